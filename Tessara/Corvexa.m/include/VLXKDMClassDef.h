// A class definition of a replica's schema: its name, super class, flags, and attribute list.
#pragma once

#include "VLXKDMJavaObject.h"

class CORVEXA_API VLXKDMClassDef : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMClassDef)
};
