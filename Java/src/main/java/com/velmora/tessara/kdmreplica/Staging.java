package com.velmora.tessara.kdmreplica;

import java.util.ArrayList;
import java.util.Collections;
import java.util.IdentityHashMap;
import java.util.List;
import java.util.Map;
import java.util.Set;
import java.util.concurrent.locks.Lock;

/**
 * An all-or-nothing addition of classes and instances to one replica, for the document readers.
 * It holds the replica's write lock from construction to {@link #close()}; until {@link #finish()}
 * everything it added is taken out again by {@code close()}, and the replica is as before.
 * It only adds: it never changes an object that existed before it started.
 *
 * <pre>
 * try (Staging st = new Staging(replica)) {
 *     Model part = st.addClass(partDef);          // classes in any order
 *     st.schemaDone();                            // checks supers, cycles, name clashes
 *     Instance x = st.newInstance(part, "p1", false, false, false);
 *     st.setValue(x, 0, 42);                      // checked as setValue, access mode ignored
 *     st.finish();                                // keep it all
 * }                                               // without finish(): all undone
 * </pre>
 */
final class Staging implements AutoCloseable {
    private final Replica target;
    private final Lock lock;
    private final List<Model> addedModels = new ArrayList<>();
    private final List<Instance> addedInstances = new ArrayList<>();
    private boolean schemaDirty;
    private boolean finished;
    private boolean closed;

    Staging(Replica target) {
        this.target = target;
        this.lock = target.rw.writeLock();
        this.lock.lock();
    }

    Replica replica() {
        return target;
    }

    private void checkOpen() {
        if (finished || closed) {
            throw new IllegalStateException("staging of replica '" + target.name + "' is "
                    + (closed ? "closed" : "finished"));
        }
    }

    /**
     * Adds a model for a class that is in no replica. Its super class need not be there yet: the
     * schema is checked by {@link #schemaDone()} or {@link #finish()}.
     *
     * @throws IllegalArgumentException for a class already in a replica or a name already taken
     */
    Model addClass(ClassDef c) {
        checkOpen();
        Lock free = Locks.adopt();
        try {
            if (c.replica != null) {
                throw new IllegalArgumentException("replica '" + target.name + "': class '" + c.name
                        + "' is already in replica '" + c.replica.name + "'");
            }
            if (target.models.byName.containsKey(c.name)) {
                throw new IllegalArgumentException("replica '" + target.name + "' already has a class '" + c.name
                        + "'");
            }
            Model m = new Model(c);
            target.models.items.add(m);
            target.models.byName.put(c.name, m);
            m.replica = target;
            c.replica = target;
            addedModels.add(m);
            schemaDirty = true;
            return m;
        } finally {
            free.unlock();
        }
    }

    /** Checks the schema and installs the layouts. @throws IllegalArgumentException as {@code ModelSet.add} */
    void schemaDone() {
        checkOpen();
        if (schemaDirty) {
            target.schemaChanged();
            schemaDirty = false;
        }
    }

    /**
     * A new instance of a model of the replica, with the given identifier (String, byte[] or null)
     * and state. A deleted instance goes to the model's deleted list (its identifier is not
     * checked); the others are appended to the model's set and their identifier must be free.
     */
    Instance newInstance(Model m, Object id, boolean created, boolean modified, boolean deleted) {
        checkOpen();
        if (schemaDirty) {
            throw new IllegalStateException("staging of replica '" + target.name
                    + "': call schemaDone() before adding instances");
        }
        if (m.replica != target) {
            throw new IllegalArgumentException("replica '" + target.name + "': the model of class '"
                    + m.classDef.name + "' is not in this replica");
        }
        if (id != null && !(id instanceof String) && !(id instanceof byte[])) {
            throw new IllegalArgumentException("replica '" + target.name + "': an identifier is a String or a"
                    + " byte[], not a " + Values.className(id));
        }
        Object stored = id instanceof byte[] ? ((byte[]) id).clone() : id;
        Instance x = new Instance(m, m.alignedTo.length);
        if (deleted) {
            x.id = stored;
            x.state = Instance.DELETED;
            if (m.deleted == null) {
                m.deleted = new ArrayList<>();
            }
            m.deleted.add(x);
        } else {
            m.changeId(x, stored);
            x.id = stored;
            x.state = (byte) ((created ? Instance.CREATED : 0) | (modified ? Instance.MODIFIED : 0));
            m.instances.append(x);
        }
        addedInstances.add(x);
        return x;
    }

    /** Sets a value with the checks of {@code Instance.setValue}, except the access mode; null clears. */
    void setValue(Instance x, int position, Object value) {
        checkOpen();
        if (position < 0 || position >= x.values.length) {
            throw new IndexOutOfBoundsException("instance " + x.describe() + ": attribute position " + position
                    + " is out of range (" + x.values.length + " attributes)");
        }
        AttributeDef def = x.model.alignedTo[position];
        x.values[position] = value == null ? null : Values.importValue(def, value, target, x);
    }

    /** Keeps everything added. @throws IllegalArgumentException when the schema is invalid (then nothing is kept) */
    void finish() {
        schemaDone();
        finished = true;
    }

    @Override
    public void close() {
        if (closed) {
            return;
        }
        closed = true;
        try {
            if (!finished) {
                rollback();
            }
        } finally {
            lock.unlock();
        }
    }

    private void rollback() {
        Map<Model, Set<Instance>> byModel = new IdentityHashMap<>();
        for (Instance x : addedInstances) {
            Model m = x.model;
            x.forget();
            if ((x.state & Instance.DELETED) != 0) {
                m.deleted.remove(x);
                continue;
            }
            byModel.computeIfAbsent(m, k -> Collections.newSetFromMap(new IdentityHashMap<>())).add(x);
            Object key = Instance.keyOf(x.id);
            if (key != null && m.ids.get(key) == x) {
                m.ids.remove(key);
            }
        }
        for (Map.Entry<Model, Set<Instance>> e : byModel.entrySet()) {
            e.getKey().instances.compact(e.getValue());
        }
        Lock free = Locks.adopt();
        try {
            for (int i = addedModels.size() - 1; i >= 0; i--) {
                Model m = addedModels.get(i);
                target.models.items.remove(m);
                target.models.byName.remove(m.classDef.name);
                m.replica = null;
                m.classDef.replica = null;
                m.classDef.refreshFreeLayout();
                m.alignedTo = m.classDef.layout;
            }
        } finally {
            free.unlock();
        }
        target.schemaChanged();
    }
}
