#include "Runtime/Testing/Testing.h"

#include "Runtime/Logging/LogCapture.h"

#include "Runtime/Threads/Mutex.h"
#include "Runtime/Threads/Thread.h"

namespace
{
    struct IsLockedProbe
    {
        Mutex* mutex;
        bool answer;
    };

    void* AskIsLocked(void* data)
    {
        IsLockedProbe* probe = static_cast<IsLockedProbe*>(data);
        probe->answer = probe->mutex->IsLocked();
        return nullptr;
    }

    void* WaitForQuit(void* data)
    {
        Thread* self = static_cast<Thread*>(data);
        while (!self->IsQuitSignaled())
            Thread::Sleep(0.001);
        return nullptr;
    }

    void* JoinItself(void* data)
    {
        static_cast<Thread*>(data)->WaitForExit(false);
        return nullptr;
    }

    bool RunAndJoin(Thread::EntryPoint entry, void* data)
    {
        Thread thread;
        thread.Run(entry, data);
        thread.WaitForExit(false);
        return !thread.IsRunning();
    }
}

UNIT_TEST_SUITE(Threads)
{
    TEST(Mutex_IsRecursive_IsLockedFalseForHolder_TrueForOthers)
    {
        Mutex mutex;
        CHECK(!mutex.IsLocked());
        mutex.Lock();
        CHECK(mutex.TryLock());  // the holder may take it again
        mutex.Unlock();
        CHECK(!mutex.IsLocked());

        IsLockedProbe probe{&mutex, false};
        CHECK(RunAndJoin(AskIsLocked, &probe));
        CHECK(probe.answer);
        mutex.Unlock();

        probe.answer = true;
        CHECK(RunAndJoin(AskIsLocked, &probe));
        CHECK(!probe.answer);
    }

    TEST(Mutex_TakenTwice_StaysLockedForOthersUntilBothUnlocks)
    {
        Mutex mutex;
        mutex.Lock();
        mutex.Lock();
        mutex.Unlock();
        IsLockedProbe probe{&mutex, false};
        CHECK(RunAndJoin(AskIsLocked, &probe));
        CHECK(probe.answer);
        mutex.Unlock();
        CHECK(RunAndJoin(AskIsLocked, &probe));
        CHECK(!probe.answer);
    }

    TEST(Thread_RunsEntryPoint_AndQuitsWhenSignalled)
    {
        Thread thread;
        thread.SetName("waiter");
        thread.Run(WaitForQuit, &thread, 256 * 1024);
        CHECK(thread.IsRunning());
        CHECK(!thread.IsQuitSignaled());
        thread.WaitForExit(true);
        CHECK(!thread.IsRunning());
        CHECK(thread.IsQuitSignaled());
    }

    TEST(Thread_JoiningItself_LogsTheError_AndIsStillJoinedFromOutside)
    {
        Thread thread;
        thread.SetName("selfish");
        LogCapture::Result log = LogCapture::Capture([&] {
            thread.Run(JoinItself, &thread);
            thread.WaitForExit(false);
        });
        CHECK(!thread.IsRunning());
        CHECK_EQUAL(1u, log.console.size());
        CHECK_EQUAL("***Thread 'selfish' tried to join itself!*** "
                    "(Filename: Runtime/Threads/Posix/PlatformThread.cpp Line: 128)\n",
                    log.console.empty() ? std::string() : log.console.at(0).text);
        CHECK_EQUAL(kLogTypeError, log.console.empty() ? kLogTypeLog : log.console.at(0).type);
    }

    TEST(MainThreadId_IsThisThread)
    {
        CHECK(Thread::CurrentThreadIsMainThread());
        CHECK(pthread_equal(Thread::GetCurrentThreadID(), pthread_self()));
    }
}
