// The frame's crossings: how each native argument reaches Java (ArgOf) and how each Java result
// lands in a native out-parameter (ResultOf), for texts, lists, byte buffers, primitives and
// proxies; the frame's access to the proxy base; and the refusals the crossings raise. Schema
// enumerations cross in EnumCrossings.h, attribute values in ValueCrossings.h.
#pragma once

#include <string>
#include <type_traits>

#include <jni.h>

#include "ReplicaStubs.h"
#include "VLXBinary.h"
#include "VLXError.h"
#include "VLXJBXException.h"
#include "VLXJBXJNIConverter.h"
#include "VLXJBXJNIHelper.h"
#include "VLXJBXJNIUtilities.h"
#include "VLXListValVLXKDMInstance.h"
#include "VLXJBXLocalRef.h"
#include "VLXKDMInstanceValue.h"
#include "VLXKDMJavaObject.h"
#include "VLXListValVLXUnicodeString.h"
#include "VLXResult.h"
#include "VLXUnicodeString.h"

namespace corvexa {

// The one owner of a local reference (from the bridge).
using LocalRef = VLXJBXLocalRef;

// The frame's access to the proxy base's start-up and binding table.
class FrameAccess {
 public:
  // Steps 1 to 3: the environment, the start of the Java side and, for a proxy, the built test.
  static long Start(VLXKDMJavaObject* self, JNIEnv*& env, const char* name)
  {
    return self ? self->InitJavaAndTestIsBuilt(env, name) : VLXKDMJavaObject::InitJava(env, name);
  }
  static ReplicaStubs* Table() { return VLXKDMJavaObject::_st.load(std::memory_order_acquire); }
  // The bound table for an object attached outside any operation (the Java side is started if no
  // operation has started it); null with the failure in status.
  static const ReplicaStubs* BoundTable(const char* operation, long& status)
  {
    const ReplicaStubs* st = Table();
    if (!st || !st->IsBound()) {
      JNIEnv* started = nullptr;
      status = VLXKDMJavaObject::InitJava(started, operation);
      if (status < 0) return nullptr;
      st = Table();
      status = !st ? VLX_E_FAIL : !st->IsBound() ? st->ReportUnbound(operation) : VLX_S_OK;
      if (status < 0) return nullptr;
    }
    return st;
  }
  // Attaches proxy to object, whose Java class the binding table's method signature establishes.
  static long Attach(VLXKDMJavaObject& proxy, JNIEnv* env, jobject object)
  {
    return proxy.ReplaceGlobalRef(env, object);
  }
  // Proxies of the instances of an Instance[] (null: an empty list).
  static long Build(VLXListValVLXKDMInstance& list, JNIEnv* env, jobject array)
  {
    return VLXKDMJavaObject::BuildFromJavaType(env, array, list);
  }
  // Attaches value to object (not null) and reads its local form; a failure leaves value as it was.
  static long Read(VLXKDMInstanceValue& value, JNIEnv* env, jobject object) { return value.Read(env, object, true); }

