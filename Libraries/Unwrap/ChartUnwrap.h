// The default layout of GenerateSecondaryUVSet, as a pipeline of stages:
//   1. clean-up and adjacency (MeshPreparation),
//   2. segmentation into charts that flatten well (ChartSegmentation),
//   3. conformal flattening, checks and splitting (ChartFlattening),
//      then cutting charts that would pack badly into pieces that pack well (ChartCutting),
//   4. packing at one common scale (AtlasPacking),
//   5. the output guarantees checked before anything is returned (OutputCheck).
#pragma once

#include "UnwrapApi.h"

#include <stdint.h>

// What a run did, for reports: charts after segmentation, splits in flattening, final charts
// (degenerate triangles' own included), the 3D-area-weighted mean distortions of the charts
// (measured before cutting), and the cuts made for packing.
struct UnwrapStats
{
    uint32_t segmented, splits, charts;
    double angleDistortion, areaDistortion;
    uint32_t cuts;
};

// Writes 6 floats a triangle into outUV, all in [0, 1]. The mesh has been checked: every index is
// below vertexCount and every position is finite. srcPoly (one source polygon a triangle) may be
// null. On failure returns false with *error set to a constant text. *stats is filled as far as the
// run gets.
bool UnwrapIntoCharts(const float* vertex, uint32_t vertexCount, const uint32_t* tri, const uint32_t* srcPoly,
                      uint32_t triCount, const UnwrapParam& param, float* outUV, UnwrapStats* stats, const char** error);
