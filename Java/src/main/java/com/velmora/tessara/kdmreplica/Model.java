package com.velmora.tessara.kdmreplica;

import java.util.ArrayList;
import java.util.Arrays;
import java.util.HashMap;
import java.util.List;
import java.util.concurrent.locks.Lock;

/**
 * The data of one class in a replica: its instances ({@link #getInstances()}, a live set), plus the
 * deleted instances that wait for {@code Replica.commit}. A model is made for a class definition and
 * joins a replica through {@code ModelSet.add}; instances can only be created once it is there.
 */
public class Model {
    private static final AttributeDef[] NO_ATTRIBUTES = new AttributeDef[0];

    final ClassDef classDef;
    final InstanceSet instances;
    /** The replica whose model set holds this model, or null. */
    volatile Replica replica;
    /** The layout that the value arrays of this model's instances follow. */
    AttributeDef[] alignedTo = NO_ATTRIBUTES;
    /** Removed instances that were committed before (or loaded), waiting for the next commit. */
    ArrayList<Instance> deleted;
    /** Identifier key to live instance; made on first use. */
    HashMap<Object, Instance> ids;

    /**
     * A model for the class {@code classDef}, in no replica yet.
     *
     * @throws IllegalArgumentException for null
     */
    public Model(ClassDef classDef) {
        if (classDef == null) {
            throw new IllegalArgumentException("Model: class definition is null");
        }
        this.classDef = classDef;
        this.instances = new InstanceSet(this);
    }

    /** A model for a new class with a generated name. */
    public Model() {
        this(new ClassDef());
    }

    /** The model of a set made with {@code new InstanceSet()}. */
    Model(ClassDef classDef, InstanceSet set) {
        this.classDef = classDef;
        this.instances = set;
    }

    /** The replica that holds this model, or null. */
    public Replica getReplica() {
        return replica;
    }

    /**
     * A new instance of the class, marked created, appended to {@link #getInstances()}.
     *
     * @throws IllegalStateException when the model is in no replica
     */
    public Instance createInstance() {
        Lock l = Locks.write(this);
        try {
            if (replica == null) {
                throw new IllegalStateException("model of class '" + classDef.name
                        + "' is in no replica: add it to a replica's model set before creating instances");
            }
            Instance x = new Instance(this, alignedTo.length);
            x.state = Instance.CREATED;
            instances.append(x);
            return x;
        } finally {
            l.unlock();
        }
    }

    /** The instances of the model: the live set (not a copy). */
    public InstanceSet getInstances() {
        return instances;
    }

    public ClassDef getClassDef() {
        return classDef;
    }

    /**
     * The live instance of this model whose identifier is {@code id} (a String, or a byte[] by
     * content), or null; found through the model's identifier index, whatever the model's size.
     *
     * @throws IllegalArgumentException for null or another kind of identifier
     */
    public Instance findInstance(Object id) {
        Object key = lookupKey(id, "model of class '" + classDef.name + "'");
        Lock l = Locks.read(this);
        try {
            return ids == null ? null : ids.get(key);
        } finally {
            l.unlock();
        }
    }

    /**
     * The live instances of this model, and with {@code withSubclasses} of the models of its
     * subclasses (in model order), whose attribute {@code attribute} holds a value equal to
     * {@code value}: given as {@code setValue} takes it, multi-valued ones element by element,
     * instances by identity; null selects the instances without a value.
     *
     * @throws IllegalArgumentException for an attribute the class does not have, or a value of
     *         another form than the attribute's
     */
    public Instance[] selectInstances(String attribute, Object value, boolean withSubclasses) {
        Lock l = Locks.read(this);
        try {
            int p = attribute == null ? -1 : classDef.positionOf(attribute);
            if (p < 0) {
                throw new IllegalArgumentException("model of class '" + classDef.name + "': no attribute "
                        + (attribute == null ? "null" : "'" + attribute + "'"));
            }
            AttributeDef def = classDef.layout[p];
            Object query = Values.queryValue(def, value);
            ArrayList<Instance> found = new ArrayList<>();
            Replica r = replica;
            for (Model m : r == null || !withSubclasses ? List.of(this) : r.models.items) {
                if (m != this && !isSubclass(m.classDef, r.models)) {
                    continue;
                }
                int at = Arrays.asList(m.alignedTo).indexOf(def);
                InstanceSet s = m.instances;
                for (int k = 0; at >= 0 && k < s.count; k++) {
                    Instance x = s.items[k];
                    if (Values.matches(x.values[at], query)) {
                        found.add(x);
                    }
                }
            }
            return found.toArray(new Instance[0]);
        } finally {
            l.unlock();
        }
    }

    /** Whether {@code c} is a subclass of this model's class (caller holds a lock of the replica). */
    private boolean isSubclass(ClassDef c, ModelSet models) {
        int depth = 0;
        for (ClassDef s = models.superOf(c); s != null && depth++ <= BinaryCodec.MAX_SUPER_DEPTH;
                s = models.superOf(s)) {
            if (s == classDef) {
                return true;
            }
        }
        return false;
    }

    /** The index key of an identifier a caller looks up. */
    static Object lookupKey(Object id, String where) {
        if (!(id instanceof String) && !(id instanceof byte[])) {
            throw new IllegalArgumentException(where + ": an identifier to find is a String or a byte[], not "
                    + (id == null ? "null" : "a " + Values.className(id)));
        }
        return Instance.keyOf(id);
    }

    /** Moves a live instance of this model from its identifier to a new one (caller holds the write lock). */
    void changeId(Instance x, Object newId) {
        Object newKey = Instance.keyOf(newId);
        if (newKey != null) {
            Instance other = ids == null ? null : ids.get(newKey);
            if (other != null && other != x) {
                StringBuilder b = new StringBuilder("model of class '").append(classDef.name)
                        .append("' already has a live instance with identifier ");
                Values.format(b, newId);
                throw new IllegalArgumentException(b.toString());
            }
        }
        if (ids == null) {
            ids = new HashMap<>();
        }
        Object oldKey = Instance.keyOf(x.id);
        if (oldKey != null) {
            ids.remove(oldKey);
        }
        if (newKey != null) {
            ids.put(newKey, x);
        }
    }

    /** For example {@code Model 'Part' (12 instances, 2 deleted) in replica 'plant'}. */
    @Override
    public String toString() {
        Lock l = Locks.read(this);
        try {
            StringBuilder b = new StringBuilder("Model '").append(classDef.name).append("' (")
                    .append(instances.count).append(" instances");
            if (deleted != null && !deleted.isEmpty()) {
                b.append(", ").append(deleted.size()).append(" deleted");
            }
            b.append(')');
            Replica r = replica;
            b.append(r == null ? " in no replica" : " in replica '" + r.name + "'");
            return b.toString();
        } finally {
            l.unlock();
        }
    }
}
