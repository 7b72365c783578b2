#include "DllRuntime.h"
#include "ImportsFixture.h"

extern "C" BOOL DllMain(HMODULE, DWORD reason, void*)
{
    if (reason == 1)
        RunGlobalConstructors();
    return 1;
}
