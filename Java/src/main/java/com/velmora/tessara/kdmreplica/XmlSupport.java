package com.velmora.tessara.kdmreplica;

import java.io.BufferedInputStream;
import java.io.BufferedReader;
import java.io.ByteArrayOutputStream;
import java.io.IOException;
import java.io.InputStream;
import java.io.InputStreamReader;
import java.io.StringReader;
import java.io.StringWriter;
import java.net.URI;
import java.net.URISyntaxException;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.InvalidPathException;
import java.nio.file.Path;
import java.nio.file.Paths;
import java.time.DateTimeException;
import java.time.LocalDateTime;
import java.time.ZoneOffset;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.Base64;
import java.util.List;
import java.util.regex.Matcher;
import java.util.regex.Pattern;
import javax.xml.XMLConstants;
import javax.xml.stream.Location;
import javax.xml.stream.XMLInputFactory;
import javax.xml.stream.XMLOutputFactory;
import javax.xml.stream.XMLResolver;
import javax.xml.stream.XMLStreamConstants;
import javax.xml.stream.XMLStreamException;
import javax.xml.stream.XMLStreamReader;
import javax.xml.stream.XMLStreamWriter;
import javax.xml.transform.stax.StAXSource;
import javax.xml.transform.stream.StreamSource;
import javax.xml.validation.Schema;
import javax.xml.validation.SchemaFactory;
import javax.xml.validation.Validator;
import org.w3c.dom.ls.LSResourceResolver;
import org.xml.sax.ErrorHandler;
import org.xml.sax.SAXException;
import org.xml.sax.SAXParseException;

/**
 * What the XML and XSD codecs share: hardened readers and writers, the text forms of values,
 * the reversible escape of texts that XML 1.0 cannot carry, XML name checks, schema locations and
 * validation.
 *
 * <p>Every reader refuses DTDs, external entities and any external access; a document with a
 * DOCTYPE is rejected outright. Nothing is read except the input the caller names.
 */
final class XmlSupport {
    /** The namespace of replica documents and of the schemas written for them. */
    static final String NS = "urn:corvexa:replica:1";
    static final String XS = XMLConstants.W3C_XML_SCHEMA_NS_URI;
    static final String XSI = XMLConstants.W3C_XML_SCHEMA_INSTANCE_NS_URI;
    /** Version of the document format, written on the root element. */
    static final String FORMAT = "1";

    private XmlSupport() {
    }

    // ---------------------------------------------------------------- inputs

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

        /** The directory that relative names in this input are resolved against (now, for a string). */
        Path baseDir() {
            return file != null ? file.getParent() : currentDir();
        }

