// Unwrap.dll's self-test exports: they unwrap small meshes with known answers and check the chart
// layout's promises (UVs inside the unit square, flat and developable charts unrolled to their
// true shape at one common scale, one UV per vertex inside a chart, degenerate triangles placed in
// the chart holding their corners or apart, charts apart).
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

// Twice the signed UV area of triangle t.
static double TwiceUVArea(const float* uv, int32_t t)
{
    const float* c = uv + 6 * t;
    return ((double)c[2] - c[0]) * ((double)c[5] - c[1]) - ((double)c[4] - c[0]) * ((double)c[3] - c[1]);
}

static bool SameUV(const float* a, const float* b) { return a[0] == b[0] && a[1] == b[1]; }

static bool DegenerateTrianglesChecks()
{
    // A 2 x 1 rectangle (triangles 0, 1) and four degenerate triangles: one repeating an index on
    // the rectangle's edge 0-1 (2), one on the rectangle's corners 0, 1 and its own copy of corner 1
    // (3), and two apart from it: three corners on a line (4) and three on one point (5).
    const float vertex[] = {0, 0, 0, 2, 0, 0, 2, 1, 0, 0, 1, 0, 2, 0, 0, 5, 5, 5, 6, 5, 5, 7, 5, 5, 9, 9, 9};
    const uint32_t tri[] = {0, 1, 2, 0, 2, 3, 0, 1, 1, 0, 1, 4, 5, 6, 7, 8, 8, 8};
    float uv[36];
    if (!Unwrap(vertex, 9, tri, 6, uv) || !InsideUnitSquare(uv, 6))
        return false;
    // The rectangle is one chart at its true shape: a conformal map of a flat chart is a similarity.
    double scale = Distance2(uv, uv + 2) / 2.0;
    if (!(scale > 0) || !KeepsShape(vertex, tri, uv, 0, scale) || !KeepsShape(vertex, tri, uv, 1, scale) ||
        !OneUVPerVertex(tri, 2, uv) || !(TwiceUVArea(uv, 0) > 0) || !(TwiceUVArea(uv, 1) > 0))
        return false;
    // Triangle 2 sits in the rectangle's chart: its corners take the UVs of vertices 0 and 1 there.
    if (!SameUV(uv + 12, uv) || !SameUV(uv + 14, uv + 2) || !SameUV(uv + 16, uv + 2))
        return false;
    // Triangle 3 has a corner (vertex 4) the chart does not hold: a chart of its own, with no area.
    // So are triangles 4 and 5: every one of their corners keeps the margin from the rectangle.
    Box rectangle = BoxOf(uv, 6);
    for (int c = 9; c < 18; ++c)
        if (!ApartFrom(rectangle, uv + 2 * c, kDefaults.packMargin))
            return false;
    bool lineStaysALine = fabs(TwiceUVArea(uv, 4)) < 1e-12 && fabs(TwiceUVArea(uv, 3)) < 1e-12;
    bool pointStaysAPoint = SameUV(uv + 30, uv + 32) && SameUV(uv + 32, uv + 34);
    return lineStaysALine && pointStaysAPoint;
}

// A flat 60 x 1 strip of unit rectangles, each one source polygon of two triangles: far too
// long for the square, so it is cut into pieces, but only between rectangles: both triangles of
// each rectangle share the UVs of its diagonal, and every edge keeps its length at one scale.
static bool LongStripOfRectsChecks()
{
    const uint32_t rects = 60;
    float vertex[3 * 2 * (rects + 1)];
    uint32_t tri[6 * rects], polygon[2 * rects];
    for (uint32_t i = 0; i <= rects; ++i)
        for (uint32_t side = 0; side < 2; ++side)
        {
            float* p = vertex + 3 * (2 * i + side);
            p[0] = (float)i, p[1] = (float)side, p[2] = 0;
        }
    for (uint32_t i = 0; i < rects; ++i)
    {
        uint32_t a = 2 * i, b = 2 * i + 2, c = 2 * i + 3, d = 2 * i + 1;
        const uint32_t quad[6] = {a, b, c, a, c, d};
        memcpy(tri + 6 * i, quad, sizeof quad);
        polygon[2 * i] = polygon[2 * i + 1] = 1000 + i;
    }
    float uv[12 * rects];
    char error[256];
    memset(error, 0, sizeof error);
    if (!GenerateSecondaryUVSet(vertex, 2 * (rects + 1), nullptr, tri, polygon, 2 * rects, uv, kDefaults, error, sizeof error) ||
        error[0] != 0 || !InsideUnitSquare(uv, 2 * rects))
        return false;
    double scale = Distance2(uv, uv + 2);
    bool cut = false;
    for (uint32_t i = 0; i < rects; ++i)
    {
        const float* first = uv + 12 * i;
        const float* second = first + 6;
        if (!SameUV(first, second) || !SameUV(first + 4, second + 2) || !KeepsShape(vertex, tri, uv, 2 * i, scale) ||
            !KeepsShape(vertex, tri, uv, 2 * i + 1, scale))
            return false;
        cut = cut || (i > 0 && !SameUV(first, uv + 12 * (i - 1) + 2));   // a: corner b of the rectangle before
    }
    return cut;
}

