// Start-up: the JVM the bridge created, its options and class path, and the start-up configuration.
#include "BridgeSupport.h"
#include "VLXJBXInternal.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>

namespace
{

using StartupTest = BridgeTest;

TEST_F(StartupTest, TheJvmWasCreatedWithTheOptionsListAndTheClassPath)
{
  EXPECT_EQ(Ascii(SystemProperty(env, "corvexa.platform.test")), "from-options");
  const std::string classPath = Ascii(SystemProperty(env, "java.class.path"));
  // VLXJBX_CLASSPATH is "/nonexistent/first.jar::/nonexistent/second" for this test: the empty
  // entry is dropped and the entries come first.
  EXPECT_EQ(classPath.rfind("/nonexistent/first.jar:/nonexistent/second", 0), 0u) << classPath;
  const std::string libraryDirectory = VLXJBXDetail::LibraryDirectory();
  ASSERT_FALSE(libraryDirectory.empty());
  struct stat st;
  const bool jarBuilt = stat((libraryDirectory + "/../share/corvexa/corvexa-replica.jar").c_str(), &st) == 0;
  EXPECT_EQ(classPath.find("corvexa-replica.jar") != std::string::npos, jarBuilt) << classPath;
}

TEST_F(StartupTest, TheEnvironmentIsCachedAndTheJvmIsTheProcessOne)
{
  JNIEnv* again = nullptr;
  VLXListValVLXUnicodeString ignored;
  ignored.Append("-XX:+ThisOptionDoesNotExist"); // options matter only when the JVM is created
  EXPECT_EQ(VLXJBXJNIUtilities::GetJNIEnv(again, ignored), VLX_S_OK);
  EXPECT_EQ(again, env);
  JavaVM* vms[2] = {nullptr, nullptr};
  jsize count = 0;
  ASSERT_EQ(JNI_GetCreatedJavaVMs(vms, 2, &count), JNI_OK);
  ASSERT_EQ(count, 1);
  EXPECT_EQ(VLXJBXJNIUtilities::GetJavaVM(), vms[0]);
  EXPECT_FALSE(TakeLastError().present);
}

// ---- configuration, without a JVM ----

class ClassPathLayout : public ::testing::Test
{
protected:
  std::string root;

  void SetUp() override
  {
    char pattern[] = "/tmp/corvexa-classpath-XXXXXX";
    ASSERT_NE(mkdtemp(pattern), nullptr);
    root = pattern;
    mkdir((root + "/lib").c_str(), 0700);
    mkdir((root + "/share").c_str(), 0700);
    mkdir((root + "/share/corvexa").c_str(), 0700);
  }
  void TearDown() override
  {
    unlink((root + "/lib/corvexa-replica.jar").c_str());
    unlink((root + "/share/corvexa/corvexa-replica.jar").c_str());
    rmdir((root + "/share/corvexa").c_str());
    rmdir((root + "/share").c_str());
    rmdir((root + "/lib").c_str());
    rmdir(root.c_str());
  }
  void Touch(const std::string& path) { std::ofstream(path) << "jar"; }
};

TEST_F(ClassPathLayout, SharedDirectoryJarIsPreferredAndTheVariableComesFirst)
{
  const std::string lib = root + "/lib";
  EXPECT_EQ(VLXJBXDetail::BuildClassPath(nullptr, lib), "") << "no jar anywhere";
  EXPECT_EQ(VLXJBXDetail::BuildClassPath("a.jar::b:", lib), "a.jar:b");

  Touch(lib + "/corvexa-replica.jar");
  EXPECT_EQ(VLXJBXDetail::BuildClassPath(nullptr, lib), lib + "/corvexa-replica.jar") << "beside the library";

  Touch(root + "/share/corvexa/corvexa-replica.jar");
  EXPECT_EQ(VLXJBXDetail::BuildClassPath("x", lib), "x:" + lib + "/../share/corvexa/corvexa-replica.jar")
      << "installed and build-tree layout first";
  EXPECT_EQ(VLXJBXDetail::BuildClassPath("x", ""), "x") << "unknown library directory";
}

TEST(StartupConfig, OptionsAreSplitOnAnyWhitespace)
{
  EXPECT_TRUE(VLXJBXDetail::SplitOptions(nullptr).empty());
  EXPECT_TRUE(VLXJBXDetail::SplitOptions(" \t\n").empty());
  const std::vector<std::string> words = VLXJBXDetail::SplitOptions("  -Xcheck:jni\t-Xmx64m\n -Dk=v ");
  EXPECT_EQ(words, (std::vector<std::string>{"-Xcheck:jni", "-Xmx64m", "-Dk=v"}));
}

} // namespace
