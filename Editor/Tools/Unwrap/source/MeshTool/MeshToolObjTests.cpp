// End-to-end tests of chartbake-mesh on OBJ, PLY and STL input: every OBJ face form, polygons
// (concave ones too) and negative indices, objects and materials kept in OBJ output.
#include "Editor/Tools/Unwrap/source/MeshTool/MeshToolTestSupport.h"
#include "Runtime/Testing/Testing.h"

#include <assimp/Exporter.hpp>
#include <assimp/Importer.hpp>
#include <assimp/scene.h>

#include <array>
#include <cstdio>

using namespace MeshToolTest;

namespace
{
    // A unit cube's corners and faces; `corner(v, face)` spells one face corner.
    std::string CubeObj(std::string (*corner)(int v, int face))
    {
        std::string obj = "v 0 0 0\nv 1 0 0\nv 1 1 0\nv 0 1 0\nv 0 0 1\nv 1 0 1\nv 1 1 1\nv 0 1 1\n"
                          "vt 0 0\nvt 1 0\nvt 1 1\nvt 0 1\n"
                          "vn 0 0 -1\nvn 0 0 1\nvn 0 -1 0\nvn 1 0 0\nvn 0 1 0\nvn -1 0 0\n";
        const int faces[6][4] = {{1, 4, 3, 2}, {5, 6, 7, 8}, {1, 2, 6, 5}, {2, 3, 7, 6}, {3, 4, 8, 7}, {4, 1, 5, 8}};
        for (int f = 0; f < 6; ++f)
        {
            obj += "f";
            for (int v : faces[f])
                obj += " " + corner(v, f);
            obj += "\n";
        }
        return obj;
    }

    std::string PlainCorner(int v, int) { return std::to_string(v); }
    std::string UVCorner(int v, int) { return std::to_string(v) + "/" + std::to_string((v - 1) % 4 + 1); }
    std::string NormalCorner(int v, int f) { return std::to_string(v) + "//" + std::to_string(f + 1); }
    std::string FullCorner(int v, int f) { return UVCorner(v, f) + "/" + std::to_string(f + 1); }

    // The parts of an OBJ file the checks need: positions, UVs and triangles as corner triples
    // of one-based (v, vt) numbers, plus the object and material lines.
    struct ObjText
    {
        std::vector<std::array<float, 3>> v;
        std::vector<std::array<float, 2>> vt;
        std::vector<std::array<int, 6>> faces;   // v, vt of three corners
        size_t normals = 0;
        std::string names;                        // "o" and "usemtl" lines, in order
    };

    ObjText ParseObj(const std::string& text)
    {
        ObjText obj;
        std::istringstream lines(text);
        std::string line;
        while (std::getline(lines, line))
        {
            std::array<float, 3> p{};
            std::array<int, 6> f{};
            int n[3];
            if (std::sscanf(line.c_str(), "v %f %f %f", &p[0], &p[1], &p[2]) == 3)
                obj.v.push_back(p);
            else if (std::sscanf(line.c_str(), "vt %f %f", &p[0], &p[1]) == 2)
                obj.vt.push_back({p[0], p[1]});
            else if (line.rfind("vn ", 0) == 0)
                ++obj.normals;
            else if (std::sscanf(line.c_str(), "f %d/%d/%d %d/%d/%d %d/%d/%d", &f[0], &f[1], &n[0], &f[2], &f[3], &n[1], &f[4],
                                 &f[5], &n[2]) == 9 ||
                     std::sscanf(line.c_str(), "f %d/%d %d/%d %d/%d", &f[0], &f[1], &f[2], &f[3], &f[4], &f[5]) == 6)
                obj.faces.push_back(f);
            else if (line.rfind("o ", 0) == 0 || line.rfind("usemtl ", 0) == 0)
                obj.names += line + "\n";
        }
        return obj;
    }

    double TriangleArea(const std::array<float, 3>& a, const std::array<float, 3>& b, const std::array<float, 3>& c)
    {
        double u[3], w[3];
        for (int i = 0; i < 3; ++i)
            u[i] = b[i] - a[i], w[i] = c[i] - a[i];
        double x = u[1] * w[2] - u[2] * w[1], y = u[2] * w[0] - u[0] * w[2], z = u[0] * w[1] - u[1] * w[0];
        return std::sqrt(x * x + y * y + z * z) / 2;
    }
}

