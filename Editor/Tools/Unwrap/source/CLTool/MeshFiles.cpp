#include "Editor/Tools/Unwrap/source/CLTool/MeshFiles.h"

#include "Editor/Tools/Unwrap/source/CLTool/DecimalText.h"
#include "Editor/Tools/Unwrap/source/CLTool/MeshFileStream.h"
#include "Editor/Tools/Unwrap/source/CLTool/TextBlockWriter.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string_view>

UnwrapParam DefaultUnwrapParam()
{
    return UnwrapParam{0.08f, 0.15f, 88.0f, 1.0f / 256.0f, 0};
}

namespace
{
    // The fixed part of the raw binary file: parameters, counts, presence words.
    struct BinaryHeader
    {
        uint32_t vertexCount = 0;
        uint32_t triCount = 0;
        uint32_t uvPresent = 0;
        uint32_t srcPolyPresent = 0;
    };

    // Counts are turned into element counts in 32 bits (3V, 3T, 6T) and into int32 for the
    // library; counts beyond either are refused rather than wrapped.
    MeshFileError CheckCounts(const char* path, const BinaryHeader& header)
    {
        const uint64_t kMaxInt32 = 0x7FFFFFFF;
        if ((uint64_t)header.vertexCount * 3 > kMaxInt32 || (uint64_t)header.triCount * 6 > kMaxInt32)
            return std::string("input file ") + path + " has counts too large to process: " +
                   std::to_string(header.vertexCount) + " vertices, " + std::to_string(header.triCount) + " triangles";
        return "";
    }

    // Every index of the triangle block must name one of the file's vertices: the library reads
    // positions through them unchecked.
    MeshFileError CheckTriangleIndices(const char* path, const uint32_t* tri, uint32_t triCount, uint32_t vertexCount)
    {
        for (uint64_t i = 0; i < 3ull * triCount; ++i)
            if (tri[i] >= vertexCount)
                return std::string("input file ") + path + ": triangle " + std::to_string(i / 3) + " refers to vertex index " +
                       std::to_string(tri[i]) + ", which does not exist (the file has " + std::to_string(vertexCount) +
                       " vertices)";
        return "";
    }

    template <typename T>
    MeshFileError ReadBlock(MeshFileStream& in, T** block, uint64_t elements, const char* what)
    {
        uint64_t bytes = elements * sizeof(T);
        if (bytes > in.Remaining())
            return in.Read(nullptr, bytes, what);   // reports the truncation
        *block = (T*)std::malloc(bytes ? bytes : 1);
        if (!*block)
            return std::string("out of memory reading ") + in.Path();
        return in.Read(*block, bytes, what);
    }

    // Longest OBJ output line: "vt " or "v " and up to three floats, or "f " and six numbers.
    constexpr size_t kMaxLineChars = 3 + 3 * (DecimalText::kMaxFloatChars + 1);
    static_assert(kMaxLineChars >= 2 + 6 * (DecimalText::kMaxUnsignedChars + 1));

    // "<tag>%f %f ...\n" with `count` values, each widened to double.
    void WriteFloatLine(TextBlockWriter& text, std::string_view tag, const float* values, int count)
    {
        char* at = text.Reserve(kMaxLineChars);
        std::memcpy(at, tag.data(), tag.size());
        at += tag.size();
        for (int i = 0; i < count; ++i)
        {
            if (i > 0)
                *at++ = ' ';
            at = DecimalText::WriteFixed6(values[i], at);
        }
        *at++ = '\n';
        text.Commit(at);
    }

    // "f %u/%u %u/%u %u/%u\n": one-based vertex numbers, each with its corner's UV number.
    void WriteFaceLine(TextBlockWriter& text, const uint32_t* corners, uint32_t firstUV)
    {
        char* at = text.Reserve(kMaxLineChars);
        *at++ = 'f';
        for (uint32_t c = 0; c < 3; ++c)
        {
            *at++ = ' ';
            at = DecimalText::WriteUnsigned(uint32_t(corners[c] + 1), at);
            *at++ = '/';
            at = DecimalText::WriteUnsigned(uint32_t(firstUV + c), at);
        }
        *at++ = '\n';
        text.Commit(at);
    }
}

MeshFileError LoadFromHalvorBinary(const char* path, UnwrapParam* param, uint32_t* vertexCount, uint32_t* triCount,
                                   float** vertex, float** uv, uint32_t** tri, uint32_t** srcPoly)
{
    MeshFileStream in;
    BinaryHeader header;
    MeshFileError error = in.OpenForReading(path, "rb");
    if (error.empty()) error = in.Read(param, sizeof(UnwrapParam), "parameter block");
    if (error.empty()) error = in.Read(&header.vertexCount, 4, "vertex count");
    if (error.empty()) error = in.Read(&header.triCount, 4, "triangle count");
    if (!error.empty())
        return error;
    // A file that ends before a presence word leaves it 0: the word is optional, not truncated.
    in.ReadOptionalWord(&header.uvPresent);
    in.ReadOptionalWord(&header.srcPolyPresent);
    error = CheckCounts(path, header);
    if (!error.empty())
        return error;
    *vertexCount = header.vertexCount;
    *triCount = header.triCount;
    *uv = nullptr;
    *srcPoly = nullptr;
    error = ReadBlock(in, vertex, 3ull * header.vertexCount, "vertex block");
    if (error.empty()) error = ReadBlock(in, tri, 3ull * header.triCount, "triangle block");
    if (error.empty()) error = CheckTriangleIndices(path, *tri, header.triCount, header.vertexCount);
    if (error.empty() && header.uvPresent) error = ReadBlock(in, uv, 6ull * header.triCount, "UV block");
    if (error.empty() && header.srcPolyPresent) error = ReadBlock(in, srcPoly, header.triCount, "source polygon block");
    return error;
}

MeshFileError SaveToHalvorBinary(const char* path, uint32_t, uint32_t triCount, const float*, const float* uv, const uint32_t*)
{
    MeshFileStream out;
    MeshFileError error = out.OpenForWriting(path, "wb");
    if (error.empty())
        error = out.Write(uv, (size_t)triCount * 24);
    std::string closed = out.Close();
    return error.empty() ? closed : error;
}

MeshFileError SaveToObj(const char* path, uint32_t vertexCount, uint32_t triCount, const float* vertex, const float* uv,
                        const uint32_t* tri)
{
    MeshFileStream out;
    MeshFileError error = out.OpenForWriting(path, "wt");
    if (!error.empty())
        return error;
    TextBlockWriter text(out);
    char header[80];
    int headerLength = std::snprintf(header, sizeof header, "g unwrap_out\n# vertices %u\n# triangles %u\n\n", vertexCount,
                                     triCount);
    text.Append(std::string_view(header, size_t(headerLength)));
    for (uint32_t v = 0; v < vertexCount; ++v)
        WriteFloatLine(text, "v ", vertex + 3ull * v, 3);
    text.Append("\n");
    for (uint64_t corner = 0; corner < 3ull * triCount; ++corner)
        WriteFloatLine(text, "vt ", uv + 2 * corner, 2);
    text.Append("\n");
    for (uint32_t t = 0; t < triCount; ++t)
        WriteFaceLine(text, tri + 3ull * t, 3 * t + 1);
    error = text.Finish();
    std::string closed = out.Close();
    return error.empty() ? closed : error;
}
