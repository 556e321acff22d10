package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.XmlNames.NS;
import static com.velmora.tessara.kdmreplica.XmlNames.XSI;

import java.io.OutputStream;
import java.nio.file.Path;
import java.util.IdentityHashMap;
import java.util.concurrent.locks.Lock;

/**
 * Writes a replica as an XML document (see {@link XsdWriter} for the shape):
 *
 * <pre>
 * &lt;replica xmlns="urn:corvexa:replica:1" format="1" name="plant"
 *          xsi:schemaLocation="urn:corvexa:replica:1 plant.xsd"&gt;
 *   &lt;xs:schema ...&gt;...&lt;/xs:schema&gt;               (withSchema)
 *   &lt;Part key="i1" id="p1" state="created"&gt;          (state: withState)
 *     &lt;name&gt;bolt&lt;/name&gt;&lt;sizes&gt;1&lt;/sizes&gt;&lt;sizes&gt;2&lt;/sizes&gt;&lt;tags xsi:nil="true"/&gt;
 *     &lt;supplier ref="i7"/&gt;
 *   &lt;/Part&gt;
 *   &lt;Part key="i2" idBin="AAE=" state="deleted"&gt;...&lt;/Part&gt;   (withState)
 * &lt;/replica&gt;
 * </pre>
 *
 * Models in order; in each, the live instances in set order, then (withState) the deleted ones.
 * Every instance has a document-local {@code key}; relationships refer to keys. A relationship to
 * an instance the document does not hold (a deleted one without withState, or one forgotten)
 * makes the write fail: it is never dropped silently.
 */
final class XmlWriter {
    private final Replica replica;
    private final boolean withState;
    private final XmlOutput out;
    private final IdentityHashMap<Model, Integer> firstKey = new IdentityHashMap<>();
    private final IdentityHashMap<Instance, Integer> deletedKeys = new IdentityHashMap<>();

    private XmlWriter(Replica replica, boolean withState, OutputStream stream) {
        this.replica = replica;
        this.withState = withState;
        this.out = new XmlOutput(Replica.getFeature("indent"), stream);
    }

    /** {@code Replica.getXml}: takes the replica's read lock for the whole pass. */
    static String write(Replica r, boolean withSchema, boolean withState) {
        Lock l = r.rw.readLock();
        l.lock();
        try {
            return new XmlWriter(r, withState, null).run(withSchema);
        } finally {
            l.unlock();
        }
    }

    /** {@code Replica.writeXmlFile}: the document streamed into the file, under the read lock. */
    static void writeFile(Replica r, Path target, boolean withSchema, boolean withState) {
        Lock l = r.rw.readLock();
        l.lock();
        try {
            OutputFiles.write(target, "XML file", (channel, stream) -> new XmlWriter(r, withState, stream)
                    .run(withSchema));
        } finally {
            l.unlock();
        }
    }

    private String run(boolean withSchema) {
        int next = 1;
        for (Model m : replica.models.items) {
            XmlNames.checkXmlName("class", m.classDef.name);
            for (AttributeDef a : m.alignedTo) {
                XmlNames.checkXmlName("class '" + m.classDef.name + "': attribute", a.name);
            }
            firstKey.put(m, next);
            next += m.instances.count;
            if (withState && m.deleted != null) {
                for (Instance x : m.deleted) {
                    deletedKeys.put(x, next++);
                }
            }
        }
        String location = Replica.processSchemaLocation;
        out.startDocument();
        out.start("", "replica", NS);
        out.namespace("", NS);
        out.namespace("xsi", XSI);
        out.attr("format", XmlNames.FORMAT);
        out.textAttr("name", replica.name);
        if (!location.isEmpty()) {
            out.attr("xsi", XSI, "schemaLocation", NS + " " + SchemaLocations.encodeLocation(location));
        }
        if (withSchema) {
            XsdWriter.writeSchema(out, replica);
        }
        Progress.Tracker progress = Progress.start(next - 1);
        long done = 0;
        for (Model m : replica.models.items) {
            InstanceSet s = m.instances;
            for (int k = 0; k < s.count; k++) {
                Instance x = s.items[k];
                instance(x, firstKey.get(m) + k);
                progress.at(++done);
            }
            if (withState && m.deleted != null) {
                for (Instance x : m.deleted) {
                    instance(x, deletedKeys.get(x));
                    progress.at(++done);
                }
            }
        }
        out.end();
        String text = out.finish();
        progress.end();
        return text;
    }

    private static String key(int n) {
        return "i" + n;
    }

