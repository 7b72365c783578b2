#include "Runtime/Testing/ConsoleTestReporter.h"
#include "Runtime/Testing/HarnessTestSupport.h"
#include "Runtime/Testing/Testing.h"

using HarnessTestSupport::CaptureConsole;
using Testing::DisabledTestInfo;

namespace
{
    const char* const kFile = "Tests/Sample.cpp";

    // A reporter laid out like a run over the suite "Tessary" with test names up to 7 characters.
    struct ReporterFixture
    {
        ReporterFixture()
        {
            reporter.SetTestList(&noTests);
            reporter.SetTestNameColumnIndex(11);
            reporter.SetResultColumnIndex(22);
        }

        void Fail(const UnitTest::TestDetails& test, int line, const char* text)
        {
            reporter.ReportFailure(UnitTest::TestDetails(test, line), text);
        }

        Testing::TestList noTests;
        Testing::ConsoleTestReporter reporter;
        const UnitTest::TestDetails array{"Array", "Tessary", kFile, 315};
        const UnitTest::TestDetails hashTab{"HashTab", "Tessary", kFile, 323};
    };

    DisabledTestInfo Ignored(const char* suite, const char* name, DisabledTestInfo::Kind kind, const char* reason,
                             int bug)
    {
        Testing::TestDetails details;
        details.suiteName = suite;
        details.testName = name;
        DisabledTestInfo info(details);
        info.kind = kind;
        info.reason = reason;
        info.bugNumber = bug;
        return info;
    }
}

