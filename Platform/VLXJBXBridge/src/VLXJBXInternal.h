// Shared helpers of the bridge's units; not installed.
#ifndef VLXJBXInternal_h
#define VLXJBXInternal_h

#include "VLXJBXLocalRef.h"
#include "VLXUnicodeString.h"

#include <jni.h>

#include <initializer_list>
#include <string>
#include <vector>

namespace VLXJBXDetail {
using LocalRef = VLXJBXLocalRef;

// Java classes and members of java.lang the bridge itself uses, resolved once per process through
// uncounted global references that are never released. A member is null when its lookup failed.
struct JavaLang {
  jclass stringClass = nullptr;
  jclass objectArrayClass = nullptr;
  jclass booleanArrayClass = nullptr;
  jclass byteArrayClass = nullptr;
  jclass intArrayClass = nullptr;
  jclass doubleArrayClass = nullptr;
  jmethodID classGetName = nullptr;         // java.lang.Class.getName()
  jmethodID throwableGetMessage = nullptr;  // java.lang.Throwable.getMessage()
  jmethodID throwableGetCause = nullptr;    // java.lang.Throwable.getCause()
};
// Needs no pending exception.
const JavaLang& Lang(JNIEnv* env);

// Records a new VLXJBXException with the id and parameters as the calling thread's last error and
// returns `code`.
long Raise(long code, const char* id, std::initializer_list<std::string> parameters, const char* file, int line);

// The calling thread's JNIEnv from the bridge (null when none can be obtained; the last error says why).
JNIEnv* CurrentEnv();

// Adjusts the count of global references held through the bridge.
void CountGlobalRefs(long delta);

// A Java exception in words.
struct JavaExceptionText {
  std::string className;  // "java.lang.IllegalStateException"
  std::string message;    // its getMessage(), "(no message)" when null
  std::string cause;      // "; caused by <class>: <message>", or empty when it has no cause
  // "class: message" followed by the cause.
  std::string Describe() const { return className + ": " + message + cause; }
};

// Clears the pending exception (there must be one) and describes it. Every exception raised while
// describing it is cleared too.
JavaExceptionText TakeException(JNIEnv* env);

// Java text to UTF-8, for descriptive texts (messages, class names): needs no pending exception;
// a null string gives "", an unpaired surrogate becomes U+FFFD. Never fails.
std::string JavaToUtf8(JNIEnv* env, jstring text);

// The Java name of the class of object (not null), as Class.getName spells it; false when it cannot
// be read (an exception on the way is cleared). No exception may be pending.
bool ClassName(JNIEnv* env, jobject object, std::string& name);

// Encodes count UTF-16 units as UTF-8 into out, which holds 3 bytes per unit. Returns the byte
// count; or, when a unit is an unpaired surrogate, -1 - its index (lossy: it becomes U+FFFD).
// A high surrogate ending the units is unpaired.
long Utf16ToUtf8(const jchar* units, jsize count, char* out, bool lossy);

// The whole UTF-8 form of a text of count (> 256) units into bytes, read in pieces: VLX_S_OK, or a
// failure with a last error naming operation for an unpaired surrogate or a form longer than
// INT_MAX bytes (lossy: U+FFFD for the surrogate, and the form cut short).
long LongTextToUtf8(JNIEnv* env, jstring text, jsize count, const char* operation, bool lossy, std::string& bytes);

// Records that the Java text cannot cross exactly because of the unpaired surrogate at index.
long RejectUnpairedSurrogate(const char* operation, jsize index, jchar unit);

// Calls use(bytes, length) with the exact UTF-8 form of text (null gives no bytes), read with no
// exception pending, and returns VLX_S_OK. A text that UTF-8 cannot carry (an unpaired surrogate)
// or whose form passes INT_MAX bytes fails without calling use, with a last error naming
// operation and where. Short texts are converted on the stack.
template <class Use>
long WithUtf8(JNIEnv* env, jstring text, const char* operation, Use use)
{
  const jsize count = text == nullptr ? 0 : env->GetStringLength(text);
  if (count <= 0) {
    use("", 0);
    return 0;
  }
  if (count <= 256) {
    jchar units[256];
    char bytes[3 * 256];
    env->GetStringRegion(text, 0, count, units);
    const long length = Utf16ToUtf8(units, count, bytes, false);
    if (length < 0) return RejectUnpairedSurrogate(operation, static_cast<jsize>(-1 - length), units[-1 - length]);
    use(bytes, static_cast<int>(length));
    return 0;
  }
  std::string bytes;
  const long rc = LongTextToUtf8(env, text, count, operation, false, bytes);
  if (rc < 0) return rc;
  use(bytes.data(), static_cast<int>(bytes.size()));
  return 0;
}

// The JVM's invocation functions, from the libjvm.so already in the process, else the first that
// loads of $JAVA_HOME/lib/server/libjvm.so, libjvm.so through the library's run path and the
// system's default JDK; loaded once. Without one, create is null and problem names the paths tried.
struct Jvm {
  jint(JNICALL* create)(JavaVM**, void**, void*) = nullptr;
  jint(JNICALL* created)(JavaVM**, jsize, jsize*) = nullptr;
  std::string path;
  std::string problem;
};
const Jvm& LoadJvm();

// The start-up configuration, exposed for tests.
// The directory of the bridge library ("" if it cannot be found).
std::string LibraryDirectory();
// The replica jar: the first of <libraryDirectory>/../share/corvexa/corvexa-replica.jar and
// <libraryDirectory>/corvexa-replica.jar that is a readable file, else "" and why neither is
// (the paths searched, those that exist but cannot be read).
struct ReplicaJarSearch {
  std::string found;
  std::string problem;
};
ReplicaJarSearch FindReplicaJar(const std::string& libraryDirectory);
// The class path for `classPathVariable` (VLXJBX_CLASSPATH, may be null) and the library
// directory: the variable's non-empty entries, then the replica jar when it is found.
std::string BuildClassPath(const char* classPathVariable, const std::string& libraryDirectory);
// The whitespace-separated words of `text` (may be null).
std::vector<std::string> SplitOptions(const char* text);
}  // namespace VLXJBXDetail

#endif
