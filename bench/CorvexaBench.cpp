// corvexa-bench: the cost of the library's operations against hand-written JNI doing the same work,
// measured in the same process and the same run, and the cost of filling a replica from C++ against
// the same filling done in Java.
//
// Each pair is one operation done two ways:
//   <operation>/library   through the library's proxies
//   <operation>/handJNI   by hand-written JNI: identifiers looked up once, the environment fetched
//                         once, strings converted exactly (UTF-8 <-> UTF-16), every exception
//                         checked, every local reference deleted
// The summary at the end gives each pair's times (the median over repetitions when there are
// several), their ratio against the target, and the heap allocations one call makes on the
// calling thread once the operation has run before (counted by a replacement of operator new and
// malloc that this program links in), and the JNI functions one call makes (counted through a
// counting copy of the thread's JNI function table), to read each pair's excess against.
//
// Options of our own (besides Google Benchmark's):
//   --fill_instances=N    instances per fill (default 100000)
//   --lookup_instances=N  instances of the model looked up by identifier (default 1000000)
//   --bulk_instances=N    instances per bulk fill and read (default 100000)
//   --fill_iterations=N   measured fills per side, one per repetition (default 5)
//   --warmup_calls=N      calls of each operation before anything is measured (default 20000)
// The JVM gets the options of VLXJBX_JVM_OPTIONS, or when it is unset kDefaultJvmOptions below.
#include <jni.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <benchmark/benchmark.h>

#include "AllocationCounter.h"
#include "BenchJava.h"
#include "BenchReport.h"
#include "DataBench.h"
#include "ModernBench.h"
#include "HandStrings.h"
#include "JniCallCounter.h"
#include "VLXBinary.h"
#include "VLXJBXJNIUtilities.h"
#include "VLXKDMAttributeDef.h"
#include "VLXKDMAttributeDefList.h"
#include "VLXKDMClassDef.h"
#include "VLXKDMInstance.h"
#include "VLXKDMInstanceSet.h"
#include "VLXKDMInstanceValue.h"
#include "VLXKDMModel.h"
#include "VLXKDMModelSet.h"
#include "VLXKDMReplica.h"
#include "VLXListValVLXUnicodeString.h"
#include "VLXRawCollint.h"
#include "VLXTime.h"
#include "VLXUnicodeString.h"

using namespace corvexa_bench;

namespace {

struct Options {
  int fillInstances = 100000;
  int fillIterations = 5;
  int lookupInstances = 1000000;
  int bulkInstances = 100000;
  int warmupCalls = 20000;
};
Options gOptions;

constexpr int kListLength = 1000;
const char* const kDefaultJvmOptions = "-Xms1g -Xmx1g -XX:+AlwaysPreTouch";
constexpr time_t kBaseSeconds = 1700000000;

// The objects the per-operation benchmarks work on, and the hand-written code's identifiers.
struct World {
  // The library's side.
  VLXKDMReplica replica;
  VLXKDMModel model;
  VLXKDMInstance instance;
  VLXKDMModelSet models;
  VLXKDMInstanceValue value;
  VLXUnicodeString name;
  const VLXUnicodeString integerName{"integer"};
  const VLXUnicodeString integersName{"integers"};
  const int textPosition = 1;  // the attribute "text"
  const VLXUnicodeString textValue{"a short text value"};
  std::vector<int> thousand;
  VLXRawCollint thousandList;

  // The hand-written side: its own global references to the same Java objects.
  JNIEnv* env = nullptr;
  jobject replicaRef = nullptr;
  jobject instanceRef = nullptr;
  jobject modelsRef = nullptr;  // the holder GetModels fills
  jclass integerClass = nullptr;
  jmethodID integerValueOf = nullptr;
  jmethodID integerIntValue = nullptr;
  jmethodID replicaGetName = nullptr;
  jmethodID replicaGetModels = nullptr;
  jmethodID instanceSetValueNamed = nullptr;
  jmethodID instanceSetValueAt = nullptr;
  jmethodID instanceGetValueNamed = nullptr;
  int handInteger = 0;
  jobject keptValue = nullptr;  // the hand-written GetValue's Java value, held as the value holder holds it

  // The fill's Java baseline and the collector, called between measured fills.
  jclass fillClass = nullptr;
  jmethodID fill = nullptr;
  jclass systemClass = nullptr;
  jmethodID systemGc = nullptr;

