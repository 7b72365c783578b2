// Charts and seams: corners with the same vertex and the same UV are one key; triangles sharing
// a key are in one chart. Cost: sorting the 3T corners and the 3T half-edges.
#include "Editor/Tools/Unwrap/source/UVStat/UVStatParts.h"
#include "Runtime/Utilities/UnionFind.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <numeric>

namespace UVStat
{
    namespace
    {
        // The bits of a UV coordinate as compared for identity (-0 and +0 are the same UV).
        uint32_t CoordinateBits(float value)
        {
            value += 0.0f;
            uint32_t bits;
            std::memcpy(&bits, &value, 4);
            return bits;
        }


        double EdgeLength(const LayoutView& layout, uint32_t a, uint32_t b)
        {
            const float *p = layout.vertex + 3ull * a, *q = layout.vertex + 3ull * b;
            double dx = double(p[0]) - q[0], dy = double(p[1]) - q[1], dz = double(p[2]) - q[2];
            return std::sqrt(dx * dx + dy * dy + dz * dz);
        }
    }

    ChartLabels LabelCharts(const LayoutView& layout)
    {
        ChartLabels labels;
        uint64_t corners = 3ull * layout.triCount;
        struct CornerKey
        {
            uint32_t vertex, u, v, corner;
        };
        std::vector<CornerKey> keys(corners);
        for (uint64_t k = 0; k < corners; ++k)
            keys[k] = {layout.tri[k], CoordinateBits(layout.uv[2 * k]), CoordinateBits(layout.uv[2 * k + 1]), uint32_t(k)};
        std::sort(keys.begin(), keys.end(), [](const CornerKey& a, const CornerKey& b) {
            return a.vertex != b.vertex ? a.vertex < b.vertex : (a.u != b.u ? a.u < b.u : (a.v != b.v ? a.v < b.v : a.corner < b.corner));
        });
        labels.cornerKey.resize(corners);
        UnionFind sets(layout.triCount);
        for (uint64_t i = 0; i < corners; ++i)
        {
            bool same = i > 0 && keys[i].vertex == keys[i - 1].vertex && keys[i].u == keys[i - 1].u && keys[i].v == keys[i - 1].v;
            if (!same)
                labels.keyVertex.push_back(keys[i].vertex);
            else
                sets.Join(keys[i].corner / 3, keys[i - 1].corner / 3);
            labels.cornerKey[keys[i].corner] = uint32_t(labels.keyVertex.size() - 1);
        }
        labels.keyCount = uint32_t(labels.keyVertex.size());
        labels.chartOf.assign(layout.triCount, 0);
        std::vector<uint32_t> number(layout.triCount, ~0u);
        for (uint32_t t = 0; t < layout.triCount; ++t)
        {
            uint32_t root = sets.Root(t);
            if (number[root] == ~0u)
                number[root] = labels.chartCount++;
            labels.chartOf[t] = number[root];
        }
        return labels;
    }

    void MeasureStructure(const LayoutView& layout, const ChartLabels& labels, Quality& quality, Validity& validity)
    {
        quality.charts = labels.chartCount;
        quality.vertexSplit = layout.vertexCount ? double(labels.keyCount) / layout.vertexCount : 0;

        // A vertex whose corners inside one chart carry two different UVs: (vertex, chart) pairs
        // that more than one key maps to.
        std::vector<uint32_t> chartOfKey(labels.keyCount);
        for (uint64_t k = 0; k < labels.cornerKey.size(); ++k)
            chartOfKey[labels.cornerKey[k]] = labels.chartOf[k / 3];
        std::vector<std::pair<uint32_t, uint32_t>> vertexChart(labels.keyCount);
        for (uint32_t key = 0; key < labels.keyCount; ++key)
            vertexChart[key] = {labels.keyVertex[key], chartOfKey[key]};
        std::sort(vertexChart.begin(), vertexChart.end());
        validity.splitVertexCharts = 0;
        for (uint32_t i = 1; i < labels.keyCount; ++i)
            if (vertexChart[i] == vertexChart[i - 1] && (i < 2 || vertexChart[i - 1] != vertexChart[i - 2]))
                ++validity.splitVertexCharts;

        // Seams: an edge whose sides do not all carry the same pair of keys. An edge with one
        // side is the mesh's border, not a seam.
        struct HalfEdge
        {
            uint32_t low, high, lowKey, highKey;
        };
        std::vector<HalfEdge> edges;
        edges.reserve(labels.cornerKey.size());
        for (uint32_t t = 0; t < layout.triCount; ++t)
            for (int c = 0; c < 3; ++c)
            {
                uint32_t a = 3 * t + c, b = 3 * t + (c + 1) % 3;
                uint32_t va = layout.tri[a], vb = layout.tri[b];
                if (va == vb)
                    continue;
                if (va < vb)
                    edges.push_back({va, vb, labels.cornerKey[a], labels.cornerKey[b]});
                else
                    edges.push_back({vb, va, labels.cornerKey[b], labels.cornerKey[a]});
            }
        std::sort(edges.begin(), edges.end(), [](const HalfEdge& a, const HalfEdge& b) {
            return a.low != b.low ? a.low < b.low : a.high < b.high;
        });
        double total = 0, seam = 0;
        for (size_t i = 0; i < edges.size();)
        {
            size_t j = i + 1;
            bool split = false;
            for (; j < edges.size() && edges[j].low == edges[i].low && edges[j].high == edges[i].high; ++j)
                split = split || edges[j].lowKey != edges[i].lowKey || edges[j].highKey != edges[i].highKey;
            double length = EdgeLength(layout, edges[i].low, edges[i].high);
            total += length;
            seam += split ? length : 0;
            i = j;
        }
        quality.seamLengthRatio = total > 0 ? seam / total : 0;
    }
}
