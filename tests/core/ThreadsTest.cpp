// Threads: proxies shared between threads stay usable, each thread keeps its own last error, values
// written by many threads at once stay intact, and a thread the application detached works again.
#include <atomic>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "TestSupport.h"

using namespace corvexa_test;

namespace {

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

// Writers on their own models and readers of a shared one, all at once: every value read is the
// one written, and every writer's last values are there afterwards.
TEST(ValueThreads, WritersOnTheirOwnModelsAndReadersOfASharedOneKeepEveryValue)
{
  const int kWriters = 8, kReaders = 8, kInstances = 200, kRounds = 20;
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString("threads")));
  std::vector<VLXKDMModel> models(kWriters + 1);
  for (int m = 0; m <= kWriters; ++m)
    AddClass(replica, ("Model" + std::to_string(m)).c_str(), SampleAttributes(), models[static_cast<size_t>(m)]);
  // The shared model (the last): instance j holds the integer j and j seconds.
  std::vector<std::vector<VLXKDMInstance>> instances(kWriters + 1, std::vector<VLXKDMInstance>(kInstances));
  std::vector<VLXKDMInstance>& shared = instances[kWriters];
  for (int j = 0; j < kInstances; ++j) {
    ASSERT_EQ(VLX_S_OK, models[kWriters].CreateInstance(shared[static_cast<size_t>(j)]));
    ASSERT_EQ(VLX_S_OK, shared[static_cast<size_t>(j)].SetValue(0, j));
    ASSERT_EQ(VLX_S_OK, shared[static_cast<size_t>(j)].SetValue(3, Seconds(j)));
  }
  // What writer w leaves in its instance j in round r.
  auto text = [](int w, int j, int r) {
    return "w" + std::to_string(w) + "-" + std::to_string(j) + "-" + std::to_string(r);
  };
  const long globals = GlobalRefCount();
  std::atomic<int> failures{0};
  std::vector<std::thread> threads;
  for (int w = 0; w < kWriters; ++w) {
    threads.emplace_back([&, w] {
      std::vector<VLXKDMInstance>& own = instances[static_cast<size_t>(w)];
      for (VLXKDMInstance& in : own)
        if (models[static_cast<size_t>(w)].CreateInstance(in) != VLX_S_OK) ++failures;
      for (int r = 0; r < kRounds; ++r) {
        for (int j = 0; j < kInstances; ++j) {
          VLXKDMInstance& in = own[static_cast<size_t>(j)];
          VLXKDMInstanceValue holder;
          holder.SetListOfInteger(ListOf<VLXRawCollint>({w, j, r}));
          if (in.SetValue(U("integer"), w * 100000 + j) != VLX_S_OK || in.SetValue(2, U(text(w, j, r))) != VLX_S_OK ||
              in.SetValue(7, holder) != VLX_S_OK || in.SetValue(6, shared[static_cast<size_t>(j)]) != VLX_S_OK)
            ++failures;
        }
      }
    });
  }
  for (int r = 0; r < kReaders; ++r) {
    threads.emplace_back([&, r] {
      VLXKDMInstanceValue value;
      for (int i = 0; i < kRounds * 2 * kInstances; ++i) {
        const int j = (i + r * 17) % kInstances;
        VLXKDMInstance in(shared[static_cast<size_t>(j)]);
        if (in.GetValue(U("integer"), value) != VLX_S_OK || value.GetInteger() != j) ++failures;
        if (in.GetValue(3, value) != VLX_S_OK || value.GetDate().Gettime_t() != j) ++failures;
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(0, failures.load());
  for (int w = 0; w < kWriters; ++w) {
    for (int j = 0; j < kInstances; ++j) {
      VLXKDMInstance& in = instances[static_cast<size_t>(w)][static_cast<size_t>(j)];
      VLXKDMInstanceValue integer, last, list, link;
      ASSERT_EQ(VLX_S_OK, in.GetValue(0, integer));
      ASSERT_EQ(VLX_S_OK, in.GetValue(U("string"), last));
      ASSERT_EQ(VLX_S_OK, in.GetValue(7, list));
      ASSERT_EQ(VLX_S_OK, in.GetValue(6, link));
      EXPECT_EQ(w * 100000 + j, integer.GetInteger());
      EXPECT_EQ(text(w, j, kRounds - 1), Text(last.GetString()));
      EXPECT_TRUE(list.GetListOfInteger() == ListOf<VLXRawCollint>({w, j, kRounds - 1}));
      EXPECT_TRUE(link.GetInstance() == shared[static_cast<size_t>(j)]);
    }
  }
  instances.clear();
  models.clear();
  EXPECT_EQ(globals - (kInstances + kWriters + 1), GlobalRefCount());
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
