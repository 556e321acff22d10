// The modern interface: every type through set/get/try_get, iteration, documents and files, the
// misuses that throw, and what it adds to the proxies (bool setters, value-list iteration).
#include <gtest/gtest.h>

#include <climits>
#include <cmath>
#include <cstdio>
#include <functional>
#include <numeric>

#include "VLXJBXJNIUtilities.h"
#include "corvexa/corvexa.hpp"

using namespace corvexa;
using std::chrono::milliseconds;

namespace {

time_point Ms(long long ms) { return time_point(milliseconds(ms)); }
bytes B(std::initializer_list<int> v)
{
  bytes out;
  for (int x : v) out.push_back(std::byte(x));
  return out;
}

// A replica with one attribute of every type, single ("i") and multi-valued ("is"), and one instance.
struct Sample {
  Replica replica = Replica::create("sample");
  Model model;
  Instance a, b;
  Sample()
  {
    ClassDeclaration declaration("Sample");
    const std::pair<const char*, Type> types[] = {{"i", Type::integer},  {"d", Type::floating}, {"b", Type::boolean},
                                                  {"s", Type::text},     {"t", Type::date},     {"y", Type::bytes},
                                                  {"r", Type::reference}};
    for (const auto& [name, type] : types) {
      declaration.attribute(AttributeDeclaration(name, type).target("Sample"));
      declaration.attribute(AttributeDeclaration(std::string(name) + "s", type).multi_valued().target("Sample"));
    }
    replica.define(declaration);
    model = replica.model("Sample");
    a = model.create();
    b = model.create();
  }
};

bool Same(double x, double y) { return std::isnan(x) ? std::isnan(y) : x == y && std::signbit(x) == std::signbit(y); }
template <class T>
bool Same(const T& x, const T& y)
{
  return x == y;
}
bool Same(const std::vector<double>& x, const std::vector<double>& y)
{
  return x.size() == y.size() &&
         std::equal(x.begin(), x.end(), y.begin(), [](double p, double q) { return Same(p, q); });
}

// Sets value, reads it back with get and try_get, clears it: try_get is then empty and get throws.
template <class T>
std::function<void(Instance&)> RoundTrip(const char* attribute, T value)
{
  return [attribute, value](Instance& in) {
    SCOPED_TRACE(attribute);
    in.set(attribute, value);
    EXPECT_TRUE(in.has_value(attribute));
    EXPECT_TRUE(Same(value, in.get<T>(attribute)));
    EXPECT_TRUE(Same(value, *in.try_get<T>(attribute)));
    in.clear(attribute);
    EXPECT_FALSE(in.try_get<T>(attribute).has_value());
    EXPECT_THROW((void)in.get<T>(attribute), Error);
  };
}

TEST(ModernValues, EveryTypeRoundTrips)
{
  Sample s;
  const double nan = std::nan(""), inf = HUGE_VAL;
  const std::string nul("a\0b", 3), emoji = "\xF0\x9F\x98\x80 \xC3\xA9";
  const std::vector<std::function<void(Instance&)>> cases = {
      RoundTrip("i", 0),
      RoundTrip("i", INT_MIN),
      RoundTrip("i", INT_MAX),
      RoundTrip("d", nan),
      RoundTrip("d", -0.0),
      RoundTrip("d", inf),
      RoundTrip("d", 1e-308),
      RoundTrip("b", true),
      RoundTrip("b", false),
      RoundTrip("s", std::string()),
      RoundTrip("s", nul),
      RoundTrip("s", emoji),
      RoundTrip("t", Ms(0)),
      RoundTrip("t", Ms(-1)),
      RoundTrip("t", Ms(-86'400'123)),
      RoundTrip("t", Ms(1'234'567'890'123)),
      RoundTrip("y", bytes()),
      RoundTrip("y", B({0, 255, 0})),
      RoundTrip("r", s.b),
      RoundTrip("is", std::vector<int>()),
      RoundTrip("is", std::vector<int>{INT_MIN, 0, INT_MAX}),
      RoundTrip("ds", std::vector<double>()),
      RoundTrip("ds", std::vector<double>{nan, -0.0, 1.5}),
      RoundTrip("bs", std::vector<bool>()),
      RoundTrip("bs", std::vector<bool>{true, false, true}),
      RoundTrip("ss", std::vector<std::string>()),
      RoundTrip("ss", std::vector<std::string>{"", nul, emoji}),
      RoundTrip("ts", std::vector<time_point>()),
      RoundTrip("ts", std::vector<time_point>{Ms(-1), Ms(999), Ms(-2'208'988'800'001)}),
      RoundTrip("ys", std::vector<bytes>()),
      RoundTrip("ys", std::vector<bytes>{B({}), B({1, 2})}),
      RoundTrip("rs", std::vector<Instance>()),
      RoundTrip("rs", std::vector<Instance>{s.a, s.b, s.a}),
  };
  for (const auto& check : cases) check(s.a);
  // Texts in: a literal and a view; finer than milliseconds goes toward the past.
  s.a.set("s", "lit");
  EXPECT_EQ("lit", s.a.get<std::string>("s"));
  s.a.set("t", Ms(-5) + std::chrono::microseconds(300));
  EXPECT_EQ(Ms(-5), s.a.get<time_point>("t"));
}

TEST(ModernValues, MisusesThrowNamingWhat)
{
  Sample s;
  s.a.set("i", 7);
  const std::vector<std::pair<std::string, std::function<void()>>> cases = {
      {"'i' holds a java.lang.Integer, not double", [&] { (void)s.a.get<double>("i"); }},
      {"'i' holds a java.lang.Integer, not std::vector<int>", [&] { (void)s.a.try_get<std::vector<int>>("i"); }},
      {"'d' has no value", [&] { (void)s.a.get<double>("d"); }},
      {"nope", [&] { (void)s.a.get<int>("nope"); }},
      {"nope", [&] { s.a.set("nope", 1); }},
      {"\"s\"", [&] { s.a.set("s", 1.5); }},
      {"\"is\"", [&] { s.a.set("is", 1); }},
      {"\"s\"", [&] { s.a.set("s", "\xFF"); }},
      {"\"r\"): an empty Instance handle", [&] { s.a.set("r", Instance()); }},
      {"\"rs\"): an empty Instance handle",
       [&] {
         s.a.set("rs", std::vector<Instance>{s.b, Instance()});
       }},
      {"\"i\"", [&] { (void)Instance().get<int>("i"); }},
      {"no class 'Nope'", [&] { (void)s.replica.model("Nope"); }},
      {"no class 'Nope'", [&] { (void)s.replica.class_def("Nope"); }},
      {"class 'Sample' has no attribute 'nope'", [&] { (void)s.replica.class_def("Sample").attribute("nope"); }},
      {"position 2 is out of range (size 2)", [&] { (void)s.model.instances()[2]; }},
      {"/nonexistent/x.xml", [&] { (void)Replica::read_xml_file("/nonexistent/x.xml"); }},
      {"cannot read binary file '/nonexistent/x.bin'", [&] { (void)Replica::read_binary_file("/nonexistent/x.bin"); }},
      {"cannot write binary file '/nonexistent/x.bin': the directory '/nonexistent' does not exist",
       [&] { s.replica.write_binary_file("/nonexistent/x.bin"); }},
      {"corvexa::Replica::from_binary",
       [&] {
         (void)Replica::from_binary(B({1, 2, 3}));
       }},
      {"corvexa::Replica::name", [&] { (void)Replica().name(); }},
      {"corvexa::Model::create", [&] { (void)Model().create(); }},
      {"the type 9 is not a corvexa::Type",
       [&] { s.replica.define(ClassDeclaration("Odd").attribute("x", static_cast<Type>(9))); }},
  };
  for (const auto& [fragment, misuse] : cases) {
    SCOPED_TRACE(fragment);
    try {
      misuse();
      ADD_FAILURE() << "no exception";
    } catch (const Error& e) {
      EXPECT_NE(std::string(e.what()).find(fragment), std::string::npos) << e.what();
      EXPECT_LT(e.code(), 0);
      EXPECT_FALSE(e.id().empty()) << e.what();
      EXPECT_FALSE(e.parameters().empty());
      EXPECT_EQ(0u, std::string(e.what()).find(e.operation()));
    }
  }
}

TEST(ModernIteration, EmptyAndLargeSetsInOrder)
{
  Sample s;
  Replica r = Replica::create();
  r.define(ClassDeclaration("Empty").attribute("n", Type::integer));
  std::size_t seen = 0;
  for (Instance in : r.model("Empty").instances()) seen += bool(in);
  EXPECT_EQ(0u, seen);
  EXPECT_TRUE(r.model("Empty").instances().empty());

  const int n = 20'000;
  Model m = r.model("Empty");
  for (int i = 0; i < n; ++i) m.create().set("n", i);
  int expected = 0;
  for (Instance in : m.instances()) EXPECT_EQ(expected++, in.get<int>("n"));
  EXPECT_EQ(n, expected);
  EXPECT_EQ(std::size_t(n), m.instances().size());
}

TEST(ModernSchema, DeclaredClassesAndLayouts)
{
  Replica r = Replica::create("shop");
  r.define(
      ClassDeclaration("Supplier").attribute(AttributeDeclaration("name", Type::text).mandatory().unique().length(40)));
  r.define(ClassDeclaration("Part")
               .abstract()
               .comment("stock")
               .attribute("number", Type::text)
               .attribute(AttributeDeclaration("supplier", Type::reference).target("Supplier")));
  r.define(ClassDeclaration("Bolt").extends("Part").attribute(
      AttributeDeclaration("lengths", Type::integer).multi_valued()));
  std::vector<std::string> layouts;
  for (const ClassDef& c : r.classes()) {
    std::string line = c.name() + ":";
    for (const AttributeDef& a : c.attributes()) line += " " + a.name();
    layouts.push_back(line);
  }
  EXPECT_EQ((std::vector<std::string>{"Supplier: name", "Part: number supplier", "Bolt: number supplier lengths"}),
            layouts);
  const AttributeDef name = r.class_def("Supplier").attribute("name");
  EXPECT_TRUE(name.mandatory() && name.unique() && !name.multi_valued());
  EXPECT_EQ(40, name.length());
  EXPECT_EQ(Type::text, name.type());
  EXPECT_EQ(std::vector<std::string>{"Supplier"}, r.class_def("Bolt").attribute("supplier").targets());
  EXPECT_TRUE(r.class_def("Bolt").attribute("lengths").multi_valued());
  EXPECT_EQ(1u, r.class_def("Bolt").own_attributes().size());
  EXPECT_EQ("Part", r.model("Bolt").class_def().super_name());
  EXPECT_TRUE(r.class_def("Part").is_abstract());
  EXPECT_EQ("stock", r.class_def("Part").comment());
  // A mandatory value missing: commit refuses, naming it.
  r.model("Supplier").create().set_id("S1");
  try {
    r.commit();
    ADD_FAILURE() << "committed";
  } catch (const Error& e) {
    EXPECT_NE(std::string(e.what()).find("name"), std::string::npos) << e.what();
  }
}

TEST(ModernDocuments, FilesStringsLookupsAndStates)
{
  Replica inv = Replica::read_xml_file(CORVEXA_EXAMPLES_DIR "/inventory.xml");
  EXPECT_EQ("inventory", inv.name());
  Model parts = inv.model("Part");
  EXPECT_EQ("P-1001", parts.find("P-1001")->get<std::string>("number"));
  EXPECT_FALSE(parts.find("nope").has_value());
  EXPECT_EQ("Acme Fasteners", inv.find("SUP-ACME")->get<std::string>("name"));
  EXPECT_EQ(1u, parts.select("tags", std::vector<std::string>{"hinge", "brass"}).size());
  EXPECT_EQ(2u, parts.select("number", "P-1001").size() + inv.model("Bolt").select("stainless", false).size());
  EXPECT_EQ(3u, parts.select("quantity", 1000, true).size() + parts.select("weight", 0.35).size() +
                    inv.model("Bolt").select("lengths", std::vector<int>{10, 20, 30}).size());
  EXPECT_EQ(1u, parts.select_without_value("weight").size());
  Instance made = parts.create();
  made.set_id(B({9, 9}));
  EXPECT_TRUE(made.is_created() && !made.is_deleted() && made.bytes_id() == B({9, 9}) && !made.id());
  EXPECT_EQ(made, *parts.find(B({9, 9})));
  parts.remove(made);
  EXPECT_EQ("Part", parts.find("P-1002")->class_name());

  const std::string dir = ::testing::TempDir();
  for (Compression c : {Compression::off, Compression::on}) {
    inv.write_binary_file(dir + "/modern.bin", c);
    EXPECT_EQ(inv.xml(), Replica::read_binary_file(dir + "/modern.bin").xml());
    EXPECT_EQ(inv.xml(), Replica::from_binary(inv.binary(c)).xml());
  }
  inv.write_xml_file(dir + "/modern.xml");
  EXPECT_EQ(inv.xml(), Replica::read_xml_file(dir + "/modern.xml").xml());
  inv.write_xsd_file(dir + "/modern.xsd");
  Replica schema = Replica::create();
  schema.insert_schema_file(dir + "/modern.xsd");
  schema.populate_from_xml_string(inv.xml(false));
  EXPECT_EQ(parts.instances().size(), schema.model("Part").instances().size());
  EXPECT_EQ(inv.xml(), Replica::read_xml_string(inv.xml()).xml());
  std::remove((dir + "/modern.bin").c_str());
  std::remove((dir + "/modern.xml").c_str());
  std::remove((dir + "/modern.xsd").c_str());
}

TEST(ModernColumns, BatchesWriteAndReadByType)
{
  Sample s;
  const std::string nul("a\0b", 3);
  Columns batch(2);
  const std::size_t i = batch.add_column("i", Type::integer), ss = batch.add_column("ss", Type::text, true),
                    t = batch.add_column("t", Type::date), r = batch.add_column("r", Type::reference);
  batch.set(i, 0, INT_MIN);
  batch.set(ss, 0, std::vector<std::string>{"x", nul});
  batch.set(t, 1, Ms(-1));
  batch.set(r, 1, s.a);
  batch.create_in(s.model);
  Columns read;
  for (const char* name : {"i", "ss", "t", "r"}) read.add_column(name);
  read.read(s.model);
  ASSERT_EQ(4u, read.rows());
  EXPECT_EQ(INT_MIN, read.get<int>(i, 2));
  EXPECT_EQ((std::vector<std::string>{"x", nul}), read.get<std::vector<std::string>>(ss, 2));
  EXPECT_EQ(Ms(-1), read.get<time_point>(t, 3));
  EXPECT_EQ(s.a, *read.try_get<Instance>(r, 3));
  EXPECT_FALSE(read.try_get<int>(i, 3).has_value());
  for (const auto& misuse :
       std::vector<std::function<void()>>{[&] { (void)read.get<int>(i, 3); }, [&] { (void)read.get<double>(i, 2); },
                                          [&] { batch.set(i, 9, 1); }, [&] { batch.set(i, 0, 1.5); }})
    EXPECT_THROW(misuse(), Error);

  // The other types, written to an instance and read back from it.
  Columns other(1);
  const std::size_t d = other.add_column("d", Type::floating), b = other.add_column("b", Type::boolean),
                    y = other.add_column("y", Type::bytes), is = other.add_column("is", Type::integer, true),
                    ds = other.add_column("ds", Type::floating, true), bs = other.add_column("bs", Type::boolean, true),
                    ys = other.add_column("ys", Type::bytes, true), rs = other.add_column("rs", Type::reference, true);
  other.set(d, 0, -0.0), other.set(b, 0, true), other.set(y, 0, B({0, 255})), other.set(is, 0, std::vector<int>{1, 2});
  other.set(ds, 0, std::vector<double>{0.5}), other.set(bs, 0, std::vector<bool>{true, false});
  other.set(ys, 0, std::vector<bytes>{B({7}), {}}), other.set(rs, 0, std::vector<Instance>{s.b, s.a});
  other.write_to({s.a});
  Columns back;
  for (const char* name : {"d", "b", "y", "is", "ds", "bs", "ys", "rs"}) back.add_column(name);
  back.read(std::vector<Instance>{s.a});
  EXPECT_TRUE(Same(-0.0, back.get<double>(d, 0)));
  EXPECT_TRUE(back.get<bool>(b, 0));
  EXPECT_EQ(B({0, 255}), back.get<bytes>(y, 0));
  EXPECT_EQ((std::vector<int>{1, 2}), back.get<std::vector<int>>(is, 0));
  EXPECT_EQ((std::vector<double>{0.5}), back.get<std::vector<double>>(ds, 0));
  EXPECT_EQ((std::vector<bool>{true, false}), back.get<std::vector<bool>>(bs, 0));
  EXPECT_EQ((std::vector<bytes>{B({7}), {}}), back.get<std::vector<bytes>>(ys, 0));
  EXPECT_EQ((std::vector<Instance>{s.b, s.a}), back.get<std::vector<Instance>>(rs, 0));
  EXPECT_THROW(other.write_to({}), Error);
}

TEST(ModernExchange, ReplicaToJavaAndBack)
{
  Replica r = Replica::create("exchanged");
  JavaVM* vm = VLXJBXJNIUtilities::GetJavaVM();
  ASSERT_NE(nullptr, vm);
  JNIEnv* env = nullptr;
  ASSERT_EQ(JNI_OK, vm->GetEnv(reinterpret_cast<void**>(&env), JNI_VERSION_1_8));
  const jobject java = r.to_java(env);
  EXPECT_EQ("exchanged", Replica::from_java(env, java).name());
  env->DeleteLocalRef(java);
}

TEST(ProxyAdditions, BoolSettersAndListIteration)
{
  Sample s;
  VLXKDMInstance proxy(s.a.proxy());
  ASSERT_EQ(VLX_S_OK, proxy.SetValue(VLXUnicodeString("b"), true));
  EXPECT_TRUE(s.a.get<bool>("b"));
  ASSERT_EQ(VLX_S_OK, proxy.SetValue(4, false));  // "b" is at position 4
  EXPECT_FALSE(s.a.get<bool>("b"));

  VLXRawCollint ints;
  for (int i = 1; i <= 4; ++i) ints.Append(i);
  EXPECT_EQ(10, std::accumulate(ints.begin(), ints.end(), 0));
  VLXListValVLXKDMInstance list;
  list.Append(s.a.proxy());
  list.Append(s.b.proxy());
  std::vector<Instance> out(list.begin(), list.end());
  EXPECT_EQ((std::vector<Instance>{s.a, s.b}), out);
  EXPECT_EQ(2, std::as_const(list).end() - std::as_const(list).begin());
}

}  // namespace
