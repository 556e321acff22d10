// The value converters: times at the rounding boundaries, null Java objects, and the list converters
// with null elements, elements that throw and proxies without Java object. Every Java call the
// converters make runs under the JVM's JNI checks: a call with an exception pending or a local
// reference left behind fails the process.
#include <climits>

#include "CallFrame.h"
#include "TestSupport.h"
#include "VLXListValVLXBinary.h"
#include "VLXListValVLXTime.h"

using namespace corvexa_test;
using corvexa::Values;

namespace {

// Every test, its failure paths included, leaves the global references and this natively attached
// thread's local references as it found them.
class Converters : public ::testing::Test {
 protected:
  static void SetUpTestSuite()
  {
    VLXKDMReplica start;
    ASSERT_EQ(VLX_S_OK, start.Build());  // starts the Java side
  }
  void SetUp() override
  {
    globals = GlobalRefCount();
    locals = LocalRefCount();
  }
  void TearDown() override
  {
    EXPECT_EQ(globals, GlobalRefCount());
    EXPECT_EQ(locals, LocalRefCount());
  }
  JNIEnv* env = Env();
  long globals = 0, locals = 0;
};

// ---- Times -----------------------------------------------------------------------------------

TEST_F(Converters, DateMillisecondsRoundToSecondsAtTheBoundaries)
{
  // Milliseconds, and the seconds they round to.
  const jlong msOf[] = {1499, 1500, -1,    -1500, -1501,     -2500,     0,        -499,
                        -500, -501, -1400, 999,   -86400000, LLONG_MAX, LLONG_MIN};
  const time_t secondsOf[] = {
      1, 2, 0, -1, -2, -2, 0, 0, 0, -1, -1, 1, -86400, LLONG_MAX / 1000 + 1, LLONG_MIN / 1000 - 1};
  std::vector<jobject> dates;
  for (size_t i = 0; i < std::size(msOf); ++i) {
    const jlong ms = msOf[i];
    const time_t seconds = secondsOf[i];
    SCOPED_TRACE(ms);
    Local date(NewDate(ms));
    VLXTime time = Seconds(12345);
    ASSERT_EQ(VLX_S_OK, Values::BuildFromJavaType(env, date.get(), time));
    EXPECT_EQ(seconds, time.Gettime_t());
    dates.push_back(env->NewLocalRef(date.get()));
  }
  // The list converter rounds the same way.
  Local array(NewArray("java/util/Date", dates));
  VLXListValVLXTime times;
  times.Append(Seconds(77));  // emptied first
  ASSERT_EQ(VLX_S_OK, Values::BuildFromJavaType(env, array.get(), times));
  ASSERT_EQ(static_cast<int>(std::size(msOf)), times.Size());
  for (int i = 1; i <= times.Size(); ++i) EXPECT_EQ(secondsOf[i - 1], times[i].Gettime_t()) << i;
  for (jobject d : dates) env->DeleteLocalRef(d);
}

TEST_F(Converters, ATimeBeyondTheRangeOfAJavaDateFailsAndMakesNothing)
{
  for (time_t seconds : {static_cast<time_t>(LLONG_MAX), static_cast<time_t>(LLONG_MIN / 1000 - 1)}) {
    jobject untouched = reinterpret_cast<jobject>(0x1);
    ClearLastError();
    EXPECT_LT(Values::ConvertToJavaType(env, Seconds(seconds), untouched), 0);
    EXPECT_EQ(reinterpret_cast<jobject>(0x1), untouched);
    EXPECT_EQ("VLXJBXInfraERR_1009", PeekLastError().id);

    VLXListValVLXTime list;
    list.Append(Seconds(1));
    list.Append(Seconds(seconds));
    EXPECT_LT(Values::ConvertToJavaType(env, list, untouched), 0);
    EXPECT_EQ(reinterpret_cast<jobject>(0x1), untouched);
  }
}

// ---- Null Java objects -----------------------------------------------------------------------

TEST_F(Converters, ANullJavaObjectFailsForAScalarAndEmptiesAList)
{
  int integer = 5;
  double real = 5;
  VLXBoolean flag = 5;
  VLXTime time = Seconds(5);
  ClearLastError();
  EXPECT_LT(Values::BuildFromJavaType(env, nullptr, integer), 0);
  EXPECT_EQ("VLXJBXInfraERR_1009", PeekLastError().id);
  EXPECT_EQ("VLXKDMJavaObject::BuildFromJavaType(JNIEnv*, jobject, int&)", PeekLastError().parameters.at(0));
  EXPECT_LT(Values::BuildFromJavaType(env, nullptr, real), 0);
  EXPECT_LT(Values::BuildFromJavaType(env, nullptr, flag), 0);
  EXPECT_LT(Values::BuildFromJavaType(env, nullptr, time), 0);
  EXPECT_EQ(5, integer);
  EXPECT_EQ(5, real);
  EXPECT_EQ(5, flag);
  EXPECT_EQ(5, time.Gettime_t());

  VLXListValVLXTime times;
  times.Append(time);
  VLXListValVLXBinary binaries;
  binaries.Append(VLXBinary(3));
  VLXListValVLXKDMInstance instances;
  instances.Append(NewInstance());
  EXPECT_EQ(VLX_S_OK, Values::BuildFromJavaType(env, nullptr, times));
  EXPECT_EQ(VLX_S_OK, Values::BuildFromJavaType(env, nullptr, binaries));
  EXPECT_EQ(VLX_S_OK, Values::BuildFromJavaType(env, nullptr, instances));
  EXPECT_EQ(0, times.Size() + binaries.Size() + instances.Size());
}

// ---- Lists from Java -------------------------------------------------------------------------

TEST_F(Converters, ADateArrayWithANullOrThrowingElementFailsAfterTheElementsBeforeIt)
{
  Local first(NewDate(1000)), last(NewDate(3000)), throwing(NewDate(0, "com/velmora/tessara/testdoubles/ThrowingDate"));
  const struct {
    jobject bad;
    const char* error;
    const char* says;
  } cases[] = {{nullptr, "VLXJBXInfraERR_1009", "index 1"},
               {throwing.get(), "VLXJBXInfraERR_1005", "cannot tell its time"}};
  for (const auto& c : cases) {
    SCOPED_TRACE(c.error);
    Local array(NewArray("java/util/Date", {first.get(), c.bad, last.get()}));
    VLXListValVLXTime times;
    ClearLastError();
    EXPECT_LT(Values::BuildFromJavaType(env, array.get(), times), 0);
    EXPECT_FALSE(env->ExceptionCheck());
    ASSERT_EQ(1, times.Size());
    EXPECT_EQ(1, times[1].Gettime_t());
    EXPECT_EQ(c.error, PeekLastError().id);
    EXPECT_NE(std::string::npos, PeekLastError().text.find(c.says)) << PeekLastError().text;
  }
  // A single date that throws: the output is left alone.
  VLXTime time = Seconds(42);
  EXPECT_LT(Values::BuildFromJavaType(env, throwing.get(), time), 0);
  EXPECT_EQ(42, time.Gettime_t());
  EXPECT_FALSE(env->ExceptionCheck());
}

// (Lists of every type to Java, empty ones too, are crossed by the value holder suite.)
TEST_F(Converters, AnArrayOfInstancesGivesProxiesOfTheSameObjects)
{
  std::vector<VLXKDMInstance> objects = NewInstances(3);
  Local array(NewArray(kInstanceClass, {objects[0].GetHandle(), nullptr, objects[2].GetHandle()}));
  VLXListValVLXKDMInstance list;
  list.Append(objects[1]);  // emptied first
  const long baseline = VLXJBXJNIUtilities::GetGlobalRefCount();
  ASSERT_EQ(VLX_S_OK, Values::BuildFromJavaType(env, array.get(), list));
  ASSERT_EQ(3, list.Size());
  EXPECT_TRUE(Same(list[1].GetHandle(), objects[0].GetHandle()));
  EXPECT_EQ(nullptr, list[2].GetHandle());  // a null element: an unattached proxy
  EXPECT_TRUE(Same(list[3].GetHandle(), objects[2].GetHandle()));
  EXPECT_NE(list[1].GetHandle(), objects[0].GetHandle());  // a reference of its own
  EXPECT_EQ(baseline + 2 - 1, VLXJBXJNIUtilities::GetGlobalRefCount());

  VLXKDMInstance single;
  ASSERT_EQ(VLX_S_OK, Values::BuildFromJavaType(env, objects[1].GetHandle(), single));
  EXPECT_TRUE(single == objects[1]);
  ASSERT_EQ(VLX_S_OK, Values::BuildFromJavaType(env, nullptr, single));
  EXPECT_EQ(nullptr, single.GetHandle());
  jobject out = nullptr;
  ASSERT_EQ(VLX_S_OK, Values::ConvertToJavaType(env, objects[0], out));
  EXPECT_EQ(objects[0].GetHandle(), out);  // an instance hands out its very reference, not to be released
}

}  // namespace
