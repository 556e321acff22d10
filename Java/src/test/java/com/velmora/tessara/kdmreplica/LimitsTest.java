package com.velmora.tessara.kdmreplica;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.concurrent.TimeUnit;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.Timeout;
import org.junit.jupiter.api.io.TempDir;

/**
 * What a document may cost: each limit refuses the first input past it, naming the limit, and
 * lets the same input through once raised; schema locations stay in their folders; super class
 * chains are bounded; commit refuses what the readers let in.
 */
class LimitsTest {
    private static final String NS = "urn:corvexa:replica:1";
    private static final String XSD = "<xs:schema xmlns:xs='http://www.w3.org/2001/XMLSchema' xmlns='" + NS
            + "' targetNamespace='" + NS + "' elementFormDefault='qualified'>";
    private static final String PART = XSD + "<xs:complexType name='P'><xs:sequence><xs:element name='s'"
            + " minOccurs='0'><xs:simpleType><xs:restriction base='xs:string'><xs:maxLength value='5'/>"
            + "</xs:restriction></xs:simpleType></xs:element><xs:element name='r' type='P' minOccurs='0'/>"
            + "</xs:sequence></xs:complexType><xs:complexType name='Q'/></xs:schema>";

    @TempDir
    Path dir;

    @AfterEach
    void restore() {
        defaults();
    }

    private static void defaults() {
        for (String[] d : new String[][] {{"maxDocumentSize", "1073741824"}, {"maxElementDepth", "256"},
            {"maxNamespaceDeclarations", "100"}, {"maxAttributeLength", "1048576"}, {"maxTextLength", "268435456"},
            {"maxInflatedSize", "1073741824"}, {"maxInflateRatio", "200"}}) {
            Replica.setLimit(d[0], Long.parseLong(d[1]));
        }
        Replica.setSchemaFolder(null);
    }

    private static String doc(String inner) {
        return "<replica xmlns='" + NS + "'>" + inner + "</replica>";
    }

    /** Refused at {@code limit}, naming it; accepted once it is {@code enough}. */
    private static void limited(String limit, long low, long enough, Runnable read) {
        Replica.setLimit(limit, low);
        IllegalArgumentException e = assertThrows(IllegalArgumentException.class, read::run, limit);
        assertTrue(e.getMessage().contains("past the limit " + limit + " = " + low), e.getMessage());
        Replica.setLimit(limit, enough);
        read.run();
        defaults();
    }

    @Test
    void eachLimitRefusesTheFirstInputPastItAndNamesIt() throws Exception {
        Replica r = new Replica();
        r.insertSchemaString(PART);
        String nested = doc("<P><s>ab</s></P>"); // depth 3
        limited("maxElementDepth", 2, 3, () -> r.populatesFromXmlString(nested));
        limited("maxDocumentSize", 40, nested.length(), () -> r.populatesFromXmlString(nested));
        String spaced = "<replica xmlns='" + NS + "' xmlns:a='a' xmlns:b='b'><P/></replica>";
        limited("maxNamespaceDeclarations", 2, 3, () -> r.populatesFromXmlString(spaced));
        limited("maxAttributeLength", 10, 21, () -> r.populatesFromXmlString(doc("<P id='" + "i".repeat(21) + "'/>")));
        for (String text : new String[] {"<s>abc&amp;</s>", "<s><![CDATA[abcde]]></s>"}) {
            limited("maxTextLength", 7, 16, () -> r.populatesFromXmlString(doc("<P>" + text + "</P>")));
        }
        // a file in UTF-16 is scanned in its own units, and its size is checked before it is read
        Path f = dir.resolve("wide.xml");
        Files.write(f, ("\uFEFF" + spaced).getBytes(StandardCharsets.UTF_16LE));
        limited("maxNamespaceDeclarations", 2, 3, () -> r.populatesFromXmlFile(f.toString()));
        limited("maxDocumentSize", Files.size(f) - 1, Files.size(f), () -> r.populatesFromXmlFile(f.toString()));

        Replica big = new Replica();
        big.insertSchemaString(PART);
        for (int i = 0; i < 2000; i++) {
            big.getModels().getItem("P").createInstance().setValue("s", "abcde");
        }
        byte[] packed = Replica.getBinaryFromReplica(big, true);
        limited("maxInflatedSize", 1000, 1 << 20, () -> Replica.getReplicaFromBinary(packed, true));
        Replica.setLimit("maxInflateRatio", 1); // under the 64 MiB floor the ratio is not applied
        Replica.getReplicaFromBinary(packed, true);

        assertThrows(IllegalArgumentException.class, () -> Replica.setLimit("maxDepth", 1));
        assertThrows(IllegalArgumentException.class, () -> Replica.setLimit("maxTextLength", 0));
        Replica.setLimit("maxInflatedSize", 1L << 33);
        assertEquals(1L << 33, Replica.getLimit("maxInflatedSize"));
    }

