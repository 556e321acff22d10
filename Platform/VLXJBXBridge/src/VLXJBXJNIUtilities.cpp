#include "VLXJBXJNIUtilities.h"

#include "VLXError.h"
#include "VLXJBXException.h"
#include "VLXJBXInternal.h"

#include <dlfcn.h>
#include <fcntl.h>
#include <poll.h>
#include <pthread.h>
#include <signal.h>
#include <spawn.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <time.h>
#include <unistd.h>

#include <atomic>
#include <cctype>
#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <mutex>
#include <string>
#include <system_error>
#include <vector>

extern char** environ;

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

// The Java thread of the bridge's own attachment of the calling thread (a weak reference). The
// application may detach that attachment and attach the thread itself, and its new environment
// may have the old one's address; the Java thread tells the two apart.
thread_local jweak t_ownThread = nullptr;

// The calling thread's java.lang.Thread (a local reference), or null.
jobject CurrentJavaThread(JNIEnv* env)
{
  LocalRef cls(env, env->FindClass("java/lang/Thread"));
  const jmethodID current =
      cls.get() ? env->GetStaticMethodID(static_cast<jclass>(cls.get()), "currentThread", "()Ljava/lang/Thread;")
                : nullptr;
  jobject thread = current ? env->CallStaticObjectMethod(static_cast<jclass>(cls.get()), current) : nullptr;
  if (env->ExceptionCheck()) env->ExceptionClear();
  return thread;
}

// Marks the calling thread's attachment as the bridge's own: it is detached at thread exit.
void OwnAttachment(JavaVM* vm, JNIEnv* env)
{
  if (g_detachKeyReady) pthread_setspecific(g_detachKey, vm);
  if (t_ownThread) env->DeleteWeakGlobalRef(t_ownThread);
  LocalRef thread(env, CurrentJavaThread(env));
  t_ownThread = thread.get() ? env->NewWeakGlobalRef(thread.get()) : nullptr;
}

