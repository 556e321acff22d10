// VLXJBXJavaObject: a native object bound to at most one Java object through a global reference
// (the handle). The base of the proxies.
#ifndef VLXJBXJavaObject_h
#define VLXJBXJavaObject_h

#include "VLXBaseUnknown.h"

#include <jni.h>

class VLXJBXJavaObject : public VLXBaseUnknown {
 public:
  // No handle; exchangedWithJava 0.
  VLXJBXJavaObject();
  // Refers to the same Java object as `other` through a global reference of its own, so it stays
  // valid when `other` is destroyed. Copies exchangedWithJava. If no Java environment can be
  // obtained the copy has no handle (and the thread's last error says why).
  VLXJBXJavaObject(const VLXJBXJavaObject& other);
  // Like the copy constructor; the reference held before is released. Self-assignment changes nothing.
  // From an object of another dynamic type, `other`'s Java object must pass AcceptObject; if it
  // does not, this object keeps its handle (the thread's last error says why).
  VLXJBXJavaObject& operator=(const VLXJBXJavaObject& other);
  // Releases the handle.
  ~VLXJBXJavaObject() override;

  // Replaces the handle by a new global reference to `object` (which may be a local, global or weak
  // reference) and releases the one held before. A null `object` releases the held reference and
  // leaves the handle null. A null `env` means the calling thread's environment. A non-null `object`
  // must pass AcceptObject. On failure the handle is unchanged and the result negative.
  long SetGlobalRef(JNIEnv* env, jobject object);
  // The handle (a global reference owned by this object), or null.
  jobject GetGlobalRef() const { return _handle; }

  // Equal when both handles refer to the same Java object (JNI IsSameObject); two null handles are
  // equal, a null and a non-null one are not.
  int operator==(const VLXJBXJavaObject& other) const;
  int operator!=(const VLXJBXJavaObject& other) const { return !(*this == other); }

  // Set by the proxies when their Java object was handed to or received from Java code.
  unsigned char exchangedWithJava;

 protected:
  // Decides whether this object may hold `object` (not null; no Java exception pending). A derived
  // class bound to one Java class answers a negative code, with a last error naming the expected
  // and the actual class, for an object of any other. This one accepts every object.
  virtual long AcceptObject(JNIEnv* env, jobject object);
  // SetGlobalRef without AcceptObject, for an object whose Java class the caller has established;
  // `env` must not be null.
  long ReplaceGlobalRef(JNIEnv* env, jobject object);

  jobject _handle;
};

#endif
