// Quality and speed of the bundled unwrapper on real and generated meshes: the real ChartBake
// with its libraries unwraps each mesh with the default parameters (packMargin 1/256), timed
// (median of several runs), with its peak memory, and the layout is measured with uvstat's
// library (the same code as bin/uvstat). One row a mesh, then the medians.
//
//   UnwrapQualityBench [-runs <n>] [-no-large] [-bin <dir>] [mesh.off ...]
//
// OFF files (polygons are split into fans) are added to the generated meshes: torus and sphere
// at about 10k, 100k and 1M triangles (-no-large leaves out the 1M ones). -bin runs the ChartBake
// (and libraries) of another build, for instance a copy kept from before a change.
//
// Memory: the peak resident memory of the ChartBake run minus that of a run on a one-triangle
// mesh (the program, its libraries, and the unwrapper's fixed costs, mostly packing's bitmaps;
// the header also gives an empty mesh's run, which never calls the unwrapper), in two ratios:
//   mem/x  over the mesh's input arrays, 12 V + 12 T bytes (positions, indices);
//   io/x   over the input and the output arrays, 12 V + 36 T bytes (the output holds 6 floats a
//          triangle). ChartBake holds both while the library runs, so io/x - 1 is the
//          unwrapper's own working memory over the arrays it reads and writes.
// On small meshes the runs' noise and the fixed costs outweigh the arrays: ratios there can come
// out below 1, even negative.
// bench/quality-meshes.sh fetches the Debian libcgal-demo meshes and runs this.
#include "Editor/Tools/Unwrap/source/UVStat/TestMeshes.h"
#include "Editor/Tools/Unwrap/source/UVStat/UVStat.h"

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <sstream>
#include <string>
#include <fcntl.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>
#include <vector>

namespace
{
    struct NamedMesh
    {
        std::string name;
        UVStat::TestMesh mesh;
    };

    // An OFF file: "OFF", counts, vertex lines, face lines "n i0 i1 ... " (fans for n > 3).
    bool ReadOff(const std::string& path, UVStat::TestMesh* mesh)
    {
        std::ifstream in(path);
        std::string word;
        size_t vertices = 0, faces = 0, edges = 0;
        if (!(in >> word) || word.find("OFF") == std::string::npos || !(in >> vertices >> faces >> edges))
            return false;
        for (size_t v = 0; v < vertices; ++v)
        {
            double x, y, z;
            if (!(in >> x >> y >> z))
                return false;
            mesh->Add(x, y, z);
            std::string rest;
            std::getline(in, rest);   // optional colours
        }
        for (size_t f = 0; f < faces; ++f)
        {
            size_t n;
            if (!(in >> n) || n < 3)
                return false;
            std::vector<uint32_t> corner(n);
            for (uint32_t& c : corner)
                if (!(in >> c) || c >= vertices)
                    return false;
            for (size_t k = 1; k + 1 < n; ++k)
                mesh->Face(corner[0], corner[k], corner[k + 1]);
            std::string rest;
            std::getline(in, rest);
        }
        return true;
    }

    std::string g_BinDir = CHARTBAKE_BIN_DIR;

    struct RunResult
    {
        bool ok = false;
        double seconds = 0;
        long peakKilobytes = 0;
        std::string output;
    };

