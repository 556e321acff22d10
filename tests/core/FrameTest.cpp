// The call frame as a caller sees it: results, out-parameters, last errors and Java exceptions.
#include <functional>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "TestSupport.h"

using namespace corvexa_test;

namespace {

const char* const kThrowingReplica = "com/velmora/tessara/testdoubles/ThrowingReplica";
const char* const kNullReplica = "com/velmora/tessara/testdoubles/NullReplica";

class FrameTest : public ::testing::Test {
 protected:
  void SetUp() override
  {
    ASSERT_NE(nullptr, Env());
    ClearLastError();
  }
};

// An error left by an earlier call, or by a failure of a later one that recorded no cause, never
// stands for the next failure.
TEST_F(FrameTest, AnEarlierErrorIsNeverRaisedAgain)
{
  VLXError* earlier = new VLXError("TESTERR_0001", "CorvexaTestMessages");
  ASSERT_EQ(VLX_E_FAIL, VLXError::GetReturn(2, earlier, nullptr, __FILE__, __LINE__));
  VLXKDMReplica unbuilt;
  EXPECT_EQ(VLX_E_FAIL, unbuilt.Commit());
  EXPECT_EQ("VLXJBXInfraERR_1003", PeekLastError().id);
  EXPECT_EQ("VLXKDMReplica::Commit()", PeekLastError().parameters[0]);

  // A failure that records nothing after an operation has started names itself and its code.
  VLXKDMReplica built;
  ASSERT_EQ(VLX_S_OK, built.Build(VLXUnicodeString("fresh")));
  VLXUnicodeString name;
  ASSERT_EQ(VLX_S_OK, built.GetName(name));
  EXPECT_EQ(VLX_E_FAIL, VLXKDMReplica::HandleReplicaError(Env(), VLX_E_INVALIDARG, "Caller::Step()"));
  EXPECT_EQ("Caller::Step() failed: it failed with the code -2147024809 and recorded no cause", PeekLastError().text);
}

// A proxy holds only a Java object of its own class, however the object comes to it; a wrong one is
// refused, naming both classes, and the proxy keeps what it held.
TEST_F(FrameTest, AnObjectOfAnotherClassNeverEntersAProxy)
{
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString("wrong")));
  VLXKDMClassDef classDef;
  ASSERT_EQ(VLX_S_OK, classDef.Build(VLXUnicodeString("Part")));
  const jobject string = Env()->NewStringUTF("not a replica");
  const std::string kReplica = "com.velmora.tessara.kdmreplica.Replica";
  const std::string kClassDef = "com.velmora.tessara.kdmreplica.ClassDef";
  const std::string kHolder = "com.velmora.tessara.ReplicaHolder";
  struct Case {
    const char* what;
    std::function<long()> attach;
    std::string actual, expected;
  };
  VLXKDMReplica target;
  ASSERT_EQ(VLX_S_OK, target.Build(VLXUnicodeString("kept")));
  const std::vector<Case> cases = {
      {"SetHandle", [&] { return target.SetHandle(Env(), classDef.GetHandle()); }, kClassDef, kReplica},
      {"exchange", [&] { return target.BuildFromJavaType(Env(), string); }, "java.lang.String", kReplica},
      {"holder in", [&] { return target.BuildFromJavaHolder(Env(), replica.GetHandle()); }, kReplica, kHolder},
      {"holder out",
       [&] {
         jobject h = string;
         return target.ConvertToJavaHolder(Env(), h);
       },
       "java.lang.String", kHolder},
      {"assignment through the base",
       [&] {
         VLXKDMJavaObject& base = target;
         base = classDef;
         return VLX_E_INVALIDARG;
       },
       kClassDef, kReplica},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    ClearLastError();
    EXPECT_EQ(VLX_E_INVALIDARG, c.attach());
    const std::string text = PeekLastError().text;
    EXPECT_NE(std::string::npos, text.find("is a " + c.actual + ", not a " + c.expected)) << text;
    VLXUnicodeString name;
    ASSERT_EQ(VLX_S_OK, target.GetName(name));
    EXPECT_EQ("kept", Text(name));
  }
  Env()->DeleteLocalRef(string);
}

TEST_F(FrameTest, GetHandleOfAnUnbuiltProxyIsNullAndReportsNothing)
{
  VLXKDMReplica unbuilt;
  EXPECT_EQ(nullptr, unbuilt.GetHandle());
  EXPECT_FALSE(PeekLastError().present);
}

TEST_F(FrameTest, AJavaExceptionIsReportedClearedAndLeavesOutParametersAlone)
{
  VLXKDMReplica throwing;
  AttachNew(throwing, kThrowingReplica);

  VLXUnicodeString name("kept");
  EXPECT_EQ(VLX_E_FAIL, throwing.GetName(name));
  EXPECT_EQ("kept", Text(name));
  EXPECT_FALSE(Env()->ExceptionCheck());
  const LastError error = PeekLastError();
  ASSERT_TRUE(error.present);
  EXPECT_NE(std::string::npos, error.text.find("VLXKDMReplica::GetName(VLXUnicodeString&)")) << error.text;
  EXPECT_NE(std::string::npos, error.text.find("java.lang.IllegalStateException")) << error.text;
  EXPECT_NE(std::string::npos, error.text.find("name unavailable")) << error.text;
  EXPECT_NE(std::string::npos, error.text.find("storage offline")) << error.text;

  // An out-proxy keeps the object it referred to.
  VLXKDMReplica other;
  ASSERT_EQ(VLX_S_OK, other.Build(VLXUnicodeString("other")));
  VLXKDMClassDef classDef, before;
  ASSERT_EQ(VLX_S_OK, classDef.Build(VLXUnicodeString("Before")));
  before = classDef;
  EXPECT_EQ(VLX_E_FAIL, throwing.GetClassDef(VLXUnicodeString("Part"), classDef));
  EXPECT_TRUE(classDef == before);
  EXPECT_NE(std::string::npos, PeekLastError().text.find("no class lookups here: Part"));

  EXPECT_EQ(VLX_E_FAIL, throwing.Commit());
  EXPECT_EQ(3, IntField(throwing.GetHandle(), "calls"));

  // The next call on the same thread works.
  VLXUnicodeString otherName;
  EXPECT_EQ(VLX_S_OK, other.GetName(otherName));
  EXPECT_EQ("other", Text(otherName));
}

