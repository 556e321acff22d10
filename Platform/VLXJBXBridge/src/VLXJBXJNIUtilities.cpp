#include "VLXJBXJNIUtilities.h"

#include "VLXError.h"
#include "VLXJBXException.h"
#include "VLXJBXInternal.h"

#include <dlfcn.h>
#include <pthread.h>
#include <sys/stat.h>

#include <atomic>
#include <cctype>
#include <cstdlib>
#include <mutex>
#include <string>
#include <vector>

using VLXJBXDetail::LocalRef;
using VLXJBXDetail::Raise;

namespace {
const char kReplicaJar[] = "corvexa-replica.jar";
const char kAttachedThreadPrefix[] = "VLXJBX-attached-";

// The process's JVM, published once it is found or created.
std::atomic<JavaVM*> g_vm{nullptr};
// Guards the start of the JVM and remembers a failed start (a JVM cannot be created twice).
std::mutex g_startMutex;
bool g_startFailed = false;
std::string g_startFailure;

// The environment of threads whose attachment the bridge controls: the threads it attached and
// the thread that created the JVM. Other threads (Java threads calling native code, threads
// attached by someone else) ask the JVM each time: whoever attached them may detach them.
thread_local JNIEnv* t_env = nullptr;

// Detaches, at thread exit, the threads the bridge attached (the key's value is the JVM). Key
// destructors do not run for the main thread when the process exits, which is what we want:
// the JVM outlives it.
pthread_key_t g_detachKey;
bool g_detachKeyReady = false;
std::once_flag g_detachKeyOnce;

std::atomic<long> g_attachSerial{0};
std::atomic<long> g_globalRefs{0};

void DetachAtThreadExit(void* value)
{
  t_env = nullptr;
  static_cast<JavaVM*>(value)->DetachCurrentThread();
}

void MakeDetachKey()
{
  std::call_once(g_detachKeyOnce,
                 [] { g_detachKeyReady = pthread_key_create(&g_detachKey, &DetachAtThreadExit) == 0; });
}

const char* JniCodeText(jint code)
{
  switch (code) {
    case JNI_ERR:
      return "unknown error";
    case JNI_EDETACHED:
      return "thread detached";
    case JNI_EVERSION:
      return "JNI version not supported";
    case JNI_ENOMEM:
      return "not enough memory";
    case JNI_EEXIST:
      return "a Java virtual machine already exists";
    case JNI_EINVAL:
      return "invalid arguments, such as an unrecognised option";
    default:
      return "unexpected code";
  }
}

// Creates the JVM (the caller holds g_startMutex and saw no JVM). On success the calling thread is
// attached and *env is its environment.
long CreateJavaVM(const VLXListValVLXUnicodeString& extraOptions, JavaVM*& vm, JNIEnv*& env)
{
  std::vector<std::string> texts;
  const std::string classPath =
      VLXJBXDetail::BuildClassPath(std::getenv("VLXJBX_CLASSPATH"), VLXJBXDetail::LibraryDirectory());
  if (!classPath.empty()) texts.push_back("-Djava.class.path=" + classPath);
  for (std::string& word : VLXJBXDetail::SplitOptions(std::getenv("VLXJBX_JVM_OPTIONS")))
    texts.push_back(std::move(word));
  for (int i = 1; i <= extraOptions.Size(); ++i)
    if (extraOptions[i].GetLengthInByte() > 0)
      texts.emplace_back(extraOptions[i].c_str(), static_cast<size_t>(extraOptions[i].GetLengthInByte()));

  std::vector<JavaVMOption> options(texts.size());
  for (size_t i = 0; i < texts.size(); ++i) {
    options[i].optionString = const_cast<char*>(texts[i].c_str());
    options[i].extraInfo = nullptr;
  }
  JavaVMInitArgs args;
  args.version = JNI_VERSION_1_8;
  args.nOptions = static_cast<jint>(options.size());
  args.options = options.empty() ? nullptr : options.data();
  args.ignoreUnrecognized = JNI_FALSE;

  void* envOut = nullptr;
  const jint rc = JNI_CreateJavaVM(&vm, &envOut, &args);
  if (rc == JNI_OK) {
    env = static_cast<JNIEnv*>(envOut);
    return VLX_S_OK;
  }
  std::string why = "JNI_CreateJavaVM returned " + std::to_string(rc) + " (" + JniCodeText(rc) + ") for the options [";
  for (size_t i = 0; i < texts.size(); ++i) why += (i ? " " : "") + texts[i];
  why += "]";
  g_startFailed = true;
  g_startFailure = why;
  vm = nullptr;
  return VLX_E_FAIL;
}

long SlowGetJNIEnv(JNIEnv*& env, const VLXListValVLXUnicodeString& options)
{
  env = nullptr;
  MakeDetachKey();
  JavaVM* vm = g_vm.load(std::memory_order_acquire);
  if (vm == nullptr) {
    std::lock_guard<std::mutex> lock(g_startMutex);
    vm = g_vm.load(std::memory_order_acquire);
    if (vm == nullptr) {
      if (g_startFailed)
        return Raise(VLX_E_FAIL, VLXJBXMessages::JvmCreationFailed, {g_startFailure}, __FILE__, __LINE__);
      jsize count = 0;
      JavaVM* existing = nullptr;
      if (JNI_GetCreatedJavaVMs(&existing, 1, &count) == JNI_OK && count > 0 && existing != nullptr) {
        vm = existing;
      } else {
        JNIEnv* created = nullptr;
        if (CreateJavaVM(options, vm, created) != VLX_S_OK)
          return Raise(VLX_E_FAIL, VLXJBXMessages::JvmCreationFailed, {g_startFailure}, __FILE__, __LINE__);
        g_vm.store(vm, std::memory_order_release);
        // The creating thread is detached at its exit like every thread the bridge attached (the
        // process's main thread runs no key destructor at exit, so it stays with the JVM).
        if (g_detachKeyReady) pthread_setspecific(g_detachKey, vm);
        t_env = created;
        env = created;
        return VLX_S_OK;
      }
      g_vm.store(vm, std::memory_order_release);
    }
  }

  void* found = nullptr;
  const jint rc = vm->GetEnv(&found, JNI_VERSION_1_8);
  if (rc == JNI_OK) {
    // Attached by someone else (perhaps after detaching a thread the bridge had attached): not
    // cached, and never detached by the bridge.
    if (g_detachKeyReady) pthread_setspecific(g_detachKey, nullptr);
    env = static_cast<JNIEnv*>(found);
    return VLX_S_OK;
  }
  if (rc != JNI_EDETACHED)
    return Raise(
        VLX_E_FAIL, VLXJBXMessages::NoEnvironment,
        {"VLXJBXJNIUtilities::GetJNIEnv", "GetEnv returned " + std::to_string(rc) + " (" + JniCodeText(rc) + ")"},
        __FILE__, __LINE__);
  if (!g_detachKeyReady)
    return Raise(VLX_E_FAIL, VLXJBXMessages::NoEnvironment,
                 {"VLXJBXJNIUtilities::GetJNIEnv", "no thread-exit hook could be installed to detach the thread"},
                 __FILE__, __LINE__);

  std::string name = kAttachedThreadPrefix + std::to_string(g_attachSerial.fetch_add(1) + 1);
  JavaVMAttachArgs attach;
  attach.version = JNI_VERSION_1_8;
  attach.name = const_cast<char*>(name.c_str());
  attach.group = nullptr;
  const jint attached = vm->AttachCurrentThreadAsDaemon(&found, &attach);
  if (attached != JNI_OK || found == nullptr)
    return Raise(VLX_E_FAIL, VLXJBXMessages::NoEnvironment,
                 {"VLXJBXJNIUtilities::GetJNIEnv", "AttachCurrentThreadAsDaemon returned " + std::to_string(attached) +
                                                       " (" + JniCodeText(attached) + ")"},
                 __FILE__, __LINE__);
  if (pthread_setspecific(g_detachKey, vm) != 0) {
    vm->DetachCurrentThread();
    return Raise(VLX_E_FAIL, VLXJBXMessages::NoEnvironment,
                 {"VLXJBXJNIUtilities::GetJNIEnv", "the thread-exit hook could not be set"}, __FILE__, __LINE__);
  }
  t_env = static_cast<JNIEnv*>(found);
  env = t_env;
  return VLX_S_OK;
}

// Names a class for error texts: its Java name when it can be obtained, else "(unknown class)".
std::string ClassName(JNIEnv* env, jclass cls)
{
  if (cls == nullptr) return "(null class)";
  const jmethodID getName = VLXJBXDetail::Lang(env).classGetName;
  if (getName == nullptr) return "(unknown class)";
  LocalRef name(env, env->CallObjectMethod(cls, getName));
  if (env->ExceptionCheck()) {
    env->ExceptionClear();
    return "(unknown class)";
  }
  return VLXJBXDetail::JavaToUtf8(env, static_cast<jstring>(name.get()));
}

template <class Id, class Lookup>
long LookupMember(JNIEnv* env, jclass cls, const char* kind, const char* name, const char* signature, Id& id,
                  const char* operation, Lookup lookup)
{
  if (env == nullptr || cls == nullptr || name == nullptr || signature == nullptr)
    return Raise(VLX_E_INVALIDARG, VLXJBXMessages::InvalidArgument,
                 {operation, env == nullptr    ? "null environment"
                             : cls == nullptr  ? "null class"
                             : name == nullptr ? "null member name"
                                               : "null signature"},
                 __FILE__, __LINE__);
  if (env->ExceptionCheck())
    return Raise(VLX_E_FAIL, VLXJBXMessages::ExceptionPending, {operation}, __FILE__, __LINE__);
  Id found = lookup(env, cls, name, signature);
  if (env->ExceptionCheck() || found == nullptr) {
    std::string exception = env->ExceptionCheck() ? VLXJBXDetail::TakeException(env).Describe() : "no exception";
    return Raise(VLX_E_FAIL, VLXJBXMessages::LookupFailed,
                 {std::string(kind) + " '" + name + "' with signature '" + signature + "' of class '" +
                      ClassName(env, cls) + "'",
                  exception},
                 __FILE__, __LINE__);
  }
  id = found;
  return VLX_S_OK;
}
}  // namespace

