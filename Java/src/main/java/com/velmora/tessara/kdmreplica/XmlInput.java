package com.velmora.tessara.kdmreplica;

import java.io.BufferedInputStream;
import java.io.BufferedReader;
import java.io.IOException;
import java.io.InputStream;
import java.io.InputStreamReader;
import java.io.StringReader;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.InvalidPathException;
import java.nio.file.Path;
import java.nio.file.Paths;
import java.util.Arrays;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import javax.xml.XMLConstants;
import javax.xml.stream.Location;
import javax.xml.stream.XMLInputFactory;
import javax.xml.stream.XMLResolver;
import javax.xml.stream.XMLStreamConstants;
import javax.xml.stream.XMLStreamException;
import javax.xml.stream.XMLStreamReader;

/**
 * The inputs of the XML and XSD codecs: what the caller names ({@link Src}, a string or a local
 * file, relative paths taken from the process's current directory; only regular files are
 * opened) and the hardened StAX reader over it ({@link In}).
 *
 * <p>Every reader refuses DTDs, external entities and any external access; a document with a
 * DOCTYPE is rejected outright. Nothing is read except the input the caller names.
 */
final class XmlInput {
    private XmlInput() {
    }

    /** An input named by the caller: a string or a local file. */
    static final class Src {
        final String text;
        final Path file;
        final String name;

        private Src(String text, Path file, String name) {
            this.text = text;
            this.file = file;
            this.name = name;
        }

        static Src ofString(String kind, String text, String member) {
            if (text == null) {
                throw new IllegalArgumentException("Replica." + member + ": the " + kind + " text is null");
            }
            return new Src(text, null, "the " + kind + " string");
        }

        static Src ofFile(String kind, String path, String member) {
            if (path == null) {
                throw new IllegalArgumentException("Replica." + member + ": the " + kind + " file path is null");
            }
            Path p;
            try {
                p = callerPath(path);
            } catch (InvalidPathException e) {
                throw new IllegalArgumentException("Replica." + member + ": '" + path + "' is not a valid path: "
                        + e.getMessage(), e);
            }
            return new Src(null, p, kind + " file '" + p + "'");
        }

        In open() {
            XMLInputFactory f = inputFactory();
            Limits.Scan scan = new Limits.Scan();
            InputStream s = null;
            In in;
            try {
                if (file == null) {
                    scan.sized(text.length(), "characters");
                    StringReader rd = new StringReader(text);
                    if (text.startsWith("\uFEFF")) {
                        rd.skip(1); // a byte order mark, as a file may start with
                    }
                    in = new In(f.createXMLStreamReader(Limits.scanned(rd, scan)), this, null, scan);
                } else {
                    // checked before opening: opening a pipe blocks, a device may never end
                    if (!Files.isRegularFile(file) && Files.exists(file)) {
                        throw new IllegalArgumentException("cannot read " + name + ": it is not a regular file (a"
                                + " directory, pipe or device is not read)");
                    }
                    try {
                        scan.sized(Files.size(file), "bytes");
                        s = new BufferedInputStream(Files.newInputStream(file), 1 << 16);
                    } catch (Limits.Exceeded e) {
                        throw e;
                    } catch (IOException e) {
                        throw new IllegalArgumentException("cannot read " + name + ": " + describe(e), e);
                    }
                    in = new In(f.createXMLStreamReader(file.toUri().toString(), Limits.scanned(s, scan)), this, s,
                            scan);
                }
            } catch (Limits.Exceeded e) {
                closeQuietly(s);
                throw new XmlDocumentException(name, -1, -1, e.getMessage(), e);
            } catch (XMLStreamException e) {
                closeQuietly(s);
                throw In.wrap(this, e);
            } catch (IOException | RuntimeException e) {
                closeQuietly(s);
                throw e instanceof RuntimeException ? (RuntimeException) e
                        : new IllegalArgumentException("cannot read " + name + ": " + describe((IOException) e), e);
            }
            if ("1.1".equals(in.r.getVersion())) {
                in.close();
                throw new XmlDocumentException(name, 1, 1, "the document is XML 1.1; only XML 1.0 documents are read",
                        null);
            }
            return in;
        }

