package com.velmora.tessara.kdmreplica;

import static com.velmora.tessara.kdmreplica.XmlNames.NS;
import static com.velmora.tessara.kdmreplica.XmlNames.XS;

import com.velmora.tessara.kdmreplica.vrattributes.AccessMode;
import com.velmora.tessara.kdmreplica.vrattributes.Visibility;
import java.io.OutputStream;
import java.nio.file.Path;
import java.util.concurrent.locks.Lock;

/**
 * Writes a replica's schema as a W3C XML Schema that validates the replica's own documents.
 *
 * <p>Shape: the target namespace is {@link XmlNames#NS}. The document element {@code replica}
 * holds an optional embedded {@code xs:schema}, then instance elements named after their class.
 * Each class is a named complex type (a subclass extends its super class's type) with one
 * optional element per own attribute, in layout order; a multi-valued attribute repeats its
 * element, and an empty array is one element with {@code xsi:nil="true"}. Value types: Integer
 * {@code xs:int}, Double {@code v.double} ({@code xs:double} with the {@code bits} of a NaN
 * payload), String {@code v.string} ({@code xs:string}, or empty with the escaped text in
 * {@code esc}), Date {@code xs:dateTime}, Boolean {@code xs:boolean}, Binary
 * {@code xs:base64Binary}, Relationship {@code v.ref} (a {@code ref} to the target's
 * document-local {@code key}, an {@code xs:IDREF}). A positive length of a String or Binary
 * attribute becomes {@code xs:maxLength}.
 *
 * <p>Every class and attribute property travels in {@code xs:appinfo} ({@code c:class},
 * {@code c:attribute}), so reading the schema back gives the schema exactly. Elements are all
 * optional, so that documents with pending changes (a mandatory value not yet given) validate;
 * mandatory is carried in the appinfo.
 */
final class XsdWriter {
    /** Global declarations of the document structure; class names never contain '.', so never clash. */
    static final String DOCUMENT_TYPE = "replica.document";
    static final String INSTANCE_ATTRIBUTES = "instance.attributes";
    static final String STATE_LIST = "state.list";
    static final String STRING_TYPE = "v.string";
    static final String DOUBLE_TYPE = "v.double";
    static final String REF_TYPE = "v.ref";

    private XsdWriter() {
    }

    /** {@code Replica.getXsd}: takes the replica's read lock for the whole pass. */
    static String write(Replica r) {
        Lock l = r.rw.readLock();
        l.lock();
        try {
            return document(r, null, true);
        } finally {
            l.unlock();
        }
    }

    /** {@code Replica.writeXsdFile}: the schema streamed into the file, under the read lock. */
    static void writeFile(Replica r, Path target) {
        Lock l = r.rw.readLock();
        l.lock();
        try {
            OutputFiles.write(target, "XSD file", (channel, stream) -> document(r, stream, true));
        } finally {
            l.unlock();
        }
    }

    /** The schema as a standalone document (caller holds a lock of the replica). */
    static String text(Replica r) {
        return document(r, null, false);
    }

    /** The schema document; tracked, it reports its classes written (all at once, at the end). */
    private static String document(Replica r, OutputStream stream, boolean tracked) {
        Progress.Tracker progress = tracked ? Progress.start(r.models.items.size()) : null;
        XmlOutput out = new XmlOutput(Replica.getFeature("indent"), stream);
        out.startDocument();
        writeSchema(out, r);
        String text = out.finish();
        if (progress != null) {
            progress.end();
        }
        return text;
    }

    private static void xs(XmlOutput out, String local) {
        out.start("xs", local, XS);
    }

    private static void xsEmpty(XmlOutput out, String local) {
        out.empty("xs", local, XS);
    }

