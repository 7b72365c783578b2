#pragma once
// Prints a run's report on the console (through printf_console), one line per test:
//     [Suite]    TestName     PASS(3ms, property: value)
//     [Suite]    OtherTest    FAIL!!!!
//     	CHECK FAILURE: text (file:line)
// then "Ran N tests with F failures in S seconds", the failed tests, and the ignored tests.
// The test name starts at m_TestNameColumnIndex and the result at m_ResultColumnIndex.

#include "Runtime/Testing/NativeTestReporter.h"

namespace Testing
{
    class ConsoleTestReporter : public NativeTestReporter
    {
    public:
        void ReportSummary(int totalTestCount, int failedTestCount, int failureCount, float secondsElapsed) override;
        void ReportIgnoredTests(std::vector<DisabledTestInfo>& ignoredTests) override;

        // Source lines shown under a failure; none on this platform.
        std::string GetSourceCodeForFailure(const Failure& failure) const;

    protected:
        void ReportTestNameOnTestStart(const UnitTest::TestDetails& details) override;
        void ReportTestStatusOnFinish(const UnitTest::TestDetails& details, float secondsElapsed) override;

    private:
        std::string PassText(float secondsElapsed) const;
    };
}
