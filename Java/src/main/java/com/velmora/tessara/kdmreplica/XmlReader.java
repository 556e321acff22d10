package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.XmlNames.NS;
import static com.velmora.tessara.kdmreplica.XmlNames.XS;
import static com.velmora.tessara.kdmreplica.XmlNames.XSI;

import java.nio.file.Path;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.HashMap;
import java.util.List;
import javax.xml.stream.XMLStreamConstants;

/**
 * Reads replica documents (the shape {@link XmlWriter} writes) into a new replica or into an
 * existing one, through {@link Staging}: on any error the target is unchanged.
 *
 * <p>Schema: a new replica takes the {@code xs:schema} embedded as the document's first child,
 * or else the local file named by the document's {@code xsi:schemaLocation} for the replica
 * namespace, confined to the document's own folder and the schema folder
 * ({@link SchemaLocations#confined}; URLs are refused unread). Locations for other namespaces are ignored. Populating an existing replica
 * reads no schema: its classes must be known, an embedded schema is skipped.
 *
 * <p>Instances without {@code state} are loaded unchanged; {@code state} gives created, modified
 * or deleted. Values are loaded as written: the reader does not apply attribute lengths (a
 * document may hold values longer than the lengths of the schema it is read with, and stays
 * readable), {@link Replica#commit} refuses such values until they are mended; the "validate"
 * feature checks the whole document against the replica's schema.
 */
final class XmlReader {
    private final Staging st;
    private final Replica target;
    private final XmlInput.In in;
    private final Keys keys = new Keys();
    private final List<PendingRef> refs = new ArrayList<>();

    /**
     * The instances of the document by key. Keys of the form the writer makes ("i" and a number
     * from 1 without leading zeros) are found by their number in an array, as long as the numbers
     * stay below twice the count of keys (plus a margin); every other key is found in a map.
     */
    private static final class Keys {
        private Instance[] byNumber = new Instance[1024];
        private int count;
        private final HashMap<String, Instance> others = new HashMap<>();

        /** The number of a key of the writer's form, or -1. */
        private static int number(String key) {
            int n = key.length();
            if (n < 2 || n > 10 || key.charAt(0) != 'i' || key.charAt(1) == '0') {
                return -1;
            }
            int v = 0;
            for (int i = 1; i < n; i++) {
                char c = key.charAt(i);
                if (c < '0' || c > '9') {
                    return -1;
                }
                v = v * 10 + (c - '0');
            }
            return v;
        }

        /** Adds a key; false when it is taken already. */
        boolean add(String key, Instance x) {
            int k = number(key);
            if (k >= byNumber.length && k < 2L * count + 1024) {
                byNumber = Arrays.copyOf(byNumber, Math.max(k + 1, byNumber.length + (byNumber.length >> 1)));
            }
            if (k >= 0 && k < byNumber.length) {
                // a key may have gone to the map before the array reached its number
                if (byNumber[k] != null || !others.isEmpty() && others.containsKey(key)) {
                    return false;
                }
                byNumber[k] = x;
            } else if (others.putIfAbsent(key, x) != null) {
                return false;
            }
            count++;
            return true;
        }

        Instance get(String key) {
            int k = number(key);
            Instance x = k >= 0 && k < byNumber.length ? byNumber[k] : null;
            return x != null ? x : others.get(key);
        }
    }

    /** One reference as read: the key and where it stands. */
    private static final class RefKey {
        final String key;
        final int line;
        final int column;

        RefKey(String key, int line, int column) {
            this.key = key;
            this.line = line;
            this.column = column;
        }
    }

    /** A relationship value waiting for its targets' keys to be known. */
    private static final class PendingRef {
        final Instance from;
        final int position;
        final RefKey[] keys;

        PendingRef(Instance from, int position, RefKey[] keys) {
            this.from = from;
            this.position = position;
            this.keys = keys;
        }
    }

    /** Values of a multi-valued attribute being collected. */
    private static final class Collect {
        final ArrayList<Object> items = new ArrayList<>();
        boolean nil;
        int line;
        int column;
    }