    /** Writes the {@code xs:schema} element (caller holds a lock of the replica). */
    static void writeSchema(XmlOutput out, Replica r) {
        for (Model m : r.models.items) {
            XmlNames.checkXmlName("class", m.classDef.name);
            for (AttributeDef a : m.classDef.attributes.items) {
                XmlNames.checkXmlName("class '" + m.classDef.name + "': attribute", a.name);
            }
        }
        xs(out, "schema");
        out.namespace("xs", XS);
        out.namespace("c", NS);
        out.attr("targetNamespace", NS);
        out.attr("elementFormDefault", "qualified");
        out.attr("version", XmlNames.FORMAT);

        xsEmpty(out, "element");
        out.attr("name", "replica");
        out.attr("type", "c:" + DOCUMENT_TYPE);

        xs(out, "complexType");
        out.attr("name", DOCUMENT_TYPE);
        xs(out, "sequence");
        xsEmpty(out, "any");
        out.attr("namespace", XS);
        out.attr("processContents", "skip");
        out.attr("minOccurs", "0");
        if (!r.models.items.isEmpty()) {
            xs(out, "choice");
            out.attr("minOccurs", "0");
            out.attr("maxOccurs", "unbounded");
            for (Model m : r.models.items) {
                xsEmpty(out, "element");
                out.attr("name", m.classDef.name);
                out.attr("type", "c:" + m.classDef.name);
            }
            out.end();
        }
        out.end();
        attribute(out, "name", "xs:string");
        attribute(out, "nameEsc", "xs:string");
        attribute(out, "format", "xs:string");
        out.end();

        xs(out, "attributeGroup");
        out.attr("name", INSTANCE_ATTRIBUTES);
        attribute(out, "key", "xs:ID");
        attribute(out, "id", "xs:string");
        attribute(out, "idEsc", "xs:string");
        attribute(out, "idBin", "xs:base64Binary");
        attribute(out, "state", "c:" + STATE_LIST);
        out.end();

        xs(out, "simpleType");
        out.attr("name", STATE_LIST);
        xs(out, "list");
        xs(out, "simpleType");
        xs(out, "restriction");
        out.attr("base", "xs:token");
        for (String s : new String[] {"created", "modified", "deleted"}) {
            xsEmpty(out, "enumeration");
            out.attr("value", s);
        }
        out.end();
        out.end();
        out.end();
        out.end();

        simpleContent(out, STRING_TYPE, "xs:string", "esc", "xs:string");
        simpleContent(out, DOUBLE_TYPE, "xs:double", "bits", "xs:hexBinary");
        xs(out, "complexType");
        out.attr("name", REF_TYPE);
        attribute(out, "ref", "xs:IDREF");
        out.end();

        for (Model m : r.models.items) {
            classType(out, m.classDef);
        }
        out.end();
    }

    private static void attribute(XmlOutput out, String name, String type) {
        xsEmpty(out, "attribute");
        out.attr("name", name);
        out.attr("type", type);
    }

    private static void simpleContent(XmlOutput out, String name, String base, String attr, String type) {
        xs(out, "complexType");
        out.attr("name", name);
        xs(out, "simpleContent");
        xs(out, "extension");
        out.attr("base", base);
        attribute(out, attr, type);
        out.end();
        out.end();
        out.end();
    }

    private static void classType(XmlOutput out, ClassDef c) {
        xs(out, "complexType");
        out.attr("name", c.name);
        xs(out, "annotation");
        xs(out, "appinfo");
        if (c.scopeNames.length == 0) {
            out.empty("c", "class", NS);
        } else {
            out.start("c", "class", NS);
        }
        if (!c.uuid.isEmpty()) {
            out.textAttr("uuid", c.uuid);
        }
        if (!c.comment.isEmpty()) {
            out.textAttr("comment", c.comment);
        }
        if (!c.derivability.isEmpty()) {
            out.textAttr("derivability", c.derivability);
        }
        if (c.extensible) {
            out.attr("extensible", "true");
        }
        if (c.abstractClass) {
            out.attr("abstract", "true");
        }
        if (!c.persistent) {
            out.attr("persistent", "false");
        }
        if (c.visibility != Visibility.Public) {
            out.attr("visibility", c.visibility.name());
        }
        if (c.classType != ClassType.Class) {
            out.attr("classType", c.classType.name());
        }
        if (!c.namespace.isEmpty()) {
            out.textAttr("namespace", c.namespace);
        }
        for (String s : c.scopeNames) {
            out.empty("c", "scope", NS);
            out.textAttr("name", s);
        }
        if (c.scopeNames.length > 0) {
            out.end();
        }
        out.end();
        out.end();
        if (!c.superName.isEmpty()) {
            xs(out, "complexContent");
            xs(out, "extension");
            out.attr("base", "c:" + c.superName);
            sequence(out, c);
            out.end();
            out.end();
        } else {
            sequence(out, c);
            xsEmpty(out, "attributeGroup");
            out.attr("ref", "c:" + INSTANCE_ATTRIBUTES);
        }
        out.end();
    }

