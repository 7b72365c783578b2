#include "PackOutline.h"

#include "WinImports.h"

namespace
{
    const uint32_t kEmpty = 0xFFFFFFFFu;

    // The end UVs of edge k of triangle t, as bits, in a fixed order (the smaller end first).
    struct EdgeKey
    {
        uint32_t bits[4];

        EdgeKey(const float* uv, uint32_t t, uint32_t k)
        {
            const float* a = uv + 6ull * t + 2 * k;
            const float* b = uv + 6ull * t + 2 * ((k + 1) % 3);
            uint32_t p[4];
            memcpy(p, a, 8);
            memcpy(p + 2, b, 8);
            bool swap = p[2] < p[0] || (p[2] == p[0] && p[3] < p[1]);
            bits[0] = swap ? p[2] : p[0], bits[1] = swap ? p[3] : p[1];
            bits[2] = swap ? p[0] : p[2], bits[3] = swap ? p[1] : p[3];
        }

        bool operator==(const EdgeKey& o) const
        {
            return bits[0] == o.bits[0] && bits[1] == o.bits[1] && bits[2] == o.bits[2] && bits[3] == o.bits[3];
        }

        uint32_t Hash() const
        {
            uint64_t h = 0x9E3779B97F4A7C15ull;
            for (int i = 0; i < 4; ++i)
                h = (h ^ bits[i]) * 0xFF51AFD7ED558CCDull;
            return (uint32_t)(h >> 32);
        }
    };
}

uint32_t AppendOutline(const float* uv, const uint32_t* triangles, uint32_t count, OutlineScratch& scratch,
                       Scratch<float>& segments, uint64_t* segmentCount, uint64_t* room, bool* outOfMemory)
{
    *outOfMemory = false;
    uint64_t edges = 3ull * count, capacity = 16;
    while (capacity < 2 * edges)
        capacity *= 2;
    if (capacity > scratch.capacity)
    {
        if (!scratch.slots.Allocate(capacity) || !scratch.counts.Allocate(capacity))
            return (scratch.capacity = 0), (*outOfMemory = true), 0;
        scratch.capacity = capacity;
    }
    uint32_t* slots = scratch.slots.Data();
    uint32_t* counts = scratch.counts.Data();
    memset(slots, 0xFF, capacity * 4);
    uint64_t mask = capacity - 1;
    for (uint32_t i = 0; i < count; ++i)
        for (uint32_t k = 0; k < 3; ++k)
        {
            EdgeKey key(uv, triangles[i], k);
            uint64_t s = key.Hash() & mask;
            while (slots[s] != kEmpty && !(EdgeKey(uv, slots[s] / 3, slots[s] % 3) == key))
                s = (s + 1) & mask;
            if (slots[s] == kEmpty)
                slots[s] = 3 * triangles[i] + k, counts[s] = 0;
            if (++counts[s] > 2)
                return 0;   // three triangles of the chart on one edge: no outline
        }
    uint32_t appended = 0;
    for (uint64_t s = 0; s < capacity; ++s)
        appended += slots[s] != kEmpty && counts[s] == 1;
    if (appended == 0)
        return 0;
    if (*segmentCount + appended > *room)
    {
        uint64_t grown = (*segmentCount + appended) * 2;
        if (!segments.Grow(4 * *segmentCount, 4 * grown))
            return (*outOfMemory = true), 0;
        *room = grown;
    }
    float* out = segments.Data() + 4 * *segmentCount;
    for (uint64_t s = 0; s < capacity; ++s)
        if (slots[s] != kEmpty && counts[s] == 1)
        {
            uint32_t t = slots[s] / 3, k = slots[s] % 3;
            const float* a = uv + 6ull * t + 2 * k;
            const float* b = uv + 6ull * t + 2 * ((k + 1) % 3);
            out[0] = a[0], out[1] = a[1], out[2] = b[0], out[3] = b[1];
            out += 4;
        }
    *segmentCount += appended;
    return appended;
}
