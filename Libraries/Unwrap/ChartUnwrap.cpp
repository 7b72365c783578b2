#include "ChartUnwrap.h"

#include "AtlasPacking.h"
#include "ChartCutting.h"
#include "ChartFlattening.h"
#include "ChartSegmentation.h"
#include "MeshPreparation.h"
#include "OutputCheck.h"
#include "WinImports.h"

namespace
{
    const char* const kOutOfMemory = "out of memory";
    const double kPi = 3.14159265358979323846;
    // Flattening a chart costs about n^1.5 for n triangles: beyond this size, more charts are
    // cheaper than larger ones (meshes of a million triangles still make a few dozen charts).
    const uint32_t kMaxChartTriangles = 65536;

    // Growing rules from the parameters. The normal limit keeps a chart within a cone around its
    // mean normal (a chart can still curve, as a cylinder strip does). The curvature budget turns
    // areaDistortionThreshold into chart size: conformal flattening turns a chart's angle defect
    // into area distortion, about 0.05 of mean area distortion a radian on spherical caps, so a
    // budget of 14 x threshold radians grows charts to within the threshold (about 0.1 at the
    // default 0.15) and the checks seldom have to split.
    GrowRules RulesFrom(const UnwrapParam& param)
    {
        double area = param.areaDistortionThreshold > 0 ? param.areaDistortionThreshold : 0;
        return {cos(80 * kPi / 180), 14 * area, kMaxChartTriangles, 0.25, false, false, true};
    }
}

bool UnwrapIntoCharts(const float* vertex, uint32_t vertexCount, const uint32_t* tri, const uint32_t* srcPoly,
                      uint32_t triCount, const UnwrapParam& param, float* outUV, UnwrapStats* stats, const char** error)
{
    // outUV holds each triangle's corner angles and curvature until flattening writes the
    // triangle's UVs over them (ChartMesh.h).
    PreparedMesh prepared;
    if (!PrepareMesh(vertex, vertexCount, tri, srcPoly, triCount, param, outUV, &prepared))
        return (*error = kOutOfMemory), false;
    const ChartMesh& mesh = prepared.mesh;
    Scratch<uint32_t> chartOf;
    if (!chartOf.Allocate(triCount))
        return (*error = kOutOfMemory), false;
    uint32_t charts = SegmentCharts(mesh, RulesFrom(param), 3, chartOf.Data());
    *stats = {charts, 0, 0, 0, 0, 0};
    if (charts == kNoChart)
        return (*error = kOutOfMemory), false;
    FlattenStats flattening;
    DistortionLimits limits = {param.angleDistortionThreshold, param.areaDistortionThreshold};
    charts = FlattenCharts(mesh, limits, charts, chartOf.Data(), outUV, &flattening);
    prepared.ReleaseCornerLists();   // packing and the output check work on twins and UVs only
    if (charts == kNoChart)
        return (*error = kOutOfMemory), false;
    CutStats cutting;
    charts = CutCharts(mesh, charts, chartOf.Data(), outUV, &cutting);
    if (charts == kNoChart)
        return (*error = kOutOfMemory), false;
    *stats = {stats->segmented, flattening.splits, charts, flattening.angleDistortion, flattening.areaDistortion, cutting.cuts};
    if (!PackAtlas(outUV, chartOf.Data(), triCount, charts, param.packMargin, error))
        return false;
    return CheckOutput(mesh, chartOf.Data(), outUV, error);
}
