package com.velmora.tessara.kdmreplica;

import com.velmora.tessara.kdmreplica.vrattributes.Visibility;
import java.util.HashMap;
import java.util.concurrent.locks.Lock;

/**
 * The definition of one class: its name, optional super class name, properties and its own
 * attribute definitions ({@link #getAttributes()}, a live list). A class joins a replica with its
 * model ({@code ModelSet.add}); there it has exactly one model.
 *
 * <p>The attributes of an instance are the super class's (recursively) first, then the class's
 * own, in list order: its layout. Inside a replica the super name must name another class of the
 * replica without a cycle, and no attribute name may appear twice in a layout; a change that
 * breaks this throws and is undone. Outside a replica the super name is only stored.
 *
 * <p>Defaults: super name "" (none), class type {@code Class}, visibility {@code Public}, not
 * abstract, not extensible, persistent, empty uuid, comment, derivability and namespace, no scope
 * names.
 * A null text stores the empty text; arrays are copied in and out.
 */
public class ClassDef {
    volatile String name;
    String superName = "";
    String uuid = "";
    String comment = "";
    String derivability = "";
    /** The target namespace of the schema that declared the class; "" for none or the replica's own. */
    String namespace = "";
    String[] scopeNames = new String[0];
    boolean extensible;
    boolean abstractClass;
    boolean persistent = true;
    Visibility visibility = Visibility.Public;
    ClassType classType = ClassType.Class;
    final AttributeDefList attributes;
    /** The replica whose model set holds this class's model, or null. */
    volatile Replica replica;

    /** Layout: inherited attributes first, then own; and attribute name to position. */
    AttributeDef[] layout = new AttributeDef[0];
    HashMap<String, Integer> positions = new HashMap<>();

    /**
     * A class named {@code name}.
     *
     * @throws IllegalArgumentException if the name is not a valid name
     */
    public ClassDef(String name) {
        this.name = Names.checkName("ClassDef", name);
        this.attributes = new AttributeDefList(this);
    }

    /** A class with a generated name ("Class" followed by a number). */
    public ClassDef() {
        this(Names.generate("Class"));
    }

    /** The class of a list made with {@code new AttributeDefList()}. */
    ClassDef(String name, AttributeDefList list) {
        this.name = name;
        this.attributes = list;
    }

    /** Own attributes only: the class's free layout, used while the class is in no replica. */
    void refreshFreeLayout() {
        setLayout(attributes.items.toArray(new AttributeDef[0]));
    }

    void setLayout(AttributeDef[] newLayout) {
        HashMap<String, Integer> map = new HashMap<>(newLayout.length * 2);
        for (int i = 0; i < newLayout.length; i++) {
            map.put(newLayout[i].name, i);
        }
        layout = newLayout;
        positions = map;
    }

    /** Position of an attribute of the layout, or -1. */
    int positionOf(String attributeName) {
        Integer p = positions.get(attributeName);
        return p == null ? -1 : p;
    }

    /** Runs a schema change; when the replica's schema becomes invalid the undo runs and the error is thrown. */
    void changeSchema(Runnable change, Runnable undo) {
        changeSchema(change, undo, false);
    }

    /** As {@link #changeSchema(Runnable, Runnable)}; {@code reparents}: the change is one of this class's super class. */
    private void changeSchema(Runnable change, Runnable undo, boolean reparents) {
        change.run();
        if (replica != null) {
            try {
                replica.schemaChanged(reparents ? this : null);
            } catch (RuntimeException e) {
                undo.run();
                throw e;
            }
        } else {
            refreshFreeLayout();
        }
    }

    public String getClassName() {
        return name;
    }

    /**
     * Renames the class. Inside a replica the new name must be free; the replica follows the
     * rename: subclasses name it as their super class, and target names of relationship attributes
     * that named the old name name the new one.
     *
     * @throws IllegalArgumentException for an invalid name or a name taken in the replica
     */
    public void setClassName(String newName) {
        Names.checkName("ClassDef '" + name + "'", newName);
        Lock l = Locks.write(this);
        try {
            Replica r = replica;
            if (r != null) {
                r.models.renameClass(this, newName);
            } else {
                name = newName;
            }
        } finally {
            l.unlock();
        }
    }

    public String getSuperName() {
        Lock l = Locks.read(this);
        try {
            return superName;
        } finally {
            l.unlock();
        }
    }

    /**
     * Sets the super class by name; null or "" means none.
     *
     * @throws IllegalArgumentException inside a replica, for an unknown or cyclic super class, or
     *         when an inherited attribute name clashes with an attribute of this class or of a
     *         subclass; the super name is then left as it was
     * @throws IllegalStateException when a stored reference to an instance of this class (or of a
     *         subclass) would then no longer be of a target class of its attribute, naming it; the
     *         super name is then left as it was
     */
    public void setSuperName(String superName) {
        String s = Names.orEmpty(superName);
        Lock l = Locks.write(this);
        try {
            String old = this.superName;
            changeSchema(() -> this.superName = s, () -> this.superName = old, true);
        } finally {
            l.unlock();
        }
    }

