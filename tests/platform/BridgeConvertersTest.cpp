// Converters: exact texts both ways, malformed and unpaired text refused, null and wrong-class
// inputs, and large arrays and lists (-Xcheck:jni reports a converter that keeps a local reference
// per element through the ctest output check).
#include "BridgeSupport.h"
#include "VLXJBXException.h"
#include "VLXJBXJNIConverter.h"

#include <climits>
#include <cmath>
#include <cstring>
#include <limits>

namespace {
using namespace std::string_literals;
using Conv = VLXJBXJNIConverter;
using ConverterTest = BridgeTest;

VLXUnicodeString U(const std::string& s) { return VLXUnicodeString(s.data(), static_cast<int>(s.size())); }

template <class List, class V>
List One(V v)
{
  List list;
  list.Append(v);
  return list;
}

const int kLarge = 100000;
const std::u16string kPiece(8191, u'a');  // one unit short of the converter's 8192-unit piece

TEST_F(ConverterTest, StringsCrossExactlyInBothDirections)
{
  std::string euros;  // three bytes for each unit: the most a piece can take
  for (int i = 0; i < 8191; ++i) euros += "\xE2\x82\xAC";
  const struct {
    std::string utf8;
    std::u16string utf16;
  } cases[] = {
      {"", u""},
      {"a\0b"s, u"a\0b"s},  // NUL stays one unit
      {"caf\xC3\xA9 \xF0\x9F\x98\x80\xF4\x8F\xBF\xBF\xEF\xBF\xBF\xEE\x80\x80\xED\x9F\xBF",
       u"caf\u00E9 \U0001F600\U0010FFFF\uFFFF\uE000\uD7FF"},
      {euros + "\xF0\x9F\x98\x80", std::u16string(8191, u'\u20AC') + u"\U0001F600"},  // a pair across pieces
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.utf8.substr(0, 40));
    jstring js = nullptr;
    ASSERT_EQ(Conv::ConvertToJavaType(env, U(c.utf8), js), VLX_S_OK);
    EXPECT_EQ(env->GetObjectRefType(js), JNILocalRefType);
    EXPECT_TRUE(Units(env, js) == c.utf16);
    VLXUnicodeString back("previous content");
    jstring made = JavaString(env, c.utf16);
    ASSERT_EQ(Conv::BuildFromJavaType(env, made, back), VLX_S_OK);
    EXPECT_TRUE(Str(back) == c.utf8);
    env->DeleteLocalRef(js);
    env->DeleteLocalRef(made);
  }
}

// UTF-8 cannot carry an unpaired surrogate: the text is refused, naming where, rather than changed.
TEST_F(ConverterTest, UnpairedSurrogatesFromJavaAreRefusedNamingTheirIndex)
{
  const std::u16string high(1, char16_t(0xD83D)), low(1, char16_t(0xDE00));
  const struct {
    std::u16string text;
    const char* where;
  } cases[] = {
      {high, "(U+D83D) at index 0"},
      {low + u"x", "(U+DE00) at index 0"},
      {low + high, "(U+DE00) at index 0"},
      {u"a" + high + u"\U0001F600", "(U+D83D) at index 1"},
      {std::u16string(300, u'b') + high, "(U+D83D) at index 300"},
      {kPiece + high + u"b", "(U+D83D) at index 8191"},
      {kPiece + u"\U0001F600" + low, "(U+DE00) at index 8193"},  // right after a piece boundary
  };
  for (const auto& c : cases) {
    VLXUnicodeString out("kept");
    jstring js = JavaString(env, c.text);
    EXPECT_EQ(Conv::BuildFromJavaType(env, js, out), VLX_E_FAIL);
    EXPECT_EQ(Str(out), "kept");
    const std::string text = TakeLastError().text;
    EXPECT_TRUE(Has(text, c.where)) << text;
    env->DeleteLocalRef(js);
  }
}

