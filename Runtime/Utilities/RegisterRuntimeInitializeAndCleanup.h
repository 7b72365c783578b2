#pragma once
// A registry of initialisation and clean-up callbacks, filled from static constructors.
// Initialisations run in ascending `order`; clean-ups run in descending order, including those
// of entries whose initialisation never ran.

#include <cstdint>

class RegisterRuntimeInitializeAndCleanup
{
public:
    typedef void (*CallbackFunction)(void* data);

    enum { kMaxCallbacks = 700 };

    RegisterRuntimeInitializeAndCleanup(CallbackFunction init, CallbackFunction cleanup, int order = 0,
                                        void* data = nullptr);
    ~RegisterRuntimeInitializeAndCleanup();
    RegisterRuntimeInitializeAndCleanup(const RegisterRuntimeInitializeAndCleanup&) = delete;
    RegisterRuntimeInitializeAndCleanup& operator=(const RegisterRuntimeInitializeAndCleanup&) = delete;

    // Returns the entry's token. Registering beyond kMaxCallbacks logs a fatal error and ends
    // the process with exit status -1.
    static uint64_t Register(CallbackFunction init, CallbackFunction cleanup, int order, void* data);
    static void Unregister(uint64_t token);  // no effect for an unknown token
    static void ExecuteInitializations();
    static void ExecuteCleanup();
    static int GetRegisteredCount();

private:
    uint64_t m_Token;
};
