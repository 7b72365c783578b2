// The log entry handler of a test run and the switch that lets a test's log output through.

#include "Runtime/Testing/NativeTestReporter.h"
#include "Runtime/Testing/Testing.h"
#include "Runtime/Threads/Mutex.h"

#include <cstdio>
#include <string>

namespace Testing
{
namespace
{
    // Made on first use: log entries may arrive from static initialisers of other units.
    Mutex& gLogEntryMutex()
    {
        static Mutex mutex;
        return mutex;
    }

    std::string FormatLogMessage(const char* format, va_list args)
    {
        va_list measure;
        va_copy(measure, args);
        const int length = vsnprintf(nullptr, 0, format, measure);
        va_end(measure);
        if (length < 0)
            return format;
        std::string message(static_cast<size_t>(length) + 1, '\0');
        va_list print;
        va_copy(print, args);
        vsnprintf(message.data(), message.size(), format, print);
        va_end(print);
        message.resize(static_cast<size_t>(length));
        return message;
    }
}

bool LogEntryHandlerForTests(LogType type, const char* format, va_list args)
{
    Mutex::AutoLock lock(gLogEntryMutex());
    const std::string message = FormatLogMessage(format, args);
    NativeTestReporter* reporter = g_TestReporter;
    if (reporter == nullptr || !reporter->IsCurrentlyRunningTest())
        return true;
    if (type != kLogTypeException && type != kLogTypeDebug)
        reporter->ReportLogMessage(type, message);
    return !reporter->IsSuppressingLogOutput();
}

void EnableFullLogOutputForCurrentTest()
{
    if (g_TestReporter != nullptr)
        g_TestReporter->SetSuppressLogOutput(false);
}
}