// The reasons are FirstMalformedOffset's (see BaseTest); the offset counts the ASCII start copied before the check.
TEST_F(ConverterTest, MalformedUtf8IsRefusedWithItsByteOffsetAndTheOutputUntouched)
{
  const struct {
    std::string bytes;
    int offset;
  } cases[] = {{"\xFF", 0}, {"okay\xF4\x90\x80\x80", 4}, {"x\xC3\xA9\x80", 3}};
  for (const auto& c : cases) {
    jstring sentinel = reinterpret_cast<jstring>(0x5678), out = sentinel;
    EXPECT_EQ(Conv::ConvertToJavaType(env, U(c.bytes), out), VLX_E_INVALIDARG);
    EXPECT_EQ(out, sentinel);
    const ErrorView e = TakeLastError();
    EXPECT_EQ(e.id, VLXJBXMessages::ConversionFailed);
    EXPECT_TRUE(Has(e.text, "the byte at offset " + std::to_string(c.offset) + " of the text is not valid UTF-8 ("))
        << e.text;
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
  EXPECT_EQ(Str(text), "kept");
  EXPECT_EQ(TakeLastError().id, VLXJBXMessages::ExceptionPending);
  EXPECT_EQ(Conv::ConvertToJavaType(nullptr, VLXUnicodeString("x"), js), VLX_E_INVALIDARG);
}

TEST_F(ConverterTest, StringListsCrossElementByElement)
{
  VLXListValVLXUnicodeString list;
  list.Append("one");
  list.Append("");
  list.Append("\xF0\x9F\x98\x80");
  list.Append(U(std::string("n\0l", 3)));
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
}

TEST_F(ConverterTest, LargeStringListsReleaseEachElementReferenceAtOnce)
{
  VLXListValVLXUnicodeString list(kLarge), back;
  for (int i = 0; i < kLarge; ++i) list.Append(U("element " + std::to_string(i)));
  jobjectArray array = nullptr;
  ASSERT_EQ(Conv::ConvertToJavaType(env, list, array), VLX_S_OK);
  ASSERT_EQ(Conv::BuildFromJavaType(env, array, back), VLX_S_OK);
  EXPECT_TRUE(back == list);
  jobjectArray empty = nullptr;
  ASSERT_EQ(Conv::ConvertToJavaType(env, VLXListValVLXUnicodeString(), empty), VLX_S_OK);
  EXPECT_EQ(env->GetArrayLength(empty), 0);
}

// `in` to a Java array of kLarge elements (kept in `java`) and back into `back`.
template <class In, class Array, class Out>
Out RoundTrip(JNIEnv* env, const In& in, Array& java, Out back)
{
  EXPECT_EQ(Conv::ConvertToJavaType(env, in, java), VLX_S_OK);
  EXPECT_EQ(env->GetArrayLength(java), kLarge);
  EXPECT_EQ(Conv::BuildFromJavaType(env, java, back), VLX_S_OK);
  return back;
}

TEST_F(ConverterTest, PrimitiveArraysCrossInBulkAndBooleansAreNormalised)
{
  VLXRawCollint ints(kLarge);
  VLXRawColldouble doubles(kLarge);
  VLXListValVLXBoolean booleans, normalised;
  VLXBinary bytes(kLarge);
  for (int i = 0; i < kLarge; ++i) {
    ints.Append(i * 7919 - 3);
    doubles.Append(i * 0.25 - 7.0);
    booleans.Append(static_cast<VLXBoolean>(i % 4 == 3 ? 255 : i % 3));  // 0, 1, 2 and 255
    normalised.Append(booleans[i + 1] != 0);
    bytes.getData()[i] = static_cast<unsigned char>(i * 31);
  }
  ints[1] = INT_MIN;
  ints[kLarge] = INT_MAX;
  doubles[1] = -0.0;
  doubles[2] = std::numeric_limits<double>::infinity();
  doubles[3] = std::numeric_limits<double>::denorm_min();
  jintArray ja = nullptr;
  jdoubleArray jd = nullptr;
  jbooleanArray jz = nullptr;
  jbyteArray jb = nullptr;
  EXPECT_TRUE(RoundTrip(env, ints, ja, VLXRawCollint()) == ints);
  EXPECT_TRUE(RoundTrip(env, bytes, jb, VLXBinary()) == bytes);
  EXPECT_TRUE(RoundTrip(env, booleans, jz, VLXListValVLXBoolean()) == normalised);
  const VLXRawColldouble doublesBack = RoundTrip(env, doubles, jd, One<VLXRawColldouble>(99.0));
  ASSERT_EQ(doublesBack.Size(), kLarge);
  EXPECT_EQ(std::memcmp(doublesBack.Data(), doubles.Data(), sizeof(double) * kLarge), 0) << "bit for bit, -0.0 too";
  jint edges[2];
  jboolean z[4];
  env->GetIntArrayRegion(ja, 0, 1, edges);
  env->GetIntArrayRegion(ja, kLarge - 1, 1, edges + 1);
  env->GetBooleanArrayRegion(jz, 0, 4, z);
  EXPECT_TRUE(edges[0] == INT_MIN && edges[1] == INT_MAX) << "the Java side holds the values";
  EXPECT_EQ(std::vector<int>(z, z + 4), (std::vector<int>{0, 1, 1, 1})) << "any non-zero byte is true";
  jbyteArray empty = nullptr;
  ASSERT_EQ(Conv::ConvertToJavaType(env, VLXBinary(), empty), VLX_S_OK);
  EXPECT_EQ(env->GetArrayLength(empty), 0);
}

}  // namespace
