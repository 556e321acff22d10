package com.velmora.tessara.kdmreplica;

import java.io.FilterInputStream;
import java.io.FilterReader;
import java.io.IOException;
import java.io.InputStream;
import java.io.Reader;
import java.util.Collections;
import java.util.LinkedHashMap;
import java.util.Map;

/**
 * The process-wide limits on what a document may cost ({@link Replica#setLimit}), and the scanner
 * that applies the XML ones while the parser reads, so that a hostile document is refused at the
 * first byte past a limit rather than after the parser has paid for it.
 *
 * <p>The scanner sees the input as the parser does (characters of a string; bytes of a file, in
 * units of one byte for the ASCII-compatible encodings and of two or four for UTF-16 and UTF-32)
 * and keeps a small state: inside a tag or not, inside a quoted attribute value or not. It counts
 * what it sees as written (a character reference is several characters), so a limit is never
 * reached later than the parser's own count.
 */
final class Limits {
    private Limits() {
    }

    /** Known limits and their defaults, in the order they are listed in messages. */
    private static final Map<String, Long> DEFAULTS;
    private static final Map<String, Long> VALUES = Collections.synchronizedMap(new LinkedHashMap<>());

    static {
        LinkedHashMap<String, Long> d = new LinkedHashMap<>();
        d.put("maxDocumentSize", 1L << 30); // bytes of an XML or XSD file, characters of a string
        d.put("maxElementDepth", 256L);
        d.put("maxNamespaceDeclarations", 100L); // on one element
        d.put("maxAttributeLength", 1L << 20); // characters of one attribute value, as written
        d.put("maxTextLength", 1L << 28); // characters of one text between tags, as written
        d.put("maxInflatedSize", 1L << 30); // bytes a compressed binary replica may inflate to
        d.put("maxInflateRatio", 200L); // times its compressed size, once past RATIO_FLOOR bytes
        DEFAULTS = Collections.unmodifiableMap(d);
        VALUES.putAll(d);
    }

    /** Inflated sizes up to this many bytes are never refused for their ratio. */
    static final long RATIO_FLOOR = 64L << 20;

    static void set(String name, long value) {
        known(name, "setLimit");
        if (value <= 0) {
            throw new IllegalArgumentException("Replica.setLimit: limit '" + name + "' must be positive, not " + value);
        }
        VALUES.put(name, value);
    }

    static long get(String name) {
        known(name, "getLimit");
        return VALUES.get(name);
    }

    private static void known(String name, String member) {
        if (name == null || !DEFAULTS.containsKey(name)) {
            throw new IllegalArgumentException("Replica." + member + ": unknown limit "
                    + (name == null ? "null" : "'" + name + "'") + "; known limits: "
                    + String.join(", ", DEFAULTS.keySet()));
        }
    }

    /** The refusal of something past a limit: what, the limit, and how to raise it. */
    static String exceeded(String what, String name, long limit) {
        return what + " is past the limit " + name + " = " + limit + " (raise it with Replica.setLimit(\"" + name
                + "\", n) or VLXKDMReplica::SetLimit)";
    }

    /** The most bytes a compressed payload of {@code stored} bytes may inflate to. */
    static long inflateCap(long stored) {
        long byRatio = Math.max(RATIO_FLOOR, stored * get("maxInflateRatio"));
        return Math.min(get("maxInflatedSize"), byRatio);
    }

    /** A refusal by the scanner: the parser wraps it, the codecs unwrap it to name the input. */
    static final class Exceeded extends IOException {
        private static final long serialVersionUID = 1L;

        Exceeded(String message) {
            super(message);
        }
    }

    /** The state of one scan: the limits in force when it began and what it has seen. */
    static final class Scan {
        private final long maxSize = get("maxDocumentSize");
        private final long maxNamespaces = get("maxNamespaceDeclarations");
        private final long maxAttribute = get("maxAttributeLength");
        private final long maxText = get("maxTextLength");
        private long size;
        private int state; // TEXT, TAG_START, TAG, QUOTED, OTHER
        private int quote;
        private long run; // characters of the current text or attribute value
        private long namespaces; // declarations on the current tag
        private int matched; // characters of "xmlns" matched so far in the current tag

        private static final int TEXT = 0;
        private static final int TAG_START = 1;
        private static final int TAG = 2;
        private static final int QUOTED = 3;
        private static final int OTHER = 4;
        private static final String XMLNS = "xmlns";

        /** The input's size announced by {@link #sized} (0 when unknown). */
        long total;

        /** Units seen so far. */
        long seen() {
            return size;
        }

        /** Checks that a whole input of {@code n} units fits before it is read. */
        void sized(long n, String unit) throws Exceeded {
            total = n;
            if (n > maxSize) {
                throw new Exceeded(exceeded("a document of " + n + " " + unit, "maxDocumentSize", maxSize));
            }
        }

        /**
         * Sees {@code n} characters. Runs that change nothing but counts (text, attribute values,
         * markup between quotes and the next "x", '>' or quote) are passed over in one loop.
         */
        void see(char[] b, int off, int n) throws Exceeded {
            for (int i = off, end = off + n; i < end; i++) {
                int j = i;
                if (state == TEXT) {
                    while (j < end && b[j] != '<') {
                        j++;
                    }
                } else if (state == QUOTED) {
                    while (j < end && b[j] != quote) {
                        j++;
                    }
                } else if (state == TAG && matched == 0) {
                    for (char c; j < end && (c = b[j]) != 'x' && c != '>' && c != '"' && c != '\'';) {
                        j++;
                    }
                }
                i = skipped(i, j);
                if (i < end) {
                    see(b[i]);
                }
            }
        }

