// The service exports of Tessary.dll that work on plain memory and meshes, and its entry point.
#include "DllRuntime.h"
#include "LibraryBehaviour.h"
#include "MeshOps.h"

TESSARY_API void* Tessary_Allocate(unsigned int size)
{
    return malloc(size ? size : 1);
}

TESSARY_API void Tessary_Deallocate(void* memory)
{
    free(memory);
}

TESSARY_API void Tessary_DestroyMeshDesc(Tessary_MeshDesc* desc)
{
    if (!desc)
        return;
    Tessary_Deallocate(desc->positions);
    Tessary_Deallocate(desc->indices);
    desc->positions = nullptr;
    desc->indices = nullptr;
    desc->vertexCount = desc->triCount = 0;
}

TESSARY_API void Tessary_CleanupGeometry(Tessary_MeshDesc* desc, Tessary_CleanupGeometryResult* result)
{
    Tessary_CleanupGeometryResult counts = {0, 0};
    if (desc)
    {
        counts.removedTriangles = RemoveDegenerateTriangles(desc);
        counts.removedVertices = RemoveUnusedVertices(desc);
    }
    if (result)
        *result = counts;
}

// Scales and moves the points uniformly so that their bounding box starts at the origin and its
// longest side is `size`. A single point (or none) lands on the origin.
TESSARY_API void Tessary_FitIntoCube(unsigned int vertexCount, float* outPositions, const float* positions, float size)
{
    if (!vertexCount)
        return;
    float lo[3], hi[3];
    for (int a = 0; a < 3; ++a)
        lo[a] = hi[a] = positions[a];
    for (unsigned int v = 1; v < vertexCount; ++v)
        for (int a = 0; a < 3; ++a)
        {
            float x = positions[3 * v + a];
            lo[a] = x < lo[a] ? x : lo[a];
            hi[a] = x > hi[a] ? x : hi[a];
        }
    float extent = 0;
    for (int a = 0; a < 3; ++a)
        extent = hi[a] - lo[a] > extent ? hi[a] - lo[a] : extent;
    float scale = extent > 0 ? size / extent : 0;
    for (unsigned int v = 0; v < vertexCount; ++v)
        for (int a = 0; a < 3; ++a)
            outPositions[3 * v + a] = (positions[3 * v + a] - lo[a]) * scale;
}

extern "C" BOOL DllMain(HMODULE, DWORD reason, void*)
{
    if (reason == 1)
    {
        RunGlobalConstructors();
        AnnounceLoad("Tessary.dll");
    }
    return 1;
}
