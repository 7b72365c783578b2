// Disjoint sets over 0 .. n-1 with path halving. A set's root is always its smallest member, so
// numbering sets by their roots does not depend on the order of the joins.
#pragma once

#include <cstdint>
#include <numeric>
#include <vector>

class UnionFind
{
public:
    explicit UnionFind(size_t n) : m_Parent(n) { std::iota(m_Parent.begin(), m_Parent.end(), 0u); }

    uint32_t Root(uint32_t i)
    {
        while (m_Parent[i] != i)
            i = m_Parent[i] = m_Parent[m_Parent[i]];
        return i;
    }

    void Join(uint32_t a, uint32_t b)
    {
        a = Root(a), b = Root(b);
        if (a != b)
            m_Parent[a < b ? b : a] = a < b ? a : b;
    }

private:
    std::vector<uint32_t> m_Parent;
};
