// corvexa::Error: the one exception of the modern interface.
#pragma once

#include <stdexcept>
#include <string>
#include <vector>

#include "CorvexaExport.h"

namespace corvexa {

// A failed operation: its result code, the thread's last error (id and parameters) and a message
// "<operation>: <cause> [<last error's id>]".
class CORVEXA_API Error : public std::runtime_error {
 public:
  Error(long code, std::string operation, std::string cause, std::string id, std::vector<std::string> parameters);

  // The result code of the failure (negative).
  [[nodiscard]] long code() const noexcept { return _code; }
  // The operation that failed, e.g. "Instance::get<int>(\"quantity\")".
  [[nodiscard]] const std::string& operation() const noexcept { return _operation; }
  // What went wrong: the last error's message text.
  [[nodiscard]] const std::string& cause() const noexcept { return _cause; }
  // The last error's message id ("VLXJBXInfraERR_1005"), or empty when none was recorded.
  [[nodiscard]] const std::string& id() const noexcept { return _id; }
  [[nodiscard]] const std::vector<std::string>& parameters() const noexcept { return _parameters; }

 private:
  long _code;
  std::string _operation;
  std::string _cause;
  std::string _id;
  std::vector<std::string> _parameters;
};

}  // namespace corvexa
