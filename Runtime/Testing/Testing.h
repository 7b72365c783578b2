#pragma once
// The test harness: suites with categories, tests registered as factories, attributes, filters,
// and the run entry points. Tests include this one header and use the framework's check macros
// (CHECK, CHECK_EQUAL, CHECK_CLOSE, CHECK_ARRAY_EQUAL, ...); see TestMacros.h for declaring
// suites and tests.
//
// Registering a test by hand, with explicit names and lines (what the test macros expand to):
//
//   namespace SuiteTessarykUnitTestCategory
//   {
//       class TestArray : public Testing::Test
//       {
//       public:
//           TestArray() : Testing::Test("Array", "Tessary", Testing::kUnitTestCategory, "Some/File.cpp", 315) {}
//       private:
//           void RunImpl() const override
//           {
//               if (!Check())
//                   Testing::ReportFailureAtLine(317, "what went wrong");
//           }
//       };
//       Testing::Test* CreateTestArray(void*) { return new TestArray(); }
//       Testing::TestFactory testArrayFactory = {&CreateTestArray, nullptr, nullptr};
//       Testing::ListAdder adderArray(Testing::GetTestList(), &testArrayFactory);
//   }
//
// ReportFailureAtLine(line, text) does what the check macros do: it reports `text` to
// UnitTest::CurrentTest::Results() with UnitTest::TestDetails(*UnitTest::CurrentTest::Details(), line),
// that is the running test's suite, name and file at the given line. A test may override
// CreateAttributes to carry attributes (TestAttributes.h).

#include "Runtime/Logging/LogAssert.h"
#include "Runtime/Testing/HarnessTest.h"
#include "Runtime/Testing/TestAttributes.h"
#include "Runtime/Testing/TestFilter.h"
#include "Runtime/Testing/TestList.h"
#include "Runtime/Testing/TestMacros.h"
#include "Runtime/Testing/TestProperty.h"

#include <UnitTest++/CheckMacros.h>
#include <UnitTest++/RequireMacros.h>
#include <UnitTest++/CurrentTest.h>
#include <UnitTest++/MemoryOutStream.h>
#include <UnitTest++/TestDetails.h>
#include <UnitTest++/TestResults.h>

#include <cstdarg>
#include <string>
#include <vector>

namespace Testing
{
    class NativeTestReporter;

    inline constexpr const char* kUnitTestCategory = "Unit";
    inline constexpr const char* kIntegrationTestCategory = "Integration";
    inline constexpr const char* kPerformanceTestCategory = "Performance";
    inline constexpr const char* kStressTestCategory = "Stress";
    inline constexpr const char* kRegressionTestCategory = "Regression";

    inline constexpr int kTestCategoryCount = 5;
    // The five categories in the order above.
    extern const char* const gAllTestCategories[kTestCategoryCount];

    // Set when a run starts and never cleared.
    extern bool g_IsRunningNativeTests;
    // The reporter of the run in progress; null outside a run.
    extern NativeTestReporter* g_TestReporter;

    extern const char* const kNoCategoryFailureText;

    // Stands in for a selected test that has no category: it fails with kNoCategoryFailureText.
    class NoCategoryTest : public Test
    {
    public:
        NoCategoryTest(const char* testName, const char* suiteName, const char* filename, int lineNumber);
        ~NoCategoryTest() override;

    private:
        void RunImpl() const override;
    };

    // The run entry points; each returns the number of failed tests (tests with at least one
    // failure). An empty category or name means "no restriction".
    int RunNativeTests();
    int RunNativeTests(const std::string& testFilter);
    int RunNativeTests(const std::vector<std::string>& testFilters);
    int RunNativeTests(const std::string& categoryName, const std::string& testFilter);
    int RunNativeTests(const std::string& categoryName, const std::vector<std::string>& testFilters);
    // The run itself, over the process-wide list.
    int RunNativeTests(bool showOnlySummary, TestFilter& filter);
    // The same run over any list (the harness's own tests run private lists through it).
    int RunTestList(TestList& list, bool showOnlySummary, TestFilter& filter);

    bool IsRunningNativeTests();
    bool IsNativeTestExpectingAssertionFailure(const char* message);

    // Lets the current test's log output through to the console (it is swallowed by default).
    void EnableFullLogOutputForCurrentTest();

    void PlatformSpecificPreTestSetup();
    void PlatformSpecificIntraTestHandler(const UnitTest::TestDetails& details, float secondsElapsed);

    // The log entry handler installed by a run: while a test runs, its log output is handed to the
    // reporter and swallowed unless the test enabled full output. Serialised by gLogEntryMutex.
    bool LogEntryHandlerForTests(LogType type, const char* format, va_list args);

    // Attaches a property to the running test's report line; ignored outside a run.
    void ReportTestProperty(const char* name, const TestProperty& property);

    // Reports a failure of the running test at an explicit line of its file.
    void ReportFailureAtLine(int line, const char* text);
}
