package com.velmora.tessara.kdmreplica;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import com.velmora.tessara.kdmreplica.vrattributes.Visibility;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.HashMap;
import java.util.HashSet;
import java.util.IdentityHashMap;
import java.util.List;
import java.util.concurrent.locks.Lock;
import java.util.zip.CRC32;
import java.util.zip.DataFormatException;
import java.util.zip.Deflater;
import java.util.zip.Inflater;

/**
 * The binary form of a replica ({@code Replica.getBinaryFromReplica} / {@code getReplicaFromBinary}).
 *
 * <h2>Format, version 1</h2>
 * A 20-byte header, then the payload (deflated, zlib wrapper, when the compressed flag is set).
 * <pre>
 * header  := "CVRB" version:u8=1 flags:u8 (bit 0: compressed, others 0) reserved:u8[2]=0
 *            payloadLength:u32 storedLength:u32 crc32(payload):u32     (big-endian)
 * payload := str name, str schemaLocation,
 *            count classes, class*,                        (model order)
 *            per class: count live, head*, count deleted, head*,
 *            count outside, (uint classIndex, head)*,      (deleted instances no longer in the
 *                                                           replica that values still refer to)
 *            values of every instance in table order       (live and deleted of each class in
 *                                                           class order, then the outside ones)
 * class   := str name, str superName, str uuid, str comment, str derivability, strs scopeNames,
 *            u8 flags (extensible 1, abstract 2, persistent 4, visibility &lt;&lt; 3, Extension 32),
 *            count attributes, attribute*
 * attribute := str name, u8 type, u8 flags (multi 1, mandatory 2, unique 4, Composition 8,
 *            access &lt;&lt; 4, visibility &lt;&lt; 6), zigzag length, str uuid, str comment,
 *            strs targetNames, strs targetRefs
 * head    := u8 (state bits created 1, modified 2, deleted 4 | id kind &lt;&lt; 4: 0 none, 1 text, 2 bytes),
 *            then str or bytes for the identifier
 * values  := presence bitmap of ceil(L/8) bytes for the L attributes of the class's layout, then the
 *            present values in position order: Integer zigzag varint, Double 8 raw bytes, String
 *            str, Date zigzag varint of milliseconds, Boolean u8 (0/1), Binary bytes, Relationship
 *            varint index into the instance table; a multi-valued one is a count then the
 *            elements (booleans packed 8 to a byte)
 * str     := varint (byteLength &lt;&lt; 1 | kind), kind 0: UTF-8, kind 1: UTF-16BE code units (used
 *            only for texts with unpaired surrogates, which UTF-8 cannot carry)
 * </pre>
 * Varints are unsigned LEB128. Writing is deterministic, so writing what was read gives the same
 * bytes.
 *
 * <h2>Reading hostile bytes</h2>
 * Every count and length is checked against the bytes that remain before anything is allocated
 * from it (with the bytes that counted instances still owe for their presence bitmaps); a
 * compressed payload is inflated in growing steps and never past its announced length, which must
 * itself stay under {@link #MAX_INFLATED} and {@link #MAX_INFLATE_RATIO} times the compressed size.
 * Super class chains are resolved without recursion and limited to {@link #MAX_SUPER_DEPTH}; the
 * class layouts together may hold at most {@link #layoutLimit} attribute slots. Every failure is a
 * {@link ReplicaBinaryException} naming what and where; the replica being built is dropped.
 *
 * <p>Values are decoded straight into their stored forms ({@code Values}), each form fixed by the
 * attribute's type, and placed into the staged instances: the checks of {@code Staging.setValue}
 * judge new writes (length limits, target names, deleted targets), while a binary replica restores
 * values the replica already held, which those rules may not accept (a value longer than its
 * length, read from a document; a reference to an instance removed since).
 */
