// Stage 3 of the chart unwrapper: every chart flattened (ConformalMap), checked (ChartValidity)
// and, when it fails, split in two and both parts flattened again.
//
// Input: chartOf from segmentation (charts 0 .. chartCount-1, degenerate triangles kNoChart).
// Output: outUV (6 floats a triangle) in mesh units, each chart at any place and orientation, and
// chartOf for every triangle with charts 0 .. (returned count)-1.
// Splitting: two seeds on either side of the place where the chart failed (ChartValidity.h), or,
// for distortion, as far apart as the chart's linked edges allow (the farthest triangle from the
// chart's first, then the farthest from that one), grown at once by distance, with no other limits
// (ChartGrowing.h); triangles neither reaches (a chart in pieces) get charts of their own. Every
// split makes charts strictly smaller and a single triangle always passes, so this ends.
// Degenerate triangles then join a chart that holds all three of their vertices (taking those
// vertices' UVs), else each becomes a chart of its own at its true (zero-area) shape.
// Cost: the flattening of every chart, plus that of the parts of failed ones.
#pragma once

#include "ChartMesh.h"
#include "ChartValidity.h"

struct FlattenStats
{
    uint32_t splits;
    double angleDistortion, areaDistortion;   // 3D-area-weighted means over the accepted charts
};

// Returns the number of charts, or kNoChart when scratch memory runs out.
uint32_t FlattenCharts(const ChartMesh& mesh, const DistortionLimits& limits, uint32_t chartCount, uint32_t* chartOf,
                       float* outUV, FlattenStats* stats);
