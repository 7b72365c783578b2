// Texts that GenerateSecondaryUVSet leaves in the caller's error buffer when a run asks for them
// (LibraryBehaviour.h): they let a test see what the library was called with.
#pragma once

#include "UnwrapApi.h"

#include <stdint.h>

// "rounding <mode>, denormals kept|flushed, control <hex>\n": the rounding of +-1/3, whether half
// the smallest normal float survives, and the SSE control register without its six sticky flags.
void ReportFloatingPointState(char* buffer, uint32_t size);

// "param <5 x hex>; <V> vertices, <T> triangles; triUV none|<hex...>; srcPoly none|<n...>\n": the
// parameter block and the first floats of the optional arrays, bit for bit.
void ReportInputs(const UnwrapParam& param, int32_t vertexCount, int32_t triCount, const float* triUV,
                  const uint32_t* srcPoly, char* buffer, uint32_t size);
