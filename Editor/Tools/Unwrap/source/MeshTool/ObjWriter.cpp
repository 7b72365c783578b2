#include "Editor/Tools/Unwrap/source/MeshTool/ObjWriter.h"

#include "Editor/Tools/Unwrap/source/MeshTool/OutputFiles.h"
#include "Editor/Tools/Unwrap/source/MeshTool/VertexSplit.h"

#include <cstdio>
#include <filesystem>

namespace fs = std::filesystem;

namespace
{
    // OBJ names end at white space.
    std::string ObjName(std::string name, const std::string& fallback)
    {
        if (name.empty())
            return fallback;
        for (char& c : name)
            if (c == ' ' || c == '\t' || c == '\n' || c == '\r')
                c = '_';
        return name;
    }

    void Line(std::string* out, const char* format, double a, double b, double c = 0, bool three = true)
    {
        char text[128];
        int n = three ? std::snprintf(text, sizeof text, format, a, b, c) : std::snprintf(text, sizeof text, format, a, b);
        out->append(text, (size_t)n);
    }

    std::string MaterialName(const MeshScene& scene, int index)
    {
        return ObjName(scene.materials[(size_t)index].name, "material" + std::to_string(index));
    }

    std::string Library(const MeshScene& scene, const std::string& outputDirectory)
    {
        std::string mtl = "# materials of the lightmapped mesh\n";
        for (size_t m = 0; m < scene.materials.size(); ++m)
        {
            const SceneMaterial& material = scene.materials[m];
            mtl += "\nnewmtl " + MaterialName(scene, (int)m) + "\n";
            Line(&mtl, "Kd %.9g %.9g %.9g\n", material.color[0], material.color[1], material.color[2]);
            if (material.color[3] < 1)
                Line(&mtl, "d %.9g\n", material.color[3], 0, 0, false);
            if (!material.texture.empty())
                mtl += "map_Kd " + RelinkPath(material.texture, scene.sourceDirectory, outputDirectory) + "\n";
        }
        return mtl;
    }
}

ObjFiles WriteObj(const MeshScene& scene, const std::vector<CornerUVs>& uvs, const std::string& outputPath)
{
    ObjFiles files;
    std::string& obj = files.obj;
    obj = "# lightmap UVs by chartbake-mesh (vt: one UV set, the lightmap)\n";
    bool anyMaterial = false;
    for (const ScenePrimitive& primitive : scene.primitives)
        anyMaterial |= primitive.material >= 0 && (size_t)primitive.material < scene.materials.size();
    if (anyMaterial)
    {
        files.mtlName = fs::path(outputPath).stem().string() + ".mtl";
        files.mtl = Library(scene, fs::path(outputPath).parent_path().string());
        obj += "mtllib " + files.mtlName + "\n";
    }
    // Numbers in OBJ count from 1 across the whole file.
    size_t vBase = 1, vtBase = 1, vnBase = 1;
    std::string lastName;
    for (size_t p = 0; p < scene.primitives.size(); ++p)
    {
        const ScenePrimitive& primitive = scene.primitives[p];
        std::string name = ObjName(primitive.name, "object" + std::to_string(p));
        // Readers take either line as the grouping; both carry the name.
        if (p == 0 || name != lastName)
            obj += "o " + name + "\ng " + name + "\n";
        lastName = name;
        VertexSplit split = SplitVerticesByUV(primitive.indices, uvs[p]);
        for (size_t i = 0; i < primitive.positions.size(); i += 3)
            Line(&obj, "v %.9g %.9g %.9g\n", primitive.positions[i], primitive.positions[i + 1], primitive.positions[i + 2]);
        for (size_t i = 0; i < split.uvs.size(); i += 2)
            Line(&obj, "vt %.9g %.9g\n", split.uvs[i], split.uvs[i + 1], 0, false);
        bool normals = primitive.normals.size() == primitive.positions.size();
        for (size_t i = 0; normals && i < primitive.normals.size(); i += 3)
            Line(&obj, "vn %.9g %.9g %.9g\n", primitive.normals[i], primitive.normals[i + 1], primitive.normals[i + 2]);
        if (primitive.material >= 0 && (size_t)primitive.material < scene.materials.size())
            obj += "usemtl " + MaterialName(scene, primitive.material) + "\n";
        for (size_t t = 0; t < primitive.indices.size(); t += 3)
        {
            obj += "f";
            for (size_t c = t; c < t + 3; ++c)
            {
                size_t v = vBase + primitive.indices[c], vt = vtBase + split.indices[c];
                obj += " " + std::to_string(v) + "/" + std::to_string(vt);
                if (normals)
                    obj += "/" + std::to_string(vnBase + primitive.indices[c]);
            }
            obj += "\n";
        }
        vBase += primitive.VertexCount();
        vtBase += split.uvs.size() / 2;
        vnBase += normals ? primitive.VertexCount() : 0;
    }
    return files;
}
