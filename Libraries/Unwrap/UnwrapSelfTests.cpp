// Unwrap.dll's self-test exports: they unwrap small meshes and check the chart layout's promises
// (UVs inside the unit square, flat charts at their true shape at one common scale, one UV per
// vertex inside a chart, charts apart).
#include "LibraryBehaviour.h"
#include "UnwrapApi.h"
#include "WinImports.h"

namespace
{
    const UnwrapParam kDefaults = {0.08f, 0.15f, 88.0f, 1.0f / 256, 0};

    double Distance3(const float* a, const float* b)
    {
        double d0 = (double)a[0] - b[0], d1 = (double)a[1] - b[1], d2 = (double)a[2] - b[2];
        return sqrt(d0 * d0 + d1 * d1 + d2 * d2);
    }

    double Distance2(const float* a, const float* b)
    {
        double d0 = (double)a[0] - b[0], d1 = (double)a[1] - b[1];
        return sqrt(d0 * d0 + d1 * d1);
    }

    bool InsideUnitSquare(const float* uv, int32_t triCount)
    {
        for (int32_t i = 0; i < 6 * triCount; ++i)
            if (!_finite(uv[i]) || uv[i] < 0 || uv[i] > 1)
                return false;
        return true;
    }

    // Every edge of triangle t keeps its length times `scale`, within a relative tolerance.
    bool KeepsShape(const float* vertex, const uint32_t* tri, const float* uv, int32_t t, double scale)
    {
        for (int c = 0; c < 3; ++c)
        {
            double length3 = Distance3(vertex + 3 * tri[3 * t + c], vertex + 3 * tri[3 * t + (c + 1) % 3]);
            double length2 = Distance2(uv + 6 * t + 2 * c, uv + 6 * t + 2 * ((c + 1) % 3));
            if (fabs(length2 - length3 * scale) > 1e-4 * (1 + length2))
                return false;
        }
        return true;
    }

    bool Unwrap(const float* vertex, int32_t vertexCount, const uint32_t* tri, int32_t triCount, float* uv)
    {
        char error[256];
        memset(error, 0, sizeof error);
        return GenerateSecondaryUVSet(vertex, vertexCount, nullptr, tri, nullptr, triCount, uv, kDefaults, error, sizeof error) &&
               error[0] == 0;
    }

    // Every corner of a vertex in triangles [0, triCount) has the same UV.
    bool OneUVPerVertex(const uint32_t* tri, int32_t triCount, const float* uv)
    {
        for (int32_t i = 0; i < 3 * triCount; ++i)
            for (int32_t j = 0; j < i; ++j)
                if (tri[i] == tri[j] && (uv[2 * i] != uv[2 * j] || uv[2 * i + 1] != uv[2 * j + 1]))
                    return false;
        return true;
    }

    struct Box
    {
        float minU, minV, maxU, maxV;
    };

    Box BoxOf(const float* uv, int32_t corners)
    {
        Box box = {uv[0], uv[1], uv[0], uv[1]};
        for (int32_t c = 1; c < corners; ++c)
        {
            box.minU = uv[2 * c] < box.minU ? uv[2 * c] : box.minU;
            box.maxU = uv[2 * c] > box.maxU ? uv[2 * c] : box.maxU;
            box.minV = uv[2 * c + 1] < box.minV ? uv[2 * c + 1] : box.minV;
            box.maxV = uv[2 * c + 1] > box.maxV ? uv[2 * c + 1] : box.maxV;
        }
        return box;
    }

    // The point lies at least `gap` (less rounding) outside the box.
    bool ApartFrom(const Box& box, const float* point, float gap)
    {
        float slack = gap - 1e-6f;
        return point[0] <= box.minU - slack || point[0] >= box.maxU + slack || point[1] <= box.minV - slack ||
               point[1] >= box.maxV + slack;
    }
}

static bool DegenerateTrianglesChecks()
{
    // A proper triangle, one with two coinciding positions, one with all three, one repeating an
    // index: each degenerate one is a chart of its own, placed apart from the proper triangle.
    const float vertex[] = {0, 0, 0, 2, 0, 0, 0, 1, 0, 3, 3, 3, 3, 3, 3, 4, 4, 4};
    const uint32_t tri[] = {0, 1, 2, 3, 4, 5, 3, 4, 3, 1, 1, 2};
    float uv[24];
    if (!Unwrap(vertex, 6, tri, 4, uv) || !InsideUnitSquare(uv, 4))
        return false;
    double scale = Distance2(uv, uv + 2) / 2.0;
    bool pointStaysAPoint = uv[12] == uv[14] && uv[14] == uv[16] && uv[13] == uv[15] && uv[15] == uv[17];
    Box proper = BoxOf(uv, 3);
    for (int c = 3; c < 12; ++c)
        if (!ApartFrom(proper, uv + 2 * c, kDefaults.packMargin))
            return false;
    return scale > 0 && KeepsShape(vertex, tri, uv, 0, scale) && KeepsShape(vertex, tri, uv, 1, scale) && pointStaysAPoint;
}

static bool DontSplitRectsChecks()
{
    // A 2 x 1 rectangle as two triangles: one chart (the diagonal's corners share their UVs) at its
    // true shape, turned square to the axes and as large as the margins allow.
    const float vertex[] = {0, 0, 0, 2, 0, 0, 2, 1, 0, 0, 1, 0};
    const uint32_t tri[] = {0, 1, 2, 0, 2, 3};
    float uv[12];
    if (!Unwrap(vertex, 4, tri, 2, uv) || !InsideUnitSquare(uv, 2) || !OneUVPerVertex(tri, 2, uv))
        return false;
    double scale = Distance2(uv, uv + 2) / 2.0;
    bool square = fabs((double)uv[0] - uv[2]) < 1e-6 || fabs((double)uv[1] - uv[3]) < 1e-6;
    bool large = 2 * scale > 0.99 * (1 - 2 * kDefaults.packMargin);
    return scale > 0 && KeepsShape(vertex, tri, uv, 0, scale) && KeepsShape(vertex, tri, uv, 1, scale) && square && large;
}

extern "C" bool Unwrap_TestUnwrapWithDegenerateTriangles()
{
    return TestExportResult("Unwrap_TestUnwrapWithDegenerateTriangles", DegenerateTrianglesChecks());
}

extern "C" bool Unwrap_TestUnwrapDontSplitRects()
{
    return TestExportResult("Unwrap_TestUnwrapDontSplitRects", DontSplitRectsChecks());
}
