// Attribute values over long runs and across threads: a million typed SetValue / GetValue calls on
// one natively attached thread leave the bridge's global references and the thread's local
// references where they started; writers and readers on many threads keep every value intact.
#include <atomic>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "DataFixture.h"
#include "LocalRefCount.h"
#include "VLXKDMInstanceValue.h"
#include "VLXListValVLXKDMInstance.h"

using namespace corvexa_test;

namespace {

VLXTime Time(time_t seconds)
{
  VLXTime t;
  t.Settime_t(seconds);
  return t;
}

TEST(ValueLeaks, TheLocalReferenceCountSeesALeak)
{
  JNIEnv* env = Env();
  const long before = LocalRefCount();
  ASSERT_GE(before, 0);
  jobject leaked[3];
  for (jobject& ref : leaked) ref = env->NewStringUTF("leak");
  EXPECT_EQ(before + 3, LocalRefCount());
  for (jobject ref : leaked) env->DeleteLocalRef(ref);
  EXPECT_EQ(before, LocalRefCount());
}

// One round of typed writes and reads: the attribute at position k of the class Sample, written by
// name or by position, then read back into a holder and compared.
bool WriteAndRead(VLXKDMInstance& instance, const VLXKDMInstance& target, const std::vector<VLXUnicodeString>& names,
                  int i, VLXKDMInstanceValue& read)
{
  const int k = i % 9;
  const bool byName = (i / 9) % 2 == 0;
  long written = VLX_E_FAIL;
  auto set = [&](int position, const auto& value) {
    written = byName ? instance.SetValue(names[static_cast<size_t>(position)], value) : instance.SetValue(position, value);
  };
  VLXRawCollint ints;
  VLXListValVLXKDMInstance targets;
  switch (k) {
    case 0: set(0, i); break;
    case 1: set(1, i / 2.0); break;
    case 2: set(2, VLXUnicodeString(std::to_string(i).c_str())); break;
    case 3: set(3, Time(i)); break;
    case 4: set(4, static_cast<VLXBoolean>(i & 1)); break;
    case 5: set(5, VLXBinary(&i, sizeof i)); break;
    case 6: set(6, target); break;
    case 7:
      ints.Append(i);
      ints.Append(-i);
      set(7, ints);
      break;
    case 8:
      targets.Append(target);
      set(13, targets);
      break;
  }
  if (written != VLX_S_OK) return false;
  const int position = k == 8 ? 13 : k;
  const long got = byName ? instance.GetValue(names[static_cast<size_t>(position)], read) : instance.GetValue(position, read);
  if (got != VLX_S_OK) return false;
  switch (k) {
    case 0: return read.GetInteger() == i;
    case 1: return read.GetDouble() == i / 2.0;
    case 2: return read.GetString() == VLXUnicodeString(std::to_string(i).c_str());
    case 3: return read.GetDate().Gettime_t() == i;
    case 4: return read.GetBoolean() == (i & 1);
    case 5: return read.GetBinary() == VLXBinary(&i, sizeof i);
    case 6: return read.GetInstance() == target;
    case 7: return read.GetListOfInteger() == ints;
    case 8: return read.GetListOfInstance() == targets;
  }
  return false;
}

TEST(ValueLeaks, AMillionTypedSetAndGetCallsLeaveNoReferences)
{
  SampleReplica s;
  VLXKDMInstance instance = s.Create(), target = s.Create();
  std::vector<VLXUnicodeString> names;
  for (const AttributeShape& a : SampleAttributes()) names.emplace_back(a.name);
  VLXKDMInstanceValue read;
  // A first pass over every kind makes what stays: the holder keeps its last Java object, and the
  // instance and the instance list it last read (reading another type leaves those members alone).
  for (int i = 0; i < 9; ++i) ASSERT_TRUE(WriteAndRead(instance, target, names, i, read)) << i;

  const long globals = VLXJBXJNIUtilities::GetGlobalRefCount();
  const long locals = LocalRefCount();
  ASSERT_GE(locals, 0);
  // Each round is one typed SetValue and one GetValue: a million calls of each.
  const int rounds = 1000000;
  int wrong = 0;
  for (int i = 9; i < 9 + rounds; ++i)
    if (!WriteAndRead(instance, target, names, i, read) && ++wrong < 5) ADD_FAILURE() << "round " << i;
  EXPECT_EQ(0, wrong);
  EXPECT_EQ(globals, VLXJBXJNIUtilities::GetGlobalRefCount());
  EXPECT_EQ(locals, LocalRefCount());

  // Failing calls leave nothing either: an unknown name, a value of the wrong type, an unbuilt
  // instance, a holder without type.
  FatalRecorder fatal;
  VLXKDMInstance unbuilt;
  VLXKDMInstanceValue untyped;
  for (int i = 0; i < 20000; ++i) {
    ASSERT_LT(instance.SetValue(VLXUnicodeString("absent"), i), 0);
    ASSERT_LT(instance.SetValue(2, i), 0);
    ASSERT_LT(instance.GetValue(VLXUnicodeString("absent"), read), 0);
    ASSERT_LT(unbuilt.SetValue(0, i), 0);
    ASSERT_LT(instance.SetValue(0, untyped), 0);
    FatalRecorder::Reports().clear();
  }
  EXPECT_EQ(globals, VLXJBXJNIUtilities::GetGlobalRefCount());
  EXPECT_EQ(locals, LocalRefCount());
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
    ASSERT_EQ(VLX_S_OK, in.SetValue(3, Time(j)));
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