// The cached environment of the calling thread while the thread is still attached with it: the
// application may have detached the thread (and attached it again) since the cache was filled.
static JNIEnv* CachedEnv()
{
  JNIEnv* cached = t_env;
  if (cached == nullptr) return nullptr;
  void* current = nullptr;
  if (g_vm.load(std::memory_order_relaxed)->GetEnv(&current, JNI_VERSION_1_8) == JNI_OK && current == cached)
    return cached;
  t_env = nullptr;
  return nullptr;
}

long VLXJBXJNIUtilities::GetJNIEnv(JNIEnv*& env, VLXListValVLXUnicodeString options)
{
  if (JNIEnv* cached = CachedEnv()) {
    env = cached;
    return VLX_S_OK;
  }
  return SlowGetJNIEnv(env, options);
}

JavaVM* VLXJBXJNIUtilities::GetJavaVM() { return g_vm.load(std::memory_order_acquire); }

JNIEnv* VLXJBXDetail::CurrentEnv()
{
  if (JNIEnv* cached = CachedEnv()) return cached;
  JNIEnv* env = nullptr;
  SlowGetJNIEnv(env, VLXListValVLXUnicodeString());
  return env;
}

long VLXJBXJNIUtilities::NewGlobalRefForClass(JNIEnv* env, const char* classPath, jclass& cls)
{
  static const char kOperation[] = "VLXJBXJNIUtilities::NewGlobalRefForClass";
  if (env == nullptr || classPath == nullptr)
    return Raise(VLX_E_INVALIDARG, VLXJBXMessages::InvalidArgument,
                 {kOperation, env == nullptr ? "null environment" : "null class path"}, __FILE__, __LINE__);
  if (env->ExceptionCheck())
    return Raise(VLX_E_FAIL, VLXJBXMessages::ExceptionPending, {kOperation}, __FILE__, __LINE__);
  LocalRef local(env, env->FindClass(classPath));
  if (env->ExceptionCheck() || local.get() == nullptr) {
    std::string exception = env->ExceptionCheck() ? VLXJBXDetail::TakeException(env).Describe() : "no exception";
    return Raise(VLX_E_FAIL, VLXJBXMessages::LookupFailed, {std::string("class '") + classPath + "'", exception},
                 __FILE__, __LINE__);
  }
  jobject global = env->NewGlobalRef(local.get());
  if (global == nullptr)
    return Raise(VLX_E_OUTOFMEMORY, VLXJBXMessages::OperationFailed,
                 {kOperation, std::string("no global reference could be made for class '") + classPath + "'"}, __FILE__,
                 __LINE__);
  VLXJBXDetail::CountGlobalRefs(1);
  cls = static_cast<jclass>(global);
  return VLX_S_OK;
}

