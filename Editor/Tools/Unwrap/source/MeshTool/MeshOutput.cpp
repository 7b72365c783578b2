#include "Editor/Tools/Unwrap/source/MeshTool/MeshOutput.h"

#include "Editor/Tools/Unwrap/source/MeshTool/GltfFromScene.h"
#include "Editor/Tools/Unwrap/source/MeshTool/GltfLightmap.h"
#include "Editor/Tools/Unwrap/source/MeshTool/LayoutPng.h"
#include "Editor/Tools/Unwrap/source/MeshTool/MeshFileChecks.h"
#include "Editor/Tools/Unwrap/source/MeshTool/ObjWriter.h"

std::string AssembleMeshOutputs(const MeshToolOptions& options, MeshInput* input, const AtlasResult& atlas,
                                const ChartStats& charts, PendingOutputs* outputs)
{
    if (LowerExtension(options.outputPath) == ".obj")
    {
        ObjFiles files = WriteObj(input->scene, atlas.uvs, options.outputPath);
        outputs->Add(options.outputPath, std::move(files.obj));
        if (!files.mtlName.empty())
            outputs->Add(MaterialLibraryPath(options.outputPath), std::move(files.mtl));
    }
    else
    {
        if (!input->isGltf)
            input->gltf = BuildGltfFromScene(&input->scene);
        std::string error = AddLightmapUVs(&input->gltf, input->scene, atlas.uvs);
        std::string bytes;
        if (error.empty())
            error = SerializeGltf(input->gltf, options.outputPath, &bytes);
        if (!error.empty())
            return "cannot write " + options.outputPath + ": " + error;
        outputs->Add(options.outputPath, std::move(bytes));
    }
    if (!options.layoutPath.empty())
    {
        std::string png;
        std::string error = DrawLayoutPng(input->scene, atlas.uvs, charts, options.resolution, &png);
        if (!error.empty())
            return "cannot draw " + options.layoutPath + ": " + error;
        outputs->Add(options.layoutPath, std::move(png));
    }
    return "";
}