final class BinaryCodec {
    static final byte[] MAGIC = {'C', 'V', 'R', 'B'};
    static final int VERSION = 1;
    static final int FLAG_COMPRESSED = 1;
    static final int HEADER_SIZE = 20;
    /** Most bytes a compressed payload may inflate to. */
    static final int MAX_INFLATED = 1 << 30;
    /** Deflate never compresses better than about 1032 to 1; a stream announcing more is refused. */
    static final int MAX_INFLATE_RATIO = 1100;
    /** Longest super class chain (classes from a root to the deepest subclass). */
    static final int MAX_SUPER_DEPTH = 1000;

    private static final AttributeType[] TYPES = {AttributeType.Integer, AttributeType.Double,
        AttributeType.String, AttributeType.Date, AttributeType.Boolean, AttributeType.Binary,
        AttributeType.Relationship};
    private static final Visibility[] VISIBILITIES = {Visibility.Public, Visibility.Protected, Visibility.Private};
    private static final AccessMode[] ACCESS_MODES = {AccessMode.ReadWrite, AccessMode.Read, AccessMode.Write};

    // Value kinds: type code * 2 + 1 when multi-valued.
    private static final int INT = 0;
    private static final int INTS = 1;
    private static final int DOUBLE = 2;
    private static final int DOUBLES = 3;
    private static final int STRING = 4;
    private static final int STRINGS = 5;
    private static final int DATE = 6;
    private static final int DATES = 7;
    private static final int BOOL = 8;
    private static final int BOOLS = 9;
    private static final int BINARY = 10;
    private static final int BINARIES = 11;
    private static final int REF = 12;
    private static final int REFS = 13;

    private BinaryCodec() {
    }

    /** Most attribute slots that the layouts of all classes may hold together, for a payload size. */
    static long layoutLimit(long payloadLength) {
        return payloadLength + 65536;
    }

    private static int typeCode(AttributeType t) {
        for (int i = 0; i < TYPES.length; i++) {
            if (TYPES[i] == t) {
                return i;
            }
        }
        throw new IllegalStateException("no code for attribute type " + t);
    }

    private static int code(Object[] table, Object v) {
        for (int i = 0; i < table.length; i++) {
            if (table[i] == v) {
                return i;
            }
        }
        throw new IllegalStateException("no code for " + v);
    }

    private static int[] kinds(AttributeDef[] layout) {
        int[] k = new int[layout.length];
        for (int p = 0; p < layout.length; p++) {
            k[p] = typeCode(layout[p].type) * 2 + (layout[p].multi ? 1 : 0);
        }
        return k;
    }

    // ================================================================ writing

    /** The binary form of a replica (holds the replica's read lock while encoding). */
    static byte[] write(Replica r, boolean compressed) {
        ByteOut payload;
        Lock l = r.rw.readLock();
        l.lock();
        try {
            payload = new Encoder(r).encode();
        } finally {
            l.unlock();
        }
        return frame(payload.b, payload.n, compressed);
    }

    /** Header and (deflated) body around a payload. */
    static byte[] frame(byte[] payload, int length, boolean compressed) {
        CRC32 crc = new CRC32();
        crc.update(payload, 0, length);
        byte[] out;
        int stored;
        if (!compressed) {
            if (length > ByteOut.MAX_ARRAY - HEADER_SIZE) {
                throw new IllegalArgumentException("binary replica: a payload of " + length
                        + " bytes does not fit in one byte array with its header");
            }
            out = new byte[HEADER_SIZE + length];
            System.arraycopy(payload, 0, out, HEADER_SIZE, length);
            stored = length;
        } else {
            if (length > MAX_INFLATED) {
                throw new IllegalArgumentException("binary replica: a payload of " + length
                        + " bytes is more than the " + MAX_INFLATED + " bytes a compressed binary replica may hold;"
                        + " write it uncompressed");
            }
            Deflater d = new Deflater(Deflater.DEFAULT_COMPRESSION);
            try {
                d.setInput(payload, 0, length);
                d.finish();
                out = new byte[HEADER_SIZE + Math.max(256, length / 4)];
                int n = HEADER_SIZE;
                while (!d.finished()) {
                    if (n == out.length) {
                        out = Arrays.copyOf(out, (int) Math.min(ByteOut.MAX_ARRAY, out.length * 2L));
                    }
                    n += d.deflate(out, n, out.length - n);
                }
                stored = n - HEADER_SIZE;
                out = Arrays.copyOf(out, n);
            } finally {
                d.end();
            }
            if (length > (long) stored * MAX_INFLATE_RATIO + 64) {
                throw new IllegalStateException("binary replica: deflate compressed " + length + " bytes to " + stored
                        + ", beyond the ratio a reader accepts");
            }
        }
        System.arraycopy(MAGIC, 0, out, 0, 4);
        out[4] = (byte) VERSION;
        out[5] = (byte) (compressed ? FLAG_COMPRESSED : 0);
        putInt(out, 8, length);
        putInt(out, 12, stored);
        putInt(out, 16, (int) crc.getValue());
        return out;
    }

