#pragma once
// Binding a module's imports: table look-up by name and the stubs that report a call to an
// import no table names.

#include <stddef.h>
#include <stdint.h>

#include "Editor/Tools/Quillet/quillet_ByteView.h"
#include "Editor/Tools/Quillet/quillet_PELoader.h"

// Every module with an import directory owns one stub area of kMaxThunks * kBytesPerThunk bytes.
constexpr size_t kMaxThunks = 1024;
constexpr size_t kBytesPerThunk = 256;
constexpr size_t kThunkAreaSize = kMaxThunks * kBytesPerThunk;
// One stub: mov rcx, <name>; mov rax, <FailedImportProcImpl>; jmp rax.
constexpr size_t kImportThunkSize = 23;
constexpr size_t kMaxImportThunks = kThunkAreaSize / kImportThunkSize;  // 11,397

typedef uint64_t(__attribute__((ms_abi)) * FailedImportProcPtr)(const char* func);

// Reached through a stub when DLL code calls an unresolved import: reports the call on standard
// output and returns 0 to the DLL.
__attribute__((ms_abi)) uint64_t FailedImportProcImpl(const char* func);

// Set to FailedImportProcImpl whenever a stub area is built; kept for debugging only.
extern FailedImportProcPtr s_FailedProcPtr;

// Looks `name` up ignoring ASCII case, first in the caller's table (when given and not empty),
// then in kQuilletKnownImports; the first equal row wins. False when neither holds it.
bool FindMatchingImport(const char* name, const PEKnownImport* imports, uint32_t importCount, void** outFunc);

// Writes one stub for the import named `name` at `dest` (kImportThunkSize bytes).
void PECreateImportThunk(uint8_t* dest, const char* name);

// Binds every import of the mapped image `image` of `module`, mapping its stub area when it has
// an import directory (prints "  No imports" when it has none). Returns an error message or null.
// Beyond the specified step, refuses an image whose descriptors name more than `maxEntries`
// import entries in all: a real image's lookup lists do not overlap, so they cannot hold more
// entries than the file has words, while overlapping lists would multiply the binding work.
const char* ProcessImports(PEModule& module, const MutableByteView& image, uint64_t ntOffset,
                           const PEKnownImport* imports, uint32_t importCount, uint64_t maxEntries);
