// The data benchmarks of corvexa-bench: lookups by identifier and selections by value, and bulk
// columns (filling and reading many instances' values in one batch), each against the same work
// done in pure Java in the same process.
#pragma once

#include <jni.h>

#include <string>

#include "BenchReport.h"

namespace corvexa_bench {

struct DataOptions {
  int lookupInstances = 1000000;
  int bulkInstances = 100000;
  int iterations = 5;  // measured fills and reads per side, one per repetition
};

// Resolves the Java baselines, checks that both sides fill the same instances, and registers
// Lookup/*, Select/*, BulkFill/* and BulkRead/*; false with why.
bool RegisterDataBenchmarks(JNIEnv* env, const DataOptions& options, std::string& why);
// The summary's lines: "bulk fill ...", "bulk read ..." (each ending with its ratio against pure
// Java), "find by identifier ..." (ending with the time per lookup) and the selection.
void PrintDataSummary(const SummaryReporter& reporter);
void ReleaseDataBenchmarks(JNIEnv* env);

}  // namespace corvexa_bench
