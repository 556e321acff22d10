package com.velmora.tessara.kdmreplica;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import com.velmora.tessara.kdmreplica.vrattributes.Visibility;
import java.util.Arrays;
import java.util.concurrent.locks.Lock;

/**
 * The definition of one attribute: its name and value type (fixed at construction) and its
 * properties. A definition belongs to at most one class ({@link #getClassDef()}); it joins one
 * through {@code AttributeDefList.add}.
 *
 * <p>Defaults: single-valued, not mandatory, not unique, length 0 (no limit), access mode
 * {@code ReadWrite}, visibility {@code Public}, aggregation {@code Shared}, empty uuid and comment,
 * no target names or references. A null text stores the empty text; a null array stores an empty
 * array; arrays are copied in and out.
 *
 * <p>Changing a property affects later {@code setValue} calls (length, access mode, target names).
 * Inside a replica, a change that values the replica holds would break is refused and changes
 * nothing: {@link #setMultiValuation} while any instance holds a value of the attribute,
 * {@link #setTargetNames} that leave out the class of a stored reference, {@link #setLength} below
 * the length of a stored value.
 */
public class AttributeDef {
    final String name;
    final AttributeType type;
    /** Owning class, or null; changed only under the write locks of both domains. */
    volatile ClassDef owner;

    String uuid = "";
    String comment = "";
    String[] targetNames = new String[0];
    String[] targetRefs = new String[0];
    AggregationType aggregation = AggregationType.Shared;
    boolean multi;
    int length;
    AccessMode accessMode = AccessMode.ReadWrite;
    Visibility visibility = Visibility.Public;
    boolean mandatory;
    boolean unique;

    /**
     * A definition named {@code name} of type {@code type}.
     *
     * @throws IllegalArgumentException if the name is not a valid name or the type is null
     */
    public AttributeDef(String name, AttributeType type) {
        this.name = Names.checkName("AttributeDef", name);
        if (type == null) {
            throw new IllegalArgumentException("AttributeDef '" + name + "': type is null");
        }
        this.type = type;
    }

    /** A String attribute with a generated name ("attribute" followed by a number). */
    public AttributeDef() {
        this(Names.generate("attribute"), AttributeType.String);
    }

    /** The replica of the owning class, or null (caller holds a lock of this definition). */
    private Replica replicaOf() {
        ClassDef c = owner;
        return c == null ? null : c.replica;
    }

    /** "Class.attribute", or the bare name for a definition of no class. */
    String qualifiedName() {
        ClassDef c = owner;
        return c == null ? name : c.name + "." + name;
    }

    public String getAttributeName() {
        return name;
    }

    public AttributeType getAttributeType() {
        return type;
    }

    /** The owning class, or null when no class holds this definition. */
    public ClassDef getClassDef() {
        return owner;
    }

    public String[] getTargetNames() {
        Lock l = Locks.read(this);
        try {
            return targetNames.clone();
        } finally {
            l.unlock();
        }
    }

    /**
     * Names of the classes that a relationship may point to (an instance of such a class or of one
     * of its subclasses). Empty: any class of the replica.
     *
     * @throws IllegalStateException when a stored value of the attribute (of a live instance or of
     *         a deleted one not yet committed) refers to an instance that the names leave out,
     *         naming both instances and the class; nothing changes then
     */
    public void setTargetNames(String[] names) {
        String[] copy = Names.copyStrings("AttributeDef '" + name + "' target names", names);
        Lock l = Locks.write(this);
        try {
            Replica r = replicaOf();
            String bad = r == null || type != AttributeType.Relationship ? null
                    : r.objection(this, null, v -> r.refusedTarget(copy, v));
            if (bad != null) {
                throw new IllegalStateException("attribute '" + qualifiedName() + "' cannot take the target names "
                        + Arrays.toString(copy) + ": " + bad);
            }
            targetNames = copy;
        } finally {
            l.unlock();
        }
    }

    /** Target references: stored and carried by documents, not interpreted. */
    public String[] getTargetRefs() {
        Lock l = Locks.read(this);
        try {
            return targetRefs.clone();
        } finally {
            l.unlock();
        }
    }

    public void setTargetRefs(String[] refs) {
        String[] copy = Names.copyStrings("AttributeDef '" + name + "' target references", refs);
        Lock l = Locks.write(this);
        try {
            targetRefs = copy;
        } finally {
            l.unlock();
        }
    }

    public AggregationType getAggregationType() {
        Lock l = Locks.read(this);
        try {
            return aggregation;
        } finally {
            l.unlock();
        }
    }

