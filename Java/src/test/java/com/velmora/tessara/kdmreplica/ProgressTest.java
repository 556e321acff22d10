package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.*;
import static org.junit.jupiter.api.Assertions.*;

import java.io.File;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.ArrayList;
import java.util.List;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Assumptions;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.io.TempDir;

/**
 * Progress and stop of the long operations, and file writes that are whole or absent: every
 * operation reports growing figures ending at its total; stopped at its first report it fails,
 * a read or populate leaving the replica as it was, a write leaving the old file and nothing else.
 */
class ProgressTest {
    @TempDir
    Path dir;

    @AfterEach
    void reset() {
        Progress.setListener(null);
        Progress.interval = 100_000_000L;
    }

    interface Op {
        void run(Replica r, Path dir) throws Exception;
    }

    /** The replica the operations work on: a few thousand instances, so that reads are in many pieces. */
    private static Replica replica() {
        Replica r = Fx.replica("p", "Item: n Integer, s String, t String*; Other: i Relationship");
        Model items = r.getModels().getItem("Item");
        for (int i = 0; i < 3000; i++) {
            inst(items, "n", i, "s", "text " + i, "t", new String[] {"a", "b"});
        }
        return r;
    }

    private static final Object[][] OPS = {
        {"writeXmlFile", (Op) (r, d) -> r.writeXmlFile(d.resolve("out").toString(), true, true)},
        {"writeXsdFile", (Op) (r, d) -> r.writeXsdFile(d.resolve("out").toString())},
        {"writeBinaryFile", (Op) (r, d) -> r.writeBinaryFile(d.resolve("out").toString(), false)},
        {"writeBinaryFile compressed", (Op) (r, d) -> r.writeBinaryFile(d.resolve("out").toString(), true)},
        {"getXml", (Op) (r, d) -> r.getXml(true, true)},
        {"getBinaryFromReplica", (Op) (r, d) -> Replica.getBinaryFromReplica(r, true)},
        {"readFromXmlFile", (Op) (r, d) -> Replica.readFromXmlFile(d.resolve("in.xml").toString())},
        {"readFromXmlString", (Op) (r, d) -> Replica.readFromXmlString(Files.readString(d.resolve("in.xml")))},
        {"readBinaryFile", (Op) (r, d) -> Replica.readBinaryFile(d.resolve("in.bin").toString())},
        {"populatesFromXmlFile", (Op) (r, d) -> r.populatesFromXmlFile(d.resolve("in.xml").toString())},
    };

    @Test
    void everyOperationReportsGrowingFiguresEndingAtItsTotalAndStopsWhenTold() throws Exception {
        Replica source = replica();
        source.writeXmlFile(dir.resolve("in.xml").toString(), true, false);
        source.writeBinaryFile(dir.resolve("in.bin").toString(), true);
        Progress.interval = 0;
        for (Object[] row : OPS) {
            String name = (String) row[0];
            Op op = (Op) row[1];
            Replica r = replica();
            r.commit();
            List<long[]> seen = new ArrayList<>();
            Progress.setListener((done, total) -> seen.add(new long[] {done, total}));
            op.run(r, dir);
            assertTrue(seen.size() >= 2 || name.equals("writeXsdFile"), name + ": " + seen.size() + " reports");
            long[] last = seen.get(seen.size() - 1);
            assertEquals(last[1], last[0], name + " ends at its total");
            for (int i = 1; i < seen.size(); i++) {
                assertTrue(seen.get(i)[0] > seen.get(i - 1)[0] && seen.get(i)[1] == last[1], name + " grows");
            }

            Files.writeString(dir.resolve("out"), "old");
            String before = dump(r);
            Progress.setListener((done, total) -> false);
            throwsWith(Progress.Stopped.class, () -> op.run(r, dir), "stopped by the progress handler at");
            assertEquals(before, dump(r), name + " changed the replica");
            assertEquals("old", Files.readString(dir.resolve("out")), name + " replaced the file");
            assertEquals(3, dir.toFile().list().length, name + " left a file behind");
            Progress.setListener(null);
        }
    }

    @Test
    void aWriteThatCannotBeMadeNamesTheFileAndLeavesNothing() throws Exception {
        Replica r = replica();
        throwsWith(IllegalArgumentException.class, () -> r.writeXmlFile(dir.resolve("no/such/dir/x.xml").toString(),
                true, false), "cannot write XML file", "no/such/dir/x.xml");
        throwsWith(IllegalArgumentException.class, () -> r.writeBinaryFile(dir.toString(), true),
                "cannot write binary file", "it is a directory");
        Assumptions.assumeFalse("root".equals(System.getProperty("user.name")), "root writes into read-only directories");
        File ro = dir.resolve("ro").toFile();
        assertTrue(ro.mkdir() && ro.setWritable(false));
        throwsWith(IllegalArgumentException.class, () -> r.writeXsdFile(new File(ro, "x.xsd").getPath()),
                "cannot write XSD file", "x.xsd");
        assertEquals(0, ro.list().length);
    }
}
