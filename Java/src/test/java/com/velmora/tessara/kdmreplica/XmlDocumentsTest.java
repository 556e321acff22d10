package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.addAttr;
import static com.velmora.tessara.kdmreplica.Fx.addClass;
import static com.velmora.tessara.kdmreplica.Fx.dump;
import static com.velmora.tessara.kdmreplica.Fx.failsAt;
import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertSame;

import java.time.Instant;
import java.util.Date;
import java.util.Random;
import org.junit.jupiter.api.BeforeEach;
import org.junit.jupiter.api.Test;

/**
 * Documents shaped otherwise than the package writes them: values in pieces and in any order,
 * keys of any form in any order; and large written documents, whose keys and values come back
 * exactly.
 */
class XmlDocumentsTest {
    private static final String HEAD = "<replica xmlns=\"urn:corvexa:replica:1\""
            + " xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\">\n";

    private Replica target;

    @BeforeEach
    void setUp() {
        target = new Replica("target");
        Model piece = addClass(target, "Piece", null);
        addAttr(piece, "qty", AttributeType.Integer, false);
        addAttr(piece, "price", AttributeType.Double, false);
        addAttr(piece, "ok", AttributeType.Boolean, false);
        addAttr(piece, "when", AttributeType.Date, false);
        addAttr(piece, "name", AttributeType.String, false);
        addAttr(piece, "nums", AttributeType.Integer, true);
        addAttr(piece, "peer", AttributeType.Relationship, false).setTargetNames(new String[] {"Piece"});
        addAttr(piece, "peers", AttributeType.Relationship, true);
    }

    private Instance piece(int i) {
        return target.getModels().getItem("Piece").getInstances().getItem(i);
    }

    @Test
    void valuesInPiecesInAnyOrderAndWithAnyPrefixAreReadWhole() {
        target.populatesFromXmlString("<?xml version='1.0'?>\n<!-- a note -->\n"
                + HEAD.replace(">\n", " xmlns:r='urn:corvexa:replica:1'><?pi data?>\n")
                + "<Piece id=\"a\">\n"
                + "  <nums>1</nums>\n"
                + "  <when>2024-03-01T12:00:<!-- a comment -->00.250Z</when>\n"
                + "  <ok>t<![CDATA[ru]]>e</ok>\n"
                + "  <nums>&#50;</nums>\n"
                + "  <price>1<?note x?>.5e&#50;</price>\n"
                + "  <name>x<!-- -->y</name>\n"
                + "  <qty> 4<![CDATA[2]]> </qty>\n"
                + "  <nums>3</nums>\n"
                + "</Piece>\n"
                + "<Piece id=\"b\"><ok>0</ok><qty>-7</qty><price>-0</price><when>1969-12-31T23:59:59.999Z</when></Piece>\n"
                + "<r:Piece id='c'><r:nums>4</r:nums><!-- c --><r:name><![CDATA[<a&b>]]>&#13;&amp;</r:name>"
                + "<r:when> 2024-02-29T23:30:00+02:30 </r:when><r:nums>5</r:nums><r:price> +1E3 </r:price></r:Piece>\n"
                + "<Piece><when>2024-03-01T00:00:00</when><price>-INF</price></Piece>\n"
                + "<Piece><when>2024-03-01T24:00:00.000000Z</when><price>.5</price></Piece>\n"
                + "</replica>");
        Instance a = piece(0);
        assertEquals(42, a.getValue("qty"));
        assertEquals(150.0, a.getValue("price"));
        assertEquals(true, a.getValue("ok"));
        assertEquals(new Date(1709294400250L), a.getValue("when"));
        assertEquals("xy", a.getValue("name"));
        assertArrayEquals(new int[] {1, 2, 3}, (int[]) a.getValue("nums"));
        Instance b = piece(1);
        assertEquals(-7, b.getValue("qty"));
        assertEquals(Double.doubleToRawLongBits(-0.0), Double.doubleToRawLongBits((Double) b.getValue("price")));
        assertEquals(false, b.getValue("ok"));
        assertEquals(new Date(-1), b.getValue("when"));
        Instance c = piece(2);
        assertFalse(c.isCreated(), "loaded instances are unchanged");
        assertEquals("<a&b>\r&", c.getValue("name"));
        assertArrayEquals(new int[] {4, 5}, (int[]) c.getValue("nums"));
        assertEquals(Date.from(Instant.parse("2024-02-29T21:00:00Z")), c.getValue("when"));
        assertEquals(1000.0, c.getValue("price"));
        assertEquals(Date.from(Instant.parse("2024-03-01T00:00:00Z")), piece(3).getValue("when"), "no zone: UTC");
        assertEquals(Double.NEGATIVE_INFINITY, piece(3).getValue("price"));
        assertEquals(Date.from(Instant.parse("2024-03-02T00:00:00Z")), piece(4).getValue("when"), "24:00 ends the day");
    }

    @Test
    void badValuesInPiecesAreRefusedWithTheWholeText() {
        String before = dump(target);
        failsAt(3, () -> target.populatesFromXmlString(HEAD + "<Piece id=\"a\">\n<qty>4<!-- -->x</qty></Piece>\n</replica>"),
                "'4x'", "'Piece.qty'", "not an Integer");
        failsAt(3, () -> target.populatesFromXmlString(HEAD + "<Piece>\n<price>1.<![CDATA[5.]]></price></Piece>\n</replica>"),
                "'1.5.'", "'Piece.price'", "not a Double");
        failsAt(3, () -> target.populatesFromXmlString(HEAD + "<Piece>\n<when>2023-02-29T00:00:00.000Z</when>"
                + "</Piece>\n</replica>"), "'2023-02-29T00:00:00.000Z'", "'Piece.when'");
        failsAt(3, () -> target.populatesFromXmlString(HEAD + "<Piece>\n<ok>yes</ok></Piece>\n</replica>"),
                "'yes'", "'Piece.ok'", "not a Boolean");
        failsAt(3, () -> target.populatesFromXmlString(HEAD + "<Piece>\n<qty>1<b/></qty></Piece>\n</replica>"),
                "'b'", "'Piece.qty'");
        failsAt(3, () -> target.populatesFromXmlString(HEAD + "<Piece><qty>1</qty>\n<name>n</name><qty>1</qty>"
                + "</Piece>\n</replica>"), "'Piece.qty' is single-valued");
        assertEquals(before, dump(target));
    }

