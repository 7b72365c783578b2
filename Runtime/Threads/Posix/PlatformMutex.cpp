#include "Runtime/Threads/Posix/PlatformMutex.h"

PlatformMutex::PlatformMutex()
{
    pthread_mutexattr_t attributes;
    pthread_mutexattr_init(&attributes);
    pthread_mutexattr_settype(&attributes, PTHREAD_MUTEX_RECURSIVE);
    pthread_mutex_init(&m_Mutex, &attributes);
    pthread_mutexattr_destroy(&attributes);
}

PlatformMutex::~PlatformMutex()
{
    pthread_mutex_destroy(&m_Mutex);
}

void PlatformMutex::Lock()
{
    pthread_mutex_lock(&m_Mutex);
}

void PlatformMutex::Unlock()
{
    pthread_mutex_unlock(&m_Mutex);
}

bool PlatformMutex::TryLock()
{
    return pthread_mutex_trylock(&m_Mutex) == 0;
}
