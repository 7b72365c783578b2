// Imports bound through the loading test's own table: FIXTURE_TWICE, which the test's table
// spells in another letter case; malloc, which the test's table overrides; and Fixture_Missing,
// which no table names.
#include "WinImports.h"

extern "C" __declspec(dllimport) int32_t FIXTURE_TWICE(int32_t value);
extern "C" __declspec(dllimport) int32_t Fixture_Missing(void);

extern "C" __declspec(dllexport) int32_t Bound_Twice(int32_t value) { return FIXTURE_TWICE(value) + 1; }
extern "C" __declspec(dllexport) void* Bound_Malloc(size_t size) { return malloc(size); }
extern "C" __declspec(dllexport) void Bound_Free(void* p) { free(p); }

// Returns to here after the stub reported the call; 1000 plus what the stub returned.
extern "C" __declspec(dllexport) int32_t Bound_CallMissing()
{
    return Fixture_Missing() + 1000;
}

extern "C" BOOL DllMain(HMODULE, DWORD, void*)
{
    return 1;
}
