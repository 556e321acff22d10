#include "VLXKDMModelSet.h"

#include "CallFrame.h"
#include "ProxyMembers.h"

using namespace corvexa;

VLXKDM_PROXY_DEFINITIONS(VLXKDMModelSet, ModelSet)

long VLXKDMModelSet::GetCount(int& count)
{
  return Call(*this, "VLXKDMModelSet::GetCount(int&)", ModelSet_getCount).returning(count);
}

long VLXKDMModelSet::GetItem(int position, VLXKDMModel& model)
{
  return Call(*this, "VLXKDMModelSet::GetItem(int, VLXKDMModel&)", ModelSet_getItemAt)
      .with(position)
      .returning(model);
}

long VLXKDMModelSet::GetItem(const VLXUnicodeString& className, VLXKDMModel& model)
{
  return Call(*this, "VLXKDMModelSet::GetItem(const VLXUnicodeString&, VLXKDMModel&)", ModelSet_getItemNamed)
      .with(className)
      .returning(model);
}

long VLXKDMModelSet::Includes(const VLXUnicodeString& className, VLXBoolean& included)
{
  return Call(*this, "VLXKDMModelSet::Includes(const VLXUnicodeString&, VLXBoolean&)", ModelSet_includes)
      .rawConversionCode()
      .with(className)
      .returning(included);
}

long VLXKDMModelSet::IndexOf(const VLXKDMClassDef& classDef, int& position)
{
  return Call(*this, "VLXKDMModelSet::IndexOf(const VLXKDMClassDef&, int&)", ModelSet_indexOf)
      .with(classDef)
      .returning(position);
}

long VLXKDMModelSet::IndexOf(const VLXUnicodeString& className, int& position)
{
  return Call(*this, "VLXKDMModelSet::IndexOf(const VLXUnicodeString&, int&)", ModelSet_indexOfNamed)
      .with(className)
      .returning(position);
}

long VLXKDMModelSet::Add(const VLXKDMModel& model)
{
  return Call(*this, "VLXKDMModelSet::Add(const VLXKDMModel&)", ModelSet_add).with(model).run();
}

long VLXKDMModelSet::Remove(const VLXKDMClassDef& classDef)
{
  return Call(*this, "VLXKDMModelSet::Remove(const VLXKDMClassDef&)", ModelSet_remove).with(classDef).run();
}

long VLXKDMModelSet::Remove(const VLXUnicodeString& className)
{
  return Call(*this, "VLXKDMModelSet::Remove(const VLXUnicodeString&)", ModelSet_removeNamed).with(className).run();
}

long VLXKDMModelSet::Remove(int position)
{
  return Call(*this, "VLXKDMModelSet::Remove(int)", ModelSet_removeAt).with(position).run();
}
