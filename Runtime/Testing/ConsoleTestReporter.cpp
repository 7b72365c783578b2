#include "Runtime/Testing/ConsoleTestReporter.h"

#include <algorithm>
#include <cstring>

namespace Testing
{
namespace
{
    constexpr int kMaxColumn = 1024;

    int ClampColumn(int value)
    {
        return std::clamp(value, 0, kMaxColumn);
    }

    std::string IgnoredReason(const DisabledTestInfo& info)
    {
        if (info.bugNumber == 0 && info.reason.empty())
            return "No reason given";
        std::string text;
        if (!info.reason.empty())
            text += info.reason + " ";
        if (info.bugNumber != 0)
            text += "(case " + std::to_string(info.bugNumber) + ")";
        return text;
    }
}

void ConsoleTestReporter::ReportTestNameOnTestStart(const UnitTest::TestDetails& details)
{
    // "[Suite]" padded with blanks (or cut) to the test-name column.
    std::string prefix = std::string("[") + details.suiteName + "]";
    prefix.resize(kMaxColumn, ' ');
    prefix.resize(ClampColumn(m_TestNameColumnIndex));
    printf_console("%s%s", prefix.c_str(), details.testName);

    const int padding = m_ResultColumnIndex - m_TestNameColumnIndex - static_cast<int>(strlen(details.testName));
    printf_console("%s", std::string(ClampColumn(padding), ' ').c_str());
}

std::string ConsoleTestReporter::PassText(float secondsElapsed) const
{
    const long milliseconds = static_cast<long>(secondsElapsed * 1000.0f);
    std::string text = "PASS(" + std::to_string(milliseconds) + "ms";
    for (const auto& [name, property] : m_CurrentTestProperties)
        text += ", " + name + ": " + FormatTestProperty(property);
    return text + ")\n";
}

void ConsoleTestReporter::ReportTestStatusOnFinish(const UnitTest::TestDetails&, float secondsElapsed)
{
    if (m_CurrentTestIsFailure)
        printf_console("FAIL!!!!\n");
    else
        printf_console("%s", PassText(secondsElapsed).c_str());

    for (const Failure& failure : m_CurrentTestFailures)
    {
        if (!failure.text.empty())
            printf_console("\tCHECK FAILURE: %s (%s:%i)\n", failure.text.c_str(), failure.fileName.c_str(),
                           failure.lineNumber);
        else
            printf_console("\tCHECK FAILURE: (%s:%i)\n", failure.fileName.c_str(), failure.lineNumber);
        printf_console("%s", GetSourceCodeForFailure(failure).c_str());
    }
}

void ConsoleTestReporter::ReportSummary(int totalTestCount, int, int, float secondsElapsed)
{
    printf_console("Ran %i tests with %i failures in %.2f seconds\n", totalTestCount, GetFailureCount(),
                   secondsElapsed);
    for (const TestDetails& failed : m_FailedTests)
        printf_console("\tFAILED: %s [%s]\n", failed.testName, failed.suiteName);
}

void ConsoleTestReporter::ReportIgnoredTests(std::vector<DisabledTestInfo>& ignoredTests)
{
    if (ignoredTests.empty())
        return;
    printf_console("\n%zu %s IGNORED!\n", ignoredTests.size(), ignoredTests.size() == 1 ? "test was" : "tests were");
    for (const DisabledTestInfo& info : ignoredTests)
        printf_console("[%s] %s: %s\n", info.details.suiteName, info.details.testName, IgnoredReason(info).c_str());
}

std::string ConsoleTestReporter::GetSourceCodeForFailure(const Failure&) const
{
    return std::string();
}
}
