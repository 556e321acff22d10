#include "VLXBinary.h"

#include <cstring>

VLXBinary::VLXBinary(int length)
{
  if (length > 0) _bytes.assign(static_cast<size_t>(length), 0);
}

VLXBinary::VLXBinary(const void* data, int length)
{
  if (data != nullptr && length > 0) {
    const unsigned char* p = static_cast<const unsigned char*>(data);
    _bytes.assign(p, p + length);
  }
}
