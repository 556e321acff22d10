// The models of one replica.
#pragma once

#include "VLXKDMJavaObject.h"

class CORVEXA_API VLXKDMModelSet : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMModelSet)
};
