package com.velmora.tessara.kdmreplica;

import static org.junit.jupiter.api.Assertions.*;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import com.velmora.tessara.kdmreplica.vrattributes.Visibility;
import java.io.IOException;
import java.io.StringReader;
import java.io.UncheckedIOException;
import java.lang.management.ManagementFactory;
import java.lang.reflect.Array;
import java.net.InetAddress;
import java.net.ServerSocket;
import java.net.Socket;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.*;
import java.util.concurrent.atomic.AtomicInteger;
import javax.xml.XMLConstants;
import javax.xml.transform.stream.StreamSource;
import javax.xml.validation.SchemaFactory;
import javax.xml.validation.Validator;
import org.junit.jupiter.api.function.Executable;

/**
 * Helpers of the tests: builders; one canonical dump of a replica (schema, data and states, through
 * public members and the deleted lists, independent of every codec); a replica with every schema
 * property away from its default, and with data of every type, edge values and states; refusal checks;
 * a local listener that counts connections.
 */
final class Fx {
    private Fx() {
    }

    static Model addClass(Replica r, String name, String superName) {
        ClassDef c = new ClassDef(name);
        if (superName != null) {
            c.setSuperName(superName);
        }
        Model m = new Model(c);
        r.getModels().add(m);
        return m;
    }

    static AttributeDef addAttr(Model m, String name, AttributeType type, boolean multi) {
        AttributeDef a = new AttributeDef(name, type);
        a.setMultiValuation(multi);
        m.getClassDef().getAttributes().add(a);
        return a;
    }

    /** A replica of a compact schema: "Part: name String, tags String*; Bolt(Part): thread Integer" (* multi-valued). */
    static Replica replica(String name, String schema) {
        Replica r = new Replica(name);
        for (String c : schema.split(";")) {
            String[] head = c.split(":", 2);
            String[] n = head[0].trim().split("[()]");
            Model m = addClass(r, n[0], n.length > 1 ? n[1] : null);
            for (String a : head.length > 1 && !head[1].isBlank() ? head[1].split(",") : new String[0]) {
                String[] p = a.trim().split(" ");
                addAttr(m, p[0], AttributeType.valueOf(p[1].replace("*", "")), p[1].endsWith("*"));
            }
        }
        return r;
    }

    /** A new instance of the model with the values of the name, value pairs. */
    static Instance inst(Model m, Object... values) {
        Instance x = m.createInstance();
        for (int i = 0; i < values.length; i += 2) {
            x.setValue((String) values[i], values[i + 1]);
        }
        return x;
    }

    /** Writes a text file in UTF-8, making its directory. */
    static Path write(Path p, String text) {
        try {
            Files.createDirectories(p.getParent());
            return Files.writeString(p, text);
        } catch (IOException e) {
            throw new UncheckedIOException(e);
        }
    }

    private static void contains(String m, String... fragments) {
        for (String f : fragments) {
            assertTrue(m != null && m.contains(f), () -> "message \"" + m + "\" lacks \"" + f + "\"");
        }
    }

    /** Asserts that the call throws {@code type} and that the message contains every fragment. */
    static <T extends Throwable> T throwsWith(Class<T> type, Executable call, String... fragments) {
        T e = assertThrows(type, call);
        contains(e.getMessage(), fragments);
        return e;
    }

    /** Runs rows of {exception class, call, message fragments...}. */
    static void refusals(Object[][] rows) {
        for (Object[] row : rows) {
            throwsWith(((Class<?>) row[0]).asSubclass(Throwable.class), (Executable) row[1],
                    Arrays.copyOfRange(row, 2, row.length, String[].class));
        }
    }

    /** Asserts that two values are equal, arrays (nested ones too) by content. */
    static void same(Object expected, Object actual, String... what) {
        assertArrayEquals(new Object[] {expected}, new Object[] {actual}, String.join(" ", what));
    }

