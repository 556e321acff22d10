#include "VLXUnicodeString.h"

#include <cstring>

VLXUnicodeString::VLXUnicodeString(const char* utf8) : _bytes(utf8 ? utf8 : "") {}

VLXUnicodeString::VLXUnicodeString(const char* bytes, int length)
{
  if (bytes != nullptr && length > 0) _bytes.assign(bytes, static_cast<size_t>(length));
}

VLXUnicodeString& VLXUnicodeString::operator=(const char* utf8)
{
  // `utf8` may point into this string's own bytes: assign() copes with that.
  if (utf8 == nullptr)
    _bytes.clear();
  else
    _bytes.assign(utf8, std::strlen(utf8));
  return *this;
}

int VLXUnicodeString::IsWellFormed() const { return FirstMalformedOffset(nullptr) < 0 ? 1 : 0; }

int VLXUnicodeString::FirstMalformedOffset(const char** reason) const
{
  return FirstMalformedOffset(_bytes.data(), GetLengthInByte(), reason);
}

namespace {
bool IsContinuation(unsigned char b) { return (b & 0xC0) == 0x80; }
}  // namespace

// Well-formed sequences (Unicode, table "Well-Formed UTF-8 Byte Sequences"):
//   00..7F | C2..DF 80..BF | E0 A0..BF 80..BF | E1..EC 80..BF 80..BF | ED 80..9F 80..BF
//   | EE..EF 80..BF 80..BF | F0 90..BF 80..BF 80..BF | F1..F3 80..BF 80..BF 80..BF | F4 80..8F 80..BF 80..BF
int VLXUnicodeString::FirstMalformedOffset(const char* bytes, int length, const char** reason)
{
  const unsigned char* s = reinterpret_cast<const unsigned char*>(bytes);
  const char* why = nullptr;
  int i = 0;
  while (i < length) {
    const unsigned char b = s[i];
    if (b < 0x80) {
      ++i;
      continue;
    }
    int need;                            // continuation bytes after the lead byte
    unsigned char lo = 0x80, hi = 0xBF;  // allowed range of the second byte
    const char* secondFault = nullptr;   // what a second byte outside [lo, hi] means
    if (IsContinuation(b)) {
      why = "unexpected continuation byte";
      break;
    } else if (b == 0xC0 || b == 0xC1) {
      why = "overlong encoding";
      break;
    } else if (b <= 0xDF) {
      need = 1;
    } else if (b <= 0xEF) {
      need = 2;
      if (b == 0xE0) {
        lo = 0xA0;
        secondFault = "overlong encoding";
      } else if (b == 0xED) {
        hi = 0x9F;
        secondFault = "encoded surrogate (U+D800..U+DFFF)";
      }
    } else if (b <= 0xF4) {
      need = 3;
      if (b == 0xF0) {
        lo = 0x90;
        secondFault = "overlong encoding";
      } else if (b == 0xF4) {
        hi = 0x8F;
        secondFault = "code point above U+10FFFF";
      }
    } else if (b <= 0xF7) {
      why = "code point above U+10FFFF";
      break;
    } else {
      why = "byte that never occurs in UTF-8";
      break;
    }
    for (int k = 1; k <= need; ++k) {
      if (i + k >= length || !IsContinuation(s[i + k])) {
        why = "truncated sequence";
        break;
      }
      if (k == 1 && (s[i + 1] < lo || s[i + 1] > hi)) {
        why = secondFault;
        break;
      }
    }
    if (why != nullptr) break;
    i += need + 1;
  }
  if (reason != nullptr) *reason = why;
  return why != nullptr ? i : -1;
}
