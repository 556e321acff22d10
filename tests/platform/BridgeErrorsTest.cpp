// Lookups that fail and Java exceptions: cleared, recorded as last errors that say what happened.
#include "BridgeSupport.h"
#include "VLXJBXException.h"
#include "VLXJBXJNIHelper.h"

namespace
{

using LookupTest = BridgeTest;

bool Contains(const std::string& text, const std::string& part) { return text.find(part) != std::string::npos; }

TEST_F(LookupTest, ClassLookupMakesACountedGlobalReference)
{
  const long before = VLXJBXJNIUtilities::GetGlobalRefCount();
  jclass cls = nullptr;
  ASSERT_EQ(VLXJBXJNIUtilities::NewGlobalRefForClass(env, "java/lang/String", cls), VLX_S_OK);
  ASSERT_NE(cls, nullptr);
  EXPECT_EQ(env->GetObjectRefType(cls), JNIGlobalRefType);
  EXPECT_EQ(VLXJBXJNIUtilities::GetGlobalRefCount(), before + 1);
  VLXJBXJNIHelper::DeleteGlobalRef(env, cls);
  EXPECT_EQ(VLXJBXJNIUtilities::GetGlobalRefCount(), before);
}

TEST_F(LookupTest, MissingClassIsClearedReportedAndLeavesTheOutputAlone)
{
  const long before = VLXJBXJNIUtilities::GetGlobalRefCount();
  jclass sentinel = reinterpret_cast<jclass>(0x1234);
  jclass cls = sentinel;
  const long rc = VLXJBXJNIUtilities::NewGlobalRefForClass(env, "com/nowhere/Missing", cls);
  EXPECT_LT(rc, 0);
  EXPECT_EQ(cls, sentinel);
  EXPECT_FALSE(env->ExceptionCheck());
  EXPECT_EQ(VLXJBXJNIUtilities::GetGlobalRefCount(), before);
  const ErrorView e = TakeLastError();
  EXPECT_EQ(e.id, VLXJBXMessages::LookupFailed);
  EXPECT_TRUE(Contains(e.text, "class 'com/nowhere/Missing' could not be found")) << e.text;
  EXPECT_TRUE(Contains(e.text, "java.lang.NoClassDefFoundError")) << e.text;
}

TEST_F(LookupTest, MissingMembersNameTheMemberTheSignatureAndTheClass)
{
  jclass string = Find("java/lang/String");
  jmethodID method = nullptr;
  EXPECT_LT(VLXJBXJNIUtilities::GetMethodID(env, string, "noSuchMethod", "()V", method), 0);
  EXPECT_EQ(method, nullptr);
  EXPECT_FALSE(env->ExceptionCheck());
  ErrorView e = TakeLastError();
  EXPECT_EQ(e.id, VLXJBXMessages::LookupFailed);
  EXPECT_TRUE(Contains(e.text, "method 'noSuchMethod' with signature '()V' of class 'java.lang.String'")) << e.text;
  EXPECT_TRUE(Contains(e.text, "NoSuchMethodError")) << e.text;

  // valueOf(int) exists, but it is static: the instance lookup fails, the static one works.
  EXPECT_LT(VLXJBXJNIUtilities::GetMethodID(env, string, "valueOf", "(I)Ljava/lang/String;", method), 0);
  TakeLastError();
  EXPECT_EQ(VLXJBXJNIUtilities::GetStaticMethodID(env, string, "valueOf", "(I)Ljava/lang/String;", method), VLX_S_OK);
  EXPECT_NE(method, nullptr);
  EXPECT_LT(VLXJBXJNIUtilities::GetStaticMethodID(env, string, "valueOf", "(Z)I", method), 0);
  e = TakeLastError();
  EXPECT_TRUE(Contains(e.text, "static method 'valueOf' with signature '(Z)I'")) << e.text;

  jfieldID field = nullptr;
  EXPECT_EQ(VLXJBXJNIUtilities::GetStaticFieldID(env, string, "CASE_INSENSITIVE_ORDER", "Ljava/util/Comparator;",
                                                 field),
            VLX_S_OK);
  EXPECT_NE(field, nullptr);
  jfieldID untouched = field;
  EXPECT_LT(VLXJBXJNIUtilities::GetStaticFieldID(env, string, "CASE_INSENSITIVE_ORDER", "I", field), 0);
  EXPECT_EQ(field, untouched);
  e = TakeLastError();
  EXPECT_TRUE(Contains(e.text, "static field 'CASE_INSENSITIVE_ORDER' with signature 'I'")) << e.text;
  EXPECT_TRUE(Contains(e.text, "NoSuchFieldError")) << e.text;
  EXPECT_FALSE(env->ExceptionCheck());
}

TEST_F(LookupTest, LookupsRefuseToRunWithAnExceptionPendingOrNullArguments)
{
  jclass string = Find("java/lang/String");
  jmethodID method = nullptr;
  EXPECT_EQ(VLXJBXJNIUtilities::GetMethodID(env, nullptr, "length", "()I", method), VLX_E_INVALIDARG);
  EXPECT_EQ(VLXJBXJNIUtilities::GetMethodID(nullptr, string, "length", "()I", method), VLX_E_INVALIDARG);
  jclass cls = nullptr;
  EXPECT_EQ(VLXJBXJNIUtilities::NewGlobalRefForClass(env, nullptr, cls), VLX_E_INVALIDARG);
  env->ThrowNew(Find("java/lang/IllegalStateException"), "pending");
  EXPECT_LT(VLXJBXJNIUtilities::GetMethodID(env, string, "length", "()I", method), 0);
  EXPECT_TRUE(env->ExceptionCheck()) << "the caller's exception is left for the caller";
  env->ExceptionClear();
  EXPECT_EQ(TakeLastError().id, VLXJBXMessages::ExceptionPending);
  EXPECT_EQ(method, nullptr);
}

// ---- HandleJavaError ----

using JavaErrorTest = BridgeTest;

// Throws new `cls`(message, cause) (cause may be null).
void ThrowWithCause(JNIEnv* env, jclass cls, const char* message, jthrowable cause)
{
  jmethodID ctor = env->GetMethodID(cls, "<init>", "(Ljava/lang/String;Ljava/lang/Throwable;)V");
  jstring text = message != nullptr ? env->NewStringUTF(message) : nullptr;
  jthrowable t = static_cast<jthrowable>(VLXJBXJNIHelper::NewObject(env, cls, ctor, text, cause));
  ASSERT_FALSE(env->ExceptionCheck());
  env->Throw(t);
}

TEST_F(JavaErrorTest, PendingExceptionIsClearedAndRecordedWithClassMessageAndCause)
{
  jclass ise = Find("java/lang/IllegalStateException");
  jthrowable inner = static_cast<jthrowable>(VLXJBXJNIHelper::NewObject(
      env, ise, env->GetMethodID(ise, "<init>", "(Ljava/lang/String;)V"), env->NewStringUTF("inner reason")));
  ASSERT_FALSE(env->ExceptionCheck());
  ThrowWithCause(env, Find("java/lang/RuntimeException"), "outer text", inner);
  ASSERT_TRUE(env->ExceptionCheck());

  EXPECT_EQ(VLXJBXJNIUtilities::HandleJavaError(env, 0, "VLXKDMReplica::GetName(VLXUnicodeString&)", nullptr, 0),
            VLX_E_FAIL);
  EXPECT_FALSE(env->ExceptionCheck());
  const ErrorView e = TakeLastError();
  EXPECT_EQ(e.id, VLXJBXMessages::JavaException);
  ASSERT_EQ(e.parameters.size(), 4u);
  EXPECT_EQ(e.parameters[0], "VLXKDMReplica::GetName(VLXUnicodeString&)");
  EXPECT_EQ(e.parameters[1], "java.lang.RuntimeException");
  EXPECT_EQ(e.parameters[2], "outer text");
  EXPECT_EQ(e.parameters[3], "; caused by java.lang.IllegalStateException: inner reason");
  EXPECT_EQ(e.text, "VLXKDMReplica::GetName(VLXUnicodeString&) failed with the Java exception "
                    "java.lang.RuntimeException: outer text; caused by java.lang.IllegalStateException: inner reason");
}

TEST_F(JavaErrorTest, ExceptionsOfRealCallsAndWithoutMessageOrWithUnicodeMessage)
{
  jclass integer = Find("java/lang/Integer");
  jmethodID parse = env->GetStaticMethodID(integer, "parseInt", "(Ljava/lang/String;)I");
  env->CallStaticIntMethod(integer, parse, env->NewStringUTF("x1"));
  // flag 1: printed to standard error first, still described and recorded.
  EXPECT_EQ(VLXJBXJNIUtilities::HandleJavaError(env, 1, "parse", nullptr, 1), VLX_E_FAIL);
  ErrorView e = TakeLastError();
  ASSERT_EQ(e.parameters.size(), 4u);
  EXPECT_EQ(e.parameters[1], "java.lang.NumberFormatException");
  EXPECT_TRUE(Contains(e.parameters[2], "\"x1\"")) << e.parameters[2];
  EXPECT_EQ(e.parameters[3], "");

  env->ThrowNew(Find("java/lang/UnsupportedOperationException"), nullptr);
  EXPECT_EQ(VLXJBXJNIUtilities::HandleJavaError(env, 0, "op", nullptr, 0), VLX_E_FAIL);
  e = TakeLastError();
  EXPECT_EQ(e.parameters[2], "(no message)");

  // A message outside the BMP, with an embedded NUL, crosses exactly (not as modified UTF-8).
  const std::u16string units = u"bad \U0001F600 value" + std::u16string(1, u'\0') + u"end";
  jstring message = JavaString(env, units);
  jclass iae = Find("java/lang/IllegalArgumentException");
  jobject thrown = env->NewObject(iae, env->GetMethodID(iae, "<init>", "(Ljava/lang/String;)V"), message);
  ASSERT_FALSE(env->ExceptionCheck());
  env->Throw(static_cast<jthrowable>(thrown));
  EXPECT_EQ(VLXJBXJNIUtilities::HandleJavaError(env, 0, "op", nullptr, 0), VLX_E_FAIL);
  e = TakeLastError();
  EXPECT_EQ(e.parameters[2], std::string("bad \xF0\x9F\x98\x80 value\0end", 18));
}

TEST_F(JavaErrorTest, WithoutAnExceptionTheCodeDecides)
{
  EXPECT_EQ(VLXJBXJNIUtilities::HandleJavaError(env, 0, "op", nullptr, 0), VLX_S_OK);
  EXPECT_EQ(VLXJBXJNIUtilities::HandleJavaError(env, 5, "op", nullptr, 0), VLX_S_OK);
  EXPECT_FALSE(TakeLastError().present) << "success records nothing";

  EXPECT_EQ(VLXJBXJNIUtilities::HandleJavaError(env, VLX_E_INVALIDARG, "VLXKDMModel::GetName()", nullptr, 0),
            VLX_E_FAIL);
  ErrorView e = TakeLastError();
  EXPECT_EQ(e.id, VLXJBXMessages::OperationFailed);
  EXPECT_EQ(e.text, "VLXKDMModel::GetName() failed: it returned the failure code -2147024809 and recorded no cause");

  // The operation's own error is kept, not replaced; one recorded before the operation started is
  // never taken for its cause.
  VLXJBXException* own = new VLXJBXException(VLXJBXMessages::ConversionFailed);
  VLXError::MarkOperationStart();
  VLXError::GetReturn(2, own, nullptr, __FILE__, __LINE__);
  EXPECT_EQ(VLXJBXJNIUtilities::HandleJavaError(env, VLX_E_FAIL, "op", nullptr, 0), VLX_E_FAIL);
  VLXError* last = VLXError::VLXGetLastError(0, nullptr);
  EXPECT_EQ(last, own);
  if (last != nullptr)
    last->Release();
  VLXError::MarkOperationStart();
  EXPECT_EQ(VLXJBXJNIUtilities::HandleJavaError(env, VLX_E_FAIL, "later", nullptr, 0), VLX_E_FAIL);
  EXPECT_EQ(TakeLastError().parameters[0], "later");
}

TEST_F(JavaErrorTest, AGivenErrorObjectIsTakenOverInEveryCase)
{
  VLXJBXException* given = new VLXJBXException(VLXJBXMessages::OperationFailed);
  const VLXUnicodeString p[] = {"mine", "why"};
  given->SetNLSRequestParams(2, p);
  EXPECT_EQ(VLXJBXJNIUtilities::HandleJavaError(env, -1, "op", given, 0), VLX_E_FAIL);
  EXPECT_EQ(TakeLastError().text, "mine failed: why");

  env->ThrowNew(Find("java/lang/IllegalStateException"), "described to stderr");
  given = new VLXJBXException(VLXJBXMessages::OperationFailed);
  given->SetNLSRequestParams(2, p);
  EXPECT_EQ(VLXJBXJNIUtilities::HandleJavaError(env, 0, "op", given, 1), VLX_E_FAIL);
  EXPECT_FALSE(env->ExceptionCheck());
  EXPECT_EQ(TakeLastError().text, "mine failed: why");

  // Success: the given error is released (the sanitizer run would report a leak otherwise).
  EXPECT_EQ(VLXJBXJNIUtilities::HandleJavaError(env, 0, "op", new VLXJBXException("x"), 0), VLX_S_OK);
  EXPECT_FALSE(TakeLastError().present);
}

TEST(BridgeCatalog, EveryIdHasAnEnglishText)
{
  for (const char* id : {VLXJBXMessages::NoEnvironment, VLXJBXMessages::OperationFailed,
                         VLXJBXMessages::JvmCreationFailed, VLXJBXMessages::JavaException,
                         VLXJBXMessages::LookupFailed, VLXJBXMessages::ConversionFailed,
                         VLXJBXMessages::ExceptionPending, VLXJBXMessages::InvalidArgument,
                         VLXJBXMessages::BindingMissing}) {
    VLXUnicodeString text;
    EXPECT_EQ(VLXError::LookupMessage(VLXJBXMessages::Catalog, id, text), 1) << id;
  }
  VLXJBXException e(VLXJBXMessages::BindingMissing);
  const VLXUnicodeString p[] = {"ReplicaStubs::init", "class com/velmora/tessara/kdmreplica/Replica"};
  e.SetNLSRequestParams(2, p);
  EXPECT_EQ(Str(e.GetMessageText()), "the Java side could not be bound for ReplicaStubs::init: class "
                                     "com/velmora/tessara/kdmreplica/Replica is missing");
  EXPECT_STREQ(e.GetCatalog(), "VLXJBXInfraErrorMessages");
  EXPECT_EQ(e.IsAKindOf("VLXError"), 1);
}

} // namespace
