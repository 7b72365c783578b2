#pragma once
// Selects the tests of a run by category and by name, and records the ignored tests it meets.
//
// Names: each entry of matchNames is a lower-cased substring pattern. "suite.test" must find the
// part before the first '.' in the suite name and the part after it in the test name (an empty
// part matches anything); an entry without '.' must occur in the suite name or the test name.
// Categories: an entry selects every category that begins with it, ignoring case ("perf" takes
// "Performance"). A test without category counts as "Unit" here.
// Tests whose suite or test name begins with "DISABLED_", or that carry KnownFailure or
// NotYetImplemented, are never run; tests whose suite or test name begins with "RUN_" are
// forced-run tests.

#include "Runtime/Testing/HarnessTest.h"

#include <string>
#include <vector>

namespace Testing
{
    struct DisabledTestInfo
    {
        enum Kind
        {
            kDisabledGeneric = 0,
            kDisabledKnownFailure = 1,
            kDisabledNotYetImplemented = 2
        };

        explicit DisabledTestInfo(const TestDetails& test) : details(test), kind(kDisabledGeneric), bugNumber(0) {}

        TestDetails details;
        Kind kind;
        std::string reason;
        int bugNumber;
    };

    class TestFilter
    {
    public:
        TestFilter() = default;
        // Category i is deliberately taken from names[i] (lower-cased), for every i below the
        // number of categories; the run entry points never use this constructor.
        TestFilter(const std::vector<std::string>& names, const std::vector<std::string>& categories);

        void AddFilterByName(const std::string& name);
        void AddCategory(const std::string& category);
        // Forgets names, categories and forcedRunOnly; the ignored-test record stays.
        void Clear();

        // Whether the test is selected by forced-run, category and name.
        bool Filter(const Test* test) const;
        // Whether the test is to be run; records it in ignoredTests when it is ignored.
        bool operator()(const Test* test);

        bool IncludesCategory(const char* category) const;

        static bool IsIgnored(const Test* test);
        static bool IsForcedRun(const Test* test);
        static bool HasValidCategory(const Test* test);

        std::vector<std::string> categories;
        std::vector<std::string> matchNames;
        bool forcedRunOnly = false;
        std::vector<DisabledTestInfo> ignoredTests;

    private:
        bool MatchesName(const Test* test) const;
    };
}
