#include "Editor/Tools/Unwrap/source/MeshTool/GltfFromScene.h"

#include "Editor/Tools/Unwrap/source/MeshTool/GltfAccessors.h"

#include <cmath>
#include <cstring>

namespace
{
    int AppendFloats(tinygltf::Model* model, const std::vector<float>& values, int type, int components, bool bounds)
    {
        tinygltf::Accessor like;
        like.type = type;
        like.componentType = TINYGLTF_COMPONENT_TYPE_FLOAT;
        DenseAccessor dense;
        dense.elementSize = 4 * (size_t)components;
        dense.count = values.size() / (size_t)components;
        dense.bytes.resize(values.size() * 4);
        std::memcpy(dense.bytes.data(), values.data(), dense.bytes.size());
        model->accessors.push_back(AppendAccessorData(model, 0, like, dense, TINYGLTF_TARGET_ARRAY_BUFFER, bounds));
        return (int)model->accessors.size() - 1;
    }

    int AppendIndices(tinygltf::Model* model, const std::vector<uint32_t>& indices)
    {
        tinygltf::Accessor like;
        like.type = TINYGLTF_TYPE_SCALAR;
        like.componentType = TINYGLTF_COMPONENT_TYPE_UNSIGNED_INT;
        DenseAccessor dense;
        dense.elementSize = 4;
        dense.count = indices.size();
        dense.bytes.resize(indices.size() * 4);
        std::memcpy(dense.bytes.data(), indices.data(), dense.bytes.size());
        model->accessors.push_back(AppendAccessorData(model, 0, like, dense, TINYGLTF_TARGET_ELEMENT_ARRAY_BUFFER, false));
        return (int)model->accessors.size() - 1;
    }

    void AddMaterials(tinygltf::Model* model, const MeshScene& scene)
    {
        for (const SceneMaterial& source : scene.materials)
        {
            tinygltf::Material material;
            material.name = source.name;
            material.pbrMetallicRoughness.baseColorFactor = {source.color[0], source.color[1], source.color[2],
                                                             source.color[3]};
            material.pbrMetallicRoughness.metallicFactor = 0;
            if (!source.texture.empty())
            {
                tinygltf::Image image;
                image.uri = source.texture;
                model->images.push_back(image);
                tinygltf::Texture texture;
                texture.source = (int)model->images.size() - 1;
                model->textures.push_back(texture);
                material.pbrMetallicRoughness.baseColorTexture.index = (int)model->textures.size() - 1;
            }
            model->materials.push_back(material);
        }
    }
}

namespace
{
    // glTF requires unit normals; importers leave zero ones on degenerate faces.
    std::vector<float> UnitNormals(std::vector<float> normals)
    {
        for (size_t i = 0; i + 2 < normals.size(); i += 3)
        {
            float* n = &normals[i];
            double length = std::sqrt((double)n[0] * n[0] + (double)n[1] * n[1] + (double)n[2] * n[2]);
            if (!(length > 1e-12))
                n[0] = 0, n[1] = 0, n[2] = 1;
            else
                for (int c = 0; c < 3; ++c)
                    n[c] = (float)(n[c] / length);
        }
        return normals;
    }
}

GltfDocument BuildGltfFromScene(MeshScene* scene)
{
    GltfDocument document;
    document.directory = scene->sourceDirectory;
    tinygltf::Model& model = document.model;
    model.asset.version = "2.0";
    model.asset.generator = "chartbake-mesh";
    model.buffers.emplace_back();
    AddMaterials(&model, *scene);
    model.scenes.emplace_back();
    model.defaultScene = 0;
    for (ScenePrimitive& source : scene->primitives)
    {
        tinygltf::Primitive primitive;
        primitive.mode = TINYGLTF_MODE_TRIANGLES;
        primitive.material = source.material;
        primitive.attributes["POSITION"] = AppendFloats(&model, source.positions, TINYGLTF_TYPE_VEC3, 3, true);
        if (!source.normals.empty())
            primitive.attributes["NORMAL"] = AppendFloats(&model, UnitNormals(source.normals), TINYGLTF_TYPE_VEC3, 3, false);
        if (!source.uvs.empty())
            primitive.attributes["TEXCOORD_0"] = AppendFloats(&model, source.uvs, TINYGLTF_TYPE_VEC2, 2, false);
        primitive.indices = AppendIndices(&model, source.indices);
        tinygltf::Mesh mesh;
        mesh.name = source.name;
        mesh.primitives.push_back(primitive);
        model.meshes.push_back(mesh);
        tinygltf::Node node;
        node.name = source.name;
        node.mesh = (int)model.meshes.size() - 1;
        model.nodes.push_back(node);
        model.scenes[0].nodes.push_back((int)model.nodes.size() - 1);
        source.sourceMesh = node.mesh;
        source.sourcePrimitive = 0;
    }
    return document;
}
