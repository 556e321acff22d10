// VLXList<T>: the value list behind every VLXListVal... and VLXRawColl... name.
//
// Positions are counted from 1. The list owns copies of its elements; copies of a list are
// independent of it. An empty list (default-constructed, or emptied with RemoveAll(1)) holds no
// heap memory. A position outside 1..Size() breaks the contract of operator[] and RemovePosition:
// they report it through VLXFatalError; if the installed handler returns, operator[] yields a
// scratch element of the calling thread (reset to T() at each such call) and RemovePosition does
// nothing.
#ifndef VLXList_h
#define VLXList_h

#include "VLXFatalError.h"

#include <cstddef>
#include <vector>

template <class T>
class VLXList {
 public:
  typedef T ElementType;

  // An empty list; a positive `sizeHint` reserves room for that many elements.
  explicit VLXList(int sizeHint = 0)
  {
    if (sizeHint > 0) _items.reserve(static_cast<std::size_t>(sizeHint));
  }
  VLXList(const VLXList&) = default;
  VLXList(VLXList&&) noexcept = default;
  VLXList& operator=(const VLXList&) = default;
  VLXList& operator=(VLXList&&) noexcept = default;
  ~VLXList() = default;

  void Append(const T& value) { _items.push_back(value); }
  int Size() const { return static_cast<int>(_items.size()); }

  T& operator[](int position)
  {
    if (!InRange(position)) return OutOfRange(__LINE__);
    return _items[static_cast<std::size_t>(position - 1)];
  }
  const T& operator[](int position) const
  {
    if (!InRange(position)) return OutOfRange(__LINE__);
    return _items[static_cast<std::size_t>(position - 1)];
  }

  // Removes every element. memoryHandling 1 (VLXCollec::FreeMemory) also frees the storage;
  // 0 (VLXCollec::KeepMemory) keeps it for later appends.
  void RemoveAll(int memoryHandling = 1)
  {
    if (memoryHandling)
      std::vector<T>().swap(_items);
    else
      _items.clear();
  }

  // Removes the element at `position`; the following ones move up by one.
  void RemovePosition(int position)
  {
    if (!InRange(position)) {
      OutOfRange(__LINE__);
      return;
    }
    _items.erase(_items.begin() + (position - 1));
  }

  // The first position p >= from whose element equals `value`, or 0 when there is none.
  // A `from` below 1 counts as 1; a `from` beyond Size() gives 0.
  int Locate(const T& value, int from = 1) const
  {
    if (from < 1) from = 1;
    for (int p = from; p <= Size(); ++p)
      if (_items[static_cast<std::size_t>(p - 1)] == value) return p;
    return 0;
  }

  // Replaces the content by `count` copies from `values` (bulk form used by the converters).
  void Assign(const T* values, int count)
  {
    if (count <= 0 || values == nullptr)
      _items.clear();
    else
      _items.assign(values, values + count);
  }

  // The elements in order, contiguous; null when the list holds no storage.
  const T* Data() const { return _items.empty() ? nullptr : _items.data(); }
  T* Data() { return _items.empty() ? nullptr : _items.data(); }
  // The number of elements the current storage can hold without growing (0: no storage).
  int Capacity() const { return static_cast<int>(_items.capacity()); }

  // The elements in order, for range-for and the standard algorithms (operator[] keeps counting
  // from 1).
  typedef typename std::vector<T>::iterator iterator;
  typedef typename std::vector<T>::const_iterator const_iterator;
  iterator begin() { return _items.begin(); }
  iterator end() { return _items.end(); }
  const_iterator begin() const { return _items.begin(); }
  const_iterator end() const { return _items.end(); }

  int operator==(const VLXList& other) const { return this == &other || _items == other._items; }
  int operator!=(const VLXList& other) const { return !(*this == other); }

 private:
  bool InRange(int position) const { return position >= 1 && position <= Size(); }

  static T& OutOfRange(int line)
  {
    VLXFatalError("AssertionFailed: position >= 1 && position <= Size()", nullptr, nullptr, nullptr, __FILE__, line);
    static thread_local T scratch;
    scratch = T();
    return scratch;
  }

  std::vector<T> _items;
};

// Declares the named list class `Name` of elements `Type` and its typedef `OfName`. A named class
// (rather than a bare typedef) lets other headers forward-declare the list.
#define VLX_DECLARE_VALUE_LIST(Name, Type, OfName)             \
  class Name : public VLXList<Type> {                          \
   public:                                                     \
    Name() = default;                                          \
    explicit Name(int sizeHint) : VLXList<Type>(sizeHint) {}   \
    Name(const VLXList<Type>& other) : VLXList<Type>(other) {} \
  };                                                           \
  typedef Name OfName;

#endif
