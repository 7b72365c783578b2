#pragma once
// The driver's view of the two libraries: their module handles, one pointer per export (named
// after the export with Impl appended), and how each library was found and loaded. Every pointer
// into a library is called with the Windows x64 calling convention.

#include "Editor/Tools/Quillet/quillet_PELoader.h"

#include <stdint.h>
#include <string>

#define WINAPI_CALL __attribute__((ms_abi))

// Types that only Tessary.dll looks into; the driver passes them through.
struct Tessary_MeshDesc;
struct Tessary_CleanupGeometryResult;
typedef struct Tessary_ProgressiveMeshData* Tessary_ProgressiveMesh;

// The unwrapping parameters: a plain 20-byte block, stored verbatim in the raw binary mesh file.
struct UnwrapParam
{
    float angleDistortionThreshold;
    float areaDistortionThreshold;
    float hardAngle;
    float packMargin;
    int32_t recollectVertices;
};
static_assert(sizeof(UnwrapParam) == 20, "UnwrapParam is stored verbatim as 20 bytes");

typedef bool(WINAPI_CALL* _Tessary_TestImpl)();
typedef bool(WINAPI_CALL* _Unwrap_TestImpl)();
typedef bool(WINAPI_CALL* _GenerateSecondaryUVSetImpl)(const float* vertex, int32_t vertexCount, const float* triUV,
                                                       const uint32_t* tri, const uint32_t* srcPoly, int32_t triCount,
                                                       float* outUV, const UnwrapParam& param, char* errorBuffer,
                                                       uint32_t errorBufferSize);

// The 13 service exports of Tessary.dll, in the order of the known-import table: (name, type).
#define TESSARY_SERVICE_EXPORTS(X) \
    X(Tessary_Allocate, void*(WINAPI_CALL*)(unsigned int)) \
    X(Tessary_Deallocate, void(WINAPI_CALL*)(void*)) \
    X(Tessary_DestroyMeshDesc, void(WINAPI_CALL*)(Tessary_MeshDesc*)) \
    X(Tessary_CleanupGeometry, void(WINAPI_CALL*)(Tessary_MeshDesc*, Tessary_CleanupGeometryResult*)) \
    X(Tessary_FitIntoCube, void(WINAPI_CALL*)(unsigned int, float*, const float*, float)) \
    X(Tessary_CreateProgressiveMesh, Tessary_ProgressiveMesh(WINAPI_CALL*)(const Tessary_MeshDesc&)) \
    X(Tessary_DestroyProgressiveMesh, void(WINAPI_CALL*)(Tessary_ProgressiveMesh)) \
    X(Tessary_PMGenerateGeometry, void(WINAPI_CALL*)(Tessary_ProgressiveMesh, Tessary_MeshDesc*)) \
    X(Tessary_PMUpdateTriangles, void(WINAPI_CALL*)(Tessary_ProgressiveMesh, unsigned int, Tessary_MeshDesc*)) \
    X(Tessary_PMUpdateTrianglesWithSourceInfo, \
      void(WINAPI_CALL*)(Tessary_ProgressiveMesh, unsigned int, Tessary_MeshDesc*, unsigned int**)) \
    X(Tessary_PMSplitCount, int(WINAPI_CALL*)(Tessary_ProgressiveMesh)) \
    X(Tessary_LiftSegmentationFromLod, void(WINAPI_CALL*)(Tessary_ProgressiveMesh, int*)) \
    X(Tessary_LiftSegmentationFromLodIter, void(WINAPI_CALL*)(Tessary_ProgressiveMesh, int*, int))

// The 17 test exports of Tessary.dll, in the order of the known-import table.
#define TESSARY_TEST_EXPORTS(X) \
    X(Tessary_TestMathBasic) X(Tessary_TestTrigonometry) X(Tessary_TestLog) X(Tessary_TestMatrix4Invert) \
    X(Tessary_TestSparseMatrix) X(Tessary_TestTriMapBasic) X(Tessary_TestTriMapVertexIndex) \
    X(Tessary_TestCollapseEdgeBasic) X(Tessary_TestSplitConnected) X(Tessary_TestNonManifoldFixer) \
    X(Tessary_TestDegenerateRemoval) X(Tessary_TestArray) X(Tessary_TestBlobArray) X(Tessary_TestHashTab) \
    X(Tessary_TestPriorityQueue) X(Tessary_TestProgressiveMeshInternalCollapseEdge) \
    X(Tessary_TestSlidingWindowSimplePatchGenerate)

#define DECLARE_SERVICE_POINTER(name, type) using _##name##Impl = type; extern _##name##Impl name##Impl;
#define DECLARE_TEST_POINTER(name) extern _Tessary_TestImpl name##Impl;
TESSARY_SERVICE_EXPORTS(DECLARE_SERVICE_POINTER)
TESSARY_TEST_EXPORTS(DECLARE_TEST_POINTER)
#undef DECLARE_SERVICE_POINTER
#undef DECLARE_TEST_POINTER

extern PEModule* _TessaryDll;
extern PEModule* _UnwrapDll;
extern _GenerateSecondaryUVSetImpl GenerateSecondaryUVSetImpl;
extern _Unwrap_TestImpl Unwrap_TestUnwrapWithDegenerateTrianglesImpl;
extern _Unwrap_TestImpl Unwrap_TestUnwrapDontSplitRectsImpl;

// How one library was looked for. `loaderMessage` is the loader's text when the load failed.
struct LibraryLoadInfo
{
    const char* name = "";
    std::string path;
    std::string loaderMessage;
};
extern LibraryLoadInfo g_TessaryLoad;
extern LibraryLoadInfo g_UnwrapLoad;

// Number of rows in the table through which Unwrap.dll imports from Tessary.dll.
constexpr uint32_t kLibraryImportRows = 30;

// Loads a library by its plain name from the working directory, or, when it cannot be opened
// there, from the directory of the ChartBake executable.
PEModule* LoadLibraryNamed(const char* name, const PEKnownImport* imports, uint32_t importCount, LibraryLoadInfo* info);

// Step by step as main runs them.
void BindServiceExports();
void FillKnownImports(PEKnownImport* rows);
void BindTestExports();

// Empty when `pointer` is bound; otherwise a sentence naming the library, the export and, when
// the library is missing, the loader's message.
std::string DescribeMissingExport(const void* pointer, const PEModule* module, const LibraryLoadInfo& load,
                                  const char* exportName);

// Empty when Tessary.dll and its 13 service exports, which Unwrap.dll imports, are there.
std::string DescribeMissingServices();

// Empty when everything an unwrap calls is there (Unwrap.dll and its unwrap export, Tessary.dll
// and its service exports, which Unwrap.dll imports); otherwise what is missing.
std::string DescribeMissingForUnwrap();