    private static void putInt(byte[] b, int at, int v) {
        b[at] = (byte) (v >>> 24);
        b[at + 1] = (byte) (v >>> 16);
        b[at + 2] = (byte) (v >>> 8);
        b[at + 3] = (byte) v;
    }

    private static long getU32(byte[] b, int at) {
        return ((b[at] & 0xFFL) << 24) | ((b[at + 1] & 0xFFL) << 16) | ((b[at + 2] & 0xFFL) << 8) | (b[at + 3] & 0xFFL);
    }

    private static final class Encoder {
        private final Replica r;
        private final List<Model> models;
        private final ByteOut out = new ByteOut(1 << 16);
        private final IdentityHashMap<Model, Integer> modelIndex = new IdentityHashMap<>();
        private final int[] base;
        /** Table index of deleted instances and of the outside ones. */
        private final IdentityHashMap<Instance, Integer> other = new IdentityHashMap<>();
        private final List<Instance> outside = new ArrayList<>();
        private int tableSize;

        Encoder(Replica r) {
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
                writeClass(m.classDef);
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
                    head(s.items[j]);
                }
                List<Instance> del = m.deleted == null ? List.of() : m.deleted;
                out.uvar(del.size());
                for (Instance x : del) {
                    head(x);
                }
            }
            out.uvar(outside.size());
            for (Instance x : outside) {
                out.uvar(modelIndex.get(x.model));
                head(x);
            }
            for (Model m : models) {
                int[] kinds = kinds(m.alignedTo);
                InstanceSet s = m.instances;
                for (int j = 0; j < s.count; j++) {
                    values(s.items[j], kinds);
                }
                if (m.deleted != null) {
                    for (Instance x : m.deleted) {
                        values(x, kinds);
                    }
                }
            }
            for (Instance x : outside) {
                values(x, kinds(x.model.alignedTo));
            }
            checkReadable();
            return out;
        }

        /** The limits a reader applies: refuse here what could not be read back. */
        private void checkReadable() {
            long slots = 0;
            for (Model m : models) {
                slots += m.alignedTo.length;
                int d = 0;
                for (ClassDef c = m.classDef; c != null && d <= MAX_SUPER_DEPTH; c = r.models.superOf(c)) {
                    d++;
                }
                if (d > MAX_SUPER_DEPTH) {
                    throw new IllegalArgumentException("replica '" + r.name + "' cannot be written in binary form:"
                            + " the super class chain of class '" + m.classDef.name + "' is longer than "
                            + MAX_SUPER_DEPTH + " classes");
                }
            }
            if (slots > layoutLimit(out.n)) {
                throw new IllegalArgumentException("replica '" + r.name + "' cannot be written in binary form: its"
                        + " class layouts hold " + slots + " attribute slots in all, more than the "
                        + layoutLimit(out.n) + " a payload of " + out.n + " bytes may describe");
            }
        }

        private void writeClass(ClassDef c) {
            out.str(c.name);
            out.str(c.superName);
            out.str(c.uuid);
            out.str(c.comment);
            out.str(c.derivability);
            out.strs(c.scopeNames);
            out.u8((c.extensible ? 1 : 0) | (c.abstractClass ? 2 : 0) | (c.persistent ? 4 : 0)
                    | code(VISIBILITIES, c.visibility) << 3 | (c.classType == ClassType.Extension ? 32 : 0));
            List<AttributeDef> attrs = c.attributes.items;
            out.uvar(attrs.size());
            for (AttributeDef a : attrs) {
                out.str(a.name);
                out.u8(typeCode(a.type));
                out.u8((a.multi ? 1 : 0) | (a.mandatory ? 2 : 0) | (a.unique ? 4 : 0)
                        | (a.aggregation == AggregationType.Composition ? 8 : 0)
                        | code(ACCESS_MODES, a.accessMode) << 4 | code(VISIBILITIES, a.visibility) << 6);
                out.zint(a.length);
                out.str(a.uuid);
                out.str(a.comment);
                out.strs(a.targetNames);
                out.strs(a.targetRefs);
            }
        }

        private void head(Instance x) {
            Object id = x.id;
            int kind = id == null ? 0 : id instanceof String ? 1 : 2;
            out.u8(x.state & 7 | kind << 4);
            if (kind == 1) {
                out.str((String) id);
            } else if (kind == 2) {
                out.bin((byte[]) id);
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

        private void values(Instance x, int[] kinds) {
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
            out.n += bitmap;
            for (int p = 0; p < len; p++) {
                Object value = v[p];
                if (value != null) {
                    out.b[at + (p >>> 3)] |= (byte) (1 << (p & 7));
                    value(kinds[p], value);
                }
            }
        }

        private void value(int kind, Object v) {
            switch (kind) {
                case INT:
                    out.zint((Integer) v);
                    break;
                case INTS: {
                    int[] a = (int[]) v;
                    out.uvar(a.length);
                    for (int e : a) {
                        out.zint(e);
                    }
                    break;
                }
                case DOUBLE:
                    out.i64(Double.doubleToRawLongBits((Double) v));
                    break;
                case DOUBLES: {
                    double[] a = (double[]) v;
                    out.uvar(a.length);
                    for (double e : a) {
                        out.i64(Double.doubleToRawLongBits(e));
                    }
                    break;
                }
                case STRING:
                    out.str((String) v);
                    break;
                case STRINGS:
                    out.strs((String[]) v);
                    break;
                case DATE:
                    out.zlong((Long) v);
                    break;
                case DATES: {
                    long[] a = (long[]) v;
                    out.uvar(a.length);
                    for (long e : a) {
                        out.zlong(e);
                    }
                    break;
                }
                case BOOL:
                    out.u8((Boolean) v ? 1 : 0);
                    break;
                case BOOLS: {
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
                    break;
                }
                case BINARY:
                    out.bin((byte[]) v);
                    break;
                case BINARIES: {
                    byte[][] a = (byte[][]) v;
                    out.uvar(a.length);
                    for (byte[] e : a) {
                        out.bin(e);
                    }
                    break;
                }
                case REF:
                    out.uvar(indexOf((Instance) v));
                    break;
                case REFS: {
                    Instance[] a = (Instance[]) v;
                    out.uvar(a.length);
                    for (Instance e : a) {
                        out.uvar(indexOf(e));
                    }
                    break;
                }
                default:
                    throw new IllegalStateException("unknown value kind " + kind);
            }
        }
    }

    // ================================================================ reading

    /** A replica from its binary form, built through {@code Staging} into a new replica. */
    static Replica read(byte[] bytes, boolean compressed) {
        return new Decoder(unframe(bytes, compressed)).decode();
    }

    private static ReplicaBinaryException header(String what, int offset) {
        return new ReplicaBinaryException(what, offset, false, null);
    }

    /** Checks the header and returns a reader over the payload (inflated when compressed). */
    static ByteIn unframe(byte[] bytes, boolean compressed) {
        if (bytes.length < HEADER_SIZE) {
            throw header("truncated: " + bytes.length + " bytes, fewer than the " + HEADER_SIZE
                    + " bytes of a header", bytes.length);
        }
        for (int i = 0; i < 4; i++) {
            if (bytes[i] != MAGIC[i]) {
                throw header("not a binary replica: the first bytes are not \"CVRB\"", i);
            }
        }
        int version = bytes[4] & 0xFF;
        if (version != VERSION) {
            throw header("unsupported version " + version + " (this reader knows version " + VERSION + ")", 4);
        }
        int flags = bytes[5] & 0xFF;
        if ((flags & ~FLAG_COMPRESSED) != 0) {
            throw header("unknown flags 0x" + Integer.toHexString(flags), 5);
        }
        boolean written = (flags & FLAG_COMPRESSED) != 0;
        if (written != compressed) {
            throw header("the bytes were written " + (written ? "compressed" : "uncompressed") + " but were read as "
                    + (compressed ? "compressed" : "uncompressed"), 5);
        }
        if (bytes[6] != 0 || bytes[7] != 0) {
            throw header("reserved header bytes are not zero", bytes[6] != 0 ? 6 : 7);
        }
        long payloadLength = getU32(bytes, 8);
        long stored = getU32(bytes, 12);
        long follow = bytes.length - HEADER_SIZE;
        if (stored != follow) {
            throw header((stored > follow ? "truncated: " : "") + "the header announces " + stored + " stored bytes but "
                    + follow + " follow it", stored > follow ? bytes.length : 12);
        }
        int crc = (int) getU32(bytes, 16);
        byte[] payload;
        int start;
        if (!compressed) {
            if (payloadLength != stored) {
                throw header("the header announces a payload of " + payloadLength + " bytes in " + stored
                        + " uncompressed bytes", 8);
            }
            payload = bytes;
            start = HEADER_SIZE;
        } else {
            long cap = Math.min(MAX_INFLATED, stored * MAX_INFLATE_RATIO + 64);
            if (payloadLength > cap) {
                throw header("the header announces " + payloadLength + " bytes once inflated, more than the cap of "
                        + cap + " bytes for " + stored + " compressed bytes", 8);
            }
            payload = inflate(bytes, HEADER_SIZE, (int) stored, (int) payloadLength);
            start = 0;
        }
        CRC32 c = new CRC32();
        c.update(payload, start, (int) payloadLength);
        if ((int) c.getValue() != crc) {
            throw header("checksum mismatch: the payload's CRC-32 is " + Long.toHexString(c.getValue())
                    + ", the header says " + Integer.toHexString(crc), 16);
        }
        return new ByteIn(payload, start, start + (int) payloadLength);
    }

    /** Inflates exactly {@code declared} bytes, growing the output step by step, never past it. */
    private static byte[] inflate(byte[] bytes, int off, int len, int declared) {
        Inflater inf = new Inflater();
        try {
            inf.setInput(bytes, off, len);
            byte[] out = new byte[(int) Math.min(declared, Math.max(4096L, len * 4L))];
            byte[] probe = new byte[1];
            int n = 0;
            while (!inf.finished()) {
                int before = inf.getRemaining();
                int k;
                if (n == out.length && n < declared) {
                    out = Arrays.copyOf(out, (int) Math.min(declared, n * 2L));
                }
                if (n == declared) {
                    k = inf.inflate(probe);
                    if (k > 0) {
                        throw header("the compressed stream inflates past the " + declared
                                + " bytes its header announces", off + len - inf.getRemaining());
                    }
                } else {
                    k = inf.inflate(out, n, out.length - n);
                    n += k;
                }
                if (k == 0 && !inf.finished()) {
                    if (inf.needsDictionary()) {
                        throw header("the compressed stream needs a preset dictionary", off + len - inf.getRemaining());
                    }
                    if (inf.needsInput()) {
                        throw header("truncated: the compressed stream ends before its end marker", off + len);
                    }
                    if (inf.getRemaining() == before) {
                        throw header("the compressed stream makes no progress", off + len - inf.getRemaining());
                    }
                }
            }
            if (inf.getRemaining() != 0) {
                throw header(inf.getRemaining() + " bytes follow the end of the compressed stream",
                        off + len - inf.getRemaining());
            }
            if (n != declared) {
                throw header("the compressed stream inflates to " + n + " bytes, the header announces " + declared,
                        off + len);
            }
            return out;
        } catch (DataFormatException e) {
            throw new ReplicaBinaryException("corrupt compressed stream: " + e.getMessage(),
                    off + len - inf.getRemaining(), false, e);
        } finally {
            inf.end();
        }
    }

    private static final class Decoder {
        private final ByteIn in;
        private ClassDef[] classes;
        private int[] classAt;
        private Instance[] table;

        Decoder(ByteIn in) {
            this.in = in;
        }

        private ReplicaBinaryException wrap(RuntimeException e, int at) {
            return in.failAt(e.getMessage(), at, e);
        }

        Replica decode() {
            String name = in.str("the replica name");
            String location = in.str("the schema location");
            int nc = in.count("the class count", 8);
            classes = new ClassDef[nc];
            classAt = new int[nc];
            for (int i = 0; i < nc; i++) {
                classAt[i] = in.pos;
                classes[i] = readClass(i);
            }
            checkSchema();
            Replica r = new Replica(name);
            r.schemaLocation = location;
            try (Staging st = new Staging(r)) {
                Model[] models = new Model[nc];
                for (int i = 0; i < nc; i++) {
                    try {
                        models[i] = st.addClass(classes[i]);
                    } catch (IllegalArgumentException e) {
                        throw wrap(e, classAt[i]);
                    }
                }
                try {
                    st.schemaDone();
                } catch (IllegalArgumentException e) {
                    throw wrap(e, classAt.length > 0 ? classAt[0] : in.pos);
                }
                int[][] kinds = new int[nc][];
                List<Instance> all = new ArrayList<>();
                long owed = 0;
                for (int i = 0; i < nc; i++) {
                    Model m = models[i];
                    kinds[i] = kinds(m.alignedTo);
                    long bitmap = (m.alignedTo.length + 7) >>> 3;
                    String cn = "class '" + m.classDef.name + "'";
                    for (int deleted = 0; deleted < 2; deleted++) {
                        int n = in.count("the " + (deleted == 0 ? "live" : "deleted") + " instance count of " + cn,
                                1 + bitmap, owed);
                        owed += n * bitmap;
                        for (int j = 0; j < n; j++) {
                            int at = in.pos;
                            int head = in.u8("an instance header");
                            int state = head & 15;
                            if (deleted == 0 ? (state & ~3) != 0 : state != Instance.DELETED) {
                                throw in.failAt("a " + (deleted == 0 ? "live" : "deleted") + " instance of " + cn
                                        + " has the state bits 0x" + Integer.toHexString(state), at, null);
                            }
                            Object id = readId(head);
                            try {
                                all.add(st.newInstance(m, id, (state & 1) != 0, (state & 2) != 0, deleted == 1));
                            } catch (IllegalArgumentException e) {
                                throw wrap(e, at);
                            }
                        }
                    }
                }
                int no = in.count("the count of instances outside the replica", 2, owed);
                List<Instance> outside = new ArrayList<>();
                int[] outsideClass = new int[no];
                for (int j = 0; j < no; j++) {
                    int at = in.pos;
                    int ci = in.index("the class of an instance outside the replica", nc);
                    Model m = models[ci];
                    outsideClass[j] = ci;
                    long bitmap = (m.alignedTo.length + 7) >>> 3;
                    owed += bitmap;
                    if (owed > in.remaining()) {
                        throw in.failAt("truncated: instances outside the replica need more bytes than remain", at, null);
                    }
                    int head = in.u8("an instance header");
                    if ((head & 15) != Instance.DELETED) {
                        throw in.failAt("an instance outside the replica must be deleted, its state bits are 0x"
                                + Integer.toHexString(head & 15), at, null);
                    }
                    Instance x = new Instance(m, m.alignedTo.length);
                    x.id = readId(head);
                    x.state = Instance.DELETED;
                    outside.add(x);
                    all.add(x);
                }
                table = all.toArray(new Instance[0]);
                int nm = 0;
                for (int i = 0; i < nc; i++) {
                    int count = models[i].instances.count + (models[i].deleted == null ? 0 : models[i].deleted.size());
                    for (int j = 0; j < count; j++) {
                        readValues(table[nm++], kinds[i]);
                    }
                }
                for (int j = 0; j < no; j++) {
                    readValues(outside.get(j), kinds[outsideClass[j]]);
                }
                if (in.remaining() != 0) {
                    throw in.fail(in.remaining() + " bytes follow the last instance's values");
                }
                for (Instance x : outside) {
                    x.forget();
                }
                st.finish();
            }
            return r;
        }

        private Object readId(int head) {
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

        private ClassDef readClass(int i) {
            int at = in.pos;
            in.index = i;
            String name = in.str("the name of class {k}");
            ClassDef c;
            try {
                c = new ClassDef(name);
            } catch (IllegalArgumentException e) {
                throw wrap(e, at);
            }
            String cn = "class '" + name + "'";
            in.className = name;
            c.superName = in.str("the super class name of {class}");
            c.uuid = in.str("the uuid of {class}");
            c.comment = in.str("the comment of {class}");
            c.derivability = in.str("the derivability of {class}");
            c.scopeNames = in.strs("a scope name of {class}", "a scope name of {class} count");
            int flagsAt = in.pos;
            int flags = in.u8("the flags of {class}");
            if ((flags & ~0x3F) != 0 || (flags >>> 3 & 3) == 3) {
                throw in.failAt("invalid flags 0x" + Integer.toHexString(flags) + " of " + cn, flagsAt, null);
            }
            c.extensible = (flags & 1) != 0;
            c.abstractClass = (flags & 2) != 0;
            c.persistent = (flags & 4) != 0;
            c.visibility = VISIBILITIES[flags >>> 3 & 3];
            c.classType = (flags & 32) != 0 ? ClassType.Extension : ClassType.Class;
            int na = in.count("the attribute count of {class}", 8);
            HashSet<String> names = new HashSet<>();
            for (int k = 0; k < na; k++) {
                AttributeDef a = readAttribute(name, k);
                if (!names.add(a.name)) {
                    throw in.fail(cn + " has two attributes named '" + a.name + "'");
                }
                c.attributes.items.add(a);
                a.owner = c;
            }
            return c;
        }

        private AttributeDef readAttribute(String className, int k) {
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
                throw wrap(e, at);
            }
            int flagsAt = in.pos;
            int flags = in.u8("the flags of {attr}");
            if ((flags >>> 4 & 3) == 3 || (flags >>> 6 & 3) == 3) {
                throw in.failAt("invalid flags 0x" + Integer.toHexString(flags) + " of attribute '" + className + "."
                        + name + "'", flagsAt, null);
            }
            a.multi = (flags & 1) != 0;
            a.mandatory = (flags & 2) != 0;
            a.unique = (flags & 4) != 0;
            a.aggregation = (flags & 8) != 0 ? AggregationType.Composition : AggregationType.Shared;
            a.accessMode = ACCESS_MODES[flags >>> 4 & 3];
            a.visibility = VISIBILITIES[flags >>> 6 & 3];
            a.length = in.zint("the length of {attr}");
            a.uuid = in.str("the uuid of {attr}");
            a.comment = in.str("the comment of {attr}");
            a.targetNames = in.strs("a target name of {attr}", "a target name of {attr} count");
            a.targetRefs = in.strs("a target reference of {attr}", "a target reference of {attr} count");
            return a;
        }

        /**
         * Resolves super classes without recursion: unknown supers, cycles, chains longer than
         * {@link #MAX_SUPER_DEPTH} and layouts larger than {@link #layoutLimit} are refused before
         * the core computes the layouts.
         */
        private void checkSchema() {
            int n = classes.length;
            HashMap<String, Integer> byName = new HashMap<>();
            for (int i = 0; i < n; i++) {
                Integer twin = byName.put(classes[i].name, i);
                if (twin != null) {
                    throw in.failAt("two classes are named '" + classes[i].name + "'", classAt[i], null);
                }
            }
            int[] sup = new int[n];
            for (int i = 0; i < n; i++) {
                String s = classes[i].superName;
                if (s.isEmpty()) {
                    sup[i] = -1;
                } else {
                    Integer j = byName.get(s);
                    if (j == null) {
                        throw in.failAt("class '" + classes[i].name + "' names super class '" + s
                                + "', which the buffer does not define", classAt[i], null);
                    }
                    sup[i] = j;
                }
            }
            int[] depth = new int[n];
            long[] slots = new long[n];
            boolean[] onPath = new boolean[n];
            int[] path = new int[n];
            long total = 0;
            for (int i = 0; i < n; i++) {
                int len = 0;
                int j = i;
                while (j >= 0 && depth[j] == 0) {
                    if (onPath[j]) {
                        throw in.failAt("class '" + classes[j].name + "' has a cyclic super class chain", classAt[j],
                                null);
                    }
                    onPath[j] = true;
                    path[len++] = j;
                    j = sup[j];
                }
                int d = j >= 0 ? depth[j] : 0;
                long s = j >= 0 ? slots[j] : 0;
                for (int k = len - 1; k >= 0; k--) {
                    int c = path[k];
                    onPath[c] = false;
                    depth[c] = ++d;
                    slots[c] = s += classes[c].attributes.items.size();
                    if (d > MAX_SUPER_DEPTH) {
                        throw in.failAt("the super class chain of class '" + classes[c].name + "' is longer than "
                                + MAX_SUPER_DEPTH + " classes", classAt[c], null);
                    }
                }
                total += slots[i];
            }
            long limit = layoutLimit(in.end - in.base);
            if (total > limit) {
                throw in.failAt("the class layouts hold " + total + " attribute slots in all, more than the " + limit
                        + " this payload may describe", classAt.length > 0 ? classAt[0] : in.pos, null);
            }
        }

        private void readValues(Instance x, int[] kinds) {
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
                    v[p] = value(kinds[p], x, p);
                }
            }
        }

        private String what(Instance x, int p) {
            return "the value of attribute '" + x.model.alignedTo[p].qualifiedName() + "' of " + x.describe();
        }

        private Object value(int kind, Instance x, int p) {
            switch (kind) {
                case INT:
                    return in.zint("an Integer value");
                case INTS: {
                    int[] a = new int[in.count("an Integer array length", 1)];
                    for (int i = 0; i < a.length; i++) {
                        a[i] = in.zint("an Integer value");
                    }
                    return a;
                }
                case DOUBLE:
                    return Double.longBitsToDouble(in.i64("a Double value"));
                case DOUBLES: {
                    double[] a = new double[in.count("a Double array length", 8)];
                    for (int i = 0; i < a.length; i++) {
                        a[i] = Double.longBitsToDouble(in.i64("a Double value"));
                    }
                    return a;
                }
                case STRING:
                    return in.str("a String value");
                case STRINGS: {
                    String[] a = new String[in.count("a String array length", 1)];
                    for (int i = 0; i < a.length; i++) {
                        a[i] = in.str("a String value");
                    }
                    return a;
                }
                case DATE:
                    return in.zlong("a Date value");
                case DATES: {
                    long[] a = new long[in.count("a Date array length", 1)];
                    for (int i = 0; i < a.length; i++) {
                        a[i] = in.zlong("a Date value");
                    }
                    return a;
                }
                case BOOL: {
                    int at = in.pos;
                    int c = in.u8("a Boolean value");
                    if (c > 1) {
                        throw in.failAt(what(x, p) + " is the byte " + c + ", not a Boolean 0 or 1", at, null);
                    }
                    return c == 1;
                }
                case BOOLS: {
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
                case BINARY:
                    return in.bin("a Binary value");
                case BINARIES: {
                    byte[][] a = new byte[in.count("a Binary array length", 1)][];
                    for (int i = 0; i < a.length; i++) {
                        a[i] = in.bin("a Binary value");
                    }
                    return a;
                }
                case REF:
                    return table[in.index("a Relationship target", table.length)];
                case REFS: {
                    Instance[] a = new Instance[in.count("a Relationship array length", 1)];
                    for (int i = 0; i < a.length; i++) {
                        a[i] = table[in.index("a Relationship target", table.length)];
                    }
                    return a;
                }
                default:
                    throw new IllegalStateException("unknown value kind " + kind);
            }
        }
    }
}
