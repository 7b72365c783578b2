#include "Runtime/Allocator/MemoryManager.h"

#include <cstdlib>
#include <cstring>
#include <malloc.h>

namespace
{
    // memalign needs a power of two no smaller than a pointer.
    size_t EffectiveAlignment(size_t alignment)
    {
        size_t result = sizeof(void*);
        while (result < alignment)
            result <<= 1;
        return result;
    }
}

void* malloc_internal(size_t size, size_t alignment, MemLabelId, int, const char*, int)
{
    return memalign(EffectiveAlignment(alignment), size);
}

void* calloc_internal(size_t count, size_t size, size_t alignment, MemLabelId label, int options, const char* file,
                      int line)
{
    size_t total = 0;
    if (__builtin_mul_overflow(count, size, &total))
        return nullptr;
    void* memory = malloc_internal(total, alignment, label, options, file, line);
    if (memory != nullptr)
        memset(memory, 0, total);
    return memory;
}

void* realloc_internal(void* ptr, size_t size, size_t, MemLabelId, int, const char*, int)
{
    return realloc(ptr, size);
}

void free_alloc_internal(void* ptr, MemLabelId, const char*, int)
{
    free(ptr);
}
