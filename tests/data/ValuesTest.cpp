// Attribute values of every type, single and list, against the real replica package: written by the
// typed setters, the variadic setters and SetValue with a value holder, by name and by position, and
// read back with GetValue both ways; empty and long lists; values the native side cannot take.
#include <climits>
#include <functional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "DataFixture.h"
#include "VLXKDMInstanceValue.h"
#include "VLXListValVLXKDMInstance.h"

using namespace corvexa_test;

namespace {

using Type = VLXKDMInstanceValue::Type;

VLXTime Time(time_t seconds)
{
  VLXTime t;
  t.Settime_t(seconds);
  return t;
}

template <class List, class T>
List ListOf(std::initializer_list<T> values)
{
  List list;
  for (const T& v : values) list.Append(v);
  return list;
}

// One attribute of the class Sample with a value for it, and the ways to write and check it.
struct ValueCase {
  int position;
  Type type;
  bool list;
  std::function<long(VLXKDMInstance&, const VLXUnicodeString&)> typedByName;
  std::function<long(VLXKDMInstance&, int)> typedByPosition;
  std::function<void(VLXKDMInstanceValue&)> fill;
  std::function<bool(const VLXKDMInstanceValue&)> holds;
  std::string attribute() const { return SampleAttributes()[position].name; }
};

template <auto Set, auto Get, class T>
ValueCase MakeCase(int position, Type type, const T& value)
{
  ValueCase c;
  c.position = position;
  c.type = type;
  c.list = position >= 7;
  c.typedByName = [value](VLXKDMInstance& instance, const VLXUnicodeString& name) {
    return instance.SetValue(name, value);
  };
  c.typedByPosition = [value](VLXKDMInstance& instance, int p) { return instance.SetValue(p, value); };
  c.fill = [value](VLXKDMInstanceValue& holder) { (holder.*Set)(value); };
  c.holds = [value](const VLXKDMInstanceValue& holder) { return static_cast<bool>((holder.*Get)() == value); };
  return c;
}

// A value of every type, single and list, some of them at the edges of their range.
std::vector<ValueCase> EveryType(const VLXKDMInstance& target, const VLXKDMInstance& other)
{
  using V = VLXKDMInstanceValue;
  const std::string text("euro \xE2\x82\xAC, smile \xF0\x9F\x98\x80, nul \0 end", 31);
  const VLXUnicodeString unicode(text.data(), static_cast<int>(text.size()));
  const unsigned char raw[] = {0x00, 0xFF, 0x80, 0x7F, 0x00};
  const VLXBinary bytes(raw, sizeof raw);
  VLXListValVLXKDMInstance instances;
  instances.Append(target);
  instances.Append(other);
  instances.Append(target);
  return {
      MakeCase<&V::SetInteger, &V::GetInteger>(0, V::IntegerType, INT_MIN),
      MakeCase<&V::SetDouble, &V::GetDouble>(1, V::DoubleType, -6.02214076e-23),
      MakeCase<&V::SetString, &V::GetString>(2, V::StringType, unicode),
      MakeCase<&V::SetDate, &V::GetDate>(3, V::DateType, Time(4102444799)),
      MakeCase<&V::SetBoolean, &V::GetBoolean>(4, V::BooleanType, VLXBoolean(1)),
      MakeCase<&V::SetBinary, &V::GetBinary>(5, V::BinaryType, bytes),
      MakeCase<&V::SetInstance, &V::GetInstance>(6, V::InstanceType, target),
      MakeCase<&V::SetListOfInteger, &V::GetListOfInteger>(
          7, V::IntegerType, ListOf<VLXRawCollint>({INT_MIN, -1, 0, 7, INT_MAX})),
      MakeCase<&V::SetListOfDouble, &V::GetListOfDouble>(
          8, V::DoubleType, ListOf<VLXRawColldouble>({0.1, -0.0, 1e308, 5e-324})),
      MakeCase<&V::SetListOfString, &V::GetListOfString>(
          9, V::StringType, ListOf<VLXListValVLXUnicodeString>({unicode, VLXUnicodeString(""), VLXUnicodeString("b")})),
      MakeCase<&V::SetListOfDate, &V::GetListOfDate>(
          10, V::DateType, ListOf<VLXListValVLXTime>({Time(0), Time(1), Time(1700000000), Time(253402300799)})),
      MakeCase<&V::SetListOfBoolean, &V::GetListOfBoolean>(
          11, V::BooleanType, ListOf<VLXListValVLXBoolean>({VLXBoolean(1), VLXBoolean(0), VLXBoolean(1)})),
      MakeCase<&V::SetListOfBinary, &V::GetListOfBinary>(
          12, V::BinaryType, ListOf<VLXListValVLXBinary>({bytes, VLXBinary(), VLXBinary("z", 1)})),
      MakeCase<&V::SetListOfInstance, &V::GetListOfInstance>(13, V::InstanceType, instances),
  };
}

// Reads the attribute by name and by position and checks both against the case.
void ExpectReadBack(VLXKDMInstance& instance, const ValueCase& c)
{
  VLXKDMInstanceValue byName, byPosition;
  ASSERT_EQ(VLX_S_OK, instance.GetValue(VLXUnicodeString(c.attribute().c_str()), byName));
  ASSERT_EQ(VLX_S_OK, instance.GetValue(c.position, byPosition));
  for (VLXKDMInstanceValue* read : {&byName, &byPosition}) {
    EXPECT_EQ(c.type, read->GetType());
    EXPECT_EQ(c.list ? 1 : 0, read->IsMultiValuated());
    EXPECT_TRUE(c.holds(*read));
  }
}

TEST(Values, EveryTypeWrittenEachWayReadsBackByNameAndPosition)
{
  SampleReplica s;
  VLXKDMInstance instance = s.Create(), target = s.Create(), other = s.Create();
  for (const ValueCase& c : EveryType(target, other)) {
    const VLXUnicodeString name(c.attribute().c_str());
    const struct {
      const char* how;
      std::function<long()> write;
    } writes[] = {
        {"typed setter by name", [&] { return c.typedByName(instance, name); }},
        {"typed setter by position", [&] { return c.typedByPosition(instance, c.position); }},
        {"value holder by name", [&] {
           VLXKDMInstanceValue holder;
           c.fill(holder);
           const long rc = instance.SetValue(name, holder);
           EXPECT_NE(nullptr, holder.GetHandle());  // the holder keeps its Java form
           return rc;
         }},
        {"value holder by position", [&] {
           VLXKDMInstanceValue holder;
           c.fill(holder);
           return instance.SetValue(c.position, holder);
         }},
    };
    for (const auto& w : writes) {
      SCOPED_TRACE(c.attribute() + ", " + w.how);
      ASSERT_EQ(VLX_S_OK, instance.ClearValue(c.position));
      VLXBoolean valuated = 9;
      ASSERT_EQ(VLX_S_OK, instance.IsValuated(c.position, valuated));
      ASSERT_EQ(0, valuated);
      ASSERT_EQ(VLX_S_OK, w.write());
      ASSERT_EQ(VLX_S_OK, instance.IsValuated(name, valuated));
      EXPECT_EQ(1, valuated);
      ExpectReadBack(instance, c);
    }
  }
  // The instance given to a typed setter stays attached to its Java object.
  ASSERT_EQ(VLX_S_OK, instance.SetValue(6, target));
  VLXUnicodeString text;
  EXPECT_EQ(VLX_S_OK, target.ToString(text));
}

TEST(Values, EmptyListsAreValues)
{
  SampleReplica s;
  VLXKDMInstance instance = s.Create();
  using V = VLXKDMInstanceValue;
  const std::vector<ValueCase> empty = {
      MakeCase<&V::SetListOfInteger, &V::GetListOfInteger>(7, V::IntegerType, VLXRawCollint()),
      MakeCase<&V::SetListOfDouble, &V::GetListOfDouble>(8, V::DoubleType, VLXRawColldouble()),
      MakeCase<&V::SetListOfString, &V::GetListOfString>(9, V::StringType, VLXListValVLXUnicodeString()),
      MakeCase<&V::SetListOfDate, &V::GetListOfDate>(10, V::DateType, VLXListValVLXTime()),
      MakeCase<&V::SetListOfBoolean, &V::GetListOfBoolean>(11, V::BooleanType, VLXListValVLXBoolean()),
      MakeCase<&V::SetListOfBinary, &V::GetListOfBinary>(12, V::BinaryType, VLXListValVLXBinary()),
      MakeCase<&V::SetListOfInstance, &V::GetListOfInstance>(13, V::InstanceType, VLXListValVLXKDMInstance()),
  };
  for (const ValueCase& c : empty) {
    SCOPED_TRACE(c.attribute());
    ASSERT_EQ(VLX_S_OK, c.typedByName(instance, VLXUnicodeString(c.attribute().c_str())));
    VLXBoolean valuated = 0;
    ASSERT_EQ(VLX_S_OK, instance.IsValuated(c.position, valuated));
    EXPECT_EQ(1, valuated);
    ExpectReadBack(instance, c);
    ASSERT_EQ(VLX_S_OK, instance.ClearValue(c.position));
    VLXKDMInstanceValue holder;
    c.fill(holder);
    ASSERT_EQ(VLX_S_OK, instance.SetValue(c.position, holder));
    ExpectReadBack(instance, c);
  }
}

TEST(Values, ListsOfAHundredThousandElements)
{
  const int n = 100000;
  SampleReplica s;
  VLXKDMInstance instance = s.Create(), a = s.Create(), b = s.Create();
  VLXRawCollint integers(n);
  VLXRawColldouble doubles(n);
  VLXListValVLXUnicodeString strings;
  VLXListValVLXTime dates;
  VLXListValVLXBoolean booleans;
  VLXListValVLXBinary binaries;
  VLXListValVLXKDMInstance instances(n);
  for (int i = 0; i < n; ++i) {
    integers.Append(i * 7 - n);
    doubles.Append(i / 3.0);
    const std::string t = "s" + std::to_string(i);
    strings.Append(VLXUnicodeString(t.c_str()));
    dates.Append(Time(static_cast<time_t>(i) * 86400 + 17));
    booleans.Append(VLXBoolean(i % 3 == 0));
    const unsigned char bytes[] = {static_cast<unsigned char>(i), static_cast<unsigned char>(i >> 8)};
    binaries.Append(VLXBinary(bytes, i % 3));
    instances.Append(i % 2 ? a : b);
  }
  using V = VLXKDMInstanceValue;
  const std::vector<ValueCase> cases = {
      MakeCase<&V::SetListOfInteger, &V::GetListOfInteger>(7, V::IntegerType, integers),
      MakeCase<&V::SetListOfDouble, &V::GetListOfDouble>(8, V::DoubleType, doubles),
      MakeCase<&V::SetListOfString, &V::GetListOfString>(9, V::StringType, strings),
      MakeCase<&V::SetListOfDate, &V::GetListOfDate>(10, V::DateType, dates),
      MakeCase<&V::SetListOfBoolean, &V::GetListOfBoolean>(11, V::BooleanType, booleans),
      MakeCase<&V::SetListOfBinary, &V::GetListOfBinary>(12, V::BinaryType, binaries),
      MakeCase<&V::SetListOfInstance, &V::GetListOfInstance>(13, V::InstanceType, instances),
  };
  for (const ValueCase& c : cases) {
    SCOPED_TRACE(c.attribute());
    ASSERT_EQ(VLX_S_OK, c.typedByPosition(instance, c.position));
    ExpectReadBack(instance, c);
    VLXKDMInstanceValue holder;
    c.fill(holder);
    ASSERT_EQ(VLX_S_OK, instance.SetValue(VLXUnicodeString(c.attribute().c_str()), holder));
    VLXKDMInstanceValue read;
    ASSERT_EQ(VLX_S_OK, instance.GetValue(c.position, read));
    EXPECT_TRUE(c.holds(read));
  }
}

// A variadic setter called with three values and a count, and the list its count should give.
struct VariadicCase {
  const char* operation;
  int position;
  const char* listTextByName;
  const char* listTextByPosition;
  std::function<long(VLXKDMInstance&, const VLXUnicodeString&, int)> byName;
  std::function<long(VLXKDMInstance&, int, int)> byPosition;
  std::function<long(VLXKDMInstance&, const VLXUnicodeString&, int)> listTwin;  // the first count values
};

TEST(VariadicSetters, SendWhatTheListSettersSendAndReportUnderTheirNames)
{
  SampleReplica s;
  VLXKDMInstance instance = s.Create(), t1 = s.Create(), t2 = s.Create();
  const VLXBinary b1("ab", 2), b2, b3("\0c", 2);
  const VLXTime d1 = Time(5), d2 = Time(0), d3 = Time(1700000000);
  auto first = [](auto list, int count) {
    decltype(list) out;
    for (int i = 1; i <= count && i <= list.Size(); ++i) out.Append(list[i]);
    return out;
  };
  const std::vector<VariadicCase> cases = {
      {"SetValueBinaries", 12, "VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfVLXBinary&)",
       "VLXKDMInstance::SetValue(int, const VLXListOfVLXBinary&)",
       [&](VLXKDMInstance& in, const VLXUnicodeString& n, int k) { return in.SetValueBinaries(n, k, &b1, &b2, &b3); },
       [&](VLXKDMInstance& in, int p, int k) { return in.SetValueBinaries(p, k, &b1, &b2, &b3); },
       [&](VLXKDMInstance& in, const VLXUnicodeString& n, int k) {
         return in.SetValue(n, first(ListOf<VLXListValVLXBinary>({b1, b2, b3}), k));
       }},
      {"SetValueBooleans", 11, "VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfVLXBoolean&)",
       "VLXKDMInstance::SetValue(int, const VLXListOfVLXBoolean&)",
       // Any non-zero argument is true.
       [](VLXKDMInstance& in, const VLXUnicodeString& n, int k) { return in.SetValueBooleans(n, k, 1, 256, 1); },
       [](VLXKDMInstance& in, int p, int k) { return in.SetValueBooleans(p, k, 1, 256, 1); },
       [&](VLXKDMInstance& in, const VLXUnicodeString& n, int k) {
         return in.SetValue(n, first(ListOf<VLXListValVLXBoolean>({VLXBoolean(1), VLXBoolean(1), VLXBoolean(1)}), k));
       }},
      {"SetValueDates", 10, "VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfVLXTime&)",
       "VLXKDMInstance::SetValue(int, const VLXListOfVLXTime&)",
       [&](VLXKDMInstance& in, const VLXUnicodeString& n, int k) { return in.SetValueDates(n, k, &d1, &d2, &d3); },
       [&](VLXKDMInstance& in, int p, int k) { return in.SetValueDates(p, k, &d1, &d2, &d3); },
       [&](VLXKDMInstance& in, const VLXUnicodeString& n, int k) {
         return in.SetValue(n, first(ListOf<VLXListValVLXTime>({d1, d2, d3}), k));
       }},
      {"SetValueDoubles", 8, "VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfDouble&)",
       "VLXKDMInstance::SetValue(int, const VLXListOfDouble&)",
       [](VLXKDMInstance& in, const VLXUnicodeString& n, int k) { return in.SetValueDoubles(n, k, 0.5, -2.0, 1e300); },
       [](VLXKDMInstance& in, int p, int k) { return in.SetValueDoubles(p, k, 0.5, -2.0, 1e300); },
       [&](VLXKDMInstance& in, const VLXUnicodeString& n, int k) {
         return in.SetValue(n, first(ListOf<VLXRawColldouble>({0.5, -2.0, 1e300}), k));
       }},
      {"SetValueInstances", 13, "VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfVLXKDMInstance&)",
       "VLXKDMInstance::SetValue(int, const VLXListOfVLXKDMInstance&)",
       [&](VLXKDMInstance& in, const VLXUnicodeString& n, int k) { return in.SetValueInstances(n, k, &t1, &t2, &t1); },
       [&](VLXKDMInstance& in, int p, int k) { return in.SetValueInstances(p, k, &t1, &t2, &t1); },
       [&](VLXKDMInstance& in, const VLXUnicodeString& n, int k) {
         VLXListValVLXKDMInstance list;
         const VLXKDMInstance* all[] = {&t1, &t2, &t1};
         for (int i = 0; i < k; ++i) list.Append(*all[i]);
         return in.SetValue(n, list);
       }},
      {"SetValueIntegers", 7, "VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfInt&)",
       "VLXKDMInstance::SetValue(int, const VLXListOfInt&)",
       [](VLXKDMInstance& in, const VLXUnicodeString& n, int k) { return in.SetValueIntegers(n, k, 1, 2, 3); },
       [](VLXKDMInstance& in, int p, int k) { return in.SetValueIntegers(p, k, 1, 2, 3); },
       [&](VLXKDMInstance& in, const VLXUnicodeString& n, int k) {
         return in.SetValue(n, first(ListOf<VLXRawCollint>({1, 2, 3}), k));
       }},
      {"SetValueStrings", 9, "VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfVLXUnicodeString&)",
       "VLXKDMInstance::SetValue(int, const VLXListOfVLXUnicodeString&)",
       [](VLXKDMInstance& in, const VLXUnicodeString& n, int k) { return in.SetValueStrings(n, k, "a", "\xC3\xA9", ""); },
       [](VLXKDMInstance& in, int p, int k) { return in.SetValueStrings(p, k, "a", "\xC3\xA9", ""); },
       [&](VLXKDMInstance& in, const VLXUnicodeString& n, int k) {
         return in.SetValue(n, first(ListOf<VLXListValVLXUnicodeString>(
                                         {VLXUnicodeString("a"), VLXUnicodeString("\xC3\xA9"), VLXUnicodeString("")}),
                                     k));
       }},
  };
  auto read = [&instance](int position) {
    VLXKDMInstanceValue value;
    EXPECT_EQ(VLX_S_OK, instance.GetValue(position, value));
    return value;
  };
  auto same = [](VLXKDMInstanceValue& a, VLXKDMInstanceValue& b) {
    if (a.GetType() != b.GetType() || !a.IsMultiValuated() || !b.IsMultiValuated()) return false;
    switch (a.GetType()) {
      case VLXKDMInstanceValue::IntegerType: return (a.GetListOfInteger() == b.GetListOfInteger()) != 0;
      case VLXKDMInstanceValue::DoubleType: return (a.GetListOfDouble() == b.GetListOfDouble()) != 0;
      case VLXKDMInstanceValue::StringType: return (a.GetListOfString() == b.GetListOfString()) != 0;
      case VLXKDMInstanceValue::DateType: return (a.GetListOfDate() == b.GetListOfDate()) != 0;
      case VLXKDMInstanceValue::BooleanType: return (a.GetListOfBoolean() == b.GetListOfBoolean()) != 0;
      case VLXKDMInstanceValue::BinaryType: return (a.GetListOfBinary() == b.GetListOfBinary()) != 0;
      case VLXKDMInstanceValue::InstanceType: return (a.GetListOfInstance() == b.GetListOfInstance()) != 0;
    }
    return false;
  };
  auto size = [](VLXKDMInstanceValue& v) {
    switch (v.GetType()) {
      case VLXKDMInstanceValue::IntegerType: return v.GetListOfInteger().Size();
      case VLXKDMInstanceValue::DoubleType: return v.GetListOfDouble().Size();
      case VLXKDMInstanceValue::StringType: return v.GetListOfString().Size();
      case VLXKDMInstanceValue::DateType: return v.GetListOfDate().Size();
      case VLXKDMInstanceValue::BooleanType: return v.GetListOfBoolean().Size();
      case VLXKDMInstanceValue::BinaryType: return v.GetListOfBinary().Size();
      case VLXKDMInstanceValue::InstanceType: return v.GetListOfInstance().Size();
    }
    return -1;
  };

  for (const VariadicCase& c : cases) {
    const VLXUnicodeString name(SampleAttributes()[c.position].name);
    for (int count : {3, 0}) {
      SCOPED_TRACE(std::string(c.operation) + " with count " + std::to_string(count));
      ASSERT_EQ(VLX_S_OK, c.listTwin(instance, name, count));
      VLXKDMInstanceValue fromList = read(c.position);
      ASSERT_EQ(VLX_S_OK, instance.ClearValue(c.position));
      ASSERT_EQ(VLX_S_OK, c.byName(instance, name, count));
      VLXKDMInstanceValue variadicByName = read(c.position);
      ASSERT_EQ(VLX_S_OK, instance.ClearValue(c.position));
      ASSERT_EQ(VLX_S_OK, c.byPosition(instance, c.position, count));
      VLXKDMInstanceValue variadicByPosition = read(c.position);
      EXPECT_EQ(count, size(fromList));
      EXPECT_TRUE(same(fromList, variadicByName));
      EXPECT_TRUE(same(fromList, variadicByPosition));
      // A negative count is refused and leaves the value as it was.
      EXPECT_EQ(VLX_E_INVALIDARG, c.byName(instance, name, -1));
      EXPECT_EQ(VLX_E_INVALIDARG, c.byPosition(instance, c.position, -1));
      VLXKDMInstanceValue after = read(c.position);
      EXPECT_TRUE(same(fromList, after));
    }
    // Failures carry the list setter's name, by name and by position.
    VLXKDMInstance unbuilt;
    ClearLastError();
    EXPECT_EQ(VLX_E_FAIL, c.byName(unbuilt, name, 3));
    EXPECT_EQ(c.listTextByName, LastErrorOperation());
    ClearLastError();
    EXPECT_EQ(VLX_E_FAIL, c.byPosition(unbuilt, c.position, 3));
    EXPECT_EQ(c.listTextByPosition, LastErrorOperation());
  }
}

TEST(ValueFailures, AClassOutsideTheTableIsReportedAndFails)
{
  VLXKDMInstance instance;
  AttachNew(instance, "com/velmora/tessara/testdoubles/LongInstance");
  for (int byPosition : {0, 1}) {
    FatalRecorder fatal;
    VLXKDMInstanceValue value;
    const long rc = byPosition ? instance.GetValue(0, value) : instance.GetValue(VLXUnicodeString("n"), value);
    EXPECT_LT(rc, 0);
    ASSERT_FALSE(FatalRecorder::Reports().empty());
    EXPECT_EQ("AssertionFailed:_type != (Type) -1", FatalRecorder::Reports()[0].message);
    EXPECT_EQ(99, FatalRecorder::Reports()[0].line);
    EXPECT_EQ(static_cast<Type>(-1), value.GetType());
  }
}

TEST(ValueFailures, AValueWithoutTypeMakesNoJavaCall)
{
  SampleReplica s;
  VLXKDMInstance instance = s.Create();
  ASSERT_EQ(VLX_S_OK, instance.SetValue(VLXUnicodeString("integer"), 41));
  for (int byPosition : {0, 1}) {
    FatalRecorder fatal;
    VLXKDMInstanceValue none;
    const long rc = byPosition ? instance.SetValue(0, none) : instance.SetValue(VLXUnicodeString("integer"), none);
    EXPECT_LT(rc, 0);
    ASSERT_FALSE(FatalRecorder::Reports().empty());
    EXPECT_EQ(380, FatalRecorder::Reports()[0].line);
    EXPECT_EQ(nullptr, none.GetHandle());
  }
  // Had Java been called with null, the attribute would have been cleared.
  VLXKDMInstanceValue kept;
  ASSERT_EQ(VLX_S_OK, instance.GetValue(0, kept));
  EXPECT_EQ(41, kept.GetInteger());
}

TEST(ValueFailures, AHolderThatCannotBeBuiltReachesNoJavaMethod)
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
    EXPECT_LT(counting.SetValue(VLXUnicodeString("any"), *value), 0);
    EXPECT_LT(counting.SetValue(3, *value), 0);
    EXPECT_EQ(nullptr, value->GetHandle());
  }
  EXPECT_EQ(6u, FatalRecorder::Reports().size());
  EXPECT_EQ(0, IntField(counting.GetHandle(), "setValueCalls"));
  // The same double counts a holder that can be built, and a typed setter.
  VLXKDMInstanceValue typed;
  typed.SetInteger(1);
  EXPECT_EQ(VLX_S_OK, counting.SetValue(3, typed));
  EXPECT_EQ(VLX_S_OK, counting.SetValue(VLXUnicodeString("any"), 2));
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
    dates.Append(Time(t));
    VLXKDMInstanceValue value;
    ASSERT_EQ(VLX_S_OK, instance.SetValue(VLXUnicodeString("date"), Time(t)));
    ASSERT_EQ(VLX_S_OK, instance.GetValue(VLXUnicodeString("date"), value));
    ASSERT_EQ(VLX_S_OK, instance.SetValue(VLXUnicodeString("date"), value));  // read-modify-write
    ASSERT_EQ(VLX_S_OK, instance.GetValue(VLXUnicodeString("date"), value));
    EXPECT_EQ(t, value.GetDate().Gettime_t());
  }
  VLXKDMInstanceValue value;
  ASSERT_EQ(VLX_S_OK, instance.SetValue(VLXUnicodeString("dates"), dates));
  ASSERT_EQ(VLX_S_OK, instance.GetValue(VLXUnicodeString("dates"), value));
  EXPECT_TRUE(value.GetListOfDate() == dates);

  ASSERT_EQ(VLX_S_OK, instance.SetValueBooleans(VLXUnicodeString("booleans"), 4, 1, 0, 256, 2));
  ASSERT_EQ(VLX_S_OK, instance.GetValue(VLXUnicodeString("booleans"), value));
  EXPECT_TRUE(value.GetListOfBoolean() == (ListOf<VLXListValVLXBoolean, VLXBoolean>({1, 0, 1, 1})));
  ASSERT_EQ(VLX_S_OK, instance.SetValue(VLXUnicodeString("booleans"), ListOf<VLXListValVLXBoolean, VLXBoolean>({7})));
  ASSERT_EQ(VLX_S_OK, instance.GetValue(VLXUnicodeString("booleans"), value));
  EXPECT_EQ(1, value.GetListOfBoolean()[1]);
  ASSERT_EQ(VLX_S_OK, instance.SetValue(VLXUnicodeString("boolean"), static_cast<VLXBoolean>(2)));
  ASSERT_EQ(VLX_S_OK, instance.GetValue(VLXUnicodeString("boolean"), value));
  EXPECT_EQ(1, value.GetBoolean());
}

