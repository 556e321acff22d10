// An attribute definition: its name and value type (fixed when it is built), uuid, comment, target
// names and references, aggregation, access mode, visibility, length and flags. Every operation but
// Build needs a built proxy; on failure, out-parameters are left as they were.
#pragma once

#include "VLXKDMJavaObject.h"
#include "VLXKDMSchemaTypes.h"
#include "VLXListValVLXUnicodeString.h"
#include "VLXUnicodeString.h"

class VLXKDMClassDef;

class CORVEXA_API VLXKDMAttributeDef : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMAttributeDef)

 public:
  // Attaches this proxy to a new Java attribute definition, owned by no class yet (see
  // VLXKDMAttributeDefList::Add). A type that is not an enumerator is reported through
  // VLXFatalError before the name is looked at; a name that is not well-formed UTF-8 returns the
  // converter's own code and creates nothing.
  long Build(const VLXUnicodeString& name, VLXKDMAttributeType::Type type);

  long GetAttributeName(VLXUnicodeString& name) const;
  // Writes VLXKDMAttributeType::String when the Java side answers null or an unknown object.
  long GetAttributeType(VLXKDMAttributeType::Type& type) const;
  long GetUuid(VLXUnicodeString& uuid) const;
  long SetUuid(const VLXUnicodeString& uuid);
  long GetQKAComment(VLXUnicodeString& comment) const;
  // A comment that is not well-formed UTF-8 returns the converter's own code.
  long SetQKAComment(const VLXUnicodeString& comment);

  // The classes a relationship may point to.
  long GetTargetNames(VLXListOfVLXUnicodeString& names) const;
  // Names that are not well-formed UTF-8 return the converter's own code.
  long SetTargetNames(const VLXListOfVLXUnicodeString& names);
  // As the list form: exactly count NUL-terminated texts (const char*) must follow (a null one is
  // the empty text); 0 sets none; a negative count fails with VLX_E_INVALIDARG, changing nothing.
  long SetTargetNames(int count, ...);
  long GetTargetRefs(VLXListOfVLXUnicodeString& refs) const;
  long SetTargetRefs(const VLXListOfVLXUnicodeString& refs);
  // As the list form: exactly count NUL-terminated texts (const char*) must follow (a null one is
  // the empty text); 0 sets none; a negative count fails with VLX_E_INVALIDARG, changing nothing.
  long SetTargetRefs(int count, ...);

  // Leaves type as the caller set it when the Java side answers null or an unknown object.
  long GetAggregationType(VLXKDMAggregationType::Type& type) const;
  long SetAggregationType(VLXKDMAggregationType::Type type);
  // Writes VLXKDMAccessMode::Read when the Java side answers null or an unknown object.
  long GetAccessMode(VLXKDMAccessMode::Mode& mode) const;
  long SetAccessMode(VLXKDMAccessMode::Mode mode);
  // Writes VLXKDMVisibility::Public when the Java side answers null or an unknown object.
  long GetSoftwareVisibility(VLXKDMVisibility::Mode& visibility) const;
  long SetSoftwareVisibility(VLXKDMVisibility::Mode visibility);
  // Enumeration setters report a value that is not an enumerator through VLXFatalError.

  // The maximal length of a String (characters) or Binary (bytes) value; 0 or less: unlimited.
  long GetLength(int& length) const;
  long SetLength(int length);
  // A flag is sent to Java as true for any non-zero byte; it is read back as 0 or 1.
  long IsMandatory(VLXBoolean& isMandatory) const;
  long SetMandatory(VLXBoolean isMandatory);
  long IsMultiValuated(VLXBoolean& isMultiValuated) const;
  long SetMultiValuation(VLXBoolean isMultiValuated);
  long IsUnique(VLXBoolean& isUnique) const;
  long SetUnicity(VLXBoolean isUnique);

  // Attaches classDef to the class that holds this attribute (to nothing when none does).
  long GetClassDef(VLXKDMClassDef& classDef) const;
  long ToString(VLXUnicodeString& text) const;
};
