#include "Editor/Tools/Unwrap/source/CLTool/MeshFileStream.h"

#include <cerrno>
#include <cstring>
#include <sys/stat.h>

namespace
{
    // Only an ordinary file is removed after a failed write: an output named /dev/full, a
    // terminal or a FIFO is a device or channel that must survive the failure.
    void RemoveIncompleteOutput(const std::string& path)
    {
        struct stat info;
        if (stat(path.c_str(), &info) == 0 && S_ISREG(info.st_mode))
            std::remove(path.c_str());
    }
}

MeshFileStream::~MeshFileStream()
{
    Close();
}

std::string MeshFileStream::Fail(const std::string& what)
{
    return what + " " + m_Path + ": " + std::strerror(errno);
}

std::string MeshFileStream::OpenForReading(const char* path, const char* mode)
{
    m_Path = path;
    m_File = std::fopen(path, mode);
    if (!m_File)
        return Fail("cannot open input file");
    // A pipe has no length: its reads are checked as they happen.
    long size = -1;
    if (std::fseek(m_File, 0, SEEK_END) == 0)
        size = std::ftell(m_File);
    if (size >= 0 && std::fseek(m_File, 0, SEEK_SET) == 0)
        m_Size = (unsigned long long)size;
    else
        m_Size = kUnknownSize;
    std::clearerr(m_File);
    return "";
}

std::string MeshFileStream::OpenForWriting(const char* path, const char* mode)
{
    m_Path = path;
    m_Writing = true;
    m_File = std::fopen(path, mode);
    return m_File ? "" : Fail("cannot create output file");
}

std::string MeshFileStream::Read(void* destination, size_t bytes, const char* what)
{
    if (bytes > Remaining())
        return Truncated(bytes, what);
    size_t got = bytes ? std::fread(destination, 1, bytes, m_File) : 0;
    m_Position += got;
    if (got == bytes)
        return "";
    return std::ferror(m_File) ? Fail("cannot read input file") : Truncated(bytes - got, what);
}

void MeshFileStream::ReadOptionalWord(uint32_t* word)
{
    uint32_t value;
    if (Remaining() < sizeof value)
        return;
    size_t got = std::fread(&value, 1, sizeof value, m_File);
    m_Position += got;
    if (got == sizeof value)
        *word = value;
}

std::string MeshFileStream::Truncated(size_t missing, const char* what) const
{
    std::string message = "input file " + m_Path + " is truncated: the " + what + " needs " + std::to_string(missing) +
                          " more bytes at offset " + std::to_string(m_Position);
    if (m_Size != kUnknownSize)
        message += ", but only " + std::to_string(Remaining()) + " remain";
    return message;
}

std::string MeshFileStream::Write(const void* source, size_t bytes)
{
    if (bytes && std::fwrite(source, 1, bytes, m_File) != bytes)
    {
        m_WriteFailed = true;
        return Fail("cannot write output file");
    }
    return "";
}

std::string MeshFileStream::Close()
{
    if (!m_File)
        return "";
    bool failed = m_WriteFailed || std::ferror(m_File) != 0;
    int savedErrno = errno;
    failed = std::fclose(m_File) != 0 || failed;
    m_File = nullptr;
    if (!m_Writing || !failed)
        return "";
    if (errno == 0)
        errno = savedErrno;
    std::string message = Fail("cannot write output file");
    RemoveIncompleteOutput(m_Path);
    return message;
}
