package com.velmora.tessara.kdmreplica;

import java.time.Instant;
import java.util.Arrays;
import java.util.Date;
import java.util.EnumMap;
import java.util.Map;

/**
 * Attribute values: checks and copies on the way in, copies on the way out, equality keys and
 * text forms.
 *
 * <p>Stored forms, one per type (single / multi-valued): Integer {@code Integer} / {@code int[]};
 * Double {@code Double} / {@code double[]}; String {@code String} / {@code String[]}; Date
 * {@code Long} milliseconds / {@code long[]}; Boolean {@code Boolean} / {@code boolean[]}; Binary
 * {@code byte[]} / {@code byte[][]}; Relationship {@code Instance} / {@code Instance[]}. A stored
 * array is never shared with a caller. null means "no value"; an empty array is a value.
 */
final class Values {
    private Values() {
    }

    /** The Java form that {@code setValue} accepts for a type, single or multi-valued. */
    static String form(AttributeType type, boolean multi) {
        switch (type) {
            case Integer: return multi ? "int[]" : "Integer";
            case Double: return multi ? "double[]" : "Double";
            case String: return multi ? "String[]" : "String";
            case Date: return multi ? "java.util.Date[]" : "java.util.Date";
            case Boolean: return multi ? "boolean[]" : "Boolean";
            case Binary: return multi ? "byte[][]" : "byte[]";
            default: return multi ? "Instance[]" : "Instance";
        }
    }

    /**
     * A value looked for in an attribute, in its stored form (dates as milliseconds); null stands
     * for no value. Only the form is checked: a value the attribute could not hold finds nothing.
     *
     * @throws IllegalArgumentException for a value of another form than the attribute's
     */
    static Object queryValue(AttributeDef def, Object v) {
        boolean multi = def.multi;
        if (v == null) {
            return null;
        }
        if (def.type == AttributeType.Date && (multi ? v instanceof Date[] : v instanceof Date)) {
            if (!multi) {
                return ((Date) v).getTime();
            }
            Date[] in = (Date[]) v;
            long[] out = new long[in.length];
            for (int i = 0; i < in.length; i++) {
                out[i] = in[i] == null ? Long.MIN_VALUE : in[i].getTime(); // a null element matches nothing
            }
            return out;
        }
        if (def.type == AttributeType.String && multi && v.getClass() == Object[].class) {
            return Arrays.copyOf((Object[]) v, ((Object[]) v).length, String[].class);
        }
        Class<?> stored = STORED.get(def.type)[multi ? 1 : 0];
        if (def.type != AttributeType.Date && stored.isInstance(v)) {
            return v;
        }
        throw new IllegalArgumentException("attribute '" + def.qualifiedName() + "' (" + def.type
                + (multi ? ", multi-valued" : "") + ") is looked for with " + form(def.type, multi) + ", not "
                + className(v));
    }

    /** Whether a stored value equals a value looked for ({@link #queryValue}): arrays by content. */
    static boolean matches(Object stored, Object query) {
        if (query == null || stored == null) {
            return query == stored;
        }
        return query.getClass().isArray() ? key(stored).equals(key(query)) : query.equals(stored);
    }

    private static final EnumMap<AttributeType, Class<?>[]> STORED = new EnumMap<>(
            java.util.Map.of(AttributeType.Integer, new Class<?>[] {Integer.class, int[].class},
                    AttributeType.Double, new Class<?>[] {Double.class, double[].class},
                    AttributeType.Boolean, new Class<?>[] {Boolean.class, boolean[].class},
                    AttributeType.String, new Class<?>[] {String.class, String[].class},
                    AttributeType.Date, new Class<?>[] {Date.class, Date[].class},
                    AttributeType.Binary, new Class<?>[] {byte[].class, byte[][].class},
                    AttributeType.Relationship, new Class<?>[] {Instance.class, Instance[].class}));

    static String className(Object v) {
        String n = v.getClass().getCanonicalName();
        return n == null ? v.getClass().getName() : n;
    }

