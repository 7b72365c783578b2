#include "Runtime/Testing/TestList.h"

namespace Testing
{
void TestList::AddFactory(TestFactory* factory)
{
    factory->next = nullptr;
    if (m_FactoryTail == nullptr)
        m_FactoryHead = factory;
    else
        m_FactoryTail->next = factory;
    m_FactoryTail = factory;
}

void TestList::AddProcedurallyGeneratedTest(Test* test)
{
    test->m_nextTest = nullptr;
    if (m_GeneratedTail == nullptr)
        m_GeneratedHead = test;
    else
        m_GeneratedTail->m_nextTest = test;
    m_GeneratedTail = test;
}

void TestList::ForEachTest(const std::function<void(const Test&)>& visit) const
{
    for (const TestFactory* factory = m_FactoryHead; factory != nullptr; factory = factory->next)
    {
        Test* test = CreateTest(*factory);
        visit(*test);
        DestroyTest(test);
    }
    for (const UnitTest::Test* test = m_GeneratedHead; test != nullptr; test = test->m_nextTest)
        visit(static_cast<const Test&>(*test));
}

TestList& GetTestList()
{
    // Function-local so that registrations from any translation unit's static initialisers find
    // it constructed.
    static TestList list;
    return list;
}

Test* CreateTest(const TestFactory& factory)
{
    return factory.factoryFunction(factory.userParameter);
}

void DestroyTest(Test* test)
{
    test->ReleaseAttributes();
    delete test;
}
}
