// VLXJBXJavaObject: one global reference per object through copy, assignment and destruction.
#include "BridgeSupport.h"
#include "VLXJBXJNIHelper.h"
#include "VLXJBXJavaObject.h"

#include <thread>

namespace {

class JavaObjectTest : public BridgeTest {
 protected:
  long Refs() const { return VLXJBXJNIUtilities::GetGlobalRefCount(); }

  jobject NewStringBuilder(const char* text)
  {
    jclass cls = Find("java/lang/StringBuilder");
    return Checked(env, VLXJBXJNIHelper::NewObject(env, cls, env->GetMethodID(cls, "<init>", "(Ljava/lang/String;)V"),
                                                   env->NewStringUTF(text)));
  }

  std::u16string ToString(jobject object)
  {
    jmethodID toString = env->GetMethodID(Find("java/lang/Object"), "toString", "()Ljava/lang/String;");
    return Units(env, Checked(env, static_cast<jstring>(VLXJBXJNIHelper::CallObjectMethod(env, object, toString))));
  }
};

TEST_F(JavaObjectTest, EveryCopyHoldsItsOwnReferenceAndDestructionReleasesIt)
{
  const long base = Refs();
  jobject local = NewStringBuilder("kept alive");
  {
    VLXJBXJavaObject a;
    ASSERT_EQ(a.SetGlobalRef(env, local), VLX_S_OK);
    EXPECT_EQ(env->GetObjectRefType(a.GetGlobalRef()), JNIGlobalRefType);
    EXPECT_EQ(Refs(), base + 1);
    a.exchangedWithJava = 1;
    env->DeleteLocalRef(local);
    {
      VLXJBXJavaObject b(a), c;
      EXPECT_EQ(Refs(), base + 2);
      EXPECT_NE(b.GetGlobalRef(), a.GetGlobalRef()) << "a reference of its own";
      EXPECT_EQ(b.exchangedWithJava, 1);
      c = b;
      c = c;  // self-assignment keeps the reference
      EXPECT_EQ(Refs(), base + 3);
      EXPECT_TRUE(c == a);
      c = VLXJBXJavaObject();  // assigning an empty object releases
      EXPECT_EQ(Refs(), base + 2);
      EXPECT_EQ(c.GetGlobalRef(), nullptr);
      a = b;  // same Java object: one reference replaced by another
      EXPECT_EQ(Refs(), base + 2);
    }
    EXPECT_EQ(Refs(), base + 1);
    EXPECT_TRUE(ToString(a.GetGlobalRef()) == u"kept alive") << "the Java object outlived its local references";
    VLXJBXJavaObject* heap = new VLXJBXJavaObject(a);
    std::thread([heap] { VLXJBXJavaObject copy(*heap); }).join();  // on a thread the bridge attaches
    EXPECT_EQ(Refs(), base + 2);
    heap->Release();
    EXPECT_EQ(Refs(), base + 1);
  }
  EXPECT_EQ(Refs(), base);
}

TEST_F(JavaObjectTest, SetGlobalRefReplacesOrReleasesAndEqualityIsJavaIdentity)
{
  const long base = Refs();
  jobject first = NewStringBuilder("same text"), second = NewStringBuilder("same text");
  VLXJBXJavaObject p, q, none1, none2;
  ASSERT_EQ(p.SetGlobalRef(env, first), VLX_S_OK);
  ASSERT_EQ(q.SetGlobalRef(env, first), VLX_S_OK);
  EXPECT_TRUE(p == q && !(p != q));
  ASSERT_EQ(p.SetGlobalRef(nullptr, second), VLX_S_OK) << "a null env means the thread's own";
  EXPECT_EQ(Refs(), base + 2);
  EXPECT_TRUE(p != q) << "equal contents, different objects";
  EXPECT_TRUE(env->IsSameObject(p.GetGlobalRef(), second));
  ASSERT_EQ(p.SetGlobalRef(env, p.GetGlobalRef()), VLX_S_OK) << "re-attaching through its own handle";
  EXPECT_EQ(Refs(), base + 2);
  EXPECT_TRUE(env->IsSameObject(p.GetGlobalRef(), second));
  EXPECT_EQ(p.SetGlobalRef(env, nullptr), VLX_S_OK);
  EXPECT_EQ(p.SetGlobalRef(env, nullptr), VLX_S_OK) << "releasing nothing is fine";
  EXPECT_EQ(p.GetGlobalRef(), nullptr);
  EXPECT_EQ(Refs(), base + 1);
  EXPECT_TRUE(none1 == none2 && none1 == p);
  EXPECT_TRUE(q != none1 && none1 != q);
}

}  // namespace
