#pragma once
// The mesh files: a Wavefront OBJ subset (read: v, vt and f lines with vertex/uv/normal corners;
// written: positions, one UV per triangle corner, faces) and the raw little-endian binary layout
// (read: the 20-byte UnwrapParam, counts, presence words and blocks; written: only the UV pairs).
//
// Arrays come from malloc and belong to the caller. Every function answers an error text, empty
// on success; on failure no output file is left behind.

#include "Editor/Tools/Unwrap/source/CLTool/LibraryExports.h"

#include <stdint.h>
#include <string>

typedef std::string MeshFileError;

MeshFileError LoadFromObj(const char* path, UnwrapParam* param, uint32_t* vertexCount, uint32_t* triCount, float** vertex,
                          float** uv, uint32_t** tri, uint32_t** srcPoly);
MeshFileError LoadFromHalvorBinary(const char* path, UnwrapParam* param, uint32_t* vertexCount, uint32_t* triCount,
                                   float** vertex, float** uv, uint32_t** tri, uint32_t** srcPoly);

// Both writers take the same arguments so that the driver can pick one through a pointer.
typedef MeshFileError (*MeshWriter)(const char* path, uint32_t vertexCount, uint32_t triCount, const float* vertex,
                                    const float* uv, const uint32_t* tri);
MeshFileError SaveToObj(const char* path, uint32_t vertexCount, uint32_t triCount, const float* vertex, const float* uv,
                        const uint32_t* tri);
MeshFileError SaveToHalvorBinary(const char* path, uint32_t vertexCount, uint32_t triCount, const float* vertex,
                                 const float* uv, const uint32_t* tri);

// The parameters an OBJ file implies, and that the driver starts from.
UnwrapParam DefaultUnwrapParam();
