package com.velmora.tessara.kdmreplica;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertThrows;
import static org.junit.jupiter.api.Assertions.assertTrue;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import com.velmora.tessara.kdmreplica.vrattributes.Visibility;
import java.io.IOException;
import java.io.StringReader;
import java.net.InetAddress;
import java.net.ServerSocket;
import java.net.Socket;
import java.net.SocketException;
import java.util.Arrays;
import java.util.Date;
import java.util.concurrent.atomic.AtomicInteger;
import javax.xml.XMLConstants;
import javax.xml.transform.stream.StreamSource;
import javax.xml.validation.Schema;
import javax.xml.validation.SchemaFactory;
import javax.xml.validation.Validator;
import org.junit.jupiter.api.function.Executable;
import org.xml.sax.SAXException;

/** Builders, a full textual dump of a replica, and a local listener that counts connections. */
final class XmlFx {
    private XmlFx() {
    }

    /** Every property of every class and attribute, every instance with identifier, state and values. */
    static String dump(Replica r) {
        StringBuilder b = new StringBuilder("replica ").append(text(r.getName())).append('\n');
        for (int i = 0; i < r.getModels().getCount(); i++) {
            Model m = r.getModels().getItem(i);
            ClassDef c = m.getClassDef();
            b.append("class ").append(c.getClassName()).append(" super=").append(c.getSuperName())
                    .append(" uuid=").append(text(c.getUuid())).append(" comment=").append(text(c.getQKAComment()))
                    .append(" deriv=").append(text(c.getQKADerivability())).append(" scopes=")
                    .append(texts(c.getScopeNames())).append(" ext=").append(c.isExtensible()).append(" abs=")
                    .append(c.isAbstract()).append(" pers=").append(c.isPersistent()).append(" vis=")
                    .append(c.getSoftwareVisibility()).append(" type=").append(c.getClassType()).append('\n');
            for (int k = 0; k < c.getAttributes().getCount(); k++) {
                AttributeDef a = c.getAttributes().getItem(k);
                b.append("  attr ").append(a.getAttributeName()).append(' ').append(a.getAttributeType())
                        .append(" multi=").append(a.isMultiValuated()).append(" mand=").append(a.isMandatory())
                        .append(" uniq=").append(a.isUnique()).append(" len=").append(a.getLength())
                        .append(" access=").append(a.getAccessMode()).append(" vis=").append(a.getSoftwareVisibility())
                        .append(" aggr=").append(a.getAggregationType()).append(" uuid=").append(text(a.getUuid()))
                        .append(" comment=").append(text(a.getQKAComment())).append(" targets=")
                        .append(texts(a.getTargetNames())).append(" refs=").append(texts(a.getTargetRefs()))
                        .append('\n');
            }
            for (int k = 0; k < m.getInstances().getCount(); k++) {
                instance(b, m.getInstances().getItem(k));
            }
            if (m.deleted != null) {
                for (Instance x : m.deleted) {
                    instance(b, x);
                }
            }
        }
        return b.toString();
    }

    private static void instance(StringBuilder b, Instance x) {
        b.append("  ").append(ref(x)).append(" id=").append(value(x.getID()));
        b.append(x.isCreated() ? " created" : "").append(x.isModified() ? " modified" : "")
                .append(x.isDeleted() ? " deleted" : "").append(" {");
        for (int p = 0; p < x.values.length; p++) {
            if (x.isValuated(p)) {
                b.append(' ').append(p).append('=').append(value(x.getValue(p)));
            }
        }
        b.append(" }\n");
    }

    /** A relationship target by class and position (live) or by position among the deleted. */
    private static String ref(Instance t) {
        Model m = t.model;
        int live = m.getInstances().indexOf(t);
        if (live >= 0) {
            return m.getClassDef().getClassName() + "#" + live;
        }
        int d = m.deleted == null ? -1 : m.deleted.indexOf(t);
        return m.getClassDef().getClassName() + "#deleted" + d;
    }

    static String text(String s) {
        StringBuilder b = new StringBuilder("\"");
        s.codePoints().forEach(c -> {
            if (c < 0x20 || c == '\\' || c == '"' || c >= 0x7f && c < 0xa0 || c >= 0xd800 && c < 0xe000
                    || c >= 0xfffe) {
                b.append(String.format("\\u%04x", c));
            } else {
                b.appendCodePoint(c);
            }
        });
        return b.append('"').toString();
    }

    private static String texts(String[] s) {
        StringBuilder b = new StringBuilder("[");
        for (String x : s) {
            b.append(text(x)).append(',');
        }
        return b.append(']').toString();
    }

    static String value(Object v) {
        if (v == null) {
            return "null";
        }
        if (v instanceof String) {
            return text((String) v);
        }
        if (v instanceof Double) {
            return "d" + Long.toHexString(Double.doubleToRawLongBits((Double) v));
        }
        if (v instanceof Date) {
            return "t" + ((Date) v).getTime();
        }
        if (v instanceof byte[]) {
            return "b" + Arrays.toString((byte[]) v);
        }
        if (v instanceof Instance) {
            return ref((Instance) v);
        }
        if (v instanceof double[]) {
            StringBuilder b = new StringBuilder("[");
            for (double d : (double[]) v) {
                b.append(value(d)).append(',');
            }
            return b.append(']').toString();
        }
        if (v instanceof int[]) {
            return Arrays.toString((int[]) v);
        }
        if (v instanceof boolean[]) {
            return Arrays.toString((boolean[]) v);
        }
        if (v instanceof Object[]) {
            StringBuilder b = new StringBuilder("[");
            for (Object o : (Object[]) v) {
                b.append(value(o)).append(',');
            }
            return b.append(']').toString();
        }
        return v.getClass().getSimpleName() + ":" + v;
    }

    /**
     * A replica with every property set away from its default (texts that XML cannot carry
     * included), a subclass listed before its super class, and no instances.
     */
    static Replica richSchema() {
        Replica r = new Replica("rich\u0001\n name");
        Model bolt = Fx.addClass(r, "Bolt", null);
        Model part = Fx.addClass(r, "Part", null);
        bolt.getClassDef().setSuperName("Part");
        Model sup = Fx.addClass(r, "Supplier_2", null);
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
        AttributeDef n = Fx.addAttr(part, "name", AttributeType.String, false);
        n.setMandatory(true);
        n.setUnicity(true);
        n.setLength(12);
        n.setAccessMode(AccessMode.Read);
        n.setSoftwareVisibility(Visibility.Private);
        n.setUuid("u\u001f");
        n.setQKAComment(" spaced ");
        AttributeDef s = Fx.addAttr(part, "supplier", AttributeType.Relationship, false);
        s.setTargetNames(new String[] {"Supplier_2", "weird\tname"});
        s.setTargetRefs(new String[] {"ref1", "\uffff"});
        s.setAggregationType(AggregationType.Composition);
        s.setAccessMode(AccessMode.Write);
        AttributeDef blob = Fx.addAttr(part, "blob", AttributeType.Binary, true);
        blob.setLength(4);
        AttributeDef neg = Fx.addAttr(bolt, "thread", AttributeType.Integer, false);
        neg.setLength(-3);
        Fx.addAttr(bolt, "grade", AttributeType.Double, true).setLength(7);
        Fx.addAttr(sup, "name", AttributeType.String, false);
        Fx.addAttr(sup, "since", AttributeType.Date, false);
        Fx.addAttr(sup, "ok", AttributeType.Boolean, true);
        return r;
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
}
