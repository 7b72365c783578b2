// Known imports, memory area: the C allocation functions, the global operators new and delete,
// heaps, memory blocks and virtual memory. Included by quillet_KnownImports.cpp only, so that
// every host function stays local to that unit. Everything handed out is host heap memory, except
// VirtualAlloc, which maps memory and records the mapping's length for VirtualFree.

namespace
{
    // --- Allocation ---------------------------------------------------------------------------

    // Every block handed to a DLL comes from here. Blocks of kMappedBlockBytes and more get their
    // own mapping, which their release gives back to the system at once. The C library does that
    // by default too, but raises the limit to the size of each mapped block freed (up to 32 MB):
    // after the first large block of a run goes, the next ones come from the heap and, once
    // freed, stay in the process. The unwrapper frees its stages' arrays as it goes and counts on
    // that memory leaving, so the limit is fixed here, once, before the first block.
    const int kMappedBlockBytes = 128 * 1024;

    void FixMappingLimit()
    {
        static const bool s_Fixed = mallopt(M_MMAP_THRESHOLD, kMappedBlockBytes) == 1;
        (void)s_Fixed;
    }

    void* HostAllocate(size_t size)
    {
        FixMappingLimit();
        return malloc(size);
    }

    QUILLET_WINAPI void* malloc_impl(unsigned long s) { return HostAllocate(s); }
    QUILLET_WINAPI void* _malloc_crt_impl(unsigned long s) { return HostAllocate(s); }
    QUILLET_WINAPI void* _malloc_dbg_impl(unsigned long size, int, const char*, int) { return HostAllocate(size); }
    QUILLET_WINAPI void* realloc_impl(void* p, unsigned long s)
    {
        FixMappingLimit();
        return realloc(p, s);
    }
    QUILLET_WINAPI void free_impl(void* p) { free(p); }

    // The 32-bit manglings take a 32-bit size; the upper half of the register is not looked at.
    QUILLET_WINAPI void* operator_new_impl(unsigned int size) { return HostAllocate(size); }
    QUILLET_WINAPI void* operator_new_array_impl(unsigned int size) { return HostAllocate(size); }
    QUILLET_WINAPI void* operator_new64_impl(unsigned long size) { return HostAllocate(size); }
    QUILLET_WINAPI void* operator_new64_array_impl(unsigned long size) { return HostAllocate(size); }

    QUILLET_WINAPI void operator_delete_impl(void* ptr)
    {
        if (ptr)
            free(ptr);
    }

    QUILLET_WINAPI void operator_delete_array_impl(void* ptr)
    {
        if (ptr)
            free(ptr);
    }

    // --- Heaps: one fictitious heap, handle value 1, backed by the host allocator -------------

    const uintptr_t kHeapHandle = 1;
    const DWORD kHeapZeroMemory = 0x8;

    QUILLET_WINAPI HANDLE GetProcessHeap_impl() { return reinterpret_cast<HANDLE>(kHeapHandle); }
    QUILLET_WINAPI HANDLE HeapCreate_impl(DWORD, unsigned long, unsigned long) { return reinterpret_cast<HANDLE>(kHeapHandle); }
    QUILLET_WINAPI BOOL HeapDestroy_impl(HANDLE) { return 1; }

    QUILLET_WINAPI void* HeapAlloc_impl(HANDLE, DWORD dwFlags, unsigned long dwBytes)
    {
        void* block = HostAllocate(dwBytes);
        // A failed allocation is handed back as null, never cleared.
        if (block && (dwFlags & kHeapZeroMemory))
            memset(block, 0, dwBytes);
        return block;
    }

    QUILLET_WINAPI BOOL HeapFree_impl(HANDLE, DWORD, void* lpMem)
    {
        free(lpMem);
        return 1;
    }

    // --- Memory blocks ------------------------------------------------------------------------

    QUILLET_WINAPI void* memset_impl(void* dst, int c, unsigned long count) { return memset(dst, c, count); }
    QUILLET_WINAPI void* memcpy_impl(void* dst, const void* src, unsigned long count) { return memcpy(dst, src, count); }
    QUILLET_WINAPI void* memmove_impl(void* dst, const void* src, unsigned long count) { return memmove(dst, src, count); }
    QUILLET_WINAPI int memcmp_impl(const void* a, const void* b, unsigned long count) { return memcmp(a, b, count); }

    // The destination size is not checked: callers always pass a size that fits.
    QUILLET_WINAPI int memmove_s_impl(void* dst, unsigned long, const void* src, unsigned long count)
    {
        memmove(dst, src, count);
        return 0;
    }
}

// --- Virtual memory ---------------------------------------------------------------------------

// Length of every mapping made by VirtualAlloc_impl, by base address, so that a release
// (which passes size 0) unmaps exactly what was mapped. Guarded by s_VAMutex, which works from
// its zero-filled static state even when InitializeQuilletImports was never called.
static std::map<void*, unsigned long> s_VARecords;
static CRITICAL_SECTION_impl s_VAMutex;

namespace
{
    const DWORD kMemReserve = 0x2000;
    const DWORD kMemRelease = 0x8000;

    // Every mapping is readable, writable and executable, whatever protection was asked for.
    QUILLET_WINAPI void* VirtualAlloc_impl(void* addr, unsigned long size, DWORD type, DWORD)
    {
        // A commit of an earlier reservation: the reservation is already fully usable.
        if (!(type & kMemReserve) && addr != nullptr)
            return addr;

        void* mapped = mmap(addr, size, PROT_READ | PROT_WRITE | PROT_EXEC, MAP_PRIVATE | MAP_ANONYMOUS, 0, 0);
        pthread_mutex_lock(&s_VAMutex);
        s_VARecords.emplace(mapped, size);  // an existing record keeps its length
        pthread_mutex_unlock(&s_VAMutex);
        return mapped;
    }

    QUILLET_WINAPI BOOL VirtualFree_impl(void* addr, unsigned long size, DWORD type)
    {
        pthread_mutex_lock(&s_VAMutex);
        if (size == 0 || type == kMemRelease)
            size = s_VARecords[addr];  // an unknown address gets length 0: nothing is unmapped
        munmap(addr, size);
        s_VARecords.erase(addr);
        pthread_mutex_unlock(&s_VAMutex);
        return 1;
    }
}
