package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.addAttr;
import static com.velmora.tessara.kdmreplica.Fx.addClass;
import static com.velmora.tessara.kdmreplica.Fx.dump;
import static com.velmora.tessara.kdmreplica.Fx.failsAt;
import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertNotNull;
import static org.junit.jupiter.api.Assertions.assertNull;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.Date;
import java.util.stream.Stream;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.io.TempDir;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.Arguments;
import org.junit.jupiter.params.provider.MethodSource;
import org.xml.sax.SAXException;

/** XSD writing and reading: our own schemas exactly, hand-written ones of the documented shape, nothing else. */
class XsdTest {

    @TempDir
    Path dir;

    @AfterEach
    void resetFeatures() {
        Replica.setFeature("indent", true);
        Replica.setSchemaLocation(null);
    }

    /** Every form validates by the schema (see RoundTripTest); here the schema refuses what breaks it. */
    @Test
    void theSchemaConstrainsTheDocumentsOfTheReplica() throws Exception {
        Replica r = Fx.richWithData();
        Replica.setFeature("indent", false);
        String xsd = r.getXsd();
        String xml = r.getXml(true, true);
        String[][] tampered = {
            {"key=\"i2\"", "key=\"i1\""},                        // duplicate key
            {"<supplier ref=\"i3\"/>", "<supplier ref=\"i9\"/>"}, // dangling reference
            {"state=\"created\"", "state=\"new\""},
            {"<grade bits=\"7ff0000000000001\">NaN</grade>", "<grade>1.5.2</grade>"},
            {"<blob>AQIDBA==</blob>", "<blob>AQIDBAU=</blob>"},      // 5 bytes, maxLength 4
            {"<name esc=\"a\\u0002\"/>", "<name>x</name><name>y</name>"}, // single-valued twice
            {"<since>", "<until>"},
        };
        Fx.validate(xsd, xml);
        for (String[] t : tampered) {
            assertTrue(xml.contains(t[0]), t[0]);
            String bad = xml.replaceFirst(java.util.regex.Pattern.quote(t[0]), t[1]);
            assertThrows(SAXException.class, () -> Fx.validate(xsd, bad), t[1]);
        }
    }

    @Test
    void theSchemaOfAnEmptyReplicaAddsNothing() {
        Replica again = new Replica("empty");
        again.insertSchemaString(new Replica("empty").getXsd());
        assertEquals(0, again.getModels().getCount());
    }

    private static final String HAND_WRITTEN = String.join("\n",
            "<?xml version='1.0' encoding='UTF-8'?>",
            "<!-- a schema as a person writes it -->",
            "<schema xmlns='http://www.w3.org/2001/XMLSchema' xmlns:inv='urn:example:inv'",
            "        targetNamespace='urn:example:inv' elementFormDefault='qualified' version='2'>",
            "  <annotation><documentation>Parts and suppliers.</documentation></annotation>",
            "  <element name='stock' type='inv:Stock'/>",
            "  <complexType name='Stock'><sequence>",
            "    <element name='parts' type='inv:Part' minOccurs='0' maxOccurs='unbounded'/>",
            "  </sequence></complexType>",
            "  <complexType name='Part' abstract='true'>",
            "    <annotation><documentation>Anything we stock.</documentation></annotation>",
            "    <sequence>",
            "      <element name='number'><simpleType><restriction base='string'>",
            "        <maxLength value='8'/></restriction></simpleType></element>",
            "      <element name='qty' type='integer' minOccurs='0'/>",
            "      <element name='weight' type='double' minOccurs='0'/>",
            "      <element name='tags' type='string' minOccurs='0' maxOccurs='5'/>",
            "      <element name='photo' minOccurs='0'><simpleType><restriction base='base64Binary'>",
            "        <maxLength value='1024'/></restriction></simpleType></element>",
            "      <element name='supplier' type='inv:Supplier' minOccurs='0'/>",
            "    </sequence>",
            "  </complexType>",
            "  <complexType name='Bolt'><complexContent><extension base='inv:Part'><sequence>",
            "    <element name='thread' type='int' minOccurs='1' maxOccurs='1'/>",
            "    <element name='checked' type='boolean' minOccurs='0' maxOccurs='unbounded' nillable='true'/>",
            "  </sequence></extension></complexContent></complexType>",
            "  <complexType name='Supplier'><sequence>",
            "    <element name='name' type='string'/>",
            "    <element name='since' type='dateTime' minOccurs='0'/>",
            "  </sequence></complexType>",
            "  <complexType name='Empty'/>",
            "</schema>");

