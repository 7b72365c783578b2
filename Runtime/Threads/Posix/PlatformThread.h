#pragma once
// The POSIX side of Thread: one pthread handle plus its scheduling defaults.

#include <pthread.h>

class Thread;

class PlatformThread
{
public:
    PlatformThread();
    ~PlatformThread();

    typedef void* (*StartRoutine)(void* thread);

    // Creates the thread running `routine(thread)`; a stackSize of 0 keeps the default.
    bool Create(const Thread* thread, StartRoutine routine, unsigned stackSize, int processor);
    void Enter(const Thread* thread);  // called first on the new thread
    void Exit(const Thread* thread, void* result);
    void Join(const Thread* thread);   // logs self-joins and failed joins; clears the handle
    void UpdatePriority(const Thread* thread) const;
    bool IsCurrentThread() const;
    pthread_t GetHandle() const { return m_Thread; }

private:
    pthread_t m_Thread;
    int m_DefaultPriority;
    int m_Processor;
    bool m_HasThread;
};
