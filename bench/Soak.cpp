// corvexa-soak: a long run of ordinary operations on one replica (create an instance, set and get
// values, delete, commit), then a churn of short-lived threads that each make a few calls. At each
// million operations, and every 5,000 threads, it prints the bridge's global reference count, the
// Java heap live after a collection, the resident memory and the thread count: steady figures mean
// nothing leaks. Figures, not a test (scripts/run-soak); exits non-zero when an operation fails.
//   corvexa-soak [operations (10,000,000)] [threads (20,000)]
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include "VLXError.h"
#include "VLXJBXJNIUtilities.h"
#include "VLXKDMAttributeDef.h"
#include "VLXKDMAttributeDefList.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMInstance.h"
#include "VLXKDMInstanceSet.h"
#include "VLXKDMInstanceValue.h"
#include "VLXKDMModel.h"
#include "VLXKDMModelSet.h"
#include "VLXKDMReplica.h"

namespace {

const auto g_start = std::chrono::steady_clock::now();

void Check(long rc, const char* what)
{
  if (VLX_SUCCEEDED(rc)) return;
  VLXError* error = VLXError::VLXGetLastError(rc, nullptr);
  std::fprintf(stderr, "corvexa-soak: %s failed: %s\n", what, error ? error->GetMessageText().c_str() : "?");
  std::exit(1);
}

// A line of /proc/self/status ("VmRSS", "Threads"), as written there.
std::string Status(const std::string& key)
{
  std::ifstream in("/proc/self/status");
  for (std::string line; std::getline(in, line);)
    if (line.compare(0, key.size() + 1, key + ":") == 0) return line.substr(line.find_first_not_of(" \t", key.size() + 1));
  return "?";
}

// The Java heap in use after a collection: what is still reachable (retired thread-local buffers
// of detached threads would otherwise count as used until the next collection).
long JavaHeapUsedKb()
{
  JNIEnv* env = nullptr;
  if (VLX_FAILED(VLXJBXJNIUtilities::GetJNIEnv(env, VLXListValVLXUnicodeString()))) return -1;
  jclass cls = env->FindClass("java/lang/Runtime");
  jobject runtime = env->CallStaticObjectMethod(cls, env->GetStaticMethodID(cls, "getRuntime", "()Ljava/lang/Runtime;"));
  env->CallVoidMethod(runtime, env->GetMethodID(cls, "gc", "()V"));
  const jlong used = env->CallLongMethod(runtime, env->GetMethodID(cls, "totalMemory", "()J")) -
                     env->CallLongMethod(runtime, env->GetMethodID(cls, "freeMemory", "()J"));
  env->DeleteLocalRef(runtime);
  env->DeleteLocalRef(cls);
  return static_cast<long>(used / 1024);
}

void Report(const char* what, long done)
{
  const double seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - g_start).count();
  std::printf("%-8s %10ld  global refs %6ld  Java heap live %8ld kB  RSS %-10s  threads %-4s  %7.1f s\n", what, done,
              VLXJBXJNIUtilities::GetGlobalRefCount(), JavaHeapUsedKb(), Status("VmRSS").c_str(),
              Status("Threads").c_str(), seconds);
  std::fflush(stdout);
}

}  // namespace

int main(int argc, char** argv)
{
  const long operations = argc > 1 ? std::atol(argv[1]) : 10000000L;
  const long threads = argc > 2 ? std::atol(argv[2]) : 20000L;

  VLXKDMReplica replica;
  VLXKDMClassDef item;
  VLXKDMAttributeDefList attributes;
  VLXKDMAttributeDef n, s, d;
  VLXKDMModel model;
  VLXKDMModelSet models;
  VLXKDMInstanceSet instances;
  Check(replica.Build(VLXUnicodeString("soak")), "Build");
  Check(item.Build(VLXUnicodeString("Item")), "ClassDef::Build");
  Check(item.GetAttributes(attributes), "GetAttributes");
  Check(n.Build(VLXUnicodeString("n"), VLXKDMAttributeType::Integer), "AttributeDef::Build");
  Check(s.Build(VLXUnicodeString("s"), VLXKDMAttributeType::String), "AttributeDef::Build");
  Check(d.Build(VLXUnicodeString("d"), VLXKDMAttributeType::Double), "AttributeDef::Build");
  for (VLXKDMAttributeDef* a : {&n, &s, &d}) Check(attributes.Add(*a), "AttributeDefList::Add");
  Check(model.Build(item), "Model::Build");
  Check(replica.GetModels(models), "GetModels");
  Check(models.Add(model), "ModelSet::Add");
  Check(model.GetInstances(instances), "GetInstances");
  Report("start", 0);

  // The mix, out of 16: 2 creations with their three values (sets once 1,000 instances live),
  // 6 sets, 1 deletion, 7 gets; every 1,000th operation a commit. Choices from a fixed generator.
  std::vector<VLXKDMInstance> live;
  unsigned long state = 12345;
  const VLXUnicodeString nName("n"), sName("s"), dName("d"), text("a value of some length \xE2\x9C\x93");
  VLXKDMInstanceValue value;
  for (long op = 1; op <= operations; ++op) {
    state = state * 6364136223846793005UL + 1442695040888963407UL;
    const unsigned kind = static_cast<unsigned>(state >> 60);
    VLXKDMInstance* some = live.empty() ? nullptr : &live[(state >> 20) % live.size()];
    if (op % 1000 == 0) {
      Check(replica.Commit(), "Commit");
    } else if (!some || (kind < 2 && live.size() < 1000)) {
      live.emplace_back();
      Check(model.CreateInstance(live.back()), "CreateInstance");
      Check(live.back().SetValue(nName, 0), "SetValue");
      Check(live.back().SetValue(sName, text), "SetValue");
      Check(live.back().SetValue(dName, 0.0), "SetValue");
    } else if (kind < 8) {
      Check(kind % 3 == 0   ? some->SetValue(nName, static_cast<int>(op))
            : kind % 3 == 1 ? some->SetValue(sName, text)
                            : some->SetValue(dName, op * 0.5),
            "SetValue");
    } else if (kind == 8) {
      Check(instances.Remove(*some), "InstanceSet::Remove");
      *some = live.back();
      live.pop_back();
    } else {
      Check(some->GetValue(kind % 3 == 0 ? nName : kind % 3 == 1 ? sName : dName, value), "GetValue");
    }
    if (op % 1000000 == 0) Report("ops", op);
  }
  Check(replica.Commit(), "Commit");
  Report("ops done", operations);

  // Thread churn: up to 8 at a time, each attached on its first call and detached at its exit.
  VLXKDMInstance shared;
  Check(model.CreateInstance(shared), "CreateInstance");
  Check(shared.SetValue(nName, 1), "SetValue");
  for (long started = 0; started < threads;) {
    std::vector<std::thread> batch;
    for (int i = 0; i < 8 && started < threads; ++i, ++started)
      batch.emplace_back([&shared, &model, started] {
        VLXKDMInstance own;
        VLXKDMInstanceValue got;
        Check(model.CreateInstance(own), "CreateInstance (thread)");
        Check(own.SetValue(VLXUnicodeString("n"), static_cast<int>(started)), "SetValue (thread)");
        Check(own.GetValue(VLXUnicodeString("n"), got), "GetValue (thread)");
        Check(shared.GetValue(VLXUnicodeString("n"), got), "GetValue (thread)");
      });
    for (std::thread& t : batch) t.join();
    if (started % 5000 == 0) Report("threads", started);
  }
  Check(replica.Commit(), "Commit");
  Report("end", threads);
  return 0;
}
