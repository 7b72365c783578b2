#pragma once
// The steps that turn the caller's file image into a mapped, relocated module image. Each one
// reads the file through `file` and the mapped block through `image`, refuses any access that
// falls outside them, and returns an error message ("Failed to load DLL: ...") or null.

#include <stdint.h>

#include "Editor/Tools/Quillet/quillet_ByteView.h"
#include "Editor/Tools/Quillet/quillet_PEFormat.h"

// What the loader takes from the caller's headers before anything is mapped.
struct PEFileHeaders
{
    uint64_t ntOffset;               // file offset of the NT headers (never negative)
    PE_IMAGE_NT_HEADERS nt;          // a copy of the caller's NT headers
};

// The checks made before mapping: size, DOS magic, NT signature, PE32+ magic.
const char* ReadFileHeaders(const ByteView& file, PEFileHeaders& out);

// Copies the headers (including the DOS part before them) and records the mapped base.
const char* CopyHeaders(const ByteView& file, const MutableByteView& image, const PEFileHeaders& headers);

const char* CopySections(const ByteView& file, const MutableByteView& image, const PEFileHeaders& headers);

// Adds `locDelta` to every DIR64 and HIGHLOW target named by the mapped base-relocation blocks.
const char* DoRelocation(const MutableByteView& image, uint64_t ntOffset, uint64_t locDelta);

// Checks that the export directory and its three arrays lie inside the mapped image.
const char* CheckExports(const MutableByteView& image, uint64_t ntOffset);
