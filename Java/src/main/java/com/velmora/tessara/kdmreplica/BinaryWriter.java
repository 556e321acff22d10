package com.velmora.tessara.kdmreplica;

import java.util.ArrayList;
import java.util.Arrays;
import java.util.IdentityHashMap;
import java.util.List;
import java.util.function.ToIntFunction;

/**
 * Writes a replica's payload in the binary form ({@link BinaryCodec} frames it): the records as
 * {@link BinaryFormat} describes them, in the order of the payload, with the table of instances
 * that relationship values index (live and deleted instances of each class, then the deleted ones
 * outside the replica that values still refer to). Refuses what a reader could not read back.
 */
final class BinaryWriter {
    private final Replica r;
    private final List<Model> models;
    private final ByteOut out;
    private final ToIntFunction<Instance> index = this::indexOf;
    private final IdentityHashMap<Model, Integer> modelIndex = new IdentityHashMap<>();
    private final int[] base;
    /** Table index of deleted instances and of the outside ones. */
    private final IdentityHashMap<Instance, Integer> other = new IdentityHashMap<>();
    private final List<Instance> outside = new ArrayList<>();
    private int tableSize;

    BinaryWriter(Replica r) {
        this(r, null);
    }

    /** A writer whose payload goes to the sink as it fills its buffer. */
    BinaryWriter(Replica r, ByteOut.Sink sink) {
        this.out = new ByteOut(1 << 16, sink);
        this.r = r;
        this.models = r.models.items;
        this.base = new int[models.size()];
    }

    ByteOut encode() {
        out.str(r.name);
        out.str(r.schemaLocation == null ? "" : r.schemaLocation);
        out.uvar(models.size());
        for (int i = 0; i < models.size(); i++) {
            Model m = models.get(i);
            modelIndex.put(m, i);
            BinaryFormat.writeClass(out, m.classDef);
        }
        long k = 0;
        for (int i = 0; i < models.size(); i++) {
            Model m = models.get(i);
            base[i] = (int) k;
            k += m.instances.count;
            if (m.deleted != null) {
                for (Instance x : m.deleted) {
                    other.put(x, (int) k++);
                }
            }
            if (k > Integer.MAX_VALUE) {
                throw new IllegalArgumentException("replica '" + r.name + "' holds more instances than a binary"
                        + " replica can index");
            }
        }
        tableSize = (int) k;
        findOutside();
        for (Model m : models) {
            InstanceSet s = m.instances;
            out.uvar(s.count);
            for (int j = 0; j < s.count; j++) {
                BinaryFormat.writeHead(out, s.items[j]);
            }
            List<Instance> del = m.deleted == null ? List.of() : m.deleted;
            out.uvar(del.size());
            for (Instance x : del) {
                BinaryFormat.writeHead(out, x);
            }
        }
        out.uvar(outside.size());
        for (Instance x : outside) {
            out.uvar(modelIndex.get(x.model));
            BinaryFormat.writeHead(out, x);
        }
        Progress.Tracker progress = Progress.start((long) tableSize + outside.size());
        long done = 0;
        for (Model m : models) {
            int[] kinds = BinaryFormat.kinds(m.alignedTo);
            InstanceSet s = m.instances;
            for (int j = 0; j < s.count; j++) {
                BinaryFormat.writeValues(out, s.items[j], kinds, index);
                progress.at(++done);
            }
            if (m.deleted != null) {
                for (Instance x : m.deleted) {
                    BinaryFormat.writeValues(out, x, kinds, index);
                    progress.at(++done);
                }
            }
        }
        for (Instance x : outside) {
            BinaryFormat.writeValues(out, x, BinaryFormat.kinds(x.model.alignedTo), index);
            progress.at(++done);
        }
        checkReadable();
        out.flush();
        progress.end();
        return out;
    }

