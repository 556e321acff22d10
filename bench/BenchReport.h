// The benchmark program's report: the console output with each benchmark's times kept for the
// summary, and the texts of the summary's figures.
#pragma once

#include <cstdio>
#include <map>
#include <string>
#include <vector>

#include <benchmark/benchmark.h>

namespace corvexa_bench {

// The console output, plus each benchmark's times per iteration in ns for the summary.
class SummaryReporter : public benchmark::ConsoleReporter {
 public:
  struct Times {
    double real = -1;
    double cpu = -1;  // CPU time of the benchmark's own thread
  };

  void ReportRuns(const std::vector<Run>& runs) override
  {
    for (const Run& run : runs) {
      const std::string name = run.run_name.function_name;
      if (run.error_occurred) {
        _failed[name] = run.error_message;
        continue;
      }
      const double scale = 1e9 / benchmark::GetTimeUnitMultiplier(run.time_unit);
      const Times times{run.GetAdjustedRealTime() * scale, run.GetAdjustedCPUTime() * scale};
      if (run.run_type == Run::RT_Iteration)
        _iterations[name].push_back(times);
      else if (run.aggregate_name == "median")
        _median[name] = times;
    }
    ConsoleReporter::ReportRuns(runs);
  }

  // The benchmark's times per iteration (the median over repetitions); negative when not run.
  Times Nanoseconds(const std::string& name) const
  {
    const auto median = _median.find(name);
    if (median != _median.end()) return median->second;
    const auto found = _iterations.find(name);
    if (found == _iterations.end() || found->second.empty()) return Times{};
    std::vector<double> real, cpu;
    for (const Times& t : found->second) {
      real.push_back(t.real);
      cpu.push_back(t.cpu);
    }
    return Times{Median(real), Median(cpu)};
  }
  std::string Failure(const std::string& name) const
  {
    const auto found = _failed.find(name);
    return found == _failed.end() ? std::string() : found->second;
  }

 private:
  static double Median(std::vector<double> v)
  {
    std::sort(v.begin(), v.end());
    return v.size() % 2 ? v[v.size() / 2] : (v[v.size() / 2 - 1] + v[v.size() / 2]) / 2;
  }

  std::map<std::string, std::vector<Times>> _iterations;
  std::map<std::string, Times> _median;
  std::map<std::string, std::string> _failed;
};

inline std::string Figure(double ns)
{
  char text[32];
  if (ns < 0) return "-";
  if (ns >= 1e6)
    std::snprintf(text, sizeof text, "%.1f ms", ns / 1e6);
  else if (ns >= 1e4)
    std::snprintf(text, sizeof text, "%.1f us", ns / 1e3);
  else
    std::snprintf(text, sizeof text, "%.1f ns", ns);
  return text;
}

inline std::string Excess(double lib, double base)
{
  if (lib <= 0 || base <= 0) return "-";
  return (lib >= base ? "+" : "-") + Figure(lib >= base ? lib - base : base - lib);
}

inline std::string Ratio(double a, double b)
{
  char text[16] = "-";
  if (a > 0 && b > 0) std::snprintf(text, sizeof text, "%.2f", a / b);
  return text;
}

}  // namespace corvexa_bench
