package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.*;
import static org.junit.jupiter.api.Assertions.*;

import java.io.ByteArrayOutputStream;
import java.util.*;
import java.util.function.Consumer;
import java.util.stream.Stream;
import java.util.zip.Deflater;
import java.util.zip.DeflaterOutputStream;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.Timeout;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.Arguments;
import org.junit.jupiter.params.provider.MethodSource;

/**
 * Truncated, corrupted and hostile binary replicas: each is refused with a
 * {@link ReplicaBinaryException} naming what and where, without allocating out of proportion to the input.
 */
class BinaryHostileTest {
    /** Allocation allowed per input byte while refusing (plus a fixed 1 MB). */
    private static final long FACTOR = 64;
    private static final int INT = 0, DOUBLE = 1, STRING = 2, DATE = 3, BOOL = 4, BINARY = 5, REL = 6, MULTI = 8;
    private static final long MAX = Integer.MAX_VALUE;

    /** Raw bytes (counts and flags below 128 are their own varint). */
    private static ByteOut w(ByteOut o, int... bytes) {
        for (int b : bytes) {
            o.u8(b);
        }
        return o;
    }

    private static ByteOut uv(ByteOut o, long v) {
        o.uvar(v);
        return o;
    }

    /** The replica's name, location and class count; with a class name, that class up to its scope names. */
    private static ByteOut head(ByteOut o, long classes, String firstClass) {
        o.str("r");
        o.str("");
        o.uvar(classes);
        if (firstClass != null) {
            o.str(firstClass);
            w(o, 0, 0, 0, 0);
        }
        return o;
    }

    /** A class whose attributes are named a0, a1, ... with the given codes (type | MULTI). */
    private static ByteOut cls(ByteOut o, String name, String sup, int... attrs) {
        o.str(name);
        o.str(sup);
        w(o, 0, 0, 0, 0, 4).uvar(attrs.length);
        for (int k = 0; k < attrs.length; k++) {
            o.str("a" + k);
            w(o, attrs[k] & 7, attrs[k] >> 3 & 1, 0, 0, 0, 0, 0);
        }
        return o;
    }

    /** A payload of that many classes, the rest written by the caller, sealed plain. */
    private static byte[] sealed(long classes, Consumer<ByteOut> build) {
        ByteOut o = head(new ByteOut(64), classes, null);
        build.accept(o);
        return seal(o, false);
    }

    /** One class of one attribute, one live instance without identifier whose value the caller writes. */
    private static byte[] oneValue(int code, Consumer<ByteOut> value) {
        return sealed(1, o -> value.accept(w(cls(o, "A", "", code), 1, 0, 0, 0, 1)));
    }

    @Test
    @Timeout(120)
    void everyTruncationIsRefused() {
        for (boolean compressed : new boolean[] {false, true}) {
            byte[] b = Replica.getBinaryFromReplica(sample(true), compressed);
            for (int len = 0; len < b.length; len++) {
                refused(Arrays.copyOf(b, len), compressed, FACTOR);
            }
        }
        // behind a correct header and checksum: the parser itself must notice
        byte[] p = payloadOf(Replica.getBinaryFromReplica(sample(true), false), false);
        for (int len = 0; len < p.length; len++) {
            refused(seal(Arrays.copyOf(p, len), false), false, FACTOR);
        }
    }

    private static byte[] changed(byte[] b, Consumer<byte[]> change) {
        byte[] c = b.clone();
        change.accept(c);
        return c;
    }

    private static Arguments row(byte[] b, boolean compressed, String... fragments) {
        return Arguments.of(fragments[0], b, compressed, -1, fragments);
    }

