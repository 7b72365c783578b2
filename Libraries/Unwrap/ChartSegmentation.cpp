#include "ChartSegmentation.h"

#include "MeshAdjacency.h"
#include "WinImports.h"

namespace
{
    // Angle between a and b, both non-zero.
    double AngleBetween(const Vec3& a, const Vec3& b) { return AngleOf(Length(Cross(a, b)), Dot(a, b)); }

    Vec3 AlongPlane(const Vec3& e, const Vec3& normal) { return e - normal * Dot(e, normal); }

    bool KeepsAngles(const ChartMesh& mesh, uint32_t w, const Vec3& normal, double threshold)
    {
        const uint32_t* c = mesh.tri + 3 * w;
        Vec3 p[3] = {Position(mesh.vertex, c[0]), Position(mesh.vertex, c[1]), Position(mesh.vertex, c[2])};
        for (int k = 0; k < 3; ++k)
        {
            Vec3 a = p[(k + 1) % 3] - p[k], b = p[(k + 2) % 3] - p[k];
            double before = AngleBetween(a, b);
            double after = AngleBetween(AlongPlane(a, normal), AlongPlane(b, normal));
            if (!(Abs(after - before) <= threshold * before))
                return false;
        }
        return true;
    }

    bool Joins(const ChartMesh& mesh, const GrowLimits& limits, uint32_t u, uint32_t w, const Vec3& chartNormal)
    {
        Vec3 normalU = Normalized(mesh.cross[u]), normalW = Normalized(mesh.cross[w]);
        bool onePolygon = mesh.srcPoly && mesh.srcPoly[u] == mesh.srcPoly[w];
        if (!onePolygon && !(Dot(normalU, normalW) > limits.cosHardAngle))
            return false;
        double cosine = Dot(normalW, chartNormal);
        if (!(cosine > 1e-6) || !(1 - cosine <= limits.areaDistortion))
            return false;
        return KeepsAngles(mesh, w, chartNormal, limits.angleDistortion);
    }

    // Grows chart `chart` from `seed` breadth first, marking its triangles in chartOf.
    void GrowFrom(const ChartMesh& mesh, const GrowLimits& limits, uint32_t seed, uint32_t chart, uint32_t* chartOf,
                  uint32_t* queue)
    {
        chartOf[seed] = chart;
        if (mesh.degenerate[seed])
            return;
        Vec3 sum = mesh.cross[seed];
        uint32_t head = 0, tail = 0;
        queue[tail++] = seed;
        while (head < tail && tail < limits.maxTriangles)
        {
            uint32_t u = queue[head++];
            for (uint32_t h = 3 * u; h < 3 * u + 3 && tail < limits.maxTriangles; ++h)
            {
                uint32_t twin = mesh.twin[h];
                uint32_t w = twin / 3;
                if (twin == kNoTwin || chartOf[w] != kNoChart || mesh.degenerate[w])
                    continue;
                if (!Joins(mesh, limits, u, w, Normalized(sum)))
                    continue;
                chartOf[w] = chart;
                sum = sum + mesh.cross[w];
                queue[tail++] = w;
            }
        }
    }
}

uint32_t GrowCharts(const ChartMesh& mesh, const GrowLimits& limits, uint32_t firstChart, uint32_t* chartOf, uint32_t* queue)
{
    uint32_t chart = firstChart;
    for (uint32_t t = 0; t < mesh.triCount; ++t)
        if (chartOf[t] == kNoChart)
            GrowFrom(mesh, limits, t, chart++, chartOf, queue);
    return chart;
}
