// LoadFromObj called directly: which face lines yield a triangle, and every number against the
// line-by-line formatted-input reading it stands for (fgets into a 1,024-byte buffer, sscanf with
// "v %f %f %f", "vt %f %f" and "f %u/%u/%*u ..."), under the driver's rounding toward zero.
#include "Editor/Tools/Unwrap/source/CLTool/MeshFiles.h"
#include "Editor/Tools/Unwrap/source/CLTool/ObjScanfReference.h"
#include "Runtime/Testing/TemporaryDirectory.h"
#include "Runtime/Testing/Testing.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <random>
#include <string>
#include <vector>
#include <xmmintrin.h>

namespace
{
    struct LoadedObj
    {
        MeshFileError error;
        UnwrapParam param = {};
        uint32_t vertexCount = 0, triCount = 0;
        float* vertex = nullptr;
        float* uv = nullptr;
        uint32_t* tri = nullptr;
        uint32_t* srcPoly = nullptr;
        ~LoadedObj()
        {
            std::free(vertex);
            std::free(uv);
            std::free(tri);
        }
        std::vector<float> Vertices() const { return std::vector<float>(vertex, vertex + 3 * (size_t)vertexCount); }
        std::vector<float> UVs() const { return std::vector<float>(uv, uv + 6 * (size_t)triCount); }
        std::vector<uint32_t> Triangles() const { return std::vector<uint32_t>(tri, tri + 3 * (size_t)triCount); }
    };

    struct ObjFileFixture : Testing::TemporaryDirectory
    {
        unsigned savedState = _mm_getcsr();

        // The driver's state while files are read: toward zero, flush-to-zero off.
        ObjFileFixture() : TemporaryDirectory("chartbake-obj") { _mm_setcsr((savedState | 0x6000u) & ~0x8000u); }
        ~ObjFileFixture() { _mm_setcsr(savedState); }

        std::string Write(const std::string& text) const
        {
            TemporaryDirectory::Write("mesh.obj", text);
            return PathOf("mesh.obj");
        }

        void Load(const std::string& text, LoadedObj* obj) const
        {
            obj->error = LoadFromObj(Write(text).c_str(), &obj->param, &obj->vertexCount, &obj->triCount, &obj->vertex, &obj->uv,
                                     &obj->tri, &obj->srcPoly);
        }
    };

    const std::string kThreeCorners = "v 0 0 0\nv 4 0 0\nv 2 2 0\nvt 0.25 0.5\nvt 1 0\nvt 0 1\n";

    bool SameBits(const std::vector<float>& a, const std::vector<float>& b)
    {
        return a.size() == b.size() && (a.empty() || std::memcmp(a.data(), b.data(), a.size() * sizeof(float)) == 0);
    }
}

