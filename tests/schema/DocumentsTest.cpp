// Documents where the native process matters: a relative path is the process's current directory's
// at the call, which only a native host can change.
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>

#include "TestSupport.h"

using namespace corvexa_test;

namespace {

// After chdir, a document and a schema are read from the new current directory, whatever directory
// the JVM started in: a file of the same name elsewhere is not read.
TEST(XmlDocuments, RelativePathsFollowTheCurrentDirectory)
{
  char started[4096];
  ASSERT_NE(nullptr, getcwd(started, sizeof started));
  const std::string root = ::testing::TempDir() + "corvexa-cwd-" + std::to_string(getpid());
  VLXKDMReplica sample, read, schema;
  ASSERT_EQ(VLX_S_OK, VLXKDMReplica::ReadFromXmlFile(U(std::string(CORVEXA_EXAMPLES_DIR) + "/inventory.xml"), sample));
  ASSERT_EQ(0, mkdir(root.c_str(), 0700));
  for (const char* name : {"here", "elsewhere"}) {
    const std::string dir = root + "/" + name;
    VLXUnicodeString xml, xsd;
    ASSERT_EQ(0, mkdir(dir.c_str(), 0700));
    ASSERT_EQ(VLX_S_OK, sample.SetName(U(name)));
    ASSERT_EQ(VLX_S_OK, sample.GetXml(1, 0, xml));
    ASSERT_EQ(VLX_S_OK, sample.GetXsd(xsd));
    std::ofstream(dir + "/doc.xml") << Text(xml);
    std::ofstream(dir + "/schema.xsd") << Text(xsd);
  }
  ASSERT_EQ(0, chdir((root + "/elsewhere").c_str()));
  const long rc = VLXKDMReplica::ReadFromXmlFile(U("doc.xml"), read);
  ASSERT_EQ(VLX_S_OK, schema.Build(U("schema")));
  const long inserted = schema.InsertSchemaFile(U("../here/schema.xsd"));
  ASSERT_EQ(0, chdir(started));
  ASSERT_EQ(VLX_S_OK, rc);
  VLXUnicodeString name;
  ASSERT_EQ(VLX_S_OK, read.GetName(name));
  EXPECT_EQ("elsewhere", Text(name));
  EXPECT_EQ(VLX_S_OK, inserted);
  std::system(("rm -rf " + root).c_str());
}

}  // namespace