        /**
         * The tag the parser stopped in at that place, read again from the input ({@code "</Parts"}),
         * or null when the place is not inside a tag. Only the markup's name is returned, never
         * other content of the input. Reads at most up to the place and a few characters beyond.
         */
        String tagAt(int line, int column) {
            if (line < 1 || column < 2 || file != null && !Files.isRegularFile(file)) {
                return null;
            }
            try (BufferedReader rd = new BufferedReader(file == null ? new StringReader(text)
                    : new InputStreamReader(Files.newInputStream(file), StandardCharsets.UTF_8), 8192)) {
                for (int l = 1; l < line;) {
                    int c = rd.read();
                    if (c < 0) {
                        return null;
                    }
                    if (c == '\n') {
                        l++;
                    } else if (c == '\r') {
                        l++;
                        rd.mark(1);
                        if (rd.read() != '\n') {
                            rd.reset();
                        }
                    }
                }
                // The line up to the place (its last TAG_WINDOW characters) and a name's length beyond.
                StringBuilder w = new StringBuilder();
                int at = -1;
                for (int col = 1; col < column + TAG_WINDOW; col++) {
                    if (col == column) {
                        at = w.length();
                    }
                    int c = rd.read();
                    if (c < 0 || c == '\n' || c == '\r') {
                        break;
                    }
                    w.append((char) c);
                    if (at < 0 && w.length() > 2 * TAG_WINDOW) {
                        w.delete(0, TAG_WINDOW);
                    }
                }
                if (at < 0) {
                    at = w.length();
                }
                int lt = w.lastIndexOf("<", at - 1);
                if (lt < 0 || w.indexOf(">", lt) >= 0 && w.indexOf(">", lt) < at) {
                    return null;
                }
                int end = lt + 1;
                if (end < w.length() && w.charAt(end) == '/') {
                    end++;
                }
                int nameStart = end;
                while (end < w.length() && isNameChar(w.charAt(end))) {
                    end++;
                }
                return end > nameStart ? w.substring(lt, end) : null;
            } catch (IOException | RuntimeException e) {
                return null; // the place is only quoted when it can be read again
            }
        }
    }

    private static final int TAG_WINDOW = 128;

    /**
     * A path a caller gave, absolute and normalized; a relative one is taken from the process's
     * current directory at the time of the call.
     *
     * @throws InvalidPathException for text that is no path
     */
    static Path callerPath(String path) {
        return currentDir().resolve(path).normalize();
    }

    /**
     * The process's current directory now. Native code may change it (chdir) after the JVM
     * started, which neither user.dir nor the JDK's resolution of relative paths follows; so it is
     * read from /proc/self/cwd, and taken from user.dir only where that does not exist.
     */
    static Path currentDir() {
        try {
            return Paths.get("/proc/self/cwd").toRealPath();
        } catch (IOException e) {
            return Paths.get("").toAbsolutePath();
        }
    }

    private static boolean isNameChar(char c) {
        return c >= 'a' && c <= 'z' || c >= 'A' && c <= 'Z' || c >= '0' && c <= '9' || c == '_' || c == '-'
                || c == '.' || c == ':' || c >= 0x80 && !Character.isWhitespace(c);
    }

    static String describe(IOException e) {
        String m = e.getMessage();
        return e.getClass().getSimpleName() + (m == null ? "" : " (" + m + ")");
    }

    private static void closeQuietly(InputStream s) {
        try {
            if (s != null) {
                s.close();
            }
        } catch (IOException ignored) {
            // nothing more to do with a stream that failed to open
        }
    }

