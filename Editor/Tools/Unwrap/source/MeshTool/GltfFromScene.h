#pragma once
// A glTF model made from an imported scene (OBJ, PLY, STL, FBX input written as glTF): one node
// and one mesh per scene primitive, positions, normals and the first UV set as attributes,
// materials as base colour (and base colour texture, referred to by its path). The primitives
// keep their scene numbering, so the lightmap can then be added like to any glTF input.

#include "Editor/Tools/Unwrap/source/MeshTool/GltfDocument.h"
#include "Editor/Tools/Unwrap/source/MeshTool/MeshScene.h"

// Also marks each scene primitive with the glTF mesh and primitive made from it.
GltfDocument BuildGltfFromScene(MeshScene* scene);
