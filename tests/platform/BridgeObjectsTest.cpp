// VLXJBXJavaObject as it is (the proxies derive from it): one global reference per object,
// re-attached through its own handle, given the thread's own environment when given none, and
// released when the object goes.
#include "BridgeSupport.h"
#include "VLXJBXJavaObject.h"

namespace {
using JavaObjectTest = BridgeTest;

TEST_F(JavaObjectTest, EachObjectHoldsOneReferenceOfItsOwnUntilItGoes)
{
  const long base = VLXJBXJNIUtilities::GetGlobalRefCount();
  jobject first = env->NewStringUTF("first"), second = env->NewStringUTF("second");
  {
    VLXJBXJavaObject a, b;
    ASSERT_EQ(a.SetGlobalRef(nullptr, first), VLX_S_OK) << "a null env means the thread's own";
    EXPECT_EQ(env->GetObjectRefType(a.GetGlobalRef()), JNIGlobalRefType);
    ASSERT_EQ(a.SetGlobalRef(env, a.GetGlobalRef()), VLX_S_OK) << "re-attached through its own handle";
    EXPECT_TRUE(env->IsSameObject(a.GetGlobalRef(), first));
    b = a;
    VLXJBXJavaObject c(b);
    (new VLXJBXJavaObject(c))->Release();
    EXPECT_EQ(VLXJBXJNIUtilities::GetGlobalRefCount(), base + 3);
    EXPECT_TRUE(a == c && a != VLXJBXJavaObject());
    ASSERT_EQ(b.SetGlobalRef(env, second), VLX_S_OK);
    EXPECT_TRUE(b != a);
    EXPECT_EQ(VLXJBXJNIUtilities::GetGlobalRefCount(), base + 3);
  }
  EXPECT_EQ(VLXJBXJNIUtilities::GetGlobalRefCount(), base);
}

}  // namespace
