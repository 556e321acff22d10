#include "VLXJBXJNIConverter.h"

#include "VLXJBXException.h"
#include "VLXJBXInternal.h"
#include "VLXResult.h"

#include <string>
#include <vector>

using VLXJBXDetail::LocalRef;
using VLXJBXDetail::Raise;

namespace {
// Checks the environment and the pending-exception state shared by every conversion.
long Enter(JNIEnv* env, const char* operation)
{
  if (env == nullptr)
    return Raise(VLX_E_INVALIDARG, VLXJBXMessages::InvalidArgument, {operation, "null environment"}, __FILE__,
                 __LINE__);
  if (env->ExceptionCheck())
    return Raise(VLX_E_FAIL, VLXJBXMessages::ExceptionPending, {operation}, __FILE__, __LINE__);
  return VLX_S_OK;
}

// After a JNI call that failed with (or without) a Java exception.
long JavaFailed(JNIEnv* env, const char* operation, const char* step)
{
  const std::string exception =
      env->ExceptionCheck() ? VLXJBXDetail::TakeException(env).Describe() : std::string("no exception");
  return Raise(VLX_E_FAIL, VLXJBXMessages::ConversionFailed, {operation, std::string(step) + " failed: " + exception},
               __FILE__, __LINE__);
}

// `input` must be null or an instance of `cls` (when that class could be resolved).
long CheckClass(JNIEnv* env, jobject input, jclass cls, const char* operation, const char* expected)
{
  if (input == nullptr || cls == nullptr || env->IsInstanceOf(input, cls)) return VLX_S_OK;
  return Raise(VLX_E_INVALIDARG, VLXJBXMessages::InvalidArgument,
               {operation, std::string("the Java value is not a ") + expected}, __FILE__, __LINE__);
}

// A new Java string from UTF-8 bytes. `what` names the text in error messages ("the text",
// "element 3 of the list").
long NewJavaString(JNIEnv* env, const char* bytes, int length, const char* operation, const std::string& what,
                   jstring& output)
{
  // UTF-16 never needs more units than UTF-8 has bytes.
  jchar small[256];
  std::vector<jchar> large;
  jchar* units = small;
  if (length > static_cast<int>(sizeof small / sizeof small[0])) {
    large.resize(static_cast<size_t>(length));
    units = large.data();
  }
  const unsigned char* s = reinterpret_cast<const unsigned char*>(bytes);
  // An ASCII start is copied as it is; the rest, from the first other byte, is checked, then decoded.
  int i = 0;
  for (; i < length && s[i] < 0x80; ++i) units[i] = s[i];
  jsize n = i;
  if (i < length) {
    const char* reason = nullptr;
    const int bad = VLXUnicodeString::FirstMalformedOffset(bytes + i, length - i, &reason);
    if (bad >= 0)
      return Raise(VLX_E_INVALIDARG, VLXJBXMessages::ConversionFailed,
                   {operation, "the byte at offset " + std::to_string(i + bad) + " of " + what +
                                   " is not valid UTF-8 (" + reason + ")"},
                   __FILE__, __LINE__);
  }
  n += VLXUnicodeString::DecodeUtf8(bytes + i, length - i, units + n);
  // NewString fails only with a null result (and an OutOfMemoryError pending).
  jstring result = env->NewString(units, n);
  if (result == nullptr) return JavaFailed(env, operation, "NewString");
  output = result;
  return VLX_S_OK;
}

const char kFromJavaString[] = "VLXJBXJNIConverter::BuildFromJavaType(jobject, VLXUnicodeString&)";

// The text's exact UTF-8 form; a text that UTF-8 cannot carry exactly fails, output untouched.
long StringFromJava(JNIEnv* env, jobject input, VLXUnicodeString& output)
{
  return VLXJBXDetail::WithUtf8(env, static_cast<jstring>(input), kFromJavaString,
                                [&output](const char* bytes, int length) { output = VLXUnicodeString(bytes, length); });
}

template <class JArray, class JElement, class Element>
long ToJavaArray(JNIEnv* env, const Element* data, int size, JArray (JNIEnv::*make)(jsize),
                 void (JNIEnv::*set)(JArray, jsize, jsize, const JElement*), const char* operation, JArray& output)
{
  static_assert(sizeof(JElement) == sizeof(Element), "element layouts differ");
  const long rc = Enter(env, operation);
  if (VLX_FAILED(rc)) return rc;
  LocalRef array(env, (env->*make)(size));
  if (array.get() == nullptr || env->ExceptionCheck()) return JavaFailed(env, operation, "creating the array");
  if (size > 0) {
    (env->*set)(static_cast<JArray>(array.get()), 0, size, reinterpret_cast<const JElement*>(data));
    if (env->ExceptionCheck()) return JavaFailed(env, operation, "filling the array");
  }
  output = static_cast<JArray>(array.release());
  return VLX_S_OK;
}

// Reads a primitive array into `buffer` (replaced). A null input gives an empty buffer.
template <class JArray, class JElement, class Element>
long FromJavaArray(JNIEnv* env, jobject input, jclass VLXJBXDetail::JavaLang::*cls, const char* javaName,
                   void (JNIEnv::*get)(JArray, jsize, jsize, JElement*), const char* operation,
                   std::vector<Element>& buffer)
{
  static_assert(sizeof(JElement) == sizeof(Element), "element layouts differ");
  long rc = Enter(env, operation);
  if (VLX_SUCCEEDED(rc)) rc = CheckClass(env, input, VLXJBXDetail::Lang(env).*cls, operation, javaName);
  if (VLX_FAILED(rc)) return rc;
  buffer.clear();
  if (input == nullptr) return VLX_S_OK;
  JArray array = static_cast<JArray>(input);
  const jsize length = env->GetArrayLength(array);
  if (length > 0) {
    buffer.resize(static_cast<size_t>(length));
    (env->*get)(array, 0, length, reinterpret_cast<JElement*>(buffer.data()));
    if (env->ExceptionCheck()) return JavaFailed(env, operation, "reading the array");
  }
  return VLX_S_OK;
}
}  // namespace

