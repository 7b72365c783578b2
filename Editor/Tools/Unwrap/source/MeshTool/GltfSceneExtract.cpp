#include "Editor/Tools/Unwrap/source/MeshTool/GltfSceneExtract.h"

#include "Editor/Tools/Unwrap/source/MeshTool/GltfAccessors.h"

#include <array>
#include <cmath>

namespace
{
    typedef std::array<double, 16> Matrix;   // column-major, as glTF stores it

    Matrix Identity() { return {1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1}; }

    Matrix Multiply(const Matrix& a, const Matrix& b)
    {
        Matrix r{};
        for (int c = 0; c < 4; ++c)
            for (int row = 0; row < 4; ++row)
                for (int k = 0; k < 4; ++k)
                    r[c * 4 + row] += a[k * 4 + row] * b[c * 4 + k];
        return r;
    }

    Matrix LocalMatrix(const tinygltf::Node& node)
    {
        if (node.matrix.size() == 16)
        {
            Matrix m;
            for (int i = 0; i < 16; ++i)
                m[i] = node.matrix[i];
            return m;
        }
        double t[3] = {0, 0, 0}, s[3] = {1, 1, 1}, q[4] = {0, 0, 0, 1};
        for (size_t i = 0; i < 3 && node.translation.size() == 3; ++i)
            t[i] = node.translation[i];
        for (size_t i = 0; i < 3 && node.scale.size() == 3; ++i)
            s[i] = node.scale[i];
        for (size_t i = 0; i < 4 && node.rotation.size() == 4; ++i)
            q[i] = node.rotation[i];
        double x = q[0], y = q[1], z = q[2], w = q[3];
        Matrix r = {1 - 2 * (y * y + z * z), 2 * (x * y + z * w),     2 * (x * z - y * w),     0,
                    2 * (x * y - z * w),     1 - 2 * (x * x + z * z), 2 * (y * z + x * w),     0,
                    2 * (x * z + y * w),     2 * (y * z - x * w),     1 - 2 * (x * x + y * y), 0,
                    0,                       0,                       0,                       1};
        for (int c = 0; c < 3; ++c)
            for (int row = 0; row < 3; ++row)
                r[c * 4 + row] *= s[c];
        r[12] = t[0], r[13] = t[1], r[14] = t[2];
        return r;
    }

    // The world matrix of the first node (depth first, scene by scene) showing each mesh.
    void FindMeshPlacements(const tinygltf::Model& model, int nodeIndex, const Matrix& parent, int depth,
                            std::vector<Matrix>* placement, std::vector<bool>* placed)
    {
        if (nodeIndex < 0 || (size_t)nodeIndex >= model.nodes.size() || depth > 256)
            return;
        const tinygltf::Node& node = model.nodes[(size_t)nodeIndex];
        Matrix world = Multiply(parent, LocalMatrix(node));
        if (node.mesh >= 0 && (size_t)node.mesh < placement->size() && !(*placed)[(size_t)node.mesh])
        {
            (*placement)[(size_t)node.mesh] = world;
            (*placed)[(size_t)node.mesh] = true;
        }
        for (int child : node.children)
            FindMeshPlacements(model, child, world, depth + 1, placement, placed);
    }

    std::string ReadFloats(const tinygltf::Model& model, const tinygltf::Primitive& primitive, const char* attribute,
                           int components, std::vector<double>* values)
    {
        auto it = primitive.attributes.find(attribute);
        if (it == primitive.attributes.end())
            return "";
        DenseAccessor dense;
        std::string error = ReadDenseAccessor(model, it->second, &dense);
        if (!error.empty())
            return error;
        const tinygltf::Accessor& accessor = model.accessors[(size_t)it->second];
        if (tinygltf::GetNumComponentsInType((uint32_t)accessor.type) != components)
            return std::string(attribute) + " has the wrong type";
        *values = DecodeComponents(accessor, dense);
        return "";
    }

    void Transform(const Matrix& m, const std::vector<double>& in, bool direction, std::vector<float>* out)
    {
        out->resize(in.size());
        for (size_t i = 0; i + 2 < in.size(); i += 3)
        {
            double v[3];
            for (int row = 0; row < 3; ++row)
                v[row] = m[row] * in[i] + m[4 + row] * in[i + 1] + m[8 + row] * in[i + 2] + (direction ? 0 : m[12 + row]);
            if (direction)
            {
                double length = std::sqrt(v[0] * v[0] + v[1] * v[1] + v[2] * v[2]);
                for (double& c : v)
                    c = length > 0 ? c / length : c;
            }
            for (int row = 0; row < 3; ++row)
                (*out)[i + (size_t)row] = (float)v[row];
        }
    }

    // The inverse transpose of the upper 3x3 (as a 4x4 without translation), for normals.
    Matrix NormalMatrix(const Matrix& m)
    {
        double a = m[0], b = m[4], c = m[8], d = m[1], e = m[5], f = m[9], g = m[2], h = m[6], i = m[10];
        double det = a * (e * i - f * h) - b * (d * i - f * g) + c * (d * h - e * g);
        if (det == 0)
            return m;
        Matrix n = Identity();
        // Cofactors of rows/columns, divided by the determinant: (M^-1)^T.
        n[0] = (e * i - f * h) / det, n[4] = -(d * i - f * g) / det, n[8] = (d * h - e * g) / det;
        n[1] = -(b * i - c * h) / det, n[5] = (a * i - c * g) / det, n[9] = -(a * h - b * g) / det;
        n[2] = (b * f - c * e) / det, n[6] = -(a * f - c * d) / det, n[10] = (a * e - b * d) / det;
        return n;
    }
}

