// Symbol visibility of the library's exported classes and functions.
#pragma once

#if defined(CORVEXA_BUILDING_LIBRARY)
#define CORVEXA_API __attribute__((visibility("default")))
#else
#define CORVEXA_API
#endif
