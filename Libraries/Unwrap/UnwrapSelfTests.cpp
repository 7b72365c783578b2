// Unwrap.dll's self-test exports: they unwrap small meshes and check the layout's promises (UVs
// inside the unit square, every chart at its true shape at one common scale, charts apart).
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
}

static bool DegenerateTrianglesChecks()
{
    // A proper triangle, one with two coinciding positions, one with all three, one repeating an index.
    const float vertex[] = {0, 0, 0, 2, 0, 0, 0, 1, 0, 3, 3, 3, 3, 3, 3, 4, 4, 4};
    const uint32_t tri[] = {0, 1, 2, 3, 4, 5, 3, 4, 3, 1, 1, 2};
    float uv[24];
    if (!Unwrap(vertex, 6, tri, 4, uv) || !InsideUnitSquare(uv, 4))
        return false;
    double scale = Distance2(uv, uv + 2) / 2.0;
    return scale > 0 && KeepsShape(vertex, tri, uv, 0, scale) && KeepsShape(vertex, tri, uv, 1, scale) &&
           uv[12] == uv[14] && uv[14] == uv[16] && uv[13] == uv[15] && uv[15] == uv[17];
}

static bool DontSplitRectsChecks()
{
    // A 2 x 1 rectangle as two triangles: both keep their right angle and their sides at one scale,
    // and their charts do not overlap.
    const float vertex[] = {0, 0, 0, 2, 0, 0, 2, 1, 0, 0, 1, 0};
    const uint32_t tri[] = {0, 1, 2, 0, 2, 3};
    float uv[12];
    if (!Unwrap(vertex, 4, tri, 2, uv) || !InsideUnitSquare(uv, 2))
        return false;
    double scale = Distance2(uv, uv + 2) / 2.0;
    float firstRight = uv[0] > uv[2] ? uv[0] : (uv[2] > uv[4] ? uv[2] : uv[4]);
    float secondLeft = uv[6] < uv[8] ? uv[6] : (uv[8] < uv[10] ? uv[8] : uv[10]);
    return scale > 0 && KeepsShape(vertex, tri, uv, 0, scale) && KeepsShape(vertex, tri, uv, 1, scale) && firstRight < secondLeft;
}

extern "C" bool Unwrap_TestUnwrapWithDegenerateTriangles()
{
    return TestExportResult("Unwrap_TestUnwrapWithDegenerateTriangles", DegenerateTrianglesChecks());
}

extern "C" bool Unwrap_TestUnwrapDontSplitRects()
{
    return TestExportResult("Unwrap_TestUnwrapDontSplitRects", DontSplitRectsChecks());
}
