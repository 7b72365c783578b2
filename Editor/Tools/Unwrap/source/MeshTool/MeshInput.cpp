#include "Editor/Tools/Unwrap/source/MeshTool/MeshInput.h"

#include "Editor/Tools/Unwrap/source/MeshTool/AssimpImport.h"
#include "Editor/Tools/Unwrap/source/MeshTool/GltfSceneExtract.h"
#include "Editor/Tools/Unwrap/source/MeshTool/OutputFiles.h"

std::string ReadMeshInput(const std::string& path, MeshInput* input)
{
    std::string ext = LowerExtension(path);
    input->isGltf = ext == ".gltf" || ext == ".glb";
    std::string error;
    if (input->isGltf)
    {
        error = LoadGltf(path, &input->gltf);
        if (error.empty())
            error = ExtractGltfScene(input->gltf, &input->scene);
    }
    else
        error = ImportWithAssimp(path, &input->scene);
    if (!error.empty())
        return "cannot read " + path + ": " + error;
    if (input->scene.TriangleCount() == 0)
        return path + " has no triangles to unwrap";
    return "";
}
