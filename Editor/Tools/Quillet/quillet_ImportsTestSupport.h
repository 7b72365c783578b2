#pragma once
// For the tests of the host functions: they reach each function the way DLL code does, by the
// row of its import name in kQuilletKnownImports, and call it with the Windows x64 convention.

#include <stdint.h>
#include <strings.h>

#include "Editor/Tools/Quillet/quillet_KnownImports.h"

namespace QuilletTest
{
    // A pointer to a host function as DLL code calls it.
    template<typename R, typename... A>
    using WinFn = R(__attribute__((ms_abi)) *)(A...);

    // The first row whose name matches ignoring case, as the loader binds; null when none does.
    inline const PEKnownImport* FindImportRow(const char* name)
    {
        for (int32_t i = 0; i < kQuilletKnownImportsCount; ++i)
            if (strcasecmp(kQuilletKnownImports[i].name, name) == 0)
                return &kQuilletKnownImports[i];
        return nullptr;
    }

    inline void* FindImport(const char* name)
    {
        const PEKnownImport* row = FindImportRow(name);
        return row ? row->func : nullptr;
    }

    // The host function bound to `name`, typed as the caller's Windows declaration; null when no
    // row has that name.
    template<typename R, typename... A>
    WinFn<R, A...> Import(const char* name)
    {
        return reinterpret_cast<WinFn<R, A...>>(FindImport(name));
    }
}
