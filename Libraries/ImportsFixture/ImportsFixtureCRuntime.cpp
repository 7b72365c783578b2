// Characters, strings, number parsing and locale.
#include "ImportsFixture.h"

namespace
{
    int CheckCharacters()
    {
        FIXTURE_CHECK(isdigit('7') == 1 && isdigit('a') == 0 && isdigit(0x130) == 1);
        FIXTURE_CHECK(isalpha('k') == 1 && isalpha('K') == 1 && isalpha('[') == 0);
        FIXTURE_CHECK(isspace(' ') == 1 && isspace('\r') == 1 && isspace(0x120) == 1 && isspace('x') == 0);
        FIXTURE_CHECK(isalnum('4') == 1 && isalnum('-') == 0);
        FIXTURE_CHECK(__isascii(127) == 1 && __isascii(200) == 0);
        FIXTURE_CHECK(isxdigit('F') != 0 && isxdigit('G') == 0);
        FIXTURE_CHECK(tolower('Q') == 'q' && toupper('q') == 'Q');
        return 0;
    }

    int CheckStrings()
    {
        char text[] = "one,two,three";
        FIXTURE_CHECK(strchr(text, ',') == text + 3 && strrchr(text, ',') == text + 7);
        FIXTURE_CHECK(strstr(text, "two") == text + 4 && strstr(text, "four") == nullptr);
        FIXTURE_CHECK(strcmp("abc", "abc") == 0 && strcmp("abc", "abd") < 0);
        FIXTURE_CHECK(strncmp("abcX", "abcY", 3) == 0);
        FIXTURE_CHECK(_stricmp("Hello", "hELLO") == 0 && _strnicmp("HELLOx", "helloy", 5) == 0);
        char* copy = _strdup(text);
        FIXTURE_CHECK(copy != text && Fixture::SameText(copy, text));
        free(copy);
        FIXTURE_CHECK(_mbstrlen("a\xC3\xA9") == 3);
        return 0;
    }

    int CheckNumbersAndLocale()
    {
        FIXTURE_CHECK(atoi(" -42x") == -42);
        FIXTURE_CHECK(atof("0.125") == 0.125);
        const char* locale = setlocale(6, "C");  // the host's LC_ALL number, passed through
        FIXTURE_CHECK(locale != nullptr && Fixture::SameText(locale, "C"));
        return 0;
    }
}

FIXTURE_EXPORT int ImportsFixture_TestCRuntime()
{
    if (int line = CheckCharacters())
        return line;
    if (int line = CheckStrings())
        return line;
    return CheckNumbersAndLocale();
}
