#pragma once
// uvstat: measures a generated UV layout (one UV pair a triangle corner) against its mesh.
//
// Validity (hard requirements of a lightmap layout): finite UVs inside [0,1]^2, no flipped or
// zero-area UV triangle, no two triangles overlapping (an exact geometric test, and the raster
// count at a fixed resolution), and at least `packMargin` between charts and to the border.
// Quality: utilization, L2 and L-infinity stretch, angle distortion, area distortion per chart
// and global, charts, vertex split, seam length ratio, texel density spread.
//
// Definitions (shared with the benchmark and the tests):
// - A3(f) is the 3D area and A2(f) the signed UV area of triangle f. A triangle is degenerate
//   when A3 <= kDegenerateRatio * (sum of its squared edge lengths); degenerate triangles are
//   left out of every average but must still have valid UVs.
// - Charts: triangles that share a vertex index with the same UV at that corner are in one
//   chart; charts are the connected components of that relation.
// - Flipped: a non-degenerate triangle whose UV orientation differs from its chart's (the sign
//   of the chart's total signed UV area). Zero UV area: |A2| <= 1e-14.
// - Overlap: two triangles whose open UV interiors intersect (exact predicates on the float
//   UVs); the raster count covers texel centres at kRasterSize^2 with the top-left fill rule.
// - Margin: the smallest distance between a boundary edge of one chart and a boundary edge of
//   another, and between any UV and the square's border.

#include <cstdint>
#include <string>
#include <vector>

namespace UVStat
{
    inline constexpr double kDegenerateRatio = 1e-12;
    inline constexpr double kZeroUVArea = 1e-14;
    inline constexpr int kRasterSize = 2048;

    // A mesh and its layout; the arrays belong to the caller.
    struct LayoutView
    {
        const float* vertex = nullptr;   // 3 floats a vertex
        uint32_t vertexCount = 0;
        const uint32_t* tri = nullptr;   // 3 vertex indices a triangle
        uint32_t triCount = 0;
        const float* uv = nullptr;       // 2 floats a corner; corner c of triangle t is pair 3t + c
    };

    struct Validity
    {
        uint64_t nonFiniteCorners = 0;      // NaN or infinite coordinate
        uint64_t outsideCorners = 0;        // outside [0,1]^2
        uint64_t flipped = 0;
        uint64_t zeroArea = 0;              // non-degenerate triangles with zero UV area
        uint64_t overlapPairsBetweenCharts = 0;   // exact: triangle pairs whose interiors intersect
        uint64_t overlapPairsInsideCharts = 0;
        uint64_t rasterOverlapBetweenCharts = 0;  // texel centres covered twice, kRasterSize^2
        uint64_t rasterOverlapInsideCharts = 0;
        uint64_t marginViolations = 0;      // boundary-edge pairs of two charts closer than the margin
        uint64_t borderViolations = 0;      // corners closer to the border than the margin
        double minChartGap = 0;             // smallest gap between two charts (1e30 for one chart)
        double minBorderGap = 0;            // smallest distance of a UV to the border
        uint64_t splitVertexCharts = 0;     // vertices with two different UVs inside one chart

        bool Valid() const;
    };

    struct Quality
    {
        double utilization = 0;
        double l2Stretch = 0;
        double lInfStretch = 0;
        double angleDistortion = 0;
        double chartAreaDistortion = 0;
        double globalAreaDistortion = 0;
        double texelDensitySpread = 0;
        double seamLengthRatio = 0;
        double vertexSplit = 0;
        uint32_t charts = 0;
        uint32_t degenerateTriangles = 0;
    };

    struct Report
    {
        double packMargin = 0;
        uint32_t vertexCount = 0;
        uint32_t triCount = 0;
        Validity validity;
        Quality quality;
        bool Valid() const { return validity.Valid(); }
    };

    // Every figure above for one layout; `packMargin` is the margin the layout must keep.
    Report Measure(const LayoutView& layout, double packMargin);

    // The report as readable text, and as one JSON object (for scripts and the benchmark).
    std::string FormatText(const Report& report);
    std::string FormatJson(const Report& report);
}
