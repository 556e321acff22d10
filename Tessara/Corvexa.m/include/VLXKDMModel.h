// The data of one class definition inside a replica: creates its instances.
#pragma once

#include "VLXKDMJavaObject.h"

class CORVEXA_API VLXKDMModel : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMModel)
};
