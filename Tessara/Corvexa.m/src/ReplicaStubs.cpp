// The binding table's rows and the one loop that resolves them.
#include "ReplicaStubs.h"

#include <cstdio>
#include <string>

#include "corvexa/Version.h"

#include "VLXError.h"
#include "VLXJBXException.h"
#include "VLXJBXJNIConverter.h"
#include "VLXJBXJNIHelper.h"
#include "VLXJBXJNIUtilities.h"
#include "VLXJBXLocalRef.h"
#include "VLXKDMJavaObject.h"
#include "VLXUnicodeString.h"

using namespace corvexa;

namespace {

const char* const kMethodName = "ReplicaStubs::init()";
// Fixed report path (and lines): callers and their tests match on them; keep them as they are.
const char* const kSourcePath = "Tessara\\Corvexa.m\\src\\ReplicaStubs.cpp";

// The slot resolved at step i: a getter marked SETTER_FIRST swaps places with the setter after it.
int SlotAtStep(int i)
{
  if (kBindingRows[i].kind == BindingKind::SetterFirst) return i + 1;
  if (i > 0 && kBindingRows[i - 1].kind == BindingKind::SetterFirst) return i - 1;
  return i;
}

}  // namespace

JNIEnv* ReplicaStubs::_env = nullptr;

const char* ReplicaStubs::ClassPath(Slot slot)
{
  return slot >= 0 && slot < SlotCount && kBindingRows[slot].kind == BindingKind::Class ? kBindingRows[slot].name
                                                                                        : nullptr;
}

ReplicaStubs::ReplicaStubs() : _state(kFilling) { _missing[0] = '\0'; }

long ReplicaStubs::init(JNIEnv* env)
{
  _env = env;
  for (int i = 0; i < SlotCount; ++i) {
    const BindingKind kind = kBindingRows[i].kind;
    if (kind == BindingKind::Class || kind == BindingKind::Constant || kind == BindingKind::Reserved)
      _slot[i] = nullptr;
  }

  jclass owner = nullptr;  // the class whose members follow
  const char* ownerPath = nullptr;
  for (int step = 0; step < SlotCount; ++step) {
    const int slot = SlotAtStep(step);
    const BindingRow& row = kBindingRows[slot];
    long status = VLX_S_OK;
    switch (row.kind) {
      case BindingKind::Class: {
        jclass cls = nullptr;
        status = VLXJBXJNIUtilities::NewGlobalRefForClass(_env, row.name, cls);
        if (status >= 0) _slot[slot] = owner = cls;
        ownerPath = row.name;
        if (status < 0) snprintf(_missing, sizeof _missing, "the Java class %s", row.name);
        break;
      }
      case BindingKind::Method:
      case BindingKind::SetterFirst:
      case BindingKind::Static: {
        jmethodID method = nullptr;
        status = row.kind == BindingKind::Static
                     ? VLXJBXJNIUtilities::GetStaticMethodID(_env, owner, row.name, row.signature, method)
                     : VLXJBXJNIUtilities::GetMethodID(_env, owner, row.name, row.signature, method);
        if (status >= 0) _slot[slot] = reinterpret_cast<void*>(method);
        if (status < 0)
          snprintf(_missing, sizeof _missing, "the Java %smethod %s.%s%s",
                   row.kind == BindingKind::Static ? "static " : "", ownerPath, row.name, row.signature);
        break;
      }
      case BindingKind::Constant: {
        char signature[256];
        snprintf(signature, sizeof signature, "L%s;", ownerPath);
        jfieldID field = nullptr;
        status = VLXJBXJNIUtilities::GetStaticFieldID(_env, owner, row.name, signature, field);
        if (status >= 0) {
          const VLXJBXLocalRef constant(_env, VLXJBXJNIHelper::GetStaticObjectField(_env, owner, field));
          _slot[slot] = VLXJBXJNIHelper::NewGlobalRef(_env, constant.get());
        } else {
          snprintf(_missing, sizeof _missing, "the Java constant %s.%s", ownerPath, row.name);
        }
        break;
      }
      case BindingKind::Reserved:
        break;
    }
    if (status < 0) {
      _state.store(kFailed, std::memory_order_release);
      return VLXKDMJavaObject::HandleReplicaError(_env, status, kMethodName);
    }
  }
  long result = VLXKDMJavaObject::HandleReplicaError(_env, VLX_S_OK, kMethodName);
  if (result < 0) snprintf(_missing, sizeof _missing, "a Java exception raised while binding");
  if (result >= 0) result = CheckVersion();
  _state.store(result < 0 ? kFailed : kBound, std::memory_order_release);
  return result;
}

// The replica package must be of the library's own version: another one is refused at start.
long ReplicaStubs::CheckVersion()
{
  const VLXJBXLocalRef version(
      _env, VLXJBXJNIHelper::CallStaticObjectMethod(_env, Class(Replica), Method(Replica_getVersion)));
  VLXUnicodeString text;
  long status = VLXJBXJNIHelper::ExceptionCheck(_env) ? VLX_E_FAIL : VLX_S_OK;
  if (status >= 0) status = VLXJBXJNIConverter::BuildFromJavaString(_env, static_cast<jstring>(version.get()), text);
  if (status >= 0 && std::string(text.c_str()) == CORVEXA_VERSION) return VLX_S_OK;
  snprintf(_missing, sizeof _missing, "a replica jar of version %s, the library's (the jar on the class path is version %s)",
           CORVEXA_VERSION, status >= 0 ? text.c_str() : "unknown");
  return VLXJBXException::Raise(VLX_E_FAIL, VLXJBXMessages::BindingMissing, {kMethodName, _missing}, kSourcePath,
                                __LINE__);
}

long ReplicaStubs::ReportUnbound(const char* methodName) const
{
  return VLXJBXException::Raise(VLX_E_FAIL, VLXJBXMessages::BindingMissing, {methodName, _missing}, kSourcePath,
                                __LINE__);
}
