#include "Editor/Tools/Quillet/quillet_KnownImports.h"

#include <ctype.h>
#include <locale.h>
#include <malloc.h>
#include <math.h>
#include <pthread.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <strings.h>
#include <sys/mman.h>
#include <time.h>
#include <unistd.h>

#include <bit>
#include <map>

#include "Editor/Tools/Quillet/quillet_Formatter.h"
#include "Editor/Tools/Quillet/quillet_ImportTypes.h"
#include "Runtime/Utilities/UTF8.h"

// The host functions, by area. Each is local to this unit and reachable from DLL code only
// through the table below.
#include "Editor/Tools/Quillet/quillet_ImportsMemory.inl"
#include "Editor/Tools/Quillet/quillet_ImportsSync.inl"
#include "Editor/Tools/Quillet/quillet_ImportsSystem.inl"
#include "Editor/Tools/Quillet/quillet_ImportsCRuntime.inl"
#include "Editor/Tools/Quillet/quillet_ImportsMath.inl"
#include "Editor/Tools/Quillet/quillet_ImportsText.inl"

#define QUILLET_IMPORT(name, func, unwind) { name, reinterpret_cast<void*>(&func), unwind }

// Import name, host function, and the argument bytes a 32-bit stdcall callee would pop (0 for the
// C runtime and for functions without parameters). Lookup takes the first row whose name matches
// ignoring case, so no name occurs twice. Rows 30 to 37 are the Microsoft manglings of the global
// operators new, new[], delete and delete[], with a 32-bit size (30 to 33) and a 64-bit size
// (34 to 37); both manglings of each delete bind the same function.
PEKnownImport kQuilletKnownImports[] = {
    QUILLET_IMPORT("GetSystemTimeAsFileTime",               GetSystemTimeAsFileTime_impl,                  8),  // 0
    QUILLET_IMPORT("GetLastError",                          GetLastError_impl,                             0),  // 1
    QUILLET_IMPORT("GetCurrentProcessId",                   GetCurrentProcessId_impl,                      0),  // 2
    QUILLET_IMPORT("GetCurrentThreadId",                    GetCurrentThreadId_impl,                       0),  // 3
    QUILLET_IMPORT("GetTickCount",                          GetTickCount_impl,                             0),  // 4
    QUILLET_IMPORT("GetVersion",                            GetVersion_impl,                               0),  // 5
    QUILLET_IMPORT("InitializeCriticalSection",             InitializeCriticalSection_impl,                8),  // 6
    QUILLET_IMPORT("InitializeCriticalSectionAndSpinCount", InitializeCriticalSectionAndSpinCount_impl,   12),  // 7
    QUILLET_IMPORT("DeleteCriticalSection",                 DeleteCriticalSection_impl,                    8),  // 8
    QUILLET_IMPORT("EnterCriticalSection",                  EnterCriticalSection_impl,                     8),  // 9
    QUILLET_IMPORT("LeaveCriticalSection",                  LeaveCriticalSection_impl,                     8),  // 10
    QUILLET_IMPORT("GetProcessHeap",                        GetProcessHeap_impl,                           0),  // 11
    QUILLET_IMPORT("EncodePointer",                         EncodePointer_impl,                            8),  // 12
    QUILLET_IMPORT("DecodePointer",                         DecodePointer_impl,                            8),  // 13
    QUILLET_IMPORT("IsProcessorFeaturePresent",             IsProcessorFeaturePresent_impl,                4),  // 14
    QUILLET_IMPORT("_initterm",                             _initterm_impl,                                0),  // 15
    QUILLET_IMPORT("_initterm_e",                           _initterm_e_impl,                              0),  // 16
    QUILLET_IMPORT("_lock",                                 _lock_impl,                                    0),  // 17
    QUILLET_IMPORT("_unlock",                               _unlock_impl,                                  0),  // 18
    QUILLET_IMPORT("__dllonexit",                           __dllonexit_impl,                              0),  // 19
    QUILLET_IMPORT("_CRT_RTC_INIT",                         _CRT_RTC_INIT_impl,                            0),  // 20
    QUILLET_IMPORT("_CRT_RTC_INITW",                        _CRT_RTC_INITW_impl,                           0),  // 21
    QUILLET_IMPORT("_CrtSetCheckCount",                     _CrtSetCheckCount_impl,                        0),  // 22
    QUILLET_IMPORT("DisableThreadLibraryCalls",             DisableThreadLibraryCalls_impl,                8),  // 23
    QUILLET_IMPORT("GetSystemInfo",                         GetSystemInfo_impl,                            8),  // 24
    QUILLET_IMPORT("Sleep",                                 Sleep_impl,                                    4),  // 25
    QUILLET_IMPORT("memset",                                memset_impl,                                   0),  // 26
    QUILLET_IMPORT("setlocale",                             setlocale_impl,                                0),  // 27
    QUILLET_IMPORT("_mbstrlen",                             _mbstrlen_impl,                                0),  // 28
    QUILLET_IMPORT("_strdup",                               _strdup_impl,                                  0),  // 29
    QUILLET_IMPORT("??2@YAPAXI@Z",                          operator_new_impl,                             0),  // 30
    QUILLET_IMPORT("??_U@YAPAXI@Z",                         operator_new_array_impl,                       0),  // 31
    QUILLET_IMPORT("??3@YAXPAX@Z",                          operator_delete_impl,                          0),  // 32
    QUILLET_IMPORT("??_V@YAXPAX@Z",                         operator_delete_array_impl,                    0),  // 33
    QUILLET_IMPORT("??2@YAPEAX_K@Z",                        operator_new64_impl,                           0),  // 34
    QUILLET_IMPORT("??_U@YAPEAX_K@Z",                       operator_new64_array_impl,                     0),  // 35
    QUILLET_IMPORT("??3@YAXPEAX@Z",                         operator_delete_impl,                          0),  // 36
    QUILLET_IMPORT("??_V@YAXPEAX@Z",                        operator_delete_array_impl,                    0),  // 37
    QUILLET_IMPORT("_vsnprintf",                            _vsnprintf_impl,                               0),  // 38
    QUILLET_IMPORT("sprintf_s",                             sprintf_s_impl,                                0),  // 39
    QUILLET_IMPORT("InterlockedCompareExchange",            InterlockedCompareExchange_impl,              16),  // 40
    QUILLET_IMPORT("InterlockedExchange",                   InterlockedExchange_impl,                     12),  // 41
    QUILLET_IMPORT("TlsAlloc",                              TlsAlloc_impl,                                 0),  // 42
    QUILLET_IMPORT("TlsGetValue",                           TlsGetValue_impl,                              4),  // 43
    QUILLET_IMPORT("TlsSetValue",                           TlsSetValue_impl,                             12),  // 44
    QUILLET_IMPORT("TlsFree",                               TlsFree_impl,                                  4),  // 45
    QUILLET_IMPORT("malloc",                                malloc_impl,                                   0),  // 46
    QUILLET_IMPORT("_malloc_dbg",                           _malloc_dbg_impl,                              0),  // 47
    QUILLET_IMPORT("_malloc_crt",                           _malloc_crt_impl,                              0),  // 48
    QUILLET_IMPORT("realloc",                               realloc_impl,                                  0),  // 49
    QUILLET_IMPORT("free",                                  free_impl,                                     0),  // 50
    QUILLET_IMPORT("VirtualAlloc",                          VirtualAlloc_impl,                            24),  // 51
    QUILLET_IMPORT("VirtualFree",                           VirtualFree_impl,                             20),  // 52
    QUILLET_IMPORT("GetFullPathNameA",                      GetFullPathNameA_impl,                        28),  // 53
    QUILLET_IMPORT("MultiByteToWideChar",                   MultiByteToWideChar_impl,                     32),  // 54
    QUILLET_IMPORT("WideCharToMultiByte",                   WideCharToMultiByte_impl,                     48),  // 55
    QUILLET_IMPORT("memcpy",                                memcpy_impl,                                   0),  // 56
    QUILLET_IMPORT("memmove",                               memmove_impl,                                  0),  // 57
    QUILLET_IMPORT("memmove_s",                             memmove_s_impl,                                0),  // 58
    QUILLET_IMPORT("memcmp",                                memcmp_impl,                                   0),  // 59
    QUILLET_IMPORT("getenv",                                getenv_impl,                                   0),  // 60
    QUILLET_IMPORT("GetEnvironmentVariableA",               GetEnvironmentVariableA_impl,                 20),  // 61
    QUILLET_IMPORT("QueryPerformanceCounter",               QueryPerformanceCounter_impl,                  8),  // 62
    QUILLET_IMPORT("GetModuleHandleA",                      GetModuleHandleA_impl,                         8),  // 63
    QUILLET_IMPORT("LoadLibraryA",                          LoadLibraryA_impl,                             8),  // 64
    QUILLET_IMPORT("GetProcAddress",                        GetProcAddress_impl,                          16),  // 65
    QUILLET_IMPORT("GetModuleFileNameA",                    GetModuleFileNameA_impl,                      20),  // 66
    QUILLET_IMPORT("CreateFileA",                           CreateFileA_impl,                             40),  // 67
    QUILLET_IMPORT("GetFileSize",                           GetFileSize_impl,                             16),  // 68
    QUILLET_IMPORT("CloseHandle",                           CloseHandle_impl,                              8),  // 69
    QUILLET_IMPORT("RegOpenKeyExA",                         RegOpenKeyExA_impl,                           32),  // 70
    QUILLET_IMPORT("RegEnumKeyExA",                         RegEnumKeyExA_impl,                           60),  // 71
    QUILLET_IMPORT("RegQueryValueExA",                      RegQueryValueExA_impl,                        48),  // 72
    QUILLET_IMPORT("RegCloseKey",                           RegCloseKey_impl,                              8),  // 73
    QUILLET_IMPORT("HeapCreate",                            HeapCreate_impl,                              20),  // 74
    QUILLET_IMPORT("HeapDestroy",                           HeapDestroy_impl,                              8),  // 75
    QUILLET_IMPORT("HeapAlloc",                             HeapAlloc_impl,                               20),  // 76
    QUILLET_IMPORT("HeapFree",                              HeapFree_impl,                                20),  // 77
    QUILLET_IMPORT("OutputDebugStringA",                    OutputDebugStringA_impl,                       8),  // 78
    QUILLET_IMPORT("_controlfp",                            _controlfp_impl,                               0),  // 79
    QUILLET_IMPORT("_clearfp",                              _clearfp_impl,                                 0),  // 80
    QUILLET_IMPORT("strchr",                                strchr_impl,                                   0),  // 81
    QUILLET_IMPORT("strrchr",                               strrchr_impl,                                  0),  // 82
    QUILLET_IMPORT("strstr",                                strstr_impl,                                   0),  // 83
    QUILLET_IMPORT("strcmp",                                strcmp_impl,                                   0),  // 84
    QUILLET_IMPORT("strncmp",                               strncmp_impl,                                  0),  // 85
    QUILLET_IMPORT("_strnicmp",                             _strnicmp_impl,                                0),  // 86
    QUILLET_IMPORT("_stricmp",                              _stricmp_impl,                                 0),  // 87
    QUILLET_IMPORT("__isascii",                             __isascii_impl,                                0),  // 88
    QUILLET_IMPORT("isdigit",                               isdigit_impl,                                  0),  // 89
    QUILLET_IMPORT("isxdigit",                              isxdigit_impl,                                 0),  // 90
    QUILLET_IMPORT("isalpha",                               isalpha_impl,                                  0),  // 91
    QUILLET_IMPORT("isspace",                               isspace_impl,                                  0),  // 92
    QUILLET_IMPORT("isalnum",                               isalnum_impl,                                  0),  // 93
    QUILLET_IMPORT("tolower",                               tolower_impl,                                  0),  // 94
    QUILLET_IMPORT("toupper",                               toupper_impl,                                  0),  // 95
    QUILLET_IMPORT("atof",                                  atof_impl,                                     0),  // 96
    QUILLET_IMPORT("atoi",                                  atoi_impl,                                     0),  // 97
    QUILLET_IMPORT("modf",                                  modf_impl,                                     0),  // 98
    QUILLET_IMPORT("ceil",                                  ceil_impl,                                     0),  // 99
    QUILLET_IMPORT("floor",                                 floor_impl,                                    0),  // 100
    QUILLET_IMPORT("floorf",                                floorf_impl,                                   0),  // 101
    QUILLET_IMPORT("_finite",                               _finite_impl,                                  0),  // 102
    QUILLET_IMPORT("_isnan",                                _isnan_impl,                                   0),  // 103
    QUILLET_IMPORT("_fpclass",                              _fpclass_impl,                                 0),  // 104
    QUILLET_IMPORT("fabs",                                  fabs_impl,                                     0),  // 105
    QUILLET_IMPORT("sqrt",                                  sqrt_impl,                                     0),  // 106
    QUILLET_IMPORT("sqrtf",                                 sqrtf_impl,                                    0),  // 107
    QUILLET_IMPORT("tan",                                   tan_impl,                                      0),  // 108
    QUILLET_IMPORT("sin",                                   sin_impl,                                      0),  // 109
    QUILLET_IMPORT("cos",                                   cos_impl,                                      0),  // 110
    QUILLET_IMPORT("acos",                                  acos_impl,                                     0),  // 111
    QUILLET_IMPORT("asin",                                  asin_impl,                                     0),  // 112
    QUILLET_IMPORT("atan",                                  atan_impl,                                     0),  // 113
    QUILLET_IMPORT("atan2",                                 atan2_impl,                                    0),  // 114
    QUILLET_IMPORT("cosh",                                  cosh_impl,                                     0),  // 115
    QUILLET_IMPORT("sinh",                                  sinh_impl,                                     0),  // 116
    QUILLET_IMPORT("tanh",                                  tanh_impl,                                     0),  // 117
    QUILLET_IMPORT("exp",                                   exp_impl,                                      0),  // 118
    QUILLET_IMPORT("log",                                   log_impl,                                      0),  // 119
    QUILLET_IMPORT("frexp",                                 frexp_impl,                                    0),  // 120
    QUILLET_IMPORT("pow",                                   pow_impl,                                      0),  // 121
    QUILLET_IMPORT("powf",                                  powf_impl,                                     0),  // 122
    QUILLET_IMPORT("fmod",                                  fmod_impl,                                     0),  // 123
    QUILLET_IMPORT("__libm_sse2_acos",                      __libm_sse2_acos_impl,                         0),  // 124
    QUILLET_IMPORT("__libm_sse2_asin",                      __libm_sse2_asin_impl,                         0),  // 125
    QUILLET_IMPORT("__libm_sse2_cos",                       __libm_sse2_cos_impl,                          0),  // 126
    QUILLET_IMPORT("__libm_sse2_sin",                       __libm_sse2_sin_impl,                          0),  // 127
    QUILLET_IMPORT("__libm_sse2_log",                       __libm_sse2_log_impl,                          0),  // 128
};

#undef QUILLET_IMPORT

int32_t kQuilletKnownImportsCount = sizeof(kQuilletKnownImports) / sizeof(kQuilletKnownImports[0]);
static_assert(sizeof(kQuilletKnownImports) / sizeof(kQuilletKnownImports[0]) == 129, "the known-import table has 129 rows");

// Reference count of InitializeQuilletImports calls. A plain integer: both functions are meant
// for one thread, before and after all DLL work.
static int32_t s_VAInitialized = 0;

void InitializeQuilletImports()
{
    if (s_VAInitialized > 0)
    {
        ++s_VAInitialized;
        return;
    }
    // Made recursive the way DLL code would make it, through the table's own function.
    InitializeCriticalSection_impl(&s_VAMutex);
    ++s_VAInitialized;
}

void CleanupQuilletImports()
{
    // s_VARecords is kept: mappings still alive stay recorded until process exit.
    if (--s_VAInitialized <= 0)
        pthread_mutex_destroy(&s_VAMutex);
}
