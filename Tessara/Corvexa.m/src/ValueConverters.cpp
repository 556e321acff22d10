// The value converters of the proxy base: boxed scalars, dates, instances, and lists of dates,
// byte buffers and instances, between their native form and Java objects.
//
// Every local reference made here is owned by a LocalRef, so no path leaves one behind; a Java
// object handed to the caller is released from its holder only once the whole conversion has
// succeeded. No Java call is made with an exception pending or on a null object.
#include <climits>
#include <ctime>
#include <string>

#include "CallFrame.h"
#include "VLXKDMInstance.h"
#include "VLXJBXJNIUtilities.h"
#include "VLXListValVLXBinary.h"
#include "VLXListValVLXKDMInstance.h"
#include "VLXListValVLXTime.h"
#include "VLXTime.h"

using namespace corvexa;

namespace {

using H = VLXJBXJNIHelper;

// The unit whose path the converters' precondition reports carry.
// Fixed report path (and lines): callers and their tests match on them; keep them as they are.
const char* const kSource = "Tessara\\Corvexa.m\\src\\VLXKDMJavaObject.cpp";
const int kLineUnattachedInstance = 157;
const int kLineUnattachedElement = 192;

const char* const kBuildBoolean = "VLXKDMJavaObject::BuildFromJavaType(JNIEnv*, jobject, VLXBoolean&)";
const char* const kBuildInt = "VLXKDMJavaObject::BuildFromJavaType(JNIEnv*, jobject, int&)";
const char* const kBuildDouble = "VLXKDMJavaObject::BuildFromJavaType(JNIEnv*, jobject, double&)";
const char* const kBuildTime = "VLXKDMJavaObject::BuildFromJavaType(JNIEnv*, jobject, VLXTime&)";
const char* const kBuildInstance = "VLXKDMJavaObject::BuildFromJavaType(JNIEnv*, jobject, VLXKDMInstance&)";
const char* const kBuildTimes = "VLXKDMJavaObject::BuildFromJavaType(JNIEnv*, jobject, VLXListOfVLXTime&)";
const char* const kBuildBinaries = "VLXKDMJavaObject::BuildFromJavaType(JNIEnv*, jobject, VLXListOfVLXBinary&)";
const char* const kBuildInstances = "VLXKDMJavaObject::BuildFromJavaType(JNIEnv*, jobject, VLXListOfVLXKDMInstance&)";
const char* const kConvertInt = "VLXKDMJavaObject::ConvertToJavaType(JNIEnv*, int, jobject&)";
const char* const kConvertDouble = "VLXKDMJavaObject::ConvertToJavaType(JNIEnv*, double, jobject&)";
const char* const kConvertBoolean = "VLXKDMJavaObject::ConvertToJavaType(JNIEnv*, VLXBoolean, jobject&)";
const char* const kConvertTime = "VLXKDMJavaObject::ConvertToJavaType(JNIEnv*, const VLXTime&, jobject&)";
const char* const kConvertInstance = "VLXKDMJavaObject::ConvertToJavaType(JNIEnv*, const VLXKDMInstance&, jobject&)";
const char* const kConvertTimes = "VLXKDMJavaObject::ConvertToJavaType(JNIEnv*, const VLXListOfVLXTime&, jobject&)";
const char* const kConvertInstances =
    "VLXKDMJavaObject::ConvertToJavaType(JNIEnv*, const VLXListOfVLXKDMInstance&, jobject&)";
const char* const kConvertBinaries =
    "VLXKDMJavaObject::ConvertToJavaType(JNIEnv*, const VLXListOfVLXBinary&, jobject&)";

long Translate(JNIEnv* env, long status, const char* name)
{
  return VLXKDMJavaObject::HandleReplicaError(env, status, name);
}

// The binding table when it can be used. Otherwise null, with status VLX_E_FAIL when there is no
// table (no error is translated) or the unbound failure when the table could not be bound.
const ReplicaStubs* TableFor(const char* name, long& status)
{
  const ReplicaStubs* st = FrameAccess::Table();
  if (!st) {
    status = VLX_E_FAIL;
    return nullptr;
  }
  if (!st->IsBound()) {
    status = st->ReportUnbound(name);
    return nullptr;
  }
  return st;
}

long RejectTime(JNIEnv* env, const VLXTime& time, const char* name)
{
  const std::string why =
      "the time " + std::to_string(static_cast<long long>(time.Gettime_t())) + " s is beyond the range of a Java date";
  return Translate(env, RejectValue(name, why), name);
}

// Java to a native scalar: read(table) calls the accessor on input; output is written only when it
// threw nothing.
template <class Native, class Read>
long BuildScalar(JNIEnv* env, jobject input, Native& output, const char* name, Read read)
{
  long status = VLX_S_OK;
  const ReplicaStubs* st = TableFor(name, status);
  if (!st) return status;
  if (!input) return Translate(env, RejectValue(name, "the Java object is null"), name);
  const Native value = read(*st);
  if (H::ExceptionCheck(env)) return Translate(env, status, name);
  output = value;
  return VLX_S_OK;
}

// A native scalar to a new Java object of class cls made by constructor ctor.
template <class Java>
long ConvertScalar(JNIEnv* env, Slot cls, Slot ctor, Java value, jobject& output, const char* name)
{
  long status = VLX_S_OK;
  const ReplicaStubs* st = TableFor(name, status);
  if (!st) return status;
  const jobject object = H::NewObject(env, st->Class(cls), st->Method(ctor), value);
  if (H::ExceptionCheck(env)) return Translate(env, status, name);
  output = object;
  return VLX_S_OK;
}

}  // namespace

