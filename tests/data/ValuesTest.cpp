// Attribute values and identifiers of instances of a real replica: the variadic setters against the
// list setters, dates and booleans as written, what the native side refuses, and what it leaves
// alone when it fails. (Values of every type cross through the converters of values/.)
#include <functional>

#include "TestSupport.h"

using namespace corvexa_test;

namespace {

VLXKDMInstanceValue Read(VLXKDMInstance& in, int position)
{
  VLXKDMInstanceValue value;
  EXPECT_EQ(VLX_S_OK, in.GetValue(position, value));
  return value;
}

// The variadic setter, by name and by position, with the three values of list and with none,
// sends what the list setter sends.
template <class Variadic, class List>
void SendsWhatTheListSetterSends(VLXKDMInstance& in, int p, Variadic variadic, const List& list)
{
  for (int k : {3, 0}) {
    for (bool byName : {true, false}) {
      SCOPED_TRACE(std::string(SampleAttributes()[p].name) + " with " + std::to_string(k) + (byName ? " by name" : ""));
      List first;
      for (int i = 1; i <= k; ++i) first.Append(list[i]);
      ASSERT_EQ(VLX_S_OK, in.SetValue(p, first));
      const VLXKDMInstanceValue sent = Read(in, p);
      ASSERT_EQ(VLX_S_OK, in.ClearValue(p));
      ASSERT_EQ(VLX_S_OK, byName ? variadic(U(SampleAttributes()[p].name), k) : variadic(p, k));
      EXPECT_TRUE(DeepEquals(sent.GetHandle(), Read(in, p).GetHandle()));
    }
  }
}

TEST(VariadicSetters, SendWhatTheListSettersSend)
{
  SampleReplica s;
  VLXKDMInstance in = s.Create(), t1 = s.Create(), t2 = s.Create();
  const VLXBinary b1("ab", 2), b2, b3("\0c", 2);
  const VLXTime d1 = Seconds(5), d2 = Seconds(0), d3 = Seconds(1700000000);
  SendsWhatTheListSetterSends(
      in, 7, [&](auto x, int k) { return in.SetValueIntegers(x, k, 1, 2, 3); }, ListOf<VLXRawCollint>({1, 2, 3}));
  SendsWhatTheListSetterSends(
      in, 8, [&](auto x, int k) { return in.SetValueDoubles(x, k, 0.5, -2.0, 1e300); },
      ListOf<VLXRawColldouble>({0.5, -2.0, 1e300}));
  SendsWhatTheListSetterSends(
      in, 9, [&](auto x, int k) { return in.SetValueStrings(x, k, "a", "\xC3\xA9", ""); },
      ListOf<VLXListValVLXUnicodeString>({U("a"), U("\xC3\xA9"), U("")}));
  SendsWhatTheListSetterSends(
      in, 10, [&](auto x, int k) { return in.SetValueDates(x, k, &d1, &d2, &d3); },
      ListOf<VLXListValVLXTime>({d1, d2, d3}));
  SendsWhatTheListSetterSends(
      in, 11, [&](auto x, int k) { return in.SetValueBooleans(x, k, 1, 256, 1); },
      ListOf<VLXListValVLXBoolean, VLXBoolean>({1, 1, 1}));
  SendsWhatTheListSetterSends(
      in, 12, [&](auto x, int k) { return in.SetValueBinaries(x, k, &b1, &b2, &b3); },
      ListOf<VLXListValVLXBinary>({b1, b2, b3}));
  SendsWhatTheListSetterSends(
      in, 13, [&](auto x, int k) { return in.SetValueInstances(x, k, &t1, &t2, &t1); },
      ListOf<VLXListValVLXKDMInstance>({t1, t2, t1}));
}

// A holder that cannot be built, or an instance without Java object, fails before any Java call: the
// attribute keeps its value.
TEST(ValueFailures, WhatCannotCrossToJavaReachesNoJavaMethod)
{
  VLXKDMInstance counting;
  AttachNew(counting, "com/velmora/tessara/testdoubles/CountingInstance");
  FatalRecorder fatal;
  VLXKDMInstanceValue untyped, unattached, unattachedList;
  unattached.SetInstance(VLXKDMInstance());
  VLXListValVLXKDMInstance list;
  list.Append(VLXKDMInstance());
  unattachedList.SetListOfInstance(list);
  for (VLXKDMInstanceValue* value : {&untyped, &unattached, &unattachedList}) {
    EXPECT_LT(counting.SetValue(U("any"), *value), 0);
    EXPECT_LT(counting.SetValue(3, *value), 0);
    EXPECT_EQ(nullptr, value->GetHandle());
  }
  // So do an unattached instance and a list holding one, given to the instance setters.
  const VLXKDMInstance none, attached = NewInstance();
  EXPECT_LT(counting.SetValue(U("any"), none), 0);
  EXPECT_LT(counting.SetValueInstances(3, 2, &attached, &none), 0);
  EXPECT_EQ(8u, FatalRecorder::Reports().size());
  EXPECT_EQ(0, IntField(counting.GetHandle(), "setValueCalls"));
  // The same double counts a holder that can be built, and a typed setter.
  VLXKDMInstanceValue typed;
  typed.SetInteger(1);
  EXPECT_EQ(VLX_S_OK, counting.SetValue(3, typed));
  EXPECT_EQ(VLX_S_OK, counting.SetValue(U("any"), 2));
  EXPECT_EQ(2, IntField(counting.GetHandle(), "setValueCalls"));
}

// What C++ writes it reads back: whole seconds before 1970, and booleans (any non-zero byte is
// true, so a unique attribute cannot hold two different "true"s).
TEST(Values, DatesBefore1970AndBooleansReadBackAsWritten)
{
  SampleReplica s;
  VLXKDMInstance instance = s.Create();
  const time_t seconds[] = {-86400, -305942400, -1, -62135596800};
  VLXListValVLXTime dates;
  for (time_t t : seconds) {
    dates.Append(Seconds(t));
    ASSERT_EQ(VLX_S_OK, instance.SetValue(U("date"), Seconds(t)));
    VLXKDMInstanceValue value = Read(instance, 3);
    ASSERT_EQ(VLX_S_OK, instance.SetValue(U("date"), value));  // read-modify-write
    EXPECT_EQ(t, Read(instance, 3).GetDate().Gettime_t());
  }
  ASSERT_EQ(VLX_S_OK, instance.SetValue(U("dates"), dates));
  EXPECT_TRUE(Read(instance, 10).GetListOfDate() == dates);

  ASSERT_EQ(VLX_S_OK, instance.SetValueBooleans(U("booleans"), 4, 1, 0, 256, 2));
  EXPECT_TRUE(Read(instance, 11).GetListOfBoolean() == (ListOf<VLXListValVLXBoolean, VLXBoolean>({1, 0, 1, 1})));
  ASSERT_EQ(VLX_S_OK, instance.SetValue(U("booleans"), ListOf<VLXListValVLXBoolean, VLXBoolean>({7})));
  EXPECT_EQ(1, Read(instance, 11).GetListOfBoolean()[1]);
  ASSERT_EQ(VLX_S_OK, instance.SetValue(U("boolean"), static_cast<VLXBoolean>(2)));
  EXPECT_EQ(1, Read(instance, 4).GetBoolean());
  // Any non-zero byte asks ToString for the values too.
  VLXUnicodeString plain, none, full;
  ASSERT_EQ(VLX_S_OK, instance.ToString(plain));
  ASSERT_EQ(VLX_S_OK, instance.ToString(0, none));
  EXPECT_EQ(Text(plain), Text(none));
  for (VLXBoolean withValues : {VLXBoolean(1), VLXBoolean(2), VLXBoolean(255)}) {
    ASSERT_EQ(VLX_S_OK, instance.ToString(withValues, full));
    EXPECT_TRUE(Has(Text(full), Text(plain)) && Text(full).size() > Text(plain).size()) << Text(full);
  }
}

// Reading an attribute that has no value fails naming the attribute and the instance (never an
// earlier error), and leaves a reused holder exactly as it was: sent elsewhere, it still carries
// its value, never a null that would clear the attribute.
TEST(ValueFailures, AnAttributeWithoutValueLeavesTheHolderAsItWas)
{
  SampleReplica s;
  VLXKDMInstance read = s.Create(), written = s.Create();
  ASSERT_EQ(VLX_S_OK, read.SetValue(U("integer"), 42));
  ASSERT_EQ(VLX_S_OK, written.SetValue(U("integer"), 7));
  VLXKDMInstanceValue value;
  ASSERT_EQ(VLX_S_OK, read.GetValue(U("integer"), value));
  for (const bool byName : {true, false}) {
    SCOPED_TRACE(byName);
    VLXError* earlier = new VLXError("TESTERR_0002", "CorvexaTestMessages");
    VLXError::GetReturn(2, earlier, nullptr, __FILE__, __LINE__);
    EXPECT_EQ(VLX_E_FAIL, byName ? read.GetValue(U("double"), value) : read.GetValue(1, value));
    const std::string text = PeekLastError().text;
    EXPECT_NE(std::string::npos, text.find(byName ? "the attribute 'double' of Instance Sample"
                                                  : "the attribute at position 1 of Instance Sample"))
        << text;
    EXPECT_NE(std::string::npos, text.find("has no value")) << text;
    EXPECT_EQ(42, value.GetInteger());
    EXPECT_NE(nullptr, value.GetHandle());
  }
  ASSERT_EQ(VLX_S_OK, written.SetValue(U("integer"), value));
  VLXKDMInstanceValue back;
  ASSERT_EQ(VLX_S_OK, written.GetValue(U("integer"), back));
  EXPECT_EQ(42, back.GetInteger());
}

// Every variadic setter refuses a negative count, and a null time or instance pointer, before any
// conversion: VLX_E_INVALIDARG, a last error saying which, and nothing changed.
TEST(VariadicSetters, ANegativeCountOrANullPointerIsRefusedChangingNothing)
{
  SampleReplica s;
  VLXKDMInstance instance = s.Create();
  VLXKDMClassDef classDef;
  ASSERT_EQ(VLX_S_OK, classDef.Build(U("C")));
  ASSERT_EQ(VLX_S_OK, classDef.SetScopeNames(1, "kept"));
  VLXKDMAttributeDef attribute;
  ASSERT_EQ(VLX_S_OK, attribute.Build(U("a"), VLXKDMAttributeType::Relationship));
  ASSERT_EQ(VLX_S_OK, attribute.SetTargetNames(1, "kept"));
  ASSERT_EQ(VLX_S_OK, attribute.SetTargetRefs(1, "kept"));
  const VLXTime one = Seconds(1);
  const VLXTime* noTime = nullptr;
  const VLXKDMInstance* noInstance = nullptr;
  const std::string negative = "the count -1 is negative";
  const std::string name = "const VLXUnicodeString&, int, ...)";
#define BOTH(setter, name, position)                                                                      \
  {"VLXKDMInstance::" #setter "(const VLXUnicodeString&, int, ...)", negative,                            \
   [&] { return instance.setter(U(name), -1); }},                                                         \
  {                                                                                                       \
    "VLXKDMInstance::" #setter "(int, int, ...)", negative, [&] { return instance.setter(position, -1); } \
  }
  const struct {
    std::string operation, why;
    std::function<long()> call;
  } cases[] = {
      {"VLXKDMClassDef::SetScopeNames(int, ...)", negative, [&] { return classDef.SetScopeNames(-1); }},
      {"VLXKDMAttributeDef::SetTargetNames(int, ...)", negative, [&] { return attribute.SetTargetNames(-1); }},
      {"VLXKDMAttributeDef::SetTargetRefs(int, ...)", negative, [&] { return attribute.SetTargetRefs(-1); }},
      BOTH(SetValueBinaries, "binaries", 12),
      BOTH(SetValueBooleans, "booleans", 11),
      BOTH(SetValueDates, "dates", 10),
      BOTH(SetValueDoubles, "doubles", 8),
      BOTH(SetValueInstances, "instances", 13),
      BOTH(SetValueIntegers, "integers", 7),
      BOTH(SetValueStrings, "strings", 9),
      {"VLXKDMInstance::SetValueDates(int, int, ...)", "value 2 of 2 is a null pointer",
       [&] { return instance.SetValueDates(10, 2, &one, noTime); }},
      {"VLXKDMInstance::SetValueDates(" + name, "value 1 of 1 is a null pointer",
       [&] { return instance.SetValueDates(U("dates"), 1, noTime); }},
      {"VLXKDMInstance::SetValueInstances(int, int, ...)", "value 1 of 2 is a null pointer",
       [&] { return instance.SetValueInstances(13, 2, noInstance, &instance); }},
      {"VLXKDMInstance::SetValueInstances(" + name, "value 1 of 1 is a null pointer",
       [&] { return instance.SetValueInstances(U("instances"), 1, noInstance); }},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.operation);
    ClearLastError();
    EXPECT_EQ(VLX_E_INVALIDARG, c.call());
    EXPECT_EQ("invalid argument to " + c.operation + ": " + c.why, PeekLastError().text);
  }
  VLXListOfVLXUnicodeString texts;
  ASSERT_EQ(VLX_S_OK, classDef.GetScopeNames(texts));
  EXPECT_EQ("kept", Texts(texts));
  ASSERT_EQ(VLX_S_OK, attribute.GetTargetNames(texts));
  EXPECT_EQ("kept", Texts(texts));
  ASSERT_EQ(VLX_S_OK, attribute.GetTargetRefs(texts));
  EXPECT_EQ("kept", Texts(texts));
  for (int position = 7; position < 14; ++position) {
    VLXBoolean valuated = 9;
    ASSERT_EQ(VLX_S_OK, instance.IsValuated(position, valuated));
    EXPECT_EQ(0, valuated) << position;
  }
}

