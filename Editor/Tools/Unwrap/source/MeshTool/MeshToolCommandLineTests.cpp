// End-to-end tests of chartbake-mesh's command line and of its answers to bad input: a clear
// message, exit status 1, and no output file written or changed.
#include "Editor/Tools/Unwrap/source/MeshTool/MeshToolTestSupport.h"
#include "Runtime/Testing/Testing.h"

using namespace MeshToolTest;

namespace
{
    const char* const kTriangleObj = "v 0 0 0\nv 1 0 0\nv 0 1 0\nf 1 2 3\n";
    const char* const kLinesOnlyObj = "v 0 0 0\nv 1 0 0\nv 0 1 0\nl 1 2 3\n";
    const std::string kPrecious = "an earlier result that must survive\n";
}

INTEGRATION_TEST_SUITE(ChartBakeMeshCommandLine)
{
    TEST_FIXTURE(MeshToolFixture, HelpAndVersion_ExitZeroWithDefaultsAndUnits)
    {
        Testing::ChildResult help = Run({"--help"});
        CHECK_EQUAL(0, help.exitStatus);
        for (const char* part : {"usage: chartbake-mesh [options] <input> <output>", "--hard-angle DEG", "degrees", "[88]",
                                 "[0.08]", "[0.15]", "1/256", "--resolution N", "[1024]", "--padding PIXELS", "--weld",
                                 "--per-mesh", "--layout FILE.png", "--quiet", "OBJ holds one UV"})
            CHECK(Contains(help.out, part));
        Testing::ChildResult version = Run({"--version"});
        CHECK_EQUAL(0, version.exitStatus);
        CHECK(Contains(version.out, "chartbake-mesh 1."));
    }

    TEST_FIXTURE(MeshToolFixture, Summary_OneLineOnSuccess_QuietPrintsNothing)
    {
        Write("tri.obj", kTriangleObj);
        Testing::ChildResult r = Run({"tri.obj", "out.glb"});
        CHECK_EQUAL(0, r.exitStatus);
        CHECK(Contains(r.out, "wrote out.glb: 1 triangle, 1 chart, "));
        CHECK(Contains(r.out, "% of the atlas used, "));
        CHECK_EQUAL(1, (int)std::count(r.out.begin(), r.out.end(), '\n'));
        CHECK_EQUAL("", r.err);
        // Past the quiet time (here set to none), every stage is announced on standard error.
        Testing::ChildResult progress = Run({"tri.obj", "progress.glb"}, {"CHARTBAKE_MESH_PROGRESS_AFTER=0"});
        CHECK_EQUAL(0, progress.exitStatus);
        CHECK(Contains(progress.err, "chartbake-mesh: reading... ("));
        CHECK(Contains(progress.err, "chartbake-mesh: unwrapping... ("));
        CHECK(Contains(progress.err, "chartbake-mesh: writing... ("));
        CHECK(Contains(progress.out, "wrote progress.glb: 1 triangle, "));
        Testing::ChildResult quiet = Run({"--quiet", "tri.obj", "quiet.glb"}, {"CHARTBAKE_MESH_PROGRESS_AFTER=0"});
        CHECK_EQUAL(0, quiet.exitStatus);
        CHECK_EQUAL("", quiet.out + quiet.err);
        CHECK(Exists("quiet.glb"));
    }

    TEST_FIXTURE(MeshToolFixture, OutOfRangeOptions_NameTheOptionAndTheRange)
    {
        Write("tri.obj", kTriangleObj);
        const std::vector<std::pair<std::vector<std::string>, std::string>> cases = {
            {{"--hard-angle", "0"}, "--hard-angle must be greater than 0 and at most 180 (degrees), not '0'"},
            {{"--hard-angle", "181"}, "--hard-angle must be greater than 0 and at most 180"},
            {{"--angle-distortion", "-0.1"}, "--angle-distortion must be from 0 to 1"},
            {{"--area-distortion", "lots"}, "--area-distortion must be from 0 to 1, not 'lots'"},
            {{"--margin", "0.25"}, "--margin must be from 0 to less than 0.25"},
            {{"--resolution", "8"}, "--resolution must be an integer from 16 to 16384"},
            {{"--resolution", "100.5"}, "--resolution must be an integer"},
            {{"--resolution", "64", "--padding", "16"}, "--padding must be an integer of 0 or more, under a quarter"},
            {{"--margin", "0.01", "--padding", "2"}, "--margin and --padding both set the margin"},
            {{"--layout", "picture.jpg"}, "--layout needs a file name ending in .png"},
            {{"--hard-angle"}, "--hard-angle needs a value"},
            {{"--frobnicate"}, "unknown option '--frobnicate'"}};
        for (const auto& [options, message] : cases)
        {
            std::vector<std::string> args = options;
            if (options.back() != "--hard-angle")
                args.insert(args.end(), {"tri.obj", "out.glb"});
            Testing::ChildResult r = Run(args);
            CHECK_EQUAL(1, r.exitStatus);
            CHECK(Contains(r.err, "chartbake-mesh: " + message));
            if (!Contains(r.err, message))
                std::fprintf(stderr, "  got: %s", r.err.c_str());
        }
        CHECK_EQUAL(1, Run({"tri.obj"}).exitStatus);
        CHECK(!Exists("out.glb"));
    }

    TEST_FIXTURE(MeshToolFixture, BadInput_ClearMessageExitOneAndTheOldOutputIntact)
    {
        Write("empty.obj", "");
        Write("faceless.obj", "v 0 0 0\nv 1 0 0\nv 0 1 0\n");
        Write("garbage.gltf", "{ \"asset\": { \"version\": \"2.0\" }, \"meshes\": [ {");
        Write("garbage.glb", "glTF\x02\0\0\0 this is not a binary glTF file");
        Write("badindex.obj", "v 0 0 0\nv 1 0 0\nf 1 2 9\n");
        Write("mesh.xyz", kTriangleObj);
        Write("lines.obj", kLinesOnlyObj);
        Write("tri.obj", kTriangleObj);
        std::filesystem::create_directory(PathOf("folder.obj"));
        const std::vector<std::pair<std::string, std::string>> cases = {
            {"missing.obj", "cannot read missing.obj: No such file or directory"},
            {"empty.obj", "empty.obj is empty"},
            {"faceless.obj", "cannot read faceless.obj: Validation failed: Mesh  contains no faces"},
            {"garbage.gltf", "cannot read garbage.gltf: "},
            {"garbage.glb", "cannot read garbage.glb: "},
            {"badindex.obj", "cannot read badindex.obj: "},
            {"lines.obj", "lines.obj has no triangles to unwrap"},
            {"mesh.xyz", "unsupported input format '.xyz' of mesh.xyz"},
            {"folder.obj", "cannot read folder.obj: it is a directory"}};
        Write("out.glb", kPrecious);
        size_t files = FileCount();
        for (const auto& [input, message] : cases)
        {
            Testing::ChildResult r = Run({input, "out.glb"});
            CHECK(r.exited);
            CHECK_EQUAL(1, r.exitStatus);
            CHECK(Contains(r.err, "chartbake-mesh: " + message));
            if (!Contains(r.err, message))
                std::fprintf(stderr, "  %s got: %s", input.c_str(), r.err.c_str());
        }
        Testing::ChildResult r = Run({"tri.obj", "out.fbx"});
        CHECK_EQUAL(1, r.exitStatus);
        CHECK(Contains(r.err, "unsupported output format '.fbx' of out.fbx (use .gltf, .glb or .obj)"));
        CHECK_EQUAL(kPrecious, Read("out.glb"));
        CHECK_EQUAL(files, FileCount());   // no temporary file left behind
    }

    TEST_FIXTURE(MeshToolFixture, OutputNamingTheInput_RefusedUnderEverySpelling)
    {
        Write("sub/mesh.obj", kTriangleObj);
        std::filesystem::create_symlink(PathOf("sub/mesh.obj"), PathOf("link.obj"));
        std::filesystem::create_hard_link(PathOf("sub/mesh.obj"), PathOf("hard.obj"));
        for (const std::string& output : std::vector<std::string>{"sub/mesh.obj", "./sub/../sub/mesh.obj", "link.obj", "hard.obj",
                                                                  dir + "/sub/mesh.obj"})
        {
            Testing::ChildResult r = Run({"sub/mesh.obj", output});
            CHECK_EQUAL(1, r.exitStatus);
            CHECK(Contains(r.err, "is the input file; choose another output name"));
        }
        // The material library and the picture may not land on the input either.
        Write("sub/mesh.mtl", "newmtl kept\n");
        CHECK_EQUAL(1, Run({"sub/mesh.mtl", "sub/mesh.obj"}).exitStatus);
        CHECK_EQUAL(1, Run({"--layout", "sub/mesh.png", "sub/mesh.obj", "sub/mesh.png"}).exitStatus);
        CHECK_EQUAL(kTriangleObj, Read("sub/mesh.obj"));
        CHECK_EQUAL("newmtl kept\n", Read("sub/mesh.mtl"));
    }
}
