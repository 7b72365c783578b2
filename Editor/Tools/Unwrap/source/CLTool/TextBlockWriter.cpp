#include "Editor/Tools/Unwrap/source/CLTool/TextBlockWriter.h"

#include <algorithm>
#include <cstring>

TextBlockWriter::TextBlockWriter(MeshFileStream& out)
    : m_Out(out), m_Block(new char[kBlockBytes])
{
}

void TextBlockWriter::Append(std::string_view text)
{
    while (!text.empty())
    {
        size_t part = std::min(text.size(), kBlockBytes);
        char* at = Reserve(part);
        std::memcpy(at, text.data(), part);
        Commit(at + part);
        text.remove_prefix(part);
    }
}

void TextBlockWriter::WriteBlock()
{
    if (m_Error.empty())
        m_Error = m_Out.Write(m_Block.get(), m_Used);
    m_Used = 0;
}

std::string TextBlockWriter::Finish()
{
    WriteBlock();
    return m_Error;
}
