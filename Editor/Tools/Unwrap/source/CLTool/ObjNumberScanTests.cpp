// The OBJ number fields against the C library, text by text: "%f" must give strtof's float bit for
// bit and stop where strtof stops, "%u" what strtoul gives; both under the SSE state the driver
// reads files with (rounding toward zero), strtof included.
#include "Editor/Tools/Unwrap/source/CLTool/ObjNumberScan.h"
#include "Runtime/Testing/Testing.h"

#include <cfloat>
#include <cstdio>
#include <cstdlib>
#include <cstring>
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

    uint32_t Bits(float value)
    {
        uint32_t bits;
        std::memcpy(&bits, &value, 4);
        return bits;
    }

    // Texts a scanner meets: plain, signed, blank-led, exponent forms, long mantissas, the edges of
    // the float range, halfway cases, and what strtof accepts besides decimals.
    std::vector<std::string> FloatTexts()
    {
        std::vector<std::string> texts = {
            "0", "-0", "+0", "0.", ".5", "-.5", "+.5", ".", "-", "+", "", " ", "e5", ".e5", "1e", "1e+", "1e-", "1E5",
            "1.e5", "1.5e+3x", "  \t\v\f\r\n 2.5", "-+1", "+-1", "1,5", "0.1", "0.2", "0.3", "0.7", "3.14159274",
            "16777216", "16777217", "16777219", "33554433", "0.000000", "123456.789012", "-999999.999999",
            "3.4028234e38", "3.40282356e38", "3.4028236e38", "1e39", "-1e39", "1e-38", "1.17549435e-38",
            "1.1754942e-38", "1.4e-45", "1.401298464324817e-45", "7e-46", "7.006492321624086e-46", "7.1e-46",
            "1e-46", "1e-50", "-1e-50", "2.5e-40", "1e-400", "1e400", "0e999999999", "1e-999999999",
            "0.0000000000000000000000000000000000000000000000000001e52",
            "1.000000059604644775390625", "1.00000005960464477539062", "1.00000005960464477539063",
            "123456789012345678901234567890", "0.30000001192092895507812500000000000000000001",
            "00000000000000000000000000001.5", "0x1.8p3", "0X10", "0x", "0xg", "-0x1p-3", "inf", "-INF", "+Infinity",
            "infinit", "nan", "-NaN", "nan(123)", "nan(", "0.5\n", "2.5 3.5", "1e5e5", "1..5"};
        std::mt19937_64 random(20261125);
        const char* formats[] = {"%.9g", "%.17g", "%f", "%e", "%.3f", "%.12e", "%a", "%.20f"};
        for (int i = 0; i < 3000; ++i)
        {
            uint32_t bits = (uint32_t)random();
            float value;
            std::memcpy(&value, &bits, 4);
            char text[512];
            std::snprintf(text, sizeof text, formats[i % 8], double(value));
            texts.push_back(text);
        }
        // Decimal digits with the point anywhere and an exponent, none, or a signed one.
        for (int i = 0; i < 3000; ++i)
        {
            std::string text = (random() % 3 == 0) ? "-" : (random() % 5 == 0) ? "+" : "";
            int digits = 1 + int(random() % 40), point = int(random() % (digits + 1));
            for (int d = 0; d < digits; ++d)
                text += (d == point ? "." : "") + std::string(1, char('0' + random() % 10));
            if (random() % 2)
                text += (random() % 2 ? "e" : "E") + std::string(random() % 2 ? "-" : random() % 2 ? "+" : "") +
                        std::to_string(random() % 60);
            texts.push_back(text);
        }
        return texts;
    }
}

