package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.*;
import static org.junit.jupiter.api.Assertions.*;

import java.nio.file.Files;
import java.nio.file.Path;
import java.util.*;
import java.util.function.Consumer;
import java.util.stream.Stream;
import org.junit.jupiter.api.*;
import org.junit.jupiter.api.function.Executable;
import org.junit.jupiter.api.io.TempDir;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.Arguments;
import org.junit.jupiter.params.provider.CsvSource;
import org.junit.jupiter.params.provider.MethodSource;

/**
 * Hostile and bad inputs: refused with an exception that names the line, column and offending
 * name; nothing is read from disk or the network; the replica is unchanged.
 */
@TestInstance(TestInstance.Lifecycle.PER_CLASS)
class XmlHostileTest {
    private static final String SECRET = "TOP-SECRET-42";
    private static final String ROOT = "<replica xmlns=\"urn:corvexa:replica:1\"";
    private static final String XSI = " xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\"";

    @TempDir
    static Path dir;
    private Fx.Listener net;
    private Path secret;
    private Replica target;
    private String before;

    @BeforeAll
    void listen() throws Exception {
        net = new Fx.Listener();
        secret = write(dir.resolve("secret.txt"), SECRET);
    }

    @BeforeEach
    void setUp() {
        target = new Replica("target");
        Model part = addClass(target, "Part", null);
        addAttr(part, "qty", AttributeType.Integer, false);
        addAttr(part, "name", AttributeType.String, false);
        addAttr(part, "tags", AttributeType.String, true);
        addAttr(part, "peer", AttributeType.Relationship, false).setTargetNames(new String[] {"Part"});
        addClass(target, "Other", null);
        Instance p = part.createInstance();
        p.setID("p0");
        p.setValue("qty", 1);
        before = dump(target);
        Replica.setSchemaFolder(dir.toString()); // string documents may name schemas here
    }

    @AfterEach
    void tearDown() {
        Replica.setFeature("validate", false);
        Replica.setFeature("indent", true);
        Replica.setSchemaLocation(null);
        Replica.setSchemaFolder(null);
        assertEquals(0, net.connections(), "nothing may be fetched from the network");
        assertEquals(before, dump(target), "the replica is unchanged");
    }

    @AfterAll
    void close() throws Exception {
        net.close();
    }

    /** The ways a text reaches the package, by name: documents, schemas, from strings and from files. */
    private Consumer<String> reader(String name) {
        Path file = dir.resolve("sub").resolve(name.startsWith("schema") ? "s.xsd" : "doc.xml");
        Consumer<String> toFile = text -> write(file, text);
        switch (name) {
            case "populate":
                return target::populatesFromXmlString;
            case "read":
                return Replica::readFromXmlString;
            case "populateFile":
                return toFile.andThen(x -> target.populatesFromXmlFile(file.toString()));
            case "readFile":
                return toFile.andThen(x -> Replica.readFromXmlFile(file.toString()));
            case "schema":
                return target::insertSchemaString;
            default:
                return toFile.andThen(x -> target.insertSchemaFile(file.toString()));
        }
    }

    private static String schemaWith(String construct) {
        return "<xs:schema xmlns:xs=\"http://www.w3.org/2001/XMLSchema\">\n" + construct
                + "\n<xs:complexType name=\"New\"/></xs:schema>";
    }

    private static Arguments row(String readers, String doc, String... fragments) {
        return Arguments.of(readers, doc, fragments);
    }

    /** readers, document (refused at line 2), message fragments. */
    Stream<Arguments> refusedUnread() {
        String fileUrl = secret.toUri().toString();
        Path xsd = write(dir.resolve("target.xsd"), target.getXsd());
        String laughs = "<!ENTITY a \"ha\">";
        for (char c = 'b'; c <= 'i'; c++) {
            laughs += "<!ENTITY " + c + " \"" + ("&" + (char) (c - 1) + ";").repeat(10) + "\">";
        }
        List<Arguments> rows = new ArrayList<>();
        for (String d : new String[] {"[<!ENTITY x SYSTEM \"" + fileUrl + "\">]", "[<!ENTITY x SYSTEM \"" + net.url("xxe")
            + "\">]", "SYSTEM \"" + net.url("ext.dtd") + "\"", "PUBLIC \"-//X//Y\" \"" + fileUrl + "\"",
            "[<!ENTITY % p SYSTEM \"" + net.url("p") + "\"> %p;]", "[" + laughs + "]", ""}) {
            rows.add(row("populate read populateFile readFile schema", "<?xml version=\"1.0\"?>\n<!DOCTYPE replica " + d
                    + ">\n" + ROOT + "><Part><name>&x;&i;</name></Part></replica>", "DOCTYPE", "refused"));
        }
        // entity references without a DOCTYPE; the document names a local schema to get past its root
        rows.add(row("populate read populateFile readFile", ROOT + XSI + " xsi:schemaLocation=\"urn:corvexa:replica:1 "
                + xsd.toUri() + "\">\n<Part><name>&x;</name></Part></replica>", "not well-formed", "'&x;'", "undeclared"));
        rows.add(row("schema", schemaWith("<xs:annotation><xs:appinfo>&x;</xs:appinfo></xs:annotation>"),
                "not well-formed", "'&x;'"));
        // schemas importing from the network or from files elsewhere, given as text, embedded or as a file
        for (String construct : new String[] {"<xs:import namespace=\"urn:x\" schemaLocation=\"" + net.url("x.xsd") + "\"/>",
            "<xs:include schemaLocation=\"" + net.url("y.xsd") + "\"/>",
            "<xs:import namespace=\"urn:x\" schemaLocation=\"" + secret + "\"/>"}) {
            rows.add(row("schema", schemaWith(construct), "refused", "nothing was read"));
            rows.add(row("read", ROOT + ">" + schemaWith(construct) + "</replica>", "refused"));
        }
        rows.add(row("schemaFile", schemaWith("<xs:include schemaLocation=\"" + net.url("y.xsd") + "\"/>"), "refused",
                "nothing was fetched"));
        rows.add(row("schemaFile", schemaWith("<xs:include schemaLocation=\"../secret.txt\"/>"), "'../secret.txt'",
                "outside the directory", "nothing was read"));
        // without a schema, a URL is refused unread; a location for another namespace is no schema at all
        String located = ROOT + XSI + "\n xsi:schemaLocation=\"";
        rows.add(row("read", located + "urn:corvexa:replica:1 " + net.url("a.xsd") + "\"/>", "is not a local file",
                net.url("a.xsd"), "nothing was fetched"));
        rows.add(row("read", located + "urn:other " + secret + "\"/>", "has no schema"));
        return rows.stream();
    }

