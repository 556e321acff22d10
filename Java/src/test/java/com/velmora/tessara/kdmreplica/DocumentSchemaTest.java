package com.velmora.tessara.kdmreplica;

import static org.junit.jupiter.api.Assertions.*;

import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.stream.Stream;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.api.io.TempDir;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.Arguments;
import org.junit.jupiter.params.provider.MethodSource;

/**
 * The replica's documents validate against the XSD it writes, by the JDK's validator and by xmllint
 * ({@code -Dcorvexa.xmllint}, required); the sample's document schema is the one the replica writes.
 */
class DocumentSchemaTest {
    private static final Path EXAMPLES = Path.of(System.getProperty("corvexa.examples", "examples"));

    @TempDir
    Path dir;

    /** Rows: what, XSD, document, whether it is valid. */
    static Stream<Arguments> documents() throws Exception {
        Replica every = Fx.sample(false); // every type single and multi-valued, edge values, deleted instances
        Replica rich = Fx.richWithData(); // every type, pending changes only: writable without states
        Replica inv = Replica.readFromXmlFile(EXAMPLES.resolve("inventory.xml").toString());
        String shipped = Files.readString(EXAMPLES.resolve("inventory.xml"));
        String invXsd = Files.readString(EXAMPLES.resolve("inventory-document.xsd"));
        return Stream.of(Arguments.of("every type", rich.getXsd(), rich.getXml(false, false), true),
                Arguments.of("every type, schema embedded", rich.getXsd(), rich.getXml(true, false), true),
                Arguments.of("edge values, states", every.getXsd(), every.getXml(false, true), true),
                Arguments.of("edge values, states, schema embedded", every.getXsd(), every.getXml(true, true), true),
                Arguments.of("inventory written back", inv.getXsd(), inv.getXml(false, false), true),
                Arguments.of("inventory as shipped", invXsd, shipped, true),
                Arguments.of("inventory, a class unknown", invXsd, shipped.replace("<Bolt ", "<Screw "), false),
                Arguments.of("inventory, a text for a number", invXsd, shipped.replace(">240<", ">many<"), false));
    }

    @ParameterizedTest(name = "{0}")
    @MethodSource("documents")
    void documentsValidateAgainstTheReplicasSchema(String what, String xsd, String xml, boolean valid) throws Exception {
        String xmllint = System.getProperty("corvexa.xmllint", "");
        assertTrue(!xmllint.isEmpty() && Files.isExecutable(Path.of(xmllint)), "xmllint is required (Debian package"
                + " libxml2-utils, installed by scripts/install-deps); found: '" + xmllint + "'");
        Path s = Files.writeString(dir.resolve("schema.xsd"), xsd);
        Path d = Files.writeString(dir.resolve("document.xml"), xml);
        Process p = new ProcessBuilder(xmllint, "--noout", "--nonet", "--schema", s.toString(), d.toString())
                .redirectErrorStream(true).start();
        String out = new String(p.getInputStream().readAllBytes(), StandardCharsets.UTF_8);
        assertEquals(valid, p.waitFor() == 0, () -> "xmllint on " + what + ":\n" + out);
        if (valid) {
            Fx.validate(xsd, xml);
        } else {
            assertThrows(org.xml.sax.SAXException.class, () -> Fx.validate(xsd, xml));
        }
    }

    @Test
    void theSamplesDocumentSchemaIsWhatTheReplicaWritesForItsClassSchema() throws Exception {
        Replica r = new Replica("inventory");
        r.insertSchemaFile(EXAMPLES.resolve("inventory.xsd").toString());
        assertEquals(Files.readString(EXAMPLES.resolve("inventory-document.xsd")), r.getXsd(),
                "examples/inventory-document.xsd is out of date: write it again from the replica's getXsd()");
    }
}