    /** Everything a replica holds, through public members (and the deleted lists), as text. */
    static String dump(Replica r) {
        StringBuilder b = new StringBuilder();
        fields(b, "replica", r.getName(), r.getSchemaLocation());
        IdentityHashMap<Instance, String> names = new IdentityHashMap<>();
        ModelSet ms = r.getModels();
        for (int i = 0; i < ms.getCount(); i++) {
            Model m = ms.getItem(i);
            for (int k = 0; k < m.getInstances().getCount(); k++) {
                names.put(m.getInstances().getItem(k), m.getClassDef().getClassName() + "#" + k);
            }
            for (int k = 0; m.deleted != null && k < m.deleted.size(); k++) {
                names.put(m.deleted.get(k), m.getClassDef().getClassName() + "~" + k);
            }
        }
        List<Instance> outside = new ArrayList<>();
        for (int i = 0; i < ms.getCount(); i++) {
            Model m = ms.getItem(i);
            ClassDef c = m.getClassDef();
            fields(b, "class", c.getClassName(), c.getSuperName(), c.getUuid(), c.getQKAComment(),
                    c.getQKADerivability(), c.getScopeNames(), c.isExtensible(), c.isAbstract(), c.isPersistent(),
                    c.getSoftwareVisibility(), c.getClassType(), c.getSchemaNamespace());
            for (int k = 0; k < c.getAttributes().getCount(); k++) {
                AttributeDef a = c.getAttributes().getItem(k);
                fields(b, " attr", a.getAttributeName(), a.getAttributeType(), a.isMultiValuated(), a.getLength(),
                        a.isMandatory(), a.isUnique(), a.getAccessMode(), a.getSoftwareVisibility(),
                        a.getAggregationType(), a.getUuid(), a.getQKAComment(), a.getTargetNames(), a.getTargetRefs());
            }
            for (int k = 0; k < m.getInstances().getCount(); k++) {
                instance(b, m.getInstances().getItem(k), names, outside);
            }
            for (int k = 0; m.deleted != null && k < m.deleted.size(); k++) {
                instance(b, m.deleted.get(k), names, outside);
            }
        }
        for (int i = 0; i < outside.size(); i++) {
            instance(b, outside.get(i), names, outside);
        }
        return b.toString();
    }

    private static void fields(StringBuilder b, String head, Object... values) {
        b.append(head);
        for (Object v : values) {
            value(b.append(' '), v, null, null);
        }
        b.append('\n');
    }

    private static void instance(StringBuilder b, Instance x, IdentityHashMap<Instance, String> names,
            List<Instance> outside) {
        b.append("  ").append(names.get(x)).append(x.isCreated() ? " C" : "").append(x.isModified() ? " M" : "")
                .append(x.isDeleted() ? " D" : "").append(" id ");
        value(b, x.getID(), names, outside);
        for (int p = 0; p < x.values.length; p++) {
            value(b.append(" | "), x.getValue(p), names, outside);
        }
        b.append('\n');
    }

    private static void value(StringBuilder b, Object v, IdentityHashMap<Instance, String> names,
            List<Instance> outside) {
        if (v == null) {
            b.append('-');
        } else if (v instanceof String) {
            b.append('"');
            for (char c : ((String) v).toCharArray()) {
                b.append(c >= 0x20 && c < 0x7F && c != '"' && c != '\\' ? String.valueOf(c) : String.format("\\u%04x", (int) c));
            }
            b.append('"');
        } else if (v instanceof Double) {
            b.append("d").append(Long.toHexString(Double.doubleToRawLongBits((Double) v)));
        } else if (v instanceof Date) {
            b.append("t").append(((Date) v).getTime());
        } else if (v instanceof byte[]) {
            b.append("x").append(HexFormat.of().formatHex((byte[]) v));
        } else if (v instanceof Instance) {
            Instance t = (Instance) v;
            if (!names.containsKey(t)) {
                names.put(t, t.getClassDef().getClassName() + "!" + outside.size());
                outside.add(t);
            }
            b.append(names.get(t));
        } else if (v.getClass().isArray()) {
            b.append('[');
            for (int i = 0; i < Array.getLength(v); i++) {
                value(b, Array.get(v, i), names, outside);
                b.append(',');
            }
            b.append(']');
        } else {
            b.append(v);
        }
    }

