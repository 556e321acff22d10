// Start-up: the process's JVM, created once by the test environment through the bridge with an
// options list of its own, its class path, and the start-up configuration.
#include "BridgeSupport.h"
#include "VLXJBXInternal.h"

#include <filesystem>

namespace {

class JvmEnvironment : public ::testing::Environment {
  void SetUp() override
  {
    VLXListValVLXUnicodeString options;
    options.Append("-Dcorvexa.platform.test=from-options");
    options.Append("");  // empty entries are skipped
    JNIEnv* env = nullptr;
    ASSERT_EQ(VLXJBXJNIUtilities::GetJNIEnv(env, options), VLX_S_OK) << TakeLastError().text;
    ASSERT_NE(env, nullptr);
  }
};
using StartupTest = BridgeTest;

// System.getProperty(name), ASCII only.
std::string SystemProperty(JNIEnv* env, const char* name)
{
  jclass system = env->FindClass("java/lang/System");
  jmethodID get = env->GetStaticMethodID(system, "getProperty", "(Ljava/lang/String;)Ljava/lang/String;");
  jstring value = Checked(env, static_cast<jstring>(env->CallStaticObjectMethod(system, get, env->NewStringUTF(name))));
  const std::u16string units = value != nullptr ? Units(env, value) : std::u16string();
  return std::string(units.begin(), units.end());
}

TEST_F(StartupTest, TheProcessJvmWasCreatedOnceWithTheOptionsListAndTheClassPath)
{
  EXPECT_EQ(SystemProperty(env, "corvexa.platform.test"), "from-options");
  const std::string classPath = SystemProperty(env, "java.class.path");
  // VLXJBX_CLASSPATH is "/nonexistent/first.jar::/nonexistent/second" for this test: the empty
  // entry is dropped and the entries come first.
  EXPECT_EQ(classPath.rfind("/nonexistent/first.jar:/nonexistent/second", 0), 0u) << classPath;
  const std::string libraryDirectory = VLXJBXDetail::LibraryDirectory();
  ASSERT_FALSE(libraryDirectory.empty());
  const bool jarBuilt = std::filesystem::exists(libraryDirectory + "/../share/corvexa/corvexa-replica.jar");
  EXPECT_EQ(classPath.find("corvexa-replica.jar") != std::string::npos, jarBuilt) << classPath;

  JNIEnv* again = nullptr;
  VLXListValVLXUnicodeString ignored;
  ignored.Append("-XX:+ThisOptionDoesNotExist");  // options matter only when the JVM is created
  EXPECT_EQ(VLXJBXJNIUtilities::GetJNIEnv(again, ignored), VLX_S_OK);
  EXPECT_EQ(again, env);
  JavaVM* vms[2] = {nullptr, nullptr};
  jsize count = 0;
  ASSERT_EQ(VLXJBXDetail::LoadJvm().created(vms, 2, &count), JNI_OK);
  ASSERT_EQ(count, 1);
  EXPECT_EQ(VLXJBXJNIUtilities::GetJavaVM(), vms[0]);
  EXPECT_FALSE(TakeLastError().present);
}

}  // namespace

int main(int argc, char** argv)
{
  ::testing::InitGoogleTest(&argc, argv);
  ::testing::AddGlobalTestEnvironment(new JvmEnvironment);
  return RUN_ALL_TESTS();
}