    /** The key of a relationship target. @throws IllegalArgumentException when the document does not hold it */
    private String keyOf(Instance from, AttributeDef def, Instance t) {
        Model m = t.model;
        if (m != null && m.replica == replica) {
            if ((t.state & Instance.DELETED) == 0 && t.pos >= 0 && t.pos < m.instances.count
                    && m.instances.items[t.pos] == t) {
                return key(firstKey.get(m) + t.pos);
            }
            Integer k = deletedKeys.get(t);
            if (k != null) {
                return key(k);
            }
        }
        boolean deleted = (t.state & Instance.DELETED) != 0;
        throw new IllegalArgumentException("replica '" + replica.name + "': cannot write " + from.describe()
                + ": attribute '" + def.qualifiedName() + "' refers to " + t.describe() + ", which the document"
                + " does not hold (" + (deleted ? (withState ? "it was removed and forgotten"
                        : "it is deleted; write with states, or clear the reference or commit first")
                        : "it is not in this replica") + ")");
    }

    private void instance(Instance x, int key) {
        String cls = x.model.classDef.name;
        boolean hasValues = false;
        for (Object v : x.values) {
            if (v != null) {
                hasValues = true;
                break;
            }
        }
        if (hasValues) {
            out.start("", cls, NS);
        } else {
            out.empty("", cls, NS);
        }
        out.attr("key", key(key));
        Object id = x.id;
        if (id instanceof String) {
            out.textAttr("id", (String) id);
        } else if (id instanceof byte[]) {
            out.attr("idBin", ValueTexts.formatBinary((byte[]) id));
        }
        if (withState && x.state != 0) {
            StringBuilder b = new StringBuilder();
            if ((x.state & Instance.CREATED) != 0) {
                b.append("created");
            }
            if ((x.state & Instance.MODIFIED) != 0) {
                b.append(b.length() > 0 ? " " : "").append("modified");
            }
            if ((x.state & Instance.DELETED) != 0) {
                b.setLength(0);
                b.append("deleted");
            }
            out.attr("state", b.toString());
        }
        if (!hasValues) {
            return;
        }
        AttributeDef[] layout = x.model.alignedTo;
        for (int p = 0; p < layout.length; p++) {
            Object v = x.values[p];
            if (v != null) {
                value(x, layout[p], v);
            }
        }
        out.end();
    }

    private void nil(String name) {
        out.empty("", name, NS);
        out.attr("xsi", XSI, "nil", "true");
    }

    private void string(String name, String s) {
        if (XmlNames.needsEscape(s, false)) {
            out.empty("", name, NS);
            out.attr("esc", XmlNames.escape(s));
        } else {
            out.element("", name, NS, s);
        }
    }

    private void dbl(String name, double d) {
        String bits = ValueTexts.nanBits(d);
        if (bits == null) {
            out.element("", name, NS, ValueTexts.formatDouble(d));
        } else {
            out.start("", name, NS);
            out.attr("bits", bits);
            out.text("NaN");
            out.end();
        }
    }

    private void ref(Instance from, AttributeDef def, Instance t) {
        String k = keyOf(from, def, t);
        out.empty("", def.name, NS);
        out.attr("ref", k);
    }

    private void value(Instance x, AttributeDef def, Object v) {
        String n = def.name;
        if (!def.multi) {
            switch (def.type) {
                case String: string(n, (String) v); break;
                case Double: dbl(n, (Double) v); break;
                case Date: out.element("", n, NS, ValueTexts.formatDate((Long) v)); break;
                case Binary: out.element("", n, NS, ValueTexts.formatBinary((byte[]) v)); break;
                case Relationship: ref(x, def, (Instance) v); break;
                default: out.element("", n, NS, v.toString()); break;
            }
            return;
        }
        int length = v instanceof Object[] ? ((Object[]) v).length : v instanceof int[] ? ((int[]) v).length
                : v instanceof double[] ? ((double[]) v).length : v instanceof boolean[] ? ((boolean[]) v).length
                : ((long[]) v).length;
        if (length == 0) {
            nil(n);
            return;
        }
        switch (def.type) {
            case Integer:
                for (int i : (int[]) v) {
                    out.element("", n, NS, Integer.toString(i));
                }
                break;
            case Double:
                for (double d : (double[]) v) {
                    dbl(n, d);
                }
                break;
            case Boolean:
                for (boolean b : (boolean[]) v) {
                    out.element("", n, NS, b ? "true" : "false");
                }
                break;
            case String:
                for (String s : (String[]) v) {
                    string(n, s);
                }
                break;
            case Date:
                for (long ms : (long[]) v) {
                    out.element("", n, NS, ValueTexts.formatDate(ms));
                }
                break;
            case Binary:
                for (byte[] b : (byte[][]) v) {
                    out.element("", n, NS, ValueTexts.formatBinary(b));
                }
                break;
            default:
                for (Instance t : (Instance[]) v) {
                    ref(x, def, t);
                }
                break;
        }
    }
}
