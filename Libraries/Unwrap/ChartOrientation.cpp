#include "ChartOrientation.h"

#include "Scratch.h"
#include "UnwrapMath.h"

namespace
{
    struct Point
    {
        double x, y;
    };

    bool Below(const Point& a, const Point& b) { return a.x < b.x || (a.x == b.x && a.y < b.y); }
    double Turn(const Point& o, const Point& a, const Point& b) { return (a.x - o.x) * (b.y - o.y) - (a.y - o.y) * (b.x - o.x); }

    void HeapSort(Point* p, uint32_t n)
    {
        auto sift = [p](uint32_t i, uint32_t size) {
            for (;;)
            {
                uint32_t child = 2 * i + 1;
                if (child >= size)
                    return;
                if (child + 1 < size && Below(p[child], p[child + 1]))
                    ++child;
                if (!Below(p[i], p[child]))
                    return;
                Point t = p[i];
                p[i] = p[child];
                p[child] = t;
                i = child;
            }
        };
        for (uint32_t i = n / 2; i-- > 0;)
            sift(i, n);
        for (uint32_t end = n; end-- > 1;)
        {
            Point t = p[0];
            p[0] = p[end];
            p[end] = t;
            sift(0, end);
        }
    }

    // Andrew's monotone chain; writes the hull (counter-clockwise) into hull, returns its size.
    uint32_t ConvexHull(Point* p, uint32_t n, Point* hull)
    {
        HeapSort(p, n);
        uint32_t k = 0;
        for (uint32_t i = 0; i < n; ++i)
        {
            while (k >= 2 && Turn(hull[k - 2], hull[k - 1], p[i]) <= 0)
                --k;
            hull[k++] = p[i];
        }
        for (uint32_t i = n - 1, lower = k + 1; i-- > 0;)
        {
            while (k >= lower && Turn(hull[k - 2], hull[k - 1], p[i]) <= 0)
                --k;
            hull[k++] = p[i];
        }
        return k > 1 ? k - 1 : k;
    }
}

bool TurnToSmallestBox(double* uv, uint32_t count)
{
    if (count == 0)
        return true;
    Scratch<Point> points, hull;
    if (!points.Allocate(count) || !hull.Allocate(2ull * count + 1))
        return false;
    for (uint32_t i = 0; i < count; ++i)
        points[i] = {uv[2 * i], uv[2 * i + 1]};
    uint32_t h = ConvexHull(points.Data(), count, hull.Data());
    double bestCos = 1, bestSin = 0, bestArea = 1e300;
    uint32_t step = h > 256 ? h / 256 : 1;
    for (uint32_t e = 0; e < h; e += step)
    {
        Point a = hull[e], b = hull[(e + 1) % h];
        double dx = b.x - a.x, dy = b.y - a.y, length = Sqrt(dx * dx + dy * dy);
        if (!(length > 0))
            continue;
        double c = dx / length, s = dy / length;
        double minX = 1e300, maxX = -1e300, minY = 1e300, maxY = -1e300;
        for (uint32_t i = 0; i < h; ++i)
        {
            double x = c * hull[i].x + s * hull[i].y, y = c * hull[i].y - s * hull[i].x;
            minX = x < minX ? x : minX;
            maxX = x > maxX ? x : maxX;
            minY = y < minY ? y : minY;
            maxY = y > maxY ? y : maxY;
        }
        double area = (maxX - minX) * (maxY - minY);
        if (area < bestArea)
        {
            bestArea = area;
            bestCos = c;
            bestSin = s;
            if (maxY - minY > maxX - minX)   // a further quarter turn: wider than tall
            {
                bestCos = -s;
                bestSin = c;
            }
        }
    }
    double minX = 1e300, minY = 1e300;
    for (uint32_t i = 0; i < count; ++i)
    {
        double x = bestCos * uv[2 * i] + bestSin * uv[2 * i + 1], y = bestCos * uv[2 * i + 1] - bestSin * uv[2 * i];
        uv[2 * i] = x;
        uv[2 * i + 1] = y;
        minX = x < minX ? x : minX;
        minY = y < minY ? y : minY;
    }
    for (uint32_t i = 0; i < count; ++i)
    {
        uv[2 * i] -= minX;
        uv[2 * i + 1] -= minY;
    }
    return true;
}
