// Finds a chart that its planar projection folds onto itself: possible even when no triangle
// flips, for instance on a spiral ramp that winds around once and a bit. When every triangle
// keeps its orientation, the projection overlaps itself only if its boundary crosses itself, so
// only the boundary edges are compared.
#pragma once

#include <stdint.h>

// True when two of the chart's boundary half-edges (`boundary`, `count` of them; corner UVs in
// outUV, vertex indices in tri) cross, or run along each other from a common vertex, or join the
// same two vertices in the same direction. Edges that only touch do not count. The edges are
// sorted into a quadtree over the chart's box [0, width] x [0, height], and only edges sharing a
// leaf (at most 16 edges, unless 24 levels deep) are compared, each pair once. A chart needing more
// than 64 comparisons an edge, or more room than 16 list entries an edge, counts as crossing too:
// it is cheaper to split it than to prove it flat.
bool BoundaryCrossesItself(const uint32_t* tri, const uint32_t* boundary, uint32_t count, const float* outUV, double width,
                           double height);
