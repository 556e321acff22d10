// The call frame as a caller sees it: results, out-parameters, last errors and Java exceptions.
#include <functional>

#include "TestSupport.h"

using namespace corvexa_test;

namespace {

std::string NameOf(VLXKDMReplica& replica)
{
  VLXUnicodeString name("unread");
  EXPECT_EQ(VLX_S_OK, replica.GetName(name));
  return Text(name);
}

// An error left by an earlier call never stands for the next failure, and a failure that recorded
// no cause names the operation and its code. A proxy's unbuilt handle is null and reports nothing.
TEST(Frame, AnEarlierErrorIsNeverRaisedAgain)
{
  VLXError* earlier = new VLXError("TESTERR_0001", "CorvexaTestMessages");
  ASSERT_EQ(VLX_E_FAIL, VLXError::GetReturn(2, earlier, nullptr, __FILE__, __LINE__));
  VLXKDMReplica unbuilt, built;
  EXPECT_EQ(VLX_E_FAIL, unbuilt.Commit());
  EXPECT_EQ("VLXJBXInfraERR_1003", PeekLastError().id);
  EXPECT_EQ("VLXKDMReplica::Commit()", PeekLastError().operation());

  ASSERT_EQ(VLX_S_OK, built.Build(U("fresh")));
  EXPECT_EQ("fresh", NameOf(built));
  EXPECT_EQ(VLX_E_FAIL, VLXKDMReplica::HandleReplicaError(Env(), VLX_E_INVALIDARG, "Caller::Step()"));
  EXPECT_EQ("Caller::Step() failed: it failed with the code -2147024809 and recorded no cause", PeekLastError().text);

  ClearLastError();
  EXPECT_EQ(nullptr, unbuilt.GetHandle());
  EXPECT_FALSE(PeekLastError().present);
}

// A proxy holds only a Java object of its own class, however the object comes to it; a wrong one is
// refused, naming both classes, and the proxy keeps what it held.
TEST(Frame, AnObjectOfAnotherClassNeverEntersAProxy)
{
  VLXKDMReplica replica, target;
  VLXKDMClassDef classDef;
  ASSERT_EQ(VLX_S_OK, replica.Build(U("wrong")));
  ASSERT_EQ(VLX_S_OK, target.Build(U("kept")));
  ASSERT_EQ(VLX_S_OK, classDef.Build(U("Part")));
  Local string(Env()->NewStringUTF("not a replica"));
  const std::string kReplica = "com.velmora.tessara.kdmreplica.Replica";
  const std::string kClassDef = "com.velmora.tessara.kdmreplica.ClassDef";
  const std::string kHolder = "com.velmora.tessara.ReplicaHolder";
  const struct {
    const char* what;
    std::function<long()> attach;
    std::string actual, expected;
  } cases[] = {
      {"SetHandle", [&] { return target.SetHandle(Env(), classDef.GetHandle()); }, kClassDef, kReplica},
      {"exchange", [&] { return target.BuildFromJavaType(Env(), string.get()); }, "java.lang.String", kReplica},
      {"holder in", [&] { return target.BuildFromJavaHolder(Env(), replica.GetHandle()); }, kReplica, kHolder},
      {"holder out",
       [&] {
         jobject h = string.get();
         return target.ConvertToJavaHolder(Env(), h);
       },
       "java.lang.String", kHolder},
      {"assignment through the base",
       [&] {
         static_cast<VLXKDMJavaObject&>(target) = classDef;
         return VLX_E_INVALIDARG;
       },
       kClassDef, kReplica},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    ClearLastError();
    EXPECT_EQ(VLX_E_INVALIDARG, c.attach());
    EXPECT_TRUE(Has(PeekLastError().text, "is a " + c.actual + ", not a " + c.expected)) << PeekLastError().text;
    EXPECT_EQ("kept", NameOf(target));
  }
}

// A Java exception is reported with the operation, its class, message and cause, and cleared; the
// out-parameters, text and proxy, keep what they held, and the next call works.
TEST(Frame, AJavaExceptionIsReportedClearedAndLeavesOutParametersAlone)
{
  VLXKDMReplica throwing, other;
  AttachNew(throwing, "com/velmora/tessara/testdoubles/ThrowingReplica");
  VLXUnicodeString name("kept");
  EXPECT_EQ(VLX_E_FAIL, throwing.GetName(name));
  EXPECT_EQ("kept", Text(name));
  EXPECT_FALSE(Env()->ExceptionCheck());
  const std::string text = PeekLastError().text;
  for (const char* part : {"VLXKDMReplica::GetName(VLXUnicodeString&)", "java.lang.IllegalStateException",
                           "name unavailable", "storage offline"})
    EXPECT_TRUE(Has(text, part)) << text;

  VLXKDMClassDef classDef, before;
  ASSERT_EQ(VLX_S_OK, classDef.Build(U("Before")));
  before = classDef;
  EXPECT_EQ(VLX_E_FAIL, throwing.GetClassDef(U("Part"), classDef));
  EXPECT_TRUE(classDef == before);
  EXPECT_TRUE(Has(PeekLastError().text, "no class lookups here: Part"));
  EXPECT_EQ(VLX_E_FAIL, throwing.Commit());
  EXPECT_EQ(3, IntField(throwing.GetHandle(), "calls"));

  ASSERT_EQ(VLX_S_OK, other.Build(U("other")));
  EXPECT_EQ("other", NameOf(other));
}

// Build attaches the proxy to a new Java object; a copy keeps the old one. An unbuilt proxy given as
// an argument goes to Java as null: Java refuses it, and a failing Build leaves the proxy as it was.
TEST(Frame, BuildAttachesANewObjectAndAFailedOneKeepsTheOld)
{
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build(U("first")));
  VLXKDMReplica keep(replica);
  ASSERT_EQ(VLX_S_OK, replica.Build(U("second")));
  EXPECT_FALSE(keep == replica);
  EXPECT_EQ("first", NameOf(keep));

  VLXKDMClassDef classDef;
  VLXKDMModel model;
  ASSERT_EQ(VLX_S_OK, classDef.Build(U("Part")));
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

// (That the shared library exports it under its plain name is checked by corvexa_exports.)
TEST(Marker, ReturnsOne) { EXPECT_EQ(1, VELMORA_QKA2_INTERNAL_Corvexa()); }

}  // namespace
