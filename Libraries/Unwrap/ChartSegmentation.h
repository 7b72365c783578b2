// Splits a mesh into charts by region growing over edge adjacency.
//
// A chart starts at the lowest-numbered triangle not yet in a chart and takes in, breadth first,
// neighbours across twin edges while all of these hold for the neighbour w reached from chart
// triangle u, with n the chart's current normal (the normalised sum of its triangles' cross
// products):
//   - dihedral angle: the angle between the normals of u and w is below hardAngle, unless u and
//     w come from one source polygon (srcPoly), which is meant to stay in one piece;
//   - area distortion: 1 - cos(angle between w's normal and n) is at most the threshold; that is
//     the share of w's area lost when it is projected onto the chart plane, and cos > 0 keeps the
//     projection from flipping w;
//   - angle distortion: max over w's corners of |projected angle - true angle| / true angle is at
//     most the threshold.
// Degenerate triangles make single-triangle charts of their own and link nothing.
#pragma once

#include "ChartMesh.h"

struct GrowLimits
{
    double cosHardAngle;
    double areaDistortion;
    double angleDistortion;
    uint32_t maxTriangles;   // no chart grows beyond this many triangles
};

// Grows charts over the triangles whose chartOf is kNoChart, numbering them from firstChart on;
// `queue` is scratch room for triCount entries. Returns the number after the last chart made.
uint32_t GrowCharts(const ChartMesh& mesh, const GrowLimits& limits, uint32_t firstChart, uint32_t* chartOf, uint32_t* queue);
