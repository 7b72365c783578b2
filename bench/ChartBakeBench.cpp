// Times whole ChartBake runs on a generated mesh of about one million triangles, in both file
// formats, and shows where the time goes (ChartBake reports its phases with CHARTBAKE_TIMINGS):
// per run the phases, then the medians of the read phase as MB/s of input and of the peak
// resident memory at the end of reading over the bytes of the mesh arrays read (positions,
// triangles and, from OBJ, one UV pair a corner), and of the whole run's peak over the same
// bytes and over them plus the output UVs (24 bytes a triangle), which ChartBake must hold too.
//
//   ChartBakeBench [triangles=1000000] [runs=3] [-keep <dir>]
//
// The mesh is a wavy grid of quads, two triangles each; it is written to a temporary directory
// (or <dir> with -keep, which also keeps it) as mesh.obj (vertex/uv/normal faces) and mesh.bin.
// Before timing, the OBJ file is read in-process by LoadFromObj and line by line with fgets and
// sscanf, both under the driver's rounding toward zero, and every number is compared bit for bit.
#include "Editor/Tools/Unwrap/source/CLTool/MeshFiles.h"
#include "Editor/Tools/Unwrap/source/CLTool/ObjScanfReference.h"
#include "Runtime/Testing/ChildProcess.h"

#include <algorithm>

#include <chrono>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <string>
#include <vector>
#include <xmmintrin.h>

namespace
{
    struct Grid
    {
        uint32_t columns;   // quads across and down
        uint32_t VertexCount() const { return (columns + 1) * (columns + 1); }
        uint32_t TriangleCount() const { return 2 * columns * columns; }
        uint32_t Index(uint32_t x, uint32_t y) const { return y * (columns + 1) + x; }
        void Position(uint32_t v, float* p) const
        {
            float x = float(v % (columns + 1)), y = float(v / (columns + 1));
            p[0] = x;
            p[1] = y;
            p[2] = 3.0f * std::sin(x * 0.05f) * std::cos(y * 0.07f);
        }
        // Corners of triangle t, counter-clockwise.
        void Triangle(uint32_t t, uint32_t* c) const
        {
            uint32_t quad = t / 2, x = quad % columns, y = quad / columns;
            uint32_t a = Index(x, y), b = Index(x + 1, y), d = Index(x, y + 1), e = Index(x + 1, y + 1);
            const uint32_t corners[2][3] = {{a, b, e}, {a, e, d}};
            std::memcpy(c, corners[t % 2], 12);
        }
    };

    bool WriteObj(const Grid& grid, const std::string& path)
    {
        FILE* f = std::fopen(path.c_str(), "w");
        if (!f)
            return false;
        std::fprintf(f, "# generated grid, %u triangles\n", grid.TriangleCount());
        for (uint32_t v = 0; v < grid.VertexCount(); ++v)
        {
            float p[3];
            grid.Position(v, p);
            std::fprintf(f, "v %f %f %f\n", p[0], p[1], p[2]);
        }
        for (uint32_t v = 0; v < grid.VertexCount(); ++v)
        {
            float p[3];
            grid.Position(v, p);
            std::fprintf(f, "vt %f %f\n", p[0] / float(grid.columns), p[1] / float(grid.columns));
        }
        std::fprintf(f, "vn 0 0 1\n");
        for (uint32_t t = 0; t < grid.TriangleCount(); ++t)
        {
            uint32_t c[3];
            grid.Triangle(t, c);
            std::fprintf(f, "f %u/%u/1 %u/%u/1 %u/%u/1\n", c[0] + 1, c[0] + 1, c[1] + 1, c[1] + 1, c[2] + 1, c[2] + 1);
        }
        return std::fclose(f) == 0;
    }

    bool WriteBinary(const Grid& grid, const std::string& path)
    {
        FILE* f = std::fopen(path.c_str(), "wb");
        if (!f)
            return false;
        const float params[4] = {0.08f, 0.15f, 88.0f, 1.0f / 256.0f};
        const uint32_t header[5] = {0, grid.VertexCount(), grid.TriangleCount(), 0, 0};
        std::fwrite(params, 4, 4, f);
        std::fwrite(header, 4, 5, f);
        std::vector<float> positions(3 * (size_t)grid.VertexCount());
        for (uint32_t v = 0; v < grid.VertexCount(); ++v)
            grid.Position(v, &positions[3 * (size_t)v]);
        std::vector<uint32_t> indices(3 * (size_t)grid.TriangleCount());
        for (uint32_t t = 0; t < grid.TriangleCount(); ++t)
            grid.Triangle(t, &indices[3 * (size_t)t]);
        std::fwrite(positions.data(), 4, positions.size(), f);
        std::fwrite(indices.data(), 4, indices.size(), f);
        return std::fclose(f) == 0;
    }

    double Median(std::vector<double> values)
    {
        if (values.empty())
            return 0;
        std::sort(values.begin(), values.end());
        return values[values.size() / 2];
    }

    // The number after `label` in ChartBake's timing report, or -1.
    double Field(const std::string& report, const std::string& label)
    {
        size_t at = report.find(label);
        return at == std::string::npos ? -1 : std::atof(report.c_str() + at + label.size());
    }

