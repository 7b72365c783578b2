#pragma once
// Writing results without ever leaving a partial or clobbered file: every output is first written
// in full to a temporary file beside its target, and only when all of them are complete are they
// renamed over their targets. On any failure the temporaries are removed and the targets are
// untouched.

#include <string>
#include <vector>

class PendingOutputs
{
public:
    void Add(const std::string& path, std::string bytes);
    // Empty on success; otherwise a sentence naming the file that could not be written.
    std::string Commit();
    const std::vector<std::string>& Paths() const { return m_Paths; }

private:
    std::vector<std::string> m_Paths;
    std::vector<std::string> m_Bytes;
};

// True when both names reach the same existing file (another spelling, a link, a hard link).
bool IsSameFile(const std::string& a, const std::string& b);

// The lower-case extension with its dot (".glb"), or empty.
std::string LowerExtension(const std::string& path);

// A file the input refers to by `path` (relative to `sourceDirectory`), named so that it is found
// from `outputDirectory`. Absolute paths and URLs stay as they are, and so does everything when
// both directories are the same.
std::string RelinkPath(const std::string& path, const std::string& sourceDirectory, const std::string& outputDirectory);
