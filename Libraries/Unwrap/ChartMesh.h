// What the chart stages share about the mesh being unwrapped (made by MeshPreparation): the arrays
// as given (triangle indices after welding), each triangle's unit normal, area, curvature and
// whether it is degenerate, and the edge twins, already cut at seams.
//
// Memory: only what cannot be recomputed cheaply is stored. Normals, areas and edge lengths are
// computed from the positions on every use, with the arithmetic MeasureTriangles uses, so they
// are bit for bit the values a stored array would hold. Corner angles and curvature (expensive:
// an arctangent a corner, sums around vertices) live in the caller's output UV array, in each
// triangle's own 24 bytes (TriangleSlot), until the triangle gets its UVs: every reader of them
// (segmentation, and the growing that splits a chart) only asks about triangles not yet
// flattened into a chart that was accepted.
#pragma once

#include "MeshAdjacency.h"
#include "UnwrapMath.h"

#include <stdint.h>

const uint32_t kNoChart = 0xFFFFFFFFu;

// The layout of one triangle's 6 output floats while they serve as scratch: the 3D corner angles
// (floats 0..2), float 3 unused, the curvature as a double (floats 4..5; 8-byte aligned because
// the output array is).
struct TriangleSlot
{
    static const uint32_t kFloats = 6;
    static const uint32_t kCurvature = 4;
};

// Triangle t's edge cross product (p1 - p0) x (p2 - p0), from the positions: twice the area
// along the normal.
struct TriangleCorners
{
    const float* vertex;
    const uint32_t* tri;
    const uint8_t* degenerate;
    Vec3 TwiceArea(uint32_t t) const
    {
        const uint32_t* v = tri + 3ull * t;
        Vec3 p0 = Position(vertex, v[0]);
        return Cross(Position(vertex, v[1]) - p0, Position(vertex, v[2]) - p0);
    }
};

// The unit normal of triangle t, (0, 0, 0) for a degenerate one.
struct TriangleNormals : TriangleCorners
{
    Vec3 operator[](uint32_t t) const
    {
        if (degenerate[t])
            return {0, 0, 0};
        Vec3 cross = TwiceArea(t);
        return cross * (1 / Length(cross));
    }
};

// The 3D area of triangle t, 0 for a degenerate one.
struct TriangleAreas : TriangleCorners
{
    double operator[](uint32_t t) const { return degenerate[t] ? 0 : 0.5 * Length(TwiceArea(t)); }
};

// The 3D length of half-edge h (3t + c, from corner c to corner (c + 1) % 3), rounded to float.
struct EdgeLengths
{
    const float* vertex;
    const uint32_t* tri;
    float operator[](uint32_t h) const
    {
        uint32_t next = NextCorner(h);
        return (float)Length(Position(vertex, tri[next]) - Position(vertex, tri[h]));
    }
};

// The 3D angle at corner h = 3t + c (0 for a degenerate triangle), from triangle t's slot.
struct CornerAngles
{
    const float* slots;
    float operator[](uint32_t h) const { return slots[TriangleSlot::kFloats * (uint64_t)(h / 3) + h % 3]; }
};

// Triangle t's curvature (MeshPreparation.h), from its slot.
struct TriangleCurvatures
{
    const float* slots;
    double operator[](uint32_t t) const
    {
        double value;
        __builtin_memcpy(&value, slots + TriangleSlot::kFloats * (uint64_t)t + TriangleSlot::kCurvature, sizeof value);
        return value;
    }
};

struct ChartMesh
{
    const float* vertex;   // 3 floats a vertex
    uint32_t vertexCount;
    const uint32_t* tri;   // 3 vertex indices a triangle
    uint32_t triCount;
    TriangleNormals normal;         // unit normal, (0, 0, 0) for a degenerate triangle
    TriangleAreas area;             // 3D area
    TriangleCurvatures curvature;   // signed angle defect share of each triangle (MeshPreparation.h)
    const uint8_t* degenerate;  // 1 for a triangle of (numerically) zero area
    const uint32_t* twin;       // 3 a triangle, kNoTwin where an edge links nothing or is a seam
    const uint32_t* srcPoly;    // source polygon of each triangle, or null
    const uint32_t* aroundStart;   // vertex v's corners (3t + c) in non-degenerate triangles: around[aroundStart[v] .. aroundStart[v + 1])
    const uint32_t* around;
    CornerAngles cornerAngle;      // 3D angle at each corner (3 a triangle)
    EdgeLengths edgeLength;        // 3D length of each half-edge
};

// Fills degenerate[] for every triangle. A triangle counts as degenerate when twice its area is at
// most 1e-9 times its longest edge squared, which covers repeated indices and coinciding or
// collinear corners; its normal is (0, 0, 0) and its area 0.
void MeasureTriangles(const float* vertex, const uint32_t* tri, uint32_t triCount, uint8_t* degenerate);

// The corner angle of triangle t at corner c, in 3D.
double CornerAngle3(const ChartMesh& mesh, uint32_t t, uint32_t c);
