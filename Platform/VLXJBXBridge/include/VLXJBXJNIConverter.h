// VLXJBXJNIConverter: native values to Java values and back.
//
// Common rules
// - Each function returns a result code; on failure the last error says what went wrong
//   (VLXJBXMessages::ConversionFailed, or JavaException when the JVM refused, e.g. out of memory).
// - ConvertToJavaType writes a NEW LOCAL reference into its out-parameter, which the caller
//   deletes; on failure the out-parameter is left alone and no reference is left behind.
// - BuildFromJavaType REPLACES the content of its out-parameter (it never appends); on failure the
//   out-parameter is left as it was. A null Java input gives the empty value with success.
// - A call made while a Java exception is pending does nothing and returns VLX_E_FAIL
//   (VLXJBXMessages::ExceptionPending); a Java input of the wrong class gives VLX_E_INVALIDARG.
// - Strings cross exactly: UTF-8 to UTF-16 with supplementary characters as surrogate pairs and NUL
//   kept as NUL, and back. Text that is not well-formed UTF-8 is refused with VLX_E_INVALIDARG and a
//   last error naming the fault and its byte offset. A Java string holding an unpaired surrogate is
//   converted with U+FFFD (the replacement character) in its place.
// - Boolean bytes: any non-zero VLXBoolean goes to Java as true (1); Java booleans come back as 0 or 1.
// - Primitive arrays are copied in bulk.
#ifndef VLXJBXJNIConverter_h
#define VLXJBXJNIConverter_h

#include "VLXBinary.h"
#include "VLXListValVLXBoolean.h"
#include "VLXListValVLXUnicodeString.h"
#include "VLXRawColldouble.h"
#include "VLXRawCollint.h"
#include "VLXUnicodeString.h"

#include <jni.h>

class VLXJBXJNIConverter {
 public:
  // VLXUnicodeString <-> java.lang.String
  static long ConvertToJavaType(JNIEnv* env, const VLXUnicodeString& input, jstring& output);
  // The same for a caller that knows no exception is pending (not checked again); failures and
  // their last errors are the same.
  static long ConvertToJavaString(JNIEnv* env, const VLXUnicodeString& input, jstring& output);
  static long BuildFromJavaType(JNIEnv* env, jobject input, VLXUnicodeString& output);
  // The same for a reference known to be null or a java.lang.String (a method's declared String
  // result), read with no exception pending: neither is checked again.
  static long BuildFromJavaString(JNIEnv* env, jstring input, VLXUnicodeString& output);

  // VLXListValVLXUnicodeString <-> String[] (a null element of the Java array gives an empty string;
  // building also accepts any Object[] whose elements are strings)
  static long ConvertToJavaType(JNIEnv* env, const VLXListValVLXUnicodeString& input, jobjectArray& output);
  static long BuildFromJavaType(JNIEnv* env, jobject input, VLXListValVLXUnicodeString& output);

  // VLXListValVLXBoolean <-> boolean[]
  static long ConvertToJavaType(JNIEnv* env, const VLXListValVLXBoolean& input, jbooleanArray& output);
  static long BuildFromJavaType(JNIEnv* env, jobject input, VLXListValVLXBoolean& output);

  // VLXBinary <-> byte[]
  static long ConvertToJavaType(JNIEnv* env, const VLXBinary& input, jbyteArray& output);
  static long BuildFromJavaType(JNIEnv* env, jobject input, VLXBinary& output);

  // VLXRawCollint <-> int[]
  static long ConvertToJavaType(JNIEnv* env, const VLXRawCollint& input, jintArray& output);
  static long BuildFromJavaType(JNIEnv* env, jobject input, VLXRawCollint& output);

  // VLXRawColldouble <-> double[]
  static long ConvertToJavaType(JNIEnv* env, const VLXRawColldouble& input, jdoubleArray& output);
  static long BuildFromJavaType(JNIEnv* env, jobject input, VLXRawColldouble& output);

  // The same conversions writing into a plain jobject.
  static long ConvertToJavaType(JNIEnv* env, const VLXUnicodeString& input, jobject& output);
  static long ConvertToJavaType(JNIEnv* env, const VLXListValVLXUnicodeString& input, jobject& output);
  static long ConvertToJavaType(JNIEnv* env, const VLXListValVLXBoolean& input, jobject& output);
  static long ConvertToJavaType(JNIEnv* env, const VLXBinary& input, jobject& output);
  static long ConvertToJavaType(JNIEnv* env, const VLXRawCollint& input, jobject& output);
  static long ConvertToJavaType(JNIEnv* env, const VLXRawColldouble& input, jobject& output);
};

#endif
