// Measure(): the stages of UVStatParts.h in order, and the two report formats.
#include "Editor/Tools/Unwrap/source/UVStat/UVStat.h"

#include "Editor/Tools/Unwrap/source/UVStat/UVStatParts.h"

#include <cstdio>

namespace UVStat
{
    bool Validity::Valid() const
    {
        return nonFiniteCorners == 0 && outsideCorners == 0 && flipped == 0 && zeroArea == 0 &&
               overlapPairsBetweenCharts == 0 && overlapPairsInsideCharts == 0 && rasterOverlapBetweenCharts == 0 &&
               rasterOverlapInsideCharts == 0 && marginViolations == 0 && borderViolations == 0 && splitVertexCharts == 0;
    }

    Report Measure(const LayoutView& layout, double packMargin)
    {
        Report report;
        report.packMargin = packMargin;
        report.vertexCount = layout.vertexCount;
        report.triCount = layout.triCount;
        TriangleAreas areas = MeasureAreas(layout);
        ChartLabels labels = LabelCharts(layout);
        MeasureStructure(layout, labels, report.quality, report.validity);
        MeasureOverlaps(layout, labels, areas, report.validity);
        MeasureMargins(layout, labels, packMargin, report.validity);
        MeasureQuality(layout, labels, areas, report.quality);
        return report;
    }

    namespace
    {
        // One named figure, for both formats.
        struct Field
        {
            const char* name;
            double value;
            bool integer;
        };

        std::vector<Field> Fields(const Report& r)
        {
            const Validity& v = r.validity;
            const Quality& q = r.quality;
            return {
                {"valid", r.Valid() ? 1.0 : 0.0, true},
                {"triangles", double(r.triCount), true},
                {"vertices", double(r.vertexCount), true},
                {"pack_margin", r.packMargin, false},
                {"nan_corners", double(v.nonFiniteCorners), true},
                {"outside_corners", double(v.outsideCorners), true},
                {"flipped", double(v.flipped), true},
                {"zero_area", double(v.zeroArea), true},
                {"overlaps_between_charts", double(v.overlapPairsBetweenCharts), true},
                {"overlaps_inside_charts", double(v.overlapPairsInsideCharts), true},
                {"raster_overlaps_between_charts", double(v.rasterOverlapBetweenCharts), true},
                {"raster_overlaps_inside_charts", double(v.rasterOverlapInsideCharts), true},
                {"margin_violations", double(v.marginViolations), true},
                {"border_violations", double(v.borderViolations), true},
                {"split_vertices_in_chart", double(v.splitVertexCharts), true},
                {"min_chart_gap", v.minChartGap, false},
                {"min_border_gap", v.minBorderGap, false},
                {"charts", double(q.charts), true},
                {"degenerate_triangles", double(q.degenerateTriangles), true},
                {"utilization", q.utilization, false},
                {"l2_stretch", q.l2Stretch, false},
                {"linf_stretch", q.lInfStretch, false},
                {"angle_distortion", q.angleDistortion, false},
                {"chart_area_distortion", q.chartAreaDistortion, false},
                {"global_area_distortion", q.globalAreaDistortion, false},
                {"vertex_split", q.vertexSplit, false},
                {"seam_length_ratio", q.seamLengthRatio, false},
                {"texel_density_spread", q.texelDensitySpread, false},
            };
        }

        std::string Number(const Field& f)
        {
            char text[64];
            if (f.integer)
                std::snprintf(text, sizeof text, "%.0f", f.value);
            else
                std::snprintf(text, sizeof text, "%.9g", f.value);
            return text;
        }
    }

    std::string FormatText(const Report& report)
    {
        std::string text;
        for (const Field& f : Fields(report))
            text += std::string(f.name) + "=" + Number(f) + "\n";
        return text;
    }

    std::string FormatJson(const Report& report)
    {
        std::string text = "{";
        bool first = true;
        for (const Field& f : Fields(report))
        {
            text += (first ? "\"" : ", \"") + std::string(f.name) + "\": " + Number(f);
            first = false;
        }
        return text + "}\n";
    }
}
