package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.*;
import static org.junit.jupiter.api.Assertions.*;

import java.nio.file.Files;
import java.nio.file.Path;
import java.util.Arrays;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.io.TempDir;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.CsvSource;

/** XSD writing and reading: our own schemas exactly, hand-written ones of the documented shape, nothing else. */
class XsdTest {
    private static final String XS = "<xs:schema xmlns:xs='http://www.w3.org/2001/XMLSchema'";

    @TempDir
    Path dir;

    /** Each class as "Name(Super) abstract: attr Type*! length [targets], ..." ('*' multi-valued, '!' mandatory). */
    private static String shape(Replica r) {
        StringBuilder b = new StringBuilder();
        for (int i = 0; i < r.getModels().getCount(); i++) {
            ClassDef c = r.getModels().getItem(i).getClassDef();
            b.append(c.getClassName()).append(c.getSuperName().isEmpty() ? "" : "(" + c.getSuperName() + ")")
                    .append(c.isAbstract() ? " abstract" : "").append(':');
            for (int k = 0; k < c.getAttributes().getCount(); k++) {
                AttributeDef a = c.getAttributes().getItem(k);
                b.append(' ').append(a.getAttributeName()).append(' ').append(a.getAttributeType())
                        .append(a.isMultiValuated() ? "*" : "").append(a.isMandatory() ? "!" : "")
                        .append(a.getLength() != 0 ? " " + a.getLength() : "")
                        .append(a.getTargetNames().length > 0 ? " " + Arrays.toString(a.getTargetNames()) : "").append(',');
            }
            b.append('\n');
        }
        return b.toString();
    }

    private static final String HAND_WRITTEN = """
            <?xml version='1.0' encoding='UTF-8'?>
            <!-- a schema as a person writes it -->
            <schema xmlns='http://www.w3.org/2001/XMLSchema' xmlns:inv='urn:example:inv'
                    targetNamespace='urn:example:inv' elementFormDefault='qualified' version='2'>
              <annotation><documentation>Parts and suppliers.</documentation></annotation>
              <element name='stock' type='inv:Stock'/>
              <complexType name='Stock'><sequence>
                <element name='parts' type='inv:Part' minOccurs='0' maxOccurs='unbounded'/>
              </sequence></complexType>
              <complexType name='Part' abstract='true'>
                <annotation><documentation>Anything we stock.</documentation></annotation>
                <sequence>
                  <element name='number'><simpleType><restriction base='string'>
                    <maxLength value='8'/></restriction></simpleType></element>
                  <element name='qty' type='integer' minOccurs='0'/>
                  <element name='weight' type='double' minOccurs='0'/>
                  <element name='tags' type='string' minOccurs='0' maxOccurs='5'/>
                  <element name='photo' minOccurs='0'><simpleType><restriction base='base64Binary'>
                    <maxLength value='1024'/></restriction></simpleType></element>
                  <element name='supplier' type='inv:Supplier' minOccurs='0'/>
                </sequence>
              </complexType>
              <complexType name='Bolt'><complexContent><extension base='inv:Part'><sequence>
                <element name='thread' type='int' minOccurs='1' maxOccurs='1'/>
                <element name='checked' type='boolean' minOccurs='0' maxOccurs='unbounded' nillable='true'/>
              </sequence></extension></complexContent></complexType>
              <complexType name='Supplier'><sequence>
                <element name='name' type='string'/>
                <element name='since' type='dateTime' minOccurs='0'/>
              </sequence></complexType>
              <complexType name='Empty'/>
            </schema>""";

    @Test
    void handWrittenSchemasOfTheDocumentedShapeAreRead() throws Exception {
        Replica r = new Replica("inv");
        r.insertSchemaString(HAND_WRITTEN);
        assertEquals("""
                Stock: parts Relationship* [Part],
                Part abstract: number String! 8, qty Integer, weight Double, tags String*, photo Binary 1024, \
                supplier Relationship [Supplier],
                Bolt(Part): thread Integer!, checked Boolean*,
                Supplier: name String!, since Date,
                Empty:
                """, shape(r));
        // The replica then works as any other: data, documents, and its own schema.
        Instance b = inst(r.getModels().getItem("Bolt"), "number", "B-1", "thread", 8, "supplier",
                inst(r.getModels().getItem("Supplier"), "name", "acme"));
        inst(r.getModels().getItem("Stock"), "parts", new Instance[] {b});
        r.commit();
        for (RoundTripTest.Form f : RoundTripTest.Form.values()) { // our schema of it keeps every property
            RoundTripTest.same(r, f);
        }
    }

