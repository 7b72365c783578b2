// The exports of Unwrap.dll (Windows x64, C names) and the parameter block they take.
#pragma once

#include <stdint.h>

// 20 bytes, stored verbatim in the raw binary mesh file.
struct UnwrapParam
{
    float angleDistortionThreshold;
    float areaDistortionThreshold;
    float hardAngle;
    float packMargin;          // gap between charts, as a fraction of the unit square
    int32_t recollectVertices;
};
static_assert(sizeof(UnwrapParam) == 20, "UnwrapParam is a 20-byte block");

extern "C" __declspec(dllexport) bool GenerateSecondaryUVSet(const float* vertex, int32_t vertexCount, const float* triUV,
                                                             const uint32_t* tri, const uint32_t* srcPoly, int32_t triCount,
                                                             float* outUV, const UnwrapParam& param, char* errorBuffer,
                                                             uint32_t errorBufferSize);
extern "C" __declspec(dllexport) bool Unwrap_TestUnwrapWithDegenerateTriangles();
extern "C" __declspec(dllexport) bool Unwrap_TestUnwrapDontSplitRects();
