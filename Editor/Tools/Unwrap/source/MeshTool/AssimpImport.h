#pragma once
// Import of OBJ, PLY, STL and FBX through assimp: polygons triangulated here (concave ones too, see PolygonTriangulation),
// identical vertices joined so that the unwrapper sees shared edges, every mesh placed in world
// space by its node. Points and lines are left out.

#include "Editor/Tools/Unwrap/source/MeshTool/MeshScene.h"

#include <string>

// Empty on success; otherwise why the file could not be read.
std::string ImportWithAssimp(const std::string& path, MeshScene* scene);
