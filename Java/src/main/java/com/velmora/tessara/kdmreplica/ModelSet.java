package com.velmora.tessara.kdmreplica;

import java.util.ArrayList;
import java.util.HashMap;
import java.util.List;
import java.util.concurrent.locks.Lock;

/**
 * The models of one replica, in the order they were added; positions from 0; one model per class
 * name. This is the replica's own set: adding a model adds its class to the replica's schema,
 * removing one takes the class and its data out.
 */
public class ModelSet {
    final Replica replica;
    final ArrayList<Model> items = new ArrayList<>();
    final HashMap<String, Model> byName = new HashMap<>();

    ModelSet(Replica replica) {
        this.replica = replica;
    }

    /** The model set of a new replica with a generated name (the set is that replica's own). */
    public ModelSet() {
        this.replica = new Replica(Names.generate("Replica"), this);
    }

    private String who() {
        return "model set of replica '" + replica.name + "'";
    }

    /** The class that {@code c} names as super class, or null (caller holds a lock of the replica). */
    ClassDef superOf(ClassDef c) {
        if (c.superName.isEmpty()) {
            return null;
        }
        Model m = byName.get(c.superName);
        return m == null ? null : m.classDef;
    }

    List<Model> snapshot() {
        return new ArrayList<>(items);
    }

    public int getCount() {
        Lock l = Locks.read(this);
        try {
            return items.size();
        } finally {
            l.unlock();
        }
    }

    private void checkPosition(int position) {
        if (position < 0 || position >= items.size()) {
            throw new IndexOutOfBoundsException(who() + ": position " + position + " is out of range (count "
                    + items.size() + ")");
        }
    }

    private String checkName(String name) {
        if (name == null) {
            throw new IllegalArgumentException(who() + ": class name is null");
        }
        return name;
    }

    /** @throws IndexOutOfBoundsException */
    public Model getItem(int position) {
        Lock l = Locks.read(this);
        try {
            checkPosition(position);
            return items.get(position);
        } finally {
            l.unlock();
        }
    }

    /** The model of the class of that name, or null. */
    public Model getItem(String className) {
        checkName(className);
        Lock l = Locks.read(this);
        try {
            return byName.get(className);
        } finally {
            l.unlock();
        }
    }

    /** Position of the model of that class name, or -1. */
    public int indexOf(String className) {
        checkName(className);
        Lock l = Locks.read(this);
        try {
            Model m = byName.get(className);
            return m == null ? -1 : items.indexOf(m);
        } finally {
            l.unlock();
        }
    }

    /** Position of the model of that class definition (by identity), or -1. */
    public int indexOf(ClassDef classDef) {
        if (classDef == null) {
            throw new IllegalArgumentException(who() + ": class definition is null");
        }
        Lock l = Locks.read(this);
        try {
            Model m = byName.get(classDef.name);
            return m != null && m.classDef == classDef ? items.indexOf(m) : -1;
        } finally {
            l.unlock();
        }
    }

    public boolean includes(String className) {
        return indexOf(className) >= 0;
    }

    /**
     * Adds a model that is in no replica; its class joins the schema.
     *
     * @throws IllegalArgumentException for null, a model or class already in a replica, a class
     *         name already taken, an unknown or cyclic super class, or an attribute name clash
     *         with inherited attributes; nothing changes then
     */
    public void add(Model model) {
        if (model == null) {
            throw new IllegalArgumentException(who() + ": model is null");
        }
        Lock l = Locks.write(this);
        try {
            Lock free = Locks.adopt();
            try {
                ClassDef c = model.classDef;
                if (model.replica != null) {
                    throw new IllegalArgumentException(who() + ": the model of class '" + c.name
                            + "' is already in replica '" + model.replica.name + "'");
                }
                if (c.replica != null) {
                    throw new IllegalArgumentException(who() + ": class '" + c.name + "' is already in replica '"
                            + c.replica.name + "'");
                }
                if (byName.containsKey(c.name)) {
                    throw new IllegalArgumentException(who() + ": the replica already has a class '" + c.name + "'");
                }
                items.add(model);
                byName.put(c.name, model);
                model.replica = replica;
                c.replica = replica;
                try {
                    replica.schemaChanged();
                } catch (RuntimeException e) {
                    items.remove(items.size() - 1);
                    byName.remove(c.name);
                    model.replica = null;
                    c.replica = null;
                    c.refreshFreeLayout();
                    model.alignedTo = c.layout;
                    throw e;
                }
            } finally {
                free.unlock();
            }
        } finally {
            l.unlock();
        }
    }

