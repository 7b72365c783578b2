// Known imports, system area: C-runtime start-up support, system queries, clocks, environment, and
// the fixed answers for files, registry and modules. Included by quillet_KnownImports.cpp only.
// The fixed values describe one x64 processor on Windows 7 SP1 and are relied on as they are.

namespace
{
    // --- Start-up support ---------------------------------------------------------------------

    QUILLET_WINAPI void _initterm_impl(_PVFV* pfbegin, _PVFV* pfend)
    {
        for (_PVFV* slot = pfbegin; slot < pfend; ++slot)
            if (*slot)
                (*slot)();
    }

    // Runs every initialiser, even after one has failed, and answers the last one's result.
    QUILLET_WINAPI int _initterm_e_impl(_PIFV* pfbegin, _PIFV* pfend)
    {
        int result = 0;
        for (_PIFV* slot = pfbegin; slot < pfend; ++slot)
            if (*slot)
                result = (*slot)();
        return result;
    }

    // Nothing is registered: the DLLs are never unloaded before process exit.
    QUILLET_WINAPI _onexit_t __dllonexit_impl(_onexit_t func, _PVFV**, _PVFV**) { return func; }
    QUILLET_WINAPI void _lock_impl(int) {}
    QUILLET_WINAPI void _unlock_impl(int) {}
    QUILLET_WINAPI void* _CRT_RTC_INIT_impl(void*, void*, int, int, int) { return nullptr; }
    QUILLET_WINAPI void* _CRT_RTC_INITW_impl(void*, void*, int, int, int) { return nullptr; }
    QUILLET_WINAPI int _CrtSetCheckCount_impl(int) { return 0; }
    QUILLET_WINAPI BOOL DisableThreadLibraryCalls_impl(HMODULE_impl) { return 1; }

    // --- System queries -----------------------------------------------------------------------

    QUILLET_WINAPI DWORD GetLastError_impl() { return 0; }
    QUILLET_WINAPI DWORD GetVersion_impl() { return 0x1DB10106; }  // 6.1, build 7601

    QUILLET_WINAPI void GetSystemInfo_impl(SYSTEM_INFO_impl* out)
    {
        if (!out)
            return;
        out->u.s.wProcessorArchitecture = 9;  // x64
        out->u.s.wReserved = 0;
        out->dwPageSize = 0x1000;
        out->lpMinimumApplicationAddress = nullptr;
        out->lpMaximumApplicationAddress = nullptr;
        out->dwActiveProcessorMask = 1;
        out->dwNumberOfProcessors = 1;
        out->dwProcessorType = 8664;  // x86-64
        out->dwAllocationGranularity = 0x1000;
        out->wProcessorLevel = 0;
        out->wProcessorRevision = 0;
    }

    // MMX (3), SSE (6), 3DNow! (7) and SSE2 (10) are reported, whatever the host has.
    QUILLET_WINAPI BOOL IsProcessorFeaturePresent_impl(unsigned int feature)
    {
        return feature == 3 || feature == 6 || feature == 7 || feature == 10;
    }

    // The floating-point environment belongs to the host; the DLLs only get the default answers.
    QUILLET_WINAPI unsigned int _controlfp_impl(unsigned int, unsigned int) { return 0x8001; }
    QUILLET_WINAPI unsigned int _clearfp_impl() { return 0; }

    // --- Clocks: processor time in host ticks, unscaled ---------------------------------------

    QUILLET_WINAPI DWORD GetTickCount_impl() { return static_cast<DWORD>(clock()); }

    QUILLET_WINAPI BOOL QueryPerformanceCounter_impl(LARGE_INTEGER_impl* count)
    {
        count->LowPart = static_cast<DWORD>(clock());
        count->HighPart = 0;
        return 1;
    }

    QUILLET_WINAPI void GetSystemTimeAsFileTime_impl(FILETIME_impl* systemTimeAsFileTime)
    {
        systemTimeAsFileTime->dwLowDateTime = static_cast<DWORD>(clock());
        systemTimeAsFileTime->dwHighDateTime = 0;
    }

    // --- Environment --------------------------------------------------------------------------

    // A value that does not fit is truncated and its truncated length returned; a size of 0
    // wraps to the largest limit, so the whole value is copied.
    QUILLET_WINAPI DWORD GetEnvironmentVariableA_impl(const char* name, char* buffer, unsigned int size)
    {
        const char* value = getenv(name);
        if (!value)
            return 0;
        DWORD len = static_cast<DWORD>(strlen(value));
        DWORD limit = size - 1u;
        DWORD n = len > limit ? limit : len;
        memcpy(buffer, value, n);
        buffer[n] = 0;
        return n;
    }

    // --- Files and modules: nothing on this host is a Windows file or module ------------------

    // The name comes back as given, with no directory prefixed.
    QUILLET_WINAPI DWORD GetFullPathNameA_impl(const char* lpFileName, unsigned int nBufferLength, char* lpBuffer, char**)
    {
        DWORD len = static_cast<DWORD>(strlen(lpFileName));
        if (len >= nBufferLength)
            return len + 1;
        memcpy(lpBuffer, lpFileName, len);
        lpBuffer[len] = 0;
        return len;
    }

    QUILLET_WINAPI DWORD GetModuleFileNameA_impl(HMODULE_impl, char* filename, unsigned int size)
    {
        strncpy(filename, "foo", size);
        return 3;
    }

    QUILLET_WINAPI HANDLE CreateFileA_impl(const char*, unsigned int, unsigned int, SECURITY_ATTRIBUTES_impl*,
                                           unsigned int, unsigned int, HANDLE)
    {
        return reinterpret_cast<HANDLE>(~uintptr_t(0));  // INVALID_HANDLE_VALUE
    }

    QUILLET_WINAPI DWORD GetFileSize_impl(HANDLE, unsigned int*) { return 0; }
    QUILLET_WINAPI BOOL CloseHandle_impl(HANDLE) { return 1; }
    QUILLET_WINAPI void OutputDebugStringA_impl(const char* str) { puts(str); }

    QUILLET_WINAPI HMODULE_impl GetModuleHandleA_impl(const char*) { return nullptr; }
    QUILLET_WINAPI HMODULE_impl LoadLibraryA_impl(const char*) { return nullptr; }
    QUILLET_WINAPI void* GetProcAddress_impl(HMODULE_impl, const char*) { return nullptr; }

    // --- Registry: every call fails with ERROR_INVALID_PARAMETER and writes nothing ------------

    const LONG kErrorInvalidParameter = 87;

    QUILLET_WINAPI LONG RegOpenKeyExA_impl(HKEY_impl, const char*, unsigned int, unsigned int, HKEY_impl*)
    {
        return kErrorInvalidParameter;
    }

    QUILLET_WINAPI LONG RegEnumKeyExA_impl(HKEY_impl, unsigned int, char*, unsigned int*, unsigned int*, char*,
                                           unsigned int*, FILETIME_impl*)
    {
        return kErrorInvalidParameter;
    }

    QUILLET_WINAPI LONG RegQueryValueExA_impl(HKEY_impl, const char*, unsigned int*, unsigned int*, unsigned char*,
                                              unsigned int*)
    {
        return kErrorInvalidParameter;
    }

    QUILLET_WINAPI LONG RegCloseKey_impl(HKEY_impl) { return kErrorInvalidParameter; }
}
