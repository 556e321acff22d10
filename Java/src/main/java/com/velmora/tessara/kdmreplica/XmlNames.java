package com.velmora.tessara.kdmreplica;

import java.util.ArrayList;
import java.util.List;
import javax.xml.XMLConstants;

/**
 * The names and plain texts of XML that the codecs share: the namespaces of replica documents,
 * XML name checks, the reversible escape of texts that XML 1.0 cannot carry, XML whitespace and
 * lists, and the clipped quotes of texts in messages.
 */
final class XmlNames {
    /** The namespace of replica documents and of the schemas written for them. */
    static final String NS = "urn:corvexa:replica:1";
    static final String XS = XMLConstants.W3C_XML_SCHEMA_NS_URI;
    static final String XSI = XMLConstants.W3C_XML_SCHEMA_INSTANCE_NS_URI;
    /** Version of the document format, written on the root element. */
    static final String FORMAT = "1";

    private XmlNames() {
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

    static String clip(String s) {
        return s.length() <= 40 ? s : s.substring(0, 37) + "...";
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

    /** Whether a character is XML whitespace (space, tab, line feed, carriage return). */
    static boolean isSpace(char c) {
        return c == ' ' || c == '\t' || c == '\n' || c == '\r';
    }
}
