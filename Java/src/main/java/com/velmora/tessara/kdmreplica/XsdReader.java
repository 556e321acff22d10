package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.XmlNames.NS;
import static com.velmora.tessara.kdmreplica.XmlNames.XS;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import com.velmora.tessara.kdmreplica.vrattributes.Visibility;
import java.io.IOException;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.ArrayList;
import java.util.HashMap;
import java.util.HashSet;
import java.util.LinkedHashMap;
import java.util.List;
import java.util.Map;
import java.util.Set;
import java.util.regex.Pattern;
import javax.xml.stream.XMLStreamConstants;

/**
 * Reads W3C XML Schemas into a replica's schema: the schemas {@link XsdWriter} writes (whose
 * {@code xs:appinfo} gives every property exactly) and hand-written ones of the same shape:
 *
 * <ul>
 * <li>named {@code xs:complexType}s, one per class (optionally {@code abstract}), holding an
 * {@code xs:sequence} of {@code xs:element}s, one per attribute, or an
 * {@code xs:complexContent/xs:extension} of the super class's type with such a sequence;</li>
 * <li>element types {@code xs:int} or {@code xs:integer} (Integer), {@code xs:double},
 * {@code xs:string}, {@code xs:dateTime} (Date), {@code xs:boolean}, {@code xs:base64Binary}
 * (Binary), or a complex type of the schema (a Relationship to that class);</li>
 * <li>{@code minOccurs} 1 (XSD's default) for mandatory or 0, {@code maxOccurs} 1 or
 * {@code unbounded} for multi-valued ({@code nillable} only then: an empty array), an anonymous
 * {@code xs:simpleType} restriction of {@code xs:string} or {@code xs:base64Binary} with
 * {@code xs:maxLength} for the length;</li>
 * <li>the {@code xs:documentation} (text only, one) of a class's {@code xs:complexType} or an
 * attribute's {@code xs:element}: its comment;</li>
 * <li>the {@code targetNamespace}: the classes' schema namespace; type references resolve
 * through their namespace (the replica's own namespace and no namespace are one), to classes of
 * the schemas read or of the replica;</li>
 * <li>global {@code xs:element}s with a named type (document elements: ignored), annotations,
 * and {@code xs:include}/{@code xs:import} of local files in the directory of a schema read from a
 * file (or below it). URLs, files elsewhere, and includes from a schema given as a string are
 * refused without being read.</li>
 * </ul>
 *
 * Anything else is refused with an {@link XmlDocumentException} naming the construct and its line:
 * nothing of a schema is dropped silently but foreign {@code xs:appinfo}, which is for other
 * applications, and the document elements. Classes are named without namespace in a replica (its
 * documents name an instance's class by name alone), so two classes of one name in different
 * namespaces are refused.
 * Classes join the replica through {@link Staging}: on any error the replica is unchanged.
 */
final class XsdReader {
    private static final Set<String> RESERVED = Set.of(XsdWriter.DOCUMENT_TYPE, XsdWriter.INSTANCE_ATTRIBUTES,
            XsdWriter.STATE_LIST, XsdWriter.STRING_TYPE, XsdWriter.DOUBLE_TYPE, XsdWriter.REF_TYPE);
    private static final Pattern SCHEME = Pattern.compile("[A-Za-z][A-Za-z0-9+.-]*:.*", Pattern.DOTALL);
    private static final String SUPPORTED = "supported: named xs:complexType with xs:sequence of typed xs:element,"
            + " xs:complexContent/xs:extension, minOccurs 0 or 1, maxOccurs 1 or unbounded, xs:maxLength,"
            + " xs:annotation, xs:include and xs:import of local files";

    /** A class as read. */
    private static final class DeclaredType {
        String name;
        String source;
        int line;
        int column;
        String base;
        String baseNs;
        int baseLine;
        int baseColumn;
        boolean abstractAttr;
        ClassDef props;
        /** The namespace references find it in ({@link #key}), the one it keeps, and whether ours wrote it. */
        String ns;
        String keptNs;
        boolean ours;
        Doc doc;
        boolean hasContent;
        final List<DeclaredElement> elems = new ArrayList<>();
    }

    /** An attribute as read. */
    private static final class DeclaredElement {
        String name;
        int line;
        int column;
        AttributeType type;
        String classRef;
        String classRefNs;
        boolean multi;
        boolean mandatory;
        int maxLength;
        AttributeDef props;
        Doc doc;
    }

    /** An xs:documentation: its text and where it stands. */
    private static final class Doc {
        final String text;
        final int line;
        final int column;

        Doc(String text, int line, int column) {
            this.text = text;
            this.line = line;
            this.column = column;
        }
    }

    /** Directory that includes must stay in (real path), or null when includes are refused. */
    private final Path rootDir;
    private final String refusal;
    private Path currentDir;
    private final Set<Path> visited = new HashSet<>();
    private final List<DeclaredType> types = new ArrayList<>();
    /** The namespaces ({@link #key}) the schemas read declare classes in. */
    private final Set<String> defined = new HashSet<>();
    /** For a document being included or imported: the target namespace it must have (null: any). */
    private String expect;
    /** Whether the document being read is included (then it may have no target namespace). */
    private boolean including;
    /** The target namespace of the document being read ("" for none), and whether ours wrote it. */
    private String docNs = "";
    private boolean docOurs;
    /** An included document without target namespace: its references without namespace are to docNs. */
    private boolean chameleon;

