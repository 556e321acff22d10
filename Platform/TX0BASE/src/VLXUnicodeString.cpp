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

int VLXUnicodeString::DecodeUtf8(const char* bytes, int length, unsigned short* units)
{
  const unsigned char* s = reinterpret_cast<const unsigned char*>(bytes);
  int n = 0;
  int i = 0;
  while (i < length) {
    unsigned long c;
    const unsigned char b = s[i];
    if (b < 0x80) {
      c = b;
      i += 1;
    } else if (b < 0xE0) {
      c = ((b & 0x1Fu) << 6) | (s[i + 1] & 0x3Fu);
      i += 2;
    } else if (b < 0xF0) {
      c = ((b & 0x0Fu) << 12) | ((s[i + 1] & 0x3Fu) << 6) | (s[i + 2] & 0x3Fu);
      i += 3;
    } else {
      c = ((b & 0x07u) << 18) | ((s[i + 1] & 0x3Fu) << 12) | ((s[i + 2] & 0x3Fu) << 6) | (s[i + 3] & 0x3Fu);
      i += 4;
    }
    if (c >= 0x10000) {
      c -= 0x10000;
      units[n++] = static_cast<unsigned short>(0xD800 + (c >> 10));
      units[n++] = static_cast<unsigned short>(0xDC00 + (c & 0x3FF));
    } else {
      units[n++] = static_cast<unsigned short>(c);
    }
  }
  return n;
}

long VLXUnicodeString::EncodeUtf16(const unsigned short* units, int count, char* bytes, bool lossy)
{
  long n = 0;
  for (int i = 0; i < count; ++i) {
    unsigned long c = units[i];
    if (c >= 0xD800 && c <= 0xDBFF && i + 1 < count && units[i + 1] >= 0xDC00 && units[i + 1] <= 0xDFFF) {
      c = 0x10000 + ((c - 0xD800) << 10) + (units[i + 1] - 0xDC00);
      ++i;
    } else if (c >= 0xD800 && c <= 0xDFFF) {
      if (!lossy) return -1 - static_cast<long>(i);
      c = 0xFFFD;
    }
    if (c < 0x80) {
      bytes[n++] = static_cast<char>(c);
    } else if (c < 0x800) {
      bytes[n++] = static_cast<char>(0xC0 | (c >> 6));
      bytes[n++] = static_cast<char>(0x80 | (c & 0x3F));
    } else if (c < 0x10000) {
      bytes[n++] = static_cast<char>(0xE0 | (c >> 12));
      bytes[n++] = static_cast<char>(0x80 | ((c >> 6) & 0x3F));
      bytes[n++] = static_cast<char>(0x80 | (c & 0x3F));
    } else {
      bytes[n++] = static_cast<char>(0xF0 | (c >> 18));
      bytes[n++] = static_cast<char>(0x80 | ((c >> 12) & 0x3F));
      bytes[n++] = static_cast<char>(0x80 | ((c >> 6) & 0x3F));
      bytes[n++] = static_cast<char>(0x80 | (c & 0x3F));
    }
  }
  return n;
}
