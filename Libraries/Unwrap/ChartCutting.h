// Stage 3c of the chart unwrapper: flattened charts that would pack badly (long strips, arcs,
// shapes that fill little of their box) are cut into pieces that pack well.
//
// Input: chartOf and outUV as FlattenCharts leaves them (charts 0 .. chartCount-1, each flattened
// in mesh units and valid: no flip, no self-overlap, within the distortion limits; degenerate
// triangles in a chart that holds their three vertices, or in a chart of their own).
// Output: chartOf with charts 0 .. (returned count)-1; outUV is not touched. A piece keeps its
// UVs, and a piece of a valid chart is valid as long as it is one piece, so every cut piece is:
//   - connected across linked edges, and does not touch itself (no vertex has two separate fans
//     of it, checked per piece);
//   - whole in source polygons (linked triangles of one srcPoly are never separated);
//   - holding all three vertices of each of its degenerate triangles.
// Which cuts: the stage estimates the utilization the packing reaches, A / S^2 with A the charts'
// area and S^2 the larger of (a) the square that the most demanding chart needs on its own (its
// minimum-area box, straight or turned by 45 degrees) and (b) the charts' box areas over a
// packing density. A cut runs across a chart along a level of the distance from one end of the
// chart (the end found by two sweeps over the chart's triangles, distances between triangle
// centres in UV), so that it crosses strips and arcs where they are narrowest in effect; levels at
// 1/8 .. 7/8 of the chart's length are tried and the best kept. Cuts are taken greedily, the one
// that raises the estimate most first, only while each raises it by at least kMinGain and the new
// seam vertices stay within a share of the mesh's vertices; at most kMaxCuts cuts.
// Cost: per chart considered, two shortest-path sweeps (O(n log n)) and seven labellings with a
// minimum-area box each (O(n) plus the hulls); charts that cannot raise the estimate enough even
// if they packed perfectly are never considered. Memory about 30 bytes a triangle.
#pragma once

#include "ChartMesh.h"

struct CutStats
{
    uint32_t cuts;           // cuts made (each adds one chart or more)
    uint32_t seamVertices;   // corners split by the cuts (vertex, chart) pairs added
};

// Returns the number of charts, or kNoChart when scratch memory runs out (chartOf may then be
// partly relabelled and must not be used).
uint32_t CutCharts(const ChartMesh& mesh, uint32_t chartCount, uint32_t* chartOf, const float* outUV, CutStats* stats);