    /**
     * Checks a non-null value against an attribute and returns the stored form (a copy).
     * Relationship targets must be live instances of {@code replica} and, when the attribute has
     * target names, of one of those classes or of a subclass of one. The access mode is not looked
     * at here.
     *
     * @param x the instance being written, named in messages
     * @throws IllegalArgumentException naming the attribute and the offending value or element
     */
    static Object importValue(AttributeDef def, Object v, Replica replica, Instance x) {
        boolean multi = def.multi;
        switch (def.type) {
            case Integer:
                if (!multi && v instanceof Integer) {
                    return v;
                }
                if (multi && v instanceof int[]) {
                    return ((int[]) v).clone();
                }
                break;
            case Double:
                if (!multi && v instanceof Double) {
                    return v;
                }
                if (multi && v instanceof double[]) {
                    return ((double[]) v).clone();
                }
                break;
            case Boolean:
                if (!multi && v instanceof Boolean) {
                    return v;
                }
                if (multi && v instanceof boolean[]) {
                    return ((boolean[]) v).clone();
                }
                break;
            case String:
                if (!multi && v instanceof String) {
                    checkLength(def, x, (String) v, -1);
                    return v;
                }
                // Object[] of strings is accepted too: some native converters build that form.
                if (multi && (v instanceof String[] || v.getClass() == Object[].class)) {
                    Object[] in = (Object[]) v;
                    String[] out = new String[in.length];
                    for (int i = 0; i < in.length; i++) {
                        if (!(in[i] instanceof String)) {
                            throw badElement(def, x, i, in[i]);
                        }
                        out[i] = (String) in[i];
                        checkLength(def, x, out[i], i);
                    }
                    return out;
                }
                break;
            case Date:
                if (!multi && v instanceof Date) {
                    return ((Date) v).getTime();
                }
                if (multi && v instanceof Date[]) {
                    Date[] in = (Date[]) v;
                    long[] out = new long[in.length];
                    for (int i = 0; i < in.length; i++) {
                        if (in[i] == null) {
                            throw badElement(def, x, i, null);
                        }
                        out[i] = in[i].getTime();
                    }
                    return out;
                }
                break;
            case Binary:
                if (!multi && v instanceof byte[]) {
                    checkLength(def, x, (byte[]) v, -1);
                    return ((byte[]) v).clone();
                }
                if (multi && v instanceof byte[][]) {
                    byte[][] in = (byte[][]) v;
                    byte[][] out = new byte[in.length][];
                    for (int i = 0; i < in.length; i++) {
                        if (in[i] == null) {
                            throw badElement(def, x, i, null);
                        }
                        checkLength(def, x, in[i], i);
                        out[i] = in[i].clone();
                    }
                    return out;
                }
                break;
            case Relationship:
                if (!multi && v instanceof Instance) {
                    checkTarget(def, (Instance) v, replica, x, -1);
                    return v;
                }
                if (multi && v instanceof Instance[]) {
                    Instance[] in = (Instance[]) v;
                    Instance[] out = Arrays.copyOf(in, in.length, Instance[].class);
                    for (int i = 0; i < out.length; i++) {
                        if (out[i] == null) {
                            throw badElement(def, x, i, null);
                        }
                        checkTarget(def, out[i], replica, x, i);
                    }
                    return out;
                }
                break;
            default:
                break;
        }
        throw new IllegalArgumentException(who(x) + ": attribute '" + def.qualifiedName() + "' ("
                + def.type + (multi ? ", multi-valued" : "") + ") takes " + form(def.type, multi) + ", not "
                + className(v));
    }

    private static String who(Instance x) {
        return "instance " + x.describe();
    }

    private static IllegalArgumentException badElement(AttributeDef def, Instance x, int i, Object e) {
        return new IllegalArgumentException(who(x) + ": attribute '" + def.qualifiedName() + "': element " + i
                + " of the value is " + (e == null ? "null" : "a " + className(e)) + ", expected "
                + form(def.type, false));
    }

