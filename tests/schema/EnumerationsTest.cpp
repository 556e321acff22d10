// The schema enumerations: every enumerator set and read back, null answers, values out of range.
#include <functional>
#include "TestSupport.h"

using namespace corvexa_test;

namespace {

const char* const kNullAttributeDef = "com/velmora/tessara/testdoubles/NullSchema$AttributeDef";
const char* const kNullClassDef = "com/velmora/tessara/testdoubles/NullSchema$ClassDefinition";

// Sets each enumerator through the setter and reads it back through the getter.
template <class E, class Proxy>
void RoundTrip(Proxy& proxy, int count, long (Proxy::*set)(E), long (Proxy::*get)(E&) const)
{
  for (int value = 0; value < count; ++value) {
    SCOPED_TRACE(value);
    ASSERT_EQ(VLX_S_OK, (proxy.*set)(static_cast<E>(value)));
    E back = static_cast<E>(count - 1 - value);
    ASSERT_EQ(VLX_S_OK, (proxy.*get)(back));
    EXPECT_EQ(value, static_cast<int>(back));
  }
}

TEST(Enumerations, EveryEnumeratorCrossesBothWays)
{
  VLXKDMAttributeDef attribute;
  ASSERT_EQ(VLX_S_OK, attribute.Build(U("weight"), VLXKDMAttributeType::Double));
  RoundTrip<VLXKDMAccessMode::Mode>(attribute, 3, &VLXKDMAttributeDef::SetAccessMode,
                                    &VLXKDMAttributeDef::GetAccessMode);
  RoundTrip<VLXKDMAggregationType::Type>(attribute, 2, &VLXKDMAttributeDef::SetAggregationType,
                                         &VLXKDMAttributeDef::GetAggregationType);
  RoundTrip<VLXKDMVisibility::Mode>(attribute, 3, &VLXKDMAttributeDef::SetSoftwareVisibility,
                                    &VLXKDMAttributeDef::GetSoftwareVisibility);

  VLXKDMClassDef classDef;
  ASSERT_EQ(VLX_S_OK, classDef.Build(U("Part")));
  RoundTrip<VLXKDMClassType::Type>(classDef, 2, &VLXKDMClassDef::SetClassType, &VLXKDMClassDef::GetClassType);
  RoundTrip<VLXKDMVisibility::Mode>(classDef, 3, &VLXKDMClassDef::SetSoftwareVisibility,
                                    &VLXKDMClassDef::GetSoftwareVisibility);

  // The attribute type is fixed when the definition is built.
  for (int type = 0; type <= VLXKDMAttributeType::Relationship; ++type) {
    SCOPED_TRACE(type);
    VLXKDMAttributeDef typed;
    ASSERT_EQ(VLX_S_OK, typed.Build(VLXUnicodeString("a"), static_cast<VLXKDMAttributeType::Type>(type)));
    VLXKDMAttributeType::Type back = VLXKDMAttributeType::Relationship;
    if (type == VLXKDMAttributeType::Relationship) back = VLXKDMAttributeType::Integer;
    ASSERT_EQ(VLX_S_OK, typed.GetAttributeType(back));
    EXPECT_EQ(type, back);
  }
}

// Answers a getter writes into a sentinel.
template <class E, class Proxy>
int Got(Proxy& proxy, long (Proxy::*get)(E&) const, int sentinel)
{
  E value = static_cast<E>(sentinel);
  EXPECT_EQ(VLX_S_OK, (proxy.*get)(value));
  return value;
}

// Null answers give the defaults, but leave the aggregation alone.
TEST(Enumerations, NullAnswersGiveTheDefaultsButLeaveTheAggregationAlone)
{
  VLXKDMAttributeDef attribute;
  VLXKDMClassDef classDef;
  AttachNew(attribute, kNullAttributeDef);
  AttachNew(classDef, kNullClassDef);
  EXPECT_EQ(VLXKDMAttributeType::String, Got(attribute, &VLXKDMAttributeDef::GetAttributeType, 5));
  EXPECT_EQ(VLXKDMAccessMode::Read, Got(attribute, &VLXKDMAttributeDef::GetAccessMode, 2));
  EXPECT_EQ(VLXKDMVisibility::Public, Got(attribute, &VLXKDMAttributeDef::GetSoftwareVisibility, 2));
  EXPECT_EQ(VLXKDMAggregationType::Shared, Got(attribute, &VLXKDMAttributeDef::GetAggregationType, 1));
  EXPECT_EQ(VLXKDMClassType::Class, Got(classDef, &VLXKDMClassDef::GetClassType, 1));
  EXPECT_EQ(VLXKDMVisibility::Public, Got(classDef, &VLXKDMClassDef::GetSoftwareVisibility, 1));
}

struct OutOfRange {
  const char* what;
  std::function<long()> call;
  const char* message;
};

TEST(Enumerations, ValuesOutOfRangeAreReportedAndNeverReachJava)
{
  VLXKDMAttributeDef attribute;
  AttachNew(attribute, kNullAttributeDef);
  VLXKDMClassDef classDef;
  AttachNew(classDef, kNullClassDef);
  VLXKDMAttributeDef built;
  const std::vector<OutOfRange> cases = {
      {"SetAccessMode(3)", [&] { return attribute.SetAccessMode(static_cast<VLXKDMAccessMode::Mode>(3)); },
       "AssertionFailed:mode != NULL"},
      {"SetAggregationType(-1)",
       [&] { return attribute.SetAggregationType(static_cast<VLXKDMAggregationType::Type>(-1)); },
       "AssertionFailed:agg != NULL"},
      {"AttributeDef SetSoftwareVisibility(3)",
       [&] { return attribute.SetSoftwareVisibility(static_cast<VLXKDMVisibility::Mode>(3)); },
       "AssertionFailed:vis != NULL"},
      {"SetClassType(2)", [&] { return classDef.SetClassType(static_cast<VLXKDMClassType::Type>(2)); },
       "AssertionFailed:type != NULL"},
      {"ClassDef SetSoftwareVisibility(7)",
       [&] { return classDef.SetSoftwareVisibility(static_cast<VLXKDMVisibility::Mode>(7)); },
       "AssertionFailed:vis != NULL"},
      {"Build(name, 7)", [&] { return built.Build(U("x"), static_cast<VLXKDMAttributeType::Type>(7)); },
       "AssertionFailed:type != NULL"},
  };
  for (const OutOfRange& c : cases) {
    SCOPED_TRACE(c.what);
    FatalRecorder recorder;
    const long rc = c.call();
    EXPECT_LT(rc, 0);
    ASSERT_EQ(1u, FatalRecorder::Reports().size());
    EXPECT_EQ(c.message, FatalRecorder::Reports()[0].message);
    EXPECT_NE(std::string::npos, PeekLastError().text.find("none of its enumerators")) << PeekLastError().text;
  }
  EXPECT_EQ(0, IntField(attribute.GetHandle(), "setterCalls"));
  EXPECT_EQ(0, IntField(classDef.GetHandle(), "setterCalls"));
  EXPECT_EQ(nullptr, built.GetHandle());

  // The type is mapped before the name is converted: a bad type is reported even with a bad name.
  FatalRecorder recorder;
  const long raw = built.Build(VLXUnicodeString("bad \xC3"), static_cast<VLXKDMAttributeType::Type>(9));
  EXPECT_EQ(1u, FatalRecorder::Reports().size());
  EXPECT_LT(raw, 0);
}

}  // namespace