INTEGRATION_TEST_SUITE(ChartBakeMeshObj)
{
    TEST_FIXTURE(MeshToolFixture, EveryFaceForm_QuadsTriangulated_ValidGlb)
    {
        struct Form
        {
            const char* name;
            std::string (*corner)(int, int);
            bool uv, normal;
        };
        const Form forms[] = {{"v", PlainCorner, false, false},
                              {"v-vt", UVCorner, true, false},
                              {"v--vn", NormalCorner, false, true},
                              {"v-vt-vn", FullCorner, true, true}};
        for (const Form& form : forms)
        {
            std::string name = std::string("cube_") + form.name;
            Write(name + ".obj", CubeObj(form.corner));
            Testing::ChildResult r = Run({name + ".obj", name + ".glb"});
            CHECK_EQUAL(0, r.exitStatus);
            CHECK(Contains(r.out, "12 triangles"));
            CHECK_EQUAL("errors 0 warnings 0\n", Validate(name + ".glb").out);
            GltfDocument output;
            if (!LoadOutput(name + ".glb", &output))
            {
                CHECK(false);
                continue;
            }
            const tinygltf::Primitive& primitive = output.model.meshes.at(0).primitives.at(0);
            CHECK_EQUAL(form.normal, primitive.attributes.count("NORMAL") == 1);
            std::string lightmap = form.uv ? "TEXCOORD_1" : "TEXCOORD_0";
            CHECK(primitive.attributes.count(lightmap) == 1);
            CHECK_EQUAL(2u + form.uv + form.normal, primitive.attributes.size());
            CHECK_EQUAL(36u, output.model.accessors[(size_t)primitive.indices].count);
            for (float value : Floats(output.model, primitive.attributes.at(lightmap)))
                CHECK(value >= 0 && value <= 1);
        }
    }

    TEST_FIXTURE(MeshToolFixture, PolygonsNegativeIndicesObjectsAndMaterials_RoundTripThroughObj)
    {
        Write("shapes.mtl", "newmtl red\nKd 1 0 0\n\nnewmtl blue\nKd 0 0 1\n");
        // A unit quad, a concave L of area 3 (its reflex corner at (1, 1)), and a triangle of
        // area 0.5 numbered backwards from the last vertex.
        Write("shapes.obj",
              "mtllib shapes.mtl\n"
              "o quad\nv 0 0 0\nv 1 0 0\nv 1 1 0\nv 0 1 0\nvn 0 0 1\nusemtl red\nf 1//1 2//1 3//1 4//1\n"
              "o ell\nv 0 0 1\nv 2 0 1\nv 2 1 1\nv 1 1 1\nv 1 2 1\nv 0 2 1\nusemtl blue\nf 5//1 6//1 7//1 8//1 9//1 10//1\n"
              "o tri\nv 5 0 0\nv 6 0 0\nv 5 1 0\nusemtl red\nf -3//-1 -2//-1 -1//-1\n");
        std::filesystem::create_directory(PathOf("out"));
        Testing::ChildResult r = Run({"shapes.obj", "out/shapes.obj"});
        CHECK_EQUAL(0, r.exitStatus);
        CHECK(Contains(r.out, "7 triangles"));
        ObjText obj = ParseObj(Read("out/shapes.obj"));
        CHECK_EQUAL("o quad\nusemtl red\no ell\nusemtl blue\no tri\nusemtl red\n", obj.names);
        CHECK_EQUAL(7u, obj.faces.size());
        CHECK_EQUAL(13u, obj.normals);
        CHECK(Contains(Read("out/shapes.mtl"), "newmtl blue\nKd 0 0 1\n"));
        // The triangulation covers each polygon exactly once: areas add up (a concave polygon
        // cut across its reflex corner would not).
        double area[3] = {0, 0, 0};
        for (const auto& f : obj.faces)
        {
            for (int c = 0; c < 3; ++c)
            {
                CHECK(f[2 * c] >= 1 && (size_t)f[2 * c] <= obj.v.size());
                CHECK(f[2 * c + 1] >= 1 && (size_t)f[2 * c + 1] <= obj.vt.size());
                if (f[2 * c] < 1 || (size_t)f[2 * c] > obj.v.size() || f[2 * c + 1] < 1 || (size_t)f[2 * c + 1] > obj.vt.size())
                    return;
            }
            const auto& a = obj.v[(size_t)f[0] - 1];
            area[a[2] == 1 ? 1 : a[0] >= 5 ? 2 : 0] += TriangleArea(a, obj.v[(size_t)f[2] - 1], obj.v[(size_t)f[4] - 1]);
        }
        CHECK_CLOSE(1.0, area[0], 1e-5);
        CHECK_CLOSE(3.0, area[1], 1e-5);
        CHECK_CLOSE(0.5, area[2], 1e-5);
        for (const auto& uv : obj.vt)
            CHECK(uv[0] >= 0 && uv[0] <= 1 && uv[1] >= 0 && uv[1] <= 1);
    }

    TEST_FIXTURE(MeshToolFixture, PlyAndStl_UnwrapIntoValidGlb)
    {
        Write("tetra.ply", "ply\nformat ascii 1.0\nelement vertex 4\nproperty float x\nproperty float y\nproperty float z\n"
                           "element face 4\nproperty list uchar int vertex_indices\nend_header\n"
                           "0 0 0\n1 0 0\n0 1 0\n0 0 1\n3 0 2 1\n3 0 1 3\n3 0 3 2\n3 1 2 3\n");
        std::string stl = "solid tetra\n";
        const char* facets[4][3] = {{"0 0 0", "0 1 0", "1 0 0"}, {"0 0 0", "1 0 0", "0 0 1"},
                                    {"0 0 0", "0 0 1", "0 1 0"}, {"1 0 0", "0 1 0", "0 0 1"}};
        for (const auto& facet : facets)
            stl += std::string("facet normal 0 0 0\nouter loop\nvertex ") + facet[0] + "\nvertex " + facet[1] + "\nvertex " +
                   facet[2] + "\nendloop\nendfacet\n";
        Write("tetra.stl", stl + "endsolid tetra\n");
        for (const std::string input : {"tetra.ply", "tetra.stl"})
        {
            Testing::ChildResult r = Run({input, input + ".glb"});
            CHECK_EQUAL(0, r.exitStatus);
            CHECK(Contains(r.out, "4 triangles"));
            CHECK_EQUAL("errors 0 warnings 0\n", Validate(input + ".glb").out);
        }
    }

    TEST_FIXTURE(MeshToolFixture, Weld_JoinsTrianglesThatOnlyShareCornerPositions)
    {
        // A flat square of two triangles that share no vertex: their corners at the diagonal
        // differ in normal, so the file keeps them apart. Apart they are two charts (nothing
        // connects them); welded by position, they are one flat piece.
        Write("split.obj", "v 0 0 0\nv 1 0 0\nv 0 1 0\nv 1 1 0\nvn 0 0 1\nvn 0 0.1 0.995\n"
                           "f 1//1 2//1 3//1\nf 2//2 4//2 3//2\n");
        Testing::ChildResult apart = Run({"split.obj", "apart.glb"});
        Testing::ChildResult welded = Run({"--weld", "split.obj", "welded.glb"});
        CHECK(Contains(apart.out, "2 triangles, 2 charts"));
        CHECK(Contains(welded.out, "2 triangles, 1 chart,"));
    }

    TEST_FIXTURE(MeshToolFixture, Fbx_UnwrapsIntoValidGlb)
    {
        // The FBX file is the cube converted by assimp's own exporter (its text form: the
        // binary form assimp 5.2 writes does not read back).
        Write("cube.obj", CubeObj(FullCorner));
        Assimp::Importer importer;
        const aiScene* scene = importer.ReadFile(PathOf("cube.obj"), 0);
        CHECK(scene != nullptr);
        if (!scene)
            return;
        Assimp::Exporter exporter;
        CHECK_EQUAL(AI_SUCCESS, exporter.Export(scene, "fbxa", PathOf("cube.fbx")));
        Testing::ChildResult r = Run({"cube.fbx", "cube.glb"});
        CHECK_EQUAL("", r.err);
        CHECK_EQUAL(0, r.exitStatus);
        CHECK(Contains(r.out, "12 triangles"));
        CHECK_EQUAL("errors 0 warnings 0\n", Validate("cube.glb").out);
    }

    TEST_FIXTURE(MeshToolFixture, Layout_PictureHasTheChosenResolution)
    {
        Write("cube.obj", CubeObj(FullCorner));
        Testing::ChildResult r = Run({"--resolution", "96", "--padding", "2", "--layout", "cube.png", "cube.obj", "out.obj"});
        CHECK_EQUAL(0, r.exitStatus);
        std::string png = Read("cube.png");
        CHECK_EQUAL(std::string("\x89PNG\r\n\x1a\n", 8), png.substr(0, 8));
        // IHDR: width and height, big-endian, at bytes 16 and 20.
        CHECK_EQUAL(std::string("\0\0\0\x60\0\0\0\x60", 8), png.substr(16, 8));
    }
}
