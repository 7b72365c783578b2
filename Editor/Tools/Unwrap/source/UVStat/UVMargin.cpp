// Gaps: every corner's distance to the square's border, and the distance between boundary
// edges of different charts. A chart's boundary edge is a triangle edge whose pair of corner
// keys no other triangle of the chart shares. Only pairs closer than the search radius
// (twice the margin, at least 1/128) are measured, through a grid of that cell size.
// Cost: sorting the 3T half-edges, then the candidate pairs of nearby boundary edges.
#include "Editor/Tools/Unwrap/source/UVStat/ExactOrient.h"
#include "Editor/Tools/Unwrap/source/UVStat/UVStatParts.h"

#include <algorithm>
#include <cmath>

namespace UVStat
{
    namespace
    {
        struct Segment
        {
            Point2 a, b;
            uint32_t chart;
        };

        double PointSegmentDistance(const Point2& p, const Point2& a, const Point2& b)
        {
            double abx = b.x - a.x, aby = b.y - a.y, apx = p.x - a.x, apy = p.y - a.y;
            double length2 = abx * abx + aby * aby;
            double s = length2 > 0 ? std::clamp((apx * abx + apy * aby) / length2, 0.0, 1.0) : 0.0;
            double dx = apx - s * abx, dy = apy - s * aby;
            return std::sqrt(dx * dx + dy * dy);
        }

        bool SegmentsMeet(const Segment& p, const Segment& q)
        {
            int d1 = Orient(p.a.x, p.a.y, p.b.x, p.b.y, q.a.x, q.a.y), d2 = Orient(p.a.x, p.a.y, p.b.x, p.b.y, q.b.x, q.b.y);
            int d3 = Orient(q.a.x, q.a.y, q.b.x, q.b.y, p.a.x, p.a.y), d4 = Orient(q.a.x, q.a.y, q.b.x, q.b.y, p.b.x, p.b.y);
            if (d1 * d2 < 0 && d3 * d4 < 0)
                return true;
            return false;   // touching cases have a zero endpoint distance, found below
        }

        double SegmentDistance(const Segment& p, const Segment& q)
        {
            if (SegmentsMeet(p, q))
                return 0;
            return std::min({PointSegmentDistance(p.a, q.a, q.b), PointSegmentDistance(p.b, q.a, q.b),
                             PointSegmentDistance(q.a, p.a, p.b), PointSegmentDistance(q.b, p.a, p.b)});
        }

        std::vector<Segment> BoundaryEdges(const LayoutView& layout, const ChartLabels& labels)
        {
            struct KeyEdge
            {
                uint32_t low, high, triangle, corner;
            };
            std::vector<KeyEdge> edges;
            edges.reserve(labels.cornerKey.size());
            for (uint32_t t = 0; t < layout.triCount; ++t)
                for (int c = 0; c < 3; ++c)
                {
                    uint32_t a = labels.cornerKey[3 * t + c], b = labels.cornerKey[3 * t + (c + 1) % 3];
                    edges.push_back({std::min(a, b), std::max(a, b), t, uint32_t(c)});
                }
            std::sort(edges.begin(), edges.end(), [](const KeyEdge& a, const KeyEdge& b) {
                return a.low != b.low ? a.low < b.low : (a.high != b.high ? a.high < b.high : a.triangle < b.triangle);
            });
            std::vector<Segment> boundary;
            for (size_t i = 0; i < edges.size();)
            {
                size_t j = i + 1;
                while (j < edges.size() && edges[j].low == edges[i].low && edges[j].high == edges[i].high)
                    ++j;
                if (j - i != 2)   // one side: a boundary; more than two: kept, to be safe
                    for (size_t k = i; k < j; ++k)
                    {
                        uint32_t t = edges[k].triangle;
                        int c = int(edges[k].corner);
                        Segment s = {CornerUV(layout, t, c), CornerUV(layout, t, (c + 1) % 3), labels.chartOf[t]};
                        if (std::isfinite(s.a.x) && std::isfinite(s.a.y) && std::isfinite(s.b.x) && std::isfinite(s.b.y))
                            boundary.push_back(s);
                    }
                i = j;
            }
            return boundary;
        }
    }

    void MeasureMargins(const LayoutView& layout, const ChartLabels& labels, double packMargin, Validity& validity)
    {
        validity.minBorderGap = 1e30;
        for (uint64_t k = 0; k < 3ull * layout.triCount; ++k)
        {
            double u = layout.uv[2 * k], v = layout.uv[2 * k + 1];
            if (!std::isfinite(u) || !std::isfinite(v))
                continue;
            double gap = std::min({u, 1 - u, v, 1 - v});
            validity.minBorderGap = std::min(validity.minBorderGap, gap);
            validity.borderViolations += gap < packMargin;
        }

        double radius = std::max(2 * packMargin, 1.0 / 128);
        std::vector<Segment> edges = BoundaryEdges(layout, labels);
        std::vector<Box> boxes(edges.size());
        for (size_t i = 0; i < edges.size(); ++i)
        {
            const Segment& s = edges[i];
            boxes[i] = {std::min(s.a.x, s.b.x) - radius / 2, std::min(s.a.y, s.b.y) - radius / 2,
                        std::max(s.a.x, s.b.x) + radius / 2, std::max(s.a.y, s.b.y) + radius / 2};
        }
        int cells = std::clamp(int(1.0 / radius), 1, 4096);
        Buckets buckets = BucketBoxes(boxes, cells);
        validity.minChartGap = radius;
        ForEachBoxPair(buckets, boxes, [&](uint32_t i, uint32_t j) {
            if (edges[i].chart == edges[j].chart)
                return;
            double gap = SegmentDistance(edges[i], edges[j]);
            validity.minChartGap = std::min(validity.minChartGap, gap);
            validity.marginViolations += gap < packMargin;
        });
        if (labels.chartCount < 2)
            validity.minChartGap = 1e30;
    }
}
