#include "Runtime/Testing/HarnessTestSupport.h"
#include "Runtime/Testing/Testing.h"

#include <csignal>
#include <stdexcept>

using HarnessTestSupport::InnerTests;
using HarnessTestSupport::WithoutTimes;

// Every run here happens over a private list in a child process, so that its failures, its
// reporter and its log handler never touch the run these tests are part of.
namespace
{
    // A real store through a null pointer. Both the pointer and the store are volatile, so the
    // optimiser can neither prove the pointer null nor drop the store as dead; the undefined-
    // behaviour sanitizer is kept out, so that the store faults as it does in an ordinary build.
    __attribute__((no_sanitize_undefined)) void WriteThroughNull()
    {
        volatile int* volatile target = nullptr;
        *target = 1;
    }
}

UNIT_TEST_SUITE(RunNativeTests)
{
    TEST(OneFailingAndOnePassingTest_PrintTheReportExactly)
    {
        InnerTests inner;
        inner.Add("Tessary", "Array");
        const int checkLine = __LINE__; inner.Add("Tessary", "HashTab", [] { CHECK_EQUAL(1, 2); });
        const Testing::ChildResult run = inner.RunInChild();

        CHECK(run.exited);
        CHECK_EQUAL(1, run.exitStatus);
        CHECK_EQUAL("[Tessary]  Array      PASS(#ms)\n"
                    "[Tessary]  HashTab    FAIL!!!!\n"
                    "\tCHECK FAILURE: Expected 1 but was 2 (Inner.cpp:" + std::to_string(checkLine) + ")\n"
                    "Ran 2 tests with 1 failures in # seconds\n"
                    "\tFAILED: HashTab [Tessary]\n",
                    WithoutTimes(run.out));
    }

    TEST(CrashingTests_CountAsOneFailureEach_AndTheRunGoesOn)
    {
        InnerTests inner;
        inner.Add("S", "Segv", [] { raise(SIGSEGV); });
        inner.Add("S", "NullWrite", WriteThroughNull);
        inner.Add("S", "Fpe", [] { raise(SIGFPE); });
        inner.Add("S", "After");
        const Testing::ChildResult run = inner.RunInChild();

        CHECK(run.exited);
        CHECK_EQUAL(3, run.exitStatus);
        CHECK_EQUAL("[S]  Segv         FAIL!!!!\n"
                    "\tCHECK FAILURE: Unhandled exception: Crash! (Inner.cpp:10)\n"
                    "[S]  NullWrite    FAIL!!!!\n"
                    "\tCHECK FAILURE: Unhandled exception: Crash! (Inner.cpp:11)\n"
                    "[S]  Fpe          FAIL!!!!\n"
                    "\tCHECK FAILURE: Unhandled exception: Crash! (Inner.cpp:12)\n"
                    "[S]  After        PASS(#ms)\n"
                    "Ran 4 tests with 3 failures in # seconds\n"
                    "\tFAILED: Segv [S]\n"
                    "\tFAILED: NullWrite [S]\n"
                    "\tFAILED: Fpe [S]\n",
                    WithoutTimes(run.out));
    }

    TEST(Exceptions_AreFailuresWithTheirText)
    {
        InnerTests inner;
        inner.Add("S", "Std", [] { throw std::runtime_error("bad state"); });
        inner.Add("S", "Other", [] { throw 42; });
        const Testing::ChildResult run = inner.RunInChild();
        CHECK_EQUAL(2, run.exitStatus);
        CHECK(run.out.find("\tCHECK FAILURE: Unhandled exception: bad state (Inner.cpp:10)\n") != std::string::npos);
        CHECK(run.out.find("\tCHECK FAILURE: Unhandled exception: Crash! (Inner.cpp:11)\n") != std::string::npos);
    }

    TEST(RepeatedCheckAtOneLine_IsReportedOnce)
    {
        InnerTests inner;
        const int checkLine = __LINE__; inner.Add("S", "Twice", [] { for (int i = 0; i < 2; ++i) CHECK(false); });
        const Testing::ChildResult run = inner.RunInChild();
        CHECK_EQUAL(1, run.exitStatus);
        CHECK_EQUAL("[S]  Twice    FAIL!!!!\n"
                    "\tCHECK FAILURE: false (Inner.cpp:" + std::to_string(checkLine) + ")\n"
                    "Ran 1 tests with 1 failures in # seconds\n"
                    "\tFAILED: Twice [S]\n",
                    WithoutTimes(run.out));
    }

    TEST(LogOutputOfATest_IsSwallowed_UnlessTheTestEnablesIt)
    {
        InnerTests inner;
        inner.Add("S", "Quiet", [] { printf_console("hidden\n"); });
        inner.Add("S", "Loud", [] {
            Testing::EnableFullLogOutputForCurrentTest();
            printf_console("shown\n");
        });
        inner.Add("S", "QuietAgain", [] { DebugStringToFile("hidden entry", 0, "f.cpp", 1, kLog); });
        const Testing::ChildResult run = inner.RunInChild();
        CHECK_EQUAL(0, run.exitStatus);
        CHECK_EQUAL("[S]  Quiet         PASS(#ms)\n"
                    "[S]  Loud          shown\n"
                    "PASS(#ms)\n"
                    "[S]  QuietAgain    PASS(#ms)\n"
                    "Ran 3 tests with 0 failures in # seconds\n",
                    WithoutTimes(run.out));
    }

    TEST(LogHandler_LetsEverythingThroughOutsideATest)
    {
        const Testing::ChildResult run = HarnessTestSupport::RunAsFreshProcess([] {
            InnerTests inner;
            Testing::TestFilter filter;
            Testing::RunTestList(inner.List(), false, filter);
            printf_console("after the run\n");
        });
        CHECK_EQUAL("Ran 0 tests with 0 failures in # seconds\nafter the run\n", WithoutTimes(run.out));
    }

    TEST(Properties_AppearOnThePassLine)
    {
        InnerTests inner;
        inner.Add("S", "Measured", [] {
            Testing::ReportTestProperty("vertices", 8);
            Testing::ReportTestProperty("name", "cube");
        });
        const Testing::ChildResult run = inner.RunInChild();
        CHECK(run.out.find("[S]  Measured    PASS(") == 0);
        CHECK(run.out.find("ms, name: cube, vertices: 8)\n") != std::string::npos);
    }

    TEST(IgnoredAndUnselectedTests_AreNeitherRunNorCounted)
    {
        InnerTests inner;
        inner.Add("DISABLED_S", "Off", [] { CHECK(false); });
        inner.Add("S", "Known", [] { CHECK(false); }).With(TestAttributes::KnownFailure(123, "flaky"));
        inner.Add("Other", "Unselected", [] { CHECK(false); });
        inner.Add("S", "On");
        Testing::TestFilter filter;
        filter.AddFilterByName("s.");
        const Testing::ChildResult run = inner.RunInChild(filter);
        CHECK_EQUAL(0, run.exitStatus);
        // The columns count every test the filter selects, ignored ones included.
        CHECK_EQUAL("[S]           On       PASS(#ms)\n"
                    "Ran 1 tests with 0 failures in # seconds\n"
                    "\n2 tests were IGNORED!\n"
                    "[DISABLED_S] Off: No reason given\n"
                    "[S] Known: flaky (case 123)\n",
                    WithoutTimes(run.out));
    }

    TEST(ColumnWidths_ComeFromTheSelectedTestsOnly)
    {
        InnerTests inner;
        inner.Add("AVeryLongName", "AVeryLongName");
        inner.Add("S", "T");
        const Testing::ChildResult run = inner.RunInChild(Testing::TestFilter({"s.t"}, {}));
        CHECK_EQUAL("[S]  T    PASS(#ms)\nRan 1 tests with 0 failures in # seconds\n", WithoutTimes(run.out));
    }

    TEST(ShowOnlySummary_PrintsNoTestLines)
    {
        InnerTests inner;
        inner.Add("S", "Fails", [] { CHECK(false); });
        inner.Add("S", "Passes");
        const Testing::ChildResult run = inner.RunInChild({}, true);
        CHECK_EQUAL(1, run.exitStatus);
        CHECK_EQUAL("Ran 2 tests with 1 failures in # seconds\n\tFAILED: Fails [S]\n", WithoutTimes(run.out));
    }

    TEST(TestWithoutCategory_FailsWithTheNoSuiteMessage_AndRunningAgainAddsAnotherStandIn)
    {
        const Testing::ChildResult run = HarnessTestSupport::RunAsFreshProcess([] {
            InnerTests inner;
            inner.Add("Loose", "T", [] {}, nullptr);
            Testing::TestFilter first, second;
            const int firstFailed = Testing::RunTestList(inner.List(), true, first);
            const int secondFailed = Testing::RunTestList(inner.List(), true, second);
            printf_console("%d %d\n", firstFailed, secondFailed);
        });
        CHECK_EQUAL("Ran 1 tests with 1 failures in # seconds\n\tFAILED: T [Loose]\n"
                    "Ran 2 tests with 2 failures in # seconds\n\tFAILED: T [Loose]\n\tFAILED: T [Loose]\n"
                    "1 2\n",
                    WithoutTimes(run.out));
    }

    TEST(NoCategoryTest_ReportsItsMessageAtItsOwnLine)
    {
        const Testing::ChildResult run = HarnessTestSupport::RunAsFreshProcess([] {
            Testing::TestList list;
            list.AddProcedurallyGeneratedTest(new Testing::NoCategoryTest("T", "S", "Loose.cpp", 7));
            Testing::TestFilter filter;
            Testing::RunTestList(list, false, filter);
        });
        CHECK(run.out.find(std::string("\tCHECK FAILURE: ") + Testing::kNoCategoryFailureText + " (Loose.cpp:7)\n") !=
              std::string::npos);
    }

    TEST(Run_SetsTheRunningFlag_AndClearsTheReporterAfterwards)
    {
        const Testing::ChildResult run = HarnessTestSupport::RunAsFreshProcess([] {
            InnerTests inner;
            bool reporterDuringTest = false;
            inner.Add("S", "T", [&] { reporterDuringTest = Testing::g_TestReporter != nullptr; });
            Testing::TestFilter filter;
            Testing::RunTestList(inner.List(), true, filter);
            printf_console("%d %d %d\n", reporterDuringTest, Testing::IsRunningNativeTests(),
                           Testing::g_TestReporter == nullptr);
        });
        CHECK(run.out.find("\n1 1 1\n") != std::string::npos);
    }

    // Over the process-wide list, restricted to the suite TestMacros (two unit tests and one
    // integration test), so that the run never reaches the test that started it.
    TEST(EntryPoints_PassTheirCategoryAndNamesToTheFilter)
    {
        const Testing::ChildResult run = HarnessTestSupport::RunAsFreshProcess([] {
            const int results[] = {
                Testing::RunNativeTests(std::string("TestMacros.Test_Carries")),
                Testing::RunNativeTests(std::vector<std::string>{"TestMacros.Test_Carries", "testmacros.integrationsuite"}),
                Testing::RunNativeTests("INTEG", "TestMacros."),
                Testing::RunNativeTests("Unit", std::vector<std::string>{"TestMacros."})};
            printf_console("results %d %d %d %d\n", results[0], results[1], results[2], results[3]);
        });
        std::vector<std::string> summaries;
        for (size_t at = run.out.find("Ran "); at != std::string::npos; at = run.out.find("Ran ", at + 1))
            summaries.push_back(WithoutTimes(run.out.substr(at, run.out.find('\n', at) - at)));
        CHECK_EQUAL(4u, summaries.size());
        const char* expected[] = {"Ran 1 tests with 0 failures in # seconds", "Ran 2 tests with 0 failures in # seconds",
                                  "Ran 1 tests with 0 failures in # seconds", "Ran 3 tests with 0 failures in # seconds"};
        for (size_t i = 0; i < 4 && i < summaries.size(); ++i)
            CHECK_EQUAL(expected[i], summaries[i]);
        CHECK(run.out.find("results 0 0 0 0\n") != std::string::npos);
    }
}
