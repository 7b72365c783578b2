#include "DllRuntime.h"

// Referenced by the compiler whenever floating point is used.
extern "C" int _fltused = 0;

// Called through the vtable slot of a pure virtual function; there is nothing sane to return to.
extern "C" void _purecall() { __builtin_trap(); }

typedef void (*GlobalConstructor)();

// The linker sorts .CRT$XC* sections by their suffix, so the compiler's constructor pointers
// (.CRT$XCU) land between these two markers.
#pragma section(".CRT$XCA", read)
#pragma section(".CRT$XCZ", read)
__declspec(allocate(".CRT$XCA")) GlobalConstructor s_ConstructorsBegin = nullptr;
__declspec(allocate(".CRT$XCZ")) GlobalConstructor s_ConstructorsEnd = nullptr;

void RunGlobalConstructors()
{
    for (GlobalConstructor* p = &s_ConstructorsBegin + 1; p < &s_ConstructorsEnd; ++p)
        if (*p)
            (*p)();
}
