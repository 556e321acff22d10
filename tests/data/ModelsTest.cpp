// Models, model sets and instance sets against the real replica package: lookups by position, name
// and class, not-found answers, positions out of range, removal, and proxies that are not built.
#include <string>

#include <gtest/gtest.h>

#include "DataFixture.h"

using namespace corvexa_test;

namespace {

const VLXUnicodeString kBadName("bad \xC3\x28 name");

// A replica with the classes A, B and C (one integer attribute each), in that order.
struct ThreeClasses {
  VLXKDMReplica replica;
  VLXKDMModel a, b, c;
  VLXKDMModelSet models;
  ThreeClasses()
  {
    EXPECT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString("three")));
    const std::vector<AttributeShape> one = {{"n", VLXKDMAttributeType::Integer, false}};
    AddClass(replica, "A", one, a);
    AddClass(replica, "B", one, b);
    AddClass(replica, "C", one, c);
    EXPECT_EQ(VLX_S_OK, replica.GetModels(models));
  }
};

TEST(ModelSets, CountItemsAndPositions)
{
  ThreeClasses r;
  int count = -7;
  ASSERT_EQ(VLX_S_OK, r.models.GetCount(count));
  EXPECT_EQ(3, count);

  VLXKDMModel* expected[] = {&r.a, &r.b, &r.c};
  const char* names[] = {"A", "B", "C"};
  for (int p = 0; p < 3; ++p) {
    SCOPED_TRACE(names[p]);
    VLXKDMModel byPosition, byName;
    ASSERT_EQ(VLX_S_OK, r.models.GetItem(p, byPosition));
    EXPECT_TRUE(byPosition == *expected[p]);
    ASSERT_EQ(VLX_S_OK, r.models.GetItem(VLXUnicodeString(names[p]), byName));
    EXPECT_TRUE(byName == *expected[p]);

    int position = -7;
    ASSERT_EQ(VLX_S_OK, r.models.IndexOf(VLXUnicodeString(names[p]), position));
    EXPECT_EQ(p, position);
    VLXKDMClassDef classDef;
    ASSERT_EQ(VLX_S_OK, expected[p]->GetClassDef(classDef));
    position = -7;
    ASSERT_EQ(VLX_S_OK, r.models.IndexOf(classDef, position));
    EXPECT_EQ(p, position);
    VLXBoolean included = 9;
    ASSERT_EQ(VLX_S_OK, r.models.Includes(VLXUnicodeString(names[p]), included));
    EXPECT_EQ(1, included);
  }
}

TEST(ModelSets, NotFoundAnswersAndPositionsOutOfRange)
{
  ThreeClasses r;
  // Absent names: Java answers null (a detached out-proxy), -1 and false.
  VLXKDMModel model(r.a);
  ASSERT_EQ(VLX_S_OK, r.models.GetItem(VLXUnicodeString("Absent"), model));
  EXPECT_EQ(nullptr, model.GetHandle());
  int position = 5;
  ASSERT_EQ(VLX_S_OK, r.models.IndexOf(VLXUnicodeString("Absent"), position));
  EXPECT_EQ(-1, position);
  VLXBoolean included = 1;
  ASSERT_EQ(VLX_S_OK, r.models.Includes(VLXUnicodeString("Absent"), included));
  EXPECT_EQ(0, included);
  // A class definition of no replica.
  VLXKDMClassDef stranger;
  ASSERT_EQ(VLX_S_OK, stranger.Build(VLXUnicodeString("A")));
  position = 5;
  ASSERT_EQ(VLX_S_OK, r.models.IndexOf(stranger, position));
  EXPECT_EQ(-1, position);

  // Positions out of range fail with the Java exception; the out-model keeps its former handle.
  for (int bad : {-1, 3, 1 << 30}) {
    SCOPED_TRACE(bad);
    VLXKDMModel kept(r.b);
    ClearLastError();
    EXPECT_EQ(VLX_E_FAIL, r.models.GetItem(bad, kept));
    EXPECT_TRUE(kept == r.b);
    EXPECT_NE(std::string::npos, PeekLastError().text.find("out of range")) << PeekLastError().text;
    EXPECT_EQ(VLX_E_FAIL, r.models.Remove(bad));
  }
  int count = 0;
  ASSERT_EQ(VLX_S_OK, r.models.GetCount(count));
  EXPECT_EQ(3, count);
  // Removing what is not there fails and changes nothing.
  EXPECT_EQ(VLX_E_FAIL, r.models.Remove(VLXUnicodeString("Absent")));
  EXPECT_EQ(VLX_E_FAIL, r.models.Remove(stranger));
  // A class definition that is not built goes to Java as null, which Java refuses.
  VLXKDMClassDef unbuilt;
  position = 5;
  EXPECT_EQ(VLX_E_FAIL, r.models.IndexOf(unbuilt, position));
  EXPECT_EQ(5, position);
  EXPECT_EQ(VLX_E_FAIL, r.models.Add(VLXKDMModel()));
  ASSERT_EQ(VLX_S_OK, r.models.GetCount(count));
  EXPECT_EQ(3, count);
}

