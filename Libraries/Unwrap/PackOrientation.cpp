#include "PackOrientation.h"

#include "UnwrapMath.h"
#include "WinImports.h"

namespace
{
    const int kMaxEdgesTried = 256;

    inline double Cross(double ax, double ay, double bx, double by, double cx, double cy)
    {
        return (bx - ax) * (cy - ay) - (by - ay) * (cx - ax);
    }

    // The eight extreme corners of the chart (lowest v, highest u - v, highest u, highest u + v,
    // highest v, lowest u - v, lowest u, lowest u + v): an octagon, counter-clockwise, inside
    // the hull. Corners strictly inside it cannot be hull points.
    struct Octagon
    {
        double x[8], y[8];
        bool Inside(double px, double py) const
        {
            for (int i = 0; i < 8; ++i)
            {
                int j = (i + 1) & 7;
                if (x[i] == x[j] && y[i] == y[j])
                    continue;
                if (Cross(x[i], y[i], x[j], y[j], px, py) <= 0)
                    return false;
            }
            return true;
        }
    };

    Octagon Extremes(const float* uv, const uint32_t* triangles, uint32_t count)
    {
        Octagon o;
        double key[8];
        for (int i = 0; i < 8; ++i)
            key[i] = -1e300;
        for (uint32_t i = 0; i < count; ++i)
            for (uint32_t k = 6 * triangles[i]; k < 6 * triangles[i] + 6; k += 2)
            {
                double x = uv[k], y = uv[k + 1];
                const double score[8] = {-y, x - y, x, x + y, y, y - x, -x, -x - y};
                for (int e = 0; e < 8; ++e)
                    if (score[e] > key[e])
                        key[e] = score[e], o.x[e] = x, o.y[e] = y;
            }
        return o;
    }

    bool Before(const double* p, const double* q) { return p[0] < q[0] || (p[0] == q[0] && p[1] < q[1]); }

    // Heap sort of n points (2 doubles each) by u, then v.
    void SortPoints(double* p, uint64_t n)
    {
        auto swap = [p](uint64_t a, uint64_t b) {
            double x = p[2 * a], y = p[2 * a + 1];
            p[2 * a] = p[2 * b], p[2 * a + 1] = p[2 * b + 1];
            p[2 * b] = x, p[2 * b + 1] = y;
        };
        auto sift = [&](uint64_t root, uint64_t end) {
            for (;;)
            {
                uint64_t child = 2 * root + 1;
                if (child >= end)
                    return;
                if (child + 1 < end && Before(p + 2 * child, p + 2 * child + 2))
                    ++child;
                if (!Before(p + 2 * root, p + 2 * child))
                    return;
                swap(root, child);
                root = child;
            }
        };
        for (uint64_t i = n / 2; i-- > 0;)
            sift(i, n);
        for (uint64_t end = n; end > 1; --end)
        {
            swap(0, end - 1);
            sift(0, end - 1);
        }
    }

    // Andrew's monotone chain over sorted points; returns the hull's size (counter-clockwise).
    uint64_t ConvexHull(const double* p, uint64_t n, double* hull)
    {
        uint64_t size = 0;
        auto push = [&](const double* q, uint64_t floor) {
            while (size >= floor + 2 &&
                   Cross(hull[2 * size - 4], hull[2 * size - 3], hull[2 * size - 2], hull[2 * size - 1], q[0], q[1]) <= 0)
                --size;
            hull[2 * size] = q[0], hull[2 * size + 1] = q[1];
            ++size;
        };
        for (uint64_t i = 0; i < n; ++i)
            push(p + 2 * i, 0);
        uint64_t lower = size - 1;
        for (uint64_t i = n - 1; i-- > 0;)
            push(p + 2 * i, lower);
        return size > 1 ? size - 1 : size;   // the last point repeats the first
    }
}

bool MinimumBoxTurn(const float* uv, const uint32_t* triangles, uint32_t count, HullScratch& scratch, double* cosine,
                    double* sine)
{
    *cosine = 1, *sine = 0;
    Octagon octagon = Extremes(uv, triangles, count);
    uint64_t outside = 8;
    for (uint32_t i = 0; i < count; ++i)
        for (uint32_t k = 6 * triangles[i]; k < 6 * triangles[i] + 6; k += 2)
            outside += !octagon.Inside(uv[k], uv[k + 1]);
    if (outside + 1 > scratch.capacity)
    {
        uint64_t grown = outside + outside / 2 + 16;
        if (!scratch.points.Allocate(2 * grown) || !scratch.hull.Allocate(2 * grown + 4))
            return (scratch.capacity = 0), false;
        scratch.capacity = grown;
    }
    double* p = scratch.points.Data();
    uint64_t n = 0;
    for (int e = 0; e < 8; ++e)
        p[2 * n] = octagon.x[e], p[2 * n + 1] = octagon.y[e], ++n;
    for (uint32_t i = 0; i < count; ++i)
        for (uint32_t k = 6 * triangles[i]; k < 6 * triangles[i] + 6; k += 2)
            if (!octagon.Inside(uv[k], uv[k + 1]))
                p[2 * n] = uv[k], p[2 * n + 1] = uv[k + 1], ++n;
    SortPoints(p, n);
    uint64_t unique = 0;
    for (uint64_t i = 0; i < n; ++i)
        if (unique == 0 || p[2 * i] != p[2 * unique - 2] || p[2 * i + 1] != p[2 * unique - 1])
            p[2 * unique] = p[2 * i], p[2 * unique + 1] = p[2 * i + 1], ++unique;
    if (unique < 3)
        return true;
    double* hull = scratch.hull.Data();
    uint64_t size = ConvexHull(p, unique, hull);
    if (size < 3)
        return true;

    uint64_t stride = size / kMaxEdgesTried + 1;
    double bestArea = 1e300;
    for (uint64_t e = 0; e < size; e += stride)
    {
        uint64_t f = (e + 1) % size;
        double dx = hull[2 * f] - hull[2 * e], dy = hull[2 * f + 1] - hull[2 * e + 1];
        double length = Sqrt(dx * dx + dy * dy);
        if (length == 0)
            continue;
        double ux = dx / length, uy = dy / length;
        double low = 1e300, high = -1e300, bottom = 1e300, top = -1e300;
        for (uint64_t i = 0; i < size; ++i)
        {
            double along = hull[2 * i] * ux + hull[2 * i + 1] * uy, across = hull[2 * i + 1] * ux - hull[2 * i] * uy;
            low = along < low ? along : low, high = along > high ? along : high;
            bottom = across < bottom ? across : bottom, top = across > top ? across : top;
        }
        double area = (high - low) * (top - bottom);
        if (area < bestArea)
            bestArea = area, *cosine = ux, *sine = -uy;
    }
    return true;
}
