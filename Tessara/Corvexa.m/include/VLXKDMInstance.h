// One object of a class definition inside a replica: an optional identifier (a text or bytes), the
// states the replica keeps for it (created, modified, deleted), and one value per attribute of its
// class. Attributes are addressed by name or by position (from 0); both pass to Java unchanged, and
// an unknown name or a position out of range fails with the Java side's error. Every operation
// needs a built proxy; on failure, out-parameters (and out-proxies) are left as they were.
#pragma once

#include "VLXBinary.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMJavaObject.h"
#include "VLXUnicodeString.h"

class CORVEXA_API VLXKDMInstance : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMInstance)

 public:
  // Attaches classDef to the class of the instance.
  long GetClassDef(VLXKDMClassDef& classDef);

  // The identifier. Without one: writes 1 into noID and nothing else. With a text: writes 0, 1 and
  // the text, leaving bytes alone. With bytes: writes 0, 0 and the bytes, leaving text alone. An
  // identifier of any other Java class fails (after writing 0 into noID) with a last error naming
  // that class.
  long GetID(VLXBoolean& noID, VLXBoolean& isText, VLXUnicodeString& text, VLXBinary& bytes);
  // Sets the identifier, a text or bytes; identifiers are unique among the live instances of a
  // model (a text never collides with bytes).
  long SetID(const VLXUnicodeString& id);
  long SetID(const VLXBinary& id);

  // The states: created since the last commit, modified since then, removed from its set.
  long IsCreated(VLXBoolean& created);
  long IsModified(VLXBoolean& modified);
  long IsDeleted(VLXBoolean& deleted);

  // Whether the attribute holds a value. A name that is not well-formed UTF-8 returns the
  // converter's own code, with no translation.
  long IsValuated(const VLXUnicodeString& name, VLXBoolean& valuated);
  long IsValuated(int position, VLXBoolean& valuated);
  // Removes the value of the attribute.
  long ClearValue(const VLXUnicodeString& name);
  long ClearValue(int position);

  // A readable text form of the instance; with withValues (any non-zero byte), its values too.
  long ToString(VLXUnicodeString& text);
  long ToString(VLXBoolean withValues, VLXUnicodeString& text);
};