        In open() {
            XMLInputFactory f = inputFactory();
            try {
                if (file == null) {
                    return new In(f.createXMLStreamReader(new StringReader(text)), this, null);
                }
                // checked before opening: opening a pipe blocks, a device may never end
                if (!Files.isRegularFile(file) && Files.exists(file)) {
                    throw new IllegalArgumentException("cannot read " + name + ": it is not a regular file (a"
                            + " directory, pipe or device is not read)");
                }
                InputStream s;
                try {
                    s = new BufferedInputStream(Files.newInputStream(file), 1 << 16);
                } catch (IOException e) {
                    throw new IllegalArgumentException("cannot read " + name + ": " + describe(e), e);
                }
                try {
                    return new In(f.createXMLStreamReader(file.toUri().toString(), s), this, s);
                } catch (XMLStreamException | RuntimeException e) {
                    closeQuietly(s);
                    throw e;
                }
            } catch (XMLStreamException e) {
                throw In.wrap(this, e);
            }
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
            s.close();
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

        In(XMLStreamReader r, Src src, InputStream stream) {
            this.r = r;
            this.src = src;
            this.source = src.name;
            this.stream = stream;
        }

        /**
         * The parser's complaint as an exception naming the input, line and column; when the
         * parser stopped inside a tag whose name its message does not give (a mistyped end tag),
         * the tag is quoted from the input.
         */
        static XmlDocumentException wrap(Src src, XMLStreamException e) {
            Location l = e.getLocation();
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
                throw new XmlDocumentException(source, -1, -1, "the input cannot be read as XML: " + x, x);
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
                            throw fail("unexpected text '" + clip(r.getText().trim()) + "' in "
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
                if (!isSpace(c[i])) {
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

    static String clip(String s) {
        return s.length() <= 40 ? s : s.substring(0, 37) + "...";
    }

    // ---------------------------------------------------------------- output

    /** A StAX writer that indents (when asked) and turns StAX failures into unchecked ones. */
    static final class Out {
        final XMLStreamWriter w;
        private final StringWriter buffer;
        private final boolean indent;
        private int depth;
        /** Whether the element open at each depth has child elements (bit per depth, up to 64). */
        private long hasChildren;
        private boolean openEmpty;

        Out(boolean indent) {
            this.buffer = new StringWriter(1 << 12);
            this.indent = indent;
            try {
                this.w = XMLOutputFactory.newDefaultFactory().createXMLStreamWriter(buffer);
            } catch (XMLStreamException e) {
                throw new IllegalStateException("cannot create an XML writer: " + e.getMessage(), e);
            }
        }

        private static IllegalStateException failed(XMLStreamException e) {
            return new IllegalStateException("writing XML failed: " + e.getMessage(), e);
        }

        void startDocument() {
            try {
                w.writeStartDocument("UTF-8", "1.0");
            } catch (XMLStreamException e) {
                throw failed(e);
            }
        }

        private void newline(int level) throws XMLStreamException {
            if (indent) {
                StringBuilder b = new StringBuilder(1 + 2 * level).append('\n');
                for (int i = 0; i < level; i++) {
                    b.append("  ");
                }
                w.writeCharacters(b.toString());
            }
        }

        private void beforeChild() throws XMLStreamException {
            openEmpty = false;
            if (depth > 0) {
                hasChildren |= 1L << Math.min(depth, 63);
            }
            newline(depth);
        }

        /** Opens an element (prefix "" for the default namespace). */
        void start(String prefix, String local, String ns) {
            try {
                beforeChild();
                w.writeStartElement(prefix, local, ns);
                depth++;
                hasChildren &= ~(1L << Math.min(depth, 63));
            } catch (XMLStreamException e) {
                throw failed(e);
            }
        }

        /** Writes an element without content; its attributes may follow. */
        void empty(String prefix, String local, String ns) {
            try {
                beforeChild();
                w.writeEmptyElement(prefix, local, ns);
                openEmpty = true;
            } catch (XMLStreamException e) {
                throw failed(e);
            }
        }

        void namespace(String prefix, String ns) {
            try {
                if (prefix.isEmpty()) {
                    w.writeDefaultNamespace(ns);
                } else {
                    w.writeNamespace(prefix, ns);
                }
            } catch (XMLStreamException e) {
                throw failed(e);
            }
        }

        void attr(String local, String value) {
            try {
                w.writeAttribute(local, value);
            } catch (XMLStreamException e) {
                throw failed(e);
            }
        }

        void attr(String prefix, String ns, String local, String value) {
            try {
                w.writeAttribute(prefix, ns, local, value);
            } catch (XMLStreamException e) {
                throw failed(e);
            }
        }

        /** A text property in an attribute: {@code name="..."}, or {@code nameEsc="..."} when escaped. */
        void textAttr(String local, String value) {
            if (needsEscape(value, true)) {
                attr(local + "Esc", escape(value));
            } else {
                attr(local, value);
            }
        }

        void text(String s) {
            try {
                w.writeCharacters(s);
            } catch (XMLStreamException e) {
                throw failed(e);
            }
        }

        void end() {
            try {
                depth--;
                if ((hasChildren & (1L << Math.min(depth + 1, 63))) != 0) {
                    newline(depth);
                }
                w.writeEndElement();
            } catch (XMLStreamException e) {
                throw failed(e);
            }
        }

        /** A text-only element. */
        void element(String prefix, String local, String ns, String text) {
            start(prefix, local, ns);
            text(text);
            end();
        }

        boolean openEmpty() {
            return openEmpty;
        }

        String finish() {
            try {
                if (indent) {
                    w.writeCharacters("\n");
                }
                w.writeEndDocument();
                w.close();
            } catch (XMLStreamException e) {
                throw failed(e);
            }
            return buffer.toString();
        }
    }

    // ---------------------------------------------------------------- texts and names

    private static boolean legal(char c) {
        return c >= 0x20 ? c < 0xFFFE : c == '\t' || c == '\n' || c == '\r';
    }

    /**
     * Whether a text must be escaped to survive a write and a read: it holds a character XML 1.0
     * cannot carry (most control characters, U+FFFE, U+FFFF, an unpaired surrogate), a carriage
     * return (parsers turn it into a line feed), or, in an attribute, a tab or line feed (parsers
     * turn them into spaces).
     */
    static boolean needsEscape(String s, boolean inAttribute) {
        for (int i = 0, n = s.length(); i < n; i++) {
            char c = s.charAt(i);
            if (c < 0x20) {
                if (inAttribute || c == '\r' || (c != '\t' && c != '\n')) {
                    return true;
                }
            } else if (Character.isSurrogate(c)) {
                if (Character.isHighSurrogate(c) && i + 1 < n && Character.isLowSurrogate(s.charAt(i + 1))) {
                    i++;
                } else {
                    return true;
                }
            } else if (c >= 0xFFFE) {
                return true;
            }
        }
        return false;
    }

    /**
     * The escaped form: a backslash is doubled; every character below U+0020, U+FFFE, U+FFFF and
     * every unpaired surrogate is written {@code \\uXXXX}; the rest is kept. The result can stand
     * in an attribute.
     */
    static String escape(String s) {
        StringBuilder b = new StringBuilder(s.length() + 16);
        for (int i = 0, n = s.length(); i < n; i++) {
            char c = s.charAt(i);
            boolean paired = Character.isHighSurrogate(c) && i + 1 < n && Character.isLowSurrogate(s.charAt(i + 1));
            if (c == '\\') {
                b.append("\\\\");
            } else if (paired) {
                b.append(c).append(s.charAt(++i));
            } else if (c < 0x20 || c >= 0xFFFE || Character.isSurrogate(c)) {
                b.append("\\u");
                String h = Integer.toHexString(c);
                for (int k = h.length(); k < 4; k++) {
                    b.append('0');
                }
                b.append(h);
            } else {
                b.append(c);
            }
        }
        return b.toString();
    }

    /** The text of an escaped form. @throws IllegalArgumentException for a malformed escape */
    static String unescape(String s) {
        StringBuilder b = new StringBuilder(s.length());
        for (int i = 0, n = s.length(); i < n; i++) {
            char c = s.charAt(i);
            if (c != '\\') {
                b.append(c);
                continue;
            }
            if (i + 1 < n && s.charAt(i + 1) == '\\') {
                b.append('\\');
                i++;
            } else if (i + 1 < n && s.charAt(i + 1) == 'u' && hex4(s, i + 2) >= 0) {
                b.append((char) hex4(s, i + 2));
                i += 5;
            } else {
                throw new IllegalArgumentException("malformed escape at character " + (i + 1) + " of '" + clip(s)
                        + "' (expected \\\\ or \\uXXXX)");
            }
        }
        return b.toString();
    }

    private static int hex4(String s, int at) {
        if (at + 4 > s.length()) {
            return -1;
        }
        int v = 0;
        for (int k = 0; k < 4; k++) {
            int d = Character.digit(s.charAt(at + k), 16);
            if (d < 0) {
                return -1;
            }
            v = v * 16 + d;
        }
        return v;
    }

    private static boolean nameStart(int c) {
        return c >= 'A' && c <= 'Z' || c == '_' || c >= 'a' && c <= 'z' || c >= 0xC0 && c <= 0xD6
                || c >= 0xD8 && c <= 0xF6 || c >= 0xF8 && c <= 0x2FF || c >= 0x370 && c <= 0x37D
                || c >= 0x37F && c <= 0x1FFF || c >= 0x200C && c <= 0x200D || c >= 0x2070 && c <= 0x218F
                || c >= 0x2C00 && c <= 0x2FEF || c >= 0x3001 && c <= 0xD7FF || c >= 0xF900 && c <= 0xFDCF
                || c >= 0xFDF0 && c <= 0xFFFD || c >= 0x10000 && c <= 0xEFFFF;
    }

    private static boolean nameChar(int c) {
        return nameStart(c) || c == '-' || c == '.' || c >= '0' && c <= '9' || c == 0xB7
                || c >= 0x300 && c <= 0x36F || c >= 0x203F && c <= 0x2040;
    }

    /** Whether a name can be an XML element name without prefix (an XML 1.0 NCName). */
    static boolean isNcName(String s) {
        if (s.isEmpty()) {
            return false;
        }
        for (int i = 0; i < s.length(); ) {
            int c = s.codePointAt(i);
            if (i == 0 ? !nameStart(c) : !nameChar(c)) {
                return false;
            }
            i += Character.charCount(c);
        }
        return true;
    }

    /** @throws IllegalArgumentException when a class or attribute name cannot be an XML name */
    static void checkXmlName(String what, String name) {
        if (!isNcName(name)) {
            throw new IllegalArgumentException(what + " '" + name + "' cannot be written as an XML element name"
                    + " (it holds a character that XML names do not allow); rename it to write this replica");
        }
    }

    // ---------------------------------------------------------------- value forms

    static final long CANONICAL_NAN = Double.doubleToRawLongBits(Double.NaN);

    /** Exact text of a double: Java's round-trip form, "INF", "-INF", "NaN" (see {@link #nanBits}). */
    static String formatDouble(double d) {
        if (d == Double.POSITIVE_INFINITY) {
            return "INF";
        }
        if (d == Double.NEGATIVE_INFINITY) {
            return "-INF";
        }
        return Double.toString(d);
    }

    /** The bits of a NaN whose payload is not the canonical one (written beside "NaN"), or null. */
    static String nanBits(double d) {
        long bits = Double.doubleToRawLongBits(d);
        if (d != d && bits != CANONICAL_NAN) {
            String h = Long.toHexString(bits);
            return "0000000000000000".substring(h.length()) + h;
        }
        return null;
    }


    /** Whether {@code t} is a decimal xs:double: [+-]?(d+(.d*)?|.d+)([eE][+-]?d+)? with ASCII digits d. */
    private static boolean isDecimal(String t) {
        int n = t.length();
        int i = 0;
        if (i < n && (t.charAt(i) == '+' || t.charAt(i) == '-')) {
            i++;
        }
        int digits = 0;
        while (i < n && isDigit(t.charAt(i))) {
            i++;
            digits++;
        }
        if (i < n && t.charAt(i) == '.') {
            i++;
            while (i < n && isDigit(t.charAt(i))) {
                i++;
                digits++;
            }
        }
        if (digits == 0) {
            return false;
        }
        if (i < n && (t.charAt(i) == 'e' || t.charAt(i) == 'E')) {
            i++;
            if (i < n && (t.charAt(i) == '+' || t.charAt(i) == '-')) {
                i++;
            }
            int exp = i;
            while (i < n && isDigit(t.charAt(i))) {
                i++;
            }
            if (i == exp) {
                return false;
            }
        }
        return i == n;
    }

    private static boolean isDigit(char c) {
        return c >= '0' && c <= '9';
    }

    /** @throws IllegalArgumentException for a text that is not an xs:double */
    static double parseDouble(String text, String bits) {
        String t = text.strip();
        double d;
        switch (t) {
            case "INF":
            case "+INF":
                d = Double.POSITIVE_INFINITY;
                break;
            case "-INF":
                d = Double.NEGATIVE_INFINITY;
                break;
            case "NaN":
                d = Double.NaN;
                break;
            default:
                if (!isDecimal(t)) {
                    throw new IllegalArgumentException("'" + clip(text) + "' is not a Double");
                }
                d = Double.parseDouble(t);
        }
        if (bits != null) {
            long v;
            try {
                v = Long.parseUnsignedLong(bits.strip(), 16);
            } catch (NumberFormatException e) {
                throw new IllegalArgumentException("bits '" + clip(bits) + "' are not 16 hexadecimal digits", e);
            }
            double n = Double.longBitsToDouble(v);
            if (d == d || n == n || bits.strip().length() != 16) {
                throw new IllegalArgumentException("bits '" + clip(bits) + "' are only for a NaN value, given as the"
                        + " 16 hexadecimal digits of a NaN");
            }
            d = n;
        }
        return d;
    }

    /**
     * {@link #parseDouble(String, String)} of the first {@code n} characters of {@code c}: a
     * decimal number without surrounding whitespace or bits is read here, anything else the
     * general way.
     */
    static double parseDouble(char[] c, int n, String bits) {
        if (bits == null) {
            double d = decimal(c, n);
            if (d == d) {
                return d;
            }
        }
        return parseDouble(new String(c, 0, n), bits);
    }

    /**
     * The value of the first {@code n} characters of {@code c} when they are a decimal xs:double
     * (see {@link #isDecimal}) with at most 19 significant digits whose value {@link Decimals}
     * decides; otherwise NaN.
     */
    private static double decimal(char[] c, int n) {
        int i = 0;
        boolean negative = false;
        if (n > 0 && (c[0] == '+' || c[0] == '-')) {
            negative = c[0] == '-';
            i++;
        }
        long w = 0; // the significant digits, unsigned
        int significant = 0;
        int q = 0; // w * 10^q is the value
        boolean anyDigit = false;
        for (boolean fraction = false; i < n; i++) {
            char d = c[i];
            if (isDigit(d)) {
                anyDigit = true;
                if (w != 0 || d != '0') {
                    if (++significant > 19) {
                        return Double.NaN;
                    }
                    w = w * 10 + (d - '0');
                }
                if (fraction) {
                    q--;
                }
            } else if (d == '.' && !fraction) {
                fraction = true;
            } else {
                break;
            }
        }
        if (!anyDigit) {
            return Double.NaN;
        }
        if (i < n && (c[i] == 'e' || c[i] == 'E')) {
            i++;
            boolean negativeExponent = false;
            if (i < n && (c[i] == '+' || c[i] == '-')) {
                negativeExponent = c[i] == '-';
                i++;
            }
            int start = i;
            int e = 0;
            for (; i < n && isDigit(c[i]); i++) {
                if (e < 100_000) { // far beyond any double; the general way reads such exponents
                    e = e * 10 + (c[i] - '0');
                }
            }
            if (i == start) {
                return Double.NaN;
            }
            q += negativeExponent ? -e : e;
        }
        return i == n ? Decimals.toDouble(negative, w, q) : Double.NaN;
    }

    /**
     * {@link #parseInt(String)} of the first {@code n} characters of {@code c}: a sign and up to
     * ten digits are read here, anything else the general way.
     */
    static int parseInt(char[] c, int n) {
        int i = n > 0 && (c[0] == '+' || c[0] == '-') ? 1 : 0;
        if (n - i >= 1 && n - i <= 10) {
            long v = 0;
            for (int k = i; k < n && isDigit(c[k]); k++) {
                v = v * 10 + (c[k] - '0');
                if (k == n - 1) {
                    v = c[0] == '-' ? -v : v;
                    if (v >= Integer.MIN_VALUE && v <= Integer.MAX_VALUE) {
                        return (int) v;
                    }
                }
            }
        }
        return parseInt(new String(c, 0, n));
    }

    /** {@link #parseBoolean(String)} of the first {@code n} characters of {@code c}. */
    static boolean parseBoolean(char[] c, int n) {
        if (n == 1 && (c[0] == '1' || c[0] == '0')) {
            return c[0] == '1';
        }
        if (n == 4 && c[0] == 't' && c[1] == 'r' && c[2] == 'u' && c[3] == 'e') {
            return true;
        }
        if (n == 5 && c[0] == 'f' && c[1] == 'a' && c[2] == 'l' && c[3] == 's' && c[4] == 'e') {
            return false;
        }
        return parseBoolean(new String(c, 0, n));
    }

    /** @throws IllegalArgumentException for a text that is not a 32-bit integer */
    static int parseInt(String text) {
        String t = text.strip();
        int start = t.isEmpty() || t.charAt(0) != '+' && t.charAt(0) != '-' ? 0 : 1;
        boolean digits = start < t.length();
        for (int i = start; i < t.length() && digits; i++) {
            digits = isDigit(t.charAt(i));
        }
        if (digits) {
            try {
                return Integer.parseInt(t.charAt(0) == '+' ? t.substring(1) : t);
            } catch (NumberFormatException e) {
                throw new IllegalArgumentException("'" + clip(text) + "' is outside the range of an Integer", e);
            }
        }
        throw new IllegalArgumentException("'" + clip(text) + "' is not an Integer");
    }

    /** @throws IllegalArgumentException for a text that is not an xs:boolean */
    static boolean parseBoolean(String text) {
        switch (text.strip()) {
            case "true":
            case "1":
                return true;
            case "false":
            case "0":
                return false;
            default:
                throw new IllegalArgumentException("'" + clip(text) + "' is not a Boolean (true, false, 1 or 0)");
        }
    }

    static String formatBinary(byte[] b) {
        return Base64.getEncoder().encodeToString(b);
    }

    /** @throws IllegalArgumentException for a text that is not base64 */
    static byte[] parseBinary(String text) {
        String t = text;
        for (int i = 0; i < t.length(); i++) {
            char c = t.charAt(i);
            if (c == ' ' || c == '\t' || c == '\n' || c == '\r') {
                StringBuilder b = new StringBuilder(t.length());
                for (int k = 0; k < t.length(); k++) {
                    char d = t.charAt(k);
                    if (d != ' ' && d != '\t' && d != '\n' && d != '\r') {
                        b.append(d);
                    }
                }
                t = b.toString();
                break;
            }
        }
        try {
            return Base64.getDecoder().decode(t);
        } catch (IllegalArgumentException e) {
            throw new IllegalArgumentException("'" + clip(text) + "' is not base64 binary: " + e.getMessage(), e);
        }
    }

    private static void pad(StringBuilder b, long v, int width) {
        String s = Long.toString(v);
        for (int i = s.length(); i < width; i++) {
            b.append('0');
        }
        b.append(s);
    }

    /**
     * A date (milliseconds since 1970 UTC) as an xs:dateTime in UTC with milliseconds, for example
     * {@code 2024-03-01T12:00:00.250Z}. Years before 1 follow XML Schema 1.0, which has no year
     * zero: the proleptic year 0 is written -0001, year -1 is -0002.
     */
    static String formatDate(long millis) {
        long seconds = Math.floorDiv(millis, 1000L);
        int ms = (int) Math.floorMod(millis, 1000L);
        LocalDateTime t = LocalDateTime.ofEpochSecond(seconds, 0, ZoneOffset.UTC);
        long year = t.getYear();
        StringBuilder b = new StringBuilder(24);
        if (year <= 0) {
            b.append('-');
            pad(b, 1 - year, 4);
        } else {
            pad(b, year, 4);
        }
        b.append('-');
        pad(b, t.getMonthValue(), 2);
        b.append('-');
        pad(b, t.getDayOfMonth(), 2);
        b.append('T');
        pad(b, t.getHour(), 2);
        b.append(':');
        pad(b, t.getMinute(), 2);
        b.append(':');
        pad(b, t.getSecond(), 2);
        b.append('.');
        pad(b, ms, 3);
        return b.append('Z').toString();
    }

    /**
     * The milliseconds of a date in the form {@link #formatDate} writes for years 1 to 9999
     * ({@code 2024-03-01T12:00:00.250Z}) in the first {@code n} characters of {@code t}, or
     * Long.MIN_VALUE for any other text, which {@link #parseDate} then reads (and refuses) the
     * general way.
     */
    private static long canonicalDate(char[] t, int n) {
        if (n != 24 || t[4] != '-' || t[7] != '-' || t[10] != 'T' || t[13] != ':' || t[16] != ':' || t[19] != '.'
                || t[23] != 'Z') {
            return Long.MIN_VALUE;
        }
        int year = digits(t, 0, 4);
        int month = digits(t, 5, 2);
        int day = digits(t, 8, 2);
        int hour = digits(t, 11, 2);
        int minute = digits(t, 14, 2);
        int second = digits(t, 17, 2);
        int ms = digits(t, 20, 3);
        if (year <= 0 || month < 1 || month > 12 || day < 1 || day > daysInMonth(year, month) || hour < 0
                || hour > 23 || minute < 0 || minute > 59 || second < 0 || second > 59 || ms < 0) {
            return Long.MIN_VALUE;
        }
        return ((epochDay(year, month, day) * 24 + hour) * 60 + minute) * 60_000L + second * 1000L + ms;
    }

    private static int daysInMonth(int year, int month) {
        if (month == 2) {
            return year % 4 == 0 && (year % 100 != 0 || year % 400 == 0) ? 29 : 28;
        }
        return month == 4 || month == 6 || month == 9 || month == 11 ? 30 : 31;
    }

    /**
     * Days from 1970-01-01 to a date of the proleptic Gregorian calendar with a year from 1: whole
     * 400-year cycles from 0000-03-01, then the years of the cycle and the day of a year that
     * starts in March (so that February's leap day is its last).
     */
    private static long epochDay(int year, int month, int day) {
        int y = month <= 2 ? year - 1 : year;
        int cycle = y / 400;
        int yearOfCycle = y - cycle * 400;
        int dayOfYear = (153 * (month > 2 ? month - 3 : month + 9) + 2) / 5 + day - 1;
        int dayOfCycle = yearOfCycle * 365 + yearOfCycle / 4 - yearOfCycle / 100 + dayOfYear;
        return cycle * 146_097L + dayOfCycle - 719_468;
    }

    /** The number written by {@code n} ASCII digits at {@code from}, or -1. */
    private static int digits(char[] t, int from, int n) {
        int v = 0;
        for (int i = from; i < from + n; i++) {
            char c = t[i];
            if (!isDigit(c)) {
                return -1;
            }
            v = v * 10 + (c - '0');
        }
        return v;
    }

    private static final Pattern DATE = Pattern.compile(
            "(-?)(\\d{4,})-(\\d\\d)-(\\d\\d)T(\\d\\d):(\\d\\d):(\\d\\d)(?:\\.(\\d+))?(Z|[+-]\\d\\d:\\d\\d)?");

    /**
     * {@link #parseDate(String)} of the first {@code n} characters of {@code c}: the form written
     * by {@link #formatDate} is read here, anything else the general way.
     */
    static long parseDate(char[] c, int n) {
        long fast = canonicalDate(c, n);
        return fast != Long.MIN_VALUE ? fast : parseDate(new String(c, 0, n));
    }

    /**
     * Milliseconds since 1970 UTC of an xs:dateTime. A time without zone is taken as UTC; digits
     * finer than a millisecond must be zeros.
     *
     * @throws IllegalArgumentException for any other text
     */
    static long parseDate(String text) {
        String t = text.strip();
        long fast = t.length() == 24 ? canonicalDate(t.toCharArray(), 24) : Long.MIN_VALUE;
        if (fast != Long.MIN_VALUE) {
            return fast;
        }
        Matcher m = DATE.matcher(t);
        if (!m.matches()) {
            throw new IllegalArgumentException("'" + clip(text) + "' is not a Date (xs:dateTime such as"
                    + " 2024-03-01T12:00:00.250Z)");
        }
        try {
            if (m.group(2).length() > 10) {
                throw new IllegalArgumentException("the year is out of range");
            }
            long xsdYear = Long.parseLong(m.group(2));
            if (xsdYear == 0) {
                throw new IllegalArgumentException("there is no year 0000 (the year before 0001 is -0001)");
            }
            long year = m.group(1).isEmpty() ? xsdYear : 1 - xsdYear;
            if (year < -999_999_998L || year > 999_999_998L) {
                throw new IllegalArgumentException("the year is out of range");
            }
            int hour = Integer.parseInt(m.group(5));
            int minute = Integer.parseInt(m.group(6));
            int second = Integer.parseInt(m.group(7));
            String frac = m.group(8) == null ? "" : m.group(8);
            int ms = 0;
            for (int i = 0; i < frac.length(); i++) {
                int d = frac.charAt(i) - '0';
                if (i < 3) {
                    ms = ms * 10 + d;
                } else if (d != 0) {
                    throw new IllegalArgumentException("it is more precise than a millisecond");
                }
            }
            for (int i = frac.length(); i < 3; i++) {
                ms *= 10;
            }
            boolean endOfDay = hour == 24;
            if (endOfDay && (minute != 0 || second != 0 || ms != 0)) {
                throw new IllegalArgumentException("hour 24 is only allowed as 24:00:00");
            }
            LocalDateTime local = LocalDateTime.of((int) year, Integer.parseInt(m.group(3)),
                    Integer.parseInt(m.group(4)), endOfDay ? 0 : hour, minute, second);
            long seconds = local.toEpochSecond(ZoneOffset.UTC) + (endOfDay ? 86400 : 0);
            String zone = m.group(9);
            if (zone != null && !zone.equals("Z")) {
                int zh = Integer.parseInt(zone.substring(1, 3));
                int zm = Integer.parseInt(zone.substring(4, 6));
                if (zh > 14 || zm > 59 || (zh == 14 && zm != 0)) {
                    throw new IllegalArgumentException("time zone " + zone + " is out of range");
                }
                int offset = (zh * 3600 + zm * 60) * (zone.charAt(0) == '-' ? -1 : 1);
                seconds -= offset;
            }
            // (seconds + 1) * 1000 - (1000 - ms) reaches Long.MIN_VALUE without overflowing on the way
            return seconds < 0 && ms > 0 ? Math.addExact(Math.multiplyExact(seconds + 1, 1000L), ms - 1000L)
                    : Math.addExact(Math.multiplyExact(seconds, 1000L), ms);
        } catch (DateTimeException | ArithmeticException e) {
            throw new IllegalArgumentException("'" + clip(text) + "' is not a valid Date: " + e.getMessage(), e);
        } catch (IllegalArgumentException e) {
            throw new IllegalArgumentException("'" + clip(text) + "' is not a valid Date: " + e.getMessage(), e);
        }
    }

    // ---------------------------------------------------------------- schema locations

    /**
     * A schema location as written in {@code xsi:schemaLocation}: '%', whitespace and control
     * characters are percent-encoded (UTF-8), so any text survives. {@link #decodeLocation} undoes it.
     *
     * @throws IllegalArgumentException for a text with an unpaired surrogate
     */
    static String encodeLocation(String location) {
        StringBuilder b = new StringBuilder(location.length() + 8);
        for (int i = 0; i < location.length(); ) {
            int c = location.codePointAt(i);
            if (Character.isSurrogate((char) c) && c < 0x10000) {
                throw new IllegalArgumentException("the schema location '" + escape(location)
                        + "' holds an unpaired surrogate and cannot be written");
            }
            if (c == '%' || c <= 0x20 || c == 0x7F || c == 0xFFFE || c == 0xFFFF) {
                for (byte x : new String(Character.toChars(c)).getBytes(StandardCharsets.UTF_8)) {
                    b.append('%').append(Character.toUpperCase(Character.forDigit((x >> 4) & 15, 16)))
                            .append(Character.toUpperCase(Character.forDigit(x & 15, 16)));
                }
            } else {
                b.appendCodePoint(c);
            }
            i += Character.charCount(c);
        }
        return b.toString();
    }

    /** Decodes %XX sequences (UTF-8). @throws IllegalArgumentException for a malformed one */
    static String decodeLocation(String s) {
        if (s.indexOf('%') < 0) {
            return s;
        }
        StringBuilder b = new StringBuilder(s.length());
        ByteArrayOutputStream bytes = new ByteArrayOutputStream();
        for (int i = 0; i < s.length(); ) {
            char c = s.charAt(i);
            if (c != '%') {
                b.append(c);
                i++;
                continue;
            }
            bytes.reset();
            while (i < s.length() && s.charAt(i) == '%') {
                int hi = i + 2 < s.length() ? Character.digit(s.charAt(i + 1), 16) : -1;
                int lo = i + 2 < s.length() ? Character.digit(s.charAt(i + 2), 16) : -1;
                if (hi < 0 || lo < 0) {
                    throw new IllegalArgumentException("the schema location '" + clip(s)
                            + "' has a malformed %-escape at character " + (i + 1));
                }
                bytes.write(hi * 16 + lo);
                i += 3;
            }
            b.append(new String(bytes.toByteArray(), StandardCharsets.UTF_8));
        }
        return b.toString();
    }

    private static final Pattern SCHEME = Pattern.compile("[A-Za-z][A-Za-z0-9+.-]*:.*", Pattern.DOTALL);

    /**
     * The local file a schema location names, resolved against {@code baseDir}. Only plain paths
     * and {@code file:} URIs without host are accepted; anything else (http, https, ...) is refused
     * without any access.
     *
     * @throws IllegalArgumentException for a location that is not a local file
     */
    static Path localFile(String decoded, Path baseDir) {
        if (SCHEME.matcher(decoded).matches()) {
            if (decoded.regionMatches(true, 0, "file:", 0, 5)) {
                try {
                    URI u = new URI(decoded);
                    String host = u.getHost();
                    String authority = u.getRawAuthority();
                    if ((authority == null || authority.isEmpty() || "localhost".equals(host)) && u.getPath() != null
                            && u.getPath().startsWith("/") && u.getQuery() == null && u.getFragment() == null) {
                        return Paths.get(u.getPath()).normalize();
                    }
                } catch (URISyntaxException | InvalidPathException e) {
                    throw new IllegalArgumentException("the schema location '" + clip(decoded)
                            + "' is not a valid file URI: " + e.getMessage(), e);
                }
            }
            throw new IllegalArgumentException("the schema location '" + clip(decoded) + "' is not a local file;"
                    + " only local files are read (nothing was fetched)");
        }
        try {
            return baseDir.resolve(decoded).normalize();
        } catch (InvalidPathException e) {
            throw new IllegalArgumentException("the schema location '" + clip(decoded) + "' is not a valid path: "
                    + e.getMessage(), e);
        }
    }

    // ---------------------------------------------------------------- validation

    /** Refuses every resource a schema or validator asks for: schemas are compiled from explicit sources only. */
    private static final LSResourceResolver REFUSE_ALL = (type, namespace, publicId, systemId, baseUri) -> {
        throw new IllegalStateException("loading '" + systemId + "' (" + type + ") is refused: schemas are compiled"
                + " from explicit sources only");
    };

    /** Collects the first error; warnings are ignored. */
    private static final class FirstError implements ErrorHandler {
        SAXParseException first;

        @Override
        public void warning(SAXParseException e) {
            // warnings do not make a document invalid
        }

        @Override
        public void error(SAXParseException e) throws SAXException {
            if (first == null) {
                first = e;
            }
            throw e;
        }

        @Override
        public void fatalError(SAXParseException e) throws SAXException {
            error(e);
        }
    }

    /** The JDK's schema factory, secured; nothing outside the given sources is ever loaded. */
    static Schema compileSchema(String xsd) {
        SchemaFactory f = SchemaFactory.newDefaultInstance();
        try {
            f.setFeature(XMLConstants.FEATURE_SECURE_PROCESSING, true);
            f.setProperty(XMLConstants.ACCESS_EXTERNAL_SCHEMA, "");
            f.setProperty(XMLConstants.ACCESS_EXTERNAL_DTD, "");
        } catch (SAXException e) {
            throw new IllegalStateException("cannot secure the schema factory: " + e.getMessage(), e);
        }
        f.setResourceResolver(REFUSE_ALL);
        FirstError h = new FirstError();
        f.setErrorHandler(h);
        try {
            return f.newSchema(new StreamSource(new StringReader(xsd), "replica-schema.xsd"));
        } catch (SAXException e) {
            throw new IllegalStateException("the replica's schema does not compile: " + e.getMessage(), e);
        }
    }

    /**
     * Validates an input against a schema, reading it through a hardened StAX reader.
     *
     * @throws XmlDocumentException naming the line, column and the validator's message
     */
    static void validate(Src src, Schema schema) {
        Validator v = schema.newValidator();
        try {
            v.setFeature(XMLConstants.FEATURE_SECURE_PROCESSING, true);
            v.setProperty(XMLConstants.ACCESS_EXTERNAL_SCHEMA, "");
            v.setProperty(XMLConstants.ACCESS_EXTERNAL_DTD, "");
        } catch (SAXException e) {
            throw new IllegalStateException("cannot secure the validator: " + e.getMessage(), e);
        }
        v.setResourceResolver(REFUSE_ALL);
        FirstError h = new FirstError();
        v.setErrorHandler(h);
        try (In in = src.open()) {
            v.validate(new StAXSource(in.r));
        } catch (SAXException | IOException e) {
            SAXParseException p = h.first != null ? h.first : e instanceof SAXParseException ? (SAXParseException) e : null;
            String m = p != null ? p.getMessage() : e.getMessage();
            throw new XmlDocumentException(src.name, p == null ? -1 : p.getLineNumber(),
                    p == null ? -1 : p.getColumnNumber(), "the document does not match the replica's schema: " + m, e);
        }
    }

    /** Splits an xs:list or xsi:schemaLocation value at XML whitespace. */
    static List<String> tokens(String s) {
        List<String> out = new ArrayList<>();
        int i = 0;
        int n = s.length();
        while (i < n) {
            while (i < n && isSpace(s.charAt(i))) {
                i++;
            }
            int start = i;
            while (i < n && !isSpace(s.charAt(i))) {
                i++;
            }
            if (i > start) {
                out.add(s.substring(start, i));
            }
        }
        return out;
    }

    private static boolean isSpace(char c) {
        return c == ' ' || c == '\t' || c == '\n' || c == '\r';
    }
}