    @Test
    void handWrittenSchemasOfTheDocumentedShapeAreRead() throws Exception {
        Replica r = new Replica("inv");
        r.insertSchemaString(HAND_WRITTEN);
        assertEquals("ModelSet of replica 'inv' [Stock, Part, Bolt, Supplier, Empty]", r.getModels().toString());
        ClassDef part = r.getClassDef("Part");
        assertTrue(part.isAbstract());
        assertEquals("Part", r.getClassDef("Bolt").getSuperName());
        AttributeDef number = r.getAttributeDef("Part.number");
        assertEquals(AttributeType.String, number.getAttributeType());
        assertEquals(8, number.getLength());
        assertTrue(number.isMandatory(), "minOccurs defaults to 1");
        assertFalse(r.getAttributeDef("Part.qty").isMandatory());
        assertEquals(AttributeType.Integer, r.getAttributeDef("Part.qty").getAttributeType());
        assertTrue(r.getAttributeDef("Part.tags").isMultiValuated());
        assertEquals(1024, r.getAttributeDef("Part.photo").getLength());
        assertEquals(AttributeType.Binary, r.getAttributeDef("Part.photo").getAttributeType());
        AttributeDef supplier = r.getAttributeDef("Part.supplier");
        assertEquals(AttributeType.Relationship, supplier.getAttributeType());
        assertArrayEquals(new String[] {"Supplier"}, supplier.getTargetNames());
        AttributeDef parts = r.getAttributeDef("Stock.parts");
        assertTrue(parts.isMultiValuated());
        assertArrayEquals(new String[] {"Part"}, parts.getTargetNames());
        assertTrue(r.getAttributeDef("Bolt.thread").isMandatory());
        assertFalse(r.getAttributeDef("Bolt.thread").isMultiValuated());
        assertEquals(AttributeType.Date, r.getAttributeDef("Supplier.since").getAttributeType());
        assertEquals(0, r.getClassDef("Empty").getAttributes().getCount());

        // The replica then works as any other: data, documents, and its own schema.
        Instance s = r.getModels().getItem("Supplier").createInstance();
        s.setValue("name", "acme");
        Instance b = r.getModels().getItem("Bolt").createInstance();
        b.setValue("number", "B-1");
        b.setValue("thread", 8);
        b.setValue("supplier", s);
        r.getModels().getItem("Stock").createInstance().setValue("parts", new Instance[] {b});
        r.commit();
        for (RoundTripTest.Form f : RoundTripTest.Form.values()) { // our schema of it keeps every property
            RoundTripTest.same(r, f);
        }
    }

    @Test
    void classesMayExtendAndReferToClassesTheReplicaHasAlready() {
        Replica r = new Replica("grow");
        addAttr(addClass(r, "Existing", null), "n", AttributeType.Integer, false);
        r.insertSchemaString("<xs:schema xmlns:xs='http://www.w3.org/2001/XMLSchema'>"
                + "<xs:complexType name='More'><xs:complexContent><xs:extension base='Existing'><xs:sequence>"
                + "<xs:element name='link' type='Existing' minOccurs='0'/></xs:sequence></xs:extension>"
                + "</xs:complexContent></xs:complexType></xs:schema>");
        assertEquals(1, r.getClassDef("More").getAttributes().getCount());
        assertEquals("Existing", r.getClassDef("More").getSuperName());
        Instance m = r.getModels().getItem("More").createInstance();
        m.setValue("n", 3);
        assertNotNull(r.getAttributeDef("More.link"));
    }

