// VLXUnicodeString: bytes, embedded NUL, copies, and the UTF-8 well-formedness check.
#include "VLXUnicodeString.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>

namespace {

std::string Bytes(const VLXUnicodeString& s)
{
  return std::string(s.c_str(), static_cast<size_t>(s.GetLengthInByte()));
}

TEST(UnicodeString, NullInputsEmbeddedNulAndIndependentCopies)
{
  for (const VLXUnicodeString& s : {VLXUnicodeString(static_cast<const char*>(nullptr)), VLXUnicodeString(nullptr, 5),
                                    VLXUnicodeString("abc", 0), VLXUnicodeString("abc", -1)})
    EXPECT_EQ(s.GetLengthInByte(), 0);
  const VLXUnicodeString a("a\0b", 3);
  EXPECT_EQ(std::memcmp(a.c_str(), "a\0b\0", 4), 0) << "bytes followed by one NUL";
  EXPECT_TRUE(a == VLXUnicodeString("a\0b", 3));
  EXPECT_TRUE(a != VLXUnicodeString("a\0c", 3));
  EXPECT_TRUE(a != VLXUnicodeString("a"));

  VLXUnicodeString original("h\xC3\xA9llo"), copy(original);
  original = "other";
  EXPECT_EQ(Bytes(copy), "h\xC3\xA9llo");
  copy = copy.c_str() + 1;  // a suffix of its own bytes
  EXPECT_EQ(Bytes(copy), "\xC3\xA9llo");
  copy = static_cast<const char*>(nullptr);
  EXPECT_STREQ(copy.c_str(), "");
}

TEST(UnicodeString, FirstMalformedOffsetNamesTheFirstIllFormedSequenceAndWhy)
{
  const struct {
    std::string bytes;
    int offset /* -1: well-formed */;
    const char* reason;
  } cases[] = {
      {"", -1, ""},
      {std::string("a\0b", 3), -1, ""},
      {"\xC2\x80\xDF\xBF", -1, ""},
      {"\xE0\xA0\x80\xE2\x82\xAC\xEF\xBF\xBF", -1, ""},
      {"\xED\x9F\xBF\xEE\x80\x80", -1, ""},
      {"\xF0\x90\x80\x80\xF0\x9F\x98\x80", -1, ""},
      {"\xF4\x8F\xBF\xBF", -1, ""},
      {"ab\xC0\x80", 2, "overlong"},
      {"\xC1\xBF", 0, "overlong"},
      {"x\xE0\x9F\xBF", 1, "overlong"},
      {"\xF0\x8F\xBF\xBF", 0, "overlong"},
      {"\xED\xA0\x80", 0, "surrogate"},
      {"ok\xED\xBF\xBF", 2, "surrogate"},
      {"\xF4\x90\x80\x80", 0, "above U+10FFFF"},
      {"\xF5\x80\x80\x80", 0, "above U+10FFFF"},
      {"abc\xE2\x82", 3, "truncated"},
      {"\xF0\x9F\x98", 0, "truncated"},
      {"\xC3", 0, "truncated"},
      {"\xE2\x28\xA1", 0, "truncated"},
      {std::string("\xC3\0", 2), 0, "truncated"},
      {"a\x80", 1, "continuation"},
      {"\xC3\xA9\xA9", 2, "continuation"},
      {"abc\xFF", 3, "never occurs"},
      {"\xF8\x88\x80\x80\x80", 0, "never occurs"},
      {"\xC3\xA9\x80\xFF", 2, "continuation"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(::testing::PrintToString(c.bytes));
    const VLXUnicodeString s(c.bytes.data(), static_cast<int>(c.bytes.size()));
    const char* reason = "unset";
    EXPECT_EQ(s.FirstMalformedOffset(&reason), c.offset);
    EXPECT_EQ(s.IsWellFormed(), c.offset < 0 ? 1 : 0);
    if (c.offset < 0)
      EXPECT_EQ(reason, nullptr);
    else
      EXPECT_NE(std::string(reason ? reason : "").find(c.reason), std::string::npos) << reason;
  }
}

}  // namespace
