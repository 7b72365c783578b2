#include "Editor/Tools/Unwrap/source/MeshTool/VertexSplit.h"

#include <cstring>
#include <unordered_map>

namespace
{
    // A corner's identity for welding: its source vertex and the exact bits of its UV.
    uint64_t CornerKeyHash(uint32_t vertex, uint32_t u, uint32_t v)
    {
        uint64_t h = vertex * 0x9E3779B97F4A7C15ull;
        h ^= (u + 0x7F4A7C15ull + (h << 6) + (h >> 2));
        h ^= (v * 0xC2B2AE3D27D4EB4Full + (h << 6) + (h >> 2));
        return h;
    }

    struct CornerKey
    {
        uint32_t vertex, u, v;
        bool operator==(const CornerKey& o) const { return vertex == o.vertex && u == o.u && v == o.v; }
    };

    struct CornerKeyHasher
    {
        size_t operator()(const CornerKey& k) const { return (size_t)CornerKeyHash(k.vertex, k.u, k.v); }
    };
}

VertexSplit SplitVerticesByUV(const std::vector<uint32_t>& indices, const std::vector<float>& cornerUVs)
{
    VertexSplit split;
    split.indices.resize(indices.size());
    std::unordered_map<CornerKey, uint32_t, CornerKeyHasher> seen;
    seen.reserve(indices.size());
    for (size_t corner = 0; corner < indices.size(); ++corner)
    {
        CornerKey key{indices[corner], 0, 0};
        std::memcpy(&key.u, &cornerUVs[2 * corner], 4);
        std::memcpy(&key.v, &cornerUVs[2 * corner + 1], 4);
        auto [it, added] = seen.emplace(key, (uint32_t)split.sourceVertex.size());
        if (added)
        {
            split.sourceVertex.push_back(key.vertex);
            split.uvs.push_back(cornerUVs[2 * corner]);
            split.uvs.push_back(cornerUVs[2 * corner + 1]);
        }
        split.indices[corner] = it->second;
    }
    return split;
}
