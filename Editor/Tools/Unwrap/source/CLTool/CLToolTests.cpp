// End-to-end tests of ChartBake: the real binary, run in a fresh directory, with the bundled
// libraries. CHARTBAKE_LIBRARY_BEHAVIOUR (read by the libraries) picks failing, warning,
// crashing or announcing behaviour where a test needs it.
#include "Runtime/Testing/ChildProcess.h"
#include "Runtime/Testing/TemporaryDirectory.h"
#include "Runtime/Testing/Testing.h"

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

namespace
{
    const std::string kBinDir = CHARTBAKE_BIN_DIR;
    const char* const kBehaviour = "CHARTBAKE_LIBRARY_BEHAVIOUR=";
    // The tests that compare UVs byte for byte ask for the per-triangle grid layout: it is simple
    // enough to work out by hand, and they test the driver's formats, not the layout.
    const std::string kGrid = std::string(kBehaviour) + "unwrap-grid";

    // Little-endian bytes of a raw binary mesh file, appended field by field.
    struct Bytes
    {
        std::string data;
        Bytes& U32(uint32_t v) { data.append(reinterpret_cast<const char*>(&v), 4); return *this; }
        Bytes& F32(float v) { data.append(reinterpret_cast<const char*>(&v), 4); return *this; }
    };

    // Header of a binary mesh: parameters 0.5, 0.25, 45, packMargin 0.25, recollectVertices 1 (each
    // field distinct, so that the library's report shows their order), counts, presence words.
    Bytes BinaryHeader(uint32_t vertexCount, uint32_t triCount, uint32_t uvPresent, uint32_t srcPolyPresent)
    {
        Bytes b;
        b.F32(0.5f).F32(0.25f).F32(45.0f).F32(0.25f).U32(1);
        return b.U32(vertexCount).U32(triCount).U32(uvPresent).U32(srcPolyPresent);
    }

    // The triangle (0,0,0) (4,0,0) (2,2,0): its longest edge first, its apex at (2, 2) once
    // flattened, so the layout is exact.

    Bytes OneTriangleBinary(uint32_t uvPresent, uint32_t srcPolyPresent)
    {
        Bytes b = BinaryHeader(3, 1, uvPresent, srcPolyPresent);
        b.F32(0).F32(0).F32(0).F32(4).F32(0).F32(0).F32(2).F32(2).F32(0);
        return b.U32(0).U32(1).U32(2);
    }

    // One cell of the grid: margin 0.25, cell 0.5, scale 0.125.
    std::string OneTriangleUVs()
    {
        Bytes b;
        return b.F32(0.25f).F32(0.25f).F32(0.75f).F32(0.25f).F32(0.5f).F32(0.5f).data;
    }

    const char* const kTwoTriangleObj =
        "# two charts\n"
        "o sample\n"
        "v 0 0 0\nv 4 0 0\nv 2 2 0\nv 2 2 1\nv 0 0 1\nv 0 4 1\n"
        "vt 0.5 0.5\nvt 0.25 0.75\n"
        "vn 0 0 1\n"
        "s off\n"
        "f 1/1/1 2/1/1 3/1/1\n"
        "f 5/2/1 6/2/1 4/2/1 1/1/1\n";

    struct ChartBakeFixture : Testing::TemporaryDirectory
    {
        ChartBakeFixture() : TemporaryDirectory("chartbake-e2e") {}

        void CopyFromBin(const std::string& file, const std::string& as) const
        {
            std::filesystem::copy_file(kBinDir + "/" + file, PathOf(as));
        }

        Testing::ChildResult Run(std::vector<std::string> args, const std::vector<std::string>& env = {},
                                 const std::string& program = kBinDir + "/ChartBake") const
        {
            args.insert(args.begin(), program);
            return Testing::RunProgram(args, dir, env);
        }
        // A copy of ChartBake in the directory itself, with no libraries beside it.
        Testing::ChildResult RunLoneCopy(const std::vector<std::string>& args) const
        {
            if (!Exists("ChartBake"))
            {
                CopyFromBin("ChartBake", "ChartBake");
                std::filesystem::permissions(PathOf("ChartBake"), std::filesystem::perms::owner_all);
            }
            return Run(args, {}, PathOf("ChartBake"));
        }
    };

    bool Contains(const std::string& text, const std::string& part) { return text.find(part) != std::string::npos; }

    // What the library reports under unwrap-report-inputs (floats as their bit patterns).
    std::string Hex(float value)
    {
        uint32_t bits;
        std::memcpy(&bits, &value, 4);
        char text[16];
        std::snprintf(text, sizeof text, "%X", bits);
        return text;
    }

