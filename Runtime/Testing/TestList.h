#pragma once
// The list of registered tests, in two parts that are always walked in this order:
//   1. test factories: each makes a fresh test object on demand (the caller destroys it after use
//      with DestroyTest), so no test object lives between runs;
//   2. procedurally generated tests: test objects made at run time and kept, linked through the
//      framework's m_nextTest.
// Registration happens during static initialisation through ListAdder objects, in the order of
// the initialisers.

#include "Runtime/Testing/HarnessTest.h"

#include <functional>

namespace Testing
{
    typedef Test* (*TestCreator)(void* userParameter);

    // One registered test: {creator, userParameter, next}. `next` is set when it is linked into a
    // list and must start out null.
    struct TestFactory
    {
        TestCreator factoryFunction;
        void* userParameter;
        TestFactory* next;
    };

    class TestList
    {
    public:
        void AddFactory(TestFactory* factory);
        void AddProcedurallyGeneratedTest(Test* test);

        TestFactory* GetFactoryHead() const { return m_FactoryHead; }
        Test* GetProcedurallyGeneratedHead() const { return m_GeneratedHead; }

        // Calls `visit` with every test: a fresh object for each factory (destroyed right after the
        // call), then each procedurally generated test.
        void ForEachTest(const std::function<void(const Test&)>& visit) const;

    private:
        TestFactory* m_FactoryHead = nullptr;
        TestFactory* m_FactoryTail = nullptr;
        Test* m_GeneratedHead = nullptr;
        Test* m_GeneratedTail = nullptr;
    };

    // The process-wide list that the test macros register into and RunNativeTests runs.
    TestList& GetTestList();

    // Makes a factory's test, and destroys it again (attributes first, then the object).
    Test* CreateTest(const TestFactory& factory);
    void DestroyTest(Test* test);

    // Constructing one links a factory (or a generated test) into a list; used as a static object.
    class ListAdder
    {
    public:
        ListAdder(TestList& list, TestFactory* factory) { list.AddFactory(factory); }
        ListAdder(TestList& list, Test* generatedTest) { list.AddProcedurallyGeneratedTest(generatedTest); }
    };
}
