// Every exported operation that calls Java, one row each: its name text, a call on built proxies
// that lands (VLX_S_OK and the out-parameters it writes), and the same call on unbuilt proxies,
// which fails naming the operation and writes no out-parameter. The same rows make the leak table.
#include <unistd.h>

#include <cctype>
#include <cstdio>
#include <fstream>
#include <functional>
#include <sstream>

#include "TestSupport.h"
#include "VLXKDMColumns.h"

using namespace corvexa_test;

namespace {

const std::string kExamples = CORVEXA_EXAMPLES_DIR;

std::string FileText(const std::string& path)
{
  std::stringstream text;
  text << std::ifstream(path).rdbuf();
  return text.str();
}

// Built: a replica "world" with Sample and its model, two instances (i has the identifier "id-1"
// and the integer 42, t is a link target) and schema settings other than the out-parameters'
// sentinels; fc, fm and fa belong to no replica. Unbuilt: every proxy an operation runs on is not
// built; the proxies passed as arguments stay built.
struct World {
  bool built;
  VLXKDMReplica r;
  VLXKDMModelSet ms;
  VLXKDMModel m, fm;
  VLXKDMClassDef c, fc;
  VLXKDMAttributeDefList al;
  VLXKDMAttributeDef a, fa;
  VLXKDMInstanceSet is;
  VLXKDMInstance i, t;

