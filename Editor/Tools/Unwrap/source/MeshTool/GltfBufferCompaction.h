#pragma once
// Drops the buffer views that no accessor or image refers to and gathers the data of the others
// into one buffer (buffer 0, without a URI: the binary chunk of a .glb, an embedded buffer of a
// .gltf), each view 4-byte aligned, references renumbered.

#include <tiny_gltf.h>

#include <string>

// Empty on success; otherwise which buffer view is broken (the model is then unchanged in part only).
std::string GatherIntoOneBuffer(tinygltf::Model* model);
