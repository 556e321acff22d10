// Texts cross to Java and back byte for byte; malformed UTF-8 is refused before any Java call, with
// the converter's own code or the translated one as each operation says.
#include <functional>

#include "TestSupport.h"

using namespace corvexa_test;

namespace {

TEST(Strings, NamesSurviveARoundTripByteForByte)
{
  std::string euros;  // 8191 units of three bytes each: the converter's pieces hold 8192 units
  for (int i = 0; i < 8191; ++i) euros += "\xE2\x82\xAC";
  const std::string samples[] = {
      "plain",
      "Zo\xC3\xAB \xC3\x85ngstr\xC3\xB6m, na\xC3\xAFve caf\xC3\xA9",  // Latin accents
      "\xE6\x95\xB0\xE6\x8D\xAE\xE5\x89\xAF\xE6\x9C\xAC",             // CJK
      "fox \xF0\x9F\xA6\x8A rocket \xF0\x9F\x9A\x80",                 // outside the BMP
      std::string("nul\0inside\0", 12),                               // embedded NUL
      "\xEF\xBF\xBF edge \xF4\x8F\xBF\xBF",                           // U+FFFF, U+10FFFF
      "",
      std::string(70000, 'x'),
      euros + "\xF0\x9F\x98\x80 \xEE\x80\x80\xED\x9F\xBF",  // a pair across two pieces, U+E000, U+D7FF
  };
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build());
  for (const std::string& sample : samples) {
    SCOPED_TRACE(sample.substr(0, 40));
    ASSERT_EQ(VLX_S_OK, replica.SetName(U(sample)));
    VLXUnicodeString back("stale");
    ASSERT_EQ(VLX_S_OK, replica.GetName(back));
    EXPECT_EQ(sample, Text(back));
  }
}

// Each kind of malformed text, as an argument of each operation: the converter's code as it is
// (VLX_E_INVALIDARG) or translated (VLX_E_FAIL); the out-parameters and the Java side are left alone.
TEST(Strings, AMalformedTextArgumentGivesEachOperationsOwnCode)
{
  SampleReplica s;
  ASSERT_EQ(VLX_S_OK, s.replica.SetName(U("kept")));
  VLXKDMInstance instance = s.Create();
  ASSERT_EQ(VLX_S_OK, instance.SetValue(0, 42));
  VLXKDMModelSet models;
  ASSERT_EQ(VLX_S_OK, s.replica.GetModels(models));
  VLXKDMAttributeDef attribute;
  ASSERT_EQ(VLX_S_OK, attribute.Build(U("a"), VLXKDMAttributeType::String));
  VLXKDMAttributeDef copy(attribute);
  VLXKDMClassDef classDef;
  VLXBoolean flag = 9;
  int number = 9;
  VLXKDMInstanceValue value, holder;
  value.SetInteger(8);
  holder.SetInteger(4);
  // A malformed text at the start and after an ASCII start copied first, with the offset of its first
  // bad byte (every kind of malformed text is the string type's own table, in the base suite).
  const std::pair<const char*, int> kinds[] = {{"\xED\xA0\x80 surrogate", 0}, {"cut \xE6\x95", 4}};
  for (const auto& [malformed, offset] : kinds) {
    const VLXUnicodeString bad(malformed);
    const VLXListOfVLXUnicodeString badList = ListOf<VLXListOfVLXUnicodeString>({U("fine"), bad});
    const struct {
      const char* what;
      long expected;
      std::function<long()> call;
    } cases[] = {
        {"SetName", VLX_E_INVALIDARG, [&] { return s.replica.SetName(bad); }},
        {"ModelSet::Includes", VLX_E_INVALIDARG, [&] { return models.Includes(bad, flag); }},
        {"Instance::IsValuated", VLX_E_INVALIDARG, [&] { return instance.IsValuated(bad, flag); }},
        {"Instance::GetValue", VLX_E_INVALIDARG, [&] { return instance.GetValue(bad, value); }},
        {"AttributeDef::SetQKAComment", VLX_E_INVALIDARG, [&] { return attribute.SetQKAComment(bad); }},
        {"AttributeDef::SetTargetNames", VLX_E_INVALIDARG, [&] { return attribute.SetTargetNames(badList); }},
        {"AttributeDef::Build", VLX_E_INVALIDARG, [&] { return copy.Build(bad, VLXKDMAttributeType::Integer); }},
        {"Replica::GetClassDef", VLX_E_FAIL, [&] { return s.replica.GetClassDef(bad, classDef); }},
        {"ModelSet::IndexOf", VLX_E_FAIL, [&] { return models.IndexOf(bad, number); }},
        {"AttributeDef::SetUuid", VLX_E_FAIL, [&] { return attribute.SetUuid(bad); }},
        {"AttributeDef::SetTargetRefs", VLX_E_FAIL, [&] { return attribute.SetTargetRefs(badList); }},
        {"Instance::ClearValue", VLX_E_FAIL, [&] { return instance.ClearValue(bad); }},
        {"Instance::SetID", VLX_E_FAIL, [&] { return instance.SetID(bad); }},
        {"Instance::SetValue(name, int)", VLX_E_FAIL, [&] { return instance.SetValue(bad, 5); }},
        {"Instance::SetValue(name, text)", VLX_E_FAIL, [&] { return instance.SetValue(U("string"), bad); }},
        // The holder gets its Java form before the name is converted.
        {"Instance::SetValue(name, holder)", VLX_E_FAIL, [&] { return instance.SetValue(bad, holder); }},
    };
    for (const auto& c : cases) {
      SCOPED_TRACE(std::string(c.what) + " with " + malformed);
      ClearLastError();
      EXPECT_EQ(c.expected, c.call());
      const std::string text = PeekLastError().text;
      EXPECT_TRUE(Has(text, "the byte at offset " + std::to_string(offset) + " of ") && Has(text, "not valid UTF-8"))
          << text;
    }
  }
  EXPECT_EQ(9, flag);
  EXPECT_EQ(9, number);
  EXPECT_EQ(8, value.GetInteger());
  EXPECT_EQ(nullptr, value.GetHandle());
  EXPECT_NE(nullptr, holder.GetHandle());
  EXPECT_EQ(nullptr, classDef.GetHandle());
  EXPECT_TRUE(copy == attribute);
  VLXUnicodeString name;
  ASSERT_EQ(VLX_S_OK, s.replica.GetName(name));
  EXPECT_EQ("kept", Text(name));
  VLXKDMInstanceValue kept;
  ASSERT_EQ(VLX_S_OK, instance.GetValue(0, kept));
  EXPECT_EQ(42, kept.GetInteger());
  VLXBoolean valuated = 9;
  ASSERT_EQ(VLX_S_OK, instance.IsValuated(2, valuated));
  EXPECT_EQ(0, valuated);
}

}  // namespace
