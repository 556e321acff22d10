// The value holder: every type single and list through its Java form and back, its states
// (Empty, Attached, Local, Synchronized), and the broken preconditions reported through the
// fatal-error hook.
#include <functional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "TestSupport.h"

using namespace corvexa_test;
using Type = VLXKDMInstanceValue::Type;

namespace {

const Type kNoType = static_cast<Type>(-1);

// A second value attached to the first one's Java object, its local form read from it.
VLXKDMInstanceValue ReadBack(const VLXKDMInstanceValue& written)
{
  VLXKDMInstanceValue read;
  EXPECT_EQ(VLX_S_OK, read.SetHandle(Env(), written.GetHandle()));
  EXPECT_EQ(VLX_S_OK, read.BuildLocal());
  return read;
}

struct Case {
  const char* name;
  Type type;
  bool list;
  const char* javaClass;
  std::function<void(VLXKDMInstanceValue&)> set;
  std::function<void(const VLXKDMInstanceValue&)> check;  // the value read back holds what set stored
};

// Each type, single and list, with n elements for the lists.
std::vector<Case> Cases(int n, const std::vector<VLXKDMInstance>& instances)
{
  auto ints = [n] {
    VLXRawCollint l;
    for (int i = 0; i < n; ++i) l.Append(i * 7 - 3);
    return l;
  };
  auto doubles = [n] {
    VLXRawColldouble l;
    for (int i = 0; i < n; ++i) l.Append(i / 4.0 - 1);
    return l;
  };
  auto booleans = [n] {
    VLXListValVLXBoolean l;
    for (int i = 0; i < n; ++i) l.Append(static_cast<VLXBoolean>(i % 3 == 0));
    return l;
  };
  auto strings = [n] {
    VLXListValVLXUnicodeString l;
    for (int i = 0; i < n; ++i) l.Append(VLXUnicodeString(("s\xC3\xA9-" + std::to_string(i)).c_str()));
    return l;
  };
  auto dates = [n] {
    VLXListValVLXTime l;
    for (int i = 0; i < n; ++i) l.Append(Seconds(1700000000 - i * 3600));
    return l;
  };
  auto binaries = [n] {
    VLXListValVLXBinary l;
    for (int i = 0; i < n; ++i) {
      const unsigned char bytes[] = {static_cast<unsigned char>(i), 0, 0xFF};
      l.Append(VLXBinary(bytes, i % 4));
    }
    return l;
  };
  auto objects = [n, instances] {
    VLXListValVLXKDMInstance l;
    for (int i = 0; i < n; ++i) l.Append(instances[static_cast<size_t>(i) % instances.size()]);
    return l;
  };
  const unsigned char raw[] = {0, 1, 0x80, 0xFF};
  const VLXKDMInstance one = instances.at(0);
  return {
      {"integer", VLXKDMInstanceValue::IntegerType, false, "java/lang/Integer",
       [](VLXKDMInstanceValue& v) { v.SetInteger(-42); },
       [](const VLXKDMInstanceValue& v) { EXPECT_EQ(-42, v.GetInteger()); }},
      {"double", VLXKDMInstanceValue::DoubleType, false, "java/lang/Double",
       [](VLXKDMInstanceValue& v) { v.SetDouble(2.5e-300); },
       [](const VLXKDMInstanceValue& v) { EXPECT_EQ(2.5e-300, v.GetDouble()); }},
      {"boolean", VLXKDMInstanceValue::BooleanType, false, "java/lang/Boolean",
       [](VLXKDMInstanceValue& v) { v.SetBoolean(1); },
       [](const VLXKDMInstanceValue& v) { EXPECT_EQ(1, v.GetBoolean()); }},
      {"string", VLXKDMInstanceValue::StringType, false, "java/lang/String",
       [](VLXKDMInstanceValue& v) { v.SetString(VLXUnicodeString("caf\xC3\xA9 \xF0\x9F\x98\x80")); },
       [](const VLXKDMInstanceValue& v) { EXPECT_EQ("caf\xC3\xA9 \xF0\x9F\x98\x80", Text(v.GetString())); }},
      {"date", VLXKDMInstanceValue::DateType, false, "java/util/Date",
       [](VLXKDMInstanceValue& v) { v.SetDate(Seconds(86401)); },
       [](const VLXKDMInstanceValue& v) { EXPECT_EQ(86401, v.GetDate().Gettime_t()); }},
      {"binary", VLXKDMInstanceValue::BinaryType, false, "[B",
       [raw](VLXKDMInstanceValue& v) { v.SetBinary(VLXBinary(raw, 4)); },
       [raw](const VLXKDMInstanceValue& v) { EXPECT_TRUE(v.GetBinary() == VLXBinary(raw, 4)); }},
      {"instance", VLXKDMInstanceValue::InstanceType, false, kInstanceClass,
       [one](VLXKDMInstanceValue& v) { v.SetInstance(one); },
       [one](const VLXKDMInstanceValue& v) { EXPECT_TRUE(v.GetInstance() == one); }},
      {"integers", VLXKDMInstanceValue::IntegerType, true, "[I",
       [ints](VLXKDMInstanceValue& v) { v.SetListOfInteger(ints()); },
       [ints](const VLXKDMInstanceValue& v) { EXPECT_TRUE(v.GetListOfInteger() == ints()); }},
      {"doubles", VLXKDMInstanceValue::DoubleType, true, "[D",
       [doubles](VLXKDMInstanceValue& v) { v.SetListOfDouble(doubles()); },
       [doubles](const VLXKDMInstanceValue& v) { EXPECT_TRUE(v.GetListOfDouble() == doubles()); }},
      {"booleans", VLXKDMInstanceValue::BooleanType, true, "[Z",
       [booleans](VLXKDMInstanceValue& v) { v.SetListOfBoolean(booleans()); },
       [booleans](const VLXKDMInstanceValue& v) { EXPECT_TRUE(v.GetListOfBoolean() == booleans()); }},
      {"strings", VLXKDMInstanceValue::StringType, true, "[Ljava/lang/String;",
       [strings](VLXKDMInstanceValue& v) { v.SetListOfString(strings()); },
       [strings](const VLXKDMInstanceValue& v) { EXPECT_TRUE(v.GetListOfString() == strings()); }},
      {"dates", VLXKDMInstanceValue::DateType, true, "[Ljava/util/Date;",
       [dates](VLXKDMInstanceValue& v) { v.SetListOfDate(dates()); },
       [dates](const VLXKDMInstanceValue& v) { EXPECT_TRUE(v.GetListOfDate() == dates()); }},
      {"binaries", VLXKDMInstanceValue::BinaryType, true, "[[B",
       [binaries](VLXKDMInstanceValue& v) { v.SetListOfBinary(binaries()); },
       [binaries](const VLXKDMInstanceValue& v) { EXPECT_TRUE(v.GetListOfBinary() == binaries()); }},
      {"instances", VLXKDMInstanceValue::InstanceType, true, "[Lcom/velmora/tessara/kdmreplica/Instance;",
       [objects](VLXKDMInstanceValue& v) { v.SetListOfInstance(objects()); },
       [objects](const VLXKDMInstanceValue& v) { EXPECT_TRUE(v.GetListOfInstance() == objects()); }},
  };
}

void RoundTrip(int n)
{
  const std::vector<VLXKDMInstance> instances = NewInstances(3);
  FatalRecorder recorder;  // a getter of the wrong type would be recorded, not abort
  const long globals = GlobalRefCount(), locals = LocalRefCount();
  for (const Case& c : Cases(n, instances)) {
    SCOPED_TRACE(c.name);
    VLXKDMInstanceValue written;
    c.set(written);
    EXPECT_EQ(c.type, written.GetType());
    EXPECT_EQ(c.list, written.IsMultiValuated() != 0);
    EXPECT_EQ(nullptr, written.GetHandle());
    ASSERT_EQ(VLX_S_OK, written.BuildRemote());
    EXPECT_TRUE(IsExactly(written.GetHandle(), c.javaClass));
    c.check(written);

    VLXKDMInstanceValue read = ReadBack(written);
    EXPECT_EQ(c.type, read.GetType());
    EXPECT_EQ(c.list, read.IsMultiValuated() != 0);
    c.check(read);
    if (c.list) {
      Local array(Env()->NewLocalRef(read.GetHandle()));
      EXPECT_EQ(n, Length(array.get()));
    }
  }
  EXPECT_TRUE(Reports().empty()) << Reports().front();
  EXPECT_EQ(globals, GlobalRefCount());  // the values and their Java objects are gone
  EXPECT_EQ(locals, LocalRefCount());
}

TEST(ValueTypes, EverySingleAndListTypeCrossesToJavaAndBack) { RoundTrip(5); }
TEST(ValueTypes, EmptyListsCrossToJavaAndBack) { RoundTrip(0); }
TEST(ValueTypes, ListsOfAHundredThousandElementsCrossToJavaAndBack) { RoundTrip(100000); }

// ---- States ----------------------------------------------------------------------------------

// Empty -> Local -> Synchronized -> Attached -> Synchronized -> Local, as seen from outside.
TEST(ValueStates, EmptyAttachedLocalAndSynchronized)
{
  JNIEnv* env = Env();
  VLXKDMInstanceValue value;  // Empty
  EXPECT_EQ(kNoType, value.GetType());
  EXPECT_EQ(nullptr, value.GetHandle());
  EXPECT_LT(value.BuildLocal(), 0);

  value.SetInteger(5);  // Local
  EXPECT_EQ(VLXKDMInstanceValue::IntegerType, value.GetType());
  EXPECT_EQ(nullptr, value.GetHandle());

  ASSERT_EQ(VLX_S_OK, value.BuildRemote());  // Synchronized
  const jobject integer = value.GetHandle();
  EXPECT_TRUE(IsExactly(integer, "java/lang/Integer"));

  Local text(env->NewStringUTF("attached"));
  ASSERT_EQ(VLX_S_OK, value.SetHandle(env, text.get()));  // Attached: the local form is not read yet
  EXPECT_TRUE(Same(text.get(), value.GetHandle()));
  EXPECT_EQ(VLXKDMInstanceValue::IntegerType, value.GetType());
  EXPECT_EQ(5, value.GetInteger());

  ASSERT_EQ(VLX_S_OK, value.BuildLocal());  // Synchronized with what Java holds
  EXPECT_EQ(VLXKDMInstanceValue::StringType, value.GetType());
  EXPECT_EQ("attached", Text(value.GetString()));
  const jobject attached = value.GetHandle();
  ASSERT_EQ(VLX_S_OK, value.BuildRemote());
  EXPECT_EQ(attached, value.GetHandle());

  value.SetListOfDouble(VLXRawColldouble());  // Local again
  EXPECT_EQ(nullptr, value.GetHandle());
  EXPECT_EQ(VLXKDMInstanceValue::DoubleType, value.GetType());
  EXPECT_EQ(1, value.IsMultiValuated());
}

TEST(ValueStates, SettersDropTheJavaObjectAndBuildRemoteConvertsOnce)
{
  VLXKDMInstanceValue value;
  value.SetInteger(5);
  ASSERT_EQ(VLX_S_OK, value.BuildRemote());
  const jobject first = value.GetHandle();
  ASSERT_NE(nullptr, first);
  ASSERT_EQ(VLX_S_OK, value.BuildRemote());  // Synchronized: nothing is made
  EXPECT_EQ(first, value.GetHandle());

  const long baseline = VLXJBXJNIUtilities::GetGlobalRefCount();
  value.SetDouble(1.5);
  EXPECT_EQ(nullptr, value.GetHandle());
  EXPECT_EQ(baseline - 1, VLXJBXJNIUtilities::GetGlobalRefCount());
  ASSERT_EQ(VLX_S_OK, value.BuildRemote());
  EXPECT_TRUE(IsExactly(value.GetHandle(), "java/lang/Double"));

  // A value read from Java is Synchronized too: BuildRemote keeps the very object it was read from.
  VLXKDMInstanceValue read = ReadBack(value);
  const jobject attached = read.GetHandle();
  ASSERT_EQ(VLX_S_OK, read.BuildRemote());
  EXPECT_EQ(attached, read.GetHandle());
}

TEST(ValueStates, CopiesKeepTheStateAndAReferenceOfTheirOwn)
{
  VLXKDMInstanceValue value;
  value.SetString(VLXUnicodeString("shared"));
  ASSERT_EQ(VLX_S_OK, value.BuildRemote());

  VLXKDMInstanceValue copy(value);
  EXPECT_NE(value.GetHandle(), copy.GetHandle());
  EXPECT_TRUE(Same(value.GetHandle(), copy.GetHandle()));
  const jobject copied = copy.GetHandle();
  ASSERT_EQ(VLX_S_OK, copy.BuildRemote());  // Synchronized as well: nothing is made
  EXPECT_EQ(copied, copy.GetHandle());

  VLXKDMInstanceValue assigned;
  assigned.SetListOfInteger(VLXRawCollint());
  assigned = value;
  EXPECT_EQ(VLXKDMInstanceValue::StringType, assigned.GetType());
  EXPECT_EQ(0, assigned.IsMultiValuated());
  EXPECT_TRUE(Same(value.GetHandle(), assigned.GetHandle()));

  // Independent afterwards: the source may change or go away.
  {
    VLXKDMInstanceValue source(value);
    source.SetInteger(1);
  }
  value.SetInteger(2);
  EXPECT_EQ("shared", Text(copy.GetString()));
  EXPECT_EQ(VLXKDMInstanceValue::StringType, ReadBack(copy).GetType());
  EXPECT_EQ("shared", Text(ReadBack(assigned).GetString()));
}

TEST(ValueStates, ANewTypeEmptiesTheListOfTheFormerOne)
{
  FatalRecorder recorder;
  VLXListValVLXTime dates;
  dates.Append(Seconds(1));
  dates.Append(Seconds(2));
  VLXListValVLXUnicodeString strings;
  strings.Append(VLXUnicodeString("a"));

  VLXKDMInstanceValue value;
  value.SetListOfDate(dates);
  ASSERT_EQ(VLX_S_OK, value.BuildRemote());
  value.SetListOfString(strings);
  EXPECT_EQ(VLXKDMInstanceValue::StringType, value.GetType());
  EXPECT_EQ(1, value.GetListOfString().Size());
  EXPECT_TRUE(Reports().empty());
  EXPECT_EQ(0, value.GetListOfDate().Size());  // reported, then answered: emptied
  EXPECT_EQ(std::vector<std::string>{"AssertionFailed:_type == DateType && _isArray@302"}, Reports());

  // A former single instance drops its Java object; other single values are left as they were.
  const VLXKDMInstance instance = NewInstance();
  value.SetInstance(instance);
  value.SetInteger(3);
  EXPECT_EQ(nullptr, value.GetInstance().GetHandle());
  value.SetDouble(4);
  EXPECT_EQ(3, value.GetInteger());
}

TEST(ValueStates, AnInstanceValueSharesTheInstancesObjectWithoutTakingItsReference)
{
  VLXKDMInstance instance = NewInstance();
  const jobject own = instance.GetHandle();
  {
    VLXKDMInstanceValue value;
    value.SetInstance(instance);
    ASSERT_EQ(VLX_S_OK, value.BuildRemote());
    EXPECT_TRUE(Same(own, value.GetHandle()));
    EXPECT_NE(own, value.GetHandle());
  }
  EXPECT_EQ(own, instance.GetHandle());
  Local cls(Env()->GetObjectClass(own));  // still a valid reference
  EXPECT_NE(nullptr, cls.get());
}

// ---- Broken preconditions --------------------------------------------------------------------

// A Java object of a class that is no attribute value never enters a holder: it is refused where
// it is attached, naming its class, and the value stays as it was.
TEST(ValuePreconditions, AJavaObjectOfAnotherClassIsRefused)
{
  Local boxedLong(New("java/lang/Long", "(J)V", jlong(7)));
  Local subclass(New("com/velmora/tessara/testdoubles/InstanceSubclass"));
  Local objects(NewArray("java/lang/Object", {}));
  for (jobject object : {boxedLong.get(), subclass.get(), objects.get()}) {
    VLXKDMInstanceValue value;
    value.SetInteger(1);
    ClearLastError();
    EXPECT_EQ(VLX_E_INVALIDARG, value.SetHandle(Env(), object));
    EXPECT_NE(std::string::npos, PeekLastError().text.find("none of the classes of an attribute value"));
    EXPECT_EQ(nullptr, value.GetHandle());
    ASSERT_EQ(VLX_S_OK, value.BuildRemote());
    EXPECT_TRUE(IsExactly(value.GetHandle(), "java/lang/Integer"));
  }
}

TEST(ValuePreconditions, AValueWithoutTypeMakesNoJavaObject)
{
  FatalRecorder recorder;
  VLXKDMInstanceValue value;
  ClearLastError();
  EXPECT_LT(value.BuildRemote(), 0);
  EXPECT_EQ(nullptr, value.GetHandle());
  EXPECT_EQ("VLXKDMInstanceValue::InternalBuild(jobject&)", PeekLastError().parameters.at(0));
  EXPECT_LT(value.BuildRemote(), 0);  // tried again: a failure leaves the value unsynchronized
  EXPECT_EQ(
      (std::vector<std::string>{"AssertionFailed:_type != (Type) -1@380", "AssertionFailed:_type != (Type) -1@380"}),
      Reports());
}

TEST(ValuePreconditions, AFailedBuildRemoteIsTriedAgain)
{
  FatalRecorder recorder;
  VLXKDMInstanceValue value;
  value.SetInstance(VLXKDMInstance());
  EXPECT_LT(value.BuildRemote(), 0);
  EXPECT_LT(value.BuildRemote(), 0);
  EXPECT_EQ(2u, FatalRecorder::Reports().size());

  VLXListValVLXKDMInstance list;
  list.Append(NewInstance());
  list.Append(VLXKDMInstance());
  value.SetListOfInstance(list);
  EXPECT_LT(value.BuildRemote(), 0);
  EXPECT_EQ(nullptr, value.GetHandle());

  // Once the value can be converted, the next BuildRemote converts it.
  list.RemovePosition(2);
  value.SetListOfInstance(list);
  ASSERT_EQ(VLX_S_OK, value.BuildRemote());
  EXPECT_EQ(1, Length(value.GetHandle()));
}

TEST(ValuePreconditions, EachGetterReportsAValueOfAnotherTypeOrKind)
{
  const std::vector<VLXKDMInstance> instances = NewInstances(1);
  const std::vector<Case> cases = Cases(1, instances);
  const std::function<void(const VLXKDMInstanceValue&)> getters[] = {
      [](const VLXKDMInstanceValue& v) { v.GetInteger(); },
      [](const VLXKDMInstanceValue& v) { v.GetDouble(); },
      [](const VLXKDMInstanceValue& v) { v.GetBoolean(); },
      [](const VLXKDMInstanceValue& v) { v.GetString(); },
      [](const VLXKDMInstanceValue& v) { v.GetDate(); },
      [](const VLXKDMInstanceValue& v) { v.GetBinary(); },
      [](const VLXKDMInstanceValue& v) { v.GetInstance(); },
      [](const VLXKDMInstanceValue& v) { v.GetListOfInteger(); },
      [](const VLXKDMInstanceValue& v) { v.GetListOfDouble(); },
      [](const VLXKDMInstanceValue& v) { v.GetListOfBoolean(); },
      [](const VLXKDMInstanceValue& v) { v.GetListOfString(); },
      [](const VLXKDMInstanceValue& v) { v.GetListOfDate(); },
      [](const VLXKDMInstanceValue& v) { v.GetListOfBinary(); },
      [](const VLXKDMInstanceValue& v) { v.GetListOfInstance(); },
  };
  const char* types[] = {"IntegerType", "DoubleType", "BooleanType", "StringType",
                         "DateType",    "BinaryType", "InstanceType"};
  // The getters are declared single first, then lists, each in the order of the texts above.
  for (size_t g = 0; g < std::size(getters); ++g) {
    const bool list = g >= 7;
    const std::string expected = std::string("AssertionFailed:_type == ") + types[g % 7] +
                                 (list ? " && _isArray@" : " && !_isArray@") + std::to_string(247 + 5 * g);
    for (const Case& c : cases) {
      FatalRecorder recorder;
      VLXKDMInstanceValue value;
      c.set(value);
      getters[g](value);
      const bool matches = std::string(c.name) == std::string(cases[g].name);
      SCOPED_TRACE(std::string(c.name) + " read with getter " + std::to_string(g));
      if (matches)
        EXPECT_TRUE(Reports().empty());
      else
        EXPECT_EQ(std::vector<std::string>{expected}, Reports());
    }
  }
  // A new value: every getter reports.
  FatalRecorder recorder;
  VLXKDMInstanceValue empty;
  for (const auto& get : getters) get(empty);
  EXPECT_EQ(14u, FatalRecorder::Reports().size());
}

}  // namespace
