// The measuring library on small hand-made layouts whose figures are known: each validity
// check must see the fault it exists for, and must not see touching as overlapping.
#include "Editor/Tools/Unwrap/source/UVStat/ExactOrient.h"
#include "Editor/Tools/Unwrap/source/UVStat/TestMeshes.h"
#include "Editor/Tools/Unwrap/source/UVStat/UVStat.h"
#include "Runtime/Testing/Testing.h"

#include <cmath>
#include <limits>
#include <vector>

namespace
{
    // A unit quad (two triangles, one chart) in 3D, and its layout.
    struct Layout
    {
        UVStat::TestMesh mesh;
        std::vector<float> uv;
        UVStat::Report Measure(double margin = 1.0 / 256) const
        {
            return UVStat::Measure({mesh.positions.data(), mesh.VertexCount(), mesh.tri.data(), mesh.TriCount(), uv.data()},
                                   margin);
        }
    };

    // Two separate unit squares in 3D (vertices 0-3 and 4-7), two triangles each.
    Layout TwoSquares(double x0, double y0, double x1, double y1, double size)
    {
        Layout layout;
        for (int q = 0; q < 2; ++q)
        {
            uint32_t a = layout.mesh.Add(0, 0, q), b = layout.mesh.Add(1, 0, q), c = layout.mesh.Add(1, 1, q),
                     d = layout.mesh.Add(0, 1, q);
            layout.mesh.Face(a, b, c);
            layout.mesh.Face(a, c, d);
        }
        for (int q = 0; q < 2; ++q)
        {
            float x = float(q ? x1 : x0), y = float(q ? y1 : y0), s = float(size);
            layout.uv.insert(layout.uv.end(), {x, y, x + s, y, x + s, y + s, x, y, x + s, y + s, x, y + s});
        }
        return layout;
    }
}

