#include "Runtime/Testing/Testing.h"

#include "Runtime/Logging/LogAssert.h"
#include "Runtime/Testing/ChildProcess.h"
#include "Runtime/Utilities/OrderedCallbackRegistry.h"
#include "Runtime/Utilities/RegisterRuntimeInitializeAndCleanup.h"

#include <memory>
#include <string>

namespace
{
    // Each callback appends "<kind><data>" to the trace, data being a small tag.
    std::string trace;

    void Init(void* data)
    {
        trace += "i" + std::to_string(reinterpret_cast<intptr_t>(data)) + " ";
    }

    void Cleanup(void* data)
    {
        trace += "c" + std::to_string(reinterpret_cast<intptr_t>(data)) + " ";
    }

    void* Tag(intptr_t value)
    {
        return reinterpret_cast<void*>(value);
    }
}

UNIT_TEST_SUITE(RegisterRuntimeInitializeAndCleanup)
{
    TEST(InitRunsAscending_CleanupDescending)
    {
        auto registry = std::make_unique<OrderedCallbackRegistry>();
        registry->Add(Init, Cleanup, 5, Tag(5));
        registry->Add(Init, Cleanup, 1, Tag(1));
        registry->Add(Init, Cleanup, 3, Tag(3));
        trace.clear();
        registry->ExecuteInitializations();
        CHECK_EQUAL("i1 i3 i5 ", trace);
        trace.clear();
        registry->ExecuteCleanup();
        CHECK_EQUAL("c5 c3 c1 ", trace);
    }

    TEST(InitRunsOnce_UntilCleanupResetsIt)
    {
        auto registry = std::make_unique<OrderedCallbackRegistry>();
        registry->Add(Init, Cleanup, 0, Tag(1));
        trace.clear();
        registry->ExecuteInitializations();
        registry->ExecuteInitializations();
        CHECK_EQUAL("i1 ", trace);
        registry->ExecuteCleanup();
        registry->ExecuteInitializations();
        CHECK_EQUAL("i1 c1 i1 ", trace);
    }

    TEST(Cleanup_RunsForEntriesNeverInitialised_AndSkipsMissingCallbacks)
    {
        auto registry = std::make_unique<OrderedCallbackRegistry>();
        registry->Add(nullptr, Cleanup, 2, Tag(2));
        registry->Add(Init, nullptr, 1, Tag(1));
        trace.clear();
        registry->ExecuteCleanup();
        CHECK_EQUAL("c2 ", trace);
        trace.clear();
        registry->ExecuteInitializations();
        CHECK_EQUAL("i1 ", trace);
    }

    TEST(Remove_TakesOutOnlyThatToken_TokensCountFromZero)
    {
        auto registry = std::make_unique<OrderedCallbackRegistry>();
        const uint64_t first = registry->Add(Init, nullptr, 1, Tag(1));
        const uint64_t second = registry->Add(Init, nullptr, 2, Tag(2));
        registry->Add(Init, nullptr, 3, Tag(3));
        CHECK_EQUAL(0u, first);
        CHECK_EQUAL(1u, second);
        registry->Remove(second);
        registry->Remove(99);
        CHECK_EQUAL(2, registry->GetCount());
        trace.clear();
        registry->ExecuteInitializations();
        CHECK_EQUAL("i1 i3 ", trace);
    }

    TEST(RegisterObject_UnregistersItselfOnDestruction)
    {
        const int before = RegisterRuntimeInitializeAndCleanup::GetRegisteredCount();
        {
            RegisterRuntimeInitializeAndCleanup entry(nullptr, nullptr, 0, nullptr);
            CHECK_EQUAL(before + 1, RegisterRuntimeInitializeAndCleanup::GetRegisteredCount());
        }
        CHECK_EQUAL(before, RegisterRuntimeInitializeAndCleanup::GetRegisteredCount());
    }

    TEST(Registration701_LogsFatalLimitAndExitsWithMinusOne)
    {
        Testing::ChildResult child = Testing::RunInChildProcess([] {
            SetLogEntryHandler(nullptr);
            while (RegisterRuntimeInitializeAndCleanup::GetRegisteredCount() < 700)
                RegisterRuntimeInitializeAndCleanup::Register(nullptr, nullptr, 0, nullptr);
            printf_console("full\n");
            RegisterRuntimeInitializeAndCleanup::Register(nullptr, nullptr, 0, nullptr);
            printf_console("not reached\n");
        });
        CHECK(child.exited);
        CHECK_EQUAL(255, child.exitStatus);
        CHECK_EQUAL("full\nRegisterRuntimeInitializeAndCleanup::Register has reached the limit 700 MaxLimit 700 "
                    "(Filename: Runtime/Utilities/RegisterRuntimeInitializeAndCleanup.cpp Line: 41)\n",
                    child.out);
    }
}
