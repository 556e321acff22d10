package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.*;
import static org.junit.jupiter.api.Assertions.*;

import org.junit.jupiter.api.BeforeEach;
import org.junit.jupiter.api.Test;

/** Documents shaped otherwise than the package writes them: values in pieces and in any order, keys of any form and order. */
class XmlDocumentsTest {
    private static final String HEAD = "<replica xmlns=\"urn:corvexa:replica:1\""
            + " xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\">\n";
    private Replica target;

    @BeforeEach
    void setUp() {
        target = replica("target", "Piece: qty Integer, price Double, ok Boolean, when Date, name String, nums Integer*,"
                + " peer Relationship, peers Relationship*");
        target.getAttributeDef("peer").setTargetNames(new String[] {"Piece"});
    }

    private Instance piece(int i) {
        return target.getModels().getItem("Piece").getInstances().getItem(i);
    }

    private void populate(String body) {
        target.populatesFromXmlString(HEAD + body + "</replica>");
    }

    @Test
    void valuesInPiecesInAnyOrderAndWithAnyPrefixAreReadWhole() {
        target.populatesFromXmlString("<?xml version='1.0'?>\n<!-- a note -->\n"
                + HEAD.replace(">\n", " xmlns:r='urn:corvexa:replica:1'><?pi data?>\n")
                + "<Piece id=\"a\">\n  <nums>1</nums>\n  <when>2024-03-01T12:00:<!-- a comment -->00.250Z</when>\n"
                + "  <ok>t<![CDATA[ru]]>e</ok>\n  <nums>&#50;</nums>\n  <price>1<?note x?>.5e&#50;</price>\n"
                + "  <name>x<!-- -->y</name>\n  <qty> 4<![CDATA[2]]> </qty>\n  <nums>3</nums>\n</Piece>\n"
                + "<Piece id=\"b\"><ok>0</ok><qty>-7</qty><price>-0</price><when>1969-12-31T23:59:59.999Z</when></Piece>\n"
                + "<r:Piece id='c'><r:nums>4</r:nums><!-- c --><r:name><![CDATA[<a&b>]]>&#13;&amp;</r:name>"
                + "<r:when> 2024-02-29T23:30:00+02:30 </r:when><r:nums>5</r:nums><r:price> +1E3 </r:price></r:Piece>\n"
                + "<Piece><when>2024-03-01T00:00:00</when><price>-INF</price></Piece>\n"
                + "<Piece><when>2024-03-01T24:00:00.000000Z</when><price>.5</price></Piece>\n</replica>");
        // loaded instances are unchanged; no zone is UTC; 24:00 ends the day
        String[] expected = {"Piece[id=\"a\"] {qty=42, price=150.0, ok=true, when=2024-03-01T12:00:00.250Z, name=\"xy\","
            + " nums=[1, 2, 3]}", "Piece[id=\"b\"] {qty=-7, price=-0.0, ok=false, when=1969-12-31T23:59:59.999Z}",
            "Piece[id=\"c\"] {price=1000.0, when=2024-02-29T21:00:00Z, name=\"<a&b>\\r&\", nums=[4, 5]}",
            "Piece[#3] {price=-Infinity, when=2024-03-01T00:00:00Z}", "Piece[#4] {price=0.5, when=2024-03-02T00:00:00Z}"};
        for (int i = 0; i < expected.length; i++) {
            assertEquals("Instance " + expected[i], piece(i).toString(true));
        }
    }

    /** An instance element with a key, an identifier and references. */
    private static String piece(String key, String id, String peer, String... peers) {
        StringBuilder b = new StringBuilder("<Piece key=\"" + key + "\" id=\"" + id + "\">");
        b.append(peer == null ? "" : "<peer ref=\"" + peer + "\"/>");
        for (String p : peers) {
            b.append("<peers ref=\"").append(p).append("\"/>");
        }
        return b.append("</Piece>\n").toString();
    }

    private static Object idOf(Object instance) {
        return ((Instance) instance).getID();
    }

    @Test
    void keysOfAnyFormAndOrderFindTheirInstances() {
        // far above the count of keys so far, then many written ones, then others near and far
        StringBuilder doc = new StringBuilder(piece("i1500", "far", "i1", "i01", "i0", "k", "i1500", "i999999999", "i2"));
        for (int i = 1; i <= 1400; i++) {
            doc.append(piece("i" + i, "n" + i, "i" + (1401 - i)));
        }
        doc.append(piece("i01", "leading zero", "i1500")).append(piece("i0", "zero", null)).append(piece("k", "other", "k"))
                .append(piece("i999999999", "largest", "i1400")).append(piece("i4000", "beyond", "i999999999"));
        populate(doc.toString());
        Instance far = piece(0);
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
        StringBuilder doc = new StringBuilder(piece("i1500", "first", null)); // line 2, in the map: far above the count
        for (int i = 1; i <= 400; i++) {
            doc.append(piece("i" + i, "n" + i, null));
        }
        failsAt(403, () -> populate(doc + piece("i1500", "second", null)), "key 'i1500' is used twice"); // now numbered
        failsAt(4, () -> populate(piece("i7", "a", null) + piece("k", "b", null) + piece("i7", "c", null)),
                "key 'i7' is used twice");
        failsAt(4, () -> populate(piece("x", "a", null) + piece("i07", "b", null) + piece("x", "c", null)),
                "key 'x' is used twice");
        failsAt(2, () -> populate(piece("i1", "a", "i10")), "refers to key 'i10'", "no instance of the document");
        failsAt(2, () -> populate(piece("i1", "a", "i01")), "refers to key 'i01'");
        assertEquals(before, dump(target));
    }
}
