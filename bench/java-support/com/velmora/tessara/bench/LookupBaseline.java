package com.velmora.tessara.bench;

import com.velmora.tessara.kdmreplica.Instance;
import com.velmora.tessara.kdmreplica.InstanceSet;
import com.velmora.tessara.kdmreplica.Model;
import java.util.ArrayList;

/**
 * The pure-Java side of the lookup benchmark: the model's instances get identifiers and groups
 * here; the same lookups the native benchmark makes one call each are made here in one loop, and
 * the selection by group is a loop over the instances.
 */
public final class LookupBaseline {
    private LookupBaseline() {
    }

    /** Creates {@code count} instances in {@code model} with the identifiers "id-0", ... and group i % 1000. */
    public static int fill(Model model, int count) {
        for (int i = 0; i < count; i++) {
            Instance x = model.createInstance();
            x.setID("id-" + i);
            x.setValue("group", Integer.valueOf(i % 1000));
        }
        return count;
    }

    /** The instances whose group is {@code group}, by a loop over the model's instances; returns how many. */
    public static int select(Model model, int group) {
        Integer wanted = Integer.valueOf(group);
        ArrayList<Instance> found = new ArrayList<>();
        InstanceSet set = model.getInstances();
        for (int i = 0, n = set.getCount(); i < n; i++) {
            Instance x = set.getItem(i);
            if (wanted.equals(x.getValue("group"))) {
                found.add(x);
            }
        }
        return found.size();
    }

    /** Looks up {@code lookups} identifiers spread over the first {@code count}; returns how many were found. */
    public static int find(Model model, int count, int lookups) {
        int found = 0;
        for (int k = 0; k < lookups; k++) {
            if (model.findInstance("id-" + spread(k, count)) != null) {
                found++;
            }
        }
        return found;
    }

    /** The k-th identifier number looked up, the same on both sides: a stride through the whole model. */
    public static int spread(int k, int count) {
        return (int) ((k * 7919L) % count);
    }
}