    /** Bad buffers: what the refusal must name (the first fragment labels the row), and at times where. */
    static Stream<Arguments> refusals() {
        Replica sample = sample(true);
        byte[] plain = Replica.getBinaryFromReplica(sample, false);
        byte[] packed = Replica.getBinaryFromReplica(sample, true);
        byte[] bomb = deflate(new byte[1 << 20], 256); // 256 MB of zeros in about 250 KB
        byte[] payload = payloadOf(plain, false);
        byte[] stream = deflate(payload, 1);
        Deflater flusher = new Deflater(9); // flushed, without the final block that ends the stream
        flusher.setInput(payload);
        byte[] flushed = new byte[payload.length * 2 + 64];
        flushed = Arrays.copyOf(flushed, flusher.deflate(flushed, 0, flushed.length, Deflater.SYNC_FLUSH));
        int at = head(new ByteOut(64), 1, null).n + 12; // the type code of the first class's first attribute
        String[] arrays = {"an Integer", "a Double", "a String", "a Date", "a Boolean", "a Binary", "a Relationship"};
        List<Arguments> rows = new ArrayList<>(List.of(
            // impossible counts and lengths, refused before anything of that size is made
            row(sealed(MAX, o -> { }), false, "class count is 2147483647"),
            row(seal(head(new ByteOut(64), MAX, null), true), true, "class count is 2147483647"),
            row(seal(uv(new ByteOut(8), (MAX - 1) << 1), false), false, "replica name announces 2147483646 bytes"),
            row(seal(uv(head(new ByteOut(64), 1, "A"), MAX), false), false, "scope name of class 'A' count is 2147483647"),
            row(seal(uv(w(head(new ByteOut(64), 1, "A"), 0, 4), MAX - 1), false), false,
                    "attribute count of class 'A' is 2147483646"),
            row(sealed(1, o -> cls(o, "A", "", INT).uvar(MAX)), false, "live instance count of class 'A' is 2147483647"),
            // 1000 instance headers fit in the bytes that remain, their 250-byte presence bitmaps do not:
            // refused before 1000 value arrays of 2000 attributes (8 MB) are made
            row(sealed(1, o -> uv(cls(o, "Wide", "", new int[2000]), 1000).raw(new byte[1100])), false,
                    "live instance count of class 'Wide' is 1000"),
            row(sealed(1, o -> w(cls(o, "A", "", INT), 0, 0).uvar(MAX)), false,
                    "count of instances outside the replica is 2147483647"),
            row(oneValue(DOUBLE | MULTI, x -> w(uv(x, 2), 0, 0, 0, 0, 0, 0, 0, 0, 0)), false, "Double array length is 2"),
            row(oneValue(BINARY, x -> x.uvar(MAX)), false, "Binary value announces 2147483647 bytes"),
            row(oneValue(BINARY, x -> w(x, 3, 1, 2)), false, "Binary value announces 3 bytes, 2 remain"),
            row(oneValue(STRING, x -> w(x, 6, 65, 66)), false, "String value announces 3 bytes, 2 remain"),
            row(oneValue(STRING, x -> x.uvar(MAX << 1 | 1)), false, "String value announces 2147483647"),
            row(oneValue(REL, x -> x.uvar(MAX)), false, "target is 2147483647, outside the 1 instances"),
            row(oneValue(INT, x -> w(x, 0xFF, 0xFF, 0xFF, 0xFF, 0x7F)), false, "malformed number in an Integer value"),
            row(oneValue(DATE, x -> w(x, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF)), false,
                    "malformed number in a Date value"),
            // header lengths that cannot be true
            row(changed(plain, b -> Arrays.fill(b, 8, 12, (byte) 0xFF)), false, "announces a payload of 4294967295 bytes"),
            row(changed(plain, b -> Arrays.fill(b, 12, 16, (byte) 0xFF)), false, "truncated", "4294967295 stored bytes"),
            row(changed(packed, b -> Arrays.fill(b, 8, 12, (byte) 0xFF)), true, "more than the cap"),
            row(Arrays.copyOf(plain, plain.length + 3), false, "stored bytes but " + (plain.length - 17) + " follow"),
            // inflation
            row(compressedBuffer(bomb, 1000), true, "inflates past the 1000 bytes"),
            row(compressedBuffer(bomb, 0xFFFFFFFFL), true, "more than the cap"),
            row(compressedBuffer(Arrays.copyOf(stream, stream.length + 4), payload.length), true,
                    "4 bytes follow the end of the compressed stream"),
            row(compressedBuffer(stream, payload.length + 1), true, "inflates to " + payload.length),
            row(compressedBuffer(stream, payload.length), true, "checksum mismatch"),
            row(compressedBuffer(changed(stream, b -> b[2] ^= 0x55), payload.length), true, "compressed stream"),
            row(compressedBuffer(new byte[] {0x78, (byte) 0xBB, 0, 0, 0, 1, 3, 0}, 10), true, "needs a preset dictionary"),
            row(compressedBuffer(flushed, payload.length), true, "ends before its end marker"),
            // header and checksum
            Arguments.of("magic", changed(plain, b -> b[0] = 'X'), false, 0, new String[] {"not a binary replica"}),
            row(changed(plain, b -> b[4] = 2), false, "unsupported version 2"),
            row(changed(plain, b -> b[5] = 4), false, "unknown flags 0x4"),
            row(changed(plain, b -> b[7] = 1), false, "reserved header bytes"),
            row(packed, false, "the bytes were written compressed but were read as uncompressed", "offset 5 of the buffer"),
            row(plain, true, "the bytes were written uncompressed but were read as compressed"),
            row(changed(plain, b -> b[16] ^= 1), false, "checksum mismatch", "offset 16 of the buffer"),
            // classes
            row(sealed(2, o -> cls(cls(o, "A", ""), "A", "")), false, "two classes are named 'A'"),
            row(sealed(1, o -> cls(o, "1A", "")), false, "'1A' is not a valid name"),
            row(sealed(1, o -> cls(o, "A", "Zed")), false, "class 'A' names super class 'Zed'"),
            row(sealed(2, o -> cls(cls(o, "A", "B"), "B", "A")), false, "cyclic super class chain"),
            row(sealed(1001, o -> {
                for (int i = 0; i < 1001; i++) {
                    cls(o, "K" + i, i == 0 ? "" : "K" + (i - 1));
                }
            }), false, "super class chain of class 'K1000' is longer than 1000"),
            row(sealed(2, o -> cls(cls(o, "A", "", INT), "B", "A", STRING)), false, "'B.a0' clashes with attribute 'A.a0'"),
            row(sealed(1, o -> cls(o, "A", "", INT, INT).b[o.n - 8] = '0'), false, "class 'A' has two attributes named 'a0'"),
            row(sealed(1, o -> cls(o, "A", "", INT).b[o.n - 9] = '1'), false, "'10' is not a valid name"),
            Arguments.of("type code", sealed(1, o -> cls(o, "A", "", INT).b[at] = 9), false, at,
                    new String[] {"unknown type code 9 of attribute 'a0'"}),
            row(sealed(1, o -> cls(o, "A", "").b[at - 5] = (byte) 0x80), false, "invalid flags 0x80 of class 'A'"),
            row(sealed(1, o -> cls(o, "A", "").b[at - 5] = 0x40), false, "the namespace of class 'A' is empty"),
            // instances and values
            row(sealed(1, o -> {
                w(cls(o, "A", ""), 2, 1 << 4).str("same");
                w(o, 1 << 4).str("same");
            }), false, "already has a live instance with identifier \"same\""),
            row(sealed(1, o -> w(cls(o, "A", ""), 1, 4)), false, "live instance of class 'A' has the state bits 0x4"),
            row(sealed(1, o -> w(cls(o, "A", ""), 1, 3 << 4)), false, "unknown identifier kind 3"),
            row(sealed(1, o -> w(cls(o, "A", "", INT), 0, 0, 1, 0, 0)), false, "outside the replica must be deleted"),
            row(oneValue(BOOL, x -> w(x, 2)), false, "is the byte 2, not a Boolean"),
            row(oneValue(BOOL | MULTI, x -> w(x, 3, 0x08)), false, "sets bits beyond its 3 elements"),
            row(oneValue(STRING, x -> w(x, 4, 0xC3, 0x28)), false, "not valid UTF-8"),
            row(oneValue(STRING, x -> w(x, 7, 0, 65, 0)), false, "odd number of bytes"),
            row(oneValue(INT, x -> w(x, 2, 0)), false, "1 bytes follow the last instance's values"),
            row(sealed(1, o -> w(cls(o, "A", "", INT), 1, 0, 0, 0, 2)), false,
                    "presence bitmap of A[#0] marks attributes beyond its 1")));
        for (int type = INT; type <= REL; type++) {
            rows.add(row(oneValue(type | MULTI, x -> x.uvar(MAX)), false, arrays[type] + " array length is 2147483647"));
        }
        return rows.stream();
    }

