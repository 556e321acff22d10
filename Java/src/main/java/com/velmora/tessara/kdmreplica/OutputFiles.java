package com.velmora.tessara.kdmreplica;

import java.io.BufferedOutputStream;
import java.io.IOException;
import java.io.OutputStream;
import java.io.UncheckedIOException;
import java.nio.channels.Channels;
import java.nio.channels.FileChannel;
import java.nio.file.AtomicMoveNotSupportedException;
import java.nio.file.Files;
import java.nio.file.InvalidPathException;
import java.nio.file.Path;
import java.nio.file.StandardCopyOption;
import java.nio.file.StandardOpenOption;

/**
 * Files written whole or not at all: the content goes to a new temporary file in the target's
 * directory, which replaces the target only once it is complete. A failed or stopped write
 * removes the temporary file and leaves the target as it was.
 */
final class OutputFiles {
    /** Writes the content through a channel positioned at 0 (which it may move). */
    interface Body {
        void write(FileChannel channel, OutputStream stream) throws IOException;
    }

    private OutputFiles() {
    }

    /** The path a caller gave: relative ones from the process's current directory. */
    static Path target(String path, String member) {
        if (path == null) {
            throw new IllegalArgumentException("Replica." + member + ": the file path is null");
        }
        try {
            Path p = XmlInput.callerPath(path);
            if (p.getFileName() == null) {
                throw new IllegalArgumentException("Replica." + member + ": '" + path + "' names no file");
            }
            return p;
        } catch (InvalidPathException e) {
            throw new IllegalArgumentException("Replica." + member + ": '" + path + "' is not a valid path: "
                    + e.getMessage(), e);
        }
    }

    /** Writes {@code what} (for example "XML file") to target through body. */
    static void write(Path target, String what, Body body) {
        Path dir = target.getParent();
        if (Files.isDirectory(target)) {
            throw new IllegalArgumentException("cannot write " + what + " '" + target + "': it is a directory");
        }
        if (!Files.isDirectory(dir)) {
            throw new IllegalArgumentException("cannot write " + what + " '" + target + "': the directory '" + dir
                    + "' does not exist");
        }
        Path temp;
        try {
            temp = Files.createTempFile(dir, "." + target.getFileName() + ".", ".part");
        } catch (IOException e) {
            throw new IllegalArgumentException("cannot write " + what + " '" + target + "': " + XmlInput.describe(e), e);
        }
        boolean done = false;
        try (FileChannel ch = FileChannel.open(temp, StandardOpenOption.WRITE);
                OutputStream os = new BufferedOutputStream(Channels.newOutputStream(ch), 1 << 16)) {
            body.write(ch, os);
            os.flush();
            ch.force(false);
            done = true;
        } catch (IOException e) {
            throw new IllegalArgumentException("cannot write " + what + " '" + target + "': " + XmlInput.describe(e), e);
        } catch (UncheckedIOException e) {
            throw new IllegalArgumentException("cannot write " + what + " '" + target + "': "
                    + XmlInput.describe(e.getCause()), e);
        } finally {
            if (!done) {
                deleteQuietly(temp);
            }
        }
        try {
            try {
                Files.move(temp, target, StandardCopyOption.ATOMIC_MOVE, StandardCopyOption.REPLACE_EXISTING);
            } catch (AtomicMoveNotSupportedException e) {
                Files.move(temp, target, StandardCopyOption.REPLACE_EXISTING);
            }
        } catch (IOException e) {
            deleteQuietly(temp);
            throw new IllegalArgumentException("cannot write " + what + " '" + target + "': " + XmlInput.describe(e), e);
        }
    }

    private static void deleteQuietly(Path p) {
        try {
            Files.deleteIfExists(p);
        } catch (IOException e) {
            // nothing more to do: the write already fails
        }
    }
}
