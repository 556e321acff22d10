// What the native benchmarks share: hand-written JNI helpers (a local reference owner, exception
// checks, class and method lookups) and the replica classes they build through the library.
#pragma once

#include <jni.h>

#include <string>
#include <utility>
#include <vector>

#include "VLXKDMAttributeDef.h"
#include "VLXKDMAttributeDefList.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMInstance.h"
#include "VLXKDMInstanceSet.h"
#include "VLXKDMModel.h"
#include "VLXKDMModelSet.h"
#include "VLXKDMReplica.h"
#include "VLXUnicodeString.h"

namespace corvexa_bench {

// Owns one local reference of the hand-written code and deletes it on every path.
class Local {
 public:
  Local(JNIEnv* env, jobject ref) : _env(env), _ref(ref) {}
  ~Local()
  {
    if (_ref) _env->DeleteLocalRef(_ref);
  }
  Local(const Local&) = delete;
  Local& operator=(const Local&) = delete;
  jobject get() const { return _ref; }

 private:
  JNIEnv* _env;
  jobject _ref;
};

// After a Java call of the hand-written code: true when it threw (the exception is cleared).
inline bool Threw(JNIEnv* env)
{
  if (!env->ExceptionCheck()) return false;
  env->ExceptionClear();
  return true;
}

inline bool Fail(std::string& why, const std::string& what)
{
  why = what;
  return false;
}

// Adds the class className with its attributes (name, type, multi-valued) and its model.
inline bool AddClass(VLXKDMReplica& replica, const char* className,
                     const std::vector<std::pair<const char*, std::pair<VLXKDMAttributeType::Type, bool>>>& attributes,
                     VLXKDMModel& model)
{
  VLXKDMClassDef classDef;
  VLXKDMAttributeDefList list;
  if (classDef.Build(VLXUnicodeString(className)) < 0 || classDef.GetAttributes(list) < 0) return false;
  for (const auto& a : attributes) {
    VLXKDMAttributeDef attribute;
    if (attribute.Build(VLXUnicodeString(a.first), a.second.first) < 0) return false;
    if (attribute.SetMultiValuation(a.second.second ? 1 : 0) < 0) return false;
    if (list.Add(attribute) < 0) return false;
  }
  VLXKDMModelSet models;
  return model.Build(classDef) >= 0 && replica.GetModels(models) >= 0 && models.Add(model) >= 0;
}

inline jclass GlobalClass(JNIEnv* env, const char* path)
{
  Local local(env, env->FindClass(path));
  if (Threw(env) || !local.get()) return nullptr;
  return static_cast<jclass>(env->NewGlobalRef(local.get()));
}

inline jmethodID Method(JNIEnv* env, jclass cls, const char* name, const char* signature, bool isStatic = false)
{
  if (!cls) return nullptr;
  const jmethodID id = isStatic ? env->GetStaticMethodID(cls, name, signature) : env->GetMethodID(cls, name, signature);
  return Threw(env) ? nullptr : id;
}

// The text form (with values) of every instance of model, in order.
inline bool InstanceTexts(VLXKDMModel& model, std::vector<std::string>& texts)
{
  VLXKDMInstanceSet set;
  int count = 0;
  if (model.GetInstances(set) < 0 || set.GetCount(count) < 0) return false;
  for (int p = 0; p < count; ++p) {
    VLXKDMInstance x;
    VLXUnicodeString text;
    if (set.GetItem(p, x) < 0 || x.ToString(1, text) < 0) return false;
    texts.emplace_back(text.c_str(), text.GetLengthInByte());
  }
  return true;
}

}  // namespace corvexa_bench
