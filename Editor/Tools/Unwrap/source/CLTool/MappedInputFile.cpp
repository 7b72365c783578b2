#include "Editor/Tools/Unwrap/source/CLTool/MappedInputFile.h"

#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

namespace
{
    // Pages are handed back in steps of this size: often enough to keep the window small, rarely
    // enough that the system calls cost nothing measurable.
    constexpr size_t kReleaseStep = 4u << 20;

    std::string Failure(const char* what, const std::string& path)
    {
        return std::string(what) + " " + path + ": " + std::strerror(errno);
    }

    bool ReadAll(int fd, std::string* contents)
    {
        char block[1 << 16];
        for (;;)
        {
            ssize_t got = read(fd, block, sizeof block);
            if (got < 0 && errno == EINTR)
                continue;
            if (got < 0)
                return false;
            if (got == 0)
                return true;
            contents->append(block, (size_t)got);
        }
    }
}

MappedInputFile::~MappedInputFile()
{
    if (m_Mapping)
        munmap(m_Mapping, m_Size);
}

std::string MappedInputFile::Open(const char* path)
{
    m_Path = path;
    int fd = open(path, O_RDONLY | O_CLOEXEC);
    if (fd < 0)
        return Failure("cannot open input file", m_Path);
    struct stat info;
    std::string error;
    if (fstat(fd, &info) == 0 && S_ISREG(info.st_mode) && info.st_size > 0)
    {
        void* mapping = mmap(nullptr, (size_t)info.st_size, PROT_READ, MAP_PRIVATE, fd, 0);
        if (mapping != MAP_FAILED)
        {
            m_Mapping = mapping;
            m_Data = (const char*)mapping;
            m_Size = (size_t)info.st_size;
            madvise(mapping, m_Size, MADV_SEQUENTIAL);
        }
    }
    if (!m_Mapping)
    {
        if (ReadAll(fd, &m_Copy))
        {
            m_Data = m_Copy.data();
            m_Size = m_Copy.size();
        }
        else
            error = Failure("cannot read input file", m_Path);
    }
    close(fd);
    return error;
}

void MappedInputFile::Done(const char* position)
{
    if (!m_Mapping)
        return;
    size_t done = (size_t)(position - m_Data);
    if (done < m_Released + kReleaseStep)
        return;
    size_t page = (size_t)sysconf(_SC_PAGESIZE);
    size_t upTo = done / page * page;
    madvise((char*)m_Mapping + m_Released, upTo - m_Released, MADV_DONTNEED);
    m_Released = upTo;
}
