// The number of live JNI local references of the calling thread, read through the JVM's tool
// interface: its heap walk reports every JNI local reference as a root, with the thread that holds
// it. A native thread that leaks local references grows this count.
#pragma once

#include <jni.h>
#include <jvmti.h>

#include <gtest/gtest.h>

#include "JavaTestSupport.h"

namespace corvexa_test {

namespace detail {

struct LocalRootCount {
  jlong threadId;
  long count;
};

inline jint JNICALL CountLocalRoot(jvmtiHeapReferenceKind kind, const jvmtiHeapReferenceInfo* info, jlong, jlong,
                                   jlong, jlong*, jlong*, jint, void* data)
{
  LocalRootCount* counter = static_cast<LocalRootCount*>(data);
  if (kind == JVMTI_HEAP_REFERENCE_JNI_LOCAL && info && info->jni_local.thread_id == counter->threadId)
    ++counter->count;
  return 0;  // roots only: the walk does not go on into the heap
}

}  // namespace detail

// The calling thread's live local references, or -1 (with a test failure) when they cannot be
// counted. The count includes none made by this function.
inline long LocalRefCount()
{
  JNIEnv* env = Env();
  JavaVM* vm = nullptr;
  jvmtiEnv* jvmti = nullptr;
  if (env->GetJavaVM(&vm) != JNI_OK || vm->GetEnv(reinterpret_cast<void**>(&jvmti), JVMTI_VERSION_1_2) != JNI_OK) {
    ADD_FAILURE() << "no tool interface to count local references with";
    return -1;
  }
  jvmtiCapabilities wanted = {};
  wanted.can_tag_objects = 1;
  if (jvmti->AddCapabilities(&wanted) != JVMTI_ERROR_NONE) {
    ADD_FAILURE() << "the tool interface cannot walk the heap here";
    return -1;
  }
  detail::LocalRootCount counter{0, 0};
  {
    jclass threadClass = env->FindClass("java/lang/Thread");
    jobject current = env->CallStaticObjectMethod(
        threadClass, env->GetStaticMethodID(threadClass, "currentThread", "()Ljava/lang/Thread;"));
    bool thrown = env->ExceptionCheck();
    if (!thrown) {
      counter.threadId = env->CallLongMethod(current, env->GetMethodID(threadClass, "getId", "()J"));
      thrown = env->ExceptionCheck();
    }
    if (thrown) env->ExceptionClear();
    env->DeleteLocalRef(current);
    env->DeleteLocalRef(threadClass);
    if (thrown) {
      ADD_FAILURE() << "the calling thread's id cannot be read";
      return -1;
    }
  }
  jvmtiHeapCallbacks callbacks = {};
  callbacks.heap_reference_callback = &detail::CountLocalRoot;
  const jvmtiError walked = jvmti->FollowReferences(0, nullptr, nullptr, &callbacks, &counter);
  jvmti->DisposeEnvironment();
  if (walked != JVMTI_ERROR_NONE) {
    ADD_FAILURE() << "the heap walk failed with JVMTI error " << walked;
    return -1;
  }
  return counter.count;
}

}  // namespace corvexa_test
