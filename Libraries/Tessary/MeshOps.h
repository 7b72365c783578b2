// Mesh operations behind Tessary's services and self-tests. All work in place on a
// Tessary_MeshDesc whose arrays come from Tessary_Allocate.
#pragma once

#include "Containers.h"

// Drops triangles with two equal corners or a corner outside the vertex range; returns how many.
uint32_t RemoveDegenerateTriangles(Tessary_MeshDesc* mesh);

// Drops vertices no triangle uses and renumbers the rest in order; returns how many.
uint32_t RemoveUnusedVertices(Tessary_MeshDesc* mesh);

// Merges vertex `removed` into `kept` and drops the triangles that collapse; returns how many.
uint32_t CollapseEdge(Tessary_MeshDesc* mesh, uint32_t kept, uint32_t removed);

// Labels each triangle with its vertex-connected component (0, 1, ...) and
// returns the number of components. `component` has room for triCount entries.
uint32_t SplitConnected(const Tessary_MeshDesc& mesh, uint32_t* component);

// Key of the undirected edge (a, b) for meshes below 65,536 vertices.
inline uint32_t EdgeKey(uint32_t a, uint32_t b) { return a < b ? (a << 16) | b : (b << 16) | a; }

// Drops every triangle that would make an edge shared by more than two triangles (meshes below
// 65,536 vertices); returns how many.
uint32_t FixNonManifoldEdges(Tessary_MeshDesc* mesh);

// Maps every used vertex to the first triangle that uses it.
bool BuildVertexTriangleMap(const Tessary_MeshDesc& mesh, HashTab* map);

// A fresh mesh from literal data, on Tessary's allocator.
bool MakeMesh(Tessary_MeshDesc* mesh, const float* positions, uint32_t vertexCount, const uint32_t* indices, uint32_t triCount);