    /** Refuses every external resource a parser might ask for. */
    private static final XMLResolver NO_RESOLVER = (publicId, systemId, base, namespace) -> {
        throw new XMLStreamException("external resource '" + systemId + "' refused: documents may not load"
                + " external entities or DTDs");
    };

    /**
     * The JDK's own StAX factory, configured against DTDs, external entities and any external
     * access. (The JDK's StAX factory has no secure-processing switch; DTDs are refused outright
     * instead, which leaves no entity to expand.)
     */
    static XMLInputFactory inputFactory() {
        XMLInputFactory f = XMLInputFactory.newDefaultFactory();
        f.setProperty(XMLInputFactory.SUPPORT_DTD, Boolean.FALSE);
        f.setProperty(XMLInputFactory.IS_SUPPORTING_EXTERNAL_ENTITIES, Boolean.FALSE);
        f.setProperty(XMLInputFactory.IS_REPLACING_ENTITY_REFERENCES, Boolean.FALSE);
        f.setProperty(XMLConstants.ACCESS_EXTERNAL_DTD, "");
        f.setProperty(XMLConstants.ACCESS_EXTERNAL_SCHEMA, "");
        f.setXMLResolver(NO_RESOLVER);
        return f;
    }

    /**
     * A StAX reader with its input's name: every failure becomes an {@link XmlDocumentException}
     * that names the input, line and column. A DOCTYPE is refused when it is met.
     */
    static final class In implements AutoCloseable {
        final XMLStreamReader r;
        final String source;
        private final Src src;
        private final InputStream stream;
        private final long maxDepth = Limits.get("maxElementDepth");
        private long depth;
        /** What the input's units pass through: how many were read, of how many. */
        final Limits.Scan scan;

        In(XMLStreamReader r, Src src, InputStream stream, Limits.Scan scan) {
            this.r = r;
            this.src = src;
            this.source = src.name;
            this.stream = stream;
            this.scan = scan;
        }

        /**
         * The parser's complaint as an exception naming the input, line and column; when the
         * parser stopped inside a tag whose name its message does not give (a mistyped end tag),
         * the tag is quoted from the input.
         */
        static XmlDocumentException wrap(Src src, XMLStreamException e) {
            Location l = e.getLocation();
            Limits.Exceeded over = exceeded(e);
            if (over != null) {
                return new XmlDocumentException(src.name, l == null ? -1 : l.getLineNumber(),
                        l == null ? -1 : l.getColumnNumber(), over.getMessage(), over);
            }
            int line = l == null ? -1 : l.getLineNumber();
            int column = l == null ? -1 : l.getColumnNumber();
            String m = e.getMessage() == null ? e.toString() : e.getMessage();
            int at = m.indexOf("Message: ");
            if (at >= 0) {
                m = m.substring(at + "Message: ".length());
            }
            m = readable(m.trim());
            String tag = src.tagAt(line, column);
            if (tag != null) {
                String name = tag.substring(tag.startsWith("</") ? 2 : 1);
                if (!m.contains("\"" + name + "\"")) {
                    m += " (in the " + (tag.startsWith("</") ? "end" : "start") + " tag '" + tag + ">')";
                }
            }
            return new XmlDocumentException(src.name, line, column, "the input is not well-formed XML: " + m, e);
        }

        /** The limit that stopped the parser, when one did. */
        private static Limits.Exceeded exceeded(Throwable e) {
            Throwable c = e;
            for (int i = 0; c != null && i < 8; i++) {
                if (c instanceof Limits.Exceeded) {
                    return (Limits.Exceeded) c;
                }
                c = c.getCause() != null ? c.getCause()
                        : c instanceof XMLStreamException ? ((XMLStreamException) c).getNestedException() : null;
            }
            return null;
        }

        private static final Pattern MESSAGE_KEY = Pattern.compile("http://www\\.w3\\.org/TR/[^#\\s]*#(\\w+)\\?(.*)");

