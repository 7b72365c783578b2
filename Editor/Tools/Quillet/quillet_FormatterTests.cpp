#include "Runtime/Testing/Testing.h"

#include "Editor/Tools/Quillet/quillet_ImportsTestSupport.h"

#include <errno.h>
#include <string.h>

#include <bit>
#include <string>
#include <vector>

using namespace QuilletTest;

namespace
{
    typedef WinFn<int, char*, unsigned long, const char*, char*> VsnprintfFn;
    typedef int(__attribute__((ms_abi)) * SprintfFn)(char*, unsigned long, const char*, ...);

    // One 8-byte slot of a Windows argument list.
    uint64_t D(double value) { return std::bit_cast<uint64_t>(value); }
    uint64_t P(const void* pointer) { return reinterpret_cast<uint64_t>(pointer); }

    struct FormatRow
    {
        const char* format;
        std::vector<uint64_t> slots;
        const char* expected;
        int length = -1;  // the result when the text is cut at the buffer's end; else its length
    };

    const FormatRow kRows[] = {
        {"abcdef", {}, "abcdef"},
        // Integers: flags, widths, precisions.
        {"%05d", {uint64_t(-42)}, "-0042"},
        {"%-5d|", {42}, "42   |"},
        {"%+d", {0}, "+0"},
        {"% d", {5}, " 5"},
        {"%-+5d|", {3}, "+3   |"},
        {"%5.3d", {7}, "  007"},
        {"%.3x", {0}, "000"},
        {"%-05d|", {42}, "00042|"},  // zero-padding wins over left-justify
        {"%*d|", {5, 42}, "   42|"},
        {"%*d|", {uint64_t(-5), 42}, "42|"},  // a negative width pads nothing
        {"%x", {255}, "ff"},
        {"%#x", {255}, "ff"},
        {"%X", {0xBEEF}, "BEEF"},
        {"%o", {8}, "10"},
        {"%u", {0xFFFFFFFF}, "4294967295"},
        // Argument widths: 32 bits from the low half of the slot unless the length says 64.
        {"%d", {0xFFFFFFFF00000005ull}, "5"},
        {"%d", {0xFFFFFFFEull}, "-2"},
        {"%hd", {70000}, "70000"},
        {"%ld", {0x100000005ull}, "4294967301"},
        {"%jd", {0x100000005ull}, "4294967301"},
        {"%ju", {0x100000005ull}, "5"},
        {"%zu", {0x100000005ull}, "4294967301"},
        {"%lld", {0x8000000000000000ull}, "-9223372036854775808"},
        {"%llu", {0xFFFFFFFFFFFFFFFFull}, "8446744073709551615"},  // only the lowest 19 digits
        {"%p", {0xABC}, "abc"},
        {"%p", {0x8000000000000001ull}, "-7fffffffffffffff"},
        // Floating point: fixed-point only, halves round up.
        {"%08.2f", {D(-1.5)}, "-001.50"},  // one narrower than the width: the sign counts twice
        {"%+08.2f", {D(1.5)}, "+001.50"},
        {"%8.2f", {D(-1.5)}, "   -1.50"},
        {"%08.3f", {D(2.5)}, "0002.500"},
        {"%-8.3f|", {D(2.0)}, "2.000   |"},
        {"%.1f", {D(0.25)}, "0.3"},
        {"%.3f", {D(0.0005)}, "0.001"},
        {"%.0f", {D(2.5)}, "3"},
        {"%.2f", {D(9.999)}, "10.00"},
        {"%e", {D(1234.5)}, "1234.500000"},
        {"%E", {D(0.5)}, "0.500000"},
        {"%G", {D(0.5)}, "0.500000"},
        {"%Lf", {D(2.0)}, "2.000000"},
        {"%f", {D(-0.0)}, "0.000000"},
        {"%+.2f", {D(1.0)}, "+1.00"},
        {"%.20f", {D(1.0)}, "1.0000000000000000"},  // precision capped at 16
        {"%.*f", {2, D(3.14159)}, "3.14"},
        {"%.*f", {uint64_t(-1), D(0.5)}, "0.500000"},  // -1 is "none given": the default 6
        {"%5.*f|", {uint64_t(-2), D(2.5)}, "     3|"},  // other negatives: no point, wider padding
        {"%f", {D(123456789.125)}, "123456789.125000"},
        {"%.0f", {D(1e20)}, "100000000000000000000"},
        // Strings and characters.
        {"%s", {0}, "(NULL)"},
        {"%.s", {P("abc")}, "abc"},
        {"%5.3s", {P("abcdefg")}, "abcde"},  // the width raises the precision
        {"%10s|", {P("abc")}, "       abc|"},
        {"%-6s|", {P("ab")}, "ab    |"},
        {"%.2s", {P("abc")}, "ab"},
        {"%c%c", {'O', 'K'}, "OK"},
        {"%3c|", {'x'}, "x|"},
        // Beyond about 9.2e117 my_modf gives up after 100 rounds and the integer part reads 0.
        // (The fraction of such a value is beyond 64 bits too: its digits come out as zeros.)
        {"%.0f", {D(9e117)}, "90000000000000550000000000000000000000000000000", 118},  // cut at 47
        {"%.0f", {D(9.3e117)}, "0"},
        {"%f", {D(1e118)}, "0.0000000000000000000"},
        {"%.2f|%d", {D(-1e300), 7}, "-0.0000000000000000000|7"},
        // Windows spellings it does not know: "I64" is no length (the "I" ends the conversion and
        // "64d" is text), "S" and "a" convert nothing; none of them takes an argument.
        {"%I64d|%d", {5, 6}, "64d|5"},
        {"%S|%d", {7}, "|7"},
        {"%a|%d", {7}, "|7"},
        {"%A|%d", {7}, "|7"},
        // "l" does not widen "s": the argument is read as 8-bit text, so UTF-16 stops after one letter.
        {"%ls|%5ls", {P("abc"), P(u"xy")}, "abc|    x"},
        // Everything else.
        {"%%|%5%", {}, "%|%"},
        {"a%wXb", {}, "ab"},
        {"a%w", {}, "a"},
        {"a%qb", {}, "ab"},
        {"trailing %-", {}, "trailing "},
    };

