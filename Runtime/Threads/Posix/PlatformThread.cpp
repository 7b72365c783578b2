#include "Runtime/Threads/Posix/PlatformThread.h"

#include "Runtime/Logging/LogAssert.h"
#include "Runtime/Threads/Thread.h"

#include <cstdio>
#include <sched.h>

namespace
{
    // The scheduling priority a ThreadPriority maps to under `policy`.
    int PriorityFor(ThreadPriority priority, int policy, int defaultPriority)
    {
        const int minimum = sched_get_priority_min(policy);
        const int maximum = sched_get_priority_max(policy);
        switch (priority)
        {
            case kNormalPriority:
                return defaultPriority;
            case kBelowNormalPriority:
                return minimum + (defaultPriority - minimum) / 2;
            case kHighPriority:
            case kRealtimePriority:
                return maximum;
            default:
                return minimum;
        }
    }

    void LogThreadError(const char* message, int line)
    {
        DebugStringToFile(message, 0, "Runtime/Threads/Posix/PlatformThread.cpp", line, kError);
    }
}

PlatformThread::PlatformThread() : m_Thread(), m_DefaultPriority(0), m_Processor(-1), m_HasThread(false)
{
}

PlatformThread::~PlatformThread() = default;

bool PlatformThread::Create(const Thread* thread, StartRoutine routine, unsigned stackSize, int processor)
{
    m_Processor = processor;
    pthread_attr_t attributes;
    pthread_attr_t* attributesToUse = nullptr;
    if (stackSize != 0)
    {
        pthread_attr_init(&attributes);
        pthread_attr_setstacksize(&attributes, stackSize);
        attributesToUse = &attributes;
    }
    // Set before the thread exists: the new thread may ask IsCurrentThread (a self-join) before
    // pthread_create has returned here. The handle itself is stored before the thread starts.
    m_HasThread = true;
    const int error = pthread_create(&m_Thread, attributesToUse, routine, const_cast<Thread*>(thread));
    if (attributesToUse != nullptr)
        pthread_attr_destroy(&attributes);
    if (error != 0)
    {
        m_Thread = pthread_t();
        m_HasThread = false;
    }
    return m_HasThread;
}

void PlatformThread::Enter(const Thread*)
{
}

void PlatformThread::Exit(const Thread*, void* result)
{
    pthread_exit(result);
}

bool PlatformThread::IsCurrentThread() const
{
    return m_HasThread && pthread_equal(pthread_self(), m_Thread);
}

void PlatformThread::Join(const Thread* thread)
{
    if (!m_HasThread)
        return;
    if (IsCurrentThread())
    {
        char message[256];
        snprintf(message, sizeof(message), "***Thread '%s' tried to join itself!***",
                 thread->GetName() != nullptr ? thread->GetName() : "");
        LogThreadError(message, 128);
        return;
    }
    const int error = pthread_join(m_Thread, nullptr);
    if (error != 0)
    {
        char message[64];
        snprintf(message, sizeof(message), "Error joining threads: %d", error);
        LogThreadError(message, 135);
    }
    m_Thread = pthread_t();
    m_HasThread = false;
}

void PlatformThread::UpdatePriority(const Thread* thread) const
{
    if (!m_HasThread)
        return;
    int policy = 0;
    sched_param param{};
    if (pthread_getschedparam(m_Thread, &policy, &param) != 0)
        return;
    const int priority = PriorityFor(thread->GetPriority(), policy, m_DefaultPriority);
    if (priority != param.sched_priority)
    {
        param.sched_priority = priority;
        pthread_setschedparam(m_Thread, policy, &param);
    }
}
