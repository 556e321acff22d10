// Gathering the values of a variadic setter into the list its list twin takes.
#pragma once

#include <cstdarg>

#include "VLXListValVLXUnicodeString.h"
#include "VLXUnicodeString.h"

namespace corvexa {

// Reads count arguments of type VaArg (none when count <= 0) and appends convert(argument) for each.
template <class List, class VaArg, class Convert>
List Gather(int count, va_list args, Convert convert)
{
  List list;
  for (int i = 0; i < count; ++i) list.Append(convert(va_arg(args, VaArg)));
  return list;
}

// NUL-terminated byte strings, as texts.
inline VLXListValVLXUnicodeString GatherTexts(int count, va_list args)
{
  return Gather<VLXListValVLXUnicodeString, const char*>(count, args, [](const char* s) { return VLXUnicodeString(s); });
}

}  // namespace corvexa
