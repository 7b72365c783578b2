// The Windows and C-runtime functions that DLLs built in this project may import: exactly the
// names of the host's known-import table, declared as a Windows x64 module sees them.
// Freestanding: only the compiler's own headers are available.
#pragma once

#include <stddef.h>
#include <stdint.h>

typedef uint32_t DWORD;
typedef uint32_t UINT;
typedef int32_t BOOL;
typedef int32_t LONG;
typedef uint16_t WORD;
typedef uint64_t SIZE_T;
typedef uint64_t DWORD_PTR;
typedef void* HANDLE;
typedef void* HMODULE;
typedef void* HKEY;
typedef uint16_t WCHAR;

struct FILETIME { DWORD dwLowDateTime; DWORD dwHighDateTime; };
struct LARGE_INTEGER { DWORD LowPart; LONG HighPart; };
struct SECURITY_ATTRIBUTES { DWORD nLength; void* lpSecurityDescriptor; BOOL bInheritHandle; };
struct CRITICAL_SECTION { void* debugInfo; LONG lockCount; LONG recursionCount; HANDLE owningThread; HANDLE lockSemaphore; uint64_t spinCount; };
static_assert(sizeof(CRITICAL_SECTION) == 40, "a Windows x64 critical section is 40 bytes");
struct SYSTEM_INFO {
    union { DWORD dwOemId; struct { WORD wProcessorArchitecture; WORD wReserved; } s; } u;
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

typedef void (*_PVFV)(void);
typedef int (*_PIFV)(void);

#define WINIMPORT extern "C" __declspec(dllimport)

// KERNEL32: process, threads, synchronisation, memory
WINIMPORT void GetSystemTimeAsFileTime(FILETIME* systemTimeAsFileTime);
WINIMPORT DWORD GetLastError(void);
WINIMPORT DWORD GetCurrentProcessId(void);
WINIMPORT DWORD GetCurrentThreadId(void);
WINIMPORT DWORD GetTickCount(void);
WINIMPORT DWORD GetVersion(void);
WINIMPORT void InitializeCriticalSection(CRITICAL_SECTION* cs);
WINIMPORT BOOL InitializeCriticalSectionAndSpinCount(CRITICAL_SECTION* cs, DWORD spinCount);
WINIMPORT void DeleteCriticalSection(CRITICAL_SECTION* cs);
WINIMPORT void EnterCriticalSection(CRITICAL_SECTION* cs);
WINIMPORT void LeaveCriticalSection(CRITICAL_SECTION* cs);
WINIMPORT HANDLE GetProcessHeap(void);
WINIMPORT void* EncodePointer(void* ptr);
WINIMPORT void* DecodePointer(void* ptr);
WINIMPORT BOOL IsProcessorFeaturePresent(DWORD feature);
WINIMPORT BOOL DisableThreadLibraryCalls(HMODULE module);
WINIMPORT void GetSystemInfo(SYSTEM_INFO* info);
WINIMPORT void Sleep(DWORD milliseconds);
WINIMPORT LONG InterlockedCompareExchange(LONG volatile* dest, LONG exchange, LONG comparand);
WINIMPORT LONG InterlockedExchange(LONG volatile* target, LONG value);
WINIMPORT DWORD TlsAlloc(void);
WINIMPORT void* TlsGetValue(DWORD index);
WINIMPORT BOOL TlsSetValue(DWORD index, void* value);
WINIMPORT BOOL TlsFree(DWORD index);
WINIMPORT void* VirtualAlloc(void* address, SIZE_T size, DWORD allocationType, DWORD protect);
WINIMPORT BOOL VirtualFree(void* address, SIZE_T size, DWORD freeType);
WINIMPORT DWORD GetFullPathNameA(const char* fileName, DWORD bufferLength, char* buffer, char** filePart);
WINIMPORT int MultiByteToWideChar(UINT codePage, DWORD flags, const char* multiByteStr, int cbMultiByte, WCHAR* wideCharStr, int cchWideChar);
WINIMPORT int WideCharToMultiByte(UINT codePage, DWORD flags, const WCHAR* wideCharStr, int cchWideChar, char* multiByteStr, int cbMultiByte, const char* defaultChar, BOOL* usedDefaultChar);
WINIMPORT DWORD GetEnvironmentVariableA(const char* name, char* buffer, DWORD size);
WINIMPORT BOOL QueryPerformanceCounter(LARGE_INTEGER* count);
WINIMPORT HMODULE GetModuleHandleA(const char* moduleName);
WINIMPORT HMODULE LoadLibraryA(const char* fileName);
WINIMPORT void* GetProcAddress(HMODULE module, const char* procName);
WINIMPORT DWORD GetModuleFileNameA(HMODULE module, char* fileName, DWORD size);
WINIMPORT HANDLE CreateFileA(const char* fileName, DWORD desiredAccess, DWORD shareMode, SECURITY_ATTRIBUTES* security, DWORD creationDisposition, DWORD flagsAndAttributes, HANDLE templateFile);
WINIMPORT DWORD GetFileSize(HANDLE file, DWORD* fileSizeHigh);
WINIMPORT BOOL CloseHandle(HANDLE handle);
WINIMPORT HANDLE HeapCreate(DWORD options, SIZE_T initialSize, SIZE_T maximumSize);
WINIMPORT BOOL HeapDestroy(HANDLE heap);
WINIMPORT void* HeapAlloc(HANDLE heap, DWORD flags, SIZE_T bytes);
WINIMPORT BOOL HeapFree(HANDLE heap, DWORD flags, void* memory);
WINIMPORT void OutputDebugStringA(const char* text);

// ADVAPI32: registry
WINIMPORT LONG RegOpenKeyExA(HKEY key, const char* subKey, DWORD options, DWORD samDesired, HKEY* result);
WINIMPORT LONG RegEnumKeyExA(HKEY key, DWORD index, char* name, DWORD* cchName, DWORD* reserved, char* className, DWORD* cchClass, FILETIME* lastWriteTime);
WINIMPORT LONG RegQueryValueExA(HKEY key, const char* valueName, DWORD* reserved, DWORD* type, unsigned char* data, DWORD* cbData);
WINIMPORT LONG RegCloseKey(HKEY key);

// MSVCRT: start-up support
WINIMPORT void _initterm(_PVFV* begin, _PVFV* end);
WINIMPORT int _initterm_e(_PIFV* begin, _PIFV* end);
WINIMPORT void _lock(int lockNumber);
WINIMPORT void _unlock(int lockNumber);
WINIMPORT _PIFV __dllonexit(_PIFV func, _PVFV** begin, _PVFV** end);
WINIMPORT void* _CRT_RTC_INIT(void* a, void* b, int c, int d, int e);
WINIMPORT void* _CRT_RTC_INITW(void* a, void* b, int c, int d, int e);
WINIMPORT int _CrtSetCheckCount(int checkCount);
WINIMPORT unsigned int _controlfp(unsigned int value, unsigned int mask);
WINIMPORT unsigned int _clearfp(void);

// MSVCRT: memory
WINIMPORT void* malloc(size_t size);
WINIMPORT void* _malloc_dbg(size_t size, int blockType, const char* fileName, int line);
WINIMPORT void* _malloc_crt(size_t size);
WINIMPORT void* realloc(void* ptr, size_t size);
WINIMPORT void free(void* ptr);
WINIMPORT void* memset(void* dst, int c, size_t count);
WINIMPORT void* memcpy(void* dst, const void* src, size_t count);
WINIMPORT void* memmove(void* dst, const void* src, size_t count);
WINIMPORT int memmove_s(void* dst, size_t numberOfElements, const void* src, size_t count);
WINIMPORT int memcmp(const void* a, const void* b, size_t count);

// MSVCRT: strings, characters, locale, environment
WINIMPORT char* setlocale(int category, const char* locale);
WINIMPORT size_t _mbstrlen(const char* s);
WINIMPORT char* _strdup(const char* s);
WINIMPORT int _vsnprintf(char* buffer, size_t count, const char* format, char* args);
WINIMPORT int sprintf_s(char* buffer, size_t count, const char* format, ...);
WINIMPORT char* strchr(char* s, int c);
WINIMPORT char* strrchr(char* s, int c);
WINIMPORT char* strstr(char* s, const char* sub);
WINIMPORT int strcmp(const char* a, const char* b);
WINIMPORT int strncmp(const char* a, const char* b, size_t count);
WINIMPORT int _strnicmp(const char* a, const char* b, size_t count);
WINIMPORT int _stricmp(const char* a, const char* b);
WINIMPORT int __isascii(int c);
WINIMPORT int isdigit(int c);
WINIMPORT int isxdigit(int c);
WINIMPORT int isalpha(int c);
WINIMPORT int isspace(int c);
WINIMPORT int isalnum(int c);
WINIMPORT int tolower(int c);
WINIMPORT int toupper(int c);
WINIMPORT double atof(const char* s);
WINIMPORT int atoi(const char* s);
WINIMPORT char* getenv(const char* name);

// MSVCRT: math
WINIMPORT double modf(double x, double* integral);
WINIMPORT double ceil(double x);
WINIMPORT double floor(double x);
WINIMPORT float floorf(float x);
WINIMPORT int _finite(double x);
WINIMPORT int _isnan(double x);
WINIMPORT int _fpclass(double x);
WINIMPORT double fabs(double x);
WINIMPORT double sqrt(double x);
WINIMPORT float sqrtf(float x);
WINIMPORT double tan(double x);
WINIMPORT double sin(double x);
WINIMPORT double cos(double x);
WINIMPORT double acos(double x);
WINIMPORT double asin(double x);
WINIMPORT double atan(double x);
WINIMPORT double atan2(double y, double x);
WINIMPORT double cosh(double x);
WINIMPORT double sinh(double x);
WINIMPORT double tanh(double x);
WINIMPORT double exp(double x);
WINIMPORT double log(double x);
WINIMPORT double frexp(double x, int* exponent);
WINIMPORT double pow(double x, double y);
WINIMPORT float powf(float x, float y);
WINIMPORT double fmod(double x, double y);
// Take their argument in xmm0 and leave the result there: for one double that is the ordinary
// Windows x64 convention.
WINIMPORT double __libm_sse2_acos(double x);
WINIMPORT double __libm_sse2_asin(double x);
WINIMPORT double __libm_sse2_cos(double x);
WINIMPORT double __libm_sse2_sin(double x);
WINIMPORT double __libm_sse2_log(double x);