    @ParameterizedTest(name = "[{index}] {0}: {2}")
    @MethodSource("refusedUnread")
    void hostileDocumentsAreRefusedUnread(String readers, String doc, String[] fragments) {
        for (String name : readers.split(" ")) {
            for (boolean validate : new boolean[] {false, true}) {
                Replica.setFeature("validate", validate);
                XmlDocumentException e = failsAt(2, () -> reader(name).accept(doc), fragments);
                assertFalse(e.getMessage().contains(SECRET) || e.getMessage().contains("FETCHED"), e.getMessage());
            }
        }
    }

    @Test
    void schemaLocationsElsewhereAreNotUsedWhenTheSchemaIsKnown() throws Exception {
        String xsd = target.getXsd();
        String embedded = ROOT + XSI + "\n xsi:schemaLocation=\"urn:corvexa:replica:1 " + net.url("a.xsd") + " urn:other "
                + secret.toUri() + "\" xsi:noNamespaceSchemaLocation=\"" + net.url("b.xsd") + "\">\n";
        Replica.setFeature("validate", true);
        Replica fresh = Replica.readFromXmlString(embedded + xsd.substring(xsd.indexOf("<xs:schema"))
                + "<Part><qty>2</qty></Part></replica>");
        assertEquals(2, fresh.getModels().getItem("Part").getInstances().getItem(0).getValue("qty"));
        assertEquals(net.url("a.xsd"), fresh.getSchemaLocation());
        Replica copy = new Replica("copy");
        copy.insertSchemaString(xsd);
        copy.populatesFromXmlString(embedded + "<Part><qty>3</qty></Part></replica>");
        assertEquals(1, copy.getModels().getItem("Part").getInstances().getCount());
        // from a schema file, a local file next to it is read as a schema: the fault is reported in that file unquoted
        Path file = write(dir.resolve("s.xsd"), schemaWith("<xs:import namespace=\"urn:x\" schemaLocation=\"" + secret
                + "\"/>"));
        XmlDocumentException e = failsAt(1, () -> target.insertSchemaFile(file.toString()), "not well-formed");
        assertEquals("XSD file '" + secret.toRealPath() + "'", e.getSource());
        assertFalse(e.getMessage().contains(SECRET), e.getMessage());
    }

    @Test
    void everyTruncationOfADocumentFailsCleanly() throws Exception {
        Replica.setFeature("indent", false);
        Instance x = target.getModels().getItem("Part").getInstances().getItem(0);
        target.getModels().getItem("Part").createInstance().setValue("peer", x);
        x.setValue("tags", new String[] {"a", "b\u0001"});
        String xml = target.getXml(true, true);
        Replica copy = new Replica("copy");
        copy.insertSchemaString(target.getXsd());
        String copyBefore = dump(copy);
        for (int n = 0; n < xml.lastIndexOf('>'); n += 1 + n / 200) {
            String cut = xml.substring(0, n);
            assertThrows(XmlDocumentException.class, () -> Replica.readFromXmlString(cut), () -> "prefix of " + cut.length());
            XmlDocumentException d = assertThrows(XmlDocumentException.class, () -> copy.populatesFromXmlString(cut));
            assertTrue(d.getLine() > 0 || n == 0, d.getMessage());
            assertEquals(copyBefore, dump(copy));
        }
        Replica.readFromXmlString(xml);
        target.getModels().getItem("Part").getInstances().remove(1);
        target.getModels().getItem("Part").getInstances().getItem(0).clearValue("tags");
    }

