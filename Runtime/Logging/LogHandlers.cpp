// The replaceable log entry handler, the clean handlers and the cleaned log file, and the
// per-type stack-trace settings.

#include "Runtime/Logging/LogAssert.h"

#include <algorithm>
#include <vector>

StackTraceLogType gStackTraceLogType[kLogTypeNumLevels] = {
    kStackTraceLogScriptOnly,  // kLogTypeError
    kStackTraceLogScriptOnly,  // kLogTypeAssert
    kStackTraceLogScriptOnly,  // kLogTypeWarning
    kStackTraceLogNone,        // kLogTypeLog
    kStackTraceLogScriptOnly,  // kLogTypeException
    kStackTraceLogScriptOnly,  // kLogTypeDebug
};

namespace
{
    LogEntryHandler gCurrentLogEntryHandler = nullptr;
    // Made on the first add and released by ReleaseLogHandlers.
    std::vector<LogEntryHandler>* gCleanLogEntryHandlers = nullptr;
    FILE* gCleanedLogFile = nullptr;

    bool DefaultCleanLogHandler(LogType, const char* format, va_list args)
    {
        if (gCleanedLogFile == nullptr)
            return true;
        vfprintf(gCleanedLogFile, format, args);
        fflush(gCleanedLogFile);
        return true;
    }

    bool IsValidLogType(LogType logType)
    {
        return logType >= 0 && logType < kLogTypeNumLevels;
    }
}

void SetLogEntryHandler(LogEntryHandler handler)
{
    gCurrentLogEntryHandler = handler;
}

LogEntryHandler GetLogEntryHandler()
{
    return gCurrentLogEntryHandler;
}

void AddCleanLogEntryHandler(LogEntryHandler handler)
{
    if (gCleanLogEntryHandlers == nullptr)
        gCleanLogEntryHandlers = new std::vector<LogEntryHandler>();
    gCleanLogEntryHandlers->push_back(handler);
}

void RemoveCleanLogEntryHandler(LogEntryHandler handler)
{
    if (gCleanLogEntryHandlers == nullptr)
        return;
    std::erase(*gCleanLogEntryHandlers, handler);
}

void CleanLogHandler(LogType logType, const char* format, ...)
{
    if (gCleanLogEntryHandlers == nullptr)
        return;
    // A handler may add or remove handlers; walk a snapshot.
    const std::vector<LogEntryHandler> handlers = *gCleanLogEntryHandlers;
    for (LogEntryHandler handler : handlers)
    {
        va_list args;
        va_start(args, format);
        handler(logType, format, args);
        va_end(args);
    }
}

void InitializeCleanedLogFile(FILE* file)
{
    gCleanedLogFile = file;
    AddCleanLogEntryHandler(DefaultCleanLogHandler);
}

void CloseCleanedLogFile()
{
    if (gCleanedLogFile != nullptr)
        fclose(gCleanedLogFile);
    gCleanedLogFile = nullptr;
}

void ReleaseLogHandlers()
{
    delete gCleanLogEntryHandlers;
    gCleanLogEntryHandlers = nullptr;
    ClearConsoleLogPath();
}

void SetStackTraceLogType(StackTraceLogType type)
{
    for (StackTraceLogType& entry : gStackTraceLogType)
        entry = type;
}

void SetStackTraceLogType(LogType logType, StackTraceLogType type)
{
    if (IsValidLogType(logType))
        gStackTraceLogType[logType] = type;
}

StackTraceLogType GetStackTraceLogType(LogType logType)
{
    return IsValidLogType(logType) ? gStackTraceLogType[logType] : kStackTraceLogNone;
}
