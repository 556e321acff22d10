// The data of one class definition inside a replica: it creates the instances of that class and
// hands out the set of its instances. Every operation but Build needs a built proxy; on failure,
// out-parameters (and out-proxies) are left as they were.
#pragma once

#include "VLXBinary.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMInstance.h"
#include "VLXKDMInstanceSet.h"
#include "VLXKDMJavaObject.h"
#include "VLXListValVLXKDMInstance.h"
#include "VLXKDMInstanceValue.h"
#include "VLXUnicodeString.h"

class VLXKDMReplica;

class CORVEXA_API VLXKDMModel : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMModel)

 public:
  // Attaches this proxy to a new Java model for classDef (releasing any model it referred to). The
  // model is in no replica until it is added to a model set. A classDef that is not built goes to
  // Java as null, which the Java side refuses.
  long Build(const VLXKDMClassDef& classDef);

  // Attaches instance to a new instance of the model's class, marked created. Fails when the model
  // is in no replica.
  long CreateInstance(VLXKDMInstance& instance);
  // Attaches classDef to the class definition the model holds the data of.
  long GetClassDef(VLXKDMClassDef& classDef) const;
  // Attaches instances to the model's own (live) instance set.
  long GetInstances(VLXKDMInstanceSet& instances) const;
  // The live instance whose identifier is this text (or these bytes), through the model's
  // identifier index: as fast for a million instances as for ten. To an unbuilt proxy when no
  // instance has it.
  long FindInstance(const VLXUnicodeString& id, VLXKDMInstance& instance) const;
  long FindInstance(const VLXBinary& id, VLXKDMInstance& instance) const;
  // The live instances of the model (with withSubclasses, also of its subclasses' models) whose
  // attribute holds a value equal to value, in one call: multi-valued ones element by element,
  // instances by identity; a value holder without type selects the instances without a value.
  long SelectInstances(const VLXUnicodeString& attribute, VLXKDMInstanceValue& value, VLXBoolean withSubclasses,
                       VLXListValVLXKDMInstance& instances) const;
  // Attaches replica to the replica that holds the model; to nothing (not built) when it is in none.
  long GetReplica(VLXKDMReplica& replica) const;
  // A readable text form of the model.
  long ToString(VLXUnicodeString& text) const;
};