long VLXJBXJNIUtilities::GetMethodID(JNIEnv* env, jclass cls, const char* name, const char* signature, jmethodID& id)
{
  return LookupMember(env, cls, "method", name, signature, id, "VLXJBXJNIUtilities::GetMethodID",
                      [](JNIEnv* e, jclass c, const char* n, const char* s) { return e->GetMethodID(c, n, s); });
}

long VLXJBXJNIUtilities::GetStaticMethodID(JNIEnv* env, jclass cls, const char* name, const char* signature,
                                           jmethodID& id)
{
  return LookupMember(env, cls, "static method", name, signature, id, "VLXJBXJNIUtilities::GetStaticMethodID",
                      [](JNIEnv* e, jclass c, const char* n, const char* s) { return e->GetStaticMethodID(c, n, s); });
}

long VLXJBXJNIUtilities::GetStaticFieldID(JNIEnv* env, jclass cls, const char* name, const char* signature,
                                          jfieldID& id)
{
  return LookupMember(env, cls, "static field", name, signature, id, "VLXJBXJNIUtilities::GetStaticFieldID",
                      [](JNIEnv* e, jclass c, const char* n, const char* s) { return e->GetStaticFieldID(c, n, s); });
}

long VLXJBXJNIUtilities::HandleJavaError(JNIEnv* env, long code, const char* context, VLXError* error, int flag)
{
  const std::string operation = context != nullptr ? context : "(unnamed operation)";
  if (env != nullptr && env->ExceptionCheck()) {
    if (flag != 0) {
      // ExceptionDescribe clears the exception: keep it to describe it afterwards.
      const LocalRef pending(env, env->ExceptionOccurred());
      env->ExceptionDescribe();
      env->ExceptionClear();
      env->Throw(static_cast<jthrowable>(pending.get()));
    }
    if (error != nullptr) {
      env->ExceptionClear();
      return VLXError::GetReturn(VLXError::ReturnError, error, nullptr, __FILE__, __LINE__);
    }
    const VLXJBXDetail::JavaExceptionText exception = VLXJBXDetail::TakeException(env);
    return Raise(VLX_E_FAIL, VLXJBXMessages::JavaException,
                 {operation, exception.className, exception.message, exception.cause}, __FILE__, __LINE__);
  }
  if (code >= 0) {
    if (error != nullptr) error->Release();
    return VLX_S_OK;
  }
  if (error != nullptr) return VLXError::GetReturn(VLXError::ReturnError, error, nullptr, __FILE__, __LINE__);
  // The failure's own error, if it recorded one since the operation started; never an older one.
  if (VLXError* own = VLXError::VLXGetOperationError()) {
    own->Release();
    return VLX_E_FAIL;
  }
  return Raise(VLX_E_FAIL, VLXJBXMessages::OperationFailed,
               {operation, "it returned the failure code " + std::to_string(code) + " and recorded no cause"}, __FILE__,
               __LINE__);
}

