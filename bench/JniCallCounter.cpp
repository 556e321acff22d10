#include "JniCallCounter.h"

#include <cstdarg>

namespace corvexa_bench {
namespace {

const JNINativeInterface_* gOriginal = nullptr;
JNINativeInterface_ gCounting;
JniCounts gCounts{};

jboolean ExceptionCheck(JNIEnv* env)
{
  ++gCounts[kExceptionCheck];
  return gOriginal->ExceptionCheck(env);
}
jboolean IsInstanceOf(JNIEnv* env, jobject object, jclass cls)
{
  ++gCounts[kIsInstanceOf];
  return gOriginal->IsInstanceOf(env, object, cls);
}
jclass GetObjectClass(JNIEnv* env, jobject object)
{
  ++gCounts[kGetObjectClass];
  return gOriginal->GetObjectClass(env, object);
}
jboolean IsSameObject(JNIEnv* env, jobject a, jobject b)
{
  ++gCounts[kIsSameObject];
  return gOriginal->IsSameObject(env, a, b);
}
jobject NewGlobalRef(JNIEnv* env, jobject object)
{
  ++gCounts[kNewGlobalRef];
  return gOriginal->NewGlobalRef(env, object);
}
void DeleteGlobalRef(JNIEnv* env, jobject object)
{
  ++gCounts[kDeleteGlobalRef];
  gOriginal->DeleteGlobalRef(env, object);
}
void DeleteLocalRef(JNIEnv* env, jobject object)
{
  ++gCounts[kDeleteLocalRef];
  gOriginal->DeleteLocalRef(env, object);
}
jstring NewString(JNIEnv* env, const jchar* units, jsize length)
{
  ++gCounts[kNewString];
  return gOriginal->NewString(env, units, length);
}
jsize GetStringLength(JNIEnv* env, jstring string)
{
  ++gCounts[kGetStringLength];
  return gOriginal->GetStringLength(env, string);
}
void GetStringRegion(JNIEnv* env, jstring string, jsize start, jsize length, jchar* units)
{
  ++gCounts[kGetStringRegion];
  gOriginal->GetStringRegion(env, string, start, length, units);
}

#define COUNTING_CALL(Name, Result, Target)                               \
  Result Name(JNIEnv* env, Target target, jmethodID method, va_list args) \
  {                                                                       \
    ++gCounts[kCallMethod];                                               \
    return gOriginal->Name(env, target, method, args);                    \
  }
COUNTING_CALL(CallObjectMethodV, jobject, jobject)
COUNTING_CALL(CallVoidMethodV, void, jobject)
COUNTING_CALL(CallIntMethodV, jint, jobject)
COUNTING_CALL(CallBooleanMethodV, jboolean, jobject)
COUNTING_CALL(CallDoubleMethodV, jdouble, jobject)
COUNTING_CALL(CallLongMethodV, jlong, jobject)
COUNTING_CALL(CallStaticObjectMethodV, jobject, jclass)
COUNTING_CALL(CallStaticVoidMethodV, void, jclass)
COUNTING_CALL(CallStaticIntMethodV, jint, jclass)
COUNTING_CALL(NewObjectV, jobject, jclass)
#undef COUNTING_CALL

jintArray NewIntArray(JNIEnv* env, jsize length)
{
  ++gCounts[kNewArray];
  return gOriginal->NewIntArray(env, length);
}
jbyteArray NewByteArray(JNIEnv* env, jsize length)
{
  ++gCounts[kNewArray];
  return gOriginal->NewByteArray(env, length);
}
jobjectArray NewObjectArray(JNIEnv* env, jsize length, jclass cls, jobject initial)
{
  ++gCounts[kNewArray];
  return gOriginal->NewObjectArray(env, length, cls, initial);
}
void SetIntArrayRegion(JNIEnv* env, jintArray array, jsize start, jsize length, const jint* values)
{
  ++gCounts[kArrayRegion];
  gOriginal->SetIntArrayRegion(env, array, start, length, values);
}
void GetIntArrayRegion(JNIEnv* env, jintArray array, jsize start, jsize length, jint* values)
{
  ++gCounts[kArrayRegion];
  gOriginal->GetIntArrayRegion(env, array, start, length, values);
}
void SetByteArrayRegion(JNIEnv* env, jbyteArray array, jsize start, jsize length, const jbyte* values)
{
  ++gCounts[kArrayRegion];
  gOriginal->SetByteArrayRegion(env, array, start, length, values);
}

}  // namespace

const char* JniFunctionName(JniFunction function)
{
  static const char* const names[kJniFunctionCount] = {
      "ExceptionCheck",        "IsInstanceOf",   "GetObjectClass", "IsSameObject",    "NewGlobalRef",
      "DeleteGlobalRef",       "DeleteLocalRef", "NewString",      "GetStringLength", "GetStringRegion",
      "Call*Method/NewObject", "New*Array",      "*ArrayRegion"};
  return names[function];
}

void StartCountingJni(JNIEnv* env)
{
  gOriginal = env->functions;
  gCounting = *gOriginal;
  gCounting.ExceptionCheck = ExceptionCheck;
  gCounting.IsInstanceOf = IsInstanceOf;
  gCounting.GetObjectClass = GetObjectClass;
  gCounting.IsSameObject = IsSameObject;
  gCounting.NewGlobalRef = NewGlobalRef;
  gCounting.DeleteGlobalRef = DeleteGlobalRef;
  gCounting.DeleteLocalRef = DeleteLocalRef;
  gCounting.NewString = NewString;
  gCounting.GetStringLength = GetStringLength;
  gCounting.GetStringRegion = GetStringRegion;
  gCounting.CallObjectMethodV = CallObjectMethodV;
  gCounting.CallVoidMethodV = CallVoidMethodV;
  gCounting.CallIntMethodV = CallIntMethodV;
  gCounting.CallBooleanMethodV = CallBooleanMethodV;
  gCounting.CallDoubleMethodV = CallDoubleMethodV;
  gCounting.CallLongMethodV = CallLongMethodV;
  gCounting.CallStaticObjectMethodV = CallStaticObjectMethodV;
  gCounting.CallStaticVoidMethodV = CallStaticVoidMethodV;
  gCounting.CallStaticIntMethodV = CallStaticIntMethodV;
  gCounting.NewObjectV = NewObjectV;
  gCounting.NewIntArray = NewIntArray;
  gCounting.NewByteArray = NewByteArray;
  gCounting.NewObjectArray = NewObjectArray;
  gCounting.SetIntArrayRegion = SetIntArrayRegion;
  gCounting.GetIntArrayRegion = GetIntArrayRegion;
  gCounting.SetByteArrayRegion = SetByteArrayRegion;
  gCounts = JniCounts{};
  env->functions = &gCounting;
}

JniCounts StopCountingJni(JNIEnv* env)
{
  env->functions = gOriginal;
  return gCounts;
}

}  // namespace corvexa_bench
