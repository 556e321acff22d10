// VLXJBXJavaObject: one global reference per object through copy, assignment and destruction;
// and the thin JNI wrappers.
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

TEST_F(JavaObjectTest, JniWrappersForwardArgumentsAndResults)
{
  jclass integer = Find("java/lang/Integer");
  jobject boxed = VLXJBXJNIHelper::CallStaticObjectMethod(
      env, integer, env->GetStaticMethodID(integer, "valueOf", "(I)Ljava/lang/Integer;"), jint(-42));
  ASSERT_FALSE(VLXJBXJNIHelper::ExceptionCheck(env));
  jmethodID intValue = env->GetMethodID(integer, "intValue", "()I");
  jmethodID longValue = env->GetMethodID(integer, "longValue", "()J");
  jmethodID doubleValue = env->GetMethodID(integer, "doubleValue", "()D");
  jmethodID equals = env->GetMethodID(integer, "equals", "(Ljava/lang/Object;)Z");
  EXPECT_EQ(VLXJBXJNIHelper::CallIntMethod(env, boxed, intValue), -42);
  ASSERT_FALSE(VLXJBXJNIHelper::ExceptionCheck(env));
  EXPECT_EQ(VLXJBXJNIHelper::CallLongMethod(env, boxed, longValue), -42);
  ASSERT_FALSE(VLXJBXJNIHelper::ExceptionCheck(env));
  EXPECT_EQ(VLXJBXJNIHelper::CallDoubleMethod(env, boxed, doubleValue), -42.0);
  ASSERT_FALSE(VLXJBXJNIHelper::ExceptionCheck(env));
  EXPECT_EQ(VLXJBXJNIHelper::CallBooleanMethod(env, boxed, equals, boxed), JNI_TRUE);
  ASSERT_FALSE(VLXJBXJNIHelper::ExceptionCheck(env));
  jclass booleanClass = Find("java/lang/Boolean");
  jobject yes = VLXJBXJNIHelper::NewObject(env, booleanClass, env->GetMethodID(booleanClass, "<init>", "(Z)V"),
                                           jboolean(JNI_TRUE));
  ASSERT_FALSE(VLXJBXJNIHelper::ExceptionCheck(env));
  jmethodID booleanValue = env->GetMethodID(booleanClass, "booleanValue", "()Z");
  EXPECT_EQ(VLXJBXJNIHelper::CallBooleanMethod(env, yes, booleanValue), JNI_TRUE);
  ASSERT_FALSE(VLXJBXJNIHelper::ExceptionCheck(env));
  EXPECT_TRUE(VLXJBXJNIHelper::IsSameObject(env, VLXJBXJNIHelper::GetObjectClass(env, yes), booleanClass));

  jobject builder = NewStringBuilder("ab");
  jclass sbClass = VLXJBXJNIHelper::GetObjectClass(env, builder);
  VLXJBXJNIHelper::CallVoidMethod(env, builder, env->GetMethodID(sbClass, "setLength", "(I)V"), jint(1));
  ASSERT_FALSE(VLXJBXJNIHelper::ExceptionCheck(env));
  EXPECT_EQ(ToString(builder), u"a");

  jfieldID field = env->GetStaticFieldID(booleanClass, "FALSE", "Ljava/lang/Boolean;");
  jobject no = VLXJBXJNIHelper::GetStaticObjectField(env, booleanClass, field);
  EXPECT_FALSE(VLXJBXJNIHelper::IsSameObject(env, no, yes));
  jobject local = VLXJBXJNIHelper::NewLocalRef(env, no);
  EXPECT_TRUE(VLXJBXJNIHelper::IsSameObject(env, local, no));
  VLXJBXJNIHelper::DeleteLocalRef(env, local);

  jobjectArray array = VLXJBXJNIHelper::NewObjectArray(env, 2, booleanClass, no);
  VLXJBXJNIHelper::SetObjectArrayElement(env, array, 1, yes);
  ASSERT_FALSE(VLXJBXJNIHelper::ExceptionCheck(env));
  EXPECT_EQ(VLXJBXJNIHelper::GetArrayLength(env, array), 2);
  jobject second = VLXJBXJNIHelper::GetObjectArrayElement(env, array, 1);
  EXPECT_TRUE(VLXJBXJNIHelper::IsSameObject(env, second, yes));
  // Storing the wrong class raises ArrayStoreException, seen by ExceptionCheck.
  VLXJBXJNIHelper::SetObjectArrayElement(env, array, 0, boxed);
  EXPECT_TRUE(VLXJBXJNIHelper::ExceptionCheck(env));
  env->ExceptionClear();

  const long base = Refs();
  jobject global = VLXJBXJNIHelper::NewGlobalRef(env, yes);
  EXPECT_EQ(Refs(), base + 1);
  EXPECT_EQ(VLXJBXJNIHelper::NewGlobalRef(env, nullptr), nullptr);
  EXPECT_EQ(Refs(), base + 1) << "a null reference is not counted";
  VLXJBXJNIHelper::DeleteGlobalRef(env, global);
  VLXJBXJNIHelper::DeleteGlobalRef(env, nullptr);
  EXPECT_EQ(Refs(), base);

  jclass system = Find("java/lang/System");
  VLXJBXJNIHelper::CallStaticVoidMethod(env, system, env->GetStaticMethodID(system, "gc", "()V"));
  EXPECT_FALSE(VLXJBXJNIHelper::ExceptionCheck(env));
}

} // namespace
