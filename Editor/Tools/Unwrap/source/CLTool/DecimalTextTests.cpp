// The OBJ writer's number formatting against the C library's printf, value by value, under the
// SSE state the driver writes with (rounding toward zero, denormals kept).
#include "Editor/Tools/Unwrap/source/CLTool/DecimalText.h"
#include "Runtime/Testing/Testing.h"

#include <bit>
#include <cfloat>
#include <cinttypes>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <limits>
#include <random>
#include <string>
#include <vector>
#include <xmmintrin.h>

namespace
{
    // The driver's state: rounding field to toward zero, flush-to-zero off; restored afterwards.
    struct TowardZeroFixture
    {
        unsigned saved = _mm_getcsr();
        TowardZeroFixture() { _mm_setcsr((saved | 0x6000u) & ~0x8000u); }
        ~TowardZeroFixture() { _mm_setcsr(saved); }
    };

    std::string Fixed6(float value)
    {
        char text[DecimalText::kMaxFloatChars + 1];
        *DecimalText::WriteFixed6(value, text) = '\0';
        return text;
    }

    std::string Printf(float value)
    {
        char text[64];
        std::snprintf(text, sizeof text, "%f", double(value));
        return text;
    }

    // Empty when the formatter and printf agree on the float with the given bits, else both texts.
    std::string Disagreement(uint32_t bits)
    {
        float value = std::bit_cast<float>(bits);
        std::string expected = Printf(value), actual = Fixed6(value);
        if (expected == actual)
            return "";
        char hex[16];
        std::snprintf(hex, sizeof hex, "%08X", bits);
        return std::string("bits ") + hex + ": printf " + expected + ", formatter " + actual;
    }

    // The first disagreement over the bit patterns first, first + stride, ... (count of them).
    std::string FirstDisagreement(uint32_t first, uint32_t count, uint32_t stride)
    {
        for (uint64_t i = 0; i < count; ++i)
        {
            std::string found = Disagreement(uint32_t(first + i * stride));
            if (!found.empty())
                return found;
        }
        return "";
    }
}

UNIT_TEST_SUITE(DecimalText)
{
    TEST_FIXTURE(TowardZeroFixture, Fixed6_KnownTexts_PrintfStillRoundsToNearestEven)
    {
        CHECK_EQUAL(0x6000u, _mm_getcsr() & 0xE000u);
        const float nan = std::numeric_limits<float>::quiet_NaN(), inf = std::numeric_limits<float>::infinity();
        const struct { float value; const char* text; } cases[] = {
            {1.0f / 128, "0.007812"},   // exact ties: to even, down and up
            {3.0f / 128, "0.023438"},
            {-3.0f / 128, "-0.023438"},
            {6e-7f, "0.000001"},        // toward zero would print 0.000000
            {0.9999996f, "1.000000"},   // the rounding carries into the integer part
            {0.0f, "0.000000"},
            {-0.0f, "-0.000000"},
            {-1e-7f, "-0.000000"},
            {-FLT_TRUE_MIN, "-0.000000"},
            {16777216.0f, "16777216.000000"},
            {1e10f, "10000000000.000000"},
            {-FLT_MAX, "-340282346638528859811704183484516925440.000000"},
            {nan, "nan"},
            {-nan, "-nan"},
            {inf, "inf"},
            {-inf, "-inf"},
        };
        for (const auto& c : cases)
        {
            CHECK_EQUAL(c.text, Printf(c.value));
            CHECK_EQUAL(c.text, Fixed6(c.value));
        }
        CHECK_EQUAL(DecimalText::kMaxFloatChars, Fixed6(-FLT_MAX).size());
    }

    TEST_FIXTURE(TowardZeroFixture, Fixed6_DyadicFractions_MatchPrintf)
    {
        // j / 2^k: the exact ties (k = 7) and the near-ties around them, both signs.
        for (int k = 1; k <= 40; ++k)
            for (uint32_t j = 1; j < 8192; j += 2)
                for (float sign : {1.0f, -1.0f})
                    CHECK_EQUAL("", Disagreement(std::bit_cast<uint32_t>(sign * std::ldexp(float(j), -k))));
    }

    TEST_FIXTURE(TowardZeroFixture, Fixed6_EveryExponent_MatchesPrintf)
    {
        // Powers of two, their neighbours and the largest mantissa at every exponent field, including
        // zero and the denormals (field 0) and the infinities and NaNs (field 255), both signs.
        for (uint32_t field = 0; field < 256; ++field)
            for (uint32_t mantissa : {0u, 1u, 2u, 0x400000u, 0x7FFFFEu, 0x7FFFFFu})
                for (uint32_t sign : {0u, 0x80000000u})
                    CHECK_EQUAL("", Disagreement(sign | field << 23 | mantissa));
    }

    TEST_FIXTURE(TowardZeroFixture, Fixed6_DenseRanges_MatchPrintf)
    {
        const struct { uint32_t first, count, stride; } ranges[] = {
            {0x00000000, 0x40000000 / 1021 + 1, 1021},   // [0, 2) at a stride
            {0x3F800000, 1 << 19, 1},                    // every float from 1
            {0x35000000, 1 << 19, 16},                   // [2^-21, 2^-20): around half a millionth
            {0x4AFC0000, 1 << 19, 1},                    // across 2^23, where the fraction bits end
            {0x5F7E0000, 1 << 18, 1},                    // across 2^64
            {0xBF000000, 1 << 19, 1},                    // every float from -0.5
        };
        for (const auto& r : ranges)
            CHECK_EQUAL("", FirstDisagreement(r.first, r.count, r.stride));
    }

    TEST_FIXTURE(TowardZeroFixture, Fixed6_RandomBitPatterns_MatchPrintf)
    {
        std::mt19937 random(20261122);
        std::string first;
        for (int i = 0; i < 2000000 && first.empty(); ++i)
            first = Disagreement(uint32_t(random()));
        CHECK_EQUAL("", first);
    }

    TEST(Unsigned_MatchesPrintf)
    {
        // Every decimal length with its edges (powers of ten and two and their neighbours), then
        // random values of random magnitude.
        std::vector<uint64_t> values = {0, UINT32_MAX, UINT64_MAX};
        for (uint64_t ten = 10; ten <= UINT64_MAX / 10; ten *= 10)
            values.insert(values.end(), {ten - 1, ten, ten + 1, ten * 10 - 1, ten * 10, ten * 10 + 1});
        for (int bit = 1; bit < 64; ++bit)
            values.insert(values.end(), {(uint64_t(1) << bit) - 1, uint64_t(1) << bit});
        std::mt19937_64 random(7);
        for (int i = 0; i < 200000; ++i)
            values.push_back(random() >> (random() % 64));
        for (uint64_t v : values)
        {
            char expected[32], actual[DecimalText::kMaxUnsignedChars + 1];
            std::snprintf(expected, sizeof expected, "%" PRIu64, v);
            *DecimalText::WriteUnsigned(v, actual) = '\0';
            CHECK_EQUAL(expected, actual);
        }
    }
}
