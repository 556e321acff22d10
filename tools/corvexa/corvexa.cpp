// corvexa: look into, check, convert, draw and dump replica files from the command line.
//
// Exit codes: 0 ok, 1 the document or data is invalid, 2 usage error, 3 anything else. Errors go to
// standard error as one sentence naming the file and the cause.
#include <spawn.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <CLI/CLI.hpp>
#include <cmath>
#include <cstdio>
#include <ctime>
#include <fstream>
#include <iostream>
#include <sstream>

#include "Replicas.h"
#include "VLXError.h"
#include "VLXKDMColumns.h"
#include "VLXKDMInstance.h"
#include "VLXKDMInstanceSet.h"
#include "VLXKDMModel.h"
#include "VLXKDMModelSet.h"

extern char** environ;

using namespace corvexa_tool;

namespace {

// ---- info --------------------------------------------------------------------------------------

void Info(const std::vector<std::string>& files)
{
  for (const std::string& file : files) {
    const Form form = Detect(file);
    struct stat st {};
    stat(file.c_str(), &st);
    VLXKDMReplica replica = Read(file, form);
    VLXUnicodeString summary;
    Check(replica.ToString(summary), kOther, file);
    std::printf("%s: %s, %lld bytes\n  %s\n", file.c_str(), FormName(form), static_cast<long long>(st.st_size),
                Text(summary).c_str());
    for (const ClassInfo& c : Classes(replica)) {
      std::printf("  class %s%s: %zu attributes (%zu inherited)", c.name.c_str(),
                  c.superName.empty() ? "" : (" extends " + c.superName).c_str(), c.all.size(),
                  c.all.size() - c.own.size());
      if (form != Form::Xsd) std::printf(", %ld instances", c.instances);
      std::printf("\n");
    }
  }
}

// ---- convert -----------------------------------------------------------------------------------

void Convert(const std::string& in, const std::string& out, const std::string& to, bool withSchema, bool withState)
{
  Form form = Form::Xml;
  if (to == "xml")
    form = Form::Xml;
  else if (to == "binary")
    form = Form::Binary;
  else if (to == "compressed")
    form = Form::Compressed;
  else if (to == "xsd")
    form = Form::Xsd;
  else if (!FormOfName(out, form))
    Fail(kUsage, out + ": the form to write is not known from its name: give --to xml, binary, compressed or xsd");
  VLXKDMReplica replica = Read(in);
  Write(replica, out, form, withSchema, withState);
}

// ---- validate ----------------------------------------------------------------------------------

// Reads the data with validation on (against its own schema, or the class schema given) and checks
// every constraint a commit checks; every violation is listed.
int Validate(const std::string& file, const std::string& schema)
{
  Check(VLXKDMReplica::SetFeature(VLXUnicodeString("validate"), 1), kOther, "turning validation on");
  VLXKDMReplica replica;
  if (schema.empty()) {
    replica = Read(file);
  } else {
    Check(replica.Build(VLXUnicodeString("validated")), kOther, file);
    Check(replica.InsertSchemaFile(VLXUnicodeString(schema.c_str())), kInvalid, schema);
    Check(replica.PopulatesFromXmlFile(VLXUnicodeString(file.c_str())), kInvalid, file);
  }
  if (replica.Commit() >= 0) {
    std::printf("%s: valid\n", file.c_str());
    return kOk;
  }
  VLXError* e = VLXError::VLXGetLastError(0, nullptr);
  std::string problems = e ? e->GetMessageText().c_str() : "the commit failed without saying why";
  if (e) e->Release();
  const std::size_t list = problems.find("refused: ");  // "commit of replica 'r' refused: N violations\n - ..."
  if (list != std::string::npos) problems = problems.substr(list + 9);
  std::fprintf(stderr, "%s: invalid: %s\n", file.c_str(), problems.c_str());
  return kInvalid;
}

// ---- diagram -----------------------------------------------------------------------------------

std::string Quoted(const std::string& s)
{
  std::string out = "\"";
  for (char c : s) {
    if (c == '"' || c == '\\') out += '\\';
    out += c;
  }
  return out + "\"";
}

std::string HtmlEscaped(const std::string& s)
{
  std::string out;
  for (char c : s)
    out += c == '<' ? "&lt;" : c == '>' ? "&gt;" : c == '&' ? "&amp;" : c == '"' ? "&quot;" : std::string(1, c);
  return out;
}

std::string Multiplicity(const Attribute& a)
{
  return a.multi ? (a.mandatory ? "1..*" : "0..*") : (a.mandatory ? "1" : "0..1");
}

// The schema as a class diagram in DOT: classes with their attributes and types, inheritance,
// relationships with their multiplicity, compositions with a diamond.
std::string Dot(VLXKDMReplica& replica)
{
  std::ostringstream dot;
  dot << "digraph schema {\n  rankdir=BT;\n  node [shape=plaintext fontname=\"Helvetica\" fontsize=10];\n"
         "  edge [fontname=\"Helvetica\" fontsize=9];\n";
  const std::vector<ClassInfo> classes = Classes(replica);
  for (const ClassInfo& c : classes) {
    dot << "  " << Quoted(c.name) << " [label=<<table border=\"0\" cellborder=\"1\" cellspacing=\"0\">"
        << "<tr><td><b>" << HtmlEscaped(c.name) << "</b></td></tr><tr><td align=\"left\" balign=\"left\">";
    for (const Attribute& a : c.own)
      if (a.type != VLXKDMAttributeType::Relationship)
        dot << HtmlEscaped(a.name) << " : " << TypeName(a.type) << (a.multi ? "[*]" : "") << (a.mandatory ? " {1}" : "")
            << "<br/>";
    dot << "</td></tr></table>>];\n";
  }
  for (const ClassInfo& c : classes) {
    if (!c.superName.empty()) dot << "  " << Quoted(c.name) << " -> " << Quoted(c.superName) << " [arrowhead=empty];\n";
    for (const Attribute& a : c.own) {
      if (a.type != VLXKDMAttributeType::Relationship) continue;
      for (const std::string& target : a.targets.empty() ? std::vector<std::string>{c.name} : a.targets)
        dot << "  " << Quoted(c.name) << " -> " << Quoted(target) << " [label=" << Quoted(a.name)
            << " headlabel=" << Quoted(Multiplicity(a))
            << " dir=both arrowhead=vee arrowtail=" << (a.composition ? "diamond" : "none") << "];\n";
    }
  }
  dot << "}\n";
  return dot.str();
}

void Diagram(const std::string& file, std::string out, const std::string& format)
{
  VLXKDMReplica replica = Read(file);
  const std::string dot = Dot(replica);
  if (format == "dot") {
    if (out.empty() || out == "-") {
      std::fputs(dot.c_str(), stdout);
      return;
    }
    std::ofstream(out) << dot;
    return;
  }
  if (out.empty()) out = file.substr(0, file.rfind('.')) + "." + format;
  const std::string source = out + ".dot";
  std::ofstream(source) << dot;
  const std::string typeArg = "-T" + format;
  const char* argv[] = {"dot", typeArg.c_str(), "-o", out.c_str(), source.c_str(), nullptr};
  pid_t pid = 0;
  const int spawned = posix_spawnp(&pid, "dot", nullptr, nullptr, const_cast<char* const*>(argv), environ);
  int status = 0;
  if (spawned == 0) waitpid(pid, &status, 0);
  std::remove(source.c_str());
  if (spawned != 0)
    Fail(kOther, out +
                     ": Graphviz's dot is not installed (Debian package graphviz); --format dot writes the DOT "
                     "text without it");
  if (!WIFEXITED(status) || WEXITSTATUS(status) != 0) Fail(kOther, out + ": dot failed to draw the diagram");
}

// ---- dump --------------------------------------------------------------------------------------

std::string Escaped(const std::string& s, char format)
{
  if (format == 'j') {
    std::string out = "\"";
    for (unsigned char c : s) {
      if (c == '"' || c == '\\')
        out += '\\', out += static_cast<char>(c);
      else if (c < 0x20) {
        char u[8];
        std::snprintf(u, sizeof u, "\\u%04x", c);
        out += u;
      } else
        out += static_cast<char>(c);
    }
    return out + "\"";
  }
  if (format == 'c' && s.find_first_of(",\"\n\r") != std::string::npos) {
    std::string out = "\"";
    for (char c : s) out += c == '"' ? std::string("\"\"") : std::string(1, c);
    return out + "\"";
  }
  return s;
}

std::string Hex(const VLXBinary& b)
{
  static const char digits[] = "0123456789abcdef";
  std::string out;
  for (int i = 0; i < b.getLength(); ++i) out += digits[b.getData()[i] >> 4], out += digits[b.getData()[i] & 15];
  return out;
}

std::string IsoTime(long long ms)
{
  const long long seconds = ms >= 0 ? ms / 1000 : -((-ms + 999) / 1000);
  const time_t t = static_cast<time_t>(seconds);
  std::tm tm{};
  gmtime_r(&t, &tm);
  char text[96];
  std::snprintf(text, sizeof text, "%04d-%02d-%02dT%02d:%02d:%02d.%03lldZ", tm.tm_year + 1900, tm.tm_mon + 1,
                tm.tm_mday, tm.tm_hour, tm.tm_min, tm.tm_sec, ms - seconds * 1000);
  return text;
}

std::string Number(double d)
{
  if (std::isnan(d)) return "NaN";
  if (std::isinf(d)) return d > 0 ? "Infinity" : "-Infinity";
  char text[32];
  for (int digits = 15; digits <= 17; ++digits) {  // the shortest form that reads back as d
    std::snprintf(text, sizeof text, "%.*g", digits, d);
    if (std::strtod(text, nullptr) == d) break;
  }
  return text;
}

// The identifier of an instance ("" for none), as its text or "0x" and its bytes.
std::string IdOf(VLXKDMInstance& x)
{
  VLXBoolean none = 1, isText = 0;
  VLXUnicodeString text;
  VLXBinary bytes;
  if (x.GetID(none, isText, text, bytes) < 0 || none) return "";
  return isText ? Text(text) : "0x" + Hex(bytes);
}

// The items of a row: its one value (single-valued) or its list, each shown as text.
template <class One, class List, class Show>
void Items(const VLXKDMColumns& b, long k, long r, bool multi, long (VLXKDMColumns::*one)(long, long, One&) const,
           long (VLXKDMColumns::*list)(long, long, List&) const, Show show, std::vector<std::string>& items)
{
  List values;
  if (multi) {
    (b.*list)(k, r, values);
  } else {
    One value{};
    (b.*one)(k, r, value);
    values.Append(value);
  }
  for (int i = 1; i <= values.Size(); ++i) items.push_back(show(values[i]));
}

// One value of a column's row as text (j: JSON, quoted where JSON quotes; t, c: plain).
std::string ValueText(const VLXKDMColumns& b, long k, long r, const Attribute& a, char format)
{
  VLXBoolean has = 0;
  b.HasValue(k, r, has);
  if (!has) return format == 'j' ? "null" : "";
  auto quote = [format](const std::string& s) { return format == 'j' ? Escaped(s, 'j') : s; };
  std::vector<std::string> items;
  using C = VLXKDMColumns;
  switch (a.type) {
    case VLXKDMAttributeType::Integer:
      Items(
          b, k, r, a.multi, &C::GetInteger, &C::GetIntegers, [](int v) { return std::to_string(v); }, items);
      break;
    case VLXKDMAttributeType::Double:
      Items(
          b, k, r, a.multi, &C::GetDouble, &C::GetDoubles,
          [&](double v) { return std::isfinite(v) ? Number(v) : quote(Number(v)); }, items);
      break;
    case VLXKDMAttributeType::Boolean:
      Items(
          b, k, r, a.multi, &C::GetBoolean, &C::GetBooleans, [](VLXBoolean v) { return v ? "true" : "false"; }, items);
      break;
    case VLXKDMAttributeType::Date:  // single dates to the millisecond, lists as whole seconds
      if (!a.multi) {
        long long ms = 0;
        b.GetMilliseconds(k, r, ms);
        items.push_back(quote(IsoTime(ms)));
      } else {
        Items(
            b, k, r, true, &C::GetTime, &C::GetTimes,
            [&](const VLXTime& t) { return quote(IsoTime(t.Gettime_t() * 1000LL)); }, items);
      }
      break;
    case VLXKDMAttributeType::String:
      Items(
          b, k, r, a.multi, &C::GetText, &C::GetTexts, [&](const VLXUnicodeString& v) { return quote(Text(v)); },
          items);
      break;
    case VLXKDMAttributeType::Binary:
      Items(
          b, k, r, a.multi, &C::GetBinary, &C::GetBinaries, [&](const VLXBinary& v) { return quote("0x" + Hex(v)); },
          items);
      break;
    default:
      Items(
          b, k, r, a.multi, &C::GetInstance, &C::GetInstances,
          [&](VLXKDMInstance& x) {
            const std::string id = IdOf(x);
            return quote(id.empty() ? "(instance without identifier)" : id);
          },
          items);
  }
  if (!a.multi) return items.empty() ? "" : items[0];
  std::string out = "[";
  for (std::size_t i = 0; i < items.size(); ++i) out += (i ? ", " : "") + items[i];
  return out + "]";
}

// The characters of UTF-8 text (its width in a table).
std::size_t Columns(const std::string& s)
{
  std::size_t n = 0;
  for (unsigned char c : s) n += (c & 0xC0) != 0x80;
  return n;
}

void Dump(const std::string& file, const std::string& only, long limit, const std::string& format)
{
  VLXKDMReplica replica = Read(file);
  VLXKDMModelSet models;
  Check(replica.GetModels(models), kOther, file);
  bool found = only.empty();
  const char f = format[0];
  for (const ClassInfo& c : Classes(replica)) {
    if (!only.empty() && c.name != only) continue;
    found = true;
    VLXKDMModel model;
    VLXKDMColumns batch;
    long column = 0, rows = 0;
    for (const Attribute& a : c.all) batch.AddColumn(VLXUnicodeString(a.name.c_str()), column);
    Check(models.GetItem(VLXUnicodeString(c.name.c_str()), model), kOther, file);
    if (!c.all.empty()) Check(batch.GetValues(model), kOther, file + ": class " + c.name);
    batch.GetRowCount(rows);
    VLXKDMInstanceSet set;
    Check(model.GetInstances(set), kOther, file);
    std::vector<std::vector<std::string>> table;
    if (f != 'j') {
      table.push_back({"class", "id"});
      for (const Attribute& a : c.all) table.back().push_back(a.name);
    }
    for (long r = 0; r < c.instances && r < limit; ++r) {
      VLXKDMInstance x;
      set.GetItem(static_cast<int>(r), x);
      std::vector<std::string> row{c.name, IdOf(x)};
      for (std::size_t k = 0; k < c.all.size(); ++k)
        row.push_back(r < rows ? ValueText(batch, static_cast<long>(k), r, c.all[k], f) : "");
      if (f == 'j') {
        std::printf("{\"class\": %s, \"id\": %s", Escaped(row[0], 'j').c_str(),
                    row[1].empty() ? "null" : Escaped(row[1], 'j').c_str());
        for (std::size_t k = 0; k < c.all.size(); ++k)
          std::printf(", %s: %s", Escaped(c.all[k].name, 'j').c_str(), row[k + 2].c_str());
        std::printf("}\n");
      } else {
        table.push_back(row);
      }
    }
    if (f == 'c') {
      for (const auto& row : table)
        for (std::size_t k = 0; k < row.size(); ++k)
          std::printf("%s%s", Escaped(row[k], 'c').c_str(), k + 1 < row.size() ? "," : "\n");
    } else if (f == 't') {
      std::vector<std::size_t> width;
      for (const auto& row : table)
        for (std::size_t k = 0; k < row.size(); ++k)
          width.resize(std::max(width.size(), k + 1)), width[k] = std::max(width[k], Columns(row[k]));
      for (const auto& row : table)
        for (std::size_t k = 0; k < row.size(); ++k)
          std::printf("%s%s", row[k].c_str(),
                      k + 1 < row.size() ? std::string(width[k] - Columns(row[k]) + 2, ' ').c_str() : "\n");
    }
  }
  if (!found) Fail(kUsage, file + ": no class '" + only + "'");
}

}  // namespace