    private static String where(int element) {
        return element < 0 ? "the value" : "element " + element;
    }

    private static void checkLength(AttributeDef def, Instance x, String s, int element) {
        if (def.length > 0) {
            int n = s.codePointCount(0, s.length());
            if (n > def.length) {
                throw new IllegalArgumentException(who(x) + ": attribute '" + def.qualifiedName() + "' holds at most "
                        + def.length + " characters; " + where(element) + " has " + n);
            }
        }
    }

    private static void checkLength(AttributeDef def, Instance x, byte[] b, int element) {
        if (def.length > 0 && b.length > def.length) {
            throw new IllegalArgumentException(who(x) + ": attribute '" + def.qualifiedName() + "' holds at most "
                    + def.length + " bytes; " + where(element) + " has " + b.length);
        }
    }

    private static void checkTarget(AttributeDef def, Instance t, Replica replica, Instance x, int element) {
        Model m = t.model;
        if (m == null || replica == null || m.replica != replica) {
            throw new IllegalArgumentException(who(x) + ": attribute '" + def.qualifiedName() + "': " + where(element)
                    + ", " + t.describe() + ", is not an instance of replica '"
                    + (replica == null ? "?" : replica.name) + "'");
        }
        if ((t.state & Instance.DELETED) != 0) {
            throw new IllegalArgumentException(who(x) + ": attribute '" + def.qualifiedName() + "': " + where(element)
                    + ", " + t.describe() + ", is deleted");
        }
        if (!isTarget(def.targetNames, m.classDef, replica.models)) {
            throw new IllegalArgumentException(who(x) + ": attribute '" + def.qualifiedName() + "': "
                    + where(element) + ", " + t.describe() + ", is of class '" + m.classDef.name
                    + "', not of a target class " + Arrays.toString(def.targetNames));
        }
    }

    /**
     * Whether target names allow an instance of class {@code c}: they are empty, or name {@code c}
     * or one of its super classes in {@code models} (caller holds a lock of their replica).
     */
    static boolean isTarget(String[] targets, ClassDef c, ModelSet models) {
        if (targets.length == 0) {
            return true;
        }
        for (; c != null; c = models.superOf(c)) {
            for (String target : targets) {
                if (target.equals(c.name)) {
                    return true;
                }
            }
        }
        return false;
    }

    /**
     * The longest String (in characters, that is code points) or Binary (in bytes) of a stored
     * value or of its elements; -1 for other values.
     */
    static int longest(Object stored) {
        int n = -1;
        if (stored instanceof String) {
            n = ((String) stored).codePointCount(0, ((String) stored).length());
        } else if (stored instanceof byte[]) {
            n = ((byte[]) stored).length;
        } else if (stored instanceof String[] || stored instanceof byte[][]) {
            for (Object e : (Object[]) stored) {
                n = Math.max(n, longest(e));
            }
        }
        return n;
    }

    /** The caller's copy of a stored value. */
    static Object exportValue(Object stored) {
        if (stored == null || stored instanceof Integer || stored instanceof Double || stored instanceof Boolean
                || stored instanceof String || stored instanceof Instance) {
            return stored;
        }
        if (stored instanceof Long) {
            return new Date((Long) stored);
        }
        if (stored instanceof long[]) {
            long[] in = (long[]) stored;
            Date[] out = new Date[in.length];
            for (int i = 0; i < in.length; i++) {
                out[i] = new Date(in[i]);
            }
            return out;
        }
        if (stored instanceof byte[][]) {
            byte[][] in = (byte[][]) stored;
            byte[][] out = new byte[in.length][];
            for (int i = 0; i < in.length; i++) {
                out[i] = in[i].clone();
            }
            return out;
        }
        if (stored instanceof byte[]) {
            return ((byte[]) stored).clone();
        }
        if (stored instanceof int[]) {
            return ((int[]) stored).clone();
        }
        if (stored instanceof double[]) {
            return ((double[]) stored).clone();
        }
        if (stored instanceof boolean[]) {
            return ((boolean[]) stored).clone();
        }
        if (stored instanceof String[]) {
            return ((String[]) stored).clone();
        }
        if (stored instanceof Instance[]) {
            return ((Instance[]) stored).clone();
        }
        throw new IllegalStateException("unexpected stored value " + className(stored));
    }