// Reading an attribute that has no value fails naming the attribute and the instance (never an
// earlier error), and leaves a reused holder exactly as it was: sent elsewhere, it still carries
// its value, never a null that would clear the attribute.
TEST(ValueFailures, AnAttributeWithoutValueLeavesTheHolderAsItWas)
{
  SampleReplica s;
  VLXKDMInstance read = s.Create(), written = s.Create();
  ASSERT_EQ(VLX_S_OK, read.SetValue(VLXUnicodeString("integer"), 42));
  ASSERT_EQ(VLX_S_OK, written.SetValue(VLXUnicodeString("integer"), 7));
  VLXKDMInstanceValue value;
  ASSERT_EQ(VLX_S_OK, read.GetValue(VLXUnicodeString("integer"), value));
  for (const bool byName : {true, false}) {
    SCOPED_TRACE(byName);
    VLXError* earlier = new VLXError("TESTERR_0002", "CorvexaTestMessages");
    VLXError::GetReturn(2, earlier, nullptr, __FILE__, __LINE__);
    EXPECT_EQ(VLX_E_FAIL, byName ? read.GetValue(VLXUnicodeString("double"), value) : read.GetValue(1, value));
    const std::string text = PeekLastError().text;
    EXPECT_NE(std::string::npos, text.find(byName ? "the attribute 'double' of Instance Sample" : "the attribute at position 1 of Instance Sample")) << text;
    EXPECT_NE(std::string::npos, text.find("has no value")) << text;
    EXPECT_EQ(42, value.GetInteger());
    EXPECT_NE(nullptr, value.GetHandle());
  }
  ASSERT_EQ(VLX_S_OK, written.SetValue(VLXUnicodeString("integer"), value));
  VLXKDMInstanceValue back;
  ASSERT_EQ(VLX_S_OK, written.GetValue(VLXUnicodeString("integer"), back));
  EXPECT_EQ(42, back.GetInteger());
}

