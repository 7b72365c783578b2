// A fresh directory under $TMPDIR (/tmp when unset) for one test, removed with everything in it
// when the test ends.
// End-to-end tests write their input files here and run the programs with it as the working
// directory, so that nothing of a run is left behind.
#pragma once

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <stdexcept>
#include <string>

namespace Testing
{
    class TemporaryDirectory
    {
    public:
        // `prefix` names the directory ("<tmp>/<prefix>-XXXXXX") so that a leftover shows its
        // owner. A test run killed half-way leaves its directories behind; a harness that kills
        // runs on purpose sets TMPDIR to a folder of its own and empties it.
        explicit TemporaryDirectory(const std::string& prefix)
        {
            const char* base = std::getenv("TMPDIR");
            std::string pattern = std::string(base && *base ? base : "/tmp") + "/" + prefix + "-XXXXXX";
            if (!mkdtemp(pattern.data()))
                throw std::runtime_error("could not create a temporary directory " + pattern);
            dir = pattern;
        }
        ~TemporaryDirectory()
        {
            std::error_code ignored;
            std::filesystem::remove_all(dir, ignored);
        }
        TemporaryDirectory(const TemporaryDirectory&) = delete;
        TemporaryDirectory& operator=(const TemporaryDirectory&) = delete;

        std::string PathOf(const std::string& name) const { return dir + "/" + name; }
        bool Exists(const std::string& name) const { return std::filesystem::exists(PathOf(name)); }

        // Writes `bytes` to `name`, creating the folders on its path.
        void Write(const std::string& name, const std::string& bytes) const
        {
            std::filesystem::create_directories(std::filesystem::path(PathOf(name)).parent_path());
            std::ofstream(PathOf(name), std::ios::binary) << bytes;
        }
        // The whole file, or "" when it cannot be read.
        std::string Read(const std::string& name) const
        {
            std::ifstream in(PathOf(name), std::ios::binary);
            std::ostringstream text;
            text << in.rdbuf();
            return text.str();
        }

        std::string dir;
    };
}
