// Converters: exact strings both ways, malformed text, null and wrong-class inputs, and large arrays.
#include "BridgeSupport.h"
#include "VLXJBXException.h"
#include "VLXJBXJNIConverter.h"

#include <climits>
#include <cmath>
#include <cstring>
#include <limits>

namespace
{

using ConverterTest = BridgeTest;

std::string Bytes(const char* s, size_t n) { return std::string(s, n); }
VLXUnicodeString U(const std::string& s) { return VLXUnicodeString(s.data(), static_cast<int>(s.size())); }

struct TextCase
{
  std::string utf8;
  std::u16string utf16;
};

// ---- strings ----

TEST_F(ConverterTest, StringsCrossExactlyInBothDirections)
{
  const TextCase cases[] = {
      {"", u""},
      {"plain", u"plain"},
      {"caf\xC3\xA9 \xE2\x82\xAC", u"caf\u00E9 \u20AC"},
      {"\xF0\x9F\x98\x80", u"\U0001F600"},                        // one surrogate pair
      {"\xF4\x8F\xBF\xBF", u"\U0010FFFF"},                        // the last code point
      {Bytes("a\0b", 3), std::u16string(u"a") + u'\0' + u"b"},     // NUL stays one unit
      {"\xEF\xBF\xBF\xEE\x80\x80\xED\x9F\xBF", u"\uFFFF\uE000\uD7FF"},
  };
  for (const TextCase& c : cases) {
    jstring js = nullptr;
    ASSERT_EQ(VLXJBXJNIConverter::ConvertToJavaType(env, U(c.utf8), js), VLX_S_OK);
    ASSERT_NE(js, nullptr);
    EXPECT_EQ(env->GetObjectRefType(js), JNILocalRefType);
    EXPECT_EQ(Units(env, js), c.utf16) << c.utf8;

    VLXUnicodeString back("previous content");
    jstring made = JavaString(env, c.utf16);
    ASSERT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, made, back), VLX_S_OK);
    EXPECT_EQ(Str(back), c.utf8);
    env->DeleteLocalRef(js);
    env->DeleteLocalRef(made);
  }
}

// UTF-8 cannot carry an unpaired surrogate: the text is refused, naming where, rather than changed.
// Long texts (read in pieces) find it too, also right after a piece boundary.
TEST_F(ConverterTest, UnpairedSurrogatesFromJavaAreRefusedNamingTheirIndex)
{
  const std::u16string high(1, char16_t(0xD83D)), low(1, char16_t(0xDE00));
  const std::u16string longText(8191, u'a');
  const struct {
    std::u16string text;
    const char* where;
  } cases[] = {
      {high, "(U+D83D) at index 0"},
      {low + u"x", "(U+DE00) at index 0"},
      {low + high, "(U+DE00) at index 0"},
      {u"a" + high + u"\U0001F600", "(U+D83D) at index 1"},
      {longText + high + u"b", "(U+D83D) at index 8191"},
      {longText + u"\U0001F600" + low, "(U+DE00) at index 8193"},
      {std::u16string(300, u'b') + high, "(U+D83D) at index 300"},
  };
  for (const auto& c : cases) {
    VLXUnicodeString out("kept");
    jstring js = JavaString(env, c.text);
    EXPECT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, js, out), VLX_E_FAIL);
    EXPECT_EQ(Str(out), "kept");
    const std::string text = TakeLastError().text;
    EXPECT_NE(text.find(c.where), std::string::npos) << text;
    env->DeleteLocalRef(js);
  }
  // A pair split by a piece boundary crosses whole.
  VLXUnicodeString out;
  jstring js = JavaString(env, longText + u"\U0001F600");
  ASSERT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, js, out), VLX_S_OK);
  EXPECT_EQ(Str(out), std::string(8191, 'a') + "\xF0\x9F\x98\x80");
  env->DeleteLocalRef(js);
}

TEST_F(ConverterTest, LongStringsUseTheHeapPathBothWays)
{
  std::string text;
  for (int i = 0; i < 5000; ++i)
    text += (i % 3 == 0) ? "\xF0\x9F\x98\x80" : (i % 3 == 1 ? "\xC3\xA9" : "z");
  jstring js = nullptr;
  ASSERT_EQ(VLXJBXJNIConverter::ConvertToJavaType(env, U(text), js), VLX_S_OK);
  EXPECT_EQ(env->GetStringLength(js), 5000 / 3 * 4 + 2 + 1);
  VLXUnicodeString back;
  ASSERT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, js, back), VLX_S_OK);
  EXPECT_TRUE(Str(back) == text);
  env->DeleteLocalRef(js);
}

