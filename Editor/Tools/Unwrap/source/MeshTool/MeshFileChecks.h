#pragma once
// Everything that can be checked about the files before any work: known input and output
// formats, a readable, non-empty input, and no output (OBJ's material library and the layout
// picture included) that would overwrite the input or another output.

#include "Editor/Tools/Unwrap/source/MeshTool/MeshToolOptions.h"

#include <string>

// Empty when the run may start; otherwise the reason, naming the file.
std::string CheckMeshFiles(const MeshToolOptions& options);

// The material library written beside an OBJ output.
std::string MaterialLibraryPath(const std::string& objPath);
