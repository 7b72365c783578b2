// Reads the two words of the thread block that x64 code relies on.
#include "WinImports.h"

extern "C" __declspec(dllexport) uint64_t Gs_Read30()
{
    uint64_t value;
    __asm__ volatile("movq %%gs:0x30, %0" : "=r"(value));
    return value;
}

extern "C" __declspec(dllexport) uint64_t Gs_Read28()
{
    uint64_t value;
    __asm__ volatile("movq %%gs:0x28, %0" : "=r"(value));
    return value;
}

extern "C" BOOL DllMain(HMODULE, DWORD, void*)
{
    return 1;
}