    // The suite "Tessary" in registration order: each test's registration line and, per export it
    // checks, the check line.
    struct SelfTestCheck
    {
        const char* exportName;
        int line;
    };
    struct SelfTest
    {
        const char* name;
        int line;
        std::vector<SelfTestCheck> checks;
    };
    const SelfTest kSelfTests[] = {
        {"NonManifoldFixer", 277, {{"Tessary_TestNonManifoldFixer", 279}}},
        {"DegenerateRemoval", 281, {{"Tessary_TestDegenerateRemoval", 283}}},
        {"SplitConnected", 285, {{"Tessary_TestSplitConnected", 287}}},
        {"TriMapBasic", 289, {{"Tessary_TestTriMapBasic", 291}}},
        {"TriMapVertexIndex", 294, {{"Tessary_TestTriMapVertexIndex", 296}}},
        {"CollapseEdgeBasic", 299, {{"Tessary_TestCollapseEdgeBasic", 301}}},
        {"MathBasic", 303, {{"Tessary_TestMathBasic", 305}, {"Tessary_TestTrigonometry", 306}, {"Tessary_TestLog", 307},
                            {"Tessary_TestMatrix4Invert", 308}, {"Tessary_TestSparseMatrix", 309}}},
        {"PriorityQueue", 311, {{"Tessary_TestPriorityQueue", 313}}},
        {"Array", 315, {{"Tessary_TestArray", 317}}},
        {"BlobArray", 319, {{"Tessary_TestBlobArray", 321}}},
        {"HashTab", 323, {{"Tessary_TestHashTab", 325}}},
        {"InternalCollapseEdge", 327, {{"Tessary_TestProgressiveMeshInternalCollapseEdge", 329}}},
        {"SimplePatchGenerate", 331, {{"Tessary_TestSlidingWindowSimplePatchGenerate", 333}}},
        {"UnwrapWithDegenerateTriangles", 335, {{"Unwrap_TestUnwrapWithDegenerateTriangles", 337}}},
        {"UnwrapDontSplitRects", 339, {{"Unwrap_TestUnwrapDontSplitRects", 341}}},
    };
    const std::string kCLToolPath = "Editor/Tools/Unwrap/source/CLTool/CLTool.cpp";

    // A test name as the console reporter lines it up.
    std::string Padded(const std::string& name)
    {
        return name + std::string(name.size() < 33 ? 33 - name.size() : 1, ' ');
    }

    const std::string kUsage = "usage:\nChartBake [-obj] <input_file> <output_file>\n";
}

