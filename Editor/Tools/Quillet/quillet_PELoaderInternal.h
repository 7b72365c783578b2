#pragma once
// Beyond the loader's public interface: for tools that must look at a DLL without running any of
// its code (the loader's fuzzer, inspection). Not for the driver.

#include "Editor/Tools/Quillet/quillet_PELoader.h"

// PELoadLibrary from memory without its last two steps: the image is checked, mapped, copied,
// relocated and bound exactly as PELoadLibrary does, but neither the thread block is prepared nor
// the entry point called. Released with PEFreeLibrary.
PEModule* PEMapLibraryWithoutEntry(const void* data, size_t size, const PEKnownImport* imports, uint32_t importCount,
                                   const char** outErrorMsg);
