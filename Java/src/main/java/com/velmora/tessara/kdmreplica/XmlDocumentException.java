package com.velmora.tessara.kdmreplica;

/**
 * A bad XML or XSD input: not well-formed, refused (a DOCTYPE, an include from the network), of
 * a construct this package does not read, or holding data that does not fit the replica. The
 * message names the input, the line and column (when known) and the offending name or value.
 * Whatever the input was applied to is left unchanged.
 */
public final class XmlDocumentException extends IllegalArgumentException {
    private final String source;
    private final int line;
    private final int column;

    XmlDocumentException(String source, int line, int column, String message, Throwable cause) {
        super(source + (line > 0 ? " at line " + line + ", column " + column : "") + ": " + message, cause);
        this.source = source;
        this.line = line;
        this.column = column;
    }

    /** The input: "the XML string", "XML file '/path/x.xml'", and so on. */
    public String getSource() {
        return source;
    }

    /** The line of the fault (from 1), or -1 when it is not tied to a place in the input. */
    public int getLine() {
        return line;
    }

    /** The column of the fault (from 1), or -1. */
    public int getColumn() {
        return column;
    }
}
