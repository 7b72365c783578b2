// Chart growing, the engine of segmentation (stage 2) and of chart splitting (stage 3).
//
// Charts grow over linked edges (ChartMesh::twin) into triangles not yet in a chart, cheapest
// first from one priority queue shared by all charts growing at once. The cost of adding
// triangle f to chart c is
//     (1 - n_f . N_c) + compactness * (perimeter of f - 2 * length of f's edges already in c) / perimeter of f
// with N_c the chart's proxy normal (its area-weighted mean normal): charts stay close to a
// plane where possible and grow round rather than in fingers (short seams). A triangle is
// admissible only while n_f . N_c >= cosNormalLimit and the chart's curvature (the sum of
// ChartMesh::curvature over its triangles, in absolute value) stays within curvatureLimit: a chart may curve, but
// only as far as a conformal map can flatten it with little area distortion. Nor may a triangle
// pinch its chart (a corner already in the chart must be reached through one of the triangle's
// own edges there, so charts never touch themselves at a vertex) or wrap it (the chart's 3D
// angles around a vertex it does not surround stay 20 degrees short of a full turn): no
// flattening survives either.
// Proxies either follow each chart as it grows, or stay fixed for a round (Lloyd iteration).
// For splitting, the cost can instead be the distance from the chart's seed (through triangle
// centroids), so that two seeds share a chart evenly, as Voronoi regions do. Source polygons
// (srcPoly) join a chart whole: when one of their triangles joins, the rest of the polygon joins
// with it, whatever the limits say.
// Every order is decided by costs, then triangle numbers: runs are reproducible bit for bit.
// Cost: O(n log n) for n triangles grown; memory 17 bytes a triangle and 12 a vertex of the mesh, 16 bytes a
// candidate queued at once (the growing fronts and stale entries; the heap doubles when full),
// 72 bytes a chart.
#pragma once

#include "ChartMesh.h"
#include "MinHeap.h"
#include "../Tessary/TessaryApi.h"

// The most 3D angle a chart may gather around a vertex while its fan there stays open: a full
// turn less 20 degrees (a conformal map of a wider open fan folds over itself).
const double kWrapLimit = 6.283185307179586 - 0.35;

struct GrowRules
{
    double cosNormalLimit;   // below -1: no limit
    double curvatureLimit;   // radians of total angle defect (either sign) a chart may hold
    uint32_t maxTriangles;   // no chart grows beyond this (bounds the cost of flattening one chart)
    double compactness;
    bool fixedProxies;
    bool geodesic;   // cost: distance from the seed across triangle centroids instead (even splits)
    bool keepPolygons;   // a triangle brings the rest of its source polygon (srcPoly) along
};

struct ChartProxy
{
    Vec3 normalSum;   // sum of area * normal over the chart's triangles (or fixed for a round)
    Vec3 normal;      // normalSum made unit, kept up to date by the grower
    double curvature;
    double area;
    uint32_t triangles;
};

class ChartGrower
{
public:
    ChartGrower() = default;
    ChartGrower(const ChartGrower&) = delete;
    ChartGrower& operator=(const ChartGrower&) = delete;

    // chartOf has one entry a triangle. Proxies grow with the chart numbers seeded. The candidate
    // heap starts small and doubles when full: it holds a growing front (and entries gone stale),
    // far fewer than the 3 a triangle that growing the whole mesh pushes in all.
    bool Allocate(const ChartMesh& mesh, uint32_t* chartOf);

    // Proxies of the charts seeded so far (numbers below the highest seeded + 1).
    ChartProxy* Proxies() { return m_Proxy.Data(); }

    // True once a proxy could not get memory: the growing since then is incomplete.
    bool Failed() const { return m_Failed; }

    // Puts `seed` into chart `chart`, which must hold no triangle (a number not used yet, or one
    // whose triangles were all put back to kNoChart since), with a fresh proxy from the seed
    // unless the rules fix proxies, in which case the proxy's normalSum is kept and its curvature
    // and area restart from the seed.
    void Seed(uint32_t seed, uint32_t chart, const GrowRules& rules);

    // Grows all seeded charts until no admissible candidate is left.
    void Grow(const GrowRules& rules);

    // Gives every triangle of `candidates` (all triangles when null; `count` of them) still outside
    // a chart and not degenerate a chart: charts are started one at a time, each from the first
    // triangle a previous chart turned down, else from the next candidate in order, and grown to
    // the end before the next starts. Numbers new charts from *nextChart on.
    void GrowRemaining(const uint32_t* candidates, uint32_t count, const GrowRules& rules, uint32_t* nextChart);

private:
    double Cost(uint32_t f, uint32_t c, const GrowRules& rules) const;
    void PushNeighbours(uint32_t t, uint32_t c, const GrowRules& rules);
    void Join(uint32_t f, uint32_t c, double cost, const GrowRules& rules);
    void Reject(uint32_t f);
    bool Admissible(uint32_t f, uint32_t c, const GrowRules& rules) const;
    bool BreaksAtCorner(uint32_t f, uint32_t c) const;
    bool WalkBreaks(uint32_t h, uint32_t c, bool linked) const;
    uint32_t Holder(uint32_t v) const;
    void Add(uint32_t f, uint32_t c, double cost, const GrowRules& rules);

    const ChartMesh* m_Mesh = nullptr;
    uint32_t* m_ChartOf = nullptr;
    MinHeap m_Heap;
    bool Reserve(uint32_t chart);

    Scratch<ChartProxy> m_Proxy;   // doubled as chart numbers grow
    uint32_t m_ProxyCapacity = 0;
    bool m_Failed = false;
    Scratch<double> m_Distance;     // geodesic rules: each grown triangle's distance from its seed
    Scratch<uint32_t> m_Polygon;    // stack of the triangles joining with a source polygon
    Scratch<uint32_t> m_Rejected;   // FIFO of triangles some chart turned down
    Scratch<uint8_t> m_Queued;      // 1 once a triangle is in m_Rejected
    // Per vertex, what the grower has seen of it: the one chart that took triangles there, with
    // that chart's generation then and the sum of its 3D angles there; kMixedCharts once a second
    // chart does (then only a walk around the vertex tells). Seeding a chart starts a new
    // generation of it: shares from its earlier life (triangles put back outside the grower) no
    // longer count. Spares most walks around vertices in BreaksAtCorner.
    struct VertexShare
    {
        uint32_t chart, generation;
        float angle;
    };
    static const uint32_t kMixedCharts = 0xFFFFFFFEu;
    Scratch<VertexShare> m_Share;
    Scratch<uint32_t> m_Generation;   // per chart, with the proxies
    uint32_t m_RejectedHead = 0, m_RejectedTail = 0;
};