// GetID writes only what the identifier's kind says: without one, noID alone; a text leaves bytes
// alone, bytes leave the text alone; an identifier of another class fails naming it, after noID.
TEST(Identifiers, EachKindWritesOnlyItsOutParameters)
{
  SampleReplica s;
  VLXKDMInstance none = s.Create(), text = s.Create(), bytes = s.Create(), integer, boxedLong;
  const std::string id("p-\xE2\x82\xAC-1\0tail", 11);
  ASSERT_EQ(VLX_S_OK, text.SetID(U(id)));
  const unsigned char raw[] = {0x00, 0xFF, 0x80};
  ASSERT_EQ(VLX_S_OK, bytes.SetID(VLXBinary(raw, sizeof raw)));
  AttachNew(integer, "com/velmora/tessara/testdoubles/IntegerIdInstance");
  AttachNew(boxedLong, "com/velmora/tessara/testdoubles/LongInstance");
  const struct {
    const char* what;
    VLXKDMInstance& instance;
    long rc;
    std::string expected;  // noID, isText, text, bytes as read afterwards
  } cases[] = {
      {"none", none, VLX_S_OK, "1 9 former 2"},
      {"text", text, VLX_S_OK, "0 1 " + id + " 2"},
      {"bytes", bytes, VLX_S_OK, "0 0 former 3"},
      {"a java.lang.Integer,", integer, VLX_E_FAIL, "0 9 former 2"},
      {"a java.lang.Long,", boxedLong, VLX_E_FAIL, "0 9 former 2"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    VLXBoolean noID = 9, isText = 9;
    VLXUnicodeString out("former");
    VLXBinary data("\x01\x02", 2);
    ClearLastError();
    EXPECT_EQ(c.rc, c.instance.GetID(noID, isText, out, data));
    EXPECT_EQ(c.expected, std::to_string(noID) + " " + std::to_string(isText) + " " + Text(out) + " " +
                              std::to_string(data.getLength()));
    EXPECT_TRUE(c.rc == VLX_S_OK || Has(PeekLastError().text, c.what)) << PeekLastError().text;
  }
}

// A value holder without type selects the instances that have no value (and reports nothing).
TEST(Selection, AnUntypedValueSelectsTheInstancesWithoutValue)
{
  FatalRecorder fatal;
  SampleReplica s;
  VLXKDMInstance with = s.Create(), without = s.Create();
  ASSERT_EQ(VLX_S_OK, with.SetValue(0, 7));
  VLXKDMInstanceValue untyped;
  VLXListValVLXKDMInstance found;
  ASSERT_EQ(VLX_S_OK, s.model.SelectInstances(U("integer"), untyped, 0, found)) << PeekLastError().text;
  ASSERT_EQ(1, found.Size());
  EXPECT_TRUE(found[1] == without);
  EXPECT_TRUE(Reports().empty());
}

}  // namespace
