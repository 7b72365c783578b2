#pragma once
// The runtime's single path for diagnostics: console output, located log entries, assertion
// reports, a replaceable entry handler that may swallow output, a list of "clean" handlers that
// see every entry once in plain form, and the batch-mode abort (declared in Argv.h).

#include <cstdarg>
#include <cstdio>
#include <string>

enum LogType
{
    kLogTypeError = 0,
    kLogTypeAssert = 1,
    kLogTypeWarning = 2,
    kLogTypeLog = 3,
    kLogTypeException = 4,
    kLogTypeDebug = 5,
    kLogTypeNumLevels = 6
};

// Bit set: the `mode` of a log entry.
enum LogMessageFlags
{
    kNoLogMessageFlags = 0,
    kError = 1 << 0,
    kAssert = 1 << 1,
    kLog = 1 << 2,
    kFatal = 1 << 4,
    kAssetImportError = 1 << 6,
    kAssetImportWarning = 1 << 7,
    kScriptingError = 1 << 8,
    kScriptingWarning = 1 << 9,
    kScriptingLog = 1 << 10,
    kScriptCompileError = 1 << 11,
    kScriptCompileWarning = 1 << 12,
    kStickyError = 1 << 13,
    kMayIgnoreLineNumber = 1 << 14,
    kReportBug = 1 << 15,
    kDisplayPreviousErrorInStatusBar = 1 << 16,
    kScriptingException = 1 << 17,
    kDontExtractStacktrace = 1 << 18,
    kGraphCompileError = 1 << 20,
    kScriptingAssertion = 1 << 21
};

enum StackTraceLogType
{
    kStackTraceLogNone = 0,
    kStackTraceLogScriptOnly = 1,
    kStackTraceLogFull = 2
};

// The record handed to a double-click callback; carries nothing on this platform.
struct CppLogEntry
{
    const char* condition = "";
    const char* file = "";
    int line = 0;
    int mode = 0;
};
typedef void (*LogEntryDoubleClickCallback)(const CppLogEntry& entry);

// One log entry.
struct DebugStringToFileData
{
    const char* condition = "";
    const char* strippedStacktrace = "";
    const char* stacktrace = "";
    int errorNum = 0;
    const char* file = "";
    int line = 0;
    int mode = 0;
    int targetInstanceID = 0;
    int identifier = 0;
    LogEntryDoubleClickCallback doubleClickCallback = nullptr;
    bool invokePostprocessCallbacks = true;
};

// A log entry handler sees the log type, the format and its arguments; false swallows the output.
typedef bool (*LogEntryHandler)(LogType type, const char* format, va_list args);

// Hooks, each null until registered.
typedef void (*LogToConsoleFunc)(const std::string& condition, int errorNum, const char* file, int line, int mode,
                                 int targetInstanceID, int identifier, LogEntryDoubleClickCallback doubleClickCallback);
// Called for entries whose type logs script-only stack traces. It may fill the two stack-trace
// outputs and rewrite `file`; the entry goes on with the file as the preprocessor left it.
typedef void (*PreprocessCondition)(const std::string& condition, std::string& strippedStacktrace,
                                    std::string& stacktrace, std::string& file, int line, int errorNum, int mode,
                                    int targetInstanceID, int identifier);
typedef void (*RemoveImportErrorFromConsoleFunc)(int identifier);
typedef void (*ShowErrorWithModeFunc)(int mode);

// The stack-trace setting every log type starts with, one entry per LogType.
extern StackTraceLogType gStackTraceLogType[kLogTypeNumLevels];

// Console output. printf_consolev is the one writer: the entry handler may swallow a line,
// otherwise it goes to the console file (standard output unless a specific file is open).
void printf_consolev(LogType logType, const char* format, va_list args);
void printf_console(const char* format, ...) __attribute__((format(printf, 1, 2)));
void printf_console_log(const char* format, va_list args);
void printf_console_log_error(const char* format, ...) __attribute__((format(printf, 1, 2)));
void printf_console_log_assert(const char* format, ...) __attribute__((format(printf, 1, 2)));
void printf_console_log_warning(const char* format, ...) __attribute__((format(printf, 1, 2)));
void printf_console_log_plain(const char* format, ...) __attribute__((format(printf, 1, 2)));
void print_realstdout(const char* text, size_t length);
// The text that `format` with `args` produces; the format itself if it cannot be formatted.
// `args` is left untouched (the function works on a copy).
std::string FormatLogString(const char* format, va_list args);
void ResetStdout();

// The console file.
FILE* OpenConsole();
void LogOutputToSpecificFile(const char* path);
std::string GetConsoleLogPath();
void SetConsoleLogPath(const char* path);
void SetConsoleLogPath(const std::string& path);
void ClearConsoleLogPath();
bool IsConsoleLogPathSet();

// Handlers.
void SetLogEntryHandler(LogEntryHandler handler);
LogEntryHandler GetLogEntryHandler();
void AddCleanLogEntryHandler(LogEntryHandler handler);
void RemoveCleanLogEntryHandler(LogEntryHandler handler);
void CleanLogHandler(LogType logType, const char* format, ...) __attribute__((format(printf, 2, 3)));
void InitializeCleanedLogFile(FILE* file);
void CloseCleanedLogFile();
void ReleaseLogHandlers();

// Stack-trace settings.
void SetStackTraceLogType(StackTraceLogType type);
void SetStackTraceLogType(LogType logType, StackTraceLogType type);
StackTraceLogType GetStackTraceLogType(LogType logType);

// Hooks.
void RegisterLogToConsole(LogToConsoleFunc func);
void RegisterLogPreprocessor(PreprocessCondition func);
void RegisterRemoveImportErrorFromConsole(RemoveImportErrorFromConsoleFunc func);
void RegisterShowErrorWithMode(ShowErrorWithModeFunc func);
void RemoveErrorWithIdentifierFromConsole(int identifier);
void ShowErrorWithMode(int mode);

void DumpCallstackConsole(const char* prefix, const char* file, int line);
bool IsDebuggerPresent();

// Prints `text` line by line with "%s\n"; lines longer than maxLineLength (1023 for -1) are cut.
void DebugTextLineByLine(const char* text, int maxLineLength = -1);

// Environment.
std::string GetStringFromEnv(const char* name);
std::string GetCustomLogFile();   // HALVOR_LOG_FILE
std::string GetCleanedLogFile();  // HALVOR_CLEANED_LOG_FILE

// Start-up: sends console output to HALVOR_LOG_FILE and opens HALVOR_CLEANED_LOG_FILE as the
// cleaned log, for whichever of the two is set. Program mains call this first thing.
void InitializeLoggingFromEnvironment();

// Entries.
LogType LogTypeFromMode(int mode);
void DebugStringToFile(const char* condition, int errorNum, const char* file, int line, int mode,
                       int targetInstanceID = 0, int identifier = 0,
                       LogEntryDoubleClickCallback doubleClickCallback = nullptr);
void DebugStringToFile(const DebugStringToFileData& data);
void DebugStringToFilePostprocessedStacktrace(const DebugStringToFileData& data);

void __msl_assertion_failed(const char* condition, const char* file, const char* function, int line);