// ---- Java to native --------------------------------------------------------------------------

long VLXKDMJavaObject::BuildFromJavaType(JNIEnv* env, jobject input, VLXBoolean& output)
{
  return BuildScalar(env, input, output, kBuildBoolean, [&](const ReplicaStubs& st) {
    return static_cast<VLXBoolean>(H::CallBooleanMethod(env, input, st.Method(Boolean_booleanValue)));
  });
}

long VLXKDMJavaObject::BuildFromJavaType(JNIEnv* env, jobject input, int& output)
{
  return BuildScalar(env, input, output, kBuildInt, [&](const ReplicaStubs& st) {
    return static_cast<int>(H::CallIntMethod(env, input, st.Method(Integer_intValue)));
  });
}

long VLXKDMJavaObject::BuildFromJavaType(JNIEnv* env, jobject input, double& output)
{
  return BuildScalar(env, input, output, kBuildDouble, [&](const ReplicaStubs& st) {
    return static_cast<double>(H::CallDoubleMethod(env, input, st.Method(Double_doubleValue)));
  });
}

long VLXKDMJavaObject::BuildFromJavaType(JNIEnv* env, jobject input, VLXTime& output)
{
  return BuildScalar(env, input, output, kBuildTime, [&](const ReplicaStubs& st) {
    VLXTime time;
    time.Settime_t(Seconds(H::CallLongMethod(env, input, st.Method(Date_getTime))));
    return time;
  });
}

long VLXKDMJavaObject::BuildFromJavaType(JNIEnv* env, jobject input, VLXKDMInstance& output)
{
  return Translate(env, output.SetGlobalRef(env, input), kBuildInstance);
}

long VLXKDMJavaObject::BuildFromJavaType(JNIEnv* env, jobject input, VLXListValVLXTime& output)
{
  long status = VLX_S_OK;
  const ReplicaStubs* st = TableFor(kBuildTimes, status);
  if (!st) return status;
  output.RemoveAll(1);
  if (!input) return Translate(env, status, kBuildTimes);
  const jobjectArray array = static_cast<jobjectArray>(input);
  const jsize n = H::GetArrayLength(env, array);
  const jmethodID getTime = st->Method(Date_getTime);
  for (jsize i = 0; i < n; ++i) {
    LocalRef element(env, H::GetObjectArrayElement(env, array, i));
    if (H::ExceptionCheck(env)) break;
    if (!element.get()) {
      status = RejectValue(kBuildTimes, "the date at index " + std::to_string(i) + " of the Java array is null");
      break;
    }
    const jlong ms = H::CallLongMethod(env, element.get(), getTime);
    if (H::ExceptionCheck(env)) break;
    VLXTime time;
    time.Settime_t(Seconds(ms));
    output.Append(time);
  }
  return Translate(env, status, kBuildTimes);
}

