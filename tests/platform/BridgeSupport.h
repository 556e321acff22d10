// Shared helpers of the bridge tests and (through TestSupport.h) of the library's suites.
#ifndef BridgeSupport_h
#define BridgeSupport_h

#include "VLXError.h"
#include "VLXJBXJNIUtilities.h"
#include "VLXResult.h"

#include <gtest/gtest.h>
#include <jni.h>

#include <string>
#include <vector>

inline std::string Text(const VLXUnicodeString& s) { return std::string(s.c_str(), size_t(s.GetLengthInByte())); }
inline bool Has(const std::string& text, const std::string& part) { return text.find(part) != std::string::npos; }

// The calling thread's last error, read as it is (Peek) or read and cleaned (Take).
struct LastError {
  bool present = false;
  std::string id, text;
  std::vector<std::string> parameters;
  std::string operation() const { return parameters.empty() ? std::string() : parameters[0]; }
};
inline LastError PeekLastError()
{
  LastError view;
  if (VLXError* e = VLXError::VLXGetLastError(0, nullptr)) {
    view = {true, e->GetId(), Text(e->GetMessageText()), {}};
    for (int i = 1; i <= e->GetNLSParameterCount(); ++i) view.parameters.push_back(Text(e->GetNLSParameter(i)));
    e->Release();
  }
  return view;
}
inline LastError TakeLastError()
{
  const LastError view = PeekLastError();
  VLXError::VLXCleanLastError();
  return view;
}

// The UTF-16 units of a Java string, and a Java string of UTF-16 units, without the converters.
inline std::u16string Units(JNIEnv* env, jstring s)
{
  std::u16string units(size_t(env->GetStringLength(s)), u'\0');
  env->GetStringRegion(s, 0, jsize(units.size()), reinterpret_cast<jchar*>(&units[0]));
  return units;
}
inline jstring JavaString(JNIEnv* env, const std::u16string& units)
{
  return env->NewString(reinterpret_cast<const jchar*>(units.data()), jsize(units.size()));
}

// A Java call's result, after the exception check -Xcheck:jni asks for.
template <class T>
T Checked(JNIEnv* env, T value)
{
  EXPECT_FALSE(env->ExceptionCheck());
  return value;
}

// Every test runs in a local frame of its own and must leave no exception pending.
class BridgeTest : public ::testing::Test {
 protected:
  JNIEnv* env = nullptr;
  void SetUp() override
  {
    VLXError::VLXCleanLastError();
    ASSERT_EQ(VLXJBXJNIUtilities::GetJNIEnv(env, VLXListValVLXUnicodeString()), VLX_S_OK);
    ASSERT_EQ(env->PushLocalFrame(32), JNI_OK);
  }
  void TearDown() override
  {
    if (env != nullptr) {
      EXPECT_FALSE(env->ExceptionCheck()) << "the test left a Java exception pending";
      env->ExceptionClear();
      env->PopLocalFrame(nullptr);
    }
    VLXError::VLXCleanLastError();
  }
  jclass Find(const char* name)
  {
    jclass c = env->FindClass(name);
    EXPECT_NE(c, nullptr) << name;
    return c;
  }
};

#endif
