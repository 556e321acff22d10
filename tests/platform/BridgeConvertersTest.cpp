// Converters: unpaired text from Java refused, null and wrong-class inputs, a pending exception,
// string lists element by element, and booleans and number extremes in primitive arrays. (Texts
// both ways, malformed UTF-8 and lists of 100000 elements cross through the library's suites.)
#include "BridgeSupport.h"
#include "VLXJBXException.h"
#include "VLXJBXJNIConverter.h"

#include <climits>
#include <cstring>
#include <limits>

namespace {
using Conv = VLXJBXJNIConverter;
using ConverterTest = BridgeTest;

template <class List, class V>
List One(V v)
{
  List list;
  list.Append(v);
  return list;
}

// UTF-8 cannot carry an unpaired surrogate: the text is refused, naming where, rather than changed.
TEST_F(ConverterTest, UnpairedSurrogatesFromJavaAreRefusedNamingTheirIndex)
{
  const std::u16string high(1, char16_t(0xD83D)), low(1, char16_t(0xDE00));
  const std::u16string piece(8191, u'a');  // one unit short of the converter's 8192-unit piece
  const struct {
    std::u16string text;
    const char* where;
  } cases[] = {
      {high, "(U+D83D) at index 0"},
      {low + u"x", "(U+DE00) at index 0"},
      {low + high, "(U+DE00) at index 0"},
      {u"a" + high + u"\U0001F600", "(U+D83D) at index 1"},
      {std::u16string(300, u'b') + high, "(U+D83D) at index 300"},
      {piece + high + u"b", "(U+D83D) at index 8191"},
      {piece + u"\U0001F600" + low, "(U+DE00) at index 8193"},  // right after a piece boundary
  };
  for (const auto& c : cases) {
    VLXUnicodeString out("kept");
    jstring js = JavaString(env, c.text);
    EXPECT_EQ(Conv::BuildFromJavaType(env, js, out), VLX_E_FAIL);
    EXPECT_EQ(Text(out), "kept");
    const std::string text = TakeLastError().text;
    EXPECT_TRUE(Has(text, c.where)) << text;
    env->DeleteLocalRef(js);
  }
}
TEST_F(ConverterTest, NullJavaValuesGiveEmptyValuesWrongClassesAndPendingExceptionsAreRefused)
{
  // Each output, starting non-empty: an array of another type is refused and leaves it alone; a
  // null Java value empties it.
  jintArray intArray = env->NewIntArray(2);
  jbooleanArray booleanArray = env->NewBooleanArray(2);
  auto check = [&](auto out, jobject wrong) {
    const auto before = out;
    EXPECT_EQ(Conv::BuildFromJavaType(env, wrong, out), VLX_E_INVALIDARG);
    EXPECT_TRUE(out == before);
    EXPECT_EQ(TakeLastError().id, VLXJBXMessages::InvalidArgument);
    EXPECT_EQ(Conv::BuildFromJavaType(env, nullptr, out), VLX_S_OK);
    EXPECT_TRUE(out == decltype(out)());
    EXPECT_FALSE(out == before);
  };
  check(VLXUnicodeString("kept"), intArray);
  check(One<VLXListValVLXUnicodeString>("kept"), intArray);
  check(One<VLXListValVLXBoolean>(1), intArray);
  check(VLXBinary(3), intArray);
  check(One<VLXRawCollint>(1), booleanArray);
  check(One<VLXRawColldouble>(1.5), intArray);

  VLXUnicodeString text("kept");
  env->ThrowNew(Find("java/lang/IllegalStateException"), "pending");
  jstring js = nullptr;
  EXPECT_EQ(Conv::ConvertToJavaType(env, VLXUnicodeString("x"), js), VLX_E_FAIL);
  EXPECT_EQ(Conv::BuildFromJavaType(env, nullptr, text), VLX_E_FAIL);
  EXPECT_TRUE(env->ExceptionCheck()) << "the caller's exception stays pending";
  env->ExceptionClear();
  EXPECT_EQ(js, nullptr);
  EXPECT_EQ(Text(text), "kept");
  EXPECT_EQ(TakeLastError().id, VLXJBXMessages::ExceptionPending);
  EXPECT_EQ(Conv::ConvertToJavaType(nullptr, VLXUnicodeString("x"), js), VLX_E_INVALIDARG);
}

TEST_F(ConverterTest, StringListsCrossElementByElement)
{
  VLXListValVLXUnicodeString list;
  list.Append("one");
  list.Append("");
  list.Append("\xF0\x9F\x98\x80");
  list.Append(VLXUnicodeString("n\0l", 3));
  jobjectArray array = nullptr;
  ASSERT_EQ(Conv::ConvertToJavaType(env, list, array), VLX_S_OK);
  ASSERT_EQ(env->GetArrayLength(array), 4);
  jstring third = static_cast<jstring>(env->GetObjectArrayElement(array, 2));
  EXPECT_TRUE(Units(env, third) == u"\U0001F600");
  env->SetObjectArrayElement(array, 0, nullptr);  // a null element reads back as an empty string
  VLXListValVLXUnicodeString back;
  back.Append("replaced");
  ASSERT_EQ(Conv::BuildFromJavaType(env, array, back), VLX_S_OK);
  list[1] = "";
  EXPECT_TRUE(back == list);

  // An Object[] holding only strings is accepted; one holding anything else is refused.
  jclass objectClass = Find("java/lang/Object");
  jobjectArray objects = env->NewObjectArray(2, objectClass, env->NewStringUTF("s"));
  ASSERT_EQ(Conv::BuildFromJavaType(env, objects, back), VLX_S_OK);
  EXPECT_EQ(back.Size(), 2);
  env->SetObjectArrayElement(objects, 1, objectClass);
  EXPECT_EQ(Conv::BuildFromJavaType(env, objects, back), VLX_E_INVALIDARG);
  EXPECT_EQ(back.Size(), 2) << "left as it was";
  EXPECT_TRUE(Has(TakeLastError().text, "element 1 of the Java array is not a java.lang.String"));

  list.Append("bro\xC3");
  jobjectArray out = nullptr;
  EXPECT_EQ(Conv::ConvertToJavaType(env, list, out), VLX_E_INVALIDARG);
  EXPECT_EQ(out, nullptr);
  const std::string text = TakeLastError().text;
  EXPECT_TRUE(Has(text, "the byte at offset 3 of element 5 of the list is not valid UTF-8 (truncated")) << text;

  // Each element's local reference goes at once: 1000 kept would pass the test's local frame, which
  // -Xcheck:jni reports.
  VLXListValVLXUnicodeString many(1000);
  for (int i = 0; i < 1000; ++i) many.Append("element");
  ASSERT_EQ(Conv::ConvertToJavaType(env, many, out), VLX_S_OK);
  ASSERT_EQ(Conv::BuildFromJavaType(env, out, back), VLX_S_OK);
  EXPECT_TRUE(back == many);
}

// Any non-zero byte crosses as true; int and double extremes cross exactly, the last element too,
// and the output is replaced, not appended to.
TEST_F(ConverterTest, PrimitiveArraysKeepTheirExtremesAndBooleansAreNormalised)
{
  VLXRawCollint ints, intsBack = One<VLXRawCollint>(9);
  VLXRawColldouble doubles, doublesBack;
  VLXListValVLXBoolean booleans, booleansBack, normalised;
  for (int i : {INT_MIN, 0, INT_MAX}) ints.Append(i);
  for (double d : {-0.0, std::numeric_limits<double>::infinity(), std::numeric_limits<double>::denorm_min()})
    doubles.Append(d);
  for (int b : {0, 1, 2, 255}) booleans.Append(static_cast<VLXBoolean>(b)), normalised.Append(b != 0);
  VLXBinary bytes(2), bytesBack;
  bytes.getData()[0] = 0x80, bytes.getData()[1] = 0xFF;
  jintArray ja = nullptr;
  jdoubleArray jd = nullptr;
  jbooleanArray jz = nullptr;
  jbyteArray jb = nullptr;
  ASSERT_EQ(Conv::ConvertToJavaType(env, bytes, jb), VLX_S_OK);
  ASSERT_EQ(Conv::BuildFromJavaType(env, jb, bytesBack), VLX_S_OK);
  EXPECT_TRUE(bytesBack == bytes);
  ASSERT_EQ(Conv::ConvertToJavaType(env, ints, ja), VLX_S_OK);
  ASSERT_EQ(Conv::ConvertToJavaType(env, doubles, jd), VLX_S_OK);
  ASSERT_EQ(Conv::ConvertToJavaType(env, booleans, jz), VLX_S_OK);
  jboolean z[4];
  env->GetBooleanArrayRegion(jz, 0, 4, z);
  EXPECT_EQ(std::vector<int>(z, z + 4), (std::vector<int>{0, 1, 1, 1})) << "the Java side holds true";
  ASSERT_EQ(Conv::BuildFromJavaType(env, ja, intsBack), VLX_S_OK);
  ASSERT_EQ(Conv::BuildFromJavaType(env, jd, doublesBack), VLX_S_OK);
  ASSERT_EQ(Conv::BuildFromJavaType(env, jz, booleansBack), VLX_S_OK);
  EXPECT_TRUE(intsBack == ints && booleansBack == normalised);
  ASSERT_EQ(doublesBack.Size(), 3);
  EXPECT_EQ(std::memcmp(doublesBack.Data(), doubles.Data(), 3 * sizeof(double)), 0) << "bit for bit, -0.0 too";
}

}  // namespace
