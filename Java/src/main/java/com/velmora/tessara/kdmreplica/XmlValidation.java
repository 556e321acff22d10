package com.velmora.tessara.kdmreplica;

import java.io.IOException;
import java.io.StringReader;
import javax.xml.XMLConstants;
import javax.xml.transform.stax.StAXSource;
import javax.xml.transform.stream.StreamSource;
import javax.xml.validation.Schema;
import javax.xml.validation.SchemaFactory;
import javax.xml.validation.Validator;
import org.w3c.dom.ls.LSResourceResolver;
import org.xml.sax.ErrorHandler;
import org.xml.sax.SAXException;
import org.xml.sax.SAXParseException;

/**
 * Validation of documents against the replica's schema with the JDK's schema factory and
 * validator, secured: schemas are compiled from explicit sources only, documents are read through
 * the hardened reader of {@link XmlInput}, and nothing else is ever loaded.
 */
final class XmlValidation {
    private XmlValidation() {
    }

    /** Refuses every resource a schema or validator asks for: schemas are compiled from explicit sources only. */
    private static final LSResourceResolver REFUSE_ALL = (type, namespace, publicId, systemId, baseUri) -> {
        throw new IllegalStateException("loading '" + systemId + "' (" + type + ") is refused: schemas are compiled"
                + " from explicit sources only");
    };

    /** Collects the first error; warnings are ignored. */
    private static final class FirstError implements ErrorHandler {
        SAXParseException first;

        @Override
        public void warning(SAXParseException e) {
            // warnings do not make a document invalid
        }

        @Override
        public void error(SAXParseException e) throws SAXException {
            if (first == null) {
                first = e;
            }
            throw e;
        }

        @Override
        public void fatalError(SAXParseException e) throws SAXException {
            error(e);
        }
    }

    /** The JDK's schema factory, secured; nothing outside the given sources is ever loaded. */
    static Schema compileSchema(String xsd) {
        SchemaFactory f = SchemaFactory.newDefaultInstance();
        try {
            f.setFeature(XMLConstants.FEATURE_SECURE_PROCESSING, true);
            f.setProperty(XMLConstants.ACCESS_EXTERNAL_SCHEMA, "");
            f.setProperty(XMLConstants.ACCESS_EXTERNAL_DTD, "");
        } catch (SAXException e) {
            throw new IllegalStateException("cannot secure the schema factory: " + e.getMessage(), e);
        }
        f.setResourceResolver(REFUSE_ALL);
        FirstError h = new FirstError();
        f.setErrorHandler(h);
        try {
            return f.newSchema(new StreamSource(new StringReader(xsd), "replica-schema.xsd"));
        } catch (SAXException e) {
            throw new IllegalStateException("the replica's schema does not compile: " + e.getMessage(), e);
        }
    }

    /**
     * Validates an input against a schema, reading it through a hardened StAX reader.
     *
     * @throws XmlDocumentException naming the line, column and the validator's message
     */
    static void validate(XmlInput.Src src, Schema schema) {
        Validator v = schema.newValidator();
        try {
            v.setFeature(XMLConstants.FEATURE_SECURE_PROCESSING, true);
            v.setProperty(XMLConstants.ACCESS_EXTERNAL_SCHEMA, "");
            v.setProperty(XMLConstants.ACCESS_EXTERNAL_DTD, "");
        } catch (SAXException e) {
            throw new IllegalStateException("cannot secure the validator: " + e.getMessage(), e);
        }
        v.setResourceResolver(REFUSE_ALL);
        FirstError h = new FirstError();
        v.setErrorHandler(h);
        try (XmlInput.In in = src.open()) {
            v.validate(new StAXSource(in.r));
        } catch (SAXException | IOException e) {
            SAXParseException p = h.first != null ? h.first : e instanceof SAXParseException ? (SAXParseException) e : null;
            String m = p != null ? p.getMessage() : e.getMessage();
            throw new XmlDocumentException(src.name, p == null ? -1 : p.getLineNumber(),
                    p == null ? -1 : p.getColumnNumber(), "the document does not match the replica's schema: " + m, e);
        }
    }
}