// ---- strings ----

namespace {
const char kStringOperation[] = "VLXJBXJNIConverter::ConvertToJavaType(const VLXUnicodeString&, jstring&)";
}

long VLXJBXJNIConverter::ConvertToJavaType(JNIEnv* env, const VLXUnicodeString& input, jstring& output)
{
  const long rc = Enter(env, kStringOperation);
  if (VLX_FAILED(rc)) return rc;
  return ConvertToJavaString(env, input, output);
}

long VLXJBXJNIConverter::ConvertToJavaString(JNIEnv* env, const VLXUnicodeString& input, jstring& output)
{
  return NewJavaString(env, input.c_str(), input.GetLengthInByte(), kStringOperation, "the text", output);
}

long VLXJBXJNIConverter::BuildFromJavaType(JNIEnv* env, jobject input, VLXUnicodeString& output)
{
  long rc = Enter(env, kFromJavaString);
  if (VLX_SUCCEEDED(rc))
    rc = CheckClass(env, input, VLXJBXDetail::Lang(env).stringClass, kFromJavaString, "java.lang.String");
  if (VLX_FAILED(rc)) return rc;
  return StringFromJava(env, input, output);
}

long VLXJBXJNIConverter::BuildFromJavaString(JNIEnv* env, jstring input, VLXUnicodeString& output)
{
  return StringFromJava(env, input, output);
}

// ---- string lists ----

long VLXJBXJNIConverter::ConvertToJavaType(JNIEnv* env, const VLXListValVLXUnicodeString& input, jobjectArray& output)
{
  static const char kOperation[] =
      "VLXJBXJNIConverter::ConvertToJavaType(const VLXListValVLXUnicodeString&, jobjectArray&)";
  const long rc = Enter(env, kOperation);
  if (VLX_FAILED(rc)) return rc;
  jclass stringClass = VLXJBXDetail::Lang(env).stringClass;
  if (stringClass == nullptr)
    return Raise(VLX_E_FAIL, VLXJBXMessages::ConversionFailed, {kOperation, "class java.lang.String not found"},
                 __FILE__, __LINE__);
  const int size = input.Size();
  LocalRef array(env, env->NewObjectArray(size, stringClass, nullptr));
  if (array.get() == nullptr || env->ExceptionCheck()) return JavaFailed(env, kOperation, "creating the array");
  jobjectArray result = static_cast<jobjectArray>(array.get());
  for (int i = 1; i <= size; ++i) {
    const VLXUnicodeString& text = input[i];
    jstring element = nullptr;
    const long converted = NewJavaString(env, text.c_str(), text.GetLengthInByte(), kOperation,
                                         "element " + std::to_string(i) + " of the list", element);
    if (VLX_FAILED(converted)) return converted;
    const LocalRef owned(env, element);
    env->SetObjectArrayElement(result, i - 1, element);
    if (env->ExceptionCheck()) return JavaFailed(env, kOperation, "storing an element");
  }
  output = static_cast<jobjectArray>(array.release());
  return VLX_S_OK;
}