    @Test
    void classesMayExtendAndReferToClassesTheReplicaHasAlready() {
        Replica r = replica("grow", "Existing: n Integer");
        r.insertSchemaString(XS + "><xs:complexType name='More'><xs:complexContent><xs:extension base='Existing'>"
                + "<xs:sequence><xs:element name='link' type='Existing' minOccurs='0'/></xs:sequence></xs:extension>"
                + "</xs:complexContent></xs:complexType></xs:schema>");
        assertEquals("Existing: n Integer,\nMore(Existing): link Relationship [Existing],\n", shape(r));
        inst(r.getModels().getItem("More"), "n", 3);
    }

    private static String schema(String body) {
        return XS + " xmlns:o='urn:other'>\n" + body + "\n</xs:schema>";
    }

    @Test
    void includesAndImportsAreReadOnlyFromTheInsertedFilesDirectory() throws Exception {
        Path main = write(dir.resolve("main.xsd"), schema("<xs:include schemaLocation='sub/base%20types.xsd'/>\n"
                + "<xs:import namespace='urn:other' schemaLocation='other.xsd'/>\n"
                + "<xs:complexType name='Bolt'><xs:complexContent><xs:extension base='Part'><xs:sequence>"
                + "<xs:element name='maker' type='o:Maker'/></xs:sequence></xs:extension></xs:complexContent>"
                + "</xs:complexType>"));
        write(dir.resolve("sub/base types.xsd"), schema("<xs:include schemaLocation='../main.xsd'/>"
                + "<xs:complexType name='Part'><xs:sequence><xs:element name='n' type='xs:int'/></xs:sequence>"
                + "</xs:complexType>"));
        write(dir.resolve("other.xsd"), XS + " targetNamespace='urn:other'><xs:complexType name='Maker'/></xs:schema>");
        Replica r = new Replica("files");
        r.insertSchemaFile(main.toString());
        assertEquals("Part: n Integer!,\nMaker:\nBolt(Part): maker Relationship! [Maker],\n", shape(r));

        Path outside = write(dir.resolve("outside.xsd"), schema("<xs:complexType name='Secret'/>"));
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
        failsAt(2, () -> new Replica("s").insertSchemaString(schema("<xs:include schemaLocation='main.xsd'/>")),
                "'xs:include' is refused", "given as a string", "nothing was read");
    }