  explicit World(bool isBuilt) : built(isBuilt)
  {
    EXPECT_EQ(VLX_S_OK, r.Build(U("world")));
    AddClass(r, "Sample", SampleAttributes(), m);
    const long rcs[] = {r.GetModels(ms),
                        m.GetClassDef(c),
                        c.GetAttributes(al),
                        al.GetItem(1, a),
                        m.GetInstances(is),
                        m.CreateInstance(i),
                        m.CreateInstance(t),
                        i.SetValue(0, 42),
                        i.SetID(U("id-1")),
                        a.SetAccessMode(VLXKDMAccessMode::Write),
                        a.SetAggregationType(VLXKDMAggregationType::Shared),
                        a.SetSoftwareVisibility(VLXKDMVisibility::Private),
                        a.SetLength(12),
                        c.SetClassType(VLXKDMClassType::Extension),
                        c.SetSoftwareVisibility(VLXKDMVisibility::Protected),
                        fc.Build(U("Free")),
                        fm.Build(fc),
                        fa.Build(U("extra"), VLXKDMAttributeType::Integer)};
    for (long rc : rcs) EXPECT_EQ(VLX_S_OK, rc);
    if (built) return;
    r = VLXKDMReplica(), ms = VLXKDMModelSet(), m = VLXKDMModel(), c = VLXKDMClassDef(), fc = VLXKDMClassDef();
    al = VLXKDMAttributeDefList(), a = VLXKDMAttributeDef(), is = VLXKDMInstanceSet(), i = VLXKDMInstance();
  }
};

// The out-parameters, each holding a sentinel: proxies attached to another world's objects, a
// value holder with the integer 5 and no Java object.
struct Outs {
  World x{true};
  VLXUnicodeString s{"sentinel"};
  int n = -7777;
  VLXBoolean f = 9, ft = 9;
  VLXBinary b{"\x5A", 1};
  VLXListOfVLXUnicodeString ts = ListOf<VLXListOfVLXUnicodeString>({U("sentinel")});
  VLXKDMAttributeType::Type type = VLXKDMAttributeType::Binary;
  VLXKDMAccessMode::Mode acc = VLXKDMAccessMode::ReadWrite;
  VLXKDMAggregationType::Type agg = VLXKDMAggregationType::Composition;
  VLXKDMVisibility::Mode vis = VLXKDMVisibility::Public;
  VLXKDMClassType::Type ct = VLXKDMClassType::Class;
  VLXKDMReplica r = x.r;
  VLXKDMModelSet ms = x.ms;
  VLXKDMModel m = x.m;
  VLXKDMClassDef c = x.c;
  VLXKDMAttributeDefList al = x.al;
  VLXKDMAttributeDef a = x.a;
  VLXKDMInstanceSet is = x.is;
  VLXKDMInstance i = x.i;
  VLXKDMInstanceValue v;
  Outs() { v.SetInteger(5); }
};

// A value holder as "type[L][:integer][+]": L for a list, + when it holds a Java object.
std::string Describe(VLXKDMInstanceValue& v)
{
  const bool integer = v.GetType() == VLXKDMInstanceValue::IntegerType && !v.IsMultiValuated();
  return std::to_string(v.GetType()) + (v.IsMultiValuated() ? "L" : "") +
         (integer ? ":" + std::to_string(v.GetInteger()) : "") + (v.GetHandle() ? "+" : "");
}

// The out-parameters no longer holding their sentinel, in declaration order: "name=value", or the
// bare name for bytes and proxies ("name=null" for a proxy detached).
std::string Changes(Outs& o)
{
  std::string out;
  auto add = [&out](bool changed, std::string token) {
    for (char& ch : token) ch = std::isspace(static_cast<unsigned char>(ch)) ? '_' : ch;
    if (changed) out += (out.empty() ? "" : " ") + token.substr(0, 60);
  };
  auto num = [&add](const char* name, long value, long sentinel) {
    add(value != sentinel, std::string(name) + "=" + std::to_string(value));
  };
  auto proxy = [&add](const char* name, const VLXKDMJavaObject& p, const VLXKDMJavaObject& s) {
    add(!Same(p.GetHandle(), s.GetHandle()), std::string(name) + (p.GetHandle() ? "" : "=null"));
  };
  add(Text(o.s) != "sentinel", "text=" + Text(o.s));
  num("number", o.n, -7777), num("flag", o.f, 9), num("isText", o.ft, 9);
  add(!(o.b == VLXBinary("\x5A", 1)), "bytes");
  add(Texts(o.ts) != "sentinel", "texts=" + Texts(o.ts));
  num("type", o.type, VLXKDMAttributeType::Binary), num("access", o.acc, VLXKDMAccessMode::ReadWrite);
  num("aggregation", o.agg, VLXKDMAggregationType::Composition), num("visibility", o.vis, VLXKDMVisibility::Public);
  num("classType", o.ct, VLXKDMClassType::Class);
  proxy("replica", o.r, o.x.r), proxy("models", o.ms, o.x.ms), proxy("model", o.m, o.x.m);
  proxy("classDef", o.c, o.x.c), proxy("attributes", o.al, o.x.al), proxy("attribute", o.a, o.x.a);
  proxy("instances", o.is, o.x.is), proxy("instance", o.i, o.x.i);
  add(Describe(o.v) != "0:5", "value=" + Describe(o.v));
  return out;
}

// Whether the changes are the expected ones: an expected token without "=" stands for any value.
bool Matches(const std::string& expected, const std::string& actual)
{
  std::istringstream e(expected), a(actual);
  std::string et, at;
  while (e >> et)
    if (!(a >> at) || (et != at && (et.find('=') != std::string::npos || at.rfind(et + "=", 0) != 0))) return false;
  return !(a >> at);
}

// An enumeration getter's answer written into out.
template <class P, class E>
long AsNumber(const P& proxy, long (P::*get)(E&) const, int& out)
{
  E value = E();
  const long rc = (proxy.*get)(value);
  if (rc >= 0) out = value;
  return rc;
}

// Exchange with Java: o.n becomes 1 when an object comes out.
long ToJava(World& w, Outs& o, bool holder)
{
  jobject object = nullptr;
  const long rc = holder ? w.r.ConvertToJavaHolder(Env(), object) : w.r.ConvertToJavaType(Env(), object);
  if (object) o.n = 1;
  Local owned(object);
  return rc;
}
long FromHolder(World& w, Outs& o)
{
  jobject holder = nullptr;
  EXPECT_EQ(VLX_S_OK, w.r.ConvertToJavaHolder(Env(), holder));
  Local owned(holder);
  return o.r.BuildFromJavaHolder(Env(), holder);
}
long FromJava(World& w, Outs& o) { return o.r.BuildFromJavaType(Env(), w.r.GetHandle()); }
// BuildLocal of o.v, attached (in the built world only) to a Java Integer 42.
long ReadLocal(World& w, Outs& o)
{
  Local boxed(New("java/lang/Integer", "(I)V", jint(42)));
  const long attached = w.built ? o.v.SetHandle(Env(), boxed.get()) : VLX_S_OK;
  EXPECT_EQ(VLX_S_OK, attached);
  return o.v.BuildLocal();
}
long ReadOwnXml(World& w, Outs& o)
{
  VLXUnicodeString xml;
  EXPECT_EQ(VLX_S_OK, w.r.GetXml(1, xml));
  return VLXKDMReplica::ReadFromXmlString(xml, o.r);
}
long FromBinary(World& w, Outs& o, bool detected = false)
{
  VLXBinary bytes;
  EXPECT_EQ(VLX_S_OK, VLXKDMReplica::GetBinaryFromReplica(w.r, 1, bytes));
  return detected ? VLXKDMReplica::GetReplicaFromBinary(bytes, o.r)
                  : VLXKDMReplica::GetReplicaFromBinary(bytes, 1, o.r);
}
// A file of the operations' own, in the test's temporary directory.
std::string OwnFile(const char* name)
{
  return ::testing::TempDir() + "corvexa-operations-" + std::to_string(getpid()) + name;
}
// A binary file of the world's replica, read back.
long FromBinaryFile(World& w, Outs& o)
{
  EXPECT_EQ(VLX_S_OK, w.r.WriteBinaryFile(U(OwnFile(".bin")), 0));
  return VLXKDMReplica::ReadBinaryFile(U(OwnFile(".bin")), o.r);
}
VLXBoolean Continue(long long, long long, void*) { return 1; }
// The instances whose integer is 42 (o.n: how many).
long Select(World& w, Outs& o)
{
  VLXKDMInstanceValue fortyTwo;
  fortyTwo.SetInteger(42);
  VLXListValVLXKDMInstance found;
  const long rc = w.m.SelectInstances(U("integer"), fortyTwo, 1, found);
  if (rc >= 0) o.n = found.Size();
  return rc;
}
// A batch of one integer column: 0 creates an instance (o.n: how many; 4 without the list), 1 writes 7
// to i, 2 reads the model's rows (o.n: how many), 1 and 3 read i's integer (o.n: it).
long ByColumns(World& w, Outs& o, int which)
{
  VLXKDMColumns b;
  long column = 0, rows = 0;
  int value = 0;
  const VLXListValVLXKDMInstance justI = ListOf<VLXListValVLXKDMInstance>({w.i});
  VLXListValVLXKDMInstance made;
  long rc = b.Reset(1);
  if (which == 4) return b.CreateInstances(w.m);
  if (which < 2) {
    b.AddColumn(U("integer"), VLXKDMAttributeType::Integer, 0, column);
    b.SetInteger(0, 0, 7);
    rc = which == 0 ? b.CreateInstances(w.m, made) : b.SetValues(justI);
    if (rc >= 0 && which == 0) o.n = made.Size();
    if (rc < 0 || which == 0) return rc;
    b.Reset(0);
  }
  b.AddColumn(U("integer"), column);
  rc = which == 2 ? b.GetValues(w.m) : b.GetValues(justI);
  if (rc >= 0 && which == 2 && b.GetRowCount(rows) >= 0) o.n = rows;
  if (rc >= 0 && which != 2 && b.GetInteger(0, 0, value) >= 0) o.n = value;
  return rc;
}
// A limit past 32 bits set and read back (o.n becomes 1 when it came back whole); the default again.
long LimitBack(Outs& o)
{
  long long back = 0;
  long rc = VLXKDMReplica::SetLimit(U("maxInflatedSize"), 1LL << 33);
  if (rc >= 0) rc = VLXKDMReplica::GetLimit(U("maxInflatedSize"), back);
  if (back == 1LL << 33) o.n = 1;
  VLXKDMReplica::SetLimit(U("maxInflatedSize"), 1LL << 30);
  return rc;
}
long FolderBack(Outs& o)
{
  long rc = VLXKDMReplica::SetSchemaFolder(U("/"));
  if (rc >= 0) rc = VLXKDMReplica::GetSchemaFolder(o.s);
  VLXKDMReplica::SetSchemaFolder(U(""));
  return rc;
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

#define ROW(proxy, name, landed, ...)                                                              \
  {                                                                                                \
    name, [](World& w, Outs& o) -> long { return (void)w, (void)o, (__VA_ARGS__); }, landed, proxy \
  }
#define OP(...) ROW(true, __VA_ARGS__)
#define FREE(...) ROW(false, __VA_ARGS__)
// b runs only when a succeeded.
#define THEN(a, b)            \
  [&] {                       \
    const long rc = (a);      \
    return rc < 0 ? rc : (b); \
  }()
#define INST "VLXKDMInstance::"
#define REP "VLXKDMReplica::"
#define CLS "VLXKDMClassDef::"
#define ATL "VLXKDMAttributeDefList::"
#define ATT "VLXKDMAttributeDef::"
#define MSET "VLXKDMModelSet::"
#define MOD "VLXKDMModel::"
#define ISET "VLXKDMInstanceSet::"
#define VAL "VLXKDMInstanceValue::"
// A text property's getter, and its setter read back through the getter.
#define TEXT(prefix, proxy, P, got, value)                             \
  OP(prefix "Get" #P "(VLXUnicodeString&)", got, w.proxy.Get##P(o.s)), \
      OP(prefix "Set" #P "(const VLXUnicodeString&)", "text=" value,   \
         THEN(w.proxy.Set##P(U(value)), w.proxy.Get##P(o.s)))
// An enumeration's getter into out, and its setter read back as a number.
#define ENUM(prefix, proxy, P, T, out, got, value, set)       \
  OP(prefix "Get" #P "(" T "&)", got, w.proxy.Get##P(o.out)), \
      OP(prefix "Set" #P "(" T ")", set,                      \
         THEN(w.proxy.Set##P(value), AsNumber(w.proxy, &std::decay_t<decltype(w.proxy)>::Get##P, o.n)))
// A value setter by attribute name and by position (sig: its value parameter), read back there.
#define SETS(sig, name, position, landed, value)                       \
  OP(INST "SetValue(const VLXUnicodeString&, " sig ")", landed,        \
     THEN(w.i.SetValue(U(name), value), w.i.GetValue(position, o.v))), \
      OP(INST "SetValue(int, " sig ")", landed, THEN(w.i.SetValue(position, value), w.i.GetValue(position, o.v)))
// A list setter by name and by position, from a list and from the variadic setter's arguments.
#define LISTS(T, name, position, landed, list, variadic, ...)                     \
  SETS("const VLXListOf" T "&", name, position, landed, list),                    \
      OP(INST "SetValue(const VLXUnicodeString&, const VLXListOf" T "&)", landed, \
         THEN(w.i.variadic(U(name), __VA_ARGS__), w.i.GetValue(position, o.v))),  \
      OP(INST "SetValue(int, const VLXListOf" T "&)", landed,                     \
         THEN(w.i.variadic(position, __VA_ARGS__), w.i.GetValue(position, o.v)))

const VLXBinary kAb("ab", 2);
const VLXTime kMinute = Seconds(60);

const Operation kOperations[] = {
    // ---- VLXKDMReplica
    FREE(REP "Build()", "replica", o.r.Build()),
    FREE(REP "Build(const VLXUnicodeString&)", "text=made replica", THEN(o.r.Build(U("made")), o.r.GetName(o.s))),
    OP(REP "GetName(VLXUnicodeString&)", "text=world", w.r.GetName(o.s)),
    OP(REP "SetName(const VLXUnicodeString&)", "text=renamed", THEN(w.r.SetName(U("renamed")), w.r.GetName(o.s))),
    OP(REP "ToString(VLXUnicodeString&)", "text", w.r.ToString(o.s)),
    OP(REP "Commit()", "flag=0", THEN(w.r.Commit(), w.i.IsCreated(o.f))),
    OP(REP "GetModels(VLXKDMModelSet&)", "models", w.r.GetModels(o.ms)),
    OP(REP "GetClassDef(const VLXUnicodeString&, VLXKDMClassDef&)", "classDef", w.r.GetClassDef(U("Sample"), o.c)),
    OP(REP "GetAttributeDef(const VLXUnicodeString&, VLXKDMAttributeDef&)", "attribute",
       w.r.GetAttributeDef(U("Sample.double"), o.a)),
    OP(REP "FindInstance(const VLXUnicodeString&, VLXKDMInstance&)", "text=id-1 flag=0 isText=1 instance",
       THEN(w.r.FindInstance(U("id-1"), o.i), o.i.GetID(o.f, o.ft, o.s, o.b))),
    OP(REP "FindInstance(const VLXBinary&, VLXKDMInstance&)", "instance=null", w.r.FindInstance(kAb, o.i)),
    FREE(REP "SetSchemaLocation(const VLXUnicodeString&)", "", VLXKDMReplica::SetSchemaLocation(U(""))),
    OP(REP "GetSchemaLocation(VLXUnicodeString&)", "text", w.r.GetSchemaLocation(o.s)),
    FREE(REP "SetFeature(const VLXUnicodeString&, VLXBoolean)", "", VLXKDMReplica::SetFeature(U("indent"), 1)),
    FREE(REP "SetLimit(const VLXUnicodeString&, long long)", "", VLXKDMReplica::SetLimit(U("maxElementDepth"), 256)),
    FREE(REP "GetLimit(const VLXUnicodeString&, long long&)", "number=1", LimitBack(o)),
    FREE(REP "SetSchemaFolder(const VLXUnicodeString&)", "", VLXKDMReplica::SetSchemaFolder(U(""))),
    FREE(REP "GetSchemaFolder(VLXUnicodeString&)", "text=/", FolderBack(o)),
    OP(REP "InsertSchemaFile(const VLXUnicodeString&)", "classDef",
       THEN(w.r.InsertSchemaFile(U(kExamples + "/inventory.xsd")), w.r.GetClassDef(U("Bolt"), o.c))),
    OP(REP "InsertSchemaString(const VLXUnicodeString&)", "classDef",
       THEN(w.r.InsertSchemaString(U(FileText(kExamples + "/inventory.xsd"))), w.r.GetClassDef(U("Bolt"), o.c))),
    OP(REP "PopulatesFromXmlFile(const VLXUnicodeString&)", "number=3",
       THEN(w.r.PopulatesFromXmlFile(U(DocumentFile())), w.is.GetCount(o.n))),
    OP(REP "PopulatesFromXmlString(const VLXUnicodeString&)", "number=3",
       THEN(w.r.PopulatesFromXmlString(U(FileText(DocumentFile()))), w.is.GetCount(o.n))),
    FREE(REP "ReadFromXmlFile(const VLXUnicodeString&, VLXKDMReplica&)", "text=inventory replica",
         THEN(VLXKDMReplica::ReadFromXmlFile(U(kExamples + "/inventory.xml"), o.r), o.r.GetName(o.s))),
    FREE(REP "ReadFromXmlString(const VLXUnicodeString&, VLXKDMReplica&)", "text=world replica",
         THEN(ReadOwnXml(w, o), o.r.GetName(o.s))),
    OP(REP "GetXml(VLXBoolean, VLXUnicodeString&)", "text", w.r.GetXml(1, o.s)),
    OP(REP "GetXml(VLXBoolean, VLXBoolean, VLXUnicodeString&)", "text", w.r.GetXml(1, 1, o.s)),
    OP(REP "GetXsd(VLXUnicodeString&)", "text", w.r.GetXsd(o.s)),
    FREE(REP "GetBinaryFromReplica(const VLXKDMReplica&, VLXBoolean, VLXBinary&)", "bytes",
         VLXKDMReplica::GetBinaryFromReplica(w.r, 0, o.b)),
    FREE(REP "GetReplicaFromBinary(const VLXBinary&, VLXBoolean, VLXKDMReplica&)", "text=world replica",
         THEN(FromBinary(w, o), o.r.GetName(o.s))),
    FREE(REP "GetReplicaFromBinary(const VLXBinary&, VLXKDMReplica&)", "text=world replica",
         THEN(FromBinary(w, o, true), o.r.GetName(o.s))),
    OP(REP "WriteXmlFile(const VLXUnicodeString&, VLXBoolean, VLXBoolean)", "",
       w.r.WriteXmlFile(U(OwnFile(".xml")), 1, 1)),
    OP(REP "WriteXsdFile(const VLXUnicodeString&)", "", w.r.WriteXsdFile(U(OwnFile(".xsd")))),
    OP(REP "WriteBinaryFile(const VLXUnicodeString&, VLXBoolean)", "", w.r.WriteBinaryFile(U(OwnFile(".bin")), 1)),
    FREE(REP "ReadBinaryFile(const VLXUnicodeString&, VLXKDMReplica&)", "text=world replica",
         THEN(FromBinaryFile(w, o), o.r.GetName(o.s))),
    FREE(REP "SetProgressHandler(VLXKDMProgressHandler, void*)", "",
         THEN(VLXKDMReplica::SetProgressHandler(&Continue, nullptr),
              VLXKDMReplica::SetProgressHandler(nullptr, nullptr))),
    FREE(REP "BuildFromJavaType(JNIEnv*, jobject)", "text=world replica", THEN(FromJava(w, o), o.r.GetName(o.s))),
    FREE(REP "ConvertToJavaType(JNIEnv*, jobject&)", "number=1", ToJava(w, o, false)),
    FREE(REP "BuildFromJavaHolder(JNIEnv*, jobject)", "text=world replica", THEN(FromHolder(w, o), o.r.GetName(o.s))),
    FREE(REP "ConvertToJavaHolder(JNIEnv*, jobject&)", "number=1", ToJava(w, o, true)),

    // ---- VLXKDMClassDef
    FREE(CLS "Build()", "classDef", o.c.Build()),
    FREE(CLS "Build(const VLXUnicodeString&)", "text=Made classDef", THEN(o.c.Build(U("Made")), o.c.GetClassName(o.s))),
    TEXT(CLS, c, ClassName, "text=Sample", "Renamed"),
    OP(CLS "GetSuperName(VLXUnicodeString&)", "text", w.c.GetSuperName(o.s)),
    OP(CLS "SetSuperName(const VLXUnicodeString&)", "text=Base",
       THEN(w.fc.SetSuperName(U("Base")), w.fc.GetSuperName(o.s))),
    TEXT(CLS, c, Uuid, "text", "u-1"),
    TEXT(CLS, c, QKAComment, "text", "said"),
    TEXT(CLS, c, QKADerivability, "text", "derived"),
    OP(CLS "GetScopeNames(VLXListOfVLXUnicodeString&)", "texts", w.c.GetScopeNames(o.ts)),
    OP(CLS "SetScopeNames(const VLXListOfVLXUnicodeString&)", "texts=a,b",
       THEN(w.c.SetScopeNames(ListOf<VLXListOfVLXUnicodeString>({U("a"), U("b")})), w.c.GetScopeNames(o.ts))),
    OP(CLS "SetScopeNames(const VLXListOfVLXUnicodeString&)", "texts=a,b",
       THEN(w.c.SetScopeNames(2, "a", "b"), w.c.GetScopeNames(o.ts))),
    OP(CLS "IsAbstract(VLXBoolean&)", "flag=0", w.c.IsAbstract(o.f)),
    OP(CLS "SetAbstract(VLXBoolean)", "flag=1", THEN(w.c.SetAbstract(2), w.c.IsAbstract(o.f))),
    OP(CLS "IsExtensible(VLXBoolean&)", "flag", w.c.IsExtensible(o.f)),
    OP(CLS "SetExtensibility(VLXBoolean)", "flag=0", THEN(w.c.SetExtensibility(0), w.c.IsExtensible(o.f))),
    OP(CLS "IsPersistent(VLXBoolean&)", "flag", w.c.IsPersistent(o.f)),
    OP(CLS "SetPersistency(VLXBoolean)", "flag=0", THEN(w.c.SetPersistency(0), w.c.IsPersistent(o.f))),
    ENUM(CLS, c, ClassType, "VLXKDMClassType::Type", ct, "classType=1", VLXKDMClassType::Class, "number=0"),
    ENUM(CLS, c, SoftwareVisibility, "VLXKDMVisibility::Mode", vis, "visibility=1", VLXKDMVisibility::Private,
         "number=2"),
    OP(CLS "GetAttributes(VLXKDMAttributeDefList&)", "attributes", w.c.GetAttributes(o.al)),
    OP(CLS "ToString(VLXUnicodeString&)", "text", w.c.ToString(o.s)),

    // ---- VLXKDMAttributeDef
    FREE(ATT "Build(const VLXUnicodeString&, VLXKDMAttributeType::Type)", "type=4 attribute",
         THEN(o.a.Build(U("made"), VLXKDMAttributeType::Boolean), o.a.GetAttributeType(o.type))),
    OP(ATT "GetAttributeName(VLXUnicodeString&)", "text=double", w.a.GetAttributeName(o.s)),
    OP(ATT "GetAttributeType(VLXKDMAttributeType::Type&)", "type=1", w.a.GetAttributeType(o.type)),
    TEXT(ATT, a, Uuid, "text", "u-2"),
    TEXT(ATT, a, QKAComment, "text", "noted"),
    OP(ATT "GetTargetNames(VLXListOfVLXUnicodeString&)", "texts", w.a.GetTargetNames(o.ts)),
    OP(ATT "SetTargetNames(const VLXListOfVLXUnicodeString&)", "texts=P",
       THEN(w.a.SetTargetNames(ListOf<VLXListOfVLXUnicodeString>({U("P")})), w.a.GetTargetNames(o.ts))),
    OP(ATT "SetTargetNames(const VLXListOfVLXUnicodeString&)", "texts=P,Q",
       THEN(w.a.SetTargetNames(2, "P", "Q"), w.a.GetTargetNames(o.ts))),
    OP(ATT "GetTargetRefs(VLXListOfVLXUnicodeString&)", "texts", w.a.GetTargetRefs(o.ts)),
    OP(ATT "SetTargetRefs(const VLXListOfVLXUnicodeString&)", "texts=r",
       THEN(w.a.SetTargetRefs(ListOf<VLXListOfVLXUnicodeString>({U("r")})), w.a.GetTargetRefs(o.ts))),
    OP(ATT "SetTargetRefs(const VLXListOfVLXUnicodeString&)", "texts=r,s,t",
       THEN(w.a.SetTargetRefs(3, "r", "s", "t"), w.a.GetTargetRefs(o.ts))),
    ENUM(ATT, a, AggregationType, "VLXKDMAggregationType::Type", agg, "aggregation=1",
         VLXKDMAggregationType::Composition, "number=0"),
    ENUM(ATT, a, AccessMode, "VLXKDMAccessMode::Mode", acc, "access=1", VLXKDMAccessMode::Read, "number=0"),
    ENUM(ATT, a, SoftwareVisibility, "VLXKDMVisibility::Mode", vis, "visibility=2", VLXKDMVisibility::Protected,
         "number=1"),
    OP(ATT "GetLength(int&)", "number=12", w.a.GetLength(o.n)),
    OP(ATT "SetLength(int)", "number=-3", THEN(w.a.SetLength(-3), w.a.GetLength(o.n))),
    OP(ATT "IsMandatory(VLXBoolean&)", "flag=0", w.a.IsMandatory(o.f)),
    OP(ATT "SetMandatory(VLXBoolean)", "flag=1", THEN(w.a.SetMandatory(128), w.a.IsMandatory(o.f))),
    OP(ATT "IsMultiValuated(VLXBoolean&)", "flag=0", w.a.IsMultiValuated(o.f)),
    OP(ATT "SetMultiValuation(VLXBoolean)", "flag=1", THEN(w.a.SetMultiValuation(255), w.a.IsMultiValuated(o.f))),
    OP(ATT "IsUnique(VLXBoolean&)", "flag=0", w.a.IsUnique(o.f)),
    OP(ATT "SetUnicity(VLXBoolean)", "flag=1", THEN(w.a.SetUnicity(3), w.a.IsUnique(o.f))),
    OP(ATT "GetClassDef(VLXKDMClassDef&)", "classDef", w.a.GetClassDef(o.c)),
    OP(ATT "ToString(VLXUnicodeString&)", "text", w.a.ToString(o.s)),

    // ---- VLXKDMAttributeDefList (the 14 attributes of Sample)
    OP(ATL "GetCount(int&)", "number=14", w.al.GetCount(o.n)),
    OP(ATL "GetItem(int, VLXKDMAttributeDef&)", "text=string attribute",
       THEN(w.al.GetItem(2, o.a), o.a.GetAttributeName(o.s))),
    OP(ATL "GetItem(const VLXUnicodeString&, VLXKDMAttributeDef&)", "text=dates attribute",
       THEN(w.al.GetItem(U("dates"), o.a), o.a.GetAttributeName(o.s))),
    OP(ATL "Includes(const VLXUnicodeString&, VLXBoolean&)", "flag=1", w.al.Includes(U("double"), o.f)),
    OP(ATL "IndexOf(const VLXKDMAttributeDef&, int&)", "number=1", w.al.IndexOf(w.a, o.n)),
    OP(ATL "IndexOf(const VLXUnicodeString&, int&)", "number=2", w.al.IndexOf(U("string"), o.n)),
    OP(ATL "Add(const VLXKDMAttributeDef&)", "number=15", THEN(w.al.Add(w.fa), w.al.GetCount(o.n))),
    OP(ATL "Remove(const VLXKDMAttributeDef&)", "number=13", THEN(w.al.Remove(w.a), w.al.GetCount(o.n))),
    OP(ATL "Remove(const VLXUnicodeString&)", "number=13", THEN(w.al.Remove(U("double")), w.al.GetCount(o.n))),
    OP(ATL "Remove(int)", "number=13", THEN(w.al.Remove(3), w.al.GetCount(o.n))),

    // ---- VLXKDMModel
    FREE(MOD "Build(const VLXKDMClassDef&)", "model", o.m.Build(w.c)),
    OP(MOD "CreateInstance(VLXKDMInstance&)", "instance", w.m.CreateInstance(o.i)),
    OP(MOD "GetClassDef(VLXKDMClassDef&)", "text=Sample classDef", THEN(w.m.GetClassDef(o.c), o.c.GetClassName(o.s))),
    OP(MOD "GetInstances(VLXKDMInstanceSet&)", "number=2 instances", THEN(w.m.GetInstances(o.is), o.is.GetCount(o.n))),
    OP(MOD "FindInstance(const VLXUnicodeString&, VLXKDMInstance&)", "text=id-1 flag=0 isText=1 instance",
       THEN(w.m.FindInstance(U("id-1"), o.i), o.i.GetID(o.f, o.ft, o.s, o.b))),
    OP(MOD "FindInstance(const VLXBinary&, VLXKDMInstance&)", "instance=null", w.m.FindInstance(kAb, o.i)),
    OP(MOD "SelectInstances(const VLXUnicodeString&, VLXKDMInstanceValue&, VLXBoolean, VLXListValVLXKDMInstance&)",
       "number=1", Select(w, o)),
    FREE("VLXKDMColumns::CreateInstances(VLXKDMModel&, VLXListValVLXKDMInstance&)", "number=1", ByColumns(w, o, 0)),
    FREE("VLXKDMColumns::CreateInstances(VLXKDMModel&)", "", ByColumns(w, o, 4)),
    FREE("VLXKDMColumns::SetValues(const VLXListValVLXKDMInstance&)", "number=7", ByColumns(w, o, 1)),
    FREE("VLXKDMColumns::GetValues(VLXKDMModel&)", "number=2", ByColumns(w, o, 2)),
    FREE("VLXKDMColumns::GetValues(const VLXListValVLXKDMInstance&)", "number=42", ByColumns(w, o, 3)),
    OP(MOD "GetReplica(VLXKDMReplica&)", "text=world replica", THEN(w.m.GetReplica(o.r), o.r.GetName(o.s))),
    OP(MOD "ToString(VLXUnicodeString&)", "text", w.m.ToString(o.s)),

    // ---- VLXKDMModelSet (the one model of Sample)
    OP(MSET "GetCount(int&)", "number=1", w.ms.GetCount(o.n)),
    OP(MSET "GetItem(int, VLXKDMModel&)", "model", w.ms.GetItem(0, o.m)),
    OP(MSET "GetItem(const VLXUnicodeString&, VLXKDMModel&)", "model", w.ms.GetItem(U("Sample"), o.m)),
    OP(MSET "Includes(const VLXUnicodeString&, VLXBoolean&)", "flag=1", w.ms.Includes(U("Sample"), o.f)),
    OP(MSET "IndexOf(const VLXKDMClassDef&, int&)", "number=0", w.ms.IndexOf(w.c, o.n)),
    OP(MSET "IndexOf(const VLXUnicodeString&, int&)", "number=-1", w.ms.IndexOf(U("Absent"), o.n)),
    OP(MSET "Add(const VLXKDMModel&)", "number=2", THEN(w.ms.Add(w.fm), w.ms.GetCount(o.n))),
    OP(MSET "Remove(const VLXKDMClassDef&)", "number=0", THEN(w.ms.Remove(w.c), w.ms.GetCount(o.n))),
    OP(MSET "Remove(const VLXUnicodeString&)", "number=0", THEN(w.ms.Remove(U("Sample")), w.ms.GetCount(o.n))),
    OP(MSET "Remove(int)", "number=0", THEN(w.ms.Remove(0), w.ms.GetCount(o.n))),

    // ---- VLXKDMInstanceSet (instance, then target)
    OP(ISET "GetCount(int&)", "number=2", w.is.GetCount(o.n)),
    OP(ISET "GetItem(int, VLXKDMInstance&)", "text=id-1 flag=0 isText=1 instance",
       THEN(w.is.GetItem(0, o.i), o.i.GetID(o.f, o.ft, o.s, o.b))),
    OP(ISET "IndexOf(const VLXKDMInstance&, int&)", "number=1", w.is.IndexOf(w.t, o.n)),
    OP(ISET "Remove(const VLXKDMInstance&)", "number=1", THEN(w.is.Remove(w.t), w.is.GetCount(o.n))),
    OP(ISET "Remove(int)", "number=1", THEN(w.is.Remove(0), w.is.GetCount(o.n))),
    OP(ISET "RemoveAll()", "number=0", THEN(w.is.RemoveAll(), w.is.GetCount(o.n))),

    // ---- VLXKDMInstance
    OP(INST "GetClassDef(VLXKDMClassDef&)", "classDef", w.i.GetClassDef(o.c)),
    OP(INST "GetID(VLXBoolean&, VLXBoolean&, VLXUnicodeString&, VLXBinary&)", "text=id-1 flag=0 isText=1",
       w.i.GetID(o.f, o.ft, o.s, o.b)),
    OP(INST "SetID(const VLXUnicodeString&)", "text=id-2 flag=0 isText=1",
       THEN(w.i.SetID(U("id-2")), w.i.GetID(o.f, o.ft, o.s, o.b))),
    OP(INST "SetID(const VLXBinary&)", "flag=0 isText=0 bytes", THEN(w.i.SetID(kAb), w.i.GetID(o.f, o.ft, o.s, o.b))),
    OP(INST "IsCreated(VLXBoolean&)", "flag=1", w.i.IsCreated(o.f)),
    OP(INST "IsModified(VLXBoolean&)", "flag=0", w.i.IsModified(o.f)),
    OP(INST "IsDeleted(VLXBoolean&)", "flag=0", w.i.IsDeleted(o.f)),
    OP(INST "IsValuated(const VLXUnicodeString&, VLXBoolean&)", "flag=1", w.i.IsValuated(U("integer"), o.f)),
    OP(INST "IsValuated(int, VLXBoolean&)", "flag=0", w.i.IsValuated(1, o.f)),
    OP(INST "ClearValue(const VLXUnicodeString&)", "flag=0",
       THEN(w.i.ClearValue(U("integer")), w.i.IsValuated(0, o.f))),
    OP(INST "ClearValue(int)", "flag=0", THEN(w.i.ClearValue(0), w.i.IsValuated(0, o.f))),
    OP(INST "GetValue(const VLXUnicodeString&, VLXKDMInstanceValue&)", "value=0:42+", w.i.GetValue(U("integer"), o.v)),
    OP(INST "GetValue(int, VLXKDMInstanceValue&)", "value=0:42+", w.i.GetValue(0, o.v)),
    SETS("VLXKDMInstanceValue&", "integer", 0, "value=0:5+", o.v),
    SETS("int", "integer", 0, "value=0:7+", 7),
    SETS("double", "double", 1, "value=1+", 2.5),
    SETS("const VLXUnicodeString&", "string", 2, "value=2+", U("s")),
    SETS("const VLXTime&", "date", 3, "value=3+", kMinute),
    SETS("VLXBoolean", "boolean", 4, "value=4+", VLXBoolean(1)),
    SETS("const VLXBinary&", "binary", 5, "value=5+", kAb),
    SETS("const VLXKDMInstance&", "instance", 6, "value=6+", w.t),
    LISTS("Int", "integers", 7, "value=0L+", ListOf<VLXRawCollint>({1, 2}), SetValueIntegers, 2, 1, 3),
    LISTS("Double", "doubles", 8, "value=1L+", ListOf<VLXRawColldouble>({0.5}), SetValueDoubles, 2, 0.5, 1.5),
    LISTS("VLXUnicodeString", "strings", 9, "value=2L+", ListOf<VLXListOfVLXUnicodeString>({U("a")}), SetValueStrings,
          0),
    LISTS("VLXTime", "dates", 10, "value=3L+", ListOf<VLXListValVLXTime>({kMinute}), SetValueDates, 1, &kMinute),
    LISTS("VLXBoolean", "booleans", 11, "value=4L+", ListOf<VLXListValVLXBoolean>({VLXBoolean(0)}), SetValueBooleans, 2,
          1, 0),
    LISTS("VLXBinary", "binaries", 12, "value=5L+", ListOf<VLXListValVLXBinary>({kAb}), SetValueBinaries, 1, &kAb),
    LISTS("VLXKDMInstance", "instances", 13, "value=6L+", ListOf<VLXListValVLXKDMInstance>({w.t}), SetValueInstances, 2,
          &w.t, &w.t),
    OP(INST "ToString(VLXUnicodeString&)", "text", w.i.ToString(o.s)),
    OP(INST "ToString(VLXBoolean, VLXUnicodeString&)", "text", w.i.ToString(1, o.s)),

    // ---- VLXKDMInstanceValue: its Java object stands for the proxy
    OP(VAL "BuildLocal()", "value=0:42+", ReadLocal(w, o)),
    FREE(VAL "BuildRemote()", "value=0:5+", o.v.BuildRemote()),
};

TEST(Operations, EachLandsOnBuiltProxiesAndFailsOnUnbuiltOnesNamingItselfAndWritingNothing)
{
  for (const Operation& op : kOperations) {
    SCOPED_TRACE(op.name);
    for (const bool built : {true, false}) {
      if (!built && !op.needsProxy) continue;
      World world(built);
      Outs outs;
      ClearLastError();
      const long rc = op.call(world, outs);
      const std::string changes = Changes(outs);
      if (built) {
        EXPECT_EQ(VLX_S_OK, rc) << PeekLastError().text;
        EXPECT_TRUE(Matches(op.landed, changes)) << "expected [" << op.landed << "], got [" << changes << "]";
        continue;
      }
      EXPECT_LT(rc, 0);
      const LastError error = PeekLastError();
      EXPECT_EQ("VLXJBXInfraERR_1003", error.id);
      EXPECT_EQ(op.name, error.operation());
      EXPECT_TRUE(Has(error.text, "not attached to a Java object")) << error.text;
      EXPECT_EQ("", changes);
    }
  }
  for (const std::string& file : {DocumentFile(), OwnFile(".xml"), OwnFile(".xsd"), OwnFile(".bin")})
    std::remove(file.c_str());
}

// Each row, on built and on unbuilt proxies, succeeding or failing (a call repeated on the same
// world fails where Java refuses it again), then failures of other kinds: repeated, they leave the
// global references and this thread's local references where the first call left them.
TEST(Operations, RepeatedCallsLeaveNoReferencesBehind)
{
  auto check = [](const std::function<long()>& call) {
    call();
    const long globals = GlobalRefCount(), locals = LocalRefCount();
    for (int k = 0; k < 20; ++k) call();
    EXPECT_EQ(globals, GlobalRefCount());
    EXPECT_EQ(locals, LocalRefCount());
  };
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
      check([&] { return op.call(world, outs); });
    }
  }
  // Malformed texts (raw and translated), Java exceptions, null answers, a value of a class outside
  // the table, an attribute without value, values that cannot be built, an object of another class.
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
  const std::function<long()> failures[] = {
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
  for (size_t i = 0; i < std::size(failures); ++i) {
    SCOPED_TRACE("failure " + std::to_string(i));
    check(failures[i]);
  }
  ClearLastError();
}

}  // namespace
