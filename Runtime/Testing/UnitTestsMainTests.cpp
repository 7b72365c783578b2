#include "Runtime/Testing/ChildProcess.h"
#include "Runtime/Testing/HarnessTestSupport.h"
#include "Runtime/Testing/Testing.h"

using HarnessTestSupport::WithoutTimes;

namespace
{
    Testing::ChildResult RunUnitTests(const std::vector<std::string>& arguments)
    {
        std::vector<std::string> argv = {std::string(CHARTBAKE_BIN_DIR) + "/UnitTests"};
        argv.insert(argv.end(), arguments.begin(), arguments.end());
        return Testing::RunProgram(argv, CHARTBAKE_BIN_DIR);
    }
}

// The test executable itself, run with filters that select only tests of the suite TestMacros.
UNIT_TEST_SUITE(UnitTestsMain)
{
    TEST(RepeatedFilters_AndACategory_SelectTheirTests)
    {
        const Testing::ChildResult run =
            RunUnitTests({"-category", "UNIT", "-filter", "testmacros.test_carries", "-filter", ".Fixture_Is"});
        CHECK(run.exited);
        CHECK_EQUAL(0, run.exitStatus);
        CHECK_EQUAL("[TestMacros]  Test_CarriesSuiteNameAndUnitCategory    PASS(#ms)\n"
                    "[TestMacros]  Fixture_IsConstructedBeforeTheBody      PASS(#ms)\n"
                    "Ran 2 tests with 0 failures in # seconds\n",
                    WithoutTimes(run.out));
    }

    TEST(SeveralPatternsAfterOneFilter_AreAllUsed)
    {
        const Testing::ChildResult run =
            RunUnitTests({"-filter", "testmacros.test_carries", "testmacros.fixture_is", "-category", "unit"});
        CHECK(WithoutTimes(run.out).find("Ran 2 tests with 0 failures") != std::string::npos);
    }

    TEST(CategoryPrefix_SelectsOnlyThatCategory)
    {
        const Testing::ChildResult run = RunUnitTests({"-category", "integ", "-filter", "TestMacros."});
        CHECK_EQUAL(0, run.exitStatus);
        CHECK_EQUAL("[TestMacros]  IntegrationSuite_CarriesItsCategory    PASS(#ms)\n"
                    "Ran 1 tests with 0 failures in # seconds\n",
                    WithoutTimes(run.out));
    }
}
