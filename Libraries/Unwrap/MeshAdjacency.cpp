#include "MeshAdjacency.h"

#include "Scratch.h"
#include "WinImports.h"

namespace
{
    uint32_t LowEnd(const uint32_t* tri, uint32_t h)
    {
        uint32_t a = tri[h], b = tri[NextCorner(h)];
        return a < b ? a : b;
    }

    uint32_t HighEnd(const uint32_t* tri, uint32_t h)
    {
        uint32_t a = tri[h], b = tri[NextCorner(h)];
        return a < b ? b : a;
    }

    // Stable counting sort of `in` (n half-edges) by key(h) < vertexCount into `out`.
    template <typename Key>
    void SortByVertex(const uint32_t* in, uint32_t n, uint32_t vertexCount, uint32_t* count, uint32_t* out, Key key)
    {
        memset(count, 0, ((uint64_t)vertexCount + 1) * sizeof(uint32_t));
        for (uint32_t i = 0; i < n; ++i)
            ++count[key(in[i]) + 1];
        for (uint32_t v = 0; v < vertexCount; ++v)
            count[v + 1] += count[v];
        for (uint32_t i = 0; i < n; ++i)
            out[count[key(in[i])]++] = in[i];
    }

    // Links the run sorted[begin, end) of half-edges that join the same two vertices.
    void LinkRun(const uint32_t* tri, const uint32_t* sorted, uint32_t begin, uint32_t end, uint32_t* twin)
    {
        if (end - begin != 2)
            return;
        uint32_t a = sorted[begin], b = sorted[begin + 1];
        bool opposite = tri[a] != tri[b];
        bool properEdge = tri[a] != tri[NextCorner(a)];
        if (opposite && properEdge && a / 3 != b / 3)
        {
            twin[a] = b;
            twin[b] = a;
        }
    }
}

bool FindTwins(const uint32_t* tri, uint32_t triCount, uint32_t vertexCount, uint32_t* twin)
{
    uint32_t n = 3 * triCount;
    Scratch<uint32_t> count, byHigh, sorted;
    if (!count.Allocate((uint64_t)vertexCount + 1) || !byHigh.Allocate(n) || !sorted.Allocate(n))
        return false;
    for (uint32_t h = 0; h < n; ++h)
    {
        twin[h] = kNoTwin;
        sorted[h] = h;
    }
    SortByVertex(sorted.Data(), n, vertexCount, count.Data(), byHigh.Data(), [tri](uint32_t h) { return HighEnd(tri, h); });
    SortByVertex(byHigh.Data(), n, vertexCount, count.Data(), sorted.Data(), [tri](uint32_t h) { return LowEnd(tri, h); });
    uint32_t begin = 0;
    for (uint32_t i = 1; i <= n; ++i)
    {
        bool sameEdge = i < n && LowEnd(tri, sorted[i]) == LowEnd(tri, sorted[begin]) &&
                        HighEnd(tri, sorted[i]) == HighEnd(tri, sorted[begin]);
        if (!sameEdge)
        {
            LinkRun(tri, sorted.Data(), begin, i, twin);
            begin = i;
        }
    }
    return true;
}
