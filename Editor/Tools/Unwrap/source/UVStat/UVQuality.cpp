// Quality figures. Degenerate triangles and triangles without a UV area (already reported as
// invalid) are left out of every average; all weights are 3D areas. Cost: linear.
#include "Editor/Tools/Unwrap/source/UVStat/UVStatParts.h"

#include <algorithm>
#include <cmath>

namespace UVStat
{
    namespace
    {
        struct Vec3
        {
            double x, y, z;
        };

        Vec3 Position(const LayoutView& layout, uint32_t t, int c)
        {
            const float* p = layout.vertex + 3ull * layout.tri[3ull * t + c];
            return {p[0], p[1], p[2]};
        }

        double Angle3(const Vec3& at, const Vec3& p, const Vec3& q)
        {
            Vec3 a = {p.x - at.x, p.y - at.y, p.z - at.z}, b = {q.x - at.x, q.y - at.y, q.z - at.z};
            double dot = a.x * b.x + a.y * b.y + a.z * b.z;
            double cx = a.y * b.z - a.z * b.y, cy = a.z * b.x - a.x * b.z, cz = a.x * b.y - a.y * b.x;
            return std::atan2(std::sqrt(cx * cx + cy * cy + cz * cz), dot);
        }

        double Angle2(const Point2& at, const Point2& p, const Point2& q)
        {
            double ax = p.x - at.x, ay = p.y - at.y, bx = q.x - at.x, by = q.y - at.y;
            return std::atan2(std::fabs(ax * by - ay * bx), ax * bx + ay * by);
        }

        // Sander et al.'s stretch of the map from UV to 3D, with UVs scaled by `scale`:
        // returns (L2^2, Gamma) of triangle t.
        std::pair<double, double> Stretch(const LayoutView& layout, uint32_t t, double scale)
        {
            Point2 q[3];
            Vec3 p[3];
            for (int c = 0; c < 3; ++c)
            {
                Point2 uv = CornerUV(layout, t, c);
                q[c] = {uv.x * scale, uv.y * scale};
                p[c] = Position(layout, t, c);
            }
            double twice = (q[1].x - q[0].x) * (q[2].y - q[0].y) - (q[2].x - q[0].x) * (q[1].y - q[0].y);
            double w[3] = {q[1].y - q[2].y, q[2].y - q[0].y, q[0].y - q[1].y};   // for Ss
            double z[3] = {q[2].x - q[1].x, q[0].x - q[2].x, q[1].x - q[0].x};   // for St
            Vec3 ss = {0, 0, 0}, st = {0, 0, 0};
            for (int c = 0; c < 3; ++c)
            {
                ss = {ss.x + p[c].x * w[c], ss.y + p[c].y * w[c], ss.z + p[c].z * w[c]};
                st = {st.x + p[c].x * z[c], st.y + p[c].y * z[c], st.z + p[c].z * z[c]};
            }
            double a = (ss.x * ss.x + ss.y * ss.y + ss.z * ss.z) / (twice * twice);
            double b = (ss.x * st.x + ss.y * st.y + ss.z * st.z) / (twice * twice);
            double c = (st.x * st.x + st.y * st.y + st.z * st.z) / (twice * twice);
            double gamma = std::sqrt((a + c + std::sqrt((a - c) * (a - c) + 4 * b * b)) / 2);
            return {(a + c) / 2, gamma};
        }

        // Area-weighted mean of max(r, 1/r) - 1, r = (UV share) / (3D share) within each group.
        double AreaDistortion(const std::vector<uint8_t>& counted, const TriangleAreas& areas,
                              const std::vector<uint32_t>& groupOf, uint32_t groups)
        {
            std::vector<double> uvArea(groups, 0.0), area3(groups, 0.0);
            for (size_t t = 0; t < counted.size(); ++t)
                if (counted[t])
                    uvArea[groupOf[t]] += std::fabs(areas.area2[t]), area3[groupOf[t]] += areas.area3[t];
            double sum = 0, weight = 0;
            for (size_t t = 0; t < counted.size(); ++t)
                if (counted[t])
                {
                    uint32_t g = groupOf[t];
                    double r = (std::fabs(areas.area2[t]) / uvArea[g]) / (areas.area3[t] / area3[g]);
                    sum += areas.area3[t] * (std::max(r, 1 / r) - 1);
                    weight += areas.area3[t];
                }
            return weight > 0 ? sum / weight : 0;
        }
    }

    void MeasureQuality(const LayoutView& layout, const ChartLabels& labels, const TriangleAreas& areas, Quality& quality)
    {
        uint32_t n = layout.triCount;
        std::vector<uint8_t> counted(n, 0);
        double uvTotal = 0, area3Total = 0, utilization = 0;
        for (uint32_t t = 0; t < n; ++t)
        {
            quality.degenerateTriangles += areas.degenerate[t];
            if (!areas.finite[t])
                continue;
            utilization += std::fabs(areas.area2[t]);
            counted[t] = !areas.degenerate[t] && std::fabs(areas.area2[t]) > kZeroUVArea;
            if (counted[t])
                uvTotal += std::fabs(areas.area2[t]), area3Total += areas.area3[t];
        }
        quality.utilization = utilization;
        if (area3Total <= 0)
            return;

        double scale = std::sqrt(area3Total / uvTotal), l2Sum = 0, lInf = 0, angleSum = 0;
        for (uint32_t t = 0; t < n; ++t)
        {
            if (!counted[t])
                continue;
            auto [l2, gamma] = Stretch(layout, t, scale);
            l2Sum += l2 * areas.area3[t];
            lInf = std::max(lInf, gamma);
            double angles = 0;
            for (int c = 0; c < 3; ++c)
            {
                int d = (c + 1) % 3, e = (c + 2) % 3;
                angles += std::fabs(Angle2(CornerUV(layout, t, c), CornerUV(layout, t, d), CornerUV(layout, t, e)) -
                                    Angle3(Position(layout, t, c), Position(layout, t, d), Position(layout, t, e)));
            }
            angleSum += areas.area3[t] * angles / M_PI;
        }
        quality.l2Stretch = std::sqrt(l2Sum / area3Total);
        quality.lInfStretch = lInf;
        quality.angleDistortion = angleSum / area3Total;

        quality.chartAreaDistortion = AreaDistortion(counted, areas, labels.chartOf, labels.chartCount);
        quality.globalAreaDistortion = AreaDistortion(counted, areas, std::vector<uint32_t>(n, 0), 1);

        // Texel density per chart, sqrt(UV area / 3D area); its area-weighted coefficient of variation.
        std::vector<double> uvArea(labels.chartCount, 0.0), area3(labels.chartCount, 0.0);
        for (uint32_t t = 0; t < n; ++t)
            if (counted[t])
                uvArea[labels.chartOf[t]] += std::fabs(areas.area2[t]), area3[labels.chartOf[t]] += areas.area3[t];
        double mean = 0, square = 0;
        for (uint32_t c = 0; c < labels.chartCount; ++c)
            if (area3[c] > 0)
            {
                double density = std::sqrt(uvArea[c] / area3[c]);
                mean += area3[c] * density, square += area3[c] * density * density;
            }
        mean /= area3Total, square /= area3Total;
        quality.texelDensitySpread = mean > 0 ? std::sqrt(std::max(0.0, square - mean * mean)) / mean : 0;
    }
}
