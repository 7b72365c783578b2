// Located log entries: stack-trace handling, the clean-log forms, the console line and the hooks.

#include "Runtime/Logging/LogAssert.h"

#include <string>

namespace
{
    LogToConsoleFunc gLogToConsoleFunc = nullptr;
    PreprocessCondition gPreprocessor = nullptr;
    RemoveImportErrorFromConsoleFunc gRemoveImportErrorFromConsoleFunc = nullptr;
    ShowErrorWithModeFunc gShowErrorWithModeFunc = nullptr;

    const char* kNoStacktraceText = "Stacktrace is not supported on this platform.";

    const char* OrEmpty(const char* text)
    {
        return text != nullptr ? text : "";
    }

    bool HasAny(int mode, int flags)
    {
        return (mode & flags) != 0;
    }

    // The printer an entry's console line goes through. Deliberately not LogTypeFromMode: a
    // script compile warning alone prints through the error printer.
    LogType ConsolePrinterType(int mode)
    {
        if (HasAny(mode, kLog | kScriptingLog))
            return kLogTypeLog;
        if (HasAny(mode, kAssetImportWarning | kScriptingWarning))
            return kLogTypeWarning;
        if (HasAny(mode, kAssert | kScriptingAssertion))
            return kLogTypeAssert;
        return kLogTypeError;
    }

    void PrintConsoleLine(LogType printer, const char* format, ...) __attribute__((format(printf, 2, 3)));
    void PrintConsoleLine(LogType printer, const char* format, ...)
    {
        va_list args;
        va_start(args, format);
        printf_consolev(printer, format, args);
        va_end(args);
    }

    std::string WithStacktrace(const char* condition, const char* stacktrace)
    {
        std::string message = condition;
        if (*stacktrace != '\0')
        {
            message += "\n";
            message += stacktrace;
        }
        return message;
    }

    void WriteCleanLog(LogType type, const DebugStringToFileData& data, const std::string& cleanMessage)
    {
        const char* condition = OrEmpty(data.condition);
        if (data.errorNum != 0)
            CleanLogHandler(type, "%s (Error: %d)\n\n", condition, data.errorNum);
        else if (type != kLogTypeAssert)
            CleanLogHandler(type, "%s\n\n", condition);
        else
            CleanLogHandler(kLogTypeAssert, "%s\n\n", ("Assertion failed: " + cleanMessage).c_str());
    }

    void WriteConsoleLine(LogType type, const DebugStringToFileData& data, const std::string& consoleMessage)
    {
        const LogType printer = ConsolePrinterType(data.mode);
        if (GetStackTraceLogType(type) == kStackTraceLogNone &&
            !HasAny(data.mode, kScriptingError | kScriptingWarning))
        {
            PrintConsoleLine(printer, "%s\n", OrEmpty(data.condition));
            return;
        }
        const bool multiLine = consoleMessage.find('\n') != std::string::npos;
        char errorText[32] = "";
        if (data.errorNum != 0)
            snprintf(errorText, sizeof(errorText), "Error: %i ", data.errorNum);
        PrintConsoleLine(printer, "%s %s(%sFilename: %s Line: %i)%s", consoleMessage.c_str(), multiLine ? "\n" : "",
                         errorText, OrEmpty(data.file), data.line, multiLine ? "\n\n" : "\n");
    }
}

LogType LogTypeFromMode(int mode)
{
    if (HasAny(mode, kScriptingException))
        return kLogTypeException;
    if (HasAny(mode, kError | kFatal | kAssetImportError | kScriptingError | kScriptCompileError | kStickyError |
                         kGraphCompileError))
        return kLogTypeError;
    if (HasAny(mode, kAssert | kScriptingAssertion))
        return kLogTypeAssert;
    if (HasAny(mode, kAssetImportWarning | kScriptingWarning | kScriptCompileWarning))
        return kLogTypeWarning;
    return kLogTypeLog;
}

void DebugStringToFile(const char* condition, int errorNum, const char* file, int line, int mode,
                       int targetInstanceID, int identifier, LogEntryDoubleClickCallback doubleClickCallback)
{
    DebugStringToFileData data;
    data.condition = condition;
    data.errorNum = errorNum;
    data.file = file;
    data.line = line;
    data.mode = mode;
    data.targetInstanceID = targetInstanceID;
    data.identifier = identifier;
    data.doubleClickCallback = doubleClickCallback;
    DebugStringToFile(data);
}

void DebugStringToFile(const DebugStringToFileData& data)
{
    DebugStringToFileData copy = data;
    copy.strippedStacktrace = "";
    copy.stacktrace = "";
    // Owns the file name when a preprocessor rewrote it, for as long as the copy is in use.
    std::string file = OrEmpty(data.file);
    if (!HasAny(data.mode, kDontExtractStacktrace))
    {
        const StackTraceLogType setting = GetStackTraceLogType(LogTypeFromMode(data.mode));
        if (setting == kStackTraceLogFull)
        {
            copy.strippedStacktrace = kNoStacktraceText;
            copy.stacktrace = kNoStacktraceText;
        }
        else if (setting == kStackTraceLogScriptOnly && gPreprocessor != nullptr)
        {
            std::string strippedOut, stacktraceOut;
            gPreprocessor(OrEmpty(data.condition), strippedOut, stacktraceOut, file, data.line, data.errorNum,
                          data.mode, data.targetInstanceID, data.identifier);
            copy.file = file.c_str();
        }
    }
    DebugStringToFilePostprocessedStacktrace(copy);
}

void DebugStringToFilePostprocessedStacktrace(const DebugStringToFileData& data)
{
    const LogType type = LogTypeFromMode(data.mode);
    const char* condition = OrEmpty(data.condition);
    const std::string consoleMessage = WithStacktrace(condition, OrEmpty(data.stacktrace));
    const std::string cleanMessage = WithStacktrace(condition, OrEmpty(data.strippedStacktrace));

    WriteCleanLog(type, data, cleanMessage);
    WriteConsoleLine(type, data, consoleMessage);

    if (gLogToConsoleFunc != nullptr)
        gLogToConsoleFunc(consoleMessage, data.errorNum, OrEmpty(data.file), data.line, data.mode,
                          data.targetInstanceID, data.identifier, data.doubleClickCallback);
}

void __msl_assertion_failed(const char* condition, const char* file, const char* /*function*/, int line)
{
    DebugStringToFile(condition, 0, file, line, kAssert);
}

void RegisterLogToConsole(LogToConsoleFunc func)
{
    gLogToConsoleFunc = func;
}

void RegisterLogPreprocessor(PreprocessCondition func)
{
    gPreprocessor = func;
}

void RegisterRemoveImportErrorFromConsole(RemoveImportErrorFromConsoleFunc func)
{
    gRemoveImportErrorFromConsoleFunc = func;
}

void RegisterShowErrorWithMode(ShowErrorWithModeFunc func)
{
    gShowErrorWithModeFunc = func;
}

void RemoveErrorWithIdentifierFromConsole(int identifier)
{
    if (gRemoveImportErrorFromConsoleFunc != nullptr)
        gRemoveImportErrorFromConsoleFunc(identifier);
}

void ShowErrorWithMode(int mode)
{
    if (gShowErrorWithModeFunc != nullptr)
        gShowErrorWithModeFunc(mode);
}

void DumpCallstackConsole(const char*, const char*, int)
{
}

bool IsDebuggerPresent()
{
    return false;
}
