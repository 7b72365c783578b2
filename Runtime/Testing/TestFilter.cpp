#include "Runtime/Testing/TestFilter.h"

#include "Runtime/Testing/TestAttributes.h"
#include "Runtime/Utilities/Word.h"

namespace Testing
{
namespace
{
    bool Contains(const std::string& text, const std::string& part)
    {
        return text.find(part) != std::string::npos;
    }

    bool NameBeginsWith(const Test* test, const char* prefix)
    {
        return BeginsWith(test->m_details.suiteName, prefix) || BeginsWith(test->m_details.testName, prefix);
    }

    // Pattern entries are lower case already; the names are lowered for the comparison.
    bool PatternMatches(const std::string& pattern, const std::string& suite, const std::string& test)
    {
        const size_t dot = pattern.find('.');
        if (dot == std::string::npos)
            return Contains(suite, pattern) || Contains(test, pattern);
        return Contains(suite, pattern.substr(0, dot)) && Contains(test, pattern.substr(dot + 1));
    }
}

TestFilter::TestFilter(const std::vector<std::string>& names, const std::vector<std::string>& categoryList)
    : categories(categoryList), matchNames(names)
{
    for (std::string& name : matchNames)
        ToLowerInplace(name);
    for (size_t i = 0; i < categories.size() && i < matchNames.size(); ++i)
        categories[i] = matchNames[i];
}

void TestFilter::AddFilterByName(const std::string& name)
{
    matchNames.push_back(ToLower(name));
}

void TestFilter::AddCategory(const std::string& category)
{
    categories.push_back(ToLower(category));
}

void TestFilter::Clear()
{
    categories.clear();
    matchNames.clear();
    forcedRunOnly = false;
}

bool TestFilter::IncludesCategory(const char* category) const
{
    if (categories.empty())
        return true;
    for (const std::string& wanted : categories)
    {
        if (BeginsWithCaseInsensitive(category, wanted))
            return true;
    }
    return false;
}

bool TestFilter::MatchesName(const Test* test) const
{
    if (matchNames.empty())
        return true;
    const std::string suite = ToLower(test->m_details.suiteName);
    const std::string name = ToLower(test->m_details.testName);
    for (const std::string& pattern : matchNames)
    {
        if (PatternMatches(pattern, suite, name))
            return true;
    }
    return false;
}

bool TestFilter::Filter(const Test* test) const
{
    if (forcedRunOnly && !IsForcedRun(test))
        return false;
    const char* category = HasValidCategory(test) ? test->Category() : "Unit";
    if (!IncludesCategory(category))
        return false;
    return MatchesName(test);
}

bool TestFilter::operator()(const Test* test)
{
    using TestAttributes::BaseAttribute;
    if (!Filter(test))
        return false;
    if (!IsIgnored(test))
        return HasValidCategory(test);

    DisabledTestInfo info(test->Details());
    if (auto known = static_cast<const TestAttributes::KnownFailure*>(
            BaseAttribute::GetAttribute(BaseAttribute::kKnownFailure, test)))
    {
        info.kind = DisabledTestInfo::kDisabledKnownFailure;
        if (known->reason != nullptr)
            info.reason = known->reason;
        info.bugNumber = known->bugNumber;
    }
    if (auto pending = static_cast<const TestAttributes::NotYetImplemented*>(
            BaseAttribute::GetAttribute(BaseAttribute::kNotYetImplemented, test)))
    {
        info.kind = DisabledTestInfo::kDisabledNotYetImplemented;
        if (pending->reason != nullptr)
            info.reason = pending->reason;
    }
    ignoredTests.push_back(info);
    return false;
}

bool TestFilter::IsIgnored(const Test* test)
{
    using TestAttributes::BaseAttribute;
    return BaseAttribute::HasAttribute(BaseAttribute::kKnownFailure, test) ||
           BaseAttribute::HasAttribute(BaseAttribute::kNotYetImplemented, test) ||
           NameBeginsWith(test, "DISABLED_");
}

bool TestFilter::IsForcedRun(const Test* test)
{
    return NameBeginsWith(test, "RUN_");
}

bool TestFilter::HasValidCategory(const Test* test)
{
    return test->Category() != nullptr && test->Category()[0] != '\0';
}
}
