#include "ModernBench.h"

#include <memory>
#include <vector>

#include "VLXKDMInstanceValue.h"
#include "corvexa/corvexa.hpp"

namespace corvexa_bench {

namespace {

struct ModernData {
  int count = 0;
  corvexa::Replica replica;
  corvexa::Model model;
  std::vector<corvexa::Instance> modern;  // the same instances through both interfaces
  std::vector<VLXKDMInstance> proxies;
};
std::unique_ptr<ModernData> gModern;

void GetModern(benchmark::State& state)
{
  long long sum = 0;
  for (auto _ : state)
    for (const corvexa::Instance& in : gModern->modern) sum += in.get<int>("n");
  benchmark::DoNotOptimize(sum);
}

void GetProxy(benchmark::State& state)
{
  long long sum = 0;
  VLXKDMInstanceValue value;
  for (auto _ : state)
    for (VLXKDMInstance& in : gModern->proxies) {
      if (in.GetValue("n", value) != VLX_S_OK) return state.SkipWithError("GetValue failed");
      sum += value.GetInteger();
    }
  benchmark::DoNotOptimize(sum);
}

void SetModern(benchmark::State& state)
{
  int i = 0;
  for (auto _ : state)
    for (corvexa::Instance& in : gModern->modern) in.set("n", i++);
}

void SetProxy(benchmark::State& state)
{
  int i = 0;
  for (auto _ : state)
    for (VLXKDMInstance& in : gModern->proxies)
      if (in.SetValue("n", i++) != VLX_S_OK) return state.SkipWithError("SetValue failed");
}

void IterateModern(benchmark::State& state)
{
  std::size_t seen = 0;
  for (auto _ : state)
    for (corvexa::Instance in : gModern->model.instances()) seen += static_cast<bool>(in);
  if (seen % static_cast<std::size_t>(gModern->count) != 0) state.SkipWithError("instances missed");
}

void IterateProxy(benchmark::State& state)
{
  std::size_t seen = 0;
  VLXKDMModel model(gModern->model.proxy());
  for (auto _ : state) {
    VLXKDMInstanceSet set;
    int count = 0;
    if (model.GetInstances(set) != VLX_S_OK || set.GetCount(count) != VLX_S_OK) return state.SkipWithError("set");
    VLXKDMInstance in;
    for (int i = 0; i < count; ++i) {
      if (set.GetItem(i, in) != VLX_S_OK) return state.SkipWithError("GetItem failed");
      seen += in.GetHandle() != nullptr;
    }
  }
  if (seen % static_cast<std::size_t>(gModern->count) != 0) state.SkipWithError("instances missed");
}

}  // namespace

bool RegisterModernBenchmarks(int instances, std::string& why)
{
  try {
    gModern = std::make_unique<ModernData>();
    gModern->count = instances;
    gModern->replica = corvexa::Replica::create("modern");
    gModern->replica.define(corvexa::ClassDeclaration("Item").attribute("n", corvexa::Type::integer));
    gModern->model = gModern->replica.model("Item");
    for (int i = 0; i < instances; ++i) {
      gModern->modern.push_back(gModern->model.create());
      gModern->modern.back().set("n", i);
      gModern->proxies.push_back(gModern->modern.back().proxy());
    }
  } catch (const corvexa::Error& e) {
    why = e.what();
    return false;
  }
  const std::pair<const char*, void (*)(benchmark::State&)> runs[] = {
      {"ModernGetInt/modern", GetModern},      {"ModernGetInt/proxy", GetProxy},
      {"ModernSetInt/modern", SetModern},      {"ModernSetInt/proxy", SetProxy},
      {"ModernIterate/modern", IterateModern}, {"ModernIterate/proxy", IterateProxy}};
  for (const auto& [name, run] : runs)
    benchmark::RegisterBenchmark(name, run)->Unit(benchmark::kMillisecond)->UseRealTime();
  return true;
}

void PrintModernSummary(const SummaryReporter& reporter)
{
  std::printf("\n");
  const std::pair<const char*, const char*> rows[] = {
      {"ModernGetInt", "get<int>"}, {"ModernSetInt", "set(int)"}, {"ModernIterate", "iteration"}};
  for (const auto& [key, what] : rows) {
    const SummaryReporter::Times modern = reporter.Nanoseconds(std::string(key) + "/modern"),
                                 proxy = reporter.Nanoseconds(std::string(key) + "/proxy");
    if (modern.real > 0 && proxy.real > 0)
      std::printf("modern %s over %d instances: %s, the proxy API %s (thread CPU time %sx); target at most 1.1x: %sx\n",
                  what, gModern->count, Figure(modern.real).c_str(), Figure(proxy.real).c_str(),
                  Ratio(modern.cpu, proxy.cpu).c_str(), Ratio(modern.real, proxy.real).c_str());
  }
}

void ReleaseModernBenchmarks() { gModern.reset(); }

}  // namespace corvexa_bench
