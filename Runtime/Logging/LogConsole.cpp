// The console writer and the console file.

#include "Runtime/Logging/LogAssert.h"

#include <cstring>
#include <string>

namespace
{
    // Null until the first output, then standard output unless a specific file was opened.
    FILE* gConsoleFile = nullptr;
    bool gConsolePathSet = false;
    std::string s_ConsolePath;

    void WriteToConsole(const char* format, va_list args)
    {
        FILE* out = OpenConsole();
        if (out == nullptr)
            out = stdout;
        vfprintf(out, format, args);
        fflush(out);
    }
}

FILE* OpenConsole()
{
    if (gConsoleFile == nullptr)
        gConsoleFile = stdout;
    return gConsoleFile;
}

void LogOutputToSpecificFile(const char* path)
{
    if (path == nullptr)
        return;
    SetConsoleLogPath(path);
    if (gConsoleFile != nullptr && gConsoleFile != stdout)
        fclose(gConsoleFile);
    // A file that cannot be opened leaves the console file unset, so output goes to standard
    // output (OpenConsole), not to a file opened earlier.
    gConsoleFile = fopen(path, "w");
}

std::string GetConsoleLogPath()
{
    return gConsolePathSet ? s_ConsolePath : std::string();
}

void SetConsoleLogPath(const char* path)
{
    if (path == nullptr)
    {
        ClearConsoleLogPath();
        return;
    }
    s_ConsolePath = path;
    gConsolePathSet = true;
}

void SetConsoleLogPath(const std::string& path)
{
    SetConsoleLogPath(path.c_str());
}

void ClearConsoleLogPath()
{
    s_ConsolePath.clear();
    gConsolePathSet = false;
}

bool IsConsoleLogPathSet()
{
    return gConsolePathSet;
}

void printf_consolev(LogType logType, const char* format, va_list args)
{
    if (LogEntryHandler handler = GetLogEntryHandler())
    {
        // The handler consumes its own copy, so the arguments are still intact for the console.
        va_list handlerArgs;
        va_copy(handlerArgs, args);
        const bool print = handler(logType, format, handlerArgs);
        va_end(handlerArgs);
        if (!print)
            return;
    }
    WriteToConsole(format, args);
}

void printf_console(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    printf_consolev(kLogTypeDebug, format, args);
    va_end(args);
}

void printf_console_log(const char* format, va_list args)
{
    printf_consolev(kLogTypeLog, format, args);
}

void printf_console_log_error(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    printf_consolev(kLogTypeError, format, args);
    va_end(args);
}

void printf_console_log_assert(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    printf_consolev(kLogTypeAssert, format, args);
    va_end(args);
}

void printf_console_log_warning(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    printf_consolev(kLogTypeWarning, format, args);
    va_end(args);
}

void printf_console_log_plain(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    printf_consolev(kLogTypeLog, format, args);
    va_end(args);
}

std::string FormatLogString(const char* format, va_list args)
{
    va_list measure;
    va_copy(measure, args);
    const int length = vsnprintf(nullptr, 0, format, measure);
    va_end(measure);
    if (length < 0)
        return format;
    std::string text(static_cast<size_t>(length) + 1, '\0');
    va_list print;
    va_copy(print, args);
    vsnprintf(text.data(), text.size(), format, print);
    va_end(print);
    text.resize(static_cast<size_t>(length));
    return text;
}

void print_realstdout(const char* text, size_t length)
{
    fwrite(text, 1, length, stdout);
    fflush(stdout);
}

void ResetStdout()
{
}

void DebugTextLineByLine(const char* text, int maxLineLength)
{
    if (text == nullptr)
        return;
    const size_t limit = maxLineLength < 0 ? 1023 : static_cast<size_t>(maxLineLength > 0 ? maxLineLength : 1);
    auto isBreak = [](char c) { return c == '\r' || c == '\n'; };
    const char* p = text;
    while (isBreak(*p))
        ++p;
    while (*p != '\0')
    {
        const size_t lineLength = strcspn(p, "\r\n");
        for (size_t done = 0; done < lineLength; done += limit)
        {
            const size_t piece = lineLength - done < limit ? lineLength - done : limit;
            const std::string part(p + done, piece);
            printf_console("%s\n", part.c_str());
        }
        p += lineLength;
        while (isBreak(*p))
            ++p;
    }
}
