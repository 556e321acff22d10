package com.velmora.tessara.kdmreplica;

import java.util.ArrayList;
import java.util.concurrent.locks.Lock;

/**
 * The own attribute definitions of one class, in order; positions from 0. This is the class's own
 * list: adding or removing changes the class. Inside a replica, instances of the class and of its
 * subclasses follow at once: an added attribute starts without value in every instance, a removed
 * one takes its values with it; the other values keep their attributes.
 */
public class AttributeDefList {
    final ClassDef owner;
    final ArrayList<AttributeDef> items = new ArrayList<>();

    /** The list of the class being constructed. */
    AttributeDefList(ClassDef owner) {
        this.owner = owner;
    }

    /** The list of a new class with a generated name (the list is that class's own list). */
    public AttributeDefList() {
        this.owner = new ClassDef(Names.generate("Class"), this);
    }

    private String who() {
        return "attribute list of class '" + owner.name + "'";
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

    private static String checkName(String what, String name) {
        if (name == null) {
            throw new IllegalArgumentException(what + ": attribute name is null");
        }
        return name;
    }

    private int find(String name) {
        for (int i = 0; i < items.size(); i++) {
            if (items.get(i).name.equals(name)) {
                return i;
            }
        }
        return -1;
    }

    /** The definition at a position. @throws IndexOutOfBoundsException */
    public AttributeDef getItem(int position) {
        Lock l = Locks.read(this);
        try {
            checkPosition(position);
            return items.get(position);
        } finally {
            l.unlock();
        }
    }

    /** The own definition of that name, or null. */
    public AttributeDef getItem(String name) {
        checkName(who(), name);
        Lock l = Locks.read(this);
        try {
            int i = find(name);
            return i < 0 ? null : items.get(i);
        } finally {
            l.unlock();
        }
    }

    /** Position of the own definition of that name, or -1. */
    public int indexOf(String name) {
        checkName(who(), name);
        Lock l = Locks.read(this);
        try {
            return find(name);
        } finally {
            l.unlock();
        }
    }

    /** Position of the definition (by identity), or -1. */
    public int indexOf(AttributeDef def) {
        if (def == null) {
            throw new IllegalArgumentException(who() + ": attribute definition is null");
        }
        Lock l = Locks.read(this);
        try {
            return def.owner == owner ? items.indexOf(def) : -1;
        } finally {
            l.unlock();
        }
    }

    public boolean includes(String name) {
        return indexOf(name) >= 0;
    }

    /**
     * Appends a definition that belongs to no class; it then belongs to this list's class.
     *
     * @throws IllegalArgumentException for null, a definition that belongs to a class, or a name
     *         that the class's layout (inherited attributes included) or a subclass already holds
     */
    public void add(AttributeDef def) {
        if (def == null) {
            throw new IllegalArgumentException(who() + ": attribute definition is null");
        }
        Lock l = Locks.write(this);
        try {
            Lock free = Locks.adopt();
            try {
                ClassDef current = def.owner;
                if (current != null) {
                    throw new IllegalArgumentException(who() + ": attribute '" + def.name
                            + "' already belongs to class '" + current.name + "'");
                }
                if (find(def.name) >= 0) {
                    throw new IllegalArgumentException(who() + ": the class already has an attribute '"
                            + def.name + "'");
                }
                owner.changeSchema(() -> {
                    items.add(def);
                    def.owner = owner;
                }, () -> {
                    items.remove(items.size() - 1);
                    def.owner = null;
                });
            } finally {
                free.unlock();
            }
        } finally {
            l.unlock();
        }
    }

    private void removeAt(int i) {
        AttributeDef def = items.get(i);
        owner.changeSchema(() -> {
            items.remove(i);
            def.owner = null;
        }, () -> {
            items.add(i, def);
            def.owner = owner;
        });
    }

    /** Removes the definition at a position; it then belongs to no class. @throws IndexOutOfBoundsException */
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

    /** Removes the own definition of that name. @throws IllegalArgumentException when absent */
    public void remove(String name) {
        checkName(who(), name);
        Lock l = Locks.write(this);
        try {
            Lock free = Locks.adopt();
            try {
                int i = find(name);
                if (i < 0) {
                    throw new IllegalArgumentException(who() + ": no attribute '" + name + "' to remove");
                }
                removeAt(i);
            } finally {
                free.unlock();
            }
        } finally {
            l.unlock();
        }
    }

    /** Removes the definition. @throws IllegalArgumentException when it is not in this list */
    public void remove(AttributeDef def) {
        if (def == null) {
            throw new IllegalArgumentException(who() + ": attribute definition is null");
        }
        Lock l = Locks.write(this);
        try {
            Lock free = Locks.adopt();
            try {
                int i = def.owner == owner ? items.indexOf(def) : -1;
                if (i < 0) {
                    throw new IllegalArgumentException(who() + ": attribute '" + def.qualifiedName()
                            + "' is not in this list");
                }
                removeAt(i);
            } finally {
                free.unlock();
            }
        } finally {
            l.unlock();
        }
    }

    /** For example {@code AttributeDefList of 'Part' [name, weight]}. */
    @Override
    public String toString() {
        Lock l = Locks.read(this);
        try {
            StringBuilder b = new StringBuilder("AttributeDefList of '").append(owner.name).append("' [");
            for (int i = 0; i < items.size(); i++) {
                b.append(i == 0 ? "" : ", ").append(items.get(i).name);
            }
            return b.append(']').toString();
        } finally {
            l.unlock();
        }
    }
}
