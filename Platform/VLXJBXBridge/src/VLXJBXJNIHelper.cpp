#include "VLXJBXJNIHelper.h"

#include "VLXJBXInternal.h"

jobject VLXJBXJNIHelper::NewGlobalRef(JNIEnv* env, jobject obj)
{
  jobject ref = env->NewGlobalRef(obj);
  if (ref != nullptr) VLXJBXDetail::CountGlobalRefs(1);
  return ref;
}

void VLXJBXJNIHelper::DeleteGlobalRef(JNIEnv* env, jobject ref)
{
  if (ref == nullptr) return;
  env->DeleteGlobalRef(ref);
  VLXJBXDetail::CountGlobalRefs(-1);
}
