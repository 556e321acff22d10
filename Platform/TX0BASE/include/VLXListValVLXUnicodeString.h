// VLXListValVLXUnicodeString (also VLXListOfVLXUnicodeString): value list of VLXUnicodeString, positions from 1. See
// VLXList.h.
#ifndef VLXListValVLXUnicodeString_h
#define VLXListValVLXUnicodeString_h

#include "VLXList.h"
#include "VLXUnicodeString.h"

VLX_DECLARE_VALUE_LIST(VLXListValVLXUnicodeString, VLXUnicodeString, VLXListOfVLXUnicodeString)

#endif
