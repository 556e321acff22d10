package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.addAttr;
import static com.velmora.tessara.kdmreplica.Fx.addClass;
import static com.velmora.tessara.kdmreplica.Fx.throwsWith;
import static com.velmora.tessara.kdmreplica.XmlFx.dump;
import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertNull;
import static org.junit.jupiter.api.Assertions.assertSame;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.util.Date;
import java.util.stream.Stream;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.Arguments;
import org.junit.jupiter.params.provider.MethodSource;

/** XML documents: every value, identifier, state and reference survives a write and a read exactly. */
class XmlRoundTripTest {

    @AfterEach
    void resetFeatures() {
        Replica.setFeature("validate", false);
        Replica.setFeature("indent", true);
        Replica.setSchemaLocation(null);
    }

    private static String allChars(int from, int to) {
        StringBuilder b = new StringBuilder();
        for (int c = from; c < to; c++) {
            b.append((char) c);
        }
        return b.toString();
    }

    private static byte[] allBytes() {
        byte[] b = new byte[256];
        for (int i = 0; i < 256; i++) {
            b[i] = (byte) i;
        }
        return b;
    }

    static Stream<Arguments> edgeValues() {
        double nanPayload = Double.longBitsToDouble(0x7ff0000000000123L);
        double negativeNan = Double.longBitsToDouble(0xfff8000000000000L);
        long year0 = -62135596800001L; // 0000-12-31T23:59:59.999Z, proleptic
        String longText = "x".repeat(100_000) + "\u0000";
        return Stream.of(
                Arguments.of(AttributeType.Integer,
                        new Object[] {0, -1, Integer.MIN_VALUE, Integer.MAX_VALUE},
                        new Object[] {new int[0], new int[] {Integer.MIN_VALUE, 0, Integer.MAX_VALUE}}),
                Arguments.of(AttributeType.Double,
                        new Object[] {0.0, -0.0, Double.NaN, nanPayload, negativeNan, Double.POSITIVE_INFINITY,
                            Double.NEGATIVE_INFINITY, Double.MIN_VALUE, -Double.MAX_VALUE, 0.1, 1.0 / 3, 1e-310,
                            123456789012345680.0},
                        new Object[] {new double[0], new double[] {-0.0, Double.NaN, nanPayload, 2.5e-300}}),
                Arguments.of(AttributeType.String,
                        new Object[] {"", " lead and trail ", "a\r\nb\rc\n", "\t", allChars(0, 0x20),
                            "\ufffe\uffff", "lone \ud800 high", "lone \udc00 low", "pair \ud83d\ude00",
                            "back\\slash \\u0041", "]]> <&> \"'", "\u0085\u2028 \u007f", longText},
                        new Object[] {new String[0], new String[] {""}, new String[] {"a\u0001", "", "\\", "\r"}}),
                Arguments.of(AttributeType.Date,
                        new Object[] {new Date(0), new Date(-1), new Date(Long.MIN_VALUE), new Date(Long.MAX_VALUE),
                            new Date(year0), new Date(year0 + 1), new Date(-62135596800000L),
                            new Date(253402300800000L), new Date(1700000000123L)},
                        new Object[] {new Date[0], new Date[] {new Date(5), new Date(-5)}}),
                Arguments.of(AttributeType.Boolean,
                        new Object[] {true, false},
                        new Object[] {new boolean[0], new boolean[] {true, false, true}}),
                Arguments.of(AttributeType.Binary,
                        new Object[] {new byte[0], new byte[] {-1}, allBytes()},
                        new Object[] {new byte[0][], new byte[][] {new byte[0], allBytes(), {0}}}));
    }

    @ParameterizedTest(name = "{0}")
    @MethodSource("edgeValues")
    void everyValueSurvivesExactlyAndTheSchemaValidatesIt(AttributeType type, Object[] singles, Object[] arrays)
            throws Exception {
        Replica r = new Replica("values of " + type);
        Model m = addClass(r, "T", null);
        addAttr(m, "one", type, false);
        addAttr(m, "many", type, true);
        for (Object v : singles) {
            m.createInstance().setValue("one", v);
        }
        for (Object v : arrays) {
            m.createInstance().setValue("many", v);
        }
        m.createInstance(); // no value at all
        r.commit();
        String expected = dump(r);
        for (boolean indent : new boolean[] {true, false}) {
            Replica.setFeature("indent", indent);
            String xml = r.getXml(false);
            XmlFx.validate(r.getXsd(), xml);
            Replica.setFeature("validate", true);
            Replica back = Replica.readFromXmlString(r.getXml(true));
            Replica.setFeature("validate", false);
            assertEquals(expected, dump(back));
            assertEquals(r.getXml(true, true), back.getXml(true, true), "the writer is deterministic");
            Replica filled = new Replica("filled");
            filled.insertSchemaString(r.getXsd());
            filled.populatesFromXmlString(xml);
            assertEquals(expected.replace("values of " + type, "filled"), dump(filled));
        }
    }

