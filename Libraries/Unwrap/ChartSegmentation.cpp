#include "ChartSegmentation.h"

#include "MeshAdjacency.h"
#include "Scratch.h"
#include "WinImports.h"

namespace
{
    bool OnChartBoundary(const ChartMesh& mesh, const uint32_t* chartOf, uint32_t t)
    {
        for (uint32_t h = 3 * t; h < 3 * t + 3; ++h)
            if (mesh.twin[h] == kNoTwin || chartOf[mesh.twin[h] / 3] != chartOf[t])
                return true;
        return false;
    }

    // seedOf[c] = the triangle of chart c farthest (in steps across linked edges inside the chart)
    // from the chart's boundary, the lowest such triangle on ties. `queue`, `depth`: room for T.
    void InnermostTriangles(const ChartMesh& mesh, const uint32_t* chartOf, uint32_t charts, uint32_t* seedOf,
                            uint32_t* queue, uint32_t* depth)
    {
        uint32_t head = 0, tail = 0;
        for (uint32_t t = 0; t < mesh.triCount; ++t)
        {
            depth[t] = kNoChart;
            if (chartOf[t] != kNoChart && OnChartBoundary(mesh, chartOf, t))
            {
                depth[t] = 0;
                queue[tail++] = t;
            }
        }
        while (head < tail)
        {
            uint32_t t = queue[head++];
            for (uint32_t h = 3 * t; h < 3 * t + 3; ++h)
            {
                uint32_t w = mesh.twin[h] / 3;
                if (mesh.twin[h] != kNoTwin && depth[w] == kNoChart && chartOf[w] == chartOf[t])
                {
                    depth[w] = depth[t] + 1;
                    queue[tail++] = w;
                }
            }
        }
        for (uint32_t c = 0; c < charts; ++c)
            seedOf[c] = kNoChart;
        for (uint32_t t = 0; t < mesh.triCount; ++t)
        {
            uint32_t c = chartOf[t];
            if (c != kNoChart && (seedOf[c] == kNoChart || depth[t] > depth[seedOf[c]]))
                seedOf[c] = t;
        }
    }

    void SumProxies(const ChartMesh& mesh, const uint32_t* chartOf, uint32_t charts, ChartProxy* proxy)
    {
        for (uint32_t c = 0; c < charts; ++c)
            proxy[c] = {{0, 0, 0}, {0, 0, 0}, 0, 0, 0};
        for (uint32_t t = 0; t < mesh.triCount; ++t)
            if (chartOf[t] != kNoChart)
            {
                ChartProxy& p = proxy[chartOf[t]];
                p.normalSum = p.normalSum + mesh.normal[t] * mesh.area[t];
                p.curvature += mesh.curvature[t];
                p.area += mesh.area[t];
                ++p.triangles;
            }
    }

    // One Lloyd round; returns the number of charts after it.
    uint32_t LloydRound(const ChartMesh& mesh, const GrowRules& rules, ChartGrower& grower, uint32_t charts, uint32_t* chartOf,
                        uint32_t* seedOf, uint32_t* queue, uint32_t* depth)
    {
        SumProxies(mesh, chartOf, charts, grower.Proxies());
        InnermostTriangles(mesh, chartOf, charts, seedOf, queue, depth);
        for (uint32_t t = 0; t < mesh.triCount; ++t)
            chartOf[t] = kNoChart;
        GrowRules fixed = rules;
        fixed.fixedProxies = true;
        for (uint32_t c = 0; c < charts; ++c)   // a seed already taken with another's polygon leaves c empty
            if (seedOf[c] != kNoChart && chartOf[seedOf[c]] == kNoChart)
                grower.Seed(seedOf[c], c, fixed);
        grower.Grow(fixed);
        uint32_t next = charts;
        grower.GrowRemaining(nullptr, mesh.triCount, rules, &next);
        return next;
    }

    struct Cone
    {
        Vec3 axis;
        double halfAngle;
    };

    double AngleBetweenUnit(const Vec3& a, const Vec3& b) { return AngleOf(Length(Cross(a, b)), Dot(a, b)); }

    struct Border
    {
        uint32_t a, b;   // charts, a != b
        double length;
    };

