// A byte buffer (value type).
#ifndef VLXBinary_h
#define VLXBinary_h

#include <vector>

class VLXBinary {
 public:
  VLXBinary() = default;
  // `length` zero bytes (a length below 1 gives the empty buffer).
  explicit VLXBinary(int length);
  // A copy of `length` bytes from `data` (null data or a length below 1 gives the empty buffer).
  VLXBinary(const void* data, int length);
  VLXBinary(const VLXBinary&) = default;
  VLXBinary(VLXBinary&&) noexcept = default;
  ~VLXBinary() = default;
  VLXBinary& operator=(const VLXBinary&) = default;
  VLXBinary& operator=(VLXBinary&&) noexcept = default;

  int getLength() const { return static_cast<int>(_bytes.size()); }
  // The bytes; null when the buffer is empty.
  const unsigned char* getData() const { return _bytes.empty() ? nullptr : _bytes.data(); }
  unsigned char* getData() { return _bytes.empty() ? nullptr : _bytes.data(); }

  int operator==(const VLXBinary& other) const { return _bytes == other._bytes; }
  int operator!=(const VLXBinary& other) const { return _bytes != other._bytes; }

 private:
  std::vector<unsigned char> _bytes;
};

#endif
