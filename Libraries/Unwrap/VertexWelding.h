// Welds vertices that sit at the very same position, for meshes whose exporter split vertices
// (at normal or UV seams) that the unwrapper should see as one: GenerateSecondaryUVSet does this
// when UnwrapParam::recollectVertices is non-zero.
#pragma once

#include <stdint.h>

// Writes into weldedTri (3 a triangle) the triangle indices with every vertex replaced by the
// lowest-numbered vertex at bit-for-bit the same position (+0 and -0 counting as one). Expected
// linear time (a hash table of positions). False when scratch memory runs out.
bool WeldVertices(const float* vertex, uint32_t vertexCount, const uint32_t* tri, uint32_t triCount, uint32_t* weldedTri);
