#pragma once
// The storage and ordering behind RegisterRuntimeInitializeAndCleanup: a fixed array of entries
// with a count and a token counter. A separate class so that tests can use a registry of their
// own instead of the process-wide one.

#include <cstdint>

typedef void (*OrderedCallbackFunction)(void* data);

struct OrderedCallback
{
    int order = 0;
    void* data = nullptr;  // handed to both callbacks
    OrderedCallbackFunction init = nullptr;
    OrderedCallbackFunction cleanup = nullptr;
    uint64_t registrationToken = 0;
    bool initCalled = false;
};

class OrderedCallbackRegistry
{
public:
    static constexpr int kMaxCallbacks = 700;

    // Constant-initialisable, so that a static registry is usable from other static constructors.
    constexpr OrderedCallbackRegistry() = default;

    bool IsFull() const { return m_Count >= kMaxCallbacks; }
    int GetCount() const { return m_Count; }

    // Adds an entry and returns its token; the caller checks IsFull() first.
    uint64_t Add(OrderedCallbackFunction init, OrderedCallbackFunction cleanup, int order, void* data);
    // Swaps the entry with the last one and shortens the list; no effect for an unknown token.
    void Remove(uint64_t token);
    // Ascending order; each init runs once until the next clean-up.
    void ExecuteInitializations();
    // Descending order; every clean-up runs, also of entries whose init never ran.
    void ExecuteCleanup();

private:
    void SortByOrder();

    OrderedCallback m_Callbacks[kMaxCallbacks] = {};
    int m_Count = 0;
    uint64_t m_NextToken = 0;
};
