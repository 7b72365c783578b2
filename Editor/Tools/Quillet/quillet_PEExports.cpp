// Export look-up by name in a mapped module. The mapped image is writable by the DLL itself, so
// every read is checked again here rather than trusted from load time.
#include "Editor/Tools/Quillet/quillet_PELoader.h"

#include <strings.h>

#include "Editor/Tools/Quillet/quillet_ByteView.h"
#include "Editor/Tools/Quillet/quillet_PEFormat.h"

namespace
{
    // Index into AddressOfFunctions of the first name equal to `name` ignoring case, or -1.
    int64_t FindNameOrdinal(const ByteView& image, const PE_IMAGE_EXPORT_DIRECTORY& exports, const char* name)
    {
        for (uint64_t i = 0; i < exports.NumberOfNames; ++i)
        {
            uint32_t nameOffset = 0;
            if (!image.Read(exports.AddressOfNames + 4 * i, nameOffset))
                return -1;
            const char* exportName = image.CString(nameOffset);
            if (!exportName)
                return -1;
            if (strcasecmp(exportName, name) != 0)
                continue;
            uint16_t index = 0;
            if (!image.Read(exports.AddressOfNameOrdinals + 2 * i, index))
                return -1;
            return index;
        }
        return -1;
    }
}

void* PEGetProcAddress(PEModule* module, const char* name)
{
    if (!module || !name)
        return nullptr;
    ByteView image(module->codeBase, module->codeSize);
    const uint64_t ntOffset = reinterpret_cast<uint8_t*>(module->headers) - module->codeBase;
    PE_IMAGE_DATA_DIRECTORY dir{};
    if (!image.Read(ntOffset + PEDataDirectoryOffset(kPEDirectoryExports), dir) || dir.size == 0)
        return nullptr;
    PE_IMAGE_EXPORT_DIRECTORY exports{};
    if (!image.Read(dir.va, exports))
        return nullptr;
    const int64_t index = FindNameOrdinal(image, exports, name);
    // Strictly greater: an index equal to NumberOfFunctions is accepted, as it always was.
    if (index < 0 || static_cast<uint64_t>(index) > exports.NumberOfFunctions)
        return nullptr;
    uint32_t funcAddr = 0;
    if (!image.Read(exports.AddressOfFunctions + 4 * static_cast<uint64_t>(index), funcAddr))
        return nullptr;
    return module->codeBase + funcAddr;
}