        /** The JDK reports namespace faults as bare message keys ("...#AttributeNotUnique?Part&a"). */
        private static String readable(String m) {
            Matcher k = MESSAGE_KEY.matcher(m);
            if (!k.matches()) {
                return m;
            }
            String[] args = k.group(2).split("&", -1);
            switch (k.group(1)) {
                case "AttributeNotUnique":
                    if (args.length == 2) {
                        return "attribute '" + args[1] + "' appears twice in element '" + args[0] + "'";
                    }
                    break;
                case "ElementPrefixUnbound":
                    if (args.length == 2) {
                        return "the prefix '" + args[0] + "' of element '" + args[1] + "' is not bound to a namespace";
                    }
                    break;
                case "AttributePrefixUnbound":
                    if (args.length == 3) {
                        return "the prefix '" + args[2] + "' of attribute '" + args[1] + "' of element '" + args[0]
                                + "' is not bound to a namespace";
                    }
                    break;
                default:
                    break;
            }
            return k.group(1) + ": " + String.join(", ", args);
        }

        /** The next event; a DOCTYPE or an entity reference is refused. */
        int next() {
            int e;
            try {
                e = r.next();
            } catch (XMLStreamException x) {
                throw wrap(src, x);
            } catch (RuntimeException x) {
                // The JDK reader reports some malformed input (bad encodings) unchecked.
                Limits.Exceeded over = exceeded(x);
                throw new XmlDocumentException(source, -1, -1, over != null ? over.getMessage()
                        : "the input cannot be read as XML: " + x, x);
            }
            if (e == XMLStreamConstants.START_ELEMENT && ++depth > maxDepth) {
                throw fail(Limits.exceeded("the element depth", "maxElementDepth", maxDepth));
            } else if (e == XMLStreamConstants.END_ELEMENT) {
                depth--;
            }
            if (e == XMLStreamConstants.DTD) {
                throw fail("the document has a DOCTYPE declaration; documents with a DOCTYPE (DTDs, entity"
                        + " declarations) are refused");
            }
            if (e == XMLStreamConstants.ENTITY_REFERENCE) {
                // With DTDs refused no entity can be declared, so this is a well-formedness fault the
                // reader reports as an event rather than as an error.
                throw fail("the input is not well-formed XML: entity reference '&" + r.getLocalName()
                        + ";' names an undeclared entity (documents may use only the predefined entities and"
                        + " character references)");
            }
            return e;
        }

        /**
         * Moves to the next start or end tag, skipping comments, processing instructions and
         * whitespace; other text is refused, naming {@code where}.
         */
        int nextTag(String where) {
            return nextTag(where, null);
        }

        /** {@link #nextTag(String)} for {@code where} followed by a quoted name, joined only on failure. */
        int nextTag(String where, String name) {
            for (;;) {
                int e = next();
                switch (e) {
                    case XMLStreamConstants.START_ELEMENT:
                    case XMLStreamConstants.END_ELEMENT:
                    case XMLStreamConstants.END_DOCUMENT:
                        return e;
                    case XMLStreamConstants.CHARACTERS:
                    case XMLStreamConstants.CDATA:
                    case XMLStreamConstants.SPACE:
                        if (!isWhiteSpace()) {
                            throw fail("unexpected text '" + XmlNames.clip(r.getText().trim()) + "' in "
                                    + (name == null ? where : where + " '" + name + "'"));
                        }
                        break;
                    default:
                        break;
                }
            }
        }

        /** Whether the current text event holds only XML whitespace (space, tab, line feed, carriage return). */
        private boolean isWhiteSpace() {
            char[] c = r.getTextCharacters();
            for (int i = r.getTextStart(), end = i + r.getTextLength(); i < end; i++) {
                if (!XmlNames.isSpace(c[i])) {
                    return false;
                }
            }
            return true;
        }

        /** The characters of the last {@link #valueChars} (the first {@link #charCount}); reused from value to value. */
        char[] chars = new char[64];
        int charCount;

