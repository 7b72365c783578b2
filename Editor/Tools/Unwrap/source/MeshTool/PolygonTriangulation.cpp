#include "Editor/Tools/Unwrap/source/MeshTool/PolygonTriangulation.h"

#include <cmath>

namespace
{
    struct Point2
    {
        double x, y;
    };

    double Cross(const Point2& a, const Point2& b, const Point2& c)
    {
        return (b.x - a.x) * (c.y - a.y) - (b.y - a.y) * (c.x - a.x);
    }

    // Inside or on the border of the counter-clockwise triangle abc.
    bool InTriangle(const Point2& p, const Point2& a, const Point2& b, const Point2& c)
    {
        return Cross(a, b, p) >= 0 && Cross(b, c, p) >= 0 && Cross(c, a, p) >= 0;
    }

    // The corners in the plane of the polygon, counter-clockwise.
    std::vector<Point2> Flatten(const std::vector<float>& points, bool* flipped)
    {
        size_t n = points.size() / 3;
        double normal[3] = {0, 0, 0};
        for (size_t i = 0; i < n; ++i)
        {
            const float* a = &points[3 * i];
            const float* b = &points[3 * ((i + 1) % n)];
            normal[0] += (a[1] - b[1]) * (a[2] + b[2]);
            normal[1] += (a[2] - b[2]) * (a[0] + b[0]);
            normal[2] += (a[0] - b[0]) * (a[1] + b[1]);
        }
        // Drop the axis the normal points along most; keep the other two in cyclic order, so that
        // a counter-clockwise polygon seen along the normal stays counter-clockwise.
        int drop = 2;
        if (std::fabs(normal[0]) >= std::fabs(normal[1]) && std::fabs(normal[0]) >= std::fabs(normal[2]))
            drop = 0;
        else if (std::fabs(normal[1]) >= std::fabs(normal[2]))
            drop = 1;
        int u = (drop + 1) % 3, v = (drop + 2) % 3;
        *flipped = normal[drop] < 0;
        std::vector<Point2> flat(n);
        for (size_t i = 0; i < n; ++i)
            flat[i] = {points[3 * i + (size_t)u], (*flipped ? -1.0 : 1.0) * points[3 * i + (size_t)v]};
        return flat;
    }
}

std::vector<uint32_t> TriangulatePolygon(const std::vector<float>& points)
{
    size_t n = points.size() / 3;
    std::vector<uint32_t> triangles;
    if (n < 3)
        return triangles;
    bool flipped = false;
    std::vector<Point2> flat = Flatten(points, &flipped);
    std::vector<uint32_t> left(n);
    for (size_t i = 0; i < n; ++i)
        left[i] = (uint32_t)i;
    while (left.size() > 3)
    {
        size_t m = left.size();
        bool clipped = false;
        for (size_t i = 0; i < m && !clipped; ++i)
        {
            uint32_t a = left[(i + m - 1) % m], b = left[i], c = left[(i + 1) % m];
            if (Cross(flat[a], flat[b], flat[c]) <= 0)
                continue;   // a reflex or flat corner is no ear
            bool empty = true;
            for (uint32_t other : left)
                if (other != a && other != b && other != c && InTriangle(flat[other], flat[a], flat[b], flat[c]))
                {
                    empty = false;
                    break;
                }
            if (!empty)
                continue;
            triangles.insert(triangles.end(), {a, b, c});
            left.erase(left.begin() + (long)i);
            clipped = true;
        }
        if (!clipped)
            break;
    }
    // What is left is a triangle, or a polygon without ears: finish it as a fan.
    for (size_t i = 1; i + 1 < left.size(); ++i)
        triangles.insert(triangles.end(), {left[0], left[i], left[i + 1]});
    return triangles;
}
