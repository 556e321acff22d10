package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.Fx.addAttr;
import static com.velmora.tessara.kdmreplica.Fx.addClass;
import static com.velmora.tessara.kdmreplica.Fx.throwsWith;
import static com.velmora.tessara.kdmreplica.Fx.dump;
import static com.velmora.tessara.kdmreplica.Fx.failsAt;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertFalse;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;
import static org.junit.jupiter.api.Assumptions.assumeTrue;

import java.io.File;
import java.io.IOException;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.nio.file.Paths;
import java.util.List;
import java.util.function.Consumer;
import java.util.stream.Stream;
import java.util.ArrayList;
import org.junit.jupiter.api.AfterAll;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.BeforeAll;
import org.junit.jupiter.api.BeforeEach;
import org.junit.jupiter.api.TestInstance;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.Timeout;
import org.junit.jupiter.api.function.Executable;
import org.junit.jupiter.api.io.TempDir;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.Arguments;
import org.junit.jupiter.params.provider.MethodSource;

/**
 * Hostile and bad inputs: refused with an exception that names the line, column and offending
 * name; nothing is read from disk or the network; the replica is unchanged.
 */
@TestInstance(TestInstance.Lifecycle.PER_CLASS)
class XmlHostileTest {
    private static final String SECRET = "TOP-SECRET-42";
    private static final String ROOT = "<replica xmlns=\"urn:corvexa:replica:1\"";

    @TempDir
    static Path dir;
    private Fx.Listener net;
    private Path secret;
    private Replica target;
    private String before;

    @BeforeAll
    void listen() throws Exception {
        net = new Fx.Listener();
        secret = dir.resolve("secret.txt");
        Files.write(secret, SECRET.getBytes(StandardCharsets.US_ASCII));
    }

    @BeforeEach
    void setUp() throws Exception {
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
    }

