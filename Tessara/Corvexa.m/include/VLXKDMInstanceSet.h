// The instances of one model.
#pragma once

#include "VLXKDMJavaObject.h"

class CORVEXA_API VLXKDMInstanceSet : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMInstanceSet)
};
