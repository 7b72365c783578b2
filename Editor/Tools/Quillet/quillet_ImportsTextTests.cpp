#include "Runtime/Testing/Testing.h"

#include "Editor/Tools/Quillet/quillet_ImportsTestSupport.h"
#include "Runtime/Testing/ChildProcess.h"

#include <signal.h>
#include <string.h>

#include <string>

using namespace QuilletTest;

namespace
{
    typedef WinFn<int, unsigned int, unsigned int, const char*, int, uint16_t*, int> MultiByteToWideCharFn;
    typedef WinFn<int, unsigned int, unsigned int, const uint16_t*, int, char*, int, const char*, int*> WideCharToMultiByteFn;

    const uint16_t kWideCanary = 0xCDCD;
    const char kByteCanary = '#';

    struct Conversions
    {
        MultiByteToWideCharFn toWide = reinterpret_cast<MultiByteToWideCharFn>(FindImport("MultiByteToWideChar"));
        WideCharToMultiByteFn toBytes = reinterpret_cast<WideCharToMultiByteFn>(FindImport("WideCharToMultiByte"));
        uint16_t wide[16];
        char bytes[32];

        Conversions()
        {
            for (uint16_t& unit : wide)
                unit = kWideCanary;
            memset(bytes, kByteCanary, sizeof bytes);
        }
    };

    bool AbortedWith(const Testing::ChildResult& result, const std::string& report)
    {
        return !result.exited && result.termSignal == SIGABRT && result.err.find(report) != std::string::npos;
    }
}

UNIT_TEST_SUITE(QuilletImportsText)
{
    TEST_FIXTURE(Conversions, MultiByteToWideChar_Utf8WithTerminator_CountsTheTerminator)
    {
        // "h", "é" (2 bytes), "€" (3 bytes), U+1F600 (4 bytes, a surrogate pair), terminator.
        const char text[] = "h\xC3\xA9\xE2\x82\xAC\xF0\x9F\x98\x80";
        CHECK_EQUAL(6, toWide(65001, 0, text, -1, wide, 16));
        const uint16_t expected[] = {'h', 0xE9, 0x20AC, 0xD83D, 0xDE00, 0, kWideCanary};
        CHECK_ARRAY_EQUAL(expected, wide, 7);
    }

    TEST_FIXTURE(Conversions, MultiByteToWideChar_ExplicitLength_ConvertsExactlyThatManyBytes)
    {
        CHECK_EQUAL(3, toWide(65001, 0, "abcdef", 3, wide, 3));
        const uint16_t expected[] = {'a', 'b', 'c', kWideCanary};
        CHECK_ARRAY_EQUAL(expected, wide, 4);
        CHECK_EQUAL(0, toWide(65001, 0, "abc", 0, wide, 16));
    }

    TEST_FIXTURE(Conversions, MultiByteToWideChar_NullArgumentsAndIllegalInput_GiveZero)
    {
        CHECK_EQUAL(0, toWide(65001, 0, nullptr, -1, wide, 16));
        CHECK_EQUAL(0, toWide(65001, 0, "abc", -1, nullptr, 16));
        CHECK_EQUAL(0, toWide(65001, 0, "abc", -1, nullptr, 0));  // no counting mode
        CHECK_EQUAL(0, toWide(65001, 0, "a\xFF" "b", -1, wide, 16));
    }

    TEST_FIXTURE(Conversions, WideCharToMultiByte_DefaultCodePage_KeepsTheLowByte)
    {
        const uint16_t text[] = {'A', 0xE9, 0x4E2D, 0};
        int usedDefault = 7;
        CHECK_EQUAL(4, toBytes(0, 0, text, -1, bytes, 32, nullptr, &usedDefault));
        CHECK_EQUAL(0, usedDefault);
        const char expected[] = {'A', '\xE9', 0x2D, 0, kByteCanary};
        CHECK_ARRAY_EQUAL(expected, bytes, 5);
        CHECK_EQUAL(0, toBytes(0, 0, text, 0, bytes, 32, nullptr, nullptr));
    }

    TEST_FIXTURE(Conversions, WideCharToMultiByte_Utf8_EncodesSurrogatePairs)
    {
        const uint16_t text[] = {'h', 0xE9, 0xD83D, 0xDE00, 0};
        int usedDefault = 7;
        CHECK_EQUAL(8, toBytes(65001, 0, text, -1, bytes, 32, nullptr, &usedDefault));
        CHECK_EQUAL(0, usedDefault);
        CHECK_EQUAL(std::string("h\xC3\xA9\xF0\x9F\x98\x80"), std::string(bytes));
        CHECK_EQUAL(kByteCanary, bytes[8]);
        CHECK_EQUAL(3, toBytes(65001, 0, text, 2, bytes + 16, 3, nullptr, nullptr));  // "h", "é"
        CHECK_EQUAL(kByteCanary, bytes[16 + 3]);
    }

    TEST_FIXTURE(Conversions, WideCharToMultiByte_NullArguments_GiveZero)
    {
        const uint16_t text[] = {'a', 0};
        CHECK_EQUAL(0, toBytes(65001, 0, nullptr, -1, bytes, 32, nullptr, nullptr));
        CHECK_EQUAL(0, toBytes(65001, 0, text, -1, nullptr, 32, nullptr, nullptr));
        CHECK_EQUAL(kByteCanary, bytes[0]);
        // No counting mode: a null output of size 0 passes the checks, so the flag is still
        // cleared, and then gets 0 in either code page.
        for (unsigned int codePage : {0u, 65001u})
        {
            int usedDefault = 7;
            CHECK_EQUAL(0, toBytes(codePage, 0, text, -1, nullptr, 0, nullptr, &usedDefault));
            CHECK_EQUAL(0, usedDefault);
        }
    }

    TEST(UnsupportedCodePages_StopTheProcessWithTheAssertionReport)
    {
        const char* toWideReport = "Editor/Tools/Quillet/quillet_KnownImports:1091: "
                                   "int MultiByteToWideChar_impl(UINT, DWORD, const char*, int, short unsigned int*, int): "
                                   "Assertion `false' failed.";
        const char* toBytesReport = "Editor/Tools/Quillet/quillet_KnownImports:1145: "
                                    "int WideCharToMultiByte_impl(UINT, DWORD, const short unsigned int*, int, char*, int, const char*, BOOL*): "
                                    "Assertion `false' failed.";
        // With an output buffer, and with a null output of size 0, which is no way around the check.
        for (bool withOutput : {true, false})
        {
            Testing::ChildResult toWide = Testing::RunInChildProcess([withOutput] {
                uint16_t out[8];
                reinterpret_cast<MultiByteToWideCharFn>(FindImport("MultiByteToWideChar"))(
                    0, 0, "abc", -1, withOutput ? out : nullptr, withOutput ? 8 : 0);
            });
            CHECK(AbortedWith(toWide, toWideReport));

            Testing::ChildResult toBytes = Testing::RunInChildProcess([withOutput] {
                const uint16_t text[] = {'a', 0};
                char out[8];
                reinterpret_cast<WideCharToMultiByteFn>(FindImport("WideCharToMultiByte"))(
                    1252, 0, text, -1, withOutput ? out : nullptr, withOutput ? 8 : 0, nullptr, nullptr);
            });
            CHECK(AbortedWith(toBytes, toBytesReport));
        }
    }
}