    private XsdReader(Path schemaFile, String refusal) {
        this.refusal = refusal;
        if (schemaFile != null) {
            Path real;
            try {
                real = schemaFile.toRealPath();
            } catch (IOException e) {
                throw new IllegalArgumentException("cannot read XSD file '" + schemaFile + "': "
                        + XmlInput.describe(e), e);
            }
            this.rootDir = real.getParent();
            this.currentDir = rootDir;
            visited.add(real);
        } else {
            this.rootDir = null;
        }
    }

    // ---------------------------------------------------------------- entry points

    /** {@code Replica.insertSchemaString} / {@code insertSchemaFile}. */
    static void insert(Replica r, XmlInput.Src src) {
        XsdReader rd = new XsdReader(src.file, src.file == null
                ? "a schema given as a string may not include or import other schemas" : null);
        rd.parseDocument(src);
        try (Staging st = new Staging(r)) {
            rd.apply(st);
            st.finish();
        }
    }

    /** A reader for a schema embedded in a document: it may not include anything. */
    static XsdReader embedded() {
        return new XsdReader(null, "a schema embedded in a document may not include or import other schemas");
    }

    /** A reader for the schema file a document names as its schema location. */
    static XsdReader forFile(Path file) {
        return new XsdReader(file, null);
    }

    /** Reads a whole schema document. */
    void parseDocument(XmlInput.Src src) {
        try (XmlInput.In in = src.open()) {
            int e = in.nextTag("the prolog");
            if (e != XMLStreamConstants.START_ELEMENT || !in.is(XS, "schema")) {
                throw in.fail("the document element is " + (e == XMLStreamConstants.START_ELEMENT ? in.qname()
                        + " in namespace '" + in.nsOf() + "'" : "missing") + ", expected xs:schema");
            }
            parseSchema(in);
            if (in.nextTag("the end of the document") != XMLStreamConstants.END_DOCUMENT) {
                throw in.fail("element " + in.qname() + " after the schema");
            }
        }
    }

    // ---------------------------------------------------------------- parsing

    private static XmlDocumentException unsupported(XmlInput.In in, String where) {
        return in.fail("the construct " + in.qname() + " is not supported " + where + " (" + SUPPORTED + ")");
    }

    private static XmlDocumentException unsupportedAttr(XmlInput.In in, int i) {
        return in.fail("attribute '" + in.attrName(i) + "' of " + in.qname() + " is not supported (" + SUPPORTED
                + ")");
    }

    /** The namespace by which references find a class: the replica's own namespace and none are one. */
    private static String key(String ns) {
        return ns == null || NS.equals(ns) ? "" : ns;
    }

    private static String show(String key) {
        return key.isEmpty() ? "no namespace (or the replica's own, " + NS + ")" : "namespace '" + key + "'";
    }

    private static boolean plain(XmlInput.In in, int i) {
        String ns = in.r.getAttributeNamespace(i);
        return ns == null || ns.isEmpty();
    }

    /** Parses an {@code xs:schema} element; the reader is on its start tag and ends on its end tag. */
    void parseSchema(XmlInput.In in) {
        String tns = null;
        for (int i = 0; i < in.r.getAttributeCount(); i++) {
            String n = in.r.getAttributeLocalName(i);
            if (!plain(in, i)) {
                if (!javax.xml.XMLConstants.XML_NS_URI.equals(in.r.getAttributeNamespace(i))) {
                    throw unsupportedAttr(in, i);
                }
            } else if (n.equals("targetNamespace")) {
                tns = in.r.getAttributeValue(i);
            } else if (!n.equals("elementFormDefault") && !n.equals("attributeFormDefault") && !n.equals("version")
                    && !n.equals("id")) {
                throw unsupportedAttr(in, i);
            }
        }
        String declared = tns == null ? "" : tns;
        if (expect != null && !declared.equals(expect) && !(including && declared.isEmpty())) {
            throw in.fail("the " + (including ? "included" : "imported") + " schema has "
                    + (declared.isEmpty() ? "no targetNamespace" : "targetNamespace '" + declared + "'") + ", not "
                    + (expect.isEmpty() ? "none" : "'" + expect + "'") + (including ? " as the schema including it"
                    : " as its xs:import says"));
        }
        boolean ours = NS.equals(tns);
        chameleon = including && declared.isEmpty() && !expect.isEmpty();
        docNs = chameleon ? expect : declared;
        docOurs = ours;
        defined.add(key(docNs));
        for (;;) {
            int e = in.nextTag("xs:schema");
            if (e == XMLStreamConstants.END_ELEMENT) {
                return;
            }
            if (!XS.equals(in.nsOf())) {
                throw in.fail("element " + in.qname() + " (namespace '" + in.nsOf() + "') is not a schema construct");
            }
            String local = in.r.getLocalName();
            String name = in.attr("name");
            switch (local) {
                case "annotation":
                    annotation(in, null, null, "at the top level of a schema");
                    break;
                case "include":
                case "import":
                    include(in);
                    break;
                case "complexType":
                    if (ours && RESERVED.contains(name)) {
                        in.skip();
                    } else {
                        types.add(complexType(in));
                    }
                    break;
                case "element":
                    globalElement(in);
                    break;
                case "simpleType":
                case "attributeGroup":
                    if (ours && RESERVED.contains(name)) {
                        in.skip();
                        break;
                    }
                    throw unsupported(in, "at the top level of a schema");
                default:
                    throw unsupported(in, "at the top level of a schema");
            }
        }
    }