    // order[] = the charts by area, smallest first, then by number (shell sort: charts may be many).
    void SmallestFirst(const ChartProxy* proxy, uint32_t charts, uint32_t* order)
    {
        for (uint32_t c = 0; c < charts; ++c)
            order[c] = c;
        auto smaller = [proxy](uint32_t x, uint32_t y) {
            return proxy[x].area != proxy[y].area ? proxy[x].area < proxy[y].area : x < y;
        };
        for (uint32_t gap = charts / 2; gap > 0; gap = gap == 2 ? 1 : gap * 5 / 11)
            for (uint32_t i = gap; i < charts; ++i)
            {
                uint32_t x = order[i], j = i;
                for (; j >= gap && smaller(x, order[j - gap]); j -= gap)
                    order[j] = order[j - gap];
                order[j] = x;
            }
    }

    // Fills borders[] with one entry per pair of neighbouring charts (a, b), a != b, both
    // directions, with the total length of linked edges between them, grouped by a and sorted by b
    // (two counting sorts); first[a] .. first[a + 1] are a's entries. Returns the number of entries.
    uint32_t CollectBorders(const ChartMesh& mesh, const uint32_t* chartOf, uint32_t charts, Border* borders, Border* sorted,
                            uint32_t* first)
    {
        uint32_t n = 0;
        for (uint32_t h = 0; h < 3 * mesh.triCount; ++h)
        {
            uint32_t a = chartOf[h / 3], b = mesh.twin[h] == kNoTwin ? kNoChart : chartOf[mesh.twin[h] / 3];
            if (a == kNoChart || b == kNoChart || a == b)
                continue;
            borders[n++] = {a, b, mesh.edgeLength[h]};
        }
        for (int pass = 0; pass < 2; ++pass)   // by b, then stably by a
        {
            Border* from = pass == 0 ? borders : sorted;
            Border* to = pass == 0 ? sorted : borders;
            memset(first, 0, (charts + 1ull) * sizeof(uint32_t));
            for (uint32_t i = 0; i < n; ++i)
                ++first[(pass == 0 ? from[i].b : from[i].a) + 1];
            for (uint32_t c = 0; c < charts; ++c)
                first[c + 1] += first[c];
            for (uint32_t i = 0; i < n; ++i)
                to[first[pass == 0 ? from[i].b : from[i].a]++] = from[i];
        }
        uint32_t m = 0;
        for (uint32_t i = 0; i < n; ++i)
        {
            if (m > 0 && borders[m - 1].a == borders[i].a && borders[m - 1].b == borders[i].b)
                borders[m - 1].length += borders[i].length;
            else
                borders[m++] = borders[i];
        }
        memset(first, 0, (charts + 1ull) * sizeof(uint32_t));
        for (uint32_t i = 0; i < m; ++i)
            ++first[borders[i].a + 1];
        for (uint32_t c = 0; c < charts; ++c)
            first[c + 1] += first[c];
        return m;
    }

    // --- Merges that would wrap a vertex ----------------------------------------------------
    // Two charts that both hold corners at a vertex v, whose 3D angles there together pass
    // kWrapLimit while the union's fan at v stays open (v on a border of the cut surface, or a
    // third chart at v), would make a chart that folds over itself in its conformal map: the
    // flattening checks would split it again, into more pieces than the two it came from.
    // WrapPairs lists such pairs as sorted keys (smaller chart << 32 | larger chart).
    struct WrapPairs
    {
        Scratch<uint64_t> keys;
        uint32_t count = 0;

        bool Contains(uint32_t a, uint32_t b) const
        {
            uint64_t key = a < b ? (uint64_t)a << 32 | b : (uint64_t)b << 32 | a;
            uint32_t low = 0, high = count;
            while (low < high)
            {
                uint32_t mid = low + (high - low) / 2;
                if (keys[mid] < key)
                    low = mid + 1;
                else
                    high = mid;
            }
            return low < count && keys[low] == key;
        }
    };

