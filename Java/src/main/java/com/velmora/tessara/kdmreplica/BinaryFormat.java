package com.velmora.tessara.kdmreplica;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import com.velmora.tessara.kdmreplica.vrattributes.Visibility;
import java.util.Arrays;
import java.util.HashSet;
import java.util.List;
import java.util.function.Function;
import java.util.function.ToIntFunction;

/**
 * The records of the binary form, each described once: how the classes and attributes of the
 * schema, the instance headers and the values are laid out. {@link BinaryWriter} and
 * {@link BinaryReader} go through these descriptions in both directions, so that they cannot drift
 * apart; the byte encodings themselves are {@link ByteOut}'s and {@link ByteIn}'s.
 *
 * <p>A new property of a class or an attribute is one more entry in {@link #CLASS} or
 * {@link #ATTRIBUTE}: a text, a list of texts, a number, or a field of the flags byte.
 */
final class BinaryFormat {
    /** The attribute types by their code. */
    static final AttributeType[] TYPES = {AttributeType.Integer, AttributeType.Double,
        AttributeType.String, AttributeType.Date, AttributeType.Boolean, AttributeType.Binary,
        AttributeType.Relationship};
    private static final Visibility[] VISIBILITIES = {Visibility.Public, Visibility.Protected, Visibility.Private};
    private static final AccessMode[] ACCESS_MODES = {AccessMode.ReadWrite, AccessMode.Read, AccessMode.Write};

    private BinaryFormat() {
    }

    // ---------------------------------------------------------------- describing a record

    /** How one property of a record is written. */
    private interface Put<T> {
        void put(ByteOut out, T record);
    }

    /** How one property of a record is read into it. */
    private interface Take<T> {
        void take(ByteIn in, T record);
    }

    /** One property of a record: its writing and its reading side by side. */
    private static final class Property<T> {
        final Put<T> put;
        final Take<T> take;

        Property(Put<T> put, Take<T> take) {
            this.put = put;
            this.take = take;
        }
    }

    private interface Setter<T, V> {
        void set(T record, V value);
    }

    private interface IntSetter<T> {
        void set(T record, int value);
    }

    private interface BoolGetter<T> {
        boolean get(T record);
    }

    private interface BoolSetter<T> {
        void set(T record, boolean value);
    }

    /** A text ({@code str}); {@code what} names it in messages. */
    private static <T> Property<T> text(String what, Function<T, String> get, Setter<T, String> set) {
        return new Property<>((out, t) -> out.str(get.apply(t)), (in, t) -> set.set(t, in.str(what)));
    }

    /**
     * A text present only when its flag bit is set (a class without one is written as before the
     * text existed): written when not empty; read when the flags left it null, and then not empty.
     */
    private static <T> Property<T> flagged(String what, Function<T, String> get, Setter<T, String> set) {
        return new Property<>((out, t) -> {
            if (!get.apply(t).isEmpty()) {
                out.str(get.apply(t));
            }
        }, (in, t) -> {
            if (get.apply(t) == null) {
                int at = in.pos;
                String v = in.str(what);
                if (v.isEmpty()) {
                    throw in.failAt(in.expand(what) + " is empty, though its flag says it is given", at, null);
                }
                set.set(t, v);
            }
        });
    }

    /** A list of texts ({@code strs}: a count, then each text). */
    private static <T> Property<T> texts(String what, Function<T, String[]> get, Setter<T, String[]> set) {
        String countWhat = what + " count";
        return new Property<>((out, t) -> out.strs(get.apply(t)), (in, t) -> set.set(t, in.strs(what, countWhat)));
    }

    /** A 32-bit number as a zigzag varint. */
    private static <T> Property<T> zigzag(String what, ToIntFunction<T> get, IntSetter<T> set) {
        return new Property<>((out, t) -> out.zint(get.applyAsInt(t)), (in, t) -> set.set(t, in.zint(what)));
    }

    /** A field of a flags byte: one of {@code values} codes in {@code width} bits from bit {@code shift}. */
    private static final class Field<T> {
        final int shift;
        final int width;
        final int values;
        final ToIntFunction<T> get;
        final IntSetter<T> set;

        Field(int shift, int width, int values, ToIntFunction<T> get, IntSetter<T> set) {
            this.shift = shift;
            this.width = width;
            this.values = values;
            this.get = get;
            this.set = set;
        }