    private static void write(Path p, String text) throws Exception {
        Files.createDirectories(p.getParent());
        Files.write(p, text.getBytes(StandardCharsets.UTF_8));
    }

    private static String schema(String body) {
        return "<xs:schema xmlns:xs='http://www.w3.org/2001/XMLSchema' xmlns:o='urn:other'>\n" + body + "\n</xs:schema>";
    }

    @Test
    void includesAndImportsAreReadOnlyFromTheInsertedFilesDirectory() throws Exception {
        Path main = dir.resolve("main.xsd");
        write(main, schema("<xs:include schemaLocation='sub/base%20types.xsd'/>\n"
                + "<xs:import namespace='urn:other' schemaLocation='other.xsd'/>\n"
                + "<xs:complexType name='Bolt'><xs:complexContent><xs:extension base='Part'><xs:sequence>"
                + "<xs:element name='maker' type='o:Maker'/></xs:sequence></xs:extension></xs:complexContent>"
                + "</xs:complexType>"));
        write(dir.resolve("sub/base types.xsd"), schema("<xs:include schemaLocation='../main.xsd'/>"
                + "<xs:complexType name='Part'><xs:sequence><xs:element name='n' type='xs:int'/></xs:sequence>"
                + "</xs:complexType>"));
        write(dir.resolve("other.xsd"), "<xs:schema xmlns:xs='http://www.w3.org/2001/XMLSchema'"
                + " targetNamespace='urn:other'><xs:complexType name='Maker'/></xs:schema>");
        Replica r = new Replica("files");
        r.insertSchemaFile(main.toString());
        assertEquals("ModelSet of replica 'files' [Part, Maker, Bolt]", r.getModels().toString());
        assertArrayEquals(new String[] {"Maker"}, r.getAttributeDef("Bolt.maker").getTargetNames());

        Path outside = dir.resolve("outside.xsd");
        write(outside, schema("<xs:complexType name='Secret'/>"));
        Path inner = dir.resolve("inner/schema.xsd");
        Files.createDirectories(inner.getParent());
        Files.createSymbolicLink(inner.resolveSibling("link.xsd"), outside);
        String[][] refused = {
            {"<xs:include schemaLocation='../outside.xsd'/>", "outside the directory"},
            {"<xs:include schemaLocation='" + outside + "'/>", "outside the directory"},
            {"<xs:include schemaLocation='link.xsd'/>", "not a file inside the directory"},
            {"<xs:import namespace='urn:x' schemaLocation='https://example.invalid/x.xsd'/>", "never URLs"},
            {"<xs:include schemaLocation='file:///etc/hostname'/>", "never URLs"},
            {"<xs:import namespace='urn:x'/>", "names no schemaLocation"},
            {"<xs:include schemaLocation='missing.xsd'/>", "cannot read"},
        };
        for (String[] c : refused) {
            write(inner, schema("<xs:complexType name='Before'/>\n" + c[0] + "\n<xs:complexType name='After'/>"));
            Replica target = new Replica("target");
            failsAt(3, () -> target.insertSchemaFile(inner.toString()), c[1], "'xs:", "schema.xsd");
            assertEquals(0, target.getModels().getCount(), "nothing was added");
        }
        Replica fromString = new Replica("s");
        failsAt(2, () -> fromString.insertSchemaString(schema("<xs:include schemaLocation='main.xsd'/>")),
                "'xs:include' is refused", "given as a string", "nothing was read");
    }