  // The hand-written fill's identifiers.
  jmethodID modelCreateInstance = nullptr;
  jclass doubleClass = nullptr;
  jmethodID doubleValueOf = nullptr;
  jclass booleanClass = nullptr;
  jmethodID booleanValueOf = nullptr;
  jclass dateClass = nullptr;
  jmethodID dateNew = nullptr;
};
World* gWorld = nullptr;

// ---- Set-up ----------------------------------------------------------------------------------

bool SetUp(World& w, std::string& why)
{
  // The first library call starts the JVM.
  if (w.replica.Build(VLXUnicodeString("bench")) < 0) return Fail(why, "VLXKDMReplica::Build failed (JVM start)");
  if (!AddClass(w.replica, "Sample",
                {{"integer", {VLXKDMAttributeType::Integer, false}},
                 {"text", {VLXKDMAttributeType::String, false}},
                 {"integers", {VLXKDMAttributeType::Integer, true}}},
                w.model))
    return Fail(why, "building the class Sample failed");
  if (w.model.CreateInstance(w.instance) < 0) return Fail(why, "VLXKDMModel::CreateInstance failed");
  if (w.instance.SetValue(w.integerName, 42) < 0) return Fail(why, "VLXKDMInstance::SetValue failed");
  for (int i = 0; i < kListLength; ++i) {
    w.thousand.push_back(i * 7 - 3000);
    w.thousandList.Append(i * 7 - 3000);
  }

  if (VLXJBXJNIUtilities::GetJNIEnv(w.env, VLXListValVLXUnicodeString()) < 0 || !w.env)
    return Fail(why, "no JNIEnv from the bridge");
  JNIEnv* env = w.env;
  w.replicaRef = env->NewGlobalRef(w.replica.GetHandle());
  w.instanceRef = env->NewGlobalRef(w.instance.GetHandle());
  w.integerClass = GlobalClass(env, "java/lang/Integer");
  w.integerValueOf = Method(env, w.integerClass, "valueOf", "(I)Ljava/lang/Integer;", true);
  w.integerIntValue = Method(env, w.integerClass, "intValue", "()I");
  Local replicaClass(env, env->GetObjectClass(w.replicaRef));
  Local instanceClass(env, env->GetObjectClass(w.instanceRef));
  w.replicaGetName = Method(env, static_cast<jclass>(replicaClass.get()), "getName", "()Ljava/lang/String;");
  w.replicaGetModels =
      Method(env, static_cast<jclass>(replicaClass.get()), "getModels", "()Lcom/velmora/tessara/kdmreplica/ModelSet;");
  const jclass instance = static_cast<jclass>(instanceClass.get());
  w.instanceSetValueNamed = Method(env, instance, "setValue", "(Ljava/lang/String;Ljava/lang/Object;)V");
  w.instanceSetValueAt = Method(env, instance, "setValue", "(ILjava/lang/Object;)V");
  w.instanceGetValueNamed = Method(env, instance, "getValue", "(Ljava/lang/String;)Ljava/lang/Object;");
  if (!w.integerValueOf || !w.integerIntValue || !w.replicaGetName || !w.replicaGetModels || !w.instanceSetValueNamed ||
      !w.instanceSetValueAt || !w.instanceGetValueNamed)
    return Fail(why, "a hand-written lookup failed");

  w.fillClass = GlobalClass(env, "com/velmora/tessara/bench/FillBaseline");
  w.fill = Method(env, w.fillClass, "fill", "(Lcom/velmora/tessara/kdmreplica/Model;IJ)I", true);
  if (!w.fill)
    return Fail(why, "class com.velmora.tessara.bench.FillBaseline not found (is the bench jar on VLXJBX_CLASSPATH?)");
  w.systemClass = GlobalClass(env, "java/lang/System");
  w.systemGc = Method(env, w.systemClass, "gc", "()V", true);
  if (!w.systemGc) return Fail(why, "System.gc not found");

  Local modelClass(env, env->GetObjectClass(w.model.GetHandle()));
  w.modelCreateInstance = Method(env, static_cast<jclass>(modelClass.get()), "createInstance",
                                 "()Lcom/velmora/tessara/kdmreplica/Instance;");
  w.doubleClass = GlobalClass(env, "java/lang/Double");
  w.doubleValueOf = Method(env, w.doubleClass, "valueOf", "(D)Ljava/lang/Double;", true);
  w.booleanClass = GlobalClass(env, "java/lang/Boolean");
  w.booleanValueOf = Method(env, w.booleanClass, "valueOf", "(Z)Ljava/lang/Boolean;", true);
  w.dateClass = GlobalClass(env, "java/util/Date");
  w.dateNew = Method(env, w.dateClass, "<init>", "(J)V");
  if (!w.modelCreateInstance || !w.doubleValueOf || !w.booleanValueOf || !w.dateNew)
    return Fail(why, "a lookup of the hand-written fill failed");
  return true;
}

void TearDown(World& w)
{
  JNIEnv* env = w.env;
  if (!env) return;
  for (jobject ref :
       {w.replicaRef, w.instanceRef, w.modelsRef, w.keptValue, static_cast<jobject>(w.integerClass),
        static_cast<jobject>(w.fillClass), static_cast<jobject>(w.systemClass), static_cast<jobject>(w.doubleClass),
        static_cast<jobject>(w.booleanClass), static_cast<jobject>(w.dateClass)})
    if (ref) env->DeleteGlobalRef(ref);
}

// ---- The pairs -------------------------------------------------------------------------------
// Each operation takes the iteration number (so that written values change) and says whether it
// succeeded.

bool LibGetName(World& w, int) { return w.replica.GetName(w.name) == VLX_S_OK; }

bool HandGetName(World& w, int)
{
  JNIEnv* env = w.env;
  Local name(env, env->CallObjectMethod(w.replicaRef, w.replicaGetName));
  if (Threw(env)) return false;
  if (!name.get()) {
    w.name = VLXUnicodeString();
    return true;
  }
  if (ReadJavaString(env, static_cast<jstring>(name.get()), w.name)) return true;
  Threw(env);
  return false;
}

bool LibGetModels(World& w, int) { return w.replica.GetModels(w.models) == VLX_S_OK; }

bool HandGetModels(World& w, int)
{
  JNIEnv* env = w.env;
  Local models(env, env->CallObjectMethod(w.replicaRef, w.replicaGetModels));
  if (Threw(env)) return false;
  const jobject held = models.get() ? env->NewGlobalRef(models.get()) : nullptr;
  if (w.modelsRef) env->DeleteGlobalRef(w.modelsRef);
  w.modelsRef = held;
  return true;
}

bool LibSetNamedInteger(World& w, int i) { return w.instance.SetValue(w.integerName, i) == VLX_S_OK; }

bool HandSetNamedInteger(World& w, int i)
{
  JNIEnv* env = w.env;
  Local name(env, NewJavaString(env, w.integerName));
  if (!name.get()) {
    Threw(env);  // malformed text (nothing pending) or a failed NewString
    return false;
  }
  Local boxed(env, env->CallStaticObjectMethod(w.integerClass, w.integerValueOf, static_cast<jint>(i)));
  if (Threw(env)) return false;
  env->CallVoidMethod(w.instanceRef, w.instanceSetValueNamed, name.get(), boxed.get());
  return !Threw(env);
}

bool LibSetTextAt(World& w, int) { return w.instance.SetValue(w.textPosition, w.textValue) == VLX_S_OK; }

bool HandSetTextAt(World& w, int)
{
  JNIEnv* env = w.env;
  Local text(env, NewJavaString(env, w.textValue));
  if (!text.get()) {
    Threw(env);  // malformed text (nothing pending) or a failed NewString
    return false;
  }
  env->CallVoidMethod(w.instanceRef, w.instanceSetValueAt, static_cast<jint>(w.textPosition), text.get());
  return !Threw(env);
}

bool LibGetNamedInteger(World& w, int)
{
  return w.instance.GetValue(w.integerName, w.value) == VLX_S_OK &&
         w.value.GetType() == VLXKDMInstanceValue::IntegerType && !w.value.IsMultiValuated() &&
         (benchmark::DoNotOptimize(w.value.GetInteger()), true);
}

// By hand; with keep, the Java value is also held by a global reference in place of the previous
// one, as the value holder holds it (its synchronized state keeps the Java object): the share of the
// gap that the holder's contract costs.
bool HandGetNamedIntegerWith(World& w, bool keep)
{
  JNIEnv* env = w.env;
  Local name(env, NewJavaString(env, w.integerName));
  if (!name.get()) {
    Threw(env);  // malformed text (nothing pending) or a failed NewString
    return false;
  }
  Local value(env, env->CallObjectMethod(w.instanceRef, w.instanceGetValueNamed, name.get()));
  if (Threw(env) || !value.get()) return false;
  // Unboxing anything but an Integer would be a JNI error: check the class first.
  if (!env->IsInstanceOf(value.get(), w.integerClass)) return false;
  if (keep) {
    const jobject held = env->NewGlobalRef(value.get());
    if (!held) return false;
    if (w.keptValue) env->DeleteGlobalRef(w.keptValue);
    w.keptValue = held;
  }
  w.handInteger = env->CallIntMethod(value.get(), w.integerIntValue);
  benchmark::DoNotOptimize(w.handInteger);
  return !Threw(env);
}

bool HandGetNamedInteger(World& w, int) { return HandGetNamedIntegerWith(w, false); }
bool HandGetNamedIntegerKept(World& w, int) { return HandGetNamedIntegerWith(w, true); }

template <std::size_t... I>
long SetThousand(VLXKDMInstance& instance, const VLXUnicodeString& name, const int* v, std::index_sequence<I...>)
{
  return instance.SetValueIntegers(name, static_cast<int>(sizeof...(I)), v[I]...);
}

bool LibSetIntegers(World& w, int)
{
  return SetThousand(w.instance, w.integersName, w.thousand.data(), std::make_index_sequence<kListLength>()) ==
         VLX_S_OK;
}

bool LibSetIntegerList(World& w, int) { return w.instance.SetValue(w.integersName, w.thousandList) == VLX_S_OK; }

bool HandSetIntegers(World& w, int)
{
  JNIEnv* env = w.env;
  const jsize count = static_cast<jsize>(w.thousand.size());
  Local array(env, env->NewIntArray(count));
  if (Threw(env) || !array.get()) return false;
  env->SetIntArrayRegion(static_cast<jintArray>(array.get()), 0, count, w.thousand.data());
  if (Threw(env)) return false;
  Local name(env, NewJavaString(env, w.integersName));
  if (!name.get()) {
    Threw(env);  // malformed text (nothing pending) or a failed NewString
    return false;
  }
  env->CallVoidMethod(w.instanceRef, w.instanceSetValueNamed, name.get(), array.get());
  return !Threw(env);
}

using Operation = bool (*)(World&, int);

struct Pair {
  const char* key;
  const char* what;
  double target;  // 0: none
  Operation library;
  Operation hand;
};

const std::vector<Pair>& Pairs()
{
  static const std::vector<Pair> pairs = {
      {"GetName", "VLXKDMReplica::GetName", 1.25, LibGetName, HandGetName},
      {"GetModels", "VLXKDMReplica::GetModels", 1.25, LibGetModels, HandGetModels},
      {"SetValueNamedInt", "VLXKDMInstance::SetValue(name, int)", 1.3, LibSetNamedInteger, HandSetNamedInteger},
      {"SetValueAtText", "VLXKDMInstance::SetValue(position, text)", 1.3, LibSetTextAt, HandSetTextAt},
      {"GetValueNamedInt", "VLXKDMInstance::GetValue(name) of an int", 1.3, LibGetNamedInteger, HandGetNamedInteger},
      {"GetValueNamedIntKept", "  the same, hand JNI keeping the Java value (global ref)", 0, LibGetNamedInteger,
       HandGetNamedIntegerKept},
      {"SetValueIntegers1000", "VLXKDMInstance::SetValueIntegers, 1000 values", 1.3, LibSetIntegers, HandSetIntegers},
      {"SetValueIntList1000", "VLXKDMInstance::SetValue(name, list of 1000 ints)", 0, LibSetIntegerList,
       HandSetIntegers},
  };
  return pairs;
}

void RunOperation(benchmark::State& state, Operation operation)
{
  World& w = *gWorld;
  int i = 0;
  for (auto _ : state) {
    if (!operation(w, i++)) {
      state.SkipWithError("the operation failed");
      break;
    }
  }
}

// ---- Single JNI costs ------------------------------------------------------------------------
// Not pairs: the price of the JNI functions the frame calls around every Java call, so that a
// ratio's excess can be read as a count of them.

bool JustExceptionCheck(World& w, int) { return !w.env->ExceptionCheck(); }

bool JustIsInstanceOf(World& w, int) { return w.env->IsInstanceOf(w.instanceRef, w.integerClass) == JNI_FALSE; }

bool JustGetJNIEnv(World& w, int)
{
  JNIEnv* env = nullptr;
  return VLXJBXJNIUtilities::GetJNIEnv(env, VLXListValVLXUnicodeString()) >= 0 && env == w.env;
}

bool JustGlobalRefPair(World& w, int)
{
  const jobject ref = w.env->NewGlobalRef(w.instanceRef);
  w.env->DeleteGlobalRef(ref);
  return ref != nullptr;
}

struct Single {
  const char* key;
  const char* what;
  Operation operation;
};

const std::vector<Single>& Singles()
{
  static const std::vector<Single> singles = {
      {"JNI/ExceptionCheck", "ExceptionCheck", JustExceptionCheck},
      {"JNI/IsInstanceOf", "IsInstanceOf", JustIsInstanceOf},
      {"JNI/NewGlobalRef+DeleteGlobalRef", "NewGlobalRef + DeleteGlobalRef", JustGlobalRefPair},
      {"Bridge/GetJNIEnv", "VLXJBXJNIUtilities::GetJNIEnv (cached)", JustGetJNIEnv},
  };
  return singles;
}

// ---- The fill --------------------------------------------------------------------------------

struct FillReplica {
  VLXKDMReplica replica;
  VLXKDMModel model;
};

bool MakeFillReplica(FillReplica& f)
{
  using T = VLXKDMAttributeType::Type;
  const auto single = [](T type) { return std::make_pair(type, false); };
  return f.replica.Build(VLXUnicodeString("fill")) >= 0 && AddClass(f.replica, "Item",
                                                                    {{"code", single(VLXKDMAttributeType::Integer)},
                                                                     {"price", single(VLXKDMAttributeType::Double)},
                                                                     {"label", single(VLXKDMAttributeType::String)},
                                                                     {"created", single(VLXKDMAttributeType::Date)},
                                                                     {"active", single(VLXKDMAttributeType::Boolean)},
                                                                     {"payload", single(VLXKDMAttributeType::Binary)},
                                                                     {"quantity", single(VLXKDMAttributeType::Integer)},
                                                                     {"note", single(VLXKDMAttributeType::String)}},
                                                                    f.model);
}

// The same instances as FillBaseline.fill, through the library, attributes by name.
bool LibraryFill(VLXKDMModel& model, int count)
{
  static const VLXUnicodeString code("code"), price("price"), label("label"), created("created"), active("active"),
      payload("payload"), quantity("quantity"), note("note"), noteText("fixed note");
  VLXKDMInstance x;
  char text[32];
  unsigned char bytes[8];
  bool ok = true;
  for (int i = 0; i < count && ok; ++i) {
    ok = model.CreateInstance(x) >= 0;
    ok = ok && x.SetValue(code, i) >= 0;
    ok = ok && x.SetValue(price, i * 0.25) >= 0;
    std::snprintf(text, sizeof text, "item-%d", i);
    ok = ok && x.SetValue(label, VLXUnicodeString(text)) >= 0;
    VLXTime when;
    when.Settime_t(kBaseSeconds + i);
    ok = ok && x.SetValue(created, when) >= 0;
    ok = ok && x.SetValue(active, static_cast<VLXBoolean>((i & 1) != 0)) >= 0;
    for (int b = 0; b < 8; ++b) bytes[b] = static_cast<unsigned char>(static_cast<unsigned>(i) >> (b * 4));
    ok = ok && x.SetValue(payload, VLXBinary(bytes, 8)) >= 0;
    ok = ok && x.SetValue(quantity, i % 100) >= 0;
    ok = ok && x.SetValue(note, noteText) >= 0;
  }
  return ok;
}

// The same fill by hand-written JNI, doing what the library does for each value: the attribute
// name converted on every call, the value boxed (valueOf where Java has it), one setValue call.
bool HandFill(World& w, VLXKDMModel& model, int count)
{
  static const VLXUnicodeString code("code"), price("price"), label("label"), created("created"), active("active"),
      payload("payload"), quantity("quantity"), note("note"), noteText("fixed note");
  JNIEnv* env = w.env;
  const jobject modelRef = model.GetHandle();
  // Sends value (a local reference, consumed) as the attribute name's new value.
  const auto set = [&](jobject x, const VLXUnicodeString& name, jobject value) {
    Local owned(env, value);
    if (!value || env->ExceptionCheck()) {
      Threw(env);
      return false;
    }
    Local jname(env, NewJavaString(env, name));
    if (!jname.get()) {
      Threw(env);
      return false;
    }
    env->CallVoidMethod(x, w.instanceSetValueNamed, jname.get(), value);
    return !Threw(env);
  };
  char text[32];
  jbyte bytes[8];
  bool ok = true;
  for (int i = 0; i < count && ok; ++i) {
    Local x(env, env->CallObjectMethod(modelRef, w.modelCreateInstance));
    if (Threw(env) || !x.get()) return false;
    const jobject instance = x.get();
    ok = set(instance, code, env->CallStaticObjectMethod(w.integerClass, w.integerValueOf, static_cast<jint>(i)));
    ok = ok && set(instance, price, env->CallStaticObjectMethod(w.doubleClass, w.doubleValueOf, i * 0.25));
    std::snprintf(text, sizeof text, "item-%d", i);
    ok = ok && set(instance, label, NewJavaString(env, VLXUnicodeString(text)));
    ok = ok &&
         set(instance, created, env->NewObject(w.dateClass, w.dateNew, static_cast<jlong>(kBaseSeconds + i) * 1000));
    ok = ok && set(instance, active,
                   env->CallStaticObjectMethod(w.booleanClass, w.booleanValueOf, static_cast<jboolean>((i & 1) != 0)));
    for (int b = 0; b < 8; ++b) bytes[b] = static_cast<jbyte>(static_cast<unsigned>(i) >> (b * 4));
    if (ok) {
      const jbyteArray array = env->NewByteArray(8);
      if (array && !env->ExceptionCheck()) env->SetByteArrayRegion(array, 0, 8, bytes);
      ok = set(instance, payload, array);
    }
    ok = ok && set(instance, quantity,
                   env->CallStaticObjectMethod(w.integerClass, w.integerValueOf, static_cast<jint>(i % 100)));
    ok = ok && set(instance, note, NewJavaString(env, noteText));
  }
  return ok;
}

bool JavaFill(World& w, VLXKDMModel& model, int count)
{
  JNIEnv* env = w.env;
  const jint made = env->CallStaticIntMethod(w.fillClass, w.fill, model.GetHandle(), static_cast<jint>(count),
                                             static_cast<jlong>(kBaseSeconds));
  return !Threw(env) && made == count;
}

void CollectGarbage(World& w)
{
  w.env->CallStaticVoidMethod(w.systemClass, w.systemGc);
  Threw(w.env);
}

// Both fills make the same instances: their text forms, values included, are equal.
enum class FillBy { Library, HandJni, PureJava };

bool Fill(World& w, FillBy by, VLXKDMModel& model, int count)
{
  switch (by) {
    case FillBy::Library:
      return LibraryFill(model, count);
    case FillBy::HandJni:
      return HandFill(w, model, count);
    case FillBy::PureJava:
      return JavaFill(w, model, count);
  }
  return false;
}

// The three fills make the same instances: their text forms, values included, are equal.
bool FillsAgree(World& w, std::string& why)
{
  const int count = 50;
  std::vector<std::string> reference;
  for (FillBy by : {FillBy::Library, FillBy::HandJni, FillBy::PureJava}) {
    FillReplica f;
    std::vector<std::string> texts;
    if (!MakeFillReplica(f)) return Fail(why, "building the fill replica failed");
    if (!Fill(w, by, f.model, count)) return Fail(why, "a fill failed");
    if (!InstanceTexts(f.model, texts) || texts.size() != static_cast<size_t>(count))
      return Fail(why, "reading a fill back failed");
    if (by == FillBy::Library) {
      reference = texts;
      continue;
    }
    for (int k = 0; k < count; ++k)
      if (texts[k] != reference[k])
        return Fail(why,
                    "the fills differ at instance " + std::to_string(k) + ":\n  " + reference[k] + "\n  " + texts[k]);
  }
  return true;
}

void RunFill(benchmark::State& state, FillBy by)
{
  World& w = *gWorld;
  const int count = gOptions.fillInstances;
  for (auto _ : state) {
    state.PauseTiming();
    auto f = std::make_unique<FillReplica>();
    const bool made = MakeFillReplica(*f);
    CollectGarbage(w);
    state.ResumeTiming();
    const bool ok = made && Fill(w, by, f->model, count);
    state.PauseTiming();
    f.reset();
    state.ResumeTiming();
    if (!ok) {
      state.SkipWithError("the fill failed");
      break;
    }
  }
  state.counters["instances"] = count;
}

// ---- Allocations -----------------------------------------------------------------------------

struct PerCall {
  double news = 0;
  double mallocs = 0;
};

struct AllocationFinding {
  PerCall library;
  PerCall hand;
  bool ok = true;
  std::string libraryJni;  // the JNI calls of one call, as text
  std::string handJni;
};

// The JNI functions that one call of operation makes, averaged over calls, as "Name n, ...".
std::string JniCallsOf(World& w, Operation operation, int calls, bool& ok)
{
  StartCountingJni(w.env);
  for (int i = 0; i < calls; ++i) ok = operation(w, i) && ok;
  const JniCounts counts = StopCountingJni(w.env);
  std::string text;
  std::uint64_t total = 0;
  for (int f = 0; f < kJniFunctionCount; ++f) {
    if (!counts[f]) continue;
    total += counts[f];
    char item[64];
    std::snprintf(item, sizeof item, "%s%s %.3g", text.empty() ? "" : ", ",
                  JniFunctionName(static_cast<JniFunction>(f)), static_cast<double>(counts[f]) / calls);
    text += item;
  }
  char sum[32];
  std::snprintf(sum, sizeof sum, " (%.3g in all)", static_cast<double>(total) / calls);
  return text + sum;
}

PerCall Count(World& w, Operation operation, int calls, bool& ok)
{
  StartCountingAllocations();
  for (int i = 0; i < calls; ++i) ok = operation(w, i) && ok;
  const AllocationCounts counts = StopCountingAllocations();
  return PerCall{static_cast<double>(counts.news) / calls, static_cast<double>(counts.mallocs) / calls};
}

// ---- The summary -----------------------------------------------------------------------------

void PrintSummary(const SummaryReporter& reporter, const std::map<std::string, AllocationFinding>& allocations,
                  const PerCall& fillAllocations)
{
  std::printf("\n==== Corvexa: library against hand-written JNI (same process, same run) ====\n");
  std::printf("Times per call; \"cpu\" is the CPU time of the calling thread, \"real\" the wall-clock time.\n");
  std::printf(
      "The target applies to the cpu ratio for single operations (steadier on a shared machine) and\n"
      "is shown against both.\n\n");
  std::printf("%-46s %10s %10s %10s %10s %10s %6s %6s %7s  %s\n", "operation", "lib cpu", "base cpu", "excess",
              "lib real", "base real", "cpu x", "real x", "target", "");
  int misses = 0;
  const auto row = [&](const char* what, const std::string& lib, const std::string& base, double target, bool byReal) {
    const SummaryReporter::Times l = reporter.Nanoseconds(lib), b = reporter.Nanoseconds(base);
    const double ratio =
        byReal ? (l.real > 0 && b.real > 0 ? l.real / b.real : -1) : (l.cpu > 0 && b.cpu > 0 ? l.cpu / b.cpu : -1);
    std::string verdict;
    if (!reporter.Failure(lib).empty() || !reporter.Failure(base).empty())
      verdict = "FAILED: " + reporter.Failure(lib) + reporter.Failure(base);
    else if (ratio < 0)
      verdict = "not run";
    else if (target > 0)
      verdict = ratio <= target ? "meets target" : (++misses, "MISSES target");
    char targetText[16] = "-";
    if (target > 0) std::snprintf(targetText, sizeof targetText, "<=%.2f", target);
    std::printf("%-46s %10s %10s %10s %10s %10s %6s %6s %7s  %s\n", what, Figure(l.cpu).c_str(), Figure(b.cpu).c_str(),
                Excess(l.cpu, b.cpu).c_str(), Figure(l.real).c_str(), Figure(b.real).c_str(),
                Ratio(l.cpu, b.cpu).c_str(), Ratio(l.real, b.real).c_str(), targetText, verdict.c_str());
  };
  std::printf("  base: hand-written JNI\n");
  for (const Pair& pair : Pairs())
    row(pair.what, std::string(pair.key) + "/library", std::string(pair.key) + "/handJNI", pair.target, false);
  const std::string fillWhat = "fill " + std::to_string(gOptions.fillInstances) + " instances x 8 attributes";
  std::printf("  base: the same fill in pure Java, called once through JNI\n");
  row(fillWhat.c_str(), "Fill/library", "Fill/pureJava", 0, true);
  std::printf("  base: the same fill by hand-written JNI\n");
  row(fillWhat.c_str(), "Fill/library", "Fill/handJNI", 0, true);
  const SummaryReporter::Times fl = reporter.Nanoseconds("Fill/library"), fh = reporter.Nanoseconds("Fill/handJNI"),
                               fj = reporter.Nanoseconds("Fill/pureJava");
  const double n = gOptions.fillInstances;
  if (fl.real > 0 && fh.real > 0 && fj.real > 0)
    std::printf("  real time per instance: library %s, hand-written JNI %s, pure Java %s\n",
                Figure(fl.real / n).c_str(), Figure(fh.real / n).c_str(), Figure(fj.real / n).c_str());

  std::printf("\nSingle JNI costs, for reading the excess (cpu time per call):\n");
  for (const Single& single : Singles())
    std::printf("  %-44s %10s\n", single.what, Figure(reporter.Nanoseconds(single.key).cpu).c_str());

  std::printf("\nHeap allocations per call on the calling thread, after warm-up (operator new | malloc):\n");
  std::printf("%-46s %17s %17s\n", "operation", "library", "hand JNI");
  for (const Pair& pair : Pairs()) {
    const auto found = allocations.find(pair.key);
    if (found == allocations.end()) continue;
    const AllocationFinding& a = found->second;
    char lib[40], hand[40];
    std::snprintf(lib, sizeof lib, "%6.2f | %6.2f", a.library.news, a.library.mallocs);
    std::snprintf(hand, sizeof hand, "%6.2f | %6.2f", a.hand.news, a.hand.mallocs);
    std::printf("%-46s %17s %17s%s\n", pair.what, lib, hand, a.ok ? "" : "  (some calls failed)");
  }
  std::printf("%-46s %6.2f | %6.2f per instance: 9 library calls, and the caller's own VLXBinary (1 new)\n",
              "fill through the library", fillAllocations.news, fillAllocations.mallocs);

  std::printf("\nJNI calls per call (counted through the thread's JNI function table, not while timing):\n");
  for (const Pair& pair : Pairs()) {
    const auto found = allocations.find(pair.key);
    if (found == allocations.end()) continue;
    std::printf("%s\n  library:  %s\n  hand JNI: %s\n", pair.what, found->second.libraryJni.c_str(),
                found->second.handJni.c_str());
  }
  if (misses) std::printf("\n%d ratio(s) miss their target.\n", misses);
}

bool ParseOption(const char* arg, const char* name, int& value)
{
  const size_t length = std::strlen(name);
  if (std::strncmp(arg, name, length) != 0 || arg[length] != '=') return false;
  char* end = nullptr;
  const long parsed = std::strtol(arg + length + 1, &end, 10);
  if (*end != '\0' || parsed < 1 || parsed > 100000000) {
    std::fprintf(stderr, "corvexa-bench: bad value in %s\n", arg);
    std::exit(2);
  }
  value = static_cast<int>(parsed);
  return true;
}

}  // namespace

