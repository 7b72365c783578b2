#include "Runtime/Utilities/RegisterRuntimeInitializeAndCleanup.h"

#include "Runtime/Logging/LogAssert.h"
#include "Runtime/Utilities/OrderedCallbackRegistry.h"

#include <cstdio>
#include <cstdlib>

static_assert(RegisterRuntimeInitializeAndCleanup::kMaxCallbacks == OrderedCallbackRegistry::kMaxCallbacks);

namespace
{
    // Registration happens from static constructors of other translation units, so the registry
    // is initialised before any of them run.
    constinit OrderedCallbackRegistry s_Registry;

    [[noreturn]] void ReportLimitAndExit()
    {
        char message[128];
        snprintf(message, sizeof(message),
                 "RegisterRuntimeInitializeAndCleanup::Register has reached the limit %d MaxLimit %d",
                 s_Registry.GetCount(), OrderedCallbackRegistry::kMaxCallbacks);
        DebugStringToFile(message, 0, "Runtime/Utilities/RegisterRuntimeInitializeAndCleanup.cpp", 41, kError | kFatal);
        exit(-1);
    }
}

RegisterRuntimeInitializeAndCleanup::RegisterRuntimeInitializeAndCleanup(CallbackFunction init,
                                                                         CallbackFunction cleanup, int order,
                                                                         void* data)
    : m_Token(Register(init, cleanup, order, data))
{
}

RegisterRuntimeInitializeAndCleanup::~RegisterRuntimeInitializeAndCleanup()
{
    Unregister(m_Token);
}

uint64_t RegisterRuntimeInitializeAndCleanup::Register(CallbackFunction init, CallbackFunction cleanup, int order,
                                                       void* data)
{
    if (s_Registry.IsFull())
        ReportLimitAndExit();
    return s_Registry.Add(init, cleanup, order, data);
}

void RegisterRuntimeInitializeAndCleanup::Unregister(uint64_t token)
{
    s_Registry.Remove(token);
}

void RegisterRuntimeInitializeAndCleanup::ExecuteInitializations()
{
    s_Registry.ExecuteInitializations();
}

void RegisterRuntimeInitializeAndCleanup::ExecuteCleanup()
{
    s_Registry.ExecuteCleanup();
}

int RegisterRuntimeInitializeAndCleanup::GetRegisteredCount()
{
    return s_Registry.GetCount();
}
