// Known imports, text area: code-page conversion and formatted output. Included by
// quillet_KnownImports.cpp only. Wide characters are 16-bit UTF-16 units.

// The host C library's assertion handler: prints "<program>: <file>:<line>: <function>: Assertion
// `<expression>' failed." and aborts. Declared here because <assert.h> hides it under NDEBUG.
extern "C" void __assert_fail(const char* assertion, const char* file, unsigned int line, const char* function) noexcept
    __attribute__((noreturn));

namespace
{
    const UINT kCodePageDefault = 0;
    const UINT kCodePageUtf8 = 65001;

    // An unsupported code page is a programming error in the DLL: stop the process with the
    // assertion report the DLLs' developers know from this function.
    [[noreturn]] void UnsupportedCodePage(unsigned int line, const char* function)
    {
        __assert_fail("false", "Editor/Tools/Quillet/quillet_KnownImports", line, function);
    }

    // Only UTF-8 is accepted. cchWideChar is not a bound: room for cbMultiByte units is assumed.
    // A null output with size 0 (the Windows counting mode) is not offered: it passes the checks
    // like any call, so an unsupported code page still stops the process, and then gets 0.
    QUILLET_WINAPI int MultiByteToWideChar_impl(UINT codePage, DWORD, const char* multiByteStr, int cbMultiByte,
                                                unsigned short* wideCharStr, int cchWideChar)
    {
        if (!multiByteStr)
            return 0;
        if (!wideCharStr && cchWideChar != 0)
            return 0;
        if (cbMultiByte < 0)
            cbMultiByte = static_cast<int>(strlen(multiByteStr)) + 1;  // the terminator is converted too
        if (codePage != kCodePageUtf8)
            UnsupportedCodePage(1091, "int MultiByteToWideChar_impl(UINT, DWORD, const char*, int, short unsigned int*, int)");
        if (!wideCharStr)
            return 0;

        int count = 0;
        return ConvertUTF8toUTF16(multiByteStr, cbMultiByte, wideCharStr, count) ? count : 0;
    }

    int WideLengthWithTerminator(const unsigned short* text)
    {
        int length = 0;
        while (text[length] != 0)
            ++length;
        return length + 1;
    }

    // Code page 0 keeps the low byte of every unit; UTF-8 is converted. cbMultiByte is not a bound.
    // As above, a null output with size 0 passes the checks and then gets 0.
    QUILLET_WINAPI int WideCharToMultiByte_impl(UINT codePage, DWORD, const unsigned short* wideCharStr, int cchWideChar,
                                                char* multiByteStr, int cbMultiByte, const char*, BOOL* usedDefaultChar)
    {
        if (!wideCharStr)
            return 0;
        if (!multiByteStr && cbMultiByte != 0)
            return 0;
        if (cchWideChar < 0)
            cchWideChar = WideLengthWithTerminator(wideCharStr);
        if (usedDefaultChar)
            *usedDefaultChar = 0;

        if (codePage == kCodePageDefault)
        {
            if (!multiByteStr)
                return 0;
            for (int i = 0; i < cchWideChar; ++i)
                multiByteStr[i] = static_cast<char>(wideCharStr[i] & 0xFF);
            return cchWideChar;
        }
        if (codePage != kCodePageUtf8)
            UnsupportedCodePage(1145, "int WideCharToMultiByte_impl(UINT, DWORD, const short unsigned int*, int, char*, int, const char*, BOOL*)");
        if (!multiByteStr)
            return 0;

        int count = 0;
        return ConvertUTF16toUTF8(wideCharStr, cchWideChar, multiByteStr, count) ? count : 0;
    }

    // `ap` is a Windows argument list built by the caller.
    QUILLET_WINAPI int _vsnprintf_impl(char* string, unsigned long count, const char* format, char* ap)
    {
        return dopr(string, count, format, ap);
    }

    // The Windows variadic convention stores the fourth argument in its home slot, right before
    // the caller's stack arguments, so the list starts there and continues on the caller's stack.
    QUILLET_WINAPI int sprintf_s_impl(char* string, unsigned long count, const char* format, ...)
    {
        __builtin_ms_va_list ap;
        __builtin_ms_va_start(ap, format);
        int result = dopr(string, count, format, ap);
        __builtin_ms_va_end(ap);
        return result;
    }
}
