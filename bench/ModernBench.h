// The modern interface's benchmarks of corvexa-bench: get<int>, set(int) and iteration over a
// model's instances, against the proxy API doing the same work.
#pragma once

#include <string>

#include "BenchReport.h"

namespace corvexa_bench {

// Builds a replica of instances instances and registers Modern*/modern and Modern*/proxy; false
// with why.
bool RegisterModernBenchmarks(int instances, std::string& why);
// The summary's lines, each ending with the ratio of the modern interface to the proxy API.
void PrintModernSummary(const SummaryReporter& reporter);
void ReleaseModernBenchmarks();

}  // namespace corvexa_bench
