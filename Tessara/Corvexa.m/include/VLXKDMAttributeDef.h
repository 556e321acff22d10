// An attribute definition of a class: its name, value type, and properties.
#pragma once

#include "VLXKDMJavaObject.h"

class CORVEXA_API VLXKDMAttributeDef : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMAttributeDef)
};
