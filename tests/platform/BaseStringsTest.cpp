// VLXUnicodeString: bytes, embedded NUL, and the UTF-8 well-formedness check.
#include "VLXUnicodeString.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>

namespace
{

TEST(UnicodeString, NullAndEmptyInputsGiveTheEmptyString)
{
  EXPECT_EQ(VLXUnicodeString(static_cast<const char*>(nullptr)).GetLengthInByte(), 0);
  EXPECT_EQ(VLXUnicodeString(nullptr, 5).GetLengthInByte(), 0);
  EXPECT_EQ(VLXUnicodeString("abc", 0).GetLengthInByte(), 0);
  EXPECT_EQ(VLXUnicodeString("abc", -1).GetLengthInByte(), 0);
  VLXUnicodeString s("text");
  s = static_cast<const char*>(nullptr);
  EXPECT_EQ(s.GetLengthInByte(), 0);
  EXPECT_STREQ(s.c_str(), "");
}

TEST(UnicodeString, EmbeddedNulIsKeptCountedAndCompared)
{
  const VLXUnicodeString a("a\0b", 3);
  EXPECT_EQ(a.GetLengthInByte(), 3);
  EXPECT_EQ(std::memcmp(a.c_str(), "a\0b\0", 4), 0) << "bytes followed by one NUL";
  EXPECT_TRUE(a != VLXUnicodeString("a\0c", 3));
  EXPECT_TRUE(a != VLXUnicodeString("a"));
  EXPECT_TRUE(a == VLXUnicodeString("a\0b", 3));
  EXPECT_EQ(a.IsWellFormed(), 1);
}

TEST(UnicodeString, CopiesAreIndependentAndSelfAssignmentFromOwnBytesWorks)
{
  VLXUnicodeString original("h\xC3\xA9llo");
  VLXUnicodeString copy(original);
  original = "other";
  EXPECT_STREQ(copy.c_str(), "h\xC3\xA9llo");
  EXPECT_EQ(copy.GetLengthInByte(), 6);
  // Assigning a suffix of its own bytes.
  copy = copy.c_str() + 1;
  EXPECT_STREQ(copy.c_str(), "\xC3\xA9llo");
  VLXUnicodeString moved(std::move(copy));
  EXPECT_STREQ(moved.c_str(), "\xC3\xA9llo");
}

struct Utf8Case
{
  const char* name;
  std::string bytes;
  int offset;         // -1: well-formed
  const char* reason; // substring of the reported reason
};

class Utf8Check : public ::testing::TestWithParam<Utf8Case>
{
};

TEST_P(Utf8Check, ReportsTheFirstIllFormedSequenceAndWhy)
{
  const Utf8Case& c = GetParam();
  const VLXUnicodeString s(c.bytes.data(), static_cast<int>(c.bytes.size()));
  const char* reason = "unset";
  EXPECT_EQ(s.FirstMalformedOffset(&reason), c.offset);
  EXPECT_EQ(s.IsWellFormed(), c.offset < 0 ? 1 : 0);
  if (c.offset < 0) {
    EXPECT_EQ(reason, nullptr);
  } else {
    ASSERT_NE(reason, nullptr);
    EXPECT_NE(std::string(reason).find(c.reason), std::string::npos) << reason;
  }
}

std::string B(const char* s, size_t n) { return std::string(s, n); }

INSTANTIATE_TEST_SUITE_P(
    Table, Utf8Check,
    ::testing::Values(
        Utf8Case{"empty", "", -1, ""}, Utf8Case{"ascii", "plain text", -1, ""},
        Utf8Case{"nul", B("a\0b", 3), -1, ""}, Utf8Case{"twoByte", "\xC2\x80\xDF\xBF", -1, ""},
        Utf8Case{"threeByte", "\xE0\xA0\x80\xE2\x82\xAC\xEF\xBF\xBF", -1, ""},
        Utf8Case{"beforeSurrogates", "\xED\x9F\xBF", -1, ""}, Utf8Case{"afterSurrogates", "\xEE\x80\x80", -1, ""},
        Utf8Case{"fourByte", "\xF0\x90\x80\x80\xF0\x9F\x98\x80", -1, ""},
        Utf8Case{"lastCodePoint", "\xF4\x8F\xBF\xBF", -1, ""},
        Utf8Case{"overlongTwoByteC0", "ab\xC0\x80", 2, "overlong"},
        Utf8Case{"overlongTwoByteC1", "\xC1\xBF", 0, "overlong"},
        Utf8Case{"overlongThreeByte", "x\xE0\x9F\xBF", 1, "overlong"},
        Utf8Case{"overlongFourByte", "\xF0\x8F\xBF\xBF", 0, "overlong"},
        Utf8Case{"highSurrogate", "\xED\xA0\x80", 0, "surrogate"},
        Utf8Case{"lowSurrogateAfterText", "ok\xED\xBF\xBF", 2, "surrogate"},
        Utf8Case{"aboveMaxF4", "\xF4\x90\x80\x80", 0, "above U+10FFFF"},
        Utf8Case{"aboveMaxF5", "\xF5\x80\x80\x80", 0, "above U+10FFFF"},
        Utf8Case{"truncatedAtEnd", "abc\xE2\x82", 3, "truncated"},
        Utf8Case{"truncatedFourByte", "\xF0\x9F\x98", 0, "truncated"},
        Utf8Case{"loneLead", "\xC3", 0, "truncated"},
        Utf8Case{"cutByAscii", "\xE2\x28\xA1", 0, "truncated"},
        Utf8Case{"cutByNul", B("\xC3\0", 2), 0, "truncated"},
        Utf8Case{"strayContinuation", "a\x80", 1, "continuation"},
        Utf8Case{"extraContinuation", "\xC3\xA9\xA9", 2, "continuation"},
        Utf8Case{"invalidByteFF", "abc\xFF", 3, "never occurs"},
        Utf8Case{"fiveByteForm", "\xF8\x88\x80\x80\x80", 0, "never occurs"},
        Utf8Case{"firstFaultWins", "\xC3\xA9\x80\xFF", 2, "continuation"}),
    [](const ::testing::TestParamInfo<Utf8Case>& info) { return std::string(info.param.name); });

} // namespace
