#pragma once
// A picture of the atlas: `resolution` pixels a side, UV (0, 0) at the bottom left, every chart
// filled in a colour of its own, chart outlines (edges not shared inside a chart) drawn dark.
// Under --per-mesh the atlases are drawn over each other.

#include "Editor/Tools/Unwrap/source/MeshTool/ChartStats.h"
#include "Editor/Tools/Unwrap/source/MeshTool/MeshScene.h"

#include <string>

// The PNG file's bytes in `png`; empty on success.
std::string DrawLayoutPng(const MeshScene& scene, const std::vector<CornerUVs>& uvs, const ChartStats& charts,
                          int resolution, std::string* png);
