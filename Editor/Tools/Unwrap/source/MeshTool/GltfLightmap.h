#pragma once
// Adds the lightmap UVs to a glTF model as the first free TEXCOORD set of every triangle
// primitive the scene was made from, and leaves everything else as it was.
//
// Per primitive: vertices are split only where the new UVs need it; every vertex attribute and
// morph target is copied through that split; indices are rewritten (strips and fans become
// triangle lists). An accessor that only this primitive uses is replaced in place, keeping its
// number for everything that refers to it; a shared one is left to its other users and the
// primitive gets a new one. Finally the buffer views nothing refers to any more are dropped and
// all data is gathered into one buffer. Cost: linear in the primitives' vertices and corners.

#include "Editor/Tools/Unwrap/source/MeshTool/GltfDocument.h"
#include "Editor/Tools/Unwrap/source/MeshTool/MeshScene.h"

#include <vector>

// `uvs[i]` are the corner UVs of `scene.primitives[i]`. Empty on success.
std::string AddLightmapUVs(GltfDocument* document, const MeshScene& scene, const std::vector<CornerUVs>& uvs);

// The first TEXCOORD_n the primitive does not have yet.
std::string FirstFreeTexcoord(const tinygltf::Primitive& primitive);