    private void include(XmlInput.In in) {
        String what = in.qname();
        String loc = in.attr("schemaLocation");
        if (refusal != null) {
            throw in.fail(what + " is refused: " + refusal + " (nothing was read)");
        }
        if (loc == null) {
            throw in.fail(what + " names no schemaLocation; only local files next to the inserted schema are read");
        }
        String decoded;
        try {
            decoded = SchemaLocations.decodeLocation(loc.strip());
        } catch (IllegalArgumentException e) {
            throw in.fail(what + ": " + e.getMessage(), e);
        }
        if (SCHEME.matcher(decoded).matches()) {
            throw in.fail(what + " of '" + XmlNames.clip(decoded) + "' is refused: only local files next to the"
                    + " inserted schema are read, never URLs (nothing was fetched)");
        }
        Path p;
        try {
            p = currentDir.resolve(decoded).normalize();
        } catch (java.nio.file.InvalidPathException e) {
            throw in.fail(what + ": '" + XmlNames.clip(decoded) + "' is not a valid path", e);
        }
        if (!p.startsWith(rootDir)) {
            throw in.fail(what + " of '" + XmlNames.clip(decoded) + "' is refused: it is outside the directory of"
                    + " the inserted schema, " + rootDir + " (nothing was read)");
        }
        Path real;
        try {
            real = p.toRealPath();
        } catch (IOException e) {
            throw in.fail(what + ": cannot read '" + p + "': " + XmlInput.describe(e), e);
        }
        if (!real.startsWith(rootDir) || !Files.isRegularFile(real)) {
            throw in.fail(what + " of '" + XmlNames.clip(decoded) + "' is refused: it is not a file inside the"
                    + " directory of the inserted schema, " + rootDir + " (nothing was read)");
        }
        boolean isInclude = in.is(XS, "include");
        String ns = isInclude ? docNs : in.attr("namespace");
        in.skip();
        if (visited.add(real)) {
            Path saved = currentDir;
            String savedNs = docNs;
            String savedExpect = expect;
            boolean savedOurs = docOurs;
            boolean savedIncluding = including;
            boolean savedChameleon = chameleon;
            currentDir = real.getParent();
            expect = ns == null ? "" : ns;
            including = isInclude;
            try {
                parseDocument(XmlInput.Src.ofFile("XSD", real.toString(), "insertSchemaFile"));
            } finally {
                currentDir = saved;
                docNs = savedNs;
                expect = savedExpect;
                docOurs = savedOurs;
                including = savedIncluding;
                chameleon = savedChameleon;
            }
        }
    }

    private static void globalElement(XmlInput.In in) {
        boolean typed = false;
        for (int i = 0; i < in.r.getAttributeCount(); i++) {
            String n = in.r.getAttributeLocalName(i);
            if (plain(in, i) && n.equals("type")) {
                typed = true;
            } else if (!plain(in, i) || !n.equals("name") && !n.equals("id")) {
                throw unsupportedAttr(in, i);
            }
        }
        String name = in.attr("name");
        while (in.nextTag("xs:element") == XMLStreamConstants.START_ELEMENT) {
            if (!in.is(XS, "annotation")) {
                throw unsupported(in, "in the top-level element '" + name + "' (declare a named xs:complexType and"
                        + " give the element that type)");
            }
            annotation(in, null, null, "in the top-level element '" + name + "'");
        }
        if (!typed) {
            throw in.fail("the top-level element '" + name + "' has no type; give it the type of a named"
                    + " xs:complexType");
        }
    }

    private DeclaredType complexType(XmlInput.In in) {
        DeclaredType t = new DeclaredType();
        t.ns = key(docNs);
        t.keptNs = key(docNs);
        t.ours = docOurs;
        t.source = in.source;
        t.line = in.line();
        t.column = in.column();
        for (int i = 0; i < in.r.getAttributeCount(); i++) {
            String n = in.r.getAttributeLocalName(i);
            String v = in.r.getAttributeValue(i);
            if (!plain(in, i)) {
                throw unsupportedAttr(in, i);
            } else if (n.equals("name")) {
                t.name = v;
            } else if (n.equals("abstract")) {
                t.abstractAttr = bool(in, n, v);
            } else if (n.equals("mixed") && !bool(in, n, v) || n.equals("id")) {
                continue;
            } else {
                throw unsupportedAttr(in, i);
            }
        }
        if (t.name == null) {
            throw in.fail("a top-level xs:complexType has no name");
        }
        while (in.nextTag("xs:complexType '" + t.name + "'") == XMLStreamConstants.START_ELEMENT) {
            if (!XS.equals(in.nsOf())) {
                throw unsupported(in, "in xs:complexType '" + t.name + "'");
            }
            switch (in.r.getLocalName()) {
                case "annotation":
                    annotation(in, t, null, null);
                    break;
                case "sequence":
                    content(in, t);
                    sequence(in, t);
                    break;
                case "complexContent":
                    content(in, t);
                    complexContent(in, t);
                    break;
                case "attributeGroup":
                    attributeGroupRef(in);
                    break;
                default:
                    throw unsupported(in, "in xs:complexType '" + t.name + "'");
            }
        }
        return t;
    }

    private static void content(XmlInput.In in, DeclaredType t) {
        if (t.hasContent) {
            throw in.fail("xs:complexType '" + t.name + "' has a second content model " + in.qname());
        }
        t.hasContent = true;
    }

    private static boolean bool(XmlInput.In in, String what, String v) {
        switch (v.strip()) {
            case "true":
            case "1":
                return true;
            case "false":
            case "0":
                return false;
            default:
                throw in.fail("'" + what + "' of " + in.qname() + " is '" + XmlNames.clip(v) + "', not a boolean");
        }
    }

