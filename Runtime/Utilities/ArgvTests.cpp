#include "Runtime/Testing/Testing.h"

#include "Runtime/Logging/LogAssert.h"
#include "Runtime/Logging/LogCapture.h"
#include "Runtime/Testing/ChildProcess.h"
#include "Runtime/Utilities/Argv.h"

#include <vector>

namespace
{
    // Installs a command line for the life of the object and puts the process's own back after.
    class ScopedArgv
    {
    public:
        explicit ScopedArgv(std::vector<const char*> arguments)
            : m_Arguments(std::move(arguments)), m_SavedArgc(GetArgc()), m_SavedArgv(GetArgv()),
              m_SavedBatchmode(IsBatchmode())
        {
            for (int i = 0; i < kLogTypeNumLevels; ++i)
                m_SavedStackTrace[i] = GetStackTraceLogType(static_cast<LogType>(i));
            SetupArgv(static_cast<int>(m_Arguments.size()), m_Arguments.data());
        }

        ~ScopedArgv()
        {
            SetupArgv(m_SavedArgc, m_SavedArgv);
            SetIsBatchmode(m_SavedBatchmode);
            for (int i = 0; i < kLogTypeNumLevels; ++i)
                SetStackTraceLogType(static_cast<LogType>(i), m_SavedStackTrace[i]);
        }

    private:
        std::vector<const char*> m_Arguments;
        int m_SavedArgc;
        const char** m_SavedArgv;
        bool m_SavedBatchmode;
        StackTraceLogType m_SavedStackTrace[kLogTypeNumLevels];
    };

    std::vector<std::string> Strings(std::initializer_list<const char*> items)
    {
        return std::vector<std::string>(items.begin(), items.end());
    }

    bool AllStackTraceTypesAre(StackTraceLogType expected)
    {
        for (int i = 0; i < kLogTypeNumLevels; ++i)
        {
            if (GetStackTraceLogType(static_cast<LogType>(i)) != expected)
                return false;
        }
        return true;
    }
}

