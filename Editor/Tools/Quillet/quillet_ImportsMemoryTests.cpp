#include "Runtime/Testing/Testing.h"

#include "Editor/Tools/Quillet/quillet_ImportsTestSupport.h"

#include <errno.h>
#include <stdlib.h>
#include <string.h>
#include <sys/mman.h>
#include <unistd.h>

using namespace QuilletTest;

// Under AddressSanitizer the C library's allocator is replaced: freed blocks wait in its
// quarantine, still mapped, so the release of large blocks is checked in ordinary builds only.
#if defined(__SANITIZE_ADDRESS__)
#define QUILLET_TESTS_SEE_HOST_HEAP 0
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define QUILLET_TESTS_SEE_HOST_HEAP 0
#endif
#endif
#ifndef QUILLET_TESTS_SEE_HOST_HEAP
#define QUILLET_TESTS_SEE_HOST_HEAP 1
#endif

namespace
{
    const unsigned int kMemCommit = 0x1000;
    const unsigned int kMemReserve = 0x2000;
    const unsigned int kMemDecommit = 0x4000;
    const unsigned int kMemRelease = 0x8000;
    const unsigned int kPageReadWrite = 4;

    const size_t kPage = static_cast<size_t>(sysconf(_SC_PAGESIZE));

    // msync fails with ENOMEM exactly when part of the range is not mapped.
    bool IsMapped(void* page)
    {
        return msync(page, kPage, MS_ASYNC) == 0;
    }

    char* PageAt(void* base, size_t index) { return static_cast<char*>(base) + index * kPage; }

    struct VirtualMemory
    {
        WinFn<void*, void*, unsigned long, unsigned int, unsigned int> alloc = Import<void*, void*, unsigned long, unsigned int, unsigned int>("VirtualAlloc");
        WinFn<int, void*, unsigned long, unsigned int> free = Import<int, void*, unsigned long, unsigned int>("VirtualFree");
    };
}