    /** The namespace URI and local name of a QName in an attribute value, resolved at the current element. */
    private static String[] qname(XmlInput.In in, String what, String text) {
        String t = text.strip();
        int colon = t.indexOf(':');
        String prefix = colon < 0 ? "" : t.substring(0, colon);
        String local = colon < 0 ? t : t.substring(colon + 1);
        String ns = in.r.getNamespaceContext().getNamespaceURI(prefix);
        if (colon >= 0 && (ns == null || ns.isEmpty())) {
            throw in.fail(what + " '" + t + "' of " + in.qname() + " uses the undeclared prefix '" + prefix + "'");
        }
        return new String[] {ns == null ? "" : ns, local};
    }

    /** A reference to a class: its namespace ({@link #key}, a chameleon's none taken as its includer's) and name. */
    private String[] classRef(XmlInput.In in, String what, String text) {
        String[] q = qname(in, what, text);
        return new String[] {key(chameleon && q[0].isEmpty() ? docNs : q[0]), q[1]};
    }

    private void complexContent(XmlInput.In in, DeclaredType t) {
        for (int i = 0; i < in.r.getAttributeCount(); i++) {
            String n = in.r.getAttributeLocalName(i);
            if (!plain(in, i) || !n.equals("id") && !(n.equals("mixed") && !bool(in, n, in.r.getAttributeValue(i)))) {
                throw unsupportedAttr(in, i);
            }
        }
        boolean extension = false;
        while (in.nextTag("xs:complexContent") == XMLStreamConstants.START_ELEMENT) {
            if (in.is(XS, "annotation")) {
                annotation(in, null, null, "in xs:complexContent of '" + t.name + "'");
                continue;
            }
            if (!in.is(XS, "extension") || extension) {
                throw unsupported(in, "in xs:complexContent of '" + t.name + "' (use one xs:extension of the super"
                        + " class's type)");
            }
            extension = true;
            for (int i = 0; i < in.r.getAttributeCount(); i++) {
                String n = in.r.getAttributeLocalName(i);
                if (!plain(in, i) || !n.equals("base") && !n.equals("id")) {
                    throw unsupportedAttr(in, i);
                }
            }
            String base = in.attr("base");
            if (base == null) {
                throw in.fail("xs:extension in '" + t.name + "' has no base");
            }
            String[] q = qname(in, "base", base);
            if (XS.equals(q[0])) {
                throw in.fail("xs:extension of '" + base + "' in '" + t.name + "' is not supported: the base must be"
                        + " the complex type of the super class");
            }
            q = classRef(in, "base", base);
            t.baseNs = q[0];
            t.base = q[1];
            t.baseLine = in.line();
            t.baseColumn = in.column();
            boolean seq = false;
            while (in.nextTag("xs:extension") == XMLStreamConstants.START_ELEMENT) {
                if (in.is(XS, "annotation")) {
                    annotation(in, null, null, "in xs:extension of '" + t.name + "'");
                } else if (in.is(XS, "sequence") && !seq) {
                    seq = true;
                    sequence(in, t);
                } else if (in.is(XS, "attributeGroup")) {
                    attributeGroupRef(in);
                } else {
                    throw unsupported(in, "in xs:extension of '" + t.name + "'");
                }
            }
        }
        if (!extension) {
            throw in.fail("xs:complexContent of '" + t.name + "' has no xs:extension");
        }
    }

    private static void attributeGroupRef(XmlInput.In in) {
        String ref = in.attr("ref");
        String[] q = ref == null ? null : qname(in, "ref", ref);
        if (q == null || !NS.equals(q[0]) || !XsdWriter.INSTANCE_ATTRIBUTES.equals(q[1])
                || in.r.getAttributeCount() != 1) {
            throw unsupported(in, "(only the document's own instance attributes group may be referred to; classes"
                    + " hold their attributes as elements)");
        }
        in.skip();
    }

    private void sequence(XmlInput.In in, DeclaredType t) {
        for (int i = 0; i < in.r.getAttributeCount(); i++) {
            String n = in.r.getAttributeLocalName(i);
            String v = in.r.getAttributeValue(i).strip();
            if (!plain(in, i) || !(n.equals("id") || (n.equals("minOccurs") || n.equals("maxOccurs")) && v.equals("1"))) {
                throw unsupportedAttr(in, i);
            }
        }
        while (in.nextTag("xs:sequence of '" + t.name + "'") == XMLStreamConstants.START_ELEMENT) {
            if (in.is(XS, "annotation")) {
                annotation(in, null, null, "in the xs:sequence of '" + t.name + "'");
            } else if (in.is(XS, "element")) {
                t.elems.add(localElement(in, t));
            } else {
                throw unsupported(in, "in the xs:sequence of '" + t.name + "'");
            }
        }
    }

    private static int occurs(XmlInput.In in, String what, String v) {
        String s = v.strip();
        if (what.equals("maxOccurs") && s.equals("unbounded")) {
            return Integer.MAX_VALUE;
        }
        try {
            int n = Integer.parseInt(s);
            if (n >= 0) {
                return n;
            }
        } catch (NumberFormatException e) {
            // reported below
        }
        throw in.fail(what + " '" + XmlNames.clip(v) + "' of " + in.qname() + " is not a count");
    }

