// The java.lang classes the bridge itself uses, and Java exceptions and texts in native words.
#include "VLXJBXInternal.h"

#include <mutex>

namespace
{
jclass GlobalClass(JNIEnv* env, const char* name)
{
  jclass local = env->FindClass(name);
  if (env->ExceptionCheck()) {
    env->ExceptionClear();
    return nullptr;
  }
  jclass global = static_cast<jclass>(env->NewGlobalRef(local));
  env->DeleteLocalRef(local);
  return global;
}

jmethodID Method(JNIEnv* env, jclass cls, const char* name, const char* signature)
{
  if (cls == nullptr)
    return nullptr;
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
  if (getMessage == nullptr)
    return "(message unavailable)";
  VLXJBXDetail::LocalRef message(env, env->CallObjectMethod(throwable, getMessage));
  if (env->ExceptionCheck()) {
    // getMessage may be overridden and throw itself.
    env->ExceptionClear();
    return "(message unavailable: getMessage failed)";
  }
  if (message.get() == nullptr)
    return "(no message)";
  return VLXJBXDetail::JavaToUtf8(env, static_cast<jstring>(message.get()));
}
}

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
    jclass classClass = env->FindClass("java/lang/Class");
    if (env->ExceptionCheck())
      env->ExceptionClear();
    lang.classGetName = Method(env, classClass, "getName", "()Ljava/lang/String;");
    if (classClass != nullptr)
      env->DeleteLocalRef(classClass);
    jclass throwable = env->FindClass("java/lang/Throwable");
    if (env->ExceptionCheck())
      env->ExceptionClear();
    lang.throwableGetMessage = Method(env, throwable, "getMessage", "()Ljava/lang/String;");
    lang.throwableGetCause = Method(env, throwable, "getCause", "()Ljava/lang/Throwable;");
    if (throwable != nullptr)
      env->DeleteLocalRef(throwable);
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
  if (getName == nullptr)
    return false;
  LocalRef cls(env, env->GetObjectClass(object));
  LocalRef text(env, env->CallObjectMethod(cls.get(), getName));
  if (env->ExceptionCheck()) {
    env->ExceptionClear();
    return false;
  }
  name = JavaToUtf8(env, static_cast<jstring>(text.get()));
  return true;
}

int VLXJBXDetail::Utf16ToUtf8(const jchar* units, jsize count, char* out)
{
  int n = 0;
  for (jsize i = 0; i < count; ++i) {
    unsigned long c = units[i];
    if (c >= 0xD800 && c <= 0xDBFF && i + 1 < count && units[i + 1] >= 0xDC00 && units[i + 1] <= 0xDFFF) {
      c = 0x10000 + ((c - 0xD800) << 10) + (units[i + 1] - 0xDC00);
      ++i;
    } else if (c >= 0xD800 && c <= 0xDFFF) {
      c = 0xFFFD; // unpaired surrogate
    }
    if (c < 0x80) {
      out[n++] = static_cast<char>(c);
    } else if (c < 0x800) {
      out[n++] = static_cast<char>(0xC0 | (c >> 6));
      out[n++] = static_cast<char>(0x80 | (c & 0x3F));
    } else if (c < 0x10000) {
      out[n++] = static_cast<char>(0xE0 | (c >> 12));
      out[n++] = static_cast<char>(0x80 | ((c >> 6) & 0x3F));
      out[n++] = static_cast<char>(0x80 | (c & 0x3F));
    } else {
      out[n++] = static_cast<char>(0xF0 | (c >> 18));
      out[n++] = static_cast<char>(0x80 | ((c >> 12) & 0x3F));
      out[n++] = static_cast<char>(0x80 | ((c >> 6) & 0x3F));
      out[n++] = static_cast<char>(0x80 | (c & 0x3F));
    }
  }
  return n;
}

std::string VLXJBXDetail::JavaToUtf8(JNIEnv* env, jstring text)
{
  return WithUtf8(env, text, [](const char* bytes, int length) { return std::string(bytes, static_cast<size_t>(length)); });
}
