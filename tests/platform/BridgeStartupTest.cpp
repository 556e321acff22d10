// Start-up: the JVM the bridge created, its options and class path, and the start-up configuration.
#include "BridgeSupport.h"
#include "VLXJBXInternal.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>

namespace {

using StartupTest = BridgeTest;

// System.getProperty(name), ASCII only.
std::string SystemProperty(JNIEnv* env, const char* name)
{
  jclass system = env->FindClass("java/lang/System");
  jmethodID get = env->GetStaticMethodID(system, "getProperty", "(Ljava/lang/String;)Ljava/lang/String;");
  jstring value = Checked(env, static_cast<jstring>(env->CallStaticObjectMethod(system, get, env->NewStringUTF(name))));
  std::string out;
  for (char16_t c : value != nullptr ? Units(env, value) : std::u16string())
    out += c < 0x80 ? static_cast<char>(c) : '?';
  return out;
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
  struct stat st;
  const bool jarBuilt = stat((libraryDirectory + "/../share/corvexa/corvexa-replica.jar").c_str(), &st) == 0;
  EXPECT_EQ(classPath.find("corvexa-replica.jar") != std::string::npos, jarBuilt) << classPath;

  JNIEnv* again = nullptr;
  VLXListValVLXUnicodeString ignored;
  ignored.Append("-XX:+ThisOptionDoesNotExist");  // options matter only when the JVM is created
  EXPECT_EQ(VLXJBXJNIUtilities::GetJNIEnv(again, ignored), VLX_S_OK);
  EXPECT_EQ(again, env);
  JavaVM* vms[2] = {nullptr, nullptr};
  jsize count = 0;
  ASSERT_EQ(JNI_GetCreatedJavaVMs(vms, 2, &count), JNI_OK);
  ASSERT_EQ(count, 1);
  EXPECT_EQ(VLXJBXJNIUtilities::GetJavaVM(), vms[0]);
  EXPECT_FALSE(TakeLastError().present);
}

TEST(StartupConfig, ClassPathPrefersTheSharedJarAndPutsTheVariableFirst)
{
  char pattern[] = "/tmp/corvexa-classpath-XXXXXX";
  ASSERT_NE(mkdtemp(pattern), nullptr);
  const std::string root = pattern, lib = root + "/lib";
  std::filesystem::create_directories(root + "/share/corvexa");
  std::filesystem::create_directories(lib);
  EXPECT_EQ(VLXJBXDetail::BuildClassPath(nullptr, lib), "") << "no jar anywhere";
  EXPECT_EQ(VLXJBXDetail::BuildClassPath("a.jar::b:", lib), "a.jar:b");
  std::ofstream(lib + "/corvexa-replica.jar") << "jar";
  EXPECT_EQ(VLXJBXDetail::BuildClassPath(nullptr, lib), lib + "/corvexa-replica.jar") << "beside the library";
  std::ofstream(root + "/share/corvexa/corvexa-replica.jar") << "jar";
  EXPECT_EQ(VLXJBXDetail::BuildClassPath("x", lib), "x:" + lib + "/../share/corvexa/corvexa-replica.jar")
      << "installed and build-tree layout first";
  EXPECT_EQ(VLXJBXDetail::BuildClassPath("x", ""), "x") << "unknown library directory";
  std::filesystem::remove_all(root);

  EXPECT_TRUE(VLXJBXDetail::SplitOptions(nullptr).empty());
  EXPECT_TRUE(VLXJBXDetail::SplitOptions(" \t\n").empty());
  EXPECT_EQ(VLXJBXDetail::SplitOptions("  -Xcheck:jni\t-Xmx64m\n -Dk=v "),
            (std::vector<std::string>{"-Xcheck:jni", "-Xmx64m", "-Dk=v"}));
}

}  // namespace
