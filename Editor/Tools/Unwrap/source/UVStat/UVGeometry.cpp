// Shared geometry of the measuring stages: per-triangle areas and the uniform grid that the
// pair searches use. Cost: linear in the triangles and in the grid cells their boxes touch.
#include "Editor/Tools/Unwrap/source/UVStat/UVStatParts.h"

#include <algorithm>
#include <cmath>

namespace UVStat
{
    TriangleAreas MeasureAreas(const LayoutView& layout)
    {
        TriangleAreas areas;
        uint32_t n = layout.triCount;
        areas.area3.resize(n);
        areas.area2.resize(n);
        areas.degenerate.resize(n);
        areas.finite.resize(n);
        for (uint32_t t = 0; t < n; ++t)
        {
            double p[3][3];
            for (int c = 0; c < 3; ++c)
                for (int k = 0; k < 3; ++k)
                    p[c][k] = layout.vertex[3ull * layout.tri[3ull * t + c] + k];
            double a[3], b[3], lengths = 0;
            for (int k = 0; k < 3; ++k)
            {
                a[k] = p[1][k] - p[0][k], b[k] = p[2][k] - p[0][k];
                double e = p[2][k] - p[1][k];
                lengths += a[k] * a[k] + b[k] * b[k] + e * e;
            }
            double x = a[1] * b[2] - a[2] * b[1], y = a[2] * b[0] - a[0] * b[2], z = a[0] * b[1] - a[1] * b[0];
            areas.area3[t] = 0.5 * std::sqrt(x * x + y * y + z * z);
            areas.degenerate[t] = areas.area3[t] <= kDegenerateRatio * lengths;
            Point2 q[3] = {CornerUV(layout, t, 0), CornerUV(layout, t, 1), CornerUV(layout, t, 2)};
            bool finite = true;
            for (const Point2& corner : q)
                finite = finite && std::isfinite(corner.x) && std::isfinite(corner.y);
            areas.finite[t] = finite;
            areas.area2[t] = finite ? 0.5 * ((q[1].x - q[0].x) * (q[2].y - q[0].y) - (q[1].y - q[0].y) * (q[2].x - q[0].x)) : 0;
        }
        return areas;
    }

    Buckets BucketBoxes(const std::vector<Box>& boxes, int cellsPerSide)
    {
        Buckets buckets;
        double x0 = 1e300, y0 = 1e300, x1 = -1e300, y1 = -1e300;
        for (const Box& b : boxes)
        {
            x0 = std::min(x0, b.x0), y0 = std::min(y0, b.y0);
            x1 = std::max(x1, b.x1), y1 = std::max(y1, b.y1);
        }
        CellGrid& grid = buckets.grid;
        grid.size = std::max(1, cellsPerSide);
        double extent = std::max(x1 - x0, y1 - y0);
        grid.x0 = boxes.empty() ? 0 : x0;
        grid.y0 = boxes.empty() ? 0 : y0;
        grid.scale = extent > 0 ? grid.size / extent : 1;
        size_t cells = size_t(grid.size) * grid.size;
        buckets.start.assign(cells + 1, 0);
        auto forCells = [&grid](const Box& b, auto body) {
            for (int cy = grid.CellY(b.y0); cy <= grid.CellY(b.y1); ++cy)
                for (int cx = grid.CellX(b.x0); cx <= grid.CellX(b.x1); ++cx)
                    body(size_t(cy) * grid.size + cx);
        };
        for (const Box& b : boxes)
            forCells(b, [&buckets](size_t cell) { ++buckets.start[cell + 1]; });
        for (size_t c = 0; c < cells; ++c)
            buckets.start[c + 1] += buckets.start[c];
        buckets.items.resize(buckets.start[cells]);
        std::vector<uint32_t> fill(buckets.start.begin(), buckets.start.end() - 1);
        for (uint32_t i = 0; i < boxes.size(); ++i)
            forCells(boxes[i], [&](size_t cell) { buckets.items[fill[cell]++] = i; });
        return buckets;
    }
}
