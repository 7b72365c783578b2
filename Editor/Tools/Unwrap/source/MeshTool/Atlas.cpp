#include "Editor/Tools/Unwrap/source/MeshTool/Atlas.h"

#include "Editor/Tools/Unwrap/source/CLTool/UnwrapLibraries.h"

#include <cmath>
#include <cstring>
#include <map>
#include <xmmintrin.h>

namespace
{
    // The libraries run under their own SSE state; this program's own arithmetic does not.
    class UnwrapFloatingPointScope
    {
    public:
        UnwrapFloatingPointScope() : m_Saved(_mm_getcsr()) { SetUnwrapFloatingPointState(); }
        ~UnwrapFloatingPointScope() { _mm_setcsr(m_Saved); }

    private:
        unsigned m_Saved;
    };

    // One unwrapper call over the primitives `members`, their vertices and triangles concatenated.
    std::string UnwrapTogether(const MeshScene& scene, const std::vector<size_t>& members, const UnwrapParam& param,
                               AtlasResult* result)
    {
        std::vector<float> vertex;
        std::vector<uint32_t> tri, srcPoly;
        bool anyPolygons = false;
        for (size_t i : members)
        {
            const ScenePrimitive& primitive = scene.primitives[i];
            uint32_t base = (uint32_t)(vertex.size() / 3);
            vertex.insert(vertex.end(), primitive.positions.begin(), primitive.positions.end());
            for (uint32_t index : primitive.indices)
                tri.push_back(base + index);
            // Polygon numbers stay apart between primitives; a triangle without one is its own.
            uint32_t polygonBase = (uint32_t)srcPoly.size();
            for (uint32_t t = 0; t < primitive.TriangleCount(); ++t)
                srcPoly.push_back(polygonBase + (t < primitive.sourcePolygon.size() ? primitive.sourcePolygon[t] : t));
            anyPolygons |= !primitive.sourcePolygon.empty();
        }
        for (float c : vertex)
            if (!std::isfinite(c))
                return "the mesh has a vertex position that is not a finite number";
        if (tri.size() / 3 > (size_t)INT32_MAX / 6 || vertex.size() / 3 > (size_t)INT32_MAX)
            return "the mesh is too large for the unwrapper (" + std::to_string(tri.size() / 3) + " triangles)";
        uint32_t triCount = (uint32_t)(tri.size() / 3);
        std::vector<float> outUV((size_t)triCount * 6 + 1, 0.0f);
        char errorBuffer[kUnwrapErrorBufferSize] = {};
        bool success;
        {
            UnwrapFloatingPointScope scope;
            success = CallGenerateSecondaryUVSet(vertex.data(), (uint32_t)(vertex.size() / 3), nullptr, tri.data(),
                                                 anyPolygons ? srcPoly.data() : nullptr, triCount, outUV.data(), param, errorBuffer);
        }
        std::string message(errorBuffer, strnlen(errorBuffer, sizeof errorBuffer));
        if (!success)
            return "the unwrapper failed" + (message.empty() ? std::string() : ": " + message);
        result->libraryMessage += message;
        size_t corner = 0;
        for (size_t i : members)
        {
            size_t corners = scene.primitives[i].indices.size();
            result->uvs[i].assign(outUV.begin() + (long)(2 * corner), outUV.begin() + (long)(2 * (corner + corners)));
            corner += corners;
        }
        ++result->atlasCount;
        return "";
    }
}

std::string UnwrapScene(const MeshScene& scene, const UnwrapParam& param, bool perMesh, AtlasResult* result)
{
    result->uvs.assign(scene.primitives.size(), {});
    std::map<int, std::vector<size_t>> groups;
    for (size_t i = 0; i < scene.primitives.size(); ++i)
        groups[perMesh ? scene.primitives[i].atlasGroup : 0].push_back(i);
    for (const auto& [group, members] : groups)
    {
        std::string error = UnwrapTogether(scene, members, param, result);
        if (!error.empty())
            return error;
    }
    return "";
}
