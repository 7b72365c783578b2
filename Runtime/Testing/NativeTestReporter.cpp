#include "Runtime/Testing/NativeTestReporter.h"

#include "Runtime/Testing/TestAttributes.h"
#include "Runtime/Testing/TestList.h"

namespace Testing
{
NativeTestReporter::NativeTestReporter() = default;

NativeTestReporter::~NativeTestReporter() = default;

// The name goes out before the running flag is set: while a test runs, the harness's log handler
// swallows console output.
void NativeTestReporter::ReportTestStart(const UnitTest::TestDetails& details)
{
    if (!m_ShowOnlySummary)
        ReportTestNameOnTestStart(details);
    m_CurrentTest = TestDetails(details);
    m_IsCurrentlyRunningTest = true;
    m_CurrentTestIsFailure = false;
    m_SuppressLogOutput = true;
    m_ShouldIgnoreLogMessagesForCurrentTest = ShouldIgnoreLogMessages(details);
}

void NativeTestReporter::ReportFailure(const UnitTest::TestDetails& details, const char* failure)
{
    Failure entry{details.filename ? details.filename : "", details.lineNumber, failure ? failure : ""};
    for (const Failure& known : m_CurrentTestFailures)
    {
        if (known == entry)
            return;
    }
    m_CurrentTestFailures.push_back(entry);
    MarkCurrentTestAsFailure();
}

void NativeTestReporter::MarkCurrentTestAsFailure()
{
    if (m_CurrentTestIsFailure)
        return;
    m_CurrentTestIsFailure = true;
    m_FailedTests.push_back(m_CurrentTest);
}

void NativeTestReporter::ReportTestProperty(const UnitTest::TestDetails&, const char* name,
                                            const TestProperty& property)
{
    m_CurrentTestProperties.insert_or_assign(name, property);
}

// The result goes out after the running flag is cleared, so that the log handler lets it through.
void NativeTestReporter::ReportTestFinish(const UnitTest::TestDetails& details, float secondsElapsed)
{
    m_IsCurrentlyRunningTest = false;
    if (!m_ShowOnlySummary)
        ReportTestStatusOnFinish(details, secondsElapsed);
    m_CurrentTestProperties.clear();
    m_CurrentTestFailures.clear();
    m_CurrentTest = TestDetails();
    CallPlatformSpecificTestFinishedHandler(details, secondsElapsed);
}

void NativeTestReporter::CallPlatformSpecificTestFinishedHandler(const UnitTest::TestDetails& details,
                                                                 float secondsElapsed)
{
    if (m_PlatformSpecificTestFinishedHandler != nullptr)
        m_PlatformSpecificTestFinishedHandler(details, secondsElapsed);
}

bool NativeTestReporter::ShouldIgnoreLogMessages(const UnitTest::TestDetails& details) const
{
    using TestAttributes::BaseAttribute;
    bool ignore = false;
    const TestList& list = m_TestList != nullptr ? *m_TestList : GetTestList();
    list.ForEachTest([&](const Test& test) {
        if (test.m_details.filename == details.filename && test.m_details.lineNumber == details.lineNumber)
            ignore = BaseAttribute::HasAttribute(BaseAttribute::kIgnoreExtraLogOutput, &test);
    });
    return ignore;
}

void NativeTestReporter::ReportLogMessage(LogType, const std::string&)
{
}
}
