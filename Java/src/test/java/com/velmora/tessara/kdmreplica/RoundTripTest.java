package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.*;
import static org.junit.jupiter.api.Assertions.*;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import java.util.*;
import java.util.concurrent.CountDownLatch;
import java.util.stream.Stream;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.Timeout;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.Arguments;
import org.junit.jupiter.params.provider.EnumSource;
import org.junit.jupiter.params.provider.MethodSource;

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
        XML, XML_STATES, XSD_POPULATE, XSD_POPULATE_STATES, BINARY, BINARY_COMPRESSED;

        boolean binary() {
            return this == BINARY || this == BINARY_COMPRESSED;
        }

        /** The output: {bytes}, {document with its schema}, or {XSD, document}; documents are validated by the XSD. */
        Object[] write(Replica r) throws Exception {
            if (binary()) {
                return new Object[] {Replica.getBinaryFromReplica(r, this == BINARY_COMPRESSED)};
            }
            Replica.setFeature("indent", this == XML || this == XSD_POPULATE_STATES);
            boolean embedded = this == XML || this == XML_STATES;
            String xml = r.getXml(embedded, this == XML_STATES || this == XSD_POPULATE_STATES);
            Fx.validate(r.getXsd(), xml);
            return embedded ? new Object[] {xml} : new Object[] {r.getXsd(), xml};
        }

        Replica read(Object[] w, String name) {
            if (binary()) {
                return Replica.getReplicaFromBinary((byte[]) w[0], this == BINARY_COMPRESSED);
            }
            Replica.setFeature("validate", this == XML || this == XSD_POPULATE_STATES);
            if (w.length == 1) {
                return Replica.readFromXmlString((String) w[0]);
            }
            Replica r = new Replica(name);
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

    static Stream<Arguments> edgeValues() {
        double nanPayload = Double.longBitsToDouble(0x7ff0000000000123L);
        long year0 = -62135596800001L; // 0000-12-31T23:59:59.999Z, proleptic
        byte[] allBytes = new byte[256];
        for (int i = 0; i < 256; i++) {
            allBytes[i] = (byte) i;
        }
        StringBuilder controls = new StringBuilder();
        for (char c = 0; c < 0x20; c++) {
            controls.append(c);
        }
        Object[][] rows = {
            {AttributeType.Integer, new Object[] {0, -1, Integer.MIN_VALUE, Integer.MAX_VALUE},
                new Object[] {new int[0], new int[] {Integer.MIN_VALUE, 0, Integer.MAX_VALUE}}},
            {AttributeType.Double, new Object[] {0.0, -0.0, Double.NaN, nanPayload, Double.longBitsToDouble(0xfff8000000000000L),
                Double.POSITIVE_INFINITY, Double.NEGATIVE_INFINITY, Double.MIN_VALUE, -Double.MAX_VALUE, 0.1, 1.0 / 3,
                1e-310, 123456789012345680.0}, new Object[] {new double[0], new double[] {-0.0, Double.NaN, nanPayload, 2.5e-300}}},
            {AttributeType.String, new Object[] {"", " lead and trail ", "a\r\nb\rc\n", "\t", controls.toString(), "\ufffe\uffff",
                "lone \ud800 high", "lone \udc00 low", "pair \ud83d\ude00", "back\\slash \\u0041", "]]> <&> \"'",
                "\u0085\u2028 \u007f", "x".repeat(100_000) + "\u0000"},
                new Object[] {new String[0], new String[] {""}, new String[] {"a\u0001", "", "\\", "\r"}}},
            {AttributeType.Date, new Object[] {new Date(0), new Date(-1), new Date(Long.MIN_VALUE), new Date(Long.MAX_VALUE),
                new Date(year0), new Date(year0 + 1), new Date(-62135596800000L), new Date(253402300800000L),
                new Date(1700000000123L)}, new Object[] {new Date[0], new Date[] {new Date(5), new Date(-5)}}},
            {AttributeType.Boolean, new Object[] {true, false},
                new Object[] {new boolean[0], new boolean[] {true, false, false, true, true, false, true, true, true}}},
            {AttributeType.Binary, new Object[] {new byte[0], new byte[] {-1}, allBytes},
                new Object[] {new byte[0][], new byte[][] {new byte[0], allBytes, {0}}}},
        };
        return Stream.of(Form.values()).flatMap(f -> Stream.of(rows).map(r -> Arguments.of(f, r[0], r[1], r[2])));
    }

    @ParameterizedTest(name = "{0} {1}")
    @MethodSource("edgeValues")
    void everyValueSurvivesExactly(Form f, AttributeType type, Object[] singles, Object[] arrays) throws Exception {
        Replica r = replica("values of " + type, "T: one " + type + ", many " + type + "*");
        Model m = r.getModels().getItem(0);
        for (Object v : singles) {
            m.createInstance().setValue("one", v);
        }
        for (Object v : arrays) {
            m.createInstance().setValue("many", v);
        }
        m.createInstance(); // no value at all
        r.commit();
        same(r, f);
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
        r.commit();
        same(r, f);
        if (!f.binary()) {
            String xml = (String) f.write(r)[f == Form.XML || f == Form.XML_STATES ? 0 : 1];
            assertFalse(xml.contains("\u0001") || xml.contains("\r") || xml.contains("\ud800"), xml);
        }
    }

    /** Every schema property away from its default, a subclass before its super class, pending instances. */
    @ParameterizedTest
    @EnumSource(value = Form.class, names = {"XML_STATES", "XSD_POPULATE_STATES", "BINARY", "BINARY_COMPRESSED"})
    void everySchemaPropertyAndPendingInstanceSurvives(Form f) throws Exception {
        Replica r = Fx.richWithData();
        Replica back = trip(r, f);
        assertEquals(dump(r), dump(back));
        assertEquals(r.getXsd(), back.getXsd());
    }

    /**
     * Created, modified and deleted instances, a deleted and a live instance sharing an identifier, a
     * live reference to a deleted instance: the read replica refuses the commit as the original does
     * and, repaired alike, commits to the same replica.
     */
    @ParameterizedTest
    @EnumSource(value = Form.class, names = {"XML_STATES", "XSD_POPULATE_STATES", "BINARY", "BINARY_COMPRESSED"})
    void statesAndDeletedInstancesComeBack(Form f) throws Exception {
        Replica r = replica("states", "Part: n Integer, link Relationship");
        Model part = r.getModels().getItem(0);
        Instance kept = part.createInstance();
        Instance gone = inst(part, "n", 7);
        Instance changed = part.createInstance();
        gone.setID("p1");
        r.commit();
        changed.setValue("n", 1);
        kept.setValue("link", gone);
        part.getInstances().remove(gone);
        part.createInstance().setID("p1"); // the deleted instance's identifier is free again
        part.getInstances().remove(part.createInstance()); // created then removed: forgotten
        if (f.binary()) { // only the binary form carries these
            Instance ghost = inst(part, "n", 99); // created, referred to, removed before any commit
            changed.setValue("link", ghost);
            part.getInstances().remove(ghost);
            r.getAttributeDef("link").targetNames = new String[] {"Elsewhere"}; // values held no longer fit (the setter refuses that)
        }
        Replica back = trip(r, f);
        assertEquals(dump(r), dump(back));
        assertEquals("Replica 'states' (1 classes, 3 instances, 1 deleted)", back.toString());
        ReplicaCommitException e1 = assertThrows(ReplicaCommitException.class, r::commit);
        assertEquals(e1.getViolations(), assertThrows(ReplicaCommitException.class, back::commit).getViolations());
        for (Replica x : new Replica[] {r, back}) {
            for (int i = 0; i < 2; i++) {
                x.getModels().getItem(0).getInstances().getItem(i).clearValue("link");
            }
            x.commit();
        }
        assertEquals(dump(r), dump(back));
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

    /** The read replica enforces its schema: inheritance, read-only access, lengths, composition. */
    @ParameterizedTest
    @EnumSource(Form.class)
    void schemaPropertiesComeBackInForce(Form f) throws Exception {
        Replica r = replica("schema", "Base: label String; Sub(Base): owns Relationship*");
        Model base = r.getModels().getItem("Base");
        AttributeDef label = r.getAttributeDef("label");
        r.getAttributeDef("owns").setAggregationType(AggregationType.Composition);
        inst(r.getModels().getItem("Sub"), "label", "a long label", "owns", new Instance[] {base.createInstance()});
        int max = f.binary() ? 3 : 12;
        r.commit(); // which would refuse the value below
        label.length = max; // binary: below the value held (setLength refuses that; documents would not validate)
        label.setAccessMode(AccessMode.Read);

        Replica read = trip(r, f);
        Instance p = read.getModels().getItem("Sub").getInstances().getItem(0);
        assertEquals("a long label", p.getValue("label"), "a value held before the length was lowered");
        assertSame(read.getAttributeDef("Base.label"), read.getAttributeDef("Sub.label"));
        throwsWith(IllegalStateException.class, () -> p.setValue("label", "ab"), "read-only");
        read.getAttributeDef("Base.label").setAccessMode(AccessMode.ReadWrite);
        throwsWith(IllegalArgumentException.class, () -> p.setValue("label", "x".repeat(max + 1)), "at most " + max);
        read.getModels().getItem("Sub").getInstances().remove(p);
        assertEquals(0, read.getModels().getItem("Base").getInstances().getCount(), "composition removes the child");
        assertEquals(1, base.getInstances().getCount(), "the original keeps its own");
    }

    @ParameterizedTest
    @EnumSource(value = Form.class, names = {"BINARY", "BINARY_COMPRESSED"})
    void generatedReplicasComeBackExactly(Form f) throws Exception {
        StringBuilder seen = new StringBuilder();
        for (long seed = 1; seed <= 40; seed++) {
            Replica r = generate(seed, seed % 4 == 0 ? 25 : 6);
            seen.append(dump(r));
            same(r, f);
        }
        // The generated replicas really contain what the round trips are meant to cover.
        for (String feature : new String[] {" C ", " M ", " D ", "~", "!", "\\ud800", "d7ff8000000000123",
            "d8000000000000000", "t-9223372036854775808", "[]", "Composition", "Extension", "Read"}) {
            assertTrue(seen.indexOf(feature) >= 0, "no generated replica holds " + feature);
        }
    }

    @Test
    void theCompressionFlagMustMatchTheHeader() {
        Replica r = generate(3, 4);
        byte[] plain = Replica.getBinaryFromReplica(r, false);
        byte[] packed = Replica.getBinaryFromReplica(r, true);
        assertEquals(0, plain[5]);
        assertEquals(1, packed[5]);
        throwsWith(ReplicaBinaryException.class, () -> Replica.getReplicaFromBinary(packed, false),
                "the bytes were written compressed but were read as uncompressed", "offset 5 of the buffer");
        throwsWith(ReplicaBinaryException.class, () -> Replica.getReplicaFromBinary(plain, true),
                "the bytes were written uncompressed but were read as compressed");
        throwsWith(IllegalArgumentException.class, () -> Replica.getReplicaFromBinary(null, true), "null");
        throwsWith(IllegalArgumentException.class, () -> Replica.getBinaryFromReplica(null, true), "null");
        Replica big = generate(4, 300);
        assertTrue(Replica.getBinaryFromReplica(big, true).length < Replica.getBinaryFromReplica(big, false).length);
    }

    @Test
    void referencesAndNamesTheFormsCannotCarryAreRefusedByName() {
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

    /** Writers see a consistent replica while other threads change it. */
    @Test
    @Timeout(120)
    void snapshotsTakenWhileOthersWriteAreConsistent() throws Exception {
        Replica r = generate(11, 40);
        Model m = r.getModels().getItem(0);
        List<Throwable> errors = Collections.synchronizedList(new ArrayList<>());
        CountDownLatch snapshots = new CountDownLatch(2);
        List<Thread> threads = new ArrayList<>();
        for (int t = 0; t < 4; t++) {
            int seed = t;
            boolean compressed = seed == 3;
            threads.add(new Thread(() -> {
                Random rnd = new Random(seed);
                for (int i = 0; seed < 2 ? snapshots.getCount() > 0 : i < 100; i++) {
                    try {
                        if (seed >= 2) {
                            byte[] b = Replica.getBinaryFromReplica(r, compressed);
                            assertArrayEquals(b, Replica.getBinaryFromReplica(Replica.getReplicaFromBinary(b, compressed),
                                    compressed));
                        } else if (rnd.nextBoolean() || m.getInstances().getCount() == 0) {
                            m.createInstance().setID("w" + seed + "-" + i);
                        } else {
                            m.getInstances().remove(rnd.nextInt(m.getInstances().getCount()));
                        }
                    } catch (IndexOutOfBoundsException | IllegalStateException e) {
                        // a changer may find that the other removed in between, or removed before the id was set
                        if (seed >= 2 || e instanceof IllegalStateException && !e.getMessage().contains("is deleted")) {
                            errors.add(e);
                        }
                    } catch (Throwable e) {
                        errors.add(e);
                    }
                }
                if (seed >= 2) {
                    snapshots.countDown();
                }
            }));
        }
        for (Thread t : threads) {
            t.start();
        }
        for (Thread t : threads) {
            t.join();
        }
        assertTrue(errors.isEmpty(), () -> errors.size() + " errors: " + errors.subList(0, Math.min(3, errors.size())));
        same(r, Form.BINARY);
    }
}