    /**
     * A replica with every property set away from its default (texts that XML cannot carry
     * included), a subclass listed before its super class, and no instances.
     */
    static Replica richSchema() {
        Replica r = new Replica("rich\u0001\n name");
        Model bolt = addClass(r, "Bolt", null);
        Model part = addClass(r, "Part", null);
        bolt.getClassDef().setSuperName("Part");
        Model sup = addClass(r, "Supplier_2", null);
        ClassDef c = part.getClassDef();
        c.setUuid("uuid-\t-1");
        c.setQKAComment("multi\nline\r\ncomment \\u0041 <&>\"'");
        c.setQKADerivability("deriv\u0000");
        c.setScopeNames(new String[] {"a", "", "b\ud800"});
        c.setExtensibility(true);
        c.setAbstract(true);
        c.setPersistency(false);
        c.setSoftwareVisibility(Visibility.Protected);
        c.setClassType(ClassType.Extension);
        c.setSchemaNamespace("urn:part\u0002 \ud800");
        bolt.getClassDef().setSoftwareVisibility(Visibility.Private);
        AttributeDef n = addAttr(part, "name", AttributeType.String, false);
        n.setMandatory(true);
        n.setUnicity(true);
        n.setLength(12);
        n.setAccessMode(AccessMode.Read);
        n.setSoftwareVisibility(Visibility.Private);
        n.setUuid("u\u001f");
        n.setQKAComment(" spaced ");
        AttributeDef s = addAttr(part, "supplier", AttributeType.Relationship, false);
        s.setTargetNames(new String[] {"Supplier_2", "weird\tname"});
        s.setTargetRefs(new String[] {"ref1", "\uffff"});
        s.setAggregationType(AggregationType.Composition);
        s.setAccessMode(AccessMode.Write);
        addAttr(part, "blob", AttributeType.Binary, true).setLength(4);
        addAttr(bolt, "thread", AttributeType.Integer, false).setLength(-3);
        addAttr(bolt, "grade", AttributeType.Double, true).setLength(7);
        addAttr(sup, "name", AttributeType.String, false);
        addAttr(sup, "since", AttributeType.Date, false);
        addAttr(sup, "ok", AttributeType.Boolean, true);
        return r;
    }

    /** The rich schema with pending instances: texts XML cannot carry, NaN payloads, a missing mandatory value. */
    static Replica richWithData() {
        return pending(richSchema());
    }

    private static Replica pending(Replica r) {
        Instance s = r.getModels().getItem("Supplier_2").createInstance();
        s.setValue("name", "a\u0002");
        s.setValue("since", new Date(-1));
        s.setValue("ok", new boolean[0]);
        Instance b = r.getModels().getItem("Bolt").createInstance();
        b.setID("b\n1");
        b.setValue("supplier", s);
        b.setValue("thread", 8);
        b.setValue("blob", new byte[][] {{1, 2, 3, 4}, {}});
        b.setValue("grade", new double[] {Double.NaN, Double.longBitsToDouble(0x7ff0000000000001L)});
        r.getModels().getItem("Bolt").createInstance(); // mandatory 'name' missing: still a valid document
        return r;
    }

    private static final Class<?>[] ELEMENTS = {int.class, double.class, String.class, Date.class, boolean.class,
        byte[].class, Instance.class};

