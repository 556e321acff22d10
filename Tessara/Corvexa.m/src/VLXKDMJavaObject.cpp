// The proxy base: the start of the Java side, the built test and the error translation.
#include "VLXKDMJavaObject.h"

#include <cstdio>

#include "ReplicaStubs.h"
#include "VLXError.h"
#include "VLXJBXException.h"
#include "VLXJBXJNIConverter.h"
#include "VLXJBXJNIHelper.h"
#include "VLXJBXJNIUtilities.h"
#include "VLXListValVLXUnicodeString.h"
#include "VLXMutex.h"
#include "VLXResult.h"
#include "VLXUnicodeString.h"

namespace {

// The source path that the error translation hands to GetReturn, with the line of each branch.
const char* const kSourcePath = "Tessara\\Corvexa.m\\src\\VLXKDMJavaObject.cpp";
const int kLineNoEnvironment = 86;
const int kLineSuccess = 96;
const int kLineReRaise = 102;
const int kLineNewError = 108;

const char* const kCatalog = "VLXJBXInfraErrorMessages";

// Holds the library's mutex for one scope, when asked to.
class MaybeLocked {
 public:
  MaybeLocked(VLXMutex* mutex, bool lock) : _mutex(lock ? mutex : nullptr) {
    if (_mutex) _mutex->Lock();
  }
  ~MaybeLocked() {
    if (_mutex) _mutex->Unlock();
  }
  MaybeLocked(const MaybeLocked&) = delete;
  MaybeLocked& operator=(const MaybeLocked&) = delete;

 private:
  VLXMutex* _mutex;
};

// Raises a new error of our catalog naming methodName as the thread's last error.
long RaiseNew(const char* messageId, const char* methodName, int line) {
  VLXJBXException* error = new VLXJBXException(messageId, kCatalog);
  const VLXUnicodeString parameter(methodName);
  error->SetNLSRequestParams(1, &parameter);
  VLXError::VLXCleanLastError();
  return VLXError::GetReturn(2, error, nullptr, kSourcePath, line);
}

}  // namespace

// The library's one static initialiser: its mutex. Everything else starts constant-initialised.
VLXMutex* VLXKDMJavaObject::_mutex = new VLXMutex(0, 0, 0);
std::atomic<ReplicaStubs*> VLXKDMJavaObject::_st{nullptr};
std::atomic<int> VLXKDMJavaObject::_javaInitDone{0};

VLXKDMJavaObject::VLXKDMJavaObject() = default;
VLXKDMJavaObject::VLXKDMJavaObject(const VLXKDMJavaObject& other) = default;
VLXKDMJavaObject& VLXKDMJavaObject::operator=(const VLXKDMJavaObject& other) = default;
VLXKDMJavaObject::~VLXKDMJavaObject() = default;

jobject VLXKDMJavaObject::GetHandle() const { return GetGlobalRef(); }

long VLXKDMJavaObject::SetHandle(JNIEnv* env, jobject object) { return SetGlobalRef(env, object); }

long VLXKDMJavaObject::InitJava(JNIEnv*& env, const char* methodName)
{
  // Until the binding table is installed and init has returned, the start runs under the lock: one
  // thread creates and fills the table, every other thread waits until it is complete. This also
  // covers a late start, when the first call of the process found no environment.
  const ReplicaStubs* table = _st.load(std::memory_order_acquire);
  const bool starting =
      _javaInitDone.load(std::memory_order_acquire) == 0 || !table || !table->IsSettled();
  MaybeLocked lock(_mutex, starting);

  long status = VLXJBXJNIUtilities::GetJNIEnv(env, VLXListValVLXUnicodeString());
  if (status < 0 || !env) {
    printf("Error VLXJBXJNIUtilities::GetJNIEnv\n");
  } else if (!_st.load(std::memory_order_acquire)) {
    status = StartJavaSide(env);
  }
  _javaInitDone.store(1, std::memory_order_release);
  // The success path checks for a pending Java exception once, without the error translation.
  if (status >= 0 && env && !VLXJBXJNIHelper::ExceptionCheck(env)) return VLX_S_OK;
  return HandleReplicaError(env, status, methodName);
}

long VLXKDMJavaObject::StartJavaSide(JNIEnv* env)
{
  ReplicaStubs* table = new ReplicaStubs;
  _st.store(table, std::memory_order_release);
  if (table->init(env) < 0) printf("Error ReplicaStubs::Init\n");

  // Check the environment with one string conversion.
  const VLXUnicodeString text("String or initialization");
  jstring probe = nullptr;
  const long status = VLXJBXJNIConverter::ConvertToJavaType(env, text, probe);
  if (status < 0) {
    printf("Error VLXJBXJNIConverter::ConvertToJavaType replicaName\n");
    fflush(stdout);
  } else {
    VLXJBXJNIHelper::DeleteLocalRef(env, probe);
  }
  return status;
}

long VLXKDMJavaObject::InitJavaAndTestIsBuilt(JNIEnv*& env, const char* methodName)
{
  long status = InitJava(env, methodName);
  // A successful start has just found no Java exception pending: a built proxy needs no more.
  if (status >= 0 && GetHandle()) return VLX_S_OK;
  if (status >= 0) status = VLX_E_FAIL;
  return HandleReplicaError(env, status, methodName);
}

long VLXKDMJavaObject::HandleReplicaError(JNIEnv* env, long status, const char* methodName)
{
  if (!env) {
    MaybeLocked lock(_mutex, true);
    return RaiseNew("VLXJBXInfraERR_1002", methodName, kLineNoEnvironment);
  }
  if (VLXJBXJNIHelper::ExceptionCheck(env)) {
    MaybeLocked lock(_mutex, true);
    return VLXJBXJNIUtilities::HandleJavaError(env, VLX_E_FAIL, methodName, nullptr, 0);
  }
  if (status >= 0) return VLXError::GetReturn(1, nullptr, nullptr, kSourcePath, kLineSuccess);

  MaybeLocked lock(_mutex, true);
  if (VLXError* pending = VLXError::VLXGetLastError(VLX_E_FAIL, nullptr)) {
    VLXError::VLXCleanLastError();
    return VLXError::GetReturn(2, pending, nullptr, kSourcePath, kLineReRaise);
  }
  return RaiseNew("VLXJBXInfraERR_1003", methodName, kLineNewError);
}

extern "C" int VELMORA_QKA2_INTERNAL_Corvexa() { return 1; }
