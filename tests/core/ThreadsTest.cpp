// Threads: proxies shared between threads stay usable, each thread keeps its own last error and
// values, and the threads the application attaches or detaches work as it left them.
#include <pthread.h>

#include <atomic>
#include <thread>

#include "TestSupport.h"

using namespace corvexa_test;

namespace {

// Eight threads at once read a shared replica and an instance of a shared model, write values to an
// instance of their own and read them back, and (the odd ones) fail on purpose: no thread sees
// another's values or last error, and every reference is given back.
TEST(Threads, SharedProxiesOwnValuesAndLastErrorsStayApartAcrossThreads)
{
  SampleReplica shared("shared");
  VLXKDMInstance target = shared.Create();
  ASSERT_EQ(VLX_S_OK, target.SetValue(0, 7));
  const long baseline = GlobalRefCount();
  std::atomic<int> failures{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 8; ++t) {
    threads.emplace_back([&, t] {
      VLXKDMInstance own = shared.Create();
      for (int i = 0; i < 1000; ++i) {
        VLXKDMReplica copy(shared.replica), unbuilt;
        VLXUnicodeString name;
        VLXKDMInstanceValue value, list, link;
        const std::string text = std::to_string(t) + "-" + std::to_string(i);
        list.SetListOfInteger(ListOf<VLXRawCollint>({t, i}));
        failures += copy.GetName(name) != VLX_S_OK || Text(name) != "shared";
        failures += target.GetValue(0, value) != VLX_S_OK || value.GetInteger() != 7;
        failures += own.SetValue(2, U(text)) != VLX_S_OK || own.SetValue(7, list) != VLX_S_OK ||
                    own.SetValue(6, target) != VLX_S_OK || own.GetValue(2, value) != VLX_S_OK ||
                    Text(value.GetString()) != text || own.GetValue(7, list) != VLX_S_OK ||
                    !(list.GetListOfInteger() == ListOf<VLXRawCollint>({t, i})) || own.GetValue(6, link) != VLX_S_OK ||
                    !(link.GetInstance() == target);
        if (t % 2 == 1)
          failures += unbuilt.Commit() != VLX_E_FAIL || PeekLastError().id != "VLXJBXInfraERR_1003";
        else
          failures += PeekLastError().present;
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(0, failures.load());
  EXPECT_EQ(baseline, GlobalRefCount());
}

// An application may detach a thread that the library attached, or attach a thread itself: the next
// call on a detached thread works, and the library never detaches an attachment that is not its own,
// during a call or when the thread ends (the application's exit hook, a pthread key made after the
// library's, runs after the library's and must find the thread still attached).
std::atomic<int> g_attachedAtExit{-1};
void DetachAtExit(void* vm)
{
  void* env = nullptr;
  g_attachedAtExit = static_cast<JavaVM*>(vm)->GetEnv(&env, JNI_VERSION_1_8) == JNI_OK;
  static_cast<JavaVM*>(vm)->DetachCurrentThread();
}

TEST(Threads, AThreadTheApplicationDetachedWorksOnItsNextCall)
{
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build(U("detached")));
  JavaVM* vm = VLXJBXJNIUtilities::GetJavaVM();
  ASSERT_NE(nullptr, vm);
  pthread_key_t key;
  ASSERT_EQ(0, pthread_key_create(&key, &DetachAtExit));
  std::thread([&] {
    VLXUnicodeString name;
    void* own = nullptr;
    ASSERT_EQ(VLX_S_OK, replica.GetName(name));
    ASSERT_EQ(JNI_OK, vm->DetachCurrentThread());
    ASSERT_EQ(VLX_S_OK, replica.GetName(name));  // attached again by the library
    ASSERT_EQ(JNI_OK, vm->DetachCurrentThread());
    ASSERT_EQ(JNI_OK, vm->AttachCurrentThread(&own, nullptr));  // now the application's, perhaps at the same address
    pthread_setspecific(key, vm);
    ASSERT_EQ(VLX_S_OK, replica.GetName(name));
  }).join();
  EXPECT_EQ(1, g_attachedAtExit.exchange(-1)) << "the library detached the application's attachment";
  std::thread([&] {
    VLXUnicodeString name;
    void *own = nullptr, *still = nullptr;
    ASSERT_EQ(JNI_OK, vm->AttachCurrentThread(&own, nullptr));
    pthread_setspecific(key, vm);
    ASSERT_EQ(VLX_S_OK, replica.GetName(name));  // the application's attachment, used as it is
    EXPECT_EQ("detached", Text(name));
    EXPECT_EQ(JNI_OK, vm->GetEnv(&still, JNI_VERSION_1_8));
    EXPECT_EQ(own, still);
  }).join();
  pthread_key_delete(key);
  EXPECT_EQ(1, g_attachedAtExit) << "the library detached a thread it did not attach";
}

}  // namespace