    @ParameterizedTest(name = "{0}")
    @MethodSource("refusals")
    void badBuffersAreRefusedNamingWhatAndWhere(String label, byte[] bytes, boolean compressed, int offset,
            String[] fragments) {
        ReplicaBinaryException e = refused(bytes, compressed, FACTOR, fragments);
        if (offset >= 0) {
            assertEquals(offset, e.getOffset());
            assertEquals(offset > 0, e.isPayloadOffset());
        }
    }

    private static byte[] deflate(byte[] data, int times) {
        ByteArrayOutputStream bytes = new ByteArrayOutputStream();
        try (DeflaterOutputStream out = new DeflaterOutputStream(bytes, new Deflater(9))) {
            for (int i = 0; i < times; i++) {
                out.write(data);
            }
        } catch (java.io.IOException e) {
            throw new AssertionError(e);
        }
        return bytes.toByteArray();
    }

    private static byte[] compressedBuffer(byte[] stream, long declared) {
        byte[] b = Arrays.copyOf(BinaryCodec.MAGIC, BinaryCodec.HEADER_SIZE + stream.length);
        b[4] = (byte) BinaryCodec.VERSION;
        b[5] = (byte) BinaryCodec.FLAG_COMPRESSED;
        for (int i = 0; i < 4; i++) {
            b[8 + i] = (byte) (declared >>> (24 - 8 * i));
            b[12 + i] = (byte) (stream.length >>> (24 - 8 * i));
        }
        System.arraycopy(stream, 0, b, BinaryCodec.HEADER_SIZE, stream.length);
        return b;
    }

    @Test
    @Timeout(120)
    void aBombUnderTheCapStopsInflatingAtTheDeclaredLength() {
        byte[] bomb = deflate(new byte[1 << 20], 256);
        long declared = 64 << 20;
        assertTrue(declared < (long) bomb.length * BinaryCodec.MAX_INFLATE_RATIO);
        long before = allocated();
        refused(compressedBuffer(bomb, declared), true, 3L * BinaryCodec.MAX_INFLATE_RATIO, "inflates past the "
                + declared + " bytes");
        assertTrue(allocated() - before < 3 * declared, "allocated " + (allocated() - before));
    }
}
