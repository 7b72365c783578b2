#pragma once
// The measuring stages of uvstat, each filling its part of the report. Measure() (UVStat.cpp)
// runs them in order: triangle areas, chart labels, then structure, overlaps, margins, quality.

#include "Editor/Tools/Unwrap/source/UVStat/UVStat.h"

#include <cstdint>
#include <vector>

namespace UVStat
{
    struct Point2
    {
        double x, y;
    };

    inline Point2 CornerUV(const LayoutView& layout, uint32_t t, int c)
    {
        return {layout.uv[6ull * t + 2 * c], layout.uv[6ull * t + 2 * c + 1]};
    }

    // Per triangle: 3D area, signed UV area, degenerate (see UVStat.h) and finite-UV flags.
    struct TriangleAreas
    {
        std::vector<double> area3, area2;
        std::vector<uint8_t> degenerate, finite;
    };
    TriangleAreas MeasureAreas(const LayoutView& layout);

    // Distinct (vertex, UV) corner keys and the charts they join (UVCharts.cpp).
    struct ChartLabels
    {
        std::vector<uint32_t> cornerKey;   // key number of each corner, 3 a triangle
        std::vector<uint32_t> keyVertex;   // the vertex of each key
        std::vector<uint32_t> chartOf;     // chart of each triangle, numbered by first triangle
        uint32_t keyCount = 0;
        uint32_t chartCount = 0;
    };
    ChartLabels LabelCharts(const LayoutView& layout);

    // Vertex split, seam length ratio, vertices split inside one chart (UVCharts.cpp).
    void MeasureStructure(const LayoutView& layout, const ChartLabels& labels, Quality& quality, Validity& validity);

    // NaN, outside, flipped, zero-area triangles; exact and raster overlaps (UVOverlap.cpp).
    void MeasureOverlaps(const LayoutView& layout, const ChartLabels& labels, const TriangleAreas& areas, Validity& validity);

    // Gaps between charts and to the border (UVMargin.cpp).
    void MeasureMargins(const LayoutView& layout, const ChartLabels& labels, double packMargin, Validity& validity);

    // Utilization, stretch, angle and area distortion, texel density spread (UVQuality.cpp).
    void MeasureQuality(const LayoutView& layout, const ChartLabels& labels, const TriangleAreas& areas, Quality& quality);

    // Uniform grid over a box, for the pair searches of the overlap and margin stages.
    struct CellGrid
    {
        double x0 = 0, y0 = 0, scale = 1;   // cell = floor((x - x0) * scale), clamped
        int size = 1;                        // cells a side
        int Cell(double v, double origin) const
        {
            double c = (v - origin) * scale;
            return c <= 0 ? 0 : (c >= size - 1 ? size - 1 : (int)c);
        }
        int CellX(double x) const { return Cell(x, x0); }
        int CellY(double y) const { return Cell(y, y0); }
    };

    // Items with boxes, bucketed into the cells their boxes touch (compressed lists).
    struct Box
    {
        double x0, y0, x1, y1;
    };
    struct Buckets
    {
        CellGrid grid;
        std::vector<uint32_t> start;   // size*size + 1
        std::vector<uint32_t> items;
    };
    Buckets BucketBoxes(const std::vector<Box>& boxes, int cellsPerSide);

    // Calls visit(i, j) once for every pair of items i < j whose (closed) boxes intersect.
    template <typename Visit>
    void ForEachBoxPair(const Buckets& buckets, const std::vector<Box>& boxes, Visit visit)
    {
        int size = buckets.grid.size;
        for (int cell = 0; cell < size * size; ++cell)
        {
            int cx = cell % size, cy = cell / size;
            for (uint32_t a = buckets.start[cell]; a < buckets.start[cell + 1]; ++a)
                for (uint32_t b = a + 1; b < buckets.start[cell + 1]; ++b)
                {
                    uint32_t i = buckets.items[a], j = buckets.items[b];
                    const Box &p = boxes[i], &q = boxes[j];
                    if (p.x0 > q.x1 || q.x0 > p.x1 || p.y0 > q.y1 || q.y0 > p.y1)
                        continue;
                    // The pair is met in every cell both boxes touch: visit it only in the cell
                    // holding the low corner of the boxes' intersection.
                    double lx = p.x0 > q.x0 ? p.x0 : q.x0, ly = p.y0 > q.y0 ? p.y0 : q.y0;
                    if (buckets.grid.CellX(lx) != cx || buckets.grid.CellY(ly) != cy)
                        continue;
                    visit(i < j ? i : j, i < j ? j : i);
                }
        }
    }
}
