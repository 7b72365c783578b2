// Per-triangle validity and overlaps. Exact test: two triangles overlap when their open UV
// interiors intersect; for two convex polygons that is the case exactly when no edge line of
// either one has the other entirely on its closed outer side (exact orientation predicates, so
// triangles that only touch along an edge or at a corner never count). Raster test: texel
// centres at kRasterSize^2, top-left fill rule, a centre covered twice is an overlap.
// Cost: a grid broad phase, then the candidate pairs; the raster touches each covered texel.
#include "Editor/Tools/Unwrap/source/UVStat/ExactOrient.h"
#include "Editor/Tools/Unwrap/source/UVStat/UVStatParts.h"

#include <algorithm>
#include <cmath>

namespace UVStat
{
    namespace
    {
        // Triangle corners turned counter-clockwise (positive orientation).
        struct CcwTriangle
        {
            Point2 p[3];
        };

        int Orient(const Point2& a, const Point2& b, const Point2& c) { return UVStat::Orient(a.x, a.y, b.x, b.y, c.x, c.y); }

        // The exact orientation of triangle t's UVs (0: the corners are collinear, no interior).
        int UVOrientation(const LayoutView& layout, uint32_t t)
        {
            return Orient(CornerUV(layout, t, 0), CornerUV(layout, t, 1), CornerUV(layout, t, 2));
        }

        // Triangle t with its corners in counter-clockwise order; t must have an interior.
        CcwTriangle Ccw(const LayoutView& layout, uint32_t t)
        {
            CcwTriangle tri = {{CornerUV(layout, t, 0), CornerUV(layout, t, 1), CornerUV(layout, t, 2)}};
            if (UVOrientation(layout, t) < 0)
                std::swap(tri.p[1], tri.p[2]);
            return tri;
        }

        // True when some edge line of `a` has all of `b` on its closed outer side.
        bool EdgeSeparates(const CcwTriangle& a, const CcwTriangle& b)
        {
            for (int e = 0; e < 3; ++e)
            {
                const Point2 &from = a.p[e], &to = a.p[(e + 1) % 3];
                if (Orient(from, to, b.p[0]) <= 0 && Orient(from, to, b.p[1]) <= 0 && Orient(from, to, b.p[2]) <= 0)
                    return true;
            }
            return false;
        }

        bool InteriorsIntersect(const CcwTriangle& a, const CcwTriangle& b) { return !EdgeSeparates(a, b) && !EdgeSeparates(b, a); }

        // Whether a texel centre on an edge belongs to the triangle: top and left edges do (for a
        // counter-clockwise triangle with v up, left edges run downwards, top edges leftwards).
        bool TopLeft(const Point2& from, const Point2& to)
        {
            double dy = to.y - from.y, dx = to.x - from.x;
            return dy < 0 || (dy == 0 && dx < 0);
        }

        bool Covers(const CcwTriangle& tri, const Point2& centre)
        {
            for (int e = 0; e < 3; ++e)
            {
                const Point2 &from = tri.p[e], &to = tri.p[(e + 1) % 3];
                int side = Orient(from, to, centre);
                if (side < 0 || (side == 0 && !TopLeft(from, to)))
                    return false;
            }
            return true;
        }

