#pragma once
// Per-vertex lightmap UVs from per-corner ones: a vertex whose corners got one UV stays one
// vertex; a vertex on a chart seam is copied once for every distinct UV its corners got. Only
// referenced vertices are kept, in order of first use.

#include <cstdint>
#include <vector>

struct VertexSplit
{
    std::vector<uint32_t> sourceVertex;   // for each new vertex, the vertex it copies
    std::vector<uint32_t> indices;        // the triangle list in new vertex numbers
    std::vector<float> uvs;               // 2 a new vertex
};

// `indices`: 3 a triangle; `cornerUVs`: 2 a corner, corner c of triangle t at 3t + c.
VertexSplit SplitVerticesByUV(const std::vector<uint32_t>& indices, const std::vector<float>& cornerUVs);
