// The special members of a proxy class: the base's, and the check of the Java class it attaches to.
#pragma once

#define VLXKDM_PROXY_DEFINITIONS(Class, JavaClass)                                                  \
  Class::Class() = default;                                                                         \
  Class::Class(const Class& other) = default;                                                       \
  Class& Class::operator=(const Class& other) = default;                                            \
  Class::~Class() = default;                                                                        \
  long Class::AcceptObject(JNIEnv* env, jobject object)                                             \
  {                                                                                                 \
    return CheckJavaClass(env, object, corvexa::JavaClass, #Class "::SetHandle(JNIEnv*, jobject)"); \
  }
