// Ten arguments of mixed integer and floating types: the first four travel in registers, the
// other six on the stack above the caller's 32-byte home area.
#include "WinImports.h"

#define ARGS_PARAMETERS                                                                      \
    int32_t a1, double a2, int64_t a3, float a4, double a5, int32_t a6, float a7, int64_t a8, \
        double a9, uint16_t a10

// One bit for each argument that arrived with the value the test passes (bit 0 for a1).
extern "C" __declspec(dllexport) int32_t Args_Check(ARGS_PARAMETERS)
{
    int32_t ok = 0;
    ok |= (a1 == -7) << 0;
    ok |= (a2 == 2.5) << 1;
    ok |= (a3 == 0x123456789ALL) << 2;
    ok |= (a4 == -0.75f) << 3;
    ok |= (a5 == 1e100) << 4;
    ok |= (a6 == 2147483647) << 5;
    ok |= (a7 == 3.125f) << 6;
    ok |= (a8 == -0x7000000000000000LL) << 7;
    ok |= (a9 == -4.0625) << 8;
    ok |= (a10 == 0xBEEF) << 9;
    return ok;
}

// The sum of k * ak, returned in xmm0: any two arguments swapped change it.
extern "C" __declspec(dllexport) double Args_Sum(ARGS_PARAMETERS)
{
    return 1 * a1 + 2 * a2 + 3.0 * static_cast<double>(a3) + 4 * a4 + 5 * a5 + 6 * a6 + 7 * a7 +
           8.0 * static_cast<double>(a8) + 9 * a9 + 10 * a10;
}

extern "C" BOOL DllMain(HMODULE, DWORD, void*)
{
    return 1;
}
