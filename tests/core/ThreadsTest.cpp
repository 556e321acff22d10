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

// The value that writer w gives to instance j of its own model.
struct Expected {
  int integer;
  std::string text;
  VLXRawCollint list;
};
Expected ExpectedFor(int w, int j)
{
  Expected e{w * 100000 + j, "w" + std::to_string(w) + "-" + std::to_string(j), VLXRawCollint()};
  for (int k = 0; k < j % 5; ++k) e.list.Append(w + j + k);
  return e;
}

TEST(ValueThreads, WritersOnTheirOwnModelsAndReadersOfASharedOneKeepEveryValue)
{
  const int kWriters = 8, kReaders = 8, kInstances = 200, kRounds = 20;
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString("threads")));
  std::vector<VLXKDMModel> models(kWriters + 1);
  for (int m = 0; m <= kWriters; ++m) {
    const std::string name = m == kWriters ? "Shared" : "Own" + std::to_string(m);
    AddClass(replica, name.c_str(), SampleAttributes(), models[static_cast<size_t>(m)]);
  }
  // The shared model: instance j holds the integer j, the text "s<j>" and j seconds.
  std::vector<VLXKDMInstance> shared(kInstances);
  for (int j = 0; j < kInstances; ++j) {
    VLXKDMInstance& in = shared[static_cast<size_t>(j)];
    ASSERT_EQ(VLX_S_OK, models[kWriters].CreateInstance(in));
    ASSERT_EQ(VLX_S_OK, in.SetValue(0, j));
    ASSERT_EQ(VLX_S_OK, in.SetValue(VLXUnicodeString("string"), VLXUnicodeString(("s" + std::to_string(j)).c_str())));
    ASSERT_EQ(VLX_S_OK, in.SetValue(3, Seconds(j)));
  }
  const long globals = VLXJBXJNIUtilities::GetGlobalRefCount();

  std::atomic<int> failures{0};
  std::atomic<int> reads{0};
  std::vector<std::thread> threads;
  for (int w = 0; w < kWriters; ++w) {
    threads.emplace_back([&, w] {
      VLXKDMModel& model = models[static_cast<size_t>(w)];
      std::vector<VLXKDMInstance> own(kInstances);
      for (int j = 0; j < kInstances; ++j)
        if (model.CreateInstance(own[static_cast<size_t>(j)]) != VLX_S_OK) ++failures;
      // Several rounds overwrite each value; the last round's values are the expected ones.
      for (int round = 0; round < kRounds; ++round) {
        for (int j = 0; j < kInstances; ++j) {
          VLXKDMInstance& in = own[static_cast<size_t>(j)];
          const Expected e = ExpectedFor(w, round == kRounds - 1 ? j : j + 1000);
          VLXKDMInstanceValue holder;
          holder.SetListOfInteger(e.list);
          if (in.SetValue(VLXUnicodeString("integer"), e.integer) != VLX_S_OK) ++failures;
          if (in.SetValue(2, VLXUnicodeString(e.text.c_str())) != VLX_S_OK) ++failures;
          if (in.SetValue(7, holder) != VLX_S_OK) ++failures;
          if (in.SetValue(6, shared[static_cast<size_t>(j)]) != VLX_S_OK) ++failures;
        }
      }
    });
  }
  for (int r = 0; r < kReaders; ++r) {
    threads.emplace_back([&, r] {
      VLXKDMInstanceValue value;
      for (int round = 0; round < kRounds * 2; ++round) {
        for (int j = 0; j < kInstances; ++j) {
          VLXKDMInstance in(shared[static_cast<size_t>((j + r * 17) % kInstances)]);
          const int expected = (j + r * 17) % kInstances;
          if (in.GetValue(0, value) != VLX_S_OK || value.GetInteger() != expected) ++failures;
          if (in.GetValue(VLXUnicodeString("string"), value) != VLX_S_OK ||
              value.GetString() != VLXUnicodeString(("s" + std::to_string(expected)).c_str()))
            ++failures;
          if (in.GetValue(3, value) != VLX_S_OK || value.GetDate().Gettime_t() != expected) ++failures;
          ++reads;
        }
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(0, failures.load());
  EXPECT_EQ(kReaders * kRounds * 2 * kInstances, reads.load());

  // Every writer's model holds exactly its own last values, read here on the main thread.
  for (int w = 0; w < kWriters; ++w) {
    SCOPED_TRACE("writer " + std::to_string(w));
    VLXKDMInstanceSet set;
    ASSERT_EQ(VLX_S_OK, models[static_cast<size_t>(w)].GetInstances(set));
    int count = -1;
    ASSERT_EQ(VLX_S_OK, set.GetCount(count));
    ASSERT_EQ(kInstances, count);
    std::vector<bool> seen(kInstances, false);
    for (int p = 0; p < count; ++p) {
      VLXKDMInstance in;
      ASSERT_EQ(VLX_S_OK, set.GetItem(p, in));
      VLXKDMInstanceValue integer, text, list, link;
      ASSERT_EQ(VLX_S_OK, in.GetValue(0, integer));
      const int j = integer.GetInteger() - w * 100000;
      ASSERT_TRUE(j >= 0 && j < kInstances) << integer.GetInteger();
      EXPECT_FALSE(seen[static_cast<size_t>(j)]);
      seen[static_cast<size_t>(j)] = true;
      const Expected e = ExpectedFor(w, j);
      ASSERT_EQ(VLX_S_OK, in.GetValue(2, text));
      EXPECT_EQ(e.text, Text(text.GetString()));
      ASSERT_EQ(VLX_S_OK, in.GetValue(VLXUnicodeString("integers"), list));
      EXPECT_TRUE(list.GetListOfInteger() == e.list);
      ASSERT_EQ(VLX_S_OK, in.GetValue(6, link));
      EXPECT_TRUE(link.GetInstance() == shared[static_cast<size_t>(j)]);
    }
  }
  // The shared model is as it was filled.
  for (int j = 0; j < kInstances; ++j) {
    VLXKDMInstanceValue value;
    ASSERT_EQ(VLX_S_OK, shared[static_cast<size_t>(j)].GetValue(0, value));
    EXPECT_EQ(j, value.GetInteger());
  }
  EXPECT_EQ(globals, VLXJBXJNIUtilities::GetGlobalRefCount());
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
