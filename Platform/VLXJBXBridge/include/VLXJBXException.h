// VLXJBXException: the error objects that the Java bridge records as last errors, and the ids of
// its message catalog "VLXJBXInfraErrorMessages" (registered when the bridge library is loaded).
#ifndef VLXJBXException_h
#define VLXJBXException_h

#include "VLXError.h"

#include <initializer_list>
#include <string>

namespace VLXJBXMessages {
// The catalog name.
inline constexpr const char Catalog[] = "VLXJBXInfraErrorMessages";
// "no Java environment could be obtained for /p1: /p2" (/p1 the operation, /p2 the cause)
inline constexpr const char NoEnvironment[] = "VLXJBXInfraERR_1002";
// "/p1 failed: /p2" (/p1 the operation, /p2 the cause)
inline constexpr const char OperationFailed[] = "VLXJBXInfraERR_1003";
// "the Java virtual machine could not be created: /p1"
inline constexpr const char JvmCreationFailed[] = "VLXJBXInfraERR_1004";
// "/p1 failed with the Java exception /p2: /p3/p4" (/p4: "; caused by <class>: <message>" or empty)
inline constexpr const char JavaException[] = "VLXJBXInfraERR_1005";
// "/p1 could not be found: /p2" (/p1 names the class, or the member, its signature and its class)
inline constexpr const char LookupFailed[] = "VLXJBXInfraERR_1006";
// "conversion failed in /p1: /p2"
inline constexpr const char ConversionFailed[] = "VLXJBXInfraERR_1007";
// "/p1 was not attempted: a Java exception is already pending"
inline constexpr const char ExceptionPending[] = "VLXJBXInfraERR_1008";
// "invalid argument to /p1: /p2"
inline constexpr const char InvalidArgument[] = "VLXJBXInfraERR_1009";
// "the Java side could not be bound for /p1: /p2 is missing"
inline constexpr const char BindingMissing[] = "VLXJBXInfraERR_1010";
}  // namespace VLXJBXMessages

class VLXJBXException : public VLXError {
 public:
  // An error with id `messageId` of `catalog` (normally VLXJBXMessages::Catalog). Parameters are
  // set with SetNLSRequestParams.
  VLXJBXException(const char* messageId, const char* catalog = VLXJBXMessages::Catalog);
  VLXJBXException(const VLXJBXException&) = default;
  VLXJBXException& operator=(const VLXJBXException&) = default;
  ~VLXJBXException() override;

  // Records a new error of the catalog with `id` and `parameters` as the calling thread's last
  // error, stamped with `file` and `line`, and returns `code`. The one way errors are raised.
  static long Raise(long code, const char* id, std::initializer_list<std::string> parameters, const char* file,
                    int line);
};

#endif
