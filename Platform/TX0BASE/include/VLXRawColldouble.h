// VLXRawColldouble (also VLXListOfDouble): value list of double, positions from 1. See VLXList.h.
#ifndef VLXRawColldouble_h
#define VLXRawColldouble_h

#include "VLXList.h"

VLX_DECLARE_VALUE_LIST(VLXRawColldouble, double, VLXListOfDouble)

#endif
