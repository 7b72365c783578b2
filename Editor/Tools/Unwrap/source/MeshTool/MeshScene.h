#pragma once
// The format-neutral scene every importer produces and the unwrap, the OBJ writer and the layout
// picture consume: triangle lists in world space with their first UV set, normals and material.

#include <cstdint>
#include <string>
#include <vector>

struct ScenePrimitive
{
    std::string name;               // object or group name, for OBJ groups
    int material = -1;              // index into MeshScene::materials, -1 for none
    int atlasGroup = 0;             // primitives of one group share an atlas under --per-mesh
    int sourceMesh = -1;            // glTF input: the mesh and primitive this came from
    int sourcePrimitive = -1;
    std::vector<float> positions;   // 3 a vertex, world space
    std::vector<float> normals;     // 3 a vertex, or empty
    std::vector<float> uvs;         // 2 a vertex (the first UV set), or empty
    std::vector<uint32_t> indices;  // 3 a triangle, each < vertex count
    std::vector<uint32_t> sourcePolygon;  // per triangle, the polygon face it was cut from, or empty

    uint32_t VertexCount() const { return (uint32_t)(positions.size() / 3); }
    uint32_t TriangleCount() const { return (uint32_t)(indices.size() / 3); }
};

struct SceneMaterial
{
    std::string name;
    float color[4] = {1, 1, 1, 1};  // base colour, linear RGBA
    std::string texture;            // base colour texture path as the input names it, or empty
};

struct MeshScene
{
    std::vector<ScenePrimitive> primitives;
    std::vector<SceneMaterial> materials;
    std::string sourceDirectory;    // where relative texture paths start

    uint64_t TriangleCount() const
    {
        uint64_t count = 0;
        for (const ScenePrimitive& primitive : primitives)
            count += primitive.TriangleCount();
        return count;
    }
};

// The lightmap UVs of one primitive: 2 floats a triangle corner, corner c of triangle t at 3t + c.
typedef std::vector<float> CornerUVs;
