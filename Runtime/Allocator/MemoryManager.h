#pragma once
// The runtime's allocation functions. The label, options, file and line are accepted for the
// callers' bookkeeping and ignored on this platform.

#include <cstddef>

enum MemLabelIdentifier
{
    kMemDefault = 0,
    kMemTempAlloc,
    kMemString,
    kMemThread,
    kMemTest,
    kMemLabelCount
};

struct MemLabelId
{
    MemLabelIdentifier identifier = kMemDefault;
};

enum AllocateOptions
{
    kAllocateOptionNone = 0,
    kAllocateOptionReturnNullIfOutOfMemory = 1
};

void* malloc_internal(size_t size, size_t alignment, MemLabelId label, int options, const char* file, int line);
// count * size zeroed bytes; null if the product overflows.
void* calloc_internal(size_t count, size_t size, size_t alignment, MemLabelId label, int options,
                      const char* file, int line);
// The alignment is not kept across a reallocation.
void* realloc_internal(void* ptr, size_t size, size_t alignment, MemLabelId label, int options, const char* file,
                       int line);
void free_alloc_internal(void* ptr, MemLabelId label, const char* file = nullptr, int line = 0);

// A named allocator base; its statistics all answer 0 on this platform.
class BaseAllocator
{
public:
    explicit BaseAllocator(const char* name) : m_Name(name) {}
    virtual ~BaseAllocator() = default;
    const char* GetName() const { return m_Name; }
    virtual size_t GetAllocatedMemorySize() const { return 0; }
    virtual size_t GetAllocatorSizeTotalUsed() const { return 0; }
    virtual size_t GetReservedSizeTotal() const { return 0; }
    virtual size_t GetPeakAllocatedMemorySize() const { return 0; }
    virtual int GetNumberOfAllocations() const { return 0; }

private:
    const char* m_Name;
};
