// VLXJBXLocalRef: the owner of one JNI local reference, which it deletes when it is destroyed or
// reset, on every path. Movable, not copyable. The one owner of local references in the bridge and
// in the code built on it.
#ifndef VLXJBXLocalRef_h
#define VLXJBXLocalRef_h

#include <jni.h>

class VLXJBXLocalRef {
 public:
  VLXJBXLocalRef() = default;
  // Takes over `ref` (may be null), a local reference made on `env`.
  VLXJBXLocalRef(JNIEnv* env, jobject ref) : _env(env), _ref(ref) {}
  ~VLXJBXLocalRef() { reset(); }
  VLXJBXLocalRef(const VLXJBXLocalRef&) = delete;
  VLXJBXLocalRef& operator=(const VLXJBXLocalRef&) = delete;
  VLXJBXLocalRef(VLXJBXLocalRef&& other) noexcept : _env(other._env), _ref(other.release()) {}
  VLXJBXLocalRef& operator=(VLXJBXLocalRef&& other) noexcept
  {
    if (this != &other) {
      reset();
      _env = other._env;
      _ref = other.release();
    }
    return *this;
  }

  jobject get() const { return _ref; }
  // Hands the reference over to the caller, who then owns it.
  jobject release()
  {
    jobject ref = _ref;
    _ref = nullptr;
    return ref;
  }
  // Deletes the reference now (deleting is allowed with a Java exception pending).
  void reset()
  {
    if (_ref != nullptr) _env->DeleteLocalRef(_ref);
    _ref = nullptr;
  }

 private:
  JNIEnv* _env = nullptr;
  jobject _ref = nullptr;
};

#endif
