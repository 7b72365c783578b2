#include "Runtime/Testing/Testing.h"

#include "Editor/Tools/Quillet/quillet_ImportsTestSupport.h"
#include "Runtime/Testing/ChildProcess.h"

#include <stdlib.h>
#include <string.h>
#include <time.h>

#include <vector>

using namespace QuilletTest;

namespace
{
    struct SystemInfo
    {
        uint16_t wProcessorArchitecture, wReserved;
        uint32_t dwPageSize;
        void* lpMinimumApplicationAddress;
        void* lpMaximumApplicationAddress;
        uint64_t dwActiveProcessorMask;
        uint32_t dwNumberOfProcessors, dwProcessorType, dwAllocationGranularity;
        uint16_t wProcessorLevel, wProcessorRevision;
    };
    static_assert(sizeof(SystemInfo) == 48, "Windows layout");

    struct TwoDwords
    {
        uint32_t low;
        int32_t high;
    };

    // Start-up table entries that record the order they ran in; DLL code, so Windows x64 functions.
    std::vector<int> s_Calls;
    __attribute__((ms_abi)) void First() { s_Calls.push_back(1); }
    __attribute__((ms_abi)) void Second() { s_Calls.push_back(2); }
    __attribute__((ms_abi)) int ReturnsFive() { s_Calls.push_back(5); return 5; }
    __attribute__((ms_abi)) int ReturnsZero() { s_Calls.push_back(0); return 0; }
    __attribute__((ms_abi)) int ReturnsSeven() { s_Calls.push_back(7); return 7; }

    typedef int(__attribute__((ms_abi)) * IntFunction)();
    typedef void(__attribute__((ms_abi)) * VoidFunction)();

    int InittermE(std::vector<IntFunction> table)
    {
        s_Calls.clear();
        return Import<int, IntFunction*, IntFunction*>("_initterm_e")(table.data(), table.data() + table.size());
    }

    const char kEnvName[] = "QUILLET_IMPORTS_TEST_VALUE";
}