UNIT_TEST_SUITE(QuilletImportsMemory)
{
    TEST(Malloc_ReallocAndFree_UseTheHostHeap)
    {
        auto hostMalloc = Import<void*, unsigned long>("malloc");
        auto hostRealloc = Import<void*, void*, unsigned long>("realloc");
        auto hostFree = Import<void, void*>("free");
        char* p = static_cast<char*>(hostMalloc(4));
        memcpy(p, "abc", 4);
        p = static_cast<char*>(hostRealloc(p, 4096));
        CHECK_EQUAL("abc", p);
        hostFree(p);
        // Blocks from the other allocation names are host blocks as well.
        free(Import<void*, unsigned long, int, const char*, int>("_malloc_dbg")(16, 1, "file.cpp", 12));
        free(Import<void*, unsigned long>("_malloc_crt")(16));
        hostFree(nullptr);
    }

    TEST(NewOperators_32BitManglingsIgnoreTheUpperHalfOfTheSize)
    {
        // A 32-bit caller leaves whatever it likes above the size: 2^40 + 16 must allocate 16 bytes.
        for (const char* name : {"??2@YAPAXI@Z", "??_U@YAPAXI@Z"})
        {
            void* p = Import<void*, uint64_t>(name)((uint64_t(1) << 40) | 16);
            CHECK(p != nullptr);
            free(p);
        }
        for (const char* name : {"??2@YAPEAX_K@Z", "??_U@YAPEAX_K@Z"})
        {
            void* p = Import<void*, uint64_t>(name)(16);
            CHECK(p != nullptr);
            free(p);
            // The 64-bit size is used whole: a size no host can give yields null, not a small block.
            CHECK((Import<void*, uint64_t>(name)(uint64_t(1) << 62)) == nullptr);
        }
    }

    TEST(DeleteOperators_FreeBlocksAndIgnoreNull)
    {
        for (const char* name : {"??3@YAXPAX@Z", "??_V@YAXPAX@Z", "??3@YAXPEAX@Z", "??_V@YAXPEAX@Z"})
        {
            auto destroy = Import<void, void*>(name);
            CHECK(destroy != nullptr);
            destroy(malloc(8));
            destroy(nullptr);
        }
    }

    TEST(Heaps_AreOneFictitiousHeapWithHandle1)
    {
        auto processHeap = Import<void*>("GetProcessHeap")();
        auto created = Import<void*, unsigned int, unsigned long, unsigned long>("HeapCreate")(0, 1 << 20, 0);
        CHECK_EQUAL(uintptr_t(1), reinterpret_cast<uintptr_t>(processHeap));
        CHECK_EQUAL(uintptr_t(1), reinterpret_cast<uintptr_t>(created));
        CHECK_EQUAL(1, (Import<int, void*>("HeapDestroy")(created)));

        auto heapAlloc = Import<void*, void*, unsigned int, unsigned long>("HeapAlloc");
        auto heapFree = Import<int, void*, unsigned int, void*>("HeapFree");
        void* block = heapAlloc(created, 0, 100);
        CHECK(block != nullptr);
        CHECK_EQUAL(1, heapFree(processHeap, 0, block));
    }

#if QUILLET_TESTS_SEE_HOST_HEAP
    TEST(LargeBlocks_LeaveTheProcessWhenFreed_EvenAfterALargerBlockWasFreed)
    {
        // Freeing a large block first is what makes the C library's default keep the next large
        // blocks in its heap (it raises its mapping limit to the freed block's size), where a
        // freed block stays part of the process.
        auto heapAlloc = Import<void*, void*, unsigned int, unsigned long>("HeapAlloc");
        auto heapFree = Import<int, void*, unsigned int, void*>("HeapFree");
        auto hostMalloc = Import<void*, unsigned long>("malloc");
        auto hostFree = Import<void, void*>("free");
        void* heap = reinterpret_cast<void*>(1);
        const size_t kLarger = 24 << 20, kLarge = 4 << 20;
        char* larger = static_cast<char*>(heapAlloc(heap, 0, kLarger));
        memset(larger, 1, kLarger);
        heapFree(heap, 0, larger);
        for (int viaMalloc = 0; viaMalloc < 2; ++viaMalloc)
        {
            char* block = static_cast<char*>(viaMalloc ? hostMalloc(kLarge) : heapAlloc(heap, 0, kLarge));
            memset(block, 2, kLarge);
            // A whole page inside the block, away from the allocator's own header.
            char* page = reinterpret_cast<char*>((reinterpret_cast<uintptr_t>(block) + 2 * kPage) & ~(uintptr_t)(kPage - 1));
            CHECK(IsMapped(page));
            viaMalloc ? hostFree(block) : (void)heapFree(heap, 0, block);
            CHECK(!IsMapped(page));
        }
    }
#endif

    TEST(HeapAlloc_ZeroMemoryFlag_ClearsTheBlock)
    {
        auto heapAlloc = Import<void*, void*, unsigned int, unsigned long>("HeapAlloc");
        // Dirty a block first that the allocator hands back for the same size: beyond the sizes
        // it caches per thread, a freed block goes back to the heap (kept from the heap's end by
        // a guard block, so that it is not given back to the system) and an exact fit reuses it.
        // The volatile pointers keep the compiler from dropping the unused blocks altogether.
        const size_t kSize = 4000;
        void* volatile dirty = malloc(kSize);
        void* volatile guard = malloc(64);
        memset(dirty, 0xAB, kSize);
        free(dirty);
        unsigned char* block = static_cast<unsigned char*>(heapAlloc(reinterpret_cast<void*>(1), 0x8, kSize));
        bool allZero = true;
        for (size_t i = 0; i < kSize; ++i)
            allZero = allZero && block[i] == 0;
        CHECK(allZero);
        free(block);
        free(guard);
        // A size no host can give yields null, with nothing cleared.
        CHECK(heapAlloc(reinterpret_cast<void*>(1), 0x8, uint64_t(1) << 62) == nullptr);
    }

    TEST(VirtualAlloc_CommitOfAnAddress_ReturnsItAndMapsNothing)
    {
        VirtualMemory vm;
        void* hole = mmap(nullptr, kPage, PROT_READ, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
        munmap(hole, kPage);
        CHECK(vm.alloc(hole, kPage, kMemCommit, kPageReadWrite) == hole);
        CHECK(!IsMapped(hole));
    }

    TEST(VirtualAlloc_WithoutAddress_MapsWritableMemoryThatReleaseUnmapsWhole)
    {
        VirtualMemory vm;
        for (unsigned int type : {kMemCommit, kMemReserve | kMemCommit})
        {
            char* base = static_cast<char*>(vm.alloc(nullptr, 3 * kPage, type, kPageReadWrite));
            CHECK(base != MAP_FAILED);
            base[0] = 1;
            base[3 * kPage - 1] = 2;
            CHECK_EQUAL(1, vm.free(base, 0, kMemRelease));
            CHECK(!IsMapped(PageAt(base, 0)));
            CHECK(!IsMapped(PageAt(base, 2)));
        }
    }

    TEST(VirtualFree_OfAnUnrecordedAddress_UnmapsNothing)
    {
        VirtualMemory vm;
        void* page = mmap(nullptr, kPage, PROT_READ, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
        CHECK_EQUAL(1, vm.free(page, 0, kMemRelease));
        CHECK(IsMapped(page));
        munmap(page, kPage);
    }

    TEST(VirtualFree_DecommitWithSize_UnmapsThatSizeAndForgetsTheRecord)
    {
        VirtualMemory vm;
        char* base = static_cast<char*>(vm.alloc(nullptr, 2 * kPage, kMemReserve, kPageReadWrite));
        CHECK_EQUAL(1, vm.free(base, kPage, kMemDecommit));
        CHECK(!IsMapped(PageAt(base, 0)));
        CHECK(IsMapped(PageAt(base, 1)));
        // The record is gone: a release now finds length 0 and leaves the second page alone.
        CHECK_EQUAL(1, vm.free(base, 0, kMemRelease));
        CHECK(IsMapped(PageAt(base, 1)));
        munmap(PageAt(base, 1), kPage);
    }

    TEST(VirtualAlloc_AtAnAddressAlreadyRecorded_KeepsTheFirstLength)
    {
        VirtualMemory vm;
        // Three pages, unmapped behind the record's back, then one page mapped again at the same
        // base: the record still says three pages, so the release unmaps three.
        char* base = static_cast<char*>(vm.alloc(nullptr, 3 * kPage, kMemReserve, kPageReadWrite));
        munmap(base, 3 * kPage);
        char* again = static_cast<char*>(vm.alloc(base, kPage, kMemReserve, kPageReadWrite));
        CHECK(again == base);
        CHECK(IsMapped(again));  // a reservation at an address maps (the address is a free hint)
        void* rest = mmap(PageAt(base, 1), 2 * kPage, PROT_READ, MAP_PRIVATE | MAP_ANONYMOUS | MAP_FIXED_NOREPLACE, -1, 0);
        CHECK(rest == PageAt(base, 1));
        CHECK_EQUAL(1, vm.free(again, 0, kMemRelease));
        CHECK(!IsMapped(PageAt(base, 0)));
        CHECK(!IsMapped(PageAt(base, 2)));
        munmap(base, 3 * kPage);
    }

    TEST(VirtualAlloc_MapsExecutableMemory_AndAZeroSizeFreeReleasesTheRecordedLength)
    {
        VirtualMemory vm;
        // Whatever protection is asked for, the memory runs code: a lone "ret".
        unsigned char* code = static_cast<unsigned char*>(vm.alloc(nullptr, 2 * kPage, kMemCommit, kPageReadWrite));
        code[0] = 0xC3;
        reinterpret_cast<void (*)()>(code)();
        // Size 0 with a type other than release still takes the recorded length.
        CHECK_EQUAL(1, vm.free(code, 0, kMemDecommit));
        CHECK(!IsMapped(PageAt(code, 0)));
        CHECK(!IsMapped(PageAt(code, 1)));
    }
}
