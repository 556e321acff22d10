// Start-up of the Java side, one scenario per process (ctest runs each with its own environment):
// a replica jar that lacks a class, a JVM that cannot be created, and many first calls at once.
#include <unistd.h>

#include <atomic>
#include <cstdio>
#include <fstream>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "JavaTestSupport.h"
#include "ReplicaStubs.h"
#include "VLXKDMReplica.h"

using namespace corvexa_test;
using namespace corvexa;

namespace {

// Reads the binding table the way the proxies do.
struct TableReader : VLXKDMJavaObject {
  static ReplicaStubs* Table() { return _st.load(); }
};

// Captures what the process writes to standard output while it lives.
class StdoutCapture {
 public:
  StdoutCapture() : _path("/tmp/corvexa-startup-" + std::to_string(getpid()) + ".out")
  {
    fflush(stdout);
    _saved = dup(STDOUT_FILENO);
    FILE* file = fopen(_path.c_str(), "w");
    dup2(fileno(file), STDOUT_FILENO);
    fclose(file);
  }
  std::string Finish()
  {
    fflush(stdout);
    dup2(_saved, STDOUT_FILENO);
    close(_saved);
    std::ifstream in(_path);
    std::stringstream text;
    text << in.rdbuf();
    std::remove(_path.c_str());
    return text.str();
  }

 private:
  std::string _path;
  int _saved;
};

TEST(StartupMissingClass, InitStopsAtTheMissingClassAndEveryOperationFailsCleanly)
{
  StdoutCapture capture;
  VLXKDMReplica replica;
  const long first = replica.Build(VLXUnicodeString("never"));
  const std::string output = capture.Finish();

  EXPECT_EQ("Error ReplicaStubs::Init\n", output);
  EXPECT_EQ(VLX_E_FAIL, first);
  EXPECT_EQ(nullptr, replica.GetHandle());
  LastError error = PeekLastError();
  EXPECT_EQ("VLXJBXInfraERR_1010", error.id);
  EXPECT_NE(std::string::npos, error.text.find("VLXKDMReplica::Build(const VLXUnicodeString&)")) << error.text;
  EXPECT_NE(std::string::npos, error.text.find("com/velmora/tessara/ReplicaHolder")) << error.text;

  // The table stays installed: the classes before the missing one are resolved, those after not.
  const ReplicaStubs* table = TableReader::Table();
  ASSERT_NE(nullptr, table);
  EXPECT_FALSE(table->IsBound());
  EXPECT_NE(nullptr, table->Class(Replica));
  EXPECT_NE(nullptr, table->Method(Replica_getName));
  EXPECT_EQ(nullptr, table->Class(ReplicaHolder));
  EXPECT_EQ(nullptr, table->Class(String));
  EXPECT_EQ(nullptr, table->Constant(Visibility_Private));

  // Later operations fail the same way, without calling Java and without printing again.
  StdoutCapture again;
  VLXUnicodeString name("kept");
  EXPECT_EQ(VLX_E_FAIL, replica.GetName(name));  // not built
  EXPECT_EQ(VLX_E_FAIL, replica.Build());
  EXPECT_EQ("", again.Finish());
  EXPECT_EQ("kept", Text(name));
  EXPECT_EQ("VLXJBXInfraERR_1010", PeekLastError().id);
  EXPECT_FALSE(Env()->ExceptionCheck());
}

TEST(StartupNoJvm, AJvmThatCannotBeCreatedRaisesTheNoEnvironmentError)
{
  StdoutCapture capture;
  VLXKDMReplica replica;
  const long first = replica.Build();
  VLXUnicodeString name("kept");
  const long second = replica.GetName(name);
  const std::string output = capture.Finish();

  EXPECT_EQ("Error VLXJBXJNIUtilities::GetJNIEnv\nError VLXJBXJNIUtilities::GetJNIEnv\n", output);
  EXPECT_LT(first, 0);
  EXPECT_LT(second, 0);
  EXPECT_EQ("kept", Text(name));
  const LastError error = PeekLastError();
  EXPECT_EQ("VLXJBXInfraERR_1002", error.id);
  ASSERT_EQ(1u, error.parameters.size());
  EXPECT_EQ("VLXKDMReplica::GetName(VLXUnicodeString&)", error.parameters[0]);
  EXPECT_EQ(nullptr, TableReader::Table());
}

TEST(StartupConcurrent, SixteenFirstCallsAtOnceCreateAndFillTheTableOnce)
{
  constexpr int kThreads = 16;
  std::atomic<int> ready{0};
  std::atomic<int> failures{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&, t] {
      ++ready;
      while (ready.load() < kThreads) {
      }
      VLXKDMReplica replica;
      const std::string name = "thread-" + std::to_string(t);
      if (replica.Build(VLXUnicodeString(name.c_str())) != VLX_S_OK) ++failures;
      VLXUnicodeString back;
      if (replica.GetName(back) != VLX_S_OK || Text(back) != name) ++failures;
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(0, failures.load());

  const ReplicaStubs* table = TableReader::Table();
  ASSERT_NE(nullptr, table);
  EXPECT_TRUE(table->IsBound());
  // With every proxy gone, the only global references left are the table's own: 27 classes and
  // 17 constants. A second filling would have doubled them.
  EXPECT_EQ(27 + 17, VLXJBXJNIUtilities::GetGlobalRefCount());
}

}  // namespace