    @Test
    void referencesUseDocumentKeysForInstancesWithAndWithoutIdentifiers() {
        Replica r = new Replica("refs");
        Model node = addClass(r, "Node", null);
        addAttr(node, "next", AttributeType.Relationship, false);
        addAttr(node, "all", AttributeType.Relationship, true);
        Model leaf = addClass(r, "Leaf", "Node");
        Instance a = node.createInstance();
        Instance b = node.createInstance();
        Instance c = leaf.createInstance();
        b.setID("b");
        c.setID(new byte[] {'b'}); // a binary identifier equal in bytes to a text one: both kept
        a.setValue("next", a);
        b.setValue("next", c);
        c.setValue("next", a);
        a.setValue("all", new Instance[] {c, a, c, b});
        b.setValue("all", new Instance[0]);
        r.commit();
        Replica back = Replica.readFromXmlString(r.getXml(true));
        assertEquals(dump(r), dump(back));
        Instance a2 = back.getModels().getItem("Node").getInstances().getItem(0);
        assertSame(a2, a2.getValue("next"));
        Instance[] all = (Instance[]) a2.getValue("all");
        assertSame(all[0], all[2]);
        assertArrayEquals(new byte[] {'b'}, (byte[]) all[0].getID());
        assertEquals("Leaf", all[0].getClassDef().getClassName());
    }

    @Test
    void statesAndDeletedInstancesComeBackWithStatesAndOnlyThen() {
        Replica r = new Replica("states");
        Model part = addClass(r, "Part", null);
        addAttr(part, "n", AttributeType.Integer, false);
        addAttr(part, "peer", AttributeType.Relationship, false);
        Instance kept = part.createInstance();
        Instance changed = part.createInstance();
        Instance gone = part.createInstance();
        gone.setID("g");
        gone.setValue("n", 7);
        r.commit();
        changed.setValue("n", 1);
        kept.setValue("peer", gone); // a live instance keeps a reference to one that will be deleted
        part.getInstances().remove(gone);
        Instance fresh = part.createInstance();
        fresh.setID("g"); // the deleted instance's identifier is free again
        Instance vanished = part.createInstance();
        part.getInstances().remove(vanished); // created then removed: forgotten, not written

        Replica back = Replica.readFromXmlString(r.getXml(true, true));
        assertEquals(dump(r), dump(back));
        Model bm = back.getModels().getItem("Part");
        assertTrue(bm.getInstances().getItem(0).isModified());
        assertTrue(bm.getInstances().getItem(2).isCreated());
        Instance deleted = (Instance) bm.getInstances().getItem(0).getValue("peer");
        assertTrue(deleted.isDeleted());
        assertEquals(7, deleted.getValue("n"));
        throwsWith(ReplicaCommitException.class, back::commit, "deleted");
        throwsWith(ReplicaCommitException.class, r::commit, "deleted");

        // Without states the deleted instance is not in the document, so the reference cannot be written.
        throwsWith(IllegalArgumentException.class, () -> r.getXml(false), "Part[#0]", "'Part.peer'",
                "Part[id=\"g\"]", "write with states");
        part.getInstances().getItem(0).clearValue("peer");
        Replica plain = Replica.readFromXmlString(r.getXml(true, false));
        Model pm = plain.getModels().getItem("Part");
        assertEquals(3, pm.getInstances().getCount());
        for (int i = 0; i < 3; i++) {
            Instance x = pm.getInstances().getItem(i);
            assertFalse(x.isCreated() || x.isModified() || x.isDeleted(), x.toString());
        }
        assertNull(pm.deleted);

        // The same pending changes committed on both sides give the same replica.
        Replica again = Replica.readFromXmlString(r.getXml(true, true));
        r.commit();
        again.commit();
        assertEquals(dump(r), dump(again));
    }

    @Test
    void identifiersTextsAndNamesThatXmlCannotCarryAreEscapedReversibly() {
        Replica r = new Replica("tab\there\r\n\u0000");
        Model m = addClass(r, "Thing", null);
        addAttr(m, "s", AttributeType.String, false);
        String[] ids = {"a\tb", "line\nbreak", "cr\r", "\u0001", "\\u0041", "\ud800", " padded ", "", "&<>\"'"};
        for (String id : ids) {
            Instance x = m.createInstance();
            x.setID(id);
            x.setValue("s", id);
        }
        m.createInstance().setID(new byte[0]);
        r.commit();
        String xml = r.getXml(false);
        assertFalse(xml.contains("\u0001") || xml.contains("\r") || xml.contains("\ud800"), xml);
        Replica back = new Replica("x");
        back.insertSchemaString(r.getXsd());
        back.populatesFromXmlString(xml);
        Replica read = Replica.readFromXmlString(r.getXml(true));
        assertEquals(dump(r), dump(read));
        assertEquals("tab\there\r\n\u0000", read.getName());
        for (int i = 0; i < ids.length; i++) {
            assertEquals(ids[i], read.getModels().getItem(0).getInstances().getItem(i).getID());
        }
    }