        /** Counts the units from i to j passed over; returns j. */
        private int skipped(int i, int j) throws Exceeded {
            if (j > i) {
                size += j - i;
                if (size > maxSize) {
                    throw new Exceeded(exceeded("the document", "maxDocumentSize", maxSize));
                }
                if (state == TEXT && (run += j - i) > maxText) {
                    throw new Exceeded(exceeded("a text", "maxTextLength", maxText));
                }
                if (state == QUOTED && (run += j - i) > maxAttribute) {
                    throw new Exceeded(exceeded("an attribute value", "maxAttributeLength", maxAttribute));
                }
            }
            return j;
        }

        void see(int c) throws Exceeded {
            if (++size > maxSize) {
                throw new Exceeded(exceeded("the document", "maxDocumentSize", maxSize));
            }
            switch (state) {
                case TEXT:
                    if (c == '<') {
                        state = TAG_START;
                    } else if (++run > maxText) {
                        throw new Exceeded(exceeded("a text", "maxTextLength", maxText));
                    }
                    break;
                case TAG_START:
                    run = 0;
                    namespaces = 0;
                    matched = 0;
                    state = c == '!' || c == '?' ? OTHER : TAG;
                    break;
                case TAG:
                    if (c == '"' || c == '\'') {
                        state = QUOTED;
                        quote = c;
                        run = 0;
                    } else if (c == '>') {
                        state = TEXT;
                        run = 0;
                    } else if (c == XMLNS.charAt(matched)) {
                        if (++matched == XMLNS.length()) {
                            matched = 0;
                            if (++namespaces > maxNamespaces) {
                                throw new Exceeded(exceeded("the count of namespace declarations on one element",
                                        "maxNamespaceDeclarations", maxNamespaces));
                            }
                        }
                    } else {
                        matched = c == 'x' ? 1 : 0;
                    }
                    break;
                case QUOTED:
                    if (c == quote) {
                        state = TAG;
                        matched = 0;
                    } else if (++run > maxAttribute) {
                        throw new Exceeded(exceeded("an attribute value", "maxAttributeLength", maxAttribute));
                    }
                    break;
                default: // comments, processing instructions, declarations and CDATA: to the next '>'
                    if (c == '>') {
                        state = TEXT;
                        run = 0;
                    } else if (++run > maxText) {
                        throw new Exceeded(exceeded("a text", "maxTextLength", maxText));
                    }
                    break;
            }
        }
    }

    /** A string document's characters through a scan. */
    static Reader scanned(Reader in, Scan scan) {
        return new FilterReader(in) {
            @Override
            public int read() throws IOException {
                int c = super.read();
                if (c >= 0) {
                    scan.see(c);
                }
                return c;
            }

            @Override
            public int read(char[] b, int off, int len) throws IOException {
                int n = super.read(b, off, len);
                if (n > 0) {
                    scan.see(b, off, n);
                }
                return n;
            }
        };
    }

    /**
     * A file's bytes through a scan, in units fixed by its first bytes: two (UTF-16) or four
     * (UTF-32) bytes in either order when a byte order mark or a zero byte around the first '<'
     * says so, else one (UTF-8 and the other ASCII-compatible encodings, whose markup is ASCII).
     */
    static InputStream scanned(InputStream in, Scan scan) {
        return new FilterInputStream(in) {
            private final byte[] head = new byte[4];
            private int headLength;
            private int width; // 0 until known
            private char[] units = new char[0]; // the bytes of a one-byte encoding, as units
            private boolean bigEndian;
            private int unit;
            private int unitBytes;

            private void byteSeen(int b) throws IOException {
                if (width == 0) {
                    head[headLength++] = (byte) b;
                    if (headLength < 4) {
                        return;
                    }
                    decideWidth();
                    for (int i = 0; i < 4; i++) {
                        unitByte(head[i] & 0xFF);
                    }
                    return;
                }
                unitByte(b);
            }

            private void decideWidth() {
                int b0 = head[0] & 0xFF;
                int b1 = head[1] & 0xFF;
                int b2 = head[2] & 0xFF;
                int b3 = head[3] & 0xFF;
                if (b0 == 0 && b1 == 0) { // 00 00 FE FF, 00 00 00 3C
                    width = 4;
                    bigEndian = true;
                } else if (b2 == 0 && b3 == 0 && (b1 == 0 || b0 == 0xFF)) { // FF FE 00 00, 3C 00 00 00
                    width = 4;
                } else if (b0 == 0xFE && b1 == 0xFF || b0 == 0) { // FE FF, 00 3C
                    width = 2;
                    bigEndian = true;
                } else if (b0 == 0xFF && b1 == 0xFE || b1 == 0) { // FF FE, 3C 00
                    width = 2;
                } else {
                    width = 1;
                }
            }

            private void unitByte(int b) throws IOException {
                unit = bigEndian ? unit << 8 | b : unit | b << (8 * unitBytes);
                if (++unitBytes == width) {
                    scan.see(unit);
                    unit = 0;
                    unitBytes = 0;
                }
            }

            @Override
            public int read() throws IOException {
                int c = super.read();
                if (c >= 0) {
                    byteSeen(c);
                }
                return c;
            }

            @Override
            public int read(byte[] b, int off, int len) throws IOException {
                int n = super.read(b, off, len);
                if (n > 0 && width == 1) {
                    if (units.length < n) {
                        units = new char[Math.max(n, 8192)];
                    }
                    for (int i = 0; i < n; i++) {
                        units[i] = (char) (b[off + i] & 0xFF);
                    }
                    scan.see(units, 0, n);
                } else {
                    for (int i = 0; i < n; i++) {
                        byteSeen(b[off + i] & 0xFF);
                    }
                }
                return n;
            }

            @Override
            public long skip(long n) throws IOException {
                return 0; // every byte is seen
            }
        };
    }
}
