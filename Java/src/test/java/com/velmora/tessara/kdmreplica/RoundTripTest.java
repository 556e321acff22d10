package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.*;
import static org.junit.jupiter.api.Assertions.*;

import java.nio.file.Files;
import java.nio.file.Path;
import java.util.*;
import java.util.concurrent.atomic.AtomicBoolean;
import java.util.concurrent.atomic.AtomicInteger;
import java.util.concurrent.atomic.AtomicReference;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.Timeout;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.EnumSource;

/**
 * Every form a replica is written in (XML with and without its schema and states, a separate XSD
 * inserted then a document populated, the binary form plain and compressed) gives back exactly
 * what was written, as the canonical dump sees it, and writes what it read to the same output.
 */
class RoundTripTest {

    @AfterEach
    void resetFeatures() {
        Replica.setFeature("validate", false);
        Replica.setFeature("indent", true);
        Replica.setSchemaLocation(null);
    }

    enum Form {
        XML, XML_STATES, XSD_POPULATE, XSD_POPULATE_STATES, BINARY, BINARY_COMPRESSED,
        XML_FILE, XSD_FILE_POPULATE, BINARY_FILE, BINARY_FILE_COMPRESSED;

        private static final Path DIR = tempDir();

        boolean binary() {
            return name().startsWith("BINARY");
        }

        boolean compressed() {
            return name().endsWith("COMPRESSED");
        }

        private static Path tempDir() {
            try {
                Path d = Files.createTempDirectory("corvexa-round-trip");
                d.toFile().deleteOnExit();
                return d;
            } catch (Exception e) {
                throw new IllegalStateException(e);
            }
        }

        private String file(String kind) {
            Path p = DIR.resolve(name() + "." + kind);
            p.toFile().deleteOnExit();
            return p.toString();
        }

        /**
         * The output: {bytes}, {document with its schema}, or {XSD, document}; documents are
         * validated by the XSD. A file holds what the same output in memory holds.
         */
        Object[] write(Replica r) throws Exception {
            if (this == BINARY_FILE || this == BINARY_FILE_COMPRESSED) {
                r.writeBinaryFile(file("bin"), compressed());
                byte[] bytes = Files.readAllBytes(Path.of(file("bin")));
                assertArrayEquals(Replica.getBinaryFromReplica(r, compressed()), bytes);
                return new Object[] {bytes};
            }
            if (binary()) {
                return new Object[] {Replica.getBinaryFromReplica(r, compressed())};
            }
            Replica.setFeature("indent", this == XML || this == XSD_POPULATE_STATES || this == XML_FILE);
            boolean embedded = this == XML || this == XML_STATES || this == XML_FILE;
            boolean states = this != XML && this != XSD_POPULATE;
            String xml = r.getXml(embedded, states);
            Fx.validate(r.getXsd(), xml);
            if (this == XML_FILE || this == XSD_FILE_POPULATE) {
                r.writeXmlFile(file("xml"), embedded, states);
                assertEquals(xml, Files.readString(Path.of(file("xml"))));
                r.writeXsdFile(file("xsd"));
                assertEquals(r.getXsd(), Files.readString(Path.of(file("xsd"))));
            }
            return embedded ? new Object[] {xml} : new Object[] {r.getXsd(), xml};
        }

        Replica read(Object[] w, String name) {
            if (binary()) {
                return this == BINARY_FILE || this == BINARY_FILE_COMPRESSED ? Replica.readBinaryFile(file("bin"))
                        : this == BINARY ? Replica.getReplicaFromBinary((byte[]) w[0]) // compression from the header
                        : Replica.getReplicaFromBinary((byte[]) w[0], true);
            }
            Replica.setFeature("validate", this == XML || this == XSD_POPULATE_STATES);
            if (this == XML_FILE) {
                return Replica.readFromXmlFile(file("xml"));
            }
            if (w.length == 1) {
                return Replica.readFromXmlString((String) w[0]);
            }
            Replica r = new Replica(name);
            if (this == XSD_FILE_POPULATE) {
                r.insertSchemaFile(file("xsd"));
                r.populatesFromXmlFile(file("xml"));
                return r;
            }
            r.insertSchemaString((String) w[0]);
            r.populatesFromXmlString((String) w[1]);
            return r;
        }
    }

