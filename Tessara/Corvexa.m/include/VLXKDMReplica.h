// The root proxy: one replica, a schema (class definitions) and the data of that schema (one model
// per class). All operations but Build need a built proxy; on failure they leave their
// out-parameters as they were.
#pragma once

#include <jni.h>

#include "VLXBinary.h"
#include "VLXKDMAttributeDef.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMJavaObject.h"
#include "VLXKDMModelSet.h"
#include "VLXUnicodeString.h"

// A progress handler: hears the work done and the total (bytes or characters read, instances or
// classes written) of the calling thread's long operations, at most about ten times a second and
// once at the end with the total; answers 0 to stop the operation. It runs on the operation's
// thread, inside the operation: it must not throw, and must not change the replica.
typedef VLXBoolean (*VLXKDMProgressHandler)(long long done, long long total, void* context);

class CORVEXA_API VLXKDMReplica : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMReplica)

 public:
  // Attaches this proxy to a new, empty Java replica (releasing any replica it referred to).
  long Build();
  // Attaches this proxy to a new, empty Java replica named name.
  long Build(const VLXUnicodeString& name);

  // The replica's name.
  long GetName(VLXUnicodeString& name) const;
  // Renames the replica. A name that is not well-formed UTF-8 returns the converter's own code.
  long SetName(const VLXUnicodeString& name);
  // A readable text form of the replica.
  long ToString(VLXUnicodeString& text) const;
  // Checks the whole replica and, when it is consistent, makes its pending changes permanent;
  // otherwise fails, changing nothing, with a last error that lists every violation.
  long Commit();

  // Attaches models to the replica's model set.
  long GetModels(VLXKDMModelSet& models) const;
  // Attaches classDef to the class definition named className; to nothing (not built) when the
  // replica has no such class.
  long GetClassDef(const VLXUnicodeString& className, VLXKDMClassDef& classDef) const;
  // Attaches attributeDef to the attribute definition named attributeName ("Class.attribute", or a
  // bare name that exactly one class holds); to nothing when there is none.
  long GetAttributeDef(const VLXUnicodeString& attributeName, VLXKDMAttributeDef& attributeDef) const;
  // The live instance whose identifier is this text (or these bytes), through each model's
  // identifier index, models in order (identifiers are unique within a model, so the first model
  // holding it wins). To an unbuilt proxy when no instance has it.
  long FindInstance(const VLXUnicodeString& id, VLXKDMInstance& instance) const;
  long FindInstance(const VLXBinary& id, VLXKDMInstance& instance) const;

  // ---- Documents. Parsing, validation and writing happen on the Java side; a malformed or hostile
  // document or buffer fails with a last error that says what was wrong, leaving the replica as it
  // was.

  // Sets the schema location written into XML output, for the whole process. Needs no proxy.
  static long SetSchemaLocation(const VLXUnicodeString& location);
  // The schema location this replica was read with (or the one in force when it was created).
  long GetSchemaLocation(VLXUnicodeString& location) const;
  // Sets a process-wide feature of the replica implementation: "validate" (validate XML input
  // against the replica's schema; default off) or "indent" (indent XML output; default on). Needs
  // no proxy; an unknown name fails, listing the known ones.
  static long SetFeature(const VLXUnicodeString& name, VLXBoolean value);
  // Sets or reads a process-wide limit on what reading a document may cost; a document past a
  // limit is refused with a last error naming the limit. Limits and defaults: "maxDocumentSize"
  // (bytes of an XML or XSD file, characters of a string; 1 GiB), "maxElementDepth" (256),
  // "maxNamespaceDeclarations" (on one element; 100), "maxAttributeLength" (characters of one
  // attribute value as written; 1 Mi), "maxTextLength" (characters of one text as written;
  // 256 Mi), "maxInflatedSize" (bytes a compressed binary replica may inflate to; 1 GiB),
  // "maxInflateRatio" (times its compressed size, checked past 64 MiB; 200). Needs no proxy; an
  // unknown name or a value below 1 fails.
  static long SetLimit(const VLXUnicodeString& name, long long value);
  static long GetLimit(const VLXUnicodeString& name, long long& value);
  // Sets the folder from which a document's schema location may also be read, for the whole
  // process: a document given as a string reads its schema file only from there, a document file
  // from its own folder or there. Empty (the default): a string reads no schema file.
  static long SetSchemaFolder(const VLXUnicodeString& folder);
  // The folder set (absolute), or empty.
  static long GetSchemaFolder(VLXUnicodeString& folder);

  // Adds the class definitions of an XSD file or text to the schema, with an empty model for each.
  long InsertSchemaFile(const VLXUnicodeString& path);
  long InsertSchemaString(const VLXUnicodeString& xsd);
  // Adds the instances of an XML file or text; the schema must know their classes. All or nothing.
  long PopulatesFromXmlFile(const VLXUnicodeString& path);
  long PopulatesFromXmlString(const VLXUnicodeString& xml);
  // Attaches replica to a new replica read from an XML file or text, with the schema embedded in
  // the document or found at its schema location. replica need not be built.
  static long ReadFromXmlFile(const VLXUnicodeString& path, VLXKDMReplica& replica);
  static long ReadFromXmlString(const VLXUnicodeString& xml, VLXKDMReplica& replica);

  // The replica as XML; withSchema embeds its XSD so that the document stands alone.
  long GetXml(VLXBoolean withSchema, VLXUnicodeString& xml) const;
  // As above; withState also writes pending changes (states, deleted instances) so that reading
  // the document back restores them.
  long GetXml(VLXBoolean withSchema, VLXBoolean withState, VLXUnicodeString& xml) const;
  // The schema as a W3C XML Schema that validates the replica's own XML.
  long GetXsd(VLXUnicodeString& xsd) const;

  // The replica as bytes (deflated when compressed), and back. The flag given to read must be the
  // one the bytes were written with.
  static long GetBinaryFromReplica(const VLXKDMReplica& replica, VLXBoolean compressed, VLXBinary& bytes);
  static long GetReplicaFromBinary(const VLXBinary& bytes, VLXBoolean compressed, VLXKDMReplica& replica);
  // As above, compressed or not as the bytes' header says.
  static long GetReplicaFromBinary(const VLXBinary& bytes, VLXKDMReplica& replica);

  // ---- Files, streamed: a write goes to a temporary file in the same directory, which replaces
  // path only once it is complete, so a failed or stopped write leaves path as it was; the
  // document is never whole in memory. A relative path is taken from the process's current
  // directory (also after a chdir).

  // The replica as an XML file (as GetXml), an XSD file (as GetXsd), a binary file (as
  // GetBinaryFromReplica).
  long WriteXmlFile(const VLXUnicodeString& path, VLXBoolean withSchema, VLXBoolean withState) const;
  long WriteXsdFile(const VLXUnicodeString& path) const;
  long WriteBinaryFile(const VLXUnicodeString& path, VLXBoolean compressed) const;
  // Attaches replica to a new replica read from a binary file, compressed or not as its header says.
  static long ReadBinaryFile(const VLXUnicodeString& path, VLXKDMReplica& replica);

  // ---- Progress. Sets the calling thread's progress handler for the operations that read or
  // write documents and files, and populate (null removes it); context is given back to it. A
  // stopped operation fails with a last error saying so: a read or populate leaves the replica as
  // it was, a write leaves no file. Needs no proxy.
  static long SetProgressHandler(VLXKDMProgressHandler handler, void* context);

  // ---- Exchange with Java code that calls into native code with its own environment.

  // Attaches this proxy to the given Java replica (null detaches it). Uses env as it is. An object
  // that is not a replica fails with VLX_E_INVALIDARG, naming its class; the proxy is unchanged.
  long BuildFromJavaType(JNIEnv* env, jobject replica);
  // Writes a new local reference to this proxy's Java replica (null when the proxy is not built);
  // the reference belongs to the calling Java frame.
  long ConvertToJavaType(JNIEnv* env, jobject& replica);
  // Attaches this proxy to the replica that the Java ReplicaHolder holder holds. A null holder or
  // an object that is not a ReplicaHolder fails with VLX_E_INVALIDARG; the proxy is unchanged.
  long BuildFromJavaHolder(JNIEnv* env, jobject holder);
  // Stores this proxy's Java replica into holder; when holder is null, into a new ReplicaHolder
  // written to holder (a local reference of the calling Java frame). holder is written only on
  // success. A holder that is not a ReplicaHolder fails with VLX_E_INVALIDARG.
  long ConvertToJavaHolder(JNIEnv* env, jobject& holder);
};
