package com.velmora.tessara.kdmreplica;

import java.io.IOException;
import java.io.OutputStream;
import java.io.UncheckedIOException;
import java.nio.ByteBuffer;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.Arrays;
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
 *            u8 flags (extensible 1, abstract 2, persistent 4, visibility &lt;&lt; 3, Extension 32,
 *            namespace 64), str namespace (only with flag 64: a class without a schema namespace
 *            is written as before namespaces were kept), count attributes, attribute*
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
 * itself stay under {@link #MAX_INFLATED} and {@link #MAX_INFLATE_RATIO} times the compressed size, and
 * under the limits "maxInflatedSize" and "maxInflateRatio" ({@link Limits}), before anything is
 * inflated.
 * Super class chains are resolved without recursion and limited to {@link #MAX_SUPER_DEPTH}; the
 * class layouts together may hold at most {@link #layoutLimit} attribute slots. Every failure is a
 * {@link ReplicaBinaryException} naming what and where; the replica being built is dropped.
 *
 * <h2>Where things are</h2>
 * This class holds the entry points and the frame (header, checksum, compression). The records
 * of the payload are described once, for both directions, in {@link BinaryFormat};
 * {@link BinaryWriter} and {@link BinaryReader} walk the payload in order; the primitive
 * encodings and their bounds checks are {@link ByteOut}'s and {@link ByteIn}'s.
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

    private BinaryCodec() {
    }

    /** Most attribute slots that the layouts of all classes may hold together, for a payload size. */
    static long layoutLimit(long payloadLength) {
        return payloadLength + 65536;
    }

    // ================================================================ writing

    /** The binary form of a replica (holds the replica's read lock while encoding). */
    static byte[] write(Replica r, boolean compressed) {
        ByteOut payload;
        Lock l = r.rw.readLock();
        l.lock();
        try {
            payload = new BinaryWriter(r).encode();
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
        header(out, compressed, length, stored, (int) crc.getValue());
        return out;
    }

    /** Writes the header into the first {@link #HEADER_SIZE} bytes of out. */
    private static void header(byte[] out, boolean compressed, int length, int stored, int crc) {
        System.arraycopy(MAGIC, 0, out, 0, 4);
        out[4] = (byte) VERSION;
        out[5] = (byte) (compressed ? FLAG_COMPRESSED : 0);
        putInt(out, 8, length);
        putInt(out, 12, stored);
        putInt(out, 16, crc);
    }

    /** {@code Replica.writeBinaryFile}: the payload streamed into the file as it is encoded, the header last. */
    static void writeFile(Replica r, Path target, boolean compressed) {
        Lock l = r.rw.readLock();
        l.lock();
        try {
            OutputFiles.write(target, "binary file", (channel, stream) -> {
                stream.write(new byte[HEADER_SIZE]);
                FileFrame frame = new FileFrame(stream, compressed);
                try {
                    new BinaryWriter(r, frame).encode();
                    byte[] header = frame.finish();
                    stream.flush();
                    channel.write(ByteBuffer.wrap(header), 0);
                } finally {
                    frame.end();
                }
            });
        } finally {
            l.unlock();
        }
    }

    /** The frame of a payload streamed into a file: checksum, length and (deflated) bytes as they come. */
    private static final class FileFrame implements ByteOut.Sink {
        private final OutputStream os;
        private final Deflater deflater;
        private final byte[] buffer;
        private final CRC32 crc = new CRC32();
        private long length;
        private long stored;

        FileFrame(OutputStream os, boolean compressed) {
            this.os = os;
            this.deflater = compressed ? new Deflater(Deflater.DEFAULT_COMPRESSION) : null;
            this.buffer = compressed ? new byte[1 << 16] : null;
        }

        @Override
        public void accept(byte[] b, int off, int len) {
            length += len;
            if (deflater == null ? length > ByteOut.MAX_ARRAY - HEADER_SIZE : length > MAX_INFLATED) {
                throw new IllegalArgumentException("binary replica: a payload of more than " + (length - len)
                        + " bytes is more than a " + (deflater == null ? "binary replica read back in one array"
                                : "compressed binary replica") + " may hold" + (deflater == null ? ""
                                        : "; write it uncompressed"));
            }
            crc.update(b, off, len);
            try {
                if (deflater == null) {
                    os.write(b, off, len);
                    stored += len;
                } else {
                    deflater.setInput(b, off, len);
                    while (!deflater.needsInput()) {
                        drain();
                    }
                }
            } catch (IOException e) {
                throw new UncheckedIOException(e);
            }
        }

        private void drain() throws IOException {
            int k = deflater.deflate(buffer);
            os.write(buffer, 0, k);
            stored += k;
        }

        /** The header, once every payload byte went through. */
        byte[] finish() throws IOException {
            if (deflater != null) {
                deflater.finish();
                while (!deflater.finished()) {
                    drain();
                }
                if (length > stored * MAX_INFLATE_RATIO + 64) {
                    throw new IllegalStateException("binary replica: deflate compressed " + length + " bytes to "
                            + stored + ", beyond the ratio a reader accepts");
                }
            }
            byte[] h = new byte[HEADER_SIZE];
            header(h, deflater != null, (int) length, (int) stored, (int) crc.getValue());
            return h;
        }

        void end() {
            if (deflater != null) {
                deflater.end();
            }
        }
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

    // ================================================================ reading

    /**
     * A replica from its binary form, built through {@code Staging} into a new replica;
     * {@code compressed} null takes the header's flag.
     */
    static Replica read(byte[] bytes, Boolean compressed) {
        return new BinaryReader(unframe(bytes, compressed)).decode();
    }

    /** {@code Replica.readBinaryFile}: the file's bytes (read once, whole), compressed as the header says. */
    static Replica readFile(Path file) {
        String name = "binary file '" + file + "'";
        byte[] bytes;
        try {
            if (!Files.isRegularFile(file) && Files.exists(file)) {
                throw new IllegalArgumentException("cannot read " + name + ": it is not a regular file");
            }
            long size = Files.size(file);
            if (size > ByteOut.MAX_ARRAY) {
                throw new IllegalArgumentException("cannot read " + name + ": " + size
                        + " bytes are more than a binary replica holds");
            }
            bytes = Files.readAllBytes(file);
        } catch (IOException e) {
            throw new IllegalArgumentException("cannot read " + name + ": " + XmlInput.describe(e), e);
        }
        return read(bytes, null);
    }

    private static ReplicaBinaryException header(String what, int offset) {
        return new ReplicaBinaryException(what, offset, false, null);
    }

    /** Checks the header and returns a reader over the payload (inflated when compressed). */
    static ByteIn unframe(byte[] bytes, Boolean wanted) {
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
        boolean compressed = wanted == null ? written : wanted;
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
            if (payloadLength > Limits.get("maxInflatedSize")) {
                throw header(Limits.exceeded("an inflated size of " + payloadLength + " bytes", "maxInflatedSize",
                        Limits.get("maxInflatedSize")), 8);
            }
            if (payloadLength > Limits.inflateCap(stored)) {
                throw header(Limits.exceeded("inflating " + stored + " bytes to " + payloadLength + " bytes",
                        "maxInflateRatio", Limits.get("maxInflateRatio")), 8);
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
}