    private XmlReader(Staging st, XmlInput.In in) {
        this.st = st;
        this.target = st.replica();
        this.in = in;
    }

    // ---------------------------------------------------------------- entry points

    /** {@code Replica.readFromXmlString} / {@code readFromXmlFile}. */
    static Replica read(XmlInput.Src src) {
        Replica r = new Replica(Names.generate("Replica"));
        load(r, src, true);
        return r;
    }

    /** {@code Replica.populatesFromXmlString} / {@code populatesFromXmlFile}. */
    static void populate(Replica r, XmlInput.Src src) {
        load(r, src, false);
    }

    private static void load(Replica r, XmlInput.Src src, boolean fresh) {
        try (Staging st = new Staging(r)) {
            try (XmlInput.In in = src.open()) {
                new XmlReader(st, in).document(src, fresh);
            }
            if (Replica.getFeature("validate")) {
                XmlValidation.validate(src, XmlValidation.compileSchema(XsdWriter.text(r)));
            }
            st.finish();
        }
    }

    // ---------------------------------------------------------------- document

    private void document(XmlInput.Src src, boolean fresh) {
        int e = in.nextTag("the prolog");
        if (e != XMLStreamConstants.START_ELEMENT || !in.is(NS, "replica")) {
            throw in.fail("the document element is " + (e == XMLStreamConstants.START_ELEMENT ? in.qname()
                    + " in namespace '" + in.nsOf() + "'" : "missing") + "; a replica document has the element"
                    + " 'replica' in namespace '" + NS + "'");
        }
        String name = null;
        String location = null;
        int locLine = in.line();
        int locColumn = in.column();
        for (int i = 0; i < in.r.getAttributeCount(); i++) {
            String ns = in.r.getAttributeNamespace(i);
            String n = in.r.getAttributeLocalName(i);
            String v = in.r.getAttributeValue(i);
            if (XSI.equals(ns)) {
                if (n.equals("schemaLocation")) {
                    location = schemaLocation(v);
                } else if (!n.equals("noNamespaceSchemaLocation")) {
                    throw in.fail("attribute '" + in.attrName(i) + "' is not expected on the document element");
                }
            } else if (ns != null && !ns.isEmpty()) {
                throw in.fail("attribute '" + in.attrName(i) + "' is not expected on the document element");
            } else if (n.equals("name")) {
                name = v;
            } else if (n.equals("nameEsc")) {
                name = unescape(n, v);
            } else if (n.equals("format")) {
                if (!v.strip().equals(XmlNames.FORMAT)) {
                    throw in.fail("the document is in format '" + XmlNames.clip(v) + "'; this reader knows format "
                            + XmlNames.FORMAT);
                }
            } else {
                throw in.fail("attribute '" + n + "' is not expected on the document element");
            }
        }
        e = in.nextTag("the document element");
        boolean schemaRead = false;
        if (e == XMLStreamConstants.START_ELEMENT && in.is(XS, "schema")) {
            if (fresh) {
                XsdReader x = XsdReader.embedded();
                x.parseSchema(in);
                x.apply(st);
                schemaRead = true;
            } else {
                in.skip();
            }
            e = in.nextTag("the document element");
        }
        if (fresh) {
            if (!schemaRead) {
                if (location == null) {
                    throw new XmlDocumentException(in.source, locLine, locColumn, "the document has no schema: it"
                            + " embeds no xs:schema and names no schema location (xsi:schemaLocation for namespace '"
                            + NS + "')", null);
                }
                Path file;
                try {
                    file = SchemaLocations.confined(location, src.file == null ? null : src.file.getParent(),
                            Replica.schemaFolder);
                } catch (IllegalArgumentException x) {
                    throw new XmlDocumentException(in.source, locLine, locColumn, x.getMessage(), x);
                }
                XsdReader x = XsdReader.forFile(file);
                x.parseDocument(XmlInput.Src.ofFile("XSD", file.toString(), "readFromXml"));
                x.apply(st);
            }
            st.schemaDone();
            target.name = name != null ? name : target.name;
            target.schemaLocation = location != null ? location : "";
        }
        Progress.Tracker progress = Progress.start(in.scan.total);
        while (e == XMLStreamConstants.START_ELEMENT) {
            instance();
            progress.at(in.scan.seen());
            e = in.nextTag("the document element");
        }
        if (in.nextTag("the end of the document") != XMLStreamConstants.END_DOCUMENT) {
            throw in.fail("element " + in.qname() + " after the document element");
        }
        resolve();
        progress.end();
    }

