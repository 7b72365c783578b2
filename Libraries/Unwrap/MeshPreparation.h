// Stage 1 of the chart unwrapper: clean-up and adjacency.
//
// Input: the caller's mesh (indices checked to be in range, positions finite) and the parameters.
// Output: a ChartMesh over arrays owned by PreparedMesh:
//   - with recollectVertices set, vertices at bit-for-bit the same position are one (VertexWelding);
//   - degenerate triangles (MeasureTriangles) are flagged and linked to nothing, so they never
//     drive chart growing (they get UVs later from the chart they sit in);
//   - edge twins (MeshAdjacency): edges shared by more than two triangles or with opposite winding
//     are seams; so is every edge whose two triangles' normals are more than hardAngle apart,
//     unless both triangles come from one source polygon (srcPoly), which must stay in one piece;
//   - curvature[t]: the triangle's share of the angle defect 2 pi - angle sum (Gaussian
//     curvature, signed) of its corners' vertices, split by corner angle, counted only at vertices
//     all of whose edges are linked (interior vertices of the cut surface). A chart's sum of it
//     tells how far from developable the chart is, which conformal flattening turns into area
//     distortion; signed, so that the noise of scanned surfaces cancels out as it does in the map;
//   - each vertex's corners in non-degenerate triangles and every corner's angle (for the
//     growing's tests at vertices).
// Memory: normals, areas and edge lengths are computed on use; corner angles and curvature are
// kept in `slots`, the caller's output UV array (6 floats a triangle; ChartMesh.h tells how long
// they stay valid). What is owned here: twins (12 bytes a triangle), the degenerate flags (1),
// the corner lists (12, plus 4 a vertex), and with recollectVertices the welded indices (12).
// Cost: linear in vertices + triangles; the stage's peak adds the twins' sort, 24 bytes a
// triangle, for a moment.
#pragma once

#include "ChartMesh.h"
#include "Scratch.h"
#include "UnwrapApi.h"

struct PreparedMesh
{
    Scratch<uint32_t> welded, twin, aroundStart, around;
    Scratch<uint8_t> degenerate;
    ChartMesh mesh;

    // Gives back the corner lists (mesh.around, mesh.aroundStart) once no stage reads them: the
    // growing (segmentation and splits) and the placing of degenerate triangles (flattening).
    void ReleaseCornerLists();
};

// False when scratch memory runs out. `slots` is the output UV array (6 floats a triangle).
bool PrepareMesh(const float* vertex, uint32_t vertexCount, const uint32_t* tri, const uint32_t* srcPoly, uint32_t triCount,
                 const UnwrapParam& param, float* slots, PreparedMesh* out);