    // Calls found(a, b) for every pair of charts that would wrap vertex v. Vertices with more
    // than kMaxChartsAtVertex charts are left to the flattening checks.
    const uint32_t kMaxChartsAtVertex = 8;
    template <typename Found>
    void WrapsAtVertex(const ChartMesh& mesh, const uint32_t* chartOf, uint32_t v, Found found)
    {
        uint32_t chart[kMaxChartsAtVertex], n = 0;
        double angle[kMaxChartsAtVertex];
        bool open = false;
        for (uint32_t i = mesh.aroundStart[v]; i < mesh.aroundStart[v + 1]; ++i)
        {
            uint32_t corner = mesh.around[i], into = PreviousCorner(corner);
            open = open || mesh.twin[corner] == kNoTwin || mesh.twin[into] == kNoTwin;
            uint32_t c = chartOf[corner / 3], k = 0;
            if (c == kNoChart)
            {
                open = true;
                continue;
            }
            while (k < n && chart[k] != c)
                ++k;
            if (k == n)
            {
                if (n == kMaxChartsAtVertex)
                    return;
                chart[n] = c, angle[n++] = 0;
            }
            angle[k] += mesh.cornerAngle[corner];
        }
        open = open || n > 2;
        for (uint32_t i = 0; open && i < n; ++i)
            for (uint32_t j = i + 1; j < n; ++j)
                if (angle[i] + angle[j] > kWrapLimit)
                    found(chart[i], chart[j]);
    }

    // False when scratch memory runs out. Cost: one walk around every vertex.
    bool CollectWrapPairs(const ChartMesh& mesh, const uint32_t* chartOf, WrapPairs* pairs)
    {
        uint64_t count = 0;
        for (uint32_t v = 0; v < mesh.vertexCount; ++v)
            WrapsAtVertex(mesh, chartOf, v, [&count](uint32_t, uint32_t) { ++count; });
        pairs->count = 0;
        if (count == 0)
            return true;
        if (count > 0xFFFFFFF0ull || !pairs->keys.Allocate(count))
            return false;
        uint64_t* keys = pairs->keys.Data();
        for (uint32_t v = 0; v < mesh.vertexCount; ++v)
            WrapsAtVertex(mesh, chartOf, v, [keys, pairs](uint32_t a, uint32_t b) {
                keys[pairs->count++] = a < b ? (uint64_t)a << 32 | b : (uint64_t)b << 32 | a;
            });
        uint32_t n = pairs->count;
        for (uint32_t gap = n / 2; gap > 0; gap = gap == 2 ? 1 : gap * 5 / 11)   // shell sort
            for (uint32_t i = gap; i < n; ++i)
            {
                uint64_t x = keys[i];
                uint32_t j = i;
                for (; j >= gap && x < keys[j - gap]; j -= gap)
                    keys[j] = keys[j - gap];
                keys[j] = x;
            }
        return true;
    }

    // Merges charts pairwise along linked borders while the union stays within the limits. Returns
    // the number of merges made; chartOf keeps the numbers of the surviving charts.
    uint32_t MergePass(const ChartMesh& mesh, const GrowRules& rules, uint32_t charts, uint32_t* chartOf, Border* borders,
                       Border* sorted, uint32_t* order, uint32_t* first, Cone* cone, ChartProxy* proxy, uint32_t* target,
                       const WrapPairs& wraps)
    {
        SumProxies(mesh, chartOf, charts, proxy);
        for (uint32_t c = 0; c < charts; ++c)
            cone[c] = {Normalized(proxy[c].normalSum), 0};
        for (uint32_t t = 0; t < mesh.triCount; ++t)
            if (chartOf[t] != kNoChart)
            {
                Cone& k = cone[chartOf[t]];
                double angle = AngleBetweenUnit(k.axis, mesh.normal[t]);
                k.halfAngle = angle > k.halfAngle ? angle : k.halfAngle;
            }
        CollectBorders(mesh, chartOf, charts, borders, sorted, first);
        SmallestFirst(proxy, charts, order);
        for (uint32_t c = 0; c < charts; ++c)
            target[c] = kNoChart;   // kNoChart: untouched this pass; c: kept; other: merged into it
        uint32_t merges = 0;
        double angleLimit = rules.cosNormalLimit >= -1 ? AngleOf(Sqrt(1 - rules.cosNormalLimit * rules.cosNormalLimit), rules.cosNormalLimit) : 4;
        for (uint32_t i = 0; i < charts; ++i)
        {
            uint32_t a = order[i];
            if (target[a] != kNoChart)
                continue;
            uint32_t best = kNoChart;
            double bestLength = 0;
            for (uint32_t k = first[a]; k < first[a + 1]; ++k)
            {
                uint32_t b = borders[k].b;
                if (target[b] != kNoChart)
                    continue;
                double length = borders[k].length;
                if (best != kNoChart && (length < bestLength || (length == bestLength && b > best)))
                    continue;
                Vec3 axis = Normalized(proxy[a].normalSum + proxy[b].normalSum);
                bool fits = AngleBetweenUnit(axis, cone[a].axis) + cone[a].halfAngle <= angleLimit &&
                            AngleBetweenUnit(axis, cone[b].axis) + cone[b].halfAngle <= angleLimit &&
                            Abs(proxy[a].curvature + proxy[b].curvature) <= rules.curvatureLimit &&
                            proxy[a].triangles + proxy[b].triangles <= rules.maxTriangles && !wraps.Contains(a, b);
                if (fits)
                {
                    best = b;
                    bestLength = length;
                }
            }
            if (best == kNoChart)
                continue;
            target[a] = best;
            target[best] = best;
            ++merges;
        }
        for (uint32_t t = 0; t < mesh.triCount; ++t)
            if (chartOf[t] != kNoChart && target[chartOf[t]] != kNoChart)
                chartOf[t] = target[chartOf[t]];
        return merges;
    }
}

