// Every exported operation that calls Java, one row each: its method name text, a call on built
// proxies of a real replica that lands (VLX_S_OK, and the out-parameters it writes), and the same
// call on unbuilt proxies, which fails naming the operation and leaves every out-parameter alone.
#include <unistd.h>

#include <cctype>
#include <cstdio>
#include <fstream>
#include <functional>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "TestSupport.h"

using namespace corvexa_test;

namespace {

const std::string kExamples = CORVEXA_EXAMPLES_DIR;

std::string FileText(const std::string& path)
{
  std::ifstream in(path);
  std::stringstream text;
  text << in.rdbuf();
  return text.str();
}

// The proxies the operations run on. Built: a replica "world" with the class Sample and its model,
// two instances (the first has the identifier "id-1" and the integer 42), and schema settings that
// differ from the out-parameters' sentinels. Unbuilt: the same, but every proxy an operation runs
// on is not built; the proxies passed as arguments stay built.
struct World {
  bool built;
  VLXKDMReplica replica;
  VLXKDMModelSet models;
  VLXKDMModel model, freeModel;
  VLXKDMClassDef classDef, freeClass;  // freeClass: of no replica
  VLXKDMAttributeDefList attributes;
  VLXKDMAttributeDef attribute, freeAttribute;
  VLXKDMInstanceSet instances;
  VLXKDMInstance instance, target;

  explicit World(bool isBuilt) : built(isBuilt)
  {
    EXPECT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString("world")));
    AddClass(replica, "Sample", SampleAttributes(), model);
    EXPECT_EQ(VLX_S_OK, replica.GetModels(models));
    EXPECT_EQ(VLX_S_OK, model.GetClassDef(classDef));
    EXPECT_EQ(VLX_S_OK, classDef.GetAttributes(attributes));
    EXPECT_EQ(VLX_S_OK, attributes.GetItem(1, attribute));
    EXPECT_EQ(VLX_S_OK, model.GetInstances(instances));
    EXPECT_EQ(VLX_S_OK, model.CreateInstance(instance));
    EXPECT_EQ(VLX_S_OK, model.CreateInstance(target));
    EXPECT_EQ(VLX_S_OK, instance.SetValue(0, 42));
    EXPECT_EQ(VLX_S_OK, instance.SetID(VLXUnicodeString("id-1")));
    EXPECT_EQ(VLX_S_OK, attribute.SetAccessMode(VLXKDMAccessMode::Write));
    EXPECT_EQ(VLX_S_OK, attribute.SetAggregationType(VLXKDMAggregationType::Shared));
    EXPECT_EQ(VLX_S_OK, attribute.SetSoftwareVisibility(VLXKDMVisibility::Private));
    EXPECT_EQ(VLX_S_OK, attribute.SetLength(12));
    EXPECT_EQ(VLX_S_OK, classDef.SetClassType(VLXKDMClassType::Extension));
    EXPECT_EQ(VLX_S_OK, classDef.SetSoftwareVisibility(VLXKDMVisibility::Protected));
    EXPECT_EQ(VLX_S_OK, freeClass.Build(VLXUnicodeString("Free")));
    EXPECT_EQ(VLX_S_OK, freeModel.Build(freeClass));
    EXPECT_EQ(VLX_S_OK, freeAttribute.Build(VLXUnicodeString("extra"), VLXKDMAttributeType::Integer));
    if (built) return;
    replica = VLXKDMReplica();
    models = VLXKDMModelSet();
    model = VLXKDMModel();
    classDef = VLXKDMClassDef();
    freeClass = VLXKDMClassDef();
    attributes = VLXKDMAttributeDefList();
    attribute = VLXKDMAttributeDef();
    instances = VLXKDMInstanceSet();
    instance = VLXKDMInstance();
  }
};

// The out-parameters, each holding a sentinel: the proxies are attached to the objects of another
// world, the value holder holds the integer 5 without Java object.
struct Outs {
  World sentinel{true};
  VLXUnicodeString text{"sentinel"};
  int number = -7777;
  VLXBoolean flag = 9, isText = 9;
  VLXBinary bytes{"\x5A", 1};
  VLXListOfVLXUnicodeString texts = ListOf<VLXListOfVLXUnicodeString>({VLXUnicodeString("sentinel")});
  VLXKDMAttributeType::Type type = VLXKDMAttributeType::Binary;
  VLXKDMAccessMode::Mode access = VLXKDMAccessMode::ReadWrite;
  VLXKDMAggregationType::Type aggregation = VLXKDMAggregationType::Composition;
  VLXKDMVisibility::Mode visibility = VLXKDMVisibility::Public;
  VLXKDMClassType::Type classType = VLXKDMClassType::Class;
  VLXKDMReplica replica = sentinel.replica;
  VLXKDMModelSet models = sentinel.models;
  VLXKDMModel model = sentinel.model;
  VLXKDMClassDef classDef = sentinel.classDef;
  VLXKDMAttributeDefList attributes = sentinel.attributes;
  VLXKDMAttributeDef attribute = sentinel.attribute;
  VLXKDMInstanceSet instances = sentinel.instances;
  VLXKDMInstance instance = sentinel.instance;
  VLXKDMInstanceValue value;
  Outs() { value.SetInteger(5); }
};

// A value holder as "type[L][:integer][+]": L for a list, + when it holds a Java object.
std::string Describe(VLXKDMInstanceValue& v)
{
  const bool integer = v.GetType() == VLXKDMInstanceValue::IntegerType && !v.IsMultiValuated();
  return std::to_string(v.GetType()) + (v.IsMultiValuated() ? "L" : "") +
         (integer ? ":" + std::to_string(v.GetInteger()) : "") + (v.GetHandle() ? "+" : "");
}