UNIT_TEST_SUITE(ConsoleTestReporter)
{
    TEST_FIXTURE(ReporterFixture, PassingTest_PrintsColumnsTimeAndPropertiesInNameOrder)
    {
        const std::string out = CaptureConsole([&] {
            reporter.ReportTestStart(array);
            reporter.ReportTestProperty(array, "vertices", 7);
            reporter.ReportTestProperty(array, "vertices", 8);  // replaces the 7
            reporter.ReportTestProperty(array, "area", 2.5f);
            reporter.ReportTestProperty(array, "ratio", 0.1);
            reporter.ReportTestProperty(array, "count", 3L);
            reporter.ReportTestProperty(array, "label", "quad");
            reporter.ReportTestFinish(array, 0.012f);
        });
        CHECK_EQUAL("[Tessary]  Array      PASS(12ms, area: 2.5, count: 3, label: quad, ratio: 0.1, vertices: 8)\n", out);
    }

    TEST_FIXTURE(ReporterFixture, PassingTime_IsTruncatedToWholeMilliseconds)
    {
        const std::string out = CaptureConsole([&] {
            reporter.ReportTestStart(array);
            reporter.ReportTestFinish(array, 0.0039f);
        });
        CHECK_EQUAL("[Tessary]  Array      PASS(3ms)\n", out);
    }

    TEST_FIXTURE(ReporterFixture, FailingTest_PrintsNoTimeOrProperties_ThenEachCheckLine)
    {
        const std::string out = CaptureConsole([&] {
            reporter.ReportTestStart(hashTab);
            reporter.ReportTestProperty(hashTab, "vertices", 8);
            Fail(hashTab, 325, "Expected 1 but was 2");
            Fail(hashTab, 326, "");
            reporter.ReportTestFinish(hashTab, 0.5f);
        });
        CHECK_EQUAL("[Tessary]  HashTab    FAIL!!!!\n"
                    "\tCHECK FAILURE: Expected 1 but was 2 (Tests/Sample.cpp:325)\n"
                    "\tCHECK FAILURE: (Tests/Sample.cpp:326)\n",
                    out);
    }

    TEST_FIXTURE(ReporterFixture, IdenticalFailures_ArePrintedOnce_AndTheTestCountsOnce)
    {
        const std::string out = CaptureConsole([&] {
            reporter.ReportTestStart(hashTab);
            Fail(hashTab, 325, "Expected 1 but was 2");
            Fail(hashTab, 325, "Expected 1 but was 2");
            Fail(hashTab, 325, "Expected 1 but was 3");  // another text: a distinct failure
            reporter.ReportTestFinish(hashTab, 0.0f);
            reporter.ReportSummary(1, 1, 3, 0.25f);
        });
        CHECK_EQUAL("[Tessary]  HashTab    FAIL!!!!\n"
                    "\tCHECK FAILURE: Expected 1 but was 2 (Tests/Sample.cpp:325)\n"
                    "\tCHECK FAILURE: Expected 1 but was 3 (Tests/Sample.cpp:325)\n"
                    "Ran 1 tests with 1 failures in 0.25 seconds\n"
                    "\tFAILED: HashTab [Tessary]\n",
                    out);
        CHECK_EQUAL(1, reporter.GetFailureCount());
    }

    TEST_FIXTURE(ReporterFixture, FinishedTest_LeavesNoStateForTheNextOne)
    {
        const std::string out = CaptureConsole([&] {
            reporter.ReportTestStart(hashTab);
            reporter.ReportTestProperty(hashTab, "vertices", 8);
            Fail(hashTab, 325, "boom");
            reporter.ReportTestFinish(hashTab, 0.0f);
            reporter.ReportTestStart(array);
            reporter.ReportTestFinish(array, 0.0f);
        });
        CHECK_EQUAL("[Tessary]  HashTab    FAIL!!!!\n"
                    "\tCHECK FAILURE: boom (Tests/Sample.cpp:325)\n"
                    "[Tessary]  Array      PASS(0ms)\n",
                    out);
        CHECK(!reporter.IsCurrentlyRunningTest());
    }

    TEST_FIXTURE(ReporterFixture, Summary_CountsFailedTests_NotTheRunnersNumbers)
    {
        const std::string out = CaptureConsole([&] {
            for (const UnitTest::TestDetails* test : {&hashTab, &array})
            {
                reporter.ReportTestStart(*test);
                Fail(*test, 1, "a");
                Fail(*test, 2, "b");
                reporter.ReportTestFinish(*test, 0.0f);
            }
            reporter.ReportSummary(3, 99, 99, 1.234f);
        });
        const std::string summary = out.substr(out.find("Ran "));
        CHECK_EQUAL("Ran 3 tests with 2 failures in 1.23 seconds\n"
                    "\tFAILED: HashTab [Tessary]\n"
                    "\tFAILED: Array [Tessary]\n",
                    summary);
    }

    TEST_FIXTURE(ReporterFixture, IgnoredList_OneTestWasWithBugAndReason_NoneIsSilent)
    {
        std::vector<DisabledTestInfo> ignored = {
            Ignored("Tessary", "Flaky", DisabledTestInfo::kDisabledKnownFailure, "flaky", 123)};
        const std::string out = CaptureConsole([&] { reporter.ReportIgnoredTests(ignored); });
        CHECK_EQUAL("\n1 test was IGNORED!\n[Tessary] Flaky: flaky (case 123)\n", out);

        ignored.clear();
        CHECK_EQUAL("", CaptureConsole([&] { reporter.ReportIgnoredTests(ignored); }));
    }

    TEST_FIXTURE(ReporterFixture, SeveralIgnoredTests_UseTestsWere_AndEachReasonForm)
    {
        std::vector<DisabledTestInfo> ignored = {
            Ignored("S", "NoReason", DisabledTestInfo::kDisabledGeneric, "", 0),
            Ignored("S", "ReasonOnly", DisabledTestInfo::kDisabledNotYetImplemented, "later", 0),
            Ignored("S", "BugOnly", DisabledTestInfo::kDisabledKnownFailure, "", 7)};
        const std::string out = CaptureConsole([&] { reporter.ReportIgnoredTests(ignored); });
        CHECK_EQUAL("\n3 tests were IGNORED!\n"
                    "[S] NoReason: No reason given\n"
                    "[S] ReasonOnly: later \n"
                    "[S] BugOnly: (case 7)\n",
                    out);
    }


    TEST_FIXTURE(ReporterFixture, ShowOnlySummary_PrintsOnlyTheSummaryAndTheIgnoredList)
    {
        reporter.SetShowOnlySummary(true);
        std::vector<DisabledTestInfo> ignored = {Ignored("S", "Off", DisabledTestInfo::kDisabledGeneric, "", 0)};
        const std::string out = CaptureConsole([&] {
            reporter.ReportTestStart(array);
            reporter.ReportTestFinish(array, 0.0f);
            reporter.ReportTestStart(hashTab);
            Fail(hashTab, 325, "boom");
            reporter.ReportTestFinish(hashTab, 0.0f);
            reporter.ReportSummary(2, 1, 1, 0.0f);
            reporter.ReportIgnoredTests(ignored);
        });
        CHECK_EQUAL("Ran 2 tests with 1 failures in 0.00 seconds\n"
                    "\tFAILED: HashTab [Tessary]\n"
                    "\n1 test was IGNORED!\n[S] Off: No reason given\n",
                    out);
    }

    TEST_FIXTURE(ReporterFixture, SuiteLongerThanTheNameColumn_IsCut_AndNoPaddingGoesNegative)
    {
        reporter.SetTestNameColumnIndex(4);
        reporter.SetResultColumnIndex(6);
        const std::string out = CaptureConsole([&] {
            reporter.ReportTestStart(hashTab);
            reporter.ReportTestFinish(hashTab, 0.0f);
        });
        CHECK_EQUAL("[TesHashTabPASS(0ms)\n", out);
    }



    TEST(ShouldIgnoreLogMessages_MatchesTheSameFilePointerAndLine)
    {
        HarnessTestSupport::InnerTests inner;
        const Testing::Test& quiet = inner.Add("S", "Quiet").With(TestAttributes::IgnoreExtraLogOutput());
        inner.Add("S", "Plain");
        Testing::ConsoleTestReporter reporter;
        reporter.SetTestList(&inner.List());

        const UnitTest::TestDetails& details = quiet.m_details;
        const std::string sameTextOtherPointer = details.filename;
        CHECK(reporter.ShouldIgnoreLogMessages(UnitTest::TestDetails("X", "Y", details.filename, details.lineNumber)));
        CHECK(!reporter.ShouldIgnoreLogMessages(UnitTest::TestDetails("X", "Y", details.filename, details.lineNumber + 1)));
        CHECK(!reporter.ShouldIgnoreLogMessages(
            UnitTest::TestDetails("X", "Y", sameTextOtherPointer.c_str(), details.lineNumber)));
    }
}
