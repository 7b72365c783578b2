#include "Runtime/Testing/Testing.h"

#include "Editor/Tools/Quillet/quillet_ImportsTestSupport.h"

#include <pthread.h>
#include <string.h>
#include <unistd.h>

#include <chrono>
#include <thread>

using namespace QuilletTest;

namespace
{
    // A Windows x64 critical section: 40 bytes that the DLL owns.
    struct alignas(8) CriticalSection
    {
        unsigned char bytes[40];
    };

    bool LockableFromAnotherThread(CriticalSection& cs)
    {
        bool locked = false;
        std::thread([&] {
            pthread_mutex_t* mutex = reinterpret_cast<pthread_mutex_t*>(cs.bytes);
            locked = pthread_mutex_trylock(mutex) == 0;
            if (locked)
                pthread_mutex_unlock(mutex);
        }).join();
        return locked;
    }

    struct CriticalSectionFunctions
    {
        WinFn<void, CriticalSection*> initialize = Import<void, CriticalSection*>("InitializeCriticalSection");
        WinFn<void, CriticalSection*, unsigned int> initializeWithSpin = Import<void, CriticalSection*, unsigned int>("InitializeCriticalSectionAndSpinCount");
        WinFn<void, CriticalSection*> enter = Import<void, CriticalSection*>("EnterCriticalSection");
        WinFn<void, CriticalSection*> leave = Import<void, CriticalSection*>("LeaveCriticalSection");
        WinFn<void, CriticalSection*> destroy = Import<void, CriticalSection*>("DeleteCriticalSection");
    };
}

UNIT_TEST_SUITE(QuilletImportsSync)
{
    TEST_FIXTURE(CriticalSectionFunctions, CriticalSection_IsRecursiveAndMustBeLeftAsOftenAsEntered)
    {
        for (bool withSpinCount : {false, true})
        {
            CriticalSection cs;
            memset(&cs, 0xCD, sizeof cs);  // the DLL's storage is not zeroed beforehand
            if (withSpinCount)
                initializeWithSpin(&cs, 4000);
            else
                initialize(&cs);
            enter(&cs);
            enter(&cs);  // the owner may enter again without blocking
            leave(&cs);
            CHECK(!LockableFromAnotherThread(cs));
            leave(&cs);
            CHECK(LockableFromAnotherThread(cs));
            destroy(&cs);
        }
    }

    TEST(Tls_SlotsArePerThreadValues)
    {
        auto tlsAlloc = Import<unsigned int>("TlsAlloc");
        auto tlsSet = Import<int, unsigned int, void*>("TlsSetValue");
        auto tlsGet = Import<void*, unsigned int>("TlsGetValue");
        auto tlsFree = Import<int, unsigned int>("TlsFree");

        unsigned int slot = tlsAlloc();
        CHECK(tlsGet(slot) == nullptr);
        int value = 0;
        CHECK_EQUAL(1, tlsSet(slot, &value));
        CHECK(tlsGet(slot) == &value);
        void* seenByOtherThread = &value;
        std::thread([&] { seenByOtherThread = tlsGet(slot); }).join();
        CHECK(seenByOtherThread == nullptr);
        CHECK_EQUAL(1, tlsFree(slot));
    }

    TEST(InterlockedExchange_StoresAndReturnsThePreviousValue)
    {
        auto exchange = Import<int, volatile int*, int>("InterlockedExchange");
        volatile int word = 5;
        CHECK_EQUAL(5, exchange(&word, -7));
        CHECK_EQUAL(-7, word);
    }

    TEST(InterlockedCompareExchange_ReturnsComparandOnSuccessAndTheReadValueOtherwise)
    {
        auto compareExchange = Import<int, volatile int*, int, int>("InterlockedCompareExchange");
        volatile int word = 10;
        CHECK_EQUAL(10, compareExchange(&word, 20, 10));
        CHECK_EQUAL(20, word);
        CHECK_EQUAL(20, compareExchange(&word, 30, 99));
        CHECK_EQUAL(20, word);
    }

    TEST(PointerEncoding_SleepAndIdentity)
    {
        int object = 0;
        CHECK((Import<void*, void*>("EncodePointer")(&object)) == &object);
        CHECK((Import<void*, void*>("DecodePointer")(&object)) == &object);

        // Sleep returns at once, however long it is asked to wait.
        auto start = std::chrono::steady_clock::now();
        Import<void, unsigned int>("Sleep")(60000);
        CHECK(std::chrono::steady_clock::now() - start < std::chrono::seconds(30));

        CHECK_EQUAL(static_cast<uint32_t>(pthread_self()), Import<uint32_t>("GetCurrentThreadId")());
        CHECK_EQUAL(static_cast<uint32_t>(getpid()), Import<uint32_t>("GetCurrentProcessId")());
    }
}