// Detaches the thread at its exit when it is still attached through the bridge's own attachment.
void DetachAtThreadExit(void* value)
{
  t_env = nullptr;
  JavaVM* vm = static_cast<JavaVM*>(value);
  JNIEnv* env = nullptr;
  if (vm->GetEnv(reinterpret_cast<void**>(&env), JNI_VERSION_1_8) != JNI_OK) return;
  bool own = true;
  if (t_ownThread && !env->ExceptionCheck()) {
    LocalRef thread(env, CurrentJavaThread(env));
    own = env->IsSameObject(t_ownThread, thread.get());
  }
  if (t_ownThread) env->DeleteWeakGlobalRef(t_ownThread);
  t_ownThread = nullptr;
  if (own) vm->DetachCurrentThread();
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

std::string Joined(const std::vector<std::string>& words)
{
  std::string text;
  for (size_t i = 0; i < words.size(); ++i) text += (i ? " " : "") + words[i];
  return text;
}

// Whether the options the application gave can be trusted not to stop the JVM while it starts:
// HotSpot ends the whole process (exit(1)) for many faulty options, such as a maximum heap below
// its minimum or two collectors. Only options with no failure at start are trusted: the JNI checks,
// verbose output and the library's own properties. Properties in general are not (a bad
// java.system.class.loader or management port ends the process too).
bool CannotStopTheJvm(const std::string& option)
{
  return option == "-Xcheck:jni" || option == "-verbose:gc" || option == "-verbose:class" || option == "-verbose:jni" ||
         option.rfind("-Dcorvexa.", 0) == 0;
}

// The java launcher of the JDK whose libjvm the library uses ("" if there is none): bin/java in
// the first directory above libjvm's that has one (lib/server/libjvm.so in current JDKs,
// jre/lib/<arch>/server/libjvm.so in older ones).
std::string JavaLauncher()
{
  Dl_info info;
  const VLXJBXDetail::Jvm& jvm = VLXJBXDetail::LoadJvm();
  if (!jvm.create || dladdr(reinterpret_cast<void*>(jvm.create), &info) == 0 || info.dli_fname == nullptr)
    return std::string();
  std::string directory = info.dli_fname;
  for (int level = 0; level < 4; ++level) {
    const size_t slash = directory.rfind('/');
    if (slash == std::string::npos || slash == 0) break;
    directory.resize(slash);
    const std::string java = directory + "/bin/java";
    if (access(java.c_str(), X_OK) == 0) return java;
  }
  return std::string();
}

// The line of the launcher's output that says what went wrong: the first one that is not one of
// its general lines, else the first line.
std::string ReasonLine(const std::string& output)
{
  std::string first;
  size_t start = 0;
  while (start < output.size()) {
    size_t end = output.find('\n', start);
    if (end == std::string::npos) end = output.size();
    std::string line = output.substr(start, end - start);
    start = end + 1;
    if (!line.empty() && line.back() == '\r') line.pop_back();
    if (line.empty()) continue;
    if (first.empty()) first = line;
    if (line != "Error occurred during initialization of VM" &&
        line.rfind("Error: Could not create the Java", 0) != 0 &&
        line.rfind("Error: A fatal exception has occurred", 0) != 0 && line.rfind("Picked up ", 0) != 0)
      return line;
  }
  return first.empty() ? "no output" : first;
}

long long NowMs()
{
  timespec now;
  clock_gettime(CLOCK_MONOTONIC, &now);
  return static_cast<long long>(now.tv_sec) * 1000 + now.tv_nsec / 1000000;
}

// The JNI "exit" hook among the options of JNI_CreateJavaVM is no way out: HotSpot does not call
// it for these failures (tried with JDK 17) and ends the process all the same. Hence a check in a
// process of its own.
// Starts `java <options> -version` (no shell, its output captured) and waits for it, at most
// kLauncherTimeoutMs. Returns false with the reason in `refusal` when the launcher failed with
// the options; true when it succeeded or nothing could be decided (no launcher, no process, no
// answer in time, its status taken by someone else): the JVM is then created as before.
constexpr long long kLauncherTimeoutMs = 20000;

bool LauncherAccepts(const std::vector<std::string>& options, std::string& refusal)
{
  const std::string java = JavaLauncher();
  if (java.empty()) return true;
  std::vector<char*> argv;
  argv.push_back(const_cast<char*>(java.c_str()));
  for (const std::string& option : options) argv.push_back(const_cast<char*>(option.c_str()));
  argv.push_back(const_cast<char*>("-version"));
  argv.push_back(nullptr);
  // JDK_JAVA_OPTIONS is read by the launcher alone, not by a JVM created through JNI.
  std::vector<char*> envp;
  for (char** variable = environ; variable != nullptr && *variable != nullptr; ++variable)
    if (std::strncmp(*variable, "JDK_JAVA_OPTIONS=", 17) != 0) envp.push_back(*variable);
  envp.push_back(nullptr);

  int fds[2];
  if (pipe2(fds, O_CLOEXEC) != 0) return true;
  posix_spawn_file_actions_t actions;
  posix_spawnattr_t attributes;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_addopen(&actions, 0, "/dev/null", O_RDONLY, 0);
  posix_spawn_file_actions_adddup2(&actions, fds[1], 1);  // HotSpot writes its start errors to stdout
  posix_spawn_file_actions_adddup2(&actions, fds[1], 2);
  posix_spawnattr_init(&attributes);
  sigset_t none;
  sigemptyset(&none);
  posix_spawnattr_setsigmask(&attributes, &none);
  posix_spawnattr_setflags(&attributes, POSIX_SPAWN_SETSIGMASK);
  pid_t pid = -1;
  const int spawned = posix_spawn(&pid, java.c_str(), &actions, &attributes, argv.data(), envp.data());
  posix_spawn_file_actions_destroy(&actions);
  posix_spawnattr_destroy(&attributes);
  close(fds[1]);
  if (spawned != 0) {
    close(fds[0]);
    return true;
  }

  // Read its output until it ends (another process may keep the pipe open if it was forked
  // meanwhile, so the end of the output alone does not say it) or until the deadline.
  std::string output;
  // 1: read some, 0: nothing within the time, -1: at the end of the output.
  auto readSome = [&output, fd = fds[0]](int timeoutMs) {
    pollfd wait = {fd, POLLIN, 0};
    const int ready = poll(&wait, 1, timeoutMs);
    if (ready == 0 || (ready < 0 && errno == EINTR)) return 0;
    if (ready < 0) return -1;
    char buffer[4096];
    const ssize_t got = read(fd, buffer, sizeof buffer);
    if (got > 0 && output.size() < 65536) output.append(buffer, static_cast<size_t>(got));
    if (got > 0) return 1;
    return got < 0 && errno == EINTR ? 0 : -1;
  };
  int status = 0;
  pid_t waited = 0;
  bool timedOut = false, reading = true;
  const long long deadline = NowMs() + kLauncherTimeoutMs;
  for (;;) {
    if (reading) {
      const int got = readSome(100);
      if (got > 0 && NowMs() <= deadline) continue;
      reading = got >= 0;
    } else {
      usleep(10000);
    }
    waited = waitpid(pid, &status, WNOHANG);
    if (waited == pid || (waited < 0 && errno != EINTR)) break;
    if (NowMs() > deadline) {
      timedOut = true;
      kill(pid, SIGKILL);
      while (waitpid(pid, &status, 0) < 0 && errno == EINTR) {
      }
      break;
    }
  }
  while (readSome(0) > 0) {
  }
  close(fds[0]);
  if (timedOut || waited != pid) return true;
  if (WIFEXITED(status) && WEXITSTATUS(status) == 0) return true;
  refusal = "the JVM options [" + Joined(options) + "] would end the process while the JVM starts: " + java +
            " with them and -version " +
            (WIFEXITED(status) ? "exited with code " + std::to_string(WEXITSTATUS(status))
                               : "was ended by signal " + std::to_string(WTERMSIG(status))) +
            " (" + ReasonLine(output) + ")";
  return false;
}

// The directories the dynamic loader searches for a library this one loads: its run path first.
std::vector<std::string> RunPathDirectories()
{
  std::vector<std::string> directories;
  Dl_info info;
  if (dladdr(reinterpret_cast<void*>(&RunPathDirectories), &info) == 0 || !info.dli_fname) return directories;
  void* self = dlopen(info.dli_fname, RTLD_LAZY | RTLD_NOLOAD);
  if (!self) return directories;
  Dl_serinfo size;
  if (dlinfo(self, RTLD_DI_SERINFOSIZE, &size) == 0) {
    std::vector<char> buffer(size.dls_size);
    Dl_serinfo* paths = reinterpret_cast<Dl_serinfo*>(buffer.data());
    if (dlinfo(self, RTLD_DI_SERINFOSIZE, paths) == 0 && dlinfo(self, RTLD_DI_SERINFO, paths) == 0)
      for (unsigned i = 0; i < paths->dls_cnt; ++i) directories.emplace_back(paths->dls_serpath[i].dls_name);
  }
  dlclose(self);
  return directories;
}

}  // namespace

