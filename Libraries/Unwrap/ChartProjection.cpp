#include "ChartProjection.h"

#include "ChartLayout.h"
#include "MeshAdjacency.h"
#include "WinImports.h"

namespace
{
    const int kSampledDirections = 64;
    const uint32_t kEdgeDirectionLimit = 32;   // up to this many boundary edges, try each one's direction

    struct Basis
    {
        Vec3 origin, u, v;
    };

    Basis PlaneBasis(const Vec3& normal, const Vec3& origin)
    {
        double ax = fabs(normal.x), ay = fabs(normal.y), az = fabs(normal.z);
        Vec3 axis = ax <= ay && ax <= az ? Vec3{1, 0, 0} : (ay <= az ? Vec3{0, 1, 0} : Vec3{0, 0, 1});
        Vec3 u = Normalized(Cross(normal, axis));
        return {origin, u, Cross(normal, u)};   // u x v = normal: orientation is kept
    }

    // Writes the projected corners of every chart triangle; false if one of them flips.
    bool ProjectOntoPlane(const ChartMesh& mesh, const uint32_t* triangles, uint32_t count, float* outUV)
    {
        Vec3 sum = {0, 0, 0};
        for (uint32_t i = 0; i < count; ++i)
            sum = sum + mesh.cross[triangles[i]];
        Vec3 normal = Normalized(sum);
        uint32_t first = triangles[0];
        if (count == 1 && mesh.degenerate[first])
        {
            const uint32_t* c = mesh.tri + 3 * first;
            FlattenTriangle(mesh.vertex + 3 * c[0], mesh.vertex + 3 * c[1], mesh.vertex + 3 * c[2], outUV + 6 * first);
            return true;
        }
        Basis basis = PlaneBasis(normal, Position(mesh.vertex, mesh.tri[3 * first]));
        bool flipped = false;
        for (uint32_t i = 0; i < count; ++i)
        {
            uint32_t t = triangles[i];
            flipped |= !(Dot(mesh.cross[t], normal) > 0);
            for (uint32_t c = 0; c < 3; ++c)
            {
                Vec3 p = Position(mesh.vertex, mesh.tri[3 * t + c]) - basis.origin;
                outUV[6 * t + 2 * c] = (float)Dot(p, basis.u);
                outUV[6 * t + 2 * c + 1] = (float)Dot(p, basis.v);
            }
        }
        return !flipped;
    }

    uint32_t BoundaryEdges(const ChartMesh& mesh, const uint32_t* chartOf, uint32_t chart, const uint32_t* triangles,
                           uint32_t count, uint32_t* boundary)
    {
        uint32_t found = 0;
        for (uint32_t i = 0; i < count; ++i)
            for (uint32_t h = 3 * triangles[i]; h < 3 * triangles[i] + 3; ++h)
                if (mesh.twin[h] == kNoTwin || chartOf[mesh.twin[h] / 3] != chart)
                    boundary[found++] = h;
        return found;
    }

    struct Direction
    {
        double cosine, sine;

        double Along(double x, double y) const { return cosine * x + sine * y; }
        double Across(double x, double y) const { return cosine * y - sine * x; }
    };

    // The box around points turned by a direction.
    struct Extent
    {
        double minX = 1e300, maxX = -1e300, minY = 1e300, maxY = -1e300;

        void Add(const Direction& d, double x, double y)
        {
            double along = d.Along(x, y), across = d.Across(x, y);
            minX = along < minX ? along : minX;
            maxX = along > maxX ? along : maxX;
            minY = across < minY ? across : minY;
            maxY = across > maxY ? across : maxY;
        }
        double Width() const { return maxX - minX; }
        double Height() const { return maxY - minY; }
    };

    // Area of the box around the boundary's corners with sides along `d` and across it.
    double BoxArea(const float* uv, const uint32_t* boundary, uint32_t count, const Direction& d)
    {
        Extent extent;
        for (uint32_t i = 0; i < count; ++i)
            extent.Add(d, uv[2 * boundary[i]], uv[2 * boundary[i] + 1]);
        return extent.Width() * extent.Height();
    }

