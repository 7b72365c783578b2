// Code-page conversion and formatted output: sprintf_s with register and stack arguments,
// _vsnprintf with an argument list built here.
#include <stdarg.h>

#include "ImportsFixture.h"

namespace
{
    int FormatList(char* buffer, size_t count, const char* format, ...)
    {
        va_list args;
        va_start(args, format);
        int result = _vsnprintf(buffer, count, format, args);
        va_end(args);
        return result;
    }

    int CheckConversion()
    {
        WCHAR wide[8];
        const char utf8[] = "a\xC3\xA9\xE2\x82\xAC";  // "a", "é", "€"
        FIXTURE_CHECK(MultiByteToWideChar(65001, 0, utf8, -1, wide, 8) == 4);
        FIXTURE_CHECK(wide[0] == 'a' && wide[1] == 0xE9 && wide[2] == 0x20AC && wide[3] == 0);

        char narrow[16];
        BOOL usedDefault = 5;
        FIXTURE_CHECK(WideCharToMultiByte(65001, 0, wide, -1, narrow, 16, nullptr, &usedDefault) == 7);
        FIXTURE_CHECK(usedDefault == 0 && Fixture::SameText(narrow, utf8));
        const WCHAR cjk[] = {0x4E2D, 0xE9, 0};
        FIXTURE_CHECK(WideCharToMultiByte(0, 0, cjk, -1, narrow, 16, nullptr, nullptr) == 3);
        FIXTURE_CHECK(narrow[0] == 0x2D && narrow[1] == '\xE9' && narrow[2] == 0);
        return 0;
    }

    int CheckSprintf()
    {
        char buffer[64];
        Fixture::Fill(buffer, '#', sizeof buffer);
        // Two doubles among eight arguments: some in registers, the rest on this function's stack.
        int n = sprintf_s(buffer, 48, "%d|%s|%.2f|%c|%x|%.1f|%lld|%s", 1, "two", 3.0, '4', 0x5, 6.5, 7ll, "end");
        FIXTURE_CHECK(n == 24 && Fixture::SameText(buffer, "1|two|3.00|4|5|6.5|7|end") && buffer[25] == '#');
        FIXTURE_CHECK(sprintf_s(buffer, 48, "%.3f", 0.25) == 5 && Fixture::SameText(buffer, "0.250"));
        FIXTURE_CHECK(sprintf_s(buffer, 4, "%s", "abcdef") == 6 && Fixture::SameText(buffer, "abc"));
        return 0;
    }

    int CheckVsnprintf()
    {
        char buffer[64];
        int n = FormatList(buffer, sizeof buffer, "%5.1f/%-4d/%u/%s/%08.2f", 2.25, 17, 4000000000u, "xy", -1.5);
        FIXTURE_CHECK(n == 32 && Fixture::SameText(buffer, "  2.3/17  /4000000000/xy/-001.50"));
        return 0;
    }
}

FIXTURE_EXPORT int ImportsFixture_TestText()
{
    if (int line = CheckConversion())
        return line;
    if (int line = CheckSprintf())
        return line;
    return CheckVsnprintf();
}