long VLXJBXJNIConverter::BuildFromJavaType(JNIEnv* env, jobject input, VLXListValVLXUnicodeString& output)
{
  static const char kOperation[] = "VLXJBXJNIConverter::BuildFromJavaType(jobject, VLXListValVLXUnicodeString&)";
  long rc = Enter(env, kOperation);
  if (VLX_FAILED(rc)) return rc;
  const VLXJBXDetail::JavaLang& lang = VLXJBXDetail::Lang(env);
  rc = CheckClass(env, input, lang.objectArrayClass, kOperation, "object array");
  if (VLX_FAILED(rc)) return rc;
  if (input == nullptr) {
    output.RemoveAll(1);
    return VLX_S_OK;
  }
  jobjectArray array = static_cast<jobjectArray>(input);
  const jsize length = env->GetArrayLength(array);
  VLXListValVLXUnicodeString result(length);
  for (jsize i = 0; i < length; ++i) {
    LocalRef element(env, env->GetObjectArrayElement(array, i));
    if (env->ExceptionCheck()) return JavaFailed(env, kOperation, "reading an element");
    if (element.get() != nullptr && lang.stringClass != nullptr && !env->IsInstanceOf(element.get(), lang.stringClass))
      return Raise(VLX_E_INVALIDARG, VLXJBXMessages::InvalidArgument,
                   {kOperation, "element " + std::to_string(i) + " of the Java array is not a java.lang.String"},
                   __FILE__, __LINE__);
    const long converted = VLXJBXDetail::WithUtf8(
        env, static_cast<jstring>(element.get()), kOperation,
        [&result](const char* bytes, int length) { result.Append(VLXUnicodeString(bytes, length)); });
    if (VLX_FAILED(converted)) return converted;
  }
  output = std::move(result);
  return VLX_S_OK;
}

// ---- primitive arrays ----

long VLXJBXJNIConverter::ConvertToJavaType(JNIEnv* env, const VLXListValVLXBoolean& input, jbooleanArray& output)
{
  // Any non-zero byte is true: Java sees only 0 or 1.
  const int size = input.Size();
  std::vector<VLXBoolean> normalised(static_cast<size_t>(size));
  for (int i = 0; i < size; ++i) normalised[static_cast<size_t>(i)] = input.Data()[i] != 0;
  return ToJavaArray<jbooleanArray, jboolean>(
      env, normalised.data(), size, &JNIEnv::NewBooleanArray, &JNIEnv::SetBooleanArrayRegion,
      "VLXJBXJNIConverter::ConvertToJavaType(const VLXListValVLXBoolean&, jbooleanArray&)", output);
}

long VLXJBXJNIConverter::BuildFromJavaType(JNIEnv* env, jobject input, VLXListValVLXBoolean& output)
{
  std::vector<VLXBoolean> buffer;
  const long rc = FromJavaArray<jbooleanArray, jboolean>(
      env, input, &VLXJBXDetail::JavaLang::booleanArrayClass, "boolean[]", &JNIEnv::GetBooleanArrayRegion,
      "VLXJBXJNIConverter::BuildFromJavaType(jobject, VLXListValVLXBoolean&)", buffer);
  if (VLX_SUCCEEDED(rc)) output.Assign(buffer.data(), static_cast<int>(buffer.size()));
  return rc;
}

long VLXJBXJNIConverter::ConvertToJavaType(JNIEnv* env, const VLXBinary& input, jbyteArray& output)
{
  return ToJavaArray<jbyteArray, jbyte>(env, input.getData(), input.getLength(), &JNIEnv::NewByteArray,
                                        &JNIEnv::SetByteArrayRegion,
                                        "VLXJBXJNIConverter::ConvertToJavaType(const VLXBinary&, jbyteArray&)", output);
}

