#include "Editor/Tools/Unwrap/source/MeshTool/ChartStats.h"

#include "Runtime/Utilities/UnionFind.h"

#include <cmath>
#include <cstring>
#include <numeric>
#include <unordered_map>

uint64_t CornerKey(const float* position, const float* uv)
{
    uint32_t bits[5];
    std::memcpy(bits, position, 12);
    std::memcpy(bits + 3, uv, 8);
    uint64_t h = 1469598103934665603ull;
    for (uint32_t b : bits)
        h = (h ^ b) * 1099511628211ull;
    return h;
}

ChartStats ComputeChartStats(const MeshScene& scene, const std::vector<CornerUVs>& uvs, int atlasCount)
{
    ChartStats stats;
    size_t total = 0;
    std::vector<size_t> first(scene.primitives.size());
    for (size_t p = 0; p < scene.primitives.size(); ++p)
        first[p] = total, total += scene.primitives[p].TriangleCount();
    UnionFind charts(total);
    std::unordered_map<uint64_t, uint32_t> edgeOwner;   // undirected edge key -> a triangle
    edgeOwner.reserve(total * 3);
    double area = 0;
    for (size_t p = 0; p < scene.primitives.size(); ++p)
    {
        const ScenePrimitive& primitive = scene.primitives[p];
        for (uint32_t t = 0; t < primitive.TriangleCount(); ++t)
        {
            uint64_t corner[3];
            const float* uv = &uvs[p][6 * (size_t)t];
            for (int c = 0; c < 3; ++c)
                corner[c] = CornerKey(&primitive.positions[3 * (size_t)primitive.indices[3 * t + c]], uv + 2 * c);
            for (int c = 0; c < 3; ++c)
            {
                uint64_t a = corner[c], b = corner[(c + 1) % 3];
                uint64_t key = (a < b ? a : b) * 31 + (a < b ? b : a);
                auto [it, added] = edgeOwner.emplace(key, (uint32_t)(first[p] + t));
                if (!added)
                    charts.Join(it->second, (uint32_t)(first[p] + t));
            }
            area += std::fabs((uv[2] - uv[0]) * (uv[5] - uv[1]) - (uv[4] - uv[0]) * (uv[3] - uv[1])) / 2;
        }
    }
    std::unordered_map<uint32_t, uint32_t> chartNumber;
    stats.chartOfTriangle.resize(scene.primitives.size());
    for (size_t p = 0; p < scene.primitives.size(); ++p)
        for (uint32_t t = 0; t < scene.primitives[p].TriangleCount(); ++t)
        {
            auto [it, added] = chartNumber.emplace(charts.Root((uint32_t)(first[p] + t)), stats.chartCount);
            if (added)
                ++stats.chartCount;
            stats.chartOfTriangle[p].push_back(it->second);
        }
    stats.utilization = atlasCount > 0 ? area / atlasCount : 0;
    return stats;
}
