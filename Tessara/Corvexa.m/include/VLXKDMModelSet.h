// The models of one replica, reached through VLXKDMReplica::GetModels: one model per class. Positions
// pass to Java unchanged and count from 0; IndexOf answers -1 for an absent model, GetItem by name
// detaches the out-proxy when there is none; a position out of range, or removing an absent model,
// fails with the Java side's error. On failure, out-parameters are left as they were.
#pragma once

#include "VLXKDMClassDef.h"
#include "VLXKDMJavaObject.h"
#include "VLXKDMModel.h"
#include "VLXUnicodeString.h"

class CORVEXA_API VLXKDMModelSet : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMModelSet)

 public:
  long GetCount(int& count) const;
  // Attaches model to the model at position (from 0), or to the model of the class named className.
  long GetItem(int position, VLXKDMModel& model) const;
  long GetItem(const VLXUnicodeString& className, VLXKDMModel& model) const;
  // Whether the replica has a model of the class named className. A name that is not well-formed
  // UTF-8 returns the converter's own code, with no translation.
  long Includes(const VLXUnicodeString& className, VLXBoolean& included) const;
  // The position of the model of classDef (compared by identity) or of the class named className.
  long IndexOf(const VLXKDMClassDef& classDef, int& position) const;
  long IndexOf(const VLXUnicodeString& className, int& position) const;
  // Adds a model that is in no replica (made with VLXKDMModel::Build); its class joins the schema.
  long Add(const VLXKDMModel& model);
  // Takes a model out, with its instances; its class leaves the schema.
  long Remove(const VLXKDMClassDef& classDef);
  long Remove(const VLXUnicodeString& className);
  long Remove(int position);
};
