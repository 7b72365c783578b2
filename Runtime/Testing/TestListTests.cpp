#include "Runtime/Testing/HarnessTestSupport.h"
#include "Runtime/Testing/Testing.h"

#include <string>

namespace
{
    // Counts the life of factory-made tests and of their attribute lists.
    struct Counters
    {
        int created = 0;
        int destroyed = 0;
        int attributesReleased = 0;
        std::string runs;
    };
    Counters s_Counters;

    class CountedTest : public Testing::Test
    {
    public:
        explicit CountedTest(const char* name) : Testing::Test(name, "Counted", Testing::kUnitTestCategory, "Counted.cpp", 1)
        {
            ++s_Counters.created;
        }
        ~CountedTest() override { ++s_Counters.destroyed; }

        void CreateAttributes(Testing::TestAttributeList& attributes) const override
        {
            attributes.push_back(new TestAttributes::IgnoreExtraLogOutput());
        }
        void DestroyAttributes(Testing::TestAttributeList& attributes) const override
        {
            ++s_Counters.attributesReleased;
            Testing::Test::DestroyAttributes(attributes);
        }

    private:
        void RunImpl() const override { s_Counters.runs += m_details.testName; }
    };

    Testing::Test* CreateFirst(void*) { return new CountedTest("First"); }
    Testing::Test* CreateNamed(void* name) { return new CountedTest(static_cast<const char*>(name)); }
}

UNIT_TEST_SUITE(TestList)
{
    TEST(Walk_VisitsFactoriesInRegistrationOrder_ThenGeneratedTests)
    {
        Testing::TestList list;
        HarnessTestSupport::ScriptedTest generated("Generated", "G", {});
        list.AddProcedurallyGeneratedTest(&generated);
        char second[] = "Second";
        Testing::TestFactory first = {&CreateFirst, nullptr, nullptr};
        Testing::TestFactory named = {&CreateNamed, second, nullptr};
        Testing::ListAdder addFirst(list, &first);
        Testing::ListAdder addNamed(list, &named);

        std::string order;
        list.ForEachTest([&](const Testing::Test& test) { order += std::string(test.m_details.testName) + " "; });
        CHECK_EQUAL("First Second G ", order);
    }

    TEST(Run_MakesAFreshObjectPerFactoryTest_AndDestroysIt)
    {
        const Testing::ChildResult run = HarnessTestSupport::RunAsFreshProcess([] {
            Testing::TestList list;
            Testing::TestFactory first = {&CreateFirst, nullptr, nullptr};
            list.AddFactory(&first);
            s_Counters = Counters();
            Testing::TestFilter filter;
            Testing::RunTestList(list, true, filter);
            // One object to measure the columns, one to add stand-ins, one to run, and one for the
            // log-attribute lookup at the test's start: each destroyed after use. Only the last two
            // look at attributes, so only they build (and release) an attribute list.
            printf_console("%d %d %d %s\n", s_Counters.created, s_Counters.destroyed, s_Counters.attributesReleased,
                           s_Counters.runs.c_str());
        });
        CHECK_EQUAL("4 4 2 First\n", run.out.substr(run.out.find('\n') + 1));
    }

    TEST(Attributes_AreMadeOnceOnFirstUse_AndReleasedBeforeDeletion)
    {
        s_Counters = Counters();
        Testing::Test* test = CreateFirst(nullptr);
        const Testing::TestAttributeList& first = test->Attributes();
        const Testing::TestAttributeList& again = test->Attributes();
        CHECK_EQUAL(1u, again.size());
        CHECK(&first == &again);
        Testing::DestroyTest(test);
        CHECK_EQUAL(1, s_Counters.attributesReleased);
        CHECK_EQUAL(1, s_Counters.destroyed);
    }
}
