#pragma once
// A thread object over POSIX threads. m_Running and m_ShouldQuit are plain flags written with
// full memory fences and read without locks.

#include "Runtime/Threads/Posix/PlatformThread.h"

#include <cstdint>
#include <pthread.h>

enum ThreadPriority
{
    kLowPriority = 0,
    kBelowNormalPriority = 1,
    kNormalPriority = 2,
    kHighPriority = 4,
    kRealtimePriority = 5
};

typedef pthread_t ThreadId;

class Thread
{
public:
    typedef void* (*EntryPoint)(void* userData);

    Thread();
    ~Thread();
    Thread(const Thread&) = delete;
    Thread& operator=(const Thread&) = delete;

    void Run(EntryPoint entryPoint, void* userData, uint32_t stackSize = 0, int processor = -1);
    void WaitForExit(bool signalQuit = true);
    void SignalQuit();
    bool IsRunning() const { return m_Running; }
    bool IsQuitSignaled() const { return m_ShouldQuit; }

    void SetName(const char* name) { m_Name = name; }
    const char* GetName() const { return m_Name; }
    void SetPriority(ThreadPriority priority);
    ThreadPriority GetPriority() const { return m_Priority; }

    static void Sleep(double seconds);
    static ThreadId GetCurrentThreadID();
    static bool CurrentThreadIsMainThread();
    static void SetCurrentThreadProcessor(int processor);
    double GetThreadRunningTime() const;  // seconds of CPU time of this thread, 0 if not running

    static ThreadId mainThreadId;

private:
    friend class PlatformThread;
    static void* RunThreadWrapper(void* thread);

    PlatformThread m_Thread;
    void* m_UserData;
    EntryPoint m_EntryPoint;
    volatile bool m_Running;
    volatile bool m_ShouldQuit;
    ThreadPriority m_Priority;
    uint32_t m_TempAllocSize;
    const char* m_Name;
};

namespace ThreadHelper
{
    void SleepInSeconds(double seconds);
    void SetThreadName(const Thread* thread);  // no effect on this platform
    void SetThreadProcessor(const Thread* thread, int processor);  // no effect on this platform
}