    /**
     * The rich replica plus a class of every type single and multi-valued holding edge values and
     * identifiers of every kind, committed, then changed: modified, created and deleted instances
     * (composition included), live references to deleted ones, a read-only attribute with values.
     * With {@code vanished}, what only the binary forms carry: a reference to an instance removed
     * before any commit and constraints tightened past the values held (set directly: the setters
     * refuse that, but a replica read from a binary form can hold such values).
     */
    static Replica sample(boolean vanished) {
        Replica r = richSchema();
        Model all = addClass(r, "Gr\u00f6\u00dfe", null);
        for (AttributeType t : AttributeType.values()) {
            addAttr(all, "s" + t, t, false);
            addAttr(all, "m" + t, t, true).setAggregationType(AggregationType.Composition);
        }
        StringBuilder controls = new StringBuilder();
        for (char c = 0; c < 0x20; c++) {
            controls.append(c);
        }
        long year0 = -62135596800001L; // 0000-12-31T23:59:59.999Z, proleptic
        List<Instance> xs = new ArrayList<>();
        Object[][] values = {{0, 1, -1, 63, 64, -64, -65, Integer.MAX_VALUE, Integer.MIN_VALUE, 1 << 20},
            {0.0, -0.0, Double.NaN, Double.longBitsToDouble(0x7ff0000000000123L), Double.longBitsToDouble(
                0xfff8000000000000L), Double.NEGATIVE_INFINITY, Double.POSITIVE_INFINITY, Double.MIN_VALUE, -Double.MAX_VALUE,
                0.1, 1.0 / 3, 1e-310, 123456789012345680.0, -1e-300},
            {"", " lead and trail ", "a\r\nb\rc\n", "\t", controls.toString(), "\ufffe\uffff\ufffd", "lone \ud800 high",
                "lone \udc00 low", "pair \ud83d\ude00", "back\\slash \\u0041", "]]> <&> \"'", "\u0085\u2028 \u007f \u00fc"},
            {new Date(0), new Date(-1), new Date(Long.MIN_VALUE), new Date(Long.MAX_VALUE), new Date(year0),
                new Date(year0 + 1), new Date(-62135596800000L), new Date(253402300800000L), new Date(1700000000123L)},
            {true, false, false, true, true, false, true, true, true, false},
            {new byte[0], new byte[] {-1}, new byte[256], new byte[] {0}}};
        for (int i = 0; i < 256; i++) {
            ((byte[]) values[5][2])[i] = (byte) i;
        }
        for (int i = 0; i < 15; i++) {
            Instance x = all.createInstance();
            x.setID(i % 3 == 0 ? null : i % 3 == 1 ? "id" + i + (i == 4 ? "\uDBFF" : "") : new byte[] {(byte) i, -1});
            for (AttributeType t : AttributeType.values()) {
                Object[] v = t == AttributeType.Relationship ? xs.toArray() : values[t.ordinal()];
                if (v.length > 0 && i % 5 != 4) {
                    x.setValue("s" + t, v[i % v.length]);
                    Object m = Array.newInstance(ELEMENTS[t.ordinal()], i % (v.length + 1));
                    for (int k = 0; k < Array.getLength(m); k++) {
                        Array.set(m, k, v[(k + i) % v.length]);
                    }
                    x.setValue("m" + t, m);
                }
            }
            xs.add(x);
        }
        r.commit();
        xs.get(5).setValue("sInteger", 5); // modified
        all.getInstances().remove(xs.get(2)); // deleted, with the instances it composes
        all.getInstances().remove(xs.get(3)); // composing deleted ones
        all.createInstance().setID(xs.get(2).getID()); // the deleted one's identifier is free again
        all.getInstances().remove(all.createInstance()); // created then removed: forgotten
        r.getAttributeDef("mInteger").setAccessMode(AccessMode.Read); // readers fill it all the same
        if (vanished) {
            r.schemaLocation = "file:schemas/\u00e9 s.xsd"; // documents take the process-wide one
            Instance ghost = all.createInstance(); // created, referred to, removed before any commit
            xs.get(6).setValue("sRelationship", ghost);
            all.getInstances().remove(ghost);
            r.getAttributeDef("sString").length = 2;
            r.getAttributeDef("sRelationship").targetNames = new String[] {"Bolt"};
            r.getAttributeDef("sBoolean").setMandatory(true);
            r.getAttributeDef("sDate").setUnicity(true);
        }
        return pending(r);
    }

