// The formatter behind the DLLs' sprintf_s and _vsnprintf against the host snprintf on the same
// formats and values, and the cost of a call from Windows-convention code into a host function,
// each printed as a ratio.
//     FormatterBench [iterations]
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

#include <algorithm>
#include <bit>
#include <chrono>
#include <vector>

#include "Editor/Tools/Quillet/quillet_KnownImports.h"

namespace
{
    typedef int(__attribute__((ms_abi)) * VsnprintfFn)(char*, unsigned long, const char*, char*);
    typedef unsigned int(__attribute__((ms_abi)) * LeafFn)();
    typedef int(__attribute__((ms_abi)) * CompareFn)(const char*, const char*);

    void* FindImport(const char* name)
    {
        for (int32_t i = 0; i < kQuilletKnownImportsCount; ++i)
            if (strcmp(kQuilletKnownImports[i].name, name) == 0)
                return kQuilletKnownImports[i].func;
        return nullptr;
    }

    // Nanoseconds per iteration of `body`, the best of five rounds.
    template<typename Body>
    double NanosecondsPerCall(int iterations, Body body)
    {
        double best = 1e300;
        for (int round = 0; round < 5; ++round)
        {
            const auto start = std::chrono::steady_clock::now();
            for (int i = 0; i < iterations; ++i)
                body();
            const auto end = std::chrono::steady_clock::now();
            best = std::min(best, std::chrono::duration<double, std::nano>(end - start).count() / iterations);
        }
        return best;
    }

    struct FormatCase
    {
        const char* name;
        const char* format;
        std::vector<uint64_t> slots;  // the same values as a Windows argument list
        int (*host)(char*, size_t, const char*);
    };

    uint64_t D(double value) { return std::bit_cast<uint64_t>(value); }

    const char kName[] = "vertex";
    const FormatCase kCases[] = {
        {"integer", "%d", {uint64_t(-123456)}, [](char* b, size_t n, const char* f) { return snprintf(b, n, f, -123456); }},
        {"hex and padding", "%08x|%-6u|%+5d", {0xBEEF, 42, 7},
         [](char* b, size_t n, const char* f) { return snprintf(b, n, f, 0xBEEF, 42u, 7); }},
        {"string", "%s: %10s", {reinterpret_cast<uint64_t>(kName), reinterpret_cast<uint64_t>(kName)},
         [](char* b, size_t n, const char* f) { return snprintf(b, n, f, kName, kName); }},
        {"double", "%f", {D(3.14159265)}, [](char* b, size_t n, const char* f) { return snprintf(b, n, f, 3.14159265); }},
        {"mesh line", "v %f %f %f", {D(0.125), D(-17.5), D(1024.0625)},
         [](char* b, size_t n, const char* f) { return snprintf(b, n, f, 0.125, -17.5, 1024.0625); }},
    };

    unsigned int PlainLeaf() { return 0; }
}

int main(int argc, char** argv)
{
    const int iterations = argc > 1 ? std::max(1, atoi(argv[1])) : 200000;
    VsnprintfFn formatter = reinterpret_cast<VsnprintfFn>(FindImport("_vsnprintf"));
    LeafFn getLastError = reinterpret_cast<LeafFn>(FindImport("GetLastError"));
    CompareFn windowsStrcmp = reinterpret_cast<CompareFn>(FindImport("strcmp"));
    if (!formatter || !getLastError || !windowsStrcmp)
    {
        fprintf(stderr, "the known-import table lacks a benchmarked name\n");
        return 1;
    }

    char buffer[256];
    printf("Formatter against host snprintf, %d calls each (ratio > 1: the formatter is slower)\n", iterations);
    printf("  %-16s %12s %12s %8s\n", "format", "formatter ns", "snprintf ns", "ratio");
    for (const FormatCase& c : kCases)
    {
        char* args = reinterpret_cast<char*>(const_cast<uint64_t*>(c.slots.data()));
        const double ours = NanosecondsPerCall(iterations, [&] { formatter(buffer, sizeof buffer, c.format, args); });
        const double host = NanosecondsPerCall(iterations, [&] { c.host(buffer, sizeof buffer, c.format); });
        printf("  %-16s %12.1f %12.1f %8.2f\n", c.name, ours, host, ours / host);
    }

    // Every function is called through a volatile pointer, reloaded each time, so that neither
    // side is inlined or hoisted.
    volatile LeafFn windowsLeafFn = getLastError;
    volatile CompareFn windowsCompareFn = windowsStrcmp;
    unsigned int (*volatile plainLeaf)() = &PlainLeaf;
    int (*volatile hostStrcmp)(const char*, const char*) = &strcmp;
    volatile unsigned int sink = 0;
    const double windowsLeaf = NanosecondsPerCall(iterations * 10, [&] { sink = sink + windowsLeafFn(); });
    const double hostLeaf = NanosecondsPerCall(iterations * 10, [&] { sink = sink + plainLeaf(); });
    const double windowsCompare = NanosecondsPerCall(iterations * 10, [&] { sink = sink + windowsCompareFn("abcdef", "abcdeg"); });
    const double hostCompare = NanosecondsPerCall(iterations * 10, [&] { sink = sink + hostStrcmp("abcdef", "abcdeg"); });
    printf("Call into a host function (ratio: Windows-convention call over a plain host call)\n");
    printf("  %-34s %8.2f ns  plain %8.2f ns  ratio %5.2f\n", "leaf (GetLastError)", windowsLeaf, hostLeaf, windowsLeaf / hostLeaf);
    printf("  %-34s %8.2f ns  plain %8.2f ns  ratio %5.2f\n", "calling the C library (strcmp)", windowsCompare, hostCompare,
           windowsCompare / hostCompare);
    return 0;
}