    // Runs ChartBake in `dir` and waits for it, with its own peak resident memory.
    RunResult SpawnChartBake(const std::string& dir)
    {
        RunResult result;
        std::string log = dir + "/chartbake.log";
        posix_spawn_file_actions_t actions;
        posix_spawn_file_actions_init(&actions);
        posix_spawn_file_actions_addchdir_np(&actions, dir.c_str());
        posix_spawn_file_actions_addopen(&actions, 1, log.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
        std::string program = g_BinDir + "/ChartBake";
        char* args[] = {program.data(), const_cast<char*>("mesh.bin"), const_cast<char*>("out.bin"), nullptr};
        auto start = std::chrono::steady_clock::now();
        pid_t child = 0;
        int spawned = posix_spawn(&child, program.c_str(), &actions, nullptr, args, environ);
        posix_spawn_file_actions_destroy(&actions);
        if (spawned != 0)
            return result;
        int status = 0;
        struct rusage usage = {};
        wait4(child, &status, 0, &usage);
        result.seconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
        result.peakKilobytes = usage.ru_maxrss;
        result.ok = WIFEXITED(status) && WEXITSTATUS(status) == 0;
        std::ifstream text(log);
        result.output.assign(std::istreambuf_iterator<char>(text), std::istreambuf_iterator<char>());
        return result;
    }

    // ChartBake is started from a small helper process forked before any mesh is loaded: a
    // child's peak memory counts the memory of the process it was spawned from, so spawning
    // from this (by then large) process would report this process's size.
    struct Spawner
    {
        int request[2] = {-1, -1}, reply[2] = {-1, -1};
        pid_t child = -1;

        void Start()
        {
            if (pipe(request) != 0 || pipe(reply) != 0)
                std::exit(1);
            child = fork();
            if (child == 0)
            {
                close(request[1]), close(reply[0]);
                FILE* in = fdopen(request[0], "r");
                FILE* out = fdopen(reply[1], "w");
                char dir[4096];
                while (in && out && std::fgets(dir, sizeof dir, in))
                {
                    dir[std::strcspn(dir, "\n")] = 0;
                    RunResult r = SpawnChartBake(dir);
                    std::fprintf(out, "%d %.9f %ld\n", r.ok ? 1 : 0, r.seconds, r.peakKilobytes);
                    std::fflush(out);
                }
                _exit(0);
            }
            close(request[0]), close(reply[1]);
        }

        // Ends the helper: it sees the end of its requests.
        void Stop()
        {
            close(request[1]);
            waitpid(child, nullptr, 0);
        }

        RunResult Run(const std::string& dir)
        {
            RunResult result;
            std::string line = dir + "\n";
            char answer[128] = {};
            int ok = 0;
            if (write(request[1], line.data(), line.size()) != (ssize_t)line.size() || read(reply[0], answer, sizeof answer - 1) <= 0 ||
                std::sscanf(answer, "%d %lf %ld", &ok, &result.seconds, &result.peakKilobytes) != 3)
                return result;
            result.ok = ok != 0;
            std::ifstream text(dir + "/chartbake.log");
            result.output.assign(std::istreambuf_iterator<char>(text), std::istreambuf_iterator<char>());
            return result;
        }
    };

    Spawner g_Spawner;

    RunResult RunChartBake(const std::string& dir) { return g_Spawner.Run(dir); }

    double Median(std::vector<double> values)
    {
        if (values.empty())
            return 0;
        std::sort(values.begin(), values.end());
        size_t n = values.size();
        return n % 2 ? values[n / 2] : 0.5 * (values[n / 2 - 1] + values[n / 2]);
    }

    struct Row
    {
        std::string name;
        uint32_t triangles = 0;
        bool unwrapped = false;
        UVStat::Report report;
        double secondsPer100k = 0, peakMegabytes = 0, memoryRatio = 0, inOutRatio = 0;
    };

    Row Measure(const NamedMesh& m, const std::string& dir, int runs, long baselineKilobytes)
    {
        Row row;
        row.name = m.name;
        row.triangles = m.mesh.TriCount();
        UVStat::WriteBinaryMeshFile(dir + "/mesh.bin", m.mesh);
        std::vector<double> seconds;
        long peak = 0;
        for (int r = 0; r < runs; ++r)
        {
            RunResult run = RunChartBake(dir);
            if (!run.ok)
            {
                std::fprintf(stderr, "%s: ChartBake failed: %s\n", m.name.c_str(), run.output.c_str());
                return row;
            }
            seconds.push_back(run.seconds);
            peak = std::max(peak, run.peakKilobytes);
        }
        std::ifstream in(dir + "/out.bin", std::ios::binary);
        std::string bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
        if (bytes.size() != 24ull * row.triangles)
            return row;
        std::vector<float> uv(6ull * row.triangles);
        std::memcpy(uv.data(), bytes.data(), bytes.size());
        row.unwrapped = true;
        row.report = UVStat::Measure({m.mesh.positions.data(), m.mesh.VertexCount(), m.mesh.tri.data(), row.triangles, uv.data()},
                                     1.0 / 256);
        row.secondsPer100k = Median(seconds) * 1e5 / std::max(1u, row.triangles);
        row.peakMegabytes = peak / 1024.0;
        double meshBytes = 12.0 * m.mesh.VertexCount() + 12.0 * row.triangles;
        row.memoryRatio = (peak - baselineKilobytes) * 1024.0 / meshBytes;
        row.inOutRatio = (peak - baselineKilobytes) * 1024.0 / (meshBytes + 24.0 * row.triangles);
        return row;
    }

    void PrintHeader()
    {
        std::printf("%-22s %8s %6s %6s %6s %7s %7s %7s %8s %7s %7s %9s %8s %7s %6s %5s\n", "mesh", "tris", "charts", "util",
                    "vsplit", "L2", "Linf", "angle", "areaDist", "overlap", "margin", "s/100k", "peakMB", "mem/x", "io/x", "valid");
    }

    void PrintRow(const Row& r)
    {
        if (!r.unwrapped)
        {
            std::printf("%-22s %8u  unwrap failed\n", r.name.c_str(), r.triangles);
            return;
        }
        const UVStat::Validity& v = r.report.validity;
        const UVStat::Quality& q = r.report.quality;
        std::printf("%-22s %8u %6u %6.3f %6.3f %7.4f %7.3f %7.4f %8.4f %7llu %7llu %9.3f %8.1f %7.2f %6.2f %5s\n", r.name.c_str(),
                    r.triangles, q.charts, q.utilization, q.vertexSplit, q.l2Stretch, q.lInfStretch, q.angleDistortion,
                    q.chartAreaDistortion, (unsigned long long)(v.overlapPairsBetweenCharts + v.overlapPairsInsideCharts),
                    (unsigned long long)(v.marginViolations + v.borderViolations), r.secondsPer100k, r.peakMegabytes,
                    r.memoryRatio, r.inOutRatio, r.report.Valid() ? "yes" : "NO");
    }

    void PrintMedians(const std::vector<Row>& rows)
    {
        auto median = [&rows](auto field) {
            std::vector<double> values;
            for (const Row& r : rows)
                if (r.unwrapped)
                    values.push_back(field(r));
            return Median(values);
        };
        size_t valid = 0, failed = 0;
        for (const Row& r : rows)
            valid += r.unwrapped && r.report.Valid(), failed += !r.unwrapped;
        std::printf("%-22s %8s %6.1f %6.3f %6.3f %7.4f %7.3f %7.4f %8.4f %7.0f %7.0f %9.3f %8.1f %7.2f %6.2f %zu/%zu\n", "MEDIAN", "",
                    median([](const Row& r) { return double(r.report.quality.charts); }),
                    median([](const Row& r) { return r.report.quality.utilization; }),
                    median([](const Row& r) { return r.report.quality.vertexSplit; }),
                    median([](const Row& r) { return r.report.quality.l2Stretch; }),
                    median([](const Row& r) { return r.report.quality.lInfStretch; }),
                    median([](const Row& r) { return r.report.quality.angleDistortion; }),
                    median([](const Row& r) { return r.report.quality.chartAreaDistortion; }),
                    median([](const Row& r) {
                        return double(r.report.validity.overlapPairsBetweenCharts + r.report.validity.overlapPairsInsideCharts);
                    }),
                    median([](const Row& r) { return double(r.report.validity.marginViolations + r.report.validity.borderViolations); }),
                    median([](const Row& r) { return r.secondsPer100k; }), median([](const Row& r) { return r.peakMegabytes; }),
                    median([](const Row& r) { return r.memoryRatio; }), median([](const Row& r) { return r.inOutRatio; }), valid,
                    rows.size());
        if (failed)
            std::printf("%zu mesh(es) failed to unwrap\n", failed);
    }
}

int main(int argc, char** argv)
{
    int runs = 3;
    bool large = true;
    std::vector<std::string> files;
    for (int i = 1; i < argc; ++i)
    {
        std::string arg = argv[i];
        if (arg == "-runs" && i + 1 < argc)
            runs = std::max(1, std::atoi(argv[++i]));
        else if (arg == "-no-large")
            large = false;
        else if (arg == "-bin" && i + 1 < argc)
            g_BinDir = argv[++i];
        else
            files.push_back(arg);
    }
    g_Spawner.Start();   // before any mesh is loaded (Spawner)

    std::vector<NamedMesh> meshes;
    for (const std::string& path : files)
    {
        NamedMesh m{std::filesystem::path(path).stem().string(), {}};
        if (!ReadOff(path, &m.mesh))
        {
            std::fprintf(stderr, "cannot read %s as an OFF mesh\n", path.c_str());
            return 1;
        }
        meshes.push_back(std::move(m));
    }
    // About 2 n^2 triangles each.
    const uint32_t sizes[3] = {71, 224, 708};
    for (int s = 0; s < (large ? 3 : 2); ++s)
    {
        uint32_t n = sizes[s];
        const char* scale = s == 0 ? "10k" : (s == 1 ? "100k" : "1M");
        meshes.push_back({std::string("torus-") + scale, UVStat::Torus(2 * n, n / 2)});
        meshes.push_back({std::string("sphere-") + scale, UVStat::Sphere(n, 2 * n)});
    }

    char pattern[] = "/tmp/unwrap-quality-XXXXXX";
    std::string dir = mkdtemp(pattern);
    // ChartBake's own footprint, on a one-triangle mesh, is left out of the memory ratios; an
    // empty mesh's run shows how much of it is the unwrapper's fixed costs.
    UVStat::WriteBinaryMeshFile(dir + "/mesh.bin", UVStat::TestMesh());
    long empty = RunChartBake(dir).peakKilobytes;
    UVStat::TestMesh tiny;
    tiny.Face(tiny.Add(0, 0, 0), tiny.Add(1, 0, 0), tiny.Add(0, 1, 0));
    UVStat::WriteBinaryMeshFile(dir + "/mesh.bin", tiny);
    long baseline = RunChartBake(dir).peakKilobytes;

    std::printf("%s/ChartBake, default parameters (packMargin 1/256), median of %d runs; memory = peak RSS - %.1f MB (a "
                "one-triangle mesh's; an empty mesh's: %.1f MB); mem/x = memory / (12 V + 12 T bytes: input), io/x = "
                "memory / (12 V + 36 T bytes: input and output)\n",
                g_BinDir.c_str(), runs, baseline / 1024.0, empty / 1024.0);
    PrintHeader();
    std::vector<Row> rows;
    for (const NamedMesh& m : meshes)
    {
        rows.push_back(Measure(m, dir, runs, baseline));
        PrintRow(rows.back());
        std::fflush(stdout);
    }
    PrintMedians(rows);
    g_Spawner.Stop();
    std::filesystem::remove_all(dir);
    return 0;
}
