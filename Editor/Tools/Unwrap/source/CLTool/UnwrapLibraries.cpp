#include "Editor/Tools/Unwrap/source/CLTool/UnwrapLibraries.h"

#include <mutex>
#include <xmmintrin.h>

void LoadUnwrapLibraries(PEKnownImport* rows)
{
    _TessaryDll = LoadLibraryNamed("Tessary.dll", nullptr, 0, &g_TessaryLoad);
    BindServiceExports();
    static std::once_flag rowsFilled;
    std::call_once(rowsFilled, [rows] { FillKnownImports(rows); });
    _UnwrapDll = LoadLibraryNamed("Unwrap.dll", rows, kLibraryImportRows, &g_UnwrapLoad);
    GenerateSecondaryUVSetImpl =
        reinterpret_cast<_GenerateSecondaryUVSetImpl>(PEGetProcAddress(_UnwrapDll, "GenerateSecondaryUVSet"));
}

void LoadUnwrapLibraries()
{
#define SERVICE_ROW(name, type) {#name, nullptr, 0},
#define TEST_ROW(name) {#name, nullptr, 0},
    static PEKnownImport rows[kLibraryImportRows] = {TESSARY_SERVICE_EXPORTS(SERVICE_ROW) TESSARY_TEST_EXPORTS(TEST_ROW)};
#undef SERVICE_ROW
#undef TEST_ROW
    LoadUnwrapLibraries(rows);
}

// Rounding field (bits 13-14) to 11 first, then flush-to-zero (bit 15) off; every other bit stays.
void SetUnwrapFloatingPointState()
{
    _mm_setcsr(_mm_getcsr() | 0x6000u);
    _mm_setcsr(_mm_getcsr() & ~0x8000u);
}

bool CallGenerateSecondaryUVSet(const float* vertex, uint32_t vertexCount, const float* triUV, const uint32_t* tri,
                                const uint32_t* srcPoly, uint32_t triCount, float* outUV, const UnwrapParam& param,
                                char* errorBuffer)
{
    PESetupFS();
    return GenerateSecondaryUVSetImpl(vertex, (int32_t)vertexCount, triUV, tri, srcPoly, (int32_t)triCount, outUV,
                                      param, errorBuffer, kUnwrapErrorBufferSize);
}