    /** Instances a stored relationship value refers to (empty for other values). */
    static Instance[] targets(Object stored) {
        if (stored instanceof Instance) {
            return new Instance[] {(Instance) stored};
        }
        if (stored instanceof Instance[]) {
            return (Instance[]) stored;
        }
        return new Instance[0];
    }

    /** A key with value equality for a stored value: arrays by content, instances by identity. */
    static Object key(Object stored) {
        if (stored != null && stored.getClass().isArray()) {
            return new ArrayKey(stored);
        }
        return stored;
    }

    /** Key of an identifier (String or byte[]); a String and a byte[] never collide. */
    static Object idKey(Object id) {
        return id instanceof byte[] ? new ArrayKey(id) : id;
    }

    private static final class ArrayKey {
        private final Object array;
        private final int hash;

        ArrayKey(Object array) {
            this.array = array;
            this.hash = Arrays.deepHashCode(new Object[] {array});
        }

        @Override
        public boolean equals(Object o) {
            return o instanceof ArrayKey && Arrays.deepEquals(new Object[] {array}, new Object[] {((ArrayKey) o).array});
        }

        @Override
        public int hashCode() {
            return hash;
        }
    }

    static void quote(StringBuilder b, String s) {
        b.append('"');
        for (int i = 0; i < s.length(); i++) {
            char c = s.charAt(i);
            switch (c) {
                case '"': b.append("\\\""); break;
                case '\\': b.append("\\\\"); break;
                case '\n': b.append("\\n"); break;
                case '\r': b.append("\\r"); break;
                case '\t': b.append("\\t"); break;
                default:
                    if (c < 0x20) {
                        b.append(String.format("\\u%04x", (int) c));
                    } else {
                        b.append(c);
                    }
            }
        }
        b.append('"');
    }

    private static void hex(StringBuilder b, byte[] bytes) {
        b.append("0x");
        int n = Math.min(bytes.length, 32);
        for (int i = 0; i < n; i++) {
            b.append(Character.forDigit((bytes[i] >> 4) & 15, 16)).append(Character.forDigit(bytes[i] & 15, 16));
        }
        if (n < bytes.length) {
            b.append("...(").append(bytes.length).append(" bytes)");
        }
    }

    /** Readable form of a stored value. */
    static void format(StringBuilder b, Object v) {
        if (v instanceof String) {
            quote(b, (String) v);
        } else if (v instanceof Long) {
            b.append(Instant.ofEpochMilli((Long) v));
        } else if (v instanceof byte[]) {
            hex(b, (byte[]) v);
        } else if (v instanceof Instance) {
            b.append(((Instance) v).describe());
        } else if (v instanceof int[]) {
            b.append(Arrays.toString((int[]) v));
        } else if (v instanceof double[]) {
            b.append(Arrays.toString((double[]) v));
        } else if (v instanceof boolean[]) {
            b.append(Arrays.toString((boolean[]) v));
        } else if (v instanceof long[]) {
            long[] a = (long[]) v;
            b.append('[');
            for (int i = 0; i < a.length; i++) {
                b.append(i == 0 ? "" : ", ").append(Instant.ofEpochMilli(a[i]));
            }
            b.append(']');
        } else if (v instanceof Object[]) {
            Object[] a = (Object[]) v;
            b.append('[');
            for (int i = 0; i < a.length; i++) {
                b.append(i == 0 ? "" : ", ");
                format(b, a[i]);
            }
            b.append(']');
        } else {
            b.append(v);
        }
    }
}
