#pragma once

#include <stdint.h>

// One row of a known-import table: an import name and the host function (Windows x64 calling
// convention) that a DLL's import of that name is bound to. Names match ignoring ASCII case.
struct PEKnownImport
{
    const char* name;
    void* func;
    // Argument bytes a 32-bit stdcall callee would pop; carried for call thunks, unused on x64.
    int32_t unwind;
};

extern PEKnownImport kQuilletKnownImports[];
extern int32_t kQuilletKnownImportsCount;

void InitializeQuilletImports();
void CleanupQuilletImports();
