#include "VLXMutex.h"

#include "VLXFatalError.h"

VLXMutex::VLXMutex(int, int, int)
{
  pthread_mutexattr_t attributes;
  pthread_mutexattr_init(&attributes);
  pthread_mutexattr_settype(&attributes, PTHREAD_MUTEX_RECURSIVE);
  if (pthread_mutex_init(&_mutex, &attributes) != 0)
    VLXFatalError("AssertionFailed: pthread_mutex_init(&_mutex, &attributes) == 0", nullptr, nullptr, nullptr, __FILE__,
                  __LINE__);
  pthread_mutexattr_destroy(&attributes);
}

VLXMutex::~VLXMutex() { pthread_mutex_destroy(&_mutex); }

void VLXMutex::Lock()
{
  if (pthread_mutex_lock(&_mutex) != 0)
    VLXFatalError("AssertionFailed: pthread_mutex_lock(&_mutex) == 0", nullptr, nullptr, nullptr, __FILE__, __LINE__);
}

void VLXMutex::Unlock()
{
  if (pthread_mutex_unlock(&_mutex) != 0)
    VLXFatalError("AssertionFailed: pthread_mutex_unlock(&_mutex) == 0 (unlocked by a thread that does not hold it)",
                  nullptr, nullptr, nullptr, __FILE__, __LINE__);
}

int VLXMutex::TryLock() { return pthread_mutex_trylock(&_mutex) == 0 ? 1 : 0; }
