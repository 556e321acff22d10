// Helpers shared by the native test suites: the thread's Java environment, Java test doubles, and
// the thread's last error read as plain values.
#pragma once

#include <jni.h>

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "VLXError.h"
#include "VLXJBXJNIUtilities.h"
#include "VLXListValVLXUnicodeString.h"
#include "VLXResult.h"
#include "VLXUnicodeString.h"

namespace corvexa_test {

// The calling thread's environment (starts the JVM when needed).
inline JNIEnv* Env()
{
  JNIEnv* env = nullptr;
  VLXJBXJNIUtilities::GetJNIEnv(env, VLXListValVLXUnicodeString());
  return env;
}

// A new local reference to a Java object made by the class's no-argument constructor.
inline jobject NewJavaObject(const char* classPath)
{
  JNIEnv* env = Env();
  jclass cls = env->FindClass(classPath);
  if (!cls) {
    env->ExceptionDescribe();
    ADD_FAILURE() << "test class not found: " << classPath;
    return nullptr;
  }
  jmethodID ctor = env->GetMethodID(cls, "<init>", "()V");
  jobject object = env->NewObject(cls, ctor);
  env->DeleteLocalRef(cls);
  return object;
}

// Attaches proxy to a new Java object of the test double class.
template <class Proxy>
void AttachNew(Proxy& proxy, const char* classPath)
{
  JNIEnv* env = Env();
  jobject object = NewJavaObject(classPath);
  ASSERT_EQ(VLX_S_OK, proxy.SetHandle(env, object));
  env->DeleteLocalRef(object);
}

// Reads an int field of a Java object (for test doubles that count calls).
inline int IntField(jobject object, const char* field)
{
  if (!object) {
    ADD_FAILURE() << "no Java object to read " << field << " from";
    return -1;
  }
  JNIEnv* env = Env();
  jclass cls = env->GetObjectClass(object);
  const int value = env->GetIntField(object, env->GetFieldID(cls, field, "I"));
  env->DeleteLocalRef(cls);
  return value;
}

inline std::string Text(const VLXUnicodeString& s) { return std::string(s.c_str(), s.GetLengthInByte()); }

struct LastError {
  bool present = false;
  std::string id;
  std::vector<std::string> parameters;
  std::string text;
};

// The calling thread's last error, read without changing it.
inline LastError PeekLastError()
{
  LastError out;
  VLXError* error = VLXError::VLXGetLastError(VLX_E_FAIL, nullptr);
  if (!error) return out;
  out.present = true;
  out.id = error->GetId();
  for (int i = 1; i <= error->GetNLSParameterCount(); ++i) out.parameters.push_back(Text(error->GetNLSParameter(i)));
  out.text = Text(error->GetMessageText());
  error->Release();
  return out;
}

inline void ClearLastError() { VLXError::VLXCleanLastError(); }

}  // namespace corvexa_test

#include "VLXFatalError.h"

namespace corvexa_test {

// Records the fatal-error reports made while it lives, and lets the library go on.
class FatalRecorder {
 public:
  struct Report {
    std::string message;
    std::string file;
    int line;
  };
  FatalRecorder() : _previous(VLXSetFatalErrorHandler(&FatalRecorder::Record)) { Reports().clear(); }
  ~FatalRecorder() { VLXSetFatalErrorHandler(_previous); }
  FatalRecorder(const FatalRecorder&) = delete;
  FatalRecorder& operator=(const FatalRecorder&) = delete;

  static std::vector<Report>& Reports()
  {
    static std::vector<Report> reports;
    return reports;
  }

 private:
  static void Record(const char* message, const char* file, int line)
  {
    Reports().push_back(Report{message ? message : "", file ? file : "", line});
  }
  VLXFatalErrorHandler _previous;
};

}  // namespace corvexa_test
