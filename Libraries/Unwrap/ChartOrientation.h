// Turns a flattened chart so that its smallest bounding rectangle lies along the axes, wider than
// tall, with its lower left corner at (0, 0). Packing may turn charts again; this gives every packer
// a tight box to start from. The smallest rectangle has a side along an edge of the convex hull,
// so every hull edge's direction is tried (up to 256 of them, evenly picked, on large hulls).
// Rigid: turning only, orientation kept. Cost: O(n log n) for the hull, O(h * min(h, 256)) after.
#pragma once

#include <stdint.h>

// uv: 2 doubles a point, `count` points, turned in place. False when scratch memory runs out.
bool TurnToSmallestBox(double* uv, uint32_t count);