    /** @throws IllegalArgumentException for null */
    public void setAggregationType(AggregationType aggregation) {
        if (aggregation == null) {
            throw new IllegalArgumentException("AttributeDef '" + name + "': aggregation type is null");
        }
        Lock l = Locks.write(this);
        try {
            this.aggregation = aggregation;
        } finally {
            l.unlock();
        }
    }

    /**
     * Makes the attribute multi-valued (array form) or single-valued.
     *
     * @throws IllegalStateException when the flag changes while an instance holds a value of it
     */
    public void setMultiValuation(boolean multi) {
        Lock l = Locks.write(this);
        try {
            if (multi == this.multi) {
                return;
            }
            ClassDef c = owner;
            if (c != null && c.replica != null) {
                int holders = c.replica.countValuesOf(this);
                if (holders > 0) {
                    throw new IllegalStateException("attribute '" + qualifiedName() + "' cannot become "
                            + (multi ? "multi" : "single") + "-valued: " + holders
                            + " instance(s) hold a value of it");
                }
            }
            this.multi = multi;
        } finally {
            l.unlock();
        }
    }

    public boolean isMultiValuated() {
        Lock l = Locks.read(this);
        try {
            return multi;
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
     * Maximum length of a String value (characters, that is code points) or of a Binary value
     * (bytes), checked by {@code setValue} on each value or element; 0 or less means no limit.
     *
     * @throws IllegalStateException when a stored value (of a live instance or of a deleted one not
     *         yet committed) is longer, naming the instance and that length; nothing changes then
     */
    public void setLength(int length) {
        Lock l = Locks.write(this);
        try {
            Replica r = replicaOf();
            String unit = type == AttributeType.String ? " characters" : " bytes";
            String bad = r == null || length <= 0 ? null : r.objection(this, null,
                    v -> Values.longest(v) > length ? "holds a value of " + Values.longest(v) + unit : null);
            if (bad != null) {
                throw new IllegalStateException("attribute '" + qualifiedName() + "' cannot be limited to " + length
                        + unit + ": " + bad);
            }
            this.length = length;
        } finally {
            l.unlock();
        }
    }

    public int getLength() {
        Lock l = Locks.read(this);
        try {
            return length;
        } finally {
            l.unlock();
        }
    }

    /** @throws IllegalArgumentException for null */
    public void setAccessMode(AccessMode mode) {
        if (mode == null) {
            throw new IllegalArgumentException("AttributeDef '" + name + "': access mode is null");
        }
        Lock l = Locks.write(this);
        try {
            this.accessMode = mode;
        } finally {
            l.unlock();
        }
    }

    public AccessMode getAccessMode() {
        Lock l = Locks.read(this);
        try {
            return accessMode;
        } finally {
            l.unlock();
        }
    }

    /** @throws IllegalArgumentException for null */
    public void setSoftwareVisibility(Visibility visibility) {
        if (visibility == null) {
            throw new IllegalArgumentException("AttributeDef '" + name + "': visibility is null");
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

    /** Mandatory: {@code Replica.commit} refuses a live instance without a value. */
    public void setMandatory(boolean mandatory) {
        Lock l = Locks.write(this);
        try {
            this.mandatory = mandatory;
        } finally {
            l.unlock();
        }
    }

    public boolean isMandatory() {
        Lock l = Locks.read(this);
        try {
            return mandatory;
        } finally {
            l.unlock();
        }
    }

    /**
     * Unique: {@code Replica.commit} refuses two live instances of the owning class (or of its
     * subclasses) with equal values (arrays compared by content, instances by identity).
     */
    public void setUnicity(boolean unique) {
        Lock l = Locks.write(this);
        try {
            this.unique = unique;
        } finally {
            l.unlock();
        }
    }

    public boolean isUnique() {
        Lock l = Locks.read(this);
        try {
            return unique;
        } finally {
            l.unlock();
        }
    }

    /** For example {@code AttributeDef 'Part.weight' Double[] mandatory unique length=8}. */
    @Override
    public String toString() {
        Lock l = Locks.read(this);
        try {
            StringBuilder b = new StringBuilder("AttributeDef '").append(qualifiedName()).append("' ")
                    .append(type).append(multi ? "[]" : "");
            if (mandatory) {
                b.append(" mandatory");
            }
            if (unique) {
                b.append(" unique");
            }
            if (length > 0) {
                b.append(" length=").append(length);
            }
            if (accessMode != AccessMode.ReadWrite) {
                b.append(" access=").append(accessMode);
            }
            if (type == AttributeType.Relationship) {
                b.append(' ').append(aggregation);
                if (targetNames.length > 0) {
                    b.append(" targets=").append(Arrays.toString(targetNames));
                }
            }
            return b.toString();
        } finally {
            l.unlock();
        }
    }
}