    const size_t kBufferSize = 64;
    const char kCanary = '#';

    struct Formatted
    {
        int result;
        std::string text;
        bool canaryIntact;
    };

    // Formats with _vsnprintf through the table into a canary-filled buffer of `count` bytes (and
    // canary bytes beyond), and checks that nothing after the terminator was written.
    Formatted Vsnprintf(const char* format, std::vector<uint64_t> slots, size_t count = 48)
    {
        char buffer[kBufferSize];
        memset(buffer, kCanary, sizeof buffer);
        auto vsnprintf = reinterpret_cast<VsnprintfFn>(FindImport("_vsnprintf"));
        slots.push_back(0);  // keep data() valid for an empty list
        int result = vsnprintf(buffer, count, format, reinterpret_cast<char*>(slots.data()));
        size_t end = count == 0 ? 0 : strnlen(buffer, count) + 1;
        bool intact = true;
        for (size_t i = end; i < sizeof buffer; ++i)
            intact = intact && buffer[i] == kCanary;
        return {result, count == 0 ? std::string() : std::string(buffer), intact};
    }

    // One line naming the format, so that a failing row of the table identifies itself.
    std::string Describe(const char* format, const Formatted& formatted)
    {
        return std::string(format) + " -> \"" + formatted.text + "\" (" + std::to_string(formatted.result) +
               (formatted.canaryIntact ? ")" : ", wrote past the terminator)");
    }
}

