// Loading a 64-bit PE DLL into this process: checks, mapping, relocation, import binding and the
// entry point call; and releasing a module again.
#include "Editor/Tools/Quillet/quillet_PELoader.h"

#include <new>
#include <stdio.h>
#include <stdlib.h>
#include <sys/mman.h>

#include "Editor/Tools/Quillet/quillet_PEFormat.h"
#include "Editor/Tools/Quillet/quillet_PEImage.h"
#include "Editor/Tools/Quillet/quillet_PEImports.h"
#include "Editor/Tools/Quillet/quillet_PELoaderInternal.h"

typedef int32_t(__attribute__((ms_abi)) * DllEntryProc)(void* module, uint32_t reason, void* reserved);

namespace
{
    constexpr uint32_t kDllProcessAttach = 1;

    PEModule* Fail(const char** outErrorMsg, const char* message)
    {
        if (outErrorMsg)
            *outErrorMsg = message;
        return nullptr;
    }

    // Steps after mapping that may still fail; the caller releases the module on failure.
    const char* BuildImage(const ByteView& file, const PEFileHeaders& headers, PEModule& module,
                           const PEKnownImport* imports, uint32_t importCount)
    {
        MutableByteView image(module.codeBase, module.codeSize);
        PEFilledRanges filled;  // what the file wrote into the image: all other bytes are zero
        if (const char* error = CopyHeaders(file, image, headers, filled))
            return error;
        module.headers = reinterpret_cast<PE_IMAGE_NT_HEADERS*>(module.codeBase + headers.ntOffset);
        if (const char* error = CopySections(file, image, headers, filled))
            return error;
        // Wraps when the block lies below the preferred base; adding it wraps back.
        const uint64_t locDelta = reinterpret_cast<uint64_t>(module.codeBase) - headers.nt.OptionalHeader.ImageBase;
        if (const char* error = DoRelocation(image, headers.ntOffset, locDelta, filled))
            return error;
        // As many import entries as the file has 8-byte words: more means lists that overlap.
        const uint64_t maxImportEntries = file.Size() / sizeof(uint64_t);
        if (const char* error = ProcessImports(module, image, headers.ntOffset, imports, importCount, maxImportEntries))
            return error;
        if (const char* error = CheckExports(image, headers.ntOffset, filled))
            return error;
        // A zero entry point is not special; anything past the image is.
        if (headers.nt.OptionalHeader.AddressOfEntryPoint >= module.codeSize)
            return "Failed to load DLL: entry point outside the image";
        return nullptr;
    }

    // The memory form's steps; `runEntry` false stops after binding (see quillet_PELoaderInternal.h).
    PEModule* LoadFromMemory(const void* data, size_t size, const PEKnownImport* imports, uint32_t importCount,
                             const char** outErrorMsg, bool runEntry)
    {
        ByteView file(static_cast<const uint8_t*>(data), data ? size : 0);
        PEFileHeaders headers{};
        if (const char* error = ReadFileHeaders(file, headers))
            return Fail(outErrorMsg, error);

        const size_t mapSize = headers.nt.OptionalHeader.SizeOfImage;
        void* code = MapExecMemory(mapSize);
        if (code == MAP_FAILED)
            return Fail(outErrorMsg, "Failed to load DLL: could not allocate memory for executable");
        PEModule* module = new (std::nothrow) PEModule{static_cast<uint8_t*>(code), mapSize, nullptr, nullptr, nullptr, 0};
        if (!module)
        {
            UnmapExecMemory(code, mapSize);
            return Fail(outErrorMsg, "Failed to load DLL: could not allocate memory for executable");
        }

        const char* error = BuildImage(file, headers, *module, imports, importCount);
        if (!error && runEntry)
            error = PESetupFS();
        if (error)
        {
            PEFreeLibrary(module);
            return Fail(outErrorMsg, error);
        }

        if (runEntry)
        {
            DllEntryProc entry = reinterpret_cast<DllEntryProc>(module->codeBase + headers.nt.OptionalHeader.AddressOfEntryPoint);
            entry(module->codeBase, kDllProcessAttach, nullptr);
        }
        if (outErrorMsg)
            *outErrorMsg = nullptr;
        return module;
    }
}

PEModule* PELoadLibrary(const void* data, size_t size, const PEKnownImport* imports, uint32_t importCount,
                        const char** outErrorMsg)
{
    return LoadFromMemory(data, size, imports, importCount, outErrorMsg, true);
}

PEModule* PEMapLibraryWithoutEntry(const void* data, size_t size, const PEKnownImport* imports, uint32_t importCount,
                                   const char** outErrorMsg)
{
    return LoadFromMemory(data, size, imports, importCount, outErrorMsg, false);
}

PEModule* PELoadLibrary(const char* path, const PEKnownImport* imports, uint32_t importCount, const char** outErrorMsg)
{
    FILE* file = path ? fopen(path, "rb") : nullptr;
    if (!file)
        return Fail(outErrorMsg, "Failed to load DLL: could not open file");
    fseek(file, 0, SEEK_END);
    const long end = ftell(file);
    // The failure paths between here and the read deliberately leave the file open; a process
    // that cannot load its library ends soon after, which reclaims the handle.
    if (end < 0)
        return Fail(outErrorMsg, "Failed to load DLL: could not read file");
    const uint32_t dllSize = static_cast<uint32_t>(end);
    fseek(file, 0, SEEK_SET);
    void* dllData = malloc(dllSize);
    if (!dllData)
        return Fail(outErrorMsg, "Failed to load DLL: could not allocate memory for file");
    if (fread(dllData, 1, dllSize, file) < dllSize)
    {
        free(dllData);
        return Fail(outErrorMsg, "Failed to load DLL: could not read file");
    }
    fclose(file);
    PEModule* module = PELoadLibrary(static_cast<const void*>(dllData), dllSize, imports, importCount, outErrorMsg);
    free(dllData);
    return module;
}

void PEFreeLibrary(PEModule* module)
{
    if (!module)
        return;
    UnmapExecMemory(module->codeBase, module->codeSize);
    if (module->thunks && module->thunks != MAP_FAILED)
        UnmapExecMemory(module->thunks, module->thunksSize);
    delete module;
}

void* PECreateCallThunk(PEModule* /*module*/, void* func, int32_t /*unwind*/, void** destAddr)
{
    if (destAddr)
        *destAddr = nullptr;
    return func;
}
