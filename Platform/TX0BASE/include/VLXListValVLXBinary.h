// VLXListValVLXBinary (also VLXListOfVLXBinary): value list of VLXBinary, positions from 1. See VLXList.h.
#ifndef VLXListValVLXBinary_h
#define VLXListValVLXBinary_h

#include "VLXList.h"
#include "VLXBinary.h"

VLX_DECLARE_VALUE_LIST(VLXListValVLXBinary, VLXBinary, VLXListOfVLXBinary)

#endif