UNIT_TEST_SUITE(ObjNumberScan)
{
    TEST_FIXTURE(TowardZeroFixture, ScanFloat_EveryTextGivesStrtofsBitsAndStopsWhereItStops)
    {
        int mismatches = 0;
        for (const std::string& text : FloatTexts())
        {
            float expected = -1.0f, got = -1.0f;
            char* expectedEnd;
            expected = std::strtof(text.c_str(), &expectedEnd);
            const char* end = ObjNumberScan::FloatScanner().Scan(text.data(), text.data() + text.size(), &got);
            bool converted = expectedEnd != text.c_str();
            bool same = converted ? end == expectedEnd && Bits(got) == Bits(expected) : end == nullptr && got == -1.0f;
            if (!same && ++mismatches <= 5)
                CHECK_EQUAL("strtof(" + text + ") = " + std::to_string(Bits(expected)) + " ending at " +
                                std::to_string(expectedEnd - text.c_str()),
                            "strtof(" + text + ") = " + std::to_string(Bits(got)) + " ending at " +
                                std::to_string(end ? end - text.data() : 0));
        }
        CHECK_EQUAL(0, mismatches);
    }

    TEST(ScanFloat_StopsAtTheEndOfItsPiece)
    {
        ObjNumberScan::FloatScanner scanner;
        const char text[] = "1.5e10 7";
        float value = 0;
        CHECK_EQUAL(text + 3, scanner.Scan(text, text + 4, &value));
        CHECK_EQUAL(1.5f, value);
        CHECK(scanner.Scan(text + 6, text + 7, &value) == nullptr);
        // The rare forms go through a zero-terminated copy of the piece, which ends there too.
        const char hex[] = "0x1p4 and more";
        CHECK_EQUAL(hex + 3, scanner.Scan(hex, hex + 3, &value));
        CHECK_EQUAL(1.0f, value);
    }

    TEST_FIXTURE(TowardZeroFixture, FloatScanner_ReadsToNearestAndRestoresTheCallersState)
    {
        unsigned before = _mm_getcsr();
        const char tenth[] = "0.1", huge[] = "1e39";
        float value = 0, clamped = 0;
        {
            ObjNumberScan::FloatScanner scanner;
            CHECK_EQUAL(0u, _mm_getcsr() & 0xE040u);
            scanner.Scan(tenth, tenth + 3, &value);
            scanner.Scan(huge, huge + 4, &clamped);
            CHECK_EQUAL(0u, _mm_getcsr() & 0xE040u);
        }
        CHECK_EQUAL(before, _mm_getcsr());
        CHECK_EQUAL(Bits(0.1f), Bits(value));
        // Out of range, strtof answers in the caller's rounding: toward zero stops at the largest float.
        CHECK_EQUAL(Bits(FLT_MAX), Bits(clamped));
    }

    TEST(ScanUnsigned_EveryTextGivesStrtoulsValueModulo2To32)
    {
        std::vector<std::string> texts = {"0", "7", "+7", "-1", "-0", "  \t12/", "4294967295", "4294967296", "4294967297",
                                          "18446744073709551615", "18446744073709551616", "-18446744073709551615",
                                          "-18446744073709551616", "99999999999999999999999", "", "-", "+", "/1",
                                          "x1", "0x10", "007", "1 2", "- 1", "12345678901", "\v\f\r\n 42", "\n5"};
        std::mt19937_64 random(7);
        for (int i = 0; i < 2000; ++i)
        {
            std::string text = (random() % 4 == 0) ? "-" : "";
            for (int d = 0, digits = 1 + int(random() % 24); d < digits; ++d)
                text += char('0' + random() % 10);
            texts.push_back(text + "/");
        }
        int mismatches = 0;
        for (const std::string& text : texts)
        {
            char* expectedEnd;
            uint32_t expected = (uint32_t)std::strtoul(text.c_str(), &expectedEnd, 10);
            uint32_t got = 12345;
            const char* end = ObjNumberScan::ScanUnsigned(text.data(), text.data() + text.size(), &got);
            bool converted = expectedEnd != text.c_str();
            bool same = converted ? end == expectedEnd && got == expected : end == nullptr && got == 12345;
            if (!same && ++mismatches <= 5)
                CHECK_EQUAL("strtoul(" + text + ") = " + std::to_string(expected), "strtoul(" + text + ") = " + std::to_string(got));
        }
        CHECK_EQUAL(0, mismatches);
        const char bounded[] = "12345";
        uint32_t value = 0;
        CHECK_EQUAL(bounded + 2, ObjNumberScan::ScanUnsigned(bounded, bounded + 2, &value));
        CHECK_EQUAL(12u, value);
    }
}