static bool DontSplitRectsChecks()
{
    // A 4 x 1 strip of eight triangles bent into a third of a cylinder around the x axis (the
    // strip's long side runs around it, normals 120 degrees apart at its ends): developable, so it
    // stays one chart and unrolls to its true shape, every edge at one common scale within 1%.
    const int steps = 4;
    float vertex[3 * 2 * (steps + 1)];
    uint32_t tri[3 * 2 * steps];
    for (int i = 0; i <= steps; ++i)
    {
        const double arc = 2 * 3.14159265358979323846 / 3;
        double angle = arc * i / steps, radius = 4 / arc;   // the arc is 4 long
        for (int side = 0; side < 2; ++side)
        {
            float* p = vertex + 3 * (2 * i + side);
            p[0] = (float)side;
            p[1] = (float)(radius * cos(angle));
            p[2] = (float)(radius * sin(angle));
        }
    }
    for (uint32_t i = 0; i < (uint32_t)steps; ++i)
    {
        uint32_t a = 2 * i, b = 2 * i + 1, c = 2 * i + 3, d = 2 * i + 2;
        const uint32_t quad[6] = {a, d, c, a, c, b};
        memcpy(tri + 6 * i, quad, sizeof quad);
    }
    float uv[12 * steps];
    if (!Unwrap(vertex, 2 * (steps + 1), tri, 2 * steps, uv) || !InsideUnitSquare(uv, 2 * steps) ||
        !OneUVPerVertex(tri, 2 * steps, uv))
        return false;
    double scale = Distance2(uv, uv + 2) / Distance3(vertex + 3 * tri[0], vertex + 3 * tri[1]);
    for (int t = 0; t < 2 * steps; ++t)
        for (int c = 0; c < 3; ++c)
        {
            double length3 = Distance3(vertex + 3 * tri[3 * t + c], vertex + 3 * tri[3 * t + (c + 1) % 3]);
            double length2 = Distance2(uv + 6 * t + 2 * c, uv + 6 * t + 2 * ((c + 1) % 3));
            if (!(fabs(length2 - scale * length3) <= 0.01 * scale * length3) || !(TwiceUVArea(uv, t) > 0))
                return false;
        }
    // A 2 x 1 rectangle of two triangles: one chart at its true shape, as large as packing allows
    // (at best half the square).
    const float flat[] = {0, 0, 0, 2, 0, 0, 2, 1, 0, 0, 1, 0};
    const uint32_t pair[] = {0, 1, 2, 0, 2, 3};
    float rect[12];
    if (!Unwrap(flat, 4, pair, 2, rect) || !InsideUnitSquare(rect, 2) || !OneUVPerVertex(pair, 2, rect))
        return false;
    double rectScale = Distance2(rect, rect + 2) / 2.0;
    return rectScale > 0 && KeepsShape(flat, pair, rect, 0, rectScale) && KeepsShape(flat, pair, rect, 1, rectScale) &&
           2 * rectScale * rectScale > 0.4 && LongStripOfRectsChecks();
}

extern "C" bool Unwrap_TestUnwrapWithDegenerateTriangles()
{
    return TestExportResult("Unwrap_TestUnwrapWithDegenerateTriangles", DegenerateTrianglesChecks());
}

extern "C" bool Unwrap_TestUnwrapDontSplitRects()
{
    return TestExportResult("Unwrap_TestUnwrapDontSplitRects", DontSplitRectsChecks());
}
