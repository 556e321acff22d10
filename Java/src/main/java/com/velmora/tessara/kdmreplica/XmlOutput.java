package com.velmora.tessara.kdmreplica;

import java.io.BufferedWriter;
import java.io.IOException;
import java.io.UncheckedIOException;
import java.io.OutputStream;
import java.io.OutputStreamWriter;
import java.io.StringWriter;
import java.io.Writer;
import java.nio.charset.StandardCharsets;
import javax.xml.stream.XMLOutputFactory;
import javax.xml.stream.XMLStreamException;
import javax.xml.stream.XMLStreamWriter;

/** A StAX writer that indents (when asked) and turns StAX failures into unchecked ones. */
final class XmlOutput {
    final XMLStreamWriter w;
    private final StringWriter buffer;
    /** The characters' way into the stream, when there is one. */
    private final Writer encoder;
    private final boolean indent;
    private int depth;
    /** Whether the element open at each depth has child elements (bit per depth, up to 64). */
    private long hasChildren;
    private boolean openEmpty;

    /** A writer into a text that {@link #finish} returns. */
    XmlOutput(boolean indent) {
        this(indent, null);
    }

    /** A writer into a stream, in UTF-8 (or into a text when {@code stream} is null). */
    XmlOutput(boolean indent, OutputStream stream) {
        this.buffer = stream == null ? new StringWriter(1 << 12) : null;
        this.indent = indent;
        try {
            XMLOutputFactory f = XMLOutputFactory.newDefaultFactory();
            // Characters are encoded in bulk by a writer of our own: the factory's own UTF-8 stream
            // encodes them one at a time.
            this.encoder = stream == null ? null
                    : new BufferedWriter(new OutputStreamWriter(stream, StandardCharsets.UTF_8), 1 << 14);
            this.w = f.createXMLStreamWriter(stream == null ? buffer : encoder);
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
        if (XmlNames.needsEscape(value, true)) {
            attr(local + "Esc", XmlNames.escape(value));
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

    /** Ends the document: its text, or null when it went to a stream (flushed, not closed). */
    String finish() {
        try {
            if (indent) {
                w.writeCharacters("\n");
            }
            w.writeEndDocument();
            w.close();
            if (encoder != null) {
                encoder.flush();
            }
        } catch (XMLStreamException e) {
            throw failed(e);
        } catch (IOException e) {
            throw new UncheckedIOException(e);
        }
        return buffer == null ? null : buffer.toString();
    }
}
