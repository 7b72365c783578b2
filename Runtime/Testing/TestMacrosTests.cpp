#include "Runtime/Testing/Testing.h"

#include <string>

namespace
{
    struct CounterFixture
    {
        CounterFixture() : value(41) {}
        int value;
    };
}

UNIT_TEST_SUITE(TestMacros)
{
    TEST(Test_CarriesSuiteNameAndUnitCategory)
    {
        CHECK_EQUAL("TestMacros", UnitTest::CurrentTest::Details()->suiteName);
        CHECK_EQUAL("Test_CarriesSuiteNameAndUnitCategory", UnitTest::CurrentTest::Details()->testName);
        CHECK_EQUAL(Testing::kUnitTestCategory, Category());
        CHECK(Attributes().empty());
    }

    TEST_WITH_ATTRIBUTES(Attributes_AreCarriedInDeclarationOrder, TestAttributes::IgnoreExtraLogOutput(),
                         TestAttributes::ExternalCSharpResource("a.cs"))
    {
        using TestAttributes::BaseAttribute;
        CHECK_EQUAL(2u, Attributes().size());
        CHECK(BaseAttribute::HasAttribute(TestAttributes::IgnoreExtraLogOutput::kType, this));
        const auto* resource = static_cast<const TestAttributes::ExternalCSharpResource*>(
            BaseAttribute::GetAttribute(TestAttributes::ExternalCSharpResource::kType, this));
        CHECK(resource != nullptr && resource->filePath != nullptr && std::string(resource->filePath) == "a.cs");
        CHECK(!BaseAttribute::HasAttribute(BaseAttribute::kKnownFailure, this));
    }

    TEST_FIXTURE(CounterFixture, Fixture_IsConstructedBeforeTheBody)
    {
        ++value;
        CHECK_EQUAL(42, value);
    }
}

INTEGRATION_TEST_SUITE(TestMacros)
{
    TEST(IntegrationSuite_CarriesItsCategory)
    {
        CHECK_EQUAL(Testing::kIntegrationTestCategory, Category());
        CHECK_EQUAL("TestMacros", m_details.suiteName);
    }
}
