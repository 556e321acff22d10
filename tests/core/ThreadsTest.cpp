// Threads: proxies shared between threads stay usable, each thread keeps its own last error, values
// written by many threads at once stay intact, and a thread the application detached works again.
#include <atomic>
#include <thread>

#include "TestSupport.h"

using namespace corvexa_test;

namespace {

TEST(Threads, EachThreadHasItsOwnLastErrorAndSharedProxiesStayUsable)
{
  VLXKDMReplica shared;
  ASSERT_EQ(VLX_S_OK, shared.Build(U("shared")));
  const long baseline = GlobalRefCount();
  std::atomic<int> failures{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 8; ++t) {
    threads.emplace_back([&, t] {
      VLXKDMReplica own;
      const std::string ownName = "own-" + std::to_string(t);
      failures += own.Build(U(ownName)) != VLX_S_OK;
      for (int i = 0; i < 2000; ++i) {
        VLXKDMReplica copy(shared), unbuilt;
        VLXUnicodeString name;
        failures += copy.GetName(name) != VLX_S_OK || Text(name) != "shared";
        failures += own.GetName(name) != VLX_S_OK || Text(name) != ownName;
        // Odd threads fail on purpose; their errors must not reach the even ones.
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

// Writers on their own models and readers of a shared one, all at once: every value read is the
// one written, every writer's last values are there afterwards, and the references are given back.
TEST(Threads, WritersOnTheirOwnModelsAndReadersOfASharedOneKeepEveryValue)
{
  const int kWriters = 8, kReaders = 8, kInstances = 200, kRounds = 20;
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build(U("threads")));
  std::vector<VLXKDMModel> models(kWriters + 1);
  for (int m = 0; m <= kWriters; ++m)
    AddClass(replica, ("Model" + std::to_string(m)).c_str(), SampleAttributes(), models[m]);
  // The shared model (the last): instance j holds the integer j and j seconds.
  std::vector<std::vector<VLXKDMInstance>> instances(kWriters + 1, std::vector<VLXKDMInstance>(kInstances));
  std::vector<VLXKDMInstance>& shared = instances[kWriters];
  for (int j = 0; j < kInstances; ++j) {
    ASSERT_EQ(VLX_S_OK, models[kWriters].CreateInstance(shared[j]));
    ASSERT_EQ(VLX_S_OK, shared[j].SetValue(0, j));
    ASSERT_EQ(VLX_S_OK, shared[j].SetValue(3, Seconds(j)));
  }
  auto text = [](int w, int j, int r) {
    return "w" + std::to_string(w) + "-" + std::to_string(j) + "-" + std::to_string(r);
  };
  const long globals = GlobalRefCount();
  std::atomic<int> failures{0};
  std::vector<std::thread> threads;
  for (int w = 0; w < kWriters; ++w) {
    threads.emplace_back([&, w] {
      for (VLXKDMInstance& in : instances[w]) failures += models[w].CreateInstance(in) != VLX_S_OK;
      for (int r = 0; r < kRounds; ++r) {
        for (int j = 0; j < kInstances; ++j) {
          VLXKDMInstance& in = instances[w][j];
          VLXKDMInstanceValue holder;
          holder.SetListOfInteger(ListOf<VLXRawCollint>({w, j, r}));
          failures += in.SetValue(U("integer"), w * 100000 + j) != VLX_S_OK ||
                      in.SetValue(2, U(text(w, j, r))) != VLX_S_OK || in.SetValue(7, holder) != VLX_S_OK ||
                      in.SetValue(6, shared[j]) != VLX_S_OK;
        }
      }
    });
  }
  for (int r = 0; r < kReaders; ++r) {
    threads.emplace_back([&, r] {
      VLXKDMInstanceValue value;
      for (int i = 0; i < kRounds * 2 * kInstances; ++i) {
        const int j = (i + r * 17) % kInstances;
        VLXKDMInstance in(shared[j]);
        failures += in.GetValue(U("integer"), value) != VLX_S_OK || value.GetInteger() != j;
        failures += in.GetValue(3, value) != VLX_S_OK || value.GetDate().Gettime_t() != j;
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(0, failures.load());
  for (int w = 0; w < kWriters; ++w) {
    for (int j = 0; j < kInstances; ++j) {
      VLXKDMInstanceValue integer, last, list, link;
      ASSERT_EQ(VLX_S_OK, instances[w][j].GetValue(0, integer));
      ASSERT_EQ(VLX_S_OK, instances[w][j].GetValue(U("string"), last));
      ASSERT_EQ(VLX_S_OK, instances[w][j].GetValue(7, list));
      ASSERT_EQ(VLX_S_OK, instances[w][j].GetValue(6, link));
      EXPECT_EQ(w * 100000 + j, integer.GetInteger());
      EXPECT_EQ(text(w, j, kRounds - 1), Text(last.GetString()));
      EXPECT_TRUE(list.GetListOfInteger() == ListOf<VLXRawCollint>({w, j, kRounds - 1}));
      EXPECT_TRUE(link.GetInstance() == shared[j]);
    }
  }
  instances.clear();
  models.clear();
  EXPECT_EQ(globals - (kInstances + kWriters + 1), GlobalRefCount());
}

// An application may detach a thread that the library attached, or detach it and attach it again
// itself: the next call on that thread works, and the library never detaches an attachment that is
// not its own.
TEST(Threads, AThreadTheApplicationDetachedWorksOnItsNextCall)
{
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build(U("detached")));
  JavaVM* vm = VLXJBXJNIUtilities::GetJavaVM();
  ASSERT_NE(nullptr, vm);
  std::thread([&] {
    VLXUnicodeString name;
    ASSERT_EQ(VLX_S_OK, replica.GetName(name));
    ASSERT_EQ(JNI_OK, vm->DetachCurrentThread());
    ASSERT_EQ(VLX_S_OK, replica.GetName(name));  // attached again by the library
    ASSERT_EQ(JNI_OK, vm->DetachCurrentThread());
    void *own = nullptr, *still = nullptr;
    ASSERT_EQ(JNI_OK, vm->AttachCurrentThread(&own, nullptr));
    ASSERT_EQ(VLX_S_OK, replica.GetName(name));  // the application's attachment, used as it is
    EXPECT_EQ("detached", Text(name));
    EXPECT_EQ(JNI_OK, vm->GetEnv(&still, JNI_VERSION_1_8));
    EXPECT_EQ(own, still);
    ASSERT_EQ(JNI_OK, vm->DetachCurrentThread());
  }).join();
}

}  // namespace
