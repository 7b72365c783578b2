// Allocation, the eight operator manglings, heaps, memory blocks and virtual memory.
#include "ImportsFixture.h"

namespace
{
    struct Counted
    {
        int value = 7;
    };

    int CheckAllocation()
    {
        char* block = static_cast<char*>(malloc(16));
        FIXTURE_CHECK(block != nullptr);
        block[15] = 'z';
        block = static_cast<char*>(realloc(block, 4096));
        FIXTURE_CHECK(block != nullptr && block[15] == 'z');
        free(block);
        free(nullptr);
        void* debugBlock = _malloc_dbg(32, 1, "ImportsFixtureMemory.cpp", __LINE__);
        void* crtBlock = _malloc_crt(32);
        FIXTURE_CHECK(debugBlock != nullptr && crtBlock != nullptr);
        free(debugBlock);
        free(crtBlock);
        return 0;
    }

    int CheckOperators()
    {
        // The 64-bit manglings, as the compiler emits them.
        Counted* one = new Counted;
        Counted* many = new Counted[3];
        FIXTURE_CHECK(one->value == 7 && many[2].value == 7);
        delete one;
        delete[] many;
        Counted* none = nullptr;
        delete none;

        // The 32-bit manglings, called by name.
        void* a = OperatorNew32(24);
        void* b = OperatorNewArray32(24);
        FIXTURE_CHECK(a != nullptr && b != nullptr);
        OperatorDelete32(a);
        OperatorDeleteArray32(b);
        OperatorDelete32(nullptr);
        OperatorDeleteArray32(nullptr);
        return 0;
    }

    int CheckHeaps()
    {
        HANDLE heap = GetProcessHeap();
        HANDLE created = HeapCreate(0, 4096, 0);
        FIXTURE_CHECK(heap == (HANDLE)1 && created == (HANDLE)1);
        unsigned char* block = static_cast<unsigned char*>(HeapAlloc(created, 0x8, 300));
        FIXTURE_CHECK(block != nullptr);
        for (int i = 0; i < 300; ++i)
            FIXTURE_CHECK(block[i] == 0);
        FIXTURE_CHECK(HeapFree(heap, 0, block) == 1);
        FIXTURE_CHECK(HeapDestroy(created) == 1);
        return 0;
    }

    int CheckMemoryBlocks()
    {
        char buffer[16];
        FIXTURE_CHECK(memset(buffer, 'a', sizeof buffer) == buffer && buffer[15] == 'a');
        FIXTURE_CHECK(memcpy(buffer, "0123456789", 11) == buffer && Fixture::SameText(buffer, "0123456789"));
        FIXTURE_CHECK(memmove(buffer + 2, buffer, 5) == buffer + 2 && Fixture::SameText(buffer, "0101234789"));
        FIXTURE_CHECK(memmove_s(buffer, 1, "xyz", 4) == 0 && Fixture::SameText(buffer, "xyz"));
        FIXTURE_CHECK(memcmp("abc", "abd", 3) < 0 && memcmp("abc", "abd", 2) == 0);
        return 0;
    }

    int CheckVirtualMemory()
    {
        const DWORD reserveCommit = 0x3000, commit = 0x1000, release = 0x8000;
        char* region = static_cast<char*>(VirtualAlloc(nullptr, 65536, reserveCommit, 4));
        FIXTURE_CHECK(region != nullptr && region != (char*)~uintptr_t(0));
        region[0] = 1;
        region[65535] = 2;
        // Committing part of a reservation hands back the address as it is.
        FIXTURE_CHECK(VirtualAlloc(region + 4096, 4096, commit, 4) == region + 4096);
        FIXTURE_CHECK(VirtualFree(region, 0, release) == 1);
        FIXTURE_CHECK(VirtualFree(nullptr, 0, release) == 1);  // never recorded: nothing happens
        return 0;
    }
}

FIXTURE_EXPORT int ImportsFixture_TestMemory()
{
    if (int line = CheckAllocation())
        return line;
    if (int line = CheckOperators())
        return line;
    if (int line = CheckHeaps())
        return line;
    if (int line = CheckMemoryBlocks())
        return line;
    return CheckVirtualMemory();
}