    @Test
    @Timeout(value = 20, unit = TimeUnit.SECONDS)
    void schemaLocationsAreReadOnlyFromTheDocumentsFolderOrTheSchemaFolder() throws Exception {
        Path docs = Files.createDirectories(dir.resolve("docs"));
        Path other = Files.createDirectories(dir.resolve("other"));
        Files.writeString(docs.resolve("s.xsd"), PART);
        Files.writeString(other.resolve("s.xsd"), PART);
        Files.createSymbolicLink(docs.resolve("link.xsd"), other.resolve("s.xsd"));
        new ProcessBuilder("mkfifo", docs.resolve("fifo.xsd").toString()).start().waitFor();
        String[] refused = {"../other/s.xsd", other.resolve("s.xsd").toString(), "file://" + other.resolve("s.xsd"),
            "link.xsd", "fifo.xsd", "missing.xsd", "../other/missing.xsd", "/proc/self/environ"};
        for (String loc : refused) {
            Path f = docs.resolve("d.xml");
            Files.writeString(f, "<replica xmlns='" + NS + "' xmlns:xsi='http://www.w3.org/2001/XMLSchema-instance'"
                    + " xsi:schemaLocation='" + NS + " " + loc + "'/>");
            IllegalArgumentException e = assertThrows(IllegalArgumentException.class,
                    () -> Replica.readFromXmlFile(f.toString()), loc);
            // the same words whether the file exists or not, and whatever it is
            assertTrue(e.getMessage().endsWith("is refused: only a regular file in '" + docs
                    + "' is read as a document's schema"), e.getMessage());
        }
        String stringDoc = "<replica xmlns='" + NS + "' xmlns:xsi='http://www.w3.org/2001/XMLSchema-instance'"
                + " xsi:schemaLocation='" + NS + " s.xsd'/>";
        assertTrue(assertThrows(IllegalArgumentException.class, () -> Replica.readFromXmlString(stringDoc))
                .getMessage().contains("reads no schema file unless a schema folder is set"));
        Replica.setSchemaFolder(other.toString());
        assertEquals(other.toString(), Replica.getSchemaFolder());
        assertEquals(2, Replica.readFromXmlString(stringDoc).getModels().getCount());
        Path f = docs.resolve("d.xml");
        Files.writeString(f, stringDoc.replace(" s.xsd", " " + other.resolve("s.xsd")));
        assertEquals(2, Replica.readFromXmlFile(f.toString()).getModels().getCount(), "the folder widens files too");
    }

    @Test
    void superClassChainsAreBoundedAndTheirFaultsShort() {
        StringBuilder b = new StringBuilder(XSD).append("<xs:complexType name='C0'/>");
        for (int i = 1; i <= BinaryCodec.MAX_SUPER_DEPTH; i++) {
            b.append("<xs:complexType name='C").append(i).append("'><xs:complexContent><xs:extension base='C")
                    .append(i - 1).append("'/></xs:complexContent></xs:complexType>");
        }
        String chain = b.toString();
        String longest = chain.substring(0, chain.lastIndexOf("<xs:complexType")) + "</xs:schema>";
        new Replica().insertSchemaString(longest);
        String e = assertThrows(IllegalArgumentException.class,
                () -> new Replica().insertSchemaString(chain + "</xs:schema>")).getMessage();
        assertTrue(e.contains("is longer than " + BinaryCodec.MAX_SUPER_DEPTH + " classes"), e);
        String cycle = longest.replace("<xs:complexType name='C0'/>", "<xs:complexType name='C0'><xs:complexContent>"
                + "<xs:extension base='C999'/></xs:complexContent></xs:complexType>");
        e = assertThrows(IllegalArgumentException.class, () -> new Replica().insertSchemaString(cycle)).getMessage();
        assertTrue(e.contains("cyclic super class chain: C0 -> C999 -> C998") && e.length() < 300, e);
    }

    @Test
    void commitRefusesWhatAReaderLetIn() {
        Replica r = new Replica();
        r.insertSchemaString(PART);
        r.populatesFromXmlString(doc("<P><s>123456789</s></P>"));
        String e = assertThrows(ReplicaCommitException.class, r::commit).getMessage();
        assertTrue(e.contains("'P.s' holds at most 5 characters but has a value of 9"), e);
    }

    @Test
    void byteOrderMarksAreReadAndXml11IsNamed() {
        String xml = new Replica("bom").getXml(true);
        assertEquals("bom", Replica.readFromXmlString("\uFEFF" + xml).getName());
        String e = assertThrows(IllegalArgumentException.class,
                () -> Replica.readFromXmlString(xml.replaceFirst("version=\"1.0\"", "version=\"1.1\""))).getMessage();
        assertTrue(e.contains("the document is XML 1.1; only XML 1.0 documents are read"), e);
    }
}