    double SquaredLength(const float* uv, uint32_t h, double* dx, double* dy)
    {
        uint32_t next = NextCorner(h);
        *dx = (double)uv[2 * next] - uv[2 * h];
        *dy = (double)uv[2 * next + 1] - uv[2 * h + 1];
        return *dx * *dx + *dy * *dy;
    }

    Direction EdgeDirection(const float* uv, uint32_t h)
    {
        double dx, dy;
        double length = Sqrt(SquaredLength(uv, h, &dx, &dy));
        return length > 0 ? Direction{dx / length, dy / length} : Direction{1, 0};
    }

    uint32_t LongestEdge(const float* uv, const uint32_t* boundary, uint32_t count)
    {
        uint32_t longest = boundary[0];
        double longestLength = 0, dx, dy;
        for (uint32_t i = 0; i < count; ++i)
            if (SquaredLength(uv, boundary[i], &dx, &dy) > longestLength)
            {
                longestLength = SquaredLength(uv, boundary[i], &dx, &dy);
                longest = boundary[i];
            }
        return longest;
    }

    // The direction, among those tried, whose box around the boundary is smallest: each boundary
    // edge's direction for small charts; evenly spaced directions and the longest edge's otherwise.
    Direction SmallestBoxDirection(const float* uv, const uint32_t* boundary, uint32_t count)
    {
        Direction best = {1, 0};
        double bestArea = BoxArea(uv, boundary, count, best);
        auto consider = [&](Direction d) {
            double area = BoxArea(uv, boundary, count, d);
            if (area < bestArea)
            {
                bestArea = area;
                best = d;
            }
        };
        if (count <= kEdgeDirectionLimit)
        {
            for (uint32_t i = 0; i < count; ++i)
                consider(EdgeDirection(uv, boundary[i]));
            return best;
        }
        const double quarterTurn = 1.5707963267948966;
        for (int k = 1; k < kSampledDirections; ++k)
        {
            double angle = quarterTurn * k / kSampledDirections;
            consider({cos(angle), sin(angle)});
        }
        consider(EdgeDirection(uv, LongestEdge(uv, boundary, count)));
        return best;
    }

    // Turns every corner of the chart by `d` (and a further quarter turn if the box would be taller
    // than wide), then moves the box to start at (0, 0).
    ChartBox TurnAndSettle(const uint32_t* triangles, uint32_t count, const Direction& d, float* outUV)
    {
        Extent extent;
        for (uint32_t i = 0; i < count; ++i)
            for (uint32_t k = 6 * triangles[i]; k < 6 * triangles[i] + 6; k += 2)
                extent.Add(d, outUV[k], outUV[k + 1]);
        bool upright = extent.Height() > extent.Width();
        for (uint32_t i = 0; i < count; ++i)
            for (uint32_t k = 6 * triangles[i]; k < 6 * triangles[i] + 6; k += 2)
            {
                double along = d.Along(outUV[k], outUV[k + 1]) - extent.minX;
                double across = d.Across(outUV[k], outUV[k + 1]) - extent.minY;
                // A quarter turn (x, y) -> (y, width - x) keeps the orientation.
                outUV[k] = (float)(upright ? across : along);
                outUV[k + 1] = (float)(upright ? extent.Width() - along : across);
            }
        return upright ? ChartBox{extent.Height(), extent.Width()} : ChartBox{extent.Width(), extent.Height()};
    }
}

bool ProjectChart(const ChartMesh& mesh, const uint32_t* chartOf, uint32_t chart, const uint32_t* triangles, uint32_t count,
                  float* outUV, ChartBox* box, uint32_t* boundary, uint32_t* boundaryCount)
{
    *boundaryCount = 0;
    if (!ProjectOntoPlane(mesh, triangles, count, outUV))
        return false;
    *boundaryCount = BoundaryEdges(mesh, chartOf, chart, triangles, count, boundary);
    Direction d = *boundaryCount ? SmallestBoxDirection(outUV, boundary, *boundaryCount) : Direction{1, 0};
    *box = TurnAndSettle(triangles, count, d, outUV);
    return true;
}
