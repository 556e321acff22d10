// The one support header of the native suites: the thread's Java environment, objects made and read
// through JNI, the thread's last error, reference counts, and a replica with one attribute of every
// type. Fatal-error reports are recorded with the platform suites' FatalRecorder.
#pragma once

#include <jvmti.h>

#include "../platform/BridgeSupport.h"
#include "../platform/FatalRecorder.h"
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
#include "VLXListValVLXUnicodeString.h"

namespace corvexa_test {

const char* const kInstanceClass = "com/velmora/tessara/kdmreplica/Instance";

// The calling thread's environment (starts the JVM when needed).
inline JNIEnv* Env()
{
  JNIEnv* env = nullptr;
  VLXJBXJNIUtilities::GetJNIEnv(env, VLXListValVLXUnicodeString());
  return env;
}

inline VLXUnicodeString U(const std::string& s) { return VLXUnicodeString(s.data(), static_cast<int>(s.size())); }
inline std::string Texts(const VLXListOfVLXUnicodeString& list)
{
  std::string out;
  for (int i = 1; i <= list.Size(); ++i) out += (i > 1 ? "," : "") + Text(list[i]);
  return out;
}
inline void ClearLastError() { VLXError::VLXCleanLastError(); }

// The fatal-error reports recorded so far, as "message@line".
inline std::vector<std::string> Reports()
{
  std::vector<std::string> out;
  for (const FatalReport& r : FatalRecorder::Reports()) out.push_back(r.message + "@" + std::to_string(r.line));
  return out;
}

// A local reference deleted at the end of the scope.
class Local {
 public:
  explicit Local(jobject ref = nullptr) : _ref(ref) {}
  ~Local() { reset(); }
  void reset(jobject ref = nullptr)
  {
    if (_ref) Env()->DeleteLocalRef(_ref);
    _ref = ref;
  }
  Local(const Local&) = delete;
  Local& operator=(const Local&) = delete;
  jobject get() const { return _ref; }