    /** Writes and reads; writing changes nothing, and what was read writes the same output. */
    static Replica trip(Replica r, Form f) throws Exception {
        try {
            String before = dump(r);
            Object[] w = f.write(r);
            Replica back = f.read(w, r.getName());
            assertEquals(before, dump(r), "writing changed the replica");
            assertArrayEquals(w, f.write(back), "what was read writes other output");
            return back;
        } finally {
            Replica.setFeature("validate", false);
            Replica.setFeature("indent", true);
        }
    }

    static void same(Replica r, Form f) throws Exception {
        assertEquals(dump(r), dump(trip(r, f)), f.name());
    }

    @ParameterizedTest
    @EnumSource(Form.class)
    void referencesIdentifiersAndTextsXmlCannotCarry(Form f) throws Exception {
        Replica r = replica("tab\there\r\n\u0000", "Node: next Relationship, all Relationship*, s String; Leaf(Node)");
        Model node = r.getModels().getItem("Node");
        Model leaf = r.getModels().getItem("Leaf");
        Instance a = node.createInstance(); // no identifier
        Instance b = node.createInstance();
        Instance c = leaf.createInstance();
        b.setID("b");
        c.setID(new byte[] {'b'}); // a binary identifier equal in bytes to a text one: both kept
        a.setValue("next", a);
        b.setValue("next", c);
        c.setValue("next", a);
        a.setValue("all", new Instance[] {c, a, c, b});
        b.setValue("all", new Instance[0]);
        for (String id : new String[] {"a\tb", "line\nbreak", "cr\r", "\u0001", "\\u0041", "\ud800", " padded ", "", "&<>\"'"}) {
            inst(node, "s", id).setID(id);
        }
        leaf.createInstance().setID(new byte[0]);
        inst(node, "s", "x".repeat(100_000) + "\u0000"); // longer than any buffer of the readers
        r.commit();
        same(r, f);
        if (!f.binary()) {
            Object[] w = f.write(r);
            String xml = (String) w[w.length - 1];
            assertFalse(xml.contains("\u0001") || xml.contains("\r") || xml.contains("\ud800"), xml);
        }
    }

    /**
     * Every schema property away from its default, a subclass before its super class, every type's
     * edge values, states, pending and deleted instances; in the binary forms also references to
     * vanished instances and values past tightened constraints. The read replica refuses the
     * commit as the original does.
     */
    @ParameterizedTest
    @EnumSource(value = Form.class, names = {"XML_STATES", "XSD_POPULATE_STATES", "BINARY", "BINARY_COMPRESSED",
        "XML_FILE", "XSD_FILE_POPULATE", "BINARY_FILE", "BINARY_FILE_COMPRESSED"})
    void everySchemaPropertyAndPendingInstanceSurvives(Form f) throws Exception {
        Replica r = sample(f.binary());
        Replica back = trip(r, f);
        assertEquals(dump(r), dump(back));
        assertEquals(r.getXsd(), back.getXsd());
        assertEquals(r.toString(), back.toString());
        ReplicaCommitException e = assertThrows(ReplicaCommitException.class, r::commit);
        assertEquals(e.getViolations(), assertThrows(ReplicaCommitException.class, back::commit).getViolations());
    }

    @Test
    void withoutStatesPendingChangesAreWrittenAsCommittedAndDeletedTargetsAreRefused() {
        Replica r = replica("states", "Part: peer Relationship");
        Model part = r.getModels().getItem(0);
        Instance kept = part.createInstance();
        Instance gone = part.createInstance();
        gone.setID("g");
        r.commit();
        kept.setValue("peer", gone);
        part.getInstances().remove(gone);
        part.createInstance();
        throwsWith(IllegalArgumentException.class, () -> r.getXml(false), "Part[#0]", "'Part.peer'", "Part[id=\"g\"]",
                "write with states");
        kept.clearValue("peer");
        Model pm = Replica.readFromXmlString(r.getXml(true, false)).getModels().getItem("Part");
        assertEquals(2, pm.getInstances().getCount());
        for (int i = 0; i < 2; i++) {
            Instance x = pm.getInstances().getItem(i);
            assertFalse(x.isCreated() || x.isModified() || x.isDeleted(), x.toString());
        }
        assertNull(pm.deleted);
    }

