// Counts the heap allocations made by the calling thread while counting is on, so the benchmark can
// say how many allocations one operation costs. Other threads (the JVM's compiler and collector
// threads) are never counted.
#pragma once

#include <cstdint>

namespace corvexa_bench {

struct AllocationCounts {
  std::uint64_t news = 0;     // operator new, every form
  std::uint64_t mallocs = 0;  // malloc, calloc, realloc (also the JVM's own, made on this thread)
};

// Turns counting on for the calling thread and zeroes its counts.
void StartCountingAllocations();
// Turns counting off for the calling thread and returns what it counted since the start.
AllocationCounts StopCountingAllocations();

}  // namespace corvexa_bench
