#pragma once
// Triangulation of one polygon face (convex or concave, planar or nearly so) by ear clipping in
// the plane of its Newell normal. Always answers n - 2 triangles for n corners, in the polygon's
// winding, as corner numbers 0..n-1; a polygon with no ear left (self-intersecting or degenerate)
// is finished as a fan. Cost: O(n^2) for n corners, fine for the faces of real meshes.

#include <cstdint>
#include <vector>

// `points`: 3 floats a corner.
std::vector<uint32_t> TriangulatePolygon(const std::vector<float>& points);