UNIT_TEST_SUITE(QuilletImportsSystem)
{
    TEST(Initterm_CallsTheNonNullEntriesInOrder)
    {
        auto initterm = Import<void, VoidFunction*, VoidFunction*>("_initterm");
        VoidFunction table[] = {&First, nullptr, &Second};
        s_Calls.clear();
        initterm(table, table + 3);
        CHECK(s_Calls == std::vector<int>({1, 2}));
        initterm(table + 3, table);  // begin not below end: nothing
        CHECK_EQUAL(2u, s_Calls.size());
    }

    TEST(InittermE_RunsToTheEndAndAnswersTheLastResult)
    {
        CHECK_EQUAL(0, InittermE({&ReturnsFive, nullptr, &ReturnsZero}));
        CHECK(s_Calls == std::vector<int>({5, 0}));
        CHECK_EQUAL(7, InittermE({&ReturnsZero, &ReturnsSeven}));
        CHECK_EQUAL(0, InittermE({}));
        CHECK_EQUAL(5, InittermE({&ReturnsFive, nullptr}));
    }

    TEST(StartupBookkeeping_FixedAnswers)
    {
        s_Calls.clear();
        IntFunction onExit = &ReturnsSeven;
        CHECK((Import<IntFunction, IntFunction, void*, void*>("__dllonexit")(onExit, nullptr, nullptr)) == onExit);
        CHECK(s_Calls.empty());  // registered nowhere, never called
        Import<void, int>("_lock")(8);
        Import<void, int>("_unlock")(8);
        CHECK((Import<void*, void*, void*, int, int, int>("_CRT_RTC_INIT")(nullptr, nullptr, 0, 1, 0)) == nullptr);
        CHECK((Import<void*, void*, void*, int, int, int>("_CRT_RTC_INITW")(nullptr, nullptr, 0, 1, 0)) == nullptr);
        CHECK_EQUAL(0, (Import<int, int>("_CrtSetCheckCount")(1)));
        CHECK_EQUAL(1, (Import<int, void*>("DisableThreadLibraryCalls")(nullptr)));
        CHECK_EQUAL(0x8001u, (Import<unsigned int, unsigned int, unsigned int>("_controlfp")(0x10000, 0x30000)));
        CHECK_EQUAL(0u, Import<unsigned int>("_clearfp")());
    }

    TEST(SystemQueries_FixedValues)
    {
        CHECK_EQUAL(0u, Import<uint32_t>("GetLastError")());
        CHECK_EQUAL(0x1DB10106u, Import<uint32_t>("GetVersion")());

        auto feature = Import<int, unsigned int>("IsProcessorFeaturePresent");
        for (unsigned int present : {3u, 6u, 7u, 10u})
            CHECK_EQUAL(1, feature(present));
        for (unsigned int absent : {0u, 2u, 8u, 11u, 17u, 0x80000003u})
            CHECK_EQUAL(0, feature(absent));
    }

    TEST(GetSystemInfo_DescribesOneX64ProcessorAndIgnoresNull)
    {
        auto getSystemInfo = Import<void, SystemInfo*>("GetSystemInfo");
        SystemInfo info;
        memset(&info, 0xCC, sizeof info);
        getSystemInfo(&info);
        CHECK_EQUAL(9, info.wProcessorArchitecture);
        CHECK_EQUAL(0, info.wReserved);
        CHECK_EQUAL(4096u, info.dwPageSize);
        CHECK(info.lpMinimumApplicationAddress == nullptr);
        CHECK(info.lpMaximumApplicationAddress == nullptr);
        CHECK_EQUAL(1u, info.dwActiveProcessorMask);
        CHECK_EQUAL(1u, info.dwNumberOfProcessors);
        CHECK_EQUAL(8664u, info.dwProcessorType);
        CHECK_EQUAL(4096u, info.dwAllocationGranularity);
        CHECK_EQUAL(0, info.wProcessorLevel);
        CHECK_EQUAL(0, info.wProcessorRevision);
        getSystemInfo(nullptr);
    }

    TEST(Clocks_AreHostProcessorTimeUnscaled)
    {
        uint32_t before = static_cast<uint32_t>(clock());
        uint32_t ticks = Import<uint32_t>("GetTickCount")();
        TwoDwords counter = {0xFFFFFFFF, -1};
        CHECK_EQUAL(1, (Import<int, TwoDwords*>("QueryPerformanceCounter")(&counter)));
        TwoDwords fileTime = {0xFFFFFFFF, -1};
        Import<void, TwoDwords*>("GetSystemTimeAsFileTime")(&fileTime);
        uint32_t after = static_cast<uint32_t>(clock());

        CHECK(before <= ticks && ticks <= after);
        CHECK(ticks <= counter.low && counter.low <= fileTime.low && fileTime.low <= after);
        CHECK_EQUAL(0, counter.high);
        CHECK_EQUAL(0, fileTime.high);
    }

    TEST(GetEnvironmentVariableA_TruncatesToTheBufferAndReturnsTheCopiedLength)
    {
        auto getVariable = Import<uint32_t, const char*, char*, unsigned int>("GetEnvironmentVariableA");
        setenv(kEnvName, "0123456789", 1);
        char small[8] = "zzzzzzz";
        CHECK_EQUAL(3u, getVariable(kEnvName, small, 4));
        CHECK_EQUAL("012", small);
        CHECK_EQUAL('z', small[4]);

        char large[32];
        CHECK_EQUAL(10u, getVariable(kEnvName, large, 0));  // size 0: no limit at all
        CHECK_EQUAL("0123456789", large);

        unsetenv(kEnvName);
        char untouched[4] = "abc";
        CHECK_EQUAL(0u, getVariable(kEnvName, untouched, 4));
        CHECK_EQUAL("abc", untouched);
        CHECK((Import<char*, const char*>("getenv")(kEnvName)) == nullptr);
    }

    TEST(GetFullPathNameA_ReturnsTheNameAsGivenOrTheSizeNeeded)
    {
        auto fullPath = Import<uint32_t, const char*, unsigned int, char*, char**>("GetFullPathNameA");
        char buffer[16] = "###############";
        char* filePart = buffer;
        CHECK_EQUAL(8u, fullPath("abc.obj", 7, buffer, &filePart));
        CHECK_EQUAL('#', buffer[0]);
        CHECK_EQUAL(7u, fullPath("abc.obj", 8, buffer, &filePart));
        CHECK_EQUAL("abc.obj", buffer);
        CHECK(filePart == buffer);
    }

    TEST(GetModuleFileNameA_IsFooWithABoundedCopy)
    {
        auto moduleFileName = Import<uint32_t, void*, char*, unsigned int>("GetModuleFileNameA");
        char path[260];
        memset(path, 0xCC, sizeof path);
        CHECK_EQUAL(3u, moduleFileName(reinterpret_cast<void*>(0x1234), path, sizeof path));
        CHECK_EQUAL("foo", path);
        bool restZero = true;
        for (size_t i = 3; i < sizeof path; ++i)
            restZero = restZero && path[i] == 0;
        CHECK(restZero);

        char tiny[4] = {'#', '#', '#', '#'};
        CHECK_EQUAL(3u, moduleFileName(nullptr, tiny, 2));
        CHECK_EQUAL('f', tiny[0]);
        CHECK_EQUAL('o', tiny[1]);
        CHECK_EQUAL('#', tiny[2]);  // no terminator below size 4
    }

    TEST(OutputDebugStringA_PrintsALineToStandardOutput)
    {
        Testing::ChildResult result = Testing::RunInChildProcess([] {
            Import<void, const char*>("OutputDebugStringA")("debug text");
            fflush(stdout);
        });
        CHECK_EQUAL("debug text\n", result.out);
    }
}
