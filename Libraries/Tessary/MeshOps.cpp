#include "MeshOps.h"

namespace
{
    bool IsDegenerate(const uint32_t* t, uint32_t vertexCount)
    {
        return t[0] == t[1] || t[1] == t[2] || t[0] == t[2] || t[0] >= vertexCount || t[1] >= vertexCount ||
               t[2] >= vertexCount;
    }

    uint32_t Find(uint32_t* parent, uint32_t v)
    {
        while (parent[v] != v)
        {
            parent[v] = parent[parent[v]];
            v = parent[v];
        }
        return v;
    }
}

uint32_t RemoveDegenerateTriangles(Tessary_MeshDesc* mesh)
{
    uint32_t kept = 0;
    for (uint32_t t = 0; t < mesh->triCount; ++t)
    {
        const uint32_t* tri = mesh->indices + 3 * t;
        if (IsDegenerate(tri, mesh->vertexCount))
            continue;
        memmove(mesh->indices + 3 * kept, tri, 12);
        ++kept;
    }
    uint32_t removed = mesh->triCount - kept;
    mesh->triCount = kept;
    return removed;
}

uint32_t RemoveUnusedVertices(Tessary_MeshDesc* mesh)
{
    uint32_t* newIndex = (uint32_t*)Tessary_Allocate(mesh->vertexCount * 4 + 4);
    memset(newIndex, 0xFF, mesh->vertexCount * 4);
    for (uint32_t i = 0; i < 3 * mesh->triCount; ++i)
        newIndex[mesh->indices[i]] = 0;
    uint32_t kept = 0;
    for (uint32_t v = 0; v < mesh->vertexCount; ++v)
    {
        if (newIndex[v] == 0xFFFFFFFFu)
            continue;
        memmove(mesh->positions + 3 * kept, mesh->positions + 3 * v, 12);
        newIndex[v] = kept++;
    }
    for (uint32_t i = 0; i < 3 * mesh->triCount; ++i)
        mesh->indices[i] = newIndex[mesh->indices[i]];
    Tessary_Deallocate(newIndex);
    uint32_t removed = mesh->vertexCount - kept;
    mesh->vertexCount = kept;
    return removed;
}

uint32_t CollapseEdge(Tessary_MeshDesc* mesh, uint32_t kept, uint32_t removed)
{
    for (uint32_t i = 0; i < 3 * mesh->triCount; ++i)
        if (mesh->indices[i] == removed)
            mesh->indices[i] = kept;
    return RemoveDegenerateTriangles(mesh);
}

uint32_t SplitConnected(const Tessary_MeshDesc& mesh, uint32_t* component)
{
    uint32_t* parent = (uint32_t*)Tessary_Allocate(mesh.vertexCount * 4 + 4);
    for (uint32_t v = 0; v < mesh.vertexCount; ++v)
        parent[v] = v;
    for (uint32_t t = 0; t < mesh.triCount; ++t)
        for (int c = 1; c < 3; ++c)
            parent[Find(parent, mesh.indices[3 * t + c])] = Find(parent, mesh.indices[3 * t]);
    HashTab label;
    for (uint32_t t = 0; t < mesh.triCount; ++t)
    {
        uint32_t root = Find(parent, mesh.indices[3 * t]);
        if (!label.Get(root, &component[t]))
        {
            component[t] = label.count;
            label.Set(root, component[t]);
        }
    }
    uint32_t count = label.count;
    label.Release();
    Tessary_Deallocate(parent);
    return count;
}

uint32_t FixNonManifoldEdges(Tessary_MeshDesc* mesh)
{
    HashTab uses;
    uint32_t kept = 0;
    for (uint32_t t = 0; t < mesh->triCount; ++t)
    {
        const uint32_t* tri = mesh->indices + 3 * t;
        uint32_t counts[3] = {0, 0, 0};
        bool overfull = false;
        for (int c = 0; c < 3; ++c)
        {
            uses.Get(EdgeKey(tri[c], tri[(c + 1) % 3]), &counts[c]);
            overfull = overfull || counts[c] >= 2;
        }
        if (overfull)
            continue;
        for (int c = 0; c < 3; ++c)
            uses.Set(EdgeKey(tri[c], tri[(c + 1) % 3]), counts[c] + 1);
        memmove(mesh->indices + 3 * kept, tri, 12);
        ++kept;
    }
    uses.Release();
    uint32_t removed = mesh->triCount - kept;
    mesh->triCount = kept;
    return removed;
}

bool BuildVertexTriangleMap(const Tessary_MeshDesc& mesh, HashTab* map)
{
    for (uint32_t t = 0; t < mesh.triCount; ++t)
        for (int c = 0; c < 3; ++c)
        {
            uint32_t existing;
            if (!map->Get(mesh.indices[3 * t + c], &existing) && !map->Set(mesh.indices[3 * t + c], t))
                return false;
        }
    return true;
}

bool MakeMesh(Tessary_MeshDesc* mesh, const float* positions, uint32_t vertexCount, const uint32_t* indices, uint32_t triCount)
{
    mesh->vertexCount = vertexCount;
    mesh->triCount = triCount;
    mesh->positions = (float*)Tessary_Allocate(vertexCount * 12 + 4);
    mesh->indices = (uint32_t*)Tessary_Allocate(triCount * 12 + 4);
    if (!mesh->positions || !mesh->indices)
        return false;
    memcpy(mesh->positions, positions, vertexCount * 12);
    memcpy(mesh->indices, indices, triCount * 12);
    return true;
}
