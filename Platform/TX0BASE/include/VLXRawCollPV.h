// VLXRawCollPV: a list of untyped pointers, positions from 1, and its collection base.
//
// The list stores the pointer values only: it never dereferences, copies or frees what they point
// to. A position outside 1..Size() breaks the contract of operator[] and RemovePosition; they
// report it through VLXFatalError and, if the handler returns, operator[] yields a scratch slot of
// the calling thread (reset to null at each such call) and RemovePosition does nothing.
#ifndef VLXRawCollPV_h
#define VLXRawCollPV_h

#include <algorithm>
#include <cstddef>
#include <vector>

namespace VLXCollec {
// What RemoveAll does with the storage.
enum MemoryHandling {
  KeepMemory = 0,  // keep the storage's capacity for later appends
  FreeMemory = 1   // free the storage
};
}  // namespace VLXCollec

// The root of the collection classes; it holds nothing.
class VLXCollecRoot {
 public:
  VLXCollecRoot() = default;
  VLXCollecRoot(const VLXCollecRoot&) = default;
  VLXCollecRoot& operator=(const VLXCollecRoot&) = default;
  virtual ~VLXCollecRoot();
};

class VLXRawCollPV : public VLXCollecRoot {
 public:
  // An empty list; a positive `sizeHint` reserves room for that many pointers.
  explicit VLXRawCollPV(int sizeHint = 0);
  VLXRawCollPV(const VLXRawCollPV&) = default;
  VLXRawCollPV& operator=(const VLXRawCollPV&) = default;
  ~VLXRawCollPV() override;

  void*& operator[](int position);
  void* const& operator[](int position) const;

  void Append(void* pointer);
  // Removes the pointer at `position`; the following ones move up by one.
  void RemovePosition(int position);
  // Removes every pointer: 1 (VLXCollec::FreeMemory) also frees the storage, 0 keeps it.
  void RemoveAll(int memoryHandling = VLXCollec::FreeMemory);

  int Size() const { return static_cast<int>(_items.size()); }
  // Grows the list to `newSize` with null pointers, or drops the pointers beyond `newSize`.
  // A negative size is reported through VLXFatalError and changes nothing.
  void Size(int newSize);

  // The first position p >= from holding `pointer`, or 0. A `from` below 1 counts as 1.
  int Locate(void* pointer, int from = 1) const;

  // Sorts the pointers in ascending order of `compare`, which receives two ELEMENT VALUES (the
  // stored pointers themselves, not pointers to the slots) and returns <0, 0 or >0 like strcmp.
  // Equal elements keep their relative order. A null `compare` sorts by pointer value.
  void QuickSort(int (*compare)(const void*, const void*));
  // The same for a function over typed element pointers, e.g. int (*)(VLXKDMInstance*, VLXKDMInstance*).
  template <class E>
  void QuickSort(int (*compare)(E*, E*))
  {
    SortWith([compare](void* a, void* b) { return compare(static_cast<E*>(a), static_cast<E*>(b)) < 0; });
  }

  // Compares two pointer values: -1, 0 or 1 by address.
  static int Compare(const void* a, const void* b);
  // Compares two lists element by element from position 1 with `compare` (given two element values;
  // null compares addresses): the first non-zero result is returned; when one list is a prefix of
  // the other the shorter one is smaller (-1 / 1); 0 when both have equal elements throughout.
  static int Compare(const VLXRawCollPV& a, const VLXRawCollPV& b, int (*compare)(const void*, const void*));
  template <class E>
  static int Compare(const VLXRawCollPV& a, const VLXRawCollPV& b, int (*compare)(E*, E*))
  {
    const int n = a.Size() < b.Size() ? a.Size() : b.Size();
    for (int i = 0; i < n; ++i) {
      const int r = compare(static_cast<E*>(a._items[static_cast<std::size_t>(i)]),
                            static_cast<E*>(b._items[static_cast<std::size_t>(i)]));
      if (r != 0) return r;
    }
    return a.Size() < b.Size() ? -1 : (a.Size() > b.Size() ? 1 : 0);
  }

  // The number of pointers the current storage can hold without growing (0: no storage).
  int Capacity() const { return static_cast<int>(_items.capacity()); }

 private:
  template <class Less>
  void SortWith(Less less)
  {
    std::stable_sort(_items.begin(), _items.end(), less);
  }

  std::vector<void*> _items;
};

#endif
