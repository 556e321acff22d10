package com.velmora.tessara.kdmreplica;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;
import static org.junit.jupiter.api.Assertions.fail;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import com.velmora.tessara.kdmreplica.vrattributes.Visibility;
import java.io.IOException;
import java.io.StringReader;
import java.lang.management.ManagementFactory;
import java.net.InetAddress;
import java.net.ServerSocket;
import java.net.Socket;
import java.net.SocketException;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.Date;
import java.util.IdentityHashMap;
import java.util.List;
import java.util.Random;
import java.util.concurrent.atomic.AtomicInteger;
import javax.xml.XMLConstants;
import javax.xml.transform.stream.StreamSource;
import javax.xml.validation.Schema;
import javax.xml.validation.SchemaFactory;
import javax.xml.validation.Validator;
import org.junit.jupiter.api.function.Executable;
import org.xml.sax.SAXException;

/**
 * Helpers of the tests: builders; one canonical dump of a replica (schema, data and states,
 * through public members and the deleted lists, independent of every codec); a replica with every
 * schema property away from its default; a seeded generator of replicas that use every type,
 * property and state; refusal checks for documents and binary forms; a local listener that counts
 * connections.
 */
final class Fx {
    private Fx() {
    }

    /** Adds a class (with an optional super name) and its model to the replica. */
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

    /** Asserts that the call throws {@code type} and that the message contains every fragment. */
    static <T extends Throwable> T throwsWith(Class<T> type, Executable call, String... fragments) {
        T e = assertThrows(type, call);
        for (String f : fragments) {
            assertTrue(e.getMessage() != null && e.getMessage().contains(f),
                    () -> "message \"" + e.getMessage() + "\" lacks \"" + f + "\"");
        }
        return e;
    }

    /** Everything a replica holds, through public members (and the deleted lists), as text. */
    static String dump(Replica r) {
        StringBuilder b = new StringBuilder();
        b.append("replica ").append(esc(r.getName())).append(" location ").append(esc(r.getSchemaLocation()))
                .append('\n');
        IdentityHashMap<Instance, String> names = new IdentityHashMap<>();
        ModelSet ms = r.getModels();
        for (int i = 0; i < ms.getCount(); i++) {
            Model m = ms.getItem(i);
            InstanceSet s = m.getInstances();
            for (int k = 0; k < s.getCount(); k++) {
                names.put(s.getItem(k), m.getClassDef().getClassName() + "#" + k);
            }
            if (m.deleted != null) {
                for (int k = 0; k < m.deleted.size(); k++) {
                    names.put(m.deleted.get(k), m.getClassDef().getClassName() + "~" + k);
                }
            }
        }
        List<Instance> outside = new ArrayList<>();
        for (int i = 0; i < ms.getCount(); i++) {
            Model m = ms.getItem(i);
            ClassDef c = m.getClassDef();
            b.append("class ").append(esc(c.getClassName())).append(" super ").append(esc(c.getSuperName()))
                    .append(" uuid ").append(esc(c.getUuid())).append(" comment ").append(esc(c.getQKAComment()))
                    .append(" deriv ").append(esc(c.getQKADerivability())).append(" scopes ")
                    .append(escAll(c.getScopeNames())).append(' ').append(c.isExtensible()).append(' ')
                    .append(c.isAbstract()).append(' ').append(c.isPersistent()).append(' ')
                    .append(c.getSoftwareVisibility()).append(' ').append(c.getClassType()).append('\n');
            AttributeDefList al = c.getAttributes();
            for (int k = 0; k < al.getCount(); k++) {
                AttributeDef a = al.getItem(k);
                b.append("  attr ").append(esc(a.getAttributeName())).append(' ').append(a.getAttributeType())
                        .append(' ').append(a.isMultiValuated()).append(' ').append(a.getLength()).append(' ')
                        .append(a.isMandatory()).append(' ').append(a.isUnique()).append(' ')
                        .append(a.getAccessMode()).append(' ').append(a.getSoftwareVisibility()).append(' ')
                        .append(a.getAggregationType()).append(" uuid ").append(esc(a.getUuid()))
                        .append(" comment ").append(esc(a.getQKAComment())).append(" targets ")
                        .append(escAll(a.getTargetNames())).append(" refs ").append(escAll(a.getTargetRefs()))
                        .append('\n');
            }
            InstanceSet s = m.getInstances();
            for (int k = 0; k < s.getCount(); k++) {
                instance(b, s.getItem(k), names, outside);
            }
            if (m.deleted != null) {
                for (Instance x : m.deleted) {
                    instance(b, x, names, outside);
                }
            }
        }
        for (int i = 0; i < outside.size(); i++) {
            instance(b, outside.get(i), names, outside);
        }
        return b.toString();
    }

