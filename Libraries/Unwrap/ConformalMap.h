// Stage 3a of the chart unwrapper: conformal flattening of one chart (least-squares conformal
// maps, free boundary).
//
// The map minimises the conformal energy E(u, v) = 1/2 (|grad u|^2 + |grad v|^2) integrated over
// the chart, minus the signed UV area: E >= 0, and E = 0 exactly when the map keeps every angle.
// E is a quadratic form whose matrix is [[L, -B], [B, L]] with L the cotangent Laplacian and B the
// skew matrix of the area form (1/2 per directed triangle edge), positive semi-definite with the
// similarity maps as its null space; pinning two vertices makes it positive definite, so it is
// solved by conjugate gradients (HermitianSolver.h) started from the chart's projection onto its
// mean plane, pins at the projection's extremes along the first axis, at their 3D distance. A
// nearly planar chart keeps its projection: the solve stops below what float UVs resolve.
// The result is scaled so that the chart's UV area equals its 3D area (one unit for all charts).
// Input: the chart's triangles, none degenerate. Output: FlatChart, the chart's own vertex numbers
// (first use order) and one UV a vertex: corners of one vertex share it by construction.
// Cost: O(k * nnz) for k iterations (at most 50 + 5 sqrt(n) for n chart vertices); memory about 200
// bytes a chart vertex, released with the FlatChart.
#pragma once

#include "ChartMesh.h"
#include "Scratch.h"

struct FlatChart
{
    uint32_t vertexCount = 0;
    Scratch<uint32_t> corner;   // 3 a chart triangle: its corners' chart vertex numbers
    Scratch<uint32_t> global;   // per chart vertex: the mesh vertex
    Scratch<double> uv;         // 2 per chart vertex
};

class ConformalMapper
{
public:
    bool Allocate(const ChartMesh& mesh);

    // Flattens triangles[0, count). False only when scratch memory runs out; a map that went wrong
    // (not finite, no positive area) is left for the chart checks to reject.
    bool Flatten(const uint32_t* triangles, uint32_t count, FlatChart* out);

private:
    bool Number(const uint32_t* triangles, uint32_t count, FlatChart* out);
    void Project(const uint32_t* triangles, uint32_t count, FlatChart* out, uint32_t* pin0, uint32_t* pin1);
    bool Solve(const uint32_t* triangles, uint32_t count, FlatChart* out, uint32_t pin0, uint32_t pin1);

    const ChartMesh* m_Mesh = nullptr;
    Scratch<uint32_t> m_LocalOf, m_Stamp;
    uint32_t m_Pass = 0;
};

// Flattens one non-degenerate triangle at its true shape into uv (2 doubles a corner).
void FlattenSingleTriangle(const ChartMesh& mesh, uint32_t t, double* uv);
