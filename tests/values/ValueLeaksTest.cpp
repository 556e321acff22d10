// Long loops over the converters and the value holder, their failure paths included, leave the
// global-reference count where it started; a local reference left behind on this natively
// attached thread would overflow the JVM's checked capacity and fail the process.
#include <climits>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "ValuesSupport.h"
#include "VLXListValVLXBinary.h"
#include "VLXListValVLXTime.h"

using namespace corvexa_test;
using corvexa::Values;

namespace {

TEST(ValueLeaks, SuccessfulConversionsLeaveNoReferences)
{
  const std::vector<VLXKDMInstance> instances = NewInstances(3);
  VLXListValVLXTime dates;
  VLXListValVLXBinary binaries;
  VLXListValVLXKDMInstance list;
  for (int i = 0; i < 3; ++i) {
    dates.Append(Seconds(i));
    binaries.Append(VLXBinary(i));
    list.Append(instances[static_cast<size_t>(i)]);
  }
  const long baseline = VLXJBXJNIUtilities::GetGlobalRefCount();
  VLXKDMInstanceValue value, read;
  for (int i = 0; i < 50000; ++i) {
    switch (i % 5) {
      case 0: value.SetInteger(i); break;
      case 1: value.SetListOfDate(dates); break;
      case 2: value.SetListOfBinary(binaries); break;
      case 3: value.SetListOfInstance(list); break;
      case 4: value.SetInstance(instances[0]); break;
    }
    ASSERT_EQ(VLX_S_OK, value.BuildRemote());
    ASSERT_EQ(VLX_S_OK, read.SetHandle(Env(), value.GetHandle()));
    ASSERT_EQ(VLX_S_OK, read.BuildLocal());
  }
  EXPECT_TRUE(read.GetInstance() == instances[0]);  // the last round wrote an instance
  value = VLXKDMInstanceValue();
  read = VLXKDMInstanceValue();
  EXPECT_EQ(baseline, VLXJBXJNIUtilities::GetGlobalRefCount());
}

TEST(ValueLeaks, EarlyStopsAndFailuresLeaveNoReferences)
{
  FatalRecorder recorder;
  JNIEnv* env = Env();
  Local first(NewDate(1000)), throwing(NewDate(0, "com/velmora/tessara/testdoubles/ThrowingDate"));
  Local withNull(NewArray("java/util/Date", {first.get(), first.get(), nullptr, first.get()}));
  Local withThrowing(NewArray("java/util/Date", {first.get(), throwing.get(), first.get()}));
  Local text(env->NewStringUTF("no bytes"));
  Local bytes(env->NewByteArray(2));
  Local mixed(NewArray("java/lang/Object", {bytes.get(), bytes.get(), text.get()}));
  Local boxedLong(NewLong(1));

  VLXListValVLXKDMInstance badInstances;
  badInstances.Append(NewInstance());
  badInstances.Append(VLXKDMInstance());  // not attached
  VLXListValVLXTime badTimes;
  badTimes.Append(Seconds(1));
  badTimes.Append(Seconds(static_cast<time_t>(LLONG_MAX)));

  const long baseline = VLXJBXJNIUtilities::GetGlobalRefCount();
  VLXListValVLXTime times;
  VLXListValVLXBinary binaries;
  VLXKDMInstanceValue value;
  for (int i = 0; i < 20000; ++i) {
    ASSERT_LT(Values::BuildFromJavaType(env, withNull.get(), times), 0);
    ASSERT_LT(Values::BuildFromJavaType(env, withThrowing.get(), times), 0);
    ASSERT_LT(Values::BuildFromJavaType(env, mixed.get(), binaries), 0);
    jobject out = nullptr;
    ASSERT_LT(Values::ConvertToJavaType(env, badInstances, out), 0);
    ASSERT_LT(Values::ConvertToJavaType(env, badTimes, out), 0);
    ASSERT_EQ(nullptr, out);
    ASSERT_EQ(VLX_E_INVALIDARG, value.SetHandle(env, boxedLong.get()));
    ASSERT_LT(value.BuildLocal(), 0);
    FatalRecorder::Reports().clear();
  }
  EXPECT_EQ(2, binaries.Size());
  value = VLXKDMInstanceValue();
  EXPECT_EQ(baseline, VLXJBXJNIUtilities::GetGlobalRefCount());
}

}  // namespace