TEST(ModelSets, AddAndRemoveByEachForm)
{
  ThreeClasses r;
  VLXKDMClassDef classB;
  ASSERT_EQ(VLX_S_OK, r.b.GetClassDef(classB));

  ASSERT_EQ(VLX_S_OK, r.models.Remove(classB));                   // B
  ASSERT_EQ(VLX_S_OK, r.models.Remove(VLXUnicodeString("C")));    // C
  ASSERT_EQ(VLX_S_OK, r.models.Remove(0));                        // A
  int count = -1;
  ASSERT_EQ(VLX_S_OK, r.models.GetCount(count));
  EXPECT_EQ(0, count);

  // A removed model is in no replica and can be added again; earlier proxies stay attached.
  VLXKDMReplica owner(r.replica);
  ASSERT_EQ(VLX_S_OK, r.b.GetReplica(owner));
  EXPECT_EQ(nullptr, owner.GetHandle());
  ASSERT_EQ(VLX_S_OK, r.models.Add(r.b));
  ASSERT_EQ(VLX_S_OK, r.b.GetReplica(owner));
  EXPECT_TRUE(owner == r.replica);
  // Adding it twice fails.
  EXPECT_EQ(VLX_E_FAIL, r.models.Add(r.b));
  ASSERT_EQ(VLX_S_OK, r.models.GetCount(count));
  EXPECT_EQ(1, count);
}

TEST(ModelSets, IncludesReturnsTheConverterCodeRawOthersTranslate)
{
  ThreeClasses r;
  VLXBoolean included = 7;
  ClearLastError();
  EXPECT_EQ(VLX_E_INVALIDARG, r.models.Includes(kBadName, included));
  EXPECT_EQ(7, included);
  int position = 7;
  EXPECT_EQ(VLX_E_FAIL, r.models.IndexOf(kBadName, position));
  EXPECT_EQ(7, position);
  VLXKDMModel model;
  EXPECT_EQ(VLX_E_FAIL, r.models.GetItem(kBadName, model));
  EXPECT_EQ(VLX_E_FAIL, r.models.Remove(kBadName));
  EXPECT_NE(std::string::npos, PeekLastError().text.find("UTF-8")) << PeekLastError().text;
}

TEST(Models, BuildCreateAndNavigate)
{
  VLXKDMClassDef first, second;
  ASSERT_EQ(VLX_S_OK, first.Build(VLXUnicodeString("First")));
  ASSERT_EQ(VLX_S_OK, second.Build(VLXUnicodeString("Second")));
  VLXKDMModel model;
  ASSERT_EQ(VLX_S_OK, model.Build(first));
  const VLXKDMModel firstModel(model);
  ASSERT_EQ(VLX_S_OK, model.Build(second));  // re-attached to a second Java model
  EXPECT_FALSE(model == firstModel);
  VLXKDMClassDef classDef;
  ASSERT_EQ(VLX_S_OK, model.GetClassDef(classDef));
  EXPECT_TRUE(classDef == second);

  // A model in no replica: no replica, and no instance can be created.
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, model.GetReplica(replica));
  EXPECT_EQ(nullptr, replica.GetHandle());
  VLXKDMInstance instance;
  EXPECT_EQ(VLX_E_FAIL, model.CreateInstance(instance));
  EXPECT_EQ(nullptr, instance.GetHandle());
  EXPECT_NE(std::string::npos, PeekLastError().text.find("in no replica")) << PeekLastError().text;

  ASSERT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString("home")));
  VLXKDMModelSet models;
  ASSERT_EQ(VLX_S_OK, replica.GetModels(models));
  ASSERT_EQ(VLX_S_OK, models.Add(model));
  VLXKDMReplica owner;
  ASSERT_EQ(VLX_S_OK, model.GetReplica(owner));
  EXPECT_TRUE(owner == replica);
  ASSERT_EQ(VLX_S_OK, model.CreateInstance(instance));
  ASSERT_NE(nullptr, instance.GetHandle());
  VLXKDMInstanceSet instances;
  ASSERT_EQ(VLX_S_OK, model.GetInstances(instances));
  int count = 0;
  ASSERT_EQ(VLX_S_OK, instances.GetCount(count));
  EXPECT_EQ(1, count);
  VLXUnicodeString text;
  ASSERT_EQ(VLX_S_OK, model.ToString(text));
  EXPECT_NE(std::string::npos, Text(text).find("Second")) << Text(text);

  // A class definition that is not built goes to the Java constructor as null, which refuses it;
  // the model keeps its Java model.
  VLXKDMModel kept(model);
  EXPECT_EQ(VLX_E_FAIL, kept.Build(VLXKDMClassDef()));
  EXPECT_TRUE(kept == model);
}

