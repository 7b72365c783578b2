#include "Editor/Tools/Unwrap/source/CLTool/LibraryExports.h"

#include <cstdio>
#include <unistd.h>

#define DEFINE_SERVICE_POINTER(name, type) _##name##Impl name##Impl = nullptr;
#define DEFINE_TEST_POINTER(name) _Tessary_TestImpl name##Impl = nullptr;
TESSARY_SERVICE_EXPORTS(DEFINE_SERVICE_POINTER)
TESSARY_TEST_EXPORTS(DEFINE_TEST_POINTER)
#undef DEFINE_SERVICE_POINTER
#undef DEFINE_TEST_POINTER

PEModule* _TessaryDll = nullptr;
PEModule* _UnwrapDll = nullptr;
_GenerateSecondaryUVSetImpl GenerateSecondaryUVSetImpl = nullptr;
_Unwrap_TestImpl Unwrap_TestUnwrapWithDegenerateTrianglesImpl = nullptr;
_Unwrap_TestImpl Unwrap_TestUnwrapDontSplitRectsImpl = nullptr;

LibraryLoadInfo g_TessaryLoad;
LibraryLoadInfo g_UnwrapLoad;

namespace
{
    bool CanOpen(const std::string& path)
    {
        FILE* file = std::fopen(path.c_str(), "rb");
        if (!file)
            return false;
        std::fclose(file);
        return true;
    }

    std::string ExecutableDirectory()
    {
        char path[4096];
        ssize_t length = readlink("/proc/self/exe", path, sizeof path - 1);
        if (length <= 0)
            return "";
        std::string exe(path, (size_t)length);
        size_t slash = exe.rfind('/');
        return slash == std::string::npos ? "" : exe.substr(0, slash);
    }

    template <typename Pointer>
    void Bind(Pointer& pointer, PEModule* module, const char* name)
    {
        pointer = reinterpret_cast<Pointer>(PEGetProcAddress(module, name));
    }
}

PEModule* LoadLibraryNamed(const char* name, const PEKnownImport* imports, uint32_t importCount, LibraryLoadInfo* info)
{
    info->name = name;
    info->path = name;
    if (!CanOpen(name))
    {
        std::string besideExecutable = ExecutableDirectory() + "/" + name;
        if (CanOpen(besideExecutable))
            info->path = besideExecutable;
    }
    const char* message = nullptr;
    PEModule* module = PELoadLibrary(info->path.c_str(), imports, importCount, &message);
    info->loaderMessage = module || !message ? "" : message;
    return module;
}

void BindServiceExports()
{
#define BIND_SERVICE(name, type) Bind(name##Impl, _TessaryDll, #name);
    TESSARY_SERVICE_EXPORTS(BIND_SERVICE)
#undef BIND_SERVICE
}

void FillKnownImports(PEKnownImport* rows)
{
    void* pointers[kLibraryImportRows] = {
#define SERVICE_ADDRESS(name, type) reinterpret_cast<void*>(name##Impl),
#define TEST_ADDRESS(name) reinterpret_cast<void*>(name##Impl),
        TESSARY_SERVICE_EXPORTS(SERVICE_ADDRESS) TESSARY_TEST_EXPORTS(TEST_ADDRESS)
#undef SERVICE_ADDRESS
#undef TEST_ADDRESS
    };
    for (uint32_t row = 0; row < kLibraryImportRows; ++row)
        rows[row].func = pointers[row];
}

void BindTestExports()
{
#define BIND_TEST(name) Bind(name##Impl, _TessaryDll, #name);
    TESSARY_TEST_EXPORTS(BIND_TEST)
#undef BIND_TEST
    Bind(Unwrap_TestUnwrapWithDegenerateTrianglesImpl, _UnwrapDll, "Unwrap_TestUnwrapWithDegenerateTriangles");
    Bind(Unwrap_TestUnwrapDontSplitRectsImpl, _UnwrapDll, "Unwrap_TestUnwrapDontSplitRects");
}

std::string DescribeMissingExport(const void* pointer, const PEModule* module, const LibraryLoadInfo& load,
                                  const char* exportName)
{
    if (pointer)
        return "";
    if (!module)
        return std::string(exportName) + " is unavailable: " + load.name + " could not be loaded from " + load.path +
               " (" + (load.loaderMessage.empty() ? "no message from the loader" : load.loaderMessage) + ")";
    return std::string(load.name) + " has no export " + exportName;
}

std::string DescribeMissingServices()
{
    std::string missing;
#define CHECK_SERVICE(name, type) \
    if (missing.empty()) \
        missing = DescribeMissingExport(reinterpret_cast<const void*>(name##Impl), _TessaryDll, g_TessaryLoad, #name);
    TESSARY_SERVICE_EXPORTS(CHECK_SERVICE)
#undef CHECK_SERVICE
    return missing;
}

std::string DescribeMissingForUnwrap()
{
    std::string missing = DescribeMissingExport(reinterpret_cast<const void*>(GenerateSecondaryUVSetImpl), _UnwrapDll,
                                                g_UnwrapLoad, "GenerateSecondaryUVSet");
    return missing.empty() ? DescribeMissingServices() : missing;
}