    private DeclaredElement localElement(XmlInput.In in, DeclaredType t) {
        DeclaredElement e = new DeclaredElement();
        e.line = in.line();
        e.column = in.column();
        int min = 1;
        int max = 1;
        boolean nillable = false;
        String type = null;
        for (int i = 0; i < in.r.getAttributeCount(); i++) {
            String n = in.r.getAttributeLocalName(i);
            String v = in.r.getAttributeValue(i);
            if (!plain(in, i)) {
                throw unsupportedAttr(in, i);
            }
            switch (n) {
                case "name": e.name = v; break;
                case "type": type = v; break;
                case "minOccurs": min = occurs(in, n, v); break;
                case "maxOccurs": max = occurs(in, n, v); break;
                case "nillable": nillable = bool(in, n, v); break;
                case "id": break;
                case "form":
                    if (v.strip().equals("qualified")) {
                        break;
                    }
                    throw unsupportedAttr(in, i);
                default:
                    throw unsupportedAttr(in, i);
            }
        }
        if (e.name == null) {
            throw in.fail("an xs:element in '" + t.name + "' has no name");
        }
        if (max == 0 || min > max) {
            throw in.fail("element '" + e.name + "' of '" + t.name + "' has minOccurs " + min + " and maxOccurs "
                    + (max == Integer.MAX_VALUE ? "unbounded" : Integer.toString(max)));
        }
        if (min > 1 || max != 1 && max != Integer.MAX_VALUE) {
            throw in.fail("element '" + e.name + "' of '" + t.name + "' has minOccurs " + min + " and maxOccurs "
                    + (max == Integer.MAX_VALUE ? "unbounded" : Integer.toString(max)) + ": bounds are not supported (an"
                    + " attribute is optional or mandatory, minOccurs 0 or 1, and single or multi-valued, maxOccurs 1"
                    + " or unbounded)");
        }
        if (nillable && max == 1) {
            throw in.fail("element '" + e.name + "' of '" + t.name + "' is nillable but single-valued: nillable is"
                    + " supported only with maxOccurs unbounded (xsi:nil is an empty multi-valued attribute; a"
                    + " single-valued one has a value or none)");
        }
        e.mandatory = min >= 1;
        e.multi = max > 1;
        if (type != null) {
            resolveType(in, e, type);
        }
        while (in.nextTag("xs:element '" + e.name + "'") == XMLStreamConstants.START_ELEMENT) {
            if (in.is(XS, "annotation")) {
                annotation(in, null, e, null);
            } else if ((in.is(XS, "simpleType") || in.is(XS, "complexType")) && e.type == null) {
                anonymousType(in, e);
            } else if (in.is(XS, "simpleType") || in.is(XS, "complexType")) {
                throw in.fail("element '" + e.name + "' has a type already and also an anonymous " + in.qname());
            } else {
                throw unsupported(in, "in xs:element '" + e.name + "'");
            }
        }
        if (e.type == null) {
            throw in.fail("element '" + e.name + "' of '" + t.name + "' has no type");
        }
        return e;
    }

    private void resolveType(XmlInput.In in, DeclaredElement e, String type) {
        String[] q = qname(in, "type", type);
        if (XS.equals(q[0])) {
            switch (q[1]) {
                case "int":
                case "integer":
                    e.type = AttributeType.Integer;
                    return;
                case "double": e.type = AttributeType.Double; return;
                case "string": e.type = AttributeType.String; return;
                case "dateTime": e.type = AttributeType.Date; return;
                case "boolean": e.type = AttributeType.Boolean; return;
                case "base64Binary": e.type = AttributeType.Binary; return;
                default:
                    throw in.fail("type 'xs:" + q[1] + "' of element '" + e.name + "' is not supported (supported:"
                            + " xs:int, xs:integer, xs:double, xs:string, xs:dateTime, xs:boolean, xs:base64Binary"
                            + " and the complex types of classes)");
            }
        }
        if (NS.equals(q[0])) {
            switch (q[1]) {
                case XsdWriter.STRING_TYPE: e.type = AttributeType.String; return;
                case XsdWriter.DOUBLE_TYPE: e.type = AttributeType.Double; return;
                case XsdWriter.REF_TYPE: e.type = AttributeType.Relationship; return;
                default: break;
            }
        }
        e.type = AttributeType.Relationship;
        q = classRef(in, "type", type);
        e.classRefNs = q[0];
        e.classRef = q[1];
    }

    /** An anonymous simple or complex type: a restriction of a string or binary type by xs:maxLength. */
    private static void anonymousType(XmlInput.In in, DeclaredElement e) {
        boolean complex = in.is(XS, "complexType");
        if (in.r.getAttributeCount() > 0) {
            throw unsupportedAttr(in, 0);
        }
        boolean done = false;
        while (in.nextTag(in.qname()) == XMLStreamConstants.START_ELEMENT) {
            if (in.is(XS, "annotation")) {
                annotation(in, null, null, "in the anonymous type of element '" + e.name + "'");
                continue;
            }
            if (done) {
                throw unsupported(in, "in the anonymous type of element '" + e.name + "'");
            }
            if (complex) {
                if (!in.is(XS, "simpleContent")) {
                    throw unsupported(in, "in the anonymous type of element '" + e.name + "' (a class's attribute"
                            + " holds a value; for a relationship, name the target class's type)");
                }
                while (in.nextTag("xs:simpleContent") == XMLStreamConstants.START_ELEMENT) {
                    if (in.is(XS, "annotation")) {
                        annotation(in, null, null, "in the anonymous type of element '" + e.name + "'");
                    } else if (in.is(XS, "restriction") && e.type == null) {
                        restriction(in, e, true);
                    } else {
                        throw unsupported(in, "in the xs:simpleContent of element '" + e.name + "'");
                    }
                }
            } else {
                if (!in.is(XS, "restriction")) {
                    throw unsupported(in, "in the anonymous type of element '" + e.name + "'");
                }
                restriction(in, e, false);
            }
            done = true;
        }
        if (e.type == null) {
            throw in.fail("the anonymous type of element '" + e.name + "' has no xs:restriction");
        }
    }

