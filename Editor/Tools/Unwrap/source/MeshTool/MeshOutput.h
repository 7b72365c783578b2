#pragma once
// Assembling every output of a run in memory, ready to be committed together: the mesh (glTF with
// the lightmap set added, or OBJ with its material library) and the layout picture.

#include "Editor/Tools/Unwrap/source/MeshTool/Atlas.h"
#include "Editor/Tools/Unwrap/source/MeshTool/ChartStats.h"
#include "Editor/Tools/Unwrap/source/MeshTool/MeshInput.h"
#include "Editor/Tools/Unwrap/source/MeshTool/MeshToolOptions.h"
#include "Editor/Tools/Unwrap/source/MeshTool/OutputFiles.h"

// Empty on success. May change `input` (the glTF document receives the lightmap set).
std::string AssembleMeshOutputs(const MeshToolOptions& options, MeshInput* input, const AtlasResult& atlas,
                                const ChartStats& charts, PendingOutputs* outputs);
