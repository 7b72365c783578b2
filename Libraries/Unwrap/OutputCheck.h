// Stage 5 of the chart unwrapper: the promises of the output, checked on the final UVs so that a
// broken layout is reported instead of returned.
//   - every UV is a finite number in [0, 1];
//   - no non-degenerate triangle is flipped or has zero UV area (float UVs, exact sign), unless
//     the area it should have at the layout's scale is below what float UVs resolve (1e-10 twice
//     the area: a sliver whose height is under the spacing of floats near 1);
//   - corners of one vertex share one UV inside a chart (checked through each triangle's
//     linked neighbours: the two corners on either side of a linked edge inside one chart).
// Overlaps between charts and the margin are the packing stage's promise (AtlasPacking.h); inside
// a chart the flattening checks (ChartValidity.h) rule them out.
// Cost: linear in triangles.
#pragma once

#include "ChartMesh.h"

// False with *error set to a constant text when a promise is broken.
bool CheckOutput(const ChartMesh& mesh, const uint32_t* chartOf, const float* outUV, const char** error);
