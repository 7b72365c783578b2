#include "ChartFlattening.h"

#include "ChartGrowing.h"
#include "ChartLayout.h"
#include "MeshAdjacency.h"
#include "Scratch.h"
#include "WinImports.h"

namespace
{
    struct Range
    {
        uint32_t begin, end, chart;
    };

    class Flattener
    {
    public:
        Flattener(const ChartMesh& mesh, const DistortionLimits& limits, uint32_t* chartOf, float* outUV)
            : m_Mesh(mesh), m_Limits(limits), m_ChartOf(chartOf), m_OutUV(outUV)
        {
        }

        bool Allocate()
        {
            uint64_t T = m_Mesh.triCount + 1ull;
            return m_Mapper.Allocate(m_Mesh) && m_Members.Allocate(T) &&
                   m_Depth.Allocate(T) && m_Queue.Allocate(T) && m_Stack.Allocate(T) && m_Slot.Allocate(T + 1);
        }

        // Lists the non-degenerate triangles chart by chart and queues every chart.
        void Start(uint32_t chartCount)
        {
            m_NextChart = chartCount;
            uint32_t* start = m_Slot.Data();
            memset(start, 0, (chartCount + 1ull) * sizeof(uint32_t));
            for (uint32_t t = 0; t < m_Mesh.triCount; ++t)
                if (m_ChartOf[t] != kNoChart)
                    ++start[m_ChartOf[t] + 1];
            for (uint32_t c = 0; c < chartCount; ++c)
                start[c + 1] += start[c];
            for (uint32_t c = chartCount; c > 0; --c)
                m_Stack[m_StackSize++] = {start[c - 1], start[c], c - 1};
            for (uint32_t t = 0; t < m_Mesh.triCount; ++t)
                if (m_ChartOf[t] != kNoChart)
                    m_Members[start[m_ChartOf[t]]++] = t;
        }

        bool Run(FlattenStats* stats)
        {
            double area = 0;
            *stats = {0, 0, 0};
            while (m_StackSize)
            {
                Range r = m_Stack[--m_StackSize];
                const uint32_t* triangles = m_Members.Data() + r.begin;
                uint32_t count = r.end - r.begin;
                FlatChart flat;
                if (!m_Mapper.Flatten(triangles, count, &flat))
                    return false;
                ChartMeasure measure = {0, 0};
                SplitSeeds seeds = {kNoChart, kNoChart};
                if (count == 1 || ChartIsValid(m_Mesh, m_ChartOf, r.chart, triangles, count, flat, m_Limits, &measure, &seeds))
                {
                    double chartArea = Write(triangles, count, flat);
                    stats->angleDistortion += measure.angleDistortion * chartArea;
                    stats->areaDistortion += measure.areaDistortion * chartArea;
                    area += chartArea;
                    continue;
                }
                ++stats->splits;
                // The grower's memory is taken at the first split: most meshes never need it.
                if (!m_GrowerReady && !(m_GrowerReady = m_Grower.Allocate(m_Mesh, m_ChartOf)))
                    return false;
                Split(r, seeds);
                if (m_Grower.Failed())
                    return false;
            }
            stats->angleDistortion = area > 0 ? stats->angleDistortion / area : 0;
            stats->areaDistortion = area > 0 ? stats->areaDistortion / area : 0;
            return true;
        }

        uint32_t NextChart() const { return m_NextChart; }

    private:
        double Write(const uint32_t* triangles, uint32_t count, const FlatChart& flat)
        {
            double area = 0;
            for (uint32_t i = 0; i < count; ++i)
            {
                area += m_Mesh.area[triangles[i]];
                for (uint32_t c = 0; c < 3; ++c)
                {
                    uint32_t v = flat.corner[3 * i + c];
                    m_OutUV[6ull * triangles[i] + 2 * c] = (float)flat.uv[2 * v];
                    m_OutUV[6ull * triangles[i] + 2 * c + 1] = (float)flat.uv[2 * v + 1];
                }
            }
            return area;
        }

        // The triangle of the range farthest from `from` across linked edges (lowest on ties);
        // the range's triangles are outside any chart while this runs.
        uint32_t Farthest(const Range& r, uint32_t from)
        {
            for (uint32_t i = r.begin; i < r.end; ++i)
                m_Depth[m_Members[i]] = kNoChart;
            uint32_t head = 0, tail = 0, best = from;
            m_Depth[from] = 0;
            m_Queue[tail++] = from;
            while (head < tail)
            {
                uint32_t t = m_Queue[head++];
                if (m_Depth[t] > m_Depth[best] || (m_Depth[t] == m_Depth[best] && t < best))
                    best = t;
                for (uint32_t h = 3 * t; h < 3 * t + 3; ++h)
                {
                    uint32_t twin = m_Mesh.twin[h];
                    if (twin != kNoTwin && m_ChartOf[twin / 3] == kNoChart && m_Depth[twin / 3] == kNoChart)
                    {
                        m_Depth[twin / 3] = m_Depth[t] + 1;
                        m_Queue[tail++] = twin / 3;
                    }
                }
            }
            return best;
        }

