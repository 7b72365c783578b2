#include "ChartGrowing.h"

#include "MeshAdjacency.h"
#include "WinImports.h"

namespace
{
    Vec3 Centroid(const ChartMesh& mesh, uint32_t t)
    {
        const uint32_t* v = mesh.tri + 3 * t;
        return (Position(mesh.vertex, v[0]) + Position(mesh.vertex, v[1]) + Position(mesh.vertex, v[2])) * (1.0 / 3);
    }

}

bool ChartGrower::Allocate(const ChartMesh& mesh, uint32_t* chartOf)
{
    m_Mesh = &mesh;
    m_ChartOf = chartOf;
    uint64_t T = mesh.triCount + 1ull;
    if (!m_Heap.Allocate(1024) || !Reserve(255) || !m_Distance.Allocate(T) || !m_Polygon.Allocate(T) ||
        !m_Rejected.Allocate(T) || !m_Queued.Allocate(T) || !m_Share.Allocate(mesh.vertexCount + 1ull))
        return false;
    memset(m_Queued.Data(), 0, mesh.triCount);
    for (uint32_t v = 0; v < mesh.vertexCount; ++v)
        m_Share[v] = {kNoChart, 0, 0};
    return true;
}

bool ChartGrower::Reserve(uint32_t chart)
{
    if (chart < m_ProxyCapacity)
        return true;
    uint64_t capacity = m_ProxyCapacity ? 2ull * m_ProxyCapacity : 256;
    capacity = capacity > chart ? capacity : chart + 1ull;
    if (!m_Proxy.Grow(m_ProxyCapacity, capacity) || !m_Generation.Grow(m_ProxyCapacity, capacity))
        return false;
    memset(m_Generation.Data() + m_ProxyCapacity, 0, (capacity - m_ProxyCapacity) * sizeof(uint32_t));
    m_ProxyCapacity = (uint32_t)capacity;
    return true;
}

double ChartGrower::Cost(uint32_t f, uint32_t c, const GrowRules& rules) const
{
    const ChartMesh& mesh = *m_Mesh;
    double perimeter = 0, shared = 0;
    for (uint32_t h = 3 * f; h < 3 * f + 3; ++h)
    {
        double length = mesh.edgeLength[h];
        perimeter += length;
        if (mesh.twin[h] != kNoTwin && m_ChartOf[mesh.twin[h] / 3] == c)
            shared += length;
    }
    double deviation = 1 - Dot(mesh.normal[f], m_Proxy[c].normal);
    return deviation + rules.compactness * (perimeter > 0 ? (perimeter - 2 * shared) / perimeter : 0);
}

// Adding f to chart c would break the chart at one of f's corners: either pinch it (the vertex
// already belongs to c, but neither of f's edges at it links to a triangle of c, so the chart
// would touch itself there), or wrap it (the chart's 3D angles around the vertex would pass
// kWrapLimit, 20 degrees short of a full turn, while the fan stays open: its conformal map would fold over itself).
// The vertex's share (see m_Share) answers without a walk around it when the vertex belongs to
// no chart, or to c alone with room left below the wrap limit.
bool ChartGrower::BreaksAtCorner(uint32_t f, uint32_t c) const
{
    const ChartMesh& mesh = *m_Mesh;
    for (uint32_t k = 0; k < 3; ++k)
    {
        uint32_t h = 3 * f + k, previous = 3 * f + (k + 2) % 3;   // the two edges at corner k
        bool linked = (mesh.twin[h] != kNoTwin && m_ChartOf[mesh.twin[h] / 3] == c) ||
                      (mesh.twin[previous] != kNoTwin && m_ChartOf[mesh.twin[previous] / 3] == c);
        uint32_t holder = Holder(mesh.tri[h]);
        if (holder == kNoChart)
            continue;   // a single corner angle is below pi: nothing to pinch or wrap
        if (holder == c && !linked)
            return true;
        if (holder == c && m_Share[mesh.tri[h]].angle + mesh.cornerAngle[h] <= kWrapLimit - 1e-3)
            continue;
        if (holder != c && holder != kMixedCharts)
            continue;   // c has no triangle at v
        if (WalkBreaks(h, c, linked))
            return true;
    }
    return false;
}

// The chart that alone holds v, kNoChart when none does, kMixedCharts when the share cannot tell.
uint32_t ChartGrower::Holder(uint32_t v) const
{
    const VertexShare& share = m_Share[v];
    if (share.chart == kNoChart || share.chart == kMixedCharts)
        return share.chart;
    return share.generation == m_Generation[share.chart] ? share.chart : kNoChart;
}

// The walk around corner h's vertex that BreaksAtCorner saves where it can.
bool ChartGrower::WalkBreaks(uint32_t h, uint32_t c, bool linked) const
{
    const ChartMesh& mesh = *m_Mesh;
    uint32_t v = mesh.tri[h];
    double angle = mesh.cornerAngle[h];
    uint32_t inChart = 1, all = mesh.aroundStart[v + 1] - mesh.aroundStart[v];
    for (uint32_t i = mesh.aroundStart[v]; i < mesh.aroundStart[v + 1]; ++i)
    {
        uint32_t corner = mesh.around[i];
        if (m_ChartOf[corner / 3] != c)
            continue;
        if (!linked)
            return true;
        ++inChart;
        angle += mesh.cornerAngle[corner];
    }
    return angle > kWrapLimit && inChart < all;
}