    /** The location named for the replica namespace in an {@code xsi:schemaLocation}, decoded; or null. */
    private String schemaLocation(String v) {
        List<String> t = XmlNames.tokens(v);
        for (int i = 0; i + 1 < t.size(); i += 2) {
            if (NS.equals(t.get(i))) {
                try {
                    return SchemaLocations.decodeLocation(t.get(i + 1));
                } catch (IllegalArgumentException x) {
                    throw in.fail(x.getMessage(), x);
                }
            }
        }
        return null;
    }

    private String unescape(String attr, String v) {
        try {
            return XmlNames.unescape(v);
        } catch (IllegalArgumentException x) {
            throw in.fail("attribute '" + attr + "': " + x.getMessage(), x);
        }
    }

    // ---------------------------------------------------------------- instances

    private void instance() {
        String cls = in.r.getLocalName();
        if (!NS.equals(in.nsOf())) {
            throw in.fail("element " + in.qname() + " (namespace '" + in.nsOf() + "') is not an instance of the"
                    + " replica namespace");
        }
        Model m = target.models.byName.get(cls);
        if (m == null) {
            throw in.fail("unknown class '" + cls + "': replica '" + target.name + "' has no such class");
        }
        int line = in.line();
        int column = in.column();
        String key = null;
        Object id = null;
        boolean created = false;
        boolean modified = false;
        boolean deleted = false;
        for (int i = 0; i < in.r.getAttributeCount(); i++) {
            String ns = in.r.getAttributeNamespace(i);
            String n = in.r.getAttributeLocalName(i);
            String v = in.r.getAttributeValue(i);
            if (ns != null && !ns.isEmpty()) {
                throw in.fail("attribute '" + in.attrName(i) + "' is not expected on an instance of '" + cls + "'");
            }
            switch (n) {
                case "key": key = v; break;
                case "id": id = v; break;
                case "idEsc": id = unescape(n, v); break;
                case "idBin":
                    try {
                        id = ValueTexts.parseBinary(v);
                    } catch (IllegalArgumentException x) {
                        throw in.fail("instance of '" + cls + "': identifier idBin " + x.getMessage(), x);
                    }
                    break;
                case "state":
                    for (String s : XmlNames.tokens(v)) {
                        switch (s) {
                            case "created": created = true; break;
                            case "modified": modified = true; break;
                            case "deleted": deleted = true; break;
                            default:
                                throw in.fail("instance of '" + cls + "': state '" + XmlNames.clip(s) + "' is not"
                                        + " created, modified or deleted");
                        }
                    }
                    break;
                default:
                    throw in.fail("attribute '" + n + "' is not expected on an instance of '" + cls + "' (known: key,"
                            + " id, idEsc, idBin, state)");
            }
        }
        Instance x;
        try {
            x = st.newInstance(m, id, created, modified, deleted);
        } catch (IllegalArgumentException ex) {
            throw new XmlDocumentException(in.source, line, column, ex.getMessage(), ex);
        }
        if (key != null && !keys.add(key, x)) {
            throw new XmlDocumentException(in.source, line, column, "instance of '" + cls + "': key '"
                    + XmlNames.clip(key) + "' is used twice in the document", null);
        }
        values(x, m, cls);
    }

