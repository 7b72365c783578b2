// LoadFromObj: the OBJ subset that the unwrapper reads. Only v, vt and f lines count; a face
// contributes its first three corners, each of the form vertex/uv/normal (numbers from 1).
#include "Editor/Tools/Unwrap/source/CLTool/MeshFileStream.h"
#include "Editor/Tools/Unwrap/source/CLTool/MeshFiles.h"

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <vector>

namespace
{
    // A face corner whose vertex or UV number was not (yet) defined where the face was read.
    struct PendingReference
    {
        uint32_t corner;   // first corner index of the face
        unsigned long line;
    };

    struct ObjContents
    {
        std::vector<float> positions;
        std::vector<float> uvs;
        std::vector<uint32_t> cornerVertex;
        std::vector<uint32_t> cornerUV;
        std::vector<PendingReference> pending;
    };

    // Reads "%u" as the formatted-input functions do (leading blanks and a sign allowed, decimal,
    // kept modulo 2^32); false when no digits follow.
    bool ReadUnsigned(const char*& p, uint32_t* value)
    {
        char* end;
        unsigned long parsed = std::strtoul(p, &end, 10);
        if (end == p)
            return false;
        *value = (uint32_t)parsed;
        p = end;
        return true;
    }

    // One corner "vertex/uv/normal"; the normal number is read and dropped.
    bool ReadCorner(const char*& p, uint32_t* vertex, uint32_t* uv)
    {
        uint32_t normal;
        return ReadUnsigned(p, vertex) && *p++ == '/' && ReadUnsigned(p, uv) && *p++ == '/' && ReadUnsigned(p, &normal);
    }

    // The first three corners of an f line; the same match as "f %u/%u/%*u %u/%u/%*u %u/%u/%*u".
    MeshFileError ParseFace(const char* line, unsigned long lineNumber, const std::string& path, ObjContents* obj)
    {
        uint32_t v[3], t[3];
        const char* p = line + 1;
        for (int c = 0; c < 3; ++c)
            if (!ReadCorner(p, &v[c], &t[c]))
                return path + ":" + std::to_string(lineNumber) +
                       ": face corners must have the form vertex/uv/normal (three of them)";
        bool defined = true;
        for (int c = 0; c < 3; ++c)
        {
            obj->cornerVertex.push_back(v[c] - 1);
            obj->cornerUV.push_back(t[c] - 1);
            defined = defined && v[c] - 1 < obj->positions.size() / 3 && t[c] - 1 < obj->uvs.size() / 2;
        }
        if (!defined)
            obj->pending.push_back({(uint32_t)obj->cornerVertex.size() - 3, lineNumber});
        return "";
    }

    // Up to `count` floats as "%f %f ..." reads them; fields that do not parse stay 0.
    void ReadFloats(const char* p, float* values, int count)
    {
        for (int i = 0; i < count; ++i)
        {
            char* end;
            float value = std::strtof(p, &end);
            if (end == p)
                return;
            values[i] = value;
            p = end;
        }
    }

    MeshFileError ParseLine(const char* line, unsigned long lineNumber, const std::string& path, ObjContents* obj)
    {
        if (line[0] == 'v' && line[1] == ' ')
        {
            float xyz[3] = {0, 0, 0};
            ReadFloats(line + 1, xyz, 3);
            obj->positions.insert(obj->positions.end(), xyz, xyz + 3);
        }
        else if (line[0] == 'v' && line[1] == 't' && line[2] == ' ')
        {
            float uv[2] = {0, 0};
            ReadFloats(line + 2, uv, 2);
            obj->uvs.insert(obj->uvs.end(), uv, uv + 2);
        }
        else if (line[0] == 'f' && line[1] == ' ')
            return ParseFace(line, lineNumber, path, obj);
        return "";
    }

    // Faces may name positions and UVs defined further down; they are checked once all are read.
    MeshFileError CheckReferences(const ObjContents& obj, const std::string& path)
    {
        uint64_t positionCount = obj.positions.size() / 3, uvCount = obj.uvs.size() / 2;
        for (const PendingReference& face : obj.pending)
            for (uint32_t c = face.corner; c < face.corner + 3; ++c)
            {
                const char* what = obj.cornerVertex[c] >= positionCount ? "vertex" : obj.cornerUV[c] >= uvCount ? "uv" : nullptr;
                if (what)
                    return path + ":" + std::to_string(face.line) + ": face refers to " + what + " " +
                           std::to_string(uint32_t((what[0] == 'v' ? obj.cornerVertex[c] : obj.cornerUV[c]) + 1)) +
                           ", which does not exist (the file has " + std::to_string(positionCount) + " vertices and " +
                           std::to_string(uvCount) + " uvs)";
            }
        return "";
    }

    template <typename T>
    T* CopyOut(const T* data, size_t count)
    {
        T* copy = (T*)std::malloc(count ? count * sizeof(T) : 1);
        if (copy && count)
            std::memcpy(copy, data, count * sizeof(T));
        return copy;
    }
}

MeshFileError LoadFromObj(const char* path, UnwrapParam* param, uint32_t* vertexCount, uint32_t* triCount, float** vertex,
                          float** uv, uint32_t** tri, uint32_t**)
{
    MeshFileStream in;
    MeshFileError error = in.OpenForReading(path, "rt");
    if (!error.empty())
        return error;
    ObjContents obj;
    obj.positions.reserve(6144);
    obj.uvs.reserve(4096);
    obj.cornerVertex.reserve(6144);
    char line[1024];
    unsigned long lineNumber = 0;
    bool atLineStart = true;
    while (std::fgets(line, sizeof line, in.Handle()))
    {
        // A line longer than the buffer arrives in pieces; each piece is parsed as a line.
        lineNumber += atLineStart ? 1 : 0;
        atLineStart = std::strchr(line, '\n') != nullptr;
        error = ParseLine(line, lineNumber, in.Path(), &obj);
        if (!error.empty())
            return error;
    }
    if (std::ferror(in.Handle()))
        return "cannot read input file " + in.Path() + ": " + std::strerror(errno);
    error = CheckReferences(obj, in.Path());
    if (!error.empty())
        return error;

    *param = DefaultUnwrapParam();
    *vertexCount = (uint32_t)(obj.positions.size() / 3);
    *triCount = (uint32_t)(obj.cornerVertex.size() / 3);
    *vertex = CopyOut(obj.positions.data(), obj.positions.size());
    *tri = CopyOut(obj.cornerVertex.data(), obj.cornerVertex.size());
    *uv = (float*)std::malloc(*triCount ? (size_t)*triCount * 24 : 1);
    if (!*vertex || !*tri || !*uv)
        return "out of memory reading " + in.Path();
    for (size_t k = 0; k < 3 * (size_t)*triCount; ++k)
    {
        (*uv)[2 * k] = obj.uvs[2 * (size_t)obj.cornerUV[k]];
        (*uv)[2 * k + 1] = obj.uvs[2 * (size_t)obj.cornerUV[k] + 1];
    }
    return "";
}
