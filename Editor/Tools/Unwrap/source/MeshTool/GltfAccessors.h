#pragma once
// Reading and appending glTF accessors. Reading resolves the buffer view, byte stride and sparse
// substitution into one dense, tightly packed copy, checking every range against its buffer;
// appending writes dense data into one buffer with the alignment and stride rules of vertex
// attributes and indices.

#include <tiny_gltf.h>

#include <cstdint>
#include <string>
#include <vector>

// The elements of one accessor, tightly packed: `count` elements of `elementSize` bytes.
struct DenseAccessor
{
    std::vector<uint8_t> bytes;
    size_t count = 0;
    size_t elementSize = 0;
};

// Empty on success; otherwise which accessor is broken and how.
std::string ReadDenseAccessor(const tinygltf::Model& model, int accessorIndex, DenseAccessor* out);

// The accessor's components as doubles (normalized integers mapped to [-1, 1] or [0, 1]).
std::vector<double> DecodeComponents(const tinygltf::Accessor& accessor, const DenseAccessor& dense);

// Element i of an index accessor (unsigned byte, short or int components).
uint32_t IndexAt(const tinygltf::Accessor& accessor, const DenseAccessor& dense, size_t i);

// Appends `dense` to buffer `bufferIndex` in a buffer view of its own and answers a new accessor
// describing it like `like` (type, component type, normalized, name, extras). Vertex attributes
// get a byte stride when their elements are not a multiple of 4 bytes; min and max are computed
// when `withBounds` is set.
tinygltf::Accessor AppendAccessorData(tinygltf::Model* model, int bufferIndex, const tinygltf::Accessor& like,
                                      const DenseAccessor& dense, int bufferViewTarget, bool withBounds);
