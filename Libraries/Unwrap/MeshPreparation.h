// Stage 1 of the chart unwrapper: clean-up and adjacency.
//
// Input: the caller's mesh (indices checked to be in range, positions finite) and the parameters.
// Output: a ChartMesh over arrays owned by PreparedMesh:
//   - with recollectVertices set, vertices at bit-for-bit the same position are one (VertexWelding);
//   - unit normals and areas; degenerate triangles (MeasureTriangles) are flagged and linked to
//     nothing, so they never drive chart growing (they get UVs later from the chart they sit in);
//   - edge twins (MeshAdjacency): edges shared by more than two triangles or with opposite winding
//     are seams; so is every edge whose two triangles' normals are more than hardAngle apart,
//     unless both triangles come from one source polygon (srcPoly), which must stay in one piece;
//   - curvature[t]: the triangle's share of the angle defect 2 pi - angle sum (Gaussian
//     curvature, signed) of its corners' vertices, split by corner angle, counted only at vertices
//     all of whose edges are linked (interior vertices of the cut surface). A chart's sum of it
//     tells how far from developable the chart is, which conformal flattening turns into area
//     distortion; signed, so that the noise of scanned surfaces cancels out as it does in the map;
//   - each vertex's corners in non-degenerate triangles, every corner's angle and every edge's length (for
//     the growing's costs and its tests at vertices).
// Cost: linear in vertices + triangles; about 90 bytes a triangle.
#pragma once

#include "ChartMesh.h"
#include "Scratch.h"
#include "UnwrapApi.h"

struct PreparedMesh
{
    Scratch<uint32_t> welded, twin, aroundStart, around;
    Scratch<float> cornerAngle, edgeLength;
    Scratch<Vec3> normal;
    Scratch<double> area, curvature;
    Scratch<uint8_t> degenerate;
    ChartMesh mesh;
};

// False when scratch memory runs out.
bool PrepareMesh(const float* vertex, uint32_t vertexCount, const uint32_t* tri, const uint32_t* srcPoly, uint32_t triCount,
                 const UnwrapParam& param, PreparedMesh* out);
