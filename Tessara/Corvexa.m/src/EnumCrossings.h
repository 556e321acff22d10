// How the schema enumerations cross: a native enumerator goes as its Java constant, a returned
// constant lands as its enumerator.
#pragma once

#include <string>

#include "Crossings.h"
#include "VLXFatalError.h"
#include "VLXKDMSchemaTypes.h"

namespace corvexa {

// ---- Schema enumerations ---------------------------------------------------------------------
// Each native enumeration stands for the Java constants in consecutive slots of the binding table,
// in value order. A getter that finds a null or unknown object writes the enumeration's default;
// the aggregation type has none and then leaves the caller's value alone.

template <class E>
struct EnumTable;
template <>
struct EnumTable<VLXKDMAttributeType::Type> {
  static constexpr const char* kName = "VLXKDMAttributeType::Type";
  static constexpr Slot kFirst = AttributeType_Integer;
  static constexpr int kCount = 7;
  static constexpr bool kHasDefault = true;
  static constexpr VLXKDMAttributeType::Type kDefault = VLXKDMAttributeType::String;
};
template <>
struct EnumTable<VLXKDMAccessMode::Mode> {
  static constexpr const char* kName = "VLXKDMAccessMode::Mode";
  static constexpr Slot kFirst = AccessMode_Read;
  static constexpr int kCount = 3;
  static constexpr bool kHasDefault = true;
  static constexpr VLXKDMAccessMode::Mode kDefault = VLXKDMAccessMode::Read;
};
template <>
struct EnumTable<VLXKDMAggregationType::Type> {
  static constexpr const char* kName = "VLXKDMAggregationType::Type";
  static constexpr Slot kFirst = AggregationType_Composition;
  static constexpr int kCount = 2;
  static constexpr bool kHasDefault = false;
  static constexpr VLXKDMAggregationType::Type kDefault = VLXKDMAggregationType::Composition;
};
template <>
struct EnumTable<VLXKDMClassType::Type> {
  static constexpr const char* kName = "VLXKDMClassType::Type";
  static constexpr Slot kFirst = ClassType_Class;
  static constexpr int kCount = 2;
  static constexpr bool kHasDefault = true;
  static constexpr VLXKDMClassType::Type kDefault = VLXKDMClassType::Class;
};
template <>
struct EnumTable<VLXKDMVisibility::Mode> {
  static constexpr const char* kName = "VLXKDMVisibility::Mode";
  static constexpr Slot kFirst = Visibility_Public;
  static constexpr int kCount = 3;
  static constexpr bool kHasDefault = true;
  static constexpr VLXKDMVisibility::Mode kDefault = VLXKDMVisibility::Public;
};

// Where a broken enumeration argument is reported: the assertion text, source path and line.
struct Assertion {
  const char* message;
  const char* file;
  int line;
};

// An enumeration argument: sent as its Java constant, mapped before any other argument. A value
// without a constant is a broken precondition, reported through VLXFatalError; if the handler
// returns, the operation fails with an invalid-argument error and Java is not called.
template <class E>
struct EnumArg {
  E value;
  Assertion assertion;
};
template <class E>
EnumArg<E> Enum(E value, Assertion assertion)
{
  return EnumArg<E>{value, assertion};
}

// Records that value is none of the enumerators of the enumeration name; returns VLX_E_INVALIDARG.
inline long RejectEnumerator(const char* name, int value)
{
  return VLXJBXException::Raise(
      VLX_E_INVALIDARG, VLXJBXMessages::InvalidArgument,
      {std::string("the enumeration ") + name, "the value " + std::to_string(value) + " is none of its enumerators"},
      __FILE__, __LINE__);
}

template <class E>
struct ArgOf<EnumArg<E>> {
  using J = jobject;
  static constexpr bool kOwnsRef = false;
  static constexpr bool kEarly = true;
  static long To(JNIEnv*, const EnumArg<E>& arg, J& out)
  {
    using Table = EnumTable<E>;
    const int value = static_cast<int>(arg.value);
    out = value >= 0 && value < Table::kCount ? FrameAccess::Table()->Constant(static_cast<Slot>(Table::kFirst + value))
                                              : nullptr;
    if (out) return VLX_S_OK;
    VLXFatalError(arg.assertion.message, nullptr, nullptr, nullptr, arg.assertion.file, arg.assertion.line);
    return RejectEnumerator(Table::kName, value);
  }
};

// An enumeration out-parameter: the returned Java object compared by identity with the constants.
template <class E>
struct EnumOut {
  E& value;
};
template <class E>
EnumOut<E> Enum(E& value)
{
  return EnumOut<E>{value};
}

template <class E>
struct ResultOf<EnumOut<E>> {
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, EnumOut<E>& out, long status)
  {
    using Table = EnumTable<E>;
    const LocalRef owned(env, result);
    if (!result) {
      if (Table::kHasDefault) out.value = Table::kDefault;
      return status;
    }
    const ReplicaStubs* st = FrameAccess::Table();
    int found = -1;
    for (int value = 0; value < Table::kCount && found < 0; ++value) {
      const jobject constant = st->Constant(static_cast<Slot>(Table::kFirst + value));
      if (constant && VLXJBXJNIHelper::IsSameObject(env, result, constant)) found = value;
    }
    if (found >= 0)
      out.value = static_cast<E>(found);
    else if (Table::kHasDefault)
      out.value = Table::kDefault;
    return status;
  }
};

}  // namespace corvexa