UNIT_TEST_SUITE(Argv)
{
    TEST(ValuesFollowOption_NegativeNumberIsValue_NextOptionStops)
    {
        ScopedArgv args({"prog", "-foo", "a", "-5", "-bar", "b"});
        CHECK(GetValuesForARGV("foo") == Strings({"a", "-5"}));
        CHECK(GetValuesForARGV("bar") == Strings({"b"}));
        CHECK_EQUAL("a", GetFirstValueForARGV("foo"));
        CHECK(GetAllArguments() == Strings({"-foo", "a", "-5", "-bar", "b"}));
    }

    TEST(OptionGivenLast_HasNoValues)
    {
        ScopedArgv args({"prog", "x", "-foo"});
        CHECK(HasARGV("foo"));
        CHECK(GetValuesForARGV("foo").empty());
        CHECK_EQUAL("", GetFirstValueForARGV("foo"));
        CHECK(!HasARGV("x"));
        CHECK(GetValuesForARGV("missing").empty());
    }

    TEST(ValueRules_DashAloneIsValue_EmptyArgumentStops)
    {
        ScopedArgv args({"prog", "-opt", "-", "v", "", "after"});
        CHECK(GetValuesForARGV("opt") == Strings({"-", "v"}));
        const char* argv[] = {"-x", "-9z", "-", "", "plain", "--"};
        CHECK(GetValueFromCommandLine(0, argv) == nullptr);
        CHECK_EQUAL("-9z", GetValueFromCommandLine(1, argv));
        CHECK_EQUAL("-", GetValueFromCommandLine(2, argv));
        CHECK(GetValueFromCommandLine(3, argv) == nullptr);
        CHECK_EQUAL("plain", GetValueFromCommandLine(4, argv));
        CHECK(GetValueFromCommandLine(5, argv) == nullptr);
    }

    TEST(OnlyFirstOccurrenceOfOption_GivesValues)
    {
        ScopedArgv args({"prog", "-foo", "-x", "-FOO", "later"});
        CHECK(GetValuesForARGV("foo").empty());
    }

    TEST(OptionLookup_IgnoresCase_AndDerivesRunModeFlags)
    {
        {
            ScopedArgv args({"prog", "-BatchMode", "-RUNEDITORTESTS"});
            CHECK(HasARGV("batchmode"));
            CHECK(HasARGV("BATCHMODE"));
            CHECK(IsBatchmode());
            CHECK(IsTestRun());
            CHECK(!IsAutomated());
            CHECK(!IsHumanControllingUs());
        }
        {
            ScopedArgv args({"prog", "-automated"});
            CHECK(!IsBatchmode());
            CHECK(!IsTestRun());
            CHECK(IsAutomated());
            CHECK(!IsHumanControllingUs());
        }
        {
            ScopedArgv args({"prog", "batchmode", "-batchmodeX"});
            CHECK(!IsBatchmode());
            CHECK(IsHumanControllingUs());
        }
    }

    TEST(StackTraceLogType_ExactWordsSetAllTypes_OtherSpellingsChangeNothing)
    {
        {
            ScopedArgv args({"prog", "-stackTraceLogType", "Full"});
            CHECK(AllStackTraceTypesAre(kStackTraceLogFull));
        }
        {
            ScopedArgv args({"prog", "-stacktracelogtype", "None"});
            CHECK(AllStackTraceTypesAre(kStackTraceLogNone));
        }
        {
            ScopedArgv args({"prog", "-stackTraceLogType", "full"});
            CHECK_EQUAL(kStackTraceLogScriptOnly, GetStackTraceLogType(kLogTypeError));
            CHECK_EQUAL(kStackTraceLogNone, GetStackTraceLogType(kLogTypeLog));
        }
        {
            ScopedArgv args({"prog", "-stackTraceLogType", "ScriptOnly"});
            CHECK(AllStackTraceTypesAre(kStackTraceLogScriptOnly));
        }
    }

    TEST(PrintARGV_MasksOnlyArgumentAfterExactPasswordOption)
    {
        ScopedArgv args({"prog", "-password", "secret", "-Password", "shown", "tail"});
        LogCapture::Result log = LogCapture::Capture([] { PrintARGV(); });
        CHECK_EQUAL(6u, log.console.size());
        std::string printed;
        for (const LogCapture::Line& line : log.console)
            printed += line.text;
        CHECK_EQUAL("prog\n-password\n(hidden)\n-Password\nshown\ntail\n", printed);
    }

    TEST(CheckBatchModeErrorString_InBatchMode_LogsAbortsWithStatus1)
    {
        Testing::ChildResult child = Testing::RunInChildProcess([] {
            static const char* argv[] = {"prog", "-batchmode"};
            SetupArgv(2, argv);
            SetLogEntryHandler(nullptr);
            CheckBatchModeErrorString("");
            CheckBatchModeErrorString("it broke");
            printf_console("not reached\n");
        });
        CHECK(child.exited);
        CHECK_EQUAL(1, child.exitStatus);
        CHECK_EQUAL("it broke (Filename: Runtime/Utilities/Argv.cpp Line: 227)\n"
                    "\nAborting batchmode due to failure:\nit broke\n\n",
                    child.out);
    }

    TEST(CheckBatchModeErrorString_OutsideBatchMode_OnlyLogs)
    {
        Testing::ChildResult child = Testing::RunInChildProcess([] {
            SetIsBatchmode(false);
            SetLogEntryHandler(nullptr);
            CheckBatchModeErrorString("soft failure");
            printf_console("still here\n");
        });
        CHECK(child.exited);
        CHECK_EQUAL(0, child.exitStatus);
        CHECK_EQUAL("soft failure (Filename: Runtime/Utilities/Argv.cpp Line: 227)\nstill here\n", child.out);
    }
}