        int mask() {
            return ((1 << width) - 1) << shift;
        }
    }

    /** A yes or no in bit {@code shift}. */
    private static <T> Field<T> bit(int shift, BoolGetter<T> get, BoolSetter<T> set) {
        return new Field<>(shift, 1, 2, t -> get.get(t) ? 1 : 0, (t, v) -> set.set(t, v != 0));
    }

    /** One of {@code codes}, by its index, in the bits from {@code shift}. */
    private static <T, E> Field<T> choice(int shift, E[] codes, Function<T, E> get, Setter<T, E> set) {
        int width = 32 - Integer.numberOfLeadingZeros(codes.length - 1);
        return new Field<>(shift, width, codes.length, t -> code(codes, get.apply(t)), (t, v) -> set.set(t, codes[v]));
    }

    /**
     * A flags byte of the fields of a record ({@code owner} names it: {@code "{class}"}); a byte
     * with bits outside the fields or a code no field knows is refused.
     */
    @SafeVarargs
    private static <T> Property<T> flags(String owner, Field<T>... fields) {
        String what = "the flags of " + owner;
        int used = 0;
        for (Field<T> f : fields) {
            used |= f.mask();
        }
        int unused = ~used & 0xFF;
        return new Property<>((out, t) -> {
            int v = 0;
            for (Field<T> f : fields) {
                v |= f.get.applyAsInt(t) << f.shift;
            }
            out.u8(v);
        }, (in, t) -> {
            int at = in.pos;
            int v = in.u8(what);
            boolean valid = (v & unused) == 0;
            for (Field<T> f : fields) {
                valid &= (v & f.mask()) >>> f.shift < f.values;
            }
            if (!valid) {
                throw in.failAt("invalid flags 0x" + Integer.toHexString(v) + " of " + in.expand(owner), at, null);
            }
            for (Field<T> f : fields) {
                f.set.set(t, (v & f.mask()) >>> f.shift);
            }
        });
    }

    private static int code(Object[] table, Object v) {
        for (int i = 0; i < table.length; i++) {
            if (table[i] == v) {
                return i;
            }
        }
        throw new IllegalStateException("no code for " + v);
    }

    static int typeCode(AttributeType t) {
        return code(TYPES, t);
    }

    // ---------------------------------------------------------------- the schema

    /** A class after its name, in the order written. */
    private static final List<Property<ClassDef>> CLASS = List.of(
            text("the super class name of {class}", c -> c.superName, (c, v) -> c.superName = v),
            text("the uuid of {class}", c -> c.uuid, (c, v) -> c.uuid = v),
            text("the comment of {class}", c -> c.comment, (c, v) -> c.comment = v),
            text("the derivability of {class}", c -> c.derivability, (c, v) -> c.derivability = v),
            texts("a scope name of {class}", c -> c.scopeNames, (c, v) -> c.scopeNames = v),
            flags("{class}",
                    bit(0, c -> c.extensible, (c, v) -> c.extensible = v),
                    bit(1, c -> c.abstractClass, (c, v) -> c.abstractClass = v),
                    bit(2, c -> c.persistent, (c, v) -> c.persistent = v),
                    choice(3, VISIBILITIES, c -> c.visibility, (c, v) -> c.visibility = v),
                    bit(5, c -> c.classType == ClassType.Extension,
                            (c, v) -> c.classType = v ? ClassType.Extension : ClassType.Class),
                    bit(6, c -> !c.namespace.isEmpty(), (c, v) -> c.namespace = v ? null : "")),
            flagged("the namespace of {class}", c -> c.namespace, (c, v) -> c.namespace = v));

    /** An attribute after its name and type code, in the order written. */
    private static final List<Property<AttributeDef>> ATTRIBUTE = List.of(
            flags("{attr}",
                    bit(0, a -> a.multi, (a, v) -> a.multi = v),
                    bit(1, a -> a.mandatory, (a, v) -> a.mandatory = v),
                    bit(2, a -> a.unique, (a, v) -> a.unique = v),
                    bit(3, a -> a.aggregation == AggregationType.Composition,
                            (a, v) -> a.aggregation = v ? AggregationType.Composition : AggregationType.Shared),
                    choice(4, ACCESS_MODES, a -> a.accessMode, (a, v) -> a.accessMode = v),
                    choice(6, VISIBILITIES, a -> a.visibility, (a, v) -> a.visibility = v)),
            zigzag("the length of {attr}", a -> a.length, (a, v) -> a.length = v),
            text("the uuid of {attr}", a -> a.uuid, (a, v) -> a.uuid = v),
            text("the comment of {attr}", a -> a.comment, (a, v) -> a.comment = v),
            texts("a target name of {attr}", a -> a.targetNames, (a, v) -> a.targetNames = v),
            texts("a target reference of {attr}", a -> a.targetRefs, (a, v) -> a.targetRefs = v));

