// The list of attribute definitions of a class definition.
#pragma once

#include "VLXKDMJavaObject.h"

class CORVEXA_API VLXKDMAttributeDefList : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMAttributeDefList)
};
