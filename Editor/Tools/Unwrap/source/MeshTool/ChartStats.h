#pragma once
// What the summary and the layout picture know about the result: which chart every triangle
// belongs to, how many charts there are and how much of the atlas they cover.
//
// Two triangles are in one chart when they share an edge whose two ends have the same position
// and the same lightmap UV in both (so a seam, where the UVs differ, separates charts).

#include "Editor/Tools/Unwrap/source/MeshTool/MeshScene.h"

#include <cstdint>
#include <vector>

struct ChartStats
{
    std::vector<std::vector<uint32_t>> chartOfTriangle;   // per primitive, per triangle
    uint32_t chartCount = 0;
    double utilization = 0;   // covered UV area over the atlas area, averaged over the atlases
};

// A corner's identity for finding shared edges: its position and its UV, bit for bit, hashed.
uint64_t CornerKey(const float* position, const float* uv);

ChartStats ComputeChartStats(const MeshScene& scene, const std::vector<CornerUVs>& uvs, int atlasCount);