        void CountRasterOverlaps(const LayoutView& layout, const ChartLabels& labels, const std::vector<uint8_t>& usable,
                                 Validity& validity)
        {
            const int n = kRasterSize;
            std::vector<uint32_t> firstChart(size_t(n) * n, ~0u);
            std::vector<uint8_t> counted(size_t(n) * n, 0);   // bit 0: between charts, bit 1: inside one
            for (uint32_t t = 0; t < layout.triCount; ++t)
            {
                if (!usable[t])
                    continue;
                CcwTriangle tri = Ccw(layout, t);
                double lx = std::min({tri.p[0].x, tri.p[1].x, tri.p[2].x}), hx = std::max({tri.p[0].x, tri.p[1].x, tri.p[2].x});
                double ly = std::min({tri.p[0].y, tri.p[1].y, tri.p[2].y}), hy = std::max({tri.p[0].y, tri.p[1].y, tri.p[2].y});
                int x0 = std::max(0, int(std::floor(lx * n - 0.5))), x1 = std::min(n - 1, int(std::ceil(hx * n - 0.5)));
                int y0 = std::max(0, int(std::floor(ly * n - 0.5))), y1 = std::min(n - 1, int(std::ceil(hy * n - 0.5)));
                uint32_t chart = labels.chartOf[t];
                for (int y = y0; y <= y1; ++y)
                    for (int x = x0; x <= x1; ++x)
                    {
                        if (!Covers(tri, {(x + 0.5) / n, (y + 0.5) / n}))
                            continue;
                        size_t texel = size_t(y) * n + x;
                        if (firstChart[texel] == ~0u)
                            firstChart[texel] = chart;
                        else
                            counted[texel] |= firstChart[texel] == chart ? 2 : 1;
                    }
            }
            for (uint8_t flags : counted)
            {
                validity.rasterOverlapBetweenCharts += flags & 1;
                validity.rasterOverlapInsideCharts += (flags >> 1) & 1;
            }
        }
    }

    void MeasureOverlaps(const LayoutView& layout, const ChartLabels& labels, const TriangleAreas& areas, Validity& validity)
    {
        // The orientation of each chart: the sign of its total signed UV area.
        std::vector<double> chartArea(labels.chartCount, 0.0);
        for (uint32_t t = 0; t < layout.triCount; ++t)
            if (areas.finite[t] && !areas.degenerate[t])
                chartArea[labels.chartOf[t]] += areas.area2[t];

        std::vector<uint8_t> usable(layout.triCount, 0);   // finite, with a UV interior
        for (uint32_t t = 0; t < layout.triCount; ++t)
        {
            for (int c = 0; c < 3; ++c)
            {
                Point2 q = CornerUV(layout, t, c);
                if (!std::isfinite(q.x) || !std::isfinite(q.y))
                    ++validity.nonFiniteCorners;
                else if (q.x < 0 || q.x > 1 || q.y < 0 || q.y > 1)
                    ++validity.outsideCorners;
            }
            if (!areas.finite[t])
                continue;
            bool zero = std::fabs(areas.area2[t]) <= kZeroUVArea;
            if (!areas.degenerate[t])
            {
                validity.zeroArea += zero;
                double orientation = chartArea[labels.chartOf[t]];
                validity.flipped += !zero && ((areas.area2[t] > 0) != (orientation > 0));
            }
            usable[t] = UVOrientation(layout, t) != 0;
        }

        std::vector<Box> boxes;
        std::vector<uint32_t> triangleOf;
        for (uint32_t t = 0; t < layout.triCount; ++t)
            if (usable[t])
            {
                Point2 a = CornerUV(layout, t, 0), b = CornerUV(layout, t, 1), c = CornerUV(layout, t, 2);
                boxes.push_back({std::min({a.x, b.x, c.x}), std::min({a.y, b.y, c.y}), std::max({a.x, b.x, c.x}),
                                 std::max({a.y, b.y, c.y})});
                triangleOf.push_back(t);
            }
        int cells = std::clamp(int(std::sqrt(double(boxes.size()))), 1, 2048);
        Buckets buckets = BucketBoxes(boxes, cells);
        ForEachBoxPair(buckets, boxes, [&](uint32_t i, uint32_t j) {
            uint32_t s = triangleOf[i], t = triangleOf[j];
            if (!InteriorsIntersect(Ccw(layout, s), Ccw(layout, t)))
                return;
            if (labels.chartOf[s] == labels.chartOf[t])
                ++validity.overlapPairsInsideCharts;
            else
                ++validity.overlapPairsBetweenCharts;
        });
        CountRasterOverlaps(layout, labels, usable, validity);
    }
}
