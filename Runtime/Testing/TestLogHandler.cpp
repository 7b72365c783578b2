// The log entry handler of a test run and the switch that lets a test's log output through.

#include "Runtime/Testing/NativeTestReporter.h"
#include "Runtime/Testing/Testing.h"
#include "Runtime/Threads/Mutex.h"

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
}

bool LogEntryHandlerForTests(LogType type, const char* format, va_list args)
{
    Mutex::AutoLock lock(gLogEntryMutex());
    const std::string message = FormatLogString(format, args);
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
