#pragma once
// A recursive mutex: the holding thread may take it again.

#include "Runtime/Threads/Posix/PlatformMutex.h"

class Mutex
{
public:
    Mutex() = default;
    Mutex(const Mutex&) = delete;
    Mutex& operator=(const Mutex&) = delete;

    void Lock();
    void Unlock();
    bool TryLock();  // true when taken
    // Tries to take it: locked if that fails, else releases it again. A mutex held by the
    // calling thread therefore answers false.
    bool IsLocked();
    void BlockUntilUnlocked();  // takes and releases it

    class AutoLock
    {
    public:
        explicit AutoLock(Mutex& mutex) : m_Mutex(mutex) { m_Mutex.Lock(); }
        ~AutoLock() { m_Mutex.Unlock(); }
        AutoLock(const AutoLock&) = delete;
        AutoLock& operator=(const AutoLock&) = delete;

    private:
        Mutex& m_Mutex;
    };

private:
    PlatformMutex m_Mutex;
};
