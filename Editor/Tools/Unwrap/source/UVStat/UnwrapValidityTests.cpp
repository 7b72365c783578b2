// Hard validity of the bundled unwrapper: the real ChartBake with the real libraries unwraps
// generated meshes, and uvstat's measuring library checks every promise of the layout (finite
// UVs inside the square, no flipped or zero-area triangle, no overlap between or inside
// charts, packMargin kept between charts and to the border, one UV a vertex inside a chart).
#include "Editor/Tools/Unwrap/source/UVStat/TestMeshes.h"
#include "Editor/Tools/Unwrap/source/UVStat/UVStat.h"
#include "Runtime/Testing/ChildProcess.h"
#include "Runtime/Testing/TemporaryDirectory.h"
#include "Runtime/Testing/Testing.h"

#include <cmath>
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

    // A flat grid of `along` x `across` cells of cellLength x 1, bent round an arc of `turn`
    // radians (a straight strip for turn 0). From every `degenerateEvery`-th column (0: none), a
    // zero-area triangle joins three vertices on one slanted line over four columns (sharing no
    // edge with the grid, so the strip stays one surface); they start two columns before each
    // multiple of `degenerateEvery`, so that a cut there would cross one.
    UVStat::TestMesh Strip(uint32_t along, uint32_t across, double cellLength, double turn, uint32_t degenerateEvery = 0)
    {
        UVStat::TestMesh mesh;
        double length = along * cellLength, radius = turn > 0 ? length / turn : 0;
        for (uint32_t i = 0; i <= along; ++i)
            for (uint32_t j = 0; j <= across; ++j)
            {
                double x = i * cellLength, y = j;
                if (turn > 0)
                {
                    double angle = x / radius, r = radius + y;
                    x = r * std::cos(angle), y = r * std::sin(angle);
                }
                mesh.Add(x, y, 0);
            }
        auto at = [across](uint32_t i, uint32_t j) { return i * (across + 1) + j; };
        for (uint32_t i = 0; i < along; ++i)
            for (uint32_t j = 0; j < across; ++j)
            {
                mesh.Face(at(i, j), at(i + 1, j), at(i + 1, j + 1));
                mesh.Face(at(i, j), at(i + 1, j + 1), at(i, j + 1));
            }
        for (uint32_t i = degenerateEvery - 2; degenerateEvery && turn == 0 && i + 4 <= along; i += degenerateEvery)
            mesh.Face(at(i, 0), at(i + 2, 1), at(i + 4, 2));
        return mesh;
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

    // Charts too long for the square are cut across into pieces: a 48:1 strip covers under 4 %
    // of the square whole, while its pieces stack; every piece keeps its flat, exact shape.
    TEST(ALongStripIsCutIntoPiecesThatFillTheSquare)
    {
        UVStat::Report strip = CheckUnwrapIsValid("strip", Strip(576, 3, 0.25, 0), __LINE__);
        CHECK(strip.quality.charts >= 4);
        CHECK(strip.quality.utilization > 0.3);
        CHECK(strip.quality.chartAreaDistortion < 1e-3);
        CHECK(strip.quality.vertexSplit < 1.05);
    }

    TEST(ALongArcIsCutIntoPiecesThatStayValid)
    {
        // Three quarters of a ring, 2 wide and about 150 long.
        UVStat::Report arc = CheckUnwrapIsValid("arc", Strip(600, 2, 0.25, 4.7), __LINE__);
        CHECK(arc.quality.charts >= 2);
        CHECK(arc.quality.utilization > 0.15);
    }

    TEST(CutsKeepEveryDegenerateTriangleWithItsVertices)
    {
        // Zero-area triangles span four columns each: a cut between their ends would leave them
        // with vertices in two pieces that the packing then moves apart. (uvstat counts such a
        // triangle, whose UVs are collinear only up to float rounding, as overlapping the
        // triangles under it, so that one check is left out here.)
        UVStat::TestMesh mesh = Strip(576, 3, 0.25, 0, 16);
        uint32_t firstDegenerate = 2 * 576 * 3;
        UnwrapRun run = RunChartBake(mesh, UVStat::TestParams());
        CHECK_EQUAL(0, run.process.exitStatus);
        if (run.uv.empty())
            return;
        UVStat::Report report = MeasureRun(mesh, run, UVStat::TestParams().packMargin);
        const UVStat::Validity& v = report.validity;
        CHECK_EQUAL(0u, v.nonFiniteCorners + v.outsideCorners + v.flipped + v.zeroArea);
        CHECK_EQUAL(0u, v.overlapPairsBetweenCharts + v.rasterOverlapBetweenCharts + v.rasterOverlapInsideCharts);
        CHECK_EQUAL(0u, v.marginViolations + v.borderViolations + v.splitVertexCharts);
        CHECK(report.quality.charts >= 4);
        CHECK(report.quality.utilization > 0.3);
        // Each keeps its 3D length (sqrt 5) at the layout's one scale.
        double scale = std::sqrt(report.quality.utilization / (576 * 0.25 * 3));
        for (uint32_t t = firstDegenerate; t < mesh.TriCount(); ++t)
        {
            double dx = run.uv[6 * t + 4] - run.uv[6 * t], dy = run.uv[6 * t + 5] - run.uv[6 * t + 1];
            CHECK_CLOSE(std::sqrt(5.0) * scale, std::sqrt(dx * dx + dy * dy), 1e-3 * scale);
        }
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
