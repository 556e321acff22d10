// What the modern interface's units share: texts between std::string and VLXUnicodeString, the
// checks that turn a failed operation into corvexa::Error, and the call frame.
#pragma once

#include <climits>
#include <string>
#include <string_view>

#include "VLXUnicodeString.h"
#include "corvexa/corvexa.hpp"

namespace corvexa {
// The handles under names of their own: the binding table's slots, declared next in the same
// namespace, hide the class names Instance, Model, Replica, ClassDef, AttributeDef and Columns.
using InstanceHandle = Instance;
using ModelHandle = Model;
using ReplicaHandle = Replica;
using ClassHandle = ClassDef;
using AttributeHandle = AttributeDef;
using ColumnsHandle = Columns;
}  // namespace corvexa

#include "CallFrame.h"

namespace corvexa {

// Records the refusal of an argument as the thread's last error and throws it.
[[noreturn]] void Refuse(const char* operation, std::string_view argument, const std::string& why);

// A count of bytes or values as the platform's int; beyond it (2 GiB) the value is refused.
inline int Length(std::size_t count)
{
  if (count > static_cast<std::size_t>(INT_MAX))
    Refuse("corvexa", {}, std::to_string(count) + " bytes or values are more than one value may hold");
  return static_cast<int>(count);
}
inline VLXUnicodeString Text(std::string_view text) { return VLXUnicodeString(text.data(), Length(text.size())); }
inline std::string Text(const VLXUnicodeString& text)
{
  return std::string(text.c_str(), static_cast<std::size_t>(text.GetLengthInByte()));
}
inline VLXBinary Binary(const bytes& data) { return VLXBinary(data.data(), Length(data.size())); }
inline bytes Bytes(const VLXBinary& data)
{
  const auto* begin = reinterpret_cast<const std::byte*>(data.getData());
  return bytes(begin, begin + data.getLength());
}

// Throws the Error of a failed operation: its code, and the last error the operation recorded.
[[noreturn]] void Throw(long code, const std::string& operation);
// The operation's name for a message: "corvexa::Instance::get<int>(\"quantity\")".
std::string Named(const char* operation, std::string_view argument);

inline void Check(long code, const char* operation)
{
  if (code < 0) Throw(code, operation);
}
inline void Check(long code, const char* operation, std::string_view argument)
{
  if (code < 0) Throw(code, Named(operation, argument));
}

}  // namespace corvexa
