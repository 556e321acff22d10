// VLXJBXJavaObject: one global reference per object through copy, assignment and destruction.
#include "BridgeSupport.h"
#include "VLXJBXJNIHelper.h"
#include "VLXJBXJavaObject.h"

#include <thread>

namespace
{

class Proxy : public VLXJBXJavaObject
{
public:
  using VLXJBXJavaObject::_handle;
};

class JavaObjectTest : public BridgeTest
{
protected:
  long Refs() const { return VLXJBXJNIUtilities::GetGlobalRefCount(); }

  jobject NewStringBuilder(const char* text)
  {
    jclass cls = Find("java/lang/StringBuilder");
    jobject sb = VLXJBXJNIHelper::NewObject(env, cls, env->GetMethodID(cls, "<init>", "(Ljava/lang/String;)V"),
                                            env->NewStringUTF(text));
    EXPECT_FALSE(env->ExceptionCheck());
    return sb;
  }

  std::u16string ToString(jobject object)
  {
    jclass cls = Find("java/lang/Object");
    jstring s = static_cast<jstring>(VLXJBXJNIHelper::CallObjectMethod(
        env, object, env->GetMethodID(cls, "toString", "()Ljava/lang/String;")));
    EXPECT_FALSE(env->ExceptionCheck());
    std::u16string units = Units(env, s);
    env->DeleteLocalRef(s);
    return units;
  }
};

TEST_F(JavaObjectTest, EveryCopyHoldsItsOwnReferenceAndDestructionReleasesIt)
{
  const long base = Refs();
  jobject local = NewStringBuilder("kept alive");
  {
    Proxy a;
    EXPECT_EQ(a.GetGlobalRef(), nullptr);
    EXPECT_EQ(a.exchangedWithJava, 0);
    ASSERT_EQ(a.SetGlobalRef(env, local), VLX_S_OK);
    EXPECT_EQ(env->GetObjectRefType(a.GetGlobalRef()), JNIGlobalRefType);
    EXPECT_EQ(Refs(), base + 1);
    a.exchangedWithJava = 1;
    env->DeleteLocalRef(local);
    {
      Proxy b(a);
      EXPECT_EQ(Refs(), base + 2);
      EXPECT_NE(b.GetGlobalRef(), a.GetGlobalRef()) << "a reference of its own";
      EXPECT_EQ(b.exchangedWithJava, 1);
      EXPECT_TRUE(b == a);
      Proxy c;
      c = b;
      EXPECT_EQ(Refs(), base + 3);
      c = c; // self-assignment keeps the reference
      EXPECT_EQ(Refs(), base + 3);
      EXPECT_TRUE(c == a);
      c = Proxy(); // assigning an empty object releases
      EXPECT_EQ(Refs(), base + 2);
      EXPECT_EQ(c.GetGlobalRef(), nullptr);
      a = b; // same Java object: one reference replaced by another
      EXPECT_EQ(Refs(), base + 2);
    }
    EXPECT_EQ(Refs(), base + 1);
    // The Java object outlived every local reference and the copies.
    EXPECT_EQ(ToString(a.GetGlobalRef()), u"kept alive");
  }
  EXPECT_EQ(Refs(), base);
}

TEST_F(JavaObjectTest, SetGlobalRefReplacesOrReleases)
{
  const long base = Refs();
  jobject first = NewStringBuilder("first");
  jobject second = NewStringBuilder("second");
  Proxy p;
  ASSERT_EQ(p.SetGlobalRef(env, first), VLX_S_OK);
  ASSERT_EQ(p.SetGlobalRef(nullptr, second), VLX_S_OK) << "a null env means the thread's own";
  EXPECT_EQ(Refs(), base + 1);
  EXPECT_EQ(ToString(p.GetGlobalRef()), u"second");
  // Re-attaching to the object it already holds (through its own handle) works.
  ASSERT_EQ(p.SetGlobalRef(env, p.GetGlobalRef()), VLX_S_OK);
  EXPECT_EQ(Refs(), base + 1);
  EXPECT_EQ(ToString(p.GetGlobalRef()), u"second");
  EXPECT_EQ(p.SetGlobalRef(env, nullptr), VLX_S_OK);
  EXPECT_EQ(p.GetGlobalRef(), nullptr);
  EXPECT_EQ(Refs(), base);
  EXPECT_EQ(p.SetGlobalRef(env, nullptr), VLX_S_OK) << "releasing nothing is fine";
}

TEST_F(JavaObjectTest, EqualityIsJavaIdentity)
{
  jobject x = NewStringBuilder("same text");
  jobject y = NewStringBuilder("same text");
  Proxy a, b, c, none1, none2;
  a.SetGlobalRef(env, x);
  b.SetGlobalRef(env, x);
  c.SetGlobalRef(env, y);
  EXPECT_TRUE(a == b);
  EXPECT_FALSE(a != b);
  EXPECT_TRUE(a != c) << "equal contents, different objects";
  EXPECT_TRUE(none1 == none2);
  EXPECT_TRUE(a != none1);
  EXPECT_TRUE(none1 != a);
}

TEST_F(JavaObjectTest, HeapObjectsAndOtherThreadsBalanceTheCount)
{
  const long base = Refs();
  Proxy* heap = new Proxy;
  heap->SetGlobalRef(env, NewStringBuilder("heap"));
  EXPECT_EQ(Refs(), base + 1);
  std::thread t([heap] {
    Proxy copy(*heap); // made and destroyed on a thread the bridge attaches
    copy.exchangedWithJava = 2;
  });
  t.join();
  EXPECT_EQ(Refs(), base + 1);
  heap->Release();
  EXPECT_EQ(Refs(), base);
}

} // namespace
