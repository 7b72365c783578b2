#pragma once
// Test support: runs a piece of code with the log entry handler and a clean log handler replaced
// by recorders, and hands back what was logged. The previous handler is back in place before the
// caller checks anything, so that the test reporter's own output is never captured.

#include "Runtime/Logging/LogAssert.h"

#include <functional>
#include <string>
#include <vector>

namespace LogCapture
{
    struct Line
    {
        LogType type;
        std::string text;
    };

    struct Result
    {
        std::vector<Line> console;  // every line that reached printf_consolev
        std::vector<Line> clean;    // every call of the clean handlers
    };

    namespace Detail
    {
        inline Result*& Active()
        {
            static Result* active = nullptr;
            return active;
        }

        // Records and swallows the line, so that captured output stays off the console.
        inline bool RecordConsole(LogType type, const char* format, va_list args)
        {
            if (Active() != nullptr)
                Active()->console.push_back({type, FormatLogString(format, args)});
            return false;
        }

        inline bool RecordClean(LogType type, const char* format, va_list args)
        {
            if (Active() != nullptr)
                Active()->clean.push_back({type, FormatLogString(format, args)});
            return true;
        }
    }

    inline Result Capture(const std::function<void()>& body)
    {
        Result result;
        const LogEntryHandler previous = GetLogEntryHandler();
        Detail::Active() = &result;
        SetLogEntryHandler(Detail::RecordConsole);
        AddCleanLogEntryHandler(Detail::RecordClean);
        body();
        RemoveCleanLogEntryHandler(Detail::RecordClean);
        SetLogEntryHandler(previous);
        Detail::Active() = nullptr;
        return result;
    }
}
