// A tour of the library, in four steps:
//   1. start the Java side, build and name a replica, look into it, commit it;
//   2. read the sample data (examples/inventory.xml, whose schema is inventory.xsd beside it);
//   3. build a schema in C++ with an attribute of every type, single and multi-valued, write it as
//      XSD, and read that XSD back into a second replica;
//   4. fill the replica with data of every type, commit, write it as XML and as bytes, read both
//      back, and check that every value survived;
// and show how a failure comes back. Usage: corvexa-example [directory of the sample data]
#include <cstdio>
#include <initializer_list>
#include <iterator>
#include <string>
#include <vector>

#include "VLXError.h"
#include "VLXKDMAttributeDef.h"
#include "VLXKDMAttributeDefList.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMInstance.h"
#include "VLXKDMInstanceSet.h"
#include "VLXKDMInstanceValue.h"
#include "VLXKDMModel.h"
#include "VLXKDMModelSet.h"
#include "VLXKDMReplica.h"
#include "VLXListValVLXKDMInstance.h"
#include "VLXRawColldouble.h"
#include "VLXRawCollint.h"

#ifndef CORVEXA_EXAMPLES_DIR
#define CORVEXA_EXAMPLES_DIR "examples"
#endif

namespace {

std::string Text(const VLXUnicodeString& s) { return std::string(s.c_str(), s.GetLengthInByte()); }
VLXUnicodeString U(const std::string& s) { return VLXUnicodeString(s.c_str(), static_cast<int>(s.size())); }

int failures = 0;

// Prints what an operation returned and, on failure, the thread's last error.
bool Report(const char* what, long rc)
{
  if (VLX_SUCCEEDED(rc)) {
    std::printf("  %-52s ok\n", what);
    return true;
  }
  std::printf("  %-52s failed with 0x%08lx\n", what, static_cast<unsigned long>(rc) & 0xffffffffUL);
  if (VLXError* error = VLXError::VLXGetLastError(rc, nullptr)) {
    std::printf("      last error %s: %s\n", error->GetId(), error->GetMessageText().c_str());
    error->Release();
  }
  return false;
}

// Like Report, for the steps the tour cannot go on without.
bool Must(const char* what, long rc)
{
  if (Report(what, rc)) return true;
  ++failures;
  return false;
}

// ---- Step 1 ----------------------------------------------------------------------------------

bool FirstSteps()
{
  std::printf("1. A replica of our own\n");
  VLXKDMReplica replica;
  if (!Must("Build a replica named \"inventory\"", replica.Build(VLXUnicodeString("inventory")))) return false;
  VLXUnicodeString name, text;
  Report("Rename it to \"inventory 2026\"", replica.SetName(VLXUnicodeString("inventory 2026")));
  Report("Read its name back", replica.GetName(name));
  std::printf("      name: %s\n", Text(name).c_str());
  Report("Its text form", replica.ToString(text));
  std::printf("      %s\n", Text(text).c_str());
  VLXKDMModelSet models;
  Report("Reach its model set", replica.GetModels(models));
  VLXKDMClassDef part;
  Report("Look up the class \"Part\"", replica.GetClassDef(VLXUnicodeString("Part"), part));
  std::printf("      %s\n", part.GetHandle() ? "found" : "the replica has no class named Part");
  return Must("Commit", replica.Commit());
}

// ---- Step 2 ----------------------------------------------------------------------------------

bool SampleData(const std::string& dir)
{
  std::printf("\n2. The sample data\n");
  VLXKDMReplica stock;
  if (!Must("Read inventory.xml (schema: inventory.xsd)",
            VLXKDMReplica::ReadFromXmlFile(U(dir + "/inventory.xml"), stock)))
    return false;
  VLXKDMModelSet models;
  int count = 0;
  Must("Count its models", stock.GetModels(models));
  models.GetCount(count);
  for (int m = 0; m < count; ++m) {
    VLXKDMModel model;
    VLXKDMClassDef classDef;
    VLXKDMInstanceSet instances;
    VLXUnicodeString className;
    int n = 0;
    if (VLX_FAILED(models.GetItem(m, model)) || VLX_FAILED(model.GetClassDef(classDef)) ||
        VLX_FAILED(classDef.GetClassName(className)) || VLX_FAILED(model.GetInstances(instances)) ||
        VLX_FAILED(instances.GetCount(n)))
      return Must("Walk the models", VLX_E_FAIL);
    std::printf("      %-10s %d instance(s)\n", Text(className).c_str(), n);
    if (n > 0) {
      VLXKDMInstance first;
      VLXUnicodeString shown;
      instances.GetItem(0, first);
      first.ToString(1, shown);
      std::printf("        first: %s\n", Text(shown).c_str());
    }
  }
  return true;
}

// ---- Step 3 ----------------------------------------------------------------------------------

// The attributes of the class "Sensor": every type, single and multi-valued.
struct SensorAttribute {
  const char* name;
  VLXKDMAttributeType::Type type;
  bool multi;
};
const SensorAttribute kSensorAttributes[] = {
    {"serial", VLXKDMAttributeType::Integer, false},    {"counts", VLXKDMAttributeType::Integer, true},
    {"reading", VLXKDMAttributeType::Double, false},    {"history", VLXKDMAttributeType::Double, true},
    {"label", VLXKDMAttributeType::String, false},      {"tags", VLXKDMAttributeType::String, true},
    {"installed", VLXKDMAttributeType::Date, false},    {"serviced", VLXKDMAttributeType::Date, true},
    {"active", VLXKDMAttributeType::Boolean, false},    {"flags", VLXKDMAttributeType::Boolean, true},
    {"firmware", VLXKDMAttributeType::Binary, false},   {"blobs", VLXKDMAttributeType::Binary, true},
    {"next", VLXKDMAttributeType::Relationship, false}, {"peers", VLXKDMAttributeType::Relationship, true},
};

bool BuildSchema(VLXKDMReplica& replica)
{
  VLXKDMClassDef sensor;
  VLXKDMAttributeDefList attributes;
  if (VLX_FAILED(sensor.Build(VLXUnicodeString("Sensor"))) ||
      VLX_FAILED(sensor.SetQKAComment(VLXUnicodeString("a measuring point"))) ||
      VLX_FAILED(sensor.GetAttributes(attributes)))
    return Must("Build the class \"Sensor\"", VLX_E_FAIL);
  for (const SensorAttribute& wanted : kSensorAttributes) {
    VLXKDMAttributeDef attribute;
    long rc = attribute.Build(VLXUnicodeString(wanted.name), wanted.type);
    if (VLX_SUCCEEDED(rc) && wanted.multi) rc = attribute.SetMultiValuation(1);
    if (VLX_SUCCEEDED(rc) && wanted.type == VLXKDMAttributeType::Relationship)
      rc = attribute.SetTargetNames(1, "Sensor");
    if (VLX_SUCCEEDED(rc)) rc = attributes.Add(attribute);
    if (VLX_FAILED(rc)) return Must(wanted.name, rc);
  }
  VLXKDMAttributeDef serial;
  attributes.GetItem(VLXUnicodeString("serial"), serial);
  serial.SetMandatory(1);
  serial.SetUnicity(1);

  VLXKDMModel model;
  VLXKDMModelSet models;
  return Must(
      "Build the class \"Sensor\" with 14 attributes in C++",
      VLX_SUCCEEDED(model.Build(sensor)) && VLX_SUCCEEDED(replica.GetModels(models)) ? models.Add(model) : VLX_E_FAIL);
}

bool SchemaBuiltInCpp(VLXKDMReplica& replica)
{
  std::printf("\n3. A schema built in C++\n");
  if (!Must("Build a replica named \"plant\"", replica.Build(VLXUnicodeString("plant"))) || !BuildSchema(replica))
    return false;
  VLXUnicodeString xsd, again;
  if (!Must("Write the schema as XSD", replica.GetXsd(xsd))) return false;
  std::printf("      %d bytes of XSD\n", xsd.GetLengthInByte());
  VLXKDMReplica copy;
  if (!Must("Build a replica named \"copy\"", copy.Build(VLXUnicodeString("copy"))) ||
      !Must("Insert that XSD into it", copy.InsertSchemaString(xsd)) ||
      !Must("Write its schema as XSD", copy.GetXsd(again)))
    return false;
  const bool same = Text(xsd) == Text(again);
  std::printf("      the two schemas are %s\n", same ? "identical" : "DIFFERENT");
  if (!same) ++failures;
  return same;
}

// ---- Step 4 ----------------------------------------------------------------------------------

VLXTime Time(time_t seconds)
{
  VLXTime t;
  t.Settime_t(seconds);
  return t;
}

template <class List, class T>
List ListOf(std::initializer_list<T> values)
{
  List list;
  for (const T& v : values) list.Append(v);
  return list;
}

// The fourteen values of sensor number n, in the order of kSensorAttributes, as the program means
// them: what Fill writes and what every copy of the replica must hold. Times before 1970 included.
std::vector<VLXKDMInstanceValue> Written(int n, const VLXKDMInstance& next, const VLXListOfVLXKDMInstance& peers)
{
  const unsigned char firmware[] = {0x00, 0xFF, static_cast<unsigned char>(n), 0x7F};
  std::vector<VLXKDMInstanceValue> v(14);
  v[0].SetInteger(1000 + n);
  v[1].SetListOfInteger(ListOf<VLXRawCollint>({n, -n, 2147483647}));
  v[2].SetDouble(20.5 + n / 3.0);
  v[3].SetListOfDouble(ListOf<VLXRawColldouble>({-0.0, 1e-300}));
  v[4].SetString(U("Sensor n\xC2\xB0" + std::to_string(n) + " \xE2\x9C\x93 \xF0\x9F\x8C\xA1"));
  v[5].SetListOfString(ListOf<VLXListValVLXUnicodeString>({VLXUnicodeString("indoor"), VLXUnicodeString("<a & b>")}));
  v[6].SetDate(Time(1262304000L + 3600L * n));
  v[7].SetListOfDate(ListOf<VLXListOfVLXTime>({Time(1700000000 + n), Time(-86400L * n - 1)}));
  v[8].SetBoolean(static_cast<VLXBoolean>(n % 2));
  v[9].SetListOfBoolean(ListOf<VLXListValVLXBoolean>({VLXBoolean(1), VLXBoolean(0), VLXBoolean(1)}));
  v[10].SetBinary(VLXBinary(firmware, 4));
  v[11].SetListOfBinary(ListOf<VLXListOfVLXBinary>({VLXBinary(firmware, 4), VLXBinary()}));
  v[12].SetInstance(next);
  v[13].SetListOfInstance(peers);
  return v;
}

// Sets the fourteen values of sensor number n with the typed and the variadic setters.
long Fill(VLXKDMInstance& sensor, int n, const std::vector<VLXKDMInstanceValue>& v)
{
  const long results[] = {
      sensor.SetID(U("S-" + std::to_string(n))),
      sensor.SetValue(VLXUnicodeString("serial"), v[0].GetInteger()),
      sensor.SetValueIntegers(VLXUnicodeString("counts"), 3, n, -n, 2147483647),
      sensor.SetValue(VLXUnicodeString("reading"), v[2].GetDouble()),
      sensor.SetValueDoubles(VLXUnicodeString("history"), 2, -0.0, 1e-300),
      sensor.SetValue(VLXUnicodeString("label"), v[4].GetString()),
      sensor.SetValueStrings(VLXUnicodeString("tags"), 2, "indoor", "<a & b>"),
      sensor.SetValue(VLXUnicodeString("installed"), v[6].GetDate()),
      sensor.SetValue(VLXUnicodeString("serviced"), v[7].GetListOfDate()),
      sensor.SetValue(VLXUnicodeString("active"), v[8].GetBoolean()),
      sensor.SetValueBooleans(VLXUnicodeString("flags"), 3, 1, 0, 1),
      sensor.SetValue(VLXUnicodeString("firmware"), v[10].GetBinary()),
      sensor.SetValue(VLXUnicodeString("blobs"), v[11].GetListOfBinary()),
      sensor.SetValue(VLXUnicodeString("next"), v[12].GetInstance()),
      sensor.SetValue(VLXUnicodeString("peers"), v[13].GetListOfInstance()),
  };
  for (long rc : results)
    if (VLX_FAILED(rc)) return rc;
  return VLX_S_OK;
}

// The identifier of an instance, as text.
std::string Id(const VLXKDMInstance& instance)
{
  VLXBoolean none = 1, isText = 0;
  VLXUnicodeString text;
  VLXBinary bytes;
  const_cast<VLXKDMInstance&>(instance).GetID(none, isText, text, bytes);
  return none ? "(none)" : Text(text);
}

// Whether two values hold the same data; instances compare by their identifiers, since the two
// replicas hold different Java objects.
bool SameValue(const VLXKDMInstanceValue& a, VLXKDMInstanceValue& b)
{
  if (const_cast<VLXKDMInstanceValue&>(a).GetType() != b.GetType() || a.IsMultiValuated() != b.IsMultiValuated())
    return false;
  const bool list = a.IsMultiValuated();
  switch (b.GetType()) {
    case VLXKDMInstanceValue::IntegerType:
      return list ? a.GetListOfInteger() == b.GetListOfInteger() : a.GetInteger() == b.GetInteger();
    case VLXKDMInstanceValue::DoubleType:
      return list ? a.GetListOfDouble() == b.GetListOfDouble() : a.GetDouble() == b.GetDouble();
    case VLXKDMInstanceValue::StringType:
      return list ? a.GetListOfString() == b.GetListOfString() : a.GetString() == b.GetString();
    case VLXKDMInstanceValue::DateType:
      return list ? a.GetListOfDate() == b.GetListOfDate() : a.GetDate() == b.GetDate();
    case VLXKDMInstanceValue::BooleanType:
      return list ? a.GetListOfBoolean() == b.GetListOfBoolean() : a.GetBoolean() == b.GetBoolean();
    case VLXKDMInstanceValue::BinaryType:
      return list ? a.GetListOfBinary() == b.GetListOfBinary() : a.GetBinary() == b.GetBinary();
    case VLXKDMInstanceValue::InstanceType: {
      if (!list) return Id(a.GetInstance()) == Id(b.GetInstance());
      const VLXListValVLXKDMInstance &x = a.GetListOfInstance(), &y = b.GetListOfInstance();
      if (x.Size() != y.Size()) return false;
      for (int i = 1; i <= x.Size(); ++i)
        if (Id(x[i]) != Id(y[i])) return false;
      return true;
    }
  }
  return false;
}

// The sensors of a replica, in order.
std::vector<VLXKDMInstance> Sensors(VLXKDMReplica& replica)
{
  std::vector<VLXKDMInstance> out;
  VLXKDMModelSet models;
  VLXKDMModel model;
  VLXKDMInstanceSet instances;
  int count = 0;
  if (VLX_FAILED(replica.GetModels(models)) || VLX_FAILED(models.GetItem(VLXUnicodeString("Sensor"), model)) ||
      VLX_FAILED(model.GetInstances(instances)) || VLX_FAILED(instances.GetCount(count)))
    return out;
  out.resize(static_cast<size_t>(count));
  for (int i = 0; i < count; ++i) instances.GetItem(i, out[static_cast<size_t>(i)]);
  return out;
}

// Compares every value of every sensor of a replica with the values written (not with another
// read, which could repeat the same change); prints and counts differences.
void Compare(const char* how, const std::vector<std::vector<VLXKDMInstanceValue>>& written, VLXKDMReplica& copy)
{
  std::vector<VLXKDMInstance> b = Sensors(copy);
  int compared = 0, different = written.size() == b.size() ? 0 : 1;
  for (size_t i = 0; i < written.size() && i < b.size(); ++i) {
    for (size_t k = 0; k < std::size(kSensorAttributes); ++k) {
      VLXKDMInstanceValue y;
      const bool read = VLX_SUCCEEDED(b[i].GetValue(VLXUnicodeString(kSensorAttributes[k].name), y));
      ++compared;
      if (!read || !SameValue(written[i][k], y)) {
        ++different;
        std::printf("      %s of %s differs\n", kSensorAttributes[k].name, Id(b[i]).c_str());
      }
    }
  }
  std::printf("      %s: %zu sensors, %d values compared, %d different\n", how, b.size(), compared, different);
  failures += different;
}

bool DataOfEveryType(VLXKDMReplica& replica)
{
  std::printf("\n4. Data of every type\n");
  VLXKDMModelSet models;
  VLXKDMModel model;
  if (!Must("Reach the model of \"Sensor\"",
            VLX_SUCCEEDED(replica.GetModels(models)) ? models.GetItem(VLXUnicodeString("Sensor"), model) : VLX_E_FAIL))
    return false;
  const int kSensors = 5;
  std::vector<VLXKDMInstance> sensors(kSensors);
  long rc = VLX_S_OK;
  for (VLXKDMInstance& sensor : sensors)
    if (VLX_SUCCEEDED(rc)) rc = model.CreateInstance(sensor);
  if (!Must("Create 5 sensors", rc)) return false;
  std::vector<std::vector<VLXKDMInstanceValue>> written;
  for (int n = 0; n < kSensors && VLX_SUCCEEDED(rc); ++n) {
    VLXListOfVLXKDMInstance peers;
    for (int p = 0; p < n; ++p) peers.Append(sensors[static_cast<size_t>(p)]);
    written.push_back(Written(n, sensors[static_cast<size_t>((n + 1) % kSensors)], peers));
    rc = Fill(sensors[static_cast<size_t>(n)], n, written.back());
  }
  if (!Must("Fill 5 sensors with 14 values each", rc) || !Must("Commit", replica.Commit())) return false;
  Compare("the replica itself", written, replica);

  VLXUnicodeString xml;
  VLXKDMReplica fromXml;
  if (!Must("Write the replica as XML (with its schema)", replica.GetXml(1, xml)) ||
      !Must("Read that XML into a new replica", VLXKDMReplica::ReadFromXmlString(xml, fromXml)))
    return false;
  std::printf("      %d bytes of XML\n", xml.GetLengthInByte());
  Compare("XML", written, fromXml);

  for (VLXBoolean compressed : {VLXBoolean(0), VLXBoolean(1)}) {
    VLXBinary bytes;
    VLXKDMReplica fromBytes;
    if (!Must(compressed ? "Write it as compressed bytes" : "Write it as bytes",
              VLXKDMReplica::GetBinaryFromReplica(replica, compressed, bytes)) ||
        !Must("Read those bytes into a new replica", VLXKDMReplica::GetReplicaFromBinary(bytes, compressed, fromBytes)))
      return false;
    std::printf("      %d bytes\n", bytes.getLength());
    Compare(compressed ? "compressed bytes" : "bytes", written, fromBytes);
  }
  return true;
}

void Failures()
{
  std::printf("\nHow a failure comes back:\n");
  VLXKDMReplica unbuilt, replica;
  VLXUnicodeString name;
  Report("Read the name of a replica never built", unbuilt.GetName(name));
  replica.Build();
  Report("Rename with malformed UTF-8", replica.SetName(VLXUnicodeString("bad \xC3\x28 text")));
  Report("Read an XML document with an external entity",
         VLXKDMReplica::ReadFromXmlString(
             VLXUnicodeString("<!DOCTYPE r [<!ENTITY x SYSTEM \"file:///etc/passwd\">]><r>&x;</r>"), replica));
  VLXBinary bytes;
  VLXKDMReplica::GetBinaryFromReplica(replica, 0, bytes);
  Report("Read uncompressed bytes as compressed ones", VLXKDMReplica::GetReplicaFromBinary(bytes, 1, replica));
}

}  // namespace

int main(int argc, char** argv)
{
  const std::string dir = argc > 1 ? argv[1] : CORVEXA_EXAMPLES_DIR;
  VLXKDMReplica plant;
  if (FirstSteps() && SampleData(dir) && SchemaBuiltInCpp(plant)) DataOfEveryType(plant);
  Failures();
  std::printf("\n%s\n", failures == 0 ? "Every step worked and every value survived."
                                      : "Some steps failed or some values did not survive.");
  return failures == 0 ? 0 : 1;
}
