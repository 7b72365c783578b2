#include "ChartUnwrap.h"

#include "AtlasPacking.h"
#include "ChartOverlap.h"
#include "ChartProjection.h"
#include "ChartSegmentation.h"
#include "MeshAdjacency.h"
#include "Scratch.h"
#include "VertexWelding.h"
#include "WinImports.h"

namespace
{
    const char* const kOutOfMemory = "out of memory";

    struct Workspace
    {
        Scratch<Vec3> cross;
        Scratch<uint8_t> degenerate;
        Scratch<uint32_t> twin, chartOf, queue, start, triangles;
        // A chart's box is kept at its lowest triangle (boxAt) until the charts are final, since
        // chart numbers change whenever failed charts are grown again; `projected` marks the
        // lowest triangle of every chart already projected.
        Scratch<ChartBox> boxAt, boxes;
        Scratch<uint8_t> projected;

        bool Allocate(uint32_t triCount)
        {
            return cross.Allocate(triCount) && degenerate.Allocate(triCount) && twin.Allocate(3ull * triCount) &&
                   chartOf.Allocate(triCount) && queue.Allocate(3ull * triCount) && start.Allocate(2ull * triCount + 1) &&
                   triangles.Allocate(triCount) && boxAt.Allocate(triCount) && boxes.Allocate(triCount) &&
                   projected.Allocate(triCount);
        }
    };

    // Renumbers the charts 0, 1, ... in the order of their first triangle, dropping numbers no
    // triangle uses (numbers on entry are below 2 * triCount), then groups the triangles by chart
    // into start[] / triangles[]. Returns the number of charts.
    uint32_t GroupByChart(uint32_t triCount, uint32_t* chartOf, uint32_t* start, uint32_t* triangles)
    {
        uint32_t* number = start;
        memset(number, 0xFF, 2ull * triCount * sizeof(uint32_t));
        uint32_t charts = 0;
        for (uint32_t t = 0; t < triCount; ++t)
        {
            if (number[chartOf[t]] == kNoChart)
                number[chartOf[t]] = charts++;
            chartOf[t] = number[chartOf[t]];
        }
        memset(start, 0, (charts + 1ull) * sizeof(uint32_t));
        for (uint32_t t = 0; t < triCount; ++t)
            ++start[chartOf[t] + 1];
        for (uint32_t c = 0; c < charts; ++c)
            start[c + 1] += start[c];
        for (uint32_t t = 0; t < triCount; ++t)
            triangles[start[chartOf[t]]++] = t;
        for (uint32_t c = charts; c > 0; --c)   // the fill moved every start one chart on
            start[c] = start[c - 1];
        start[0] = 0;
        return charts;
    }

    // Projects every chart not projected yet; the triangles of charts that would flip a triangle or
    // fold onto themselves go back to kNoChart. Returns the size of the largest such chart (0 when
    // all are fine). Two triangles on either side of an edge cannot overlap unless one flips.
    uint32_t ProjectCharts(const ChartMesh& mesh, Workspace& w, uint32_t charts, float* outUV)
    {
        uint32_t largestFailure = 0;
        for (uint32_t c = 0; c < charts; ++c)
        {
            const uint32_t* members = w.triangles.Data() + w.start[c];
            uint32_t count = w.start[c + 1] - w.start[c];
            if (w.projected[members[0]])
                continue;
            ChartBox& box = w.boxAt[members[0]];
            uint32_t* boundary = w.queue.Data();
            uint32_t boundaryCount = 0;
            if (ProjectChart(mesh, w.chartOf.Data(), c, members, count, outUV, &box, boundary, &boundaryCount) &&
                (count < 3 || !BoundaryCrossesItself(mesh.tri, boundary, boundaryCount, outUV, box.width, box.height)))
            {
                w.projected[members[0]] = 1;
                continue;
            }
            for (uint32_t i = 0; i < count; ++i)
                w.chartOf[members[i]] = kNoChart;
            largestFailure = count > largestFailure ? count : largestFailure;
        }
        return largestFailure;
    }

    // Grows and projects charts until every chart projects without flips or overlaps; a chart that
    // fails is grown again with at most half its size, so this ends at single triangles at the
    // latest. Leaves the final charts' boxes in w.boxes.
    uint32_t MakeCharts(const ChartMesh& mesh, Workspace& w, GrowLimits limits, float* outUV)
    {
        memset(w.chartOf.Data(), 0xFF, (uint64_t)mesh.triCount * sizeof(uint32_t));
        memset(w.projected.Data(), 0, mesh.triCount);
        GrowCharts(mesh, limits, 0, w.chartOf.Data(), w.queue.Data());
        for (;;)
        {
            uint32_t charts = GroupByChart(mesh.triCount, w.chartOf.Data(), w.start.Data(), w.triangles.Data());
            uint32_t largestFailure = ProjectCharts(mesh, w, charts, outUV);
            if (largestFailure == 0)
            {
                for (uint32_t c = 0; c < charts; ++c)
                    w.boxes[c] = w.boxAt[w.triangles[w.start[c]]];
                return charts;
            }
            limits.maxTriangles = largestFailure / 2 ? largestFailure / 2 : 1;
            GrowCharts(mesh, limits, charts, w.chartOf.Data(), w.queue.Data());
        }
    }

    GrowLimits LimitsFrom(const UnwrapParam& param, uint32_t triCount)
    {
        const double degrees = 3.14159265358979323846 / 180;
        return {cos(param.hardAngle * degrees), param.areaDistortionThreshold, param.angleDistortionThreshold, triCount};
    }
}

bool UnwrapIntoCharts(const float* vertex, uint32_t vertexCount, const uint32_t* tri, const uint32_t* srcPoly,
                      uint32_t triCount, const UnwrapParam& param, float* outUV, const char** error)
{
    Workspace w;
    if (!w.Allocate(triCount))
        return (*error = kOutOfMemory), false;
    Scratch<uint32_t> welded;
    if (param.recollectVertices)
    {
        if (!welded.Allocate(3ull * triCount) || !WeldVertices(vertex, vertexCount, tri, triCount, welded.Data()))
            return (*error = kOutOfMemory), false;
        tri = welded.Data();
    }
    MeasureTriangles(vertex, tri, triCount, w.cross.Data(), w.degenerate.Data());
    if (!FindTwins(tri, triCount, vertexCount, w.twin.Data()))
        return (*error = kOutOfMemory), false;
    ChartMesh mesh = {vertex, tri, triCount, w.cross.Data(), w.degenerate.Data(), w.twin.Data(), srcPoly};
    uint32_t charts = MakeCharts(mesh, w, LimitsFrom(param, triCount), outUV);
    return PackAtlas(outUV, w.chartOf.Data(), triCount, charts, param.packMargin, error);
}
