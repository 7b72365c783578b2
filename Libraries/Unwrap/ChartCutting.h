// Stage 3c of the chart unwrapper: flattened charts that would pack badly (long strips, arcs,
// shapes that fill little of their box) are cut into pieces that pack well.
//
// Input: chartOf and outUV as FlattenCharts leaves them (charts 0 .. chartCount-1, each flattened
// in mesh units and valid: no flip, no self-overlap, within the distortion limits; degenerate
// triangles in a chart that holds their three vertices, or in a chart of their own).
// Output: chartOf with charts 0 .. (returned count)-1; outUV is not touched. A cut leaves two
// pieces that keep their UVs, and a piece of a valid chart is valid as long as it is one piece,
// so every piece is:
//   - connected across linked edges, and does not touch itself (no vertex has two separate fans
//     of it, checked per piece);
//   - whole in source polygons (linked triangles of one srcPoly are never separated);
//   - holding all three vertices of each of its degenerate triangles.
// Which cuts: the stage estimates the utilization the packing reaches, A / S^2 with A the charts'
// area and S^2 a soft sum (root of the squares) of (a) the square that the most demanding chart
// needs on its own (its minimum-area box, straight or turned by 45 degrees) and (b) the charts'
// box areas over a packing density. A cut runs across a chart along a level of a coordinate along
// it: the position along the long side of its minimum-area box (straight strips) or the path
// distance from one end of the chart (found by two sweeps over its triangles, distances between
// triangle centres in UV), which follows arcs; levels at 1/6 .. 5/6 of the coordinate's range
// are tried (moved a little when one is not allowed), each smoothed so that it does not zigzag,
// and the best for the chart kept; pieces are measured by the smallest of four boxes turned from
// the chart's minimum-area frame. Cuts are
// taken greedily, the move that raises the estimate most first: one chart, or the charts that
// need the largest squares together (cutting one of several equally long charts changes
// nothing). A move of n cuts is made only while it raises the estimate by kMinGain^sqrt(n) and
// by kSeamPrice times the share of vertices its seam splits, all cuts within kSeamShare of the
// vertices and kMaxCuts.
// Cost: a minimum-area box per chart; per chart considered, two shortest-path sweeps
// (O(n log n)) and ten to thirty labellings (O(n) each); charts that cannot raise the estimate
// enough even if they filled their box are never considered (fandisk: 3 % more instructions for
// the whole unwrap). Memory about 30 bytes a triangle.
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
