// Gathering the values of a variadic setter into the list its list twin takes.
#pragma once

#include <cstdarg>

#include "VLXListValVLXUnicodeString.h"
#include "VLXUnicodeString.h"

namespace corvexa {

constexpr int kMaxReserved = 1 << 16;

// Reads count arguments of type VaArg (none when count <= 0) and appends convert(argument) for each.
template <class List, class VaArg, class Convert>
List Gather(int count, va_list args, Convert convert)
{
  // Room for the arguments reserved once (up to a bound: a count is the caller's word, not a size).
  List list(count > 0 ? (count < kMaxReserved ? count : kMaxReserved) : 0);
  for (int i = 0; i < count; ++i) list.Append(convert(va_arg(args, VaArg)));
  return list;
}

// NUL-terminated byte strings, as texts.
inline VLXListValVLXUnicodeString GatherTexts(int count, va_list args)
{
  return Gather<VLXListValVLXUnicodeString, const char*>(count, args, [](const char* s) { return VLXUnicodeString(s); });
}

}  // namespace corvexa
