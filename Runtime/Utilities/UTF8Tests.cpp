#include "Runtime/Testing/Testing.h"

#include "Runtime/Utilities/UTF8.h"

#include <cstring>
#include <string>
#include <vector>

namespace
{
    struct Utf16Result
    {
        bool ok;
        std::vector<uint16_t> units;
    };

    struct Utf8Result
    {
        bool ok;
        std::string bytes;
    };

    // Output buffers sized exactly as the wrappers assume, plus a guard that must stay untouched.
    const uint16_t kGuard16 = 0xBEEF;
    const char kGuard8 = '\x5A';

    Utf16Result ToUtf16(const std::string& text)
    {
        std::vector<uint16_t> out(text.size() + 1, kGuard16);
        int length = -1;
        const bool ok = ConvertUTF8toUTF16(text.data(), static_cast<int>(text.size()), out.data(), length);
        const bool guardIntact = out.back() == kGuard16;
        out.resize(length >= 0 ? static_cast<size_t>(length) : 0);
        return {ok && guardIntact, out};
    }

    Utf8Result ToUtf8(const std::vector<uint16_t>& units)
    {
        std::string out(4 * units.size() + 1, kGuard8);
        int length = -1;
        const bool ok = ConvertUTF16toUTF8(units.data(), static_cast<int>(units.size()), out.data(), length);
        const bool guardIntact = out.back() == kGuard8;
        out.resize(length >= 0 ? static_cast<size_t>(length) : 0);
        return {ok && guardIntact, out};
    }

    bool IllegalUtf8(const std::string& text)
    {
        std::vector<uint16_t> out(text.size() + 1);
        int length = 99;
        return !ConvertUTF8toUTF16(text.data(), static_cast<int>(text.size()), out.data(), length) && length == 0;
    }
}

UNIT_TEST_SUITE(UTF8)
{
    TEST(RoundTrip_AllEncodingLengths_IncludingSurrogatePair)
    {
        // "A", e-acute, a CJK character, U+1F600, and a terminating zero.
        const std::string text("A\xC3\xA9\xE4\xB8\xAD\xF0\x9F\x98\x80", 10);
        const std::string withZero = text + std::string(1, '\0');
        Utf16Result wide = ToUtf16(withZero);
        CHECK(wide.ok);
        const std::vector<uint16_t> expected = {0x41, 0xE9, 0x4E2D, 0xD83D, 0xDE00, 0};
        CHECK(wide.units == expected);
        Utf8Result narrow = ToUtf8(wide.units);
        CHECK(narrow.ok);
        CHECK(narrow.bytes == withZero);
    }

    TEST(Boundaries_OfEachEncodingLength_RoundTrip)
    {
        const std::vector<uint16_t> units = {0x7F, 0x80, 0x7FF, 0x800, 0xFFFF, 0xD800, 0xDC00, 0xDBFF, 0xDFFF};
        Utf8Result narrow = ToUtf8(units);
        CHECK(narrow.ok);
        CHECK_EQUAL(std::string("\x7F\xC2\x80\xDF\xBF\xE0\xA0\x80\xEF\xBF\xBF\xF0\x90\x80\x80\xF4\x8F\xBF\xBF"),
                    narrow.bytes);
        Utf16Result wide = ToUtf16(narrow.bytes);
        CHECK(wide.ok);
        CHECK(wide.units == units);
    }

    TEST(IllegalUtf8_FailsWithZeroLength)
    {
        CHECK(IllegalUtf8("\x80"));                  // stray continuation byte
        CHECK(IllegalUtf8("\xC0\xAF"));              // overlong two-byte form
        CHECK(IllegalUtf8("\xE0\x80\xAF"));          // overlong three-byte form
        CHECK(IllegalUtf8("\xF0\x8F\xBF\xBF"));      // overlong four-byte form
        CHECK(IllegalUtf8("\xED\xA0\x80"));          // encoded surrogate
        CHECK(IllegalUtf8("\xF4\x90\x80\x80"));      // above U+10FFFF
        CHECK(IllegalUtf8("\xF8\x88\x80\x80\x80"));  // five-byte form
        CHECK(IllegalUtf8("ok\xC3(z"));              // lead byte without its continuation
        CHECK(IllegalUtf8("\xFF"));
    }

    TEST(TruncatedUtf8_IsNotIllegal_PartialCharacterDropped)
    {
        Utf16Result wide = ToUtf16("ab\xE4\xB8");
        CHECK(wide.ok);
        CHECK(wide.units == std::vector<uint16_t>({'a', 'b'}));
    }

    TEST(Lenient_UnpairedSurrogatesPassThroughAsThreeBytes)
    {
        Utf8Result lowAlone = ToUtf8({0xDC00, 'x'});
        CHECK(lowAlone.ok);
        CHECK_EQUAL(std::string("\xED\xB0\x80x"), lowAlone.bytes);
        Utf8Result highThenLetter = ToUtf8({0xD800, 'y'});
        CHECK(highThenLetter.ok);
        CHECK_EQUAL(std::string("\xED\xA0\x80y"), highThenLetter.bytes);
    }

    TEST(Lenient_HighSurrogateAtEnd_IsDroppedNotIllegal)
    {
        Utf8Result narrow = ToUtf8({'z', 0xD83D});
        CHECK(narrow.ok);
        CHECK_EQUAL("z", narrow.bytes);
    }

    TEST(Strict_UnpairedSurrogatesAreIllegal_AndStopAtThem)
    {
        const uint16_t source[] = {'a', 0xDC00, 'b'};
        const uint16_t* in = source;
        uint8_t out[16];
        uint8_t* target = out;
        CHECK_EQUAL(sourceIllegal, ConvertUTF16toUTF8(&in, source + 3, &target, out + sizeof(out), strictConversion));
        CHECK(in == source + 1);
        CHECK(target == out + 1);
    }

    TEST(SmallTarget_ReportsTargetExhausted_WithoutSplittingCharacters)
    {
        const uint8_t source[] = {'a', 0xF0, 0x9F, 0x98, 0x80};
        const uint8_t* in = source;
        uint16_t out[2];
        uint16_t* target = out;
        CHECK_EQUAL(targetExhausted, ConvertUTF8toUTF16(&in, source + 5, &target, out + 2, lenientConversion));
        CHECK(in == source + 1);
        CHECK(target == out + 1);

        const uint16_t wide[] = {0x4E2D};
        const uint16_t* wideIn = wide;
        uint8_t bytes[2];
        uint8_t* bytesOut = bytes;
        CHECK_EQUAL(targetExhausted, ConvertUTF16toUTF8(&wideIn, wide + 1, &bytesOut, bytes + 2, lenientConversion));
        CHECK(bytesOut == bytes);
    }

    TEST(ZeroOrNegativeLength_ConvertsNothing)
    {
        uint16_t wide[1] = {kGuard16};
        int length = -1;
        CHECK(ConvertUTF8toUTF16("abc", 0, wide, length));
        CHECK_EQUAL(0, length);
        char narrow[1] = {kGuard8};
        const uint16_t source[] = {'a'};
        CHECK(ConvertUTF16toUTF8(source, -3, narrow, length));
        CHECK_EQUAL(0, length);
        CHECK_EQUAL(kGuard16, wide[0]);
        CHECK_EQUAL(kGuard8, narrow[0]);
    }
}