TEST(InstanceSets, CountItemsIndexAndRemoval)
{
  SampleReplica s;
  VLXKDMInstanceSet set;
  ASSERT_EQ(VLX_S_OK, s.model.GetInstances(set));
  std::vector<VLXKDMInstance> made;
  for (int i = 0; i < 4; ++i) made.push_back(s.Create());
  int count = 0;
  ASSERT_EQ(VLX_S_OK, set.GetCount(count));
  EXPECT_EQ(4, count);
  for (int p = 0; p < 4; ++p) {
    VLXKDMInstance item;
    ASSERT_EQ(VLX_S_OK, set.GetItem(p, item));
    EXPECT_TRUE(item == made[p]);
    int position = -7;
    ASSERT_EQ(VLX_S_OK, set.IndexOf(made[p], position));
    EXPECT_EQ(p, position);
  }
  // Out of range: the Java exception, the out-instance keeps its handle.
  for (int bad : {-1, 4}) {
    VLXKDMInstance kept(made[0]);
    EXPECT_EQ(VLX_E_FAIL, set.GetItem(bad, kept));
    EXPECT_TRUE(kept == made[0]);
    EXPECT_EQ(VLX_E_FAIL, set.Remove(bad));
  }
  // An instance of another replica is not in the set: -1, and removing it fails.
  SampleReplica other("other");
  VLXKDMInstance foreign = other.Create();
  int position = 7;
  ASSERT_EQ(VLX_S_OK, set.IndexOf(foreign, position));
  EXPECT_EQ(-1, position);
  EXPECT_EQ(VLX_E_FAIL, set.Remove(foreign));
  // An instance that is not built goes as null, which Java refuses.
  position = 7;
  EXPECT_EQ(VLX_E_FAIL, set.IndexOf(VLXKDMInstance(), position));
  EXPECT_EQ(7, position);
  EXPECT_EQ(VLX_E_FAIL, set.Remove(VLXKDMInstance()));

  // Removal by instance and by position; the proxies stay attached to their Java instances.
  ASSERT_EQ(VLX_S_OK, set.Remove(made[1]));
  ASSERT_EQ(VLX_S_OK, set.Remove(0));
  ASSERT_EQ(VLX_S_OK, set.GetCount(count));
  EXPECT_EQ(2, count);
  VLXKDMInstance first;
  ASSERT_EQ(VLX_S_OK, set.GetItem(0, first));
  EXPECT_TRUE(first == made[2]);
  VLXUnicodeString text;
  EXPECT_EQ(VLX_S_OK, made[1].ToString(text));
  ASSERT_EQ(VLX_S_OK, set.IndexOf(made[1], position));
  EXPECT_EQ(-1, position);
  ASSERT_EQ(VLX_S_OK, set.RemoveAll());
  ASSERT_EQ(VLX_S_OK, set.GetCount(count));
  EXPECT_EQ(0, count);
  ASSERT_EQ(VLX_S_OK, set.RemoveAll());  // an empty set too
}

