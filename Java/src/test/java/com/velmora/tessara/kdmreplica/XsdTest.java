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

    /** Each class as "Name(Super) @namespace "comment" abstract: attr Type*! length [targets] "comment", ..." ('*' multi-valued, '!' mandatory). */
    private static String shape(Replica r) {
        StringBuilder b = new StringBuilder();
        for (int i = 0; i < r.getModels().getCount(); i++) {
            ClassDef c = r.getModels().getItem(i).getClassDef();
            b.append(c.getClassName()).append(c.getSuperName().isEmpty() ? "" : "(" + c.getSuperName() + ")")
                    .append(c.getSchemaNamespace().isEmpty() ? "" : " @" + c.getSchemaNamespace())
                    .append(c.getQKAComment().isEmpty() ? "" : " \"" + c.getQKAComment() + "\"")
                    .append(c.isAbstract() ? " abstract" : "").append(':');
            for (int k = 0; k < c.getAttributes().getCount(); k++) {
                AttributeDef a = c.getAttributes().getItem(k);
                b.append(' ').append(a.getAttributeName()).append(' ').append(a.getAttributeType())
                        .append(a.isMultiValuated() ? "*" : "").append(a.isMandatory() ? "!" : "")
                        .append(a.getLength() != 0 ? " " + a.getLength() : "")
                        .append(a.getTargetNames().length > 0 ? " " + Arrays.toString(a.getTargetNames()) : "")
                        .append(a.getQKAComment().isEmpty() ? "" : " \"" + a.getQKAComment() + "\"").append(',');
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
                  <element name='tags' type='string' minOccurs='0' maxOccurs='unbounded'/>
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
                Stock @urn:example:inv: parts Relationship* [Part],
                Part @urn:example:inv "Anything we stock." abstract: number String! 8, qty Integer, weight Double, \
                tags String*, photo Binary 1024, supplier Relationship [Supplier],
                Bolt(Part) @urn:example:inv: thread Integer!, checked Boolean*,
                Supplier @urn:example:inv: name String!, since Date,
                Empty @urn:example:inv:
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
        assertEquals("Part: n Integer!,\nMaker @urn:other:\nBolt(Part): maker Relationship! [Maker],\n", shape(r));

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

        // Target namespaces: an include without one takes the includer's, others must match.
        write(inner.resolveSibling("c.xsd"), XS + "><xs:complexType name='C'><xs:sequence><xs:element name='c' type='C'"
                + " minOccurs='0'/></xs:sequence></xs:complexType></xs:schema>");
        write(inner, XS + " targetNamespace='urn:p' xmlns:p='urn:p'><xs:include schemaLocation='c.xsd'/><xs:complexType"
                + " name='D'><xs:complexContent><xs:extension base='p:C'/></xs:complexContent></xs:complexType></xs:schema>");
        Replica ns = new Replica("ns");
        ns.insertSchemaFile(inner.toString());
        assertEquals("C @urn:p: c Relationship [C],\nD(C) @urn:p:\n", shape(ns));
        write(inner.resolveSibling("p.xsd"), XS + " targetNamespace='urn:p'><xs:complexType name='Before'/></xs:schema>");
        String[][] spaces = {{"<xs:import namespace='urn:q' schemaLocation='p.xsd'/>", "imported schema has targetNamespace"
            + " 'urn:p', not 'urn:q'"}, {"<xs:include schemaLocation='p.xsd'/>", "included schema has targetNamespace 'urn:p',"
            + " not none"}, {"<xs:complexType name='Before'/><xs:import namespace='urn:p' schemaLocation='p.xsd'/>",
                "class 'Before' is defined twice", "schema.xsd' at line 2, in no namespace", "kept apart"}};
        for (String[] c : spaces) {
            write(inner, schema(c[0]));
            failsAt(1, () -> new Replica("t").insertSchemaFile(inner.toString()), Arrays.copyOfRange(c, 1, c.length));
        }
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

    /**
     * Hand-written constructs: each is kept, and comes back from the replica's own XSD and binary
     * form ("kept: " what the replica holds), or is refused naming it, at its line (line 3).
     * Schema attributes, then the body; 'seq:' wraps in a sequence of a complex type P.
     */
    @ParameterizedTest(name = "{1} -> {2}")
    @CsvSource(delimiter = '|', quoteCharacter = '`', textBlock = """
        targetNamespace='urn:p'           | <xs:complexType name='A'/>  | kept: A @urn:p:
        targetNamespace='urn:p' xmlns:p='urn:p' | <xs:complexType name='A'><xs:sequence><xs:element name='b' type='p:A' minOccurs='0'/></xs:sequence></xs:complexType> | kept: A @urn:p: b Relationship [A],
        xmlns:c='urn:corvexa:replica:1'   | <xs:complexType name='A'><xs:sequence><xs:element name='b' type='c:Existing'/></xs:sequence></xs:complexType> | kept: A: b Relationship! [Existing],
        ``                                | <xs:complexType name='A'><xs:annotation><xs:documentation>Parts &amp; <![CDATA[more]]></xs:documentation></xs:annotation></xs:complexType> | `kept: A "Parts & more":`
        ``                                | seq: <xs:element name='n' type='xs:int'><xs:annotation><xs:documentation> a count </xs:documentation></xs:annotation></xs:element> | `kept: P: n Integer! " a count ",`
        ``                                | seq: <xs:element name='m' type='xs:int' minOccurs='0' maxOccurs='unbounded' nillable='true'/><xs:element name='k' type='xs:int' maxOccurs='unbounded' nillable='false'/> | kept: P: m Integer*, k Integer*!,
        ``                                | seq: <xs:element name='n' type='xs:int' minOccurs='1' maxOccurs='1' nillable='false'/> | kept: P: n Integer!,
        ``                                | seq: <xs:element name='n' type='xs:int' minOccurs='2' maxOccurs='5'/> | minOccurs 2 and maxOccurs 5
        ``                                | seq: <xs:element name='n' type='xs:int' minOccurs='0' maxOccurs='3'/> | minOccurs 0 and maxOccurs 3
        ``                                | seq: <xs:element name='n' type='xs:int' nillable='true'/> | is nillable but single-valued
        ``                                | <xs:annotation><xs:documentation>All</xs:documentation></xs:annotation> | xs:documentation at the top level
        ``                                | <xs:element name='r' type='Existing'><xs:annotation><xs:documentation>x</xs:documentation></xs:annotation></xs:element> | xs:documentation in the top-level element 'r'
        ``                                | seq: <xs:annotation><xs:documentation>x</xs:documentation></xs:annotation> | xs:documentation in the xs:sequence of 'P'
        ``                                | seq: <xs:element name='n'><xs:simpleType><xs:annotation><xs:documentation>x</xs:documentation></xs:annotation><xs:restriction base='xs:string'/></xs:simpleType></xs:element> | xs:documentation in the anonymous type
        ``                                | <xs:complexType name='P'><xs:annotation><xs:documentation xml:lang='en'>x</xs:documentation></xs:annotation></xs:complexType> | attribute 'xml:lang' of xs:documentation
        ``                                | <xs:complexType name='P'><xs:annotation><xs:documentation>a <b>b</b></xs:documentation></xs:annotation></xs:complexType> | element 'b' is not expected inside the xs:documentation of class 'P'
        ``                                | <xs:complexType name='P'><xs:annotation><xs:documentation>a</xs:documentation><xs:documentation>b</xs:documentation></xs:annotation></xs:complexType> | a second xs:documentation of class 'P'
        xmlns:c='urn:corvexa:replica:1'   | <xs:complexType name='P'><xs:annotation><xs:documentation>a</xs:documentation><xs:appinfo><c:class comment='b'/></xs:appinfo></xs:annotation></xs:complexType> | differs from the comment its xs:appinfo gives
        xmlns:x='urn:x'                   | seq: <xs:element name='b' type='x:Existing'/> | is in namespace 'urn:x', which neither the schemas read nor replica 'target' declare classes in
        targetNamespace='urn:p'           | <xs:complexType name='B'/><xs:complexType name='P'><xs:sequence><xs:element name='b' type='B'/></xs:sequence></xs:complexType> | is in no namespace (or the replica's own, urn:corvexa:replica:1), but the schema declares 'B' in namespace 'urn:p'
        targetNamespace='urn:p' xmlns:p='urn:p' | <xs:complexType name='P'><xs:complexContent><xs:extension base='p:Existing'/></xs:complexContent></xs:complexType> | but the class 'Existing' of replica 'target' is in no namespace
        targetNamespace='urn:p'           | <xs:complexType name='Existing'/> | this one is in namespace 'urn:p'): a replica names its classes without namespace
        """)
    void handWrittenConstructsAreKeptOrRefusedNeverDropped(String attrs, String body, String outcome) {
        Replica r = replica("target", "Existing: n Integer");
        String before = dump(r);
        String b = body.startsWith("seq: ") ? "<xs:complexType name='P'><xs:sequence>" + body.substring(5)
                + "</xs:sequence></xs:complexType>" : body;
        String xsd = "<?xml version='1.0'?>\n" + XS + " " + (attrs == null ? "" : attrs) + ">\n  " + b + "\n</xs:schema>\n";
        if (!outcome.startsWith("kept: ")) {
            failsAt(3, () -> r.insertSchemaString(xsd), outcome, "the XSD string");
            assertEquals(before, dump(r));
            return;
        }
        r.insertSchemaString(xsd);
        String expected = "Existing: n Integer,\n" + outcome.substring(6) + "\n";
        assertEquals(expected, shape(r));
        Replica back = new Replica("back");
        back.insertSchemaString(r.getXsd());
        assertEquals(expected, shape(back), "from the replica's XSD");
        assertEquals(expected, shape(Replica.getReplicaFromBinary(Replica.getBinaryFromReplica(r, true), true)));
    }

    @Test
    void propertiesFromTheAppinfoOverrideWhatTheStructureSays() {
        Replica r = new Replica("app");
        r.insertSchemaString(XS + " xmlns:c='urn:corvexa:replica:1'><xs:complexType name='P' abstract='true'>"
                + "<xs:annotation><xs:appinfo><other/><c:class persistent='false'><c:scope nameEsc='a\\u0009b'/></c:class>"
                + "</xs:appinfo></xs:annotation><xs:sequence><xs:element name='a' type='xs:string'><xs:annotation>"
                + "<xs:appinfo><c:attribute access='Read' length='-2' commentEsc='x\\\\y'/></xs:appinfo></xs:annotation>"
                + "</xs:element></xs:sequence></xs:complexType></xs:schema>");
        assertEquals("P: a String -2 \"x\\y\",\n", shape(r), "the appinfo gives every property: not abstract, a optional");
        assertFalse(r.getClassDef("P").isPersistent());
        assertArrayEquals(new String[] {"a\tb"}, r.getClassDef("P").getScopeNames());
        assertEquals("Read x\\y", r.getAttributeDef("P.a").getAccessMode() + " " + r.getAttributeDef("P.a").getQKAComment());
        failsAt(1, () -> new Replica("x").insertSchemaString(XS + " xmlns:c='urn:corvexa:replica:1'><xs:complexType"
                + " name='P'><xs:annotation><xs:appinfo><c:class commentEsc='bad \\q escape'/></xs:appinfo>"
                + "</xs:annotation></xs:complexType></xs:schema>"), "malformed escape");
    }
}
