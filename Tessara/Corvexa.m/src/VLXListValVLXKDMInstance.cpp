// The owning list of instance proxies: one heap copy per element, in a list of pointers.
#include "VLXListValVLXKDMInstance.h"

#include "VLXFatalError.h"

namespace {

// Fixed report path (and lines): callers and their tests match on them; keep them as they are.
const char* const kSource = "Tessara\\Corvexa.m\\src\\VLXListValVLXKDMInstance.cpp";

// What an element read out of range (or one whose copy could not be made) stands for: an
// unattached proxy of the calling thread, blanked at each use.
VLXKDMInstance& Blank()
{
  static thread_local VLXKDMInstance blank;
  blank = VLXKDMInstance();
  return blank;
}

}  // namespace

VLXListValVLXKDMInstance::VLXListValVLXKDMInstance() : _storage(0) {}

VLXListValVLXKDMInstance::VLXListValVLXKDMInstance(int sizeHint) : _storage(sizeHint) {}

VLXListValVLXKDMInstance::VLXListValVLXKDMInstance(int sizeHint, int) : _storage(sizeHint) {}

VLXListValVLXKDMInstance::VLXListValVLXKDMInstance(VLXKDMInstance** instances, int count)
    : _storage(count > 0 ? count : 0)
{
  for (int k = 0; instances && k < count; ++k)
    if (instances[k]) _storage.Append(NewCopy(instances[k]));
}

VLXListValVLXKDMInstance::VLXListValVLXKDMInstance(VLXKDMInstance* instances, int count)
    : _storage(count > 0 ? count : 0)
{
  for (int k = 0; instances && k < count; ++k) _storage.Append(NewCopy(&instances[k]));
}

VLXListValVLXKDMInstance::VLXListValVLXKDMInstance(const VLXListValVLXKDMInstance& other)
    : VLXCollecRoot(other), _storage(other.Size())
{
  AppendCopies(other);
}

VLXListValVLXKDMInstance& VLXListValVLXKDMInstance::operator=(const VLXListValVLXKDMInstance& other)
{
  if (this == &other) return *this;
  DestroyRange(1, Size());
  _storage.RemoveAll(VLXCollec::KeepMemory);
  AppendCopies(other);
  return *this;
}

VLXListValVLXKDMInstance::~VLXListValVLXKDMInstance() { DestroyRange(1, Size()); }

int VLXListValVLXKDMInstance::operator==(const VLXListValVLXKDMInstance& other) const { return !(*this != other); }

int VLXListValVLXKDMInstance::operator!=(const VLXListValVLXKDMInstance& other) const
{
  if (this == &other) return 0;
  if (Size() != other.Size()) return 1;
  for (int p = 1; p <= Size(); ++p)
    if ((*this)[p] != other[p]) return 1;
  return 0;
}

VLXKDMInstance& VLXListValVLXKDMInstance::operator[](int position)
{
  VLXKDMInstance* element = static_cast<VLXKDMInstance*>(_storage[position]);
  return element ? *element : Blank();
}

const VLXKDMInstance& VLXListValVLXKDMInstance::operator[](int position) const
{
  VLXKDMInstance* element = static_cast<VLXKDMInstance*>(_storage[position]);
  return element ? *element : Blank();
}

int VLXListValVLXKDMInstance::Size() const { return _storage.Size(); }

void VLXListValVLXKDMInstance::Append(const VLXKDMInstance& instance) { _storage.Append(NewCopy(&instance)); }

void VLXListValVLXKDMInstance::Array(VLXKDMInstance** pointers) const
{
  for (int p = Size(); p >= 1; --p) pointers[p - 1] = static_cast<VLXKDMInstance*>(_storage[p]);
}

void VLXListValVLXKDMInstance::Array(VLXKDMInstance* proxies) const
{
  for (int p = Size(); p >= 1; --p) proxies[p - 1] = (*this)[p];
}

int VLXListValVLXKDMInstance::Compare(const VLXListValVLXKDMInstance& a, const VLXListValVLXKDMInstance& b,
                                      int (*compare)(VLXKDMInstance*, VLXKDMInstance*))
{
  return VLXRawCollPV::Compare(a._storage, b._storage, compare);
}

int VLXListValVLXKDMInstance::Locate(const VLXKDMInstance& instance, int from) const
{
  if (from < 1) from = 1;
  for (int p = from; p <= Size(); ++p)
    if ((*this)[p] == instance) return p;
  return 0;
}

void VLXListValVLXKDMInstance::QuickSort(int (*compare)(VLXKDMInstance*, VLXKDMInstance*))
{
  _storage.QuickSort(compare);
}

void VLXListValVLXKDMInstance::RemoveAll(VLXCollec::MemoryHandling memoryHandling)
{
  DestroyRange(1, Size());
  _storage.RemoveAll(memoryHandling);
}

int VLXListValVLXKDMInstance::RemoveDuplicates()
{
  int removed = 0;
  for (int i = 1; i <= Size(); ++i) {
    for (int j = i + 1; j <= Size();) {
      if ((*this)[i] == (*this)[j]) {
        RemovePosition(j);
        ++removed;
      } else {
        ++j;
      }
    }
  }
  return removed;
}

void VLXListValVLXKDMInstance::RemovePosition(int position)
{
  if (position < 1 || position > Size()) {
    _storage.RemovePosition(position);  // reports the position
    return;
  }
  delete static_cast<VLXKDMInstance*>(_storage[position]);
  _storage.RemovePosition(position);
}

void VLXListValVLXKDMInstance::Size(int size, const VLXKDMInstance* filler)
{
  const int n = Size();
  if (size < 0) {
    VLXFatalError("AssertionFailed:size >= 0", nullptr, nullptr, nullptr, kSource, __LINE__);
    return;
  }
  if (size > n) {
    _storage.Size(size);
    for (int p = n + 1; p <= size; ++p) _storage[p] = NewCopy(filler);
  } else if (size < n) {
    for (int p = size + 1; p <= n; ++p) {
      delete static_cast<VLXKDMInstance*>(_storage[p]);
      _storage[p] = nullptr;
    }
    _storage.Size(size);
  }
}

VLXKDMInstance* VLXListValVLXKDMInstance::NewCopy(const VLXKDMInstance* instance)
{
  // The class-level allocator of the base object answers null when no memory can be obtained.
  return instance ? new VLXKDMInstance(*instance) : new VLXKDMInstance();
}

void VLXListValVLXKDMInstance::DestroyRange(int from, int to)
{
  for (int p = to; p >= from; --p) {
    delete static_cast<VLXKDMInstance*>(_storage[p]);
    _storage[p] = nullptr;
  }
}

void VLXListValVLXKDMInstance::AppendCopies(const VLXListValVLXKDMInstance& other)
{
  for (int p = 1; p <= other.Size(); ++p) {
    const VLXKDMInstance* element = static_cast<const VLXKDMInstance*>(other._storage[p]);
    // An element whose copy failed stays a null entry in the copy as well.
    _storage.Append(element ? NewCopy(element) : nullptr);
  }
}