long VLXKDMJavaObject::BuildFromJavaType(JNIEnv* env, jobject input, VLXListValVLXBinary& output)
{
  long status = VLX_S_OK;
  output.RemoveAll(1);
  if (!input) return Translate(env, status, kBuildBinaries);
  const jobjectArray array = static_cast<jobjectArray>(input);
  const jsize n = H::GetArrayLength(env, array);
  for (jsize i = 0; i < n; ++i) {
    LocalRef element(env, H::GetObjectArrayElement(env, array, i));
    if (H::ExceptionCheck(env)) break;
    VLXBinary buffer;  // a null element gives an empty buffer
    status = VLXJBXJNIConverter::BuildFromJavaType(env, element.get(), buffer);
    if (status < 0) break;
    output.Append(buffer);
  }
  return Translate(env, status, kBuildBinaries);
}

long VLXKDMJavaObject::BuildFromJavaType(JNIEnv* env, jobject input, VLXListValVLXKDMInstance& output)
{
  long status = VLX_S_OK;
  output.RemoveAll(VLXCollec::FreeMemory);
  if (!input) return Translate(env, status, kBuildInstances);
  const jobjectArray array = static_cast<jobjectArray>(input);
  const jsize n = H::GetArrayLength(env, array);
  const VLXKDMInstance blank;
  for (jsize i = 0; i < n; ++i) {
    output.Append(blank);
    LocalRef element(env, H::GetObjectArrayElement(env, array, i));
    if (H::ExceptionCheck(env)) break;
    // A null element leaves the new proxy unattached.
    status = output[output.Size()].SetGlobalRef(env, element.get());
    if (status < 0) break;
  }
  return Translate(env, status, kBuildInstances);
}

// ---- Native to Java --------------------------------------------------------------------------

long VLXKDMJavaObject::ConvertToJavaType(JNIEnv* env, int input, jobject& output)
{
  return ConvertScalar(env, Integer, Integer_new, static_cast<jint>(input), output, kConvertInt);
}

long VLXKDMJavaObject::ConvertToJavaType(JNIEnv* env, double input, jobject& output)
{
  return ConvertScalar(env, Double, Double_new, static_cast<jdouble>(input), output, kConvertDouble);
}

long VLXKDMJavaObject::ConvertToJavaType(JNIEnv* env, VLXBoolean input, jobject& output)
{
  // Any non-zero byte is true: Java sees only 0 or 1.
  return ConvertScalar(env, Boolean, Boolean_new, static_cast<jboolean>(input != 0), output, kConvertBoolean);
}

long VLXKDMJavaObject::ConvertToJavaType(JNIEnv* env, const VLXTime& input, jobject& output)
{
  jlong ms = 0;
  if (!Milliseconds(input, ms)) {
    long status = VLX_S_OK;
    if (!TableFor(kConvertTime, status)) return status;
    return RejectTime(env, input, kConvertTime);
  }
  return ConvertScalar(env, Date, Date_new, ms, output, kConvertTime);
}

long VLXKDMJavaObject::ConvertToJavaType(JNIEnv* env, const VLXKDMInstance& input, jobject& output)
{
  if (!input.GetHandle()) {
    VLXFatalError("AssertionFailed:input.GetHandle() != NULL", nullptr, nullptr, nullptr, kSource,
                  kLineUnattachedInstance);
    return Translate(env, RejectValue(kConvertInstance, "the instance is not attached to a Java object"),
                     kConvertInstance);
  }
  output = input.GetHandle();
  return Translate(env, VLX_S_OK, kConvertInstance);
}