TEST(UnbuiltProxies, EveryOperationFailsNamingItselfAndWritesNothing)
{
  VLXKDMModelSet models;
  VLXKDMModel model;
  VLXKDMInstanceSet set;
  VLXKDMClassDef classDef;
  VLXKDMInstance instance;
  VLXKDMReplica replica;
  VLXUnicodeString text("kept");
  int number = 42;
  VLXBoolean flag = 9;
  const struct {
    const char* name;
    long (*run)(VLXKDMModelSet&, VLXKDMModel&, VLXKDMInstanceSet&, VLXKDMClassDef&, VLXKDMInstance&,
                VLXKDMReplica&, VLXUnicodeString&, int&, VLXBoolean&);
  } cases[] = {
#define CASE(text, expr) {text, [](VLXKDMModelSet& ms, VLXKDMModel& m, VLXKDMInstanceSet& is, VLXKDMClassDef& cd, \
                                   VLXKDMInstance& in, VLXKDMReplica& r, VLXUnicodeString& t, int& n,            \
                                   VLXBoolean& f) -> long { (void)ms, (void)m, (void)is, (void)cd, (void)in,    \
                                                            (void)r, (void)t, (void)n, (void)f; return expr; }}
      CASE("VLXKDMModelSet::GetCount(int&)", ms.GetCount(n)),
      CASE("VLXKDMModelSet::GetItem(int, VLXKDMModel&)", ms.GetItem(0, m)),
      CASE("VLXKDMModelSet::GetItem(const VLXUnicodeString&, VLXKDMModel&)", ms.GetItem(t, m)),
      CASE("VLXKDMModelSet::Includes(const VLXUnicodeString&, VLXBoolean&)", ms.Includes(t, f)),
      CASE("VLXKDMModelSet::IndexOf(const VLXKDMClassDef&, int&)", ms.IndexOf(cd, n)),
      CASE("VLXKDMModelSet::IndexOf(const VLXUnicodeString&, int&)", ms.IndexOf(t, n)),
      CASE("VLXKDMModelSet::Add(const VLXKDMModel&)", ms.Add(m)),
      CASE("VLXKDMModelSet::Remove(const VLXKDMClassDef&)", ms.Remove(cd)),
      CASE("VLXKDMModelSet::Remove(const VLXUnicodeString&)", ms.Remove(t)),
      CASE("VLXKDMModelSet::Remove(int)", ms.Remove(0)),
      CASE("VLXKDMModel::CreateInstance(VLXKDMInstance&)", m.CreateInstance(in)),
      CASE("VLXKDMModel::GetClassDef(VLXKDMClassDef&)", m.GetClassDef(cd)),
      CASE("VLXKDMModel::GetInstances(VLXKDMInstanceSet&)", m.GetInstances(is)),
      CASE("VLXKDMModel::GetReplica(VLXKDMReplica&)", m.GetReplica(r)),
      CASE("VLXKDMModel::ToString(VLXUnicodeString&)", m.ToString(t)),
      CASE("VLXKDMInstanceSet::GetCount(int&)", is.GetCount(n)),
      CASE("VLXKDMInstanceSet::GetItem(int, VLXKDMInstance&)", is.GetItem(0, in)),
      CASE("VLXKDMInstanceSet::IndexOf(const VLXKDMInstance&, int&)", is.IndexOf(in, n)),
      CASE("VLXKDMInstanceSet::Remove(const VLXKDMInstance&)", is.Remove(in)),
      CASE("VLXKDMInstanceSet::Remove(int)", is.Remove(0)),
      CASE("VLXKDMInstanceSet::RemoveAll()", is.RemoveAll()),
#undef CASE
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    ClearLastError();
    EXPECT_EQ(VLX_E_FAIL, c.run(models, model, set, classDef, instance, replica, text, number, flag));
    EXPECT_EQ("VLXJBXInfraERR_1003", PeekLastError().id);
    EXPECT_EQ(c.name, LastErrorOperation());
  }
  EXPECT_EQ("kept", Text(text));
  EXPECT_EQ(42, number);
  EXPECT_EQ(9, flag);
  EXPECT_EQ(nullptr, model.GetHandle());
  EXPECT_EQ(nullptr, instance.GetHandle());
  EXPECT_EQ(nullptr, set.GetHandle());
  EXPECT_EQ(nullptr, classDef.GetHandle());
  EXPECT_EQ(nullptr, replica.GetHandle());
}

}  // namespace