    @Test
    void referencesAndNamesTheFormsCannotCarryAreRefusedByName() {
        throwsWith(IllegalArgumentException.class, () -> Replica.getReplicaFromBinary(null, true), "null");
        throwsWith(IllegalArgumentException.class, () -> Replica.getBinaryFromReplica(null, true), "null");
        Replica r = replica("refs", "A: to Relationship; B");
        inst(r.getModels().getItem("A"), "to", r.getModels().getItem("B").createInstance()).setID("x");
        r.getModels().remove("B");
        throwsWith(IllegalArgumentException.class, () -> Replica.getBinaryFromReplica(r, false), "A[id=\"x\"]", "'A.to'",
                "class 'B' is not in the replica");

        Replica r2 = replica("refs2", "C: to Relationship");
        Model c = r2.getModels().getItem(0);
        Instance z = c.createInstance();
        inst(c, "to", z);
        c.getInstances().remove(z);
        addAttr(c, "later", AttributeType.Integer, false);
        throwsWith(IllegalArgumentException.class, () -> Replica.getBinaryFromReplica(r2, true), "'C.to'",
                "attributes have changed");

        Replica r3 = new Replica("names");
        addClass(r3, "\u00aaClass", null).createInstance(); // a letter, but not one an XML name may start with
        throwsWith(IllegalArgumentException.class, () -> r3.getXml(false), "class '\u00aaClass'", "XML element name");
        throwsWith(IllegalArgumentException.class, r3::getXsd, "class '\u00aaClass'");
        Model ok = addClass(new Replica("names2"), "Ok", null);
        addAttr(ok, "x\u00e9", AttributeType.Integer, false);
        assertTrue(ok.getReplica().getXsd().contains("name=\"x\u00e9\""), "a letter allowed in names");
        addAttr(ok, "x\u00b5", AttributeType.Integer, false); // micro sign: a letter that XML names do not allow
        throwsWith(IllegalArgumentException.class, () -> ok.getReplica().getXml(true), "class 'Ok': attribute 'x\u00b5'");
    }

    @Test
    void theProcessWideSchemaLocationIsWrittenAndRemembered() {
        Replica r = replica("loc", "A: v Integer");
        assertFalse(r.getXml(true).contains("schemaLocation"));
        String location = "dir with space/100%/\u00e9t\u00e9.xsd";
        Replica.setSchemaLocation(location);
        String xml = r.getXml(true);
        assertTrue(xml.contains("xsi:schemaLocation=\"urn:corvexa:replica:1 dir%20with%20space/100%25/\u00e9t\u00e9.xsd\""), xml);
        Replica.setSchemaLocation("elsewhere.xsd");
        assertEquals(location, Replica.readFromXmlString(xml).getSchemaLocation(), "the location read");
        assertEquals("elsewhere.xsd", new Replica("b").getSchemaLocation(), "taken when a replica is created");
        Replica.setSchemaLocation(null);
        assertEquals("", Replica.readFromXmlString(r.getXml(true)).getSchemaLocation());
        assertEquals("", new Replica("c").getSchemaLocation());
    }

    /** Binary snapshots are consistent while another thread changes the replica (the writer holds the read lock). */
    @Test
    @Timeout(120)
    void snapshotsTakenWhileOthersWriteAreConsistent() throws Exception {
        Replica r = sample(true);
        Model m = r.getModels().getItem(3); // the class of every type, written last
        AtomicBoolean done = new AtomicBoolean();
        AtomicInteger changes = new AtomicInteger();
        AtomicReference<Throwable> failed = new AtomicReference<>();
        Thread changer = new Thread(() -> {
            try {
                for (int i = 0; !done.get(); i = changes.incrementAndGet()) {
                    if (i % 2 == 0) {
                        m.createInstance().setValue("mString", new String[] {"w" + i, "x"});
                    } else {
                        m.getInstances().remove(m.getInstances().getCount() - 1);
                    }
                }
            } catch (Throwable e) {
                failed.set(e);
            }
        });
        changer.start();
        try {
            for (int i = 0; i < 3000 || changes.get() < 100_000 && changer.isAlive(); i++) { // overlapping many changes
                boolean compressed = i % 2 == 1;
                byte[] b = Replica.getBinaryFromReplica(r, compressed);
                assertArrayEquals(b, Replica.getBinaryFromReplica(Replica.getReplicaFromBinary(b, compressed), compressed));
            }
        } finally {
            done.set(true);
            changer.join();
        }
        assertNull(failed.get());
        same(r, Form.BINARY);
    }
}
