// Reads the two words of the thread block that x64 code relies on, from exports and from its
// entry point (which records what it saw). Also exports a forwarder, which a loader that does
// not recognise forwarding hands back as the address of its text.
#include "WinImports.h"

#pragma comment(linker, "/export:Gs_Forwarded=Elsewhere.Forwarded_Function")

static uint64_t s_entrySaw30 = 0;
static uint32_t s_entrySawLastError = 0xFFFFFFFF;

extern "C" __declspec(dllexport) uint64_t Gs_EntrySaw30() { return s_entrySaw30; }
extern "C" __declspec(dllexport) uint32_t Gs_EntrySawLastError() { return s_entrySawLastError; }

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
    // The block's own address, and the word where the host's block layout keeps the last error.
    uint64_t self;
    uint32_t lastError;
    __asm__ volatile("movq %%gs:0x30, %0" : "=r"(self));
    __asm__ volatile("movl %%gs:0x58, %0" : "=r"(lastError));
    s_entrySaw30 = self;
    s_entrySawLastError = lastError;
    return 1;
}