// The out-parameters that no longer hold their sentinel, in declaration order: "name=value" for
// plain values, the bare name for bytes and proxies ("name=null" for a proxy detached).
std::string Changes(Outs& o)
{
  std::string out;
  auto add = [&out](bool changed, std::string token) {
    for (char& c : token) c = std::isspace(static_cast<unsigned char>(c)) ? '_' : c;
    if (changed) out += (out.empty() ? "" : " ") + token.substr(0, 60);
  };
  add(Text(o.text) != "sentinel", "text=" + Text(o.text));
  add(o.number != -7777, "number=" + std::to_string(o.number));
  add(o.flag != 9, "flag=" + std::to_string(o.flag));
  add(o.isText != 9, "isText=" + std::to_string(o.isText));
  add(!(o.bytes == VLXBinary("\x5A", 1)), "bytes");
  add(Texts(o.texts) != "sentinel", "texts=" + Texts(o.texts));
  add(o.type != VLXKDMAttributeType::Binary, "type=" + std::to_string(o.type));
  add(o.access != VLXKDMAccessMode::ReadWrite, "access=" + std::to_string(o.access));
  add(o.aggregation != VLXKDMAggregationType::Composition, "aggregation=" + std::to_string(o.aggregation));
  add(o.visibility != VLXKDMVisibility::Public, "visibility=" + std::to_string(o.visibility));
  add(o.classType != VLXKDMClassType::Class, "classType=" + std::to_string(o.classType));
  auto proxy = [&](const char* name, const VLXKDMJavaObject& p, const VLXKDMJavaObject& s) {
    add(!Same(p.GetHandle(), s.GetHandle()), std::string(name) + (p.GetHandle() ? "" : "=null"));
  };
  proxy("replica", o.replica, o.sentinel.replica);
  proxy("models", o.models, o.sentinel.models);
  proxy("model", o.model, o.sentinel.model);
  proxy("classDef", o.classDef, o.sentinel.classDef);
  proxy("attributes", o.attributes, o.sentinel.attributes);
  proxy("attribute", o.attribute, o.sentinel.attribute);
  proxy("instances", o.instances, o.sentinel.instances);
  proxy("instance", o.instance, o.sentinel.instance);
  add(Describe(o.value) != "0:5", "value=" + Describe(o.value));
  return out;
}

// Whether the changes are the expected ones: an expected token without "=" stands for any value.
bool Matches(const std::string& expected, const std::string& actual)
{
  std::istringstream e(expected), a(actual);
  std::string et, at;
  while (e >> et) {
    if (!(a >> at)) return false;
    if (et != at && (et.find('=') != std::string::npos || at.rfind(et + "=", 0) != 0)) return false;
  }
  return !(a >> at);
}

// An enumeration getter's answer written into out.
template <class P, class E>
long AsNumber(P& proxy, long (P::*get)(E&), int& out)
{
  E value = E();
  const long rc = (proxy.*get)(value);
  if (rc >= 0) out = value;
  return rc;
}

// Exchange with Java: a holder or reference made from the replica, written into o.number as 1.
long ToJava(World& w, Outs& o, bool holder)
{
  jobject object = nullptr;
  const long rc = holder ? w.replica.ConvertToJavaHolder(Env(), object) : w.replica.ConvertToJavaType(Env(), object);
  if (object) o.number = 1;
  Local owned(object);
  return rc;
}
long FromHolder(World& w, Outs& o)
{
  jobject holder = nullptr;
  EXPECT_EQ(VLX_S_OK, w.replica.ConvertToJavaHolder(Env(), holder));
  Local owned(holder);
  return o.replica.BuildFromJavaHolder(Env(), holder);
}
long FromJava(World& w, Outs& o) { return o.replica.BuildFromJavaType(Env(), w.replica.GetHandle()); }
// BuildLocal of the holder o.value, attached (in the built world only) to a Java Integer 42.
long ReadLocal(World& w, Outs& o)
{
  Local boxed(New("java/lang/Integer", "(I)V", jint(42)));
  if (w.built) {
    EXPECT_EQ(VLX_S_OK, o.value.SetHandle(Env(), boxed.get()));
  }
  return o.value.BuildLocal();
}
long ReadOwnXml(World& w, Outs& o)
{
  VLXUnicodeString xml;
  EXPECT_EQ(VLX_S_OK, w.replica.GetXml(1, xml));
  return VLXKDMReplica::ReadFromXmlString(xml, o.replica);
}
long FromBinary(World& w, Outs& o)
{
  VLXBinary bytes;
  EXPECT_EQ(VLX_S_OK, VLXKDMReplica::GetBinaryFromReplica(w.replica, 1, bytes));
  return VLXKDMReplica::GetReplicaFromBinary(bytes, 1, o.replica);
}
const std::string& DocumentFile()
{
  static const std::string path = [] {
    const std::string p = ::testing::TempDir() + "corvexa-operations-" + std::to_string(getpid()) + ".xml";
    std::ofstream(p)
        << "<replica xmlns=\"urn:corvexa:replica:1\" format=\"1\" name=\"doc\"><Sample key=\"k1\"/></replica>";
    return p;
  }();
  return path;
}

struct Operation {
  const char* name;
  long (*call)(World&, Outs&);
  const char* landed;  // Changes() after the call on the built world
  bool needsProxy;     // false: a Build, static or exchange operation, which runs on no built proxy
};

#define OP(name, landed, ...)           \
  {                                     \
    name,                               \
        [](World& w, Outs& o) -> long { \
          (void)w, (void)o;             \
          return __VA_ARGS__;           \
        },                              \
        landed, true                    \
  }
#define FREE(name, landed, ...)         \
  {                                     \
    name,                               \
        [](World& w, Outs& o) -> long { \
          (void)w, (void)o;             \
          return __VA_ARGS__;           \
        },                              \
        landed, false                   \
  }
// b runs only when a succeeded.
#define THEN(a, b)            \
  [&] {                       \
    const long rc = (a);      \
    return rc < 0 ? rc : (b); \
  }()
#define INST "VLXKDMInstance::"
#define LIST_NAMED(T) INST "SetValue(const VLXUnicodeString&, const VLXListOf" T "&)"
#define LIST_AT(T) INST "SetValue(int, const VLXListOf" T "&)"

const VLXBinary kAb("ab", 2);
const VLXTime kMinute = Seconds(60);

