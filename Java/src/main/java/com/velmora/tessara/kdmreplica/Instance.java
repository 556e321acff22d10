package com.velmora.tessara.kdmreplica;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import java.util.HashMap;
import java.util.concurrent.locks.Lock;

/**
 * One object of a class: an optional identifier, state flags, and one value per attribute of the
 * class's layout (inherited attributes first). Attributes are addressed by name or by position
 * from 0. Instances are made by {@code Model.createInstance}.
 *
 * <p>States: a new instance is created; {@code setValue}, {@code clearValue} and {@code setID} on
 * an instance that is not created mark it modified; {@code InstanceSet.remove} marks it deleted
 * (its created and modified flags are then cleared); {@code Replica.commit} clears created and
 * modified. A deleted instance can still be read, but not written.
 *
 * <p>Values are kept in one array indexed by attribute position; see {@code Values} for the
 * forms accepted and returned. {@code new Instance()} makes a detached instance of no class: it has
 * no attribute, so every attribute access throws; its identifier can be set.
 */
public class Instance {
    static final byte CREATED = 1;
    static final byte MODIFIED = 2;
    static final byte DELETED = 4;
    private static final Object[] NO_VALUES = new Object[0];

    /** The model, fixed for life; null for a detached instance. */
    final Model model;
    /** Values by layout position; realigned when the layout changes. */
    Object[] values;
    /** null, a String, or a byte[] owned by this instance. */
    Object id;
    byte state;
    /** Position in the model's instance set, or -1 when not in it. */
    int pos = -1;
    /**
     * The layout of a deleted instance that its model no longer tracks (never committed, or
     * forgotten by a commit): such an instance is not realigned any more and keeps the attributes
     * it had when it left. null while the model tracks the instance.
     */
    AttributeDef[] frozen;

    /** A detached instance of no class (see the class comment). */
    public Instance() {
        this.model = null;
        this.values = NO_VALUES;
    }

    Instance(Model model, int attributeCount) {
        this.model = model;
        this.values = attributeCount == 0 ? NO_VALUES : new Object[attributeCount];
    }

    /** Short form used in messages: {@code Part[id="a7"]}, {@code Part[#3]}, {@code Part[deleted]}. */
    String describe() {
        StringBuilder b = new StringBuilder(model == null ? "detached instance" : model.classDef.name).append('[');
        Object i = id;
        if (i instanceof String) {
            b.append("id=");
            Values.quote(b, (String) i);
        } else if (i instanceof byte[]) {
            b.append("id=");
            Values.format(b, i);
        } else if ((state & DELETED) != 0) {
            b.append("deleted");
        } else if (pos >= 0) {
            b.append('#').append(pos);
        } else {
            b.append("no id");
        }
        return b.append(']').toString();
    }

    private String who() {
        return "instance " + describe();
    }

    /** Leaves the model's tracking: keeps the current layout (caller holds the write lock). */
    void forget() {
        if (model != null) {
            frozen = model.alignedTo;
        }
    }

    private AttributeDef[] layout() {
        AttributeDef[] f = frozen;
        return f != null ? f : model == null ? new AttributeDef[0] : model.alignedTo;
    }

    private int position(String name) {
        if (name == null) {
            throw new IllegalArgumentException(who() + ": attribute name is null");
        }
        int p = -1;
        if (frozen != null) {
            for (int i = 0; i < frozen.length && p < 0; i++) {
                p = frozen[i].name.equals(name) ? i : -1;
            }
        } else if (model != null) {
            p = model.classDef.positionOf(name);
        }
        if (p < 0) {
            throw new IllegalArgumentException(who() + ": class '" + (model == null ? "(none)" : model.classDef.name)
                    + "' has no attribute '" + name + "'");
        }
        return p;
    }

    private int checkPosition(int p) {
        if (p < 0 || p >= values.length) {
            throw new IndexOutOfBoundsException(who() + ": attribute position " + p + " is out of range (class "
                    + (model == null ? "(none)" : "'" + model.classDef.name + "'") + " has " + values.length
                    + " attributes)");
        }
        return p;
    }

    private void checkWritable() {
        if ((state & DELETED) != 0) {
            throw new IllegalStateException(who() + " is deleted: it cannot be changed");
        }
    }

    private void touch() {
        if ((state & CREATED) == 0) {
            state |= MODIFIED;
        }
    }

    public boolean isDeleted() {
        Lock l = Locks.read(this);
        try {
            return (state & DELETED) != 0;
        } finally {
            l.unlock();
        }
    }

    public boolean isModified() {
        Lock l = Locks.read(this);
        try {
            return (state & MODIFIED) != 0;
        } finally {
            l.unlock();
        }
    }

    public boolean isCreated() {
        Lock l = Locks.read(this);
        try {
            return (state & CREATED) != 0;
        } finally {
            l.unlock();
        }
    }

