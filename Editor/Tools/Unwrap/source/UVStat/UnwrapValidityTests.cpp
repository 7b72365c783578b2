// Hard validity of the bundled unwrapper: the real ChartBake with the real libraries unwraps
// generated meshes, and uvstat's measuring library checks every promise of the layout (finite
// UVs inside the square, no flipped or zero-area triangle, no overlap between or inside
// charts, packMargin kept between charts and to the border, one UV a vertex inside a chart).
#include "Editor/Tools/Unwrap/source/UVStat/TestMeshes.h"
#include "Editor/Tools/Unwrap/source/UVStat/UVStat.h"
#include "Runtime/Testing/ChildProcess.h"
#include "Runtime/Testing/TemporaryDirectory.h"
#include "Runtime/Testing/Testing.h"

#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

namespace
{
    struct UnwrapRun
    {
        Testing::ChildResult process;
        std::string uvBytes;
        std::vector<float> uv;
    };

    // Runs ChartBake on `mesh` in a fresh directory (removed afterwards).
    UnwrapRun RunChartBake(const UVStat::TestMesh& mesh, const UVStat::TestParams& params)
    {
        Testing::TemporaryDirectory dir("chartbake-validity");
        UVStat::WriteBinaryMeshFile(dir.PathOf("mesh.bin"), mesh, params);
        UnwrapRun run;
        run.process = Testing::RunProgram({std::string(CHARTBAKE_BIN_DIR) + "/ChartBake", "mesh.bin", "out.bin"}, dir.dir);
        run.uvBytes = dir.Read("out.bin");
        if (run.uvBytes.size() == 24ull * mesh.TriCount())
        {
            run.uv.resize(6ull * mesh.TriCount());
            std::memcpy(run.uv.data(), run.uvBytes.data(), run.uvBytes.size());
        }
        return run;
    }

    UVStat::Report MeasureRun(const UVStat::TestMesh& mesh, const UnwrapRun& run, double margin)
    {
        return UVStat::Measure({mesh.positions.data(), mesh.VertexCount(), mesh.tri.data(), mesh.TriCount(), run.uv.data()},
                               margin);
    }

    // Unwraps and requires a complete, valid layout; returns its report for further checks.
    UVStat::Report CheckUnwrapIsValid(const char* name, const UVStat::TestMesh& mesh, int line,
                                      const UVStat::TestParams& params = UVStat::TestParams())
    {
        UnwrapRun run = RunChartBake(mesh, params);
        if (!run.process.exited || run.process.exitStatus != 0 || run.uv.empty())
        {
            Testing::ReportFailureAtLine(line, (std::string(name) + ": ChartBake failed: " + run.process.out + run.process.err).c_str());
            return UVStat::Report();
        }
        UVStat::Report report = MeasureRun(mesh, run, params.packMargin);
        if (!report.Valid())
            Testing::ReportFailureAtLine(line, (std::string(name) + ": invalid layout\n" + UVStat::FormatText(report)).c_str());
        return report;
    }
}

INTEGRATION_TEST_SUITE(UnwrapValidity)
{
    TEST(ClosedSurfacesUnwrapIntoValidLayouts)
    {
        CheckUnwrapIsValid("sphere", UVStat::Sphere(24, 48), __LINE__);
        CheckUnwrapIsValid("torus", UVStat::Torus(64, 32), __LINE__);
        UVStat::TestParams welded;
        welded.recollectVertices = 1;
        UVStat::Report cube = CheckUnwrapIsValid("cube", UVStat::Cube(6), __LINE__, welded);
        // Welded, the cube is one closed surface: its six sides meet at 90-degree edges, below
        // the hard angle, yet every vertex still gets one UV a chart.
        CHECK(cube.quality.charts >= 1 && cube.quality.charts <= 6 * 6 * 6 * 2);
    }

    TEST(SaddleFanWhoseAnglesExceedAFullTurnDoesNotOverlapItself)
    {
        UVStat::Report report = CheckUnwrapIsValid("saddle fan", UVStat::SaddleFan(64, 3, 0.8), __LINE__);
        CHECK_EQUAL(0u, report.validity.overlapPairsInsideCharts);
    }

    TEST(ThousandsOfSmallComponentsArePackedWithTheMargin)
    {
        UVStat::Report report = CheckUnwrapIsValid("components", UVStat::ManyComponents(2000), __LINE__);
        CHECK(report.quality.charts >= 2000);
    }

    TEST(NonManifoldDuplicateAndDegenerateFacesGetValidUVs)
    {
        CheckUnwrapIsValid("dirty", UVStat::DirtyMesh(), __LINE__);
        UVStat::TestParams welded;
        welded.recollectVertices = 1;
        CheckUnwrapIsValid("dirty, welded", UVStat::DirtyMesh(), __LINE__, welded);
    }

    TEST(MoreChartsThanTheOldRowLimitKeepTheMargin)
    {
        // 17,000 separate triangles: more than 127 x 127 charts, which still fit with the margin.
        UVStat::Report report = CheckUnwrapIsValid("17,000 charts", UVStat::ManyTriangles(17000), __LINE__);
        CHECK(report.quality.charts > 16129);
        CHECK_EQUAL(0u, report.validity.marginViolations);
        CHECK_EQUAL(0u, report.validity.borderViolations);
    }

    TEST(AMarginThatCannotBeKeptFailsWithAMessage)
    {
        // 3,000 separate charts, each needing at least a 1/32 square around it: 2.9 unit squares.
        UVStat::TestParams params;
        params.packMargin = 1.0f / 32;
        UnwrapRun run = RunChartBake(UVStat::ManyComponents(3000), params);
        CHECK(run.process.exited);
        CHECK_EQUAL(1, run.process.exitStatus);
        CHECK(run.process.out.find("packMargin") != std::string::npos);
        CHECK(run.uv.empty());
    }

    TEST(RepeatedRunsWriteIdenticalBytes)
    {
        UVStat::TestMesh mesh = UVStat::Torus(48, 24);
        mesh.Append(UVStat::ManyComponents(50));
        UnwrapRun first = RunChartBake(mesh, UVStat::TestParams()), second = RunChartBake(mesh, UVStat::TestParams());
        CHECK_EQUAL(0, first.process.exitStatus);
        CHECK(!first.uvBytes.empty());
        CHECK(first.uvBytes == second.uvBytes);
    }
}
