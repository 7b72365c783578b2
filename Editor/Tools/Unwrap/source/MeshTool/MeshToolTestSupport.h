#pragma once
// Shared by the end-to-end tests of chartbake-mesh: a fresh directory per test, runs of the real
// binary, glTF input built in memory, and the checks every output must pass (the glTF validator,
// a valid lightmap set, attributes kept corner for corner).
#include "Editor/Tools/Unwrap/source/MeshTool/GltfAccessors.h"
#include "Editor/Tools/Unwrap/source/MeshTool/GltfDocument.h"
#include "Editor/Tools/Unwrap/source/MeshTool/GltfLightmap.h"
#include "Editor/Tools/Unwrap/source/MeshTool/GltfSceneExtract.h"
#include "Runtime/Testing/ChildProcess.h"
#include "Runtime/Testing/TemporaryDirectory.h"

#include <cmath>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

namespace MeshToolTest
{
    const std::string kBinDir = CHARTBAKE_BIN_DIR;
    const std::string kSourceDir = CHARTBAKE_SOURCE_DIR;
    const std::string kToolsDir = CHARTBAKE_TOOLS_DIR;

    inline bool Contains(const std::string& text, const std::string& part) { return text.find(part) != std::string::npos; }

    struct MeshToolFixture : Testing::TemporaryDirectory
    {
        MeshToolFixture() : TemporaryDirectory("chartbake-mesh-e2e") {}

        size_t FileCount() const
        {
            size_t count = 0;
            for (auto it = std::filesystem::recursive_directory_iterator(dir); it != std::filesystem::recursive_directory_iterator(); ++it)
                count += it->is_regular_file() ? 1 : 0;
            return count;
        }

        Testing::ChildResult Run(std::vector<std::string> args, const std::vector<std::string>& env = {}) const
        {
            args.insert(args.begin(), kBinDir + "/chartbake-mesh");
            return Testing::RunProgram(args, dir, env);
        }

        // The validator's verdict: its last line ("errors N warnings M") and any error lines.
        Testing::ChildResult Validate(const std::string& name) const
        {
            if (!std::filesystem::exists(kToolsDir + "/node_modules/gltf-validator"))
            {
                Testing::ChildResult missing;
                missing.out = "the glTF validator is not installed: run scripts/install-validator.sh\n";
                return missing;
            }
            return Testing::RunProgram({"/usr/bin/env", "node", kSourceDir + "/scripts/validate-gltf.js", PathOf(name)}, dir,
                                       {"NODE_PATH=" + kToolsDir + "/node_modules"});
        }

        bool LoadOutput(const std::string& name, GltfDocument* document) const
        {
            return LoadGltf(PathOf(name), document).empty();
        }
    };

    // All elements of an accessor as raw bytes, one string each.
    inline std::vector<std::string> Elements(const tinygltf::Model& model, int accessor)
    {
        DenseAccessor dense;
        if (!ReadDenseAccessor(model, accessor, &dense).empty())
            return {};
        std::vector<std::string> elements;
        for (size_t i = 0; i < dense.count; ++i)
            elements.emplace_back(reinterpret_cast<const char*>(&dense.bytes[i * dense.elementSize]), dense.elementSize);
        return elements;
    }

    inline std::vector<float> Floats(const tinygltf::Model& model, int accessor)
    {
        DenseAccessor dense;
        if (!ReadDenseAccessor(model, accessor, &dense).empty())
            return {};
        std::vector<double> values = DecodeComponents(model.accessors[(size_t)accessor], dense);
        return std::vector<float>(values.begin(), values.end());
    }

    // Builds glTF input: float and index data appended to buffer 0, one buffer view an accessor.
    struct GltfBuilder
    {
        tinygltf::Model model;

        GltfBuilder()
        {
            model.asset.version = "2.0";
            model.buffers.emplace_back();
        }