    private void values(Instance x, Model m, String cls) {
        AttributeDef[] layout = m.alignedTo;
        AttributeDef[] named = m.classDef.layout;
        Collect[] multi = null;
        int expected = 0; // values come in layout order when written by this package: try that first
        while (in.nextTag("instance of", cls) == XMLStreamConstants.START_ELEMENT) {
            String n = in.r.getLocalName();
            int p = -1;
            if (NS.equals(in.nsOf())) {
                p = expected < named.length && named[expected].name.equals(n) ? expected : m.classDef.positionOf(n);
            }
            if (p < 0) {
                throw in.fail("class '" + cls + "' has no attribute '" + n + "'"
                        + (NS.equals(in.nsOf()) ? "" : " in namespace '" + in.nsOf() + "'"));
            }
            AttributeDef def = layout[p];
            expected = def.multi ? p : p + 1;
            if (!def.multi) {
                if (x.values[p] != null) {
                    throw in.fail("attribute '" + def.qualifiedName() + "' is single-valued but is given more than"
                            + " one value");
                }
                Object v = item(x, def, null);
                if (v instanceof RefKey) {
                    refs.add(new PendingRef(x, p, new RefKey[] {(RefKey) v}));
                }
                // a pending reference holds its key until resolve() puts the target in its place
                x.values[p] = v;
                continue;
            }
            if (multi == null) {
                multi = new Collect[layout.length];
            }
            Collect c = multi[p];
            if (c == null) {
                c = multi[p] = new Collect();
                c.line = in.line();
                c.column = in.column();
            }
            Object v = item(x, def, c);
            if (v != null) {
                c.items.add(v);
            }
            if (c.nil && !c.items.isEmpty()) {
                throw in.fail("attribute '" + def.qualifiedName() + "': an empty value (xsi:nil) cannot stand beside"
                        + " other values");
            }
        }
        if (multi != null) {
            for (int p = 0; p < multi.length; p++) {
                if (multi[p] != null) {
                    store(x, layout[p], p, multi[p]);
                }
            }
        }
    }

    /**
     * Reads one value element (the reader is on its start tag and ends on its end tag). Returns the
     * stored form of one value, a {@link RefKey} for a relationship, or null for an xsi:nil.
     */
    private Object item(Instance x, AttributeDef def, Collect c) {
        String esc = null;
        String bits = null;
        String ref = null;
        boolean nil = false;
        for (int i = 0; i < in.r.getAttributeCount(); i++) {
            String ns = in.r.getAttributeNamespace(i);
            String n = in.r.getAttributeLocalName(i);
            String v = in.r.getAttributeValue(i);
            if (XSI.equals(ns) && n.equals("nil")) {
                try {
                    nil = ValueTexts.parseBoolean(v);
                } catch (IllegalArgumentException x2) {
                    throw in.fail("xsi:nil of '" + def.qualifiedName() + "': " + x2.getMessage(), x2);
                }
            } else if ((ns == null || ns.isEmpty()) && n.equals("esc") && def.type == AttributeType.String) {
                esc = v;
            } else if ((ns == null || ns.isEmpty()) && n.equals("bits") && def.type == AttributeType.Double) {
                bits = v;
            } else if ((ns == null || ns.isEmpty()) && n.equals("ref") && def.type == AttributeType.Relationship) {
                ref = v;
            } else {
                throw in.fail("attribute '" + in.attrName(i) + "' is not expected on the value of '"
                        + def.qualifiedName() + "' (" + def.type + ")");
            }
        }
        if (nil) {
            if (c == null) {
                throw in.fail("attribute '" + def.qualifiedName() + "' is single-valued: xsi:nil (an empty array) is"
                        + " only for multi-valued attributes; leave the element out for no value");
            }
            if (!c.items.isEmpty() || c.nil) {
                throw in.fail("attribute '" + def.qualifiedName() + "': an empty value (xsi:nil) cannot stand beside"
                        + " other values");
            }
            c.nil = true;
            String t = in.valueText(def);
            if (!t.isEmpty() || esc != null || ref != null || bits != null) {
                throw in.fail("attribute '" + def.qualifiedName() + "': an element with xsi:nil has no content");
            }
            return null;
        }
        javax.xml.stream.Location at = in.r.getLocation();
        int line = at.getLineNumber();
        int column = at.getColumnNumber();
        // numbers, booleans and dates are read from the characters, without a String
        boolean chars = def.type == AttributeType.Integer || def.type == AttributeType.Double
                || def.type == AttributeType.Boolean || def.type == AttributeType.Date;
        String text = null;
        if (chars) {
            in.valueChars(def);
        } else {
            text = in.valueText(def);
        }
        try {
            switch (def.type) {
                case Integer: return ValueTexts.parseInt(in.chars, in.charCount);
                case Double: return ValueTexts.parseDouble(in.chars, in.charCount, bits);
                case Boolean: return ValueTexts.parseBoolean(in.chars, in.charCount);
                case Date: return ValueTexts.parseDate(in.chars, in.charCount);
                case Binary: return ValueTexts.parseBinary(text);
                case String:
                    if (esc == null) {
                        return text;
                    }
                    if (!text.isEmpty()) {
                        throw new IllegalArgumentException("a value given in 'esc' has no content");
                    }
                    return XmlNames.unescape(esc);
                default:
                    if (ref == null || !text.isBlank()) {
                        throw new IllegalArgumentException("a relationship value is an empty element with a 'ref'"
                                + " to the key of an instance of the document");
                    }
                    return new RefKey(ref, line, column);
            }
        } catch (IllegalArgumentException ex) {
            if (ex instanceof XmlDocumentException) {
                throw ex;
            }
            throw new XmlDocumentException(in.source, line, column, "instance " + x.describe() + ": attribute '"
                    + def.qualifiedName() + "': " + ex.getMessage(), ex);
        }
    }

