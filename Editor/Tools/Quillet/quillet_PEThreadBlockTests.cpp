#include "Runtime/Testing/Testing.h"

#include <thread>

#include "Editor/Tools/Quillet/quillet_PELoaderTestSupport.h"
#include "Editor/Tools/Quillet/quillet_PEThreadBlock.h"

using namespace PELoaderTest;

namespace
{
    uint64_t ReadGsWord(uint64_t offset)
    {
        uint64_t value;
        __asm__ volatile("movq %%gs:(%1), %0" : "=r"(value) : "r"(offset));
        return value;
    }

    uint8_t ReadGsByte(uint64_t offset)
    {
        uint8_t value;
        __asm__ volatile("movb %%gs:(%1), %0" : "=q"(value) : "r"(offset));
        return value;
    }

    // Bytes of the block other than the two address words that are not zero.
    size_t NonZeroBytesOutsideTheAddressWords()
    {
        size_t n = 0;
        for (uint64_t i = 0; i < kTIBSize; ++i)
            if (i < 0x28 || i >= 0x38)
                n += ReadGsByte(i) != 0;
        return n;
    }

    typedef uint64_t(__attribute__((ms_abi)) * GsFn)();
}

UNIT_TEST_SUITE(PEThreadBlock)
{
    TEST(SetupFS_PutsTheBlockAddressAt28And30_RestZero)
    {
        CHECK(PESetupFS() == nullptr);
        const uint64_t block = ReadGsWord(0x30);
        CHECK(block != 0);
        CHECK_EQUAL(block, ReadGsWord(0x28));
        CHECK_EQUAL(0u, NonZeroBytesOutsideTheAddressWords());
    }

    TEST(SetupFS_WipesWhatDllCodeLeftInTheBlock)
    {
        PESetupFS();
        ThreadInformationBlock* tib = reinterpret_cast<ThreadInformationBlock*>(ReadGsWord(0x30));
        tib->lastError = 5;
        tib->threadID = 77;
        reinterpret_cast<uint8_t*>(tib)[kTIBSize - 1] = 0xAB;
        CHECK_EQUAL(3u, NonZeroBytesOutsideTheAddressWords());
        PESetupFS();
        CHECK_EQUAL(0u, NonZeroBytesOutsideTheAddressWords());
        CHECK_EQUAL(reinterpret_cast<uint64_t>(tib), ReadGsWord(0x30));
    }

    TEST(DllCode_ReadsTheBlockThroughGs)
    {
        StdoutCapture capture;
        PEModule* module = PELoadLibrary(FixturePath("GsReader.dll").c_str(), nullptr, 0, nullptr);
        CHECK_EQUAL("  No imports\n", capture.Text());
        if (!module)
            return;
        PESetupFS();
        const uint64_t block = ReadGsWord(0x30);
        CHECK_EQUAL(block, reinterpret_cast<GsFn>(PEGetProcAddress(module, "Gs_Read30"))());
        CHECK_EQUAL(block, reinterpret_cast<GsFn>(PEGetProcAddress(module, "Gs_Read28"))());
        PEFreeLibrary(module);
    }

    TEST(OneBlockForAllThreads)
    {
        PESetupFS();
        const uint64_t here = ReadGsWord(0x30);
        uint64_t there = 0;
        std::thread other([&there] {
            PESetupFS();
            there = ReadGsWord(0x30);
        });
        other.join();
        CHECK(here != 0);
        CHECK_EQUAL(here, there);
    }

    // The loader prepares the block before the entry point runs: the entry point finds the
    // block's address at 0x30, and what an earlier user left in the block is already wiped.
    TEST(EntryPoint_RunsWithAFreshBlock)
    {
        PESetupFS();
        ThreadInformationBlock* tib = reinterpret_cast<ThreadInformationBlock*>(ReadGsWord(0x30));
        tib->lastError = 0x5EED;
        PEModule* module = nullptr;
        {
            StdoutCapture capture;
            module = PELoadLibrary(FixturePath("GsReader.dll").c_str(), nullptr, 0, nullptr);
            capture.Text();
        }
        CHECK(module != nullptr);
        if (!module)
            return;
        typedef uint32_t(__attribute__((ms_abi)) * WordFn)();
        CHECK_EQUAL(reinterpret_cast<uint64_t>(tib), reinterpret_cast<GsFn>(PEGetProcAddress(module, "Gs_EntrySaw30"))());
        CHECK_EQUAL(0u, reinterpret_cast<WordFn>(PEGetProcAddress(module, "Gs_EntrySawLastError"))());
        PEFreeLibrary(module);
    }
}
