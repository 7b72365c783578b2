// Times whole ChartBake runs on a generated mesh of about one million triangles, in both file
// formats, and shows where the time goes (ChartBake reports its phases with CHARTBAKE_TIMINGS).
//
//   ChartBakeBench [triangles=1000000] [runs=3] [-keep <dir>]
//
// The mesh is a wavy grid of quads, two triangles each; it is written to a temporary directory
// (or <dir> with -keep, which also keeps it) as mesh.obj (vertex/uv/normal faces) and mesh.bin.
#include "Runtime/Testing/ChildProcess.h"

#include <chrono>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <string>
#include <vector>

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

    void TimeRuns(const std::string& dir, const std::vector<std::string>& args, int runs)
    {
        const std::string chartBake = std::string(CHARTBAKE_BIN_DIR) + "/ChartBake";
        std::vector<std::string> argv = {chartBake};
        argv.insert(argv.end(), args.begin(), args.end());
        for (int run = 0; run < runs; ++run)
        {
            auto start = std::chrono::steady_clock::now();
            Testing::ChildResult r = Testing::RunProgram(argv, dir, {"CHARTBAKE_TIMINGS=1"});
            double ms = std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start).count();
            std::printf("  run %d: %8.1f ms total, exit %d\n    %s", run + 1, ms, r.exitStatus, r.err.c_str());
        }
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
    std::printf("OBJ (%.1f MB in):\n", std::filesystem::file_size(dir + "/mesh.obj") / 1e6);
    TimeRuns(dir, {"-obj", "mesh.obj", "out.obj"}, runs);
    std::printf("binary (%.1f MB in):\n", std::filesystem::file_size(dir + "/mesh.bin") / 1e6);
    TimeRuns(dir, {"mesh.bin", "out.bin"}, runs);
    if (keepDir.empty())
        std::filesystem::remove_all(dir);
    return 0;
}