        int Add(const void* data, size_t count, int type, int componentType, int target, bool bounds = false)
        {
            DenseAccessor dense;
            dense.count = count;
            dense.elementSize = (size_t)tinygltf::GetComponentSizeInBytes((uint32_t)componentType) *
                                (size_t)tinygltf::GetNumComponentsInType((uint32_t)type);
            dense.bytes.resize(count * dense.elementSize);
            std::memcpy(dense.bytes.data(), data, dense.bytes.size());
            tinygltf::Accessor like;
            like.type = type;
            like.componentType = componentType;
            model.accessors.push_back(AppendAccessorData(&model, 0, like, dense, target, bounds));
            return (int)model.accessors.size() - 1;
        }
        // Raw bytes in a buffer view of their own (for sparse indices and values), 4-byte aligned.
        int View(const void* data, size_t size)
        {
            std::vector<unsigned char>& buffer = model.buffers[0].data;
            buffer.resize((buffer.size() + 3) / 4 * 4, 0);
            tinygltf::BufferView view;
            view.buffer = 0;
            view.byteOffset = buffer.size();
            view.byteLength = size;
            buffer.insert(buffer.end(), static_cast<const unsigned char*>(data), static_cast<const unsigned char*>(data) + size);
            model.bufferViews.push_back(view);
            return (int)model.bufferViews.size() - 1;
        }
        int Vec3(const std::vector<float>& v, bool bounds = false)
        {
            return Add(v.data(), v.size() / 3, TINYGLTF_TYPE_VEC3, TINYGLTF_COMPONENT_TYPE_FLOAT, TINYGLTF_TARGET_ARRAY_BUFFER, bounds);
        }
        int Vec2(const std::vector<float>& v)
        {
            return Add(v.data(), v.size() / 2, TINYGLTF_TYPE_VEC2, TINYGLTF_COMPONENT_TYPE_FLOAT, TINYGLTF_TARGET_ARRAY_BUFFER);
        }
        int Indices(const std::vector<uint16_t>& i)
        {
            return Add(i.data(), i.size(), TINYGLTF_TYPE_SCALAR, TINYGLTF_COMPONENT_TYPE_UNSIGNED_SHORT,
                       TINYGLTF_TARGET_ELEMENT_ARRAY_BUFFER);
        }
        std::string Bytes(bool binary) const
        {
            GltfDocument document;
            document.model = model;
            std::string bytes;
            SerializeGltf(document, binary ? "in.glb" : "in.gltf", &bytes);
            return bytes;
        }
    };

    // A unit cube as 24 vertices (4 a face, normals and UVs per face) and 12 triangles, shifted by x.
    struct CubeData
    {
        std::vector<float> positions, normals, uvs;
        std::vector<uint16_t> indices;
    };
    inline CubeData MakeCube(float x)
    {
        CubeData cube;
        // Per face: the axis it faces along and its sign.
        for (int axis = 0; axis < 3; ++axis)
            for (int sign = -1; sign <= 1; sign += 2)
            {
                uint16_t base = (uint16_t)(cube.positions.size() / 3);
                int u = (axis + 1) % 3, v = (axis + 2) % 3;
                const float corners[4][2] = {{0, 0}, {1, 0}, {1, 1}, {0, 1}};
                for (const auto& c : corners)
                {
                    float p[3];
                    p[axis] = sign > 0 ? 1.0f : 0.0f;
                    p[u] = c[0], p[v] = c[1];
                    cube.positions.insert(cube.positions.end(), {p[0] + x, p[1], p[2]});
                    float n[3] = {0, 0, 0};
                    n[axis] = (float)sign;
                    cube.normals.insert(cube.normals.end(), {n[0], n[1], n[2]});
                    cube.uvs.insert(cube.uvs.end(), {c[0], c[1]});
                }
                // Counter-clockwise seen from outside.
                if (sign > 0)
                    cube.indices.insert(cube.indices.end(), {base, (uint16_t)(base + 1), (uint16_t)(base + 2), base,
                                                             (uint16_t)(base + 2), (uint16_t)(base + 3)});
                else
                    cube.indices.insert(cube.indices.end(), {base, (uint16_t)(base + 2), (uint16_t)(base + 1), base,
                                                             (uint16_t)(base + 3), (uint16_t)(base + 2)});
            }
        return cube;
    }

