#pragma once
// One open standard-stream file with the checks the mesh functions need: every read is checked
// against the bytes the file still holds, every write for success, and an output that could not
// be completed is removed again.

#include <cstdint>
#include <cstdio>
#include <string>

class MeshFileStream
{
public:
    ~MeshFileStream();

    // Opens for reading or writing. Empty result on success.
    std::string OpenForReading(const char* path, const char* mode);
    std::string OpenForWriting(const char* path, const char* mode);

    // Reads exactly `bytes` bytes of the block called `what`, or reports how short the file is.
    std::string Read(void* destination, size_t bytes, const char* what);
    // Reads a 32-bit word that a file may leave out at its end; a missing word leaves *word as it was.
    void ReadOptionalWord(uint32_t* word);
    std::string Write(const void* source, size_t bytes);

    // Closes; for an output, reports a failed write and removes the incomplete file (an ordinary
    // file only: a device such as /dev/full stays).
    std::string Close();

    FILE* Handle() const { return m_File; }
    const std::string& Path() const { return m_Path; }
    // Bytes left to read; for a pipe, whose length is unknown, effectively unlimited.
    unsigned long long Remaining() const { return m_Size - m_Position; }

private:
    static constexpr unsigned long long kUnknownSize = ~0ull;

    std::string Fail(const std::string& what);
    std::string Truncated(size_t missing, const char* what) const;

    FILE* m_File = nullptr;
    std::string m_Path;
    bool m_Writing = false;
    bool m_WriteFailed = false;
    unsigned long long m_Size = 0;
    unsigned long long m_Position = 0;
};
