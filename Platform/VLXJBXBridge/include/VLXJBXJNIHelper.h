// VLXJBXJNIHelper: one thin function per JNI function the Corvexa libraries call, applied to the
// given environment. Object results are local references (except NewGlobalRef). The functions
// check nothing: the JNI rules apply (no call but the exception and delete functions while an
// exception is pending, no null object where JNI wants one).
#ifndef VLXJBXJNIHelper_h
#define VLXJBXJNIHelper_h

#include <jni.h>

class VLXJBXJNIHelper {
 public:
  template <class... A>
  static jobject CallObjectMethod(JNIEnv* env, jobject obj, jmethodID method, A... args)
  {
    return env->CallObjectMethod(obj, method, args...);
  }
  template <class... A>
  static void CallVoidMethod(JNIEnv* env, jobject obj, jmethodID method, A... args)
  {
    env->CallVoidMethod(obj, method, args...);
  }
  template <class... A>
  static jboolean CallBooleanMethod(JNIEnv* env, jobject obj, jmethodID method, A... args)
  {
    return env->CallBooleanMethod(obj, method, args...);
  }
  template <class... A>
  static jint CallIntMethod(JNIEnv* env, jobject obj, jmethodID method, A... args)
  {
    return env->CallIntMethod(obj, method, args...);
  }
  template <class... A>
  static jlong CallLongMethod(JNIEnv* env, jobject obj, jmethodID method, A... args)
  {
    return env->CallLongMethod(obj, method, args...);
  }
  template <class... A>
  static jdouble CallDoubleMethod(JNIEnv* env, jobject obj, jmethodID method, A... args)
  {
    return env->CallDoubleMethod(obj, method, args...);
  }
  template <class... A>
  static jobject CallStaticObjectMethod(JNIEnv* env, jclass cls, jmethodID method, A... args)
  {
    return env->CallStaticObjectMethod(cls, method, args...);
  }
  template <class... A>
  static jlong CallStaticLongMethod(JNIEnv* env, jclass cls, jmethodID method, A... args)
  {
    return env->CallStaticLongMethod(cls, method, args...);
  }
  template <class... A>
  static void CallStaticVoidMethod(JNIEnv* env, jclass cls, jmethodID method, A... args)
  {
    env->CallStaticVoidMethod(cls, method, args...);
  }
  template <class... A>
  static jobject NewObject(JNIEnv* env, jclass cls, jmethodID constructor, A... args)
  {
    return env->NewObject(cls, constructor, args...);
  }

  static jobjectArray NewObjectArray(JNIEnv* env, jsize length, jclass elementClass, jobject initialElement)
  {
    return env->NewObjectArray(length, elementClass, initialElement);
  }
  static jobject GetObjectArrayElement(JNIEnv* env, jobjectArray array, jsize index)
  {
    return env->GetObjectArrayElement(array, index);
  }
  static void SetObjectArrayElement(JNIEnv* env, jobjectArray array, jsize index, jobject value)
  {
    env->SetObjectArrayElement(array, index, value);
  }
  static jsize GetArrayLength(JNIEnv* env, jarray array) { return env->GetArrayLength(array); }
  static jclass GetObjectClass(JNIEnv* env, jobject obj) { return env->GetObjectClass(obj); }
  static jboolean IsInstanceOf(JNIEnv* env, jobject obj, jclass cls) { return env->IsInstanceOf(obj, cls); }
  static jobject GetStaticObjectField(JNIEnv* env, jclass cls, jfieldID field)
  {
    return env->GetStaticObjectField(cls, field);
  }
  static jboolean IsSameObject(JNIEnv* env, jobject a, jobject b) { return env->IsSameObject(a, b); }
  static jobject NewLocalRef(JNIEnv* env, jobject obj) { return env->NewLocalRef(obj); }
  static void DeleteLocalRef(JNIEnv* env, jobject obj) { env->DeleteLocalRef(obj); }
  static bool ExceptionCheck(JNIEnv* env) { return env->ExceptionCheck() == JNI_TRUE; }
  static void ExceptionClear(JNIEnv* env) { env->ExceptionClear(); }
  static jint RegisterNatives(JNIEnv* env, jclass cls, const JNINativeMethod* methods, jint count)
  {
    return env->RegisterNatives(cls, methods, count);
  }

  // A new global reference to `obj` (null for a null `obj`), counted by
  // VLXJBXJNIUtilities::GetGlobalRefCount.
  static jobject NewGlobalRef(JNIEnv* env, jobject obj);
  // Deletes a global reference made through the bridge (a null `ref` is ignored) and uncounts it.
  static void DeleteGlobalRef(JNIEnv* env, jobject ref);
};

#endif
