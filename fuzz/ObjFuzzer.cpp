// LoadFromObj on arbitrary text: it must read the mesh or refuse it with a message, never crash,
// leak or run away.
#include "MeshFuzzing.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    ReadMeshFromMemory(&LoadFromObj, data, size);
    return 0;
}