        /**
         * Reads the text of the value of an attribute up to its end tag into {@link #chars}, as
         * {@link #valueText} does, without making a String of it.
         */
        void valueChars(AttributeDef def) {
            int n = 0;
            for (;;) {
                int e = next();
                switch (e) {
                    case XMLStreamConstants.CHARACTERS:
                    case XMLStreamConstants.CDATA:
                    case XMLStreamConstants.SPACE:
                        int len = r.getTextLength();
                        if (len > chars.length - n) {
                            chars = Arrays.copyOf(chars, Math.max(n + len, 2 * chars.length));
                        }
                        System.arraycopy(r.getTextCharacters(), r.getTextStart(), chars, n, len);
                        n += len;
                        break;
                    case XMLStreamConstants.END_ELEMENT:
                        charCount = n;
                        return;
                    case XMLStreamConstants.START_ELEMENT:
                        throw fail("element " + qname() + " is not expected inside the value of '"
                                + def.qualifiedName() + "', which holds text");
                    default:
                        break;
                }
            }
        }

        /** The text of the current element up to its end tag; a child element is refused. */
        String text(String where) {
            return text(where, null);
        }

        /** The text of the value of an attribute ({@link #text(String)}, its description made only on failure). */
        String valueText(AttributeDef def) {
            return text(null, def);
        }

        private String text(String where, AttributeDef def) {
            StringBuilder b = null;
            String first = null;
            for (;;) {
                int e = next();
                switch (e) {
                    case XMLStreamConstants.CHARACTERS:
                    case XMLStreamConstants.CDATA:
                    case XMLStreamConstants.SPACE:
                        if (first == null) {
                            first = r.getText();
                        } else {
                            if (b == null) {
                                b = new StringBuilder(first);
                            }
                            b.append(r.getText());
                        }
                        break;
                    case XMLStreamConstants.END_ELEMENT:
                        return b != null ? b.toString() : first == null ? "" : first;
                    case XMLStreamConstants.START_ELEMENT:
                        throw fail("element " + qname() + " is not expected inside "
                                + (def == null ? where : "the value of '" + def.qualifiedName() + "'")
                                + ", which holds text");
                    default:
                        break;
                }
            }
        }

        /** Skips the current element and everything in it. */
        void skip() {
            int depth = 1;
            while (depth > 0) {
                int e = next();
                if (e == XMLStreamConstants.START_ELEMENT) {
                    depth++;
                } else if (e == XMLStreamConstants.END_ELEMENT) {
                    depth--;
                }
            }
        }

        boolean is(String ns, String local) {
            return local.equals(r.getLocalName()) && ns.equals(nsOf());
        }

        String nsOf() {
            String n = r.getNamespaceURI();
            return n == null ? "" : n;
        }

        /** The current element's name as written, for messages: {@code 'xs:choice'}. */
        String qname() {
            String p = r.getPrefix();
            return "'" + (p == null || p.isEmpty() ? "" : p + ":") + r.getLocalName() + "'";
        }

        String attrName(int i) {
            String p = r.getAttributePrefix(i);
            return (p == null || p.isEmpty() ? "" : p + ":") + r.getAttributeLocalName(i);
        }

        /** The value of an attribute in no namespace, or null. */
        String attr(String local) {
            return r.getAttributeValue(null, local);
        }

        int line() {
            return r.getLocation().getLineNumber();
        }

        int column() {
            return r.getLocation().getColumnNumber();
        }

        XmlDocumentException fail(String message) {
            return new XmlDocumentException(source, line(), column(), message, null);
        }

        XmlDocumentException fail(String message, Throwable cause) {
            return new XmlDocumentException(source, line(), column(), message, cause);
        }

        @Override
        public void close() {
            try {
                r.close();
            } catch (XMLStreamException ignored) {
                // closing a reader of a string or of a stream we close below cannot lose data
            }
            if (stream != null) {
                closeQuietly(stream);
            }
        }
    }

}