    @Test
    void everySchemaPropertySurvivesTheEmbeddedSchema() {
        Replica r = XmlFx.richSchema();
        Model part = r.getModels().getItem("Part");
        Model sup = r.getModels().getItem("Supplier_2");
        Instance s = sup.createInstance();
        s.setValue("name", "acme");
        Instance p = r.getModels().getItem("Bolt").createInstance();
        p.setValue("supplier", s);
        p.setValue("thread", 8);
        p.setValue("blob", new byte[][] {{1, 2, 3, 4}});
        assertEquals(0, part.getInstances().getCount());
        Replica back = Replica.readFromXmlString(r.getXml(true, true));
        assertEquals(dump(r), dump(back));
        assertEquals(r.getXsd(), back.getXsd());
        assertEquals("Bolt", back.getModels().getItem(0).getClassDef().getClassName());
    }

    @Test
    void theProcessWideSchemaLocationIsWrittenAndRemembered() {
        Replica r = new Replica("loc");
        addAttr(addClass(r, "A", null), "v", AttributeType.Integer, false);
        assertFalse(r.getXml(true).contains("schemaLocation"));
        String location = "dir with space/100%/\u00e9t\u00e9.xsd";
        Replica.setSchemaLocation(location);
        String xml = r.getXml(true);
        assertTrue(xml.contains("xsi:schemaLocation=\"urn:corvexa:replica:1 dir%20with%20space/100%25/\u00e9t\u00e9.xsd\""),
                xml);
        Replica.setSchemaLocation("elsewhere.xsd");
        Replica back = Replica.readFromXmlString(xml);
        assertEquals(location, back.getSchemaLocation(), "the location the document was read with");
        Replica.setSchemaLocation(null);
        assertEquals("", Replica.readFromXmlString(r.getXml(true)).getSchemaLocation());
    }

    @Test
    void namesThatCannotBeXmlNamesFailTheWriteClearly() {
        Replica r = new Replica("names");
        Model m = addClass(r, "\u00aaClass", null); // a letter, but not one an XML name may start with
        m.createInstance();
        throwsWith(IllegalArgumentException.class, () -> r.getXml(false), "class '\u00aaClass'", "XML element name");
        throwsWith(IllegalArgumentException.class, r::getXsd, "class '\u00aaClass'");
        Replica r2 = new Replica("names2");
        Model ok = addClass(r2, "Ok", null);
        addAttr(ok, "x\u00e9", AttributeType.Integer, false);
        assertTrue(r2.getXsd().contains("name=\"x\u00e9\""), "a letter allowed in names");
        addAttr(ok, "x\u00b5", AttributeType.Integer, false); // micro sign: a letter that XML names do not allow
        throwsWith(IllegalArgumentException.class, () -> r2.getXml(true), "class 'Ok': attribute 'x\u00b5'");
    }

    @Test
    void handWrittenDocumentsMayUseCommentsCdataCharacterReferencesAndAnyOrder() {
        Replica r = new Replica("target");
        Model part = addClass(r, "Part", null);
        addAttr(part, "name", AttributeType.String, false);
        addAttr(part, "tags", AttributeType.String, true);
        addAttr(part, "made", AttributeType.Date, false);
        addAttr(part, "w", AttributeType.Double, false);
        addAttr(part, "ok", AttributeType.Boolean, true);
        r.populatesFromXmlString("<?xml version='1.0'?>\n<!-- a note -->\n"
                + "<r:replica xmlns:r='urn:corvexa:replica:1'><?pi data?>\n"
                + "  <r:Part id='p1'><r:tags>x</r:tags><!-- c --><r:name><![CDATA[<a&b>]]>&#13;&amp;</r:name>"
                + "<r:made> 2024-02-29T23:30:00+02:30 </r:made><r:tags>y</r:tags><r:w> +1E3 </r:w>"
                + "<r:ok>1</r:ok><r:ok> false </r:ok></r:Part>\n"
                + "  <r:Part><r:made>2024-03-01T00:00:00</r:made><r:w>-INF</r:w></r:Part>\n"
                + "  <r:Part><r:made>2024-03-01T24:00:00.000000Z</r:made><r:w>.5</r:w></r:Part>\n"
                + "</r:replica>");
        Instance p = part.getInstances().getItem(0);
        assertFalse(p.isCreated(), "loaded instances are unchanged");
        assertEquals("<a&b>\r&", p.getValue("name"));
        assertArrayEquals(new String[] {"x", "y"}, (String[]) p.getValue("tags"));
        assertEquals(Date.from(java.time.Instant.parse("2024-02-29T21:00:00Z")), p.getValue("made"));
        assertEquals(1000.0, p.getValue("w"));
        assertArrayEquals(new boolean[] {true, false}, (boolean[]) p.getValue("ok"));
        Instance q = part.getInstances().getItem(1);
        assertEquals(Date.from(java.time.Instant.parse("2024-03-01T00:00:00Z")), q.getValue("made"),
                "a time without zone is UTC");
        assertEquals(Double.NEGATIVE_INFINITY, q.getValue("w"));
        assertEquals(Date.from(java.time.Instant.parse("2024-03-02T00:00:00Z")),
                part.getInstances().getItem(2).getValue("made"), "24:00:00 is the end of the day");
    }
}
