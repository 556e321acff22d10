// VLXListValVLXBoolean (also VLXListOfVLXBoolean): value list of VLXBoolean, positions from 1. See VLXList.h.
#ifndef VLXListValVLXBoolean_h
#define VLXListValVLXBoolean_h

#include "VLXList.h"
#include "VLXResult.h"

VLX_DECLARE_VALUE_LIST(VLXListValVLXBoolean, VLXBoolean, VLXListOfVLXBoolean)

#endif