struct Malformed
{
  std::string bytes;
  int offset;
  const char* reason;
};

TEST_F(ConverterTest, MalformedTextIsRefusedWithItsByteOffsetAndTheOutputUntouched)
{
  const Malformed cases[] = {
      {"ab\xC0\x80", 2, "overlong"},          {"x\xE0\x80\xAF", 1, "overlong"},
      {"\xED\xA0\x80", 0, "surrogate"},       {"okay\xF4\x90\x80\x80", 4, "above U+10FFFF"},
      {"abc\xE2\x82", 3, "truncated"},        {"a\x80z", 1, "continuation"},
      {"\xFF", 0, "never occurs"},
  };
  for (const Malformed& c : cases) {
    jstring sentinel = reinterpret_cast<jstring>(0x5678);
    jstring out = sentinel;
    EXPECT_EQ(VLXJBXJNIConverter::ConvertToJavaType(env, U(c.bytes), out), VLX_E_INVALIDARG);
    EXPECT_EQ(out, sentinel);
    EXPECT_FALSE(env->ExceptionCheck());
    const ErrorView e = TakeLastError();
    EXPECT_EQ(e.id, VLXJBXMessages::ConversionFailed);
    EXPECT_NE(e.text.find("the byte at offset " + std::to_string(c.offset) + " of the text is not valid UTF-8"),
              std::string::npos)
        << e.text;
    EXPECT_NE(e.text.find(c.reason), std::string::npos) << e.text;
  }
}

TEST_F(ConverterTest, NullJavaValuesGiveEmptyValuesAndWrongClassesAreRefused)
{
  VLXUnicodeString text("was here");
  EXPECT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, nullptr, text), VLX_S_OK);
  EXPECT_EQ(text.GetLengthInByte(), 0);

  VLXListValVLXUnicodeString strings;
  strings.Append("x");
  VLXListValVLXBoolean booleans;
  booleans.Append(1);
  VLXBinary bytes(3);
  VLXRawCollint ints;
  ints.Append(1);
  VLXRawColldouble doubles;
  doubles.Append(1.5);
  EXPECT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, nullptr, strings), VLX_S_OK);
  EXPECT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, nullptr, booleans), VLX_S_OK);
  EXPECT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, nullptr, bytes), VLX_S_OK);
  EXPECT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, nullptr, ints), VLX_S_OK);
  EXPECT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, nullptr, doubles), VLX_S_OK);
  EXPECT_EQ(strings.Size() + booleans.Size() + bytes.getLength() + ints.Size() + doubles.Size(), 0);

  // An int[] is neither a String, a String[], a boolean[] nor a double[].
  jintArray notIt = env->NewIntArray(2);
  text = "kept";
  strings.Append("kept");
  booleans.Append(1);
  doubles.Append(2.5);
  EXPECT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, notIt, text), VLX_E_INVALIDARG);
  EXPECT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, notIt, strings), VLX_E_INVALIDARG);
  EXPECT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, notIt, booleans), VLX_E_INVALIDARG);
  EXPECT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, notIt, doubles), VLX_E_INVALIDARG);
  EXPECT_STREQ(text.c_str(), "kept");
  EXPECT_EQ(strings.Size(), 1);
  EXPECT_EQ(booleans.Size(), 1);
  EXPECT_EQ(doubles.Size(), 1);
  EXPECT_EQ(TakeLastError().id, VLXJBXMessages::InvalidArgument);
  EXPECT_FALSE(env->ExceptionCheck());
}