    static Stream<Arguments> unsupported() {
        String ct = "<xs:complexType name='P'>";
        return Stream.of(
                Arguments.of(ct + "<xs:choice/></xs:complexType>", "'xs:choice'"),
                Arguments.of(ct + "<xs:all/></xs:complexType>", "'xs:all'"),
                Arguments.of(ct + "<xs:sequence/><xs:attribute name='a' type='xs:int'/></xs:complexType>",
                        "'xs:attribute'"),
                Arguments.of("<xs:simpleType name='S'><xs:restriction base='xs:string'/></xs:simpleType>",
                        "'xs:simpleType'"),
                Arguments.of("<xs:group name='G'><xs:sequence/></xs:group>", "'xs:group'"),
                Arguments.of("<xs:attribute name='a' type='xs:int'/>", "'xs:attribute'"),
                Arguments.of("<xs:redefine schemaLocation='x.xsd'/>", "'xs:redefine'"),
                Arguments.of("<xs:notation name='n' public='p'/>", "'xs:notation'"),
                Arguments.of("<foo:bar xmlns:foo='urn:x'/>", "'foo:bar'"),
                Arguments.of(ct + "<xs:sequence><xs:element ref='a'/></xs:sequence></xs:complexType>", "'ref'"),
                Arguments.of(ct + "<xs:sequence><xs:element name='a' type='xs:long'/></xs:sequence></xs:complexType>",
                        "'xs:long'"),
                Arguments.of(ct + "<xs:sequence><xs:element name='a'><xs:simpleType><xs:restriction base='xs:string'>"
                        + "<xs:pattern value='x'/></xs:restriction></xs:simpleType></xs:element></xs:sequence>"
                        + "</xs:complexType>", "'xs:pattern'"),
                Arguments.of(ct + "<xs:sequence><xs:element name='a'><xs:simpleType><xs:restriction base='xs:int'>"
                        + "<xs:maxLength value='3'/></xs:restriction></xs:simpleType></xs:element></xs:sequence>"
                        + "</xs:complexType>", "restriction of 'xs:int'"),
                Arguments.of(ct + "<xs:sequence><xs:any/></xs:sequence></xs:complexType>", "'xs:any'"),
                Arguments.of(ct + "<xs:sequence><xs:sequence/></xs:sequence></xs:complexType>", "'xs:sequence'"),
                Arguments.of(ct + "<xs:complexContent><xs:restriction base='Ok'/></xs:complexContent></xs:complexType>",
                        "'xs:restriction'"),
                Arguments.of(ct + "<xs:simpleContent><xs:extension base='xs:string'/></xs:simpleContent>"
                        + "</xs:complexType>", "'xs:simpleContent'"),
                Arguments.of("<xs:complexType name='P' mixed='true'><xs:sequence/></xs:complexType>", "'mixed'"),
                Arguments.of("<xs:complexType name='P' final='#all'/>", "'final'"),
                Arguments.of(ct + "<xs:sequence><xs:element name='a' type='xs:int' default='1'/></xs:sequence>"
                        + "</xs:complexType>", "'default'"),
                Arguments.of(ct + "<xs:sequence maxOccurs='2'><xs:element name='a' type='xs:int'/></xs:sequence>"
                        + "</xs:complexType>", "'maxOccurs'"),
                Arguments.of(ct + "<xs:sequence><xs:element name='a' type='xs:int'><xs:key name='k'/></xs:element>"
                        + "</xs:sequence></xs:complexType>", "'xs:key'"),
                Arguments.of("<xs:element name='root'><xs:complexType/></xs:element>", "'xs:complexType'"),
                Arguments.of("<xs:element name='root'/>", "has no type"),
                Arguments.of(ct + "<xs:sequence><xs:element name='a'/></xs:sequence></xs:complexType>", "has no type"),
                Arguments.of(ct + "<xs:complexContent><xs:extension base='xs:anyType'/></xs:complexContent>"
                        + "</xs:complexType>", "'xs:anyType'"),
                Arguments.of(ct + "<xs:sequence><xs:element name='a' type='q:T'/></xs:sequence></xs:complexType>",
                        "undeclared prefix 'q'"),
                Arguments.of(ct + "<xs:sequence><xs:element name='a' type='xs:int' maxOccurs='0'/></xs:sequence>"
                        + "</xs:complexType>", "maxOccurs 0"),
                Arguments.of(ct + "<xs:sequence><xs:element name='a' type='xs:int' minOccurs='x'/></xs:sequence>"
                        + "</xs:complexType>", "minOccurs 'x'"),
                // well-formed constructs that do not make a valid schema of classes
                Arguments.of(ct + "<xs:sequence><xs:element name='a' type='Nope'/></xs:sequence></xs:complexType>",
                        "type 'Nope' of element 'a'"),
                Arguments.of(ct + "<xs:complexContent><xs:extension base='Missing'/></xs:complexContent>"
                        + "</xs:complexType>", "base type 'Missing'"),
                Arguments.of("<xs:complexType name='Ok'/>", "class 'Ok' is defined twice"),
                Arguments.of("<xs:complexType name='Existing'/>", "already has a class 'Existing'"),
                Arguments.of("<xs:complexType name='a.b'/>", "'a.b' is not a valid name"),
                Arguments.of(ct + "<xs:complexContent><xs:extension base='P'/></xs:complexContent></xs:complexType>",
                        "cyclic super class chain: P -> P"),
                Arguments.of(ct + "<xs:sequence><xs:element name='a' type='xs:int'/><xs:element name='a'"
                        + " type='xs:int'/></xs:sequence></xs:complexType>", "already has an attribute 'a'"),
                Arguments.of(ct + "<xs:annotation><xs:appinfo><c:class xmlns:c='urn:corvexa:replica:1'"
                        + " visibility='Secret'/></xs:appinfo></xs:annotation></xs:complexType>",
                        "visibility 'Secret'"),
                Arguments.of("<xs:complexType name='P'>text</xs:complexType>", "unexpected text 'text'"));
    }

