// Critical sections, thread-local slots, interlocked operations, pointer encoding and identity.
#include "ImportsFixture.h"

namespace
{
    int CheckCriticalSections()
    {
        CRITICAL_SECTION cs;
        Fixture::Fill(&cs, 0xEE, sizeof cs);
        InitializeCriticalSection(&cs);
        EnterCriticalSection(&cs);
        EnterCriticalSection(&cs);  // recursive: the owner enters again
        LeaveCriticalSection(&cs);
        LeaveCriticalSection(&cs);
        DeleteCriticalSection(&cs);

        CRITICAL_SECTION spinning;
        InitializeCriticalSectionAndSpinCount(&spinning, 4000);
        EnterCriticalSection(&spinning);
        LeaveCriticalSection(&spinning);
        DeleteCriticalSection(&spinning);
        return 0;
    }

    int CheckTls()
    {
        DWORD slot = TlsAlloc();
        FIXTURE_CHECK(TlsGetValue(slot) == nullptr);
        int value = 0;
        FIXTURE_CHECK(TlsSetValue(slot, &value) == 1);
        FIXTURE_CHECK(TlsGetValue(slot) == &value);
        FIXTURE_CHECK(TlsFree(slot) == 1);
        return 0;
    }

    int CheckInterlocked()
    {
        volatile LONG word = 3;
        FIXTURE_CHECK(InterlockedExchange(&word, 9) == 3 && word == 9);
        FIXTURE_CHECK(InterlockedCompareExchange(&word, 11, 9) == 9 && word == 11);
        FIXTURE_CHECK(InterlockedCompareExchange(&word, 20, 9) == 11 && word == 11);
        return 0;
    }

    int CheckIdentity()
    {
        int object = 0;
        FIXTURE_CHECK(EncodePointer(&object) == &object);
        FIXTURE_CHECK(DecodePointer(&object) == &object);
        Sleep(1000000);  // returns at once
        // The exact host values are checked on the host side; here only that they are real ids.
        FIXTURE_CHECK(GetCurrentProcessId() != 0);
        FIXTURE_CHECK(GetCurrentThreadId() != 0);
        return 0;
    }
}

FIXTURE_EXPORT int ImportsFixture_TestSync()
{
    if (int line = CheckCriticalSections())
        return line;
    if (int line = CheckTls())
        return line;
    if (int line = CheckInterlocked())
        return line;
    return CheckIdentity();
}
