#include "Editor/Tools/Unwrap/source/MeshTool/AssimpImport.h"

#include "Editor/Tools/Unwrap/source/MeshTool/PolygonTriangulation.h"

#include <assimp/Importer.hpp>
#include <assimp/material.h>
#include <assimp/postprocess.h>
#include <assimp/scene.h>

#include <filesystem>

namespace
{
    SceneMaterial ConvertMaterial(const aiMaterial& source)
    {
        SceneMaterial material;
        aiString name;
        if (source.Get(AI_MATKEY_NAME, name) == AI_SUCCESS)
            material.name = name.C_Str();
        aiColor4D diffuse;
        if (source.Get(AI_MATKEY_COLOR_DIFFUSE, diffuse) == AI_SUCCESS)
        {
            material.color[0] = diffuse.r;
            material.color[1] = diffuse.g;
            material.color[2] = diffuse.b;
            material.color[3] = diffuse.a;
        }
        aiString texture;
        if (source.GetTexture(aiTextureType_DIFFUSE, 0, &texture) == AI_SUCCESS && texture.C_Str()[0] != '*')
            material.texture = texture.C_Str();
        return material;
    }

    ScenePrimitive ConvertMesh(const aiMesh& mesh, const aiMatrix4x4& world, const std::string& nodeName)
    {
        ScenePrimitive primitive;
        primitive.name = nodeName.empty() ? mesh.mName.C_Str() : nodeName;
        primitive.material = (int)mesh.mMaterialIndex;
        aiMatrix3x3 normalMatrix = aiMatrix3x3(world);
        normalMatrix.Inverse().Transpose();
        for (unsigned v = 0; v < mesh.mNumVertices; ++v)
        {
            aiVector3D p = world * mesh.mVertices[v];
            primitive.positions.insert(primitive.positions.end(), {p.x, p.y, p.z});
            if (mesh.mNormals)
            {
                aiVector3D n = (normalMatrix * mesh.mNormals[v]).NormalizeSafe();
                primitive.normals.insert(primitive.normals.end(), {n.x, n.y, n.z});
            }
            if (mesh.mTextureCoords[0])
                primitive.uvs.insert(primitive.uvs.end(), {mesh.mTextureCoords[0][v].x, mesh.mTextureCoords[0][v].y});
        }
        // Polygons are cut here rather than by assimp, whose triangulation covers the notch of
        // concave polygons; each triangle remembers its polygon for the unwrapper.
        for (unsigned f = 0; f < mesh.mNumFaces; ++f)
        {
            const aiFace& face = mesh.mFaces[f];
            if (face.mNumIndices < 3)
                continue;
            std::vector<float> corners;
            for (unsigned c = 0; c < face.mNumIndices; ++c)
            {
                const aiVector3D& p = mesh.mVertices[face.mIndices[c]];
                corners.insert(corners.end(), {p.x, p.y, p.z});
            }
            for (uint32_t corner : TriangulatePolygon(corners))
                primitive.indices.push_back(face.mIndices[corner]);
            primitive.sourcePolygon.resize(primitive.indices.size() / 3, f);
        }
        return primitive;
    }

    // Every mesh instance under `node`, in world space; each node is one atlas group.
    void CollectNode(const aiScene& source, const aiNode& node, const aiMatrix4x4& parent, MeshScene* scene, int* group)
    {
        aiMatrix4x4 world = parent * node.mTransformation;
        int nodeGroup = (*group)++;
        for (unsigned i = 0; i < node.mNumMeshes; ++i)
        {
            const aiMesh& mesh = *source.mMeshes[node.mMeshes[i]];
            if (!(mesh.mPrimitiveTypes & (aiPrimitiveType_TRIANGLE | aiPrimitiveType_POLYGON)))
                continue;
            ScenePrimitive primitive = ConvertMesh(mesh, world, node.mName.C_Str());
            primitive.atlasGroup = nodeGroup;
            if (primitive.TriangleCount() > 0)
                scene->primitives.push_back(std::move(primitive));
        }
        for (unsigned c = 0; c < node.mNumChildren; ++c)
            CollectNode(source, *node.mChildren[c], world, scene, group);
    }
}

std::string ImportWithAssimp(const std::string& path, MeshScene* scene)
{
    Assimp::Importer importer;
    const aiScene* source = importer.ReadFile(path, aiProcess_JoinIdenticalVertices | aiProcess_ValidateDataStructure);
    if (!source)
        return importer.GetErrorString();
    if (!source->mRootNode)
        return "the file holds no scene";
    for (unsigned m = 0; m < source->mNumMaterials; ++m)
        scene->materials.push_back(ConvertMaterial(*source->mMaterials[m]));
    int group = 0;
    CollectNode(*source, *source->mRootNode, aiMatrix4x4(), scene, &group);
    // assimp invents a material for meshes that name none; the output should not carry it.
    for (ScenePrimitive& primitive : scene->primitives)
        if (primitive.material >= 0 && scene->materials[(size_t)primitive.material].name == AI_DEFAULT_MATERIAL_NAME)
            primitive.material = -1;
    scene->sourceDirectory = std::filesystem::path(path).parent_path().string();
    return "";
}
