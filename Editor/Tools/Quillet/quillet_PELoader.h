#pragma once

#include <stddef.h>
#include <stdint.h>

#include "Editor/Tools/Quillet/quillet_KnownImports.h"

struct PE_IMAGE_NT_HEADERS;

// One loaded DLL. A DLL loaded twice is two independent modules.
struct PEModule
{
    uint8_t* codeBase;              // the mapped image; the DLL's own module handle
    size_t codeSize;                // SizeOfImage
    PE_IMAGE_NT_HEADERS* headers;   // NT headers inside the mapped image
    uint8_t* thunks;                // import-stub area, null when the DLL has no imports
    uint8_t* thunksCurr;            // next free byte of the stub area
    size_t thunksSize;              // bytes mapped for the stub area, or 0
};

// Loads a 64-bit PE DLL. Imports bind by name, ignoring case, first to `imports`, then to
// kQuilletKnownImports, else to a stub that reports the call. On failure returns null and,
// when outErrorMsg is given, a constant message starting "Failed to load DLL: ".
PEModule* PELoadLibrary(const void* data, size_t size, const PEKnownImport* imports, uint32_t importCount, const char** outErrorMsg);
PEModule* PELoadLibrary(const char* path, const PEKnownImport* imports, uint32_t importCount, const char** outErrorMsg);

// Looks an export up by name, ignoring case. Null for a null module or an unknown name.
void* PEGetProcAddress(PEModule* module, const char* name);
void PEFreeLibrary(PEModule* module);

// A fresh private anonymous read-write-execute mapping, or MAP_FAILED (all ones) unchanged.
void* MapExecMemory(size_t bytes);
void UnmapExecMemory(void* ptr, size_t bytes);

// Hook for platforms whose calling conventions differ; on x64 it returns func unchanged.
void* PECreateCallThunk(PEModule* module, void* func, int32_t unwind, void** destAddr);

// Points the calling thread's GS segment at the process-wide thread block. Must run on a thread
// before it calls DLL code. Returns an error message or null.
const char* PESetupFS();