TEST(ValueFailures, UnattachedInstancesFailWithoutClearingTheAttribute)
{
  SampleReplica s;
  VLXKDMInstance instance = s.Create(), target = s.Create();
  ASSERT_EQ(VLX_S_OK, instance.SetValue(6, target));
  ASSERT_EQ(VLX_S_OK, instance.SetValueInstances(13, 1, &target));
  FatalRecorder fatal;
  const VLXKDMInstance unattached;
  EXPECT_LT(instance.SetValue(VLXUnicodeString("instance"), unattached), 0);
  EXPECT_LT(instance.SetValueInstances(VLXUnicodeString("instances"), 2, &target, &unattached), 0);
  // A null pointer is refused before any conversion, as a null time is.
  EXPECT_EQ(VLX_E_INVALIDARG, instance.SetValueInstances(13, 1, static_cast<const VLXKDMInstance*>(nullptr)));
  VLXTime second;
  second.Settime_t(1);
  EXPECT_EQ(VLX_E_INVALIDARG, instance.SetValueDates(10, 2, &second, static_cast<const VLXTime*>(nullptr)));
  EXPECT_EQ("invalid argument to VLXKDMInstance::SetValueDates(int, int, ...): value 2 of 2 is a null pointer",
            PeekLastError().text);
  EXPECT_EQ(2u, FatalRecorder::Reports().size());
  VLXKDMInstanceValue single, list;
  ASSERT_EQ(VLX_S_OK, instance.GetValue(6, single));
  EXPECT_TRUE(single.GetInstance() == target);
  ASSERT_EQ(VLX_S_OK, instance.GetValue(13, list));
  ASSERT_EQ(1, list.GetListOfInstance().Size());
}

