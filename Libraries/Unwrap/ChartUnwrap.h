// The default layout of GenerateSecondaryUVSet: charts grown over the mesh (ChartSegmentation),
// each flattened onto its plane (ChartProjection), all packed at one scale (ChartPacking).
#pragma once

#include "UnwrapApi.h"

#include <stdint.h>

// Writes 6 floats a triangle into outUV, all in [0, 1]. The mesh has been checked: every index is
// below vertexCount and every position is finite. srcPoly (one source polygon a triangle) may be
// null. With param.recollectVertices set, vertices at the same position count as one
// (VertexWelding.h). On failure returns false with *error set to a constant text.
bool UnwrapIntoCharts(const float* vertex, uint32_t vertexCount, const uint32_t* tri, const uint32_t* srcPoly,
                      uint32_t triCount, const UnwrapParam& param, float* outUV, const char** error);