    private static void restriction(XmlInput.In in, DeclaredElement e, boolean complex) {
        String base = in.attr("base");
        if (base == null || in.r.getAttributeCount() != 1) {
            throw in.fail("xs:restriction in element '" + e.name + "' needs exactly a base");
        }
        String[] q = qname(in, "base", base);
        if (complex && NS.equals(q[0]) && q[1].equals(XsdWriter.STRING_TYPE)
                || !complex && XS.equals(q[0]) && q[1].equals("string")) {
            e.type = AttributeType.String;
        } else if (!complex && XS.equals(q[0]) && q[1].equals("base64Binary")) {
            e.type = AttributeType.Binary;
        } else {
            throw in.fail("xs:restriction of '" + base + "' in element '" + e.name + "' is not supported: only"
                    + " xs:string and xs:base64Binary may be restricted, by xs:maxLength");
        }
        while (in.nextTag("xs:restriction") == XMLStreamConstants.START_ELEMENT) {
            if (in.is(XS, "annotation")) {
                annotation(in, null, null, "in the xs:restriction of element '" + e.name + "'");
            } else if (in.is(XS, "maxLength")) {
                String v = in.attr("value");
                try {
                    e.maxLength = Integer.parseInt(v == null ? "" : v.strip());
                } catch (NumberFormatException x) {
                    throw in.fail("xs:maxLength of element '" + e.name + "' has no count value", x);
                }
                if (e.maxLength < 0) {
                    throw in.fail("xs:maxLength of element '" + e.name + "' is negative");
                }
                in.skip();
            } else {
                throw unsupported(in, "in the xs:restriction of element '" + e.name + "' (only xs:maxLength)");
            }
        }
    }

    /**
     * An xs:annotation: our appinfo gives the properties of class {@code t} or attribute {@code e},
     * the xs:documentation their comment; with neither ({@code where} says where the annotation
     * stands) a documentation has no place and is refused.
     */
    private static void annotation(XmlInput.In in, DeclaredType t, DeclaredElement e, String where) {
        while (in.nextTag("xs:annotation") == XMLStreamConstants.START_ELEMENT) {
            if (in.is(XS, "documentation")) {
                if (t == null && e == null) {
                    throw in.fail("xs:documentation " + where + " is not supported: only a class's xs:complexType"
                            + " and an attribute's xs:element keep one, as their comment");
                }
                if (in.r.getAttributeCount() > 0) {
                    throw in.fail("attribute '" + in.attrName(0) + "' of xs:documentation is not supported (the"
                            + " comment it becomes keeps the text only)");
                }
                String owner = t != null ? "class '" + t.name + "'" : "attribute '" + e.name + "'";
                if ((t != null ? t.doc : e.doc) != null) {
                    throw in.fail("a second xs:documentation of " + owner + " is not supported: its comment is one"
                            + " text");
                }
                int line = in.line();
                int column = in.column();
                Doc d = new Doc(in.text("the xs:documentation of " + owner), line, column);
                if (t != null) {
                    t.doc = d;
                } else {
                    e.doc = d;
                }
            } else if (in.is(XS, "appinfo")) {
                while (in.nextTag("xs:appinfo") == XMLStreamConstants.START_ELEMENT) {
                    if (t != null && in.is(NS, "class")) {
                        t.props = classProps(in, t.name);
                    } else if (e != null && in.is(NS, "attribute")) {
                        e.props = attrProps(in, e.name);
                    } else {
                        in.skip();
                    }
                }
            } else {
                throw unsupported(in, "in xs:annotation");
            }
        }
    }

    /** A text property: {@code name} as it stands, or {@code nameEsc} unescaped; null when neither is. */
    private static String text(XmlInput.In in, int i, String local) {
        String v = in.r.getAttributeValue(i);
        if (!local.endsWith("Esc")) {
            return v;
        }
        try {
            return XmlNames.unescape(v);
        } catch (IllegalArgumentException x) {
            throw in.fail("attribute '" + local + "' of " + in.qname() + ": " + x.getMessage(), x);
        }
    }

    private static String base(String local) {
        return local.endsWith("Esc") ? local.substring(0, local.length() - 3) : local;
    }

    private static <E extends Enum<E>> E enumValue(XmlInput.In in, Class<E> type, String what, String v) {
        try {
            return Enum.valueOf(type, v.strip());
        } catch (IllegalArgumentException x) {
            StringBuilder known = new StringBuilder();
            for (E k : type.getEnumConstants()) {
                known.append(known.length() == 0 ? "" : ", ").append(k.name());
            }
            throw in.fail(what + " '" + XmlNames.clip(v) + "' of " + in.qname() + " is not one of " + known, x);
        }
    }

    /** Names from {@code <c:x name=".."/>} children, in order. */
    private static void names(XmlInput.In in, String what, List<String> a, List<String> b, String childA,
            String childB) {
        while (in.nextTag(what) == XMLStreamConstants.START_ELEMENT) {
            List<String> into = in.is(NS, childA) ? a : childB != null && in.is(NS, childB) ? b : null;
            if (into == null) {
                throw in.fail("element " + in.qname() + " is not expected in " + what);
            }
            String v = null;
            for (int i = 0; i < in.r.getAttributeCount(); i++) {
                String n = in.r.getAttributeLocalName(i);
                if (!plain(in, i) || !base(n).equals("name")) {
                    throw in.fail("attribute '" + in.attrName(i) + "' is not expected on " + in.qname());
                }
                v = text(in, i, n);
            }
            if (v == null) {
                throw in.fail(in.qname() + " has no name");
            }
            into.add(v);
            in.skip();
        }
    }

