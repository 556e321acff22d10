#include "VLXFatalError.h"

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <string>

namespace {
void DefaultHandler(const char* message, const char* file, int line)
{
  std::fprintf(stderr, "Fatal error: %s (%s:%d)\n", message ? message : "", file ? file : "?", line);
  std::fflush(stderr);
  std::abort();
}

std::atomic<VLXFatalErrorHandler> g_handler{&DefaultHandler};
}  // namespace

void VLXFatalError(const char* message, const char* detail1, const char* detail2, const char* detail3, const char* file,
                   int line)
{
  const VLXFatalErrorHandler handler = g_handler.load(std::memory_order_acquire);
  if (detail1 == nullptr && detail2 == nullptr && detail3 == nullptr) {
    handler(message ? message : "", file, line);
    return;
  }
  std::string text = message ? message : "";
  for (const char* detail : {detail1, detail2, detail3})
    if (detail != nullptr) {
      if (!text.empty()) text += ' ';
      text += detail;
    }
  handler(text.c_str(), file, line);
}

VLXFatalErrorHandler VLXSetFatalErrorHandler(VLXFatalErrorHandler handler)
{
  return g_handler.exchange(handler ? handler : &DefaultHandler, std::memory_order_acq_rel);
}
