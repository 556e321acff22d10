// Threads: attach once per thread, detach at thread exit, and leave alone the threads that
// someone else attached.
#include "BridgeSupport.h"
#include "VLXJBXJNIConverter.h"

#include <pthread.h>

#include <atomic>
#include <thread>

namespace {

// The calling thread as Java sees it; `thread` is a plain JNI global reference (not the bridge's).
struct JavaThread {
  jobject thread = nullptr;
  std::u16string name;
  bool daemon = false;
};

JavaThread Current(JNIEnv* env)
{
  JavaThread facts;
  env->PushLocalFrame(8);
  jclass cls = env->FindClass("java/lang/Thread");
  jobject current = Checked(
      env, env->CallStaticObjectMethod(cls, env->GetStaticMethodID(cls, "currentThread", "()Ljava/lang/Thread;")));
  facts.thread = env->NewGlobalRef(current);
  facts.daemon = Checked(env, env->CallBooleanMethod(current, env->GetMethodID(cls, "isDaemon", "()Z"))) == JNI_TRUE;
  facts.name = Units(env, Checked(env, static_cast<jstring>(env->CallObjectMethod(
                                           current, env->GetMethodID(cls, "getName", "()Ljava/lang/String;")))));
  env->PopLocalFrame(nullptr);
  return facts;
}

bool IsAlive(JNIEnv* env, jobject thread)
{
  jclass cls = env->FindClass("java/lang/Thread");
  const bool alive = Checked(env, env->CallBooleanMethod(thread, env->GetMethodID(cls, "isAlive", "()Z"))) == JNI_TRUE;
  env->DeleteLocalRef(cls);
  env->DeleteGlobalRef(thread);
  return alive;
}

const std::u16string kAttached = u"VLXJBX-attached-";
using ThreadsTest = BridgeTest;

TEST_F(ThreadsTest, EachNativeThreadIsAttachedOnceAsANamedDaemonConvertsAndIsDetachedWhenItExits)
{
  const int kThreads = 8;
  std::vector<JavaThread> seen(kThreads);
  std::atomic<int> sameEnv{0}, mismatches{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t)
    threads.emplace_back([&, t] {
      JNIEnv *first = nullptr, *second = nullptr;
      if (VLXJBXJNIUtilities::GetJNIEnv(first, VLXListValVLXUnicodeString()) == VLX_S_OK &&
          VLXJBXJNIUtilities::GetJNIEnv(second, VLXListValVLXUnicodeString()) == VLX_S_OK && first == second &&
          first != nullptr) {
        ++sameEnv;
        seen[t] = Current(first);
        for (int i = 0; i < 1000; ++i) {  // conversions on many threads at once
          const std::string text = "thread " + std::to_string(t) + " \xF0\x9F\x98\x80 #" + std::to_string(i);
          jstring js = nullptr;
          VLXUnicodeString back;
          VLXJBXJNIConverter::ConvertToJavaType(first, VLXUnicodeString(text.c_str()), js);
          VLXJBXJNIConverter::BuildFromJavaType(first, js, back);
          mismatches += Str(back) != text;
          first->DeleteLocalRef(js);
        }
      }
    });
  for (std::thread& t : threads) t.join();
  EXPECT_EQ(sameEnv, kThreads);
  EXPECT_EQ(mismatches, 0);
  for (JavaThread& j : seen) {
    ASSERT_NE(j.thread, nullptr);
    EXPECT_TRUE(j.daemon);
    EXPECT_EQ(j.name.rfind(kAttached, 0), 0u);
    EXPECT_FALSE(IsAlive(env, j.thread)) << "the attached thread was detached at its exit";
  }
}

// Threads the application attaches and detaches itself. The exit hook of the first (a pthread key
// made after the bridge's, so it runs after it) records whether it is still attached at exit.
std::atomic<int> g_stillAttachedAtExit{-1};
pthread_key_t g_ownerKey;
void OwnerDetach(void* vm)
{
  void* env = nullptr;
  g_stillAttachedAtExit = static_cast<JavaVM*>(vm)->GetEnv(&env, JNI_VERSION_1_8) == JNI_OK;
  static_cast<JavaVM*>(vm)->DetachCurrentThread();
}

TEST_F(ThreadsTest, TheApplicationsAttachmentsAreUsedAsTheyAreAndItsDetachesAreNoticed)
{
  JavaVM* vm = VLXJBXJNIUtilities::GetJavaVM();
  ASSERT_NE(vm, nullptr);
  ASSERT_EQ(pthread_key_create(&g_ownerKey, &OwnerDetach), 0);
  std::atomic<int> steps{0};
  void* own = nullptr;
  JNIEnv* e = nullptr;
  auto works = [&] {  // the bridge's environment for the calling thread, used for a real call
    jstring js = nullptr;
    const bool ok = VLXJBXJNIUtilities::GetJNIEnv(e, VLXListValVLXUnicodeString()) == VLX_S_OK && e != nullptr &&
                    VLXJBXJNIConverter::ConvertToJavaType(e, VLXUnicodeString("works \xE2\x9C\x93"), js) == VLX_S_OK &&
                    e->GetStringLength(js) == 7;
    if (ok) e->DeleteLocalRef(js);
    return ok;
  };
  std::thread([&] {
    if (vm->AttachCurrentThread(&own, nullptr) != JNI_OK) return;
    pthread_setspecific(g_ownerKey, vm);
    steps += works() && e == own;  // the application's attachment, never detached by the bridge
  }).join();
  JavaThread last;
  std::thread([&] {
    if (vm->AttachCurrentThread(&own, nullptr) != JNI_OK) return;
    steps += works() && e == own;
    vm->DetachCurrentThread();
    steps += works();  // attached by the bridge
    vm->DetachCurrentThread();
    steps += works();  // attached again rather than using the stale environment
    last = Current(e);
  }).join();
  pthread_key_delete(g_ownerKey);
  EXPECT_EQ(steps, 4);
  EXPECT_EQ(g_stillAttachedAtExit, 1) << "the bridge detached a thread it did not attach";
  ASSERT_NE(last.thread, nullptr);
  EXPECT_FALSE(IsAlive(env, last.thread)) << "the bridge's own attachment ended with the thread";
}

}  // namespace