const VLXJBXDetail::Jvm& VLXJBXDetail::LoadJvm()
{
  static const Jvm jvm = [] {
    Jvm found;
    auto take = [&found](void* handle, const std::string& path) {
      found.create = reinterpret_cast<decltype(found.create)>(dlsym(handle, "JNI_CreateJavaVM"));
      found.created = reinterpret_cast<decltype(found.created)>(dlsym(handle, "JNI_GetCreatedJavaVMs"));
      if (found.create && found.created)
        found.path = path;
      else
        found.create = nullptr, found.created = nullptr;
      return found.create != nullptr;
    };
    // A JVM already in the process (a Java program that loaded the library, or a program linked
    // with libjvm) is the one to use: a second libjvm in one process cannot work.
    if (take(RTLD_DEFAULT, "the process's own libjvm")) return found;
    std::vector<std::string> candidates;
    if (const char* home = std::getenv("JAVA_HOME"); home && *home)
      candidates.push_back(std::string(home) + "/lib/server/libjvm.so");
    // The directories this library's run path names (the JDK it was built with), looked up here:
    // dlopen's own search may not start from this library (a sanitizer runtime intercepts it).
    for (const std::string& directory : RunPathDirectories())
      if (access((directory + "/libjvm.so").c_str(), F_OK) == 0) candidates.push_back(directory + "/libjvm.so");
    candidates.push_back("/usr/lib/jvm/default-java/lib/server/libjvm.so");
    std::string tried;
    for (const std::string& path : candidates) {
      void* handle = dlopen(path.c_str(), RTLD_NOW | RTLD_GLOBAL);
      if (handle && take(handle, path)) return found;
      const char* error = dlerror();
      tried += (tried.empty() ? "" : "; ") + path + " (" + (error ? error : "no JNI_CreateJavaVM in it") + ")";
    }
    found.problem =
        "no Java virtual machine library (libjvm.so) could be loaded; set JAVA_HOME to a JDK 17. Tried: " + tried +
        (std::getenv("JAVA_HOME") ? "" : "; JAVA_HOME is not set");
    return found;
  }();
  return jvm;
}

