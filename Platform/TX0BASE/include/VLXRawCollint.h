// VLXRawCollint (also VLXListOfInt): value list of int, positions from 1. See VLXList.h.
#ifndef VLXRawCollint_h
#define VLXRawCollint_h

#include "VLXList.h"

VLX_DECLARE_VALUE_LIST(VLXRawCollint, int, VLXListOfInt)

#endif
