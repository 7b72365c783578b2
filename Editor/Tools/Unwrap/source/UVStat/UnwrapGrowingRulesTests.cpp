// The bundled unwrapper's growing rules that read the per-corner and per-triangle values the
// library keeps in scratch (3D corner angles, curvature made from them), checked through their
// effect on the charts of meshes whose right answer follows from geometry: the real ChartBake with the real libraries,
// with the library's chart statistics (unwrap-report-stats) and uvstat's measures. A layout can
// stay valid with wrong angles or curvature, so the validity tests alone would not notice.
#include "Editor/Tools/Unwrap/source/UVStat/TestMeshes.h"
#include "Editor/Tools/Unwrap/source/UVStat/UVStat.h"
#include "Runtime/Testing/ChildProcess.h"
#include "Runtime/Testing/TemporaryDirectory.h"
#include "Runtime/Testing/Testing.h"

#include <cmath>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

namespace
{
    struct ChartCounts
    {
        bool ran = false;
        unsigned segmented = 0, splits = 0, charts = 0;   // as the library reports them
        uint32_t layoutCharts = 0;                        // as uvstat counts them in the output
    };

    ChartCounts Unwrap(const UVStat::TestMesh& mesh)
    {
        Testing::TemporaryDirectory dir("chartbake-growing");
        UVStat::WriteBinaryMeshFile(dir.PathOf("mesh.bin"), mesh);
        Testing::ChildResult r = Testing::RunProgram({std::string(CHARTBAKE_BIN_DIR) + "/ChartBake", "mesh.bin", "out.bin"},
                                                     dir.dir, {"CHARTBAKE_LIBRARY_BEHAVIOUR=unwrap-report-stats"});
        ChartCounts counts;
        std::string bytes = dir.Read("out.bin");
        if (r.exitStatus != 0 || bytes.size() != 24ull * mesh.TriCount() ||
            std::sscanf(r.out.c_str(), "segmented %u charts, %u splits, %u charts", &counts.segmented, &counts.splits,
                        &counts.charts) != 3)
            return counts;
        std::vector<float> uv(6ull * mesh.TriCount());
        std::memcpy(uv.data(), bytes.data(), bytes.size());
        counts.layoutCharts =
            UVStat::Measure({mesh.positions.data(), mesh.VertexCount(), mesh.tri.data(), mesh.TriCount(), uv.data()}, 1.0 / 256)
                .quality.charts;
        counts.ran = true;
        return counts;
    }

    // A flat disk: `slices` equal triangles around a centre vertex, closed (the centre is an
    // interior vertex, the rim a boundary).
    UVStat::TestMesh FlatDisk(uint32_t slices)
    {
        const double pi = 3.14159265358979323846;
        UVStat::TestMesh mesh;
        uint32_t centre = mesh.Add(0, 0, 0);
        for (uint32_t k = 0; k < slices; ++k)
            mesh.Add(std::cos(2 * pi * k / slices), std::sin(2 * pi * k / slices), 0);
        for (uint32_t k = 0; k < slices; ++k)
            mesh.Face(centre, 1 + k, 1 + (k + 1) % slices);
        return mesh;
    }
}

INTEGRATION_TEST_SUITE(UnwrapGrowingRules)
{
    TEST(FlatDisk_IsOneChart)
    {
        // The centre's corner angles sum to 2 pi: no curvature, one chart. Any other corner's
        // angles there (75 degrees each against 30) would make an angle defect of -9.4 radians,
        // far over what a chart may hold, which no merging could undo.
        ChartCounts counts = Unwrap(FlatDisk(12));
        CHECK(counts.ran);
        CHECK_EQUAL(1u, counts.segmented);
        CHECK_EQUAL(0u, counts.splits);
        CHECK_EQUAL(1u, counts.layoutCharts);
    }

    TEST(SphereChartsEachHoldAtMostTheCurvatureBudget)
    {
        // A chart grows while its angle defect stays within 14 x areaDistortionThreshold (2.1
        // radians at the default 0.15), and the angle defects of a closed sphere sum to 4 pi:
        // segmentation needs at least 6 charts. By the normal limit alone (80 degrees from the
        // chart's mean) it would stop at 3 or 4.
        ChartCounts counts = Unwrap(UVStat::Sphere(24, 48));
        CHECK(counts.ran);
        CHECK(counts.segmented >= 6);
        CHECK(counts.charts >= counts.segmented);
    }
}
