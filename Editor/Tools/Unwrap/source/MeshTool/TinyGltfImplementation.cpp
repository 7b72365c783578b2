// The tinygltf implementation, compiled into this program rather than taken from the shared
// library: assimp's dependency libdraco carries a copy of tinygltf built with other options, and
// the dynamic linker would otherwise bind some of our calls to that copy. Images stay encoded
// (see GltfDocument.cpp), so the image codecs are left out (TINYGLTF_NO_STB_IMAGE and
// TINYGLTF_NO_STB_IMAGE_WRITE come from the build).
#define TINYGLTF_IMPLEMENTATION
#include <tiny_gltf.h>