uint32_t RenumberCharts(uint32_t* chartOf, uint32_t triCount, uint32_t limit)
{
    Scratch<uint32_t> number;
    if (!number.Allocate(limit + 1ull))
        return kNoChart;
    memset(number.Data(), 0xFF, (limit + 1ull) * sizeof(uint32_t));
    uint32_t charts = 0;
    for (uint32_t t = 0; t < triCount; ++t)
        if (chartOf[t] != kNoChart)
        {
            if (number[chartOf[t]] == kNoChart)
                number[chartOf[t]] = charts++;
            chartOf[t] = number[chartOf[t]];
        }
    return charts;
}

uint32_t SegmentCharts(const ChartMesh& mesh, const GrowRules& rules, uint32_t lloydRounds, uint32_t* chartOf)
{
    uint32_t T = mesh.triCount;
    ChartGrower grower;
    Scratch<uint32_t> seedOf, queue, depth;
    if (!grower.Allocate(mesh, chartOf) || !seedOf.Allocate(T + 1ull) || !queue.Allocate(T + 1ull) ||
        !depth.Allocate(T + 1ull))
        return kNoChart;
    for (uint32_t t = 0; t < T; ++t)
        chartOf[t] = kNoChart;
    uint32_t charts = 0;
    grower.GrowRemaining(nullptr, T, rules, &charts);
    for (uint32_t round = 0; round < lloydRounds; ++round)
        charts = LloydRound(mesh, rules, grower, charts, chartOf, seedOf.Data(), queue.Data(), depth.Data());
    if (grower.Failed())
        return kNoChart;
    Scratch<Border> borders, sorted;
    Scratch<Cone> cone;
    Scratch<ChartProxy> proxy;
    Scratch<uint32_t> first;
    uint64_t crossing = 1;   // linked half-edges between two charts: merging only ever lowers their number
    for (uint32_t h = 0; h < 3 * T; ++h)
        crossing += mesh.twin[h] != kNoTwin && chartOf[h / 3] != chartOf[mesh.twin[h] / 3];
    if (!borders.Allocate(crossing) || !sorted.Allocate(crossing) || !cone.Allocate(charts + 1ull) || !proxy.Allocate(charts + 1ull) ||
        !first.Allocate(charts + 2ull))
        return kNoChart;
    for (int pass = 0; pass < 8; ++pass)
    {
        WrapPairs wraps;
        if (!CollectWrapPairs(mesh, chartOf, &wraps))
            return kNoChart;
        if (MergePass(mesh, rules, charts, chartOf, borders.Data(), sorted.Data(), seedOf.Data(), first.Data(), cone.Data(), proxy.Data(),
                      queue.Data(), wraps) == 0)
            break;
    }
    return RenumberCharts(chartOf, T, charts);
}
