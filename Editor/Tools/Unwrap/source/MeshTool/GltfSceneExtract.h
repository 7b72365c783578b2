#pragma once
// The triangle primitives of a glTF model as a MeshScene: positions and normals placed by the
// first node that shows the mesh (so that the shared atlas has one texel density across the
// scene), the first UV set, and a triangle list (strips and fans unrolled, non-indexed primitives
// numbered). Points and lines are not part of the scene.

#include "Editor/Tools/Unwrap/source/MeshTool/GltfDocument.h"
#include "Editor/Tools/Unwrap/source/MeshTool/MeshScene.h"

#include <string>

bool IsTrianglePrimitive(const tinygltf::Primitive& primitive);

// The triangle list of a primitive, in its own vertex numbering; empty `error` on success.
std::vector<uint32_t> PrimitiveTriangles(const tinygltf::Model& model, const tinygltf::Primitive& primitive,
                                         std::string* error);

std::string ExtractGltfScene(const GltfDocument& document, MeshScene* scene);
