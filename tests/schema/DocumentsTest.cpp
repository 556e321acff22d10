// Replica documents end to end, against the real replica package: schemas in, XML in and out,
// bytes in and out, and what a broken or hostile document does to the replica it was meant for.
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>

#include <gtest/gtest.h>

#include "JavaTestSupport.h"
#include "VLXKDMAttributeDef.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMInstance.h"
#include "VLXKDMInstanceSet.h"
#include "VLXKDMModel.h"
#include "VLXKDMModelSet.h"
#include "VLXKDMReplica.h"

using namespace corvexa_test;

namespace {

const std::string kExamples = CORVEXA_EXAMPLES_DIR;

VLXUnicodeString U(const std::string& s) { return VLXUnicodeString(s.c_str(), static_cast<int>(s.size())); }

std::string Xml(VLXKDMReplica& replica, VLXBoolean withSchema = 1, VLXBoolean withState = 1)
{
  VLXUnicodeString xml;
  EXPECT_EQ(VLX_S_OK, replica.GetXml(withSchema, withState, xml));
  return Text(xml);
}

std::string Name(VLXKDMReplica& replica)
{
  VLXUnicodeString name;
  EXPECT_EQ(VLX_S_OK, replica.GetName(name));
  return Text(name);
}

int InstanceCount(VLXKDMReplica& replica, const char* className)
{
  VLXKDMModelSet models;
  VLXKDMModel model;
  VLXKDMInstanceSet instances;
  int count = -1;
  EXPECT_EQ(VLX_S_OK, replica.GetModels(models));
  EXPECT_EQ(VLX_S_OK, models.GetItem(VLXUnicodeString(className), model));
  EXPECT_EQ(VLX_S_OK, model.GetInstances(instances));
  EXPECT_EQ(VLX_S_OK, instances.GetCount(count));
  return count;
}

// The sample replica, read from the sample data (which names its schema file beside it).
void ReadSample(VLXKDMReplica& replica)
{
  ASSERT_EQ(VLX_S_OK, VLXKDMReplica::ReadFromXmlFile(U(kExamples + "/inventory.xml"), replica));
}

// Expects rc to be a failure whose last error mentions every one of the given texts.
void ExpectFailureSaying(long rc, std::initializer_list<const char*> texts)
{
  EXPECT_LT(rc, 0);
  const LastError error = PeekLastError();
  ASSERT_TRUE(error.present);
  for (const char* text : texts) EXPECT_NE(std::string::npos, error.text.find(text)) << error.text;
  ClearLastError();
}

TEST(Schemas, AnXsdFileAndTheReplicasOwnXsdGiveTheSameSchema)
{
  VLXKDMReplica fromFile;
  ASSERT_EQ(VLX_S_OK, fromFile.Build(VLXUnicodeString("from file")));
  ASSERT_EQ(VLX_S_OK, fromFile.InsertSchemaFile(U(kExamples + "/inventory.xsd")));

  VLXKDMClassDef bolt;
  VLXUnicodeString text;
  ASSERT_EQ(VLX_S_OK, fromFile.GetClassDef(VLXUnicodeString("Bolt"), bolt));
  ASSERT_EQ(VLX_S_OK, bolt.GetSuperName(text));
  EXPECT_EQ("Part", Text(text));
  VLXKDMAttributeDef lengths;
  ASSERT_EQ(VLX_S_OK, fromFile.GetAttributeDef(VLXUnicodeString("Bolt.lengths"), lengths));
  VLXBoolean multi = 0;
  ASSERT_EQ(VLX_S_OK, lengths.IsMultiValuated(multi));
  EXPECT_TRUE(multi);
  EXPECT_EQ(0, InstanceCount(fromFile, "Supplier"));

  VLXUnicodeString xsd;
  ASSERT_EQ(VLX_S_OK, fromFile.GetXsd(xsd));
  VLXKDMReplica fromString;
  ASSERT_EQ(VLX_S_OK, fromString.Build(VLXUnicodeString("from string")));
  ASSERT_EQ(VLX_S_OK, fromString.InsertSchemaString(xsd));
  VLXUnicodeString again;
  ASSERT_EQ(VLX_S_OK, fromString.GetXsd(again));
  EXPECT_EQ(Text(xsd), Text(again));

  // The same classes again are refused, and the schema stays as it was.
  ExpectFailureSaying(fromString.InsertSchemaString(xsd), {"already has a class", "line"});
  ASSERT_EQ(VLX_S_OK, fromString.GetXsd(again));
  EXPECT_EQ(Text(xsd), Text(again));
}

TEST(XmlDocuments, AreReadIntoAnUnbuiltOrABuiltProxyAndWrittenBackUnchanged)
{
  VLXKDMReplica sample;  // not built
  ReadSample(sample);
  EXPECT_EQ("inventory", Name(sample));
  EXPECT_EQ(3, InstanceCount(sample, "Bolt"));
  VLXUnicodeString location;
  ASSERT_EQ(VLX_S_OK, sample.GetSchemaLocation(location));
  EXPECT_EQ("inventory.xsd", Text(location));

  // A built proxy is moved to the new replica; a copy of it keeps the old one.
  VLXKDMReplica target;
  ASSERT_EQ(VLX_S_OK, target.Build(VLXUnicodeString("old")));
  VLXKDMReplica old(target);
  const std::string standalone = Xml(sample, 1, 0);
  ASSERT_EQ(VLX_S_OK, VLXKDMReplica::ReadFromXmlString(U(standalone), target));
  EXPECT_EQ("inventory", Name(target));
  EXPECT_EQ("old", Name(old));
  EXPECT_EQ(standalone, Xml(target, 1, 0));

  // One flag is the two-flag form without state; without schema the document has no xs:schema.
  VLXUnicodeString one;
  ASSERT_EQ(VLX_S_OK, target.GetXml(1, one));
  EXPECT_EQ(standalone, Text(one));
  ASSERT_EQ(VLX_S_OK, target.GetXml(0, one));
  EXPECT_EQ(std::string::npos, Text(one).find("schema>"));
  EXPECT_NE(std::string::npos, standalone.find("schema>"));
}

// A relative path is the process's current directory's at the time of the call, whatever directory
// the JVM started in: after chdir, a file of the same name elsewhere is not read.
TEST(XmlDocuments, RelativePathsFollowTheCurrentDirectory)
{
  char started[4096];
  ASSERT_NE(nullptr, getcwd(started, sizeof started));
  const std::string root = ::testing::TempDir() + "corvexa-cwd-" + std::to_string(getpid());
  VLXKDMReplica sample;
  ReadSample(sample);
  ASSERT_EQ(0, mkdir(root.c_str(), 0700));
  for (const char* name : {"here", "elsewhere"}) {
    const std::string dir = root + "/" + name;
    ASSERT_EQ(0, mkdir(dir.c_str(), 0700));
    ASSERT_EQ(VLX_S_OK, sample.SetName(VLXUnicodeString(name)));
    std::ofstream(dir + "/doc.xml") << Xml(sample, 1, 0);
    std::ofstream(dir + "/schema.xsd") << [&] { VLXUnicodeString x; sample.GetXsd(x); return Text(x); }();
  }
  ASSERT_EQ(0, chdir((root + "/elsewhere").c_str()));
  VLXKDMReplica read, schema;
  const long rc = VLXKDMReplica::ReadFromXmlFile(VLXUnicodeString("doc.xml"), read);
  ASSERT_EQ(VLX_S_OK, schema.Build(VLXUnicodeString("schema")));
  const long inserted = schema.InsertSchemaFile(VLXUnicodeString("../here/schema.xsd"));
  ASSERT_EQ(0, chdir(started));
  ASSERT_EQ(VLX_S_OK, rc);
  EXPECT_EQ("elsewhere", Name(read));
  EXPECT_EQ(VLX_S_OK, inserted);
  std::system(("rm -rf " + root).c_str());
}

TEST(XmlDocuments, PendingChangesTravelOnlyWithTheStateFlag)
{
  VLXKDMReplica replica;
  ReadSample(replica);
  VLXKDMModelSet models;
  VLXKDMModel parts;
  VLXKDMInstanceSet instances;
  VLXKDMInstance part;
  ASSERT_EQ(VLX_S_OK, replica.GetModels(models));
  ASSERT_EQ(VLX_S_OK, models.GetItem(VLXUnicodeString("Part"), parts));
  ASSERT_EQ(VLX_S_OK, parts.GetInstances(instances));
  ASSERT_EQ(VLX_S_OK, instances.GetItem(0, part));
  ASSERT_EQ(VLX_S_OK, part.SetValue(VLXUnicodeString("quantity"), 17));
  VLXKDMInstance added;
  ASSERT_EQ(VLX_S_OK, parts.CreateInstance(added));
  ASSERT_EQ(VLX_S_OK, added.SetValue(VLXUnicodeString("number"), VLXUnicodeString("P-2000")));

  const struct {
    VLXBoolean withState;
    VLXBoolean modified, created;
  } cases[] = {{1, 1, 1}, {0, 0, 0}};
  for (const auto& c : cases) {
    SCOPED_TRACE(int(c.withState));
    VLXKDMReplica back;
    ASSERT_EQ(VLX_S_OK, VLXKDMReplica::ReadFromXmlString(U(Xml(replica, 1, c.withState)), back));
    ASSERT_EQ(3, InstanceCount(back, "Part"));
    VLXKDMModelSet backModels;
    VLXKDMModel backParts;
    VLXKDMInstanceSet backInstances;
    VLXKDMInstance first, last;
    ASSERT_EQ(VLX_S_OK, back.GetModels(backModels));
    ASSERT_EQ(VLX_S_OK, backModels.GetItem(VLXUnicodeString("Part"), backParts));
    ASSERT_EQ(VLX_S_OK, backParts.GetInstances(backInstances));
    ASSERT_EQ(VLX_S_OK, backInstances.GetItem(0, first));
    ASSERT_EQ(VLX_S_OK, backInstances.GetItem(2, last));
    VLXBoolean modified = 9, created = 9;
    ASSERT_EQ(VLX_S_OK, first.IsModified(modified));
    ASSERT_EQ(VLX_S_OK, last.IsCreated(created));
    EXPECT_EQ(c.modified, modified != 0);
    EXPECT_EQ(c.created, created != 0);
  }
}

TEST(XmlDocuments, PopulatingAddsInstancesToAReplicaThatKnowsTheirClasses)
{
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString("stock")));
  ASSERT_EQ(VLX_S_OK, replica.InsertSchemaFile(U(kExamples + "/inventory.xsd")));
  ASSERT_EQ(VLX_S_OK, replica.PopulatesFromXmlFile(U(kExamples + "/inventory.xml")));
  EXPECT_EQ(2, InstanceCount(replica, "Supplier"));
  EXPECT_EQ("stock", Name(replica));

  // Identifiers are unique per model: the same document again is refused as a whole.
  const std::string before = Xml(replica);
  std::ifstream file(kExamples + "/inventory.xml");
  const std::string sample((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
  ExpectFailureSaying(replica.PopulatesFromXmlString(U(sample)), {"SUP-ACME"});
  EXPECT_EQ(before, Xml(replica));
}

TEST(XmlDocuments, BrokenOrHostileDocumentsFailReadablyAndChangeNothing)
{
  VLXKDMReplica replica;
  ReadSample(replica);
  const std::string before = Xml(replica);

  const std::string secret = ::testing::TempDir() + "corvexa-secret.txt";
  {
    std::ofstream out(secret);
    out << "TOP-SECRET-CONTENT";
  }
  const std::string open = "<replica xmlns=\"urn:corvexa:replica:1\" format=\"1\" name=\"inventory\">";
  const struct {
    const char* what;
    std::string document;
    const char* says;
  } cases[] = {
      {"truncated", open + "<Supplier key=\"k9\"><name>Half", "line"},
      {"wrong value type", open + "<Part key=\"k9\"><number>X</number><quantity>many</quantity></Part></replica>",
       "many"},
      {"unknown class", open + "<Gear key=\"k9\"/></replica>", "Gear"},
      {"unknown attribute", open + "<Supplier key=\"k9\"><name>N</name><colour>red</colour></Supplier></replica>",
       "colour"},
      {"dangling reference", open + "<Part key=\"k9\"><number>X</number><supplier ref=\"nowhere\"/></Part></replica>",
       "nowhere"},
      {"external entity",
       "<?xml version=\"1.0\"?><!DOCTYPE replica [<!ENTITY x SYSTEM \"file://" + secret + "\">]>" + open +
           "<Supplier key=\"k9\"><name>&x;</name></Supplier></replica>",
       "DOCTYPE"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    ExpectFailureSaying(replica.PopulatesFromXmlString(U(c.document)), {c.says});
    EXPECT_EQ(before, Xml(replica));
    // Reading into a proxy leaves the proxy on the replica it had.
    VLXKDMReplica target(replica);
    ExpectFailureSaying(VLXKDMReplica::ReadFromXmlString(U(c.document), target), {});
    EXPECT_EQ(before, Xml(target));
  }
  EXPECT_EQ(std::string::npos, before.find("TOP-SECRET"));
  std::remove(secret.c_str());

  ExpectFailureSaying(replica.InsertSchemaFile(VLXUnicodeString("/no/such/dir/schema.xsd")), {"schema.xsd"});
  ExpectFailureSaying(replica.PopulatesFromXmlString(VLXUnicodeString("bad \xC3\x28 text")), {});
  EXPECT_EQ(before, Xml(replica));
}

TEST(BinaryForm, RoundTripsWithBothFlagsAndRefusesTheOtherFlag)
{
  VLXKDMReplica sample;
  ReadSample(sample);
  const std::string xml = Xml(sample);
  for (VLXBoolean compressed : {VLXBoolean(0), VLXBoolean(1)}) {
    SCOPED_TRACE(int(compressed));
    VLXBinary bytes;
    ASSERT_EQ(VLX_S_OK, VLXKDMReplica::GetBinaryFromReplica(sample, compressed, bytes));
    ASSERT_GT(bytes.getLength(), 0);
    VLXKDMReplica back;
    ASSERT_EQ(VLX_S_OK, VLXKDMReplica::GetReplicaFromBinary(bytes, compressed, back));
    EXPECT_EQ(xml, Xml(back));

    VLXKDMReplica other;
    ASSERT_EQ(VLX_S_OK, other.Build(VLXUnicodeString("other")));
    ExpectFailureSaying(VLXKDMReplica::GetReplicaFromBinary(bytes, !compressed, other), {"compress"});
    EXPECT_EQ("other", Name(other));
  }
}

TEST(BinaryForm, DamagedBytesFailReadablyAndLeaveTheProxyAlone)
{
  VLXKDMReplica sample;
  ReadSample(sample);
  VLXBinary bytes;
  ASSERT_EQ(VLX_S_OK, VLXKDMReplica::GetBinaryFromReplica(sample, 0, bytes));

  VLXKDMReplica target;
  ASSERT_EQ(VLX_S_OK, target.Build(VLXUnicodeString("kept")));
  VLXBinary flipped(bytes);
  flipped.getData()[bytes.getLength() / 2] ^= 0x5A;
  VLXBinary truncated(bytes.getData(), bytes.getLength() - 7);
  const VLXBinary empty;
  for (const VLXBinary* damaged : std::initializer_list<const VLXBinary*>{&flipped, &truncated, &empty}) {
    ExpectFailureSaying(VLXKDMReplica::GetReplicaFromBinary(*damaged, 0, target), {});
    EXPECT_EQ("kept", Name(target));
  }

  VLXKDMReplica unbuilt;
  VLXBinary untouched(bytes);
  EXPECT_LT(VLXKDMReplica::GetBinaryFromReplica(unbuilt, 0, untouched), 0);
  EXPECT_TRUE(untouched == bytes);
  ClearLastError();
}

TEST(Features, KnownFeaturesChangeTheOutputAndUnknownOnesAreListed)
{
  VLXKDMReplica sample;
  ReadSample(sample);
  ASSERT_EQ(VLX_S_OK, VLXKDMReplica::SetFeature(VLXUnicodeString("indent"), 0));
  const std::string flat = Xml(sample);
  ASSERT_EQ(VLX_S_OK, VLXKDMReplica::SetFeature(VLXUnicodeString("indent"), 1));
  const std::string indented = Xml(sample);
  EXPECT_LT(flat.size(), indented.size());
  EXPECT_NE(std::string::npos, indented.find("\n  <"));

  ExpectFailureSaying(VLXKDMReplica::SetFeature(VLXUnicodeString("colour"), 1), {"colour", "validate", "indent"});

  ASSERT_EQ(VLX_S_OK, VLXKDMReplica::SetSchemaLocation(VLXUnicodeString("elsewhere/stock.xsd")));
  VLXKDMReplica fresh;
  ASSERT_EQ(VLX_S_OK, fresh.Build());
  VLXUnicodeString location;
  ASSERT_EQ(VLX_S_OK, fresh.GetSchemaLocation(location));
  EXPECT_EQ("elsewhere/stock.xsd", Text(location));
  EXPECT_NE(std::string::npos, Xml(fresh, 0, 0).find("elsewhere/stock.xsd"));
  ASSERT_EQ(VLX_S_OK, VLXKDMReplica::SetSchemaLocation(VLXUnicodeString("")));
}

}  // namespace
