// Packing, step 0b: a chart's outline. A chart's texels can be drawn from its boundary instead
// of its triangles: the texels the boundary touches, plus those whose centres lie inside it (an
// even-odd test along each row). A texel that the chart touches either holds a boundary point or
// lies wholly inside, so both drawings set the same texels; the outline costs its boundary edges
// instead of all triangles, which pays on charts of many small triangles.
//
// The boundary edges are the triangle edges that no other triangle of the chart shares: within a
// chart, the corners of one vertex share one UV, so an edge is known by its two end UVs, bit for bit.
#pragma once

#include "Scratch.h"

#include <stdint.h>

struct OutlineScratch
{
    Scratch<uint32_t> slots;   // open-addressing table of edges (3t + k: edge k of triangle t)
    Scratch<uint32_t> counts;  // how often each slot's edge occurs
    uint64_t capacity = 0;     // slots, a power of two
};

// Appends the chart's boundary edges to `segments` (4 floats an edge: u0 v0 u1 v1; the array
// holds *count edges and room for *room, grown as needed). Returns the number appended, or 0
// when the outline cannot stand for the chart (an edge met more than twice, or no edge) and the
// triangles must be drawn; *outOfMemory is set when memory runs out.
// Cost: the chart's corners, through a hash table of twice as many slots as edges.
uint32_t AppendOutline(const float* uv, const uint32_t* triangles, uint32_t count, OutlineScratch& scratch,
                       Scratch<float>& segments, uint64_t* segmentCount, uint64_t* room, bool* outOfMemory);
