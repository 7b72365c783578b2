// What the chart stages share about the mesh being unwrapped: the arrays as given, each
// triangle's cross product and whether it is degenerate, and the edge twins (MeshAdjacency.h).
#pragma once

#include "UnwrapMath.h"

#include <stdint.h>

const uint32_t kNoChart = 0xFFFFFFFFu;

struct ChartMesh
{
    const float* vertex;   // 3 floats a vertex
    const uint32_t* tri;   // 3 vertex indices a triangle
    uint32_t triCount;
    const Vec3* cross;          // (p1 - p0) x (p2 - p0) of each triangle: twice its area along its normal
    const uint8_t* degenerate;  // 1 for a triangle of (numerically) zero area
    const uint32_t* twin;       // 3 a triangle, kNoTwin where an edge links nothing
    const uint32_t* srcPoly;    // source polygon of each triangle, or null
};

// Fills cross[] and degenerate[] for every triangle. A triangle counts as degenerate when twice its
// area is at most 1e-9 times its longest edge squared, which covers repeated indices and
// coinciding or collinear corners.
void MeasureTriangles(const float* vertex, const uint32_t* tri, uint32_t triCount, Vec3* cross, uint8_t* degenerate);