    /** Documents after a first good instance: line of the fault, body ('~' a line break), fragments (';' between). */
    @ParameterizedTest(name = "{1}")
    @CsvSource(delimiter = '|', quoteCharacter = '`', textBlock = """
        3 | <Part><qty>five</qty></Part>                    | 'five';'Part.qty';not an Integer
        3 | <Part><qty>99999999999</qty></Part>             | 'Part.qty';outside the range
        4 | <Part>~<qty><b/></qty></Part>                   | 'b';'Part.qty'
        3 | <Pert/>                                         | unknown class 'Pert'
        3 | <Part><wieght>1</wieght></Part>                 | no attribute 'wieght'
        3 | <Part id="a"/>                                  | identifier "a"
        3 | <Part id="p0"/>                                 | identifier "p0"
        3 | <Part key="k1"/>                                | key 'k1' is used twice
        4 | <Part>~<peer ref="k9"/></Part>                  | 'Part.peer';key 'k9'
        4 | <Other key="o"/><Part>~<peer ref="o"/></Part>   | 'Part.peer';class 'Other';target class [Part]
        4 | <Part><qty>1</qty>~<qty>2</qty></Part>          | 'Part.qty' is single-valued
        4 | <Part><peer ref="k1"/>~<peer ref="k1"/></Part>  | 'Part.peer' is single-valued
        4 | <Part>~<name xsi:nil="true"/></Part>            | 'Part.name' is single-valued;xsi:nil
        4 | <Part><tags>a</tags>~<tags xsi:nil="true"/></Part> | 'Part.tags';xsi:nil
        4 | <Part>~<name esc="bad\\x"/></Part>              | 'Part.name';malformed escape
        4 | <Part>~<name color="red">x</name></Part>        | 'color';'Part.name'
        3 | <Part state="gone"/>                            | state 'gone'
        3 | <Part idBin="%%%"/>                             | idBin;'%%%'
        3 | <Part>text</Part>                               | unexpected text 'text'
        3 | <x:Part xmlns:x="urn:elsewhere"/>               | 'x:Part';urn:elsewhere
        1 | <replica format="2" xmlns="urn:corvexa:replica:1"/> | format '2'
        4 | </replica>~<more/>                              | not well-formed
        1 | <replika xmlns="urn:corvexa:replica:1"/>        | 'replika'
        3 | <Part><qty>1</qty></Parts>                      | not well-formed;'</Parts>'
        4 | <Part>~<qty>1</qty></Pxrt>                      | not well-formed;'</Pxrt>'
        3 | <Part key="a" key="b"/>                         | not well-formed;attribute 'key' appears twice in element 'Part'
        3 | <y:Part/>                                       | prefix 'y';'y:Part';not bound
        3 | <Part><qty y:n="1">1</qty>~</Part>              | prefix 'y';'y:n';'qty';not bound
        """)
    void badDocumentsNameTheLineColumnAndOffendingName(int line, String body, String fragments) {
        String doc = body.startsWith("<repli") ? body : ROOT + XSI + ">\n<Part key=\"k1\" id=\"a\"><qty>5</qty></Part>\n"
                + body.replace('~', '\n') + "\n</replica>";
        String[] f = fragments.split(";");
        failsAt(line, () -> target.populatesFromXmlString(doc), f);
        Path file = write(dir.resolve("bad.xml"), doc);
        XmlDocumentException e = failsAt(line, () -> target.populatesFromXmlFile(file.toString()), f);
        assertTrue(e.getMessage().startsWith("XML file '" + file) && e.getSource().contains("bad.xml"), e.getMessage());
    }

    @Test
    void inputsThatAreNotXmlAtAllFailClearly() throws Exception {
        for (String doc : new String[] {"", "   ", "not xml", "<", "\u0000", "<replica xmlns='urn:corvexa:replica:1'>"}) {
            IllegalArgumentException e = assertThrows(XmlDocumentException.class, () -> target.populatesFromXmlString(doc));
            assertTrue(e.getMessage().startsWith("the XML string"), e.getMessage());
        }
        Path bin = Files.write(dir.resolve("bin.xml"), new byte[] {(byte) 0xff, (byte) 0xfe, 0, 0, 0x3c, 0x00, (byte) 0xc3,
            0x28});
        assertThrows(XmlDocumentException.class, () -> target.populatesFromXmlFile(bin.toString()));
        throwsWith(IllegalArgumentException.class, () -> target.populatesFromXmlFile(dir.resolve("none.xml").toString()),
                "none.xml", "NoSuchFile");
        assertThrows(IllegalArgumentException.class, () -> target.populatesFromXmlString(null));
        assertThrows(IllegalArgumentException.class, () -> Replica.readFromXmlFile(null));
        assertThrows(IllegalArgumentException.class, () -> target.insertSchemaString(null));
        // directories and devices are refused unopened (a pipe would block, a device may never end)
        for (Executable read : new Executable[] {() -> target.populatesFromXmlFile(dir.toString()),
            () -> Replica.readFromXmlFile("/dev/zero"), () -> target.insertSchemaFile(dir.toString())}) {
            throwsWith(IllegalArgumentException.class, read, "is not a regular file");
        }
    }
}
