// The hand-written baseline's string conversions: what a careful programmer writing JNI by hand
// does to pass UTF-8 text to Java and back exactly (NewString / GetStringRegion with UTF-16, not the
// modified UTF-8 of NewStringUTF). Malformed UTF-8 is refused, as the library refuses it.
#pragma once

#include <jni.h>

#include <vector>

#include "VLXUnicodeString.h"

namespace corvexa_bench {

// Decodes UTF-8 into UTF-16 units; false when the bytes are not well-formed UTF-8.
inline bool Utf8ToUtf16(const unsigned char* s, int length, jchar* units, jsize& count)
{
  jsize n = 0;
  for (int i = 0; i < length;) {
    const unsigned b = s[i];
    unsigned long c;
    int extra;
    unsigned long least;
    if (b < 0x80) {
      units[n++] = static_cast<jchar>(b);
      ++i;
      continue;
    } else if (b >= 0xC2 && b < 0xE0) {
      c = b & 0x1Fu, extra = 1, least = 0x80;
    } else if (b >= 0xE0 && b < 0xF0) {
      c = b & 0x0Fu, extra = 2, least = 0x800;
    } else if (b >= 0xF0 && b < 0xF5) {
      c = b & 0x07u, extra = 3, least = 0x10000;
    } else {
      return false;
    }
    if (i + extra >= length) return false;  // truncated sequence
    for (int k = 1; k <= extra; ++k) {
      const unsigned t = s[i + k];
      if ((t & 0xC0u) != 0x80u) return false;
      c = (c << 6) | (t & 0x3Fu);
    }
    if (c < least || c > 0x10FFFF || (c >= 0xD800 && c <= 0xDFFF)) return false;
    if (c >= 0x10000) {
      c -= 0x10000;
      units[n++] = static_cast<jchar>(0xD800 + (c >> 10));
      units[n++] = static_cast<jchar>(0xDC00 + (c & 0x3FF));
    } else {
      units[n++] = static_cast<jchar>(c);
    }
    i += extra + 1;
  }
  count = n;
  return true;
}

// A new local reference to the Java string of text, or null (no exception pending) when the text
// is not well-formed UTF-8 or Java could not make the string (exception pending then).
inline jstring NewJavaString(JNIEnv* env, const VLXUnicodeString& text)
{
  const int length = text.GetLengthInByte();
  jchar small[256];
  std::vector<jchar> large;
  jchar* units = small;
  if (length > 256) {
    large.resize(static_cast<size_t>(length));
    units = large.data();
  }
  jsize count = 0;
  if (!Utf8ToUtf16(reinterpret_cast<const unsigned char*>(text.c_str()), length, units, count)) return nullptr;
  return env->NewString(units, count);
}

// Encodes UTF-16 units as UTF-8 (an unpaired surrogate becomes U+FFFD); returns the byte count.
// out must hold 3 bytes per unit.
inline int Utf16ToUtf8(const jchar* units, jsize count, char* out)
{
  int n = 0;
  for (jsize i = 0; i < count; ++i) {
    unsigned long c = units[i];
    if (c >= 0xD800 && c <= 0xDBFF && i + 1 < count && units[i + 1] >= 0xDC00 && units[i + 1] <= 0xDFFF) {
      c = 0x10000 + ((c - 0xD800) << 10) + (units[i + 1] - 0xDC00);
      ++i;
    } else if (c >= 0xD800 && c <= 0xDFFF) {
      c = 0xFFFD;
    }
    if (c < 0x80) {
      out[n++] = static_cast<char>(c);
    } else if (c < 0x800) {
      out[n++] = static_cast<char>(0xC0 | (c >> 6));
      out[n++] = static_cast<char>(0x80 | (c & 0x3F));
    } else if (c < 0x10000) {
      out[n++] = static_cast<char>(0xE0 | (c >> 12));
      out[n++] = static_cast<char>(0x80 | ((c >> 6) & 0x3F));
      out[n++] = static_cast<char>(0x80 | (c & 0x3F));
    } else {
      out[n++] = static_cast<char>(0xF0 | (c >> 18));
      out[n++] = static_cast<char>(0x80 | ((c >> 12) & 0x3F));
      out[n++] = static_cast<char>(0x80 | ((c >> 6) & 0x3F));
      out[n++] = static_cast<char>(0x80 | (c & 0x3F));
    }
  }
  return n;
}

// Reads a Java string (not null) into text; false with an exception pending when Java failed.
inline bool ReadJavaString(JNIEnv* env, jstring string, VLXUnicodeString& text)
{
  const jsize count = env->GetStringLength(string);
  jchar smallUnits[256];
  char smallBytes[3 * 256];
  std::vector<jchar> largeUnits;
  std::vector<char> largeBytes;
  jchar* units = smallUnits;
  char* bytes = smallBytes;
  if (count > 256) {
    largeUnits.resize(static_cast<size_t>(count));
    largeBytes.resize(3 * static_cast<size_t>(count));
    units = largeUnits.data();
    bytes = largeBytes.data();
  }
  env->GetStringRegion(string, 0, count, units);
  if (env->ExceptionCheck()) return false;
  text = VLXUnicodeString(bytes, Utf16ToUtf8(units, count, bytes));
  return true;
}

}  // namespace corvexa_bench
