#include "Runtime/Threads/Thread.h"

#include <atomic>
#include <cerrno>
#include <ctime>

ThreadId Thread::mainThreadId = pthread_self();

namespace
{
    void FullFence()
    {
        std::atomic_thread_fence(std::memory_order_seq_cst);
    }
}

Thread::Thread()
    : m_UserData(nullptr), m_EntryPoint(nullptr), m_Running(false), m_ShouldQuit(false),
      m_Priority(kNormalPriority), m_TempAllocSize(65536), m_Name(nullptr)
{
}

// A thread object must not die under its running thread: it asks it to quit and joins it.
Thread::~Thread()
{
    WaitForExit(true);
}

void* Thread::RunThreadWrapper(void* object)
{
    Thread* thread = static_cast<Thread*>(object);
    thread->m_Thread.Enter(thread);
    ThreadHelper::SetThreadName(thread);
    void* result = thread->m_EntryPoint(thread->m_UserData);
    FullFence();
    thread->m_Running = false;
    FullFence();
    thread->m_Thread.Exit(thread, result);
    return result;
}

void Thread::Run(EntryPoint entryPoint, void* userData, uint32_t stackSize, int processor)
{
    m_ShouldQuit = false;
    m_EntryPoint = entryPoint;
    m_UserData = userData;
    m_Running = true;
    FullFence();
    if (!m_Thread.Create(this, RunThreadWrapper, stackSize, processor))
    {
        m_Running = false;
        return;
    }
    if (m_Priority != kNormalPriority)
        m_Thread.UpdatePriority(this);
}

void Thread::WaitForExit(bool signalQuit)
{
    if (m_Running && signalQuit)
        SignalQuit();
    m_Thread.Join(this);
    m_Running = false;
}

void Thread::SignalQuit()
{
    m_ShouldQuit = true;
    FullFence();
}

void Thread::SetPriority(ThreadPriority priority)
{
    if (m_Priority == priority)
        return;
    m_Priority = priority;
    m_Thread.UpdatePriority(this);
}

void Thread::Sleep(double seconds)
{
    ThreadHelper::SleepInSeconds(seconds);
}

ThreadId Thread::GetCurrentThreadID()
{
    return pthread_self();
}

bool Thread::CurrentThreadIsMainThread()
{
    return pthread_equal(pthread_self(), mainThreadId) != 0;
}

void Thread::SetCurrentThreadProcessor(int)
{
}

double Thread::GetThreadRunningTime() const
{
    if (!m_Running)
        return 0.0;
    clockid_t clock;
    timespec time{};
    if (pthread_getcpuclockid(m_Thread.GetHandle(), &clock) != 0 || clock_gettime(clock, &time) != 0)
        return 0.0;
    return static_cast<double>(time.tv_sec) + static_cast<double>(time.tv_nsec) * 1e-9;
}

namespace ThreadHelper
{
    void SleepInSeconds(double seconds)
    {
        if (!(seconds > 0.0))
            return;
        timespec request{};
        request.tv_sec = static_cast<time_t>(seconds);
        const long microseconds = static_cast<long>((seconds - static_cast<double>(request.tv_sec)) * 1000000.0);
        request.tv_nsec = microseconds * 1000;
        timespec remaining{};
        while (nanosleep(&request, &remaining) != 0 && errno == EINTR)
            request = remaining;
    }

    void SetThreadName(const Thread*)
    {
    }

    void SetThreadProcessor(const Thread*, int)
    {
    }
}
