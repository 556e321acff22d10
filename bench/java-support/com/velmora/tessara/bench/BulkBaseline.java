package com.velmora.tessara.bench;

import com.velmora.tessara.kdmreplica.Instance;
import com.velmora.tessara.kdmreplica.InstanceSet;
import com.velmora.tessara.kdmreplica.Model;
import java.util.Date;

/**
 * The pure-Java side of the bulk benchmark: the instances the native side makes through a batch of
 * columns, made here value by value, and their eight attributes read here into one array each.
 */
public final class BulkBaseline {
    private BulkBaseline() {
    }

    /**
     * Creates {@code count} instances in {@code model}, whose class has code (Integer), price
     * (Double), label (String), created (Date), active (Boolean), payload (Binary), owner
     * (Relationship) and counts (a list of Integer), and sets all eight.
     *
     * @return the number of instances made
     */
    public static int fill(Model model, int count, long baseMillis, Instance owner) {
        for (int i = 0; i < count; i++) {
            Instance x = model.createInstance();
            x.setValue("code", Integer.valueOf(i));
            x.setValue("price", Double.valueOf(i * 0.25));
            x.setValue("label", "item-" + i);
            x.setValue("created", new Date(baseMillis + i * 1000L));
            x.setValue("active", Boolean.valueOf((i & 1) != 0));
            x.setValue("payload", payload(i));
            x.setValue("owner", owner);
            x.setValue("counts", new int[] {i, i + 1, i + 2});
        }
        return count;
    }

    /** The payload of instance i, the same on both sides. */
    public static byte[] payload(int i) {
        byte[] payload = new byte[8];
        for (int b = 0; b < payload.length; b++) {
            payload[b] = (byte) (i >>> (b * 4));
        }
        return payload;
    }

    /** The eight attributes of the model's instances, read into one array each; returns how many rows. */
    public static int read(Model model) {
        InstanceSet set = model.getInstances();
        int n = set.getCount();
        int[] codes = new int[n];
        double[] prices = new double[n];
        String[] labels = new String[n];
        long[] created = new long[n];
        boolean[] active = new boolean[n];
        byte[][] payloads = new byte[n][];
        Instance[] owners = new Instance[n];
        int[][] counts = new int[n][];
        for (int i = 0; i < n; i++) {
            Instance x = set.getItem(i);
            codes[i] = (Integer) x.getValue("code");
            prices[i] = (Double) x.getValue("price");
            labels[i] = (String) x.getValue("label");
            created[i] = ((Date) x.getValue("created")).getTime();
            active[i] = (Boolean) x.getValue("active");
            payloads[i] = (byte[]) x.getValue("payload");
            owners[i] = (Instance) x.getValue("owner");
            counts[i] = (int[]) x.getValue("counts");
        }
        return codes.length + (labels.length == n && payloads.length == n && owners.length == n && counts.length == n
                && prices.length == n && created.length == n && active.length == n ? 0 : 1);
    }
}
