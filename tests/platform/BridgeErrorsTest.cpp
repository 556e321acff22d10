// Lookups that fail and Java exceptions: cleared, recorded as last errors that say what happened.
#include "BridgeSupport.h"
#include "VLXJBXException.h"
#include "VLXJBXJNIHelper.h"

namespace {
using namespace std::string_literals;
using Util = VLXJBXJNIUtilities;
using LookupTest = BridgeTest;
using JavaErrorTest = BridgeTest;

TEST_F(LookupTest, ClassLookupMakesACountedGlobalReferenceOrReportsWhyNot)
{
  const long before = Util::GetGlobalRefCount();
  jclass cls = nullptr;
  ASSERT_EQ(Util::NewGlobalRefForClass(env, "java/lang/String", cls), VLX_S_OK);
  EXPECT_EQ(env->GetObjectRefType(cls), JNIGlobalRefType);
  EXPECT_EQ(Util::GetGlobalRefCount(), before + 1);
  VLXJBXJNIHelper::DeleteGlobalRef(env, cls);
  EXPECT_EQ(Util::GetGlobalRefCount(), before);

  jclass sentinel = reinterpret_cast<jclass>(0x1234);
  cls = sentinel;
  EXPECT_LT(Util::NewGlobalRefForClass(env, "com/nowhere/Missing", cls), 0);
  EXPECT_EQ(cls, sentinel);
  EXPECT_FALSE(env->ExceptionCheck());
  EXPECT_EQ(Util::GetGlobalRefCount(), before);
  const LastError e = TakeLastError();
  EXPECT_EQ(e.id, VLXJBXMessages::LookupFailed);
  EXPECT_TRUE(Has(e.text, "class 'com/nowhere/Missing' could not be found")) << e.text;
  EXPECT_TRUE(Has(e.text, "java.lang.NoClassDefFoundError")) << e.text;

  jclass string = Find("java/lang/String");
  jmethodID method = nullptr;
  EXPECT_EQ(Util::GetMethodID(env, nullptr, "length", "()I", method), VLX_E_INVALIDARG);
  EXPECT_EQ(Util::GetMethodID(nullptr, string, "length", "()I", method), VLX_E_INVALIDARG);
  EXPECT_EQ(Util::NewGlobalRefForClass(env, nullptr, cls), VLX_E_INVALIDARG);
  env->ThrowNew(Find("java/lang/IllegalStateException"), "pending");
  EXPECT_LT(Util::GetMethodID(env, string, "length", "()I", method), 0);
  EXPECT_LT(Util::NewGlobalRefForClass(env, "java/lang/String", cls), 0);
  EXPECT_TRUE(env->ExceptionCheck()) << "the caller's exception is left for the caller";
  env->ExceptionClear();
  EXPECT_EQ(TakeLastError().id, VLXJBXMessages::ExceptionPending);
  EXPECT_TRUE(method == nullptr && cls == sentinel);
}

TEST_F(LookupTest, MemberLookupsNameTheMemberTheSignatureAndTheClass)
{
  jclass string = Find("java/lang/String");
  enum Kind { Method, StaticMethod, StaticField };
  const struct {
    Kind kind;
    const char *name, *signature, *failure /* null: found */;
  } cases[] = {
      {Method, "noSuchMethod", "()V", "method 'noSuchMethod' with signature '()V' of class 'java.lang.String'"},
      {Method, "valueOf", "(I)Ljava/lang/String;", "NoSuchMethodError"},  // exists, but static
      {StaticMethod, "valueOf", "(I)Ljava/lang/String;", nullptr},
      {StaticMethod, "valueOf", "(Z)I", "static method 'valueOf' with signature '(Z)I'"},
      {StaticField, "CASE_INSENSITIVE_ORDER", "Ljava/util/Comparator;", nullptr},
      {StaticField, "CASE_INSENSITIVE_ORDER", "I", "static field 'CASE_INSENSITIVE_ORDER' with signature 'I'"},
      {StaticField, "length", "I", "NoSuchFieldError"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name + std::string(c.signature));
    jmethodID method = nullptr;
    jfieldID field = nullptr;
    const long rc = c.kind == Method         ? Util::GetMethodID(env, string, c.name, c.signature, method)
                    : c.kind == StaticMethod ? Util::GetStaticMethodID(env, string, c.name, c.signature, method)
                                             : Util::GetStaticFieldID(env, string, c.name, c.signature, field);
    EXPECT_FALSE(env->ExceptionCheck());
    const LastError e = TakeLastError();
    EXPECT_EQ(VLX_SUCCEEDED(rc), c.failure == nullptr);
    EXPECT_EQ(method != nullptr || field != nullptr, c.failure == nullptr) << "an id exactly when found";
    EXPECT_EQ(e.present, c.failure != nullptr);
    if (c.failure != nullptr) {
      EXPECT_EQ(e.id, VLXJBXMessages::LookupFailed);
      EXPECT_TRUE(Has(e.text, c.failure)) << e.text;
    }
  }
}

jthrowable NewThrowable(JNIEnv* env, const char* cls, jstring message, jthrowable cause)
{
  jclass c = env->FindClass(cls);
  jmethodID ctor = env->GetMethodID(c, "<init>", "(Ljava/lang/String;Ljava/lang/Throwable;)V");
  return Checked(env, static_cast<jthrowable>(VLXJBXJNIHelper::NewObject(env, c, ctor, message, cause)));
}

TEST_F(JavaErrorTest, PendingExceptionsAreClearedAndRecordedWithClassMessageAndCause)
{
  jthrowable inner = NewThrowable(env, "java/lang/IllegalStateException", env->NewStringUTF("inner reason"), nullptr);
  // A message outside the BMP, with an embedded NUL, crosses exactly (not as modified UTF-8).
  jstring unicode = JavaString(env, u"bad \U0001F600 value" + std::u16string(1, u'\0') + u"end");
  // thrown null: a real call throws; flag 1: printed to standard error first. The parameters after
  // the context, joined by '|'.
  const struct {
    jthrowable thrown;
    int flag;
    std::string parameters;
  } cases[] = {
      {NewThrowable(env, "java/lang/RuntimeException", env->NewStringUTF("outer text"), inner), 0,
       "java.lang.RuntimeException|outer text|; caused by java.lang.IllegalStateException: inner reason"},
      {nullptr, 1, "java.lang.NumberFormatException|For input string: \"x1\"|"},
      {NewThrowable(env, "java/lang/UnsupportedOperationException", nullptr, nullptr), 0,
       "java.lang.UnsupportedOperationException|(no message)|"},
      {NewThrowable(env, "java/lang/IllegalArgumentException", unicode, nullptr), 0,
       "java.lang.IllegalArgumentException|bad \xF0\x9F\x98\x80 value\0end|"s},
  };
  ASSERT_FALSE(env->ExceptionCheck());
  jclass integer = Find("java/lang/Integer");
  for (const auto& c : cases) {
    if (c.thrown != nullptr)
      env->Throw(c.thrown);
    else
      env->CallStaticIntMethod(integer, env->GetStaticMethodID(integer, "parseInt", "(Ljava/lang/String;)I"),
                               env->NewStringUTF("x1"));
    ASSERT_TRUE(env->ExceptionCheck());
    EXPECT_EQ(Util::HandleJavaError(env, 0, "ctx", nullptr, c.flag), VLX_E_FAIL);
    EXPECT_FALSE(env->ExceptionCheck());
    const LastError e = TakeLastError();
    EXPECT_EQ(e.id, VLXJBXMessages::JavaException);
    ASSERT_EQ(e.parameters.size(), 4u);
    EXPECT_EQ(e.parameters[0], "ctx");
    EXPECT_EQ(e.parameters[1] + "|" + e.parameters[2] + "|" + e.parameters[3], c.parameters);
  }
  env->Throw(cases[0].thrown);
  Util::HandleJavaError(env, 0, "VLXKDMReplica::GetName(VLXUnicodeString&)", nullptr, 0);
  EXPECT_EQ(TakeLastError().text,
            "VLXKDMReplica::GetName(VLXUnicodeString&) failed with the Java exception java.lang.RuntimeException: "
            "outer text; caused by java.lang.IllegalStateException: inner reason");
}

TEST_F(JavaErrorTest, WithoutAnExceptionTheCodeDecidesAndTheOperationsOwnErrorIsKept)
{
  EXPECT_EQ(Util::HandleJavaError(env, 0, "op", nullptr, 0), VLX_S_OK);
  EXPECT_EQ(Util::HandleJavaError(env, 5, "op", nullptr, 0), VLX_S_OK);
  EXPECT_FALSE(TakeLastError().present) << "success records nothing";

  EXPECT_EQ(Util::HandleJavaError(env, VLX_E_INVALIDARG, "VLXKDMModel::GetName()", nullptr, 0), VLX_E_FAIL);
  const LastError e = TakeLastError();
  EXPECT_EQ(e.id, VLXJBXMessages::OperationFailed);
  EXPECT_EQ(e.text, "VLXKDMModel::GetName() failed: it returned the failure code -2147024809 and recorded no cause");

  // The operation's own error is kept, not replaced; one recorded before the operation started is
  // never taken for its cause.
  VLXJBXException* own = new VLXJBXException(VLXJBXMessages::ConversionFailed);
  VLXError::MarkOperationStart();
  VLXError::GetReturn(2, own, nullptr, __FILE__, __LINE__);
  EXPECT_EQ(Util::HandleJavaError(env, VLX_E_FAIL, "op", nullptr, 0), VLX_E_FAIL);
  VLXError* last = VLXError::VLXGetLastError(0, nullptr);
  EXPECT_EQ(last, own);
  if (last != nullptr) last->Release();
  VLXError::MarkOperationStart();
  EXPECT_EQ(Util::HandleJavaError(env, VLX_E_FAIL, "later", nullptr, 0), VLX_E_FAIL);
  EXPECT_EQ(TakeLastError().parameters[0], "later");
}

TEST_F(JavaErrorTest, AGivenErrorObjectIsTakenOverInEveryCase)
{
  const VLXUnicodeString p[] = {"mine", "why"};
  for (int pending = 0; pending < 2; ++pending) {
    if (pending) env->ThrowNew(Find("java/lang/IllegalStateException"), "described to stderr");
    VLXJBXException* given = new VLXJBXException(VLXJBXMessages::OperationFailed);
    given->SetNLSRequestParams(2, p);
    EXPECT_EQ(Util::HandleJavaError(env, pending ? 0 : -1, "op", given, pending), VLX_E_FAIL);
    EXPECT_FALSE(env->ExceptionCheck());
    EXPECT_EQ(TakeLastError().text, "mine failed: why");
  }
  // Success: the given error is released (the sanitizer run would report a leak otherwise).
  EXPECT_EQ(Util::HandleJavaError(env, 0, "op", new VLXJBXException("x"), 0), VLX_S_OK);
  EXPECT_FALSE(TakeLastError().present);
}

TEST(BridgeCatalog, EveryIdHasAText)
{
  for (const char* id :
       {VLXJBXMessages::NoEnvironment, VLXJBXMessages::OperationFailed, VLXJBXMessages::JvmCreationFailed,
        VLXJBXMessages::JavaException, VLXJBXMessages::LookupFailed, VLXJBXMessages::ConversionFailed,
        VLXJBXMessages::ExceptionPending, VLXJBXMessages::InvalidArgument, VLXJBXMessages::BindingMissing}) {
    VLXUnicodeString text;
    EXPECT_EQ(VLXError::LookupMessage(VLXJBXMessages::Catalog, id, text), 1) << id;
  }
}

}  // namespace
