#include "VLXRawCollPV.h"

#include "VLXFatalError.h"

#include <cstdint>

VLXCollecRoot::~VLXCollecRoot() = default;

VLXRawCollPV::VLXRawCollPV(int sizeHint)
{
  if (sizeHint > 0) _items.reserve(static_cast<size_t>(sizeHint));
}

VLXRawCollPV::~VLXRawCollPV() = default;

namespace {
void*& Scratch(int line)
{
  VLXFatalError("AssertionFailed: position >= 1 && position <= Size()", nullptr, nullptr, nullptr, __FILE__, line);
  static thread_local void* scratch;
  scratch = nullptr;
  return scratch;
}
}  // namespace

void*& VLXRawCollPV::operator[](int position)
{
  if (position < 1 || position > Size()) return Scratch(__LINE__);
  return _items[static_cast<size_t>(position - 1)];
}

void* const& VLXRawCollPV::operator[](int position) const
{
  if (position < 1 || position > Size()) return Scratch(__LINE__);
  return _items[static_cast<size_t>(position - 1)];
}

void VLXRawCollPV::Append(void* pointer) { _items.push_back(pointer); }

void VLXRawCollPV::RemovePosition(int position)
{
  if (position < 1 || position > Size()) {
    Scratch(__LINE__);
    return;
  }
  _items.erase(_items.begin() + (position - 1));
}

void VLXRawCollPV::RemoveAll(int memoryHandling)
{
  if (memoryHandling)
    std::vector<void*>().swap(_items);
  else
    _items.clear();
}

void VLXRawCollPV::Size(int newSize)
{
  if (newSize < 0) {
    VLXFatalError("AssertionFailed: newSize >= 0", nullptr, nullptr, nullptr, __FILE__, __LINE__);
    return;
  }
  _items.resize(static_cast<size_t>(newSize), nullptr);
}

int VLXRawCollPV::Locate(void* pointer, int from) const
{
  if (from < 1) from = 1;
  for (int p = from; p <= Size(); ++p)
    if (_items[static_cast<size_t>(p - 1)] == pointer) return p;
  return 0;
}

void VLXRawCollPV::QuickSort(int (*compare)(const void*, const void*))
{
  if (compare == nullptr) compare = &VLXRawCollPV::Compare;
  SortWith([compare](void* a, void* b) { return compare(a, b) < 0; });
}

int VLXRawCollPV::Compare(const void* a, const void* b)
{
  // Compare addresses as integers: relational operators on unrelated pointers are unspecified.
  const uintptr_t x = reinterpret_cast<uintptr_t>(a), y = reinterpret_cast<uintptr_t>(b);
  return x < y ? -1 : (x > y ? 1 : 0);
}

int VLXRawCollPV::Compare(const VLXRawCollPV& a, const VLXRawCollPV& b, int (*compare)(const void*, const void*))
{
  if (compare == nullptr) compare = &VLXRawCollPV::Compare;
  return Compare<const void>(a, b, compare);
}
