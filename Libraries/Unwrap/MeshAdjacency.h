// Edge adjacency of an indexed triangle mesh. Half-edge h = 3t + c runs from corner c of triangle
// t to corner (c + 1) % 3. Two half-edges are twins when they join the same two vertex indices in
// opposite directions and no other half-edge joins those two vertices: an edge used by more than
// two triangles, or by two triangles of opposite winding, or one whose ends are the same index,
// links nothing.
#pragma once

#include <stdint.h>

const uint32_t kNoTwin = 0xFFFFFFFFu;

inline uint32_t NextCorner(uint32_t halfEdge) { return halfEdge % 3 == 2 ? halfEdge - 2 : halfEdge + 1; }
// The half-edge that ends where `halfEdge` starts, in the same triangle.
inline uint32_t PreviousCorner(uint32_t halfEdge) { return halfEdge % 3 == 0 ? halfEdge + 2 : halfEdge - 1; }

// Fills twin[3 * triCount] in time linear in vertexCount + triCount (two counting sorts of the
// half-edges by their end vertices). Every index must be below vertexCount. False when scratch
// memory runs out.
bool FindTwins(const uint32_t* tri, uint32_t triCount, uint32_t vertexCount, uint32_t* twin);