    private void store(Instance x, AttributeDef def, int p, Collect c) {
        List<Object> items = c.items;
        int n = items.size();
        switch (def.type) {
            case Integer: {
                int[] a = new int[n];
                for (int i = 0; i < n; i++) {
                    a[i] = (Integer) items.get(i);
                }
                x.values[p] = a;
                break;
            }
            case Double: {
                double[] a = new double[n];
                for (int i = 0; i < n; i++) {
                    a[i] = (Double) items.get(i);
                }
                x.values[p] = a;
                break;
            }
            case Boolean: {
                boolean[] a = new boolean[n];
                for (int i = 0; i < n; i++) {
                    a[i] = (Boolean) items.get(i);
                }
                x.values[p] = a;
                break;
            }
            case Date: {
                long[] a = new long[n];
                for (int i = 0; i < n; i++) {
                    a[i] = (Long) items.get(i);
                }
                x.values[p] = a;
                break;
            }
            case String:
                x.values[p] = items.toArray(new String[0]);
                break;
            case Binary:
                x.values[p] = items.toArray(new byte[0][]);
                break;
            default:
                if (n == 0) {
                    x.values[p] = new Instance[0];
                } else {
                    RefKey[] k = items.toArray(new RefKey[0]);
                    x.values[p] = k;
                    refs.add(new PendingRef(x, p, k));
                }
                break;
        }
    }

    // ---------------------------------------------------------------- references

    /** Resolves the relationship values, checking each target against the attribute's target classes. */
    private void resolve() {
        for (PendingRef r : refs) {
            AttributeDef def = r.from.model.alignedTo[r.position];
            Instance[] targets = new Instance[r.keys.length];
            for (int i = 0; i < targets.length; i++) {
                RefKey k = r.keys[i];
                Instance t = keys.get(k.key);
                if (t == null) {
                    throw new XmlDocumentException(in.source, k.line, k.column, "instance "
                            + r.from.describe() + ": attribute '" + def.qualifiedName() + "' refers to key '"
                            + XmlNames.clip(k.key) + "', which no instance of the document has", null);
                }
                if (!Values.isTarget(def.targetNames, t.model.classDef, target.models)) {
                    throw new XmlDocumentException(in.source, k.line, k.column, "instance "
                            + r.from.describe() + ": attribute '" + def.qualifiedName() + "' refers to key '"
                            + XmlNames.clip(k.key) + "', an instance of class '" + t.model.classDef.name
                            + "', not of a target class " + Arrays.toString(def.targetNames), null);
                }
                targets[i] = t;
            }
            r.from.values[r.position] = def.multi ? targets : targets[0];
        }
    }
}
