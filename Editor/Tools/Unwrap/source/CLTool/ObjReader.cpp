// LoadFromObj: the OBJ subset that the unwrapper reads. Only v, vt and f lines count; a face
// contributes its first three corners, each of the form vertex/uv/normal (numbers from 1), where
// the last corner may leave out its normal number: the face's six vertex and UV numbers are all
// that is needed.
//
// One pass over the mapped file. The file is cut into the pieces a 1,024-byte line buffer would
// hold (a line longer than 1,023 characters arrives in several pieces, each taken as a line), and
// each piece is parsed in place. Positions and triangles are collected straight into the arrays
// that are handed back; each face's corner UVs are looked up as the face is read, so the UV list
// is the only other array. A face naming a position or UV that comes further down the file keeps
// its UV numbers in its UV slots and is completed (or refused) at the end.
#include "Editor/Tools/Unwrap/source/CLTool/MallocArray.h"
#include "Editor/Tools/Unwrap/source/CLTool/MappedInputFile.h"
#include "Editor/Tools/Unwrap/source/CLTool/MeshFiles.h"
#include "Editor/Tools/Unwrap/source/CLTool/ObjNumberScan.h"

#include <cstring>
#include <vector>

using ObjNumberScan::FloatScanner;
using ObjNumberScan::ScanUnsigned;

namespace
{
    // A face with a vertex or UV number beyond what was read before it.
    struct PendingFace
    {
        uint32_t triangle;
        unsigned long line;
    };

    struct ObjContents
    {
        MallocArray<float> positions;   // 3 a vertex: the vertex array handed back
        MallocArray<float> uvs;         // 2 a vt line
        MallocArray<uint32_t> tri;      // 3 zero-based vertex numbers a triangle: the tri array handed back
        MallocArray<float> cornerUVs;   // 6 a triangle: the uv array handed back
        std::vector<PendingFace> pending;
    };

    // The first three corners of an f line, as "f %u/%u/%*u %u/%u/%*u %u/%u/%*u" matches them:
    // true when all six vertex and UV numbers matched (the last normal number is not needed).
    bool ScanFace(const char* p, const char* end, uint32_t vertex[3], uint32_t uv[3])
    {
        for (int c = 0; c < 3; ++c)
        {
            uint32_t normal;
            if (!(p = ScanUnsigned(p, end, &vertex[c])) || p == end || *p++ != '/' || !(p = ScanUnsigned(p, end, &uv[c])))
                return false;
            if (c == 2)
                return true;
            if (p == end || *p++ != '/' || !(p = ScanUnsigned(p, end, &normal)))
                return false;
        }
        return true;
    }

    std::string FaceError(const std::string& path, unsigned long line, const std::string& what)
    {
        return path + ":" + std::to_string(line) + ": " + what;
    }

    bool ParseFace(const char* p, const char* end, unsigned long line, const std::string& path, ObjContents* obj,
                   std::string* error)
    {
        uint32_t vertex[3], uv[3];
        if (!ScanFace(p, end, vertex, uv))
        {
            *error = FaceError(path, line, "face corners must have the form vertex/uv/normal (three of them)");
            return false;
        }
        uint32_t* tri = obj->tri.Append(3);
        float* cornerUVs = obj->cornerUVs.Append(6);
        if (!tri || !cornerUVs)
        {
            *error = "out of memory reading " + path;
            return false;
        }
        // Numbers are one-based in the file; the subtraction is unsigned, so 0 becomes 2^32 - 1.
        size_t positionCount = obj->positions.Size() / 3, uvCount = obj->uvs.Size() / 2;
        bool defined = true;
        for (int c = 0; c < 3; ++c)
        {
            tri[c] = vertex[c] - 1;
            uv[c] -= 1;
            defined = defined && tri[c] < positionCount && uv[c] < uvCount;
        }
        if (!defined)
        {
            std::memcpy(cornerUVs, uv, sizeof uv);   // completed in ResolvePendingFaces
            obj->pending.push_back({(uint32_t)(obj->tri.Size() / 3 - 1), line});
            return true;
        }
        for (int c = 0; c < 3; ++c)
            std::memcpy(cornerUVs + 2 * c, &obj->uvs[2 * (size_t)uv[c]], 2 * sizeof(float));
        return true;
    }

    // Up to `count` floats as "%f %f ..." reads them; fields that do not parse stay 0.
    bool ParseFloats(const char* p, const char* end, const FloatScanner& scanner, MallocArray<float>* list, int count)
    {
        float* values = list->Append((size_t)count);
        if (!values)
            return false;
        for (int i = 0; i < count; ++i)
            values[i] = 0;
        for (int i = 0; i < count && p; ++i)
            p = scanner.Scan(p, end, &values[i]);
        return true;
    }

