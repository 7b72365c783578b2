// The exports of Tessary.dll as its clients see them (Windows x64, C names). Built inside
// Tessary.dll they are exported, elsewhere imported.
#pragma once

#include <stdint.h>

#ifdef TESSARY_BUILD
#define TESSARY_API extern "C" __declspec(dllexport)
#else
#define TESSARY_API extern "C" __declspec(dllimport)
#endif

// An indexed triangle mesh; both arrays come from Tessary_Allocate and belong to the desc.
struct Tessary_MeshDesc
{
    uint32_t vertexCount;
    uint32_t triCount;
    float* positions;    // 3 floats a vertex
    uint32_t* indices;   // 3 vertex indices a triangle
};

struct Tessary_CleanupGeometryResult
{
    uint32_t removedTriangles;
    uint32_t removedVertices;
};

typedef struct Tessary_ProgressiveMeshData* Tessary_ProgressiveMesh;

TESSARY_API void* Tessary_Allocate(unsigned int size);
TESSARY_API void Tessary_Deallocate(void* memory);
TESSARY_API void Tessary_DestroyMeshDesc(Tessary_MeshDesc* desc);
TESSARY_API void Tessary_CleanupGeometry(Tessary_MeshDesc* desc, Tessary_CleanupGeometryResult* result);
TESSARY_API void Tessary_FitIntoCube(unsigned int vertexCount, float* outPositions, const float* positions, float size);
TESSARY_API Tessary_ProgressiveMesh Tessary_CreateProgressiveMesh(const Tessary_MeshDesc& desc);
TESSARY_API void Tessary_DestroyProgressiveMesh(Tessary_ProgressiveMesh pm);
TESSARY_API void Tessary_PMGenerateGeometry(Tessary_ProgressiveMesh pm, Tessary_MeshDesc* out);
TESSARY_API void Tessary_PMUpdateTriangles(Tessary_ProgressiveMesh pm, unsigned int targetTriCount, Tessary_MeshDesc* out);
TESSARY_API void Tessary_PMUpdateTrianglesWithSourceInfo(Tessary_ProgressiveMesh pm, unsigned int targetTriCount,
                                                         Tessary_MeshDesc* out, unsigned int** sourceTriangles);
TESSARY_API int Tessary_PMSplitCount(Tessary_ProgressiveMesh pm);
TESSARY_API void Tessary_LiftSegmentationFromLod(Tessary_ProgressiveMesh pm, int* segmentation);
TESSARY_API void Tessary_LiftSegmentationFromLodIter(Tessary_ProgressiveMesh pm, int* segmentation, int iterations);
