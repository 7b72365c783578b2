#pragma once
// The steps that turn the caller's file image into a mapped, relocated module image. Each one
// reads the file through `file` and the mapped block through `image`, refuses any access that
// falls outside them, and returns an error message ("Failed to load DLL: ...") or null.

#include <stdint.h>

#include "Editor/Tools/Quillet/quillet_ByteView.h"
#include "Editor/Tools/Quillet/quillet_PEFilledRanges.h"
#include "Editor/Tools/Quillet/quillet_PEFormat.h"

// What the loader takes from the caller's headers before anything is mapped.
struct PEFileHeaders
{
    uint64_t ntOffset;               // file offset of the NT headers (never negative)
    PE_IMAGE_NT_HEADERS nt;          // a copy of the caller's NT headers
};

// The checks made before mapping: size, DOS magic, NT signature, PE32+ magic.
const char* ReadFileHeaders(const ByteView& file, PEFileHeaders& out);

// Copies the headers (including the DOS part before them) and records the mapped base. Adds the
// copied bytes to `filled`.
const char* CopyHeaders(const ByteView& file, const MutableByteView& image, const PEFileHeaders& headers,
                        PEFilledRanges& filled);

// Copies each section's raw data (adding it to `filled`) or zeroes a section without any. Only
// filled bytes are ever zeroed: the rest of the mapping is zero already. Beyond the specified
// step, refuses sections whose raw data add up to more than the file holds (no real image
// shares raw data between sections), so the bytes written stay within the file's size.
const char* CopySections(const ByteView& file, const MutableByteView& image, const PEFileHeaders& headers,
                         PEFilledRanges& filled);

// Adds `locDelta` to every DIR64 and HIGHLOW target named by the mapped base-relocation blocks.
// Beyond the specified step, every block must lie wholly inside the image and inside `filled`
// (checked before any of its entries is used), and so must every target: a block or target in
// never-filled space could only ever be zero, and walking it would cost time and memory in
// proportion to SizeOfImage.
const char* DoRelocation(const MutableByteView& image, uint64_t ntOffset, uint64_t locDelta, PEFilledRanges& filled);

// Checks that the export directory and its three arrays lie inside the mapped image. Beyond the
// specified steps, the arrays must also lie in `filled`: look-ups then walk at most as many names
// as the file holds, however large the image.
const char* CheckExports(const MutableByteView& image, uint64_t ntOffset, PEFilledRanges& filled);
