// Start-up support, system queries, clocks, environment, files, registry and modules. The host
// test sets IMPORTS_FIXTURE_VALUE=0123456789 before calling this area.
#include "ImportsFixture.h"

namespace
{
    int s_Order[4];
    int s_Calls;
    void RecordOne() { s_Order[s_Calls++] = 1; }
    void RecordTwo() { s_Order[s_Calls++] = 2; }
    int ReturnFive() { s_Order[s_Calls++] = 5; return 5; }
    int ReturnZero() { s_Order[s_Calls++] = 0; return 0; }

    int CheckStartup()
    {
        _PVFV constructors[] = {&RecordOne, nullptr, &RecordTwo};
        s_Calls = 0;
        _initterm(constructors, constructors + 3);
        FIXTURE_CHECK(s_Calls == 2 && s_Order[0] == 1 && s_Order[1] == 2);

        _PIFV initialisers[] = {&ReturnFive, nullptr, &ReturnZero};
        s_Calls = 0;
        FIXTURE_CHECK(_initterm_e(initialisers, initialisers + 3) == 0 && s_Calls == 2);
        FIXTURE_CHECK(_initterm_e(initialisers, initialisers) == 0);

        FIXTURE_CHECK(__dllonexit(&ReturnFive, nullptr, nullptr) == &ReturnFive);
        _lock(8);
        _unlock(8);
        FIXTURE_CHECK(_CRT_RTC_INIT(nullptr, nullptr, 0, 1, 0) == nullptr);
        FIXTURE_CHECK(_CRT_RTC_INITW(nullptr, nullptr, 0, 1, 0) == nullptr);
        FIXTURE_CHECK(_CrtSetCheckCount(1) == 0);
        FIXTURE_CHECK(DisableThreadLibraryCalls(nullptr) == 1);
        return 0;
    }

    int CheckSystemQueries()
    {
        FIXTURE_CHECK(GetLastError() == 0);
        FIXTURE_CHECK(GetVersion() == 0x1DB10106);
        SYSTEM_INFO info;
        Fixture::Fill(&info, 0xCC, sizeof info);
        GetSystemInfo(&info);
        FIXTURE_CHECK(info.u.s.wProcessorArchitecture == 9 && info.u.s.wReserved == 0);
        FIXTURE_CHECK(info.dwPageSize == 4096 && info.dwAllocationGranularity == 4096);
        FIXTURE_CHECK(info.lpMinimumApplicationAddress == nullptr && info.lpMaximumApplicationAddress == nullptr);
        FIXTURE_CHECK(info.dwActiveProcessorMask == 1 && info.dwNumberOfProcessors == 1);
        FIXTURE_CHECK(info.dwProcessorType == 8664 && info.wProcessorLevel == 0 && info.wProcessorRevision == 0);
        GetSystemInfo(nullptr);
        FIXTURE_CHECK(IsProcessorFeaturePresent(10) == 1 && IsProcessorFeaturePresent(7) == 1);
        FIXTURE_CHECK(IsProcessorFeaturePresent(8) == 0);
        FIXTURE_CHECK(_controlfp(0x10000, 0x30000) == 0x8001 && _clearfp() == 0);
        return 0;
    }

    int CheckClocks()
    {
        DWORD ticks = GetTickCount();
        LARGE_INTEGER counter = {0xFFFFFFFF, -1};
        FIXTURE_CHECK(QueryPerformanceCounter(&counter) == 1);
        FILETIME time = {0xFFFFFFFF, 0xFFFFFFFF};
        GetSystemTimeAsFileTime(&time);
        FIXTURE_CHECK(counter.HighPart == 0 && time.dwHighDateTime == 0);
        FIXTURE_CHECK(ticks <= counter.LowPart && counter.LowPart <= time.dwLowDateTime);
        return 0;
    }

    int CheckEnvironment()
    {
        char small[8] = "zzzzzzz";
        FIXTURE_CHECK(GetEnvironmentVariableA("IMPORTS_FIXTURE_VALUE", small, 4) == 3);
        FIXTURE_CHECK(Fixture::SameText(small, "012") && small[4] == 'z');
        FIXTURE_CHECK(GetEnvironmentVariableA("IMPORTS_FIXTURE_MISSING", small, 4) == 0);
        const char* value = getenv("IMPORTS_FIXTURE_VALUE");
        FIXTURE_CHECK(value != nullptr && Fixture::SameText(value, "0123456789"));
        return 0;
    }

    int CheckFilesAndModules()
    {
        char path[16];
        char* filePart = nullptr;
        FIXTURE_CHECK(GetFullPathNameA("abc.obj", 7, path, &filePart) == 8);
        FIXTURE_CHECK(GetFullPathNameA("abc.obj", 8, path, &filePart) == 7 && Fixture::SameText(path, "abc.obj"));
        FIXTURE_CHECK(filePart == nullptr);
        FIXTURE_CHECK(GetModuleFileNameA(nullptr, path, sizeof path) == 3 && Fixture::SameText(path, "foo") && path[15] == 0);

        HANDLE file = CreateFileA("C:\\mesh.obj", 0x80000000, 1, nullptr, 3, 0x80, nullptr);
        FIXTURE_CHECK(file == (HANDLE)~uintptr_t(0));
        DWORD high = 77;
        FIXTURE_CHECK(GetFileSize(file, &high) == 0 && high == 77);
        FIXTURE_CHECK(CloseHandle(file) == 1);
        OutputDebugStringA("ImportsFixture: debug line");

        FIXTURE_CHECK(GetModuleHandleA(nullptr) == nullptr && LoadLibraryA("user32.dll") == nullptr);
        FIXTURE_CHECK(GetProcAddress(nullptr, "Sleep") == nullptr);
        return 0;
    }

    int CheckRegistry()
    {
        HKEY key = (HKEY)0x55;
        DWORD size = 99;
        FIXTURE_CHECK(RegOpenKeyExA(nullptr, "Software", 0, 1, &key) == 87 && key == (HKEY)0x55);
        FIXTURE_CHECK(RegEnumKeyExA(key, 0, nullptr, &size, nullptr, nullptr, &size, nullptr) == 87);
        FIXTURE_CHECK(RegQueryValueExA(key, "v", nullptr, &size, nullptr, &size) == 87 && size == 99);
        FIXTURE_CHECK(RegCloseKey(key) == 87);
        return 0;
    }
}

FIXTURE_EXPORT int ImportsFixture_TestSystem()
{
    if (int line = CheckStartup())
        return line;
    if (int line = CheckSystemQueries())
        return line;
    if (int line = CheckClocks())
        return line;
    if (int line = CheckEnvironment())
        return line;
    if (int line = CheckFilesAndModules())
        return line;
    return CheckRegistry();
}
