#pragma once
// Runs tests one at a time and reports them through a framework reporter. This takes the place of
// the framework's TestRunner, whose single-test step is private: the harness needs its own crash
// handling. A crash signal inside a test (SIGSEGV, SIGILL, SIGFPE, SIGBUS, SIGTRAP) becomes one
// failure "Unhandled exception: Crash!" at the test's own line, and the run goes on.
//
// The runner makes its results the framework's current results for its lifetime and restores the
// previous ones afterwards, so a test may run an inner list of tests without disturbing its own.

#include "Runtime/Testing/HarnessTest.h"

#include <UnitTest++/TestDetails.h>
#include <UnitTest++/TestReporter.h>
#include <UnitTest++/TestResults.h>
#include <UnitTest++/TimeHelpers.h>

namespace Testing
{
    extern const char* const kCrashFailureText;  // "Unhandled exception: Crash!"

    class TestRunner
    {
    public:
        explicit TestRunner(UnitTest::TestReporter& reporter);
        ~TestRunner();
        TestRunner(const TestRunner&) = delete;
        TestRunner& operator=(const TestRunner&) = delete;

        // Runs one test between the reporter's start and finish events. A maximum time of 0 or
        // less means no time limit.
        void RunTest(const Test& test, int maxTestTimeInMs);

        // Reports the summary over all tests run so far; returns the framework's failed-test count.
        int Finish();

        UnitTest::TestResults& Results() { return m_Results; }

    private:
        UnitTest::TestReporter& m_Reporter;
        UnitTest::TestResults m_Results;
        UnitTest::Timer m_Timer;
        UnitTest::TestResults* m_PreviousResults;
        const UnitTest::TestDetails* m_PreviousDetails;
    };
}
