// Long runs leave no references behind; threads share proxies but not their last errors.
#include <atomic>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "JavaTestSupport.h"
#include "VLXKDMReplica.h"

using namespace corvexa_test;

namespace {

// Run with the JVM's JNI checks on: a local reference left behind by any operation on this
// natively attached thread makes the JVM complain, which fails the test process.
TEST(Leaks, ManyOperationsOnOneNativeThreadLeaveNoReferences)
{
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString("leaks")));
  const long baseline = VLXJBXJNIUtilities::GetGlobalRefCount();
  VLXUnicodeString name;
  VLXKDMModelSet models;
  VLXKDMClassDef classDef;
  VLXKDMReplica unbuilt;
  for (int i = 0; i < 20000; ++i) {
    ASSERT_EQ(VLX_S_OK, replica.SetName(VLXUnicodeString("leaks")));
    ASSERT_EQ(VLX_S_OK, replica.GetName(name));
    ASSERT_EQ(VLX_S_OK, replica.GetModels(models));
    ASSERT_EQ(VLX_S_OK, replica.GetClassDef(VLXUnicodeString("Absent"), classDef));
    ASSERT_EQ(VLX_E_FAIL, unbuilt.GetName(name));
    ASSERT_LT(replica.SetName(VLXUnicodeString("\xC3")), 0);
  }
  models = VLXKDMModelSet();
  EXPECT_EQ(baseline, VLXJBXJNIUtilities::GetGlobalRefCount());
  EXPECT_EQ("leaks", Text(name));
}

TEST(Threads, EachThreadHasItsOwnLastErrorAndSharedProxiesStayUsable)
{
  VLXKDMReplica shared;
  ASSERT_EQ(VLX_S_OK, shared.Build(VLXUnicodeString("shared")));
  const long baseline = VLXJBXJNIUtilities::GetGlobalRefCount();
  std::atomic<int> failures{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 8; ++t) {
    threads.emplace_back([&, t] {
      VLXKDMReplica own;
      const std::string ownName = "own-" + std::to_string(t);
      if (own.Build(VLXUnicodeString(ownName.c_str())) != VLX_S_OK) ++failures;
      for (int i = 0; i < 2000; ++i) {
        VLXKDMReplica copy(shared);
        VLXUnicodeString name;
        if (copy.GetName(name) != VLX_S_OK || Text(name) != "shared") ++failures;
        if (own.GetName(name) != VLX_S_OK || Text(name) != ownName) ++failures;
        // Odd threads fail on purpose; their errors must not reach the even ones.
        if (t % 2 == 1) {
          VLXKDMReplica unbuilt;
          if (unbuilt.Commit() != VLX_E_FAIL) ++failures;
          if (PeekLastError().id != "VLXJBXInfraERR_1003") ++failures;
        } else if (PeekLastError().present) {
          ++failures;
        }
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(0, failures.load());
  EXPECT_EQ(baseline, VLXJBXJNIUtilities::GetGlobalRefCount());
}

}  // namespace

// An application may detach a thread that the library attached, or detach it and attach it again
// itself: the next call on that thread works, and the library never detaches an attachment that is
// not its own.
TEST(Threads, AThreadTheApplicationDetachedWorksOnItsNextCall)
{
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString("detached")));
  JavaVM* vm = VLXJBXJNIUtilities::GetJavaVM();
  ASSERT_NE(nullptr, vm);
  std::thread([&] {
    VLXUnicodeString name;
    ASSERT_EQ(VLX_S_OK, replica.GetName(name));
    ASSERT_EQ(JNI_OK, vm->DetachCurrentThread());
    ASSERT_EQ(VLX_S_OK, replica.GetName(name));  // attached again by the library
    ASSERT_EQ(JNI_OK, vm->DetachCurrentThread());
    void* own = nullptr;
    ASSERT_EQ(JNI_OK, vm->AttachCurrentThread(&own, nullptr));
    ASSERT_EQ(VLX_S_OK, replica.GetName(name));  // the application's attachment, used as it is
    EXPECT_EQ("detached", Text(name));
    void* still = nullptr;
    EXPECT_EQ(JNI_OK, vm->GetEnv(&still, JNI_VERSION_1_8));
    EXPECT_EQ(own, still);
    ASSERT_EQ(JNI_OK, vm->DetachCurrentThread());
  }).join();
}