namespace {

long StartFailed(const std::string& why)
{
  g_startFailed = true;
  g_startFailure = why;
  return VLX_E_FAIL;
}

// Creates the JVM (the caller holds g_startMutex and saw no JVM). On success the calling thread is
// attached and *env is its environment. Faults that would leave a JVM without the replica, or end
// the process, are found first, and no JVM is created.
long CreateJavaVM(const VLXListValVLXUnicodeString& extraOptions, JavaVM*& vm, JNIEnv*& env)
{
  vm = nullptr;
  std::vector<std::string> userOptions = VLXJBXDetail::SplitOptions(std::getenv("VLXJBX_JVM_OPTIONS"));
  for (int i = 1; i <= extraOptions.Size(); ++i)
    if (extraOptions[i].GetLengthInByte() > 0)
      userOptions.emplace_back(extraOptions[i].c_str(), static_cast<size_t>(extraOptions[i].GetLengthInByte()));

  const char* classPathVariable = std::getenv("VLXJBX_CLASSPATH");
  const std::string libraryDirectory = VLXJBXDetail::LibraryDirectory();
  const std::string classPath = VLXJBXDetail::BuildClassPath(classPathVariable, libraryDirectory);
  // Without a class path of the application's own (VLXJBX_CLASSPATH or -Djava.class.path), the
  // replica classes can come only from the replica jar.
  bool ownClassPath =
      classPathVariable != nullptr && std::string(classPathVariable).find_first_not_of(':') != std::string::npos;
  for (const std::string& option : userOptions)
    if (option.rfind("-Djava.class.path=", 0) == 0) ownClassPath = true;
  if (!ownClassPath) {
    const VLXJBXDetail::ReplicaJarSearch jar = VLXJBXDetail::FindReplicaJar(libraryDirectory);
    if (jar.found.empty()) return StartFailed(jar.problem);
  }

  bool trusted = true;
  for (const std::string& option : userOptions) trusted = trusted && CannotStopTheJvm(option);
  std::string refusal;
  if (!trusted && !LauncherAccepts(userOptions, refusal)) return StartFailed(refusal);

  std::vector<std::string> texts;
  if (!classPath.empty()) texts.push_back("-Djava.class.path=" + classPath);
  texts.insert(texts.end(), userOptions.begin(), userOptions.end());
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
  const jint rc = VLXJBXDetail::LoadJvm().create(&vm, &envOut, &args);
  if (rc == JNI_OK) {
    env = static_cast<JNIEnv*>(envOut);
    return VLX_S_OK;
  }
  vm = nullptr;
  return StartFailed("JNI_CreateJavaVM returned " + std::to_string(rc) + " (" + JniCodeText(rc) +
                     ") for the options [" + Joined(texts) + "]");
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
      const VLXJBXDetail::Jvm& jvm = VLXJBXDetail::LoadJvm();
      if (!jvm.create) {
        g_startFailed = true;
        g_startFailure = jvm.problem;
        return Raise(VLX_E_FAIL, VLXJBXMessages::JvmCreationFailed, {g_startFailure}, __FILE__, __LINE__);
      }
      if (jvm.created(&existing, 1, &count) == JNI_OK && count > 0 && existing != nullptr) {
        vm = existing;
      } else {
        JNIEnv* created = nullptr;
        if (CreateJavaVM(options, vm, created) != VLX_S_OK)
          return Raise(VLX_E_FAIL, VLXJBXMessages::JvmCreationFailed, {g_startFailure}, __FILE__, __LINE__);
        g_vm.store(vm, std::memory_order_release);
        // The creating thread is detached at its exit like every thread the bridge attached (the
        // process's main thread runs no key destructor at exit, so it stays with the JVM).
        OwnAttachment(vm, created);
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
    if (t_ownThread) env->DeleteWeakGlobalRef(t_ownThread);
    t_ownThread = nullptr;
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
  OwnAttachment(vm, static_cast<JNIEnv*>(found));
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

VLXJBXDetail::ReplicaJarSearch VLXJBXDetail::FindReplicaJar(const std::string& libraryDirectory)
{
  ReplicaJarSearch search;
  if (libraryDirectory.empty()) {
    search.problem = std::string(kReplicaJar) + " was not found: the directory of the library is unknown";
    return search;
  }
  std::string searched, unreadable;
  for (const std::string& path :
       {libraryDirectory + "/../share/corvexa/" + kReplicaJar, libraryDirectory + "/" + kReplicaJar}) {
    struct stat st;
    if (stat(path.c_str(), &st) == 0 && S_ISREG(st.st_mode)) {
      const int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
      if (fd >= 0) {
        close(fd);
        search.found = path;
        return search;
      }
      unreadable += "; " + path + " exists but cannot be read (" + std::generic_category().message(errno) + ")";
    }
    searched += (searched.empty() ? "" : ", ") + path;
  }
  search.problem = std::string(kReplicaJar) + (unreadable.empty() ? " was not found" : " could not be read") +
                   " (searched " + searched + unreadable + ")";
  return search;
}

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
  if (!libraryDirectory.empty()) add(FindReplicaJar(libraryDirectory).found);
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
