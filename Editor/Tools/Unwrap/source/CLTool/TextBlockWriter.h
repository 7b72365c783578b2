#pragma once
// Text output gathered into large blocks, each handed to a MeshFileStream in one write. The OBJ
// writer produces some hundred bytes per triangle; one write per block instead of one formatted
// stdio call per line keeps the output cost down to the formatting itself. After a failed write
// everything that follows is dropped and the first error is kept: the stream has recorded the
// failure, so closing it removes an incomplete ordinary file as before.

#include "Editor/Tools/Unwrap/source/CLTool/MeshFileStream.h"

#include <cstddef>
#include <memory>
#include <string>
#include <string_view>

class TextBlockWriter
{
public:
    static constexpr size_t kBlockBytes = 1 << 20;

    explicit TextBlockWriter(MeshFileStream& out);

    // Room for `bytes` more characters (at most kBlockBytes), writing out the block first if it
    // is too full. Characters placed there count once Commit is given the end of them.
    char* Reserve(size_t bytes)
    {
        if (kBlockBytes - m_Used < bytes)
            WriteBlock();
        return m_Block.get() + m_Used;
    }
    void Commit(const char* end) { m_Used = size_t(end - m_Block.get()); }

    void Append(std::string_view text);
    // Writes what is left; returns the first write error, empty if every write succeeded.
    std::string Finish();

private:
    void WriteBlock();

    MeshFileStream& m_Out;
    std::unique_ptr<char[]> m_Block;
    size_t m_Used = 0;
    std::string m_Error;
};
