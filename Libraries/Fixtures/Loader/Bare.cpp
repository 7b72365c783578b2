// Nothing but an entry point: no imports, no exports.
#include "WinImports.h"

extern "C" BOOL DllMain(HMODULE, DWORD, void*)
{
    return 1;
}
