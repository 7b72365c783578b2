#include "Editor/Tools/Quillet/quillet_PEImports.h"

#include <stdio.h>
#include <string.h>
#include <strings.h>
#include <sys/mman.h>

#include "Editor/Tools/Quillet/quillet_ExecMemory.h"
#include "Editor/Tools/Quillet/quillet_PEFormat.h"

FailedImportProcPtr s_FailedProcPtr = nullptr;

__attribute__((ms_abi)) uint64_t FailedImportProcImpl(const char* func)
{
    printf("Called unresolved function %s\n", func);
    return 0;
}

namespace
{
    unsigned char FoldAscii(unsigned char c) { return c >= 'A' && c <= 'Z' ? c + ('a' - 'A') : c; }

    // True when strcasecmp cannot find the names equal: their ASCII first letters already differ.
    // Bytes above 0x7F are left to strcasecmp, whose folding of them depends on the locale.
    bool FirstLettersDiffer(const char* a, const char* b)
    {
        const unsigned char x = static_cast<unsigned char>(a[0]), y = static_cast<unsigned char>(b[0]);
        return x < 0x80 && y < 0x80 && FoldAscii(x) != FoldAscii(y);
    }

    // The specified linear scan; the first-letter test only spares most strcasecmp calls.
    bool SearchTable(const char* name, const PEKnownImport* table, uint64_t count, void** outFunc)
    {
        for (uint64_t i = 0; i < count; ++i)
        {
            if (!FirstLettersDiffer(table[i].name, name) && strcasecmp(table[i].name, name) == 0)
            {
                *outFunc = table[i].func;
                return true;
            }
        }
        return false;
    }

    // Where the loader stands in the stub area of the module being bound.
    struct ThunkArea
    {
        PEModule& module;

        uint8_t* Allocate()
        {
            if (static_cast<size_t>(module.thunksCurr - module.thunks) + kImportThunkSize > module.thunksSize)
                return nullptr;
            uint8_t* stub = module.thunksCurr;
            module.thunksCurr += kImportThunkSize;
            return stub;
        }
    };

    const char* MapThunkArea(PEModule& module)
    {
        // Filled with 0xCC already, without touching its pages here (see MapBreakpointMemory).
        void* area = MapBreakpointMemory(kThunkAreaSize);
        if (area == MAP_FAILED)
            return "Failed to load DLL: could not allocate memory for import stubs";
        module.thunks = static_cast<uint8_t*>(area);
        module.thunksCurr = module.thunks;
        module.thunksSize = kThunkAreaSize;
        s_FailedProcPtr = FailedImportProcImpl;
        return nullptr;
    }

    // Binds one lookup entry: `entry` is the image offset of a PE_IMAGE_IMPORT_BY_NAME.
    const char* BindImport(const MutableByteView& image, uint64_t entry, uint64_t slot, ThunkArea& thunks,
                           const PEKnownImport* imports, uint32_t importCount)
    {
        if (entry >> 63)
            return "Failed to load DLL: import by ordinal is not supported";
        const char* name = image.CString(entry + offsetof(PE_IMAGE_IMPORT_BY_NAME, Name));
        if (!name)
            return "Failed to load DLL: import name outside the image";
        void* func = nullptr;
        if (!FindMatchingImport(name, imports, importCount, &func))
        {
            uint8_t* stub = thunks.Allocate();
            if (!stub)
                return "Failed to load DLL: too many unresolved imports for the import stub area";
            PECreateImportThunk(stub, name);
            func = stub;
        }
        if (!image.Write<uint64_t>(slot, reinterpret_cast<uint64_t>(func)))
            return "Failed to load DLL: import address table outside the image";
        return nullptr;
    }

    const char* BindDescriptor(const MutableByteView& image, const PE_IMAGE_IMPORT_DESCRIPTOR& desc,
                               ThunkArea& thunks, const PEKnownImport* imports, uint32_t importCount,
                               uint64_t& entriesLeft)
    {
        uint64_t lookup = desc.OriginalFirstThunk ? desc.OriginalFirstThunk : desc.FirstThunk;
        uint64_t address = desc.FirstThunk;
        for (uint64_t i = 0;; ++i)
        {
            uint64_t entry = 0;
            if (!image.Read(lookup + 8 * i, entry))
                return "Failed to load DLL: import lookup table outside the image";
            if (entry == 0)
                return nullptr;
            if (entriesLeft-- == 0)
                return "Failed to load DLL: more import entries than the file holds";
            if (const char* error = BindImport(image, entry, address + 8 * i, thunks, imports, importCount))
                return error;
        }
    }
}

bool FindMatchingImport(const char* name, const PEKnownImport* imports, uint32_t importCount, void** outFunc)
{
    if (imports && importCount != 0 && SearchTable(name, imports, importCount, outFunc))
        return true;
    return kQuilletKnownImportsCount > 0 &&
           SearchTable(name, kQuilletKnownImports, static_cast<uint64_t>(kQuilletKnownImportsCount), outFunc);
}

void PECreateImportThunk(uint8_t* dest, const char* name)
{
    const uint64_t nameAddress = reinterpret_cast<uint64_t>(name);
    const uint64_t procAddress = reinterpret_cast<uint64_t>(&FailedImportProcImpl);
    dest[0] = 0x48;  // mov rcx, imm64
    dest[1] = 0xB9;
    memcpy(dest + 2, &nameAddress, 8);
    dest[10] = 0x48;  // mov rax, imm64
    dest[11] = 0xB8;
    memcpy(dest + 12, &procAddress, 8);
    dest[20] = 0x48;  // jmp rax
    dest[21] = 0xFF;
    dest[22] = 0xE0;
}

const char* ProcessImports(PEModule& module, const MutableByteView& image, uint64_t ntOffset,
                           const PEKnownImport* imports, uint32_t importCount, uint64_t maxEntries)
{
    PE_IMAGE_DATA_DIRECTORY dir{};
    if (!image.Read(ntOffset + PEDataDirectoryOffset(kPEDirectoryImports), dir))
        return "Failed to load DLL: headers outside the image";
    if (dir.size == 0)
    {
        printf("  No imports\n");
        return nullptr;
    }
    if (const char* error = MapThunkArea(module))
        return error;
    ThunkArea thunks{module};
    for (uint64_t offset = dir.va;; offset += sizeof(PE_IMAGE_IMPORT_DESCRIPTOR))
    {
        PE_IMAGE_IMPORT_DESCRIPTOR desc{};
        if (!image.Read(offset, desc))
            return "Failed to load DLL: import descriptor outside the image";
        if (desc.Name == 0)
            return nullptr;
        if (const char* error = BindDescriptor(image, desc, thunks, imports, importCount, maxEntries))
            return error;
    }
}
