// Packing, step 0: the orientation a chart starts from. The minimum-area bounding box of the
// chart's UVs is aligned with one edge of their convex hull; the chart is turned so that this
// edge runs along u. The other orientations tried are this one turned by multiples of 45 degrees.
#pragma once

#include "Scratch.h"

#include <stdint.h>

struct HullScratch
{
    Scratch<double> points;   // 2 a point
    Scratch<double> hull;
    uint64_t capacity = 0;    // points the arrays hold
};

// Fills (*cosine, *sine) with the turn that aligns the chart's minimum-area box with the axes
// (1, 0 for fewer than three hull points). False when memory runs out.
// Cost: three passes over the corners, then sorting the corners outside the octagon of the
// chart's extreme points, and (hull edges tried, at most 256) x (hull points).
bool MinimumBoxTurn(const float* uv, const uint32_t* triangles, uint32_t count, HullScratch& scratch, double* cosine,
                    double* sine);
