// A 4-ary min-heap of (cost, triangle, chart) entries, for chart growing: half the levels of a
// binary heap, and the four children of an entry share a cache line or two, so a pop costs fewer
// misses. Ties in cost go to the lower triangle, then the lower chart: the order of pops is fully
// determined by the entries, whatever the heap's shape (byte-identical runs).
#pragma once

#include "Scratch.h"

#include <stdint.h>

struct HeapEntry
{
    double cost;
    uint32_t triangle, chart;
};

class MinHeap
{
public:
    bool Allocate(uint64_t capacity)
    {
        m_Size = 0;
        m_Capacity = capacity;
        return m_Entries.Allocate(capacity ? capacity : 1);
    }
    bool Empty() const { return m_Size == 0; }
    void Clear() { m_Size = 0; }

    // Doubles the room when full; false (and nothing pushed) when that memory is out.
    bool Push(const HeapEntry& entry)
    {
        if (m_Size == m_Capacity)
        {
            if (!m_Entries.Grow(m_Size, 2 * m_Capacity + 16))
                return false;
            m_Capacity = 2 * m_Capacity + 16;
        }
        uint64_t i = m_Size++;
        while (i > 0 && Before(entry, m_Entries[(i - 1) / 4]))
        {
            m_Entries[i] = m_Entries[(i - 1) / 4];
            i = (i - 1) / 4;
        }
        m_Entries[i] = entry;
        return true;
    }

    HeapEntry Pop()
    {
        HeapEntry top = m_Entries[0], last = m_Entries[--m_Size];
        uint64_t i = 0;
        for (;;)
        {
            uint64_t first = 4 * i + 1, child = first;
            if (first >= m_Size)
                break;
            for (uint64_t k = first + 1; k < first + 4 && k < m_Size; ++k)
                child = Before(m_Entries[k], m_Entries[child]) ? k : child;
            if (!Before(m_Entries[child], last))
                break;
            m_Entries[i] = m_Entries[child];
            i = child;
        }
        if (m_Size)
            m_Entries[i] = last;
        return top;
    }

private:
    static bool Before(const HeapEntry& a, const HeapEntry& b)
    {
        if (a.cost != b.cost)
            return a.cost < b.cost;
        return a.triangle != b.triangle ? a.triangle < b.triangle : a.chart < b.chart;
    }

    Scratch<HeapEntry> m_Entries;
    uint64_t m_Size = 0, m_Capacity = 0;
};
