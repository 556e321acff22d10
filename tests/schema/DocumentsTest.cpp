// Documents where the native process matters: a relative path is the process's current directory's
// at the call, which only a native host can change.
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
    std::ofstream(dir + "/schema.xsd") << [&] {
      VLXUnicodeString x;
      sample.GetXsd(x);
      return Text(x);
    }();
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

}  // namespace