    // Empty when `output` is `input` with a valid lightmap set added to every triangle primitive:
    // the same primitives and triangles, every input attribute unchanged at every corner, the new
    // set (the first free TEXCOORD_n) of the same count as POSITION and inside [0, 1]. Otherwise
    // the first difference found.
    inline std::string CompareLightmapped(const tinygltf::Model& input, const tinygltf::Model& output)
    {
        if (input.meshes.size() != output.meshes.size())
            return "mesh count changed";
        for (size_t m = 0; m < input.meshes.size(); ++m)
            for (size_t p = 0; p < input.meshes[m].primitives.size(); ++p)
            {
                std::string where = "mesh " + std::to_string(m) + " primitive " + std::to_string(p) + ": ";
                const tinygltf::Primitive& in = input.meshes[m].primitives[p];
                if (p >= output.meshes[m].primitives.size())
                    return where + "missing";
                const tinygltf::Primitive& out = output.meshes[m].primitives[p];
                if (!IsTrianglePrimitive(in))
                {
                    if (in.mode != out.mode || in.attributes.size() != out.attributes.size())
                        return where + "a primitive without triangles was changed";
                    continue;
                }
                std::string lightmap = FirstFreeTexcoord(in);
                if (out.attributes.size() != in.attributes.size() + 1 || !out.attributes.count(lightmap))
                    return where + "expected the input's attributes and " + lightmap;
                std::string error;
                std::vector<uint32_t> inTriangles = PrimitiveTriangles(input, in, &error);
                std::vector<uint32_t> outTriangles = PrimitiveTriangles(output, out, &error);
                if (!error.empty() || inTriangles.size() != outTriangles.size())
                    return where + "triangles differ " + error;
                size_t count = output.accessors[(size_t)out.attributes.at("POSITION")].count;
                for (const auto& [name, accessor] : in.attributes)
                {
                    std::vector<std::string> before = Elements(input, accessor), after = Elements(output, out.attributes.at(name));
                    if (after.size() != count)
                        return where + name + " has a count other than POSITION's";
                    for (size_t c = 0; c < inTriangles.size(); ++c)
                        if (before[inTriangles[c]] != after[outTriangles[c]])
                            return where + name + " changed at corner " + std::to_string(c);
                }
                if (in.targets.size() != out.targets.size())
                    return where + "morph targets lost";
                for (size_t t = 0; t < in.targets.size(); ++t)
                    for (const auto& [name, accessor] : in.targets[t])
                    {
                        std::vector<std::string> before = Elements(input, accessor);
                        std::vector<std::string> after = Elements(output, out.targets[t].at(name));
                        if (after.size() != count)
                            return where + "morph target " + name + " has a count other than POSITION's";
                        for (size_t c = 0; c < inTriangles.size(); ++c)
                            if (before[inTriangles[c]] != after[outTriangles[c]])
                                return where + "morph target " + name + " changed at corner " + std::to_string(c);
                    }
                std::vector<float> uv = Floats(output, out.attributes.at(lightmap));
                if (uv.size() != 2 * count)
                    return where + lightmap + " has a count other than POSITION's";
                for (float value : uv)
                    if (!(value >= 0.0f && value <= 1.0f))
                        return where + lightmap + " has a value outside [0, 1]: " + std::to_string(value);
            }
        return "";
    }

    // The lightmap UV area a primitive covers (sum of its triangles' UV areas).
    inline double LightmapArea(const tinygltf::Model& model, const tinygltf::Primitive& primitive, const std::string& set)
    {
        std::string error;
        std::vector<uint32_t> triangles = PrimitiveTriangles(model, primitive, &error);
        std::vector<float> uv = Floats(model, primitive.attributes.at(set));
        double area = 0;
        for (size_t t = 0; t + 2 < triangles.size(); t += 3)
        {
            const float* a = &uv[2 * triangles[t]];
            const float* b = &uv[2 * triangles[t + 1]];
            const float* c = &uv[2 * triangles[t + 2]];
            area += std::fabs((b[0] - a[0]) * (c[1] - a[1]) - (c[0] - a[0]) * (b[1] - a[1])) / 2;
        }
        return area;
    }
}
