// Creates the process's JVM once, through the bridge, with an options list of its own.
#include "BridgeSupport.h"

namespace {
class JvmEnvironment : public ::testing::Environment {
 public:
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
}  // namespace

int main(int argc, char** argv)
{
  ::testing::InitGoogleTest(&argc, argv);
  ::testing::AddGlobalTestEnvironment(new JvmEnvironment);
  return RUN_ALL_TESTS();
}
