// Threads: attach once per thread, detach at thread exit, and leave alone the threads that
// someone else attached.
#include "BridgeSupport.h"
#include "VLXJBXJNIConverter.h"

#include <pthread.h>

#include <atomic>
#include <condition_variable>
#include <mutex>
#include <thread>

namespace
{

// The names of the live Java threads that start with `prefix`.
int CountJavaThreads(JNIEnv* env, const std::u16string& prefix)
{
  if (env->PushLocalFrame(16) != JNI_OK)
    return -1;
  int count = -1;
  jclass threadClass = env->FindClass("java/lang/Thread");
  jclass mapClass = env->FindClass("java/util/Map");
  jclass setClass = env->FindClass("java/util/Set");
  jmethodID getAll = env->GetStaticMethodID(threadClass, "getAllStackTraces", "()Ljava/util/Map;");
  jmethodID keySet = env->GetMethodID(mapClass, "keySet", "()Ljava/util/Set;");
  jmethodID toArray = env->GetMethodID(setClass, "toArray", "()[Ljava/lang/Object;");
  jmethodID getName = env->GetMethodID(threadClass, "getName", "()Ljava/lang/String;");
  jobject map = env->CallStaticObjectMethod(threadClass, getAll);
  if (!env->ExceptionCheck()) {
    jobject keys = env->CallObjectMethod(map, keySet);
    if (!env->ExceptionCheck()) {
      jobjectArray threads = static_cast<jobjectArray>(env->CallObjectMethod(keys, toArray));
      if (!env->ExceptionCheck()) {
        count = 0;
        const jsize n = env->GetArrayLength(threads);
        for (jsize i = 0; i < n; ++i) {
          jobject thread = env->GetObjectArrayElement(threads, i);
          jstring name = static_cast<jstring>(env->CallObjectMethod(thread, getName));
          if (env->ExceptionCheck()) {
            env->ExceptionClear();
          } else if (Units(env, name).rfind(prefix, 0) == 0) {
            ++count;
          }
          env->DeleteLocalRef(name);
          env->DeleteLocalRef(thread);
        }
      }
    }
  }
  if (env->ExceptionCheck())
    env->ExceptionClear();
  env->PopLocalFrame(nullptr);
  return count;
}

const std::u16string kAttached = u"VLXJBX-attached-";

// Facts about the calling thread as Java sees it.
struct JavaThreadFacts
{
  bool daemon = false;
  std::u16string name;
};

JavaThreadFacts CurrentJavaThread(JNIEnv* env)
{
  JavaThreadFacts facts;
  env->PushLocalFrame(8);
  jclass threadClass = env->FindClass("java/lang/Thread");
  jmethodID currentThread = env->GetStaticMethodID(threadClass, "currentThread", "()Ljava/lang/Thread;");
  jmethodID isDaemon = env->GetMethodID(threadClass, "isDaemon", "()Z");
  jmethodID getName = env->GetMethodID(threadClass, "getName", "()Ljava/lang/String;");
  jobject current = env->CallStaticObjectMethod(threadClass, currentThread);
  if (!env->ExceptionCheck()) {
    facts.daemon = env->CallBooleanMethod(current, isDaemon) == JNI_TRUE;
    if (!env->ExceptionCheck()) {
      jstring name = static_cast<jstring>(env->CallObjectMethod(current, getName));
      if (!env->ExceptionCheck())
        facts.name = Units(env, name);
    }
  }
  if (env->ExceptionCheck())
    env->ExceptionClear();
  env->PopLocalFrame(nullptr);
  return facts;
}

class Gate
{
public:
  void Arrive()
  {
    std::unique_lock<std::mutex> lock(_m);
    ++_arrived;
    _cv.notify_all();
  }
  void WaitFor(int n)
  {
    std::unique_lock<std::mutex> lock(_m);
    _cv.wait(lock, [&] { return _arrived >= n; });
  }
  void Open()
  {
    std::unique_lock<std::mutex> lock(_m);
    _open = true;
    _cv.notify_all();
  }
  void WaitOpen()
  {
    std::unique_lock<std::mutex> lock(_m);
    _cv.wait(lock, [&] { return _open; });
  }

private:
  std::mutex _m;
  std::condition_variable _cv;
  int _arrived = 0;
  bool _open = false;
};

using ThreadsTest = BridgeTest;

TEST_F(ThreadsTest, EachNativeThreadIsAttachedOnceAsADaemonAndDetachedWhenItExits)
{
  const int baseline = CountJavaThreads(env, kAttached);
  ASSERT_GE(baseline, 0);
  const int kThreads = 12;
  Gate gate;
  std::atomic<int> sameEnv{0}, daemons{0}, named{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t)
    threads.emplace_back([&] {
      JNIEnv* first = nullptr;
      JNIEnv* second = nullptr;
      if (VLXJBXJNIUtilities::GetJNIEnv(first, VLXListValVLXUnicodeString()) == VLX_S_OK &&
          VLXJBXJNIUtilities::GetJNIEnv(second, VLXListValVLXUnicodeString()) == VLX_S_OK && first == second &&
          first != nullptr) {
        ++sameEnv;
        const JavaThreadFacts facts = CurrentJavaThread(first);
        daemons += facts.daemon;
        named += facts.name.rfind(kAttached, 0) == 0;
      }
      gate.Arrive();
      gate.WaitOpen();
    });
  gate.WaitFor(kThreads);
  EXPECT_EQ(CountJavaThreads(env, kAttached), baseline + kThreads) << "attached once each";
  gate.Open();
  for (std::thread& t : threads)
    t.join();
  EXPECT_EQ(sameEnv, kThreads);
  EXPECT_EQ(daemons, kThreads);
  EXPECT_EQ(named, kThreads);
  EXPECT_EQ(CountJavaThreads(env, kAttached), baseline) << "every attached thread was detached at its exit";
}

// A thread attached by someone else: its own exit hook (a pthread key made after the bridge's,
// so it runs after it) finds it still attached, then detaches it.
std::atomic<int> g_stillAttachedAtExit{-1};
pthread_key_t g_ownerKey;

void OwnerDetach(void* vm)
{
  JavaVM* jvm = static_cast<JavaVM*>(vm);
  void* env = nullptr;
  g_stillAttachedAtExit = jvm->GetEnv(&env, JNI_VERSION_1_8) == JNI_OK ? 1 : 0;
  jvm->DetachCurrentThread();
}

TEST_F(ThreadsTest, AThreadAttachedBySomeoneElseIsNeverDetachedByTheBridge)
{
  JavaVM* vm = VLXJBXJNIUtilities::GetJavaVM();
  ASSERT_NE(vm, nullptr);
  ASSERT_EQ(pthread_key_create(&g_ownerKey, &OwnerDetach), 0);
  const std::u16string foreign = u"foreign-owner";
  std::atomic<int> sameEnv{0};
  std::thread t([&] {
    JavaVMAttachArgs args{JNI_VERSION_1_8, const_cast<char*>("foreign-owner"), nullptr};
    void* own = nullptr;
    if (vm->AttachCurrentThread(&own, &args) != JNI_OK)
      return;
    pthread_setspecific(g_ownerKey, vm);
    JNIEnv* bridged = nullptr;
    if (VLXJBXJNIUtilities::GetJNIEnv(bridged, VLXListValVLXUnicodeString()) == VLX_S_OK && bridged == own)
      ++sameEnv;
  });
  t.join();
  pthread_key_delete(g_ownerKey);
  EXPECT_EQ(sameEnv, 1) << "the bridge used the existing attachment";
  EXPECT_EQ(g_stillAttachedAtExit, 1) << "the bridge detached a thread it did not attach";
  EXPECT_EQ(CountJavaThreads(env, foreign), 0);
}

TEST_F(ThreadsTest, AThreadItsOwnerDetachedIsAttachedAgainByTheBridge)
{
  JavaVM* vm = VLXJBXJNIUtilities::GetJavaVM();
  const int baseline = CountJavaThreads(env, kAttached);
  std::atomic<int> ok{0};
  std::thread t([&] {
    void* own = nullptr;
    if (vm->AttachCurrentThread(&own, nullptr) != JNI_OK)
      return;
    JNIEnv* first = nullptr;
    VLXJBXJNIUtilities::GetJNIEnv(first, VLXListValVLXUnicodeString());
    vm->DetachCurrentThread(); // the owner lets go; the bridge must not keep the stale environment
    JNIEnv* second = nullptr;
    if (VLXJBXJNIUtilities::GetJNIEnv(second, VLXListValVLXUnicodeString()) != VLX_S_OK || second == nullptr)
      return;
    // A real call through the new environment.
    VLXUnicodeString text("still works \xE2\x9C\x93");
    jstring js = nullptr;
    if (VLXJBXJNIConverter::ConvertToJavaType(second, text, js) == VLX_S_OK && second->GetStringLength(js) == 13)
      ++ok;
    second->DeleteLocalRef(js);
    ok += CurrentJavaThread(second).name.rfind(kAttached, 0) == 0;
  });
  t.join();
  EXPECT_EQ(ok, 2);
  EXPECT_EQ(CountJavaThreads(env, kAttached), baseline) << "the bridge's own attachment ended with the thread";
}

TEST_F(ThreadsTest, ConversionsRunConcurrentlyOnManyThreads)
{
  std::atomic<int> failures{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 8; ++t)
    threads.emplace_back([&failures, t] {
      JNIEnv* e = ThreadEnv();
      if (e == nullptr) {
        ++failures;
        return;
      }
      for (int i = 0; i < 2000; ++i) {
        const std::string s = "thread " + std::to_string(t) + " \xF0\x9F\x98\x80 #" + std::to_string(i);
        jstring js = nullptr;
        VLXUnicodeString back;
        if (VLXJBXJNIConverter::ConvertToJavaType(e, VLXUnicodeString(s.c_str()), js) != VLX_S_OK ||
            VLXJBXJNIConverter::BuildFromJavaType(e, js, back) != VLX_S_OK || Str(back) != s)
          ++failures;
        e->DeleteLocalRef(js);
      }
    });
  for (std::thread& t : threads)
    t.join();
  EXPECT_EQ(failures, 0);
}

} // namespace
