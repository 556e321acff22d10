// VLXListValVLXTime (also VLXListOfVLXTime): value list of VLXTime, positions from 1. See VLXList.h.
#ifndef VLXListValVLXTime_h
#define VLXListValVLXTime_h

#include "VLXList.h"
#include "VLXTime.h"

VLX_DECLARE_VALUE_LIST(VLXListValVLXTime, VLXTime, VLXListOfVLXTime)

#endif
