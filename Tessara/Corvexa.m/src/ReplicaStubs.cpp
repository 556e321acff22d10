// The binding table's rows and the one loop that resolves them.
#include "ReplicaStubs.h"

#include <cstdio>

#include "VLXError.h"
#include "VLXJBXException.h"
#include "VLXJBXJNIHelper.h"
#include "VLXJBXJNIUtilities.h"
#include "VLXJBXLocalRef.h"
#include "VLXKDMJavaObject.h"
#include "VLXUnicodeString.h"

using namespace corvexa;

namespace {

enum class Kind { Class, Method, Static, SetterFirst, Constant, Reserved };

struct Row {
  Kind kind;
  const char* name;       // class path, member or field name
  const char* signature;  // methods only
};

constexpr Row kRows[] = {
#define CLASS(name, path) {Kind::Class, path, nullptr},
#define METHOD(name, member, signature) {Kind::Method, member, signature},
#define STATIC(name, member, signature) {Kind::Static, member, signature},
#define SETTER_FIRST(name, member, signature) {Kind::SetterFirst, member, signature},
#define CONSTANT(name, field) {Kind::Constant, field, nullptr},
#define RESERVED(name) {Kind::Reserved, nullptr, nullptr},
#include "BindingTable.def"
#undef CLASS
#undef METHOD
#undef STATIC
#undef SETTER_FIRST
#undef CONSTANT
#undef RESERVED
};
static_assert(sizeof(kRows) / sizeof(kRows[0]) == SlotCount, "one row per slot");

const char* const kMethodName = "ReplicaStubs::init()";
// Fixed report path (and lines): callers and their tests match on them; keep them as they are.
const char* const kSourcePath = "Tessara\\Corvexa.m\\src\\ReplicaStubs.cpp";

// The slot resolved at step i: a getter marked SETTER_FIRST swaps places with the setter after it.
int SlotAtStep(int i)
{
  if (kRows[i].kind == Kind::SetterFirst) return i + 1;
  if (i > 0 && kRows[i - 1].kind == Kind::SetterFirst) return i - 1;
  return i;
}

}  // namespace

JNIEnv* ReplicaStubs::_env = nullptr;

const char* ReplicaStubs::ClassPath(Slot slot)
{
  return slot >= 0 && slot < SlotCount && kRows[slot].kind == Kind::Class ? kRows[slot].name : nullptr;
}

ReplicaStubs::ReplicaStubs() : _state(kFilling) { _missing[0] = '\0'; }

long ReplicaStubs::init(JNIEnv* env)
{
  _env = env;
  for (int i = 0; i < SlotCount; ++i) {
    const Kind kind = kRows[i].kind;
    if (kind == Kind::Class || kind == Kind::Constant || kind == Kind::Reserved) _slot[i] = nullptr;
  }

  jclass owner = nullptr;          // the class whose members follow
  const char* ownerPath = nullptr;
  for (int step = 0; step < SlotCount; ++step) {
    const int slot = SlotAtStep(step);
    const Row& row = kRows[slot];
    long status = VLX_S_OK;
    switch (row.kind) {
      case Kind::Class: {
        jclass cls = nullptr;
        status = VLXJBXJNIUtilities::NewGlobalRefForClass(_env, row.name, cls);
        if (status >= 0) _slot[slot] = owner = cls;
        ownerPath = row.name;
        if (status < 0) snprintf(_missing, sizeof _missing, "the Java class %s", row.name);
        break;
      }
      case Kind::Method:
      case Kind::SetterFirst:
      case Kind::Static: {
        jmethodID method = nullptr;
        status = row.kind == Kind::Static
                     ? VLXJBXJNIUtilities::GetStaticMethodID(_env, owner, row.name, row.signature, method)
                     : VLXJBXJNIUtilities::GetMethodID(_env, owner, row.name, row.signature, method);
        if (status >= 0) _slot[slot] = reinterpret_cast<void*>(method);
        if (status < 0)
          snprintf(_missing, sizeof _missing, "the Java %smethod %s.%s%s",
                   row.kind == Kind::Static ? "static " : "", ownerPath, row.name, row.signature);
        break;
      }
      case Kind::Constant: {
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
      case Kind::Reserved:
        break;
    }
    if (status < 0) {
      _state.store(kFailed, std::memory_order_release);
      return VLXKDMJavaObject::HandleReplicaError(_env, status, kMethodName);
    }
  }
  const long result = VLXKDMJavaObject::HandleReplicaError(_env, VLX_S_OK, kMethodName);
  if (result < 0) snprintf(_missing, sizeof _missing, "a Java exception raised while binding");
  _state.store(result < 0 ? kFailed : kBound, std::memory_order_release);
  return result;
}

long ReplicaStubs::ReportUnbound(const char* methodName) const
{
  return VLXJBXException::Raise(VLX_E_FAIL, VLXJBXMessages::BindingMissing, {methodName, _missing}, kSourcePath,
                                __LINE__);
}
