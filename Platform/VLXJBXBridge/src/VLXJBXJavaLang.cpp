// The java.lang classes the bridge itself uses, and Java exceptions and texts in native words.
#include "VLXJBXInternal.h"

#include "VLXJBXException.h"
#include "VLXResult.h"

#include <climits>
#include <cstdio>

#include <mutex>

using VLXJBXDetail::LocalRef;

namespace {
jclass GlobalClass(JNIEnv* env, const char* name)
{
  const LocalRef local(env, env->FindClass(name));
  if (env->ExceptionCheck()) {
    env->ExceptionClear();
    return nullptr;
  }
  return static_cast<jclass>(env->NewGlobalRef(local.get()));
}

jmethodID Method(JNIEnv* env, jclass cls, const char* name, const char* signature)
{
  if (cls == nullptr) return nullptr;
  jmethodID id = env->GetMethodID(cls, name, signature);
  if (env->ExceptionCheck()) {
    env->ExceptionClear();
    return nullptr;
  }
  return id;
}

std::string DescribeClass(JNIEnv* env, jobject object)
{
  std::string name;
  return VLXJBXDetail::ClassName(env, object, name) ? name : "(unknown class)";
}

std::string DescribeMessage(JNIEnv* env, jobject throwable)
{
  const jmethodID getMessage = VLXJBXDetail::Lang(env).throwableGetMessage;
  if (getMessage == nullptr) return "(message unavailable)";
  VLXJBXDetail::LocalRef message(env, env->CallObjectMethod(throwable, getMessage));
  if (env->ExceptionCheck()) {
    // getMessage may be overridden and throw itself.
    env->ExceptionClear();
    return "(message unavailable: getMessage failed)";
  }
  if (message.get() == nullptr) return "(no message)";
  return VLXJBXDetail::JavaToUtf8(env, static_cast<jstring>(message.get()));
}
}  // namespace

const VLXJBXDetail::JavaLang& VLXJBXDetail::Lang(JNIEnv* env)
{
  static JavaLang lang;
  static std::once_flag once;
  std::call_once(once, [env] {
    lang.stringClass = GlobalClass(env, "java/lang/String");
    lang.objectArrayClass = GlobalClass(env, "[Ljava/lang/Object;");
    lang.booleanArrayClass = GlobalClass(env, "[Z");
    lang.byteArrayClass = GlobalClass(env, "[B");
    lang.intArrayClass = GlobalClass(env, "[I");
    lang.doubleArrayClass = GlobalClass(env, "[D");
    const LocalRef classClass(env, env->FindClass("java/lang/Class"));
    if (env->ExceptionCheck()) env->ExceptionClear();
    lang.classGetName = Method(env, static_cast<jclass>(classClass.get()), "getName", "()Ljava/lang/String;");
    const LocalRef throwable(env, env->FindClass("java/lang/Throwable"));
    if (env->ExceptionCheck()) env->ExceptionClear();
    const jclass throwableClass = static_cast<jclass>(throwable.get());
    lang.throwableGetMessage = Method(env, throwableClass, "getMessage", "()Ljava/lang/String;");
    lang.throwableGetCause = Method(env, throwableClass, "getCause", "()Ljava/lang/Throwable;");
  });
  return lang;
}

VLXJBXDetail::JavaExceptionText VLXJBXDetail::TakeException(JNIEnv* env)
{
  JavaExceptionText text;
  LocalRef throwable(env, env->ExceptionOccurred());
  // No JNI call but the exception functions may run while it is pending.
  env->ExceptionClear();
  if (throwable.get() == nullptr) {
    text.className = "(unknown exception)";
    text.message = "(no message)";
    return text;
  }
  text.className = DescribeClass(env, throwable.get());
  text.message = DescribeMessage(env, throwable.get());
  const jmethodID getCause = Lang(env).throwableGetCause;
  if (getCause != nullptr) {
    LocalRef cause(env, env->CallObjectMethod(throwable.get(), getCause));
    if (env->ExceptionCheck())
      env->ExceptionClear();
    else if (cause.get() != nullptr && !env->IsSameObject(cause.get(), throwable.get()))
      text.cause = "; caused by " + DescribeClass(env, cause.get()) + ": " + DescribeMessage(env, cause.get());
  }
  return text;
}

bool VLXJBXDetail::ClassName(JNIEnv* env, jobject object, std::string& name)
{
  const jmethodID getName = Lang(env).classGetName;
  if (getName == nullptr) return false;
  LocalRef cls(env, env->GetObjectClass(object));
  LocalRef text(env, env->CallObjectMethod(cls.get(), getName));
  if (env->ExceptionCheck()) {
    env->ExceptionClear();
    return false;
  }
  name = JavaToUtf8(env, static_cast<jstring>(text.get()));
  return true;
}

long VLXJBXDetail::Utf16ToUtf8(const jchar* units, jsize count, char* out, bool lossy)
{
  return VLXUnicodeString::EncodeUtf16(units, count, out, lossy);
}

long VLXJBXDetail::RejectUnpairedSurrogate(const char* operation, jsize index, jchar unit)
{
  char code[8];
  std::snprintf(code, sizeof code, "%04X", static_cast<unsigned>(unit));
  return Raise(VLX_E_FAIL, VLXJBXMessages::ConversionFailed,
               {operation, std::string("the Java text holds an unpaired surrogate (U+") + code + ") at index " +
                               std::to_string(index) + ", which UTF-8 cannot carry"},
               __FILE__, __LINE__);
}

long VLXJBXDetail::LongTextToUtf8(JNIEnv* env, jstring text, jsize count, const char* operation, bool lossy,
                                  std::string& bytes)
{
  const size_t kMax = static_cast<size_t>(INT_MAX);
  const jsize kPiece = 8192;
  jchar units[kPiece];
  char encoded[3 * kPiece];
  bytes.clear();
  bytes.reserve(static_cast<size_t>(count) < kMax ? static_cast<size_t>(count) : kMax);
  for (jsize start = 0; start < count;) {
    jsize n = count - start < kPiece ? count - start : kPiece;
    env->GetStringRegion(text, start, n, units);
    // A high surrogate ending a piece is encoded with the unit after it, in the next piece.
    if (start + n < count && units[n - 1] >= 0xD800 && units[n - 1] <= 0xDBFF) --n;
    const long length = Utf16ToUtf8(units, n, encoded, lossy);
    if (length < 0)
      return RejectUnpairedSurrogate(operation, start + static_cast<jsize>(-1 - length), units[-1 - length]);
    if (bytes.size() + static_cast<size_t>(length) > kMax) {
      if (lossy) return VLX_S_OK;
      return Raise(VLX_E_FAIL, VLXJBXMessages::ConversionFailed,
                   {operation, "the Java text of " + std::to_string(count) +
                                   " characters is longer than 2147483647 bytes in UTF-8"},
                   __FILE__, __LINE__);
    }
    bytes.append(encoded, static_cast<size_t>(length));
    start += n;
  }
  return VLX_S_OK;
}

std::string VLXJBXDetail::JavaToUtf8(JNIEnv* env, jstring text)
{
  const jsize count = text == nullptr ? 0 : env->GetStringLength(text);
  std::string bytes;
  if (count <= 0) return bytes;
  LongTextToUtf8(env, text, count, "VLXJBXDetail::JavaToUtf8", true, bytes);
  return bytes;
}
