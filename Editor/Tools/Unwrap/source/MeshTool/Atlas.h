#pragma once
// The unwrap of a whole scene: by default every triangle primitive goes into one call of the
// unwrapper, so that all of them share one atlas at one texel density; with `perMesh`, each
// atlas group (a glTF mesh, an OBJ object) gets a call and an atlas of its own.

#include "Editor/Tools/Unwrap/source/CLTool/LibraryExports.h"
#include "Editor/Tools/Unwrap/source/MeshTool/MeshScene.h"

#include <string>
#include <vector>

struct AtlasResult
{
    std::vector<CornerUVs> uvs;    // one per scene primitive
    int atlasCount = 0;
    std::string libraryMessage;    // text the unwrapper left for the user, if any
};

// Empty on success; otherwise why the unwrap failed (the library's own message included).
std::string UnwrapScene(const MeshScene& scene, const UnwrapParam& param, bool perMesh, AtlasResult* result);