    /**
     * Takes the model at {@code position} out: its live instances are removed as by
     * {@code InstanceSet.removeAll} (composition included, so instances of other models may be
     * removed too), its deleted instances are forgotten, and the model leaves empty; it may be
     * added again. References to its instances from the remaining ones are dangling and refused
     * by the next commit until they are cleared.
     */
    private void removeAt(int position) {
        Model m = items.get(position);
        ClassDef c = m.classDef;
        for (Model other : items) {
            if (other != m && other.classDef.superName.equals(c.name)) {
                throw new IllegalArgumentException(who() + ": class '" + c.name + "' cannot be removed: class '"
                        + other.classDef.name + "' extends it");
            }
        }
        replica.removeInstances(m.instances.snapshot());
        Replica.forget(m);
        m.ids = null;
        items.remove(position);
        byName.remove(c.name);
        m.replica = null;
        c.replica = null;
        c.refreshFreeLayout();
        m.alignedTo = c.layout;
    }

    /** Removes the model at a position (see {@link #removeAt}). @throws IndexOutOfBoundsException */
    public void remove(int position) {
        Lock l = Locks.write(this);
        try {
            Lock free = Locks.adopt();
            try {
                checkPosition(position);
                removeAt(position);
            } finally {
                free.unlock();
            }
        } finally {
            l.unlock();
        }
    }

    /** Removes the model of that class name. @throws IllegalArgumentException when absent */
    public void remove(String className) {
        checkName(className);
        Lock l = Locks.write(this);
        try {
            Lock free = Locks.adopt();
            try {
                Model m = byName.get(className);
                if (m == null) {
                    throw new IllegalArgumentException(who() + ": no class '" + className + "' to remove");
                }
                removeAt(items.indexOf(m));
            } finally {
                free.unlock();
            }
        } finally {
            l.unlock();
        }
    }

    /** Removes the model of that class definition. @throws IllegalArgumentException when absent */
    public void remove(ClassDef classDef) {
        if (classDef == null) {
            throw new IllegalArgumentException(who() + ": class definition is null");
        }
        Lock l = Locks.write(this);
        try {
            Lock free = Locks.adopt();
            try {
                Model m = byName.get(classDef.name);
                if (m == null || m.classDef != classDef) {
                    throw new IllegalArgumentException(who() + ": class '" + classDef.name + "' is not in this set");
                }
                removeAt(items.indexOf(m));
            } finally {
                free.unlock();
            }
        } finally {
            l.unlock();
        }
    }

    /**
     * Renames a class of this replica, and the class in every super name and target name list
     * that names it (caller holds the replica's write lock).
     */
    void renameClass(ClassDef c, String newName) {
        String old = c.name;
        if (old.equals(newName)) {
            return;
        }
        if (byName.containsKey(newName)) {
            throw new IllegalArgumentException(who() + ": class '" + old + "' cannot be renamed '" + newName
                    + "': that name is taken");
        }
        Model m = byName.remove(old);
        byName.put(newName, m);
        c.name = newName;
        for (Model other : items) {
            if (other.classDef.superName.equals(old)) {
                other.classDef.superName = newName;
            }
            for (AttributeDef a : other.classDef.attributes.items) {
                String[] targets = a.targetNames;
                for (int i = 0; i < targets.length; i++) {
                    if (targets[i].equals(old)) {
                        targets = targets == a.targetNames ? targets.clone() : targets;
                        targets[i] = newName;
                    }
                }
                a.targetNames = targets;
            }
        }
    }

    /** For example {@code ModelSet of replica 'plant' [Part, Bolt]}. */
    @Override
    public String toString() {
        Lock l = Locks.read(this);
        try {
            StringBuilder b = new StringBuilder("ModelSet of replica '").append(replica.name).append("' [");
            for (int i = 0; i < items.size(); i++) {
                b.append(i == 0 ? "" : ", ").append(items.get(i).classDef.name);
            }
            return b.append(']').toString();
        } finally {
            l.unlock();
        }
    }
}