    @ParameterizedTest(name = "{1}")
    @MethodSource("unsupported")
    void anythingElseIsRejectedNamingTheConstructAndItsLine(String construct, String named) {
        Replica r = new Replica("target");
        addAttr(addClass(r, "Existing", null), "n", AttributeType.Integer, false);
        r.getModels().getItem(0).createInstance().setValue(0, 5);
        String before = dump(r);
        String xsd = "<?xml version='1.0'?>\n<xs:schema xmlns:xs='http://www.w3.org/2001/XMLSchema'>\n"
                + "  <xs:complexType name='Ok'><xs:sequence><xs:element name='a' type='xs:int'/></xs:sequence>"
                + "</xs:complexType>\n  " + construct + "\n</xs:schema>\n";
        failsAt(4, () -> r.insertSchemaString(xsd), named, "the XSD string");
        assertEquals(before, dump(r));
        assertNull(r.getClassDef("Ok"));
    }

    @Test
    void propertiesFromTheAppinfoOverrideWhatTheStructureSays() {
        Replica r = new Replica("app");
        r.insertSchemaString("<xs:schema xmlns:xs='http://www.w3.org/2001/XMLSchema' xmlns:c='urn:corvexa:replica:1'>"
                + "<xs:complexType name='P' abstract='true'><xs:annotation><xs:appinfo><other/>"
                + "<c:class persistent='false'><c:scope nameEsc='a\\u0009b'/></c:class></xs:appinfo></xs:annotation>"
                + "<xs:sequence><xs:element name='a' type='xs:string'><xs:annotation><xs:appinfo>"
                + "<c:attribute access='Read' length='-2' commentEsc='x\\\\y'/></xs:appinfo></xs:annotation>"
                + "</xs:element></xs:sequence></xs:complexType></xs:schema>");
        ClassDef p = r.getClassDef("P");
        assertFalse(p.isAbstract(), "the appinfo gives every class property");
        assertFalse(p.isPersistent());
        assertArrayEquals(new String[] {"a\tb"}, p.getScopeNames());
        AttributeDef a = r.getAttributeDef("P.a");
        assertFalse(a.isMandatory(), "the appinfo gives every attribute property");
        assertEquals(AccessMode.Read, a.getAccessMode());
        assertEquals(-2, a.getLength());
        assertEquals("x\\y", a.getQKAComment());
        failsAt(1, () -> new Replica("x").insertSchemaString("<xs:schema xmlns:xs='http://www.w3.org/2001/XMLSchema'"
                + " xmlns:c='urn:corvexa:replica:1'><xs:complexType name='P'><xs:annotation><xs:appinfo>"
                + "<c:class commentEsc='bad \\q escape'/></xs:appinfo></xs:annotation></xs:complexType></xs:schema>"),
                "malformed escape");
    }
}
