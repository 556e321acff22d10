#include "VLXKDMAttributeDefList.h"

#include "CallFrame.h"
#include "ProxyMembers.h"

using namespace corvexa;

VLXKDM_PROXY_DEFINITIONS(VLXKDMAttributeDefList, AttributeDefList)

long VLXKDMAttributeDefList::GetCount(int& count) const
{
  return Call(*this, "VLXKDMAttributeDefList::GetCount(int&)", slot<AttributeDefList_getCount>).returning(count);
}

long VLXKDMAttributeDefList::GetItem(int position, VLXKDMAttributeDef& item) const
{
  return Call(*this, "VLXKDMAttributeDefList::GetItem(int, VLXKDMAttributeDef&)", slot<AttributeDefList_getItemAt>)
      .with(position)
      .returning(item);
}

long VLXKDMAttributeDefList::GetItem(const VLXUnicodeString& name, VLXKDMAttributeDef& item) const
{
  return Call(*this, "VLXKDMAttributeDefList::GetItem(const VLXUnicodeString&, VLXKDMAttributeDef&)",
              slot<AttributeDefList_getItemNamed>)
      .with(name)
      .returning(item);
}

long VLXKDMAttributeDefList::Includes(const VLXUnicodeString& name, VLXBoolean& included) const
{
  return Call(*this, "VLXKDMAttributeDefList::Includes(const VLXUnicodeString&, VLXBoolean&)",
              slot<AttributeDefList_includes>)
      .with(name)
      .returning(included);
}

long VLXKDMAttributeDefList::IndexOf(const VLXKDMAttributeDef& item, int& position) const
{
  return Call(*this, "VLXKDMAttributeDefList::IndexOf(const VLXKDMAttributeDef&, int&)", slot<AttributeDefList_indexOf>)
      .with(item)
      .returning(position);
}

long VLXKDMAttributeDefList::IndexOf(const VLXUnicodeString& name, int& position) const
{
  return Call(*this, "VLXKDMAttributeDefList::IndexOf(const VLXUnicodeString&, int&)",
              slot<AttributeDefList_indexOfNamed>)
      .with(name)
      .returning(position);
}

long VLXKDMAttributeDefList::Add(const VLXKDMAttributeDef& item)
{
  return Call(*this, "VLXKDMAttributeDefList::Add(const VLXKDMAttributeDef&)", slot<AttributeDefList_add>)
      .with(item)
      .run();
}

long VLXKDMAttributeDefList::Remove(const VLXKDMAttributeDef& item)
{
  return Call(*this, "VLXKDMAttributeDefList::Remove(const VLXKDMAttributeDef&)", slot<AttributeDefList_remove>)
      .with(item)
      .run();
}

long VLXKDMAttributeDefList::Remove(const VLXUnicodeString& name)
{
  return Call(*this, "VLXKDMAttributeDefList::Remove(const VLXUnicodeString&)", slot<AttributeDefList_removeNamed>)
      .with(name)
      .run();
}

long VLXKDMAttributeDefList::Remove(int position)
{
  return Call(*this, "VLXKDMAttributeDefList::Remove(int)", slot<AttributeDefList_removeAt>).with(position).run();
}
