#include "VLXKDMModel.h"

#include "CallFrame.h"
#include "ProxyMembers.h"
#include "VLXKDMReplica.h"

using namespace corvexa;

namespace {
// The value a selection compares with: a holder without type stands for no value (Java null).
struct Compared {
  VLXKDMInstanceValue& value;
};
}  // namespace

template <>
struct corvexa::ArgOf<Compared> {
  using J = jobject;
  static constexpr bool kOwnsRef = false;
  static constexpr bool kEarly = true;
  static long To(JNIEnv* env, const Compared& arg, J& out)
  {
    if (arg.value.GetType() == static_cast<VLXKDMInstanceValue::Type>(-1)) {
      out = nullptr;
      return VLX_S_OK;
    }
    return ArgOf<RemoteForm>::To(env, Remote(arg.value), out);
  }
};

VLXKDM_PROXY_DEFINITIONS(VLXKDMModel, Model)

long VLXKDMModel::Build(const VLXKDMClassDef& classDef)
{
  return Construct(*this, "VLXKDMModel::Build(const VLXKDMClassDef&)", Model, slot<Model_new_classDef>)
      .with(classDef)
      .construct();
}

long VLXKDMModel::CreateInstance(VLXKDMInstance& instance)
{
  return Call(*this, "VLXKDMModel::CreateInstance(VLXKDMInstance&)", slot<Model_createInstance>).returning(instance);
}

long VLXKDMModel::GetClassDef(VLXKDMClassDef& classDef) const
{
  return Call(*this, "VLXKDMModel::GetClassDef(VLXKDMClassDef&)", slot<Model_getClassDef>).returning(classDef);
}

long VLXKDMModel::GetInstances(VLXKDMInstanceSet& instances) const
{
  return Call(*this, "VLXKDMModel::GetInstances(VLXKDMInstanceSet&)", slot<Model_getInstances>).returning(instances);
}

long VLXKDMModel::FindInstance(const VLXUnicodeString& id, VLXKDMInstance& instance) const
{
  return Call(*this, "VLXKDMModel::FindInstance(const VLXUnicodeString&, VLXKDMInstance&)", slot<Model_findInstance>)
      .with(id)
      .returning(instance);
}

long VLXKDMModel::FindInstance(const VLXBinary& id, VLXKDMInstance& instance) const
{
  return Call(*this, "VLXKDMModel::FindInstance(const VLXBinary&, VLXKDMInstance&)", slot<Model_findInstance>)
      .with(id)
      .returning(instance);
}

long VLXKDMModel::SelectInstances(const VLXUnicodeString& attribute, VLXKDMInstanceValue& value,
                                  VLXBoolean withSubclasses, VLXListValVLXKDMInstance& instances) const
{
  return Call(*this,
              "VLXKDMModel::SelectInstances(const VLXUnicodeString&, VLXKDMInstanceValue&, VLXBoolean, "
              "VLXListValVLXKDMInstance&)",
              slot<Model_selectInstances>)
      .with(attribute, Compared{value}, withSubclasses)
      .returning(instances);
}

long VLXKDMModel::GetReplica(VLXKDMReplica& replica) const
{
  return Call(*this, "VLXKDMModel::GetReplica(VLXKDMReplica&)", slot<Model_getReplica>).returning(replica);
}

long VLXKDMModel::ToString(VLXUnicodeString& text) const
{
  return Call(*this, "VLXKDMModel::ToString(VLXUnicodeString&)", slot<Model_toString>).returning(text);
}
