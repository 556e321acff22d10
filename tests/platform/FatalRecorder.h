// Installs, for its scope, a fatal-error handler that records the calling thread's reports and returns.
#ifndef FatalRecorder_h
#define FatalRecorder_h

#include "VLXFatalError.h"

#include <string>
#include <vector>

struct FatalReport {
  std::string message, file;
  int line;
};

class FatalRecorder {
 public:
  FatalRecorder() : _previous(VLXSetFatalErrorHandler(&Record)) { Reports().clear(); }
  ~FatalRecorder() { VLXSetFatalErrorHandler(_previous); }
  FatalRecorder(const FatalRecorder&) = delete;
  FatalRecorder& operator=(const FatalRecorder&) = delete;
  static std::vector<FatalReport>& Reports()
  {
    static thread_local std::vector<FatalReport> reports;
    return reports;
  }

 private:
  static void Record(const char* message, const char* file, int line)
  {
    Reports().push_back({message ? message : "", file ? file : "", line});
  }
  VLXFatalErrorHandler _previous;
};

#endif