// A caller's own JNI code may leave an exception pending: the operation must not call Java over
// it, and reports it through the Java error handling instead.
TEST_F(FrameTest, AnExceptionPendingBeforeTheCallFailsItWithoutAJavaCall)
{
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString("before")));
  JNIEnv* env = Env();
  for (const bool built : {true, false}) {
    jclass cls = env->FindClass("java/lang/IllegalArgumentException");
    ASSERT_NE(nullptr, cls);
    ASSERT_EQ(0, env->ThrowNew(cls, "left by the caller"));
    env->DeleteLocalRef(cls);

    VLXUnicodeString name("kept");
    VLXKDMReplica unbuilt;
    EXPECT_EQ(VLX_E_FAIL, (built ? replica : unbuilt).GetName(name));
    EXPECT_EQ("kept", Text(name));
    EXPECT_FALSE(env->ExceptionCheck());
    const LastError error = PeekLastError();
    EXPECT_NE(std::string::npos, error.text.find("java.lang.IllegalArgumentException")) << error.text;
    EXPECT_NE(std::string::npos, error.text.find("left by the caller")) << error.text;
  }
  VLXUnicodeString name;
  EXPECT_EQ(VLX_S_OK, replica.GetName(name));
  EXPECT_EQ("before", Text(name));
}

TEST_F(FrameTest, NullJavaResultsGiveEmptyValuesAndUnbuiltProxies)
{
  VLXKDMReplica nulls;
  AttachNew(nulls, kNullReplica);
  VLXUnicodeString name("before");
  EXPECT_EQ(VLX_S_OK, nulls.GetName(name));
  EXPECT_EQ("", Text(name));

  VLXKDMReplica real;
  ASSERT_EQ(VLX_S_OK, real.Build());
  VLXKDMModelSet models;
  ASSERT_EQ(VLX_S_OK, real.GetModels(models));
  ASSERT_NE(nullptr, models.GetHandle());
  EXPECT_EQ(VLX_S_OK, nulls.GetModels(models));
  EXPECT_EQ(nullptr, models.GetHandle());

  // A lookup of an absent name detaches the out-proxy.
  VLXKDMClassDef classDef;
  ASSERT_EQ(VLX_S_OK, classDef.Build(VLXUnicodeString("Elsewhere")));
  EXPECT_EQ(VLX_S_OK, real.GetClassDef(VLXUnicodeString("NoSuchClass"), classDef));
  EXPECT_EQ(nullptr, classDef.GetHandle());
}

// Build attaches the proxy to a new Java object; a copy keeps the old one. An unbuilt proxy given as
// an argument goes to Java as null: Java refuses it, and a failing Build leaves the proxy as it was.
TEST_F(FrameTest, BuildAttachesANewObjectAndAFailedOneKeepsTheOld)
{
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString("first")));
  VLXKDMReplica keep(replica);
  ASSERT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString("second")));
  EXPECT_FALSE(keep == replica);
  VLXUnicodeString name;
  ASSERT_EQ(VLX_S_OK, keep.GetName(name));
  EXPECT_EQ("first", Text(name));

  VLXKDMClassDef classDef;
  ASSERT_EQ(VLX_S_OK, classDef.Build(VLXUnicodeString("Part")));
  VLXKDMModel model;
  ASSERT_EQ(VLX_S_OK, model.Build(classDef));
  VLXKDMModel kept(model);
  EXPECT_EQ(VLX_E_FAIL, model.Build(VLXKDMClassDef()));
  EXPECT_TRUE(kept == model);
  VLXKDMModelSet models;
  ASSERT_EQ(VLX_S_OK, replica.GetModels(models));
  int position = 5;
  EXPECT_EQ(VLX_E_FAIL, models.IndexOf(VLXKDMClassDef(), position));
  EXPECT_EQ(5, position);
}

TEST_F(FrameTest, CopiesStayValidAfterTheSourceIsDestroyed)
{
  const long baseline = VLXJBXJNIUtilities::GetGlobalRefCount();
  {
    VLXKDMReplica* source = new VLXKDMReplica;
    ASSERT_EQ(VLX_S_OK, source->Build(VLXUnicodeString("shared")));
    VLXKDMReplica copy(*source);
    VLXKDMReplica assigned;
    assigned = *source;
    EXPECT_TRUE(copy == *source);
    EXPECT_EQ(baseline + 3, VLXJBXJNIUtilities::GetGlobalRefCount());
    delete source;

    VLXUnicodeString name;
    ASSERT_EQ(VLX_S_OK, copy.GetName(name));
    EXPECT_EQ("shared", Text(name));
    ASSERT_EQ(VLX_S_OK, assigned.GetName(name));
    EXPECT_EQ("shared", Text(name));
    assigned = assigned;
    EXPECT_TRUE(assigned == copy);
  }
  EXPECT_EQ(baseline, VLXJBXJNIUtilities::GetGlobalRefCount());
}

// (That the shared library exports it under its plain name is checked by corvexa_exports.)
TEST(Marker, ReturnsOne) { EXPECT_EQ(1, VELMORA_QKA2_INTERNAL_Corvexa()); }

}  // namespace