UNIT_TEST_SUITE(UVStat)
{
    TEST(ExactOrientDecidesCasesDoubleRoundingCannot)
    {
        CHECK_EQUAL(1, UVStat::Orient(0, 0, 1, 0, 0.5, 1e-300));
        // Points on a line of slope 1 through float coordinates: exactly collinear.
        CHECK_EQUAL(0, UVStat::Orient(0.25, 0.25, 0.5, 0.5, 0.75, 0.75));
        // A point one ulp off that line is decided correctly.
        double off = std::nextafter(0.75, 1.0);
        CHECK_EQUAL(1, UVStat::Orient(0.25, 0.25, 0.5, 0.5, 0.75, off));
        CHECK_EQUAL(-1, UVStat::Orient(0.25, 0.25, 0.5, 0.5, off, 0.75));
    }

    TEST(SeparateChartsWithRoomAreValidAndMeasured)
    {
        Layout layout = TwoSquares(0.1, 0.1, 0.5, 0.1, 0.3);
        UVStat::Report report = layout.Measure(0.06);   // gaps are measured up to twice the margin
        CHECK(report.Valid());
        CHECK_EQUAL(2u, report.quality.charts);
        CHECK_CLOSE(0.18, report.quality.utilization, 1e-6);
        CHECK_CLOSE(0.1, report.validity.minChartGap, 1e-6);
        CHECK_CLOSE(0.1, report.validity.minBorderGap, 1e-6);
        CHECK_CLOSE(1.0, report.quality.l2Stretch, 1e-6);
        CHECK_CLOSE(0.0, report.quality.angleDistortion, 1e-6);
        CHECK_CLOSE(1.0, report.quality.vertexSplit, 1e-9);
        CHECK_CLOSE(0.0, report.quality.texelDensitySpread, 1e-6);
    }

    TEST(OverlapBetweenChartsIsFoundExactlyAndByRaster)
    {
        Layout layout = TwoSquares(0.1, 0.1, 0.3, 0.2, 0.3);
        UVStat::Report report = layout.Measure();
        CHECK(!report.Valid());
        CHECK(report.validity.overlapPairsBetweenCharts >= 2);
        CHECK(report.validity.rasterOverlapBetweenCharts > 1000);
        CHECK_EQUAL(0u, report.validity.overlapPairsInsideCharts);
        CHECK(report.validity.marginViolations > 0);
    }

    TEST(ChartsTouchingAlongAnEdgeDoNotOverlapButBreakTheMargin)
    {
        Layout layout = TwoSquares(0.1, 0.1, 0.4, 0.1, 0.3);
        UVStat::Report report = layout.Measure();
        CHECK_EQUAL(0u, report.validity.overlapPairsBetweenCharts);
        CHECK_EQUAL(0u, report.validity.rasterOverlapBetweenCharts);
        CHECK(report.validity.marginViolations > 0);
        CHECK_EQUAL(0.0, report.validity.minChartGap);
        // A gap just under the margin is a violation, one just over it is not.
        CHECK(TwoSquares(0.1, 0.1, 0.4 + 0.0039, 0.1, 0.3).Measure().validity.marginViolations > 0);
        CHECK_EQUAL(0u, TwoSquares(0.1, 0.1, 0.4 + 0.004, 0.1, 0.3).Measure().validity.marginViolations);
    }

    TEST(BorderNaNOutsideAndFlipsAreReported)
    {
        Layout border = TwoSquares(0.001, 0.1, 0.5, 0.1, 0.3);
        CHECK_EQUAL(3u, border.Measure().validity.borderViolations);   // the corners at u = 0.001
        Layout outside = TwoSquares(0.8, 0.1, 0.1, 0.1, 0.3);
        CHECK_EQUAL(3u, outside.Measure().validity.outsideCorners);
        Layout nan = TwoSquares(0.1, 0.1, 0.5, 0.1, 0.3);
        nan.uv[0] = std::numeric_limits<float>::quiet_NaN();
        CHECK_EQUAL(1u, nan.Measure().validity.nonFiniteCorners);
        // Fold the second square's upper triangle over its lower one (corner d from (0.5, 0.4)
        // to (0.7, 0.1)): it turns clockwise against its chart and covers its neighbour.
        Layout flipped = TwoSquares(0.1, 0.1, 0.5, 0.1, 0.3);
        flipped.uv[22] = 0.7f, flipped.uv[23] = 0.1f;
        UVStat::Report report = flipped.Measure();
        CHECK_EQUAL(1u, report.validity.flipped);
        CHECK(report.validity.overlapPairsInsideCharts >= 1);
    }

    TEST(OneVertexWithTwoUVsInsideOneChartIsReported)
    {
        // A strip of two quads cut along a line of vertices but joined at one end: the chart is
        // still one, yet the cut vertex carries two UVs.
        Layout layout;
        UVStat::TestMesh& m = layout.mesh;
        for (int y = 0; y < 2; ++y)
            for (int x = 0; x < 3; ++x)
                m.Add(x, y, 0);
        m.Face(0, 1, 4), m.Face(0, 4, 3), m.Face(1, 2, 5), m.Face(1, 5, 4);
        const float s = 0.2f;
        auto at = [s](int x, int y, float dx) { return std::vector<float>{0.1f + x * s + dx, 0.1f + y * s}; };
        for (auto corner : {at(0, 0, 0), at(1, 0, 0), at(1, 1, 0), at(0, 0, 0), at(1, 1, 0), at(0, 1, 0),
                            at(1, 0, 0), at(2, 0, 0.1f), at(2, 1, 0.1f), at(1, 0, 0), at(2, 1, 0.1f), at(1, 1, 0.05f)})
            layout.uv.insert(layout.uv.end(), corner.begin(), corner.end());
        UVStat::Report report = layout.Measure();
        CHECK_EQUAL(1u, report.quality.charts);
        CHECK_EQUAL(1u, report.validity.splitVertexCharts);
        CHECK(!report.Valid());
        CHECK_CLOSE(7.0 / 6.0, report.quality.vertexSplit, 1e-9);
    }

    TEST(StretchAndAreaDistortionFollowTheirDefinitions)
    {
        // Two unit squares in 3D, the second laid out twice as wide as the first: each chart is
        // undistorted in itself, the layout as a whole is not.
        Layout layout = TwoSquares(0.1, 0.1, 0.5, 0.1, 0.2);
        for (int k = 12; k < 24; k += 2)
            layout.uv[k] = 0.5f + (layout.uv[k] - 0.5f) * 2;
        UVStat::Report report = layout.Measure();
        CHECK(report.Valid());
        CHECK_CLOSE(0.0, report.quality.chartAreaDistortion, 1e-6);
        // Global ratios r = 2/3 and 4/3 for equal 3D areas: mean of (1.5 - 1) and (4/3 - 1).
        CHECK_CLOSE((0.5 + 1.0 / 3) / 2, report.quality.globalAreaDistortion, 1e-6);
        CHECK(report.quality.texelDensitySpread > 0.1);
        CHECK(report.quality.angleDistortion > 0.05);
        CHECK(report.quality.lInfStretch > report.quality.l2Stretch);
    }
}
