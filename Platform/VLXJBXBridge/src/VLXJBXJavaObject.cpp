#include "VLXJBXJavaObject.h"

#include "VLXJBXException.h"
#include "VLXJBXInternal.h"
#include "VLXJBXJNIHelper.h"
#include "VLXResult.h"

#include <typeinfo>

VLXJBXJavaObject::VLXJBXJavaObject() : exchangedWithJava(0), _handle(nullptr) {}

VLXJBXJavaObject::VLXJBXJavaObject(const VLXJBXJavaObject& other)
    : VLXBaseUnknown(other), exchangedWithJava(other.exchangedWithJava), _handle(nullptr)
{
  if (other._handle != nullptr)
    if (JNIEnv* env = VLXJBXDetail::CurrentEnv()) _handle = VLXJBXJNIHelper::NewGlobalRef(env, other._handle);
}

VLXJBXJavaObject& VLXJBXJavaObject::operator=(const VLXJBXJavaObject& other)
{
  if (this == &other) return *this;
  VLXBaseUnknown::operator=(other);
  exchangedWithJava = other.exchangedWithJava;
  if (_handle == nullptr && other._handle == nullptr) return *this;
  JNIEnv* env = VLXJBXDetail::CurrentEnv();
  if (env == nullptr) return *this;  // a handle exists, so a JVM does: only an attach failure leads here
  // An object of the same dynamic type holds only what this one may hold.
  if (other._handle != nullptr && typeid(*this) != typeid(other) && AcceptObject(env, other._handle) < 0) return *this;
  // The new reference first: `other` may share the Java object with this.
  jobject replacement = other._handle != nullptr ? VLXJBXJNIHelper::NewGlobalRef(env, other._handle) : nullptr;
  VLXJBXJNIHelper::DeleteGlobalRef(env, _handle);
  _handle = replacement;
  return *this;
}

long VLXJBXJavaObject::AcceptObject(JNIEnv*, jobject) { return VLX_S_OK; }

VLXJBXJavaObject::~VLXJBXJavaObject()
{
  // No handle without a JVM; the environment comes from the calling thread's cache.
  if (_handle != nullptr)
    if (JNIEnv* env = VLXJBXDetail::CurrentEnv()) VLXJBXJNIHelper::DeleteGlobalRef(env, _handle);
}

long VLXJBXJavaObject::SetGlobalRef(JNIEnv* env, jobject object)
{
  if (env == nullptr) {
    if (object == nullptr && _handle == nullptr) return VLX_S_OK;
    env = VLXJBXDetail::CurrentEnv();
    if (env == nullptr) return VLX_E_FAIL;  // the last error says why
  }
  if (object != nullptr) {
    const long accepted = AcceptObject(env, object);
    if (VLX_FAILED(accepted)) return accepted;
  }
  return ReplaceGlobalRef(env, object);
}

long VLXJBXJavaObject::ReplaceGlobalRef(JNIEnv* env, jobject object)
{
  static const char kOperation[] = "VLXJBXJavaObject::SetGlobalRef";
  jobject replacement = nullptr;
  if (object != nullptr) {
    replacement = VLXJBXJNIHelper::NewGlobalRef(env, object);
    if (replacement == nullptr)
      return VLXJBXDetail::Raise(VLX_E_FAIL, VLXJBXMessages::OperationFailed,
                                 {kOperation,
                                  "no global reference could be made; the object may be a cleared weak "
                                  "reference or memory is exhausted"},
                                 __FILE__, __LINE__);
  }
  VLXJBXJNIHelper::DeleteGlobalRef(env, _handle);
  _handle = replacement;
  return VLX_S_OK;
}

int VLXJBXJavaObject::operator==(const VLXJBXJavaObject& other) const
{
  if (_handle == nullptr || other._handle == nullptr) return _handle == other._handle;
  if (_handle == other._handle) return 1;
  JNIEnv* env = VLXJBXDetail::CurrentEnv();
  return env != nullptr && env->IsSameObject(_handle, other._handle) == JNI_TRUE;
}