const Operation kOperations[] = {
    // ---- VLXKDMReplica
    FREE("VLXKDMReplica::Build()", "replica", o.replica.Build()),
    FREE("VLXKDMReplica::Build(const VLXUnicodeString&)", "text=made replica",
         THEN(o.replica.Build(U("made")), o.replica.GetName(o.text))),
    OP("VLXKDMReplica::GetName(VLXUnicodeString&)", "text=world", w.replica.GetName(o.text)),
    OP("VLXKDMReplica::SetName(const VLXUnicodeString&)", "text=renamed",
       THEN(w.replica.SetName(U("renamed")), w.replica.GetName(o.text))),
    OP("VLXKDMReplica::ToString(VLXUnicodeString&)", "text", w.replica.ToString(o.text)),
    OP("VLXKDMReplica::Commit()", "flag=0", THEN(w.replica.Commit(), w.instance.IsCreated(o.flag))),
    OP("VLXKDMReplica::GetModels(VLXKDMModelSet&)", "models", w.replica.GetModels(o.models)),
    OP("VLXKDMReplica::GetClassDef(const VLXUnicodeString&, VLXKDMClassDef&)", "classDef",
       w.replica.GetClassDef(U("Sample"), o.classDef)),
    OP("VLXKDMReplica::GetAttributeDef(const VLXUnicodeString&, VLXKDMAttributeDef&)", "attribute",
       w.replica.GetAttributeDef(U("Sample.double"), o.attribute)),
    FREE("VLXKDMReplica::SetSchemaLocation(const VLXUnicodeString&)", "", VLXKDMReplica::SetSchemaLocation(U(""))),
    OP("VLXKDMReplica::GetSchemaLocation(VLXUnicodeString&)", "text", w.replica.GetSchemaLocation(o.text)),
    FREE("VLXKDMReplica::SetFeature(const VLXUnicodeString&, VLXBoolean)", "",
         VLXKDMReplica::SetFeature(U("indent"), 1)),
    OP("VLXKDMReplica::InsertSchemaFile(const VLXUnicodeString&)", "classDef",
       THEN(w.replica.InsertSchemaFile(U(kExamples + "/inventory.xsd")), w.replica.GetClassDef(U("Bolt"), o.classDef))),
    OP("VLXKDMReplica::InsertSchemaString(const VLXUnicodeString&)", "classDef",
       THEN(w.replica.InsertSchemaString(U(FileText(kExamples + "/inventory.xsd"))),
            w.replica.GetClassDef(U("Bolt"), o.classDef))),
    OP("VLXKDMReplica::PopulatesFromXmlFile(const VLXUnicodeString&)", "number=3",
       THEN(w.replica.PopulatesFromXmlFile(U(DocumentFile())), w.instances.GetCount(o.number))),
    OP("VLXKDMReplica::PopulatesFromXmlString(const VLXUnicodeString&)", "number=3",
       THEN(w.replica.PopulatesFromXmlString(U(FileText(DocumentFile()))), w.instances.GetCount(o.number))),
    FREE("VLXKDMReplica::ReadFromXmlFile(const VLXUnicodeString&, VLXKDMReplica&)", "text=inventory replica",
         THEN(VLXKDMReplica::ReadFromXmlFile(U(kExamples + "/inventory.xml"), o.replica), o.replica.GetName(o.text))),
    FREE("VLXKDMReplica::ReadFromXmlString(const VLXUnicodeString&, VLXKDMReplica&)", "text=world replica",
         THEN(ReadOwnXml(w, o), o.replica.GetName(o.text))),
    OP("VLXKDMReplica::GetXml(VLXBoolean, VLXUnicodeString&)", "text", w.replica.GetXml(1, o.text)),
    OP("VLXKDMReplica::GetXml(VLXBoolean, VLXBoolean, VLXUnicodeString&)", "text", w.replica.GetXml(1, 1, o.text)),
    OP("VLXKDMReplica::GetXsd(VLXUnicodeString&)", "text", w.replica.GetXsd(o.text)),
    FREE("VLXKDMReplica::GetBinaryFromReplica(const VLXKDMReplica&, VLXBoolean, VLXBinary&)", "bytes",
         VLXKDMReplica::GetBinaryFromReplica(w.replica, 0, o.bytes)),
    FREE("VLXKDMReplica::GetReplicaFromBinary(const VLXBinary&, VLXBoolean, VLXKDMReplica&)", "text=world replica",
         THEN(FromBinary(w, o), o.replica.GetName(o.text))),
    FREE("VLXKDMReplica::BuildFromJavaType(JNIEnv*, jobject)", "text=world replica",
         THEN(FromJava(w, o), o.replica.GetName(o.text))),
    FREE("VLXKDMReplica::ConvertToJavaType(JNIEnv*, jobject&)", "number=1", ToJava(w, o, false)),
    FREE("VLXKDMReplica::BuildFromJavaHolder(JNIEnv*, jobject)", "text=world replica",
         THEN(FromHolder(w, o), o.replica.GetName(o.text))),
    FREE("VLXKDMReplica::ConvertToJavaHolder(JNIEnv*, jobject&)", "number=1", ToJava(w, o, true)),

    // ---- VLXKDMClassDef
    FREE("VLXKDMClassDef::Build()", "classDef", o.classDef.Build()),
    FREE("VLXKDMClassDef::Build(const VLXUnicodeString&)", "text=Made classDef",
         THEN(o.classDef.Build(U("Made")), o.classDef.GetClassName(o.text))),
    OP("VLXKDMClassDef::GetClassName(VLXUnicodeString&)", "text=Sample", w.classDef.GetClassName(o.text)),
    OP("VLXKDMClassDef::SetClassName(const VLXUnicodeString&)", "text=Renamed",
       THEN(w.classDef.SetClassName(U("Renamed")), w.classDef.GetClassName(o.text))),
    OP("VLXKDMClassDef::GetSuperName(VLXUnicodeString&)", "text", w.classDef.GetSuperName(o.text)),
    OP("VLXKDMClassDef::SetSuperName(const VLXUnicodeString&)", "text=Base",
       THEN(w.freeClass.SetSuperName(U("Base")), w.freeClass.GetSuperName(o.text))),
    OP("VLXKDMClassDef::GetUuid(VLXUnicodeString&)", "text", w.classDef.GetUuid(o.text)),
    OP("VLXKDMClassDef::SetUuid(const VLXUnicodeString&)", "text=u-1",
       THEN(w.classDef.SetUuid(U("u-1")), w.classDef.GetUuid(o.text))),
    OP("VLXKDMClassDef::GetQKAComment(VLXUnicodeString&)", "text", w.classDef.GetQKAComment(o.text)),
    OP("VLXKDMClassDef::SetQKAComment(const VLXUnicodeString&)", "text=said",
       THEN(w.classDef.SetQKAComment(U("said")), w.classDef.GetQKAComment(o.text))),
    OP("VLXKDMClassDef::GetQKADerivability(VLXUnicodeString&)", "text", w.classDef.GetQKADerivability(o.text)),
    OP("VLXKDMClassDef::SetQKADerivability(const VLXUnicodeString&)", "text=derived",
       THEN(w.classDef.SetQKADerivability(U("derived")), w.classDef.GetQKADerivability(o.text))),
    OP("VLXKDMClassDef::GetScopeNames(VLXListOfVLXUnicodeString&)", "texts", w.classDef.GetScopeNames(o.texts)),
    OP("VLXKDMClassDef::SetScopeNames(const VLXListOfVLXUnicodeString&)", "texts=a,b",
       THEN(w.classDef.SetScopeNames(ListOf<VLXListOfVLXUnicodeString>({U("a"), U("b")})),
            w.classDef.GetScopeNames(o.texts))),
    OP("VLXKDMClassDef::SetScopeNames(const VLXListOfVLXUnicodeString&)", "texts=a,b",
       THEN(w.classDef.SetScopeNames(2, "a", "b"), w.classDef.GetScopeNames(o.texts))),
    OP("VLXKDMClassDef::IsAbstract(VLXBoolean&)", "flag=0", w.classDef.IsAbstract(o.flag)),
    OP("VLXKDMClassDef::SetAbstract(VLXBoolean)", "flag=1",
       THEN(w.classDef.SetAbstract(2), w.classDef.IsAbstract(o.flag))),
    OP("VLXKDMClassDef::IsExtensible(VLXBoolean&)", "flag", w.classDef.IsExtensible(o.flag)),
    OP("VLXKDMClassDef::SetExtensibility(VLXBoolean)", "flag=0",
       THEN(w.classDef.SetExtensibility(0), w.classDef.IsExtensible(o.flag))),
    OP("VLXKDMClassDef::IsPersistent(VLXBoolean&)", "flag", w.classDef.IsPersistent(o.flag)),
    OP("VLXKDMClassDef::SetPersistency(VLXBoolean)", "flag=0",
       THEN(w.classDef.SetPersistency(0), w.classDef.IsPersistent(o.flag))),
    OP("VLXKDMClassDef::GetClassType(VLXKDMClassType::Type&)", "classType=1", w.classDef.GetClassType(o.classType)),
    OP("VLXKDMClassDef::SetClassType(VLXKDMClassType::Type)", "number=0",
       THEN(w.classDef.SetClassType(VLXKDMClassType::Class),
            AsNumber(w.classDef, &VLXKDMClassDef::GetClassType, o.number))),
    OP("VLXKDMClassDef::GetSoftwareVisibility(VLXKDMVisibility::Mode&)", "visibility=1",
       w.classDef.GetSoftwareVisibility(o.visibility)),
    OP("VLXKDMClassDef::SetSoftwareVisibility(VLXKDMVisibility::Mode)", "number=2",
       THEN(w.classDef.SetSoftwareVisibility(VLXKDMVisibility::Private),
            AsNumber(w.classDef, &VLXKDMClassDef::GetSoftwareVisibility, o.number))),
    OP("VLXKDMClassDef::GetAttributes(VLXKDMAttributeDefList&)", "attributes", w.classDef.GetAttributes(o.attributes)),
    OP("VLXKDMClassDef::ToString(VLXUnicodeString&)", "text", w.classDef.ToString(o.text)),

    // ---- VLXKDMAttributeDef
    FREE("VLXKDMAttributeDef::Build(const VLXUnicodeString&, VLXKDMAttributeType::Type)", "type=4 attribute",
         THEN(o.attribute.Build(U("made"), VLXKDMAttributeType::Boolean), o.attribute.GetAttributeType(o.type))),
    OP("VLXKDMAttributeDef::GetAttributeName(VLXUnicodeString&)", "text=double", w.attribute.GetAttributeName(o.text)),
    OP("VLXKDMAttributeDef::GetAttributeType(VLXKDMAttributeType::Type&)", "type=1",
       w.attribute.GetAttributeType(o.type)),
    OP("VLXKDMAttributeDef::GetUuid(VLXUnicodeString&)", "text", w.attribute.GetUuid(o.text)),
    OP("VLXKDMAttributeDef::SetUuid(const VLXUnicodeString&)", "text=u-2",
       THEN(w.attribute.SetUuid(U("u-2")), w.attribute.GetUuid(o.text))),
    OP("VLXKDMAttributeDef::GetQKAComment(VLXUnicodeString&)", "text", w.attribute.GetQKAComment(o.text)),
    OP("VLXKDMAttributeDef::SetQKAComment(const VLXUnicodeString&)", "text=noted",
       THEN(w.attribute.SetQKAComment(U("noted")), w.attribute.GetQKAComment(o.text))),
    OP("VLXKDMAttributeDef::GetTargetNames(VLXListOfVLXUnicodeString&)", "texts", w.attribute.GetTargetNames(o.texts)),
    OP("VLXKDMAttributeDef::SetTargetNames(const VLXListOfVLXUnicodeString&)", "texts=P",
       THEN(w.attribute.SetTargetNames(ListOf<VLXListOfVLXUnicodeString>({U("P")})),
            w.attribute.GetTargetNames(o.texts))),
    OP("VLXKDMAttributeDef::SetTargetNames(const VLXListOfVLXUnicodeString&)", "texts=P,Q",
       THEN(w.attribute.SetTargetNames(2, "P", "Q"), w.attribute.GetTargetNames(o.texts))),
    OP("VLXKDMAttributeDef::GetTargetRefs(VLXListOfVLXUnicodeString&)", "texts", w.attribute.GetTargetRefs(o.texts)),
    OP("VLXKDMAttributeDef::SetTargetRefs(const VLXListOfVLXUnicodeString&)", "texts=r",
       THEN(w.attribute.SetTargetRefs(ListOf<VLXListOfVLXUnicodeString>({U("r")})),
            w.attribute.GetTargetRefs(o.texts))),
    OP("VLXKDMAttributeDef::SetTargetRefs(const VLXListOfVLXUnicodeString&)", "texts=r,s,t",
       THEN(w.attribute.SetTargetRefs(3, "r", "s", "t"), w.attribute.GetTargetRefs(o.texts))),
    OP("VLXKDMAttributeDef::GetAggregationType(VLXKDMAggregationType::Type&)", "aggregation=1",
       w.attribute.GetAggregationType(o.aggregation)),
    OP("VLXKDMAttributeDef::SetAggregationType(VLXKDMAggregationType::Type)", "number=0",
       THEN(w.attribute.SetAggregationType(VLXKDMAggregationType::Composition),
            AsNumber(w.attribute, &VLXKDMAttributeDef::GetAggregationType, o.number))),
    OP("VLXKDMAttributeDef::GetAccessMode(VLXKDMAccessMode::Mode&)", "access=1", w.attribute.GetAccessMode(o.access)),
    OP("VLXKDMAttributeDef::SetAccessMode(VLXKDMAccessMode::Mode)", "number=0",
       THEN(w.attribute.SetAccessMode(VLXKDMAccessMode::Read),
            AsNumber(w.attribute, &VLXKDMAttributeDef::GetAccessMode, o.number))),
    OP("VLXKDMAttributeDef::GetSoftwareVisibility(VLXKDMVisibility::Mode&)", "visibility=2",
       w.attribute.GetSoftwareVisibility(o.visibility)),
    OP("VLXKDMAttributeDef::SetSoftwareVisibility(VLXKDMVisibility::Mode)", "number=1",
       THEN(w.attribute.SetSoftwareVisibility(VLXKDMVisibility::Protected),
            AsNumber(w.attribute, &VLXKDMAttributeDef::GetSoftwareVisibility, o.number))),
    OP("VLXKDMAttributeDef::GetLength(int&)", "number=12", w.attribute.GetLength(o.number)),
    OP("VLXKDMAttributeDef::SetLength(int)", "number=-3",
       THEN(w.attribute.SetLength(-3), w.attribute.GetLength(o.number))),
    OP("VLXKDMAttributeDef::IsMandatory(VLXBoolean&)", "flag=0", w.attribute.IsMandatory(o.flag)),
    OP("VLXKDMAttributeDef::SetMandatory(VLXBoolean)", "flag=1",
       THEN(w.attribute.SetMandatory(128), w.attribute.IsMandatory(o.flag))),
    OP("VLXKDMAttributeDef::IsMultiValuated(VLXBoolean&)", "flag=0", w.attribute.IsMultiValuated(o.flag)),
    OP("VLXKDMAttributeDef::SetMultiValuation(VLXBoolean)", "flag=1",
       THEN(w.attribute.SetMultiValuation(255), w.attribute.IsMultiValuated(o.flag))),
    OP("VLXKDMAttributeDef::IsUnique(VLXBoolean&)", "flag=0", w.attribute.IsUnique(o.flag)),
    OP("VLXKDMAttributeDef::SetUnicity(VLXBoolean)", "flag=1",
       THEN(w.attribute.SetUnicity(3), w.attribute.IsUnique(o.flag))),
    OP("VLXKDMAttributeDef::GetClassDef(VLXKDMClassDef&)", "classDef", w.attribute.GetClassDef(o.classDef)),
    OP("VLXKDMAttributeDef::ToString(VLXUnicodeString&)", "text", w.attribute.ToString(o.text)),

    // ---- VLXKDMAttributeDefList (the 14 attributes of Sample)
    OP("VLXKDMAttributeDefList::GetCount(int&)", "number=14", w.attributes.GetCount(o.number)),
    OP("VLXKDMAttributeDefList::GetItem(int, VLXKDMAttributeDef&)", "text=string attribute",
       THEN(w.attributes.GetItem(2, o.attribute), o.attribute.GetAttributeName(o.text))),
    OP("VLXKDMAttributeDefList::GetItem(const VLXUnicodeString&, VLXKDMAttributeDef&)", "text=dates attribute",
       THEN(w.attributes.GetItem(U("dates"), o.attribute), o.attribute.GetAttributeName(o.text))),
    OP("VLXKDMAttributeDefList::Includes(const VLXUnicodeString&, VLXBoolean&)", "flag=1",
       w.attributes.Includes(U("double"), o.flag)),
    OP("VLXKDMAttributeDefList::IndexOf(const VLXKDMAttributeDef&, int&)", "number=1",
       w.attributes.IndexOf(w.attribute, o.number)),
    OP("VLXKDMAttributeDefList::IndexOf(const VLXUnicodeString&, int&)", "number=2",
       w.attributes.IndexOf(U("string"), o.number)),
    OP("VLXKDMAttributeDefList::Add(const VLXKDMAttributeDef&)", "number=15",
       THEN(w.attributes.Add(w.freeAttribute), w.attributes.GetCount(o.number))),
    OP("VLXKDMAttributeDefList::Remove(const VLXKDMAttributeDef&)", "number=13",
       THEN(w.attributes.Remove(w.attribute), w.attributes.GetCount(o.number))),
    OP("VLXKDMAttributeDefList::Remove(const VLXUnicodeString&)", "number=13",
       THEN(w.attributes.Remove(U("double")), w.attributes.GetCount(o.number))),
    OP("VLXKDMAttributeDefList::Remove(int)", "number=13",
       THEN(w.attributes.Remove(3), w.attributes.GetCount(o.number))),

    // ---- VLXKDMModel
    FREE("VLXKDMModel::Build(const VLXKDMClassDef&)", "model", o.model.Build(w.classDef)),
    OP("VLXKDMModel::CreateInstance(VLXKDMInstance&)", "instance", w.model.CreateInstance(o.instance)),
    OP("VLXKDMModel::GetClassDef(VLXKDMClassDef&)", "text=Sample classDef",
       THEN(w.model.GetClassDef(o.classDef), o.classDef.GetClassName(o.text))),
    OP("VLXKDMModel::GetInstances(VLXKDMInstanceSet&)", "number=2 instances",
       THEN(w.model.GetInstances(o.instances), o.instances.GetCount(o.number))),
    OP("VLXKDMModel::GetReplica(VLXKDMReplica&)", "text=world replica",
       THEN(w.model.GetReplica(o.replica), o.replica.GetName(o.text))),
    OP("VLXKDMModel::ToString(VLXUnicodeString&)", "text", w.model.ToString(o.text)),

    // ---- VLXKDMModelSet (the one model of Sample)
    OP("VLXKDMModelSet::GetCount(int&)", "number=1", w.models.GetCount(o.number)),
    OP("VLXKDMModelSet::GetItem(int, VLXKDMModel&)", "model", w.models.GetItem(0, o.model)),
    OP("VLXKDMModelSet::GetItem(const VLXUnicodeString&, VLXKDMModel&)", "model",
       w.models.GetItem(U("Sample"), o.model)),
    OP("VLXKDMModelSet::Includes(const VLXUnicodeString&, VLXBoolean&)", "flag=1",
       w.models.Includes(U("Sample"), o.flag)),
    OP("VLXKDMModelSet::IndexOf(const VLXKDMClassDef&, int&)", "number=0", w.models.IndexOf(w.classDef, o.number)),
    OP("VLXKDMModelSet::IndexOf(const VLXUnicodeString&, int&)", "number=-1", w.models.IndexOf(U("Absent"), o.number)),
    OP("VLXKDMModelSet::Add(const VLXKDMModel&)", "number=2",
       THEN(w.models.Add(w.freeModel), w.models.GetCount(o.number))),
    OP("VLXKDMModelSet::Remove(const VLXKDMClassDef&)", "number=0",
       THEN(w.models.Remove(w.classDef), w.models.GetCount(o.number))),
    OP("VLXKDMModelSet::Remove(const VLXUnicodeString&)", "number=0",
       THEN(w.models.Remove(U("Sample")), w.models.GetCount(o.number))),
    OP("VLXKDMModelSet::Remove(int)", "number=0", THEN(w.models.Remove(0), w.models.GetCount(o.number))),

    // ---- VLXKDMInstanceSet (instance, then target)
    OP("VLXKDMInstanceSet::GetCount(int&)", "number=2", w.instances.GetCount(o.number)),
    OP("VLXKDMInstanceSet::GetItem(int, VLXKDMInstance&)", "text=id-1 flag=0 isText=1 instance",
       THEN(w.instances.GetItem(0, o.instance), o.instance.GetID(o.flag, o.isText, o.text, o.bytes))),
    OP("VLXKDMInstanceSet::IndexOf(const VLXKDMInstance&, int&)", "number=1", w.instances.IndexOf(w.target, o.number)),
    OP("VLXKDMInstanceSet::Remove(const VLXKDMInstance&)", "number=1",
       THEN(w.instances.Remove(w.target), w.instances.GetCount(o.number))),
    OP("VLXKDMInstanceSet::Remove(int)", "number=1", THEN(w.instances.Remove(0), w.instances.GetCount(o.number))),
    OP("VLXKDMInstanceSet::RemoveAll()", "number=0", THEN(w.instances.RemoveAll(), w.instances.GetCount(o.number))),

    // ---- VLXKDMInstance
    OP(INST "GetClassDef(VLXKDMClassDef&)", "classDef", w.instance.GetClassDef(o.classDef)),
    OP(INST "GetID(VLXBoolean&, VLXBoolean&, VLXUnicodeString&, VLXBinary&)", "text=id-1 flag=0 isText=1",
       w.instance.GetID(o.flag, o.isText, o.text, o.bytes)),
    OP(INST "SetID(const VLXUnicodeString&)", "text=id-2 flag=0 isText=1",
       THEN(w.instance.SetID(U("id-2")), w.instance.GetID(o.flag, o.isText, o.text, o.bytes))),
    OP(INST "SetID(const VLXBinary&)", "flag=0 isText=0 bytes",
       THEN(w.instance.SetID(kAb), w.instance.GetID(o.flag, o.isText, o.text, o.bytes))),
    OP(INST "IsCreated(VLXBoolean&)", "flag=1", w.instance.IsCreated(o.flag)),
    OP(INST "IsModified(VLXBoolean&)", "flag=0", w.instance.IsModified(o.flag)),
    OP(INST "IsDeleted(VLXBoolean&)", "flag=0", w.instance.IsDeleted(o.flag)),
    OP(INST "IsValuated(const VLXUnicodeString&, VLXBoolean&)", "flag=1", w.instance.IsValuated(U("integer"), o.flag)),
    OP(INST "IsValuated(int, VLXBoolean&)", "flag=0", w.instance.IsValuated(1, o.flag)),
    OP(INST "ClearValue(const VLXUnicodeString&)", "flag=0",
       THEN(w.instance.ClearValue(U("integer")), w.instance.IsValuated(0, o.flag))),
    OP(INST "ClearValue(int)", "flag=0", THEN(w.instance.ClearValue(0), w.instance.IsValuated(0, o.flag))),
    OP(INST "GetValue(const VLXUnicodeString&, VLXKDMInstanceValue&)", "value=0:42+",
       w.instance.GetValue(U("integer"), o.value)),
    OP(INST "GetValue(int, VLXKDMInstanceValue&)", "value=0:42+", w.instance.GetValue(0, o.value)),
    OP(INST "SetValue(const VLXUnicodeString&, VLXKDMInstanceValue&)", "value=0:5+",
       THEN(w.instance.SetValue(U("integer"), o.value), w.instance.GetValue(0, o.value))),
    OP(INST "SetValue(int, VLXKDMInstanceValue&)", "value=0:5+",
       THEN(w.instance.SetValue(0, o.value), w.instance.GetValue(0, o.value))),
    OP(INST "SetValue(const VLXUnicodeString&, int)", "value=0:7+",
       THEN(w.instance.SetValue(U("integer"), 7), w.instance.GetValue(0, o.value))),
    OP(INST "SetValue(int, int)", "value=0:7+", THEN(w.instance.SetValue(0, 7), w.instance.GetValue(0, o.value))),
    OP(INST "SetValue(const VLXUnicodeString&, double)", "value=1+",
       THEN(w.instance.SetValue(U("double"), 2.5), w.instance.GetValue(1, o.value))),
    OP(INST "SetValue(int, double)", "value=1+", THEN(w.instance.SetValue(1, 2.5), w.instance.GetValue(1, o.value))),
    OP(INST "SetValue(const VLXUnicodeString&, const VLXUnicodeString&)", "value=2+",
       THEN(w.instance.SetValue(U("string"), U("s")), w.instance.GetValue(2, o.value))),
    OP(INST "SetValue(int, const VLXUnicodeString&)", "value=2+",
       THEN(w.instance.SetValue(2, U("s")), w.instance.GetValue(2, o.value))),
    OP(INST "SetValue(const VLXUnicodeString&, const VLXTime&)", "value=3+",
       THEN(w.instance.SetValue(U("date"), kMinute), w.instance.GetValue(3, o.value))),
    OP(INST "SetValue(int, const VLXTime&)", "value=3+",
       THEN(w.instance.SetValue(3, kMinute), w.instance.GetValue(3, o.value))),
    OP(INST "SetValue(const VLXUnicodeString&, VLXBoolean)", "value=4+",
       THEN(w.instance.SetValue(U("boolean"), VLXBoolean(1)), w.instance.GetValue(4, o.value))),
    OP(INST "SetValue(int, VLXBoolean)", "value=4+",
       THEN(w.instance.SetValue(4, VLXBoolean(1)), w.instance.GetValue(4, o.value))),
    OP(INST "SetValue(const VLXUnicodeString&, const VLXBinary&)", "value=5+",
       THEN(w.instance.SetValue(U("binary"), kAb), w.instance.GetValue(5, o.value))),
    OP(INST "SetValue(int, const VLXBinary&)", "value=5+",
       THEN(w.instance.SetValue(5, kAb), w.instance.GetValue(5, o.value))),
    OP(INST "SetValue(const VLXUnicodeString&, const VLXKDMInstance&)", "value=6+",
       THEN(w.instance.SetValue(U("instance"), w.target), w.instance.GetValue(6, o.value))),
    OP(INST "SetValue(int, const VLXKDMInstance&)", "value=6+",
       THEN(w.instance.SetValue(6, w.target), w.instance.GetValue(6, o.value))),
    OP(LIST_NAMED("Int"), "value=0L+",
       THEN(w.instance.SetValue(U("integers"), ListOf<VLXRawCollint>({1, 2})), w.instance.GetValue(7, o.value))),
    OP(LIST_AT("Int"), "value=0L+",
       THEN(w.instance.SetValue(7, ListOf<VLXRawCollint>({1})), w.instance.GetValue(7, o.value))),
    OP(LIST_NAMED("Int"), "value=0L+",
       THEN(w.instance.SetValueIntegers(U("integers"), 2, 1, 2), w.instance.GetValue(7, o.value))),
    OP(LIST_AT("Int"), "value=0L+", THEN(w.instance.SetValueIntegers(7, 1, 3), w.instance.GetValue(7, o.value))),
    OP(LIST_NAMED("Double"), "value=1L+",
       THEN(w.instance.SetValue(U("doubles"), ListOf<VLXRawColldouble>({0.5})), w.instance.GetValue(8, o.value))),
    OP(LIST_AT("Double"), "value=1L+",
       THEN(w.instance.SetValue(8, ListOf<VLXRawColldouble>({0.5})), w.instance.GetValue(8, o.value))),
    OP(LIST_NAMED("Double"), "value=1L+",
       THEN(w.instance.SetValueDoubles(U("doubles"), 1, 0.5), w.instance.GetValue(8, o.value))),
    OP(LIST_AT("Double"), "value=1L+",
       THEN(w.instance.SetValueDoubles(8, 2, 0.5, 1.5), w.instance.GetValue(8, o.value))),
    OP(LIST_NAMED("VLXUnicodeString"), "value=2L+",
       THEN(w.instance.SetValue(U("strings"), ListOf<VLXListOfVLXUnicodeString>({U("a")})),
            w.instance.GetValue(9, o.value))),
    OP(LIST_AT("VLXUnicodeString"), "value=2L+",
       THEN(w.instance.SetValue(9, ListOf<VLXListOfVLXUnicodeString>({U("a")})), w.instance.GetValue(9, o.value))),
    OP(LIST_NAMED("VLXUnicodeString"), "value=2L+",
       THEN(w.instance.SetValueStrings(U("strings"), 1, "a"), w.instance.GetValue(9, o.value))),
    OP(LIST_AT("VLXUnicodeString"), "value=2L+",
       THEN(w.instance.SetValueStrings(9, 0), w.instance.GetValue(9, o.value))),
    OP(LIST_NAMED("VLXTime"), "value=3L+",
       THEN(w.instance.SetValue(U("dates"), ListOf<VLXListValVLXTime>({kMinute})), w.instance.GetValue(10, o.value))),
    OP(LIST_AT("VLXTime"), "value=3L+",
       THEN(w.instance.SetValue(10, ListOf<VLXListValVLXTime>({kMinute})), w.instance.GetValue(10, o.value))),
    OP(LIST_NAMED("VLXTime"), "value=3L+",
       THEN(w.instance.SetValueDates(U("dates"), 1, &kMinute), w.instance.GetValue(10, o.value))),
    OP(LIST_AT("VLXTime"), "value=3L+",
       THEN(w.instance.SetValueDates(10, 1, &kMinute), w.instance.GetValue(10, o.value))),
    OP(LIST_NAMED("VLXBoolean"), "value=4L+",
       THEN(w.instance.SetValue(U("booleans"), ListOf<VLXListValVLXBoolean>({VLXBoolean(1)})),
            w.instance.GetValue(11, o.value))),
    OP(LIST_AT("VLXBoolean"), "value=4L+",
       THEN(w.instance.SetValue(11, ListOf<VLXListValVLXBoolean>({VLXBoolean(0)})), w.instance.GetValue(11, o.value))),
    OP(LIST_NAMED("VLXBoolean"), "value=4L+",
       THEN(w.instance.SetValueBooleans(U("booleans"), 2, 1, 0), w.instance.GetValue(11, o.value))),
    OP(LIST_AT("VLXBoolean"), "value=4L+",
       THEN(w.instance.SetValueBooleans(11, 1, 1), w.instance.GetValue(11, o.value))),
    OP(LIST_NAMED("VLXBinary"), "value=5L+",
       THEN(w.instance.SetValue(U("binaries"), ListOf<VLXListValVLXBinary>({kAb})), w.instance.GetValue(12, o.value))),
    OP(LIST_AT("VLXBinary"), "value=5L+",
       THEN(w.instance.SetValue(12, ListOf<VLXListValVLXBinary>({kAb})), w.instance.GetValue(12, o.value))),
    OP(LIST_NAMED("VLXBinary"), "value=5L+",
       THEN(w.instance.SetValueBinaries(U("binaries"), 1, &kAb), w.instance.GetValue(12, o.value))),
    OP(LIST_AT("VLXBinary"), "value=5L+",
       THEN(w.instance.SetValueBinaries(12, 1, &kAb), w.instance.GetValue(12, o.value))),
    OP(LIST_NAMED("VLXKDMInstance"), "value=6L+",
       THEN(w.instance.SetValue(U("instances"), ListOf<VLXListValVLXKDMInstance>({w.target})),
            w.instance.GetValue(13, o.value))),
    OP(LIST_AT("VLXKDMInstance"), "value=6L+",
       THEN(w.instance.SetValue(13, ListOf<VLXListValVLXKDMInstance>({w.target})), w.instance.GetValue(13, o.value))),
    OP(LIST_NAMED("VLXKDMInstance"), "value=6L+",
       THEN(w.instance.SetValueInstances(U("instances"), 1, &w.target), w.instance.GetValue(13, o.value))),
    OP(LIST_AT("VLXKDMInstance"), "value=6L+",
       THEN(w.instance.SetValueInstances(13, 2, &w.target, &w.target), w.instance.GetValue(13, o.value))),
    OP(INST "ToString(VLXUnicodeString&)", "text", w.instance.ToString(o.text)),
    OP(INST "ToString(VLXBoolean, VLXUnicodeString&)", "text", w.instance.ToString(1, o.text)),

    // ---- VLXKDMInstanceValue: its Java object stands for the proxy
    OP("VLXKDMInstanceValue::BuildLocal()", "value=0:42+", ReadLocal(w, o)),
    FREE("VLXKDMInstanceValue::BuildRemote()", "value=0:5+", o.value.BuildRemote()),
};

