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

inline jclass FindClass(const char* path)
{
  jclass cls = Env()->FindClass(path);
  if (!cls) ADD_FAILURE() << "class not found: " << path;
  return cls;
}

// True when object's class is exactly the class at path.
inline bool IsExactly(jobject object, const char* path)
{
  if (!object) return false;
  JNIEnv* env = Env();
  Local cls(env->GetObjectClass(object));
  Local expected(FindClass(path));
  return env->IsSameObject(cls.get(), expected.get()) == JNI_TRUE;
}

inline jobject NewDate(jlong ms, const char* cls = "java/util/Date")
{
  JNIEnv* env = Env();
  Local date(FindClass(cls));
  return env->NewObject(date.as<jclass>(), env->GetMethodID(date.as<jclass>(), "<init>", "(J)V"), ms);
}

inline jobject NewLong(jlong value)
{
  JNIEnv* env = Env();
  Local cls(FindClass("java/lang/Long"));
  return env->CallStaticObjectMethod(cls.as<jclass>(),
                                     env->GetStaticMethodID(cls.as<jclass>(), "valueOf", "(J)Ljava/lang/Long;"), value);
}

inline jlong TimeOf(jobject date)
{
  JNIEnv* env = Env();
  Local cls(FindClass("java/util/Date"));
  return env->CallLongMethod(date, env->GetMethodID(cls.as<jclass>(), "getTime", "()J"));
}

// An array of class elementClass holding the given objects (nulls allowed).
inline jobjectArray NewArray(const char* elementClass, const std::vector<jobject>& elements)
{
  JNIEnv* env = Env();
  Local cls(FindClass(elementClass));
  jobjectArray array = env->NewObjectArray(static_cast<jsize>(elements.size()), cls.as<jclass>(), nullptr);
  for (size_t i = 0; i < elements.size(); ++i) env->SetObjectArrayElement(array, static_cast<jsize>(i), elements[i]);
  return array;
}

inline jobject Element(jobject array, int index)
{
  return Env()->GetObjectArrayElement(static_cast<jobjectArray>(array), index);
}

inline int Length(jobject array) { return Env()->GetArrayLength(static_cast<jarray>(array)); }

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