UNIT_TEST_SUITE(QuilletFormatter)
{
    TEST(Vsnprintf_FormatsEveryRowOfTheTable)
    {
        for (const FormatRow& row : kRows)
        {
            Formatted formatted = Vsnprintf(row.format, row.slots);
            int length = row.length >= 0 ? row.length : static_cast<int>(strlen(row.expected));
            Formatted expected = {length, row.expected, true};
            CHECK_EQUAL(Describe(row.format, expected), Describe(row.format, formatted));
        }
    }

    TEST(Vsnprintf_TruncatesButReturnsTheFullLength)
    {
        Formatted four = Vsnprintf("abcdef", {}, 4);
        CHECK_EQUAL("abc", four.text);
        CHECK_EQUAL(6, four.result);
        CHECK(four.canaryIntact);

        Formatted none = Vsnprintf("abcdef", {}, 0);
        CHECK_EQUAL(6, none.result);
        CHECK(none.canaryIntact);  // not even a terminator

        Formatted one = Vsnprintf("%d", {12345}, 1);
        CHECK_EQUAL("", one.text);
        CHECK_EQUAL(5, one.result);
        CHECK(one.canaryIntact);
    }

    TEST(Vsnprintf_CharacterOnAFullBuffer_LeavesItsSlotForTheNextConversion)
    {
        // At "%c" the buffer of 3 is full, so "%d" reads 'X' (88): the count is 3 + 1 + 2.
        Formatted formatted = Vsnprintf("abc%c%d", {'X', 7}, 3);
        CHECK_EQUAL("ab", formatted.text);
        CHECK_EQUAL(6, formatted.result);
        CHECK(formatted.canaryIntact);
    }

    TEST(Vsnprintf_CountConversion_StoresTheWidthOfItsLengthClass)
    {
        int32_t count32 = -1;
        uint64_t count16 = 0xFFFFFFFFFFFFFFFFull;
        int64_t count64 = -1;
        CHECK_EQUAL(6, Vsnprintf("abc%nde%hnf%ln", {P(&count32), P(&count16), P(&count64)}).result);
        CHECK_EQUAL(3, count32);
        CHECK_EQUAL(0xFFFFFFFFFFFF0005ull, count16);  // only the low 16 bits are written
        CHECK_EQUAL(6, count64);

        // "z" and "j" store 64 bits as well.
        int64_t countZ = -1, countJ = -1;
        CHECK_EQUAL(4, Vsnprintf("ab%znc%jnd", {P(&countZ), P(&countJ)}).result);
        CHECK_EQUAL(2, countZ);
        CHECK_EQUAL(3, countJ);
    }

    TEST(SprintfS_ReadsArgumentsFromRegistersAndTheCallersStack)
    {
        auto sprintfS = reinterpret_cast<SprintfFn>(FindImport("sprintf_s"));
        char buffer[kBufferSize];
        memset(buffer, kCanary, sizeof buffer);
        int result = sprintfS(buffer, 48, "%d %s %.2f %c %x %.1f %lld %s", 1, "two", 3.0, '4', 0x5, 6.5, 7ll, "end");
        CHECK_EQUAL("1 two 3.00 4 5 6.5 7 end", buffer);
        CHECK_EQUAL(24, result);
        CHECK_EQUAL(kCanary, buffer[25]);

        // A double as the very first variadic argument travels in a register and its home slot.
        CHECK_EQUAL(4, sprintfS(buffer, 48, "%.2f", 0.5));
        CHECK_EQUAL("0.50", buffer);
    }

    TEST(Vsnprintf_OutputReachingTheLimit_FailsWithErange)
    {
        // 0x7FFFFFFE characters are still counted; one more ends formatting with -1 and ERANGE.
        char buffer[8];
        memset(buffer, kCanary, sizeof buffer);
        CHECK_EQUAL(0x7FFFFFFE, Vsnprintf("%*d", {0x7FFFFFFE, 1}, 0).result);
        errno = 0;
        auto vsnprintf = reinterpret_cast<VsnprintfFn>(FindImport("_vsnprintf"));
        uint64_t slots[] = {0x7FFFFFFE, 1};
        CHECK_EQUAL(-1, vsnprintf(buffer, sizeof buffer, "%*dx", reinterpret_cast<char*>(slots)));
        CHECK_EQUAL(ERANGE, errno);
        CHECK_EQUAL(' ', buffer[sizeof buffer - 1]);  // no terminator was stored
    }
}
