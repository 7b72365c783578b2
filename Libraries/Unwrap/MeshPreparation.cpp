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
    bool MeasureCurvature(const ChartMesh& mesh, double* curvature)
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
            curvature[t] = 0;
            for (uint32_t c = 0; c < 3 && !mesh.degenerate[t]; ++c)
            {
                uint32_t v = mesh.tri[3 * t + c];
                if (!open[v] && angleSum[v] > 0)
                    curvature[t] += (2 * kPi - angleSum[v]) * mesh.cornerAngle[3 * t + c] / angleSum[v];
            }
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
                 const UnwrapParam& param, PreparedMesh* out)
{
    if (param.recollectVertices)
    {
        if (!out->welded.Allocate(3ull * triCount) || !WeldVertices(vertex, vertexCount, tri, triCount, out->welded.Data()))
            return false;
        tri = out->welded.Data();
    }
    if (!out->twin.Allocate(3ull * triCount) || !out->normal.Allocate(triCount) || !out->area.Allocate(triCount) ||
        !out->curvature.Allocate(triCount) || !out->degenerate.Allocate(triCount) ||
        !out->aroundStart.Allocate(vertexCount + 1ull) || !out->around.Allocate(3ull * triCount + 1) ||
        !out->cornerAngle.Allocate(3ull * triCount) || !out->edgeLength.Allocate(3ull * triCount))
        return false;
    MeasureTriangles(vertex, tri, triCount, out->normal.Data(), out->area.Data(), out->degenerate.Data());
    if (!FindTwins(tri, triCount, vertexCount, out->twin.Data()))
        return false;
    out->mesh = {vertex,          vertexCount,          tri,       triCount, out->normal.Data(), out->area.Data(),
                 out->curvature.Data(), out->degenerate.Data(), out->twin.Data(), srcPoly, out->aroundStart.Data(),
                 out->around.Data(), out->cornerAngle.Data(), out->edgeLength.Data()};
    for (uint32_t h = 0; h < 3 * triCount; ++h)
    {
        out->cornerAngle[h] = out->degenerate[h / 3] ? 0.0f : (float)CornerAngle3(out->mesh, h / 3, h % 3);
        out->edgeLength[h] = (float)Length(Position(vertex, tri[NextCorner(h)]) - Position(vertex, tri[h]));
    }
    ListTrianglesAroundVertices(out->mesh, out->aroundStart.Data(), out->around.Data());
    double hardAngle = param.hardAngle * (kPi / 180);
    CutSeams(out->mesh, cos(hardAngle), out->twin.Data());
    return MeasureCurvature(out->mesh, out->curvature.Data());
}
