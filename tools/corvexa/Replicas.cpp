#include "Replicas.h"

#include <sys/stat.h>
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <fstream>

#include "VLXError.h"
#include "VLXKDMAttributeDef.h"
#include "VLXKDMAttributeDefList.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMInstanceSet.h"
#include "VLXKDMModel.h"
#include "VLXKDMModelSet.h"

namespace corvexa_tool {

void Fail(int code, const std::string& message) { throw Failure{code, message}; }

std::string Text(const VLXUnicodeString& s)
{
  return std::string(s.c_str(), static_cast<std::size_t>(s.GetLengthInByte()));
}

std::string LastError()
{
  VLXError* e = VLXError::VLXGetLastError(0, nullptr);
  if (!e) return "";
  std::string text = e->GetMessageText().c_str();
  e->Release();
  for (char& c : text)
    if (c == '\n' || c == '\r') c = ' ';
  return text;
}

void Check(long rc, int code, const std::string& what)
{
  if (rc < 0) Fail(code, what + ": " + LastError());
}

const char* FormName(Form form)
{
  switch (form) {
    case Form::Xml:
      return "XML document";
    case Form::XmlWithSchema:
      return "XML document with its schema";
    case Form::Binary:
      return "binary replica";
    case Form::Compressed:
      return "compressed binary replica";
    default:
      return "XSD schema";
  }
}

namespace {

bool Exists(const std::string& path)
{
  struct stat s;
  return stat(path.c_str(), &s) == 0;
}

// The local name of the next start tag at or after at (prolog, comments and declarations
// skipped); empty when there is none in the text.
std::string NextElement(const std::string& text, std::size_t& at)
{
  while ((at = text.find('<', at)) != std::string::npos) {
    ++at;
    if (at < text.size() && (text[at] == '?' || text[at] == '!' || text[at] == '/')) continue;
    std::size_t end = at;
    while (end < text.size() && !std::isspace(static_cast<unsigned char>(text[end])) && text[end] != '>' &&
           text[end] != '/')
      ++end;
    const std::string name = text.substr(at, end - at);
    const std::size_t colon = name.find(':');
    return colon == std::string::npos ? name : name.substr(colon + 1);
  }
  return "";
}

}  // namespace

Form Detect(const std::string& path)
{
  std::ifstream in(path, std::ios::binary);
  if (!in) Fail(kOther, path + ": " + (Exists(path) ? "the file cannot be read" : "no such file"));
  std::string head(64 * 1024, '\0');
  in.read(&head[0], static_cast<std::streamsize>(head.size()));
  head.resize(static_cast<std::size_t>(in.gcount()));
  if (head.compare(0, 4, "CVRB") == 0) return head.size() > 5 && (head[5] & 1) ? Form::Compressed : Form::Binary;
  std::size_t at = 0;
  const std::string root = NextElement(head, at);
  if (root == "schema") return Form::Xsd;
  if (root == "replica") return NextElement(head, at) == "schema" ? Form::XmlWithSchema : Form::Xml;
  Fail(kInvalid, path + ": not a replica document, an XSD schema or a binary replica" +
                     (root.empty() ? std::string(" (no XML element, no binary header)")
                                   : " (its first element is '" + root + "')"));
}

bool FormOfName(const std::string& path, Form& form)
{
  const std::size_t dot = path.rfind('.');
  const std::string ext = dot == std::string::npos ? "" : path.substr(dot + 1);
  if (ext == "xml")
    form = Form::Xml;
  else if (ext == "xsd")
    form = Form::Xsd;
  else if (ext == "bin")
    form = Form::Binary;
  else
    return false;
  return true;
}

VLXKDMReplica Read(const std::string& path) { return Read(path, Detect(path)); }

VLXKDMReplica Read(const std::string& path, Form form)
{
  VLXKDMReplica replica;
  const VLXUnicodeString file(path.c_str());
  long rc;
  if (form == Form::Xsd) {
    rc = replica.Build(VLXUnicodeString("schema"));
    if (rc >= 0) rc = replica.InsertSchemaFile(file);
  } else if (form == Form::Binary || form == Form::Compressed) {
    rc = VLXKDMReplica::ReadBinaryFile(file, replica);
  } else {
    rc = VLXKDMReplica::ReadFromXmlFile(file, replica);
  }
  Check(rc, Exists(path) ? kInvalid : kOther, path);
  return replica;
}

void Write(VLXKDMReplica& replica, const std::string& path, Form form, bool withSchema, bool withState)
{
  const VLXUnicodeString file(path.c_str());
  long rc;
  switch (form) {
    case Form::Xsd:
      rc = replica.WriteXsdFile(file);
      break;
    case Form::Binary:
      rc = replica.WriteBinaryFile(file, 0);
      break;
    case Form::Compressed:
      rc = replica.WriteBinaryFile(file, 1);
      break;
    default:
      rc = replica.WriteXmlFile(file, withSchema || form == Form::XmlWithSchema, withState);
  }
  Check(rc, kOther, path);
}

const char* TypeName(int type)
{
  static const char* const names[] = {"Integer", "Double", "String", "Date", "Boolean", "Binary", "Relationship"};
  return type >= 0 && type <= 6 ? names[type] : "?";
}

namespace {

// Each call of the schema's readers in turn: the first that fails ends the tool with its own error.
void Schema(long rc) { Check(rc, kOther, "reading the schema"); }

std::vector<Attribute> OwnAttributes(VLXKDMClassDef& c)
{
  VLXKDMAttributeDefList list;
  int count = 0;
  Schema(c.GetAttributes(list));
  Schema(list.GetCount(count));
  std::vector<Attribute> out;
  for (int p = 0; p < count; ++p) {
    VLXKDMAttributeDef a;
    VLXUnicodeString name;
    VLXKDMAttributeType::Type type = VLXKDMAttributeType::Integer;
    VLXKDMAggregationType::Type aggregation = VLXKDMAggregationType::Shared;
    VLXBoolean multi = 0, mandatory = 0;
    VLXListOfVLXUnicodeString targets;
    Schema(list.GetItem(p, a));
    Schema(a.GetAttributeName(name));
    Schema(a.GetAttributeType(type));
    Schema(a.IsMultiValuated(multi));
    Schema(a.IsMandatory(mandatory));
    Schema(a.GetAggregationType(aggregation));
    Schema(a.GetTargetNames(targets));
    Attribute attribute{Text(name), type, multi != 0, mandatory != 0, aggregation == VLXKDMAggregationType::Composition,
                        {}};
    for (int t = 1; t <= targets.Size(); ++t) attribute.targets.push_back(Text(targets[t]));
    out.push_back(attribute);
  }
  return out;
}

}  // namespace

std::vector<ClassInfo> Classes(VLXKDMReplica& replica)
{
  VLXKDMModelSet models;
  int count = 0;
  Schema(replica.GetModels(models));
  Schema(models.GetCount(count));
  std::vector<ClassInfo> classes;
  for (int p = 0; p < count; ++p) {
    VLXKDMModel model;
    VLXKDMClassDef c;
    VLXKDMInstanceSet set;
    VLXUnicodeString name, superName;
    int instances = 0;
    Schema(models.GetItem(p, model));
    Schema(model.GetClassDef(c));
    Schema(c.GetClassName(name));
    Schema(c.GetSuperName(superName));
    Schema(model.GetInstances(set));
    Schema(set.GetCount(instances));
    classes.push_back(ClassInfo{Text(name), Text(superName), OwnAttributes(c), {}, instances});
  }
  for (ClassInfo& c : classes) {  // inherited attributes first, the root's first; chains are bounded
    std::vector<const ClassInfo*> chain{&c};
    for (std::size_t depth = 0; depth < classes.size() && !chain.back()->superName.empty(); ++depth) {
      const ClassInfo* super = nullptr;
      for (const ClassInfo& s : classes)
        if (s.name == chain.back()->superName) super = &s;
      if (!super) break;
      chain.push_back(super);
    }
    for (auto k = chain.rbegin(); k != chain.rend(); ++k) c.all.insert(c.all.end(), (*k)->own.begin(), (*k)->own.end());
  }
  return classes;
}

// ---- Progress ----------------------------------------------------------------------------------

namespace {

volatile std::sig_atomic_t gInterrupted = 0;

struct Bar {
  std::chrono::steady_clock::time_point start = std::chrono::steady_clock::now();
  bool tty = false;
};

void OnInterrupt(int) { gInterrupted = 1; }

VLXBoolean ShowProgress(long long done, long long total, void* context)
{
  Bar& bar = *static_cast<Bar*>(context);
  const bool late = std::chrono::steady_clock::now() - bar.start > std::chrono::seconds(1);
  if (bar.tty && late && total > 0) {
    const int filled = static_cast<int>(30 * done / total);
    std::fprintf(stderr, "\r[%-30s] %3d%%", std::string(static_cast<std::size_t>(filled), '#').c_str(),
                 static_cast<int>(100 * done / total));
    if (done == total) std::fprintf(stderr, "\r%40s\r", "");
  }
  if (done == total) bar.start = std::chrono::steady_clock::now();  // the next operation's second
  return gInterrupted ? 0 : 1;
}

}  // namespace

void StartProgress()
{
  std::signal(SIGINT, OnInterrupt);
  static Bar bar;
  bar.tty = isatty(STDERR_FILENO) != 0;
  Check(VLXKDMReplica::SetProgressHandler(&ShowProgress, &bar), kOther, "setting the progress bar");
}

}  // namespace corvexa_tool
