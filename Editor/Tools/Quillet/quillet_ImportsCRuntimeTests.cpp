#include "Runtime/Testing/Testing.h"

#include "Editor/Tools/Quillet/quillet_ImportsTestSupport.h"

#include <locale.h>
#include <stdlib.h>
#include <string.h>

using namespace QuilletTest;

namespace
{
    int CharTest(const char* name, int c) { return Import<int, int>(name)(c); }
}

UNIT_TEST_SUITE(QuilletImportsCRuntime)
{
    TEST(CharacterClasses_CompareOnlyTheLowByteOfTheDifference)
    {
        CHECK_EQUAL(1, CharTest("isdigit", '0'));
        CHECK_EQUAL(1, CharTest("isdigit", '9'));
        CHECK_EQUAL(0, CharTest("isdigit", '/'));
        CHECK_EQUAL(0, CharTest("isdigit", ':'));
        CHECK_EQUAL(1, CharTest("isdigit", 0x130));

        CHECK_EQUAL(1, CharTest("isalpha", 'a'));
        CHECK_EQUAL(1, CharTest("isalpha", 'Z'));
        CHECK_EQUAL(0, CharTest("isalpha", '@'));
        CHECK_EQUAL(0, CharTest("isalpha", '['));
        CHECK_EQUAL(0, CharTest("isalpha", '`'));
        CHECK_EQUAL(0, CharTest("isalpha", '{'));
        CHECK_EQUAL(1, CharTest("isalpha", 0x141));

        CHECK_EQUAL(1, CharTest("isspace", ' '));
        CHECK_EQUAL(1, CharTest("isspace", '\t'));
        CHECK_EQUAL(1, CharTest("isspace", '\r'));
        CHECK_EQUAL(0, CharTest("isspace", 8));
        CHECK_EQUAL(0, CharTest("isspace", 14));
        CHECK_EQUAL(1, CharTest("isspace", 0x120));

        CHECK_EQUAL(1, CharTest("isalnum", '5'));
        CHECK_EQUAL(1, CharTest("isalnum", 'q'));
        CHECK_EQUAL(0, CharTest("isalnum", '_'));

        CHECK_EQUAL(1, CharTest("__isascii", 0));
        CHECK_EQUAL(1, CharTest("__isascii", 127));
        CHECK_EQUAL(0, CharTest("__isascii", 128));
        CHECK_EQUAL(0, CharTest("__isascii", -1));
    }

    TEST(HostCharacterFunctions_PassTheHostResultOn)
    {
        CHECK(CharTest("isxdigit", 'f') != 0);
        CHECK(CharTest("isxdigit", 'A') != 0);
        CHECK_EQUAL(0, CharTest("isxdigit", 'g'));
        CHECK_EQUAL(0, CharTest("isxdigit", 0x7FFFFFFF));  // far outside the host's table
        CHECK_EQUAL(0, CharTest("isxdigit", -0x7FFFFFFF));
        CHECK_EQUAL('a', CharTest("tolower", 'A'));
        CHECK_EQUAL('1', CharTest("tolower", '1'));
        CHECK_EQUAL('Z', CharTest("toupper", 'z'));
    }

    TEST(StrdupAndMbstrlen)
    {
        char* copy = Import<char*, const char*>("_strdup")("copy me");
        CHECK_EQUAL("copy me", copy);
        Import<void, void*>("free")(copy);  // host heap memory, released the DLL's way
        // Multi-byte characters are not recognised: "é" counts two bytes.
        CHECK_EQUAL(4u, (Import<unsigned long, const char*>("_mbstrlen")("a\xC3\xA9z")));
    }

    TEST(NumberParsing_AtoiTruncatesTo32BitsAndAtofParsesDoubles)
    {
        auto parseInt = Import<int, const char*>("atoi");
        CHECK_EQUAL(-12, parseInt("  -12abc"));
        CHECK_EQUAL(1, parseInt("4294967297"));  // 2^32 + 1 read as a long, then truncated
        CHECK_EQUAL(0, parseInt("x1"));
        CHECK_EQUAL(2500.0, (Import<double, const char*>("atof")("2.5e3")));
        CHECK_EQUAL(-0.125, (Import<double, const char*>("atof")(" -0.125xyz")));
    }

    TEST(Setlocale_PassesTheCategoryNumberUntranslated)
    {
        // LC_ALL is 6 on this host (0 on Windows): the number goes to the host as it is.
        auto setLocale = Import<char*, int, const char*>("setlocale");
        const char* result = setLocale(LC_ALL, "C");
        CHECK(result != nullptr);
        CHECK_EQUAL("C", result);
        CHECK(setLocale(12345, "C") == nullptr);  // no such host category
    }
}