    // One piece of a line: [line, end), at most 1,023 characters, its line end included if any.
    bool ParseLine(const char* line, const char* end, unsigned long lineNumber, const std::string& path,
                   const FloatScanner& scanner, ObjContents* obj, std::string* error)
    {
        long length = end - line;
        bool ok = true;
        if (length >= 2 && line[0] == 'v' && line[1] == ' ')
            ok = ParseFloats(line + 1, end, scanner, &obj->positions, 3);
        else if (length >= 3 && line[0] == 'v' && line[1] == 't' && line[2] == ' ')
            ok = ParseFloats(line + 2, end, scanner, &obj->uvs, 2);
        else if (length >= 2 && line[0] == 'f' && line[1] == ' ')
            return ParseFace(line + 1, end, lineNumber, path, obj, error);
        if (!ok)
            *error = "out of memory reading " + path;
        return ok;
    }

    // Faces may name positions and UVs defined further down; they are checked, and their UVs
    // filled in, once everything is read.
    std::string ResolvePendingFaces(ObjContents* obj, const std::string& path)
    {
        uint64_t positionCount = obj->positions.Size() / 3, uvCount = obj->uvs.Size() / 2;
        for (const PendingFace& face : obj->pending)
        {
            float* cornerUVs = &obj->cornerUVs[6 * (size_t)face.triangle];
            uint32_t uv[3];
            std::memcpy(uv, cornerUVs, sizeof uv);
            for (int c = 0; c < 3; ++c)
            {
                uint32_t vertex = obj->tri[3 * (size_t)face.triangle + c];
                const char* what = vertex >= positionCount ? "vertex" : uv[c] >= uvCount ? "uv" : nullptr;
                if (what)
                    return FaceError(path, face.line,
                                     std::string("face refers to ") + what + " " +
                                         std::to_string(uint32_t((what[0] == 'v' ? vertex : uv[c]) + 1)) +
                                         ", which does not exist (the file has " + std::to_string(positionCount) +
                                         " vertices and " + std::to_string(uvCount) + " uvs)");
            }
            for (int c = 0; c < 3; ++c)
                std::memcpy(cornerUVs + 2 * c, &obj->uvs[2 * (size_t)uv[c]], 2 * sizeof(float));
        }
        return "";
    }

    std::string ParseFile(MappedInputFile& file, ObjContents* obj)
    {
        // The driver rounds toward zero; numbers are read rounded to nearest, as strtof does.
        FloatScanner scanner;
        std::string error;
        unsigned long lineNumber = 0;
        bool atLineStart = true;
        for (const char *p = file.Begin(), *end = file.End(); p < end;)
        {
            const char* limit = end - p > ObjNumberScan::kMaxPieceChars ? p + ObjNumberScan::kMaxPieceChars : end;
            const char* newline = (const char*)std::memchr(p, '\n', (size_t)(limit - p));
            const char* pieceEnd = newline ? newline + 1 : limit;
            // The pieces of one over-long line share its number.
            lineNumber += atLineStart ? 1 : 0;
            atLineStart = newline != nullptr;
            if (!ParseLine(p, pieceEnd, lineNumber, file.Path(), scanner, obj, &error))
                return error;
            p = pieceEnd;
            file.Done(p);
        }
        return "";
    }
}

MeshFileError LoadFromObj(const char* path, UnwrapParam* param, uint32_t* vertexCount, uint32_t* triCount, float** vertex,
                          float** uv, uint32_t** tri, uint32_t**)
{
    MappedInputFile file;
    MeshFileError error = file.Open(path);
    if (!error.empty())
        return error;
    ObjContents obj;
    error = ParseFile(file, &obj);
    if (error.empty())
        error = ResolvePendingFaces(&obj, file.Path());
    if (!error.empty())
        return error;

    *param = DefaultUnwrapParam();
    *vertexCount = (uint32_t)(obj.positions.Size() / 3);
    *triCount = (uint32_t)(obj.tri.Size() / 3);
    float* vertexBlock = obj.positions.Release();
    uint32_t* triBlock = obj.tri.Release();
    float* uvBlock = obj.cornerUVs.Release();
    if (!vertexBlock || !triBlock || !uvBlock)
    {
        std::free(vertexBlock);
        std::free(triBlock);
        std::free(uvBlock);
        return "out of memory reading " + file.Path();
    }
    *vertex = vertexBlock;
    *tri = triBlock;
    *uv = uvBlock;
    return "";
}
