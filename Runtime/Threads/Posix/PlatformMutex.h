#pragma once
// One POSIX mutex of the recursive type.

#include <pthread.h>

class PlatformMutex
{
public:
    PlatformMutex();
    ~PlatformMutex();
    PlatformMutex(const PlatformMutex&) = delete;
    PlatformMutex& operator=(const PlatformMutex&) = delete;

    void Lock();
    void Unlock();
    bool TryLock();  // true when taken

private:
    pthread_mutex_t m_Mutex;
};
