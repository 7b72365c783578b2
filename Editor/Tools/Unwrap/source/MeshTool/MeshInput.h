#pragma once
// Reading the input by its extension: glTF through tinygltf (kept whole for a lossless round
// trip), everything else through assimp.

#include "Editor/Tools/Unwrap/source/MeshTool/GltfDocument.h"
#include "Editor/Tools/Unwrap/source/MeshTool/MeshScene.h"

#include <string>

struct MeshInput
{
    MeshScene scene;
    bool isGltf = false;
    GltfDocument gltf;   // the whole input when `isGltf`
};

// Empty on success; otherwise a sentence naming the file. A file without triangles is an error.
std::string ReadMeshInput(const std::string& path, MeshInput* input);
