// Java objects made and read directly through JNI, to check what the value converters and the
// value holder produce and to feed them what Java would.
#pragma once

#include <jni.h>

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "CallFrame.h"
#include "JavaTestSupport.h"
#include "VLXKDMInstance.h"
#include "VLXKDMInstanceValue.h"
#include "VLXListValVLXKDMInstance.h"

namespace corvexa_test {

const char* const kInstanceClass = "com/velmora/tessara/kdmreplica/Instance";

// A local reference deleted at the end of the scope.
class Local {
 public:
  explicit Local(jobject ref = nullptr) : _ref(ref) {}
  ~Local() { reset(); }
  Local(const Local&) = delete;
  Local& operator=(const Local&) = delete;
  jobject get() const { return _ref; }
  template <class J>
  J as() const { return static_cast<J>(_ref); }
  void reset(jobject ref = nullptr)
  {
    if (_ref) Env()->DeleteLocalRef(_ref);
    _ref = ref;
  }

 private:
  jobject _ref;
};

// Every JNI call the tests make themselves is followed by this check, so that the library is never
// entered with an exception left pending by the test (the JVM's checks would blame the library).
// A pending exception is printed, cleared and counted as a failure of the test.
inline bool NoPending(const char* what)
{
  JNIEnv* env = Env();
  if (!env->ExceptionCheck()) return true;
  env->ExceptionDescribe();
  env->ExceptionClear();
  ADD_FAILURE() << "a Java exception is pending after " << what;
  return false;
}

inline jclass FindClass(const char* path)
{
  jclass cls = Env()->FindClass(path);
  if (!NoPending(path) || !cls) ADD_FAILURE() << "class not found: " << path;
  return cls;
}

// True when object's class is exactly the class at path.
inline bool IsExactly(jobject object, const char* path)
{
  if (!object) return false;
  JNIEnv* env = Env();
  Local cls(env->GetObjectClass(object));
  Local expected(FindClass(path));
  return expected.get() && env->IsSameObject(cls.get(), expected.get()) == JNI_TRUE;
}

// A new date of class cls (java.util.Date or a subclass with a (long) constructor); null, with a
// test failure, when it cannot be made.
inline jobject NewDate(jlong ms, const char* cls = "java/util/Date")
{
  JNIEnv* env = Env();
  Local date(FindClass(cls));
  if (!date.get()) return nullptr;
  const jmethodID ctor = env->GetMethodID(date.as<jclass>(), "<init>", "(J)V");
  if (!NoPending("looking up the (long) constructor") || !ctor) return nullptr;
  jobject made = env->NewObject(date.as<jclass>(), ctor, ms);
  return NoPending("making a date") ? made : nullptr;
}

inline jobject NewLong(jlong value)
{
  JNIEnv* env = Env();
  Local cls(FindClass("java/lang/Long"));
  const jmethodID valueOf = env->GetStaticMethodID(cls.as<jclass>(), "valueOf", "(J)Ljava/lang/Long;");
  if (!NoPending("looking up Long.valueOf") || !valueOf) return nullptr;
  jobject made = env->CallStaticObjectMethod(cls.as<jclass>(), valueOf, value);
  return NoPending("Long.valueOf") ? made : nullptr;
}

// Date.getTime of a date (a test failure, and 0, when it throws).
inline jlong TimeOf(jobject date)
{
  JNIEnv* env = Env();
  Local cls(FindClass("java/util/Date"));
  const jlong ms = env->CallLongMethod(date, env->GetMethodID(cls.as<jclass>(), "getTime", "()J"));
  return NoPending("Date.getTime") ? ms : 0;
}

// Boolean.booleanValue of a boxed boolean.
inline jboolean BooleanOf(jobject boxed)
{
  JNIEnv* env = Env();
  Local cls(FindClass("java/lang/Boolean"));
  const jboolean value = env->CallBooleanMethod(boxed, env->GetMethodID(cls.as<jclass>(), "booleanValue", "()Z"));
  return NoPending("Boolean.booleanValue") ? value : JNI_FALSE;
}

// An array of class elementClass holding the given objects (nulls allowed).
inline jobjectArray NewArray(const char* elementClass, const std::vector<jobject>& elements)
{
  JNIEnv* env = Env();
  Local cls(FindClass(elementClass));
  jobjectArray array = env->NewObjectArray(static_cast<jsize>(elements.size()), cls.as<jclass>(), nullptr);
  if (!NoPending("making an array")) return nullptr;
  for (size_t i = 0; i < elements.size(); ++i) {
    env->SetObjectArrayElement(array, static_cast<jsize>(i), elements[i]);
    if (!NoPending("storing an array element")) break;
  }
  return array;
}

inline jobject Element(jobject array, int index)
{
  jobject element = Env()->GetObjectArrayElement(static_cast<jobjectArray>(array), index);
  return NoPending("reading an array element") ? element : nullptr;
}

inline int Length(jobject array) { return array ? Env()->GetArrayLength(static_cast<jarray>(array)) : -1; }

inline bool Same(jobject a, jobject b) { return Env()->IsSameObject(a, b) == JNI_TRUE; }

// A proxy attached to a new detached Java instance.
inline VLXKDMInstance NewInstance()
{
  VLXKDMInstance instance;
  AttachNew(instance, kInstanceClass);
  return instance;
}

inline std::vector<VLXKDMInstance> NewInstances(int count)
{
  std::vector<VLXKDMInstance> out;
  for (int i = 0; i < count; ++i) out.push_back(NewInstance());
  return out;
}

inline VLXTime Seconds(time_t s)
{
  VLXTime t;
  t.Settime_t(s);
  return t;
}

// The fatal-error reports recorded so far, as "message@line".
inline std::vector<std::string> Reports()
{
  std::vector<std::string> out;
  for (const auto& r : FatalRecorder::Reports()) out.push_back(r.message + "@" + std::to_string(r.line));
  return out;
}

}  // namespace corvexa_test
