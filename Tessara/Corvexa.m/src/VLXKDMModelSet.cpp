#include "VLXKDMModelSet.h"

#include "CallFrame.h"
#include "ProxyMembers.h"

using namespace corvexa;

VLXKDM_PROXY_DEFINITIONS(VLXKDMModelSet, ModelSet)

long VLXKDMModelSet::GetCount(int& count) const
{
  return Call(*this, "VLXKDMModelSet::GetCount(int&)", slot<ModelSet_getCount>).returning(count);
}

long VLXKDMModelSet::GetItem(int position, VLXKDMModel& model) const
{
  return Call(*this, "VLXKDMModelSet::GetItem(int, VLXKDMModel&)", slot<ModelSet_getItemAt>)
      .with(position)
      .returning(model);
}

long VLXKDMModelSet::GetItem(const VLXUnicodeString& className, VLXKDMModel& model) const
{
  return Call(*this, "VLXKDMModelSet::GetItem(const VLXUnicodeString&, VLXKDMModel&)", slot<ModelSet_getItemNamed>)
      .with(className)
      .returning(model);
}

long VLXKDMModelSet::Includes(const VLXUnicodeString& className, VLXBoolean& included) const
{
  return Call(*this, "VLXKDMModelSet::Includes(const VLXUnicodeString&, VLXBoolean&)", slot<ModelSet_includes>)
      .rawConversionCode()
      .with(className)
      .returning(included);
}

long VLXKDMModelSet::IndexOf(const VLXKDMClassDef& classDef, int& position) const
{
  return Call(*this, "VLXKDMModelSet::IndexOf(const VLXKDMClassDef&, int&)", slot<ModelSet_indexOf>)
      .with(classDef)
      .returning(position);
}

long VLXKDMModelSet::IndexOf(const VLXUnicodeString& className, int& position) const
{
  return Call(*this, "VLXKDMModelSet::IndexOf(const VLXUnicodeString&, int&)", slot<ModelSet_indexOfNamed>)
      .with(className)
      .returning(position);
}

long VLXKDMModelSet::Add(const VLXKDMModel& model)
{
  return Call(*this, "VLXKDMModelSet::Add(const VLXKDMModel&)", slot<ModelSet_add>).with(model).run();
}

long VLXKDMModelSet::Remove(const VLXKDMClassDef& classDef)
{
  return Call(*this, "VLXKDMModelSet::Remove(const VLXKDMClassDef&)", slot<ModelSet_remove>).with(classDef).run();
}

long VLXKDMModelSet::Remove(const VLXUnicodeString& className)
{
  return Call(*this, "VLXKDMModelSet::Remove(const VLXUnicodeString&)", slot<ModelSet_removeNamed>)
      .with(className)
      .run();
}

long VLXKDMModelSet::Remove(int position)
{
  return Call(*this, "VLXKDMModelSet::Remove(int)", slot<ModelSet_removeAt>).with(position).run();
}
