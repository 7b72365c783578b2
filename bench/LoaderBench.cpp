// Load time of a fixture DLL: loads and frees Bound.dll (imports bound through the global table
// and stubs, one stub area, export directory) many times and prints the median load time, from
// memory and from its file.
//     LoaderBench [loads]
#include <stdio.h>
#include <stdlib.h>

#include <algorithm>
#include <chrono>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "Editor/Tools/Quillet/quillet_PELoader.h"

namespace
{
    template <typename LoadFn>
    double MedianLoadMicroseconds(int loads, LoadFn load)
    {
        std::vector<double> times;
        times.reserve(loads);
        for (int i = 0; i < loads; ++i)
        {
            const auto start = std::chrono::steady_clock::now();
            PEModule* module = load();
            const auto end = std::chrono::steady_clock::now();
            if (!module)
                return -1.0;
            PEFreeLibrary(module);
            times.push_back(std::chrono::duration<double, std::micro>(end - start).count());
        }
        std::nth_element(times.begin(), times.begin() + loads / 2, times.end());
        return times[loads / 2];
    }
}

int main(int argc, char** argv)
{
    const int loads = argc > 1 ? std::max(1, atoi(argv[1])) : 2000;
    const std::string path = std::string(CHARTBAKE_FIXTURE_DIR) + "/Bound.dll";
    std::ifstream in(path, std::ios::binary);
    const std::vector<char> bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    const char* error = nullptr;
    PEModule* probe = PELoadLibrary(path.c_str(), nullptr, 0, &error);
    if (!probe)
    {
        fprintf(stderr, "cannot load %s: %s\n", path.c_str(), error ? error : "?");
        return 1;
    }
    PEFreeLibrary(probe);

    const double fromMemory = MedianLoadMicroseconds(loads, [&] {
        return PELoadLibrary(bytes.data(), bytes.size(), nullptr, 0, nullptr);
    });
    const double fromFile = MedianLoadMicroseconds(loads, [&] {
        return PELoadLibrary(path.c_str(), nullptr, 0, nullptr);
    });
    printf("Bound.dll (%zu bytes), %d loads each\n", bytes.size(), loads);
    printf("median load from memory: %.2f us\n", fromMemory);
    printf("median load from file:   %.2f us\n", fromFile);
    return fromMemory < 0 || fromFile < 0;
}