    private static ClassDef classProps(XmlInput.In in, String cls) {
        ClassDef c = new ClassDef("props");
        c.namespace = null; // given only by the attribute
        for (int i = 0; i < in.r.getAttributeCount(); i++) {
            String n = in.r.getAttributeLocalName(i);
            String v = in.r.getAttributeValue(i);
            if (!plain(in, i)) {
                throw in.fail("attribute '" + in.attrName(i) + "' is not expected on " + in.qname());
            }
            switch (base(n)) {
                case "uuid": c.uuid = text(in, i, n); break;
                case "comment": c.comment = text(in, i, n); break;
                case "namespace": c.namespace = text(in, i, n); break;
                case "derivability": c.derivability = text(in, i, n); break;
                case "extensible": c.extensible = bool(in, n, v); break;
                case "abstract": c.abstractClass = bool(in, n, v); break;
                case "persistent": c.persistent = bool(in, n, v); break;
                case "visibility": c.visibility = enumValue(in, Visibility.class, n, v); break;
                case "classType": c.classType = enumValue(in, ClassType.class, n, v); break;
                default:
                    throw in.fail("attribute '" + n + "' is not a class property (on " + in.qname() + " of '" + cls
                            + "')");
            }
        }
        List<String> scopes = new ArrayList<>();
        names(in, "the properties of class '" + cls + "'", scopes, null, "scope", null);
        c.scopeNames = scopes.toArray(new String[0]);
        return c;
    }

    private static AttributeDef attrProps(XmlInput.In in, String attr) {
        AttributeDef a = new AttributeDef("props", AttributeType.String);
        for (int i = 0; i < in.r.getAttributeCount(); i++) {
            String n = in.r.getAttributeLocalName(i);
            String v = in.r.getAttributeValue(i);
            if (!plain(in, i)) {
                throw in.fail("attribute '" + in.attrName(i) + "' is not expected on " + in.qname());
            }
            switch (base(n)) {
                case "mandatory": a.mandatory = bool(in, n, v); break;
                case "unique": a.unique = bool(in, n, v); break;
                case "length":
                    try {
                        a.length = Integer.parseInt(v.strip());
                    } catch (NumberFormatException x) {
                        throw in.fail("length '" + XmlNames.clip(v) + "' of attribute '" + attr + "' is not an"
                                + " integer", x);
                    }
                    break;
                case "access": a.accessMode = enumValue(in, AccessMode.class, n, v); break;
                case "visibility": a.visibility = enumValue(in, Visibility.class, n, v); break;
                case "aggregation": a.aggregation = enumValue(in, AggregationType.class, n, v); break;
                case "uuid": a.uuid = text(in, i, n); break;
                case "comment": a.comment = text(in, i, n); break;
                default:
                    throw in.fail("attribute '" + n + "' is not an attribute property (on " + in.qname() + " of '"
                            + attr + "')");
            }
        }
        List<String> targets = new ArrayList<>();
        List<String> refs = new ArrayList<>();
        names(in, "the properties of attribute '" + attr + "'", targets, refs, "target", "targetRef");
        a.targetNames = targets.toArray(new String[0]);
        a.targetRefs = refs.toArray(new String[0]);
        return a;
    }

    // ---------------------------------------------------------------- building

    private static XmlDocumentException at(DeclaredType t, int line, int column, String message, Throwable cause) {
        return new XmlDocumentException(t.source, line, column, message, cause);
    }

    /** Adds the classes read to a staging (caller finishes or abandons it). */
    void apply(Staging st) {
        Replica r = st.replica();
        Map<String, DeclaredType> byName = new LinkedHashMap<>();
        String apart = ": a replica names its classes without namespace (its documents name an instance's class by"
                + " name alone), so two classes of one name cannot be kept apart";
        for (DeclaredType t : types) {
            DeclaredType first = byName.putIfAbsent(t.name, t);
            if (first != null) {
                throw at(t, t.line, t.column, "class '" + t.name + "' is defined twice (first in " + first.source
                        + " at line " + first.line + (first.ns.equals(t.ns) ? ")" : ", in " + show(first.ns)
                        + "; here in " + show(t.ns) + ")" + apart), null);
            }
            Model m = r.models.byName.get(t.name);
            if (m != null) {
                String ns = key(m.classDef.namespace);
                throw at(t, t.line, t.column, "replica '" + r.name + "' already has a class '" + t.name + "'"
                        + (ns.equals(t.ns) || t.ours ? "" : " (in " + show(ns) + "; this one is in " + show(t.ns) + ")"
                        + apart), null);
            }
        }
        Set<String> spaces = new HashSet<>(defined);
        for (Model m : r.models.items) {
            spaces.add(key(m.classDef.namespace));
        }
        for (DeclaredType t : types) {
            if (t.base != null) {
                String bad = unresolved(r, byName, spaces, t, t.baseNs, t.base);
                if (bad != null) {
                    throw at(t, t.baseLine, t.baseColumn, "the base type '" + t.base + "' of class '" + t.name + "' "
                            + bad, null);
                }
            }
            for (DeclaredElement e : t.elems) {
                String bad = e.classRef == null ? null : unresolved(r, byName, spaces, t, e.classRefNs, e.classRef);
                if (bad != null) {
                    throw at(t, e.line, e.column, "the type '" + e.classRef + "' of element '" + e.name + "' in class '"
                            + t.name + "' " + bad, null);
                }
            }
        }
        Map<String, Integer> depths = new HashMap<>(); // 0 while its chain is being walked
        List<DeclaredType> path = new ArrayList<>();
        for (DeclaredType t : types) {
            int d = 0;
            path.clear();
            for (DeclaredType c = t; c != null; c = c.base == null ? null : byName.get(c.base)) {
                Integer known = depths.putIfAbsent(c.name, 0);
                if (known != null) {
                    if (known == 0) {
                        List<String> names = new ArrayList<>();
                        path.forEach(x -> names.add(x.name));
                        names.add(c.name);
                        throw at(t, t.line, t.column, "class '" + t.name + "' has a cyclic super class chain: "
                                + Names.chain(names), null);
                    }
                    d = known;
                    break;
                }
                path.add(c);
                if (c.base != null && !byName.containsKey(c.base)) {
                    for (ClassDef s = r.models.byName.get(c.base).classDef; s != null; s = r.models.superOf(s)) {
                        d++;
                    }
                }
            }
            for (int i = path.size() - 1; i >= 0; i--) {
                depths.put(path.get(i).name, ++d);
                if (d > BinaryCodec.MAX_SUPER_DEPTH) {
                    throw at(t, t.line, t.column, "the super class chain of class '" + path.get(i).name + "' is longer"
                            + " than " + BinaryCodec.MAX_SUPER_DEPTH + " classes", null);
                }
            }
        }
        List<ClassDef> made = new ArrayList<>();
        for (DeclaredType t : types) {
            made.add(build(t));
        }
        for (int i = 0; i < made.size(); i++) {
            DeclaredType t = types.get(i);
            try {
                st.addClass(made.get(i));
            } catch (IllegalArgumentException x) {
                throw at(t, t.line, t.column, x.getMessage(), x);
            }
        }
        try {
            st.schemaDone();
        } catch (IllegalArgumentException x) {
            String source = types.isEmpty() ? "the schema" : types.get(0).source;
            throw new XmlDocumentException(source, -1, -1, x.getMessage(), x);
        }
    }

