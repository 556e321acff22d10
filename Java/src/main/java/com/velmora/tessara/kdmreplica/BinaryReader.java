package com.velmora.tessara.kdmreplica;

import java.util.ArrayList;
import java.util.HashMap;
import java.util.List;

/**
 * Reads a replica from the payload of its binary form ({@link BinaryCodec} checks the frame): the
 * records as {@link BinaryFormat} describes them, checked against the bytes that remain before
 * anything is allocated, built through {@code Staging} into a new replica.
 */
final class BinaryReader {
    private final ByteIn in;
    private ClassDef[] classes;
    private int[] classAt;
    private Instance[] table;

    BinaryReader(ByteIn in) {
        this.in = in;
    }

    private ReplicaBinaryException wrap(RuntimeException e, int at) {
        return in.failAt(e.getMessage(), at, e);
    }

    Replica decode() {
        String name = in.str("the replica name");
        String location = in.str("the schema location");
        int nc = in.count("the class count", 8);
        classes = new ClassDef[nc];
        classAt = new int[nc];
        for (int i = 0; i < nc; i++) {
            classAt[i] = in.pos;
            classes[i] = BinaryFormat.readClass(in, i);
        }
        checkSchema();
        Replica r = new Replica(name);
        r.schemaLocation = location;
        try (Staging st = new Staging(r)) {
            Model[] models = new Model[nc];
            for (int i = 0; i < nc; i++) {
                try {
                    models[i] = st.addClass(classes[i]);
                } catch (IllegalArgumentException e) {
                    throw wrap(e, classAt[i]);
                }
            }
            try {
                st.schemaDone();
            } catch (IllegalArgumentException e) {
                throw wrap(e, classAt.length > 0 ? classAt[0] : in.pos);
            }
            int[][] kinds = new int[nc][];
            List<Instance> all = new ArrayList<>();
            long owed = 0;
            for (int i = 0; i < nc; i++) {
                Model m = models[i];
                kinds[i] = BinaryFormat.kinds(m.alignedTo);
                long bitmap = (m.alignedTo.length + 7) >>> 3;
                String cn = "class '" + m.classDef.name + "'";
                for (int deleted = 0; deleted < 2; deleted++) {
                    int n = in.count("the " + (deleted == 0 ? "live" : "deleted") + " instance count of " + cn,
                            1 + bitmap, owed);
                    owed += n * bitmap;
                    for (int j = 0; j < n; j++) {
                        int at = in.pos;
                        int head = in.u8("an instance header");
                        int state = head & 15;
                        if (deleted == 0 ? (state & ~3) != 0 : state != Instance.DELETED) {
                            throw in.failAt("a " + (deleted == 0 ? "live" : "deleted") + " instance of " + cn
                                    + " has the state bits 0x" + Integer.toHexString(state), at, null);
                        }
                        Object id = BinaryFormat.readId(in, head);
                        try {
                            all.add(st.newInstance(m, id, (state & 1) != 0, (state & 2) != 0, deleted == 1));
                        } catch (IllegalArgumentException e) {
                            throw wrap(e, at);
                        }
                    }
                }
            }
            int no = in.count("the count of instances outside the replica", 2, owed);
            List<Instance> outside = new ArrayList<>();
            int[] outsideClass = new int[no];
            for (int j = 0; j < no; j++) {
                int at = in.pos;
                int ci = in.index("the class of an instance outside the replica", nc);
                Model m = models[ci];
                outsideClass[j] = ci;
                long bitmap = (m.alignedTo.length + 7) >>> 3;
                owed += bitmap;
                if (owed > in.remaining()) {
                    throw in.failAt("truncated: instances outside the replica need more bytes than remain", at, null);
                }
                int head = in.u8("an instance header");
                if ((head & 15) != Instance.DELETED) {
                    throw in.failAt("an instance outside the replica must be deleted, its state bits are 0x"
                            + Integer.toHexString(head & 15), at, null);
                }
                Instance x = new Instance(m, m.alignedTo.length);
                x.id = BinaryFormat.readId(in, head);
                x.state = Instance.DELETED;
                outside.add(x);
                all.add(x);
            }
            table = all.toArray(new Instance[0]);
            Progress.Tracker progress = Progress.start(table.length);
            int nm = 0;
            for (int i = 0; i < nc; i++) {
                int count = models[i].instances.count + (models[i].deleted == null ? 0 : models[i].deleted.size());
                for (int j = 0; j < count; j++) {
                    BinaryFormat.readValues(in, table[nm++], kinds[i], table);
                    progress.at(nm);
                }
            }
            for (int j = 0; j < no; j++) {
                BinaryFormat.readValues(in, outside.get(j), kinds[outsideClass[j]], table);
                progress.at(nm + j + 1L);
            }
            if (in.remaining() != 0) {
                throw in.fail(in.remaining() + " bytes follow the last instance's values");
            }
            for (Instance x : outside) {
                x.forget();
            }
            progress.end();
            st.finish();
        }
        return r;
    }

    /**
     * Resolves super classes without recursion: unknown supers, cycles, chains longer than
     * {@link BinaryCodec#MAX_SUPER_DEPTH} and layouts larger than {@link #layoutLimit} are refused before
     * the core computes the layouts.
     */
    private void checkSchema() {
        int n = classes.length;
        HashMap<String, Integer> byName = new HashMap<>();
        for (int i = 0; i < n; i++) {
            Integer twin = byName.put(classes[i].name, i);
            if (twin != null) {
                throw in.failAt("two classes are named '" + classes[i].name + "'", classAt[i], null);
            }
        }
        int[] sup = new int[n];
        for (int i = 0; i < n; i++) {
            String s = classes[i].superName;
            if (s.isEmpty()) {
                sup[i] = -1;
            } else {
                Integer j = byName.get(s);
                if (j == null) {
                    throw in.failAt("class '" + classes[i].name + "' names super class '" + s
                            + "', which the buffer does not define", classAt[i], null);
                }
                sup[i] = j;
            }
        }
        int[] depth = new int[n];
        long[] slots = new long[n];
        boolean[] onPath = new boolean[n];
        int[] path = new int[n];
        long total = 0;
        for (int i = 0; i < n; i++) {
            int len = 0;
            int j = i;
            while (j >= 0 && depth[j] == 0) {
                if (onPath[j]) {
                    throw in.failAt("class '" + classes[j].name + "' has a cyclic super class chain", classAt[j],
                            null);
                }
                onPath[j] = true;
                path[len++] = j;
                j = sup[j];
            }
            int d = j >= 0 ? depth[j] : 0;
            long s = j >= 0 ? slots[j] : 0;
            for (int k = len - 1; k >= 0; k--) {
                int c = path[k];
                onPath[c] = false;
                depth[c] = ++d;
                slots[c] = s += classes[c].attributes.items.size();
                if (d > BinaryCodec.MAX_SUPER_DEPTH) {
                    throw in.failAt("the super class chain of class '" + classes[c].name + "' is longer than "
                            + BinaryCodec.MAX_SUPER_DEPTH + " classes", classAt[c], null);
                }
            }
            total += slots[i];
        }
        long limit = BinaryCodec.layoutLimit(in.end - in.base);
        if (total > limit) {
            throw in.failAt("the class layouts hold " + total + " attribute slots in all, more than the " + limit
                    + " this payload may describe", classAt.length > 0 ? classAt[0] : in.pos, null);
        }
    }
}
