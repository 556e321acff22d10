// Start-up of the Java side, one scenario per process (ctest runs each with its own environment):
// a replica jar that lacks a class, a JVM that is not created (no replica jar, options that the JVM
// refuses or that would end the process), and many first calls at once.
#include <atomic>
#include <cstdlib>
#include <sstream>
#include <thread>

#include "TestSupport.h"
#include "ReplicaStubs.h"
#include "VLXJBXInternal.h"
#include "VLXKDMReplica.h"
#include "corvexa/Version.h"

using namespace corvexa_test;
using namespace corvexa;

namespace {

// Reads the binding table the way the proxies do.
struct TableReader : VLXKDMJavaObject {
  static ReplicaStubs* Table() { return _st.load(); }
};

// The process's standard streams are captured with GoogleTest's own capture (it flushes first).
using testing::internal::CaptureStderr;
using testing::internal::CaptureStdout;
using testing::internal::GetCapturedStderr;
using testing::internal::GetCapturedStdout;

// The live Java threads, as their set's text ("[Thread[main,5,main], ...]").
std::string JavaThreads()
{
  JNIEnv* env = Env();
  Local thread(env->FindClass("java/lang/Thread"));
  const jclass cls = static_cast<jclass>(thread.get());
  Local all(env->CallStaticObjectMethod(cls, env->GetStaticMethodID(cls, "getAllStackTraces", "()Ljava/util/Map;")));
  if (!NoPending("getAllStackTraces")) return "";
  Local keys(env->CallObjectMethod(all.get(), MethodOf(all.get(), "keySet", "()Ljava/util/Set;")));
  if (!NoPending("keySet")) return "";
  Local text(env->CallObjectMethod(keys.get(), MethodOf(keys.get(), "toString", "()Ljava/lang/String;")));
  if (!NoPending("toString")) return "";
  const char* chars = env->GetStringUTFChars(static_cast<jstring>(text.get()), nullptr);
  const std::string result = chars;
  env->ReleaseStringUTFChars(static_cast<jstring>(text.get()), chars);
  return result;
}

// A replica jar of another version than the library's is refused at start, naming both versions;
// every operation fails the same way.
TEST(StartupOtherVersion, TheJarOfAnotherVersionIsRefusedNamingBoth)
{
  VLXKDMReplica replica;
  for (int call = 0; call < 2; ++call) {
    EXPECT_EQ(VLX_E_FAIL, replica.Build(U("never")));
    const LastError error = PeekLastError();
    EXPECT_EQ("VLXJBXInfraERR_1010", error.id);
    EXPECT_NE(std::string::npos, error.text.find(std::string("a replica jar of version ") + CorvexaVersion() +
                                                 ", the library's (the jar on the class path is version 9.9.9)"))
        << error.text;
  }
}

TEST(StartupMissingClass, InitStopsAtTheMissingClassAndEveryOperationFailsCleanly)
{
  CaptureStdout();
  CaptureStderr();
  VLXKDMReplica replica;
  const long first = replica.Build(U("never"));
  EXPECT_EQ("", GetCapturedStdout());  // the application's output stays its own
  EXPECT_EQ("Error ReplicaStubs::Init\n", GetCapturedStderr());
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
  CaptureStderr();
  VLXUnicodeString name("kept");
  EXPECT_EQ(VLX_E_FAIL, replica.GetName(name));  // not built
  EXPECT_EQ(VLX_E_FAIL, replica.Build());
  EXPECT_EQ("", GetCapturedStderr());
  EXPECT_EQ("kept", Text(name));
  EXPECT_EQ("VLXJBXInfraERR_1010", PeekLastError().id);
  EXPECT_FALSE(Env()->ExceptionCheck());
}

// A JVM that is not created (each ctest row gives the cause and, in CORVEXA_EXPECTED_REASON, the
// parts of the explanation separated by '|'): the process goes on without a JVM, and the first
// call and the next fail with the same explanation.
TEST(StartupNoJvm, AJvmThatCannotBeCreatedRaisesTheNoEnvironmentError)
{
  CaptureStdout();
  CaptureStderr();
  VLXKDMReplica replica;
  const long first = replica.Build();
  const LastError firstError = PeekLastError();
  VLXUnicodeString name("kept");
  const long second = replica.GetName(name);
  EXPECT_EQ("", GetCapturedStdout());
  const std::string diagnostics = GetCapturedStderr();
  EXPECT_NE(std::string::npos,
            diagnostics.find("Error VLXJBXJNIUtilities::GetJNIEnv\nError VLXJBXJNIUtilities::GetJNIEnv\n"))
      << diagnostics;
  EXPECT_LT(first, 0);
  EXPECT_LT(second, 0);
  EXPECT_EQ("kept", Text(name));
  // The bridge's account of why the JVM could not be created stays in the last error.
  const LastError error = PeekLastError();
  EXPECT_EQ("VLXJBXInfraERR_1002", error.id);
  ASSERT_EQ(2u, error.parameters.size());
  ASSERT_EQ(2u, firstError.parameters.size());
  EXPECT_EQ("VLXKDMReplica::GetName(VLXUnicodeString&)", error.parameters[0]);
  const char* expected = std::getenv("CORVEXA_EXPECTED_REASON");
  ASSERT_NE(nullptr, expected);
  std::stringstream parts(expected);
  for (std::string part; std::getline(parts, part, '|');)
    for (const std::string& reason : {firstError.parameters[1], error.parameters[1]})
      EXPECT_NE(std::string::npos, reason.find(part)) << part << " in " << reason;
  EXPECT_EQ(nullptr, TableReader::Table());
  JavaVM* vm = nullptr;
  jsize count = -1;
  ASSERT_NE(nullptr, VLXJBXDetail::LoadJvm().created);
  EXPECT_EQ(JNI_OK, VLXJBXDetail::LoadJvm().created(&vm, 1, &count));
  EXPECT_EQ(0, count);
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
  // With every proxy gone, the only global references left are the table's own: one per class and
  // constant. A second filling would have doubled them.
  long own = 0;
  for (const corvexa::BindingRow& row : corvexa::kBindingRows)
    own += row.kind == corvexa::BindingKind::Class || row.kind == corvexa::BindingKind::Constant;
  EXPECT_EQ(own, VLXJBXJNIUtilities::GetGlobalRefCount());
  // Every thread has left the JVM, those the bridge attached (but this one, for the check) and the
  // one that created it ("main").
  const std::string live = JavaThreads();
  EXPECT_EQ(std::string::npos, live.find("Thread[main,")) << live;
  EXPECT_EQ(live.find("VLXJBX-attached-"), live.rfind("VLXJBX-attached-")) << "only this one: " << live;
}

// An exception that the application left pending at the process's first call fails that call,
// naming it, and the next call starts the library normally.
TEST(StartupPendingException, TheFirstCallFailsAndTheNextStartsNormally)
{
  JNIEnv* env = Env();  // the JVM, through the bridge alone: the library has not started
  ASSERT_EQ(nullptr, TableReader::Table());
  jclass cls = env->FindClass("java/lang/IllegalStateException");
  ASSERT_EQ(0, env->ThrowNew(cls, "left by the application"));
  VLXKDMReplica replica;
  EXPECT_EQ(VLX_E_FAIL, replica.Build(U("first")));
  EXPECT_FALSE(env->ExceptionCheck());
  env->DeleteLocalRef(cls);
  const std::string text = PeekLastError().text;
  EXPECT_NE(std::string::npos, text.find("left by the application")) << text;
  EXPECT_EQ(std::string::npos, text.find("missing")) << text;

  ASSERT_EQ(VLX_S_OK, replica.Build(U("second")));
  VLXUnicodeString name;
  ASSERT_EQ(VLX_S_OK, replica.GetName(name));
  EXPECT_EQ("second", Text(name));
  EXPECT_TRUE(TableReader::Table()->IsBound());
}

}  // namespace
