// The base of every proxy of the library. A proxy holds one global reference to a Java object of
// the replica package (its handle) and forwards each operation to one method of that object.
//
// Every operation of a proxy returns a result code: VLX_S_OK (0) on success, a negative code on
// failure, with the failure described by the calling thread's last error (VLXError::VLXGetLastError).
// A failing operation leaves its out-parameters as they were.
#pragma once

#include <atomic>
#include <jni.h>

#include "CorvexaExport.h"
#include "VLXJBXJavaObject.h"
#include "VLXResult.h"

class ReplicaStubs;
class VLXMutex;
class VLXTime;
class VLXKDMInstance;
class VLXListValVLXTime;
class VLXListValVLXBinary;
class VLXListValVLXKDMInstance;
namespace corvexa {
class FrameAccess;
}

class CORVEXA_API VLXKDMJavaObject : public VLXJBXJavaObject {
 public:
  // A new proxy is not built: its handle is null.
  VLXKDMJavaObject();
  // A copy refers to the same Java object through a global reference of its own, so it stays
  // valid after the source is destroyed.
  VLXKDMJavaObject(const VLXKDMJavaObject& other);
  VLXKDMJavaObject& operator=(const VLXKDMJavaObject& other);
  // Releases the proxy's global reference.
  virtual ~VLXKDMJavaObject();

  // The handle: the global reference to the Java object, or null when the proxy is not built.
  // Starts nothing and reports nothing.
  jobject GetHandle() const;
  // Attaches the proxy to object through a new global reference of its own (null detaches it). The
  // caller keeps and releases its own reference to object. A proxy class accepts only objects of
  // its Java class: another fails with VLX_E_INVALIDARG, the handle unchanged.
  long SetHandle(JNIEnv* env, jobject object);

  // The error translation: turns the outcome of an operation into its result code and the thread's
  // last error. A pending Java exception is cleared and reported; a success status gives VLX_S_OK;
  // any other failure keeps the error that the failing operation itself recorded, or else raises
  // one naming methodName and the failure code. An error recorded by an earlier operation of the
  // thread is never raised again.
  static long HandleReplicaError(JNIEnv* env, long status, const char* methodName);

 protected:
  // Fills env with the calling thread's Java environment and, on the first call of the process,
  // starts the Java side: creates and fills the binding table.
  static long InitJava(JNIEnv*& env, const char* methodName);
  // InitJava, then fails unless this proxy is built.
  long InitJavaAndTestIsBuilt(JNIEnv*& env, const char* methodName);

  // The value converters: one attribute value between its native form and a Java object.
  //
  // They use the caller's env (the Java side must be started) and report through the error
  // translation under their own method name texts. On failure the output is left as it was, except
  // that the list builders keep the elements converted before the failure, and no local reference
  // is left behind; a pending Java exception is reported and cleared.
  //
  // BuildFromJavaType reads input, which must be of the Java form of output's type (a boxed
  // Boolean, Integer or Double, a Date, an Instance, or an array of Dates, byte arrays or
  // Instances); it never releases input. A null input fails for a boxed value or a date, detaches
  // an instance and empties a list. A list is emptied first; a null element of a date array is a
  // failure, a null byte array gives an empty buffer, a null instance an unattached proxy. A date
  // of m milliseconds gives the nearest whole second, halves rounded up: floor((m + 500) / 1000), so
  // every whole second crosses both ways unchanged.
  static long BuildFromJavaType(JNIEnv* env, jobject input, VLXBoolean& output);
  static long BuildFromJavaType(JNIEnv* env, jobject input, int& output);
  static long BuildFromJavaType(JNIEnv* env, jobject input, double& output);
  static long BuildFromJavaType(JNIEnv* env, jobject input, VLXTime& output);
  static long BuildFromJavaType(JNIEnv* env, jobject input, VLXKDMInstance& output);
  static long BuildFromJavaType(JNIEnv* env, jobject input, VLXListValVLXTime& output);
  static long BuildFromJavaType(JNIEnv* env, jobject input, VLXListValVLXBinary& output);
  static long BuildFromJavaType(JNIEnv* env, jobject input, VLXListValVLXKDMInstance& output);
  // ConvertToJavaType writes a new local reference into output, which the caller deletes, except
  // for a single instance: output is then the proxy's own global reference, which the caller must
  // neither delete nor keep beyond the proxy's life. An instance (or an element of a list of
  // instances) that is not attached to a Java object is a broken precondition, reported through
  // VLXFatalError; if the report returns, the conversion fails and makes no Java object. A time of
  // s seconds gives a Date of s * 1000 milliseconds (a time beyond a Date's range fails); any
  // non-zero boolean byte is true.
  static long ConvertToJavaType(JNIEnv* env, int input, jobject& output);
  static long ConvertToJavaType(JNIEnv* env, double input, jobject& output);
  static long ConvertToJavaType(JNIEnv* env, VLXBoolean input, jobject& output);
  static long ConvertToJavaType(JNIEnv* env, const VLXTime& input, jobject& output);
  static long ConvertToJavaType(JNIEnv* env, const VLXKDMInstance& input, jobject& output);
  static long ConvertToJavaType(JNIEnv* env, const VLXListValVLXTime& input, jobject& output);
  static long ConvertToJavaType(JNIEnv* env, const VLXListValVLXKDMInstance& input, jobject& output);
  static long ConvertToJavaType(JNIEnv* env, const VLXListValVLXBinary& input, jobject& output);

  // VLX_S_OK when object is of the Java class of binding-table slot javaClass (or a subclass);
  // otherwise VLX_E_INVALIDARG with a last error naming operation, the expected and the actual
  // class. Starts the Java side when no operation has yet. No Java exception may be pending.
  static long CheckJavaClass(JNIEnv* env, jobject object, int javaClass, const char* operation);

  // The binding table of the process: null until the Java side is first started.
  static std::atomic<ReplicaStubs*> _st;

 private:
  friend class corvexa::FrameAccess;

  static long StartJavaSide(JNIEnv* env);

  static std::atomic<int> _javaInitDone;
  static VLXMutex* _mutex;
};

// Returns 1. Marks the library; does nothing else.
extern "C" CORVEXA_API int VELMORA_QKA2_INTERNAL_Corvexa();

// The special members every proxy class has: those of the base, and the check that the proxy is
// attached only to a Java object of its own class (SetHandle, assignment through the base, or an
// exchange with Java fail with VLX_E_INVALIDARG for any other, naming both classes). A proxy class
// adds no data.
#define VLXKDM_PROXY_SPECIAL_MEMBERS(Class)                \
 public:                                                   \
  Class();                                                 \
  Class(const Class& other);                               \
  Class& operator=(const Class& other);                    \
  virtual ~Class();                                        \
                                                           \
 protected:                                                \
  long AcceptObject(JNIEnv* env, jobject object) override; \
                                                           \
 public:
