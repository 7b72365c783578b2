#include "Runtime/Testing/Testing.h"

#include "Runtime/Allocator/MemoryManager.h"

#include <cstdint>
#include <limits>

UNIT_TEST_SUITE(MemoryManager)
{
    TEST(Allocations_HonourAlignment_CallocZeroes_OverflowGivesNull)
    {
        const MemLabelId label;
        for (size_t alignment : {size_t(1), size_t(16), size_t(64), size_t(4096)})
        {
            void* memory = malloc_internal(24, alignment, label, 0, __FILE__, __LINE__);
            CHECK(memory != nullptr);
            CHECK_EQUAL(0u, reinterpret_cast<uintptr_t>(memory) % alignment);
            free_alloc_internal(memory, label);
        }

        unsigned char* zeroed = static_cast<unsigned char*>(calloc_internal(100, 3, 32, label, 0, __FILE__, __LINE__));
        CHECK(zeroed != nullptr);
        int nonZero = 0;
        for (int i = 0; i < 300; ++i)
            nonZero += zeroed[i] != 0;
        CHECK_EQUAL(0, nonZero);
        zeroed = static_cast<unsigned char*>(realloc_internal(zeroed, 600, 32, label, 0, __FILE__, __LINE__));
        CHECK(zeroed != nullptr);
        CHECK_EQUAL(0, zeroed[299]);
        free_alloc_internal(zeroed, label);

        const size_t huge = std::numeric_limits<size_t>::max() / 2;
        CHECK(calloc_internal(huge, 4, 16, label, 0, __FILE__, __LINE__) == nullptr);
    }
}
