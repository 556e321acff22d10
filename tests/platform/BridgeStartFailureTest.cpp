// A JVM that cannot start (its options hold an unrecognised one, set by the ctest entry): every
// call fails fast with the same explanation, and the parts that need no JVM keep working.
#include "BridgeSupport.h"
#include "VLXJBXException.h"
#include "VLXJBXJavaObject.h"

namespace {

TEST(StartFailure, EveryCallFailsWithTheReasonAndTheEnvironmentNull)
{
  JNIEnv* env = reinterpret_cast<JNIEnv*>(0x1);
  EXPECT_LT(VLXJBXJNIUtilities::GetJNIEnv(env, VLXListValVLXUnicodeString()), 0);
  EXPECT_EQ(env, nullptr);
  EXPECT_EQ(VLXJBXJNIUtilities::GetJavaVM(), nullptr);
  const ErrorView e = TakeLastError();
  const std::string why = e.text;
  EXPECT_EQ(e.id, VLXJBXMessages::JvmCreationFailed);
  for (const char* part :
       {"the Java virtual machine could not be created", "-XX:+ThisOptionDoesNotExist", "Unrecognized VM option"})
    EXPECT_TRUE(Has(why, part)) << why;

  // A later call, even with other options, does not try again.
  VLXListValVLXUnicodeString options;
  options.Append("-Xmx64m");
  env = reinterpret_cast<JNIEnv*>(0x1);
  EXPECT_LT(VLXJBXJNIUtilities::GetJNIEnv(env, options), 0);
  EXPECT_EQ(env, nullptr);
  EXPECT_EQ(TakeLastError().text, why);
}

TEST(StartFailure, ObjectsWithoutAHandleAndErrorTranslationNeedNoJvm)
{
  const long base = VLXJBXJNIUtilities::GetGlobalRefCount();
  VLXJBXJavaObject a, b(a);
  b = a;
  EXPECT_TRUE(a == b);
  EXPECT_EQ(a.SetGlobalRef(nullptr, nullptr), 0);
  EXPECT_EQ(VLXJBXJNIUtilities::GetGlobalRefCount(), base);
  EXPECT_FALSE(TakeLastError().present);

  EXPECT_EQ(VLXJBXJNIUtilities::HandleJavaError(nullptr, 0, "op", nullptr, 0), 0);
  EXPECT_LT(VLXJBXJNIUtilities::HandleJavaError(nullptr, -1, "VLXKDMReplica::Commit()", nullptr, 0), 0);
  EXPECT_EQ(TakeLastError().text,
            "VLXKDMReplica::Commit() failed: it returned the failure code -1 and recorded no cause");
}

}  // namespace
