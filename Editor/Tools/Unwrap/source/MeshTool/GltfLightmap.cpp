#include "Editor/Tools/Unwrap/source/MeshTool/GltfLightmap.h"

#include "Editor/Tools/Unwrap/source/MeshTool/GltfAccessors.h"
#include "Editor/Tools/Unwrap/source/MeshTool/GltfBufferCompaction.h"
#include "Editor/Tools/Unwrap/source/MeshTool/VertexSplit.h"

#include <cstring>

namespace
{
    // How many places refer to each accessor: primitives (attributes, indices, morph targets),
    // skins and animation samplers.
    std::vector<int> CountAccessorUsers(const tinygltf::Model& model)
    {
        std::vector<int> users(model.accessors.size(), 0);
        auto use = [&](int index) {
            if (index >= 0 && (size_t)index < users.size())
                ++users[(size_t)index];
        };
        for (const tinygltf::Mesh& mesh : model.meshes)
            for (const tinygltf::Primitive& primitive : mesh.primitives)
            {
                for (const auto& [name, index] : primitive.attributes)
                    use(index);
                use(primitive.indices);
                for (const auto& target : primitive.targets)
                    for (const auto& [name, index] : target)
                        use(index);
            }
        for (const tinygltf::Skin& skin : model.skins)
            use(skin.inverseBindMatrices);
        for (const tinygltf::Animation& animation : model.animations)
            for (const tinygltf::AnimationSampler& sampler : animation.samplers)
                use(sampler.input), use(sampler.output);
        return users;
    }

    struct PrimitiveRewriter
    {
        tinygltf::Model& model;
        std::vector<int>& users;
        int buffer;

        // Puts `accessor` where `*slot` points: over the old accessor when nothing else uses it,
        // else as a new one.
        void Place(int* slot, tinygltf::Accessor accessor)
        {
            if (*slot >= 0 && users[(size_t)*slot] == 1)
            {
                model.accessors[(size_t)*slot] = std::move(accessor);
                return;
            }
            if (*slot >= 0)
                --users[(size_t)*slot];
            model.accessors.push_back(std::move(accessor));
            users.push_back(1);
            *slot = (int)model.accessors.size() - 1;
        }

        std::string CopyThroughSplit(const std::string& name, int* slot, const VertexSplit& split)
        {
            DenseAccessor source;
            std::string error = ReadDenseAccessor(model, *slot, &source);
            if (!error.empty())
                return error;
            DenseAccessor copy;
            copy.elementSize = source.elementSize;
            copy.count = split.sourceVertex.size();
            copy.bytes.resize(copy.count * copy.elementSize);
            for (size_t v = 0; v < copy.count; ++v)
            {
                if (split.sourceVertex[v] >= source.count)
                    return name + " has fewer elements than POSITION";
                std::memcpy(&copy.bytes[v * copy.elementSize], &source.bytes[split.sourceVertex[v] * source.elementSize],
                            copy.elementSize);
            }
            const tinygltf::Accessor& like = model.accessors[(size_t)*slot];
            bool bounds = name == "POSITION" || !like.minValues.empty() || !like.maxValues.empty();
            Place(slot, AppendAccessorData(&model, buffer, like, copy, TINYGLTF_TARGET_ARRAY_BUFFER, bounds));
            return "";
        }

        void WriteIndices(tinygltf::Primitive* primitive, const VertexSplit& split)
        {
            // 65535 is reserved as the primitive restart value, so 16-bit indices stop below it.
            bool small = split.sourceVertex.size() < 65535;
            tinygltf::Accessor like;
            like.type = TINYGLTF_TYPE_SCALAR;
            like.componentType = small ? TINYGLTF_COMPONENT_TYPE_UNSIGNED_SHORT : TINYGLTF_COMPONENT_TYPE_UNSIGNED_INT;
            if (primitive->indices >= 0)
                like.name = model.accessors[(size_t)primitive->indices].name;
            DenseAccessor dense;
            dense.count = split.indices.size();
            dense.elementSize = small ? 2 : 4;
            dense.bytes.resize(dense.count * dense.elementSize);
            for (size_t i = 0; i < dense.count; ++i)
            {
                if (small)
                {
                    uint16_t index = (uint16_t)split.indices[i];
                    std::memcpy(&dense.bytes[2 * i], &index, 2);
                }
                else
                    std::memcpy(&dense.bytes[4 * i], &split.indices[i], 4);
            }
            Place(&primitive->indices,
                  AppendAccessorData(&model, buffer, like, dense, TINYGLTF_TARGET_ELEMENT_ARRAY_BUFFER, false));
        }

        void WriteLightmap(tinygltf::Primitive* primitive, const VertexSplit& split)
        {
            tinygltf::Accessor like;
            like.type = TINYGLTF_TYPE_VEC2;
            like.componentType = TINYGLTF_COMPONENT_TYPE_FLOAT;
            like.name = "lightmap";
            DenseAccessor dense;
            dense.count = split.sourceVertex.size();
            dense.elementSize = 8;
            dense.bytes.resize(dense.count * 8);
            std::memcpy(dense.bytes.data(), split.uvs.data(), dense.bytes.size());
            int slot = -1;
            std::string name = FirstFreeTexcoord(*primitive);
            Place(&slot, AppendAccessorData(&model, buffer, like, dense, TINYGLTF_TARGET_ARRAY_BUFFER, true));
            primitive->attributes[name] = slot;
        }

        std::string Rewrite(tinygltf::Primitive* primitive, const ScenePrimitive& scenePrimitive, const CornerUVs& uvs)
        {
            VertexSplit split = SplitVerticesByUV(scenePrimitive.indices, uvs);
            for (auto& [name, index] : primitive->attributes)
            {
                std::string error = CopyThroughSplit(name, &index, split);
                if (!error.empty())
                    return name + ": " + error;
            }
            for (auto& target : primitive->targets)
                for (auto& [name, index] : target)
                {
                    std::string error = CopyThroughSplit(name, &index, split);
                    if (!error.empty())
                        return "morph target " + name + ": " + error;
                }
            WriteIndices(primitive, split);
            WriteLightmap(primitive, split);
            primitive->mode = TINYGLTF_MODE_TRIANGLES;
            return "";
        }
    };
}

std::string FirstFreeTexcoord(const tinygltf::Primitive& primitive)
{
    for (int set = 0;; ++set)
    {
        std::string name = "TEXCOORD_" + std::to_string(set);
        if (!primitive.attributes.count(name))
            return name;
    }
}

std::string AddLightmapUVs(GltfDocument* document, const MeshScene& scene, const std::vector<CornerUVs>& uvs)
{
    tinygltf::Model& model = document->model;
    std::vector<int> users = CountAccessorUsers(model);
    model.buffers.emplace_back();
    PrimitiveRewriter rewriter{model, users, (int)model.buffers.size() - 1};
    for (size_t i = 0; i < scene.primitives.size(); ++i)
    {
        const ScenePrimitive& primitive = scene.primitives[i];
        if (primitive.sourceMesh < 0)
            continue;
        tinygltf::Primitive& target =
            model.meshes[(size_t)primitive.sourceMesh].primitives[(size_t)primitive.sourcePrimitive];
        std::string error = rewriter.Rewrite(&target, primitive, uvs[i]);
        if (!error.empty())
            return "mesh " + std::to_string(primitive.sourceMesh) + " primitive " +
                   std::to_string(primitive.sourcePrimitive) + ": " + error;
    }
    return GatherIntoOneBuffer(&model);
}
