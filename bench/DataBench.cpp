#include "DataBench.h"

#include <cstdio>
#include <memory>
#include <vector>

#include <benchmark/benchmark.h>

#include "AllocationCounter.h"
#include "BenchJava.h"
#include "VLXKDMColumns.h"
#include "VLXKDMInstance.h"
#include "VLXKDMInstanceValue.h"
#include "VLXListValVLXKDMInstance.h"
#include "VLXRawCollint.h"

namespace corvexa_bench {
namespace {

constexpr long long kBaseMillis = 1700000000000LL;

// The Java baselines' classes and methods.
struct Data {
  DataOptions options;
  JNIEnv* env = nullptr;
  jclass lookupClass = nullptr;
  jmethodID lookupFill = nullptr, lookupFind = nullptr, lookupSelect = nullptr;
  jclass bulkClass = nullptr;
  jmethodID bulkFill = nullptr, bulkRead = nullptr;
  jclass systemClass = nullptr;
  jmethodID systemGc = nullptr;
  AllocationCounts staging;  // heap allocations of staging a batch again in the same buffers
};
Data gData;

void CollectGarbage()
{
  gData.env->CallStaticVoidMethod(gData.systemClass, gData.systemGc);
  Threw(gData.env);
}

// ---- Lookups by identifier ---------------------------------------------------------------------
// One model of gData.options.lookupInstances instances with identifiers "id-0", ... (given in Java);
// the library finds one per call, Java finds kLookupsPerJavaCall per call; both take the same
// identifiers, a stride through the whole model.

constexpr int kLookupsPerJavaCall = 1000;

struct LookupModel {
  VLXKDMReplica replica;
  VLXKDMModel model;
  bool ok = false;
};

LookupModel& TheLookupModel()
{
  static LookupModel l;
  static const bool made = [] {
    Data& w = gData;
    l.ok = l.replica.Build(VLXUnicodeString("lookup")) >= 0 &&
           AddClass(l.replica, "Item", {{"group", {VLXKDMAttributeType::Integer, false}}}, l.model) &&
           w.env->CallStaticIntMethod(w.lookupClass, w.lookupFill, l.model.GetHandle(),
                                      gData.options.lookupInstances) == gData.options.lookupInstances &&
           !w.env->ExceptionCheck();
    if (w.env->ExceptionCheck()) w.env->ExceptionClear();
    return true;
  }();
  (void)made;
  return l;
}

void RunLookup(benchmark::State& state, bool library)
{
  Data& w = gData;
  LookupModel& l = TheLookupModel();
  if (!l.ok) return state.SkipWithError("the lookup model could not be made");
  const int n = gData.options.lookupInstances;
  long long k = 0;
  VLXKDMInstance x;
  char text[32];
  for (auto _ : state) {
    bool ok;
    if (library) {
      std::snprintf(text, sizeof text, "id-%d", static_cast<int>((k++ * 7919LL) % n));
      ok = l.model.FindInstance(VLXUnicodeString(text), x) >= 0 && x.GetHandle() != nullptr;
    } else {
      ok = w.env->CallStaticIntMethod(w.lookupClass, w.lookupFind, l.model.GetHandle(), n, kLookupsPerJavaCall) ==
               kLookupsPerJavaCall &&
           !w.env->ExceptionCheck();
    }
    if (!ok) return state.SkipWithError("a lookup failed");
  }
}

// The instances of group 7 (one in a thousand): the library in one call, Java by a loop.
void RunSelect(benchmark::State& state, bool library)
{
  Data& w = gData;
  LookupModel& l = TheLookupModel();
  if (!l.ok) return state.SkipWithError("the lookup model could not be made");
  const int expected = gData.options.lookupInstances / 1000;
  VLXKDMInstanceValue seven;
  seven.SetInteger(7);
  VLXListValVLXKDMInstance found;
  for (auto _ : state) {
    const bool ok =
        library ? l.model.SelectInstances(VLXUnicodeString("group"), seven, 0, found) >= 0 && found.Size() == expected
                : w.env->CallStaticIntMethod(w.lookupClass, w.lookupSelect, l.model.GetHandle(), 7) == expected &&
                      !w.env->ExceptionCheck();
    if (!ok) return state.SkipWithError("a selection failed");
  }
}

// ---- Bulk columns -------------------------------------------------------------------------------
// A class of eight attributes (int, double, text, date, boolean, binary, reference, list of ints),
// filled with the same values by a batch of columns and by Java value by value, then read back: by
// a batch into native columns, and by Java into one array per attribute.

struct BulkReplica {
  VLXKDMReplica replica;
  VLXKDMModel model, owners;
  VLXKDMInstance owner;
};

bool MakeBulkReplica(BulkReplica& b)
{
  using T = VLXKDMAttributeType;
  return b.replica.Build(VLXUnicodeString("bulk")) >= 0 &&
         AddClass(b.replica, "Owner", {{"name", {T::String, false}}}, b.owners) &&
         b.owners.CreateInstance(b.owner) >= 0 &&
         AddClass(b.replica, "Item",
                  {{"code", {T::Integer, false}},
                   {"price", {T::Double, false}},
                   {"label", {T::String, false}},
                   {"created", {T::Date, false}},
                   {"active", {T::Boolean, false}},
                   {"payload", {T::Binary, false}},
                   {"owner", {T::Relationship, false}},
                   {"counts", {T::Integer, true}}},
                  b.model);
}

// The values of BulkBaseline.fill, staged in the batch (its buffers reused); false when a setter failed.
bool StageBulk(VLXKDMColumns& batch, BulkReplica& r, int count)
{
  using T = VLXKDMAttributeType;
  static const VLXUnicodeString names[] = {"code", "price", "label", "created", "active", "payload", "owner", "counts"};
  static const T::Type types[] = {T::Integer, T::Double, T::String,       T::Date,
                                  T::Boolean, T::Binary, T::Relationship, T::Integer};
  long column = 0, failed = batch.Reset(count);
  for (int k = 0; k < 8; ++k) failed |= batch.AddColumn(names[k], types[k], k == 7, column);
  char label[32];
  unsigned char payload[8];
  VLXRawCollint counts(3);
  for (int i = 0; i < count; ++i) {
    const int length = std::snprintf(label, sizeof label, "item-%d", i);
    for (int b = 0; b < 8; ++b) payload[b] = static_cast<unsigned char>(static_cast<unsigned>(i) >> (b * 4));
    counts.RemoveAll(0);
    counts.Append(i), counts.Append(i + 1), counts.Append(i + 2);
    failed |= batch.SetInteger(0, i, i) | batch.SetDouble(1, i, i * 0.25) | batch.SetText(2, i, label, length) |
              batch.SetMilliseconds(3, i, kBaseMillis + i * 1000LL) | batch.SetBoolean(4, i, i & 1) |
              batch.SetBinary(5, i, payload, 8) | batch.SetInstance(6, i, r.owner) | batch.SetIntegers(7, i, counts);
  }
  return failed >= 0;
}

// The same values staged and created at once.
bool ColumnsFill(VLXKDMColumns& batch, BulkReplica& r, int count)
{
  VLXKDMInstanceSet set;
  int made = 0;
  return StageBulk(batch, r, count) && batch.CreateInstances(r.model) >= 0 && r.model.GetInstances(set) >= 0 &&
         set.GetCount(made) >= 0 && made == count;
}

bool JavaBulkFill(BulkReplica& r, int count)
{
  const jint made =
      gData.env->CallStaticIntMethod(gData.bulkClass, gData.bulkFill, r.model.GetHandle(), static_cast<jint>(count),
                                     static_cast<jlong>(kBaseMillis), r.owner.GetHandle());
  return !Threw(gData.env) && made == count;
}

// Both fills make the same instances.
bool BulkFillsAgree(std::string& why)
{
  std::vector<std::string> texts[2];
  for (int side = 0; side < 2; ++side) {
    BulkReplica r;
    VLXKDMColumns batch;
    if (!MakeBulkReplica(r) || !(side ? JavaBulkFill(r, 100) : ColumnsFill(batch, r, 100)) ||
        !InstanceTexts(r.model, texts[side]))
      return Fail(why, "a bulk fill failed");
  }
  for (std::size_t k = 0; k < texts[0].size(); ++k)
    if (texts[0][k] != texts[1][k])
      return Fail(
          why, "the bulk fills differ at instance " + std::to_string(k) + ":\n  " + texts[0][k] + "\n  " + texts[1][k]);
  return texts[0].size() == 100 || Fail(why, "the bulk fill made " + std::to_string(texts[0].size()) + " instances");
}

void RunBulkFill(benchmark::State& state, bool library)
{
  const int count = gData.options.bulkInstances;
  VLXKDMColumns batch;
  for (auto _ : state) {
    state.PauseTiming();
    auto r = std::make_unique<BulkReplica>();
    const bool made = MakeBulkReplica(*r);
    CollectGarbage();
    state.ResumeTiming();
    const bool ok = made && (library ? ColumnsFill(batch, *r, count) : JavaBulkFill(*r, count));
    state.PauseTiming();
    r.reset();
    state.ResumeTiming();
    if (!ok) return state.SkipWithError("the bulk fill failed");
  }
}

void RunBulkRead(benchmark::State& state, bool library)
{
  static BulkReplica r;
  static const bool filled = [] {
    VLXKDMColumns batch;
    return MakeBulkReplica(r) && ColumnsFill(batch, r, gData.options.bulkInstances);
  }();
  if (!filled) return state.SkipWithError("the bulk replica could not be filled");
  VLXKDMColumns batch;
  long column = 0, rows = 0;
  for (const char* name : {"code", "price", "label", "created", "active", "payload", "owner", "counts"})
    batch.AddColumn(VLXUnicodeString(name), column);
  for (auto _ : state) {
    state.PauseTiming();
    CollectGarbage();
    state.ResumeTiming();
    const bool ok =
        library ? batch.GetValues(r.model) >= 0 && batch.GetRowCount(rows) >= 0 && rows == gData.options.bulkInstances
                : gData.env->CallStaticIntMethod(gData.bulkClass, gData.bulkRead, r.model.GetHandle()) ==
                          gData.options.bulkInstances &&
                      !Threw(gData.env);
    if (!ok) return state.SkipWithError("the bulk read failed");
  }
}

}  // namespace

bool RegisterDataBenchmarks(JNIEnv* env, const DataOptions& options, std::string& why)
{
  Data& d = gData;
  d.options = options;
  d.env = env;
  d.lookupClass = GlobalClass(env, "com/velmora/tessara/bench/LookupBaseline");
  d.lookupFill = Method(env, d.lookupClass, "fill", "(Lcom/velmora/tessara/kdmreplica/Model;I)I", true);
  d.lookupFind = Method(env, d.lookupClass, "find", "(Lcom/velmora/tessara/kdmreplica/Model;II)I", true);
  d.lookupSelect = Method(env, d.lookupClass, "select", "(Lcom/velmora/tessara/kdmreplica/Model;I)I", true);
  d.bulkClass = GlobalClass(env, "com/velmora/tessara/bench/BulkBaseline");
  d.bulkFill = Method(env, d.bulkClass, "fill",
                      "(Lcom/velmora/tessara/kdmreplica/Model;IJLcom/velmora/tessara/kdmreplica/Instance;)I", true);
  d.bulkRead = Method(env, d.bulkClass, "read", "(Lcom/velmora/tessara/kdmreplica/Model;)I", true);
  d.systemClass = GlobalClass(env, "java/lang/System");
  d.systemGc = Method(env, d.systemClass, "gc", "()V", true);
  if (!d.lookupFill || !d.lookupFind || !d.lookupSelect || !d.bulkFill || !d.bulkRead || !d.systemGc)
    return Fail(why, "the lookup and bulk baselines (LookupBaseline, BulkBaseline) were not found");
  if (!BulkFillsAgree(why)) return false;
  for (int warm = 0; warm < 2; ++warm) {  // the first runs of the Java code they reach are interpreted
    for (bool library : {true, false}) {
      BulkReplica r;
      VLXKDMColumns batch;
      const int count = std::min(options.bulkInstances, 20000);
      if (MakeBulkReplica(r)) library ? ColumnsFill(batch, r, count) : JavaBulkFill(r, count);
    }
  }
  {
    BulkReplica r;
    VLXKDMColumns batch;
    const bool staged = MakeBulkReplica(r) && StageBulk(batch, r, options.bulkInstances);
    StartCountingAllocations();
    const bool again = StageBulk(batch, r, options.bulkInstances);
    d.staging = StopCountingAllocations();
    if (!staged || !again) return Fail(why, "staging a bulk batch failed");
  }
  for (bool library : {true, false}) {
    const std::string side = library ? "/library" : "/pureJava";
    benchmark::RegisterBenchmark(("BulkFill" + side).c_str(), RunBulkFill, library)
        ->Iterations(1)
        ->Repetitions(options.iterations)
        ->Unit(benchmark::kMillisecond)
        ->UseRealTime();
    benchmark::RegisterBenchmark(("BulkRead" + side).c_str(), RunBulkRead, library)
        ->Iterations(1)
        ->Repetitions(options.iterations)
        ->Unit(benchmark::kMillisecond)
        ->UseRealTime();
  }
  benchmark::RegisterBenchmark("Lookup/library", RunLookup, true);
  benchmark::RegisterBenchmark("Lookup/pureJava", RunLookup, false);
  benchmark::RegisterBenchmark("Select/library", RunSelect, true)->Unit(benchmark::kMillisecond);
  benchmark::RegisterBenchmark("Select/pureJava", RunSelect, false)->Unit(benchmark::kMillisecond);
  return true;
}

void PrintDataSummary(const SummaryReporter& reporter)
{
  const DataOptions& o = gData.options;
  std::printf("\n");
  for (const char* what : {"fill", "read"}) {
    const std::string key = std::string("Bulk") + (what[0] == 'f' ? "Fill" : "Read");
    const double lib = reporter.Nanoseconds(key + "/library").real, java = reporter.Nanoseconds(key + "/pureJava").real;
    if (lib > 0 && java > 0)
      std::printf("bulk %s %d instances x 8 attributes: batch of columns %s, pure Java %s; target at most 2x: %sx\n",
                  what, o.bulkInstances, Figure(lib).c_str(), Figure(java).c_str(), Ratio(lib, java).c_str());
  }
  std::printf("  staging %d rows x 8 values again in the same batch: %llu operator new, %llu malloc\n", o.bulkInstances,
              static_cast<unsigned long long>(gData.staging.news),
              static_cast<unsigned long long>(gData.staging.mallocs));
  const double found = reporter.Nanoseconds("Lookup/library").real,
               javaFound = reporter.Nanoseconds("Lookup/pureJava").real / kLookupsPerJavaCall;
  if (found > 0 && javaFound > 0)
    std::printf("find by identifier among %d instances (pure Java %.3f us; target at most 2 us): %.3f us\n",
                o.lookupInstances, javaFound / 1e3, found / 1e3);
  const double selected = reporter.Nanoseconds("Select/library").real,
               javaSelected = reporter.Nanoseconds("Select/pureJava").real;
  if (selected > 0 && javaSelected > 0)
    std::printf("select by an int among %d instances: library %s, a pure Java loop %s; target at most 2x: %sx\n",
                o.lookupInstances, Figure(selected).c_str(), Figure(javaSelected).c_str(),
                Ratio(selected, javaSelected).c_str());
}

void ReleaseDataBenchmarks(JNIEnv* env)
{
  for (jobject ref : {static_cast<jobject>(gData.lookupClass), static_cast<jobject>(gData.bulkClass),
                      static_cast<jobject>(gData.systemClass)})
    if (ref) env->DeleteGlobalRef(ref);
}

}  // namespace corvexa_bench
