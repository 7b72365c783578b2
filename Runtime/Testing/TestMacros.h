#pragma once
// Declaring suites and tests. Include Runtime/Testing/Testing.h rather than this file.
//
//   UNIT_TEST_SUITE(Geometry)            // or INTEGRATION_/PERFORMANCE_/STRESS_/REGRESSION_TEST_SUITE
//   {
//       TEST(Area_OfUnitSquare_IsOne) { CHECK_EQUAL(1.0f, Area(square)); }
//       TEST_FIXTURE(MeshFixture, Build_KeepsVertexCount) { CHECK_EQUAL(8u, mesh.vertexCount); }
//       TEST_WITH_ATTRIBUTES(Slow, TestAttributes::KnownFailure(123, "flaky")) { ... }
//   }
//
// A suite is a namespace named Suite + name + category constant (SuiteGeometrykUnitTestCategory),
// and every test in it carries that category. SUITE(Name) declares a suite without category; its
// tests are not run and fail with the no-suite message instead. Each test registers a factory
// test<Name>Factory with the list adder adder<Name> in Testing::GetTestList(); the test object
// itself is made only while the harness runs it.
//
// These macros replace the framework's own TEST/SUITE/TEST_FIXTURE: do not include
// <UnitTest++/UnitTestPP.h> or <UnitTest++/TestMacros.h> next to this file.

#include "Runtime/Testing/TestAttributes.h"
#include "Runtime/Testing/TestList.h"

#include <UnitTest++/TestDetails.h>

// Tests outside any suite.
namespace TestSuiteInfo
{
    inline const char* GetSuiteName() { return "DefaultSuite"; }
    inline const char* GetSuiteCategory() { return nullptr; }
}

#define HARNESS_IMPL_SUITE(NamespaceName, Name, CategoryExpression)     \
    namespace NamespaceName                                            \
    {                                                                  \
        namespace TestSuiteInfo                                        \
        {                                                              \
            inline const char* GetSuiteName() { return #Name; }        \
            inline const char* GetSuiteCategory() { return CategoryExpression; } \
        }                                                              \
    }                                                                  \
    namespace NamespaceName

#define TEST_SUITE_WITH_CATEGORY(Name, CategoryConstant) \
    HARNESS_IMPL_SUITE(Suite##Name##CategoryConstant, Name, ::Testing::CategoryConstant)

#define UNIT_TEST_SUITE(Name) TEST_SUITE_WITH_CATEGORY(Name, kUnitTestCategory)
#define INTEGRATION_TEST_SUITE(Name) TEST_SUITE_WITH_CATEGORY(Name, kIntegrationTestCategory)
#define PERFORMANCE_TEST_SUITE(Name) TEST_SUITE_WITH_CATEGORY(Name, kPerformanceTestCategory)
#define STRESS_TEST_SUITE(Name) TEST_SUITE_WITH_CATEGORY(Name, kStressTestCategory)
#define REGRESSION_TEST_SUITE(Name) TEST_SUITE_WITH_CATEGORY(Name, kRegressionTestCategory)
#define SUITE(Name) HARNESS_IMPL_SUITE(Suite##Name, Name, nullptr)

// The test class, its factory and its list adder. RunImpl and CreateAttributes are defined by
// the caller right after.
#define HARNESS_IMPL_TEST(ClassName, Name, FactoryName, AdderName)                                   \
    class ClassName : public ::Testing::Test                                                         \
    {                                                                                                \
    public:                                                                                          \
        ClassName()                                                                                  \
            : ::Testing::Test(#Name, TestSuiteInfo::GetSuiteName(), TestSuiteInfo::GetSuiteCategory(), \
                              __FILE__, __LINE__)                                                    \
        {                                                                                            \
        }                                                                                            \
        static ::Testing::Test* Create(void*) { return new ClassName(); }                            \
        void CreateAttributes(::Testing::TestAttributeList& attributes) const override;              \
                                                                                                     \
    private:                                                                                         \
        void RunImpl() const override;                                                               \
    };                                                                                               \
    ::Testing::TestFactory FactoryName = {&ClassName::Create, nullptr, nullptr};                     \
    ::Testing::ListAdder AdderName(::Testing::GetTestList(), &FactoryName);                          \
    void ClassName::CreateAttributes(::Testing::TestAttributeList& attributes) const

#define TEST_WITH_ATTRIBUTES(Name, ...)                                           \
    HARNESS_IMPL_TEST(Test##Name, Name, test##Name##Factory, adder##Name)         \
    {                                                                             \
        ::Testing::AppendAttributes(attributes __VA_OPT__(, ) __VA_ARGS__);       \
    }                                                                             \
    void Test##Name::RunImpl() const

#define TEST(Name) TEST_WITH_ATTRIBUTES(Name)

// The fixture is constructed fresh for each run of the test; the body is a member function of a
// class derived from it, so it sees the fixture's members directly.
#define TEST_FIXTURE_WITH_ATTRIBUTES(Fixture, Name, ...)                                                  \
    class Fixture##Name##Helper : public Fixture                                                          \
    {                                                                                                     \
    public:                                                                                               \
        explicit Fixture##Name##Helper(const UnitTest::TestDetails& details) : m_details(details) {}      \
        void RunImpl();                                                                                   \
        const UnitTest::TestDetails& m_details;                                                           \
    };                                                                                                    \
    HARNESS_IMPL_TEST(Test##Fixture##Name, Name, test##Fixture##Name##Factory, adder##Fixture##Name)      \
    {                                                                                                     \
        ::Testing::AppendAttributes(attributes __VA_OPT__(, ) __VA_ARGS__);                               \
    }                                                                                                     \
    void Test##Fixture##Name::RunImpl() const                                                             \
    {                                                                                                     \
        Fixture##Name##Helper fixtureHelper(m_details);                                                   \
        fixtureHelper.RunImpl();                                                                          \
    }                                                                                                     \
    void Fixture##Name##Helper::RunImpl()

#define TEST_FIXTURE(Fixture, Name) TEST_FIXTURE_WITH_ATTRIBUTES(Fixture, Name)
