// The call frame's entries for attribute values, against a real instance of the replica package:
// a native value sent as its Java object (AsJava), a value holder sent after BuildRemote (Remote),
// and a returned value landed in a holder (BuildLocal).
#include <string>

#include <gtest/gtest.h>

#include "ValuesSupport.h"
#include "VLXKDMAttributeDef.h"
#include "VLXKDMAttributeDefList.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMModel.h"
#include "VLXKDMModelSet.h"
#include "VLXKDMReplica.h"

using namespace corvexa_test;
using namespace corvexa;

namespace {

const char* const kSet = "test setValue(String, Object)";
const char* const kGet = "test getValue(String)";

// A replica with the class Thing (count: Integer; dates: Date, multi-valued; others: instances of
// Thing, multi-valued) and two of its instances.
struct Things {
  VLXKDMReplica replica;
  VLXKDMModel model;
  VLXKDMInstance first, second;

  Things()
  {
    EXPECT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString("things")));
    VLXKDMClassDef thing;
    EXPECT_EQ(VLX_S_OK, thing.Build(VLXUnicodeString("Thing")));
    VLXKDMAttributeDefList attributes;
    EXPECT_EQ(VLX_S_OK, thing.GetAttributes(attributes));
    const struct {
      const char* name;
      VLXKDMAttributeType::Type type;
      VLXBoolean multi;
    } specs[] = {{"count", VLXKDMAttributeType::Integer, 0},
                 {"dates", VLXKDMAttributeType::Date, 1},
                 {"others", VLXKDMAttributeType::Relationship, 1}};
    for (const auto& s : specs) {
      VLXKDMAttributeDef attribute;
      EXPECT_EQ(VLX_S_OK, attribute.Build(VLXUnicodeString(s.name), s.type));
      EXPECT_EQ(VLX_S_OK, attribute.SetMultiValuation(s.multi));
      EXPECT_EQ(VLX_S_OK, attributes.Add(attribute));
    }
    EXPECT_EQ(VLX_S_OK, model.Build(thing));
    VLXKDMModelSet models;
    EXPECT_EQ(VLX_S_OK, replica.GetModels(models));
    EXPECT_EQ(VLX_S_OK, models.Add(model));
    EXPECT_EQ(VLX_S_OK, model.CreateInstance(first));
    EXPECT_EQ(VLX_S_OK, model.CreateInstance(second));
  }

  long Get(const char* name, VLXKDMInstanceValue& value)
  {
    return Call(first, kGet, slot<Instance_getValueNamed>).with(VLXUnicodeString(name)).returning(value);
  }
};

TEST(FrameValues, NativeValuesGoAsTheirJavaObjectsAndComeBackIntoAHolder)
{
  Things t;
  const VLXUnicodeString count("count"), dates("dates"), others("others");
  ASSERT_EQ(VLX_S_OK, Call(t.first, kSet, slot<Instance_setValueNamed>).with(count, AsJava(42)).run());
  VLXListValVLXTime times;
  times.Append(Seconds(10));
  times.Append(Seconds(3));
  ASSERT_EQ(VLX_S_OK, Call(t.first, kSet, slot<Instance_setValueNamed>).with(dates, AsJava(times)).run());
  VLXListValVLXKDMInstance both;
  both.Append(t.first);
  both.Append(t.second);
  ASSERT_EQ(VLX_S_OK, Call(t.first, kSet, slot<Instance_setValueNamed>).with(others, AsJava(both)).run());

  VLXKDMInstanceValue value;
  ASSERT_EQ(VLX_S_OK, t.Get("count", value));
  EXPECT_EQ(42, value.GetInteger());
  ASSERT_EQ(VLX_S_OK, t.Get("dates", value));
  EXPECT_TRUE(value.GetListOfDate() == times);
  ASSERT_EQ(VLX_S_OK, t.Get("others", value));
  EXPECT_TRUE(value.GetListOfInstance() == both);

  // An unknown attribute: the Java exception fails the operation and the holder is not re-attached.
  const jobject before = value.GetHandle();
  ClearLastError();
  EXPECT_LT(t.Get("absent", value), 0);
  EXPECT_EQ(before, value.GetHandle());
  EXPECT_NE(std::string::npos, PeekLastError().text.find("absent")) << PeekLastError().text;

  // An unattached instance is reported and nothing reaches Java.
  FatalRecorder recorder;
  both.Append(VLXKDMInstance());
  EXPECT_LT(Call(t.first, kSet, slot<Instance_setValueNamed>).with(others, AsJava(both)).run(), 0);
  ASSERT_EQ(VLX_S_OK, t.Get("others", value));
  EXPECT_EQ(2, value.GetListOfInstance().Size());
}

TEST(FrameValues, AHolderGoesAfterBuildRemoteAndAHolderWithoutTypeStopsTheCall)
{
  Things t;
  const VLXUnicodeString count("count");
  VLXKDMInstanceValue value;
  value.SetInteger(7);
  ASSERT_EQ(VLX_S_OK, Call(t.first, kSet, slot<Instance_setValueNamed>).with(count, Remote(value)).run());
  EXPECT_TRUE(IsExactly(value.GetHandle(), "java/lang/Integer"));
  VLXKDMInstanceValue read;
  ASSERT_EQ(VLX_S_OK, t.Get("count", read));
  EXPECT_EQ(7, read.GetInteger());

  // BuildRemote runs before the name is converted: a bad name fails after the value got its object.
  VLXKDMInstanceValue pending;
  pending.SetInteger(8);
  EXPECT_LT(Call(t.first, kSet, slot<Instance_setValueNamed>).with(VLXUnicodeString("\xC3"), Remote(pending)).run(), 0);
  EXPECT_NE(nullptr, pending.GetHandle());

  FatalRecorder recorder;
  VLXKDMInstanceValue untyped;
  ClearLastError();
  EXPECT_LT(Call(t.first, kSet, slot<Instance_setValueNamed>).with(count, Remote(untyped)).run(), 0);
  EXPECT_EQ(1u, FatalRecorder::Reports().size());
  ASSERT_EQ(VLX_S_OK, t.Get("count", read));
  EXPECT_EQ(7, read.GetInteger());  // no null was sent to clear it
}

}  // namespace