    public String getUuid() {
        Lock l = Locks.read(this);
        try {
            return uuid;
        } finally {
            l.unlock();
        }
    }

    public void setUuid(String uuid) {
        Lock l = Locks.write(this);
        try {
            this.uuid = Names.orEmpty(uuid);
        } finally {
            l.unlock();
        }
    }

    public String[] getScopeNames() {
        Lock l = Locks.read(this);
        try {
            return scopeNames.clone();
        } finally {
            l.unlock();
        }
    }

    public void setScopeNames(String[] names) {
        String[] copy = Names.copyStrings("ClassDef '" + name + "' scope names", names);
        Lock l = Locks.write(this);
        try {
            scopeNames = copy;
        } finally {
            l.unlock();
        }
    }

    public String getQKADerivability() {
        Lock l = Locks.read(this);
        try {
            return derivability;
        } finally {
            l.unlock();
        }
    }

    public void setQKADerivability(String derivability) {
        Lock l = Locks.write(this);
        try {
            this.derivability = Names.orEmpty(derivability);
        } finally {
            l.unlock();
        }
    }

    public String getQKAComment() {
        Lock l = Locks.read(this);
        try {
            return comment;
        } finally {
            l.unlock();
        }
    }

    public void setQKAComment(String comment) {
        Lock l = Locks.write(this);
        try {
            this.comment = Names.orEmpty(comment);
        } finally {
            l.unlock();
        }
    }

    /**
     * The target namespace of the XSD the class was read from ("" for a schema without one, for the
     * replica's own namespace, and for a class made otherwise). It is carried by the replica's XSD
     * and binary form; documents name classes by name alone, so a replica's class names are unique
     * whatever their namespaces.
     */
    public String getSchemaNamespace() {
        Lock l = Locks.read(this);
        try {
            return namespace;
        } finally {
            l.unlock();
        }
    }

    public void setSchemaNamespace(String namespace) {
        Lock l = Locks.write(this);
        try {
            this.namespace = Names.orEmpty(namespace);
        } finally {
            l.unlock();
        }
    }

    public void setExtensibility(boolean extensible) {
        Lock l = Locks.write(this);
        try {
            this.extensible = extensible;
        } finally {
            l.unlock();
        }
    }

    public boolean isExtensible() {
        Lock l = Locks.read(this);
        try {
            return extensible;
        } finally {
            l.unlock();
        }
    }

    /** @throws IllegalArgumentException for null */
    public void setSoftwareVisibility(Visibility visibility) {
        if (visibility == null) {
            throw new IllegalArgumentException("ClassDef '" + name + "': visibility is null");
        }
        Lock l = Locks.write(this);
        try {
            this.visibility = visibility;
        } finally {
            l.unlock();
        }
    }

    public Visibility getSoftwareVisibility() {
        Lock l = Locks.read(this);
        try {
            return visibility;
        } finally {
            l.unlock();
        }
    }

    /** Abstract: {@code Replica.commit} refuses live instances of the class (creating them is allowed). */
    public void setAbstract(boolean isAbstract) {
        Lock l = Locks.write(this);
        try {
            this.abstractClass = isAbstract;
        } finally {
            l.unlock();
        }
    }

    public boolean isAbstract() {
        Lock l = Locks.read(this);
        try {
            return abstractClass;
        } finally {
            l.unlock();
        }
    }

    public void setPersistency(boolean persistent) {
        Lock l = Locks.write(this);
        try {
            this.persistent = persistent;
        } finally {
            l.unlock();
        }
    }

    public boolean isPersistent() {
        Lock l = Locks.read(this);
        try {
            return persistent;
        } finally {
            l.unlock();
        }
    }

    /** @throws IllegalArgumentException for null */
    public void setClassType(ClassType type) {
        if (type == null) {
            throw new IllegalArgumentException("ClassDef '" + name + "': class type is null");
        }
        Lock l = Locks.write(this);
        try {
            this.classType = type;
        } finally {
            l.unlock();
        }
    }

    public ClassType getClassType() {
        Lock l = Locks.read(this);
        try {
            return classType;
        } finally {
            l.unlock();
        }
    }

    /** The class's own attribute definitions: the live list (not a copy). */
    public AttributeDefList getAttributes() {
        return attributes;
    }

    /** For example {@code ClassDef 'Bolt' extends 'Part' abstract (2 own attributes, 5 in all)}. */
    @Override
    public String toString() {
        Lock l = Locks.read(this);
        try {
            StringBuilder b = new StringBuilder("ClassDef '").append(name).append('\'');
            if (!superName.isEmpty()) {
                b.append(" extends '").append(superName).append('\'');
            }
            if (abstractClass) {
                b.append(" abstract");
            }
            if (classType != ClassType.Class) {
                b.append(' ').append(classType);
            }
            b.append(" (").append(attributes.items.size()).append(" own attributes, ")
                    .append(layout.length).append(" in all)");
            return b.toString();
        } finally {
            l.unlock();
        }
    }
}