UNIT_TEST_SUITE(ObjReader)
{
    TEST_FIXTURE(ObjFileFixture, Face_LastCornerWithoutNormal_StillYieldsTheTriangle)
    {
        for (const char* face : {"f 3/1/1 1/2/1 2/3\n", "f 3/1/1 1/2/1 2/3/\n", "f 3/1/1 1/2/1 2/3", "f 3/1/1 1/2/1 2/3/7 9/9\n"})
        {
            LoadedObj obj;
            Load(kThreeCorners + face, &obj);
            CHECK_EQUAL("", obj.error);
            CHECK_EQUAL(1u, obj.triCount);
            CHECK(obj.Triangles() == std::vector<uint32_t>({2, 0, 1}));
            CHECK(obj.UVs() == std::vector<float>({0.25f, 0.5f, 1, 0, 0, 1}));
        }
    }

    TEST_FIXTURE(ObjFileFixture, Face_FewerThanSixVertexAndUVNumbers_IsRefused)
    {
        // A missing normal before the last corner stops the match there, as does a missing UV.
        for (const char* face : {"f 1/1 2/2/1 3/3/1\n", "f 1/1/1 2/2 3/3/1\n", "f 1/1/1 2/2/1 3\n", "f 1/1/1 2/2/1 3/\n",
                                 "f 1/1/1 2/2/1\n", "f 1//1 2//1 3//1\n", "f 1/1/1 2/2/x 3/3/1\n"})
        {
            LoadedObj obj;
            Load(kThreeCorners + face, &obj);
            CHECK_EQUAL(obj.error.empty() ? std::string("accepted: ") + face : std::string(),
                        obj.error.find(":7: face corners must have the form vertex/uv/normal") != std::string::npos
                            ? std::string() : obj.error);
        }
    }

    TEST_FIXTURE(ObjFileFixture, EveryNumber_MatchesFormattedInputBitForBit)
    {
        // Numbers in many spellings, faces with blanks and signs where %u allows them, and lines
        // that are not v, vt or f.
        std::mt19937_64 random(11);
        std::string text = "# numbers\nvn 0 0 1\ng group\n";
        const char* formats[] = {"%.9g", "%f", "%e", "%.3f", "%.12E", "%a", "%+.7f"};
        const int vertices = 2000;
        for (int i = 0; i < vertices; ++i)
        {
            char line[600];
            float f[3];
            for (float& value : f)
            {
                uint32_t bits = (uint32_t)random();
                if ((bits >> 23 & 0xFF) == 0xFF)
                    bits &= ~0x40000000u;   // finite
                std::memcpy(&value, &bits, 4);
            }
            const char* fmt = formats[i % 7];
            std::string lineFormat = std::string("v ") + fmt + " " + fmt + "\t" + fmt + "\n";
            std::snprintf(line, sizeof line, lineFormat.c_str(), double(f[0]), double(f[1]), double(f[2]));
            text += line;
            std::string uvFormat = std::string("vt  ") + fmt + " " + fmt + " 0\n";
            std::snprintf(line, sizeof line, uvFormat.c_str(), double(f[2]) * 0.1, double(f[0]) / 3.0);
            text += line;
        }
        text += "v 0.1 0.2 0.3\nv 1e39 -1e39 1e-50\nv 1.4e-45 nan inf\nv 5\nv\nvt 0.7\n";
        for (int t = 0; t < 3000; ++t)
        {
            uint32_t c[3] = {uint32_t(1 + random() % vertices), uint32_t(1 + random() % vertices), uint32_t(1 + random() % vertices)};
            text += "f " + std::to_string(c[0]) + "/" + std::to_string(c[1]) + "/1 +" + std::to_string(c[1]) + "/ " +
                    std::to_string(c[2]) + "/3  " + std::to_string(c[2]) + "/" + std::to_string(c[0]) +
                    (t % 3 == 0 ? "\n" : t % 3 == 1 ? "/2 4/4/4\n" : "/\n");
        }
        LoadedObj obj;
        Load(text, &obj);
        CHECK_EQUAL("", obj.error);
        // The driver's rounding is back once the file is read (the sticky flags, bits 0-5, aside).
        CHECK_EQUAL((savedState | 0x6000u) & ~0x803Fu, _mm_getcsr() & ~0x3Fu);
        ObjScanfReference ref;
        CHECK(ReadObjWithScanf(dir + "/mesh.obj", &ref));
        CHECK_EQUAL(ref.positions.size() / 3, obj.vertexCount);
        CHECK(SameBits(ref.positions, obj.Vertices()));
        CHECK(ref.tri == obj.Triangles());
        CHECK(SameBits(ref.cornerUVs, obj.UVs()));
        CHECK_EQUAL(3000u, obj.triCount);
    }

    TEST_FIXTURE(ObjFileFixture, Parameters_AreTheDefaultsAndSourcePolygonsStayUntouched)
    {
        LoadedObj obj;
        uint32_t marker = 0;
        obj.srcPoly = &marker;
        Load(kThreeCorners + "f 1/1/1 2/2/2 3/3/3\n", &obj);
        CHECK_EQUAL("", obj.error);
        UnwrapParam defaults = DefaultUnwrapParam();
        CHECK_EQUAL(0, std::memcmp(&defaults, &obj.param, sizeof defaults));
        CHECK(obj.srcPoly == &marker);
        CHECK_EQUAL(3u, obj.vertexCount);
    }

    TEST_FIXTURE(ObjFileFixture, ForwardReferences_AreCompletedOnceTheFileIsRead)
    {
        LoadedObj obj;
        Load("f 1/2/1 2/1/1 3/3/1\nvt 0.5 0.25\nf 1/1/1 2/1/1 3/1/1\n" + kThreeCorners, &obj);
        CHECK_EQUAL("", obj.error);
        CHECK_EQUAL(2u, obj.triCount);
        CHECK(obj.UVs() == std::vector<float>({0.25f, 0.5f, 0.5f, 0.25f, 1, 0, 0.5f, 0.25f, 0.5f, 0.25f, 0.5f, 0.25f}));
    }
}
