#pragma once
// The harness's test class. The packaged framework's UnitTest::Test knows only a name, a suite, a
// file and a line; the harness adds what selecting and reporting tests needs on top of it:
//   - a category ("Unit", "Integration", ...; null or empty means none),
//   - a list of attributes (KnownFailure, IgnoreExtraLogOutput, ...) that the test builds on demand.
// Every test that the harness runs is a Testing::Test.

#include <UnitTest++/Test.h>

#include <vector>

namespace Testing
{
    // Base of everything a test can carry in its attribute list. Attributes are owned by the test
    // that created them and destroyed through this virtual destructor.
    class TestAttribute
    {
    public:
        virtual ~TestAttribute();
    };

    typedef std::vector<const TestAttribute*> TestAttributeList;

    // A copyable description of a test: the framework's fields plus the category. (The packaged
    // framework's own TestDetails cannot be copied, so records that outlive an event use this.)
    struct TestDetails
    {
        TestDetails() = default;
        explicit TestDetails(const UnitTest::TestDetails& details, const char* testCategory = nullptr)
            : suiteName(details.suiteName),
              testName(details.testName),
              filename(details.filename),
              category(testCategory),
              lineNumber(details.lineNumber)
        {
        }

        const char* suiteName = nullptr;
        const char* testName = nullptr;
        const char* filename = nullptr;
        const char* category = nullptr;  // null or empty: no category
        int lineNumber = -1;
    };

    class Test : public UnitTest::Test
    {
    public:
        Test(const char* testName, const char* suiteName, const char* category, const char* filename,
             int lineNumber);
        ~Test() override;

        // The category this test was declared with; may be null.
        const char* Category() const { return m_Category; }
        TestDetails Details() const { return TestDetails(m_details, m_Category); }

        // The attribute list, built by CreateAttributes on first use and kept until the test dies.
        const TestAttributeList& Attributes() const;

        // Fills `attributes` with this test's attributes (new objects). Adds nothing by default.
        virtual void CreateAttributes(TestAttributeList& attributes) const;
        // Destroys what CreateAttributes made: by default deletes every non-null entry and empties
        // the list.
        virtual void DestroyAttributes(TestAttributeList& attributes) const;

        // Hands the attribute list back through DestroyAttributes while the object is still whole.
        // The harness calls it before deleting a test; the destructor only cleans up what is left.
        void ReleaseAttributes() const;

    private:
        const char* m_Category;
        mutable TestAttributeList m_Attributes;
        mutable bool m_AttributesCreated = false;
    };
}
