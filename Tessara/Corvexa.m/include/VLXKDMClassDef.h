// A class definition of a replica's schema: its name, super class, uuid, comments, scope names,
// flags, class type, visibility, and the list of its attribute definitions. Every operation but
// Build needs a built proxy; on failure, out-parameters are left as they were.
#pragma once

#include "VLXKDMAttributeDefList.h"
#include "VLXKDMJavaObject.h"
#include "VLXKDMSchemaTypes.h"
#include "VLXListValVLXUnicodeString.h"
#include "VLXUnicodeString.h"

class CORVEXA_API VLXKDMClassDef : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMClassDef)

 public:
  // Attaches this proxy to a new Java class definition named name (releasing any it referred to).
  long Build(const VLXUnicodeString& name);
  // Attaches this proxy to a new, unnamed Java class definition.
  long Build();

  long GetClassName(VLXUnicodeString& name) const;
  long SetClassName(const VLXUnicodeString& name);
  // The name of the class this one extends (empty when none).
  long GetSuperName(VLXUnicodeString& name) const;
  long SetSuperName(const VLXUnicodeString& name);
  long GetUuid(VLXUnicodeString& uuid) const;
  long SetUuid(const VLXUnicodeString& uuid);
  long GetQKAComment(VLXUnicodeString& comment) const;
  long SetQKAComment(const VLXUnicodeString& comment);
  long GetQKADerivability(VLXUnicodeString& derivability) const;
  long SetQKADerivability(const VLXUnicodeString& derivability);
  long GetScopeNames(VLXListOfVLXUnicodeString& names) const;
  long SetScopeNames(const VLXListOfVLXUnicodeString& names);
  // As SetScopeNames with a list: exactly count NUL-terminated texts (const char*) must follow (a
  // null one is the empty text); 0 sets an empty list; a negative count fails with
  // VLX_E_INVALIDARG, changing nothing. Other failures are reported under the list form's name.
  long SetScopeNames(int count, ...);

  // A flag is sent to Java as true for any non-zero byte; it is read back as 0 or 1.
  long IsAbstract(VLXBoolean& isAbstract) const;
  long SetAbstract(VLXBoolean isAbstract);
  long IsExtensible(VLXBoolean& isExtensible) const;
  long SetExtensibility(VLXBoolean isExtensible);
  long IsPersistent(VLXBoolean& isPersistent) const;
  long SetPersistency(VLXBoolean isPersistent);

  // Writes VLXKDMClassType::Class when the Java side answers null or an unknown object.
  long GetClassType(VLXKDMClassType::Type& type) const;
  // A value that is not an enumerator is a broken precondition, reported through VLXFatalError.
  long SetClassType(VLXKDMClassType::Type type);
  // Writes VLXKDMVisibility::Public when the Java side answers null or an unknown object.
  long GetSoftwareVisibility(VLXKDMVisibility::Mode& visibility) const;
  long SetSoftwareVisibility(VLXKDMVisibility::Mode visibility);

  // Attaches attributes to the class's own (live) attribute list.
  long GetAttributes(VLXKDMAttributeDefList& attributes) const;
  long ToString(VLXUnicodeString& text) const;
};
