// The value holder: every type single and list through its Java form and back, its states
// (Empty, Attached, Local, Synchronized), and the broken preconditions reported through the
// fatal-error hook.
#include <functional>
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

using V = VLXKDMInstanceValue;

struct Case {
  const char* name;
  Type type;
  bool list;
  const char* javaClass;
  std::function<void(V&)> set;
  std::function<bool(const V&)> holds;  // whether a value holds what set stored
};

// Each type, single and list, with n elements for the lists.
std::vector<Case> Cases(int n, const std::vector<VLXKDMInstance>& instances)
{
  auto list = [n](auto list, auto element) {
    for (int i = 0; i < n; ++i) list.Append(element(i));
    return list;
  };
  const unsigned char raw[] = {0, 1, 0x80, 0xFF};
  const VLXBinary binary(raw, 4);
  const VLXUnicodeString text("caf\xC3\xA9 \xF0\x9F\x98\x80");
  const VLXKDMInstance one = instances.at(0);
  const auto ints = list(VLXRawCollint(), [](int i) { return i * 7 - 3; });
  const auto doubles = list(VLXRawColldouble(), [](int i) { return i / 4.0 - 1; });
  const auto booleans = list(VLXListValVLXBoolean(), [](int i) { return static_cast<VLXBoolean>(i % 3 == 0); });
  const auto strings = list(VLXListValVLXUnicodeString(), [](int i) { return U("s\xC3\xA9-" + std::to_string(i)); });
  const auto dates = list(VLXListValVLXTime(), [](int i) { return Seconds(1700000000 - i * 3600); });
  const auto binaries = list(VLXListValVLXBinary(), [&raw](int i) { return VLXBinary(raw + 1, i % 4); });
  const auto objects = list(VLXListValVLXKDMInstance(), [&](int i) { return instances[i % instances.size()]; });
#define CASE(name, type, isList, cls, set, get, value)                                                      \
  {                                                                                                         \
    name, V::type, isList, cls, [=](V& v) { v.set(value); }, [=](const V& v) { return v.get() == (value); } \
  }
  return {
      CASE("integer", IntegerType, false, "java/lang/Integer", SetInteger, GetInteger, -42),
      CASE("double", DoubleType, false, "java/lang/Double", SetDouble, GetDouble, 2.5e-300),
      CASE("boolean", BooleanType, false, "java/lang/Boolean", SetBoolean, GetBoolean, 1),
      CASE("string", StringType, false, "java/lang/String", SetString, GetString, text),
      CASE("date", DateType, false, "java/util/Date", SetDate, GetDate, Seconds(86401)),
      CASE("binary", BinaryType, false, "[B", SetBinary, GetBinary, binary),
      CASE("instance", InstanceType, false, kInstanceClass, SetInstance, GetInstance, one),
      CASE("integers", IntegerType, true, "[I", SetListOfInteger, GetListOfInteger, ints),
      CASE("doubles", DoubleType, true, "[D", SetListOfDouble, GetListOfDouble, doubles),
      CASE("booleans", BooleanType, true, "[Z", SetListOfBoolean, GetListOfBoolean, booleans),
      CASE("strings", StringType, true, "[Ljava/lang/String;", SetListOfString, GetListOfString, strings),
      CASE("dates", DateType, true, "[Ljava/util/Date;", SetListOfDate, GetListOfDate, dates),
      CASE("binaries", BinaryType, true, "[[B", SetListOfBinary, GetListOfBinary, binaries),
      CASE("instances", InstanceType, true, "[Lcom/velmora/tessara/kdmreplica/Instance;", SetListOfInstance,
           GetListOfInstance, objects),
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
    EXPECT_TRUE(c.holds(written));

    VLXKDMInstanceValue read = ReadBack(written);
    EXPECT_EQ(c.type, read.GetType());
    EXPECT_EQ(c.list, read.IsMultiValuated() != 0);
    EXPECT_TRUE(c.holds(read));
    EXPECT_EQ(c.list ? n : -2, c.list ? Length(read.GetHandle()) : -2);
  }
  EXPECT_TRUE(Reports().empty()) << Reports().front();
  EXPECT_EQ(globals, GlobalRefCount());  // the values and their Java objects are gone
  EXPECT_EQ(locals, LocalRefCount());
}

TEST(ValueTypes, EverySingleAndListTypeCrossesToJavaAndBack) { RoundTrip(5); }
TEST(ValueTypes, EmptyListsCrossToJavaAndBack) { RoundTrip(0); }
TEST(ValueTypes, ListsOfAHundredThousandElementsCrossToJavaAndBack) { RoundTrip(100000); }

// ---- States ----------------------------------------------------------------------------------

// Empty -> Local -> Synchronized -> Attached -> Synchronized -> Local, as seen from outside: a
// synchronized value makes no new Java object, and a setter lets the one it had go.
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
  ASSERT_EQ(VLX_S_OK, value.BuildRemote());  // nothing is made again
  EXPECT_EQ(integer, value.GetHandle());

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

  const long globals = GlobalRefCount();
  value.SetListOfDouble(VLXRawColldouble());  // Local again: the Java object is let go
  EXPECT_EQ(nullptr, value.GetHandle());
  EXPECT_EQ(globals - 1, GlobalRefCount());
  EXPECT_EQ(VLXKDMInstanceValue::DoubleType, value.GetType());
  EXPECT_EQ(1, value.IsMultiValuated());
}

TEST(ValueStates, CopiesKeepTheStateAndAReferenceOfTheirOwn)
{
  VLXKDMInstanceValue value;
  value.SetString(U("shared"));
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
  strings.Append(U("a"));

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

// A value without type, or with an instance that has no Java object, makes no Java object and stays
// unsynchronized: the next BuildRemote tries again.
TEST(ValuePreconditions, AFailedBuildRemoteMakesNothingAndIsTriedAgain)
{
  FatalRecorder recorder;
  VLXKDMInstanceValue value;
  ClearLastError();
  EXPECT_LT(value.BuildRemote(), 0);
  EXPECT_EQ(nullptr, value.GetHandle());
  EXPECT_EQ("VLXKDMInstanceValue::InternalBuild(jobject&)", PeekLastError().parameters.at(0));
  EXPECT_LT(value.BuildRemote(), 0);
  EXPECT_EQ(
      (std::vector<std::string>{"AssertionFailed:_type != (Type) -1@380", "AssertionFailed:_type != (Type) -1@380"}),
      Reports());
  value.SetInstance(VLXKDMInstance());
  EXPECT_LT(value.BuildRemote(), 0);
  EXPECT_LT(value.BuildRemote(), 0);
  EXPECT_EQ(4u, FatalRecorder::Reports().size());

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

}  // namespace