long VLXJBXJNIConverter::BuildFromJavaType(JNIEnv* env, jobject input, VLXBinary& output)
{
  std::vector<unsigned char> buffer;
  const long rc = FromJavaArray<jbyteArray, jbyte>(
      env, input, &VLXJBXDetail::JavaLang::byteArrayClass, "byte[]", &JNIEnv::GetByteArrayRegion,
      "VLXJBXJNIConverter::BuildFromJavaType(jobject, VLXBinary&)", buffer);
  if (VLX_SUCCEEDED(rc)) output = VLXBinary(buffer.data(), static_cast<int>(buffer.size()));
  return rc;
}

long VLXJBXJNIConverter::ConvertToJavaType(JNIEnv* env, const VLXRawCollint& input, jintArray& output)
{
  return ToJavaArray<jintArray, jint>(env, input.Data(), input.Size(), &JNIEnv::NewIntArray, &JNIEnv::SetIntArrayRegion,
                                      "VLXJBXJNIConverter::ConvertToJavaType(const VLXRawCollint&, jintArray&)",
                                      output);
}

long VLXJBXJNIConverter::BuildFromJavaType(JNIEnv* env, jobject input, VLXRawCollint& output)
{
  std::vector<int> buffer;
  const long rc = FromJavaArray<jintArray, jint>(
      env, input, &VLXJBXDetail::JavaLang::intArrayClass, "int[]", &JNIEnv::GetIntArrayRegion,
      "VLXJBXJNIConverter::BuildFromJavaType(jobject, VLXRawCollint&)", buffer);
  if (VLX_SUCCEEDED(rc)) output.Assign(buffer.data(), static_cast<int>(buffer.size()));
  return rc;
}

long VLXJBXJNIConverter::ConvertToJavaType(JNIEnv* env, const VLXRawColldouble& input, jdoubleArray& output)
{
  return ToJavaArray<jdoubleArray, jdouble>(
      env, input.Data(), input.Size(), &JNIEnv::NewDoubleArray, &JNIEnv::SetDoubleArrayRegion,
      "VLXJBXJNIConverter::ConvertToJavaType(const VLXRawColldouble&, jdoubleArray&)", output);
}

long VLXJBXJNIConverter::BuildFromJavaType(JNIEnv* env, jobject input, VLXRawColldouble& output)
{
  std::vector<double> buffer;
  const long rc = FromJavaArray<jdoubleArray, jdouble>(
      env, input, &VLXJBXDetail::JavaLang::doubleArrayClass, "double[]", &JNIEnv::GetDoubleArrayRegion,
      "VLXJBXJNIConverter::BuildFromJavaType(jobject, VLXRawColldouble&)", buffer);
  if (VLX_SUCCEEDED(rc)) output.Assign(buffer.data(), static_cast<int>(buffer.size()));
  return rc;
}

// ---- jobject forms ----

namespace {
template <class Native, class JOut>
long AsObject(JNIEnv* env, const Native& input, jobject& output)
{
  JOut typed = nullptr;
  const long rc = VLXJBXJNIConverter::ConvertToJavaType(env, input, typed);
  if (VLX_SUCCEEDED(rc)) output = typed;
  return rc;
}
}  // namespace

long VLXJBXJNIConverter::ConvertToJavaType(JNIEnv* env, const VLXUnicodeString& input, jobject& output)
{
  return AsObject<VLXUnicodeString, jstring>(env, input, output);
}
long VLXJBXJNIConverter::ConvertToJavaType(JNIEnv* env, const VLXListValVLXUnicodeString& input, jobject& output)
{
  return AsObject<VLXListValVLXUnicodeString, jobjectArray>(env, input, output);
}
long VLXJBXJNIConverter::ConvertToJavaType(JNIEnv* env, const VLXListValVLXBoolean& input, jobject& output)
{
  return AsObject<VLXListValVLXBoolean, jbooleanArray>(env, input, output);
}
long VLXJBXJNIConverter::ConvertToJavaType(JNIEnv* env, const VLXBinary& input, jobject& output)
{
  return AsObject<VLXBinary, jbyteArray>(env, input, output);
}
long VLXJBXJNIConverter::ConvertToJavaType(JNIEnv* env, const VLXRawCollint& input, jobject& output)
{
  return AsObject<VLXRawCollint, jintArray>(env, input, output);
}
long VLXJBXJNIConverter::ConvertToJavaType(JNIEnv* env, const VLXRawColldouble& input, jobject& output)
{
  return AsObject<VLXRawColldouble, jdoubleArray>(env, input, output);
}
