// A text held as UTF-8 bytes.
//
// The string is a value type. It holds any bytes, embedded NUL included; c_str() always ends them
// with one more NUL so that the text can be handed to C functions. Whether the bytes are
// well-formed UTF-8 is checked only on request (IsWellFormed, FirstMalformedOffset): the Java
// converters refuse malformed text, nothing else does.
#ifndef VLXUnicodeString_h
#define VLXUnicodeString_h

#include <string>

class VLXUnicodeString {
 public:
  VLXUnicodeString() = default;
  // The NUL-terminated text; null gives the empty string.
  VLXUnicodeString(const char* utf8);
  // `length` bytes from `bytes`, NUL bytes included; a null `bytes` or a length below 1 gives the
  // empty string.
  VLXUnicodeString(const char* bytes, int length);
  VLXUnicodeString(const VLXUnicodeString&) = default;
  VLXUnicodeString(VLXUnicodeString&&) noexcept = default;
  ~VLXUnicodeString() = default;

  VLXUnicodeString& operator=(const VLXUnicodeString&) = default;
  VLXUnicodeString& operator=(VLXUnicodeString&&) noexcept = default;
  // Replaces the text by the NUL-terminated `utf8` (null gives the empty string).
  VLXUnicodeString& operator=(const char* utf8);

  // The bytes followed by a NUL. Valid until the string is next changed or destroyed.
  const char* c_str() const { return _bytes.c_str(); }
  // The number of bytes, the terminating NUL not counted.
  int GetLengthInByte() const { return static_cast<int>(_bytes.size()); }

  // 1 when the bytes are well-formed UTF-8 (no overlong form, no encoded surrogate U+D800..U+DFFF,
  // nothing above U+10FFFF, no truncated sequence, no stray continuation byte), else 0.
  // The empty string is well-formed.
  int IsWellFormed() const;
  // The byte offset (from 0) at which the first ill-formed sequence starts, or -1 when the text is
  // well-formed. When `reason` is not null it receives a short English description of the fault
  // ("truncated sequence", ...), or null when the text is well-formed.
  int FirstMalformedOffset(const char** reason = nullptr) const;

  // The same check on any byte range.
  static int FirstMalformedOffset(const char* bytes, int length, const char** reason);

  // The UTF-16 form of `length` well-formed UTF-8 bytes (check them with FirstMalformedOffset
  // first) written to `units`, which has room for `length` units (never more are needed); returns
  // the number of units. Supplementary characters become surrogate pairs, NUL stays NUL.
  static int DecodeUtf8(const char* bytes, int length, unsigned short* units);
  // The UTF-8 form of `count` UTF-16 units written to `bytes`, which has room for 3 bytes per unit;
  // returns the number of bytes. An unpaired surrogate (a high one ending the units included)
  // stops the encoding with -1 - its index, or with `lossy` becomes U+FFFD.
  static long EncodeUtf16(const unsigned short* units, int count, char* bytes, bool lossy);

  int operator==(const VLXUnicodeString& other) const { return _bytes == other._bytes; }
  int operator!=(const VLXUnicodeString& other) const { return _bytes != other._bytes; }

 private:
  std::string _bytes;
};

#endif
