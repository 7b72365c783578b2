// A 32-bit (PE32) image, which the loader refuses. Self-contained: the shared Windows
// declarations describe the x64 layout only.
#include <stdint.h>

extern "C" __declspec(dllexport) int32_t Pe32_Value() { return 32; }

extern "C" int32_t DllMain(void*, uint32_t, void*)
{
    return 1;
}