TEST(ValueFailures, WrongTypesNamesAndUnbuiltInstances)
{
  SampleReplica s;
  VLXKDMInstance instance = s.Create();
  const VLXUnicodeString bad("bad \xC3\x28 name");

  // The Java side checks the value against the attribute.
  ClearLastError();
  EXPECT_EQ(VLX_E_FAIL, instance.SetValue(VLXUnicodeString("string"), 5));
  EXPECT_NE(std::string::npos, PeekLastError().text.find("string")) << PeekLastError().text;
  EXPECT_EQ(VLX_E_FAIL, instance.SetValue(0, VLXRawCollint()));  // a list for a single value
  EXPECT_EQ(VLX_E_FAIL, instance.SetValue(VLXUnicodeString("wieght"), 1.5));
  EXPECT_EQ(VLX_E_FAIL, instance.SetValue(99, 1.5));
  // A text that is not UTF-8, as the value or as the name.
  EXPECT_EQ(VLX_E_FAIL, instance.SetValue(VLXUnicodeString("string"), bad));
  EXPECT_EQ(VLX_E_FAIL, instance.SetValue(bad, 5));
  VLXBoolean valuated = 9;
  ASSERT_EQ(VLX_S_OK, instance.IsValuated(2, valuated));
  EXPECT_EQ(0, valuated);

  // An attribute without value: no Java object to read.
  VLXKDMInstanceValue value;
  value.SetInteger(3);
  EXPECT_LT(instance.GetValue(0, value), 0);
  // GetValue returns the name converter's code as it is and leaves the value alone.
  VLXKDMInstanceValue untouched;
  untouched.SetInteger(8);
  EXPECT_EQ(VLX_E_INVALIDARG, instance.GetValue(bad, untouched));
  EXPECT_EQ(8, untouched.GetInteger());
  // SetValue with a holder gives the holder its Java form before the name fails to convert.
  VLXKDMInstanceValue holder;
  holder.SetInteger(4);
  EXPECT_EQ(VLX_E_FAIL, instance.SetValue(bad, holder));
  EXPECT_NE(nullptr, holder.GetHandle());
  ASSERT_EQ(VLX_S_OK, instance.IsValuated(0, valuated));
  EXPECT_EQ(0, valuated);

  // An instance that is not built: every value operation fails under its own name.
  VLXKDMInstance unbuilt;
  const struct {
    const char* name;
    std::function<long()> run;
  } cases[] = {
      {"VLXKDMInstance::GetValue(const VLXUnicodeString&, VLXKDMInstanceValue&)",
       [&] { return unbuilt.GetValue(VLXUnicodeString("integer"), untouched); }},
      {"VLXKDMInstance::GetValue(int, VLXKDMInstanceValue&)", [&] { return unbuilt.GetValue(0, untouched); }},
      {"VLXKDMInstance::SetValue(const VLXUnicodeString&, VLXKDMInstanceValue&)",
       [&] { return unbuilt.SetValue(VLXUnicodeString("integer"), untouched); }},
      {"VLXKDMInstance::SetValue(int, VLXKDMInstanceValue&)", [&] { return unbuilt.SetValue(0, untouched); }},
      {"VLXKDMInstance::SetValue(const VLXUnicodeString&, int)",
       [&] { return unbuilt.SetValue(VLXUnicodeString("integer"), 1); }},
      {"VLXKDMInstance::SetValue(int, double)", [&] { return unbuilt.SetValue(1, 1.0); }},
      {"VLXKDMInstance::SetValue(int, VLXBoolean)", [&] { return unbuilt.SetValue(4, VLXBoolean(1)); }},
      {"VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXTime&)",
       [&] { return unbuilt.SetValue(VLXUnicodeString("date"), Time(1)); }},
      {"VLXKDMInstance::SetValue(int, const VLXKDMInstance&)", [&] { return unbuilt.SetValue(6, instance); }},
      {"VLXKDMInstance::SetValue(const VLXUnicodeString&, const VLXListOfVLXBinary&)",
       [&] { return unbuilt.SetValue(VLXUnicodeString("binaries"), VLXListValVLXBinary()); }},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    ClearLastError();
    EXPECT_EQ(VLX_E_FAIL, c.run());
    EXPECT_EQ("VLXJBXInfraERR_1003", PeekLastError().id);
    EXPECT_EQ(c.name, LastErrorOperation());
  }
  EXPECT_EQ(8, untouched.GetInteger());  // SetValue on an unbuilt instance does not build the value
  EXPECT_EQ(nullptr, untouched.GetHandle());
}

}  // namespace
