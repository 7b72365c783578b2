#include "Runtime/Testing/Testing.h"

#include "Runtime/Utilities/Word.h"

UNIT_TEST_SUITE(Word)
{
    TEST(StrICmp_FoldsAsciiOnly_AndOrdersLikeStrcmp)
    {
        CHECK_EQUAL(0, StrICmp("BatchMode", "batchmode"));
        CHECK(StrICmp("abc", "ABD") < 0);
        CHECK(StrICmp("abcd", "ABC") > 0);
        CHECK(StrICmp("", "a") < 0);
        CHECK(StrICmp("\xC9", "\xE9") != 0);  // no folding outside ASCII
        CHECK(StrICmp("[", "a") < 0);         // '[' sorts before letters, as after lower-casing
    }

    TEST(BeginsWith_CaseSensitiveAndInsensitive)
    {
        CHECK(BeginsWith("DISABLED_Test", "DISABLED_"));
        CHECK(!BeginsWith("disabled_Test", "DISABLED_"));
        CHECK(!BeginsWith("RU", "RUN_"));
        CHECK(BeginsWith("x", ""));
        CHECK(BeginsWithCaseInsensitive("Performance", "perf"));
        CHECK(!BeginsWithCaseInsensitive("Per", "perf"));
    }

    TEST(ToLower_ChangesOnlyAsciiCapitals)
    {
        CHECK_EQUAL("mixed_case-123 \xC9", ToLower("MiXeD_Case-123 \xC9"));
        CHECK_EQUAL('z', ToLower('Z'));
        CHECK_EQUAL('@', ToLower('@'));
    }
}
