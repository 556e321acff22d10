#include "VLXJBXException.h"

#include "VLXJBXInternal.h"

#include <mutex>

namespace {
const VLXMessageEntry kMessages[] = {
    {VLXJBXMessages::NoEnvironment, "no Java environment could be obtained for /p1: /p2"},
    {VLXJBXMessages::OperationFailed, "/p1 failed: /p2"},
    {VLXJBXMessages::JvmCreationFailed, "the Java virtual machine could not be created: /p1"},
    {VLXJBXMessages::JavaException, "/p1 failed with the Java exception /p2: /p3/p4"},
    {VLXJBXMessages::LookupFailed, "/p1 could not be found: /p2"},
    {VLXJBXMessages::ConversionFailed, "conversion failed in /p1: /p2"},
    {VLXJBXMessages::ExceptionPending, "/p1 was not attempted: a Java exception is already pending"},
    {VLXJBXMessages::InvalidArgument, "invalid argument to /p1: /p2"},
    {VLXJBXMessages::BindingMissing, "the Java side could not be bound for /p1: /p2 is missing"},
};

void RegisterMessages()
{
  static std::once_flag once;
  std::call_once(once, [] {
    VLXError::RegisterCatalog(VLXJBXMessages::Catalog, kMessages, sizeof kMessages / sizeof kMessages[0]);
  });
}

// The catalog is there as soon as the library is loaded.
const bool kRegistered = (RegisterMessages(), true);
}  // namespace

VLXJBXException::VLXJBXException(const char* messageId, const char* catalog) : VLXError(messageId, catalog)
{
  (void)kRegistered;
  RegisterMessages();
}

VLXJBXException::~VLXJBXException() = default;

long VLXJBXDetail::Raise(long code, const char* id, std::initializer_list<std::string> parameters, const char* file,
                         int line)
{
  return VLXJBXException::Raise(code, id, parameters, file, line);
}

long VLXJBXException::Raise(long code, const char* id, std::initializer_list<std::string> parameters, const char* file,
                            int line)
{
  VLXJBXException* error = new VLXJBXException(id, VLXJBXMessages::Catalog);
  if (error == nullptr)  // out of memory: the code alone must do
    return code;
  std::vector<VLXUnicodeString> texts;
  texts.reserve(parameters.size());
  for (const std::string& p : parameters) texts.emplace_back(p.data(), static_cast<int>(p.size()));
  error->SetNLSRequestParams(static_cast<int>(texts.size()), texts.data());
  VLXError::GetReturn(VLXError::ReturnError, error, nullptr, file, line);
  return code;
}
