// The attribute definitions of one class definition, reached through VLXKDMClassDef::GetAttributes.
// Positions pass to Java unchanged and count from 0; IndexOf answers -1 for an absent item, GetItem
// by name detaches the out-proxy; a position out of range fails with the Java side's error.
#pragma once

#include "VLXKDMAttributeDef.h"
#include "VLXKDMJavaObject.h"
#include "VLXUnicodeString.h"

class CORVEXA_API VLXKDMAttributeDefList : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMAttributeDefList)

 public:
  long GetCount(int& count) const;
  // Attaches item to the definition at position (from 0), or to the one named name.
  long GetItem(int position, VLXKDMAttributeDef& item) const;
  long GetItem(const VLXUnicodeString& name, VLXKDMAttributeDef& item) const;
  long Includes(const VLXUnicodeString& name, VLXBoolean& included) const;
  long IndexOf(const VLXKDMAttributeDef& item, int& position) const;
  long IndexOf(const VLXUnicodeString& name, int& position) const;
  // Adds item (built with VLXKDMAttributeDef::Build) to the class.
  long Add(const VLXKDMAttributeDef& item);
  long Remove(const VLXKDMAttributeDef& item);
  long Remove(const VLXUnicodeString& name);
  long Remove(int position);
};
