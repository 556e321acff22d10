// libFuzzer harness over the library's document readers, one executable per reader, chosen at build
// time with CORVEXA_FUZZ_READER: 0 bytes, 1 compressed bytes, 2 XML text, 3 XSD text.
//
// An input is read into a new replica. A refused input is fine (it comes back as a result code). An
// accepted one is written, the writing read and written again, and the two writings must be equal:
// anything else aborts, and libFuzzer keeps the input. Crashes and sanitizer reports are findings too.
//
// "<harness> --write-seeds DIR" writes seed inputs for its reader into DIR, made by the library from
// a replica built here (every attribute type, committed data and pending changes), and exits.
#include <cctype>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <set>
#include <string>

#include <zlib.h>

#include "VLXError.h"
#include "VLXKDMAttributeDef.h"
#include "VLXKDMAttributeDefList.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMInstance.h"
#include "VLXKDMInstanceSet.h"
#include "VLXKDMModel.h"
#include "VLXKDMModelSet.h"
#include "VLXKDMReplica.h"
#include "VLXListValVLXKDMInstance.h"

namespace {

enum Reader { kBytes, kCompressed, kXml, kXsd };
constexpr Reader kReader = static_cast<Reader>(CORVEXA_FUZZ_READER);

VLXUnicodeString U(const std::string& s) { return VLXUnicodeString(s.data(), static_cast<int>(s.size())); }
std::string Text(const VLXUnicodeString& s) { return std::string(s.c_str(), static_cast<size_t>(s.GetLengthInByte())); }

std::string LastError(long rc)
{
  VLXError* error = VLXError::VLXGetLastError(rc, nullptr);
  if (!error) return "(no last error)";
  std::string text = std::string(error->GetId()) + ": " + Text(error->GetMessageText());
  error->Release();
  return text;
}

void PutU32(std::string& bytes, size_t at, uLong value)
{
  for (int i = 0; i < 4; ++i) bytes[at + i] = static_cast<char>((value >> (24 - 8 * i)) & 0xFF);
}

// Inputs of the byte readers that start with the header's magic get its lengths and checksum made
// right, so that mutations reach the payload reader instead of failing the checksum. For the
// compressed reader, an uncompressed frame is deflated here; a compressed one (flags bit 0) keeps
// its stream and announced length, for the inflating steps. Other inputs are read as they are.
std::string Framed(std::string input)
{
  const size_t kHeader = 20;
  if (input.size() < kHeader || input.compare(0, 4, "CVRB") != 0) return input;
  auto payload = reinterpret_cast<const Bytef*>(input.data() + kHeader);
  uInt length = static_cast<uInt>(input.size() - kHeader);
  if (kReader == kCompressed && (input[5] & 1) == 0) {
    uLongf deflatedLength = compressBound(length);
    std::string deflated(deflatedLength, '\0');
    compress(reinterpret_cast<Bytef*>(&deflated[0]), &deflatedLength, payload, length);
    PutU32(input, 8, length);
    PutU32(input, 16, crc32(0, payload, length));
    input.replace(kHeader, std::string::npos, deflated, 0, deflatedLength);
    input[5] = static_cast<char>(input[5] | 1);
  } else if (kReader == kBytes) {
    PutU32(input, 8, length);
    PutU32(input, 16, crc32(0, payload, length));
  }
  PutU32(input, 12, static_cast<uLong>(input.size() - kHeader));
  return input;
}

long Read(const std::string& document, VLXKDMReplica& replica)
{
  switch (kReader) {
    case kBytes:
    case kCompressed: {
      const std::string framed = Framed(document);
      return VLXKDMReplica::GetReplicaFromBinary(VLXBinary(framed.data(), static_cast<int>(framed.size())),
                                                 kReader == kCompressed, replica);
    }
    case kXml:
      return VLXKDMReplica::ReadFromXmlString(U(document), replica);
    case kXsd: {
      const long rc = replica.Build();
      return VLX_FAILED(rc) ? rc : replica.InsertSchemaString(U(document));
    }
  }
  return VLX_E_FAIL;
}

long Write(VLXKDMReplica& replica, std::string& document)
{
  VLXUnicodeString text;
  long rc = VLX_E_FAIL;
  switch (kReader) {
    case kBytes:
    case kCompressed: {
      VLXBinary bytes;
      rc = VLXKDMReplica::GetBinaryFromReplica(replica, kReader == kCompressed, bytes);
      document.assign(reinterpret_cast<const char*>(bytes.getData()), static_cast<size_t>(bytes.getLength()));
      return rc;
    }
    case kXml:
      rc = replica.GetXml(1, 1, text);
      break;
    case kXsd:
      rc = replica.GetXsd(text);
      break;
  }
  document = Text(text);
  return rc;
}

[[noreturn]] void Finding(const char* what, const std::string& detail)
{
  std::fprintf(stderr, "==corvexa-fuzz== %s\n%s\n", what, detail.substr(0, 4000).c_str());
  std::abort();
}

// What became of an input, as a feature for libFuzzer: the parsing happens in Java, out of reach of
// the coverage instrumentation. A refusal counts by its reason: the message up to its sixth colon
// (the XML parser's own detail left out), without numbers and quoted parts. An acceptance counts
// by the shape of its writing: the markup without values and the size in 256-byte steps for
// texts, the size in 16-byte steps for bytes; so that accepted inputs, the ones the round trip
// checks, keep a place in the corpus.
long g_inputs = 0, g_accepted = 0;

__attribute__((section("__libfuzzer_extra_counters"))) unsigned char g_outcomes[4096];

void Outcome(const std::string& text, size_t salt, int colonsKept)
{
  size_t hash = 14695981039346656037ULL + salt;
  bool quoted = false;
  int colons = 0;
  for (char c : text) {
    if (c == ':' && ++colons > colonsKept) break;
    if (c == '\'' || c == '"') quoted = !quoted;
    if (quoted || (c >= '0' && c <= '9')) continue;
    hash = (hash ^ static_cast<unsigned char>(c)) * 1099511628211ULL;
  }
g_outcomes[hash % sizeof g_outcomes] = 1;
}

// ---- Seeds ------------------------------------------------------------------------------------

struct Attribute {
  const char* name;
  VLXKDMAttributeType::Type type;
  bool multi;
};
const Attribute kAttributes[] = {
    {"serial", VLXKDMAttributeType::Integer, false},    {"counts", VLXKDMAttributeType::Integer, true},
    {"reading", VLXKDMAttributeType::Double, false},    {"history", VLXKDMAttributeType::Double, true},
    {"label", VLXKDMAttributeType::String, false},      {"tags", VLXKDMAttributeType::String, true},
    {"installed", VLXKDMAttributeType::Date, false},    {"serviced", VLXKDMAttributeType::Date, true},
    {"active", VLXKDMAttributeType::Boolean, false},    {"flags", VLXKDMAttributeType::Boolean, true},
    {"firmware", VLXKDMAttributeType::Binary, false},   {"blobs", VLXKDMAttributeType::Binary, true},
    {"next", VLXKDMAttributeType::Relationship, false}, {"parts", VLXKDMAttributeType::Relationship, true},
};

#define SEED_CHECK(call)                                                       \
  do {                                                                         \
    const long rc_ = (call);                                                   \
    if (VLX_FAILED(rc_)) Finding("seed step failed: " #call, LastError(rc_)); \
  } while (0)

// A replica "plant" whose class Sensor has an attribute of every type, single and multi-valued
// (parts: a composition of Sensors), with four committed sensors, then one changed and one removed.
void BuildPlant(VLXKDMReplica& replica)
{
  VLXKDMClassDef sensor;
  VLXKDMAttributeDefList attributes;
  SEED_CHECK(replica.Build(VLXUnicodeString("plant")));
  SEED_CHECK(sensor.Build(VLXUnicodeString("Sensor")));
  SEED_CHECK(sensor.SetQKAComment(VLXUnicodeString("a measuring point & <its> \"data\"")));
  SEED_CHECK(sensor.GetAttributes(attributes));
  for (const Attribute& a : kAttributes) {
    VLXKDMAttributeDef def;
    SEED_CHECK(def.Build(VLXUnicodeString(a.name), a.type));
    if (a.multi) SEED_CHECK(def.SetMultiValuation(1));
    if (a.type == VLXKDMAttributeType::Relationship) SEED_CHECK(def.SetTargetNames(1, "Sensor"));
    if (a.multi && a.type == VLXKDMAttributeType::Relationship)
      SEED_CHECK(def.SetAggregationType(VLXKDMAggregationType::Composition));
    if (a.type == VLXKDMAttributeType::String && !a.multi) SEED_CHECK(def.SetLength(40));
    if (a.type == VLXKDMAttributeType::Integer && !a.multi) {
      SEED_CHECK(def.SetMandatory(1));
      SEED_CHECK(def.SetUnicity(1));
    }
    SEED_CHECK(attributes.Add(def));
  }
  VLXKDMModel model;
  VLXKDMModelSet models;
  SEED_CHECK(model.Build(sensor));
  SEED_CHECK(replica.GetModels(models));
  SEED_CHECK(models.Add(model));

  VLXKDMInstance s[4];
  for (int n = 0; n < 4; ++n) {
    SEED_CHECK(model.CreateInstance(s[n]));
    SEED_CHECK(s[n].SetID(U("S-" + std::to_string(n))));
    SEED_CHECK(s[n].SetValue(VLXUnicodeString("serial"), 1000 + n));
    SEED_CHECK(s[n].SetValueIntegers(VLXUnicodeString("counts"), 3, n, -n, 2147483647));
    SEED_CHECK(s[n].SetValue(VLXUnicodeString("reading"), 20.5 + n / 3.0));
    SEED_CHECK(s[n].SetValueDoubles(VLXUnicodeString("history"), 3, -0.0, 1e-300, 1.7976931348623157e308));
    SEED_CHECK(s[n].SetValue(VLXUnicodeString("label"), U("n\xC2\xB0" + std::to_string(n) + " \xF0\x9F\x8C\xA1")));
    SEED_CHECK(s[n].SetValueStrings(VLXUnicodeString("tags"), 3, "indoor", "<a & b>", ""));
    VLXTime t, u;
    t.Settime_t(1262304000L + 3600L * n);
    u.Settime_t(-86400L * n - 1);
    SEED_CHECK(s[n].SetValue(VLXUnicodeString("installed"), t));
    SEED_CHECK(s[n].SetValueDates(VLXUnicodeString("serviced"), 2, &t, &u));
    SEED_CHECK(s[n].SetValue(VLXUnicodeString("active"), static_cast<VLXBoolean>(n % 2)));
    SEED_CHECK(s[n].SetValueBooleans(VLXUnicodeString("flags"), 2, 1, 0));
    const unsigned char firmware[] = {0x00, 0xFF, static_cast<unsigned char>(n), 0x7F};
    const VLXBinary blob(firmware, 4), empty;
    SEED_CHECK(s[n].SetValue(VLXUnicodeString("firmware"), blob));
    SEED_CHECK(s[n].SetValueBinaries(VLXUnicodeString("blobs"), 2, &blob, &empty));
  }
  SEED_CHECK(s[0].SetValue(VLXUnicodeString("next"), s[1]));
  SEED_CHECK(s[0].SetValueInstances(VLXUnicodeString("parts"), 1, &s[2]));
  SEED_CHECK(replica.Commit());
  SEED_CHECK(s[1].SetValue(VLXUnicodeString("reading"), -1.25));
  VLXKDMInstanceSet instances;
  SEED_CHECK(model.GetInstances(instances));
  SEED_CHECK(instances.Remove(s[3]));
}

void WriteSeed(const std::string& path, const std::string& content)
{
  std::ofstream(path, std::ios::binary) << content;
}

// A libFuzzer dictionary of the names and markup of an XML text.
void WriteDictionary(const std::string& path, const std::string& xml)
{
  std::set<std::string> words = {"<", "</", "/>", ">", "=\"", "<!--", "-->", "<![CDATA[", "]]>", "&amp;", "&#"};
  for (size_t at = 0; at < xml.size();) {
    size_t end = at;
    while (end < xml.size() && (std::isalnum(static_cast<unsigned char>(xml[end])) || std::strchr("_:.-", xml[end])))
      ++end;
    if (end - at > 1 && end - at < 64) words.insert(xml.substr(at, end - at));
    at = end + 1;
  }
  std::ofstream out(path);
  for (const std::string& word : words) {
    out << '"';
    for (char c : word) out << (c == '"' || c == '\\' ? "\\" : "") << c;
    out << "\"\n";
  }
}

int WriteSeeds(const std::string& dir)
{
  VLXKDMReplica plant, empty;
  BuildPlant(plant);
  SEED_CHECK(empty.Build(VLXUnicodeString("empty")));
  if (kReader == kBytes || kReader == kCompressed) {
    // Uncompressed frames for both readers (Framed deflates them for the compressed one), and
    // compressed ones for the compressed reader.
    VLXKDMReplica* replicas[] = {&plant, &empty};
    for (int i = 0; i < (kReader == kCompressed ? 4 : 2); ++i) {
      VLXBinary bytes;
      SEED_CHECK(VLXKDMReplica::GetBinaryFromReplica(*replicas[i % 2], i >= 2, bytes));
      WriteSeed(dir + "/seed-" + std::to_string(i),
                std::string(reinterpret_cast<const char*>(bytes.getData()), static_cast<size_t>(bytes.getLength())));
    }
  } else if (kReader == kXsd) {
    VLXUnicodeString xsd;
    SEED_CHECK(plant.GetXsd(xsd));
    WriteSeed(dir + "/seed-plant", Text(xsd));
    WriteDictionary(dir + ".dict", Text(xsd));
  } else {
    // With the schema embedded, with and without pending changes; and without it, naming a schema
    // file written beside the directory.
    VLXUnicodeString xml, xsd;
    for (int state = 0; state < 2; ++state) {
      SEED_CHECK(plant.GetXml(1, static_cast<VLXBoolean>(state), xml));
      WriteSeed(dir + "/seed-embedded-" + std::to_string(state), Text(xml));
    }
    char* absolute = realpath(dir.c_str(), nullptr);
    const std::string schemaFile = std::string(absolute ? absolute : dir.c_str()) + ".xsd";
    std::free(absolute);
    SEED_CHECK(plant.GetXsd(xsd));
    WriteSeed(schemaFile, Text(xsd));
    SEED_CHECK(VLXKDMReplica::SetSchemaLocation(U(schemaFile)));
    SEED_CHECK(plant.GetXml(0, 1, xml));
    WriteSeed(dir + "/seed-located", Text(xml));
    WriteDictionary(dir + ".dict", Text(xml) + Text(xsd));
    SEED_CHECK(empty.GetXml(1, 0, xml));
    WriteSeed(dir + "/seed-empty", Text(xml));
  }
  std::printf("seeds written to %s\n", dir.c_str());
  return 0;
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int* argc, char*** argv)
{
  if (*argc == 3 && std::strcmp((*argv)[1], "--write-seeds") == 0) std::exit(WriteSeeds((*argv)[2]));
  std::atexit([] { std::fprintf(stderr, "corvexa-fuzz: %ld of %ld inputs accepted\n", g_accepted, g_inputs); });
  // Starts the JVM now, before libFuzzer installs its signal handlers and starts timing inputs.
  VLXKDMReplica replica;
  if (VLX_FAILED(replica.Build())) Finding("the JVM could not be started", LastError(VLX_E_FAIL));
  // The located seed names its schema file beside the corpus, in the directory the harness runs in.
  if (VLX_FAILED(VLXKDMReplica::SetSchemaFolder(U(".")))) Finding("no schema folder", LastError(VLX_E_FAIL));
  return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
  const std::string input(reinterpret_cast<const char*>(data), size);
  VLXKDMReplica first, second;
  long rc = Read(input, first);
  ++g_inputs;
  if (VLX_FAILED(rc)) {
    if (std::getenv("CORVEXA_FUZZ_VERBOSE")) std::fprintf(stderr, "refused: %s\n", LastError(rc).c_str());
    Outcome(LastError(rc), 0, 5);
    VLXError::VLXCleanLastError();
    return 0;
  }
  std::string written, rewritten;
  if (VLX_FAILED(rc = Write(first, written))) Finding("an accepted input could not be written", LastError(rc));
  if (VLX_FAILED(rc = Read(written, second)))
    Finding("the writing of an accepted input was refused", LastError(rc) + "\n-- writing:\n" + written);
  if (VLX_FAILED(rc = Write(second, rewritten))) Finding("a read writing could not be written", LastError(rc));
  if (written != rewritten) Finding("the two writings differ", "-- first:\n" + written + "\n-- second:\n" + rewritten);
  std::string markup = "accepted";
  bool tag = false;
  for (char c : kReader >= kXml ? written : std::string()) {
    tag = tag || c == '<';
    if (tag) markup += c;
    tag = tag && c != '>';
  }
  Outcome(markup, kReader >= kXml ? written.size() / 256 + 1 : written.size() / 16 + 1, 1 << 30);
  ++g_accepted;
  return 0;
}
