// How attribute values cross in the frame: the value converters as one overload set, a native
// value sent as its Java object (AsJava), a value holder sent after BuildRemote (Remote), and a
// returned value read into a holder.
#pragma once

#include <climits>
#include <ctime>

#include "Crossings.h"
#include "VLXTime.h"
#include "VLXKDMInstance.h"
#include "VLXKDMInstanceValue.h"

namespace corvexa {

// ---- Dates ------------------------------------------------------------------------------------

// A Java date's milliseconds as the nearest whole second, halves rounded up: floor((ms + 500) / 1000),
// computed without overflow at the ends of the 64-bit range. Every whole second comes back as it was.
inline time_t Seconds(jlong ms)
{
  long long seconds = ms / 1000;  // rounded toward zero
  long long rest = ms % 1000;     // same sign as ms
  if (rest < 0) {                 // floor division
    seconds -= 1;
    rest += 1000;
  }
  return static_cast<time_t>(rest >= 500 ? seconds + 1 : seconds);
}

// A time's seconds as a Java date's milliseconds; false when they do not fit in 64 bits.
inline bool Milliseconds(const VLXTime& time, jlong& ms)
{
  const long long seconds = static_cast<long long>(time.Gettime_t());
  if (seconds > LLONG_MAX / 1000 || seconds < LLONG_MIN / 1000) return false;
  ms = static_cast<jlong>(seconds * 1000);
  return true;
}

// ---- Attribute values -------------------------------------------------------------------------
// The value converters, the value holder and how attribute values cross in the frame.

// The value converters of the proxy base and the platform's, as one public overload set, for the
// frame and the value holder, which convert only once the Java side is started with no exception
// pending: a text then goes without that check.
struct Values : VLXKDMJavaObject {
  using VLXKDMJavaObject::BuildFromJavaType;
  using VLXKDMJavaObject::ConvertToJavaType;
  static long ConvertToJavaType(JNIEnv* env, const VLXUnicodeString& input, jobject& output)
  {
    jstring text = nullptr;
    const long status = VLXJBXJNIConverter::ConvertToJavaString(env, input, text);
    if (status >= 0) output = text;
    return status;
  }
  template <class Native>
  static auto ConvertToJavaType(JNIEnv* env, const Native& input, jobject& output)
      -> decltype(VLXJBXJNIConverter::ConvertToJavaType(env, input, output))
  {
    return VLXJBXJNIConverter::ConvertToJavaType(env, input, output);
  }
  template <class Native>
  static auto BuildFromJavaType(JNIEnv* env, jobject input, Native& output)
      -> decltype(VLXJBXJNIConverter::BuildFromJavaType(env, input, output))
  {
    return VLXJBXJNIConverter::BuildFromJavaType(env, input, output);
  }
};

// A native value sent as its Java object, made by the value converters: .with(name, AsJava(42)).
// The object is released after the call, except a single instance's, which is the proxy's own.
template <class T>
struct JavaForm {
  const T& value;
};
template <class T>
JavaForm<T> AsJava(const T& value)
{
  return JavaForm<T>{value};
}

template <class T>
struct ArgOf<JavaForm<T>> {
  using J = jobject;
  static constexpr bool kOwnsRef = !std::is_same_v<T, VLXKDMInstance>;
  static constexpr bool kEarly = false;
  static long To(JNIEnv* env, const JavaForm<T>& arg, J& out) { return Values::ConvertToJavaType(env, arg.value, out); }
};

// A value holder sent as its Java object: BuildRemote runs first, before any other argument is
// converted, and its failure stops the operation; then the holder's own handle goes to Java.
struct RemoteForm {
  VLXKDMInstanceValue& value;
};
inline RemoteForm Remote(VLXKDMInstanceValue& value) { return RemoteForm{value}; }

template <>
struct ArgOf<RemoteForm> {
  using J = jobject;
  static constexpr bool kOwnsRef = false;
  static constexpr bool kEarly = true;
  static long To(JNIEnv*, const RemoteForm& arg, J& out)
  {
    const long status = arg.value.BuildRemote();
    if (status < 0) return status;
    out = arg.value.GetHandle();
    return VLX_S_OK;
  }
};
// A holder passed bare would go without its Java form: pass Remote(value) instead.
template <>
struct ArgOf<VLXKDMInstanceValue>;

// A returned attribute value read into the holder; a failure, or a null answer (no value), leaves
// the holder exactly as it was. (GetValue lands through its own out-parameter, which also names the
// attribute when it has no value.)
template <>
struct ResultOf<VLXKDMInstanceValue> {
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, VLXKDMInstanceValue& out, long)
  {
    LocalRef owned(env, result);
    if (!result) return RejectValue("VLXKDMInstanceValue::BuildLocal()", "the Java method answered no value");
    return FrameAccess::Read(out, env, result);
  }
};

}  // namespace corvexa
