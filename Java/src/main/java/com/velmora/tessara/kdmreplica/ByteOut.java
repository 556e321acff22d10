package com.velmora.tessara.kdmreplica;

import java.nio.ByteBuffer;
import java.nio.charset.StandardCharsets;
import java.util.Arrays;

/**
 * A growable byte buffer with the primitive encodings of the binary form: bytes, unsigned LEB128
 * varints, zigzag numbers, 8-byte numbers, byte strings and texts ({@code str}: UTF-8, or UTF-16
 * for texts with unpaired surrogates).
 */
final class ByteOut {
    /** Largest array the writer makes. */
    static final int MAX_ARRAY = Integer.MAX_VALUE - 16;

    /** Takes the bytes written so far when the buffer is full (a file's writer, say). */
    interface Sink {
        void accept(byte[] b, int off, int len);
    }

    byte[] b;
    int n;
    private final Sink sink;
    /** Bytes handed to the sink. */
    private long flushed;

    ByteOut(int capacity) {
        this(capacity, null);
    }

    /** With a sink, the buffer holds only the bytes written since it last filled. */
    ByteOut(int capacity, Sink sink) {
        b = new byte[Math.max(16, capacity)];
        this.sink = sink;
    }

    /** Bytes written in all. */
    long size() {
        return flushed + n;
    }

    /** Hands the buffered bytes to the sink. Only between two records: a record writes its bytes after one ensure. */
    void flush() {
        if (sink != null && n > 0) {
            sink.accept(b, 0, n);
            flushed += n;
            n = 0;
        }
    }

    void ensure(int k) {
        if (b.length - n < k && sink != null) {
            flush();
        }
        if (b.length - n < k) {
            long need = (long) n + k;
            if (need > MAX_ARRAY) {
                throw new IllegalArgumentException("binary replica: the payload would exceed " + MAX_ARRAY
                        + " bytes, more than one byte array holds");
            }
            b = Arrays.copyOf(b, (int) Math.max(need, Math.min(MAX_ARRAY, b.length * 2L)));
        }
    }

    void u8(int v) {
        ensure(1);
        b[n++] = (byte) v;
    }

    /** Unsigned LEB128 of all 64 bits. */
    void uvar(long v) {
        ensure(10);
        while ((v & ~0x7FL) != 0) {
            b[n++] = (byte) ((v & 0x7F) | 0x80);
            v >>>= 7;
        }
        b[n++] = (byte) v;
    }

    void zint(int v) {
        uvar(((v << 1) ^ (v >> 31)) & 0xFFFFFFFFL);
    }

    void zlong(long v) {
        uvar((v << 1) ^ (v >> 63));
    }

    void i64(long v) {
        ensure(8);
        for (int s = 56; s >= 0; s -= 8) {
            b[n++] = (byte) (v >>> s);
        }
    }

    void raw(byte[] a) {
        ensure(a.length);
        System.arraycopy(a, 0, b, n, a.length);
        n += a.length;
    }

    void bin(byte[] a) {
        uvar(a.length);
        raw(a);
    }

    void str(String s) {
        if (s.isEmpty()) {
            u8(0);
        } else if (!hasUnpairedSurrogate(s)) {
            byte[] u = s.getBytes(StandardCharsets.UTF_8);
            uvar((long) u.length << 1);
            raw(u);
        } else {
            long len = 2L * s.length();
            uvar(len << 1 | 1);
            ensure((int) Math.min(Integer.MAX_VALUE, len));
            ByteBuffer.wrap(b, n, (int) len).asCharBuffer().put(s);
            n += (int) len;
        }
    }

    void strs(String[] a) {
        uvar(a.length);
        for (String s : a) {
            str(s);
        }
    }

    static boolean hasUnpairedSurrogate(String s) {
        for (int i = 0, len = s.length(); i < len; i++) {
            char c = s.charAt(i);
            if (Character.isSurrogate(c)) {
                if (Character.isHighSurrogate(c) && i + 1 < len && Character.isLowSurrogate(s.charAt(i + 1))) {
                    i++;
                } else {
                    return true;
                }
            }
        }
        return false;
    }
}
