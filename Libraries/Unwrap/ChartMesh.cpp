#include "ChartMesh.h"

void MeasureTriangles(const float* vertex, const uint32_t* tri, uint32_t triCount, uint8_t* degenerate)
{
    for (uint32_t t = 0; t < triCount; ++t)
    {
        Vec3 p0 = Position(vertex, tri[3 * t]), p1 = Position(vertex, tri[3 * t + 1]), p2 = Position(vertex, tri[3 * t + 2]);
        Vec3 e0 = p1 - p0, e1 = p2 - p1, e2 = p0 - p2;
        double longest = Dot(e0, e0);
        longest = Dot(e1, e1) > longest ? Dot(e1, e1) : longest;
        longest = Dot(e2, e2) > longest ? Dot(e2, e2) : longest;
        double twice = Length(Cross(e0, p2 - p0));
        degenerate[t] = !(twice > 1e-9 * longest) || longest == 0;
    }
}

double CornerAngle3(const ChartMesh& mesh, uint32_t t, uint32_t c)
{
    const uint32_t* v = mesh.tri + 3 * t;
    Vec3 p = Position(mesh.vertex, v[c]);
    Vec3 a = Position(mesh.vertex, v[(c + 1) % 3]) - p, b = Position(mesh.vertex, v[(c + 2) % 3]) - p;
    return AngleOf(Length(Cross(a, b)), Dot(a, b));
}