long VLXJBXJNIUtilities::GetClassName(JNIEnv* env, jobject object, VLXUnicodeString& name)
{
  static const char kOperation[] = "VLXJBXJNIUtilities::GetClassName";
  if (env == nullptr || object == nullptr)
    return Raise(VLX_E_INVALIDARG, VLXJBXMessages::InvalidArgument,
                 {kOperation, env == nullptr ? "null environment" : "null object"}, __FILE__, __LINE__);
  std::string text;
  if (!VLXJBXDetail::ClassName(env, object, text))
    return Raise(VLX_E_FAIL, VLXJBXMessages::OperationFailed, {kOperation, "Class.getName failed"}, __FILE__, __LINE__);
  name = VLXUnicodeString(text.data(), static_cast<int>(text.size()));
  return VLX_S_OK;
}

long VLXJBXJNIUtilities::GetGlobalRefCount() { return g_globalRefs.load(std::memory_order_relaxed); }

void VLXJBXDetail::CountGlobalRefs(long delta) { g_globalRefs.fetch_add(delta, std::memory_order_relaxed); }

// ---- start-up configuration ----

std::string VLXJBXDetail::LibraryDirectory()
{
  Dl_info info;
  if (dladdr(reinterpret_cast<void*>(&VLXJBXDetail::LibraryDirectory), &info) == 0 || info.dli_fname == nullptr)
    return std::string();
  std::string path = info.dli_fname;
  const size_t slash = path.rfind('/');
  if (slash == std::string::npos) return ".";
  return slash == 0 ? "/" : path.substr(0, slash);
}

namespace {
bool IsRegularFile(const std::string& path)
{
  struct stat st;
  return stat(path.c_str(), &st) == 0 && S_ISREG(st.st_mode);
}
}  // namespace

std::string VLXJBXDetail::BuildClassPath(const char* classPathVariable, const std::string& libraryDirectory)
{
  std::string classPath;
  auto add = [&classPath](const std::string& entry) {
    if (entry.empty()) return;
    if (!classPath.empty()) classPath += ':';
    classPath += entry;
  };
  if (classPathVariable != nullptr) {
    std::string entries = classPathVariable;
    size_t start = 0;
    while (start <= entries.size()) {
      size_t end = entries.find(':', start);
      if (end == std::string::npos) end = entries.size();
      add(entries.substr(start, end - start));
      start = end + 1;
    }
  }
  if (!libraryDirectory.empty()) {
    const std::string shared = libraryDirectory + "/../share/corvexa/" + kReplicaJar;
    const std::string beside = libraryDirectory + "/" + kReplicaJar;
    if (IsRegularFile(shared))
      add(shared);
    else if (IsRegularFile(beside))
      add(beside);
  }
  return classPath;
}

std::vector<std::string> VLXJBXDetail::SplitOptions(const char* text)
{
  std::vector<std::string> words;
  if (text == nullptr) return words;
  std::string word;
  for (const char* p = text;; ++p) {
    if (*p == '\0' || std::isspace(static_cast<unsigned char>(*p))) {
      if (!word.empty()) words.push_back(word);
      word.clear();
      if (*p == '\0') break;
    } else {
      word += *p;
    }
  }
  return words;
}
