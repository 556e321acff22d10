#include "VLXKDMReplica.h"

#include "CallFrame.h"
#include "ProxyMembers.h"

using namespace corvexa;

VLXKDM_PROXY_DEFINITIONS(VLXKDMReplica)

long VLXKDMReplica::Build()
{
  return Call::Construct(*this, "VLXKDMReplica::Build()", Replica, Replica_new).construct();
}

long VLXKDMReplica::Build(const VLXUnicodeString& name)
{
  return Call::Construct(*this, "VLXKDMReplica::Build(const VLXUnicodeString&)", Replica, Replica_new_name)
      .with(name)
      .construct();
}

long VLXKDMReplica::GetName(VLXUnicodeString& name)
{
  return Call(*this, "VLXKDMReplica::GetName(VLXUnicodeString&)", Replica_getName).returning(name);
}

long VLXKDMReplica::SetName(const VLXUnicodeString& name)
{
  return Call(*this, "VLXKDMReplica::SetName(const VLXUnicodeString&)", Replica_setName)
      .rawConversionCode()
      .with(name)
      .run();
}

long VLXKDMReplica::ToString(VLXUnicodeString& text)
{
  return Call(*this, "VLXKDMReplica::ToString(VLXUnicodeString&)", Replica_toString).returning(text);
}

long VLXKDMReplica::Commit()
{
  return Call(*this, "VLXKDMReplica::Commit()", Replica_commit).run();
}

long VLXKDMReplica::GetModels(VLXKDMModelSet& models)
{
  return Call(*this, "VLXKDMReplica::GetModels(VLXKDMModelSet&)", Replica_getModels).returning(models);
}

long VLXKDMReplica::GetClassDef(const VLXUnicodeString& className, VLXKDMClassDef& classDef)
{
  return Call(*this, "VLXKDMReplica::GetClassDef(const VLXUnicodeString&, VLXKDMClassDef&)", Replica_getClassDef)
      .with(className)
      .returning(classDef);
}

long VLXKDMReplica::GetAttributeDef(const VLXUnicodeString& attributeName, VLXKDMAttributeDef& attributeDef)
{
  return Call(*this, "VLXKDMReplica::GetAttributeDef(const VLXUnicodeString&, VLXKDMAttributeDef&)",
              Replica_getAttributeDef)
      .with(attributeName)
      .returning(attributeDef);
}
