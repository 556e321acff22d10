// VLXMutex: a recursive mutex. The thread that holds it may lock it again; it is free once the
// holder has called Unlock as many times as Lock.
#ifndef VLXMutex_h
#define VLXMutex_h

#include <pthread.h>

class VLXMutex {
 public:
  // The three integers are accepted for compatibility and not used: every VLXMutex is a
  // process-private recursive mutex.
  VLXMutex(int = 0, int = 0, int = 0);
  ~VLXMutex();
  VLXMutex(const VLXMutex&) = delete;
  VLXMutex& operator=(const VLXMutex&) = delete;

  void Lock();
  void Unlock();
  // Takes the mutex when it is free or held by the calling thread and returns 1; else returns 0 at once.
  int TryLock();

 private:
  pthread_mutex_t _mutex;
};

#endif
