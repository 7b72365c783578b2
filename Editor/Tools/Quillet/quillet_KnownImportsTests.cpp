#include "Runtime/Testing/Testing.h"

#include "Editor/Tools/Quillet/quillet_ImportsTestSupport.h"
#include "Runtime/Testing/ChildProcess.h"

#include <string.h>
#include <strings.h>

#include <set>
#include <string>

using namespace QuilletTest;

namespace
{
    std::string Lower(const char* text)
    {
        std::string lower(text);
        for (char& c : lower)
            c = static_cast<char>(tolower(static_cast<unsigned char>(c)));
        return lower;
    }

    int32_t UnwindOf(const char* name)
    {
        const PEKnownImport* row = FindImportRow(name);
        return row ? row->unwind : -1;
    }

    int RowIndexOf(const char* name)
    {
        const PEKnownImport* row = FindImportRow(name);
        return row ? static_cast<int>(row - kQuilletKnownImports) : -1;
    }
}

UNIT_TEST_SUITE(QuilletKnownImports)
{
    TEST(Table_Has129RowsWithDistinctNamesAndFunctions)
    {
        CHECK_EQUAL(129, kQuilletKnownImportsCount);
        std::set<std::string> names;
        for (int32_t i = 0; i < kQuilletKnownImportsCount; ++i)
        {
            CHECK(kQuilletKnownImports[i].func != nullptr);
            names.insert(Lower(kQuilletKnownImports[i].name));
        }
        CHECK_EQUAL(129u, names.size());
    }

    TEST(Table_RowOrderMatchesTheImportNumbering)
    {
        CHECK_EQUAL(0, RowIndexOf("GetSystemTimeAsFileTime"));
        CHECK_EQUAL(26, RowIndexOf("memset"));
        CHECK_EQUAL(30, RowIndexOf("??2@YAPAXI@Z"));
        CHECK_EQUAL(37, RowIndexOf("??_V@YAXPEAX@Z"));
        CHECK_EQUAL(39, RowIndexOf("sprintf_s"));
        CHECK_EQUAL(46, RowIndexOf("malloc"));
        CHECK_EQUAL(79, RowIndexOf("_controlfp"));
        CHECK_EQUAL(123, RowIndexOf("fmod"));
        CHECK_EQUAL(128, RowIndexOf("__libm_sse2_log"));
    }

    TEST(Lookup_IgnoresLetterCase)
    {
        CHECK(FindImport("SPRINTF_S") == FindImport("sprintf_s"));
        CHECK(FindImport("??2@yapaxi@z") == kQuilletKnownImports[30].func);
        CHECK(FindImport("NoSuchImport") == nullptr);
    }

    TEST(DeleteOperators_BothManglingsShareOneFunction)
    {
        CHECK(FindImport("??3@YAXPAX@Z") == FindImport("??3@YAXPEAX@Z"));
        CHECK(FindImport("??_V@YAXPAX@Z") == FindImport("??_V@YAXPEAX@Z"));
        CHECK(FindImport("??3@YAXPAX@Z") != FindImport("??_V@YAXPAX@Z"));
        // The four new operators are four functions.
        std::set<void*> news = {FindImport("??2@YAPAXI@Z"), FindImport("??_U@YAPAXI@Z"),
                                FindImport("??2@YAPEAX_K@Z"), FindImport("??_U@YAPEAX_K@Z")};
        CHECK_EQUAL(4u, news.size());
    }

    TEST(Unwind_IsTheStdcallArgumentBytes)
    {
        // Pointers and 64-bit sizes count 8, 32-bit integers 4, no rounding.
        CHECK_EQUAL(12, UnwindOf("InitializeCriticalSectionAndSpinCount"));
        CHECK_EQUAL(20, UnwindOf("VirtualFree"));
        CHECK_EQUAL(48, UnwindOf("WideCharToMultiByte"));
        CHECK_EQUAL(60, UnwindOf("RegEnumKeyExA"));
        CHECK_EQUAL(40, UnwindOf("CreateFileA"));
        CHECK_EQUAL(4, UnwindOf("Sleep"));
        // Functions without parameters and C-runtime functions pop nothing.
        CHECK_EQUAL(0, UnwindOf("TlsAlloc"));
        CHECK_EQUAL(0, UnwindOf("sprintf_s"));
        CHECK_EQUAL(0, UnwindOf("memmove_s"));
    }

    TEST(InitializeAndCleanup_NestAndKeepVirtualMemoryWorking)
    {
        // In a child: the lock is process state shared with every other test.
        Testing::ChildResult result = Testing::RunInChildProcess([] {
            auto virtualAlloc = Import<void*, void*, unsigned long, unsigned int, unsigned int>("VirtualAlloc");
            auto virtualFree = Import<int, void*, unsigned long, unsigned int>("VirtualFree");
            InitializeQuilletImports();
            InitializeQuilletImports();
            CleanupQuilletImports();
            void* block = virtualAlloc(nullptr, 4096, 0x3000, 4);
            static_cast<char*>(block)[0] = 1;
            int freed = virtualFree(block, 0, 0x8000);
            CleanupQuilletImports();
            printf("%d", freed);
        });
        CHECK(result.exited);
        CHECK_EQUAL(0, result.exitStatus);
        CHECK_EQUAL("1", result.out);
    }
}
