// Documents where the native process matters: relative paths follow the process's current
// directory, and a replica crosses as bytes both ways.
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>

#include <gtest/gtest.h>

#include "TestSupport.h"

using namespace corvexa_test;

namespace {

const std::string kExamples = CORVEXA_EXAMPLES_DIR;

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

// The sample replica, read from the sample data (which names its schema file beside it).
void ReadSample(VLXKDMReplica& replica)
{
  ASSERT_EQ(VLX_S_OK, VLXKDMReplica::ReadFromXmlFile(U(kExamples + "/inventory.xml"), replica));
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
    EXPECT_LT(VLXKDMReplica::GetReplicaFromBinary(bytes, !compressed, other), 0);
    EXPECT_EQ("other", Name(other));  // a failure leaves the out-proxy alone
  }
}

}  // namespace
