// VLXBaseUnknown: the base object of the framework.
//
// It brings
// - a class-level allocator: `new` on a derived class never throws; it yields null when memory
//   cannot be obtained (the constructor then does not run);
// - a thread-safe reference count that starts at 1. An object made with `new` is freed by the
//   Release() that brings the count to 0; an object on the stack, static, or inside another object
//   (a proxy held by value) is never freed by Release, which then only counts;
// - a small introspection interface over the C++ run-time type information. Objects carry no
//   scripting type information: GetTypeInfo, GetIDsOfNames and Invoke answer VLX_E_NOTIMPL.
//
// The order of the virtual functions below is part of the binary interface; derived classes add
// no virtual function other than their destructor.
#ifndef VLXBaseUnknown_h
#define VLXBaseUnknown_h

#include <atomic>
#include <cstddef>
#include <new>
#include <typeinfo>

// An interface identifier.
struct VLXIID {
  unsigned int Data1;
  unsigned short Data2;
  unsigned short Data3;
  unsigned char Data4[8];
};

bool operator==(const VLXIID& a, const VLXIID& b);
inline bool operator!=(const VLXIID& a, const VLXIID& b) { return !(a == b); }

// The identifier of the VLXBaseUnknown interface, which every object answers.
extern const VLXIID IID_VLXBaseUnknown;

class VLXBaseUnknown {
 public:
  // Notes whether the object is being made by this class's `new` (only such an object is freed by
  // Release).
  VLXBaseUnknown();
  // A copy has its own reference count (1); the implementation pointer and component state are copied.
  VLXBaseUnknown(const VLXBaseUnknown& other);
  // Copies the implementation pointer and component state; the reference count is left alone.
  VLXBaseUnknown& operator=(const VLXBaseUnknown& other);

  static void* operator new(std::size_t size) noexcept;
  static void* operator new(std::size_t size, const std::nothrow_t&) noexcept;
  static void* operator new(std::size_t, void* place) noexcept { return place; }
  static void operator delete(void* memory) noexcept;
  static void operator delete(void* memory, const std::nothrow_t&) noexcept;
  static void operator delete(void*, void*) noexcept {}

  // Answers IID_VLXBaseUnknown: writes this object into *object, adds a reference and returns
  // VLX_S_OK. Any other identifier: writes null and returns VLX_E_NOINTERFACE. A null `object`
  // gives VLX_E_INVALIDARG.
  virtual long QueryInterface(const VLXIID& iid, void** object);
  // Adds a reference; returns the new count.
  virtual unsigned long AddRef();
  // Drops a reference; deletes an object made with `new` when the count reaches 0. Returns the new
  // count.
  virtual unsigned long Release();
  // Writes 0 (no type information) and returns VLX_S_OK; VLX_E_INVALIDARG for a null `count`.
  virtual long GetTypeInfoCount(unsigned int* count);
  // VLX_E_NOTIMPL; writes null into *typeInfo when it is not null.
  virtual long GetTypeInfo(unsigned int index, unsigned long localeId, void** typeInfo);
  // VLX_E_NOTIMPL.
  virtual long GetIDsOfNames(const VLXIID& iid, char** names, unsigned int nameCount, unsigned long localeId,
                             long* dispatchIds);
  // VLX_E_NOTIMPL.
  virtual long Invoke(long dispatchId, const VLXIID& iid, unsigned long localeId, unsigned short flags,
                      void* parameters, void* result, void* exceptionInfo, unsigned int* argumentError);
  // Answers any class name for which IsAKindOf is true ("VLXBaseUnknown", the object's own class,
  // its bases) like the identifier form above; otherwise null and VLX_E_NOINTERFACE.
  virtual long QueryInterface(const char* interfaceName, void** object);

  virtual ~VLXBaseUnknown();

  // The run-time type information of the object's dynamic class.
  virtual const std::type_info& GetMetaObject() const;
  // 1 when the object's dynamic class is named `className` (demangled, with namespaces: "ns::X").
  virtual int IsA(const char* className) const;
  // 1 when the object's dynamic class or one of its base classes is named `className`.
  virtual int IsAKindOf(const char* className) const;
  // An implementation pointer that the object only stores (not owned). Null at construction.
  virtual void* GetImpl() const;
  virtual void SetImpl(void* impl);
  // 0: a live object is never the null object.
  virtual int IsNull() const;
  // 1 when `other` is this very object.
  virtual int IsEqual(const VLXBaseUnknown* other) const;
  // Records the component state (0 at construction) and returns VLX_S_OK.
  virtual long ChangeComponentState(int state);

  // The current reference count (for diagnostics and tests).
  unsigned long GetRefCount() const { return _refCount.load(std::memory_order_acquire); }
  // The state last given to ChangeComponentState.
  int GetComponentState() const { return _componentState; }

 private:
  std::atomic<unsigned long> _refCount{1};
  void* _impl = nullptr;
  int _componentState = 0;
  bool _madeByNew = false;
};

#endif
