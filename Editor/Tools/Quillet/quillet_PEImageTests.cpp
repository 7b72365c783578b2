#include "Runtime/Testing/Testing.h"

#include <vector>

#include "Editor/Tools/Quillet/quillet_PEImage.h"

namespace
{
    // A mapped image of 0x3000 bytes holding only what base relocation reads: the NT headers at
    // 0x40 with the relocation directory, blocks at 0x2000 and four 64-bit targets in page 0x1000.
    struct RelocationImage
    {
        static constexpr uint64_t kNtOffset = 0x40;
        static constexpr uint64_t kBlocks = 0x2000;
        static constexpr uint64_t kTargets[4] = {0x1010, 0x1020, 0x1030, 0x1040};
        static constexpr uint64_t kOriginal = 0x1111111180000000ull;

        std::vector<uint8_t> bytes = std::vector<uint8_t>(0x3000);
        MutableByteView image{bytes.data(), bytes.size()};
        PEFilledRanges filled;  // as if the file had filled the whole image

        RelocationImage()
        {
            filled.Add(0, bytes.size());
            // The size is only a presence flag: 1 is as good as the blocks' real length.
            image.Write(kNtOffset + PEDataDirectoryOffset(kPEDirectoryBaseRelocations), PE_IMAGE_DATA_DIRECTORY{0x2000, 1});
            // One block per kind of entry: DIR64, HIGHLOW, padding (0) and an unsupported type (5).
            image.Write(kBlocks, PE_IMAGE_BASE_RELOCATION{0x1000, 16});
            const uint16_t entries[] = {0xA010, 0x3020, 0x0030, 0x5040};
            for (int i = 0; i < 4; ++i)
                image.Write<uint16_t>(kBlocks + 8 + 2 * i, entries[i]);
            // A block of 9 bytes has no entries; the walk still moves on by 9.
            image.Write(kBlocks + 16, PE_IMAGE_BASE_RELOCATION{0x1000, 9});
            image.Write(kBlocks + 25, PE_IMAGE_BASE_RELOCATION{0, 8});  // the end mark
            // Past the end mark: a block that would patch the first target a second time.
            image.Write(kBlocks + 33, PE_IMAGE_BASE_RELOCATION{0x1000, 10});
            image.Write<uint16_t>(kBlocks + 41, 0xA010);
            for (uint64_t target : kTargets)
                image.Write(target, kOriginal);
        }

        uint64_t Word(uint64_t offset) const
        {
            uint64_t value = 0;
            image.Read(offset, value);
            return value;
        }
    };
}

UNIT_TEST_SUITE(PEImageRelocation)
{
    TEST_FIXTURE(RelocationImage, Dir64AndHighLow_PatchWholeWords_OtherTypesAreSkipped)
    {
        const uint64_t delta = 0x0000000180000001ull;  // carries into the upper half
        CHECK(DoRelocation(image, kNtOffset, delta, filled) == nullptr);
        CHECK_EQUAL(kOriginal + delta, Word(kTargets[0]));
        CHECK_EQUAL(kOriginal + delta, Word(kTargets[1]));  // HIGHLOW too, as a 64-bit word
        CHECK_EQUAL(kOriginal, Word(kTargets[2]));
        CHECK_EQUAL(kOriginal, Word(kTargets[3]));
    }

    TEST_FIXTURE(RelocationImage, NegativeDelta_WrapsBack)
    {
        CHECK(DoRelocation(image, kNtOffset, 0 - uint64_t(0x1000), filled) == nullptr);
        CHECK_EQUAL(kOriginal - 0x1000, Word(kTargets[0]));
    }

    TEST_FIXTURE(RelocationImage, AtThePreferredBase_NothingIsRead)
    {
        // A broken first block: a zero delta must not even look at it.
        image.Write(kBlocks, PE_IMAGE_BASE_RELOCATION{0x1000, 4});
        CHECK(DoRelocation(image, kNtOffset, 0, filled) == nullptr);
        CHECK_EQUAL(kOriginal, Word(kTargets[0]));
        CHECK_EQUAL("Failed to load DLL: relocation block smaller than its header", DoRelocation(image, kNtOffset, 8, filled));
    }

    TEST_FIXTURE(RelocationImage, ZeroDirectorySize_SkipsRelocation)
    {
        image.Write(kNtOffset + PEDataDirectoryOffset(kPEDirectoryBaseRelocations), PE_IMAGE_DATA_DIRECTORY{0x2000, 0});
        CHECK(DoRelocation(image, kNtOffset, 0x1000, filled) == nullptr);
        CHECK_EQUAL(kOriginal, Word(kTargets[0]));
    }

    TEST(FilledRanges_MergeTouchingPieces_AndAnswerOnlyForBytesWholyInside)
    {
        PEFilledRanges filled;
        filled.Add(0x400, 0x100);
        filled.Add(0x100, 0x100);
        filled.Add(0x200, 0x80);  // touches the one before: one piece 0x100..0x280
        CHECK(filled.Covers(0x100, 0x180));
        CHECK(!filled.Covers(0x100, 0x181));
        CHECK(!filled.Covers(0x300, 8));  // past the end of a piece, before the next
        CHECK(!filled.Covers(0x50, 8));
        CHECK(filled.Covers(0x4F8, 8));
        CHECK(!filled.Covers(0x4F9, 8));
        std::vector<uint64_t> parts;
        filled.ForEachInside(0x180, 0x300, [&](uint64_t offset, uint64_t length) {
            parts.push_back(offset);
            parts.push_back(length);
        });
        CHECK(parts == std::vector<uint64_t>({0x180, 0x100, 0x400, 0x80}));
    }
}
