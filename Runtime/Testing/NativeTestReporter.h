#pragma once
// The state and event logic of a test run's reporter: which test is running, whether its log
// output is swallowed, its distinct failures and properties, and the list of failed tests.
// Formatting is left to a derived class (ConsoleTestReporter).
//
// Event order within a run: for each test ReportTestStart, any number of ReportFailure and
// ReportTestProperty, then ReportTestFinish; after all tests ReportSummary; then the harness
// calls ReportIgnoredTests once.

#include "Runtime/Logging/LogAssert.h"
#include "Runtime/Testing/TestFilter.h"
#include "Runtime/Testing/TestProperty.h"

#include <UnitTest++/TestDetails.h>
#include <UnitTest++/TestReporter.h>

#include <map>
#include <string>
#include <vector>

namespace Testing
{
    class TestList;

    class NativeTestReporter : public UnitTest::TestReporter
    {
    public:
        typedef void (*PlatformSpecificTestFinishedCallback)(const UnitTest::TestDetails& details, float secondsElapsed);

        struct Failure
        {
            std::string fileName;
            int lineNumber;
            std::string text;

            bool operator==(const Failure& other) const = default;
        };

        NativeTestReporter();
        ~NativeTestReporter() override;

        void ReportTestStart(const UnitTest::TestDetails& details) override;
        void ReportFailure(const UnitTest::TestDetails& details, const char* failure) override;
        void ReportTestFinish(const UnitTest::TestDetails& details, float secondsElapsed) override;
        virtual void ReportTestProperty(const UnitTest::TestDetails& details, const char* name,
                                        const TestProperty& property);
        virtual void ReportIgnoredTests(std::vector<DisabledTestInfo>& ignoredTests) = 0;

        void SetShowOnlySummary(bool value) { m_ShowOnlySummary = value; }
        void SetTestNameColumnIndex(int value) { m_TestNameColumnIndex = value; }
        void SetResultColumnIndex(int value) { m_ResultColumnIndex = value; }
        void SetSuppressLogOutput(bool value) { m_SuppressLogOutput = value; }
        void SetPlatformSpecificTestFinishedHandler(PlatformSpecificTestFinishedCallback handler)
        {
            m_PlatformSpecificTestFinishedHandler = handler;
        }
        // The list that ShouldIgnoreLogMessages searches; the process-wide list unless set.
        void SetTestList(const TestList* list) { m_TestList = list; }

        bool IsCurrentlyRunningTest() const { return m_IsCurrentlyRunningTest; }
        int GetFailureCount() const { return static_cast<int>(m_FailedTests.size()); }
        bool IsSuppressingLogOutput() const { return m_SuppressLogOutput; }

        void CallPlatformSpecificTestFinishedHandler(const UnitTest::TestDetails& details, float secondsElapsed);
        void MarkCurrentTestAsFailure();
        // Whether the registered test at the same file (same pointer) and line carries
        // IgnoreExtraLogOutput; the last match decides.
        bool ShouldIgnoreLogMessages(const UnitTest::TestDetails& details) const;
        void ReportLogMessage(LogType type, const std::string& message);

        void BeginRecordingCodeCoverage() {}
        void EndRecordingCodeCoverage() {}

    protected:
        virtual void ReportTestNameOnTestStart(const UnitTest::TestDetails& details) = 0;
        virtual void ReportTestStatusOnFinish(const UnitTest::TestDetails& details, float secondsElapsed) = 0;

        PlatformSpecificTestFinishedCallback m_PlatformSpecificTestFinishedHandler = nullptr;
        bool m_IsCurrentlyRunningTest = false;
        bool m_ShowOnlySummary = false;
        int m_TestNameColumnIndex = 100;
        int m_ResultColumnIndex = 256;
        bool m_SuppressLogOutput = false;
        std::vector<TestDetails> m_FailedTests;
        bool m_CurrentTestIsFailure = false;
        TestDetails m_CurrentTest;  // null names and line -1 between tests
        std::map<std::string, TestProperty> m_CurrentTestProperties;
        std::vector<Failure> m_CurrentTestFailures;
        bool m_ShouldIgnoreLogMessagesForCurrentTest = false;

    private:
        const TestList* m_TestList = nullptr;
    };
}
