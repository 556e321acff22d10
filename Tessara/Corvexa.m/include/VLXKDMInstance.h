// One object of a class definition inside a replica, with its identifier, state and values.
#pragma once

#include "VLXKDMJavaObject.h"

class CORVEXA_API VLXKDMInstance : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMInstance)
};
