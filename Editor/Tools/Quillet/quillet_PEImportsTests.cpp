#include "Runtime/Testing/Testing.h"

#include "Editor/Tools/Quillet/quillet_PEImports.h"
#include "Editor/Tools/Quillet/quillet_PELoaderTestSupport.h"

using namespace PELoaderTest;

namespace
{
    int32_t s_hostTwiceCalls = 0;
    size_t s_hostMallocSize = 0;
    alignas(16) uint8_t s_hostBuffer[64];

    __attribute__((ms_abi)) int32_t HostTwice(int32_t value)
    {
        ++s_hostTwiceCalls;
        return 2 * value;
    }

    __attribute__((ms_abi)) void* HostMalloc(size_t size)
    {
        s_hostMallocSize = size;
        return s_hostBuffer;
    }

    // Bound.dll imports FIXTURE_TWICE: the row's spelling differs only in letter case.
    PEKnownImport kBoundTable[] = {
        {"Fixture_Twice", reinterpret_cast<void*>(&HostTwice), 4},
        {"malloc", reinterpret_cast<void*>(&HostMalloc), 0},
    };

    typedef int32_t(__attribute__((ms_abi)) * TwiceFn)(int32_t);
    typedef void*(__attribute__((ms_abi)) * MallocFn)(size_t);
    typedef void(__attribute__((ms_abi)) * FreeFn)(void*);
    typedef int32_t(__attribute__((ms_abi)) * MissingFn)();

    // The global row of `name` found by exact spelling, or null.
    const PEKnownImport* GlobalRow(const char* name)
    {
        for (int32_t i = 0; i < kQuilletKnownImportsCount; ++i)
            if (strcmp(kQuilletKnownImports[i].name, name) == 0)
                return &kQuilletKnownImports[i];
        return nullptr;
    }

    // The address list entry that an import named `name` of `module` was bound to.
    void* BoundAddress(PEModule* module, const char* name)
    {
        ByteView image(module->codeBase, module->codeSize);
        PE_IMAGE_DATA_DIRECTORY dir = module->headers->OptionalHeader.DataDirectory[kPEDirectoryImports];
        PE_IMAGE_IMPORT_DESCRIPTOR desc{};
        for (uint64_t d = dir.va; image.Read(d, desc) && desc.Name != 0; d += sizeof(desc))
        {
            uint64_t entry = 0;
            for (uint64_t i = 0; image.Read(desc.OriginalFirstThunk + 8 * i, entry) && entry != 0; ++i)
            {
                const char* text = image.CString(entry + 2);
                uint64_t slot = 0;
                if (text && strcmp(text, name) == 0 && image.Read(desc.FirstThunk + 8 * i, slot))
                    return reinterpret_cast<void*>(slot);
            }
        }
        return nullptr;
    }
}

