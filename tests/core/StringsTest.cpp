// Texts cross to Java and back byte for byte; malformed UTF-8 is refused before any Java call.
#include <string>

#include <gtest/gtest.h>

#include "JavaTestSupport.h"
#include "VLXKDMReplica.h"

using namespace corvexa_test;

namespace {

TEST(Strings, NamesSurviveARoundTripByteForByte)
{
  const std::string samples[] = {
      "plain",
      "Zo\xC3\xAB \xC3\x85ngstr\xC3\xB6m, na\xC3\xAFve caf\xC3\xA9",            // Latin accents
      "\xE6\x95\xB0\xE6\x8D\xAE\xE5\x89\xAF\xE6\x9C\xAC",                        // CJK
      "fox \xF0\x9F\xA6\x8A rocket \xF0\x9F\x9A\x80",                            // outside the BMP
      std::string("nul\0inside\0", 12),                                          // embedded NUL
      "\xEF\xBF\xBF edge \xF4\x8F\xBF\xBF",                                      // U+FFFF, U+10FFFF
      "",
      std::string(70000, 'x'),
  };
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build());
  for (const std::string& sample : samples) {
    SCOPED_TRACE(sample.substr(0, 40));
    ASSERT_EQ(VLX_S_OK, replica.SetName(VLXUnicodeString(sample.data(), static_cast<int>(sample.size()))));
    VLXUnicodeString back("stale");
    ASSERT_EQ(VLX_S_OK, replica.GetName(back));
    EXPECT_EQ(sample, Text(back));
  }
}

TEST(Strings, MalformedUtf8GivesTheRawCodeOrTheTranslatedOneAsEachOperationSays)
{
  VLXKDMReplica replica;
  ASSERT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString("kept")));
  const char* const malformed[] = {"bad \xC3\x28 byte", "\xED\xA0\x80 surrogate", "\xC0\xAF overlong",
                                   "cut \xE6\x95", "\xF5\x80\x80\x80 too big"};
  for (const char* text : malformed) {
    SCOPED_TRACE(text);
    ClearLastError();
    // SetName returns the converter's own code, untranslated.
    const long raw = replica.SetName(VLXUnicodeString(text));
    EXPECT_LT(raw, 0);
    EXPECT_NE(VLX_E_FAIL, raw);
    const LastError error = PeekLastError();
    EXPECT_NE(std::string::npos, error.text.find("UTF-8")) << error.text;

    // GetClassDef passes the same failure through the error translation.
    VLXKDMClassDef classDef;
    EXPECT_EQ(VLX_E_FAIL, replica.GetClassDef(VLXUnicodeString(text), classDef));
    EXPECT_EQ(nullptr, classDef.GetHandle());
  }
  VLXUnicodeString name;
  ASSERT_EQ(VLX_S_OK, replica.GetName(name));
  EXPECT_EQ("kept", Text(name));
}

}  // namespace
