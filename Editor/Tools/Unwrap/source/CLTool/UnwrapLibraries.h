#pragma once
// Loading the two libraries and calling the unwrapper, shared by every program that unwraps
// (ChartBake and chartbake-mesh): one place for the load order, the import table and the call.

#include "Editor/Tools/Unwrap/source/CLTool/LibraryExports.h"

// Loads Tessary.dll, binds its 13 service exports, copies them into `rows` (the 30-row table
// named after Tessary.dll's exports; filled on the first call only, before the test exports are
// bound, so the test rows stay empty), loads Unwrap.dll through that table and binds
// GenerateSecondaryUVSet. Results are kept in the driver's globals and not checked here: see
// DescribeMissingForUnwrap.
void LoadUnwrapLibraries(PEKnownImport* rows);
// The same with a table of its own, for programs that do not run the self-tests.
void LoadUnwrapLibraries();

// The thread's SSE state the libraries run under: round toward zero, flush-to-zero off.
void SetUnwrapFloatingPointState();

// Prepares this thread for library code and calls GenerateSecondaryUVSet. `errorBuffer` holds
// `kUnwrapErrorBufferSize` characters, zero-filled by the caller.
constexpr uint32_t kUnwrapErrorBufferSize = 1024;
bool CallGenerateSecondaryUVSet(const float* vertex, uint32_t vertexCount, const float* triUV, const uint32_t* tri,
                                const uint32_t* srcPoly, uint32_t triCount, float* outUV, const UnwrapParam& param,
                                char* errorBuffer);
