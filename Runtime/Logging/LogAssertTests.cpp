#include "Runtime/Testing/Testing.h"

#include "Runtime/Logging/LogAssert.h"
#include "Runtime/Logging/LogCapture.h"
#include "Runtime/Testing/ChildProcess.h"

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <unistd.h>

namespace
{
    std::string ReadFile(const std::string& path)
    {
        std::ifstream in(path);
        std::stringstream text;
        text << in.rdbuf();
        return text.str();
    }

    std::string TempPath(const char* name)
    {
        return "/tmp/logassert_tests_" + std::to_string(getpid()) + "_" + name;
    }

    bool PassHandler(LogType, const char*, va_list)
    {
        return true;
    }

    bool SwallowHandler(LogType, const char*, va_list)
    {
        return false;
    }

    // Sets one log type's stack-trace setting for the life of the object.
    struct ScopedStackTraceLogType
    {
        ScopedStackTraceLogType(LogType type, StackTraceLogType value) : m_Type(type), m_Saved(GetStackTraceLogType(type))
        {
            SetStackTraceLogType(type, value);
        }
        ~ScopedStackTraceLogType() { SetStackTraceLogType(m_Type, m_Saved); }

        LogType m_Type;
        StackTraceLogType m_Saved;
    };
}

UNIT_TEST_SUITE(LogAssert)
{
    TEST(ConsoleLine_SingleLineMessage_HasLocationInParenthesesAndOneLineFeed)
    {
        LogCapture::Result log = LogCapture::Capture([] { DebugStringToFile("Bad thing", 0, "Foo/Bar.cpp", 42, kError); });
        CHECK_EQUAL(1u, log.console.size());
        CHECK_EQUAL("Bad thing (Filename: Foo/Bar.cpp Line: 42)\n", log.console.at(0).text);
        CHECK_EQUAL(kLogTypeError, log.console.at(0).type);
    }

    TEST(ConsoleLine_MultiLineMessage_BreaksBeforeLocationAndEndsWithBlankLine)
    {
        LogCapture::Result log = LogCapture::Capture([] { DebugStringToFile("first\nsecond", 0, "a.cpp", 7, kError); });
        CHECK_EQUAL(1u, log.console.size());
        CHECK_EQUAL("first\nsecond \n(Filename: a.cpp Line: 7)\n\n", log.console.at(0).text);
    }

    TEST(ErrorNumber_AppearsBeforeFileName_AndInCleanLogForm)
    {
        LogCapture::Result log = LogCapture::Capture([] { DebugStringToFile("Oops", 5, "b.cpp", 3, kError); });
        CHECK_EQUAL(1u, log.console.size());
        CHECK_EQUAL("Oops (Error: 5 Filename: b.cpp Line: 3)\n", log.console.at(0).text);
        CHECK_EQUAL(1u, log.clean.size());
        CHECK_EQUAL("Oops (Error: 5)\n\n", log.clean.at(0).text);
        CHECK_EQUAL(kLogTypeError, log.clean.at(0).type);
    }

    TEST(LogEntry_PrintsPlainLine_BecauseLogTypeHasNoStackTrace)
    {
        LogCapture::Result log = LogCapture::Capture([] { DebugStringToFile("just saying", 0, "c.cpp", 9, kLog); });
        CHECK_EQUAL(1u, log.console.size());
        CHECK_EQUAL("just saying\n", log.console.at(0).text);
        CHECK_EQUAL(kLogTypeLog, log.console.at(0).type);
        CHECK_EQUAL(1u, log.clean.size());
        CHECK_EQUAL("just saying\n\n", log.clean.at(0).text);
    }

    TEST(ScriptingErrorFlag_ForcesLocatedLine_EvenWithStackTraceNone)
    {
        ScopedStackTraceLogType none(kLogTypeError, kStackTraceLogNone);
        LogCapture::Result log = LogCapture::Capture([] {
            DebugStringToFile("plain", 0, "d.cpp", 1, kError);
            DebugStringToFile("script", 0, "d.cpp", 2, kScriptingError);
        });
        CHECK_EQUAL(2u, log.console.size());
        CHECK_EQUAL("plain\n", log.console.at(0).text);
        CHECK_EQUAL("script (Filename: d.cpp Line: 2)\n", log.console.at(1).text);
    }

    TEST(FullStackTrace_AddsPlaceholderToConsoleMessageOnly)
    {
        ScopedStackTraceLogType full(kLogTypeWarning, kStackTraceLogFull);
        LogCapture::Result log = LogCapture::Capture([] { DebugStringToFile("w", 0, "e.cpp", 4, kScriptingWarning); });
        CHECK_EQUAL(1u, log.console.size());
        CHECK_EQUAL("w\nStacktrace is not supported on this platform. \n(Filename: e.cpp Line: 4)\n\n",
                    log.console.at(0).text);
        CHECK_EQUAL(kLogTypeWarning, log.console.at(0).type);
        CHECK_EQUAL(1u, log.clean.size());
        CHECK_EQUAL("w\n\n", log.clean.at(0).text);
    }

    TEST(DontExtractStacktrace_IgnoresFullSetting)
    {
        ScopedStackTraceLogType full(kLogTypeError, kStackTraceLogFull);
        LogCapture::Result log =
            LogCapture::Capture([] { DebugStringToFile("x", 0, "f.cpp", 5, kError | kDontExtractStacktrace); });
        CHECK_EQUAL(1u, log.console.size());
        CHECK_EQUAL("x (Filename: f.cpp Line: 5)\n", log.console.at(0).text);
    }

    TEST(Assertion_CleanFormHasPrefix_AndPrintsThroughAssertPrinter)
    {
        LogCapture::Result log = LogCapture::Capture([] { __msl_assertion_failed("a == b", "g.cpp", "void f()", 11); });
        CHECK_EQUAL(1u, log.console.size());
        CHECK_EQUAL("a == b (Filename: g.cpp Line: 11)\n", log.console.at(0).text);
        CHECK_EQUAL(kLogTypeAssert, log.console.at(0).type);
        CHECK_EQUAL(1u, log.clean.size());
        CHECK_EQUAL("Assertion failed: a == b\n\n", log.clean.at(0).text);
        CHECK_EQUAL(kLogTypeAssert, log.clean.at(0).type);
    }

    TEST(ScriptCompileWarning_IsWarningType_ButPrintsThroughErrorPrinter)
    {
        LogCapture::Result log = LogCapture::Capture([] { DebugStringToFile("cw", 0, "h.cpp", 1, kScriptCompileWarning); });
        CHECK_EQUAL(1u, log.clean.size());
        CHECK_EQUAL(kLogTypeWarning, log.clean.at(0).type);
        CHECK_EQUAL(1u, log.console.size());
        CHECK_EQUAL(kLogTypeError, log.console.at(0).type);
    }

    TEST(ScriptingException_IsExceptionType_WithLocatedLine_ThroughErrorPrinter)
    {
        LogCapture::Result log = LogCapture::Capture([] { DebugStringToFile("thrown", 0, "k.cpp", 2, kScriptingException); });
        CHECK_EQUAL(1u, log.clean.size());
        CHECK_EQUAL(kLogTypeException, log.clean.at(0).type);
        CHECK_EQUAL(1u, log.console.size());
        CHECK_EQUAL("thrown (Filename: k.cpp Line: 2)\n", log.console.at(0).text);
        CHECK_EQUAL(kLogTypeError, log.console.at(0).type);
    }

    TEST(LogTypeFromMode_FirstMatchingRuleWins)
    {
        CHECK_EQUAL(kLogTypeException, LogTypeFromMode(kScriptingException | kError));
        CHECK_EQUAL(kLogTypeError, LogTypeFromMode(kFatal));
        CHECK_EQUAL(kLogTypeError, LogTypeFromMode(kGraphCompileError | kAssert));
        CHECK_EQUAL(kLogTypeError, LogTypeFromMode(kStickyError));
        CHECK_EQUAL(kLogTypeAssert, LogTypeFromMode(kScriptingAssertion | kScriptingWarning));
        CHECK_EQUAL(kLogTypeWarning, LogTypeFromMode(kAssetImportWarning));
        CHECK_EQUAL(kLogTypeWarning, LogTypeFromMode(kScriptCompileWarning));
        CHECK_EQUAL(kLogTypeLog, LogTypeFromMode(kScriptingLog));
        CHECK_EQUAL(kLogTypeLog, LogTypeFromMode(kNoLogMessageFlags));
    }

    TEST(Handler_ReturningFalseSuppressesLine_TrueLetsItThrough)
    {
        Testing::ChildResult child = Testing::RunInChildProcess([] {
            SetLogEntryHandler(SwallowHandler);
            printf_console("swallowed %d\n", 1);
            SetLogEntryHandler(PassHandler);
            printf_console("printed %d\n", 2);
            SetLogEntryHandler(nullptr);
            printf_console("unhandled %s\n", "too");
        });
        CHECK(child.exited);
        CHECK_EQUAL("printed 2\nunhandled too\n", child.out);
    }

    TEST(CleanHandlers_RemoveTakesOutEveryCopy)
    {
        static int calls = 0;
        struct Counter
        {
            static bool Count(LogType, const char*, va_list)
            {
                ++calls;
                return true;
            }
        };
        AddCleanLogEntryHandler(Counter::Count);
        AddCleanLogEntryHandler(Counter::Count);
        CleanLogHandler(kLogTypeLog, "%s", "x");
        RemoveCleanLogEntryHandler(Counter::Count);
        CleanLogHandler(kLogTypeLog, "%s", "y");
        CHECK_EQUAL(2, calls);
    }

    TEST(CleanedLogFile_ReceivesEachEntryOnceInPlainForm)
    {
        const std::string path = TempPath("cleaned.txt");
        Testing::ChildResult child = Testing::RunInChildProcess([&] {
            SetLogEntryHandler(SwallowHandler);
            InitializeCleanedLogFile(fopen(path.c_str(), "w"));
            DebugStringToFile("one", 0, "x.cpp", 1, kError);
            DebugStringToFile("two", 3, "x.cpp", 2, kError);
            CloseCleanedLogFile();
            DebugStringToFile("after close", 0, "x.cpp", 3, kError);
        });
        CHECK(child.exited);
        CHECK_EQUAL(0, child.exitStatus);
        CHECK_EQUAL("one\n\ntwo (Error: 3)\n\n", ReadFile(path));
        remove(path.c_str());
    }

    TEST(LogOutputToSpecificFile_SendsConsoleToFileAndRecordsPath)
    {
        const std::string path = TempPath("console.txt");
        Testing::ChildResult child = Testing::RunInChildProcess([&] {
            SetLogEntryHandler(nullptr);
            LogOutputToSpecificFile(path.c_str());
            printf_console("to file %d\n", 7);
            printf("%s\n", GetConsoleLogPath().c_str());
        });
        CHECK_EQUAL(path + "\n", child.out);
        CHECK_EQUAL("to file 7\n", ReadFile(path));
        remove(path.c_str());
    }

    TEST(LogOutputToSpecificFile_ThatCannotBeOpened_LeavesOutputOnStandardOutput)
    {
        const std::string path = TempPath("first_console.txt");
        Testing::ChildResult child = Testing::RunInChildProcess([&] {
            SetLogEntryHandler(nullptr);
            LogOutputToSpecificFile(path.c_str());
            printf_console("into the first file\n");
            LogOutputToSpecificFile("/nonexistent-directory/console.txt");
            printf_console("on stdout\n");
            printf("%s\n", GetConsoleLogPath().c_str());
        });
        CHECK_EQUAL("on stdout\n/nonexistent-directory/console.txt\n", child.out);
        CHECK_EQUAL("into the first file\n", ReadFile(path));
        remove(path.c_str());
    }

    TEST(InitializeLoggingFromEnvironment_OpensBothFiles)
    {
        const std::string consolePath = TempPath("env_console.txt");
        const std::string cleanedPath = TempPath("env_cleaned.txt");
        Testing::ChildResult child = Testing::RunInChildProcess([&] {
            SetLogEntryHandler(nullptr);
            setenv("HALVOR_LOG_FILE", consolePath.c_str(), 1);
            setenv("HALVOR_CLEANED_LOG_FILE", cleanedPath.c_str(), 1);
            InitializeLoggingFromEnvironment();
            DebugStringToFile("entry", 0, "y.cpp", 8, kError);
        });
        CHECK_EQUAL("", child.out);
        CHECK_EQUAL("entry (Filename: y.cpp Line: 8)\n", ReadFile(consolePath));
        CHECK_EQUAL("entry\n\n", ReadFile(cleanedPath));
        remove(consolePath.c_str());
        remove(cleanedPath.c_str());
    }

    TEST(DebugTextLineByLine_SkipsLeadingBreaks_FoldsBreakRuns_CutsLongLines)
    {
        LogCapture::Result log = LogCapture::Capture([] { DebugTextLineByLine("\r\n\nabcdefg\r\n\r\nhi\n", 3); });
        CHECK_EQUAL(4u, log.console.size());
        CHECK_EQUAL("abc\n", log.console.at(0).text);
        CHECK_EQUAL("def\n", log.console.at(1).text);
        CHECK_EQUAL("g\n", log.console.at(2).text);
        CHECK_EQUAL("hi\n", log.console.at(3).text);
    }

    TEST(DebugTextLineByLine_DefaultLimitIs1023)
    {
        const std::string text(1024, 'x');
        LogCapture::Result log = LogCapture::Capture([&] { DebugTextLineByLine(text.c_str(), -1); });
        CHECK_EQUAL(2u, log.console.size());
        CHECK_EQUAL(1024u, log.console.at(0).text.size());  // 1023 characters and the line feed
        CHECK_EQUAL("x\n", log.console.at(1).text);
    }

    TEST(LogToConsoleHook_ReceivesConsoleMessageAndLocation)
    {
        static std::string seen;
        struct Hook
        {
            static void Log(const std::string& message, int errorNum, const char* file, int line, int mode, int, int,
                            LogEntryDoubleClickCallback)
            {
                seen = message + "|" + std::to_string(errorNum) + "|" + file + "|" + std::to_string(line) + "|" +
                       std::to_string(mode);
            }
        };
        RegisterLogToConsole(Hook::Log);
        LogCapture::Capture([] { DebugStringToFile("hooked", 2, "z.cpp", 5, kError); });
        RegisterLogToConsole(nullptr);
        CHECK_EQUAL("hooked|2|z.cpp|5|1", seen);
    }

    TEST(LogPreprocessor_CanRewriteFileOfScriptOnlyEntries)
    {
        struct Pre
        {
            static void Rewrite(const std::string&, std::string&, std::string&, std::string& file, int, int, int, int,
                                int)
            {
                file = "rewritten/" + file;
            }
        };
        RegisterLogPreprocessor(Pre::Rewrite);
        LogCapture::Result log = LogCapture::Capture([] { DebugStringToFile("p", 0, "orig.cpp", 6, kError); });
        RegisterLogPreprocessor(nullptr);
        CHECK_EQUAL(1u, log.console.size());
        CHECK_EQUAL("p (Filename: rewritten/orig.cpp Line: 6)\n", log.console.at(0).text);
    }
}
