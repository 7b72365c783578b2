#include "Runtime/Utilities/OrderedCallbackRegistry.h"

#include <algorithm>
#include <utility>

uint64_t OrderedCallbackRegistry::Add(OrderedCallbackFunction init, OrderedCallbackFunction cleanup, int order,
                                      void* data)
{
    const uint64_t token = m_NextToken++;
    m_Callbacks[m_Count++] = OrderedCallback{order, data, init, cleanup, token, false};
    return token;
}

void OrderedCallbackRegistry::Remove(uint64_t token)
{
    for (int i = 0; i < m_Count; ++i)
    {
        if (m_Callbacks[i].registrationToken == token)
        {
            std::swap(m_Callbacks[i], m_Callbacks[m_Count - 1]);
            --m_Count;
            return;
        }
    }
}

// Equal orders have no defined relative order; the stable sort keeps registration order.
void OrderedCallbackRegistry::SortByOrder()
{
    std::stable_sort(m_Callbacks, m_Callbacks + m_Count,
                     [](const OrderedCallback& a, const OrderedCallback& b) { return a.order < b.order; });
}

void OrderedCallbackRegistry::ExecuteInitializations()
{
    SortByOrder();
    for (int i = 0; i < m_Count; ++i)
    {
        OrderedCallback& entry = m_Callbacks[i];
        if (entry.init != nullptr && !entry.initCalled)
        {
            entry.init(entry.data);
            entry.initCalled = true;
        }
    }
}

void OrderedCallbackRegistry::ExecuteCleanup()
{
    SortByOrder();
    for (int i = m_Count - 1; i >= 0; --i)
    {
        OrderedCallback& entry = m_Callbacks[i];
        if (entry.cleanup != nullptr)
            entry.cleanup(entry.data);
        entry.initCalled = false;
    }
}
