// Instances against the real replica package: identifiers, states, class, valuation and text forms.
#include <string>

#include <gtest/gtest.h>

#include "DataFixture.h"

using namespace corvexa_test;

namespace {

const VLXUnicodeString kBadName("bad \xC3\x28 name");

struct Identifier {
  VLXBoolean noID = 9;
  VLXBoolean isText = 9;
  VLXUnicodeString text{"former text"};
  VLXBinary bytes{"\x01\x02", 2};
  long Read(VLXKDMInstance& instance) { return instance.GetID(noID, isText, text, bytes); }
};

TEST(Identifiers, TextAndBytesEachLeaveTheOtherOutParameterAlone)
{
  SampleReplica s;
  VLXKDMInstance instance = s.Create();

  Identifier none;
  ASSERT_EQ(VLX_S_OK, none.Read(instance));
  EXPECT_EQ(1, none.noID);
  EXPECT_EQ(9, none.isText);
  EXPECT_EQ("former text", Text(none.text));
  EXPECT_EQ(2, none.bytes.getLength());

  const std::string text("p-\xE2\x82\xAC-1\0tail", 13);  // a euro sign and an embedded NUL
  ASSERT_EQ(VLX_S_OK, instance.SetID(VLXUnicodeString(text.data(), static_cast<int>(text.size()))));
  Identifier asText;
  ASSERT_EQ(VLX_S_OK, asText.Read(instance));
  EXPECT_EQ(0, asText.noID);
  EXPECT_EQ(1, asText.isText);
  EXPECT_EQ(text, Text(asText.text));
  EXPECT_EQ(2, asText.bytes.getLength());

  const unsigned char raw[] = {0x00, 0xFF, 0x80, 0x7F, 0x00};
  ASSERT_EQ(VLX_S_OK, instance.SetID(VLXBinary(raw, sizeof raw)));
  Identifier asBytes;
  ASSERT_EQ(VLX_S_OK, asBytes.Read(instance));
  EXPECT_EQ(0, asBytes.noID);
  EXPECT_EQ(0, asBytes.isText);
  EXPECT_EQ("former text", Text(asBytes.text));
  EXPECT_TRUE(asBytes.bytes == VLXBinary(raw, sizeof raw));

  ASSERT_EQ(VLX_S_OK, instance.SetID(VLXBinary()));  // empty bytes are an identifier too
  ASSERT_EQ(VLX_S_OK, asBytes.Read(instance));
  EXPECT_EQ(0, asBytes.noID);
  EXPECT_EQ(0, asBytes.bytes.getLength());
}

TEST(Identifiers, DuplicatesAndMalformedTextFail)
{
  SampleReplica s;
  VLXKDMInstance first = s.Create(), second = s.Create();
  ASSERT_EQ(VLX_S_OK, first.SetID(VLXUnicodeString("same")));
  ClearLastError();
  EXPECT_EQ(VLX_E_FAIL, second.SetID(VLXUnicodeString("same")));
  EXPECT_NE(std::string::npos, PeekLastError().text.find("already has a live instance")) << PeekLastError().text;
  ASSERT_EQ(VLX_S_OK, second.SetID(VLXBinary("same", 4)));  // bytes never collide with a text

  ClearLastError();
  EXPECT_EQ(VLX_E_FAIL, second.SetID(kBadName));  // the translated converter failure
  EXPECT_NE(std::string::npos, PeekLastError().text.find("UTF-8")) << PeekLastError().text;
  Identifier id;
  ASSERT_EQ(VLX_S_OK, id.Read(second));
  EXPECT_EQ(0, id.isText);
}

TEST(Identifiers, AnIdentifierOfAnotherClassFailsNamingIt)
{
  const struct {
    const char* testDouble;
    const char* named;
  } cases[] = {
      {"com/velmora/tessara/testdoubles/IntegerIdInstance", "a java.lang.Integer,"},
      {"com/velmora/tessara/testdoubles/LongInstance", "a java.lang.Long,"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.testDouble);
    VLXKDMInstance instance;
    AttachNew(instance, c.testDouble);
    Identifier id;
    ClearLastError();
    const long rc = id.Read(instance);
    EXPECT_LT(rc, 0);
    EXPECT_EQ(0, id.noID);  // written before the class is looked at
    EXPECT_EQ(9, id.isText);
    EXPECT_EQ("former text", Text(id.text));
    EXPECT_EQ(2, id.bytes.getLength());
    const LastError error = PeekLastError();
    EXPECT_EQ("VLXKDMInstance::GetID(VLXBoolean&, VLXBoolean&, VLXUnicodeString&, VLXBinary&)", LastErrorOperation());
    EXPECT_NE(std::string::npos, error.text.find(c.named)) << error.text;
  }
}

TEST(States, CreatedModifiedDeletedAndCommit)
{
  SampleReplica s;
  VLXKDMInstance instance = s.Create();
  auto states = [&instance]() {
    VLXBoolean created = 9, modified = 9, deleted = 9;
    EXPECT_EQ(VLX_S_OK, instance.IsCreated(created));
    EXPECT_EQ(VLX_S_OK, instance.IsModified(modified));
    EXPECT_EQ(VLX_S_OK, instance.IsDeleted(deleted));
    return std::to_string(created) + std::to_string(modified) + std::to_string(deleted);
  };
  EXPECT_EQ("100", states());
  ASSERT_EQ(VLX_S_OK, instance.ClearValue(VLXUnicodeString("integer")));
  EXPECT_EQ("100", states());  // a created instance stays created, not modified
  ASSERT_EQ(VLX_S_OK, s.replica.Commit());
  EXPECT_EQ("000", states());
  ASSERT_EQ(VLX_S_OK, instance.SetID(VLXUnicodeString("x")));
  EXPECT_EQ("010", states());
  ASSERT_EQ(VLX_S_OK, s.replica.Commit());
  ASSERT_EQ(VLX_S_OK, instance.ClearValue(3));
  EXPECT_EQ("010", states());

  VLXKDMInstanceSet set;
  ASSERT_EQ(VLX_S_OK, s.model.GetInstances(set));
  ASSERT_EQ(VLX_S_OK, set.Remove(instance));
  EXPECT_EQ("001", states());
  // A deleted instance can be read but not changed.
  EXPECT_EQ(VLX_E_FAIL, instance.SetID(VLXUnicodeString("y")));
  EXPECT_EQ(VLX_E_FAIL, instance.ClearValue(0));
  Identifier id;
  ASSERT_EQ(VLX_S_OK, id.Read(instance));
  EXPECT_EQ("x", Text(id.text));
  ASSERT_EQ(VLX_S_OK, s.replica.Commit());
  EXPECT_EQ("001", states());

  // A created instance removed before any commit simply disappears.
  VLXKDMInstance fresh = s.Create();
  ASSERT_EQ(VLX_S_OK, set.Remove(0));
  int count = -1;
  ASSERT_EQ(VLX_S_OK, set.GetCount(count));
  EXPECT_EQ(0, count);
  VLXKDMClassDef classDef;
  ASSERT_EQ(VLX_S_OK, fresh.GetClassDef(classDef));
  VLXUnicodeString name;
  ASSERT_EQ(VLX_S_OK, classDef.GetClassName(name));
  EXPECT_EQ("Sample", Text(name));
}

TEST(Valuation, IsValuatedAndClearValueByNameAndPosition)
{
  SampleReplica s;
  VLXKDMInstance instance = s.Create();
  const int count = static_cast<int>(SampleAttributes().size());
  for (int p = 0; p < count; ++p) {
    SCOPED_TRACE(SampleAttributes()[p].name);
    VLXBoolean byName = 9, byPosition = 9;
    ASSERT_EQ(VLX_S_OK, instance.IsValuated(VLXUnicodeString(SampleAttributes()[p].name), byName));
    ASSERT_EQ(VLX_S_OK, instance.IsValuated(p, byPosition));
    EXPECT_EQ(0, byName);
    EXPECT_EQ(0, byPosition);
    ASSERT_EQ(VLX_S_OK, instance.ClearValue(VLXUnicodeString(SampleAttributes()[p].name)));
    ASSERT_EQ(VLX_S_OK, instance.ClearValue(p));
  }
  // Unknown names and positions out of range: the Java exception, nothing written.
  VLXBoolean flag = 9;
  for (int bad : {-1, count}) {
    ClearLastError();
    EXPECT_EQ(VLX_E_FAIL, instance.IsValuated(bad, flag));
    EXPECT_NE(std::string::npos, PeekLastError().text.find("out of range")) << PeekLastError().text;
    EXPECT_EQ(VLX_E_FAIL, instance.ClearValue(bad));
  }
  ClearLastError();
  EXPECT_EQ(VLX_E_FAIL, instance.IsValuated(VLXUnicodeString("wieght"), flag));
  EXPECT_NE(std::string::npos, PeekLastError().text.find("has no attribute 'wieght'")) << PeekLastError().text;
  EXPECT_EQ(VLX_E_FAIL, instance.ClearValue(VLXUnicodeString("wieght")));
  EXPECT_EQ(9, flag);
  // A malformed name: IsValuated returns the converter's own code, ClearValue the translated one.
  EXPECT_EQ(VLX_E_INVALIDARG, instance.IsValuated(kBadName, flag));
  EXPECT_EQ(VLX_E_FAIL, instance.ClearValue(kBadName));
  EXPECT_EQ(9, flag);
}

TEST(TextForms, WithAndWithoutValues)
{
  SampleReplica s;
  VLXKDMInstance instance = s.Create();
  ASSERT_EQ(VLX_S_OK, instance.SetID(VLXUnicodeString("p1")));
  VLXUnicodeString plain, full;
  ASSERT_EQ(VLX_S_OK, instance.ToString(plain));
  EXPECT_NE(std::string::npos, Text(plain).find("Sample[id=\"p1\"]")) << Text(plain);
  EXPECT_NE(std::string::npos, Text(plain).find("created")) << Text(plain);
  EXPECT_EQ(std::string::npos, Text(plain).find('{')) << Text(plain);
  for (VLXBoolean withValues : {VLXBoolean(1), VLXBoolean(2), VLXBoolean(255)}) {
    ASSERT_EQ(VLX_S_OK, instance.ToString(withValues, full));
    EXPECT_NE(std::string::npos, Text(full).find("{}")) << Text(full);
  }
  ASSERT_EQ(VLX_S_OK, instance.ToString(0, full));
  EXPECT_EQ(Text(plain), Text(full));
}

TEST(UnbuiltInstances, EveryOperationFailsNamingItselfAndWritesNothing)
{
  VLXKDMInstance instance;
  VLXKDMClassDef classDef;
  VLXUnicodeString text("kept");
  VLXBoolean flag = 9;
  Identifier id;
  const struct {
    const char* name;
    long (*run)(VLXKDMInstance&, VLXKDMClassDef&, VLXUnicodeString&, VLXBoolean&, Identifier&);
  } cases[] = {
#define CASE(text, expr) {text, [](VLXKDMInstance& in, VLXKDMClassDef& cd, VLXUnicodeString& t, VLXBoolean& f, \
                                   Identifier& i) -> long { (void)in, (void)cd, (void)t, (void)f, (void)i; return expr; }}
      CASE("VLXKDMInstance::GetClassDef(VLXKDMClassDef&)", in.GetClassDef(cd)),
      CASE("VLXKDMInstance::GetID(VLXBoolean&, VLXBoolean&, VLXUnicodeString&, VLXBinary&)", i.Read(in)),
      CASE("VLXKDMInstance::SetID(const VLXUnicodeString&)", in.SetID(t)),
      CASE("VLXKDMInstance::SetID(const VLXBinary&)", in.SetID(VLXBinary())),
      CASE("VLXKDMInstance::IsCreated(VLXBoolean&)", in.IsCreated(f)),
      CASE("VLXKDMInstance::IsModified(VLXBoolean&)", in.IsModified(f)),
      CASE("VLXKDMInstance::IsDeleted(VLXBoolean&)", in.IsDeleted(f)),
      CASE("VLXKDMInstance::IsValuated(const VLXUnicodeString&, VLXBoolean&)", in.IsValuated(t, f)),
      CASE("VLXKDMInstance::IsValuated(int, VLXBoolean&)", in.IsValuated(0, f)),
      CASE("VLXKDMInstance::ClearValue(const VLXUnicodeString&)", in.ClearValue(t)),
      CASE("VLXKDMInstance::ClearValue(int)", in.ClearValue(0)),
      CASE("VLXKDMInstance::ToString(VLXUnicodeString&)", in.ToString(t)),
      CASE("VLXKDMInstance::ToString(VLXBoolean, VLXUnicodeString&)", in.ToString(1, t)),
#undef CASE
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    ClearLastError();
    EXPECT_EQ(VLX_E_FAIL, c.run(instance, classDef, text, flag, id));
    EXPECT_EQ("VLXJBXInfraERR_1003", PeekLastError().id);
    EXPECT_EQ(c.name, LastErrorOperation());
  }
  EXPECT_EQ("kept", Text(text));
  EXPECT_EQ(9, flag);
  EXPECT_EQ(9, id.noID);
  EXPECT_EQ(nullptr, classDef.GetHandle());
}

}  // namespace