int main(int argc, char** argv)
{
  benchmark::Initialize(&argc, argv);
  int modernInstances = 100000;
  int kept = 1;
  for (int i = 1; i < argc; ++i) {
    if (ParseOption(argv[i], "--fill_instances", gOptions.fillInstances) ||
        ParseOption(argv[i], "--fill_iterations", gOptions.fillIterations) ||
        ParseOption(argv[i], "--lookup_instances", gOptions.lookupInstances) ||
        ParseOption(argv[i], "--bulk_instances", gOptions.bulkInstances) ||
        ParseOption(argv[i], "--modern_instances", modernInstances) ||
        ParseOption(argv[i], "--warmup_calls", gOptions.warmupCalls))
      continue;
    argv[kept++] = argv[i];
  }
  argc = kept;
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;

  // The Java baseline's jar goes before anything else the user put on the class path; the bridge
  // reads this when the first library call creates the JVM.
  std::string classPath = CORVEXA_BENCH_JAR;
  if (const char* more = std::getenv("VLXJBX_CLASSPATH"); more && *more) classPath += std::string(":") + more;
  setenv("VLXJBX_CLASSPATH", classPath.c_str(), 1);

  // A heap of fixed size, touched in advance: otherwise the first use of each new heap page costs a
  // page fault inside whichever operation happens to allocate there, which swamps the array
  // benchmarks with noise. Both sides of every pair share the one JVM and its options.
  if (const char* options = std::getenv("VLXJBX_JVM_OPTIONS"); !options || !*options)
    setenv("VLXJBX_JVM_OPTIONS", kDefaultJvmOptions, 1);
  std::printf("JVM options: %s\n", std::getenv("VLXJBX_JVM_OPTIONS"));

  auto world = std::make_unique<World>();
  gWorld = world.get();
  std::string why;
  if (!SetUp(*world, why) || !FillsAgree(*world, why) ||
      !RegisterDataBenchmarks(world->env, {gOptions.lookupInstances, gOptions.bulkInstances, gOptions.fillIterations},
                              why) ||
      !RegisterModernBenchmarks(modernInstances, why)) {
    std::fprintf(stderr, "corvexa-bench: set-up failed: %s\n", why.c_str());
    TearDown(*world);
    return 1;
  }

  // Warm-up (the JIT compiles the Java side), then the allocations of one call.
  std::map<std::string, AllocationFinding> allocations;
  for (const Pair& pair : Pairs()) {
    AllocationFinding& a = allocations[pair.key];
    for (int i = 0; i < gOptions.warmupCalls; ++i) {
      a.ok = pair.library(*world, i) && a.ok;
      a.ok = pair.hand(*world, i) && a.ok;
    }
    const int calls = 1000;
    a.library = Count(*world, pair.library, calls, a.ok);
    a.hand = Count(*world, pair.hand, calls, a.ok);
    a.libraryJni = JniCallsOf(*world, pair.library, 100, a.ok);
    a.handJni = JniCallsOf(*world, pair.hand, 100, a.ok);
  }
  PerCall fillAllocations;
  {
    FillReplica f;
    const int count = std::min(gOptions.fillInstances, 10000);
    bool ok = MakeFillReplica(f) && LibraryFill(f.model, count);  // warm
    f = FillReplica();
    ok = MakeFillReplica(f) && ok;
    StartCountingAllocations();
    ok = LibraryFill(f.model, count) && ok;
    const AllocationCounts counts = StopCountingAllocations();
    fillAllocations = PerCall{static_cast<double>(counts.news) / count, static_cast<double>(counts.mallocs) / count};
    if (!ok) std::fprintf(stderr, "corvexa-bench: the fill failed while counting allocations\n");
  }

  for (const Pair& pair : Pairs()) {
    const Operation library = pair.library, hand = pair.hand;
    benchmark::RegisterBenchmark((std::string(pair.key) + "/library").c_str(),
                                 [library](benchmark::State& s) { RunOperation(s, library); });
    benchmark::RegisterBenchmark((std::string(pair.key) + "/handJNI").c_str(),
                                 [hand](benchmark::State& s) { RunOperation(s, hand); });
  }
  for (int warm = 0; warm < 2; ++warm) {  // the first runs of the Java code they reach are interpreted
    for (FillBy by : {FillBy::HandJni, FillBy::PureJava}) {
      FillReplica f;
      if (MakeFillReplica(f)) Fill(*world, by, f.model, std::min(gOptions.fillInstances, 20000));
    }
  }
  for (const Single& single : Singles()) {
    const Operation operation = single.operation;
    benchmark::RegisterBenchmark(single.key, [operation](benchmark::State& s) { RunOperation(s, operation); });
  }
  // One fill per repetition, so that the summary takes the median fill.
  for (auto* fill : {benchmark::RegisterBenchmark("Fill/library", RunFill, FillBy::Library),
                     benchmark::RegisterBenchmark("Fill/handJNI", RunFill, FillBy::HandJni),
                     benchmark::RegisterBenchmark("Fill/pureJava", RunFill, FillBy::PureJava)})
    fill->Iterations(1)->Repetitions(gOptions.fillIterations)->Unit(benchmark::kMillisecond)->UseRealTime();

  SummaryReporter reporter;
  benchmark::RunSpecifiedBenchmarks(&reporter);
  PrintSummary(reporter, allocations, fillAllocations);
  PrintDataSummary(reporter);
  PrintModernSummary(reporter);
  benchmark::Shutdown();
  ReleaseModernBenchmarks();
  ReleaseDataBenchmarks(world->env);
  TearDown(*world);
  return 0;
}
