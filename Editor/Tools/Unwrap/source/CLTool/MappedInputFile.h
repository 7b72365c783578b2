#pragma once
// A whole input file as one read-only byte range: an ordinary file is mapped (no copy, pages come
// straight from the page cache), anything else (a pipe, a device) is read into memory. A reader
// that goes front to back hands back what it has finished with, so that the mapped pages do not
// stay resident: peak memory holds a window of the file, not all of it.

#include <cstddef>
#include <string>

class MappedInputFile
{
public:
    MappedInputFile() = default;
    ~MappedInputFile();
    MappedInputFile(const MappedInputFile&) = delete;
    MappedInputFile& operator=(const MappedInputFile&) = delete;

    // Empty result on success, else "cannot open input file <path>: <reason>" or
    // "cannot read input file <path>: <reason>".
    std::string Open(const char* path);

    const char* Begin() const { return m_Data; }
    const char* End() const { return m_Data + m_Size; }
    const std::string& Path() const { return m_Path; }

    // The reader is done with every byte before `position`: whole pages below it may be dropped
    // from memory (they are read again from the file if touched).
    void Done(const char* position);

private:
    std::string m_Path;
    const char* m_Data = "";
    size_t m_Size = 0;
    void* m_Mapping = nullptr;   // the mapping, when the file is mapped
    size_t m_Released = 0;       // bytes from the start already handed back
    std::string m_Copy;          // the contents, when the file could not be mapped
};
