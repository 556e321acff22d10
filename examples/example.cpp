// A tour of the library: start the Java side, build and name a replica, look into it, commit it,
// and see how a failure comes back.
#include <cstdio>
#include <string>

#include "VLXError.h"
#include "VLXKDMReplica.h"

namespace {

std::string Text(const VLXUnicodeString& s) { return std::string(s.c_str(), s.GetLengthInByte()); }

// Prints what an operation returned and, on failure, the thread's last error.
bool Report(const char* what, long rc)
{
  if (VLX_SUCCEEDED(rc)) {
    std::printf("%-44s ok\n", what);
    return true;
  }
  std::printf("%-44s failed with 0x%08lx\n", what, static_cast<unsigned long>(rc) & 0xffffffffUL);
  if (VLXError* error = VLXError::VLXGetLastError(rc, nullptr)) {
    std::printf("    last error %s: %s\n", error->GetId(), error->GetMessageText().c_str());
    error->Release();
  }
  return false;
}

}  // namespace

int main()
{
  VLXKDMReplica replica;
  if (!Report("Build a replica named \"inventory\"", replica.Build(VLXUnicodeString("inventory")))) return 1;

  VLXUnicodeString name;
  Report("Rename it to \"inventory 2026\"", replica.SetName(VLXUnicodeString("inventory 2026")));
  Report("Read its name back", replica.GetName(name));
  std::printf("    name: %s\n", Text(name).c_str());

  VLXUnicodeString text;
  Report("Its text form", replica.ToString(text));
  std::printf("    %s\n", Text(text).c_str());

  VLXKDMModelSet models;
  Report("Reach its model set", replica.GetModels(models));

  VLXKDMClassDef part;
  Report("Look up the class \"Part\"", replica.GetClassDef(VLXUnicodeString("Part"), part));
  std::printf("    %s\n", part.GetHandle() ? "found" : "the replica has no class named Part");
  VLXKDMAttributeDef weight;
  Report("Look up the attribute \"Part.weight\"", replica.GetAttributeDef(VLXUnicodeString("Part.weight"), weight));
  std::printf("    %s\n", weight.GetHandle() ? "found" : "the replica has no attribute Part.weight");

  Report("Commit", replica.Commit());

  std::printf("\nHow a failure comes back:\n");
  VLXKDMReplica unbuilt;
  Report("Read the name of a replica never built", unbuilt.GetName(name));
  Report("Rename with malformed UTF-8", replica.SetName(VLXUnicodeString("bad \xC3\x28 text")));
  return 0;
}
