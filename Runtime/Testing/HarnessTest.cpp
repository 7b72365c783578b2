#include "Runtime/Testing/HarnessTest.h"

namespace Testing
{
TestAttribute::~TestAttribute() = default;

Test::Test(const char* testName, const char* suiteName, const char* category, const char* filename,
           int lineNumber)
    : UnitTest::Test(testName, suiteName, filename, lineNumber), m_Category(category)
{
}

Test::~Test()
{
    // A derived DestroyAttributes can no longer run here; the base version releases what is left.
    Test::DestroyAttributes(m_Attributes);
}

const TestAttributeList& Test::Attributes() const
{
    if (!m_AttributesCreated)
    {
        m_AttributesCreated = true;
        CreateAttributes(m_Attributes);
    }
    return m_Attributes;
}

void Test::CreateAttributes(TestAttributeList&) const
{
}

void Test::DestroyAttributes(TestAttributeList& attributes) const
{
    for (const TestAttribute* attribute : attributes)
        delete attribute;
    attributes.clear();
}

void Test::ReleaseAttributes() const
{
    if (m_AttributesCreated)
        DestroyAttributes(m_Attributes);
    m_Attributes.clear();
    m_AttributesCreated = false;
}
}