  // The start of an operation that Java code calls with its own environment: env is replaced by
  // the calling thread's. Returns the bound table, or null with the operation's result in result.
  static const ReplicaStubs* StartJavaFacing(JNIEnv*& env, const char* name, long& result)
  {
    result = VLXKDMJavaObject::InitJava(env, name);
    if (result < 0) return nullptr;
    const ReplicaStubs* st = Table();
    if (!st)
      result = VLX_E_FAIL;
    else if (!st->IsBound())
      result = st->ReportUnbound(name);
    return st && st->IsBound() ? st : nullptr;
  }
};

// The native method the Java side calls with progress reports (Progress.callNative), registered
// once the binding table is bound; a failure leaves an exception pending.
long RegisterProgressNative(JNIEnv* env, const ReplicaStubs& table);

// ---- How a native argument reaches Java ------------------------------------------------------
// J: the JNI type passed; To: the conversion; kOwnsRef: To makes a local reference that the frame
// releases; kEarly: converted before the other arguments (enumeration constants).

template <class T, class = void>
struct ArgOf;

template <class Native, class Java>
struct ConvertedArg {  // converted by the platform converter into a new local reference
  using J = Java;
  static constexpr bool kOwnsRef = true;
  static constexpr bool kEarly = false;
  static long To(JNIEnv* env, const Native& value, J& out)
  {
    return VLXJBXJNIConverter::ConvertToJavaType(env, value, out);
  }
};

template <class T>
struct PassedArg {  // passed as it is
  using J = T;
  static constexpr bool kOwnsRef = false;
  static constexpr bool kEarly = false;
  static long To(JNIEnv*, T value, J& out)
  {
    out = value;
    return VLX_S_OK;
  }
};

// A text: steps 2 and 3 (or the conversion before it) have found no exception pending.
template <>
struct ArgOf<VLXUnicodeString> {
  using J = jstring;
  static constexpr bool kOwnsRef = true;
  static constexpr bool kEarly = false;
  static long To(JNIEnv* env, const VLXUnicodeString& value, J& out)
  {
    return VLXJBXJNIConverter::ConvertToJavaString(env, value, out);
  }
};
template <>
struct ArgOf<VLXListValVLXUnicodeString> : ConvertedArg<VLXListValVLXUnicodeString, jobjectArray> {
};
template <>
struct ArgOf<VLXBinary> : ConvertedArg<VLXBinary, jbyteArray> {
};
template <>
struct ArgOf<int> : PassedArg<jint> {
};
template <>
struct ArgOf<long long> : PassedArg<jlong> {
};
// Any non-zero byte is true: Java sees only 0 or 1.
template <>
struct ArgOf<VLXBoolean> {
  using J = jboolean;
  static constexpr bool kOwnsRef = false;
  static constexpr bool kEarly = false;
  static long To(JNIEnv*, VLXBoolean value, J& out)
  {
    out = value != 0 ? JNI_TRUE : JNI_FALSE;
    return VLX_S_OK;
  }
};
template <>
struct ArgOf<jobject> : PassedArg<jobject> {
};

// A proxy argument goes as its handle, without a built test.
template <class P>
struct ArgOf<P, std::enable_if_t<std::is_base_of_v<VLXKDMJavaObject, P>>> {
  using J = jobject;
  static constexpr bool kOwnsRef = false;
  static constexpr bool kEarly = false;
  static long To(JNIEnv*, const P& proxy, J& out)
  {
    out = proxy.GetHandle();
    return VLX_S_OK;
  }
};

// ---- How a Java result lands in a native out-parameter ---------------------------------------
// Raw: the JNI result type, which picks the Call*Method; Land: stores it and gives the new status
// (an object result's local reference is released here).

template <class T, class = void>
struct ResultOf;

template <class Native>
struct ConvertedResult {  // read by the platform converter
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, Native& out, long)
  {
    LocalRef owned(env, result);
    return VLXJBXJNIConverter::BuildFromJavaType(env, result, out);
  }
};

template <class Native, class Java>
struct PrimitiveResult {  // written as it came; the status stays
  using Raw = Java;
  static long Land(JNIEnv*, Java result, Native& out, long status)
  {
    out = result;
    return status;
  }
};

// Every method answering a VLXUnicodeString is declared to return a java.lang.String, and step 8
// has found no exception: the text is read without checking either again.
template <>
struct ResultOf<VLXUnicodeString> {
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, VLXUnicodeString& out, long)
  {
    LocalRef owned(env, result);
    return VLXJBXJNIConverter::BuildFromJavaString(env, static_cast<jstring>(result), out);
  }
};
template <>
struct ResultOf<VLXListValVLXUnicodeString> : ConvertedResult<VLXListValVLXUnicodeString> {
};
template <>
struct ResultOf<VLXBinary> : ConvertedResult<VLXBinary> {
};
// An Instance[] becomes proxies of the same Java objects.
template <>
struct ResultOf<VLXListValVLXKDMInstance> {
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, VLXListValVLXKDMInstance& out, long)
  {
    LocalRef owned(env, result);
    return FrameAccess::Build(out, env, result);
  }
};
template <>
struct ResultOf<int> : PrimitiveResult<int, jint> {
};
template <>
struct ResultOf<long long> : PrimitiveResult<long long, jlong> {
};
template <>
struct ResultOf<VLXBoolean> : PrimitiveResult<VLXBoolean, jboolean> {
};

// A returned Java object is attached to the out-proxy, even when it is null.
template <class P>
struct ResultOf<P, std::enable_if_t<std::is_base_of_v<VLXKDMJavaObject, P>>> {
  using Raw = jobject;
  static long Land(JNIEnv* env, jobject result, P& out, long)
  {
    LocalRef owned(env, result);
    return FrameAccess::Attach(out, env, result);
  }
};

// A void method: nothing lands, the status stays.
struct NoResult {};
template <>
struct ResultOf<NoResult> {
  using Raw = void;
};

// An operation that ends in another operation of the library (forwardTo): no Java call of its
// own; the other operation's result is the status.
struct Forwarded {
  using Raw = void;
};

// ---- Refusals ---------------------------------------------------------------------------------

// The Java class of object (not null) for an error text: "a java.lang.Long".
inline std::string ClassText(JNIEnv* env, jobject object)
{
  VLXUnicodeString name;
  return VLXJBXJNIUtilities::GetClassName(env, object, name) < 0 ? std::string("of a class whose name cannot be read")
                                                                 : std::string("a ") + name.c_str();
}

// Records that operation was given a value it cannot take (why says which and why) as the thread's
// last error; returns VLX_E_INVALIDARG.
inline long RejectValue(const char* operation, const std::string& why)
{
  return VLXJBXException::Raise(VLX_E_INVALIDARG, VLXJBXMessages::InvalidArgument, {operation, why}, __FILE__,
                                __LINE__);
}

}  // namespace corvexa
