// The progressive mesh: a mesh reduced by collapsing its shortest edges, with the bookkeeping to
// map the reduced triangles back to the original ones. Reductions are computed naively
// (shortest edge by a full scan per collapse): the library serves small meshes here.
#include "MeshOps.h"

struct Tessary_ProgressiveMeshData
{
    Tessary_MeshDesc original;
    Tessary_MeshDesc current;      // positions shared with `original`, indices its own
    uint32_t* sourceTriangle;      // per current triangle: its original triangle
    uint32_t* representative;      // per original vertex: the vertex it was merged into
    int splitCount;                // collapses made by the last update
};

namespace
{
    float EdgeLength2(const float* p, uint32_t a, uint32_t b)
    {
        float d0 = p[3 * a] - p[3 * b], d1 = p[3 * a + 1] - p[3 * b + 1], d2 = p[3 * a + 2] - p[3 * b + 2];
        return d0 * d0 + d1 * d1 + d2 * d2;
    }

    bool ShortestEdge(const Tessary_ProgressiveMeshData& pm, uint32_t* kept, uint32_t* removed)
    {
        bool found = false;
        float best = 0;
        for (uint32_t i = 0; i < 3 * pm.current.triCount; ++i)
        {
            uint32_t a = pm.current.indices[i], b = pm.current.indices[i % 3 == 2 ? i - 2 : i + 1];
            float length = EdgeLength2(pm.original.positions, a, b);
            if (!found || length < best)
            {
                found = true;
                best = length;
                *kept = a;
                *removed = b;
            }
        }
        return found;
    }

    void Collapse(Tessary_ProgressiveMeshData* pm, uint32_t kept, uint32_t removed)
    {
        for (uint32_t v = 0; v < pm->original.vertexCount; ++v)
            if (pm->representative[v] == removed)
                pm->representative[v] = kept;
        uint32_t alive = 0;
        for (uint32_t t = 0; t < pm->current.triCount; ++t)
        {
            uint32_t* tri = pm->current.indices + 3 * t;
            for (int c = 0; c < 3; ++c)
                tri[c] = tri[c] == removed ? kept : tri[c];
            if (tri[0] == tri[1] || tri[1] == tri[2] || tri[0] == tri[2])
                continue;
            memmove(pm->current.indices + 3 * alive, tri, 12);
            pm->sourceTriangle[alive++] = pm->sourceTriangle[t];
        }
        pm->current.triCount = alive;
    }

    void Reset(Tessary_ProgressiveMeshData* pm)
    {
        pm->current.triCount = pm->original.triCount;
        memcpy(pm->current.indices, pm->original.indices, pm->original.triCount * 12);
        for (uint32_t t = 0; t < pm->original.triCount; ++t)
            pm->sourceTriangle[t] = t;
        for (uint32_t v = 0; v < pm->original.vertexCount; ++v)
            pm->representative[v] = v;
        pm->splitCount = 0;
    }

    void CopyCurrent(const Tessary_ProgressiveMeshData& pm, Tessary_MeshDesc* out)
    {
        MakeMesh(out, pm.original.positions, pm.original.vertexCount, pm.current.indices, pm.current.triCount);
    }
}

TESSARY_API Tessary_ProgressiveMesh Tessary_CreateProgressiveMesh(const Tessary_MeshDesc& desc)
{
    Tessary_ProgressiveMeshData* pm = (Tessary_ProgressiveMeshData*)Tessary_Allocate(sizeof(Tessary_ProgressiveMeshData));
    MakeMesh(&pm->original, desc.positions, desc.vertexCount, desc.indices, desc.triCount);
    RemoveDegenerateTriangles(&pm->original);
    pm->current = pm->original;
    pm->current.indices = (uint32_t*)Tessary_Allocate(pm->original.triCount * 12 + 4);
    pm->sourceTriangle = (uint32_t*)Tessary_Allocate(pm->original.triCount * 4 + 4);
    pm->representative = (uint32_t*)Tessary_Allocate(pm->original.vertexCount * 4 + 4);
    Reset(pm);
    return pm;
}

TESSARY_API void Tessary_DestroyProgressiveMesh(Tessary_ProgressiveMesh pm)
{
    if (!pm)
        return;
    Tessary_DestroyMeshDesc(&pm->original);
    Tessary_Deallocate(pm->current.indices);
    Tessary_Deallocate(pm->sourceTriangle);
    Tessary_Deallocate(pm->representative);
    Tessary_Deallocate(pm);
}

TESSARY_API void Tessary_PMGenerateGeometry(Tessary_ProgressiveMesh pm, Tessary_MeshDesc* out)
{
    CopyCurrent(*pm, out);
}

TESSARY_API void Tessary_PMUpdateTrianglesWithSourceInfo(Tessary_ProgressiveMesh pm, unsigned int targetTriCount,
                                                         Tessary_MeshDesc* out, unsigned int** sourceTriangles)
{
    Reset(pm);
    uint32_t kept, removed;
    while (pm->current.triCount > targetTriCount && ShortestEdge(*pm, &kept, &removed))
    {
        Collapse(pm, kept, removed);
        ++pm->splitCount;
    }
    if (out)
        CopyCurrent(*pm, out);
    if (sourceTriangles)
    {
        *sourceTriangles = (unsigned int*)Tessary_Allocate(pm->current.triCount * 4 + 4);
        memcpy(*sourceTriangles, pm->sourceTriangle, pm->current.triCount * 4);
    }
}

TESSARY_API void Tessary_PMUpdateTriangles(Tessary_ProgressiveMesh pm, unsigned int targetTriCount, Tessary_MeshDesc* out)
{
    Tessary_PMUpdateTrianglesWithSourceInfo(pm, targetTriCount, out, nullptr);
}

TESSARY_API int Tessary_PMSplitCount(Tessary_ProgressiveMesh pm)
{
    return pm ? pm->splitCount : 0;
}

// `segmentation` holds one segment per original triangle; entries of the triangles that survive
// in the current level of detail are given. Each pass gives every other triangle the segment of
// an already labelled triangle that shares a merged corner with it.
TESSARY_API void Tessary_LiftSegmentationFromLodIter(Tessary_ProgressiveMesh pm, int* segmentation, int iterations)
{
    uint32_t triCount = pm->original.triCount;
    uint8_t* labelled = (uint8_t*)Tessary_Allocate(triCount + 1);
    memset(labelled, 0, triCount);
    for (uint32_t t = 0; t < pm->current.triCount; ++t)
        labelled[pm->sourceTriangle[t]] = 1;
    for (int pass = 0; pass < iterations; ++pass)
    {
        HashTab segmentOfVertex;
        for (uint32_t t = 0; t < triCount; ++t)
            for (int c = 0; c < 3 && labelled[t]; ++c)
                segmentOfVertex.Set(pm->representative[pm->original.indices[3 * t + c]], (uint32_t)segmentation[t]);
        for (uint32_t t = 0; t < triCount; ++t)
            for (int c = 0; c < 3 && !labelled[t]; ++c)
            {
                uint32_t segment;
                if (segmentOfVertex.Get(pm->representative[pm->original.indices[3 * t + c]], &segment))
                {
                    segmentation[t] = (int)segment;
                    labelled[t] = 2;
                }
            }
        segmentOfVertex.Release();
    }
    Tessary_Deallocate(labelled);
}

TESSARY_API void Tessary_LiftSegmentationFromLod(Tessary_ProgressiveMesh pm, int* segmentation)
{
    Tessary_LiftSegmentationFromLodIter(pm, segmentation, 1);
}
