// ChartBake: loads Tessary.dll and Unwrap.dll, then unwraps one mesh file or runs the libraries'
// self-tests. Both libraries are loaded and the floating-point state is set before the command
// line is looked at, so every run (a usage error included) starts from the same state.
//
//   ChartBake [-obj] <input_file> <output_file>   unwrap; exit 0 when written, 1 when the library fails
//   ChartBake -runNativeTests [...]              run the suite "Tessary"; exit = number of failed tests
#include "Editor/Tools/Unwrap/source/CLTool/LibraryExports.h"
#include "Editor/Tools/Unwrap/source/CLTool/MeshFiles.h"
#include "Editor/Tools/Unwrap/source/CLTool/PhaseTimings.h"
#include "Editor/Tools/Unwrap/source/CLTool/UnwrapLibraries.h"
#include "Runtime/Logging/LogAssert.h"
#include "Runtime/Testing/Testing.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <sstream>

namespace
{
    int PrintUsage()
    {
        std::puts("usage:");
        std::puts("ChartBake [-obj] <input_file> <output_file>");
        return 1;
    }

    int Fail(const std::string& message)
    {
        std::fprintf(stderr, "ChartBake: %s\n", message.c_str());
        return 1;
    }

    int Unwrap(bool useObjFormat, const char* inPath, const char* outPath)
    {
        std::string missing = DescribeMissingForUnwrap();
        if (!missing.empty())
            return Fail("cannot unwrap: " + missing);

        UnwrapParam unwrapParam = DefaultUnwrapParam();
        uint32_t vertexCount = 0, triCount = 0;
        float* vertex = nullptr;
        float* triUV = nullptr;
        uint32_t* tri = nullptr;
        uint32_t* srcPoly = nullptr;
        MeshFileError error = useObjFormat
            ? LoadFromObj(inPath, &unwrapParam, &vertexCount, &triCount, &vertex, &triUV, &tri, &srcPoly)
            : LoadFromHalvorBinary(inPath, &unwrapParam, &vertexCount, &triCount, &vertex, &triUV, &tri, &srcPoly);
        if (!error.empty())
            return Fail(error);
        GetPhaseTimings().Mark(PhaseTimings::kRead);

        float* outUV = (float*)std::malloc(triCount ? (size_t)(triCount * 6u) * sizeof(float) : 1);
        static char unwrapErrorBuffer[kUnwrapErrorBufferSize];
        std::memset(unwrapErrorBuffer, 0, sizeof unwrapErrorBuffer);
        if (!outUV)
            return Fail("out of memory for the UVs of " + std::to_string(triCount) + " triangles");

        bool success = CallGenerateSecondaryUVSet(vertex, vertexCount, triUV, tri, srcPoly, triCount, outUV, unwrapParam,
                                                  unwrapErrorBuffer);
        GetPhaseTimings().Mark(PhaseTimings::kUnwrap);
        if (unwrapErrorBuffer[0] != 0)
        {
            std::printf("%.*s", (int)kUnwrapErrorBufferSize, unwrapErrorBuffer);
            std::fflush(stdout);
        }
        if (!success)
            return 1;

        MeshWriter writer = useObjFormat ? SaveToObj : SaveToHalvorBinary;
        error = writer(outPath, vertexCount, triCount, vertex, outUV, tri);
        if (!error.empty())
            return Fail(error);
        GetPhaseTimings().Mark(PhaseTimings::kWrite);
        GetPhaseTimings().Report();
        return 0;
    }
}

int main(int argc, char** argv)
{
    InitializeLoggingFromEnvironment();
    GetPhaseTimings();   // the clock starts here

    // Rows 1 to 13 name the service exports, rows 14 to 30 the test exports, in the order in which
    // the export pointers are declared, so that FillKnownImports can copy them row by row.
#define SERVICE_ROW(name, type) {#name, nullptr, 0},
#define TEST_ROW(name) {#name, nullptr, 0},
    static PEKnownImport _KnownImports[kLibraryImportRows] = {TESSARY_SERVICE_EXPORTS(SERVICE_ROW)
                                                                   TESSARY_TEST_EXPORTS(TEST_ROW)};
#undef SERVICE_ROW
#undef TEST_ROW

    // The test rows are copied before the test exports are bound, so they stay empty.
    LoadUnwrapLibraries(_KnownImports);
    // Never restored: it holds for the file I/O and all library code.
    SetUnwrapFloatingPointState();
    GetPhaseTimings().Mark(PhaseTimings::kLoadLibraries);

    // Exactly "-runNativeTests", terminator included: longer or shorter arguments do not match.
    if (argc >= 2 && std::strcmp(argv[1], "-runNativeTests") == 0)
    {
        BindTestExports();
        return Testing::RunNativeTests();
    }
    if (argc >= 2 && std::strcmp(argv[1], "-obj") == 0)
        return argc == 4 ? Unwrap(true, argv[2], argv[3]) : PrintUsage();
    if (argc == 3)
        return Unwrap(false, argv[1], argv[2]);
    return PrintUsage();
}

// ---------------------------------------------------------------------------------------------
// The libraries' self-test exports as the test suite "Tessary" (category Unit): 15 tests, the
// seventh checking five exports. Names, registration lines and check lines are fixed: they appear
// in every report, with this file's name. Each export call is preceded by PESetupFS.

namespace
{
    const char* const kCLToolFile = "Editor/Tools/Unwrap/source/CLTool/CLTool.cpp";
}

