// The root proxy: one replica, a schema (class definitions) and the data of that schema (one model
// per class). All operations but Build need a built proxy; on failure they leave their
// out-parameters as they were.
#pragma once

#include "VLXKDMAttributeDef.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMJavaObject.h"
#include "VLXKDMModelSet.h"
#include "VLXUnicodeString.h"

class CORVEXA_API VLXKDMReplica : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMReplica)

 public:
  // Attaches this proxy to a new, empty Java replica (releasing any replica it referred to).
  long Build();
  // Attaches this proxy to a new, empty Java replica named name.
  long Build(const VLXUnicodeString& name);

  // The replica's name.
  long GetName(VLXUnicodeString& name);
  // Renames the replica. A name that is not well-formed UTF-8 returns the converter's own code.
  long SetName(const VLXUnicodeString& name);
  // A readable text form of the replica.
  long ToString(VLXUnicodeString& text);
  // Checks the whole replica and, when it is consistent, makes its pending changes permanent;
  // otherwise fails, changing nothing, with a last error that lists every violation.
  long Commit();

  // Attaches models to the replica's model set.
  long GetModels(VLXKDMModelSet& models);
  // Attaches classDef to the class definition named className; to nothing (not built) when the
  // replica has no such class.
  long GetClassDef(const VLXUnicodeString& className, VLXKDMClassDef& classDef);
  // Attaches attributeDef to the attribute definition named attributeName ("Class.attribute", or a
  // bare name that exactly one class holds); to nothing when there is none.
  long GetAttributeDef(const VLXUnicodeString& attributeName, VLXKDMAttributeDef& attributeDef);
};