        void Split(const Range& r, const SplitSeeds& seeds)
        {
            for (uint32_t i = r.begin; i < r.end; ++i)
                m_ChartOf[m_Members[i]] = kNoChart;
            uint32_t a = seeds.a, b = seeds.b;
            if (a == kNoChart || b == kNoChart || a == b)
            {
                a = Farthest(r, m_Members[r.begin]);
                b = Farthest(r, a);
            }
            // Source polygons stay whole unless the chart is one polygon that failed: then the
            // split ignores them, so that splitting always makes progress.
            uint32_t firstNew = m_NextChart;
            GrowRules open = {-2, 1e300, 0xFFFFFFFFu, 0, false, true, true};
            for (;; open.keepPolygons = false)
            {
                m_Grower.Seed(a, r.chart, open);
                if (b != a && m_ChartOf[b] == kNoChart)
                    m_Grower.Seed(b, m_NextChart++, open);
                m_Grower.Grow(open);
                m_Grower.GrowRemaining(m_Members.Data() + r.begin, r.end - r.begin, open, &m_NextChart);
                if (m_NextChart > firstNew || !open.keepPolygons)
                    break;
                for (uint32_t i = r.begin; i < r.end; ++i)
                    m_ChartOf[m_Members[i]] = kNoChart;
            }
            // Regroup the range part by part (counting sort on the part's slot) and queue the parts.
            uint32_t parts = m_NextChart - firstNew + 1;
            uint32_t* start = m_Slot.Data();
            memset(start, 0, (parts + 1ull) * sizeof(uint32_t));
            auto slot = [&](uint32_t t) { return m_ChartOf[t] == r.chart ? 0 : m_ChartOf[t] - firstNew + 1; };
            for (uint32_t i = r.begin; i < r.end; ++i)
                ++start[slot(m_Members[i]) + 1];
            for (uint32_t p = 0; p < parts; ++p)
                start[p + 1] += start[p];
            for (uint32_t p = parts; p > 0; --p)
                m_Stack[m_StackSize++] = {r.begin + start[p - 1], r.begin + start[p], p == 1 ? r.chart : firstNew + p - 2};
            for (uint32_t i = r.begin; i < r.end; ++i)
                m_Queue[start[slot(m_Members[i])]++] = m_Members[i];
            memcpy(m_Members.Data() + r.begin, m_Queue.Data(), (r.end - r.begin) * sizeof(uint32_t));
        }

        const ChartMesh& m_Mesh;
        DistortionLimits m_Limits;
        uint32_t* m_ChartOf;
        float* m_OutUV;
        ChartGrower m_Grower;
        ConformalMapper m_Mapper;
        Scratch<uint32_t> m_Members, m_Depth, m_Queue, m_Slot;
        Scratch<Range> m_Stack;
        uint32_t m_StackSize = 0, m_NextChart = 0;
        bool m_GrowerReady = false;
    };

    // The UV of vertex v in chart c, from a non-degenerate triangle of c around v; false if none.
    bool UVInChart(const uint32_t* chartOf, const float* outUV, const uint32_t* start,
                   const uint32_t* around, uint32_t v, uint32_t c, float* uv)
    {
        for (uint32_t i = start[v]; i < start[v + 1]; ++i)
        {
            uint32_t corner = around[i];
            if (chartOf[corner / 3] != c)
                continue;
            uv[0] = outUV[2ull * corner];
            uv[1] = outUV[2ull * corner + 1];
            return true;
        }
        return false;
    }

    // Gives every degenerate triangle a chart and UVs; returns the next free chart number.
    uint32_t PlaceDegenerate(const ChartMesh& mesh, uint32_t* chartOf, float* outUV, uint32_t nextChart)
    {
        const uint32_t* start = mesh.aroundStart;
        const uint32_t* around = mesh.around;
        for (uint32_t t = 0; t < mesh.triCount; ++t)
        {
            if (!mesh.degenerate[t])
                continue;
            const uint32_t* v = mesh.tri + 3 * t;
            float* uv = outUV + 6ull * t;
            chartOf[t] = kNoChart;
            for (uint32_t i = start[v[0]]; i < start[v[0] + 1] && chartOf[t] == kNoChart; ++i)
            {
                uint32_t c = chartOf[around[i] / 3];
                bool all = true;
                for (uint32_t k = 0; k < 3 && all; ++k)
                    all = UVInChart(chartOf, outUV, start, around, v[k], c, uv + 2 * k);
                chartOf[t] = all ? c : kNoChart;
            }
            if (chartOf[t] != kNoChart)
                continue;
            FlattenTriangle(mesh.vertex + 3ull * v[0], mesh.vertex + 3ull * v[1], mesh.vertex + 3ull * v[2], uv);
            chartOf[t] = nextChart++;
        }
        return nextChart;
    }
}

uint32_t FlattenCharts(const ChartMesh& mesh, const DistortionLimits& limits, uint32_t chartCount, uint32_t* chartOf,
                       float* outUV, FlattenStats* stats)
{
    Flattener flattener(mesh, limits, chartOf, outUV);
    if (!flattener.Allocate())
        return kNoChart;
    flattener.Start(chartCount);
    if (!flattener.Run(stats))
        return kNoChart;
    return PlaceDegenerate(mesh, chartOf, outUV, flattener.NextChart());
}
