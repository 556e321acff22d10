// Documents where the native process matters: a relative path is the process's current directory's
// at the call, which only a native host can change.
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <sstream>
#include <thread>
#include <utility>
#include <vector>

#include "TestSupport.h"

using namespace corvexa_test;

namespace {

std::string FileText(const std::string& path)
{
  std::stringstream text;
  text << std::ifstream(path).rdbuf();
  return text.str();
}

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

// The progress handler of the calling thread: the figures it hears grow to the total; answering 0
// (or throwing) stops the operation, which fails saying so and leaves the old file; another thread
// is not stopped by it. Files written after chdir land in the new current directory and read back
// with the compression their header says.
struct Heard {
  std::vector<std::pair<long long, long long>> figures;
  bool stop = false;
  bool raise = false;
};
VLXBoolean Hear(long long done, long long total, void* context)
{
  Heard& h = *static_cast<Heard*>(context);
  h.figures.emplace_back(done, total);
  if (h.raise) throw std::runtime_error("a handler that throws");
  return h.stop ? 0 : 1;
}

TEST(Files, ProgressStopsOnlyTheCallingThreadAndWritesAreWholeOrAbsent)
{
  char started[4096];
  ASSERT_NE(nullptr, getcwd(started, sizeof started));
  const std::string root = ::testing::TempDir() + "corvexa-files-" + std::to_string(getpid());
  ASSERT_EQ(0, mkdir(root.c_str(), 0700));
  VLXKDMReplica sample, back, fromBytes;
  ASSERT_EQ(VLX_S_OK, VLXKDMReplica::ReadFromXmlFile(U(std::string(CORVEXA_EXAMPLES_DIR) + "/inventory.xml"), sample));
  ASSERT_EQ(0, chdir(root.c_str()));
  Heard heard;
  ASSERT_EQ(VLX_S_OK, VLXKDMReplica::SetProgressHandler(&Hear, &heard));
  const long written = sample.WriteBinaryFile(U("inventory.bin"), 1);
  const long read = VLXKDMReplica::ReadBinaryFile(U("inventory.bin"), back);
  const std::vector<std::pair<long long, long long>> figures = heard.figures;
  std::ofstream("inventory.xml") << "old";
  heard.stop = true;
  const long stopped = sample.WriteXmlFile(U("inventory.xml"), 1, 1);
  const std::string why = PeekLastError().text;
  heard = Heard{{}, false, true};
  const long raised = sample.WriteXsdFile(U("inventory.xsd"));
  long other = VLX_E_FAIL;
  std::thread([&] { other = sample.WriteXmlFile(U(root + "/other.xml"), 0, 0); }).join();
  ASSERT_EQ(VLX_S_OK, VLXKDMReplica::SetProgressHandler(nullptr, nullptr));
  ASSERT_EQ(0, chdir(started));
  EXPECT_EQ(VLX_S_OK, written);
  EXPECT_EQ(VLX_S_OK, read);
  EXPECT_EQ(VLX_S_OK, other);
  EXPECT_LT(stopped, 0);
  EXPECT_LT(raised, 0);
  EXPECT_TRUE(Has(why, "stopped by the progress handler")) << why;
  EXPECT_EQ("old", FileText(root + "/inventory.xml"));
  EXPECT_FALSE(std::ifstream(root + "/inventory.xsd").good());
  VLXBinary bytes;
  ASSERT_EQ(VLX_S_OK, VLXKDMReplica::GetBinaryFromReplica(back, 0, bytes));
  ASSERT_EQ(VLX_S_OK, VLXKDMReplica::GetReplicaFromBinary(bytes, fromBytes));
  VLXUnicodeString name;
  EXPECT_EQ(VLX_S_OK, fromBytes.GetName(name));
  EXPECT_EQ("inventory", Text(name));
  ASSERT_GE(figures.size(), 2u);  // at least the end of the write and of the read
  for (const auto& f : figures) EXPECT_LE(f.first, f.second);
  EXPECT_EQ(figures.back().second, figures.back().first);
  std::system(("rm -rf " + root).c_str());
}

}  // namespace