TEST_F(ConverterTest, ConvertersRefuseToRunWithAnExceptionPending)
{
  env->ThrowNew(env->FindClass("java/lang/IllegalStateException"), "pending");
  jstring js = nullptr;
  VLXUnicodeString out("kept");
  EXPECT_EQ(VLXJBXJNIConverter::ConvertToJavaType(env, VLXUnicodeString("x"), js), VLX_E_FAIL);
  EXPECT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, nullptr, out), VLX_E_FAIL);
  EXPECT_TRUE(env->ExceptionCheck()) << "the caller's exception stays pending";
  env->ExceptionClear();
  EXPECT_EQ(js, nullptr);
  EXPECT_STREQ(out.c_str(), "kept");
  EXPECT_EQ(TakeLastError().id, VLXJBXMessages::ExceptionPending);
  EXPECT_EQ(VLXJBXJNIConverter::ConvertToJavaType(nullptr, VLXUnicodeString("x"), js), VLX_E_INVALIDARG);
}

// ---- string lists ----

TEST_F(ConverterTest, StringListsCrossElementByElement)
{
  VLXListValVLXUnicodeString list;
  list.Append("one");
  list.Append("");
  list.Append("\xF0\x9F\x98\x80");
  list.Append(U(Bytes("n\0l", 3)));
  jobjectArray array = nullptr;
  ASSERT_EQ(VLXJBXJNIConverter::ConvertToJavaType(env, list, array), VLX_S_OK);
  ASSERT_EQ(env->GetArrayLength(array), 4);
  jstring third = static_cast<jstring>(env->GetObjectArrayElement(array, 2));
  EXPECT_EQ(Units(env, third), u"\U0001F600");
  env->DeleteLocalRef(third);
  // A null element reads back as an empty string.
  env->SetObjectArrayElement(array, 0, nullptr);
  VLXListValVLXUnicodeString back;
  back.Append("replaced");
  ASSERT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, array, back), VLX_S_OK);
  ASSERT_EQ(back.Size(), 4);
  EXPECT_EQ(Str(back[1]), "");
  EXPECT_EQ(Str(back[3]), "\xF0\x9F\x98\x80");
  EXPECT_EQ(Str(back[4]), Bytes("n\0l", 3));
  env->DeleteLocalRef(array);

  jobjectArray empty = nullptr;
  ASSERT_EQ(VLXJBXJNIConverter::ConvertToJavaType(env, VLXListValVLXUnicodeString(), empty), VLX_S_OK);
  EXPECT_EQ(env->GetArrayLength(empty), 0);
}

TEST_F(ConverterTest, AMalformedElementNamesItsPositionAndLeavesNothingBehind)
{
  VLXListValVLXUnicodeString list;
  list.Append("fine");
  list.Append("bro\xC3");
  jobjectArray out = nullptr;
  EXPECT_EQ(VLXJBXJNIConverter::ConvertToJavaType(env, list, out), VLX_E_INVALIDARG);
  EXPECT_EQ(out, nullptr);
  const ErrorView e = TakeLastError();
  EXPECT_NE(e.text.find("the byte at offset 3 of element 2 of the list is not valid UTF-8 (truncated"),
            std::string::npos)
      << e.text;

  // An Object[] holding a non-string is refused; one holding strings is accepted.
  jclass objectClass = env->FindClass("java/lang/Object");
  jobjectArray objects = env->NewObjectArray(2, objectClass, nullptr);
  jstring s = env->NewStringUTF("s");
  env->SetObjectArrayElement(objects, 0, s);
  VLXListValVLXUnicodeString back;
  back.Append("kept");
  ASSERT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, objects, back), VLX_S_OK);
  EXPECT_EQ(back.Size(), 2);
  env->SetObjectArrayElement(objects, 1, objectClass);
  EXPECT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, objects, back), VLX_E_INVALIDARG);
  EXPECT_EQ(back.Size(), 2) << "left as it was";
  EXPECT_NE(TakeLastError().text.find("element 1 of the Java array is not a java.lang.String"), std::string::npos);
}

// ---- primitive arrays, 100,000 elements ----

const int kLarge = 100000;

