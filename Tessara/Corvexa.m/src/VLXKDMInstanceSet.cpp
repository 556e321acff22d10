#include "VLXKDMInstanceSet.h"

#include "CallFrame.h"
#include "ProxyMembers.h"

using namespace corvexa;

VLXKDM_PROXY_DEFINITIONS(VLXKDMInstanceSet, InstanceSet)

long VLXKDMInstanceSet::GetCount(int& count) const
{
  return Call(*this, "VLXKDMInstanceSet::GetCount(int&)", slot<InstanceSet_getCount>).returning(count);
}

long VLXKDMInstanceSet::GetItem(int position, VLXKDMInstance& instance) const
{
  return Call(*this, "VLXKDMInstanceSet::GetItem(int, VLXKDMInstance&)", slot<InstanceSet_getItem>)
      .with(position)
      .returning(instance);
}

long VLXKDMInstanceSet::IndexOf(const VLXKDMInstance& instance, int& position) const
{
  return Call(*this, "VLXKDMInstanceSet::IndexOf(const VLXKDMInstance&, int&)", slot<InstanceSet_indexOf>)
      .with(instance)
      .returning(position);
}

long VLXKDMInstanceSet::Remove(const VLXKDMInstance& instance)
{
  return Call(*this, "VLXKDMInstanceSet::Remove(const VLXKDMInstance&)", slot<InstanceSet_remove>).with(instance).run();
}

long VLXKDMInstanceSet::Remove(int position)
{
  return Call(*this, "VLXKDMInstanceSet::Remove(int)", slot<InstanceSet_removeAt>).with(position).run();
}

long VLXKDMInstanceSet::RemoveAll()
{
  return Call(*this, "VLXKDMInstanceSet::RemoveAll()", slot<InstanceSet_removeAll>).run();
}
