#include "VLXBaseUnknown.h"

#include "VLXResult.h"

#include <cxxabi.h>

#include <cstdlib>
#include <cstring>
#include <string>

const VLXIID IID_VLXBaseUnknown = {0x5c0f4a91, 0x2b7e, 0x4d13, {0x9a, 0x61, 0x0e, 0x3b, 0x77, 0xc2, 0x48, 0xd5}};

bool operator==(const VLXIID& a, const VLXIID& b)
{
  return a.Data1 == b.Data1 && a.Data2 == b.Data2 && a.Data3 == b.Data3 &&
         std::memcmp(a.Data4, b.Data4, sizeof a.Data4) == 0;
}

namespace {
std::string Demangle(const std::type_info& type)
{
  int status = 0;
  char* text = abi::__cxa_demangle(type.name(), nullptr, nullptr, &status);
  std::string name = (status == 0 && text != nullptr) ? text : type.name();
  std::free(text);
  return name;
}

// Walks the class and its bases (Itanium C++ ABI type information) looking for `name`.
bool IsKindOf(const std::type_info& type, const char* name)
{
  if (Demangle(type) == name) return true;
  if (auto* single = dynamic_cast<const abi::__si_class_type_info*>(&type)) return IsKindOf(*single->__base_type, name);
  if (auto* multiple = dynamic_cast<const abi::__vmi_class_type_info*>(&type)) {
    for (unsigned int i = 0; i < multiple->__base_count; ++i)
      if (IsKindOf(*multiple->__base_info[i].__base_type, name)) return true;
  }
  return false;
}
}  // namespace

namespace {
// The block the calling thread's last class `new` returned, until the object made in it claims it.
thread_local const char* t_newBlock = nullptr;
thread_local std::size_t t_newSize = 0;

void* Allocated(std::size_t size)
{
  void* memory = std::malloc(size != 0 ? size : 1);
  t_newBlock = static_cast<const char*>(memory);
  t_newSize = size;
  return memory;
}

// Whether object lies in the block of the last class `new` (then claimed: a later object is not).
bool Claim(const void* object)
{
  const char* at = static_cast<const char*>(object);
  if (t_newBlock == nullptr || at < t_newBlock || at >= t_newBlock + t_newSize) return false;
  t_newBlock = nullptr;
  return true;
}
}  // namespace

VLXBaseUnknown::VLXBaseUnknown() : _madeByNew(Claim(this)) {}

VLXBaseUnknown::VLXBaseUnknown(const VLXBaseUnknown& other)
    : _impl(other._impl), _componentState(other._componentState), _madeByNew(Claim(this))
{
}

VLXBaseUnknown& VLXBaseUnknown::operator=(const VLXBaseUnknown& other)
{
  _impl = other._impl;
  _componentState = other._componentState;
  return *this;
}

VLXBaseUnknown::~VLXBaseUnknown() = default;

void* VLXBaseUnknown::operator new(std::size_t size) noexcept { return Allocated(size); }

void* VLXBaseUnknown::operator new(std::size_t size, const std::nothrow_t&) noexcept { return Allocated(size); }

void VLXBaseUnknown::operator delete(void* memory) noexcept { std::free(memory); }

void VLXBaseUnknown::operator delete(void* memory, const std::nothrow_t&) noexcept { std::free(memory); }

long VLXBaseUnknown::QueryInterface(const VLXIID& iid, void** object)
{
  if (object == nullptr) return VLX_E_INVALIDARG;
  if (iid != IID_VLXBaseUnknown) {
    *object = nullptr;
    return VLX_E_NOINTERFACE;
  }
  AddRef();
  *object = this;
  return VLX_S_OK;
}

unsigned long VLXBaseUnknown::AddRef() { return _refCount.fetch_add(1, std::memory_order_relaxed) + 1; }

unsigned long VLXBaseUnknown::Release()
{
  const unsigned long count = _refCount.fetch_sub(1, std::memory_order_acq_rel) - 1;
  if (count == 0 && _madeByNew) delete this;
  return count;
}

long VLXBaseUnknown::GetTypeInfoCount(unsigned int* count)
{
  if (count == nullptr) return VLX_E_INVALIDARG;
  *count = 0;
  return VLX_S_OK;
}

long VLXBaseUnknown::GetTypeInfo(unsigned int, unsigned long, void** typeInfo)
{
  if (typeInfo != nullptr) *typeInfo = nullptr;
  return VLX_E_NOTIMPL;
}

long VLXBaseUnknown::GetIDsOfNames(const VLXIID&, char**, unsigned int, unsigned long, long*) { return VLX_E_NOTIMPL; }

long VLXBaseUnknown::Invoke(long, const VLXIID&, unsigned long, unsigned short, void*, void*, void*, unsigned int*)
{
  return VLX_E_NOTIMPL;
}

long VLXBaseUnknown::QueryInterface(const char* interfaceName, void** object)
{
  if (object == nullptr) return VLX_E_INVALIDARG;
  if (interfaceName == nullptr || !IsAKindOf(interfaceName)) {
    *object = nullptr;
    return VLX_E_NOINTERFACE;
  }
  AddRef();
  *object = this;
  return VLX_S_OK;
}

const std::type_info& VLXBaseUnknown::GetMetaObject() const { return typeid(*this); }

int VLXBaseUnknown::IsA(const char* className) const
{
  return className != nullptr && Demangle(typeid(*this)) == className;
}

int VLXBaseUnknown::IsAKindOf(const char* className) const
{
  return className != nullptr && IsKindOf(typeid(*this), className);
}

void* VLXBaseUnknown::GetImpl() const { return _impl; }

void VLXBaseUnknown::SetImpl(void* impl) { _impl = impl; }

int VLXBaseUnknown::IsNull() const { return 0; }

int VLXBaseUnknown::IsEqual(const VLXBaseUnknown* other) const { return other == this; }

long VLXBaseUnknown::ChangeComponentState(int state)
{
  _componentState = state;
  return VLX_S_OK;
}
