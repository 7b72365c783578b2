// Known imports, C-runtime area: character classes, strings, number parsing, locale and
// environment. Included by quillet_KnownImports.cpp only.

namespace
{
    // --- Characters ---------------------------------------------------------------------------
    // The first five are computed without the host library or its locale. Only the low 8 bits of
    // the difference are compared, so 0x130 counts as a digit: the DLLs rely on exactly this.

    inline bool LowByteAtMost(int difference, unsigned int limit)
    {
        return static_cast<unsigned char>(difference) <= limit;
    }

    inline bool IsDigitByte(int c) { return LowByteAtMost(c - 0x30, 9); }
    inline bool IsAlphaByte(int c) { return LowByteAtMost((c & ~0x20) - 0x41, 25); }

    QUILLET_WINAPI int __isascii_impl(int c) { return (c & ~0x7F) == 0; }
    QUILLET_WINAPI int isdigit_impl(int c) { return IsDigitByte(c); }
    QUILLET_WINAPI int isalpha_impl(int c) { return IsAlphaByte(c); }
    QUILLET_WINAPI int isalnum_impl(int c) { return IsDigitByte(c) || IsAlphaByte(c); }

    // Tab, line feed, vertical tab, form feed, carriage return, or a space in the low byte.
    QUILLET_WINAPI int isspace_impl(int c) { return LowByteAtMost(c - 9, 4) || static_cast<unsigned char>(c) == 0x20; }

    // The host's class table covers -128 to 255 only; a value outside (a wide character, say) is
    // no hex digit rather than a read far outside that table.
    QUILLET_WINAPI int isxdigit_impl(int c) { return c >= -128 && c <= 255 ? isxdigit(c) : 0; }
    QUILLET_WINAPI int tolower_impl(int c) { return tolower(c); }
    QUILLET_WINAPI int toupper_impl(int c) { return toupper(c); }

    // --- Strings ------------------------------------------------------------------------------

    QUILLET_WINAPI char* strchr_impl(char* str, int ch) { return strchr(str, ch); }
    QUILLET_WINAPI char* strrchr_impl(char* str, int ch) { return strrchr(str, ch); }
    QUILLET_WINAPI char* strstr_impl(char* str, const char* subStr) { return strstr(str, subStr); }
    QUILLET_WINAPI int strcmp_impl(const char* a, const char* b) { return strcmp(a, b); }
    QUILLET_WINAPI int strncmp_impl(const char* a, const char* b, unsigned long maxCount) { return strncmp(a, b, maxCount); }
    QUILLET_WINAPI int _stricmp_impl(const char* a, const char* b) { return strcasecmp(a, b); }
    QUILLET_WINAPI int _strnicmp_impl(const char* a, const char* b, unsigned long maxCount) { return strncasecmp(a, b, maxCount); }

    // The copy is host heap memory, which the DLL gives back through free.
    QUILLET_WINAPI char* _strdup_impl(const char* s) { return strdup(s); }

    // Multi-byte characters are not recognised: the length in bytes.
    QUILLET_WINAPI unsigned long _mbstrlen_impl(const char* s) { return strlen(s); }

    // --- Numbers, locale, environment ---------------------------------------------------------

    QUILLET_WINAPI int atoi_impl(const char* s) { return static_cast<int>(strtol(s, nullptr, 10)); }
    QUILLET_WINAPI double atof_impl(const char* s) { return strtod(s, nullptr); }

    // The category number is passed on untranslated between the Windows and host numberings.
    QUILLET_WINAPI char* setlocale_impl(int category, const char* locale) { return setlocale(category, locale); }
    QUILLET_WINAPI char* getenv_impl(const char* v) { return getenv(v); }
}