    @AfterEach
    void tearDown() throws Exception {
        Replica.setFeature("validate", false);
        Replica.setSchemaLocation(null);
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

    private static void write(Path p, String text) {
        try {
            Files.createDirectories(p.getParent());
            Files.write(p, text.getBytes(StandardCharsets.UTF_8));
        } catch (java.io.IOException e) {
            throw new IllegalStateException(e);
        }
    }

    private static String schemaWith(String construct) {
        return "<xs:schema xmlns:xs=\"http://www.w3.org/2001/XMLSchema\">\n" + construct
                + "\n<xs:complexType name=\"New\"/></xs:schema>";
    }

    /** readers, document, line, message fragments. */
    Stream<Arguments> refusedUnread() throws Exception {
        String all = "populate read populateFile readFile schema";
        String fileUrl = secret.toUri().toString();
        Path xsd = dir.resolve("target.xsd");
        write(xsd, target.getXsd());
        List<Arguments> rows = new ArrayList<>();
        for (String d : new String[] {
            "<!DOCTYPE replica [<!ENTITY x SYSTEM \"" + fileUrl + "\">]>", // XXE by file and by http
            "<!DOCTYPE replica [<!ENTITY x SYSTEM \"" + net.url("xxe") + "\">]>",
            "<!DOCTYPE replica SYSTEM \"" + net.url("ext.dtd") + "\">", // external DTD, external parameter entity
            "<!DOCTYPE replica PUBLIC \"-//X//Y\" \"" + fileUrl + "\">",
            "<!DOCTYPE replica [<!ENTITY % p SYSTEM \"" + net.url("p") + "\"> %p;]>",
            "<!DOCTYPE replica [<!ENTITY a \"ha\"><!ENTITY b \"&a;&a;&a;&a;&a;&a;&a;&a;&a;&a;\">" // billion laughs
                + "<!ENTITY c \"&b;&b;&b;&b;&b;&b;&b;&b;&b;&b;\"><!ENTITY d \"&c;&c;&c;&c;&c;&c;&c;&c;&c;&c;\">"
                + "<!ENTITY e \"&d;&d;&d;&d;&d;&d;&d;&d;&d;&d;\"><!ENTITY f \"&e;&e;&e;&e;&e;&e;&e;&e;&e;&e;\">"
                + "<!ENTITY g \"&f;&f;&f;&f;&f;&f;&f;&f;&f;&f;\"><!ENTITY h \"&g;&g;&g;&g;&g;&g;&g;&g;&g;&g;\">"
                + "<!ENTITY i \"&h;&h;&h;&h;&h;&h;&h;&h;&h;&h;\">]>",
            "<!DOCTYPE replica>"}) {
            rows.add(Arguments.of(all, "<?xml version=\"1.0\"?>\n" + d + "\n" + ROOT + "><Part><name>&x;&i;</name></Part>"
                    + "</replica>", 2, new String[] {"DOCTYPE", "refused"}));
        }
        // entity references without a DOCTYPE; the document names a local schema to get past its root
        rows.add(Arguments.of("populate read populateFile readFile", ROOT
                + " xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\" xsi:schemaLocation=\"urn:corvexa:replica:1 "
                + xsd.toUri() + "\">\n<Part><name>&x;</name></Part></replica>", 2,
                new String[] {"not well-formed", "'&x;'", "undeclared"}));
        rows.add(Arguments.of("schema", schemaWith("<xs:annotation><xs:documentation>&x;</xs:documentation>"
                + "</xs:annotation>"), 2, new String[] {"not well-formed", "'&x;'"}));
        // schemas importing from the network or from files elsewhere, given as text, embedded or as a file
        for (String construct : new String[] {
            "<xs:import namespace=\"urn:x\" schemaLocation=\"" + net.url("x.xsd") + "\"/>",
            "<xs:include schemaLocation=\"" + net.url("y.xsd") + "\"/>",
            "<xs:import namespace=\"urn:x\" schemaLocation=\"" + secret + "\"/>"}) {
            rows.add(Arguments.of("schema", schemaWith(construct), 2, new String[] {"refused", "nothing was read"}));
            rows.add(Arguments.of("read", ROOT + ">" + schemaWith(construct) + "</replica>", 2,
                    new String[] {"refused"}));
        }
        rows.add(Arguments.of("schemaFile", schemaWith("<xs:include schemaLocation=\"" + net.url("y.xsd") + "\"/>"), 2,
                new String[] {"refused", "nothing was fetched"}));
        rows.add(Arguments.of("schemaFile", schemaWith("<xs:include schemaLocation=\"../secret.txt\"/>"), 2,
                new String[] {"'../secret.txt'", "outside the directory", "nothing was read"}));
        // without a schema, a URL is refused unread; a location for another namespace is no schema at all
        String located = ROOT + " xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\"\n xsi:schemaLocation=\"";
        rows.add(Arguments.of("read", located + "urn:corvexa:replica:1 " + net.url("a.xsd") + "\"/>", 2,
                new String[] {"is not a local file", net.url("a.xsd"), "nothing was fetched"}));
        rows.add(Arguments.of("read", located + "urn:other " + secret + "\"/>", 2, new String[] {"has no schema"}));
        return rows.stream();
    }

    @ParameterizedTest(name = "[{index}] {0}: {3}")
    @MethodSource("refusedUnread")
    void hostileDocumentsAreRefusedUnread(String readers, String doc, int line, String[] fragments) {
        for (String name : readers.split(" ")) {
            for (boolean validate : new boolean[] {false, true}) {
                Replica.setFeature("validate", validate);
                XmlDocumentException e = failsAt(line, () -> reader(name).accept(doc), fragments);
                assertFalse(e.getMessage().contains(SECRET) || e.getMessage().contains("FETCHED"), e.getMessage());
            }
        }
    }

    @Test
    void schemaLocationsElsewhereAreNotUsedWhenTheSchemaIsKnown() throws Exception {
        String xsd = target.getXsd();
        String embedded = ROOT + " xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\"\n"
                + " xsi:schemaLocation=\"urn:corvexa:replica:1 " + net.url("a.xsd") + " urn:other " + secret.toUri()
                + "\" xsi:noNamespaceSchemaLocation=\"" + net.url("b.xsd") + "\">\n";
        Replica.setFeature("validate", true);
        Replica fresh = Replica.readFromXmlString(embedded + xsd.substring(xsd.indexOf("<xs:schema"))
                + "<Part><qty>2</qty></Part></replica>");
        assertEquals(2, fresh.getModels().getItem("Part").getInstances().getItem(0).getValue("qty"));
        assertEquals(net.url("a.xsd"), fresh.getSchemaLocation());
        Replica copy = new Replica("copy");
        copy.insertSchemaString(xsd);
        copy.populatesFromXmlString(embedded + "<Part><qty>3</qty></Part></replica>");
        assertEquals(1, copy.getModels().getItem("Part").getInstances().getCount());
        // from a schema file, a local file next to it is read as a schema: the fault is reported
        // in that file without quoting it
        Path file = dir.resolve("s.xsd");
        write(file, schemaWith("<xs:import namespace=\"urn:x\" schemaLocation=\"" + secret + "\"/>"));
        XmlDocumentException e = failsAt(1, () -> target.insertSchemaFile(file.toString()), "not well-formed");
        assertEquals("XSD file '" + secret.toRealPath() + "'", e.getSource());
        assertFalse(e.getMessage().contains(SECRET), e.getMessage());
    }

    private String goodDocument() {
        return target.getXml(false, true);
    }

    @Test
    void everyTruncationOfADocumentFailsCleanly() throws Exception {
        Replica.setFeature("indent", false);
        String xml;
        try {
            Instance x = target.getModels().getItem("Part").getInstances().getItem(0);
            target.getModels().getItem("Part").createInstance().setValue("peer", x);
            x.setValue("tags", new String[] {"a", "b\u0001"});
            xml = target.getXml(true, true);
        } finally {
            Replica.setFeature("indent", true);
        }
        Replica copy = new Replica("copy");
        copy.insertSchemaString(target.getXsd());
        String copyBefore = dump(copy);
        int end = xml.lastIndexOf('>');
        for (int n = 0; n < end; n += 1 + n / 200) {
            String cut = xml.substring(0, n);
            IllegalArgumentException e = assertThrows(IllegalArgumentException.class,
                    () -> Replica.readFromXmlString(cut), () -> "prefix of length " + cut.length());
            assertTrue(e instanceof XmlDocumentException, e.toString());
            XmlDocumentException d = assertThrows(XmlDocumentException.class, () -> copy.populatesFromXmlString(cut));
            assertTrue(d.getLine() > 0 || n == 0, d.getMessage());
            assertEquals(copyBefore, dump(copy));
        }
        Replica.readFromXmlString(xml);
        target.getModels().getItem("Part").getInstances().remove(1);
        target.getModels().getItem("Part").getInstances().getItem(0).clearValue("tags");
    }

    static Stream<Arguments> malformed() {
        String head = "<replica xmlns=\"urn:corvexa:replica:1\" xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\">\n"
                + "<Part key=\"k1\" id=\"a\"><qty>5</qty></Part>\n";
        return Stream.of(
                Arguments.of(head + "<Part><qty>five</qty></Part>\n</replica>", 3, new String[] {"'five'", "'Part.qty'",
                    "not an Integer"}),
                Arguments.of(head + "<Part><qty>99999999999</qty></Part>\n</replica>", 3, new String[] {"'Part.qty'",
                    "outside the range"}),
                Arguments.of(head + "<Part>\n<qty><b/></qty></Part>\n</replica>", 4, new String[] {"'b'", "'Part.qty'"}),
                Arguments.of(head + "<Pert/>\n</replica>", 3, new String[] {"unknown class 'Pert'"}),
                Arguments.of(head + "<Part><wieght>1</wieght></Part>\n</replica>", 3,
                        new String[] {"no attribute 'wieght'"}),
                Arguments.of(head + "<Part id=\"a\"/>\n</replica>", 3, new String[] {"identifier \"a\""}),
                Arguments.of(head + "<Part id=\"p0\"/>\n</replica>", 3, new String[] {"identifier \"p0\""}),
                Arguments.of(head + "<Part key=\"k1\"/>\n</replica>", 3, new String[] {"key 'k1' is used twice"}),
                Arguments.of(head + "<Part>\n<peer ref=\"k9\"/></Part>\n</replica>", 4,
                        new String[] {"'Part.peer'", "key 'k9'"}),
                Arguments.of(head + "<Other key=\"o\"/><Part>\n<peer ref=\"o\"/></Part>\n</replica>", 4,
                        new String[] {"'Part.peer'", "class 'Other'", "target class [Part]"}),
                Arguments.of(head + "<Part><qty>1</qty>\n<qty>2</qty></Part>\n</replica>", 4,
                        new String[] {"'Part.qty' is single-valued"}),
                Arguments.of(head + "<Part><peer ref=\"k1\"/>\n<peer ref=\"k1\"/></Part>\n</replica>", 4,
                        new String[] {"'Part.peer' is single-valued"}),
                Arguments.of(head + "<Part>\n<name xsi:nil=\"true\"/></Part>\n</replica>", 4,
                        new String[] {"'Part.name' is single-valued", "xsi:nil"}),
                Arguments.of(head + "<Part><tags>a</tags>\n<tags xsi:nil=\"true\"/></Part>\n</replica>", 4,
                        new String[] {"'Part.tags'", "xsi:nil"}),
                Arguments.of(head + "<Part>\n<name esc=\"bad\\x\"/></Part>\n</replica>", 4,
                        new String[] {"'Part.name'", "malformed escape"}),
                Arguments.of(head + "<Part>\n<name color=\"red\">x</name></Part>\n</replica>", 4,
                        new String[] {"'color'", "'Part.name'"}),
                Arguments.of(head + "<Part state=\"gone\"/>\n</replica>", 3, new String[] {"state 'gone'"}),
                Arguments.of(head + "<Part idBin=\"%%%\"/>\n</replica>", 3, new String[] {"idBin", "'%%%'"}),
                Arguments.of(head + "<Part>text</Part>\n</replica>", 3, new String[] {"unexpected text 'text'"}),
                Arguments.of(head + "<x:Part xmlns:x=\"urn:elsewhere\"/>\n</replica>", 3,
                        new String[] {"'x:Part'", "urn:elsewhere"}),
                Arguments.of(head.replace("<replica ", "<replica format=\"2\" "), 1, new String[] {"format '2'"}),
                Arguments.of(head + "</replica>\n<more/>", 4, new String[] {"not well-formed"}),
                Arguments.of("<replika xmlns=\"urn:corvexa:replica:1\"/>", 1, new String[] {"'replika'"}),
                Arguments.of(head + "<Part><qty>1</qty></Parts>\n</replica>", 3, new String[] {"not well-formed",
                    "'</Parts>'"}),
                Arguments.of(head + "<Part>\n<qty>1</qty></Pxrt>\n</replica>", 4, new String[] {"not well-formed",
                    "'</Pxrt>'"}),
                Arguments.of(head + "<Part key=\"a\" key=\"b\"/>\n</replica>", 3, new String[] {"not well-formed",
                    "attribute 'key' appears twice in element 'Part'"}),
                Arguments.of(head + "<y:Part/>\n</replica>", 3, new String[] {"prefix 'y'", "'y:Part'", "not bound"}),
                Arguments.of(head + "<Part><qty y:n=\"1\">1</qty>\n</Part></replica>", 3, new String[] {"prefix 'y'",
                    "'y:n'", "'qty'", "not bound"}));
    }

    @ParameterizedTest(name = "{2}")
    @MethodSource("malformed")
    void badDocumentsNameTheLineColumnAndOffendingName(String doc, int line, String[] fragments) throws Exception {
        failsAt(line, () -> target.populatesFromXmlString(doc), fragments);
        Path file = dir.resolve("bad.xml");
        write(file, doc);
        XmlDocumentException e = failsAt(line, () -> target.populatesFromXmlFile(file.toString()), fragments);
        assertTrue(e.getMessage().startsWith("XML file '" + file), e.getMessage());
        assertTrue(e.getSource().contains("bad.xml"));
    }

    @Test
    void theGoodDocumentOfThoseCasesIsAccepted() {
        Replica copy = new Replica("copy");
        copy.insertSchemaString(target.getXsd());
        copy.populatesFromXmlString(goodDocument());
        assertEquals(1, copy.getModels().getItem("Part").getInstances().getCount());
    }

    @Test
    void inputsThatAreNotXmlAtAllFailClearly() throws Exception {
        for (String doc : new String[] {"", "   ", "not xml", "<", "\u0000", "<replica xmlns='urn:corvexa:replica:1'>"}) {
            IllegalArgumentException e = assertThrows(XmlDocumentException.class,
                    () -> target.populatesFromXmlString(doc));
            assertTrue(e.getMessage().startsWith("the XML string"), e.getMessage());
        }
        Path bin = dir.resolve("bin.xml");
        Files.write(bin, new byte[] {(byte) 0xff, (byte) 0xfe, 0, 0, 0x3c, 0x00, (byte) 0xc3, 0x28});
        assertThrows(XmlDocumentException.class, () -> target.populatesFromXmlFile(bin.toString()));
        IllegalArgumentException missing = assertThrows(IllegalArgumentException.class,
                () -> target.populatesFromXmlFile(dir.resolve("none.xml").toString()));
        assertTrue(missing.getMessage().contains("none.xml") && missing.getMessage().contains("NoSuchFile"),
                missing.getMessage());
        assertThrows(IllegalArgumentException.class, () -> target.populatesFromXmlString(null));
        assertThrows(IllegalArgumentException.class, () -> Replica.readFromXmlFile(null));
        assertThrows(IllegalArgumentException.class, () -> target.insertSchemaString(null));
    }

    @Test
    @Timeout(value = 60, threadMode = Timeout.ThreadMode.SEPARATE_THREAD) // a guard: opening a pipe blocks
    void pipesDirectoriesAndDevicesAreRefusedUnopened() throws Exception {
        Path fifo = dir.resolve("fifo.xml");
        Process mkfifo;
        try {
            mkfifo = new ProcessBuilder("mkfifo", fifo.toString()).start();
        } catch (IOException e) {
            mkfifo = null;
        }
        assumeTrue(mkfifo != null && mkfifo.waitFor() == 0, "mkfifo makes the pipe");
        for (Path p : new Path[] {fifo, Files.createDirectory(dir.resolve("dir.xsd")), Paths.get("/dev/zero")}) {
            String path = p.toString();
            String doc = "<replica xmlns=\"urn:corvexa:replica:1\""
                    + " xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\""
                    + " xsi:schemaLocation=\"urn:corvexa:replica:1 " + path + "\"/>";
            // first a call that locks no replica of the test: a blocked one would hold that lock
            for (Executable read : new Executable[] {() -> Replica.readFromXmlFile(path),
                () -> Replica.readFromXmlString(doc), () -> target.populatesFromXmlFile(path),
                () -> target.insertSchemaFile(path)}) {
                throwsWith(IllegalArgumentException.class, read, "'" + path + "'", "not a regular file");
            }
        }
    }

    /** Reads by relative paths, in a process whose directory is not its user.dir (as after a native chdir). */
    static final class ReadRelative {
        public static void main(String[] args) {
            Replica r = new Replica("r");
            r.insertSchemaFile("s.xsd");
            r.populatesFromXmlFile("d.xml");
            System.out.print(r.getModels().getItem(0).getClassDef().getClassName() + " "
                    + Replica.readFromXmlFile("d.xml").getName() + " "
                    + Replica.readFromXmlString(args[0]).getModels().getItem(0).getClassDef().getClassName());
        }
    }

    @Test
    void relativePathsAreTakenFromTheProcessDirectoryNotFromUserDir() throws Exception {
        Replica.setSchemaLocation("s.xsd");
        for (String name : new String[] {"Here", "There"}) { // a schema and a document of the same names in each
            Replica r = new Replica(name);
            addClass(r, name, null);
            Path d = Files.createDirectory(dir.resolve(name));
            write(d.resolve("s.xsd"), r.getXsd());
            write(d.resolve("d.xml"), r.getXml(false));
        }
        String cp = Paths.get(Replica.class.getProtectionDomain().getCodeSource().getLocation().toURI())
                + File.pathSeparator
                + Paths.get(ReadRelative.class.getProtectionDomain().getCodeSource().getLocation().toURI());
        Process child = new ProcessBuilder(Paths.get(System.getProperty("java.home"), "bin", "java").toString(),
                "-Duser.dir=" + dir.resolve("There"), "-cp", cp, ReadRelative.class.getName(),
                Files.readString(dir.resolve("Here/d.xml"))).directory(dir.resolve("Here").toFile())
                .redirectErrorStream(true).start();
        assertEquals("Here Here Here", new String(child.getInputStream().readAllBytes(), StandardCharsets.UTF_8));
    }
}
