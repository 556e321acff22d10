package com.velmora.tessara.kdmreplica;

import java.util.ArrayList;
import java.util.HashMap;
import java.util.IdentityHashMap;
import java.util.LinkedHashSet;
import java.util.List;
import java.util.Map;

/**
 * Layouts of the classes of a replica: inherited attributes first (root class first), then own.
 * {@link #compute} checks the schema without changing anything; {@link #apply} installs the
 * layouts and realigns the value arrays of the instances whose class layout changed.
 */
final class Schema {
    private Schema() {
    }

    /**
     * The layout of every class of the replica.
     *
     * @throws IllegalArgumentException for an unknown or cyclic super class or an attribute name
     *         that appears twice in a layout
     */
    static Map<ClassDef, AttributeDef[]> compute(Replica r) {
        Map<ClassDef, AttributeDef[]> done = new IdentityHashMap<>();
        for (Model m : r.models.items) {
            layoutOf(r, m.classDef, done, new LinkedHashSet<>());
        }
        return done;
    }

    private static AttributeDef[] layoutOf(Replica r, ClassDef c, Map<ClassDef, AttributeDef[]> done,
            LinkedHashSet<String> path) {
        AttributeDef[] known = done.get(c);
        if (known != null) {
            return known;
        }
        if (!path.add(c.name)) {
            List<String> names = new ArrayList<>(path);
            names.add(c.name);
            throw new IllegalArgumentException("replica '" + r.name + "': class '" + names.get(0)
                    + "' has a cyclic super class chain: " + Names.chain(names));
        }
        if (path.size() > BinaryCodec.MAX_SUPER_DEPTH) {
            throw new IllegalArgumentException("replica '" + r.name + "': the super class chain of class '"
                    + path.iterator().next() + "' is longer than " + BinaryCodec.MAX_SUPER_DEPTH + " classes");
        }
        List<AttributeDef> all = new ArrayList<>();
        if (!c.superName.isEmpty()) {
            Model sm = r.models.byName.get(c.superName);
            if (sm == null) {
                throw new IllegalArgumentException("replica '" + r.name + "': class '" + c.name
                        + "' names super class '" + c.superName + "', which the replica does not hold");
            }
            for (AttributeDef a : layoutOf(r, sm.classDef, done, path)) {
                all.add(a);
            }
        }
        HashMap<String, AttributeDef> seen = new HashMap<>();
        for (AttributeDef a : all) {
            seen.put(a.name, a);
        }
        for (AttributeDef a : c.attributes.items) {
            AttributeDef clash = seen.put(a.name, a);
            if (clash != null) {
                throw new IllegalArgumentException("replica '" + r.name + "': attribute '" + c.name + "." + a.name
                        + "' clashes with attribute '" + clash.qualifiedName() + "' inherited from class '"
                        + clash.owner.name + "'");
            }
            all.add(a);
        }
        path.remove(c.name);
        AttributeDef[] layout = all.toArray(new AttributeDef[0]);
        done.put(c, layout);
        return layout;
    }

    private static boolean same(AttributeDef[] a, AttributeDef[] b) {
        if (a.length != b.length) {
            return false;
        }
        for (int i = 0; i < a.length; i++) {
            if (a[i] != b[i]) {
                return false;
            }
        }
        return true;
    }

    /** Installs computed layouts; instances of a model whose layout changed keep their values by attribute. */
    static void apply(Replica r, Map<ClassDef, AttributeDef[]> layouts) {
        for (Model m : r.models.items) {
            ClassDef c = m.classDef;
            AttributeDef[] to = layouts.get(c);
            if (!same(m.alignedTo, to)) {
                realign(m, m.alignedTo, to);
                m.alignedTo = to;
            }
            if (!same(c.layout, to) || c.positions.size() != to.length) {
                c.setLayout(to);
            }
        }
    }

    private static void realign(Model m, AttributeDef[] from, AttributeDef[] to) {
        IdentityHashMap<AttributeDef, Integer> old = new IdentityHashMap<>();
        for (int i = 0; i < from.length; i++) {
            old.put(from[i], i);
        }
        int[] source = new int[to.length];
        for (int i = 0; i < to.length; i++) {
            Integer p = old.get(to[i]);
            source[i] = p == null ? -1 : p;
        }
        InstanceSet s = m.instances;
        for (int k = 0; k < s.count; k++) {
            realign(s.items[k], source);
        }
        if (m.deleted != null) {
            for (Instance x : m.deleted) {
                realign(x, source);
            }
        }
    }

    private static void realign(Instance x, int[] source) {
        Object[] nv = new Object[source.length];
        for (int i = 0; i < source.length; i++) {
            if (source[i] >= 0) {
                nv[i] = x.values[source[i]];
            }
        }
        x.values = nv;
    }
}
