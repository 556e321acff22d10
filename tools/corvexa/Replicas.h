// What the corvexa tool does with replica files: the forms it recognises by their content, reading
// and writing each, and the failures it reports (one sentence and an exit code).
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "VLXKDMReplica.h"

namespace corvexa_tool {

// Exit codes, as documented in the tool's help.
enum Exit : int { kOk = 0, kInvalid = 1, kUsage = 2, kOther = 3 };

// A failure of the tool: the exit code and one sentence naming the file and the cause.
struct Failure {
  int code;
  std::string message;
};
[[noreturn]] void Fail(int code, const std::string& message);
// A text's UTF-8 bytes as a string.
std::string Text(const VLXUnicodeString& s);
// The thread's last error, as one line (empty when there is none).
std::string LastError();
// Fails with code and "what: the last error" when rc is a failure.
void Check(long rc, int code, const std::string& what);

enum class Form { Xml, XmlWithSchema, Binary, Compressed, Xsd };
const char* FormName(Form form);
// The form of a file, from its first bytes (not its name); fails for anything else.
Form Detect(const std::string& path);
// The form a name's extension asks for (.xml, .xsd, .bin); false when it asks for none.
bool FormOfName(const std::string& path, Form& form);

// A replica read from a file of any form (an XSD gives the schema without instances). Reading
// fails with kInvalid for a document or data the readers refuse, kOther when the file cannot be read.
VLXKDMReplica Read(const std::string& path);
VLXKDMReplica Read(const std::string& path, Form form);
// Writes the replica in a form (XML with or without schema and states), streamed.
void Write(VLXKDMReplica& replica, const std::string& path, Form form, bool withSchema, bool withState);

// The schema, for the tool's listings.
struct Attribute {
  std::string name;
  int type;  // VLXKDMAttributeType::Type
  bool multi, mandatory, composition;
  std::vector<std::string> targets;
};
struct ClassInfo {
  std::string name, superName;
  std::vector<Attribute> own;  // declared by the class
  std::vector<Attribute> all;  // inherited ones first, in layout order
  long instances = 0;
};
std::vector<ClassInfo> Classes(VLXKDMReplica& replica);
const char* TypeName(int type);

// The calling thread's progress bar on standard error (only when it is a terminal, and only for
// work that lasts more than about a second); Ctrl-C stops the operation through the handler.
void StartProgress();

}  // namespace corvexa_tool
