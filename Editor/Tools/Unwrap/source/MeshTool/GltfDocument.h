#pragma once
// A glTF 2.0 file (.gltf with external or embedded buffers, or .glb) held as a tinygltf model, read
// and written without touching what this tool does not change: images keep their encoded bytes
// (never decoded and re-encoded), extensions and extras pass through.

#include <tiny_gltf.h>

#include <string>

struct GltfDocument
{
    tinygltf::Model model;
    std::string directory;   // of the file read; relative image URIs start here
};

// Empty on success; otherwise what is wrong with the file.
std::string LoadGltf(const std::string& path, GltfDocument* document);

// The bytes of the file `outputPath` is to hold (.glb binary, else .gltf text with the buffer
// embedded). Images named by a relative URI are referred to from the output's directory.
std::string SerializeGltf(const GltfDocument& document, const std::string& outputPath, std::string* bytes);
