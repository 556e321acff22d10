#include "VLXError.h"

#include "VLXFatalError.h"
#include "VLXResult.h"

#include <map>
#include <mutex>
#include <string>

namespace {
// The catalogs registered in the process. Never destroyed: error objects may be read during
// process exit, after static destructors have started.
struct CatalogRegistry {
  std::mutex mutex;
  std::map<std::string, std::map<std::string, std::string>> catalogs;
};

CatalogRegistry& Catalogs()
{
  static CatalogRegistry* registry = new CatalogRegistry;
  return *registry;
}

// The calling thread's last error; the slot owns one reference, released when the thread exits.
struct LastErrorSlot {
  VLXError* error = nullptr;
  ~LastErrorSlot()
  {
    VLXError* e = error;
    error = nullptr;
    if (e != nullptr) e->Release();
  }
};

thread_local LastErrorSlot t_lastError;
// Whether the last error was recorded since the thread's operation mark. Kept apart from the slot,
// which has a destructor: a trivial thread-local is reached without an initialisation check, and
// the mark is made at the start of every operation.
thread_local bool t_lastErrorFresh = false;
}  // namespace

VLXError::VLXError(const char* messageId, const char* catalog)
    : _id(messageId ? messageId : ""), _catalog(catalog ? catalog : "")
{
}

VLXError::VLXError(const VLXError& other) = default;

VLXError& VLXError::operator=(const VLXError& other) = default;

VLXError::~VLXError() = default;

const VLXUnicodeString& VLXError::GetNLSParameter(int position) const
{
  if (position < 1 || position > GetNLSParameterCount()) {
    VLXFatalError("AssertionFailed: position >= 1 && position <= GetNLSParameterCount()", nullptr, nullptr, nullptr,
                  __FILE__, __LINE__);
    static const VLXUnicodeString empty;
    return empty;
  }
  return _parameters[static_cast<size_t>(position - 1)];
}

void VLXError::SetNLSRequestParams(int count, const VLXUnicodeString* params)
{
  _parameters.clear();
  if (count > 0 && params != nullptr) _parameters.assign(params, params + count);
}

void VLXError::SetSource(const char* file, int line)
{
  _file = file ? file : "";
  _line = line;
}

void VLXError::RegisterCatalog(const char* catalog, const VLXMessageEntry* entries, int count)
{
  if (catalog == nullptr || entries == nullptr) return;
  CatalogRegistry& registry = Catalogs();
  std::lock_guard<std::mutex> lock(registry.mutex);
  auto& texts = registry.catalogs[catalog];
  for (int i = 0; i < count; ++i)
    if (entries[i].id != nullptr) texts[entries[i].id] = entries[i].text ? entries[i].text : "";
}

int VLXError::LookupMessage(const char* catalog, const char* id, VLXUnicodeString& text)
{
  if (catalog == nullptr || id == nullptr) return 0;
  CatalogRegistry& registry = Catalogs();
  std::lock_guard<std::mutex> lock(registry.mutex);
  auto c = registry.catalogs.find(catalog);
  if (c == registry.catalogs.end()) return 0;
  auto t = c->second.find(id);
  if (t == c->second.end()) return 0;
  text = VLXUnicodeString(t->second.data(), static_cast<int>(t->second.size()));
  return 1;
}

VLXUnicodeString VLXError::GetMessageText() const
{
  VLXUnicodeString templ;
  std::string out;
  if (!LookupMessage(_catalog.c_str(), _id.c_str(), templ)) {
    out = _catalog + ":" + _id;
    if (!_parameters.empty()) {
      out += " (";
      for (size_t i = 0; i < _parameters.size(); ++i) {
        if (i > 0) out += ", ";
        out.append(_parameters[i].c_str(), static_cast<size_t>(_parameters[i].GetLengthInByte()));
      }
      out += ")";
    }
    return VLXUnicodeString(out.data(), static_cast<int>(out.size()));
  }
  const char* t = templ.c_str();
  const int n = templ.GetLengthInByte();
  for (int i = 0; i < n;) {
    if (t[i] == '/' && i + 2 < n && t[i + 1] == 'p' && t[i + 2] >= '0' && t[i + 2] <= '9') {
      int j = i + 2;
      long number = 0;
      while (j < n && t[j] >= '0' && t[j] <= '9' && number < 1000000) number = number * 10 + (t[j++] - '0');
      if (number >= 1 && number <= static_cast<long>(_parameters.size())) {
        const VLXUnicodeString& p = _parameters[static_cast<size_t>(number - 1)];
        out.append(p.c_str(), static_cast<size_t>(p.GetLengthInByte()));
      }
      i = j;
    } else {
      out += t[i++];
    }
  }
  return VLXUnicodeString(out.data(), static_cast<int>(out.size()));
}

VLXError* VLXError::VLXGetLastError(long, void*)
{
  VLXError* e = t_lastError.error;
  if (e != nullptr) e->AddRef();
  return e;
}

void VLXError::VLXCleanLastError()
{
  VLXError* e = t_lastError.error;
  t_lastError.error = nullptr;
  if (e != nullptr) e->Release();
}

long VLXError::GetReturn(int kind, VLXError* error, void*, const char* file, int line)
{
  if (kind == ReturnSuccess) return VLX_S_OK;
  if (kind != ReturnError) return VLX_E_INVALIDARG;
  if (error != nullptr) {
    error->SetSource(file, line);
    VLXError* previous = t_lastError.error;
    t_lastError.error = error;
    t_lastErrorFresh = true;
    // Released after the swap: `previous` may be `error` itself (a re-raise without a clean).
    if (previous != nullptr) previous->Release();
  }
  return VLX_E_FAIL;
}

void VLXError::MarkOperationStart() { t_lastErrorFresh = false; }

VLXError* VLXError::VLXGetOperationError() { return t_lastErrorFresh ? VLXGetLastError(0, nullptr) : nullptr; }
