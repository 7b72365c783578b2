// What the chart stages share about the mesh being unwrapped (made by MeshPreparation): the arrays
// as given (triangle indices after welding), each triangle's unit normal, area, curvature and
// whether it is degenerate, and the edge twins, already cut at seams.
#pragma once

#include "UnwrapMath.h"

#include <stdint.h>

const uint32_t kNoChart = 0xFFFFFFFFu;

struct ChartMesh
{
    const float* vertex;   // 3 floats a vertex
    uint32_t vertexCount;
    const uint32_t* tri;   // 3 vertex indices a triangle
    uint32_t triCount;
    const Vec3* normal;         // unit normal, (0, 0, 0) for a degenerate triangle
    const double* area;         // 3D area
    const double* curvature;    // signed angle defect share of each triangle (MeshPreparation.h)
    const uint8_t* degenerate;  // 1 for a triangle of (numerically) zero area
    const uint32_t* twin;       // 3 a triangle, kNoTwin where an edge links nothing or is a seam
    const uint32_t* srcPoly;    // source polygon of each triangle, or null
    const uint32_t* aroundStart;   // vertex v's corners (3t + c) in non-degenerate triangles: around[aroundStart[v] .. aroundStart[v + 1])
    const uint32_t* around;
    const float* cornerAngle;      // 3D angle at each corner (3 a triangle)
    const float* edgeLength;       // 3D length of each half-edge
};

// Fills normal[], area[] and degenerate[] for every triangle. A triangle counts as degenerate when
// twice its area is at most 1e-9 times its longest edge squared, which covers repeated indices and
// coinciding or collinear corners; its normal is (0, 0, 0).
void MeasureTriangles(const float* vertex, const uint32_t* tri, uint32_t triCount, Vec3* normal, double* area,
                      uint8_t* degenerate);

// The corner angle of triangle t at corner c, in 3D.
double CornerAngle3(const ChartMesh& mesh, uint32_t t, uint32_t c);