// The checks are pure: the cheap ones go first, the walk around f's corners last.
bool ChartGrower::Admissible(uint32_t f, uint32_t c, const GrowRules& rules) const
{
    const ChartProxy& proxy = m_Proxy[c];
    if (proxy.triangles >= rules.maxTriangles)
        return false;
    if (rules.cosNormalLimit >= -1 && !(Dot(m_Mesh->normal[f], proxy.normal) >= rules.cosNormalLimit))
        return false;
    if (!(Abs(proxy.curvature + m_Mesh->curvature[f]) <= rules.curvatureLimit))
        return false;
    return !BreaksAtCorner(f, c);
}

void ChartGrower::Add(uint32_t f, uint32_t c, double cost, const GrowRules& rules)
{
    ChartProxy& proxy = m_Proxy[c];
    m_ChartOf[f] = c;
    if (rules.geodesic)   // read only by geodesic growing: other rules leave its pages untouched
        m_Distance[f] = cost;
    for (uint32_t k = 0; k < 3; ++k)
    {
        uint32_t v = m_Mesh->tri[3 * f + k], holder = Holder(v);
        VertexShare& share = m_Share[v];
        if (holder == kNoChart)
            share = {c, m_Generation[c], 0};
        if (holder == kNoChart || holder == c)
            share.angle += m_Mesh->cornerAngle[3 * f + k];
        else
            share.chart = kMixedCharts;
    }
    if (!rules.fixedProxies)
    {
        proxy.normalSum = proxy.normalSum + m_Mesh->normal[f] * m_Mesh->area[f];
        proxy.normal = Normalized(proxy.normalSum);
    }
    proxy.curvature += m_Mesh->curvature[f];
    proxy.area += m_Mesh->area[f];
    ++proxy.triangles;
}

// Adds f and, when polygons are kept whole, every triangle of f's source polygon reachable from
// it across linked edges inside the polygon; queues the neighbours of all of them.
void ChartGrower::Join(uint32_t f, uint32_t c, double cost, const GrowRules& rules)
{
    const ChartMesh& mesh = *m_Mesh;
    Add(f, c, cost, rules);
    uint32_t top = 0;
    m_Polygon[top++] = f;
    while (top)
    {
        uint32_t t = m_Polygon[--top];
        PushNeighbours(t, c, rules);
        if (!rules.keepPolygons || !mesh.srcPoly)
            continue;
        for (uint32_t h = 3 * t; h < 3 * t + 3; ++h)
        {
            uint32_t w = mesh.twin[h] / 3;
            if (mesh.twin[h] != kNoTwin && m_ChartOf[w] == kNoChart && mesh.srcPoly[w] == mesh.srcPoly[t])
            {
                Add(w, c, cost, rules);
                m_Polygon[top++] = w;
            }
        }
    }
}

void ChartGrower::PushNeighbours(uint32_t t, uint32_t c, const GrowRules& rules)
{
    for (uint32_t h = 3 * t; h < 3 * t + 3; ++h)
    {
        uint32_t twin = m_Mesh->twin[h];
        if (twin == kNoTwin || m_ChartOf[twin / 3] != kNoChart)
            continue;
        uint32_t w = twin / 3;
        double cost = rules.geodesic ? m_Distance[t] + Length(Centroid(*m_Mesh, w) - Centroid(*m_Mesh, t)) : Cost(w, c, rules);
        if (!m_Heap.Push({cost, w, c}))
            m_Failed = true;
    }
}

void ChartGrower::Reject(uint32_t f)
{
    if (m_Queued[f])
        return;
    m_Queued[f] = 1;
    m_Rejected[m_RejectedTail++] = f;
}

void ChartGrower::Seed(uint32_t seed, uint32_t chart, const GrowRules& rules)
{
    if (!Reserve(chart))
    {
        m_Failed = true;
        return;
    }
    ++m_Generation[chart];   // the shares the chart's earlier triangles left are void
    ChartProxy& proxy = m_Proxy[chart];
    if (!rules.fixedProxies)
        proxy.normalSum = {0, 0, 0};
    proxy.normal = Normalized(proxy.normalSum);
    proxy.curvature = proxy.area = 0;
    proxy.triangles = 0;
    Join(seed, chart, 0, rules);
}

void ChartGrower::Grow(const GrowRules& rules)
{
    while (!m_Heap.Empty())
    {
        HeapEntry entry = m_Heap.Pop();
        uint32_t f = entry.triangle;
        if (m_ChartOf[f] != kNoChart)
            continue;
        if (!Admissible(f, entry.chart, rules))
        {
            Reject(f);
            continue;
        }
        Join(f, entry.chart, entry.cost, rules);
    }
}

void ChartGrower::GrowRemaining(const uint32_t* candidates, uint32_t count, const GrowRules& rules, uint32_t* nextChart)
{
    uint32_t next = 0;
    for (;;)
    {
        uint32_t seed = kNoChart;
        while (seed == kNoChart && m_RejectedHead < m_RejectedTail)
        {
            uint32_t f = m_Rejected[m_RejectedHead++];
            m_Queued[f] = 0;
            seed = m_ChartOf[f] == kNoChart ? f : kNoChart;
        }
        while (seed == kNoChart && next < count)
        {
            uint32_t f = candidates ? candidates[next] : next;
            ++next;
            seed = m_ChartOf[f] == kNoChart && !m_Mesh->degenerate[f] ? f : kNoChart;
        }
        if (seed == kNoChart)
            break;
        GrowRules sequential = rules;
        sequential.fixedProxies = false;
        Seed(seed, (*nextChart)++, sequential);
        Grow(sequential);
    }
    m_RejectedHead = m_RejectedTail = 0;
}
