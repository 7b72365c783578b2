#pragma once
// The scene as a Wavefront OBJ file with its material library: per object its positions and
// normals as read, the lightmap UVs as the vt lines (OBJ holds one UV set), faces v/vt/vn, object
// names and materials kept. Texture paths are made relative to the output's directory.

#include "Editor/Tools/Unwrap/source/MeshTool/MeshScene.h"

#include <string>

struct ObjFiles
{
    std::string obj;
    std::string mtlName;   // file name of the material library beside the OBJ, empty when none
    std::string mtl;
};

ObjFiles WriteObj(const MeshScene& scene, const std::vector<CornerUVs>& uvs, const std::string& outputPath);
