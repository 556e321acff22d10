package com.velmora.tessara.kdmreplica;

import java.nio.ByteBuffer;
import java.nio.charset.CharacterCodingException;
import java.nio.charset.StandardCharsets;
import java.util.Arrays;

/**
 * A bounds-checked reader of the primitive encodings of the binary form ({@link ByteOut} writes
 * them): every length and count is checked against the bytes that remain, and every failure is a
 * {@link ReplicaBinaryException} naming what was read and where.
 */
final class ByteIn {
    final byte[] b;
    final int base;
    final int end;
    int pos;

    ByteIn(byte[] b, int base, int end) {
        this.b = b;
        this.base = base;
        this.end = end;
        this.pos = base;
    }

    /**
     * What is being read, for the {@code {class}} and {@code {attr}} in descriptions: kept as
     * parts and joined only when a message is made, so reading a schema builds no texts.
     */
    String className = "";
    String attrName = "";
    int index;

    String expand(String what) {
        if (what.indexOf('{') < 0) {
            return what;
        }
        return what.replace("{class}", "class '" + className + "'")
                .replace("{attr}", "attribute '" + className + "." + attrName + "'")
                .replace("{k}", Integer.toString(index));
    }

    int remaining() {
        return end - pos;
    }

    int offset() {
        return pos - base;
    }

    ReplicaBinaryException failAt(String what, int at, Throwable cause) {
        return new ReplicaBinaryException(what, at - base, true, cause);
    }

    ReplicaBinaryException fail(String what) {
        return failAt(what, pos, null);
    }

    int u8(String what) {
        if (pos >= end) {
            throw fail("truncated: " + expand(what) + " is missing");
        }
        return b[pos++] & 0xFF;
    }

    /** Unsigned LEB128 of at most {@code maxBytes} bytes; the last byte may hold {@code lastMax} at most. */
    private long uvar(String what, int maxBytes, int lastMax) {
        int start = pos;
        long v = 0;
        for (int i = 0;; i++) {
            if (pos >= end) {
                throw failAt("truncated: " + expand(what) + " is cut short", start, null);
            }
            int c = b[pos++] & 0xFF;
            if (i == maxBytes - 1) {
                if (c > lastMax) {
                    throw failAt("malformed number in " + expand(what) + ": too many bytes", start, null);
                }
                return v | (long) c << (7 * i);
            }
            v |= (long) (c & 0x7F) << (7 * i);
            if (c < 0x80) {
                return v;
            }
        }
    }

    long u32(String what) {
        return uvar(what, 5, 0x0F);
    }

    /** A count of items of at least {@code minBytes} bytes each that must still follow. */
    int count(String what, long minBytes, long owed) {
        int start = pos;
        long v = u32(what);
        long room = Math.max(0, remaining() - owed);
        if (v > room / minBytes) {
            throw failAt(expand(what) + " is " + v + ", more than the " + remaining() + " remaining bytes can hold",
                    start, null);
        }
        return (int) v;
    }

    int count(String what, long minBytes) {
        return count(what, minBytes, 0);
    }

    int index(String what, int size) {
        int start = pos;
        long v = u32(what);
        if (v >= size) {
            throw failAt(expand(what) + " is " + v + ", outside the " + size + " instances of the table", start, null);
        }
        return (int) v;
    }

    int zint(String what) {
        int u = (int) u32(what);
        return (u >>> 1) ^ -(u & 1);
    }

    long zlong(String what) {
        long u = uvar(what, 10, 1);
        return (u >>> 1) ^ -(u & 1);
    }

    long i64(String what) {
        if (remaining() < 8) {
            throw fail("truncated: " + expand(what) + " needs 8 bytes, " + remaining() + " remain");
        }
        long v = 0;
        for (int i = 0; i < 8; i++) {
            v = v << 8 | (b[pos++] & 0xFF);
        }
        return v;
    }

    byte[] bin(String what) {
        int start = pos;
        long len = u32(what);
        if (len > remaining()) {
            throw failAt("truncated: " + expand(what) + " announces " + len + " bytes, " + remaining() + " remain", start,
                    null);
        }
        byte[] a = Arrays.copyOfRange(b, pos, pos + (int) len);
        pos += (int) len;
        return a;
    }

    String str(String what) {
        int start = pos;
        long tag = u32(what);
        long len = tag >>> 1;
        if (len > remaining()) {
            throw failAt("truncated: " + expand(what) + " announces " + len + " bytes, " + remaining() + " remain", start,
                    null);
        }
        int n = (int) len;
        if (n == 0) {
            return "";
        }
        String s;
        if ((tag & 1) == 0) {
            s = new String(b, pos, n, StandardCharsets.UTF_8);
            if (s.indexOf('\uFFFD') >= 0) {
                try {
                    StandardCharsets.UTF_8.newDecoder().decode(ByteBuffer.wrap(b, pos, n));
                } catch (CharacterCodingException e) {
                    throw failAt(expand(what) + " is not valid UTF-8", start, e);
                }
            }
        } else {
            if ((n & 1) != 0) {
                throw failAt(expand(what) + " holds an odd number of bytes (" + n + ") of UTF-16", start, null);
            }
            s = ByteBuffer.wrap(b, pos, n).asCharBuffer().toString();
        }
        pos += n;
        return s;
    }

    String[] strs(String what, String countWhat) {
        int n = count(countWhat, 1);
        String[] a = new String[n];
        for (int i = 0; i < n; i++) {
            a[i] = str(what);
        }
        return a;
    }
}
