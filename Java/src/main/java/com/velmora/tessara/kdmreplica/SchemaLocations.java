package com.velmora.tessara.kdmreplica;

import java.io.ByteArrayOutputStream;
import java.io.IOException;
import java.net.URI;
import java.net.URISyntaxException;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.InvalidPathException;
import java.nio.file.Path;
import java.nio.file.Paths;
import java.util.ArrayList;
import java.util.List;
import java.util.regex.Pattern;

/**
 * Schema locations as written in {@code xsi:schemaLocation} (percent-encoded so that any text
 * survives) and the local files they may name; nothing but a local file is ever accepted.
 */
final class SchemaLocations {
    private SchemaLocations() {
    }

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
                throw new IllegalArgumentException("the schema location '" + XmlNames.escape(location)
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
                    throw new IllegalArgumentException("the schema location '" + XmlNames.clip(s)
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
                    throw new IllegalArgumentException("the schema location '" + XmlNames.clip(decoded)
                            + "' is not a valid file URI: " + e.getMessage(), e);
                }
            }
            throw new IllegalArgumentException("the schema location '" + XmlNames.clip(decoded) + "' is not a local file;"
                    + " only local files are read (nothing was fetched)");
        }
        try {
            return baseDir.resolve(decoded).normalize();
        } catch (InvalidPathException e) {
            throw new IllegalArgumentException("the schema location '" + XmlNames.clip(decoded) + "' is not a valid path: "
                    + e.getMessage(), e);
        }
    }

    /**
     * The file a document's schema location names, confined to the document's own folder and the
     * schema folder ({@link Replica#setSchemaFolder}; for a document given as a string, the only
     * place, and relative locations are taken from it). The file must be a regular file whose real
     * path lies in one of them. Whatever the reason, the refusal reads the same, so that it does not
     * tell which files exist elsewhere; a location outside both is refused without any access.
     *
     * @param documentDir the folder of the document's file, or null for a string
     * @throws IllegalArgumentException for a location that is refused
     */
    static Path confined(String decoded, Path documentDir, String schemaFolder) {
        List<Path> allowed = new ArrayList<>();
        if (documentDir != null) {
            allowed.add(documentDir);
        }
        if (!schemaFolder.isEmpty()) {
            allowed.add(Paths.get(schemaFolder));
        }
        String clipped = XmlNames.clip(decoded);
        if (allowed.isEmpty()) {
            throw new IllegalArgumentException("the schema location '" + clipped + "' is refused: a document given as"
                    + " a string reads no schema file unless a schema folder is set (Replica.setSchemaFolder,"
                    + " VLXKDMReplica::SetSchemaFolder); nothing was read");
        }
        IllegalArgumentException refused = new IllegalArgumentException("the schema location '" + clipped
                + "' is refused: only a regular file in " + (allowed.size() == 1 ? "'" + allowed.get(0) + "'"
                : "'" + allowed.get(0) + "' or '" + allowed.get(1) + "'") + " is read as a document's schema");
        Path p = localFile(decoded, allowed.get(0));
        if (allowed.stream().noneMatch(p::startsWith)) {
            throw refused;
        }
        Path real;
        try {
            real = p.toRealPath();
        } catch (IOException | SecurityException e) {
            throw refused;
        }
        for (Path dir : allowed) {
            try {
                if (real.startsWith(dir.toRealPath()) && Files.isRegularFile(real)) {
                    return real;
                }
            } catch (IOException | SecurityException e) {
                // a folder that is not there allows nothing
            }
        }
        throw refused;
    }
}