int main(int argc, char** argv)
{
  CLI::App app{
      "corvexa: look into, check, convert, draw and dump replica files.\n"
      "Exit codes: 0 ok, 1 the document or data is invalid, 2 usage error, 3 anything else."};
  app.require_subcommand(1);
  std::vector<std::string> files;
  std::string in, out, to, schema, format = "dot", only, dumpFormat = "table";
  bool withSchema = false, withState = false;
  long limit = 1000000000L;

  CLI::App* info = app.add_subcommand("info", "The form, size, classes (attributes, instances) of each file.");
  info->add_option("FILE", files, "Replica files: XML, XSD or binary")->required()->check(CLI::ExistingFile);
  CLI::App* convert = app.add_subcommand("convert", "Any form to any form, streamed.");
  convert->add_option("IN", in, "The file to read")->required()->check(CLI::ExistingFile);
  convert->add_option("OUT", out, "The file to write (its form from --to, else its extension .xml, .xsd, .bin)")
      ->required();
  convert->add_option("--to", to, "xml, binary, compressed or xsd")
      ->check(CLI::IsMember({"xml", "binary", "compressed", "xsd"}));
  convert->add_flag("--with-schema", withSchema, "XML: embed the schema");
  convert->add_flag("--with-state", withState, "XML: write the pending changes");
  CLI::App* validate = app.add_subcommand("validate", "Read with validation on and check every constraint.");
  validate->add_option("FILE", in, "The replica file")->required()->check(CLI::ExistingFile);
  validate->add_option("--schema", schema, "A class schema (XSD) for a document without one")->check(CLI::ExistingFile);
  CLI::App* diagram = app.add_subcommand("diagram", "The schema as a class diagram.");
  diagram->add_option("FILE", in, "The replica or schema file")->required()->check(CLI::ExistingFile);
  diagram->add_option("-o,--output", out, "The file to write (DOT: standard output by default)");
  diagram->add_option("--format", format, "dot, svg or png (svg and png through Graphviz's dot)")
      ->check(CLI::IsMember({"dot", "svg", "png"}));
  CLI::App* dump = app.add_subcommand("dump", "Instances as rows.");
  dump->add_option("FILE", in, "The replica file")->required()->check(CLI::ExistingFile);
  dump->add_option("--class", only, "Only this class");
  dump->add_option("--limit", limit, "At most this many instances per class")->check(CLI::PositiveNumber);
  dump->add_option("--format", dumpFormat, "table, jsonl or csv")->check(CLI::IsMember({"table", "jsonl", "csv"}));

  try {
    app.parse(argc, argv);
  } catch (const CLI::CallForHelp& e) {
    return app.exit(e);
  } catch (const CLI::ParseError& e) {
    app.exit(e);
    return kUsage;
  }
  try {
    StartProgress();
    if (info->parsed()) Info(files);
    if (convert->parsed()) Convert(in, out, to, withSchema, withState);
    if (validate->parsed()) return Validate(in, schema);
    if (diagram->parsed()) Diagram(in, out, format);
    if (dump->parsed()) Dump(in, only, limit, dumpFormat);
    return std::fflush(stdout) == 0 ? kOk : kOther;
  } catch (const Failure& f) {
    std::fflush(stdout);
    std::fprintf(stderr, "corvexa: %s\n", f.message.c_str());
    return f.code;
  }
}
