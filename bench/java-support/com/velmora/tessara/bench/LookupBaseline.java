package com.velmora.tessara.bench;

import com.velmora.tessara.kdmreplica.Model;

/**
 * The pure-Java side of the lookup benchmark: the model's instances get identifiers here, and the
 * same lookups the native benchmark makes one call each are made here in one loop.
 */
public final class LookupBaseline {
    private LookupBaseline() {
    }

    /** Creates {@code count} instances in {@code model} with the identifiers "id-0", "id-1", .... */
    public static int fill(Model model, int count) {
        for (int i = 0; i < count; i++) {
            model.createInstance().setID("id-" + i);
        }
        return count;
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