    /** The limits a reader applies: refuse here what could not be read back. */
    private void checkReadable() {
        long slots = 0;
        for (Model m : models) {
            slots += m.alignedTo.length;
            int d = 0;
            for (ClassDef c = m.classDef; c != null && d <= BinaryCodec.MAX_SUPER_DEPTH; c = r.models.superOf(c)) {
                d++;
            }
            if (d > BinaryCodec.MAX_SUPER_DEPTH) {
                throw new IllegalArgumentException("replica '" + r.name + "' cannot be written in binary form:"
                        + " the super class chain of class '" + m.classDef.name + "' is longer than "
                        + BinaryCodec.MAX_SUPER_DEPTH + " classes");
            }
        }
        if (slots > BinaryCodec.layoutLimit(out.size())) {
            throw new IllegalArgumentException("replica '" + r.name + "' cannot be written in binary form: its"
                    + " class layouts hold " + slots + " attribute slots in all, more than the "
                    + BinaryCodec.layoutLimit(out.size()) + " a payload of " + out.size() + " bytes may describe");
        }
    }

    /** Table index of a relationship target, or -1 when it is neither in the table nor outside yet. */
    private int indexOf(Instance t) {
        Model m = t.model;
        if (m != null && m.replica == r) {
            int p = t.pos;
            if (p >= 0 && p < m.instances.count && m.instances.items[p] == t) {
                return base[modelIndex.get(m)] + p;
            }
        }
        Integer i = other.get(t);
        return i == null ? -1 : i;
    }

    /**
     * Finds the deleted instances that values refer to but that the replica no longer tracks
     * (removed before any commit, or forgotten by one), so they travel with the values.
     */
    private void findOutside() {
        for (Model m : models) {
            AttributeDef[] layout = m.alignedTo;
            if (!hasRelationship(layout)) {
                continue;
            }
            InstanceSet s = m.instances;
            for (int j = 0; j < s.count; j++) {
                scanTargets(s.items[j], layout);
            }
            if (m.deleted != null) {
                for (Instance x : m.deleted) {
                    scanTargets(x, layout);
                }
            }
        }
        for (int i = 0; i < outside.size(); i++) {
            Instance x = outside.get(i);
            scanTargets(x, x.model.alignedTo);
        }
    }

    private static boolean hasRelationship(AttributeDef[] layout) {
        for (AttributeDef a : layout) {
            if (a.type == AttributeType.Relationship) {
                return true;
            }
        }
        return false;
    }

    private void scanTargets(Instance x, AttributeDef[] layout) {
        for (int p = 0; p < layout.length; p++) {
            if (layout[p].type != AttributeType.Relationship || x.values[p] == null) {
                continue;
            }
            for (Instance t : Values.targets(x.values[p])) {
                if (indexOf(t) < 0) {
                    addOutside(x, layout[p], t);
                }
            }
        }
    }

    private void addOutside(Instance from, AttributeDef def, Instance t) {
        Model m = t.model;
        String why = null;
        if (m == null || m.replica != r) {
            why = "whose class '" + (m == null ? "(none)" : m.classDef.name) + "' is not in the replica";
        } else if ((t.state & Instance.DELETED) == 0) {
            why = "which is not in its class's instance set";
        } else if (t.frozen != null && !Arrays.equals(t.frozen, m.alignedTo)
                || t.values.length != m.alignedTo.length) {
            why = "whose class's attributes have changed since it left the replica";
        }
        if (why != null) {
            throw new IllegalArgumentException("replica '" + r.name + "' cannot be written in binary form: "
                    + from.describe() + " attribute '" + def.qualifiedName() + "' refers to " + t.describe()
                    + ", " + why + "; clear that reference first");
        }
        if ((long) tableSize + outside.size() >= Integer.MAX_VALUE) {
            throw new IllegalArgumentException("replica '" + r.name + "' refers to more instances than a binary"
                    + " replica can index");
        }
        other.put(t, tableSize + outside.size());
        outside.add(t);
    }
}