    private static void sequence(XmlOutput out, ClassDef c) {
        if (c.attributes.items.isEmpty()) {
            xsEmpty(out, "sequence");
            return;
        }
        xs(out, "sequence");
        for (AttributeDef a : c.attributes.items) {
            element(out, a);
        }
        out.end();
    }

    private static String typeOf(AttributeType t) {
        switch (t) {
            case Integer: return "xs:int";
            case Double: return "c:" + DOUBLE_TYPE;
            case String: return "c:" + STRING_TYPE;
            case Date: return "xs:dateTime";
            case Boolean: return "xs:boolean";
            case Binary: return "xs:base64Binary";
            default: return "c:" + REF_TYPE;
        }
    }

    private static void element(XmlOutput out, AttributeDef a) {
        xs(out, "element");
        out.attr("name", a.name);
        boolean restricted = a.length > 0 && (a.type == AttributeType.String || a.type == AttributeType.Binary);
        if (!restricted) {
            out.attr("type", typeOf(a.type));
        }
        out.attr("minOccurs", "0");
        if (a.multi) {
            out.attr("maxOccurs", "unbounded");
            out.attr("nillable", "true");
        }
        xs(out, "annotation");
        xs(out, "appinfo");
        boolean children = a.targetNames.length + a.targetRefs.length > 0;
        if (children) {
            out.start("c", "attribute", NS);
        } else {
            out.empty("c", "attribute", NS);
        }
        if (a.mandatory) {
            out.attr("mandatory", "true");
        }
        if (a.unique) {
            out.attr("unique", "true");
        }
        if (a.length != 0) {
            out.attr("length", Integer.toString(a.length));
        }
        if (a.accessMode != AccessMode.ReadWrite) {
            out.attr("access", a.accessMode.name());
        }
        if (a.visibility != Visibility.Public) {
            out.attr("visibility", a.visibility.name());
        }
        if (a.aggregation != AggregationType.Shared) {
            out.attr("aggregation", a.aggregation.name());
        }
        if (!a.uuid.isEmpty()) {
            out.textAttr("uuid", a.uuid);
        }
        if (!a.comment.isEmpty()) {
            out.textAttr("comment", a.comment);
        }
        for (String s : a.targetNames) {
            out.empty("c", "target", NS);
            out.textAttr("name", s);
        }
        for (String s : a.targetRefs) {
            out.empty("c", "targetRef", NS);
            out.textAttr("name", s);
        }
        if (children) {
            out.end();
        }
        out.end();
        out.end();
        if (restricted) {
            if (a.type == AttributeType.String) {
                xs(out, "complexType");
                xs(out, "simpleContent");
                xs(out, "restriction");
                out.attr("base", "c:" + STRING_TYPE);
            } else {
                xs(out, "simpleType");
                xs(out, "restriction");
                out.attr("base", "xs:base64Binary");
            }
            xsEmpty(out, "maxLength");
            out.attr("value", Integer.toString(a.length));
            out.end();
            out.end();
            if (a.type == AttributeType.String) {
                out.end();
            }
        }
        out.end();
    }
}
