#include "VertexWelding.h"

#include "Scratch.h"
#include "WinImports.h"

namespace
{
    const uint32_t kEmpty = 0xFFFFFFFFu;

    void PositionBits(const float* vertex, uint32_t v, uint32_t* bits)
    {
        memcpy(bits, vertex + 3 * (uint64_t)v, 12);
        for (int a = 0; a < 3; ++a)
            bits[a] = bits[a] == 0x80000000u ? 0 : bits[a];   // -0 is +0
    }

    uint32_t Hash(const uint32_t* bits)
    {
        uint64_t h = 0x9E3779B97F4A7C15ull;
        for (int a = 0; a < 3; ++a)
        {
            h ^= bits[a];
            h *= 0xFF51AFD7ED558CCDull;
            h ^= h >> 32;
        }
        return (uint32_t)h;
    }

    // The lowest vertex at each vertex's position, through an open-addressing table of vertex
    // numbers keyed by position (capacity a power of two, at most half full).
    bool FindCanonical(const float* vertex, uint32_t vertexCount, uint32_t* canonical)
    {
        uint64_t capacity = 16;
        while (capacity < 2ull * vertexCount)
            capacity *= 2;
        Scratch<uint32_t> table;
        if (!table.Allocate(capacity))
            return false;
        memset(table.Data(), 0xFF, capacity * sizeof(uint32_t));
        for (uint32_t v = 0; v < vertexCount; ++v)
        {
            uint32_t bits[3], other[3];
            PositionBits(vertex, v, bits);
            for (uint64_t slot = Hash(bits) & (capacity - 1);; slot = (slot + 1) & (capacity - 1))
            {
                if (table[slot] == kEmpty)
                {
                    table[slot] = canonical[v] = v;
                    break;
                }
                PositionBits(vertex, table[slot], other);
                if (memcmp(bits, other, 12) == 0)
                {
                    canonical[v] = table[slot];
                    break;
                }
            }
        }
        return true;
    }
}

bool WeldVertices(const float* vertex, uint32_t vertexCount, const uint32_t* tri, uint32_t triCount, uint32_t* weldedTri)
{
    Scratch<uint32_t> canonical;
    if (!canonical.Allocate(vertexCount) || !FindCanonical(vertex, vertexCount, canonical.Data()))
        return false;
    for (uint64_t i = 0; i < 3ull * triCount; ++i)
        weldedTri[i] = canonical[tri[i]];
    return true;
}
