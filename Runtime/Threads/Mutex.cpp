#include "Runtime/Threads/Mutex.h"

void Mutex::Lock()
{
    m_Mutex.Lock();
}

void Mutex::Unlock()
{
    m_Mutex.Unlock();
}

bool Mutex::TryLock()
{
    return m_Mutex.TryLock();
}

bool Mutex::IsLocked()
{
    if (!m_Mutex.TryLock())
        return true;
    m_Mutex.Unlock();
    return false;
}

void Mutex::BlockUntilUnlocked()
{
    m_Mutex.Lock();
    m_Mutex.Unlock();
}
