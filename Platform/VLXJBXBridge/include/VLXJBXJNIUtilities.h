// VLXJBXJNIUtilities: the calling thread's Java environment, class and member lookup, and the
// translation of Java exceptions into result codes and last errors.
//
// Every operation returns a result code (VLXResult.h): VLX_S_OK, or a negative code with a last
// error (a VLXJBXException, see VLXJBXException.h) recorded for the calling thread.
#ifndef VLXJBXJNIUtilities_h
#define VLXJBXJNIUtilities_h

#include "VLXListValVLXUnicodeString.h"
#include "VLXUnicodeString.h"
#include "VLXResult.h"

#include <jni.h>

class VLXError;

class VLXJBXJNIUtilities {
 public:
  // Writes the calling thread's JNIEnv into `env`.
  //
  // The first call of the process uses the JVM the process already has, or creates one. The class
  // path of a created JVM: the entries of the environment variable VLXJBX_CLASSPATH (separated by
  // ':'), then corvexa-replica.jar found next to this library (<libdir>/../share/corvexa/, else
  // <libdir>/). Its options: the whitespace-separated words of VLXJBX_JVM_OPTIONS, then the entries
  // of `options`; an unrecognised option makes creation fail. `options` is used only by the call
  // that creates the JVM. A JVM can be created once per process: after a failed creation every
  // call fails at once with the same last error.
  //
  // A native thread that is not attached is attached as a daemon thread named
  // "VLXJBX-attached-<n>" and detached automatically when it exits, as is the thread that created
  // the JVM (unless it is the process's main thread). Threads attached by someone else are never
  // detached by the bridge. An application that detaches a thread the bridge attached may do so:
  // the thread's next call attaches it again.
  //
  // After the first call on a thread the environment comes from a per-thread cache, confirmed with
  // the JVM's GetEnv (a few nanoseconds), without a lock.
  // On failure: `env` is null, the result negative, and the last error says why
  // (VLXJBXMessages::JvmCreationFailed or NoEnvironment).
  static long GetJNIEnv(JNIEnv*& env, VLXListValVLXUnicodeString options);

  // The process's JVM once GetJNIEnv has found or created it; null before.
  static JavaVM* GetJavaVM();

  // A new global reference to the class `classPath` ("java/lang/String") in `cls`. On failure
  // `cls` is left alone, the Java exception raised by the lookup is cleared and the last error
  // names the class (VLXJBXMessages::LookupFailed). Release the reference with
  // VLXJBXJNIHelper::DeleteGlobalRef.
  static long NewGlobalRefForClass(JNIEnv* env, const char* classPath, jclass& cls);

  // The identifier of a method, static method or static field of `cls` in `id`. On failure `id` is
  // left alone, the Java exception raised by the lookup is cleared and the last error names the
  // member, its signature and the class (VLXJBXMessages::LookupFailed).
  static long GetMethodID(JNIEnv* env, jclass cls, const char* name, const char* signature, jmethodID& id);
  static long GetStaticMethodID(JNIEnv* env, jclass cls, const char* name, const char* signature, jmethodID& id);
  static long GetStaticFieldID(JNIEnv* env, jclass cls, const char* name, const char* signature, jfieldID& id);

  // The Java name of the class of `object` (not null) in `name`, as Class.getName spells it
  // ("java.lang.Long"). No exception may be pending; one raised on the way is cleared. On failure
  // `name` is left alone and the result is negative.
  static long GetClassName(JNIEnv* env, jobject object, VLXUnicodeString& name);

  // Turns the state after a Java call into a result code.
  // - A Java exception is pending: it is cleared (printed to standard error first when `flag` is
  //   not 0) and recorded as the last error: `error` when not null, else a new
  //   VLXJBXMessages::JavaException error whose parameters are `context`, the exception's class
  //   name, its message and the class and message of its cause. Returns VLX_E_FAIL.
  // - None is pending, `code` >= 0: returns VLX_S_OK.
  // - None is pending, `code` < 0: records `error` when not null; otherwise keeps the error that the
  //   failure recorded since the operation started (VLXError::MarkOperationStart), or else records
  //   a VLXJBXMessages::OperationFailed error naming `context`. Returns VLX_E_FAIL.
  // A non-null `error` is taken over in every case (recorded, or released).
  static long HandleJavaError(JNIEnv* env, long code, const char* context, VLXError* error, int flag);

  // The number of global references currently held through the bridge: those of VLXJBXJavaObject,
  // NewGlobalRefForClass and VLXJBXJNIHelper::NewGlobalRef, minus those deleted through
  // VLXJBXJavaObject and VLXJBXJNIHelper::DeleteGlobalRef.
  static long GetGlobalRefCount();
};

#endif
