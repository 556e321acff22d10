// The instances of one model, reached through VLXKDMModel::GetInstances, in creation order.
// Positions pass to Java unchanged and count from 0; IndexOf answers -1 for an instance that is not
// in the set; a position out of range, or removing an instance that is not there, fails with the
// Java side's error. On failure, out-parameters are left as they were.
#pragma once

#include "VLXKDMInstance.h"
#include "VLXKDMJavaObject.h"

class CORVEXA_API VLXKDMInstanceSet : public VLXKDMJavaObject {
  VLXKDM_PROXY_SPECIAL_MEMBERS(VLXKDMInstanceSet)

 public:
  long GetCount(int& count) const;
  // Attaches instance to the instance at position (from 0).
  long GetItem(int position, VLXKDMInstance& instance) const;
  long IndexOf(const VLXKDMInstance& instance, int& position) const;
  // Removes an instance: it is marked deleted until the next commit (one created since the last
  // commit simply disappears), and so are the instances it holds by composition. Proxies attached
  // to removed instances stay attached.
  long Remove(const VLXKDMInstance& instance);
  long Remove(int position);
  long RemoveAll();
};
