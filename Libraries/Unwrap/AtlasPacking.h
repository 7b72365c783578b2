// Packing stage: places flattened charts into the unit square at one common scale (one texel
// density for the whole mesh).
//
// Input: `uv`, 6 floats a triangle (2 a corner), every chart flattened in the mesh's own units at
// any position and orientation; `chartOf[t]`, the chart of triangle t, below `chartCount`, every
// chart holding at least one triangle; `margin`, the gap required between any two charts and
// between every chart and the square's border.
// Output: `uv` rewritten in place. Each chart is moved rigidly (translated and turned, never
// mirrored) and scaled by the one factor common to all charts; every UV lies in [margin, 1 - margin].
// The margin is a hard guarantee: when the charts cannot be placed with it, the stage fails with
// a message rather than bring charts closer.
// Returns false with *error set to a constant text when memory runs out or the margin cannot be met.
#pragma once

#include <stdint.h>

bool PackAtlas(float* uv, const uint32_t* chartOf, uint32_t triCount, uint32_t chartCount, double margin,
               const char** error);