    /** Asserts that the call throws an XmlDocumentException at that line whose message holds every fragment. */
    static XmlDocumentException failsAt(int line, Executable call, String... fragments) {
        XmlDocumentException e = assertThrows(XmlDocumentException.class, call);
        String m = e.getMessage();
        if (line > 0) {
            assertEquals(line, e.getLine(), () -> "line of: " + m);
            assertTrue(m.contains("line " + line + ", column ") && e.getColumn() > 0, () -> "no line/column: " + m);
        }
        contains(m, fragments);
        return e;
    }

    /** Validates a document against a schema text with the JDK's validator, secured like the package does. */
    static void validate(String xsd, String xml) throws Exception {
        SchemaFactory f = SchemaFactory.newDefaultInstance();
        f.setFeature(XMLConstants.FEATURE_SECURE_PROCESSING, true);
        f.setProperty(XMLConstants.ACCESS_EXTERNAL_SCHEMA, "");
        f.setProperty(XMLConstants.ACCESS_EXTERNAL_DTD, "");
        Validator v = f.newSchema(new StreamSource(new StringReader(xsd))).newValidator();
        v.setProperty(XMLConstants.ACCESS_EXTERNAL_SCHEMA, "");
        v.setProperty(XMLConstants.ACCESS_EXTERNAL_DTD, "");
        v.validate(new StreamSource(new StringReader(xml)));
    }

    /** A local TCP listener that counts the connections it receives, to prove that nothing was fetched. */
    static final class Listener implements AutoCloseable {
        private final ServerSocket socket = new ServerSocket(0, 50, InetAddress.getLoopbackAddress());
        private final AtomicInteger connections = new AtomicInteger();

        Listener() throws IOException {
            Thread t = new Thread(() -> {
                while (!socket.isClosed()) {
                    try (Socket s = socket.accept()) {
                        connections.incrementAndGet();
                        s.getOutputStream().write("HTTP/1.0 200 OK\r\n\r\n<!ENTITY x \"FETCHED\">".getBytes(
                                StandardCharsets.US_ASCII));
                    } catch (IOException e) {
                        // closed, or a broken client (still a connection)
                    }
                }
            }, "listener");
            t.setDaemon(true);
            t.start();
        }

        String url(String path) {
            return "http://127.0.0.1:" + socket.getLocalPort() + "/" + path;
        }

        int connections() {
            return connections.get();
        }

        @Override
        public void close() throws IOException {
            socket.close();
        }
    }

    /** The payload of a buffer written by the codec (inflated when compressed). */
    static byte[] payloadOf(byte[] bytes, boolean compressed) {
        ByteIn in = BinaryCodec.unframe(bytes, compressed);
        return Arrays.copyOfRange(in.b, in.base, in.end);
    }

    /** A buffer around a payload, with a correct header and checksum. */
    static byte[] seal(byte[] payload, boolean compressed) {
        return BinaryCodec.frame(payload, payload.length, compressed);
    }

    static byte[] seal(ByteOut o, boolean compressed) {
        return BinaryCodec.frame(o.b, o.n, compressed);
    }

    private static final com.sun.management.ThreadMXBean THREADS =
            (com.sun.management.ThreadMXBean) ManagementFactory.getThreadMXBean();

    static long allocated() {
        return THREADS.getCurrentThreadAllocatedBytes();
    }

    /**
     * Reads bytes that must be refused; checks the exception's class and message fragments, and
     * that the attempt allocated at most {@code factor} times the input plus a fixed 1 MB.
     */
    static ReplicaBinaryException refused(byte[] bytes, boolean compressed, long factor, String... fragments) {
        long before = allocated();
        ReplicaBinaryException e = assertThrows(ReplicaBinaryException.class,
                () -> Replica.getReplicaFromBinary(bytes, compressed), () -> "accepted, expected " + List.of(fragments));
        long used = allocated() - before;
        assertTrue(used <= factor * bytes.length + (1 << 20), () -> "refusing " + bytes.length + " bytes allocated "
                + used + " bytes: " + e.getMessage());
        contains(e.getMessage(), fragments);
        contains(e.getMessage(), "at offset ");
        return e;
    }
}
