#include "VLXKDMModel.h"

#include "CallFrame.h"
#include "ProxyMembers.h"
#include "VLXKDMReplica.h"

using namespace corvexa;

VLXKDM_PROXY_DEFINITIONS(VLXKDMModel, Model)

long VLXKDMModel::Build(const VLXKDMClassDef& classDef)
{
  return Call::Construct(*this, "VLXKDMModel::Build(const VLXKDMClassDef&)", Model, Model_new_classDef)
      .with(classDef)
      .construct();
}

long VLXKDMModel::CreateInstance(VLXKDMInstance& instance)
{
  return Call(*this, "VLXKDMModel::CreateInstance(VLXKDMInstance&)", Model_createInstance).returning(instance);
}

long VLXKDMModel::GetClassDef(VLXKDMClassDef& classDef)
{
  return Call(*this, "VLXKDMModel::GetClassDef(VLXKDMClassDef&)", Model_getClassDef).returning(classDef);
}

long VLXKDMModel::GetInstances(VLXKDMInstanceSet& instances)
{
  return Call(*this, "VLXKDMModel::GetInstances(VLXKDMInstanceSet&)", Model_getInstances).returning(instances);
}

long VLXKDMModel::GetReplica(VLXKDMReplica& replica)
{
  return Call(*this, "VLXKDMModel::GetReplica(VLXKDMReplica&)", Model_getReplica).returning(replica);
}

long VLXKDMModel::ToString(VLXUnicodeString& text)
{
  return Call(*this, "VLXKDMModel::ToString(VLXUnicodeString&)", Model_toString).returning(text);
}
