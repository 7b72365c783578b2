#include "Runtime/Testing/Testing.h"

#include "Runtime/Testing/ConsoleTestReporter.h"
#include "Runtime/Testing/TestRunner.h"

#include <algorithm>
#include <cstring>

namespace Testing
{
const char* const gAllTestCategories[kTestCategoryCount] = {
    kUnitTestCategory, kIntegrationTestCategory, kPerformanceTestCategory, kStressTestCategory,
    kRegressionTestCategory};

bool g_IsRunningNativeTests = false;
NativeTestReporter* g_TestReporter = nullptr;

const char* const kNoCategoryFailureText =
    "DOES NOT HAVE AN ASSOCIATED SUITE, PLEASE USE A SPECIFIC SUITE e.g. UNIT_TEST_SUITE, INTEGRATION_TEST_SUITE, etc.";

NoCategoryTest::NoCategoryTest(const char* testName, const char* suiteName, const char* filename, int lineNumber)
    : Test(testName, suiteName, kUnitTestCategory, filename, lineNumber)
{
}

NoCategoryTest::~NoCategoryTest() = default;

void NoCategoryTest::RunImpl() const
{
    UnitTest::CurrentTest::Results()->OnTestFailure(m_details, kNoCategoryFailureText);
}

namespace
{
    struct ColumnWidths
    {
        size_t longestSuiteName = 0;
        size_t longestTestName = 0;
    };

    ColumnWidths MeasureSelectedTests(const TestList& list, const TestFilter& filter)
    {
        ColumnWidths widths;
        list.ForEachTest([&](const Test& test) {
            if (!filter.Filter(&test))
                return;
            widths.longestSuiteName = std::max(widths.longestSuiteName, strlen(test.m_details.suiteName));
            widths.longestTestName = std::max(widths.longestTestName, strlen(test.m_details.testName));
        });
        return widths;
    }

    // Selected tests without category get a stand-in that fails with the no-suite message. The
    // stand-ins stay registered, so a later run reports them again.
    void AddNoCategoryStandIns(TestList& list, const TestFilter& filter)
    {
        std::vector<Test*> standIns;
        list.ForEachTest([&](const Test& test) {
            if (filter.Filter(&test) && !TestFilter::HasValidCategory(&test))
            {
                const UnitTest::TestDetails& d = test.m_details;
                standIns.push_back(new NoCategoryTest(d.testName, d.suiteName, d.filename, d.lineNumber));
            }
        });
        for (Test* standIn : standIns)
            list.AddProcedurallyGeneratedTest(standIn);
    }

    void RunSelectedTests(const TestList& list, TestFilter& filter, TestRunner& runner)
    {
        for (const TestFactory* factory = list.GetFactoryHead(); factory != nullptr; factory = factory->next)
        {
            Test* test = CreateTest(*factory);
            if (filter(test))
                runner.RunTest(*test, 0);
            DestroyTest(test);
        }
        for (UnitTest::Test* test = list.GetProcedurallyGeneratedHead(); test != nullptr; test = test->m_nextTest)
        {
            if (filter(static_cast<const Test*>(test)))
                runner.RunTest(static_cast<const Test&>(*test), 0);
        }
    }
}

int RunTestList(TestList& list, bool showOnlySummary, TestFilter& filter)
{
    g_IsRunningNativeTests = true;
    SetLogEntryHandler(LogEntryHandlerForTests);

    const ColumnWidths widths = MeasureSelectedTests(list, filter);
    ConsoleTestReporter reporter;
    // An enclosing run (a test that runs an inner list) gets its reporter back afterwards.
    NativeTestReporter* const enclosingReporter = g_TestReporter;
    g_TestReporter = &reporter;
    const int testNameColumn = static_cast<int>(widths.longestSuiteName) + 4;
    reporter.SetTestNameColumnIndex(testNameColumn);
    reporter.SetResultColumnIndex(testNameColumn + static_cast<int>(widths.longestTestName) + 4);
    reporter.SetShowOnlySummary(showOnlySummary);
    reporter.SetPlatformSpecificTestFinishedHandler(PlatformSpecificIntraTestHandler);
    reporter.SetTestList(&list);

    int failedTests = 0;
    {
        TestRunner runner(reporter);
        AddNoCategoryStandIns(list, filter);
        reporter.BeginRecordingCodeCoverage();
        RunSelectedTests(list, filter, runner);
        runner.Finish();
        reporter.EndRecordingCodeCoverage();
        failedTests = reporter.GetFailureCount();
        reporter.ReportIgnoredTests(filter.ignoredTests);
    }
    g_TestReporter = enclosingReporter;
    return failedTests;
}

int RunNativeTests(bool showOnlySummary, TestFilter& filter)
{
    return RunTestList(GetTestList(), showOnlySummary, filter);
}

int RunNativeTests(const std::string& categoryName, const std::vector<std::string>& testFilters)
{
    TestFilter filter;
    for (const std::string& name : testFilters)
        filter.AddFilterByName(name);
    if (!categoryName.empty())
        filter.AddCategory(categoryName);
    return RunNativeTests(false, filter);
}

int RunNativeTests(const std::string& categoryName, const std::string& testFilter)
{
    TestFilter filter;
    if (!testFilter.empty())
        filter.AddFilterByName(testFilter);
    if (!categoryName.empty())
        filter.AddCategory(categoryName);
    return RunNativeTests(false, filter);
}

int RunNativeTests()
{
    return RunNativeTests(std::string(), std::string());
}

int RunNativeTests(const std::string& testFilter)
{
    return RunNativeTests(std::string(), testFilter);
}

int RunNativeTests(const std::vector<std::string>& testFilters)
{
    return RunNativeTests(std::string(), testFilters);
}

bool IsRunningNativeTests()
{
    return g_IsRunningNativeTests;
}

bool IsNativeTestExpectingAssertionFailure(const char*)
{
    return false;
}

void PlatformSpecificPreTestSetup()
{
}

void PlatformSpecificIntraTestHandler(const UnitTest::TestDetails&, float)
{
}

void ReportTestProperty(const char* name, const TestProperty& property)
{
    if (g_TestReporter != nullptr && UnitTest::CurrentTest::Details() != nullptr)
        g_TestReporter->ReportTestProperty(*UnitTest::CurrentTest::Details(), name, property);
}

void ReportFailureAtLine(int line, const char* text)
{
    UnitTest::CurrentTest::Results()->OnTestFailure(UnitTest::TestDetails(*UnitTest::CurrentTest::Details(), line),
                                                    text);
}
}