    /** class := str name, {@link #CLASS}, count attributes, (str name, u8 type, {@link #ATTRIBUTE})*. */
    static void writeClass(ByteOut out, ClassDef c) {
        out.str(c.name);
        for (Property<ClassDef> p : CLASS) {
            p.put.put(out, c);
        }
        List<AttributeDef> attrs = c.attributes.items;
        out.uvar(attrs.size());
        for (AttributeDef a : attrs) {
            out.str(a.name);
            out.u8(typeCode(a.type));
            for (Property<AttributeDef> p : ATTRIBUTE) {
                p.put.put(out, a);
            }
        }
    }

    /** The class {@link #writeClass} wrote, the {@code i}th of the payload. */
    static ClassDef readClass(ByteIn in, int i) {
        int at = in.pos;
        in.index = i;
        String name = in.str("the name of class {k}");
        ClassDef c;
        try {
            c = new ClassDef(name);
        } catch (IllegalArgumentException e) {
            throw in.failAt(e.getMessage(), at, e);
        }
        in.className = name;
        for (Property<ClassDef> p : CLASS) {
            p.take.take(in, c);
        }
        int na = in.count("the attribute count of {class}", 8);
        HashSet<String> names = new HashSet<>();
        for (int k = 0; k < na; k++) {
            AttributeDef a = readAttribute(in, name, k);
            if (!names.add(a.name)) {
                throw in.fail("class '" + name + "' has two attributes named '" + a.name + "'");
            }
            c.attributes.items.add(a);
            a.owner = c;
        }
        return c;
    }

    private static AttributeDef readAttribute(ByteIn in, String className, int k) {
        int at = in.pos;
        in.index = k;
        String name = in.str("the name of attribute {k} of {class}");
        in.attrName = name;
        int typeAt = in.pos;
        int type = in.u8("the type of {attr}");
        if (type >= TYPES.length) {
            throw in.failAt("unknown type code " + type + " of attribute '" + name + "' of class '" + className
                    + "'", typeAt, null);
        }
        AttributeDef a;
        try {
            a = new AttributeDef(name, TYPES[type]);
        } catch (IllegalArgumentException e) {
            throw in.failAt(e.getMessage(), at, e);
        }
        for (Property<AttributeDef> p : ATTRIBUTE) {
            p.take.take(in, a);
        }
        return a;
    }

    // ---------------------------------------------------------------- instances

    /** head := u8 (state bits | identifier kind &lt;&lt; 4: 0 none, 1 text, 2 bytes), then the identifier. */
    static void writeHead(ByteOut out, Instance x) {
        Object id = x.id;
        int kind = id == null ? 0 : id instanceof String ? 1 : 2;
        out.u8(x.state & 7 | kind << 4);
        if (kind == 1) {
            out.str((String) id);
        } else if (kind == 2) {
            out.bin((byte[]) id);
        }
    }

    /** The identifier after a head byte {@link #writeHead} wrote (the byte just read). */
    static Object readId(ByteIn in, int head) {
        int kind = head >>> 4;
        switch (kind) {
            case 0:
                return null;
            case 1:
                return in.str("a text identifier");
            case 2:
                return in.bin("a byte identifier");
            default:
                throw in.failAt("unknown identifier kind " + kind, in.pos - 1, null);
        }
    }

    // ---------------------------------------------------------------- values

    /** The value kind of each attribute of a layout: an index into {@link #VALUES}. */
    static int[] kinds(AttributeDef[] layout) {
        int[] k = new int[layout.length];
        for (int p = 0; p < layout.length; p++) {
            k[p] = typeCode(layout[p].type) * 2 + (layout[p].multi ? 1 : 0);
        }
        return k;
    }

