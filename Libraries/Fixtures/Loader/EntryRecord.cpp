// No imports at all. Records every call of its entry point, holds a pointer that only base
// relocation makes right, and exports two names that differ only in letter case.
#include "WinImports.h"

static int32_t s_calls = 0;
static uint32_t s_reason = 0;
static HMODULE s_module = nullptr;
static void* s_reserved = reinterpret_cast<void*>(1);
// Initialised data holding an absolute address: the image carries a DIR64 relocation for it.
static int32_t* volatile s_callsAddress = &s_calls;

extern "C" __declspec(dllexport) int32_t EntryRecord_Calls() { return s_calls; }
extern "C" __declspec(dllexport) uint32_t EntryRecord_Reason() { return s_reason; }
extern "C" __declspec(dllexport) HMODULE EntryRecord_Module() { return s_module; }
extern "C" __declspec(dllexport) void* EntryRecord_Reserved() { return s_reserved; }
extern "C" __declspec(dllexport) int32_t* EntryRecord_CallsAddress() { return &s_calls; }
extern "C" __declspec(dllexport) int32_t* EntryRecord_StoredAddress() { return s_callsAddress; }
extern "C" __declspec(dllexport) int32_t Probe_Value() { return 1; }
extern "C" __declspec(dllexport) int32_t PROBE_VALUE() { return 2; }

extern "C" BOOL DllMain(HMODULE module, DWORD reason, void* reserved)
{
    ++s_calls;
    s_reason = reason;
    s_module = module;
    s_reserved = reserved;
    return 1;
}