bool IsTrianglePrimitive(const tinygltf::Primitive& primitive)
{
    return primitive.mode == TINYGLTF_MODE_TRIANGLES || primitive.mode == TINYGLTF_MODE_TRIANGLE_STRIP ||
           primitive.mode == TINYGLTF_MODE_TRIANGLE_FAN || primitive.mode == -1;
}

std::vector<uint32_t> PrimitiveTriangles(const tinygltf::Model& model, const tinygltf::Primitive& primitive,
                                         std::string* error)
{
    size_t vertexCount = model.accessors[(size_t)primitive.attributes.at("POSITION")].count;
    std::vector<uint32_t> order;
    if (primitive.indices >= 0)
    {
        DenseAccessor dense;
        *error = ReadDenseAccessor(model, primitive.indices, &dense);
        if (!error->empty())
            return {};
        const tinygltf::Accessor& accessor = model.accessors[(size_t)primitive.indices];
        for (size_t i = 0; i < dense.count; ++i)
        {
            order.push_back(IndexAt(accessor, dense, i));
            if (order.back() >= vertexCount)
            {
                *error = "indices of a primitive reach past its vertices";
                return {};
            }
        }
    }
    else
        for (size_t i = 0; i < vertexCount; ++i)
            order.push_back((uint32_t)i);

    std::vector<uint32_t> triangles;
    if (primitive.mode == TINYGLTF_MODE_TRIANGLE_STRIP)
        for (size_t i = 2; i < order.size(); ++i)
        {
            bool odd = i % 2 == 1;   // every other triangle of a strip runs the other way round
            triangles.insert(triangles.end(), {order[i - 2], odd ? order[i] : order[i - 1], odd ? order[i - 1] : order[i]});
        }
    else if (primitive.mode == TINYGLTF_MODE_TRIANGLE_FAN)
        for (size_t i = 2; i < order.size(); ++i)
            triangles.insert(triangles.end(), {order[i - 1], order[i], order[0]});
    else
        triangles.assign(order.begin(), order.end() - (long)(order.size() % 3));
    return triangles;
}

std::string ExtractGltfScene(const GltfDocument& document, MeshScene* scene)
{
    const tinygltf::Model& model = document.model;
    for (const std::string& extension : model.extensionsUsed)
        if (extension == "KHR_draco_mesh_compression" || extension == "EXT_meshopt_compression")
            return "the file uses " + extension + "; decompress it first";

    std::vector<Matrix> placement(model.meshes.size(), Identity());
    std::vector<bool> placed(model.meshes.size(), false);
    for (const tinygltf::Scene& s : model.scenes)
        for (int root : s.nodes)
            FindMeshPlacements(model, root, Identity(), 0, &placement, &placed);

    for (const tinygltf::Material& material : model.materials)
    {
        SceneMaterial out;
        out.name = material.name;
        for (size_t i = 0; i < 4 && material.pbrMetallicRoughness.baseColorFactor.size() == 4; ++i)
            out.color[i] = (float)material.pbrMetallicRoughness.baseColorFactor[i];
        int texture = material.pbrMetallicRoughness.baseColorTexture.index;
        if (texture >= 0 && (size_t)texture < model.textures.size())
        {
            int image = model.textures[(size_t)texture].source;
            if (image >= 0 && (size_t)image < model.images.size())
                out.texture = model.images[(size_t)image].uri;
        }
        scene->materials.push_back(out);
    }

    for (size_t m = 0; m < model.meshes.size(); ++m)
        for (size_t p = 0; p < model.meshes[m].primitives.size(); ++p)
        {
            const tinygltf::Primitive& source = model.meshes[m].primitives[p];
            if (!IsTrianglePrimitive(source))
                continue;
            std::string where = "mesh " + std::to_string(m) + " primitive " + std::to_string(p) + ": ";
            if (!source.attributes.count("POSITION"))
                return where + "no POSITION attribute";
            ScenePrimitive primitive;
            primitive.name = model.meshes[m].name.empty() ? "mesh" + std::to_string(m) : model.meshes[m].name;
            primitive.material = source.material;
            primitive.atlasGroup = (int)m;
            primitive.sourceMesh = (int)m;
            primitive.sourcePrimitive = (int)p;
            std::vector<double> positions, normals, uvs;
            std::string error = ReadFloats(model, source, "POSITION", 3, &positions);
            if (error.empty())
                error = ReadFloats(model, source, "NORMAL", 3, &normals);
            if (error.empty())
                error = ReadFloats(model, source, "TEXCOORD_0", 2, &uvs);
            if (error.empty())
                primitive.indices = PrimitiveTriangles(model, source, &error);
            if (!error.empty())
                return where + error;
            Transform(placement[m], positions, false, &primitive.positions);
            if (normals.size() == positions.size())
                Transform(NormalMatrix(placement[m]), normals, true, &primitive.normals);
            primitive.uvs.assign(uvs.begin(), uvs.end());
            scene->primitives.push_back(std::move(primitive));
        }
    scene->sourceDirectory = document.directory;
    return "";
}
