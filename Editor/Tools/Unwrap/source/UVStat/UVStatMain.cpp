// uvstat: validity and quality of a generated UV set.
//
//   uvstat [-json] [-margin <m>] <mesh.bin|mesh.obj> <uv.bin>
//
// The mesh is ChartBake's raw binary input (or an OBJ file with -obj's reader, by extension);
// the UVs are ChartBake's raw binary output, 24 bytes a triangle. The margin defaults to the
// mesh file's packMargin. Prints one key=value line a figure (or one JSON object with -json).
// Exit status: 0 for a valid layout, 1 for an invalid one, 2 when the input cannot be read.
#include "Editor/Tools/Unwrap/source/CLTool/MeshFiles.h"
#include "Editor/Tools/Unwrap/source/UVStat/UVStat.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

namespace
{
    int Usage()
    {
        std::fprintf(stderr, "usage: uvstat [-json] [-margin <m>] <mesh.bin|mesh.obj> <uv.bin>\n");
        return 2;
    }

    int Fail(const std::string& message)
    {
        std::fprintf(stderr, "uvstat: %s\n", message.c_str());
        return 2;
    }

    bool EndsWith(const std::string& text, const std::string& end)
    {
        return text.size() >= end.size() && text.compare(text.size() - end.size(), end.size(), end) == 0;
    }
}

int main(int argc, char** argv)
{
    bool json = false;
    double margin = -1;
    std::vector<std::string> paths;
    for (int i = 1; i < argc; ++i)
    {
        std::string arg = argv[i];
        if (arg == "-json")
            json = true;
        else if (arg == "-margin" && i + 1 < argc)
        {
            char* end = nullptr;
            margin = std::strtod(argv[++i], &end);
            if (*end || !(margin >= 0))
                return Usage();
        }
        else if (!arg.empty() && arg[0] == '-')
            return Usage();
        else
            paths.push_back(arg);
    }
    if (paths.size() != 2)
        return Usage();

    UnwrapParam param = DefaultUnwrapParam();
    uint32_t vertexCount = 0, triCount = 0;
    float *vertex = nullptr, *inputUV = nullptr;
    uint32_t *tri = nullptr, *srcPoly = nullptr;
    auto load = EndsWith(paths[0], ".obj") ? LoadFromObj : LoadFromHalvorBinary;
    MeshFileError error = load(paths[0].c_str(), &param, &vertexCount, &triCount, &vertex, &inputUV, &tri, &srcPoly);
    if (!error.empty())
        return Fail(error);

    std::ifstream in(paths[1], std::ios::binary);
    if (!in)
        return Fail("cannot open " + paths[1]);
    std::string bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    if (bytes.size() != 24ull * triCount)
        return Fail(paths[1] + " holds " + std::to_string(bytes.size()) + " bytes, but the mesh's " + std::to_string(triCount) +
                    " triangles need " + std::to_string(24ull * triCount));
    std::vector<float> uv(6ull * triCount);
    std::memcpy(uv.data(), bytes.data(), bytes.size());

    UVStat::LayoutView layout = {vertex, vertexCount, tri, triCount, uv.data()};
    UVStat::Report report = UVStat::Measure(layout, margin >= 0 ? margin : param.packMargin);
    std::fputs((json ? UVStat::FormatJson(report) : UVStat::FormatText(report)).c_str(), stdout);
    std::free(vertex), std::free(inputUV), std::free(tri), std::free(srcPoly);
    return report.Valid() ? 0 : 1;
}
