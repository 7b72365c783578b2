#include "Runtime/Testing/TestRunner.h"

#include <UnitTest++/AssertException.h>
#include <UnitTest++/CurrentTest.h>
#include <UnitTest++/MemoryOutStream.h>
#include <UnitTest++/RequiredCheckException.h>
#include <UnitTest++/Posix/SignalTranslator.h>

#include <exception>
#include <setjmp.h>

namespace Testing
{
const char* const kCrashFailureText = "Unhandled exception: Crash!";

namespace
{
    // Thrown when a crash signal brought the test back to its jump target.
    struct TestCrashed
    {
    };

    // The framework's translator installs handlers for the crash signals that jump back here;
    // the jump is turned into an exception so that the caller's frames unwind normally.
    __attribute__((noinline)) void RunWithSignalTranslation(const Test& test)
    {
        UnitTest::SignalTranslator translator;
        if (sigsetjmp(*UnitTest::SignalTranslator::s_jumpTarget, 1) != 0)
            throw TestCrashed();
        test.RunImpl();
    }

    void ExecuteGuarded(const Test& test)
    {
        const UnitTest::TestDetails& details = test.m_details;
        UnitTest::CurrentTest::Details() = &details;
        try
        {
            RunWithSignalTranslation(test);
        }
        catch (const UnitTest::AssertException&)
        {
        }
        catch (const UnitTest::RequiredCheckException&)
        {
        }
        catch (const std::exception& e)
        {
            UnitTest::MemoryOutStream stream;
            stream << "Unhandled exception: " << e.what();
            UnitTest::CurrentTest::Results()->OnTestFailure(details, stream.GetText());
        }
        catch (...)
        {
            UnitTest::CurrentTest::Results()->OnTestFailure(details, kCrashFailureText);
        }
    }
}

TestRunner::TestRunner(UnitTest::TestReporter& reporter)
    : m_Reporter(reporter),
      m_Results(&reporter),
      m_PreviousResults(UnitTest::CurrentTest::Results()),
      m_PreviousDetails(UnitTest::CurrentTest::Details())
{
    m_Timer.Start();
}

TestRunner::~TestRunner()
{
    UnitTest::CurrentTest::Results() = m_PreviousResults;
    UnitTest::CurrentTest::Details() = m_PreviousDetails;
}

void TestRunner::RunTest(const Test& test, int maxTestTimeInMs)
{
    UnitTest::CurrentTest::Results() = &m_Results;
    UnitTest::Timer testTimer;
    testTimer.Start();
    m_Results.OnTestStart(test.m_details);

    ExecuteGuarded(test);

    const double testTimeInMs = testTimer.GetTimeInMs();
    if (maxTestTimeInMs > 0 && testTimeInMs > maxTestTimeInMs && !test.m_details.timeConstraintExempt)
    {
        UnitTest::MemoryOutStream stream;
        stream << "Global time constraint failed. Expected under " << maxTestTimeInMs << "ms but took "
               << testTimeInMs << "ms.";
        m_Results.OnTestFailure(test.m_details, stream.GetText());
    }
    m_Results.OnTestFinish(test.m_details, static_cast<float>(testTimeInMs / 1000.0));
}

int TestRunner::Finish()
{
    const float secondsElapsed = static_cast<float>(m_Timer.GetTimeInMs() / 1000.0);
    m_Reporter.ReportSummary(m_Results.GetTotalTestCount(), m_Results.GetFailedTestCount(),
                             m_Results.GetFailureCount(), secondsElapsed);
    return m_Results.GetFailedTestCount();
}
}