TEST(Operations, EachLandsOnBuiltProxiesAndFailsOnUnbuiltOnesNamingItselfAndWritingNothing)
{
  for (const Operation& op : kOperations) {
    SCOPED_TRACE(op.name);
    {
      World built(true);
      Outs outs;
      ClearLastError();
      EXPECT_EQ(VLX_S_OK, op.call(built, outs)) << PeekLastError().text;
      const std::string changes = Changes(outs);
      EXPECT_TRUE(Matches(op.landed, changes)) << "expected [" << op.landed << "], got [" << changes << "]";
    }
    if (!op.needsProxy) continue;
    World unbuilt(false);
    Outs outs;
    ClearLastError();
    EXPECT_LT(op.call(unbuilt, outs), 0);
    const LastError error = PeekLastError();
    EXPECT_EQ("VLXJBXInfraERR_1003", error.id);
    EXPECT_EQ(op.name, error.operation());
    EXPECT_TRUE(Has(error.text, "not attached to a Java object")) << error.text;
    EXPECT_EQ("", Changes(outs));
  }
  std::remove(DocumentFile().c_str());
}

// The leak table: every operation, on built and on unbuilt proxies, succeeding or failing (a call
// repeated on the same world fails where Java refuses it again), leaves the global references and
// this natively attached thread's local references where the first call left them.
TEST(Operations, RepeatedCallsLeaveNoReferencesBehind)
{
  {  // the count sees a leak
    const long before = LocalRefCount();
    Local leaked(Env()->NewStringUTF("leak"));
    EXPECT_EQ(before + 1, LocalRefCount());
  }
  for (const Operation& op : kOperations) {
    for (const bool built : {true, false}) {
      if (!built && !op.needsProxy) continue;
      SCOPED_TRACE(std::string(op.name) + (built ? " on built proxies" : " on unbuilt proxies"));
      World world(built);
      Outs outs;
      op.call(world, outs);
      const long globals = GlobalRefCount(), locals = LocalRefCount();
      for (int i = 0; i < 20; ++i) op.call(world, outs);
      EXPECT_EQ(globals, GlobalRefCount());
      EXPECT_EQ(locals, LocalRefCount());
    }
  }

  // Failures of other kinds: malformed texts (raw and translated), Java exceptions, null answers, a
  // value of a class outside the table, an attribute without value, values that cannot be built.
  FatalRecorder fatal;
  SampleReplica s;
  VLXKDMInstance instance = s.Create(), unattached, longs;
  VLXKDMReplica throwing, nulls;
  AttachNew(throwing, "com/velmora/tessara/testdoubles/ThrowingReplica");
  AttachNew(nulls, "com/velmora/tessara/testdoubles/NullReplica");
  AttachNew(longs, "com/velmora/tessara/testdoubles/LongInstance");
  VLXKDMInstanceValue value, untyped;
  VLXUnicodeString text;
  VLXKDMModelSet models;
  VLXKDMClassDef classDef;
  Local boxedLong(New("java/lang/Long", "(J)V", jlong(1)));
  const VLXUnicodeString bad("\xC3");
  const std::vector<std::function<long()>> failures = {
      [&] { return s.replica.SetName(bad); },
      [&] { return s.replica.GetClassDef(bad, classDef); },
      [&] { return throwing.GetName(text); },
      [&] { return throwing.GetClassDef(U("Part"), classDef); },
      [&] { return nulls.GetName(text); },
      [&] { return nulls.GetModels(models); },
      [&] { return longs.GetValue(0, value); },
      [&] { return instance.GetValue(1, value); },
      [&] { return instance.SetValue(6, unattached); },
      [&] { return instance.SetValueInstances(13, 2, &instance, &unattached); },
      [&] { return instance.SetValue(0, untyped); },
      [&] { return value.SetHandle(Env(), boxedLong.get()); },
  };
  for (size_t i = 0; i < failures.size(); ++i) {
    SCOPED_TRACE("failure " + std::to_string(i));
    failures[i]();
    const long globals = GlobalRefCount(), locals = LocalRefCount();
    for (int k = 0; k < 20; ++k) failures[i]();
    EXPECT_EQ(globals, GlobalRefCount());
    EXPECT_EQ(locals, LocalRefCount());
  }
  ClearLastError();
}

}  // namespace