    private static void instance(StringBuilder b, Instance x, IdentityHashMap<Instance, String> names,
            List<Instance> outside) {
        b.append("  ").append(names.get(x)).append(x.isCreated() ? " C" : "").append(x.isModified() ? " M" : "")
                .append(x.isDeleted() ? " D" : "").append(" id ");
        value(b, x.getID(), names, outside);
        for (int p = 0; p < x.values.length; p++) {
            b.append(" | ");
            value(b, x.getValue(p), names, outside);
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
            b.append("x");
            for (byte x : (byte[]) v) {
                b.append(String.format("%02x", x));
            }
        } else if (v instanceof Instance) {
            Instance t = (Instance) v;
            if (!names.containsKey(t)) {
                names.put(t, t.getClassDef().getClassName() + "!" + outside.size());
                outside.add(t);
            }
            b.append(names.get(t));
        } else if (v.getClass().isArray()) {
            b.append('[');
            for (int i = 0; i < java.lang.reflect.Array.getLength(v); i++) {
                value(b, java.lang.reflect.Array.get(v, i), names, outside);
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

    private static String escAll(String[] a) {
        StringBuilder b = new StringBuilder();
        value(b, a, null, null);
        return b.toString();
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
        AttributeDef blob = addAttr(part, "blob", AttributeType.Binary, true);
        blob.setLength(4);
        AttributeDef neg = addAttr(bolt, "thread", AttributeType.Integer, false);
        neg.setLength(-3);
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

    static final AttributeType[] TYPES = AttributeType.values();

    private static final String[] TEXTS = {"", "plain", "ünïcödé", "\u0000nul", "tab\tcr\r", "\uD83D\uDE00 pair",
        "lone \uD800 high", "lone \uDC00 low", "end \uD800", "\uFFFD replacement", "<&>\"'"};

    static String text(Random rnd) {
        return rnd.nextInt(3) == 0 ? "t" + rnd.nextInt(1000) : TEXTS[rnd.nextInt(TEXTS.length)];
    }

    private static final double[] DOUBLES = {0.0, -0.0, Double.NaN, Double.longBitsToDouble(0x7ff8000000000123L),
        Double.POSITIVE_INFINITY, Double.NEGATIVE_INFINITY, Double.MIN_VALUE, Double.MAX_VALUE, 1.5, -1e-300};
    private static final int[] INTS = {0, 1, -1, 63, 64, -64, -65, Integer.MAX_VALUE, Integer.MIN_VALUE};
    private static final long[] MILLIS = {0, 1, -1, Long.MAX_VALUE, Long.MIN_VALUE, 1700000000123L, -62135596800000L};

    static Object scalar(AttributeType t, Random rnd, List<Instance> live) {
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
            case Binary: {
                byte[] b = new byte[rnd.nextInt(4) == 0 ? 0 : rnd.nextInt(40)];
                rnd.nextBytes(b);
                return b;
            }
            default:
                return live.get(rnd.nextInt(live.size()));
        }
    }

    private static final Class<?>[] ELEMENTS = {int.class, double.class, String.class, Date.class, boolean.class,
        byte[].class, Instance.class};

    static Object value(AttributeDef a, Random rnd, List<Instance> live) {
        AttributeType t = a.getAttributeType();
        if (t == AttributeType.Relationship && live.isEmpty()) {
            return null;
        }
        if (!a.isMultiValuated()) {
            return scalar(t, rnd, live);
        }
        int n = rnd.nextInt(4) == 0 ? 0 : rnd.nextInt(13);
        Object v = java.lang.reflect.Array.newInstance(ELEMENTS[t.ordinal()], n);
        for (int i = 0; i < n; i++) {
            java.lang.reflect.Array.set(v, i, scalar(t, rnd, live));
        }
        return v;
    }

    private static <T> T pick(Random rnd, T[] values) {
        return values[rnd.nextInt(values.length)];
    }

    private static String[] texts(Random rnd) {
        String[] s = new String[rnd.nextInt(3)];
        for (int i = 0; i < s.length; i++) {
            s[i] = text(rnd);
        }
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
        int nClasses = 1 + rnd.nextInt(5);
        List<Model> models = new ArrayList<>();
        for (int i = 0; i < nClasses; i++) {
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
            int na = rnd.nextInt(7);
            for (int k = 0; k < na; k++) {
                AttributeDef a = new AttributeDef("a" + i + "_" + k, pick(rnd, TYPES));
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
                Instance x = m.createInstance();
                setId(x, rnd, ids);
                live.add(x);
            }
        }
        for (Instance x : live) {
            fill(x, rnd, live);
        }
        r.commit();
        // Pending changes: modifications, new instances, removals (with composition), references
        // to removed instances, an instance removed before any commit but still referred to.
        for (Instance x : new ArrayList<>(live)) {
            int what = rnd.nextInt(6);
            if (what == 0 && !x.isDeleted()) {
                fill(x, rnd, live);
            } else if (what == 1) {
                Model m = models.get(rnd.nextInt(models.size()));
                Instance y = m.createInstance();
                setId(y, rnd, ids);
                fill(y, rnd, live);
                live.add(y);
            }
        }
        for (int k = 0; k < 1 + instancesPerClass / 3 && !live.isEmpty(); k++) {
            Instance x = live.get(rnd.nextInt(live.size()));
            if (!x.isDeleted()) {
                Model m = findModel(r, x);
                m.getInstances().remove(x);
            }
        }
        live.removeIf(Instance::isDeleted);
        // A reference to an instance that disappears (created, then removed before a commit).
        for (Model m : models) {
            AttributeDef ref = firstSingleRelationship(m);
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

    private static AttributeDef firstSingleRelationship(Model m) {
        ClassDef c = m.getClassDef();
        for (int k = 0; k < c.getAttributes().getCount(); k++) {
            AttributeDef a = c.getAttributes().getItem(k);
            if (a.getAttributeType() == AttributeType.Relationship && !a.isMultiValuated()) {
                return a;
            }
        }
        return null;
    }

    private static Model findModel(Replica r, Instance x) {
        return r.getModels().getItem(x.getClassDef().getClassName());
    }

    private static void setId(Instance x, Random rnd, int[] ids) {
        int kind = rnd.nextInt(3);
        int n = ids[0]++;
        if (kind == 1) {
            x.setID("id" + n + (rnd.nextBoolean() ? "\uDBFF" : ""));
        } else if (kind == 2) {
            x.setID(new byte[] {(byte) n, (byte) (n >> 8), (byte) 0xFF});
        }
    }

    private static void fill(Instance x, Random rnd, List<Instance> live) {
        ClassDef c = x.getClassDef();
        int n = x.values.length;
        for (int p = 0; p < n; p++) {
            AttributeDef a = c.layout[p];
            if (rnd.nextInt(4) != 0) {
                x.setValue(p, value(a, rnd, live));
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
            assertTrue(m.contains("line " + line + ", column "), () -> "message lacks the line: " + m);
            assertTrue(e.getColumn() > 0, m);
        }
        for (String f : fragments) {
            assertTrue(m.contains(f), () -> "message \"" + m + "\" lacks \"" + f + "\"");
        }
        return e;
    }

    /** Validates a document against a schema text with the JDK's validator, secured like the package does. */
    static void validate(String xsd, String xml) throws SAXException, IOException {
        SchemaFactory f = SchemaFactory.newDefaultInstance();
        f.setFeature(XMLConstants.FEATURE_SECURE_PROCESSING, true);
        f.setProperty(XMLConstants.ACCESS_EXTERNAL_SCHEMA, "");
        f.setProperty(XMLConstants.ACCESS_EXTERNAL_DTD, "");
        Schema s = f.newSchema(new StreamSource(new StringReader(xsd)));
        Validator v = s.newValidator();
        v.setProperty(XMLConstants.ACCESS_EXTERNAL_SCHEMA, "");
        v.setProperty(XMLConstants.ACCESS_EXTERNAL_DTD, "");
        v.validate(new StreamSource(new StringReader(xml)));
    }

    /** A local TCP listener that counts the connections it receives, to prove that nothing was fetched. */
    static final class Listener implements AutoCloseable {
        private final ServerSocket socket;
        private final AtomicInteger connections = new AtomicInteger();
        private final Thread thread;

        Listener() throws IOException {
            socket = new ServerSocket(0, 50, InetAddress.getLoopbackAddress());
            thread = new Thread(() -> {
                while (!socket.isClosed()) {
                    try (Socket s = socket.accept()) {
                        connections.incrementAndGet();
                        s.getOutputStream().write(("HTTP/1.0 200 OK\r\nContent-Type: text/plain\r\n\r\n"
                                + "<!ENTITY x \"FETCHED\">").getBytes(java.nio.charset.StandardCharsets.US_ASCII));
                    } catch (SocketException closed) {
                        return;
                    } catch (IOException e) {
                        // a broken client is still a connection; keep listening
                    }
                }
            }, "listener");
            thread.setDaemon(true);
            thread.start();
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
            try {
                thread.join(5000);
            } catch (InterruptedException e) {
                Thread.currentThread().interrupt();
            }
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
        try {
            Replica.getReplicaFromBinary(bytes, compressed);
        } catch (ReplicaBinaryException e) {
            long used = allocated() - before;
            assertTrue(used <= factor * bytes.length + (1 << 20),
                    () -> "refusing " + bytes.length + " bytes allocated " + used + " bytes: " + e.getMessage());
            for (String f : fragments) {
                assertTrue(e.getMessage().contains(f), () -> "message \"" + e.getMessage() + "\" lacks \"" + f + "\"");
            }
            assertTrue(e.getMessage().contains("at offset "), e.getMessage());
            return e;
        }
        return fail("bytes were accepted, expected a refusal naming " + Arrays.toString(fragments));
    }
}