    void TimeRuns(const std::string& dir, const std::vector<std::string>& args, int runs, double inputBytes, double meshBytes,
                  double outputBytes)
    {
        const std::string chartBake = std::string(CHARTBAKE_BIN_DIR) + "/ChartBake";
        std::vector<std::string> argv = {chartBake};
        argv.insert(argv.end(), args.begin(), args.end());
        std::vector<double> readRates, memoryRatios, wholeRatios, withOutputRatios;
        for (int run = 0; run < runs; ++run)
        {
            auto start = std::chrono::steady_clock::now();
            Testing::ChildResult r = Testing::RunProgram(argv, dir, {"CHARTBAKE_TIMINGS=1"});
            double ms = std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start).count();
            std::printf("  run %d: %8.1f ms total, exit %d\n    %s", run + 1, ms, r.exitStatus, r.err.c_str());
            size_t memoryLine = r.err.find("peak memory");
            double readMs = Field(r.err, ", read ");
            double readKB = memoryLine == std::string::npos ? -1 : Field(r.err.substr(memoryLine), ", read ");
            if (readMs > 0)
                readRates.push_back(inputBytes / 1e6 / (readMs / 1e3));
            double wholeKB = memoryLine == std::string::npos ? -1 : Field(r.err.substr(memoryLine), ", write ");
            if (readKB > 0)
                memoryRatios.push_back(readKB * 1024.0 / meshBytes);
            if (wholeKB > 0)
            {
                wholeRatios.push_back(wholeKB * 1024.0 / meshBytes);
                withOutputRatios.push_back(wholeKB * 1024.0 / (meshBytes + outputBytes));
            }
        }
        std::printf("  median read: %.0f MB/s; median peak memory after reading / mesh data (%.1f MB): %.2f\n",
                    Median(readRates), meshBytes / 1e6, Median(memoryRatios));
        std::printf("  median whole-run peak memory / mesh data: %.2f; / (mesh data + output UVs, %.1f MB): %.2f\n",
                    Median(wholeRatios), (meshBytes + outputBytes) / 1e6, Median(withOutputRatios));
    }

    // LoadFromObj against ReadObjWithScanf, bit for bit, under the driver's rounding toward zero.
    void CompareWithFormattedInput(const std::string& path)
    {
        unsigned saved = _mm_getcsr();
        _mm_setcsr((saved | 0x6000u) & ~0x8000u);
        UnwrapParam param;
        uint32_t vertexCount = 0, triCount = 0;
        float *vertex = nullptr, *uv = nullptr;
        uint32_t *tri = nullptr, *srcPoly = nullptr;
        MeshFileError error = LoadFromObj(path.c_str(), &param, &vertexCount, &triCount, &vertex, &uv, &tri, &srcPoly);
        ObjScanfReference ref;
        bool read = ReadObjWithScanf(path, &ref);
        _mm_setcsr(saved);
        bool same = error.empty() && read && ref.positions.size() == 3ull * vertexCount && ref.tri.size() == 3ull * triCount &&
                    std::memcmp(ref.positions.data(), vertex, ref.positions.size() * 4) == 0 &&
                    std::memcmp(ref.tri.data(), tri, ref.tri.size() * 4) == 0 &&
                    std::memcmp(ref.cornerUVs.data(), uv, ref.cornerUVs.size() * 4) == 0;
        std::printf("LoadFromObj vs fgets+sscanf: %s (%zu position floats, %zu corner UV floats, %zu indices)%s%s\n",
                    same ? "bit-identical" : "DIFFERENT", ref.positions.size(), ref.cornerUVs.size(), ref.tri.size(),
                    error.empty() ? "" : ": ", error.c_str());
        std::free(vertex);
        std::free(uv);
        std::free(tri);
    }
}

int main(int argc, char** argv)
{
    uint32_t triangles = 1000000;
    int runs = 3;
    std::string keepDir;
    for (int i = 1, positional = 0; i < argc; ++i)
    {
        if (std::strcmp(argv[i], "-keep") == 0 && i + 1 < argc)
            keepDir = argv[++i];
        else if (positional++ == 0)
            triangles = (uint32_t)std::strtoul(argv[i], nullptr, 10);
        else
            runs = std::atoi(argv[i]);
    }
    Grid grid{(uint32_t)std::ceil(std::sqrt(triangles / 2.0))};
    std::string dir = keepDir;
    if (dir.empty())
    {
        char pattern[] = "/tmp/chartbake-bench-XXXXXX";
        dir = mkdtemp(pattern);
    }
    std::filesystem::create_directories(dir);
    std::printf("mesh: %u vertices, %u triangles, in %s\n", grid.VertexCount(), grid.TriangleCount(), dir.c_str());
    if (!WriteObj(grid, dir + "/mesh.obj") || !WriteBinary(grid, dir + "/mesh.bin"))
    {
        std::fprintf(stderr, "cannot write the mesh files into %s\n", dir.c_str());
        return 1;
    }
    CompareWithFormattedInput(dir + "/mesh.obj");
    const double objBytes = (double)std::filesystem::file_size(dir + "/mesh.obj");
    const double binBytes = (double)std::filesystem::file_size(dir + "/mesh.bin");
    const double positionAndTriangleBytes = 12.0 * grid.VertexCount() + 12.0 * grid.TriangleCount();
    std::printf("OBJ (%.1f MB in):\n", objBytes / 1e6);
    const double uvBytes = 24.0 * grid.TriangleCount();
    TimeRuns(dir, {"-obj", "mesh.obj", "out.obj"}, runs, objBytes, positionAndTriangleBytes + uvBytes, uvBytes);
    std::printf("binary (%.1f MB in):\n", binBytes / 1e6);
    TimeRuns(dir, {"mesh.bin", "out.bin"}, runs, binBytes, positionAndTriangleBytes, uvBytes);
    if (keepDir.empty())
        std::filesystem::remove_all(dir);
    return 0;
}
