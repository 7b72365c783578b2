#pragma once
// The Windows types that DLL code hands to the host functions of the known-import table, declared
// here as 64-bit Windows lays them out. Included only by the unit that defines those functions.

#include <pthread.h>
#include <stddef.h>
#include <stdint.h>

// Every host function that DLL code calls follows the Windows x64 convention.
#define QUILLET_WINAPI __attribute__((ms_abi))

typedef uint32_t DWORD;
typedef uint32_t UINT;
typedef int32_t BOOL;
typedef int32_t LONG;
typedef uint16_t WORD;
typedef uint64_t DWORD_PTR;
typedef void* HANDLE;
typedef void* HMODULE_impl;
typedef void* HKEY_impl;

// Start-up table entries are DLL code: called with the Windows x64 convention, so the caller
// reserves their 32-byte home area and keeps nothing it needs in registers they may change.
typedef void(QUILLET_WINAPI* _PVFV)();
typedef int(QUILLET_WINAPI* _PIFV)();
typedef _PIFV _onexit_t;

// A Windows critical section (40 bytes on x64) is used in place as a host recursive mutex.
typedef pthread_mutex_t CRITICAL_SECTION_impl;
static_assert(sizeof(pthread_mutex_t) <= 40, "a host mutex must fit in a Windows critical section");

struct FILETIME_impl
{
    DWORD dwLowDateTime;
    DWORD dwHighDateTime;
};

struct LARGE_INTEGER_impl
{
    DWORD LowPart;
    LONG HighPart;
};

struct SECURITY_ATTRIBUTES_impl
{
    DWORD nLength;
    void* lpSecurityDescriptor;
    BOOL bInheritHandle;
};

struct SYSTEM_INFO_impl
{
    union
    {
        DWORD dwOemId;
        struct
        {
            WORD wProcessorArchitecture;
            WORD wReserved;
        } s;
    } u;
    DWORD dwPageSize;
    void* lpMinimumApplicationAddress;
    void* lpMaximumApplicationAddress;
    DWORD_PTR dwActiveProcessorMask;
    DWORD dwNumberOfProcessors;
    DWORD dwProcessorType;
    DWORD dwAllocationGranularity;
    WORD wProcessorLevel;
    WORD wProcessorRevision;
};
static_assert(sizeof(SYSTEM_INFO_impl) == 48, "SYSTEM_INFO is 48 bytes on 64-bit Windows");
static_assert(offsetof(SYSTEM_INFO_impl, dwActiveProcessorMask) == 24, "Windows field offset");
static_assert(offsetof(SYSTEM_INFO_impl, wProcessorLevel) == 44, "Windows field offset");
