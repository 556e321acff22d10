package com.velmora.tessara.kdmreplica;

import static org.junit.jupiter.api.Assertions.*;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import com.velmora.tessara.kdmreplica.vrattributes.Visibility;
import java.io.IOException;
import java.io.StringReader;
import java.lang.management.ManagementFactory;
import java.lang.reflect.Array;
import java.net.InetAddress;
import java.net.ServerSocket;
import java.net.Socket;
import java.nio.charset.StandardCharsets;
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
 * property away from its default; a seeded generator of replicas that use every type, property and
 * state; refusal checks; a local listener that counts connections.
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
                    c.getSoftwareVisibility(), c.getClassType());
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
            b.append(esc((String) v));
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

    static String esc(String s) {
        StringBuilder b = new StringBuilder("\"");
        for (char c : s.toCharArray()) {
            b.append(c >= 0x20 && c < 0x7F && c != '"' && c != '\\' ? String.valueOf(c) : String.format("\\u%04x", (int) c));
        }
        return b.append('"').toString();
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
        Replica r = richSchema();
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

    private static final String[] TEXTS = {"", "plain", "ünïcödé", "\u0000nul", "tab\tcr\r", "\uD83D\uDE00 pair",
        "lone \uD800 high", "lone \uDC00 low", "end \uD800", "\uFFFD replacement", "<&>\"'"};
    private static final double[] DOUBLES = {0.0, -0.0, Double.NaN, Double.longBitsToDouble(0x7ff8000000000123L),
        Double.POSITIVE_INFINITY, Double.NEGATIVE_INFINITY, Double.MIN_VALUE, Double.MAX_VALUE, 1.5, -1e-300};
    private static final int[] INTS = {0, 1, -1, 63, 64, -64, -65, Integer.MAX_VALUE, Integer.MIN_VALUE};
    private static final long[] MILLIS = {0, 1, -1, Long.MAX_VALUE, Long.MIN_VALUE, 1700000000123L, -62135596800000L};
    private static final Class<?>[] ELEMENTS = {int.class, double.class, String.class, Date.class, boolean.class,
        byte[].class, Instance.class};

    static String text(Random rnd) {
        return rnd.nextInt(3) == 0 ? "t" + rnd.nextInt(1000) : TEXTS[rnd.nextInt(TEXTS.length)];
    }

    private static Object scalar(AttributeType t, Random rnd, List<Instance> live) {
        switch (t) {
            case Integer:
                return rnd.nextBoolean() ? INTS[rnd.nextInt(INTS.length)] : rnd.nextInt();
            case Double:
                return rnd.nextBoolean() ? DOUBLES[rnd.nextInt(DOUBLES.length)] : rnd.nextGaussian();
            case String:
                return text(rnd);
            case Date:
                return new Date(rnd.nextBoolean() ? MILLIS[rnd.nextInt(MILLIS.length)] : rnd.nextLong());
            case Boolean:
                return rnd.nextBoolean();
            case Binary:
                byte[] b = new byte[rnd.nextInt(4) == 0 ? 0 : rnd.nextInt(40)];
                rnd.nextBytes(b);
                return b;
            default:
                return live.get(rnd.nextInt(live.size()));
        }
    }

    private static Object value(AttributeDef a, Random rnd, List<Instance> live) {
        AttributeType t = a.getAttributeType();
        if (t == AttributeType.Relationship && live.isEmpty()) {
            return null;
        }
        if (!a.isMultiValuated()) {
            return scalar(t, rnd, live);
        }
        Object v = Array.newInstance(ELEMENTS[t.ordinal()], rnd.nextInt(4) == 0 ? 0 : rnd.nextInt(13));
        for (int i = 0; i < Array.getLength(v); i++) {
            Array.set(v, i, scalar(t, rnd, live));
        }
        return v;
    }

    private static <T> T pick(Random rnd, T[] values) {
        return values[rnd.nextInt(values.length)];
    }

    private static String[] texts(Random rnd) {
        String[] s = new String[rnd.nextInt(3)];
        Arrays.setAll(s, i -> text(rnd));
        return s;
    }

    /**
     * A replica with up to five classes (some extending others), attributes of every type single
     * and multi-valued with random properties, committed instances then pending changes: created,
     * modified and deleted instances, references to deleted ones and to ones removed before any
     * commit, and constraints tightened past the values held (set directly: the public setters
     * refuse that, but a replica read from a document or an older binary form can hold such values).
     */
    static Replica generate(long seed, int instancesPerClass) {
        Random rnd = new Random(seed);
        Replica r = new Replica("gen " + seed + " " + text(rnd));
        r.schemaLocation = rnd.nextBoolean() ? "" : "file:schemas/" + text(rnd) + ".xsd";
        List<Model> models = new ArrayList<>();
        for (int i = 0, n = 1 + rnd.nextInt(5); i < n; i++) {
            ClassDef c = new ClassDef(i == 2 ? "Größe" : "C" + i);
            if (i > 0 && rnd.nextInt(3) == 0) {
                c.setSuperName(models.get(rnd.nextInt(i)).getClassDef().getClassName());
            }
            c.setUuid(rnd.nextBoolean() ? "" : "uuid-" + seed + "-" + i);
            c.setQKAComment(text(rnd));
            c.setQKADerivability(text(rnd));
            c.setScopeNames(texts(rnd));
            c.setExtensibility(rnd.nextBoolean());
            c.setPersistency(rnd.nextBoolean());
            c.setSoftwareVisibility(pick(rnd, Visibility.values()));
            c.setClassType(pick(rnd, ClassType.values()));
            for (int k = 0, na = rnd.nextInt(7); k < na; k++) {
                AttributeDef a = new AttributeDef("a" + i + "_" + k, pick(rnd, AttributeType.values()));
                a.setMultiValuation(rnd.nextBoolean());
                a.setUuid(text(rnd));
                a.setQKAComment(text(rnd));
                a.setTargetRefs(texts(rnd));
                a.setSoftwareVisibility(pick(rnd, Visibility.values()));
                a.setAggregationType(rnd.nextInt(4) == 0 ? AggregationType.Composition : AggregationType.Shared);
                a.setAccessMode(rnd.nextBoolean() ? AccessMode.Write : AccessMode.ReadWrite);
                c.getAttributes().add(a);
            }
            Model m = new Model(c);
            r.getModels().add(m);
            models.add(m);
        }
        List<Instance> live = new ArrayList<>();
        int[] ids = {0};
        for (Model m : models) {
            for (int j = 0; j < instancesPerClass; j++) {
                live.add(setId(m.createInstance(), rnd, ids));
            }
        }
        for (Instance x : live) {
            fill(x, rnd, live);
        }
        r.commit();
        // Pending changes: modifications, new instances, removals (with composition).
        for (Instance x : new ArrayList<>(live)) {
            int what = rnd.nextInt(6);
            if (what == 0 && !x.isDeleted()) {
                fill(x, rnd, live);
            } else if (what == 1) {
                Instance y = setId(models.get(rnd.nextInt(models.size())).createInstance(), rnd, ids);
                fill(y, rnd, live);
                live.add(y);
            }
        }
        for (int k = 0; k < 1 + instancesPerClass / 3 && !live.isEmpty(); k++) {
            Instance x = live.get(rnd.nextInt(live.size()));
            if (!x.isDeleted()) {
                r.getModels().getItem(x.getClassDef().getClassName()).getInstances().remove(x);
            }
        }
        live.removeIf(Instance::isDeleted);
        // A reference to an instance that disappears (created, then removed before a commit).
        for (Model m : models) {
            AttributeDef ref = null;
            for (int k = 0; k < m.getClassDef().getAttributes().getCount() && ref == null; k++) {
                AttributeDef a = m.getClassDef().getAttributes().getItem(k);
                ref = a.getAttributeType() == AttributeType.Relationship && !a.isMultiValuated() ? a : null;
            }
            if (ref != null && m.getInstances().getCount() > 0 && rnd.nextBoolean()) {
                Instance holder = m.getInstances().getItem(0);
                if (!holder.isDeleted() && holder.getClassDef().getAttributes().indexOf(ref) >= 0) {
                    Instance gone = m.createInstance();
                    fill(gone, rnd, live);
                    holder.setValue(ref.getAttributeName(), gone);
                    m.getInstances().remove(gone);
                }
            }
        }
        // Constraints tightened afterwards, past the values held, which stay as they are.
        for (Model m : models) {
            ClassDef c = m.getClassDef();
            c.setAbstract(rnd.nextInt(5) == 0);
            for (int k = 0; k < c.getAttributes().getCount(); k++) {
                AttributeDef a = c.getAttributes().getItem(k);
                a.setMandatory(rnd.nextInt(3) == 0);
                a.setUnicity(rnd.nextInt(3) == 0);
                a.length = rnd.nextInt(3) == 0 ? rnd.nextInt(5) - 1 : 0;
                if (rnd.nextInt(4) == 0) {
                    a.setAccessMode(AccessMode.Read);
                }
                if (a.getAttributeType() == AttributeType.Relationship && rnd.nextBoolean()) {
                    a.targetNames = new String[] {models.get(rnd.nextInt(models.size())).getClassDef().getClassName()};
                }
            }
        }
        return r;
    }

    private static Instance setId(Instance x, Random rnd, int[] ids) {
        int kind = rnd.nextInt(3);
        int n = ids[0]++;
        if (kind == 1) {
            x.setID("id" + n + (rnd.nextBoolean() ? "\uDBFF" : ""));
        } else if (kind == 2) {
            x.setID(new byte[] {(byte) n, (byte) (n >> 8), (byte) 0xFF});
        }
        return x;
    }

    private static void fill(Instance x, Random rnd, List<Instance> live) {
        for (int p = 0; p < x.values.length; p++) {
            if (rnd.nextInt(4) != 0) {
                x.setValue(p, value(x.getClassDef().layout[p], rnd, live));
            } else if (rnd.nextBoolean()) {
                x.clearValue(p);
            }
        }
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