    /** How a value of one kind is written; relationship targets go by {@code index}. */
    private interface PutValue {
        void put(ByteOut out, Object v, ToIntFunction<Instance> index);
    }

    /** How a value of one kind is read for attribute {@code p} of {@code x}; targets come from {@code table}. */
    private interface TakeValue {
        Object take(ByteIn in, Instance[] table, Instance x, int p);
    }

    /** The writing and reading of the values of one attribute type, single or multi-valued. */
    private static final class ValueForm {
        final PutValue put;
        final TakeValue take;

        ValueForm(PutValue put, TakeValue take) {
            this.put = put;
            this.take = take;
        }
    }

    /** The value forms by kind: type code * 2, + 1 when multi-valued. */
    private static final ValueForm[] VALUES = {
        new ValueForm((out, v, ix) -> out.zint((Integer) v), (in, t, x, p) -> in.zint("an Integer value")),
        new ValueForm((out, v, ix) -> {
            int[] a = (int[]) v;
            out.uvar(a.length);
            for (int e : a) {
                out.zint(e);
            }
        }, (in, t, x, p) -> {
            int[] a = new int[in.count("an Integer array length", 1)];
            for (int i = 0; i < a.length; i++) {
                a[i] = in.zint("an Integer value");
            }
            return a;
        }),
        new ValueForm((out, v, ix) -> out.i64(Double.doubleToRawLongBits((Double) v)),
            (in, t, x, p) -> Double.longBitsToDouble(in.i64("a Double value"))),
        new ValueForm((out, v, ix) -> {
            double[] a = (double[]) v;
            out.uvar(a.length);
            for (double e : a) {
                out.i64(Double.doubleToRawLongBits(e));
            }
        }, (in, t, x, p) -> {
            double[] a = new double[in.count("a Double array length", 8)];
            for (int i = 0; i < a.length; i++) {
                a[i] = Double.longBitsToDouble(in.i64("a Double value"));
            }
            return a;
        }),
        new ValueForm((out, v, ix) -> out.str((String) v), (in, t, x, p) -> in.str("a String value")),
        new ValueForm((out, v, ix) -> out.strs((String[]) v), (in, t, x, p) -> {
            String[] a = new String[in.count("a String array length", 1)];
            for (int i = 0; i < a.length; i++) {
                a[i] = in.str("a String value");
            }
            return a;
        }),
        new ValueForm((out, v, ix) -> out.zlong((Long) v), (in, t, x, p) -> in.zlong("a Date value")),
        new ValueForm((out, v, ix) -> {
            long[] a = (long[]) v;
            out.uvar(a.length);
            for (long e : a) {
                out.zlong(e);
            }
        }, (in, t, x, p) -> {
            long[] a = new long[in.count("a Date array length", 1)];
            for (int i = 0; i < a.length; i++) {
                a[i] = in.zlong("a Date value");
            }
            return a;
        }),
        new ValueForm((out, v, ix) -> out.u8((Boolean) v ? 1 : 0), BinaryFormat::readBoolean),
        new ValueForm(BinaryFormat::writeBooleans, BinaryFormat::readBooleans),
        new ValueForm((out, v, ix) -> out.bin((byte[]) v), (in, t, x, p) -> in.bin("a Binary value")),
        new ValueForm((out, v, ix) -> {
            byte[][] a = (byte[][]) v;
            out.uvar(a.length);
            for (byte[] e : a) {
                out.bin(e);
            }
        }, (in, t, x, p) -> {
            byte[][] a = new byte[in.count("a Binary array length", 1)][];
            for (int i = 0; i < a.length; i++) {
                a[i] = in.bin("a Binary value");
            }
            return a;
        }),
        new ValueForm((out, v, ix) -> out.uvar(ix.applyAsInt((Instance) v)),
            (in, t, x, p) -> t[in.index("a Relationship target", t.length)]),
        new ValueForm((out, v, ix) -> {
            Instance[] a = (Instance[]) v;
            out.uvar(a.length);
            for (Instance e : a) {
                out.uvar(ix.applyAsInt(e));
            }
        }, (in, t, x, p) -> {
            Instance[] a = new Instance[in.count("a Relationship array length", 1)];
            for (int i = 0; i < a.length; i++) {
                a[i] = t[in.index("a Relationship target", t.length)];
            }
            return a;
        }),
    };