INTEGRATION_TEST_SUITE(ChartBake)
{
    TEST_FIXTURE(ChartBakeFixture, CommandLine_UsageForms_PrintUsageAndExit1)
    {
        const std::vector<std::vector<std::string>> usageForms = {
            {}, {"mesh.bin"}, {"-obj"}, {"-obj", "mesh.obj"}, {"-obj", "mesh.obj", "out.obj", "extra"},
            {"mesh.bin", "out.bin", "extra"}, {"-runNativeTestsX"}};
        Write("mesh.obj", kTwoTriangleObj);
        Write("mesh.bin", OneTriangleBinary(0, 0).data);
        for (const auto& args : usageForms)
        {
            Testing::ChildResult r = Run(args);
            CHECK(r.exited);
            CHECK_EQUAL(1, r.exitStatus);
            CHECK_EQUAL(kUsage, r.out);
        }
        CHECK(!Exists("out.obj"));
        CHECK(!Exists("out.bin"));
    }

    TEST_FIXTURE(ChartBakeFixture, CommandLine_BothLibrariesLoadBeforeTheArgumentsAreRead)
    {
        // Copies in the working directory are found first and announce their load.
        CopyFromBin("Tessary.dll", "Tessary.dll");
        CopyFromBin("Unwrap.dll", "Unwrap.dll");
        Testing::ChildResult r = Run({}, {std::string(kBehaviour) + "announce"});
        CHECK_EQUAL(1, r.exitStatus);
        CHECK_EQUAL("Tessary.dll loaded\nUnwrap.dll loaded\n" + kUsage, r.out);
    }

    TEST_FIXTURE(ChartBakeFixture, Unwrap_LibraryRunsWithRoundTowardZeroAndDenormalsKept)
    {
        Write("mesh.bin", OneTriangleBinary(0, 0).data);
        Testing::ChildResult r = Run({"mesh.bin", "out.bin"}, {std::string(kBehaviour) + "unwrap-report-fp"});
        CHECK_EQUAL(0, r.exitStatus);
        // The control bits of the default 0x1F80 with rounding set to 11: nothing else changed.
        CHECK_EQUAL("rounding toward zero, denormals kept, control 7F80\n", r.out);
    }

    TEST_FIXTURE(ChartBakeFixture, CommandLine_WithoutLibraries_UsageStillWorks)
    {
        Testing::ChildResult r = RunLoneCopy({"-obj"});
        CHECK(r.exited);
        CHECK_EQUAL(1, r.exitStatus);
        CHECK_EQUAL(kUsage, r.out);
    }

    TEST_FIXTURE(ChartBakeFixture, CommandLine_NearMissesOfTheTestSwitch_AreBinaryInputPaths)
    {
        for (const std::string name : {"-runNativeTestsX", "-runNativeTest"})
        {
            Write(name, OneTriangleBinary(0, 0).data);
            Testing::ChildResult r = Run({name, "out.bin"}, {kGrid});
            CHECK_EQUAL(0, r.exitStatus);
            CHECK_EQUAL("", r.out);
            CHECK_EQUAL(OneTriangleUVs(), Read("out.bin"));
        }
    }

    TEST_FIXTURE(ChartBakeFixture, Obj_TwoTriangles_WrittenByteForByte)
    {
        Write("mesh.obj", kTwoTriangleObj);
        Testing::ChildResult r = Run({"-obj", "mesh.obj", "out.obj"}, {kGrid});
        CHECK_EQUAL(0, r.exitStatus);
        CHECK_EQUAL("", r.out + r.err);
        // Default margin 1/256; two cells of 253/512 side, scale 253/2048.
        const std::string expected =
            "g unwrap_out\n# vertices 6\n# triangles 2\n\n"
            "v 0.000000 0.000000 0.000000\nv 4.000000 0.000000 0.000000\nv 2.000000 2.000000 0.000000\n"
            "v 2.000000 2.000000 1.000000\nv 0.000000 0.000000 1.000000\nv 0.000000 4.000000 1.000000\n\n"
            "vt 0.003906 0.003906\nvt 0.498047 0.003906\nvt 0.250977 0.250977\n"
            "vt 0.501953 0.003906\nvt 0.996094 0.003906\nvt 0.749023 0.250977\n\n"
            "f 1/1 2/2 3/3\nf 5/4 6/5 4/6\n";
        CHECK_EQUAL(expected, Read("out.obj"));
    }

    TEST_FIXTURE(ChartBakeFixture, Obj_OutputOfSeveralBlocks_MatchesPrintf)
    {
        // A grid of 24000 triangles, some 2.5 MB of OBJ text. Its coordinates are short dyadic
        // decimals, so the OBJ and binary inputs hold the same floats; the binary run's output gives
        // the UVs the OBJ run must print.
        const uint32_t columns = 60, rows = 200, across = columns + 1;
        std::string obj;
        Bytes bin;
        bin.F32(0.08f).F32(0.15f).F32(88.0f).F32(1.0f / 256).U32(0);
        bin.U32(across * (rows + 1)).U32(2 * columns * rows).U32(0).U32(0);
        std::vector<float> vertex;
        for (uint32_t y = 0; y <= rows; ++y)
            for (uint32_t x = 0; x < across; ++x)
                vertex.insert(vertex.end(), {0.375f * float(x) - 7, 1.25f * float(y), -0.5f * float(x * y % 7)});
        char line[128];
        for (size_t i = 0; i < vertex.size(); i += 3)
        {
            std::snprintf(line, sizeof line, "v %.9g %.9g %.9g\n", vertex[i], vertex[i + 1], vertex[i + 2]);
            obj += line;
            bin.F32(vertex[i]).F32(vertex[i + 1]).F32(vertex[i + 2]);
        }
        obj += "vt 0 0\nvn 0 0 1\n";
        std::vector<uint32_t> tri;
        for (uint32_t y = 0; y < rows; ++y)
            for (uint32_t x = 0; x < columns; ++x)
            {
                uint32_t a = y * across + x, b = a + 1, c = a + across, d = c + 1;
                tri.insert(tri.end(), {a, b, d, a, d, c});
            }
        for (size_t i = 0; i < tri.size(); i += 3)
        {
            std::snprintf(line, sizeof line, "f %u/1/1 %u/1/1 %u/1/1\n", tri[i] + 1, tri[i + 1] + 1, tri[i + 2] + 1);
            obj += line;
            bin.U32(tri[i]).U32(tri[i + 1]).U32(tri[i + 2]);
        }
        Write("mesh.obj", obj);
        Write("mesh.bin", bin.data);
        CHECK_EQUAL(0, Run({"mesh.bin", "out.bin"}).exitStatus);
        CHECK_EQUAL(0, Run({"-obj", "mesh.obj", "out.obj"}).exitStatus);
        const std::string uvBytes = Read("out.bin");
        CHECK_EQUAL(tri.size() * 8, uvBytes.size());
        std::vector<float> uv(uvBytes.size() / 4);
        std::memcpy(uv.data(), uvBytes.data(), uvBytes.size());

        std::snprintf(line, sizeof line, "g unwrap_out\n# vertices %zu\n# triangles %zu\n\n", vertex.size() / 3,
                      tri.size() / 3);
        std::string expected = line;
        for (size_t i = 0; i < vertex.size(); i += 3)
        {
            std::snprintf(line, sizeof line, "v %f %f %f\n", vertex[i], vertex[i + 1], vertex[i + 2]);
            expected += line;
        }
        expected += "\n";
        for (size_t i = 0; i < uv.size(); i += 2)
        {
            std::snprintf(line, sizeof line, "vt %f %f\n", uv[i], uv[i + 1]);
            expected += line;
        }
        expected += "\n";
        for (uint32_t i = 0; i < tri.size(); i += 3)
        {
            std::snprintf(line, sizeof line, "f %u/%u %u/%u %u/%u\n", tri[i] + 1, i + 1, tri[i + 1] + 1, i + 2,
                          tri[i + 2] + 1, i + 3);
            expected += line;
        }
        const std::string actual = Read("out.obj");
        CHECK(expected.size() > 2 * (1 << 20));
        // The first difference and what follows it, rather than megabytes of text.
        size_t at = size_t(std::mismatch(expected.begin(), expected.end(), actual.begin(), actual.end()).first -
                           expected.begin());
        CHECK_EQUAL(expected.substr(at, 80), actual.substr(at, 80));
        CHECK_EQUAL(expected.size(), actual.size());
    }

    TEST_FIXTURE(ChartBakeFixture, Binary_OptionalBlocks_ReadInOrderAndOnlyUVsWritten)
    {
        Bytes both = OneTriangleBinary(2, 0xFFFFFFFFu);
        both.F32(0).F32(0.5f).F32(1).F32(0).F32(0).F32(1).U32(7);
        Bytes uvOnly = OneTriangleBinary(1, 0);
        uvOnly.F32(0.5f).F32(0).F32(1).F32(0).F32(0).F32(1);
        Bytes polyOnly = OneTriangleBinary(0, 1);
        polyOnly.U32(9);
        const std::string head = "param 3F000000 3E800000 42340000 3E800000 1; 3 vertices, 1 triangles; ";
        const std::pair<std::string, std::string> cases[] = {
            {OneTriangleBinary(0, 0).data, head + "triUV none; srcPoly none\n"},
            {both.data, head + "triUV 0 3F000000 3F800000 0 0 3F800000; srcPoly 7\n"},
            {uvOnly.data, head + "triUV 3F000000 0 3F800000 0 0 3F800000; srcPoly none\n"},
            {polyOnly.data, head + "triUV none; srcPoly 9\n"}};
        for (const auto& [input, report] : cases)
        {
            Write("mesh.bin", input);
            Testing::ChildResult r = Run({"mesh.bin", "out.bin"}, {kGrid + ",unwrap-report-inputs"});
            CHECK_EQUAL(0, r.exitStatus);
            CHECK_EQUAL(report, r.out);
            CHECK_EQUAL(OneTriangleUVs(), Read("out.bin"));
        }
    }

    TEST_FIXTURE(ChartBakeFixture, EmptyMesh_BinaryOutputIsEmptyAndObjKeepsItsHeader)
    {
        // No triangles: the file may end right after the (empty) triangle block.
        Bytes noTriangles = BinaryHeader(1, 0, 0, 0);
        noTriangles.F32(1).F32(2).F32(3);
        Write("mesh.bin", noTriangles.data);
        CHECK_EQUAL(0, Run({"mesh.bin", "out.bin"}).exitStatus);
        CHECK(Exists("out.bin"));
        CHECK_EQUAL("", Read("out.bin"));

        Write("none.obj", "# nothing at all\n");
        CHECK_EQUAL(0, Run({"-obj", "none.obj", "none_out.obj"}).exitStatus);
        CHECK_EQUAL("g unwrap_out\n# vertices 0\n# triangles 0\n\n\n\n", Read("none_out.obj"));

        Write("points.obj", "v 1 2 3\n");
        CHECK_EQUAL(0, Run({"-obj", "points.obj", "points_out.obj"}).exitStatus);
        CHECK_EQUAL("g unwrap_out\n# vertices 1\n# triangles 0\n\nv 1.000000 2.000000 3.000000\n\n\n",
                    Read("points_out.obj"));
    }

    TEST_FIXTURE(ChartBakeFixture, Obj_DefaultParametersAndOneUVPerCornerReachTheLibrary)
    {
        // Each corner names its own UV, out of order; the fourth corner of the quad is dropped.
        Write("mesh.obj", "v 0 0 0\nv 4 0 0\nv 2 2 0\nvt 0.25 0.5\nvt 1 0\nvt 0 1\nvt 0.5 0.5\n"
                          "f 1/3/1 2/1/1 3/2/1 1/4/1\n");
        Testing::ChildResult r = Run({"-obj", "mesh.obj", "out.obj"}, {std::string(kBehaviour) + "unwrap-report-inputs"});
        CHECK_EQUAL(0, r.exitStatus);
        CHECK_EQUAL("param 3DA3D70A 3E19999A 42B00000 3B800000 0; 3 vertices, 1 triangles; triUV " + Hex(0) + " " +
                        Hex(1) + " " + Hex(0.25f) + " " + Hex(0.5f) + " " + Hex(1) + " " + Hex(0) + "; srcPoly none\n",
                    r.out);
    }

    TEST_FIXTURE(ChartBakeFixture, Obj_OverlongLinesAreReadInPiecesOf1023Characters)
    {
        // The comment's last piece, "v 4 0 0", counts as a position line of its own.
        Write("mesh.obj", "v 0 0 0\n#" + std::string(1022, 'x') + "v 4 0 0\nv 2 2 0\nvt 0 0\nf 1/1/1 2/1/1 3/1/1\n");
        CHECK_EQUAL(0, Run({"-obj", "mesh.obj", "out.obj"}).exitStatus);
        const std::string out = Read("out.obj");
        CHECK_EQUAL("g unwrap_out\n# vertices 3\n# triangles 1\n\nv 0.000000 0.000000 0.000000\n"
                    "v 4.000000 0.000000 0.000000\nv 2.000000 2.000000 0.000000\n\n",
                    out.substr(0, out.find("vt ")));

        // A line split into pieces still counts once when an error names a later line.
        Write("bad.obj", "#" + std::string(1022, 'x') + "\n#" + std::string(3000, 'y') + "\nf 1/1 2/1 3/1\n");
        Testing::ChildResult r = Run({"-obj", "bad.obj", "out_bad.obj"});
        CHECK_EQUAL(1, r.exitStatus);
        CHECK_EQUAL("ChartBake: bad.obj:3: face corners must have the form vertex/uv/normal (three of them)\n", r.err);
    }

    TEST_FIXTURE(ChartBakeFixture, Binary_PackMarginFromTheFileIsPassedOn)
    {
        // packMargin 0 and the same triangle: one cell filling the square, scale 0.25.
        Bytes b;
        b.F32(0.08f).F32(0.15f).F32(88.0f).F32(0.0f).U32(0).U32(3).U32(1).U32(0).U32(0);
        b.F32(0).F32(0).F32(0).F32(4).F32(0).F32(0).F32(2).F32(2).F32(0).U32(0).U32(1).U32(2);
        Write("mesh.bin", b.data);
        CHECK_EQUAL(0, Run({"mesh.bin", "out.bin"}, {kGrid}).exitStatus);
        Bytes expected;
        CHECK_EQUAL(expected.F32(0).F32(0).F32(1).F32(0).F32(0.5f).F32(0.5f).data, Read("out.bin"));
    }

    TEST_FIXTURE(ChartBakeFixture, ErrorBuffer_PrintedVerbatimWhetherOrNotTheUnwrapSucceeds)
    {
        Write("mesh.bin", OneTriangleBinary(0, 0).data);
        Testing::ChildResult warned = Run({"mesh.bin", "out.bin"}, {kGrid + ",unwrap-warn"});
        CHECK_EQUAL(0, warned.exitStatus);
        CHECK_EQUAL("GenerateSecondaryUVSet: warning as CHARTBAKE_LIBRARY_BEHAVIOUR asks\n", warned.out);
        CHECK_EQUAL(OneTriangleUVs(), Read("out.bin"));

        Testing::ChildResult failed = Run({"mesh.bin", "failed.bin"}, {std::string(kBehaviour) + "unwrap-fail"});
        CHECK_EQUAL(1, failed.exitStatus);
        CHECK_EQUAL("GenerateSecondaryUVSet: failing as CHARTBAKE_LIBRARY_BEHAVIOUR asks", failed.out);
        CHECK(!Exists("failed.bin"));

        // A buffer filled to its last byte, with no terminator: exactly 1,024 characters printed.
        Testing::ChildResult full = Run({"mesh.bin", "full.bin"}, {std::string(kBehaviour) + "unwrap-fill"});
        CHECK_EQUAL(0, full.exitStatus);
        CHECK_EQUAL(std::string(1023, 'W') + "Z", full.out);
    }

    TEST_FIXTURE(ChartBakeFixture, BadInput_BinaryTriangleNamesAMissingVertex)
    {
        Bytes b = BinaryHeader(3, 2, 0, 0);
        b.F32(0).F32(0).F32(0).F32(4).F32(0).F32(0).F32(2).F32(2).F32(0).U32(0).U32(1).U32(2).U32(2).U32(3).U32(0);
        Write("mesh.bin", b.data);
        Testing::ChildResult r = Run({"mesh.bin", "out.bin"}, {std::string(kBehaviour) + "unwrap-warn"});
        CHECK_EQUAL(1, r.exitStatus);
        CHECK_EQUAL("", r.out);   // the library is never called
        CHECK_EQUAL("ChartBake: input file mesh.bin: triangle 1 refers to vertex index 3, which does not exist "
                    "(the file has 3 vertices)\n",
                    r.err);
        CHECK(!Exists("out.bin"));
    }

    TEST_FIXTURE(ChartBakeFixture, BadInput_FailedWriteRemovesOnlyAnOrdinaryFile)
    {
        // Through a link to /dev/full: the write fails, and the device (and the link) must survive.
        std::filesystem::create_symlink("/dev/full", PathOf("full.bin"));
        Write("mesh.bin", OneTriangleBinary(0, 0).data);
        Testing::ChildResult r = Run({"mesh.bin", "full.bin"});
        CHECK_EQUAL(1, r.exitStatus);
        CHECK_EQUAL("ChartBake: cannot write output file full.bin: No space left on device\n", r.err);
        CHECK(std::filesystem::is_symlink(PathOf("full.bin")));
        CHECK(std::filesystem::is_character_file("/dev/full"));

        std::filesystem::create_symlink("/dev/full", PathOf("full.obj"));
        Write("mesh.obj", kTwoTriangleObj);
        r = Run({"-obj", "mesh.obj", "full.obj"});
        CHECK_EQUAL(1, r.exitStatus);
        CHECK_EQUAL("ChartBake: cannot write output file full.obj: No space left on device\n", r.err);
        CHECK(std::filesystem::is_symlink(PathOf("full.obj")));

        // An ordinary file that reaches the file size limit part way through is removed.
        std::string many = "v 0 0 0\nv 4 0 0\nv 2 2 0\nvt 0 0\n";
        for (int i = 0; i < 40; ++i)
            many += "f 1/1/1 2/1/1 3/1/1\n";
        Write("many.obj", many);
        r = Testing::RunProgram(
            {"/bin/sh", "-c", "trap '' XFSZ; ulimit -f 1; exec \"$0\" -obj many.obj part.obj", kBinDir + "/ChartBake"}, dir);
        CHECK_EQUAL(1, r.exitStatus);
        CHECK_EQUAL("ChartBake: cannot write output file part.obj: File too large\n", r.err);
        CHECK(!Exists("part.obj"));
    }

    TEST_FIXTURE(ChartBakeFixture, NativeTests_AllPass_Exit0)
    {
        Testing::ChildResult r = Run({"-runNativeTests", "ignored", "-obj"});
        CHECK_EQUAL(0, r.exitStatus);
        CHECK(Contains(r.out, "Ran 15 tests with 0 failures in "));
        for (const char* name : {"[Tessary]  NonManifoldFixer ", "MathBasic ", "InternalCollapseEdge ",
                                 "SimplePatchGenerate ", "UnwrapWithDegenerateTriangles ", "UnwrapDontSplitRects "})
            CHECK(Contains(r.out, name));
        CHECK(!Contains(r.out, "FAIL"));
    }

    TEST_FIXTURE(ChartBakeFixture, NativeTests_TwoFailingAndOneCrashing_Exit3AndTheRunGoesOn)
    {
        Testing::ChildResult r = Run({"-runNativeTests"}, {std::string(kBehaviour) +
                                                          "fail:Tessary_TestLog,fail:Tessary_TestHashTab,crash:Tessary_TestArray"});
        CHECK(r.exited);
        CHECK_EQUAL(3, r.exitStatus);
        const std::string notTrue = "\tCHECK FAILURE: Expected values to be the same, but they were not\n"
                                    "\tExpected: 1\n\t  Actual: 0\n (Editor/Tools/Unwrap/source/CLTool/CLTool.cpp:";
        CHECK(Contains(r.out, "MathBasic                        FAIL!!!!\n" + notTrue + "307)\n"));
        CHECK(Contains(r.out, "HashTab                          FAIL!!!!\n" + notTrue + "325)\n"));
        CHECK(Contains(r.out, "[Tessary]  Array                            FAIL!!!!\n"));
        CHECK(Contains(r.out, "(Editor/Tools/Unwrap/source/CLTool/CLTool.cpp:315)\n"));
        CHECK(Contains(r.out, "[Tessary]  BlobArray                        PASS("));
        CHECK(Contains(r.out, "Ran 15 tests with 3 failures in "));
        CHECK(Contains(r.out, "\tFAILED: MathBasic [Tessary]\n\tFAILED: Array [Tessary]\n\tFAILED: HashTab [Tessary]\n"));
    }

    TEST_FIXTURE(ChartBakeFixture, NativeTests_MathBasicReportsEachOfItsFiveExports)
    {
        Testing::ChildResult r = Run({"-runNativeTests"}, {std::string(kBehaviour) +
                                                          "fail:Tessary_TestMathBasic,fail:Tessary_TestSparseMatrix"});
        CHECK_EQUAL(1, r.exitStatus);
        CHECK(Contains(r.out, "CLTool.cpp:305)\n"));
        CHECK(Contains(r.out, "CLTool.cpp:309)\n"));
        CHECK(!Contains(r.out, "CLTool.cpp:306)"));
    }

    TEST_FIXTURE(ChartBakeFixture, NativeTests_SuiteOrderAndRegistrationLines)
    {
        // Every export crashes: each test fails once, at its registration line, in list order.
        std::string behaviour = kBehaviour;
        for (const SelfTest& test : kSelfTests)
            for (const SelfTestCheck& check : test.checks)
                behaviour += std::string("crash:") + check.exportName + ",";
        Testing::ChildResult r = Run({"-runNativeTests"}, {behaviour});
        CHECK_EQUAL(15, r.exitStatus);
        std::string expected, failedList;
        for (const SelfTest& test : kSelfTests)
        {
            expected += "[Tessary]  " + Padded(test.name) + "FAIL!!!!\n\tCHECK FAILURE: Unhandled exception: Crash! (" + kCLToolPath +
                        ":" + std::to_string(test.line) + ")\n";
            failedList += std::string("\tFAILED: ") + test.name + " [Tessary]\n";
        }
        CHECK_EQUAL(expected, r.out.substr(0, r.out.find("Ran ")));
        CHECK(Contains(r.out, "Ran 15 tests with 15 failures in "));
        CHECK(Contains(r.out, failedList));
    }

    TEST_FIXTURE(ChartBakeFixture, NativeTests_EachExportIsCheckedAtItsOwnLine)
    {
        for (const SelfTest& test : kSelfTests)
            for (const SelfTestCheck& check : test.checks)
            {
                Testing::ChildResult r = Run({"-runNativeTests"}, {std::string(kBehaviour) + "fail:" + check.exportName});
                CHECK_EQUAL(1, r.exitStatus);
                const std::string expected = "[Tessary]  " + Padded(test.name) +
                                             "FAIL!!!!\n\tCHECK FAILURE: Expected values to be the same, but they were not\n"
                                             "\tExpected: 1\n\t  Actual: 0\n (" + kCLToolPath + ":" + std::to_string(check.line) + ")\n";
                CHECK_EQUAL(check.exportName + (": " + expected),
                            check.exportName + (": " + (Contains(r.out, expected) ? expected : r.out)));
                CHECK(Contains(r.out, "Ran 15 tests with 1 failures in "));
            }
    }

    TEST_FIXTURE(ChartBakeFixture, NativeTests_MissingLibraries_FailTheTestsThatNeedThem)
    {
        Testing::ChildResult none = RunLoneCopy({"-runNativeTests"});
        CHECK_EQUAL(15, none.exitStatus);
        CHECK(Contains(none.out, "Tessary_TestArray is unavailable: Tessary.dll could not be loaded from Tessary.dll "
                                 "(Failed to load DLL: could not open file) (Editor/Tools/Unwrap/source/CLTool/CLTool.cpp:317)"));

        CopyFromBin("Tessary.dll", "Tessary.dll");
        Testing::ChildResult onlyTessary = RunLoneCopy({"-runNativeTests"});
        CHECK_EQUAL(2, onlyTessary.exitStatus);
        CHECK(Contains(onlyTessary.out, "Unwrap_TestUnwrapDontSplitRects is unavailable: Unwrap.dll could not be loaded"));
        CHECK(Contains(onlyTessary.out, "\tFAILED: UnwrapWithDegenerateTriangles [Tessary]\n\tFAILED: UnwrapDontSplitRects [Tessary]\n"));
    }

    TEST_FIXTURE(ChartBakeFixture, BadInput_UnopenableInputOrUncreatableOutput)
    {
        Testing::ChildResult missingObj = Run({"-obj", "absent.obj", "out.obj"});
        CHECK_EQUAL(1, missingObj.exitStatus);
        CHECK_EQUAL("ChartBake: cannot open input file absent.obj: No such file or directory\n", missingObj.err);
        CHECK_EQUAL(1, Run({"absent.bin", "out.bin"}).exitStatus);

        Write("mesh.bin", OneTriangleBinary(0, 0).data);
        Testing::ChildResult noDir = Run({"mesh.bin", "no/such/dir/out.bin"});
        CHECK_EQUAL(1, noDir.exitStatus);
        CHECK_EQUAL("ChartBake: cannot create output file no/such/dir/out.bin: No such file or directory\n", noDir.err);
        CHECK(!Exists("out.obj"));
        CHECK(!Exists("out.bin"));
    }

    TEST_FIXTURE(ChartBakeFixture, BadInput_TruncatedOrOverflowingBinary)
    {
        std::string whole = OneTriangleBinary(0, 0).data;
        // Cut inside the parameters, inside the vertex block, inside the triangle block; a present
        // UV block (presence word 2) that is missing altogether.
        const std::vector<std::string> truncated = {whole.substr(0, 10), whole.substr(0, 40), whole.substr(0, whole.size() - 1),
                                                    OneTriangleBinary(2, 0).data};
        for (const std::string& input : truncated)
        {
            Write("mesh.bin", input);
            Testing::ChildResult r = Run({"mesh.bin", "out.bin"});
            CHECK_EQUAL(1, r.exitStatus);
            CHECK(Contains(r.err, "ChartBake: input file mesh.bin is truncated: the "));
        }
        Write("huge.bin", BinaryHeader(0x60000000u, 1, 0, 0).data);
        Testing::ChildResult huge = Run({"huge.bin", "out.bin"});
        CHECK_EQUAL(1, huge.exitStatus);
        CHECK(Contains(huge.err, "has counts too large to process: 1610612736 vertices"));
        CHECK(!Exists("out.bin"));
    }

    TEST_FIXTURE(ChartBakeFixture, BadInput_ObjFacesNameTheirLine)
    {
        struct Case { const char* text; const char* error; };
        const Case cases[] = {
            {"v 0 0 0\nv 1 0 0\nv 0 1 0\nvt 0 0\nf 1/1 2/1 3/1\n",
             "ChartBake: mesh.obj:5: face corners must have the form vertex/uv/normal (three of them)\n"},
            {"v 0 0 0\nv 1 0 0\nv 0 1 0\nvt 0 0\n\nf 1/1/1 2/1/1 4/1/1\n",
             "ChartBake: mesh.obj:6: face refers to vertex 4, which does not exist (the file has 3 vertices and 1 uvs)\n"},
            {"v 0 0 0\nv 1 0 0\nv 0 1 0\nf 1/1/1 2/1/1 3/1/1\n",
             "ChartBake: mesh.obj:4: face refers to uv 1, which does not exist (the file has 3 vertices and 0 uvs)\n"},
            {"v 0 0 0\nv 1 0 0\nv 0 1 0\nvt 0 0\nf 0/1/1 2/1/1 3/1/1\n",
             "ChartBake: mesh.obj:5: face refers to vertex 0, which does not exist (the file has 3 vertices and 1 uvs)\n"},
        };
        for (const Case& c : cases)
        {
            Write("mesh.obj", c.text);
            Testing::ChildResult r = Run({"-obj", "mesh.obj", "out.obj"});
            CHECK_EQUAL(1, r.exitStatus);
            CHECK_EQUAL(c.error, r.err);
            CHECK(!Exists("out.obj"));
        }
        // Faces may refer to positions and UVs defined further down.
        Write("late.obj", "f 1/1/1 2/1/1 3/1/1\nv 0 0 0\nv 4 0 0\nv 2 2 0\nvt 0 0\n");
        CHECK_EQUAL(0, Run({"-obj", "late.obj", "out.obj"}).exitStatus);
    }

    TEST_FIXTURE(ChartBakeFixture, BadInput_MissingLibraryOrExportForTheUnwrap)
    {
        Write("mesh.bin", OneTriangleBinary(0, 0).data);
        Testing::ChildResult none = RunLoneCopy({"mesh.bin", "out.bin"});
        CHECK_EQUAL(1, none.exitStatus);
        CHECK_EQUAL("ChartBake: cannot unwrap: GenerateSecondaryUVSet is unavailable: Unwrap.dll could not be loaded "
                    "from Unwrap.dll (Failed to load DLL: could not open file)\n",
                    none.err);

        // Each library in the working directory stands in for the other: neither has the exports.
        CopyFromBin("Tessary.dll", "Unwrap.dll");
        Testing::ChildResult noExport = Run({"mesh.bin", "out.bin"});
        CHECK_EQUAL(1, noExport.exitStatus);
        CHECK_EQUAL("ChartBake: cannot unwrap: Unwrap.dll has no export GenerateSecondaryUVSet\n", noExport.err);

        std::filesystem::remove(PathOf("Unwrap.dll"));
        CopyFromBin("Unwrap.dll", "Tessary.dll");
        Testing::ChildResult noService = Run({"mesh.bin", "out.bin"});
        CHECK_EQUAL(1, noService.exitStatus);
        CHECK_EQUAL("ChartBake: cannot unwrap: Tessary.dll has no export Tessary_Allocate\n", noService.err);
        CHECK(!Exists("out.bin"));
    }
}
