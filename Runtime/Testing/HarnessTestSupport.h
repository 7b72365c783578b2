#pragma once
// Support for the harness's own tests: tests whose body, names, category and attributes are given
// at run time, a private list to run them in, and a clock-independent view of a report.

#include "Runtime/Logging/LogCapture.h"
#include "Runtime/Testing/ChildProcess.h"
#include "Runtime/Testing/Testing.h"

#include <functional>
#include <memory>
#include <regex>
#include <string>
#include <vector>

#include <unistd.h>

namespace HarnessTestSupport
{
    // A test built from a function. Names and file must outlive the test (string literals).
    class ScriptedTest : public Testing::Test
    {
    public:
        ScriptedTest(const char* suiteName, const char* testName, std::function<void()> body,
                     const char* category = Testing::kUnitTestCategory, const char* filename = "Inner.cpp",
                     int lineNumber = 10)
            : Testing::Test(testName, suiteName, category, filename, lineNumber), m_Body(std::move(body))
        {
        }

        template <class Attribute>
        ScriptedTest& With(const Attribute& attribute)
        {
            m_Prototypes.emplace_back(attribute.Clone());
            return *this;
        }

        void CreateAttributes(Testing::TestAttributeList& attributes) const override
        {
            for (const auto& prototype : m_Prototypes)
                attributes.push_back(prototype->Clone());
        }

    private:
        void RunImpl() const override
        {
            if (m_Body)
                m_Body();
        }

        std::function<void()> m_Body;
        std::vector<std::unique_ptr<TestAttributes::BaseAttribute>> m_Prototypes;
    };

    // Runs `body` in a child process that no longer sees the run it was forked from: a run started
    // there must not hand the enclosing test's reporter (log suppression on) back afterwards.
    inline Testing::ChildResult RunAsFreshProcess(const std::function<void()>& body)
    {
        return Testing::RunInChildProcess([&] {
            Testing::g_TestReporter = nullptr;
            body();
        });
    }

    // A private test list whose tests live as long as it does.
    class InnerTests
    {
    public:
        ScriptedTest& Add(const char* suiteName, const char* testName, std::function<void()> body = {},
                          const char* category = Testing::kUnitTestCategory)
        {
            // Each test gets a line of its own, as tests declared in one file would.
            const int line = 10 + static_cast<int>(m_Tests.size());
            m_Tests.push_back(
                std::make_unique<ScriptedTest>(suiteName, testName, std::move(body), category, "Inner.cpp", line));
            m_List.AddProcedurallyGeneratedTest(m_Tests.back().get());
            return *m_Tests.back();
        }

        Testing::TestList& List() { return m_List; }

        // Runs the list with `filter` in a child process; the child's exit status is the result.
        Testing::ChildResult RunInChild(Testing::TestFilter filter = {}, bool showOnlySummary = false)
        {
            return RunAsFreshProcess([&] {
                const int failed = Testing::RunTestList(m_List, showOnlySummary, filter);
                fflush(nullptr);
                _exit(failed);
            });
        }

    private:
        Testing::TestList m_List;
        std::vector<std::unique_ptr<ScriptedTest>> m_Tests;
    };

    // Elapsed times vary from run to run: "PASS(12ms" becomes "PASS(#ms" and "in 0.01 seconds"
    // becomes "in # seconds". Everything else is left exactly as printed.
    inline std::string WithoutTimes(const std::string& report)
    {
        const std::string passes = std::regex_replace(report, std::regex("PASS\\([0-9]+ms"), "PASS(#ms");
        return std::regex_replace(passes, std::regex("in [0-9]+\\.[0-9][0-9] seconds"), "in # seconds");
    }

    // Everything printed with printf_console while `body` runs, in one string.
    inline std::string CaptureConsole(const std::function<void()>& body)
    {
        std::string text;
        for (const LogCapture::Line& line : LogCapture::Capture(body).console)
            text += line.text;
        return text;
    }
}
