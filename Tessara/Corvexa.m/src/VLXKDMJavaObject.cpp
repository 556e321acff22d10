// The proxy base: the start of the Java side, the built test and the error translation.
#include "VLXKDMJavaObject.h"

#include "corvexa/Version.h"

#include <cstdio>
#include <string>

#include "CallFrame.h"
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
// Fixed report path (and lines): callers and their tests match on them; keep them as they are.
const char* const kSourcePath = "Tessara\\Corvexa.m\\src\\VLXKDMJavaObject.cpp";
const int kLineNoEnvironment = 86;
const int kLineSuccess = 96;
const int kLineReRaise = 102;
const int kLineNewError = 108;

// Holds the library's mutex for one scope, when asked to.
class MaybeLocked {
 public:
  MaybeLocked(VLXMutex* mutex, bool lock) : _mutex(lock ? mutex : nullptr)
  {
    if (_mutex) _mutex->Lock();
  }
  ~MaybeLocked()
  {
    if (_mutex) _mutex->Unlock();
  }
  MaybeLocked(const MaybeLocked&) = delete;
  MaybeLocked& operator=(const MaybeLocked&) = delete;

 private:
  VLXMutex* _mutex;
};

// Raises a new error of our catalog naming methodName and the cause as the thread's last error.
long RaiseNew(const char* messageId, const char* methodName, const VLXUnicodeString& cause, int line)
{
  return VLXJBXException::Raise(VLX_E_FAIL, messageId,
                                {methodName, std::string(cause.c_str(), static_cast<size_t>(cause.GetLengthInByte()))},
                                kSourcePath, line);
}

// The text of the error that the current operation recorded, or the given text when it recorded none.
VLXUnicodeString OwnCause(const char* otherwise)
{
  VLXError* own = VLXError::VLXGetOperationError();
  if (!own) return VLXUnicodeString(otherwise);
  VLXUnicodeString text = own->GetMessageText();
  own->Release();
  return text;
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
  const bool starting = _javaInitDone.load(std::memory_order_acquire) == 0 || !table || !table->IsSettled();
  MaybeLocked lock(_mutex, starting);
  // Errors recorded before this operation are not its own.
  VLXError::MarkOperationStart();

  long status = VLXJBXJNIUtilities::GetJNIEnv(env, VLXListValVLXUnicodeString());
  if (status < 0 || !env) {
    fprintf(stderr, "Error VLXJBXJNIUtilities::GetJNIEnv\n");
  } else if (!_st.load(std::memory_order_acquire) && !VLXJBXJNIHelper::ExceptionCheck(env)) {
    // An exception the caller left pending fails this call (below) and does not start the Java
    // side: binding with it pending would fail and mark the table unusable for good.
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
  if (table->init(env) < 0) fprintf(stderr, "Error ReplicaStubs::Init\n");
  // Without it a progress report fails its operation with Java's UnsatisfiedLinkError, which says why.
  if (table->IsBound() && corvexa::RegisterProgressNative(env, *table) < 0) VLXJBXJNIHelper::ExceptionClear(env);

  // Check the environment with one string conversion.
  const VLXUnicodeString text("String or initialization");
  jstring probe = nullptr;
  const long status = VLXJBXJNIConverter::ConvertToJavaType(env, text, probe);
  const corvexa::LocalRef owned(env, probe);
  if (status < 0) {
    fprintf(stderr, "Error VLXJBXJNIConverter::ConvertToJavaType replicaName\n");
    fflush(stderr);
  }
  return status;
}

long VLXKDMJavaObject::InitJavaAndTestIsBuilt(JNIEnv*& env, const char* methodName)
{
  const long status = InitJava(env, methodName);
  // A successful start has just found no Java exception pending: a built proxy needs no more.
  if (status < 0 || GetHandle()) return status;
  MaybeLocked lock(_mutex, true);
  return RaiseNew("VLXJBXInfraERR_1003", methodName,
                  VLXUnicodeString("the object is not attached to a Java object (it was never built, or its "
                                   "Java object was released)"),
                  kLineNewError);
}

long VLXKDMJavaObject::HandleReplicaError(JNIEnv* env, long status, const char* methodName)
{
  if (!env) {
    MaybeLocked lock(_mutex, true);
    // The bridge's own account (the JVM's options and code, the class path) becomes the cause.
    return RaiseNew("VLXJBXInfraERR_1002", methodName, OwnCause("the Java bridge recorded no cause"),
                    kLineNoEnvironment);
  }
  if (VLXJBXJNIHelper::ExceptionCheck(env)) {
    MaybeLocked lock(_mutex, true);
    return VLXJBXJNIUtilities::HandleJavaError(env, VLX_E_FAIL, methodName, nullptr, 0);
  }
  if (status >= 0) return VLXError::GetReturn(1, nullptr, nullptr, kSourcePath, kLineSuccess);

  // The error that this operation's failure recorded is kept; one recorded by an earlier operation
  // never describes this one.
  MaybeLocked lock(_mutex, true);
  if (VLXError* own = VLXError::VLXGetOperationError()) {
    VLXError::VLXCleanLastError();
    return VLXError::GetReturn(2, own, nullptr, kSourcePath, kLineReRaise);
  }
  const std::string cause = "it failed with the code " + std::to_string(status) + " and recorded no cause";
  return RaiseNew("VLXJBXInfraERR_1003", methodName, VLXUnicodeString(cause.c_str()), kLineNewError);
}

long VLXKDMJavaObject::CheckJavaClass(JNIEnv* env, jobject object, int javaClass, const char* operation)
{
  long status = VLX_S_OK;
  const ReplicaStubs* st = corvexa::FrameAccess::BoundTable(operation, status);
  if (!st) return status;
  if (!object) return corvexa::RejectValue(operation, "the Java object is null");
  const corvexa::Slot slot = static_cast<corvexa::Slot>(javaClass);
  if (VLXJBXJNIHelper::IsInstanceOf(env, object, st->Class(slot))) return VLX_S_OK;

  std::string expected = ReplicaStubs::ClassPath(slot);
  for (char& c : expected)
    if (c == '/') c = '.';
  return corvexa::RejectValue(operation,
                              "the Java object is " + corvexa::ClassText(env, object) + ", not a " + expected);
}

extern "C" int VELMORA_QKA2_INTERNAL_Corvexa() { return 1; }

extern "C" const char* CorvexaVersion() { return CORVEXA_VERSION; }