    /**
     * Sets the identifier: a String or a byte[] (copied); null removes it. Identifiers are unique
     * among the live instances of a model (a String and a byte[] never collide).
     *
     * @throws IllegalArgumentException for another type or an identifier already in use
     * @throws IllegalStateException on a deleted instance
     */
    public void setID(Object newId) {
        Object stored;
        if (newId == null || newId instanceof String) {
            stored = newId;
        } else if (newId instanceof byte[]) {
            stored = ((byte[]) newId).clone();
        } else {
            throw new IllegalArgumentException(who() + ": an identifier is a String or a byte[], not a "
                    + Values.className(newId));
        }
        Lock l = Locks.write(this);
        try {
            checkWritable();
            if (model != null && pos >= 0) {
                model.changeId(this, stored);
            }
            id = stored;
            touch();
        } finally {
            l.unlock();
        }
    }

    /** The identifier (a String, a copy of the byte[], or null). */
    public Object getID() {
        Lock l = Locks.read(this);
        try {
            Object i = id;
            return i instanceof byte[] ? ((byte[]) i).clone() : i;
        } finally {
            l.unlock();
        }
    }

    /** The class of the instance, or null for a detached instance. */
    public ClassDef getClassDef() {
        return model == null ? null : model.classDef;
    }

    /** @throws IllegalArgumentException when the class has no such attribute */
    public boolean isValuated(String name) {
        Lock l = Locks.read(this);
        try {
            return values[position(name)] != null;
        } finally {
            l.unlock();
        }
    }

    /** @throws IndexOutOfBoundsException for a position outside the layout */
    public boolean isValuated(int position) {
        Lock l = Locks.read(this);
        try {
            return values[checkPosition(position)] != null;
        } finally {
            l.unlock();
        }
    }

    private void store(int p, Object value) {
        checkWritable();
        AttributeDef def = model.alignedTo[p];
        if (def.accessMode == AccessMode.Read) {
            throw new IllegalStateException(who() + ": attribute '" + def.qualifiedName()
                    + "' is read-only (access mode Read)");
        }
        values[p] = value == null ? null : Values.importValue(def, value, model.replica, this);
        touch();
    }

    /**
     * Sets the value at a layout position; null clears it.
     *
     * @throws IndexOutOfBoundsException for a position outside the layout
     * @throws IllegalArgumentException for a value of the wrong form, type or length, or a
     *         relationship target that is not allowed
     * @throws IllegalStateException for a read-only attribute or a deleted instance
     */
    public void setValue(int position, Object value) {
        Lock l = Locks.write(this);
        try {
            store(checkPosition(position), value);
        } finally {
            l.unlock();
        }
    }

    /** As {@link #setValue(int, Object)}, by attribute name. */
    public void setValue(String name, Object value) {
        Lock l = Locks.write(this);
        try {
            store(position(name), value);
        } finally {
            l.unlock();
        }
    }

    /** Removes the value at a position (as {@code setValue(position, null)}). */
    public void clearValue(int position) {
        setValue(position, null);
    }

    /** Removes the value of an attribute (as {@code setValue(name, null)}). */
    public void clearValue(String name) {
        setValue(name, null);
    }

    /** A copy of the value at a position, or null when it has none. */
    public Object getValue(int position) {
        Lock l = Locks.read(this);
        try {
            return Values.exportValue(values[checkPosition(position)]);
        } finally {
            l.unlock();
        }
    }

    /** A copy of the value of an attribute, or null when it has none. */
    public Object getValue(String name) {
        Lock l = Locks.read(this);
        try {
            return Values.exportValue(values[position(name)]);
        } finally {
            l.unlock();
        }
    }

    private void appendState(StringBuilder b) {
        if ((state & CREATED) != 0) {
            b.append(" created");
        }
        if ((state & MODIFIED) != 0) {
            b.append(" modified");
        }
        if ((state & DELETED) != 0) {
            b.append(" deleted");
        }
    }

    /**
     * With {@code withValues}, the values too, for example
     * {@code Instance Part[id="p1"] created {name="bolt", weight=1.5}} (attributes without value
     * are left out).
     */
    public String toString(boolean withValues) {
        Lock l = Locks.read(this);
        try {
            StringBuilder b = new StringBuilder("Instance ").append(describe());
            appendState(b);
            if (withValues) {
                b.append(" {");
                boolean first = true;
                AttributeDef[] layout = layout();
                for (int i = 0; i < values.length; i++) {
                    if (values[i] != null) {
                        b.append(first ? "" : ", ").append(layout[i].name).append('=');
                        Values.format(b, values[i]);
                        first = false;
                    }
                }
                b.append('}');
            }
            return b.toString();
        } finally {
            l.unlock();
        }
    }

    /** For example {@code Instance Part[id="p1"] modified}. */
    @Override
    public String toString() {
        return toString(false);
    }

    /** Identifier map helper for models: the key of this instance's identifier, or null. */
    static Object keyOf(Object id) {
        return id == null ? null : Values.idKey(id);
    }

    static void putId(HashMap<Object, Instance> ids, Instance x) {
        if (x.id != null) {
            ids.put(Values.idKey(x.id), x);
        }
    }
}