    /** An instance element with a key, an identifier and references. */
    private static String piece(String key, String id, String peer, String... peers) {
        StringBuilder b = new StringBuilder("<Piece key=\"").append(key).append("\" id=\"").append(id).append("\">");
        if (peer != null) {
            b.append("<peer ref=\"").append(peer).append("\"/>");
        }
        for (String p : peers) {
            b.append("<peers ref=\"").append(p).append("\"/>");
        }
        return b.append("</Piece>\n").toString();
    }

    private Object idOf(Object instance) {
        return ((Instance) instance).getID();
    }

    @Test
    void keysOfAnyFormAndOrderFindTheirInstances() {
        StringBuilder doc = new StringBuilder(HEAD);
        // far above the count of keys so far, then many written ones, then others near and far
        doc.append(piece("i1500", "far", "i1", "i01", "i0", "k", "i1500", "i999999999", "i2"));
        for (int i = 1; i <= 1400; i++) {
            doc.append(piece("i" + i, "n" + i, "i" + (1401 - i)));
        }
        doc.append(piece("i01", "leading zero", "i1500"));
        doc.append(piece("i0", "zero", null));
        doc.append(piece("k", "other", "k"));
        doc.append(piece("i999999999", "largest", "i1400"));
        doc.append(piece("i4000", "beyond", "i999999999"));
        target.populatesFromXmlString(doc.append("</replica>").toString());

        Instance far = piece(0);
        assertEquals("far", far.getID());
        assertEquals("n1", idOf(far.getValue("peer")));
        Object[] peers = (Object[]) far.getValue("peers");
        String[] expected = {"leading zero", "zero", "other", "far", "largest", "n2"};
        for (int i = 0; i < expected.length; i++) {
            assertEquals(expected[i], idOf(peers[i]));
        }
        for (int i = 1; i <= 1400; i++) {
            assertEquals("n" + (1401 - i), idOf(piece(i).getValue("peer")));
        }
        assertSame(far, piece(1401).getValue("peer"));
        assertEquals("other", idOf(piece(1403).getValue("peer")));
        assertEquals("n1400", idOf(piece(1404).getValue("peer")));
        assertEquals("largest", idOf(piece(1405).getValue("peer")));
    }

    @Test
    void aKeyUsedTwiceIsRefusedWhereverEachUseIsKept() {
        String before = dump(target);
        StringBuilder doc = new StringBuilder(HEAD);
        doc.append(piece("i1500", "first", null)); // line 2, in the map: 1500 is far above the count of keys
        for (int i = 1; i <= 400; i++) {
            doc.append(piece("i" + i, "n" + i, null));
        }
        doc.append(piece("i1500", "second", null)); // line 403: now among the numbered keys
        failsAt(403, () -> target.populatesFromXmlString(doc + "</replica>"), "key 'i1500' is used twice");
        failsAt(4, () -> target.populatesFromXmlString(HEAD + piece("i7", "a", null) + piece("k", "b", null)
                + piece("i7", "c", null) + "</replica>"), "key 'i7' is used twice");
        failsAt(4, () -> target.populatesFromXmlString(HEAD + piece("x", "a", null) + piece("i07", "b", null)
                + piece("x", "c", null) + "</replica>"), "key 'x' is used twice");
        failsAt(2, () -> target.populatesFromXmlString(HEAD + piece("i1", "a", "i10") + "</replica>"),
                "refers to key 'i10'", "no instance of the document");
        failsAt(2, () -> target.populatesFromXmlString(HEAD + piece("i1", "a", "i01") + "</replica>"),
                "refers to key 'i01'");
        assertEquals(before, dump(target));
    }

    @Test
    void largeWrittenDocumentsComeBackExactly() {
        Random rnd = new Random(5);
        Model m = target.getModels().getItem("Piece");
        int n = 5000;
        Instance[] xs = new Instance[n];
        for (int i = 0; i < n; i++) {
            xs[i] = m.createInstance();
            if (i % 3 == 0) {
                xs[i].setID("p" + i);
            }
            xs[i].setValue("qty", rnd.nextInt());
            xs[i].setValue("price", Double.longBitsToDouble(rnd.nextLong()));
            xs[i].setValue("ok", rnd.nextBoolean());
            xs[i].setValue("when", new Date(rnd.nextLong() >> (i % 2 == 0 ? 20 : 8))); // also years beyond 9999
            xs[i].setValue("name", "name " + rnd.nextInt(1000));
            if (i % 7 == 0) {
                xs[i].setValue("nums", new int[] {rnd.nextInt(), i});
            }
        }
        for (int i = 0; i < n; i++) {
            xs[i].setValue("peer", xs[rnd.nextInt(n)]);
            if (i % 5 == 0) {
                xs[i].setValue("peers", new Instance[] {xs[n - 1 - i], xs[i], xs[rnd.nextInt(n)]});
            }
        }
        target.commit();
        String expected = dump(target);
        Replica back = Replica.readFromXmlString(target.getXml(true));
        assertEquals(expected.replace("target", back.getName()), dump(back));
    }
}