    /**
     * Why a reference from class {@code from} to class {@code name} in namespace {@code ns} finds no
     * class, or null when it does: the namespace must be one that classes are declared in, and the
     * class one of the schemas read in that namespace, or a class of the
     * replica in it (by name alone from the replica's own schemas, whose references are all to its
     * own namespace).
     */
    private static String unresolved(Replica r, Map<String, DeclaredType> byName, Set<String> known,
            DeclaredType from, String ns, String name) {
        if (!known.contains(ns)) {
            List<String> names = new ArrayList<>();
            for (String k : known) {
                names.add(k.isEmpty() ? "none" : "'" + k + "'");
            }
            names.sort(null);
            return "is in " + show(ns) + ", which neither the schemas read nor replica '" + r.name + "' declare"
                    + " classes in (namespaces with classes: " + (names.isEmpty() ? "none" : String.join(", ", names))
                    + "); import the schema of that namespace, or refer to the class through its own namespace";
        }
        DeclaredType d = byName.get(name);
        if (d != null) {
            return d.ns.equals(ns) ? null : "is in " + show(ns) + ", but the schema declares '" + name + "' in "
                    + show(d.ns);
        }
        Model m = r.models.byName.get(name);
        if (m != null) {
            String has = key(m.classDef.namespace);
            return from.ours || has.equals(ns) ? null : "is in " + show(ns) + ", but the class '" + name
                    + "' of replica '" + r.name + "' is in " + show(has);
        }
        return "is not defined (neither in the schema nor in replica '" + r.name + "')";
    }

    /** A comment from an xs:documentation, refused when the appinfo gives another one. */
    private static String comment(DeclaredType t, Doc doc, String fromAppinfo, String owner) {
        if (doc == null) {
            return fromAppinfo == null ? "" : fromAppinfo;
        }
        if (fromAppinfo != null && !fromAppinfo.equals(doc.text)) {
            throw at(t, doc.line, doc.column, "the xs:documentation of " + owner + " differs from the comment its"
                    + " xs:appinfo gives: the comment is one text", null);
        }
        return doc.text;
    }

    private static ClassDef build(DeclaredType t) {
        ClassDef c;
        try {
            c = new ClassDef(t.name);
        } catch (IllegalArgumentException x) {
            throw at(t, t.line, t.column, x.getMessage(), x);
        }
        c.superName = t.base == null ? "" : t.base;
        ClassDef p = t.props;
        c.comment = comment(t, t.doc, p == null ? null : p.comment, "class '" + t.name + "'");
        c.namespace = p != null && p.namespace != null ? p.namespace : t.keptNs;
        if (p != null) {
            c.uuid = p.uuid;
            c.derivability = p.derivability;
            c.extensible = p.extensible;
            c.abstractClass = p.abstractClass;
            c.persistent = p.persistent;
            c.visibility = p.visibility;
            c.classType = p.classType;
            c.scopeNames = p.scopeNames;
        } else {
            c.abstractClass = t.abstractAttr;
        }
        for (DeclaredElement e : t.elems) {
            AttributeDef a;
            try {
                a = new AttributeDef(e.name, e.type);
            } catch (IllegalArgumentException x) {
                throw at(t, e.line, e.column, "class '" + t.name + "': " + x.getMessage(), x);
            }
            a.multi = e.multi;
            AttributeDef q = e.props;
            a.comment = comment(t, e.doc, q == null ? null : q.comment, "attribute '" + t.name + "." + e.name + "'");
            if (q != null) {
                a.mandatory = q.mandatory;
                a.unique = q.unique;
                a.length = q.length;
                a.accessMode = q.accessMode;
                a.visibility = q.visibility;
                a.aggregation = q.aggregation;
                a.uuid = q.uuid;
                a.targetNames = q.targetNames;
                a.targetRefs = q.targetRefs;
            } else {
                a.mandatory = e.mandatory;
                a.length = e.maxLength;
                if (e.classRef != null) {
                    a.targetNames = new String[] {e.classRef};
                }
            }
            try {
                c.attributes.add(a);
            } catch (IllegalArgumentException x) {
                throw at(t, e.line, e.column, x.getMessage(), x);
            }
        }
        return c;
    }
}
