// The replacement of the global allocation functions that counts allocations per thread. Linked
// into the benchmark program only: the shared libraries it loads resolve operator new and malloc
// to these definitions, so the library's allocations are seen too.
#include "AllocationCounter.h"

#include <cstdlib>
#include <new>

extern "C" {
void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);
void* __libc_realloc(void* pointer, std::size_t size);
}

namespace {

// Read first, so that a thread pays for no thread-local access while nobody counts (and so that
// allocations made by the loader before thread-local storage exists never touch it).
volatile bool gAnyoneCounting = false;

thread_local bool tCounting = false;
thread_local std::uint64_t tNews = 0;
thread_local std::uint64_t tMallocs = 0;

inline void CountNew()
{
  if (gAnyoneCounting && tCounting) ++tNews;
}

inline void CountMalloc()
{
  if (gAnyoneCounting && tCounting) ++tMallocs;
}

void* AllocateOrThrow(std::size_t size)
{
  CountNew();
  void* p = __libc_malloc(size != 0 ? size : 1);
  if (!p) throw std::bad_alloc();
  return p;
}

void* AllocateAlignedOrThrow(std::size_t size, std::align_val_t alignment)
{
  CountNew();
  void* p = nullptr;
  if (posix_memalign(&p, static_cast<std::size_t>(alignment), size != 0 ? size : 1) != 0) throw std::bad_alloc();
  return p;
}

}  // namespace

namespace corvexa_bench {

void StartCountingAllocations()
{
  tNews = 0;
  tMallocs = 0;
  tCounting = true;
  gAnyoneCounting = true;
}

AllocationCounts StopCountingAllocations()
{
  tCounting = false;
  AllocationCounts counts;
  counts.news = tNews;
  counts.mallocs = tMallocs;
  return counts;
}

}  // namespace corvexa_bench

extern "C" {
void* malloc(std::size_t size)
{
  CountMalloc();
  return __libc_malloc(size);
}
void* calloc(std::size_t count, std::size_t size)
{
  CountMalloc();
  return __libc_calloc(count, size);
}
void* realloc(void* pointer, std::size_t size)
{
  CountMalloc();
  return __libc_realloc(pointer, size);
}
}

void* operator new(std::size_t size) { return AllocateOrThrow(size); }
void* operator new[](std::size_t size) { return AllocateOrThrow(size); }
void* operator new(std::size_t size, const std::nothrow_t&) noexcept
{
  CountNew();
  return __libc_malloc(size != 0 ? size : 1);
}
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept
{
  CountNew();
  return __libc_malloc(size != 0 ? size : 1);
}
void* operator new(std::size_t size, std::align_val_t alignment) { return AllocateAlignedOrThrow(size, alignment); }
void* operator new[](std::size_t size, std::align_val_t alignment) { return AllocateAlignedOrThrow(size, alignment); }

void operator delete(void* p) noexcept { std::free(p); }
void operator delete[](void* p) noexcept { std::free(p); }
void operator delete(void* p, std::size_t) noexcept { std::free(p); }
void operator delete[](void* p, std::size_t) noexcept { std::free(p); }
void operator delete(void* p, const std::nothrow_t&) noexcept { std::free(p); }
void operator delete[](void* p, const std::nothrow_t&) noexcept { std::free(p); }
void operator delete(void* p, std::align_val_t) noexcept { std::free(p); }
void operator delete[](void* p, std::align_val_t) noexcept { std::free(p); }
void operator delete(void* p, std::size_t, std::align_val_t) noexcept { std::free(p); }
void operator delete[](void* p, std::size_t, std::align_val_t) noexcept { std::free(p); }
