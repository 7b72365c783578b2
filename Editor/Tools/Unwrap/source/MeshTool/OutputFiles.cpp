#include "Editor/Tools/Unwrap/source/MeshTool/OutputFiles.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <sys/stat.h>
#include <unistd.h>

namespace fs = std::filesystem;

namespace
{
    // Writes `bytes` to a new temporary file in the directory of `target`; answers its name, or
    // empty with `error` set.
    std::string WriteTemporary(const std::string& target, const std::string& bytes, std::string* error)
    {
        fs::path dir = fs::path(target).parent_path();
        std::string pattern = (dir.empty() ? std::string(".") : dir.string()) + "/." +
                              fs::path(target).filename().string() + ".tmp-XXXXXX";
        std::vector<char> name(pattern.begin(), pattern.end());
        name.push_back('\0');
        int fd = mkstemp(name.data());
        if (fd < 0)
        {
            *error = "cannot write " + target + ": " + std::strerror(errno);
            return "";
        }
        size_t done = 0;
        while (done < bytes.size())
        {
            ssize_t n = write(fd, bytes.data() + done, bytes.size() - done);
            if (n <= 0)
            {
                *error = "cannot write " + target + ": " + std::strerror(n < 0 ? errno : ENOSPC);
                close(fd);
                unlink(name.data());
                return "";
            }
            done += (size_t)n;
        }
        // mkstemp makes the file private; an output is an ordinary file like any other.
        mode_t mask = umask(0);
        umask(mask);
        fchmod(fd, 0666 & ~mask);
        if (close(fd) != 0)
        {
            *error = "cannot write " + target + ": " + std::strerror(errno);
            unlink(name.data());
            return "";
        }
        return name.data();
    }
}

void PendingOutputs::Add(const std::string& path, std::string bytes)
{
    m_Paths.push_back(path);
    m_Bytes.push_back(std::move(bytes));
}

std::string PendingOutputs::Commit()
{
    std::vector<std::string> temporaries;
    std::string error;
    for (size_t i = 0; i < m_Paths.size() && error.empty(); ++i)
    {
        std::string temporary = WriteTemporary(m_Paths[i], m_Bytes[i], &error);
        if (!temporary.empty())
            temporaries.push_back(temporary);
    }
    for (size_t i = 0; i < temporaries.size() && error.empty(); ++i)
        if (std::rename(temporaries[i].c_str(), m_Paths[i].c_str()) != 0)
            error = "cannot write " + m_Paths[i] + ": " + std::strerror(errno);
    if (!error.empty())
        for (const std::string& temporary : temporaries)
            unlink(temporary.c_str());
    return error;
}

bool IsSameFile(const std::string& a, const std::string& b)
{
    std::error_code ec;
    return fs::equivalent(a, b, ec);
}

std::string LowerExtension(const std::string& path)
{
    std::string ext = fs::path(path).extension().string();
    std::transform(ext.begin(), ext.end(), ext.begin(), [](unsigned char c) { return (char)std::tolower(c); });
    return ext;
}

std::string RelinkPath(const std::string& path, const std::string& sourceDirectory, const std::string& outputDirectory)
{
    std::string from = sourceDirectory.empty() ? "." : sourceDirectory;
    std::string to = outputDirectory.empty() ? "." : outputDirectory;
    if (path.empty() || fs::path(path).is_absolute() || path.find("://") != std::string::npos || IsSameFile(from, to))
        return path;
    std::error_code ec;
    fs::path relative = fs::relative(fs::path(from) / path, to, ec);
    return ec || relative.empty() ? path : relative.string();
}