TEST_F(ConverterTest, LargeIntAndDoubleArraysCrossInBulk)
{
  VLXRawCollint ints(kLarge);
  VLXRawColldouble doubles(kLarge);
  for (int i = 0; i < kLarge; ++i) {
    ints.Append(i * 7919 - 3);
    doubles.Append(i * 0.25 - 7.0);
  }
  ints[1] = INT_MIN;
  ints[kLarge] = INT_MAX;
  doubles[1] = -0.0;
  doubles[2] = std::numeric_limits<double>::infinity();
  doubles[3] = std::numeric_limits<double>::denorm_min();

  jintArray ja = nullptr;
  jdoubleArray jd = nullptr;
  ASSERT_EQ(VLXJBXJNIConverter::ConvertToJavaType(env, ints, ja), VLX_S_OK);
  ASSERT_EQ(VLXJBXJNIConverter::ConvertToJavaType(env, doubles, jd), VLX_S_OK);
  ASSERT_EQ(env->GetArrayLength(ja), kLarge);
  jint probe[2];
  env->GetIntArrayRegion(ja, kLarge - 2, 2, probe);
  EXPECT_EQ(probe[0], (kLarge - 2) * 7919 - 3);
  EXPECT_EQ(probe[1], INT_MAX);

  VLXRawCollint intsBack;
  VLXRawColldouble doublesBack;
  doublesBack.Append(99);
  ASSERT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, ja, intsBack), VLX_S_OK);
  ASSERT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, jd, doublesBack), VLX_S_OK);
  EXPECT_TRUE(intsBack == ints);
  ASSERT_EQ(doublesBack.Size(), kLarge);
  EXPECT_TRUE(std::signbit(doublesBack[1]));
  EXPECT_EQ(std::memcmp(doublesBack.Data(), doubles.Data(), sizeof(double) * kLarge), 0);
  env->DeleteLocalRef(ja);
  env->DeleteLocalRef(jd);
}

// Any non-zero boolean byte goes to Java as true; binary bytes cross unchanged.
TEST_F(ConverterTest, BooleanBytesAreNormalisedAndBinaryBytesCrossUnchanged)
{
  VLXListValVLXBoolean booleans;
  VLXBinary bytes(kLarge);
  for (int i = 0; i < kLarge; ++i) {
    booleans.Append(static_cast<VLXBoolean>(i % 4 == 3 ? 255 : i % 3)); // 0, 1, 2 and 255
    bytes.getData()[i] = static_cast<unsigned char>(i * 31);
  }
  jbooleanArray jz = nullptr;
  jbyteArray jb = nullptr;
  ASSERT_EQ(VLXJBXJNIConverter::ConvertToJavaType(env, booleans, jz), VLX_S_OK);
  ASSERT_EQ(VLXJBXJNIConverter::ConvertToJavaType(env, bytes, jb), VLX_S_OK);
  jboolean z[4];
  env->GetBooleanArrayRegion(jz, 0, 4, z);
  EXPECT_EQ(z[0], 0);
  EXPECT_EQ(z[1], 1);
  EXPECT_EQ(z[2], 1);
  EXPECT_EQ(z[3], 1);
  VLXListValVLXBoolean booleansBack;
  VLXBinary bytesBack;
  ASSERT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, jz, booleansBack), VLX_S_OK);
  ASSERT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, jb, bytesBack), VLX_S_OK);
  ASSERT_EQ(booleansBack.Size(), booleans.Size());
  for (int i = 1; i <= booleans.Size(); ++i)
    ASSERT_EQ(booleansBack[i], booleans[i] != 0 ? 1 : 0) << i;
  EXPECT_TRUE(bytesBack == bytes);

  jbyteArray empty = nullptr;
  ASSERT_EQ(VLXJBXJNIConverter::ConvertToJavaType(env, VLXBinary(), empty), VLX_S_OK);
  EXPECT_EQ(env->GetArrayLength(empty), 0);
  env->DeleteLocalRef(jz);
  env->DeleteLocalRef(jb);
}

TEST_F(ConverterTest, LargeStringListsReleaseEachElementReferenceAtOnce)
{
  // -Xcheck:jni reports local reference growth beyond the frame's capacity: a converter that kept
  // one reference per element would fail this test through the ctest output check.
  VLXListValVLXUnicodeString list(kLarge);
  for (int i = 0; i < kLarge; ++i)
    list.Append(U("element " + std::to_string(i)));
  jobjectArray array = nullptr;
  ASSERT_EQ(VLXJBXJNIConverter::ConvertToJavaType(env, list, array), VLX_S_OK);
  VLXListValVLXUnicodeString back;
  ASSERT_EQ(VLXJBXJNIConverter::BuildFromJavaType(env, array, back), VLX_S_OK);
  EXPECT_TRUE(back == list);
  env->DeleteLocalRef(array);
}

} // namespace
