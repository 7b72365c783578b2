// Executable memory for module images and import stubs: the loader's only use of mmap.
#include "Editor/Tools/Quillet/quillet_PELoader.h"

#include <sys/mman.h>

void* MapExecMemory(size_t bytes)
{
    // Read + write + execute, private + anonymous; the descriptor is ignored for anonymous maps.
    return mmap(nullptr, bytes, PROT_READ | PROT_WRITE | PROT_EXEC, MAP_PRIVATE | MAP_ANONYMOUS, 0, 0);
}

void UnmapExecMemory(void* ptr, size_t bytes)
{
    munmap(ptr, bytes);
}
