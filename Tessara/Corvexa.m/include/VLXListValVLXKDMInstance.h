// VLXListValVLXKDMInstance (also VLXListOfVLXKDMInstance): a value list of instance proxies, the
// native form of a multi-valued instance attribute.
//
// Positions count from 1. The list owns a copy of every element: each copy refers to the same Java
// object as the proxy it was made from, through a global reference of its own, so the list stays
// valid when those proxies are destroyed. Two elements are equal when they refer to the same Java
// object (or when neither refers to one). A position must lie between 1 and Size(); a position out
// of range is reported through VLXFatalError. No operation makes a Java call other than the
// creation, release and comparison of references.
#pragma once

#include <cstddef>
#include <iterator>

#include "CorvexaExport.h"
#include "VLXKDMInstance.h"
#include "VLXRawCollPV.h"

class CORVEXA_API VLXListValVLXKDMInstance : public VLXCollecRoot {
 public:
  // An empty list; sizeHint reserves room for that many elements (the second integer is ignored).
  VLXListValVLXKDMInstance();
  explicit VLXListValVLXKDMInstance(int sizeHint);
  VLXListValVLXKDMInstance(int sizeHint, int ignored);
  // Copies of the count instances that the pointers point to, in order; null pointers are skipped.
  VLXListValVLXKDMInstance(VLXKDMInstance** instances, int count);
  // Copies of the count proxies of the array, in order.
  VLXListValVLXKDMInstance(VLXKDMInstance* instances, int count);
  // Copies of the other list's elements: the two lists are independent afterwards.
  VLXListValVLXKDMInstance(const VLXListValVLXKDMInstance& other);
  // Replaces every element by a copy of the other list's, in order. Self-assignment changes nothing.
  VLXListValVLXKDMInstance& operator=(const VLXListValVLXKDMInstance& other);
  // Destroys the elements (releasing their global references), from the last to the first.
  ~VLXListValVLXKDMInstance();

  // Equal when both have the same size and the elements at each position refer to the same Java
  // object. A list is equal to itself without comparing any element.
  int operator==(const VLXListValVLXKDMInstance& other) const;
  int operator!=(const VLXListValVLXKDMInstance& other) const;

  // The list's own element at position.
  VLXKDMInstance& operator[](int position);
  const VLXKDMInstance& operator[](int position) const;

  int Size() const;

  // The elements in order, for range-for and the standard algorithms (operator[] keeps counting
  // from 1).
  template <class List, class Element>
  class Iterator {
   public:
    using iterator_category = std::random_access_iterator_tag;
    using value_type = VLXKDMInstance;
    using difference_type = std::ptrdiff_t;
    using pointer = Element*;
    using reference = Element&;
    Iterator() = default;
    Iterator(List* list, int position) : _list(list), _position(position) {}
    reference operator*() const { return (*_list)[_position]; }
    pointer operator->() const { return &(*_list)[_position]; }
    reference operator[](difference_type n) const { return (*_list)[_position + static_cast<int>(n)]; }
    Iterator& operator++() { return ++_position, *this; }
    Iterator operator++(int) { return Iterator(_list, _position++); }
    Iterator& operator--() { return --_position, *this; }
    Iterator operator--(int) { return Iterator(_list, _position--); }
    Iterator& operator+=(difference_type n) { return _position += static_cast<int>(n), *this; }
    Iterator& operator-=(difference_type n) { return _position -= static_cast<int>(n), *this; }
    Iterator operator+(difference_type n) const { return Iterator(_list, _position + static_cast<int>(n)); }
    Iterator operator-(difference_type n) const { return Iterator(_list, _position - static_cast<int>(n)); }
    difference_type operator-(const Iterator& other) const { return _position - other._position; }
    bool operator==(const Iterator& other) const { return _position == other._position; }
    bool operator!=(const Iterator& other) const { return _position != other._position; }
    bool operator<(const Iterator& other) const { return _position < other._position; }
    bool operator>(const Iterator& other) const { return _position > other._position; }
    bool operator<=(const Iterator& other) const { return _position <= other._position; }
    bool operator>=(const Iterator& other) const { return _position >= other._position; }

   private:
    List* _list = nullptr;
    int _position = 1;
  };
  typedef Iterator<VLXListValVLXKDMInstance, VLXKDMInstance> iterator;
  typedef Iterator<const VLXListValVLXKDMInstance, const VLXKDMInstance> const_iterator;
  iterator begin() { return iterator(this, 1); }
  iterator end() { return iterator(this, Size() + 1); }
  const_iterator begin() const { return const_iterator(this, 1); }
  const_iterator end() const { return const_iterator(this, Size() + 1); }

  // Appends a copy of instance.
  void Append(const VLXKDMInstance& instance);
  // Writes the address of element i into pointers[i - 1], for every position. The addresses stay
  // owned by the list: they are valid until the element is removed or the list destroyed. The
  // caller provides room for Size() pointers.
  void Array(VLXKDMInstance** pointers) const;
  // Assigns element i to proxies[i - 1], for every position. The caller provides Size() proxies.
  void Array(VLXKDMInstance* proxies) const;

  // Compares two lists position by position with compare (given two element pointers): the first
  // non-zero answer, else -1 / 1 when one list is a prefix of the other, else 0.
  static int Compare(const VLXListValVLXKDMInstance& a, const VLXListValVLXKDMInstance& b,
                     int (*compare)(VLXKDMInstance*, VLXKDMInstance*));
  // The first position p >= from whose element equals instance, or 0 (also when from > Size()). A
  // from below 1 counts as 1.
  int Locate(const VLXKDMInstance& instance, int from = 1) const;
  // Sorts by compare (given two element pointers, answering <0, 0 or >0); equal elements keep their
  // order. No element is copied.
  void QuickSort(int (*compare)(VLXKDMInstance*, VLXKDMInstance*));
  // Destroys every element; memoryHandling says whether the storage's memory is freed too.
  void RemoveAll(VLXCollec::MemoryHandling memoryHandling = VLXCollec::FreeMemory);
  // Keeps the first occurrence of each Java object and removes the later equal elements, keeping
  // the order; returns the number removed.
  int RemoveDuplicates();
  // Destroys the element at position; the following ones move up by one.
  void RemovePosition(int position);
  // Grows the list to size elements with copies of *filler (unattached proxies when filler is
  // null), or shrinks it to size elements by destroying the last ones. A negative size is
  // reported through VLXFatalError and changes nothing.
  void Size(int size, const VLXKDMInstance* filler = nullptr);

 private:
  // A new heap copy of instance (an unattached proxy when instance is null), or null when no
  // memory could be obtained.
  static VLXKDMInstance* NewCopy(const VLXKDMInstance* instance);
  // Destroys the elements at positions from..to, last first, without touching the storage.
  void DestroyRange(int from, int to);
  void AppendCopies(const VLXListValVLXKDMInstance& other);

  VLXRawCollPV _storage;
};

typedef VLXListValVLXKDMInstance VLXListOfVLXKDMInstance;