    private static Object readBoolean(ByteIn in, Instance[] table, Instance x, int p) {
        int at = in.pos;
        int c = in.u8("a Boolean value");
        if (c > 1) {
            throw in.failAt(what(x, p) + " is the byte " + c + ", not a Boolean 0 or 1", at, null);
        }
        return c == 1;
    }

    /** Booleans packed 8 to a byte, the first in the lowest bit. */
    private static void writeBooleans(ByteOut out, Object v, ToIntFunction<Instance> index) {
        boolean[] a = (boolean[]) v;
        out.uvar(a.length);
        int bytes = (a.length + 7) >>> 3;
        out.ensure(bytes);
        Arrays.fill(out.b, out.n, out.n + bytes, (byte) 0);
        for (int i = 0; i < a.length; i++) {
            if (a[i]) {
                out.b[out.n + (i >>> 3)] |= (byte) (1 << (i & 7));
            }
        }
        out.n += bytes;
    }

    private static Object readBooleans(ByteIn in, Instance[] table, Instance x, int p) {
        int at = in.pos;
        long n = in.u32("a Boolean array length");
        if (n > 8L * in.remaining()) {
            throw in.failAt("a Boolean array length is " + n + ", more than the " + in.remaining()
                    + " remaining bytes can hold", at, null);
        }
        boolean[] a = new boolean[(int) n];
        int bytes = (int) ((n + 7) >>> 3);
        if (bytes > in.remaining()) {
            throw in.fail("truncated: " + what(x, p) + " needs " + bytes + " bytes");
        }
        int s = in.pos;
        if ((n & 7) != 0 && (in.b[s + bytes - 1] & 0xFF) >>> (n & 7) != 0) {
            throw in.failAt(what(x, p) + " sets bits beyond its " + n + " elements", s + bytes - 1, null);
        }
        for (int i = 0; i < a.length; i++) {
            a[i] = (in.b[s + (i >>> 3)] & 1 << (i & 7)) != 0;
        }
        in.pos += bytes;
        return a;
    }

    private static String what(Instance x, int p) {
        return "the value of attribute '" + x.model.alignedTo[p].qualifiedName() + "' of " + x.describe();
    }

    /**
     * values := a presence bitmap of ceil(L/8) bytes for the L attributes of the layout, then the
     * present values in position order.
     */
    static void writeValues(ByteOut out, Instance x, int[] kinds, ToIntFunction<Instance> index) {
        Object[] v = x.values;
        int len = kinds.length;
        if (v.length != len) {
            throw new IllegalStateException("instance " + x.describe() + " holds " + v.length
                    + " values for a layout of " + len + " attributes");
        }
        int bitmap = (len + 7) >>> 3;
        out.ensure(bitmap);
        int at = out.n;
        Arrays.fill(out.b, at, at + bitmap, (byte) 0);
        for (int p = 0; p < len; p++) {
            if (v[p] != null) {
                out.b[at + (p >>> 3)] |= (byte) (1 << (p & 7));
            }
        }
        out.n += bitmap; // complete before the values: writing them may hand the buffer to a sink
        for (int p = 0; p < len; p++) {
            if (v[p] != null) {
                VALUES[kinds[p]].put.put(out, v[p], index);
            }
        }
    }

    /** The values {@link #writeValues} wrote, into {@code x}; relationship targets from {@code table}. */
    static void readValues(ByteIn in, Instance x, int[] kinds, Instance[] table) {
        int len = kinds.length;
        int bitmap = (len + 7) >>> 3;
        if (bitmap > in.remaining()) {
            throw in.fail("truncated: the values of " + x.describe() + " are missing");
        }
        int at = in.pos;
        if ((len & 7) != 0 && (in.b[at + bitmap - 1] & 0xFF) >>> (len & 7) != 0) {
            throw in.failAt("the presence bitmap of " + x.describe() + " marks attributes beyond its "
                    + len, at + bitmap - 1, null);
        }
        in.pos += bitmap;
        Object[] v = x.values;
        for (int p = 0; p < len; p++) {
            if ((in.b[at + (p >>> 3)] & 1 << (p & 7)) != 0) {
                v[p] = VALUES[kinds[p]].take.take(in, table, x, p);
            }
        }
    }
}