long VLXKDMJavaObject::ConvertToJavaType(JNIEnv* env, const VLXListValVLXTime& input, jobject& output)
{
  long status = VLX_S_OK;
  const ReplicaStubs* st = TableFor(kConvertTimes, status);
  if (!st) return status;
  const int n = input.Size();
  LocalRef array(env, H::NewObjectArray(env, n, st->Class(Date), nullptr));
  if (H::ExceptionCheck(env)) return Translate(env, VLX_E_FAIL, kConvertTimes);
  const jclass dateClass = st->Class(Date);
  const jmethodID dateNew = st->Method(Date_new);
  for (int i = 1; i <= n; ++i) {
    jlong ms = 0;
    if (!Milliseconds(input[i], ms)) return RejectTime(env, input[i], kConvertTimes);
    LocalRef date(env, H::NewObject(env, dateClass, dateNew, ms));
    if (H::ExceptionCheck(env)) return Translate(env, VLX_E_FAIL, kConvertTimes);
    H::SetObjectArrayElement(env, static_cast<jobjectArray>(array.get()), i - 1, date.get());
    if (H::ExceptionCheck(env)) return Translate(env, VLX_E_FAIL, kConvertTimes);
  }
  output = array.release();
  return Translate(env, status, kConvertTimes);
}

long VLXKDMJavaObject::ConvertToJavaType(JNIEnv* env, const VLXListValVLXKDMInstance& input, jobject& output)
{
  long status = VLX_S_OK;
  const ReplicaStubs* st = TableFor(kConvertInstances, status);
  if (!st) return status;
  const int n = input.Size();
  // Every element must be attached before any Java object is made.
  for (int i = 1; i <= n; ++i) {
    if (input[i].GetHandle()) continue;
    VLXFatalError("AssertionFailed:input[i].GetHandle() != NULL", nullptr, nullptr, nullptr, kSource,
                  kLineUnattachedElement);
    const std::string why =
        "the instance at position " + std::to_string(i) + " of the list is not attached to a Java object";
    return Translate(env, RejectValue(kConvertInstances, why), kConvertInstances);
  }
  LocalRef array(env, H::NewObjectArray(env, n, st->Class(Instance), nullptr));
  if (H::ExceptionCheck(env)) return Translate(env, VLX_E_FAIL, kConvertInstances);
  for (int i = 1; i <= n; ++i) {
    // The element's own object: no new reference. A proxy of an object that is not an instance
    // makes the store throw.
    H::SetObjectArrayElement(env, static_cast<jobjectArray>(array.get()), i - 1, input[i].GetHandle());
    if (H::ExceptionCheck(env)) return Translate(env, VLX_E_FAIL, kConvertInstances);
  }
  output = array.release();
  return Translate(env, status, kConvertInstances);
}

// This one ends with the bridge's own translation and takes no lock.
long VLXKDMJavaObject::ConvertToJavaType(JNIEnv* env, const VLXListValVLXBinary& input, jobject& output)
{
  long status = VLX_S_OK;
  const ReplicaStubs* st = TableFor(kConvertBinaries, status);
  if (!st) return status;
  const int n = input.Size();
  LocalRef array(env, H::NewObjectArray(env, n, st->Class(ByteArray), nullptr));
  if (!array.get() || H::ExceptionCheck(env))
    return VLXJBXJNIUtilities::HandleJavaError(env, VLX_E_FAIL, kConvertBinaries, nullptr, 0);
  for (int i = 1; i <= n; ++i) {
    jbyteArray bytes = nullptr;
    status = VLXJBXJNIConverter::ConvertToJavaType(env, input[i], bytes);
    if (status < 0) return VLXJBXJNIUtilities::HandleJavaError(env, status, kConvertBinaries, nullptr, 0);
    LocalRef element(env, bytes);
    H::SetObjectArrayElement(env, static_cast<jobjectArray>(array.get()), i - 1, element.get());
    if (H::ExceptionCheck(env))
      return VLXJBXJNIUtilities::HandleJavaError(env, VLX_E_FAIL, kConvertBinaries, nullptr, 0);
  }
  output = array.release();
  return VLXJBXJNIUtilities::HandleJavaError(env, status, kConvertBinaries, nullptr, 0);
}
