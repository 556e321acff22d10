// Shared helpers of the bridge tests. The JVM is created by the test environment in BridgeMain.cpp.
#ifndef BridgeSupport_h
#define BridgeSupport_h

#include "VLXError.h"
#include "VLXJBXJNIUtilities.h"
#include "VLXResult.h"

#include <gtest/gtest.h>
#include <jni.h>

#include <string>
#include <vector>

// The calling thread's last error, read and cleaned.
struct ErrorView
{
  bool present = false;
  std::string id;
  std::vector<std::string> parameters;
  std::string text;
};

inline std::string Str(const VLXUnicodeString& s)
{
  return std::string(s.c_str(), static_cast<size_t>(s.GetLengthInByte()));
}

inline ErrorView TakeLastError()
{
  ErrorView view;
  VLXError* e = VLXError::VLXGetLastError(0, nullptr);
  if (e == nullptr)
    return view;
  view.present = true;
  view.id = e->GetId();
  for (int i = 1; i <= e->GetNLSParameterCount(); ++i)
    view.parameters.push_back(Str(e->GetNLSParameter(i)));
  view.text = Str(e->GetMessageText());
  e->Release();
  VLXError::VLXCleanLastError();
  return view;
}

inline JNIEnv* ThreadEnv()
{
  JNIEnv* env = nullptr;
  VLXJBXJNIUtilities::GetJNIEnv(env, VLXListValVLXUnicodeString());
  return env;
}

// The UTF-16 units of a Java string, read without the converters under test.
inline std::u16string Units(JNIEnv* env, jstring s)
{
  const jsize n = env->GetStringLength(s);
  std::u16string units(static_cast<size_t>(n), u'\0');
  env->GetStringRegion(s, 0, n, reinterpret_cast<jchar*>(&units[0]));
  return units;
}

inline jstring JavaString(JNIEnv* env, const std::u16string& units)
{
  return env->NewString(reinterpret_cast<const jchar*>(units.data()), static_cast<jsize>(units.size()));
}

// System.getProperty(name) as UTF-16.
inline std::u16string SystemProperty(JNIEnv* env, const char* name)
{
  env->PushLocalFrame(8);
  jclass system = env->FindClass("java/lang/System");
  jmethodID get = env->GetStaticMethodID(system, "getProperty", "(Ljava/lang/String;)Ljava/lang/String;");
  jstring key = env->NewStringUTF(name); // ASCII only: modified UTF-8 is the same
  jstring value = static_cast<jstring>(env->CallStaticObjectMethod(system, get, key));
  std::u16string result;
  if (env->ExceptionCheck())
    env->ExceptionClear();
  else if (value != nullptr)
    result = Units(env, value);
  env->PopLocalFrame(nullptr);
  return result;
}

inline std::string Ascii(const std::u16string& s)
{
  std::string out;
  for (char16_t c : s)
    out += c < 0x80 ? static_cast<char>(c) : '?';
  return out;
}

// Every test runs in a local frame of its own and must leave no exception pending.
class BridgeTest : public ::testing::Test
{
protected:
  JNIEnv* env = nullptr;

  void SetUp() override
  {
    VLXError::VLXCleanLastError();
    ASSERT_EQ(VLXJBXJNIUtilities::GetJNIEnv(env, VLXListValVLXUnicodeString()), VLX_S_OK);
    ASSERT_NE(env, nullptr);
    ASSERT_EQ(env->PushLocalFrame(32), JNI_OK);
  }

  void TearDown() override
  {
    if (env != nullptr) {
      EXPECT_FALSE(env->ExceptionCheck()) << "the test left a Java exception pending";
      if (env->ExceptionCheck())
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
