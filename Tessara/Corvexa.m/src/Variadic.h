// Gathering the values of a variadic setter into the list its list twin takes.
#pragma once

#include <cstdarg>
#include <string>
#include <type_traits>

#include "CallFrame.h"
#include "VLXListValVLXUnicodeString.h"
#include "VLXUnicodeString.h"

namespace corvexa {

constexpr int kMaxReserved = 1 << 16;

// Reads count arguments of type VaArg into list, appending convert(argument) for each. A negative
// count, or a null pointer where kNullRefused (a pointer that must point at a value), is refused:
// returns VLX_E_INVALIDARG with a last error naming operation, and list must not be used.
template <class VaArg, bool kNullRefused = false, class List, class Convert>
long Gather(const char* operation, int count, va_list args, List& list, Convert convert)
{
  if (count < 0) return RejectValue(operation, "the count " + std::to_string(count) + " is negative");
  // Room for the arguments reserved once (up to a bound: a count is the caller's word, not a size).
  list = List(count < kMaxReserved ? count : kMaxReserved);
  for (int i = 0; i < count; ++i) {
    const VaArg argument = va_arg(args, VaArg);
    if constexpr (kNullRefused) {
      if (!argument)
        return RejectValue(operation,
                           "value " + std::to_string(i + 1) + " of " + std::to_string(count) + " is a null pointer");
    }
    list.Append(convert(argument));
  }
  return VLX_S_OK;
}

// NUL-terminated byte strings, as texts (a null pointer is the empty text).
inline long GatherTexts(const char* operation, int count, va_list args, VLXListValVLXUnicodeString& list)
{
  return Gather<const char*>(operation, count, args, list, [](const char* s) { return VLXUnicodeString(s); });
}

// The body of a variadic setter: gathers its count values with gather, then runs set on the list.
#define VLXKDM_GATHER_THEN(List, gather, operation, set)        \
  List values;                                                  \
  va_list args;                                                 \
  va_start(args, count);                                        \
  const long gathered = gather(operation, count, args, values); \
  va_end(args);                                                 \
  return gathered < 0 ? gathered : set(values)

}  // namespace corvexa