namespace
{
    struct LibraryCheck
    {
        _Tessary_TestImpl* pointer;   // bound in test mode only
        const char* pointerName;
        const char* exportName;
        int line;
        bool inUnwrap;                // the export lives in Unwrap.dll
    };

    // A bool in its plain text form: 1 or 0.
    std::string BoolText(bool value)
    {
        std::ostringstream text;
        text << value;
        return text.str();
    }

    std::string DescribeMissing(const LibraryCheck& check)
    {
        if (!check.inUnwrap)
            return DescribeMissingExport(reinterpret_cast<const void*>(*check.pointer), _TessaryDll, g_TessaryLoad,
                                         check.exportName);
        std::string missing = DescribeMissingExport(reinterpret_cast<const void*>(*check.pointer), _UnwrapDll, g_UnwrapLoad,
                                                    check.exportName);
        return missing.empty() ? DescribeMissingServices() : missing;
    }

    void RunCheck(const LibraryCheck& check)
    {
        PESetupFS();
        std::string missing = DescribeMissing(check);
        if (!missing.empty())
        {
            Testing::ReportFailureAtLine(check.line, missing.c_str());
            return;
        }
        try
        {
            bool result = (*check.pointer)();
            if (result != true)
            {
                UnitTest::MemoryOutStream stream;
                stream << "Expected values to be the same, but they were not" << "\n"
                       << "\tExpected: " << BoolText(true) << "\n"
                       << "\t  Actual: " << BoolText(result) << "\n";
                Testing::ReportFailureAtLine(check.line, stream.GetText());
            }
        }
        catch (...)
        {
            std::string text = std::string("Unhandled exception in CHECK_EQUAL(true, ") + check.pointerName + "())";
            Testing::ReportFailureAtLine(check.line, text.c_str());
        }
    }

    template <size_t N>
    void RunChecks(const LibraryCheck (&checks)[N])
    {
        for (const LibraryCheck& check : checks)
            RunCheck(check);
    }
}

#define TESSARY_CHECK(name, line) {&name##Impl, #name "Impl", #name, line, false}
#define UNWRAP_CHECK(name, line) {&name##Impl, #name "Impl", #name, line, true}

// One test class, its creator, factory and list adder, as the test macros would make them.
#define LIBRARY_SELF_TEST(Name, registrationLine, ...) \
    namespace SuiteTessarykUnitTestCategory \
    { \
        class Test##Name : public Testing::Test \
        { \
        public: \
            Test##Name() : Testing::Test(#Name, "Tessary", Testing::kUnitTestCategory, kCLToolFile, registrationLine) {} \
            void CreateAttributes(Testing::TestAttributeList&) const override {} \
        private: \
            void RunImpl() const override \
            { \
                static const LibraryCheck checks[] = {__VA_ARGS__}; \
                RunChecks(checks); \
            } \
        }; \
        Testing::Test* CreateTest##Name(void*) { return new Test##Name(); } \
        Testing::TestFactory test##Name##Factory = {&CreateTest##Name, nullptr, nullptr}; \
        Testing::ListAdder adder##Name(Testing::GetTestList(), &test##Name##Factory); \
    }

LIBRARY_SELF_TEST(NonManifoldFixer, 277, TESSARY_CHECK(Tessary_TestNonManifoldFixer, 279))
LIBRARY_SELF_TEST(DegenerateRemoval, 281, TESSARY_CHECK(Tessary_TestDegenerateRemoval, 283))
LIBRARY_SELF_TEST(SplitConnected, 285, TESSARY_CHECK(Tessary_TestSplitConnected, 287))
LIBRARY_SELF_TEST(TriMapBasic, 289, TESSARY_CHECK(Tessary_TestTriMapBasic, 291))
LIBRARY_SELF_TEST(TriMapVertexIndex, 294, TESSARY_CHECK(Tessary_TestTriMapVertexIndex, 296))
LIBRARY_SELF_TEST(CollapseEdgeBasic, 299, TESSARY_CHECK(Tessary_TestCollapseEdgeBasic, 301))
LIBRARY_SELF_TEST(MathBasic, 303,
                  TESSARY_CHECK(Tessary_TestMathBasic, 305), TESSARY_CHECK(Tessary_TestTrigonometry, 306),
                  TESSARY_CHECK(Tessary_TestLog, 307), TESSARY_CHECK(Tessary_TestMatrix4Invert, 308),
                  TESSARY_CHECK(Tessary_TestSparseMatrix, 309))
LIBRARY_SELF_TEST(PriorityQueue, 311, TESSARY_CHECK(Tessary_TestPriorityQueue, 313))
LIBRARY_SELF_TEST(Array, 315, TESSARY_CHECK(Tessary_TestArray, 317))
LIBRARY_SELF_TEST(BlobArray, 319, TESSARY_CHECK(Tessary_TestBlobArray, 321))
LIBRARY_SELF_TEST(HashTab, 323, TESSARY_CHECK(Tessary_TestHashTab, 325))
LIBRARY_SELF_TEST(InternalCollapseEdge, 327, TESSARY_CHECK(Tessary_TestProgressiveMeshInternalCollapseEdge, 329))
LIBRARY_SELF_TEST(SimplePatchGenerate, 331, TESSARY_CHECK(Tessary_TestSlidingWindowSimplePatchGenerate, 333))
LIBRARY_SELF_TEST(UnwrapWithDegenerateTriangles, 335, UNWRAP_CHECK(Unwrap_TestUnwrapWithDegenerateTriangles, 337))
LIBRARY_SELF_TEST(UnwrapDontSplitRects, 339, UNWRAP_CHECK(Unwrap_TestUnwrapDontSplitRects, 341))