UNIT_TEST_SUITE(PEImports)
{
    TEST(FindMatchingImport_CallersTableFirst_ThenGlobal_IgnoringCase)
    {
        const PEKnownImport* malloc = GlobalRow("malloc");
        const PEKnownImport* sprintf = GlobalRow("sprintf_s");
        CHECK(malloc && sprintf);
        if (!malloc || !sprintf)
            return;
        void* func = nullptr;
        CHECK(FindMatchingImport("malloc", kBoundTable, 2, &func));
        CHECK(func == reinterpret_cast<void*>(&HostMalloc));
        CHECK(FindMatchingImport("MALLOC", nullptr, 0, &func));
        CHECK(func == malloc->func);
        CHECK(FindMatchingImport("malloc", kBoundTable, 0, &func));  // an empty caller's table
        CHECK(func == malloc->func);
        CHECK(FindMatchingImport("Sprintf_S", kBoundTable, 2, &func));
        CHECK(func == sprintf->func);
        CHECK(FindMatchingImport("FIXTURE_TWICE", kBoundTable, 2, &func));
        CHECK(func == reinterpret_cast<void*>(&HostTwice));
        CHECK(!FindMatchingImport("FIXTURE_TWICE", nullptr, 0, &func));
        CHECK(!FindMatchingImport("Nowhere_Function", kBoundTable, 2, &func));
    }

    TEST(FindMatchingImport_EarlierRowOfOneTableWins)
    {
        int first = 0, second = 0;
        PEKnownImport table[] = {{"Twin", &first, 0}, {"TWIN", &second, 0}};
        void* func = nullptr;
        CHECK(FindMatchingImport("twin", table, 2, &func));
        CHECK(func == &first);
        CHECK(FindMatchingImport("twin", table + 1, 1, &func));
        CHECK(func == &second);
    }

    TEST(CallersTable_BindsCaseVariant_OverridesGlobalRow_UnresolvedGetsAStub)
    {
        StdoutCapture capture;
        const char* message = "not written";
        PEModule* module = PELoadLibrary(FixturePath("Bound.dll").c_str(), kBoundTable, 2, &message);
        const std::string console = capture.Text();
        CHECK(message == nullptr);
        CHECK_EQUAL("", console);
        if (!module)
            return;
        CHECK(BoundAddress(module, "FIXTURE_TWICE") == reinterpret_cast<void*>(&HostTwice));
        CHECK(BoundAddress(module, "malloc") == reinterpret_cast<void*>(&HostMalloc));
        CHECK(BoundAddress(module, "free") == GlobalRow("free")->func);
        CHECK(BoundAddress(module, "Fixture_Missing") == module->thunks);

        PESetupFS();
        s_hostTwiceCalls = 0;
        CHECK_EQUAL(41, reinterpret_cast<TwiceFn>(PEGetProcAddress(module, "Bound_Twice"))(20));
        CHECK_EQUAL(1, s_hostTwiceCalls);
        CHECK(reinterpret_cast<MallocFn>(PEGetProcAddress(module, "Bound_Malloc"))(24) == s_hostBuffer);
        CHECK_EQUAL(24u, s_hostMallocSize);
        PEFreeLibrary(module);
    }

    TEST(UnresolvedImport_Stub_HasTheFixedBytes_RestOfAreaIsBreakpoints)
    {
        StdoutCapture capture;
        PEModule* module = PELoadLibrary(FixturePath("Bound.dll").c_str(), kBoundTable, 2, nullptr);
        capture.Text();
        if (!module)
            return;
        CHECK(module->thunksCurr == module->thunks + kImportThunkSize);
        CHECK(s_FailedProcPtr == &FailedImportProcImpl);
        uint64_t nameAddress = 0, procAddress = 0;
        memcpy(&nameAddress, module->thunks + 2, 8);
        memcpy(&procAddress, module->thunks + 12, 8);
        const char* name = reinterpret_cast<const char*>(nameAddress);
        CHECK(name >= reinterpret_cast<const char*>(module->codeBase) &&
              name < reinterpret_cast<const char*>(module->codeBase + module->codeSize));
        CHECK_EQUAL("Fixture_Missing", name);
        CHECK_EQUAL(reinterpret_cast<uint64_t>(&FailedImportProcImpl), procAddress);
        const uint8_t fixed[] = {0x48, 0xB9, 0x48, 0xB8, 0x48, 0xFF, 0xE0};
        const uint8_t actual[] = {module->thunks[0], module->thunks[1], module->thunks[10], module->thunks[11],
                                  module->thunks[20], module->thunks[21], module->thunks[22]};
        CHECK_ARRAY_EQUAL(fixed, actual, 7);
        size_t notBreakpoint = 0;
        for (size_t i = kImportThunkSize; i < module->thunksSize; ++i)
            notBreakpoint += module->thunks[i] != 0xCC;
        CHECK_EQUAL(0u, notBreakpoint);
        PEFreeLibrary(module);
    }

    // Loading costs no fill of the area: only the page holding the stubs becomes the module's own,
    // and a second module's area still reads 0xCC where the first wrote stubs.
    TEST(StubArea_OnlyWrittenPagesBecomePrivate_ModulesDoNotShareStubs)
    {
        StdoutCapture capture;
        PEModule* first = PELoadLibrary(FixturePath("Bound.dll").c_str(), nullptr, 0, nullptr);
        PEModule* second = PELoadLibrary(FixturePath("Bound.dll").c_str(), kBoundTable, 2, nullptr);
        capture.Text();
        CHECK(first && second);
        if (first && second)
        {
            const long kb = PrivateKilobytes(first->thunks);
            CHECK(kb >= 4 && kb <= 8);
            CHECK(HasExecMapping(first->thunks, first->thunksSize));
            // The first has two stubs, the second one: the bytes behind it are still breakpoints.
            CHECK_EQUAL(0xCC, second->thunks[kImportThunkSize]);
            CHECK_EQUAL(0x48, first->thunks[kImportThunkSize]);
        }
        PEFreeLibrary(first);
        PEFreeLibrary(second);
    }

    // Without a lookup list (OriginalFirstThunk 0) the names are read from the address list.
    TEST(DescriptorWithoutLookupList_ReadsTheNamesFromTheAddressList)
    {
        std::vector<uint8_t> bytes = BuildImportImage(3);
        const uint64_t descriptor = 0x200 + 0x10;  // first section's file offset + descriptor offset
        PE_IMAGE_IMPORT_DESCRIPTOR desc{};
        MutableByteView(bytes.data(), bytes.size()).Read(descriptor, desc);
        CHECK(desc.OriginalFirstThunk != 0 && desc.FirstThunk != 0);
        desc.OriginalFirstThunk = 0;
        MutableByteView(bytes.data(), bytes.size()).Write(descriptor, desc);
        LoadResult dll = Load(bytes);
        CHECK_EQUAL("(null)", dll.message);
        if (!dll.module)
            return;
        CHECK(dll.module->thunksCurr == dll.module->thunks + 3 * kImportThunkSize);
        uint64_t slot = 0;
        ByteView(dll.module->codeBase, dll.module->codeSize).Read(desc.FirstThunk + 8, slot);
        CHECK_EQUAL(reinterpret_cast<uint64_t>(dll.module->thunks + kImportThunkSize), slot);
        uint64_t name = 0;
        memcpy(&name, dll.module->thunks + 2, 8);
        CHECK_EQUAL("Nowhere_Function", reinterpret_cast<const char*>(name));
        PEFreeLibrary(dll.module);
    }

    TEST(CallingAnUnresolvedImport_ReportsIt_AndReturnsToTheDll)
    {
        PEModule* module = nullptr;
        {
            StdoutCapture capture;
            module = PELoadLibrary(FixturePath("Bound.dll").c_str(), nullptr, 0, nullptr);
            capture.Text();
        }
        if (!module)
            return;
        // Without the caller's table both FixtureHost names are stubs, in import order.
        CHECK(module->thunksCurr == module->thunks + 2 * kImportThunkSize);
        PESetupFS();
        StdoutCapture capture;
        const int32_t missing = reinterpret_cast<MissingFn>(PEGetProcAddress(module, "Bound_CallMissing"))();
        const int32_t twice = reinterpret_cast<TwiceFn>(PEGetProcAddress(module, "Bound_Twice"))(5);
        CHECK_EQUAL("Called unresolved function Fixture_Missing\nCalled unresolved function FIXTURE_TWICE\n", capture.Text());
        CHECK_EQUAL(1000, missing);
        CHECK_EQUAL(1, twice);
        // malloc now binds to the global row: real memory that free takes back.
        void* p = reinterpret_cast<MallocFn>(PEGetProcAddress(module, "Bound_Malloc"))(32);
        CHECK(p != nullptr && p != s_hostBuffer);
        reinterpret_cast<FreeFn>(PEGetProcAddress(module, "Bound_Free"))(p);
        PEFreeLibrary(module);
    }
}
