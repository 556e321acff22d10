// An application built against an installed Corvexa: it must find the JVM and the replica jar on
// its own.
#include <cstdio>
#include <string>

#include "VLXKDMReplica.h"

int main()
{
  VLXKDMReplica replica;
  if (replica.Build(VLXUnicodeString("installed")) != VLX_S_OK) return 1;
  VLXUnicodeString name;
  if (replica.GetName(name) != VLX_S_OK) return 2;
  std::printf("consumer sees replica '%s'\n", name.c_str());
  return std::string(name.c_str()) == "installed" ? 0 : 3;
}
