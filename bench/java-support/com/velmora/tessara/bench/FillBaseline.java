package com.velmora.tessara.bench;

import com.velmora.tessara.kdmreplica.Instance;
import com.velmora.tessara.kdmreplica.Model;
import java.util.Date;

/**
 * The pure-Java side of the fill benchmark: the same instances, with the same values, that the
 * native benchmark makes through the library, made here by Java code calling the replica directly.
 * Called once per measured fill through JNI, so the crossing costs one call for the whole fill.
 */
public final class FillBaseline {
    private FillBaseline() {
    }

    /**
     * Creates {@code count} instances in {@code model}, whose class has the attributes code
     * (Integer), price (Double), label (String), created (Date), active (Boolean), payload
     * (Binary), quantity (Integer) and note (String), and sets all eight, by name.
     *
     * @return the number of instances made
     */
    public static int fill(Model model, int count, long baseSeconds) {
        for (int i = 0; i < count; i++) {
            Instance x = model.createInstance();
            x.setValue("code", Integer.valueOf(i));
            x.setValue("price", Double.valueOf(i * 0.25));
            x.setValue("label", "item-" + i);
            x.setValue("created", new Date((baseSeconds + i) * 1000L));
            x.setValue("active", Boolean.valueOf((i & 1) != 0));
            byte[] payload = new byte[8];
            for (int b = 0; b < payload.length; b++) {
                payload[b] = (byte) (i >>> (b * 4));
            }
            x.setValue("payload", payload);
            x.setValue("quantity", Integer.valueOf(i % 100));
            x.setValue("note", "fixed note");
        }
        return count;
    }
}
