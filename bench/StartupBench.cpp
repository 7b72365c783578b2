// Start-up cost of a whole tool run: times `ChartBake -obj examples/sample.obj <out>` (both DLLs
// loaded, a 4-triangle unwrap, the output written) against empty programs: with the C++ runtime
// loaded, with the shared libraries the tool itself loads (C++ runtime and UnitTest++), and with
// libc alone. All run in turn in one loop; prints the medians and the tool's ratio to each.
//     StartupBench [runs=300]
#include <stdio.h>
#include <stdlib.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <string>
#include <vector>

namespace
{
    struct RunTime
    {
        double wall = -1.0;  // microseconds from fork to reaping; -1 when the run failed
        double cpu = -1.0;   // user + system time of the child, microseconds
    };

    // Runs `argv` in `dir` with its output discarded.
    RunTime Run(const std::string& dir, const std::vector<std::string>& args)
    {
        std::vector<char*> argv;
        for (const std::string& a : args)
            argv.push_back(const_cast<char*>(a.c_str()));
        argv.push_back(nullptr);
        const auto start = std::chrono::steady_clock::now();
        const pid_t pid = fork();
        if (pid == 0)
        {
            if (chdir(dir.c_str()) != 0 || !freopen("/dev/null", "w", stdout))
                _exit(126);
            execv(argv[0], argv.data());
            _exit(127);
        }
        int status = 0;
        rusage usage{};
        if (pid < 0 || wait4(pid, &status, 0, &usage) != pid || !WIFEXITED(status) || WEXITSTATUS(status) != 0)
            return {};
        const auto micros = [](const timeval& t) { return 1e6 * double(t.tv_sec) + double(t.tv_usec); };
        return {std::chrono::duration<double, std::micro>(std::chrono::steady_clock::now() - start).count(),
                micros(usage.ru_utime) + micros(usage.ru_stime)};
    }

    // The wall and CPU times of one program over all runs.
    struct Series
    {
        const char* label;
        std::vector<std::string> args;
        std::vector<double> wall, cpu;

        bool Add(const RunTime& t)
        {
            wall.push_back(t.wall);
            cpu.push_back(t.cpu);
            return t.wall >= 0;
        }
    };

    double Median(std::vector<double> values)
    {
        std::nth_element(values.begin(), values.begin() + values.size() / 2, values.end());
        return values[values.size() / 2];
    }
}

int main(int argc, char** argv)
{
    const int runs = argc > 1 ? std::max(1, atoi(argv[1])) : 300;
    const std::string bin = CHARTBAKE_BIN_DIR;
    const std::string sample = std::string(CHARTBAKE_SOURCE_DIR) + "/examples/sample.obj";
    char scratch[] = "/tmp/StartupBenchXXXXXX";
    if (!mkdtemp(scratch))
        return 1;
    const std::string out = std::string(scratch) + "/out.obj";
    const std::vector<std::string> tool = {bin + "/ChartBake", "-obj", sample, out};
    const std::vector<std::string> empty = {STARTUP_BENCH_EMPTY_PROGRAM};
    const std::vector<std::string> toolLibraries = {STARTUP_BENCH_EMPTY_TOOL_LIBRARIES_PROGRAM};
    const std::vector<std::string> libcOnly = {STARTUP_BENCH_EMPTY_LIBC_PROGRAM};

    Series series[] = {{"ChartBake -obj examples/sample.obj", tool, {}, {}},
                       {"empty C++ program", empty, {}, {}},
                       {"empty program, the tool's libraries", toolLibraries, {}, {}},
                       {"empty program, libc only", libcOnly, {}, {}}};
    bool ok = true;
    for (int i = 0; i < runs && ok; ++i)
    {
        // A fresh output each time: truncating a file that holds data makes ext4 flush it on close,
        // which would time the disk rather than the tool.
        unlink(out.c_str());
        for (Series& s : series)
            ok = s.Add(Run(bin, s.args)) && ok;
    }
    std::filesystem::remove_all(scratch);
    if (!ok)
    {
        fprintf(stderr, "a run failed: %s\n", tool[0].c_str());
        return 1;
    }
    printf("%d runs each, in turn; medians of wall time and of the child's CPU time (user + system)\n", runs);
    for (const Series& s : series)
        printf("  %-36s wall %6.0f us   cpu %6.0f us\n", s.label, Median(s.wall), Median(s.cpu));
    for (int base = 1; base < 4; ++base)
        printf("ratio ChartBake / %s: wall %.2f, cpu %.2f\n", series[base].label,
               Median(series[0].wall) / Median(series[base].wall), Median(series[0].cpu) / Median(series[base].cpu));
    return 0;
}
