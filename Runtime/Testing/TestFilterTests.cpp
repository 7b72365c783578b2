#include "Runtime/Testing/HarnessTestSupport.h"
#include "Runtime/Testing/TestFilter.h"
#include "Runtime/Testing/Testing.h"

using HarnessTestSupport::ScriptedTest;
using Testing::DisabledTestInfo;
using Testing::TestFilter;

namespace
{
    ScriptedTest MakeTest(const char* suite, const char* name, const char* category = Testing::kUnitTestCategory)
    {
        return ScriptedTest(suite, name, {}, category);
    }

    TestFilter NameFilter(const char* pattern)
    {
        TestFilter filter;
        filter.AddFilterByName(pattern);
        return filter;
    }

    TestFilter CategoryFilter(const char* category)
    {
        TestFilter filter;
        filter.AddCategory(category);
        return filter;
    }
}

UNIT_TEST_SUITE(TestFilter)
{
    TEST(EmptyFilter_SelectsEveryTest)
    {
        const ScriptedTest test = MakeTest("Any", "Thing", Testing::kStressTestCategory);
        CHECK(TestFilter().Filter(&test));
    }

    TEST(DottedEntry_MatchesSuiteAndTestPartsSeparately)
    {
        const ScriptedTest wanted = MakeTest("MyFooSuite", "TestBarBaz");
        const ScriptedTest swapped = MakeTest("Bar", "Foo");
        const TestFilter filter = NameFilter("foo.bar");
        CHECK(filter.Filter(&wanted));
        CHECK(!filter.Filter(&swapped));
    }

    TEST(DottedEntry_SplitsAtTheFirstDotOnly)
    {
        const ScriptedTest test = MakeTest("Suite", "Name.With.Dots");
        CHECK(NameFilter("suite.with.dots").Filter(&test));
        CHECK(!NameFilter("suite.with.nothing").Filter(&test));
    }

    TEST(EmptyPartsOfADottedEntry_MatchAnything)
    {
        const ScriptedTest test = MakeTest("Geometry", "AreaOfSquare");
        CHECK(NameFilter(".square").Filter(&test));
        CHECK(NameFilter("geo.").Filter(&test));
        CHECK(NameFilter(".").Filter(&test));
        CHECK(!NameFilter(".circle").Filter(&test));
        CHECK(!NameFilter("mesh.").Filter(&test));
    }

    TEST(PlainEntry_MatchesSuiteOrTestName_IgnoringCase)
    {
        const ScriptedTest test = MakeTest("Geometry", "AreaOfSquare");
        CHECK(NameFilter("GEOM").Filter(&test));
        CHECK(NameFilter("ofsq").Filter(&test));
        CHECK(!NameFilter("circle").Filter(&test));
        CHECK(NameFilter("").Filter(&test));
    }

    TEST(SeveralEntries_AnyMatchSelects)
    {
        const ScriptedTest test = MakeTest("Geometry", "Area");
        TestFilter filter = NameFilter("circle");
        CHECK(!filter.Filter(&test));
        filter.AddFilterByName("area");
        CHECK(filter.Filter(&test));
    }

    TEST(CategoryEntry_IsACaseInsensitivePrefix)
    {
        const ScriptedTest integration = MakeTest("S", "T", Testing::kIntegrationTestCategory);
        const ScriptedTest performance = MakeTest("S", "T", Testing::kPerformanceTestCategory);
        CHECK(CategoryFilter("INTEG").Filter(&integration));
        CHECK(!CategoryFilter("INTEG").Filter(&performance));
        CHECK(CategoryFilter("perf").Filter(&performance));
        CHECK(!CategoryFilter("performances").Filter(&performance));
    }

    TEST(TestWithoutCategory_CountsAsUnitForTheFilter_ButIsNotRun)
    {
        ScriptedTest uncategorised = MakeTest("S", "T", nullptr);
        ScriptedTest emptyCategory = MakeTest("S", "T", "");
        TestFilter unit = CategoryFilter("unit");
        CHECK(unit.Filter(&uncategorised));
        CHECK(unit.Filter(&emptyCategory));
        CHECK(!CategoryFilter("integration").Filter(&uncategorised));
        CHECK(!unit(&uncategorised));
        CHECK(!unit(&emptyCategory));
        CHECK(unit.ignoredTests.empty());
    }

    TEST(ForcedRunOnly_SelectsOnlyRunPrefixedNames)
    {
        const ScriptedTest forcedSuite = MakeTest("RUN_Suite", "T");
        const ScriptedTest forcedTest = MakeTest("S", "RUN_Test");
        const ScriptedTest lowerCase = MakeTest("run_Suite", "T");
        const ScriptedTest inside = MakeTest("S", "T_RUN_");
        TestFilter filter;
        filter.forcedRunOnly = true;
        CHECK(filter.Filter(&forcedSuite));
        CHECK(filter.Filter(&forcedTest));
        CHECK(!filter.Filter(&lowerCase));
        CHECK(!filter.Filter(&inside));
        filter.Clear();
        CHECK(filter.Filter(&inside));
    }

    TEST(DisabledPrefix_IsIgnoredAndRecorded_OnlyAtTheStartAndInExactCase)
    {
        const ScriptedTest disabledSuite = MakeTest("DISABLED_Suite", "T");
        const ScriptedTest disabledTest = MakeTest("S", "DISABLED_T");
        const ScriptedTest lowerCase = MakeTest("disabled_Suite", "T");
        TestFilter filter;
        CHECK(!filter(&disabledSuite));
        CHECK(!filter(&disabledTest));
        CHECK(filter(&lowerCase));
        CHECK_EQUAL(2u, filter.ignoredTests.size());
        CHECK_EQUAL("DISABLED_Suite", filter.ignoredTests[0].details.suiteName);
        CHECK_EQUAL(static_cast<int>(DisabledTestInfo::kDisabledGeneric), static_cast<int>(filter.ignoredTests[0].kind));
        CHECK_EQUAL("", filter.ignoredTests[0].reason);
        CHECK_EQUAL(0, filter.ignoredTests[0].bugNumber);
    }

    TEST(IgnoredTestsOutsideTheFilter_AreNotRecorded)
    {
        const ScriptedTest disabled = MakeTest("DISABLED_Suite", "T");
        TestFilter filter = NameFilter("other");
        CHECK(!filter(&disabled));
        CHECK(filter.ignoredTests.empty());
    }

    TEST(KnownFailure_RecordsBugAndReason)
    {
        ScriptedTest test = MakeTest("S", "T");
        test.With(TestAttributes::KnownFailure(123, "flaky"));
        TestFilter filter;
        CHECK(!filter(&test));
        CHECK_EQUAL(1u, filter.ignoredTests.size());
        CHECK_EQUAL(static_cast<int>(DisabledTestInfo::kDisabledKnownFailure), static_cast<int>(filter.ignoredTests[0].kind));
        CHECK_EQUAL("flaky", filter.ignoredTests[0].reason);
        CHECK_EQUAL(123, filter.ignoredTests[0].bugNumber);
        CHECK_EQUAL(Testing::kUnitTestCategory, filter.ignoredTests[0].details.category);
    }

    TEST(KnownFailureAndNotYetImplemented_AreRecordedOnceAsNotYetImplemented)
    {
        ScriptedTest test = MakeTest("S", "T");
        test.With(TestAttributes::KnownFailure(5, "old")).With(TestAttributes::NotYetImplemented("new"));
        TestFilter filter;
        CHECK(!filter(&test));
        CHECK_EQUAL(1u, filter.ignoredTests.size());
        CHECK_EQUAL(static_cast<int>(DisabledTestInfo::kDisabledNotYetImplemented),
                    static_cast<int>(filter.ignoredTests[0].kind));
        CHECK_EQUAL("new", filter.ignoredTests[0].reason);
        CHECK_EQUAL(5, filter.ignoredTests[0].bugNumber);
    }

    TEST(NullReasons_LeaveTheReasonEmpty)
    {
        ScriptedTest test = MakeTest("S", "T");
        test.With(TestAttributes::NotYetImplemented(nullptr));
        TestFilter filter;
        filter(&test);
        CHECK_EQUAL(1u, filter.ignoredTests.size());
        CHECK_EQUAL("", filter.ignoredTests[0].reason);
    }

    TEST(IgnoreExtraLogOutput_DoesNotIgnoreTheTest)
    {
        ScriptedTest test = MakeTest("S", "T");
        test.With(TestAttributes::IgnoreExtraLogOutput());
        CHECK(!TestFilter::IsIgnored(&test));
        CHECK(TestAttributes::BaseAttribute::HasAttribute(TestAttributes::IgnoreExtraLogOutput::kType, &test));
        CHECK(!TestAttributes::BaseAttribute::HasAttribute(TestAttributes::KnownFailure::kType, &test));
    }

    TEST(Clear_KeepsTheIgnoredRecord)
    {
        const ScriptedTest disabled = MakeTest("DISABLED_S", "T");
        TestFilter filter = NameFilter("disabled");
        filter.AddCategory("unit");
        filter(&disabled);
        filter.Clear();
        CHECK(filter.matchNames.empty());
        CHECK(filter.categories.empty());
        CHECK_EQUAL(1u, filter.ignoredTests.size());
    }


    TEST(NamesAndCategoriesConstructor_TakesCategoriesFromTheNamesAtTheSameIndex)
    {
        const TestFilter filter({"Alpha", "Beta", "Gamma"}, {"Unit", "Stress"});
        CHECK_EQUAL(3u, filter.matchNames.size());
        CHECK_EQUAL("gamma", filter.matchNames[2]);
        CHECK_EQUAL(2u, filter.categories.size());
        CHECK_EQUAL("alpha", filter.categories[0]);
        CHECK_EQUAL("beta", filter.categories[1]);
        CHECK(!filter.forcedRunOnly);
    }

}
