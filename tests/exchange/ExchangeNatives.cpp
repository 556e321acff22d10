// Native methods of the Java class com.velmora.tessara.exchange.ExchangeNatives: Java code hands
// replicas to native code and takes them back through the replica proxy's exchange operations. The
// JVM here is the Java launcher's; the library must use it rather than create one.
#include <jni.h>

#include <string>

#include "VLXError.h"
#include "VLXKDMReplica.h"

namespace {

jstring LastErrorText(JNIEnv* env)
{
  std::string text;
  if (VLXError* error = VLXError::VLXGetLastError(VLX_E_FAIL, nullptr)) {
    text = error->GetMessageText().c_str();
    error->Release();
  }
  return env->NewStringUTF(text.c_str());
}

}  // namespace

extern "C" {

JNIEXPORT jobject JNICALL Java_com_velmora_tessara_exchange_ExchangeNatives_roundTrip(JNIEnv* env, jclass,
                                                                                      jobject replica)
{
  VLXKDMReplica proxy;
  if (proxy.BuildFromJavaType(env, replica) < 0) return nullptr;
  jobject out = nullptr;
  if (proxy.ConvertToJavaType(env, out) < 0) return nullptr;
  return out;
}

JNIEXPORT jobject JNICALL Java_com_velmora_tessara_exchange_ExchangeNatives_toHolder(JNIEnv* env, jclass,
                                                                                     jobject replica, jobject holder)
{
  VLXKDMReplica proxy;
  if (proxy.BuildFromJavaType(env, replica) < 0) return nullptr;
  jobject out = holder;
  if (proxy.ConvertToJavaHolder(env, out) < 0) return nullptr;
  return out;
}

JNIEXPORT jobject JNICALL Java_com_velmora_tessara_exchange_ExchangeNatives_fromHolder(JNIEnv* env, jclass,
                                                                                       jobject holder)
{
  VLXKDMReplica proxy;
  if (proxy.BuildFromJavaHolder(env, holder) < 0) return nullptr;
  jobject out = nullptr;
  if (proxy.ConvertToJavaType(env, out) < 0) return nullptr;
  return out;
}

// Renames the replica through the ordinary call frame, on the calling Java thread, and reads the
// name back.
JNIEXPORT jstring JNICALL Java_com_velmora_tessara_exchange_ExchangeNatives_renameThroughNative(JNIEnv* env, jclass,
                                                                                                jobject replica,
                                                                                                jstring name)
{
  VLXKDMReplica proxy;
  if (proxy.BuildFromJavaType(env, replica) < 0) return nullptr;
  const char* utf = env->GetStringUTFChars(name, nullptr);
  const VLXUnicodeString newName(utf);
  env->ReleaseStringUTFChars(name, utf);
  VLXUnicodeString back;
  if (proxy.SetName(newName) < 0 || proxy.GetName(back) < 0) return nullptr;
  return env->NewStringUTF(back.c_str());
}

// True when an unbuilt proxy hands out null, succeeds, and records the exchange.
JNIEXPORT jboolean JNICALL Java_com_velmora_tessara_exchange_ExchangeNatives_unbuiltGivesNull(JNIEnv* env, jclass)
{
  VLXKDMReplica proxy;
  jobject out = reinterpret_cast<jobject>(&proxy);  // anything but null
  const long rc = proxy.ConvertToJavaType(env, out);
  return rc >= 0 && out == nullptr && proxy.exchangedWithJava == 1;
}

JNIEXPORT jstring JNICALL Java_com_velmora_tessara_exchange_ExchangeNatives_lastError(JNIEnv* env, jclass)
{
  return LastErrorText(env);
}

}  // extern "C"
