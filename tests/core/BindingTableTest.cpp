// The binding table as filled against the real replica package, read row by row from
// BindingTable.def itself: each slot holds what its row names, in row order.
#include <fstream>
#include <map>
#include <regex>

#include "CallFrame.h"
#include "TestSupport.h"

using namespace corvexa_test;

namespace {

// A row's quoted argument: string literals and the file's own #define'd prefixes, concatenated.
std::string Literal(const std::string& text, const std::map<std::string, std::string>& prefixes)
{
  std::string out;
  static const std::regex part("\"([^\"]*)\"|([A-Z]+)");
  for (auto it = std::sregex_iterator(text.begin(), text.end(), part); it != std::sregex_iterator(); ++it)
    out += (*it)[1].matched ? (*it)[1].str() : prefixes.at((*it)[2].str());
  return out;
}

TEST(BindingTable, EverySlotHoldsWhatItsRowNames)
{
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build());
  const ReplicaStubs* table = corvexa::FrameAccess::Table();
  ASSERT_TRUE(table && table->IsBound());
  JNIEnv* env = Env();

  std::ifstream def(CORVEXA_BINDING_TABLE);
  ASSERT_TRUE(def) << CORVEXA_BINDING_TABLE;
  static const std::regex define("#define ([A-Z]+) \"([^\"]*)\"");
  static const std::regex row(
      "^(CLASS|METHOD|STATIC|SETTER_FIRST|CONSTANT|RESERVED)\\((\\w+)(?:, ([^,]+))?(?:, (.+))?\\)$");
  std::map<std::string, std::string> prefixes;
  std::string line;
  int slot = 0;
  Local cls;
  std::string classPath;
  while (std::getline(def, line)) {
    std::smatch m;
    if (std::regex_search(line, m, define)) prefixes[m[1]] = m[2];
    if (!std::regex_match(line, m, row)) continue;
    SCOPED_TRACE(line);
    ASSERT_LT(slot, corvexa::SlotCount);
    const auto at = static_cast<corvexa::Slot>(slot++);
    const std::string kind = m[1], first = m[3].matched ? Literal(m[3], prefixes) : "";
    const std::string second = m[4].matched ? Literal(m[4], prefixes) : "";
    if (kind == "CLASS") {
      classPath = first;
      cls.reset(env->FindClass(first.c_str()));
      ASSERT_TRUE(NoPending(first.c_str()) && cls.get());
      EXPECT_TRUE(Same(table->Class(at), cls.get()));
    } else if (kind == "RESERVED") {
      EXPECT_EQ(nullptr, table->Constant(at));
    } else if (kind == "CONSTANT") {
      const jclass c = static_cast<jclass>(cls.get());
      const jfieldID field = env->GetStaticFieldID(c, first.c_str(), ("L" + classPath + ";").c_str());
      ASSERT_TRUE(NoPending(first.c_str()) && field);
      Local constant(env->GetStaticObjectField(c, field));
      EXPECT_TRUE(Same(table->Constant(at), constant.get()));
    } else {
      const jclass c = static_cast<jclass>(cls.get());
      const jmethodID method = kind == "STATIC" ? env->GetStaticMethodID(c, first.c_str(), second.c_str())
                                                : env->GetMethodID(c, first.c_str(), second.c_str());
      ASSERT_TRUE(NoPending(second.c_str()) && method);
      EXPECT_EQ(method, table->Method(at));
    }
  }
  EXPECT_EQ(corvexa::SlotCount, slot);
}

}  // namespace