 private:
  jobject _ref;
};

// Every JNI call of a test is followed by this check, so that the library is never entered with an
// exception the test left pending; one is printed, cleared and fails the test.
inline bool NoPending(const char* what)
{
  JNIEnv* env = Env();
  if (!env->ExceptionCheck()) return true;
  env->ExceptionDescribe();
  env->ExceptionClear();
  ADD_FAILURE() << "a Java exception is pending after " << what;
  return false;
}

// A new object of the class at path, made by the constructor of signature with the given arguments.
template <class... A>
jobject New(const char* path, const char* signature = "()V", A... args)
{
  JNIEnv* env = Env();
  Local cls(env->FindClass(path));
  if (!NoPending(path)) return nullptr;
  const jmethodID ctor = env->GetMethodID(static_cast<jclass>(cls.get()), "<init>", signature);
  if (!NoPending(signature)) return nullptr;
  jobject made = env->NewObject(static_cast<jclass>(cls.get()), ctor, args...);
  return NoPending(path) ? made : nullptr;
}
inline jobject NewDate(jlong ms, const char* cls = "java/util/Date") { return New(cls, "(J)V", ms); }

inline jmethodID MethodOf(jobject object, const char* name, const char* signature)
{
  Local cls(Env()->GetObjectClass(object));
  return Env()->GetMethodID(static_cast<jclass>(cls.get()), name, signature);
}
// Whether two Java objects are equal, arrays element by element (java.util.Objects.deepEquals).
inline bool DeepEquals(jobject a, jobject b)
{
  JNIEnv* env = Env();
  Local cls(env->FindClass("java/util/Objects"));
  const jclass objects = static_cast<jclass>(cls.get());
  const jboolean equal = env->CallStaticBooleanMethod(
      objects, env->GetStaticMethodID(objects, "deepEquals", "(Ljava/lang/Object;Ljava/lang/Object;)Z"), a, b);
  return NoPending("deepEquals") && equal == JNI_TRUE;
}

// An int field of a test double (they count calls).
inline int IntField(jobject object, const char* field)
{
  Local cls(Env()->GetObjectClass(object));
  const int value = Env()->GetIntField(object, Env()->GetFieldID(static_cast<jclass>(cls.get()), field, "I"));
  return NoPending(field) ? value : -1;
}

// True when object's class is exactly the class at path.
inline bool IsExactly(jobject object, const char* path)
{
  if (!object) return false;
  Local cls(Env()->GetObjectClass(object)), expected(Env()->FindClass(path));
  return NoPending(path) && Env()->IsSameObject(cls.get(), expected.get()) == JNI_TRUE;
}

// An array of class elementClass holding the given objects (nulls allowed).
inline jobjectArray NewArray(const char* elementClass, const std::vector<jobject>& elements)
{
  JNIEnv* env = Env();
  Local cls(env->FindClass(elementClass));
  jobjectArray array =
      env->NewObjectArray(static_cast<jsize>(elements.size()), static_cast<jclass>(cls.get()), nullptr);
  for (size_t i = 0; i < elements.size() && NoPending("making an array"); ++i)
    env->SetObjectArrayElement(array, static_cast<jsize>(i), elements[i]);
  return NoPending("filling an array") ? array : nullptr;
}
inline int Length(jobject array) { return array ? Env()->GetArrayLength(static_cast<jarray>(array)) : -1; }
inline bool Same(jobject a, jobject b) { return Env()->IsSameObject(a, b) == JNI_TRUE; }

// Attaches proxy to a new Java object of the class at path (a test double, say).
template <class Proxy>
void AttachNew(Proxy& proxy, const char* path)
{
  Local object(New(path));
  ASSERT_EQ(VLX_S_OK, proxy.SetHandle(Env(), object.get()));
}

// Proxies attached to new Java instances of no replica.
inline std::vector<VLXKDMInstance> NewInstances(int count)
{
  std::vector<VLXKDMInstance> out(static_cast<size_t>(count));
  for (VLXKDMInstance& instance : out) AttachNew(instance, kInstanceClass);
  return out;
}
inline VLXKDMInstance NewInstance() { return NewInstances(1)[0]; }

inline VLXTime Seconds(time_t s)
{
  VLXTime t;
  t.Settime_t(s);
  return t;
}

template <class List, class T>
List ListOf(std::initializer_list<T> values)
{
  List list;
  for (const T& v : values) list.Append(v);
  return list;
}

// The calling thread's live JNI local references, counted by a heap walk of the JVM's tool
// interface (it reports each as a root with its thread); -1 with a test failure when it cannot.
inline long LocalRefCount()
{
  JNIEnv* env = Env();
  JavaVM* vm = nullptr;
  jvmtiEnv* jvmti = nullptr;
  if (env->GetJavaVM(&vm) != JNI_OK || vm->GetEnv(reinterpret_cast<void**>(&jvmti), JVMTI_VERSION_1_2) != JNI_OK) {
    ADD_FAILURE() << "no tool interface to count local references with";
    return -1;
  }
  struct Counter {
    jlong thread;
    long count;
  } counter{0, 0};
  {
    Local cls(env->FindClass("java/lang/Thread"));
    const jclass thread = static_cast<jclass>(cls.get());
    Local current(
        env->CallStaticObjectMethod(thread, env->GetStaticMethodID(thread, "currentThread", "()Ljava/lang/Thread;")));
    if (!NoPending("Thread.currentThread")) return -1;
    counter.thread = env->CallLongMethod(current.get(), MethodOf(current.get(), "getId", "()J"));
    if (!NoPending("the current thread's id")) return -1;
  }
  jvmtiHeapCallbacks callbacks = {};
  callbacks.heap_reference_callback = [](jvmtiHeapReferenceKind kind, const jvmtiHeapReferenceInfo* info, jlong, jlong,
                                         jlong, jlong*, jlong*, jint, void* data) -> jint {
    Counter* c = static_cast<Counter*>(data);
    if (kind == JVMTI_HEAP_REFERENCE_JNI_LOCAL && info && info->jni_local.thread_id == c->thread) ++c->count;
    return 0;  // roots only
  };
  jvmtiCapabilities wanted = {};
  wanted.can_tag_objects = 1;
  const bool walked = jvmti->AddCapabilities(&wanted) == JVMTI_ERROR_NONE &&
                      jvmti->FollowReferences(0, nullptr, nullptr, &callbacks, &counter) == JVMTI_ERROR_NONE;
  jvmti->DisposeEnvironment();
  if (!walked) ADD_FAILURE() << "the heap walk failed";
  return walked ? counter.count : -1;
}

inline long GlobalRefCount() { return VLXJBXJNIUtilities::GetGlobalRefCount(); }

struct AttributeShape {
  const char* name;
  VLXKDMAttributeType::Type type;
  bool multi;
};

// The attributes of the class "Sample": one of each type (Integer to Relationship), then a list of
// each, so that the attribute at position p (from 0) is single for p < 7 and its list is at p + 7.
inline const std::vector<AttributeShape>& SampleAttributes()
{
  static const std::vector<AttributeShape> attributes = [] {
    const char* const names[] = {"integer",  "double",  "string",  "date",  "boolean",  "binary",   "instance",
                                 "integers", "doubles", "strings", "dates", "booleans", "binaries", "instances"};
    std::vector<AttributeShape> out;
    for (int p = 0; p < 14; ++p) out.push_back({names[p], static_cast<VLXKDMAttributeType::Type>(p % 7), p >= 7});
    return out;
  }();
  return attributes;
}

// Adds a class with the given attributes to the replica, with its model; model is attached to it.
inline void AddClass(VLXKDMReplica& replica, const char* className, const std::vector<AttributeShape>& attributes,
                     VLXKDMModel& model)
{
  VLXKDMClassDef classDef;
  VLXKDMAttributeDefList list;
  ASSERT_EQ(VLX_S_OK, classDef.Build(VLXUnicodeString(className)));
  ASSERT_EQ(VLX_S_OK, classDef.GetAttributes(list));
  for (const AttributeShape& shape : attributes) {
    VLXKDMAttributeDef attribute;
    ASSERT_EQ(VLX_S_OK, attribute.Build(VLXUnicodeString(shape.name), shape.type));
    ASSERT_EQ(VLX_S_OK, attribute.SetMultiValuation(shape.multi ? 1 : 0));
    ASSERT_EQ(VLX_S_OK, list.Add(attribute));
  }
  VLXKDMModelSet models;
  ASSERT_EQ(VLX_S_OK, model.Build(classDef));
  ASSERT_EQ(VLX_S_OK, replica.GetModels(models));
  ASSERT_EQ(VLX_S_OK, models.Add(model));
}

// A replica holding the class "Sample" (SampleAttributes) and its model.
struct SampleReplica {
  VLXKDMReplica replica;
  VLXKDMModel model;

  explicit SampleReplica(const char* name = "samples")
  {
    EXPECT_EQ(VLX_S_OK, replica.Build(VLXUnicodeString(name)));
    AddClass(replica, "Sample", SampleAttributes(), model);
  }
  VLXKDMInstance Create()
  {
    VLXKDMInstance instance;
    EXPECT_EQ(VLX_S_OK, model.CreateInstance(instance));
    return instance;
  }
};

}  // namespace corvexa_test