    /** Constructs that are refused: 'ct:' wraps in a complex type P, 'seq:' in a sequence of P; what the message names. */
    @ParameterizedTest(name = "{1}")
    @CsvSource(delimiter = '|', quoteCharacter = '`', textBlock = """
        ct: <xs:choice/>                                                     | 'xs:choice'
        ct: <xs:all/>                                                        | 'xs:all'
        ct: <xs:sequence/><xs:attribute name='a' type='xs:int'/>             | 'xs:attribute'
        <xs:simpleType name='S'><xs:restriction base='xs:string'/></xs:simpleType> | 'xs:simpleType'
        <xs:group name='G'><xs:sequence/></xs:group>                         | 'xs:group'
        <xs:attribute name='a' type='xs:int'/>                               | 'xs:attribute'
        <xs:redefine schemaLocation='x.xsd'/>                                | 'xs:redefine'
        <xs:notation name='n' public='p'/>                                   | 'xs:notation'
        <foo:bar xmlns:foo='urn:x'/>                                         | 'foo:bar'
        seq: <xs:element ref='a'/>                                           | 'ref'
        seq: <xs:element name='a' type='xs:long'/>                           | 'xs:long'
        seq: <xs:element name='a'><xs:simpleType><xs:restriction base='xs:string'><xs:pattern value='x'/></xs:restriction></xs:simpleType></xs:element> | 'xs:pattern'
        seq: <xs:element name='a'><xs:simpleType><xs:restriction base='xs:int'><xs:maxLength value='3'/></xs:restriction></xs:simpleType></xs:element> | restriction of 'xs:int'
        seq: <xs:any/>                                                       | 'xs:any'
        seq: <xs:sequence/>                                                  | 'xs:sequence'
        ct: <xs:complexContent><xs:restriction base='Ok'/></xs:complexContent> | 'xs:restriction'
        ct: <xs:simpleContent><xs:extension base='xs:string'/></xs:simpleContent> | 'xs:simpleContent'
        <xs:complexType name='P' mixed='true'><xs:sequence/></xs:complexType> | 'mixed'
        <xs:complexType name='P' final='#all'/>                              | 'final'
        seq: <xs:element name='a' type='xs:int' default='1'/>                | 'default'
        ct: <xs:sequence maxOccurs='2'><xs:element name='a' type='xs:int'/></xs:sequence> | 'maxOccurs'
        seq: <xs:element name='a' type='xs:int'><xs:key name='k'/></xs:element> | 'xs:key'
        <xs:element name='root'><xs:complexType/></xs:element>               | 'xs:complexType'
        <xs:element name='root'/>                                            | has no type
        seq: <xs:element name='a'/>                                          | has no type
        ct: <xs:complexContent><xs:extension base='xs:anyType'/></xs:complexContent> | 'xs:anyType'
        seq: <xs:element name='a' type='q:T'/>                               | undeclared prefix 'q'
        seq: <xs:element name='a' type='xs:int' maxOccurs='0'/>              | maxOccurs 0
        seq: <xs:element name='a' type='xs:int' minOccurs='x'/>              | minOccurs 'x'
        seq: <xs:element name='a' type='Nope'/>                              | type 'Nope' of element 'a'
        ct: <xs:complexContent><xs:extension base='Missing'/></xs:complexContent> | base type 'Missing'
        <xs:complexType name='Ok'/>                                          | class 'Ok' is defined twice
        <xs:complexType name='Existing'/>                                    | already has a class 'Existing'
        <xs:complexType name='a.b'/>                                         | 'a.b' is not a valid name
        ct: <xs:complexContent><xs:extension base='P'/></xs:complexContent>  | cyclic super class chain: P -> P
        seq: <xs:element name='a' type='xs:int'/><xs:element name='a' type='xs:int'/> | already has an attribute 'a'
        ct: <xs:annotation><xs:appinfo><c:class xmlns:c='urn:corvexa:replica:1' visibility='Secret'/></xs:appinfo></xs:annotation> | visibility 'Secret'
        <xs:complexType name='P'>text</xs:complexType>                       | unexpected text 'text'
        """)
    void anythingElseIsRejectedNamingTheConstructAndItsLine(String construct, String named) {
        Replica r = replica("target", "Existing: n Integer");
        inst(r.getModels().getItem(0), "n", 5);
        String before = dump(r);
        String c = construct.startsWith("seq: ") ? "ct: <xs:sequence>" + construct.substring(5) + "</xs:sequence>" : construct;
        c = c.startsWith("ct: ") ? "<xs:complexType name='P'>" + c.substring(4) + "</xs:complexType>" : c;
        String xsd = "<?xml version='1.0'?>\n" + XS + ">\n  <xs:complexType name='Ok'><xs:sequence><xs:element name='a'"
                + " type='xs:int'/></xs:sequence></xs:complexType>\n  " + c + "\n</xs:schema>\n";
        failsAt(4, () -> r.insertSchemaString(xsd), named, "the XSD string");
        assertEquals(before, dump(r));
    }

    @Test
    void propertiesFromTheAppinfoOverrideWhatTheStructureSays() {
        Replica r = new Replica("app");
        r.insertSchemaString(XS + " xmlns:c='urn:corvexa:replica:1'><xs:complexType name='P' abstract='true'>"
                + "<xs:annotation><xs:appinfo><other/><c:class persistent='false'><c:scope nameEsc='a\\u0009b'/></c:class>"
                + "</xs:appinfo></xs:annotation><xs:sequence><xs:element name='a' type='xs:string'><xs:annotation>"
                + "<xs:appinfo><c:attribute access='Read' length='-2' commentEsc='x\\\\y'/></xs:appinfo></xs:annotation>"
                + "</xs:element></xs:sequence></xs:complexType></xs:schema>");
        assertEquals("P: a String -2,\n", shape(r), "the appinfo gives every property: not abstract, a optional");
        assertFalse(r.getClassDef("P").isPersistent());
        assertArrayEquals(new String[] {"a\tb"}, r.getClassDef("P").getScopeNames());
        assertEquals("Read x\\y", r.getAttributeDef("P.a").getAccessMode() + " " + r.getAttributeDef("P.a").getQKAComment());
        failsAt(1, () -> new Replica("x").insertSchemaString(XS + " xmlns:c='urn:corvexa:replica:1'><xs:complexType"
                + " name='P'><xs:annotation><xs:appinfo><c:class commentEsc='bad \\q escape'/></xs:appinfo>"
                + "</xs:annotation></xs:complexType></xs:schema>"), "malformed escape");
    }
}
