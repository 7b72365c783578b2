#include "MeshPreparation.h"

#include "MeshAdjacency.h"
#include "VertexWelding.h"
#include "WinImports.h"

namespace
{
    const double kPi = 3.14159265358979323846;

    // Unlinks edges into degenerate triangles and edges sharper than the hard angle.
    void CutSeams(const ChartMesh& mesh, double cosHardAngle, uint32_t* twin)
    {
        for (uint32_t h = 0; h < 3 * mesh.triCount; ++h)
        {
            if (twin[h] == kNoTwin)
                continue;
            uint32_t u = h / 3, w = twin[h] / 3;
            bool onePolygon = mesh.srcPoly && mesh.srcPoly[u] == mesh.srcPoly[w];
            bool hard = !(Dot(mesh.normal[u], mesh.normal[w]) > cosHardAngle) && !onePolygon;
            if (mesh.degenerate[u] || mesh.degenerate[w] || hard)
                twin[h] = kNoTwin;
        }
    }

    // Angle defects (signed) at interior vertices, spread over the triangles by corner angle.
    bool MeasureCurvature(const ChartMesh& mesh, float* slots)
    {
        Scratch<double> angleSum;
        Scratch<uint8_t> open;
        if (!angleSum.Allocate(mesh.vertexCount) || !open.Allocate(mesh.vertexCount))
            return false;
        memset(angleSum.Data(), 0, mesh.vertexCount * sizeof(double));
        memset(open.Data(), 0, mesh.vertexCount);
        for (uint32_t h = 0; h < 3 * mesh.triCount; ++h)
        {
            uint32_t t = h / 3;
            if (mesh.degenerate[t])
                continue;
            if (mesh.twin[h] == kNoTwin)
                open[mesh.tri[h]] = open[mesh.tri[NextCorner(h)]] = 1;
            angleSum[mesh.tri[h]] += mesh.cornerAngle[h];
        }
        for (uint32_t t = 0; t < mesh.triCount; ++t)
        {
            double curvature = 0;
            for (uint32_t c = 0; c < 3 && !mesh.degenerate[t]; ++c)
            {
                uint32_t v = mesh.tri[3 * t + c];
                if (!open[v] && angleSum[v] > 0)
                    curvature += (2 * kPi - angleSum[v]) * mesh.cornerAngle[3 * t + c] / angleSum[v];
            }
            memcpy(slots + TriangleSlot::kFloats * (uint64_t)t + TriangleSlot::kCurvature, &curvature, sizeof curvature);
        }
        return true;
    }
}

namespace
{
    // Counting sort of the non-degenerate triangles' corners (3t + c) by vertex.
    void ListTrianglesAroundVertices(const ChartMesh& mesh, uint32_t* start, uint32_t* around)
    {
        memset(start, 0, (mesh.vertexCount + 1ull) * sizeof(uint32_t));
        for (uint32_t i = 0; i < 3 * mesh.triCount; ++i)
            if (!mesh.degenerate[i / 3])
                ++start[mesh.tri[i] + 1];
        for (uint32_t v = 0; v < mesh.vertexCount; ++v)
            start[v + 1] += start[v];
        for (uint32_t i = 0; i < 3 * mesh.triCount; ++i)
            if (!mesh.degenerate[i / 3])
                around[start[mesh.tri[i]]++] = i;
        for (uint32_t v = mesh.vertexCount; v > 0; --v)
            start[v] = start[v - 1];
        start[0] = 0;
    }
}

bool PrepareMesh(const float* vertex, uint32_t vertexCount, const uint32_t* tri, const uint32_t* srcPoly, uint32_t triCount,
                 const UnwrapParam& param, float* slots, PreparedMesh* out)
{
    if (param.recollectVertices)
    {
        if (!out->welded.Allocate(3ull * triCount) || !WeldVertices(vertex, vertexCount, tri, triCount, out->welded.Data()))
            return false;
        tri = out->welded.Data();
    }
    // The twins first: their sort's scratch (twice the twins' size) is gone before the corner
    // lists are made, which keeps this stage's peak low.
    if (!out->twin.Allocate(3ull * triCount) || !out->degenerate.Allocate(triCount) ||
        !FindTwins(tri, triCount, vertexCount, out->twin.Data()))
        return false;
    if (!out->aroundStart.Allocate(vertexCount + 1ull) || !out->around.Allocate(3ull * triCount + 1))
        return false;
    MeasureTriangles(vertex, tri, triCount, out->degenerate.Data());
    const uint8_t* degenerate = out->degenerate.Data();
    out->mesh = {vertex,
                 vertexCount,
                 tri,
                 triCount,
                 {{vertex, tri, degenerate}},
                 {{vertex, tri, degenerate}},
                 {slots},
                 degenerate,
                 out->twin.Data(),
                 srcPoly,
                 out->aroundStart.Data(),
                 out->around.Data(),
                 {slots},
                 {vertex, tri}};
    for (uint32_t t = 0; t < triCount; ++t)
        for (uint32_t c = 0; c < 3; ++c)
            slots[TriangleSlot::kFloats * (uint64_t)t + c] = degenerate[t] ? 0.0f : (float)CornerAngle3(out->mesh, t, c);
    ListTrianglesAroundVertices(out->mesh, out->aroundStart.Data(), out->around.Data());
    double hardAngle = param.hardAngle * (kPi / 180);
    CutSeams(out->mesh, cos(hardAngle), out->twin.Data());
    return MeasureCurvature(out->mesh, slots);
}

void PreparedMesh::ReleaseCornerLists()
{
    aroundStart.Release();
    around.Release();
    mesh.aroundStart = mesh.around = nullptr;
}
