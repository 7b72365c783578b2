// Feeds arbitrary bytes to the loader's memory form, stopping before any of the input's code
// would run, then looks a few names up in whatever module came out. Any crash, sanitizer report,
// leak, time-out or memory blow-up is a loader bug: every input must load or be refused with a
// message.
#include <stddef.h>
#include <stdint.h>
#include <string.h>

#include <initializer_list>

#include "Editor/Tools/Quillet/quillet_PELoaderInternal.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size)
{
    const char* message = nullptr;
    PEModule* module = PEMapLibraryWithoutEntry(data, size, nullptr, 0, &message);
    if (!module)
    {
        // A refusal always explains itself.
        if (!message || strncmp(message, "Failed to load DLL: ", 20) != 0)
            __builtin_trap();
        return 0;
    }
    for (const char* name : {"DllMain", "GenerateSecondaryUVSet", "a", ""})
        PEGetProcAddress(module, name);
    PEFreeLibrary(module);
    return 0;
}
