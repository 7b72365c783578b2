#include "Runtime/Testing/Testing.h"

#include <sys/mman.h>

#include "Editor/Tools/Quillet/quillet_PELoaderInternal.h"
#include "Editor/Tools/Quillet/quillet_PELoaderTestSupport.h"

using namespace PELoaderTest;

namespace
{
    typedef int32_t(__attribute__((ms_abi)) * IntFn)();
    typedef uint32_t(__attribute__((ms_abi)) * UintFn)();
    typedef void*(__attribute__((ms_abi)) * PtrFn)();

    template <typename Fn>
    Fn Export(PEModule* module, const char* name)
    {
        return reinterpret_cast<Fn>(PEGetProcAddress(module, name));
    }

    // Loads a fixture from its file with standard output captured.
    struct LoadedFixture
    {
        explicit LoadedFixture(const char* name)
        {
            StdoutCapture capture;
            const char* message = "not written";
            module = PELoadLibrary(FixturePath(name).c_str(), nullptr, 0, &message);
            error = message ? message : "(null)";
            console = capture.Text();
        }
        ~LoadedFixture() { PEFreeLibrary(module); }
        LoadedFixture(const LoadedFixture&) = delete;
        LoadedFixture& operator=(const LoadedFixture&) = delete;

        PEModule* module = nullptr;
        std::string error;
        std::string console;
    };

    // Index in table order of the export name `name` (exact spelling), and the directory.
    int64_t ExportNameIndex(PEModule* module, const char* name, PE_IMAGE_EXPORT_DIRECTORY& exports)
    {
        ByteView image(module->codeBase, module->codeSize);
        image.Read(module->headers->OptionalHeader.DataDirectory[kPEDirectoryExports].va, exports);
        for (uint32_t i = 0; i < exports.NumberOfNames; ++i)
        {
            uint32_t at = 0;
            image.Read(exports.AddressOfNames + 4ull * i, at);
            const char* text = image.CString(at);
            if (text && strcmp(text, name) == 0)
                return i;
        }
        return -1;
    }
}

UNIT_TEST_SUITE(PELoaderModules)
{
    TEST(NoImportDirectory_PrintsNoImports_GetsNoStubArea_RunsEntryOnce)
    {
        LoadedFixture dll("EntryRecord.dll");
        CHECK_EQUAL("(null)", dll.error);
        CHECK_EQUAL("  No imports\n", dll.console);
        if (!dll.module)
            return;
        PEModule& m = *dll.module;
        CHECK(m.thunks == nullptr);
        CHECK(m.thunksCurr == nullptr);
        CHECK_EQUAL(0u, m.thunksSize);
        CHECK_EQUAL(0x5000u, m.codeSize);
        CHECK_EQUAL(1, Export<IntFn>(dll.module, "EntryRecord_Calls")());
        CHECK_EQUAL(1u, Export<UintFn>(dll.module, "EntryRecord_Reason")());
        CHECK(Export<PtrFn>(dll.module, "EntryRecord_Module")() == m.codeBase);
        CHECK(Export<PtrFn>(dll.module, "EntryRecord_Reserved")() == nullptr);
    }

    // For tools that must not run DLL code: everything up to binding, then no entry point.
    TEST(MapWithoutEntry_RelocatesAndExports_ButNeverRunsTheEntryPoint)
    {
        RawImage raw = ReadFixture("EntryRecord.dll");
        StdoutCapture capture;
        const char* message = "not written";
        PEModule* module = PEMapLibraryWithoutEntry(raw.bytes.data(), raw.bytes.size(), nullptr, 0, &message);
        CHECK_EQUAL("  No imports\n", capture.Text());
        CHECK(module != nullptr && message == nullptr);
        if (!module)
            return;
        CHECK_EQUAL(0, Export<IntFn>(module, "EntryRecord_Calls")());
        CHECK(Export<PtrFn>(module, "EntryRecord_StoredAddress")() == Export<PtrFn>(module, "EntryRecord_CallsAddress")());
        PEFreeLibrary(module);
        message = "not written";
        CHECK(PEMapLibraryWithoutEntry(raw.bytes.data(), 63, nullptr, 0, &message) == nullptr);
        CHECK_EQUAL("Failed to load DLL: size smaller than PE header", message);
    }

    TEST(MappedHeaders_SitAtTheNtOffset_WithTheMappedBase)
    {
        LoadedFixture dll("EntryRecord.dll");
        RawImage raw = ReadFixture("EntryRecord.dll");
        if (!dll.module)
            return;
        CHECK(reinterpret_cast<uint8_t*>(dll.module->headers) == dll.module->codeBase + raw.NtOffset());
        CHECK_EQUAL(kPENtSignature, dll.module->headers->Signature);
        CHECK_EQUAL(reinterpret_cast<uint64_t>(dll.module->codeBase), dll.module->headers->OptionalHeader.ImageBase);
        // The DOS part before the NT headers is copied too.
        CHECK_EQUAL(0, memcmp(dll.module->codeBase, raw.bytes.data(), raw.NtOffset()));
    }

    TEST(Relocation_FixesStoredAddresses_ZeroDirectorySizeSkipsIt)
    {
        LoadedFixture dll("EntryRecord.dll");
        if (!dll.module)
            return;
        void* calls = Export<PtrFn>(dll.module, "EntryRecord_CallsAddress")();
        CHECK(Export<PtrFn>(dll.module, "EntryRecord_StoredAddress")() == calls);

        // Without the directory, the stored pointer keeps its preferred-base value; a broken block
        // is never looked at.
        RawImage raw = ReadFixture("EntryRecord.dll");
        const uint64_t preferred = raw.Headers().OptionalHeader.ImageBase;
        raw.Patch<uint32_t>(raw.FileOffset(raw.Directory(kPEDirectoryBaseRelocations).va) + 4, 2);
        raw.Patch<uint32_t>(raw.DirectoryOffset(kPEDirectoryBaseRelocations) + 4, 0);
        LoadResult unrelocated = LoadQuietly(raw.bytes);
        CHECK_EQUAL("(null)", unrelocated.message);
        if (!unrelocated.module)
            return;
        void* callsHere = Export<PtrFn>(unrelocated.module, "EntryRecord_CallsAddress")();
        const uint64_t rva = static_cast<uint8_t*>(callsHere) - unrelocated.module->codeBase;
        CHECK_EQUAL(preferred + rva, reinterpret_cast<uint64_t>(Export<PtrFn>(unrelocated.module, "EntryRecord_StoredAddress")()));
        PEFreeLibrary(unrelocated.module);
    }

    TEST(SectionWithoutRawData_IsZeroedAndRecordsItsAddress)
    {
        RawImage raw = ReadFixture("Args.dll");
        PE_IMAGE_SECTION_HEADER data{};
        raw.View().Read(raw.SectionOffset(2), data);
        CHECK_EQUAL(0u, data.SizeOfRawData);
        StdoutCapture capture;
        LoadResult dll = Load(raw.bytes);
        CHECK_EQUAL("  No imports\n", capture.Text());
        if (!dll.module)
            return;
        PE_IMAGE_SECTION_HEADER mapped{};
        ByteView image(dll.module->codeBase, dll.module->codeSize);
        // The headers keep their file offsets in the image.
        image.Read(raw.SectionOffset(2), mapped);
        CHECK_EQUAL(static_cast<uint32_t>(reinterpret_cast<uint64_t>(dll.module->codeBase + data.VirtualAddress)),
                    mapped.Misc.PhysicalAddress);
        PE_IMAGE_SECTION_HEADER text{};
        image.Read(raw.SectionOffset(0), text);
        CHECK_EQUAL(static_cast<uint32_t>(reinterpret_cast<uint64_t>(dll.module->codeBase + text.VirtualAddress)),
                    text.Misc.PhysicalAddress);
        CHECK_EQUAL(0, memcmp(dll.module->codeBase + text.VirtualAddress, raw.bytes.data() + text.PointerToRawData, text.SizeOfRawData));
        PEFreeLibrary(dll.module);
    }

    TEST(DllLoadedTwice_IsTwoIndependentModules_FreeUnmapsEach)
    {
        LoadedFixture first("EntryRecord.dll");
        PEModule* second = nullptr;
        {
            StdoutCapture capture;
            second = PELoadLibrary(FixturePath("EntryRecord.dll").c_str(), nullptr, 0, nullptr);
            capture.Text();
        }
        if (!first.module || !second)
            return;
        CHECK(first.module->codeBase != second->codeBase);
        CHECK(first.module->headers != second->headers);
        CHECK_EQUAL(1, Export<IntFn>(first.module, "EntryRecord_Calls")());
        CHECK_EQUAL(1, Export<IntFn>(second, "EntryRecord_Calls")());
        CHECK(Export<PtrFn>(second, "EntryRecord_Module")() == second->codeBase);
        CHECK(Export<PtrFn>(second, "EntryRecord_StoredAddress")() == Export<PtrFn>(second, "EntryRecord_CallsAddress")());

        uint8_t* base = second->codeBase;
        const size_t size = second->codeSize;
        CHECK(HasExecMapping(base, size));
        PEFreeLibrary(second);
        CHECK(!HasExecMapping(base, size));
        CHECK(HasExecMapping(first.module->codeBase, first.module->codeSize));
        CHECK_EQUAL(1, Export<IntFn>(first.module, "EntryRecord_Calls")());
    }

    TEST(FreeLibrary_UnmapsImageAndStubArea_ToleratesNull)
    {
        PEFreeLibrary(nullptr);
        StdoutCapture capture;
        PEModule* module = PELoadLibrary(FixturePath("Bound.dll").c_str(), nullptr, 0, nullptr);
        CHECK_EQUAL("", capture.Text());
        if (!module)
            return;
        uint8_t* image = module->codeBase;
        uint8_t* thunks = module->thunks;
        const size_t imageSize = module->codeSize, thunksSize = module->thunksSize;
        CHECK_EQUAL(262144u, thunksSize);
        CHECK(HasExecMapping(image, imageSize));
        CHECK(HasExecMapping(thunks, thunksSize));
        PEFreeLibrary(module);
        CHECK(!HasExecMapping(image, imageSize));
        CHECK(!HasExecMapping(thunks, thunksSize));
    }

    TEST(GetProcAddress_NullModule_NoExportDirectory_UnknownName)
    {
        CHECK(PEGetProcAddress(nullptr, "EntryRecord_Calls") == nullptr);
        LoadedFixture bare("Bare.dll");
        CHECK_EQUAL("  No imports\n", bare.console);
        CHECK(bare.module != nullptr);
        CHECK(PEGetProcAddress(bare.module, "DllMain") == nullptr);
        LoadedFixture dll("EntryRecord.dll");
        CHECK(PEGetProcAddress(dll.module, "EntryRecord_Nothing") == nullptr);
        CHECK(PEGetProcAddress(dll.module, "") == nullptr);
    }

    TEST(GetProcAddress_IgnoresCase_FirstEqualNameInTableOrderWins)
    {
        LoadedFixture dll("EntryRecord.dll");
        void* exact = PEGetProcAddress(dll.module, "EntryRecord_Calls");
        CHECK(exact != nullptr);
        CHECK(PEGetProcAddress(dll.module, "entryrecord_calls") == exact);
        CHECK(PEGetProcAddress(dll.module, "ENTRYRECORD_CALLS") == exact);
        // "PROBE_VALUE" sorts before "Probe_Value", so any spelling finds the upper-case export.
        CHECK_EQUAL(2, Export<IntFn>(dll.module, "Probe_Value")());
        CHECK_EQUAL(2, Export<IntFn>(dll.module, "probe_value")());
    }

    TEST(GetProcAddress_OrdinalAboveNumberOfFunctions_IsNull_EvenWithALaterMatch)
    {
        LoadedFixture dll("EntryRecord.dll");
        if (!dll.module)
            return;
        PE_IMAGE_EXPORT_DIRECTORY exports{};
        const int64_t first = ExportNameIndex(dll.module, "PROBE_VALUE", exports);
        CHECK(first >= 0 && ExportNameIndex(dll.module, "Probe_Value", exports) > first);
        MutableByteView image(dll.module->codeBase, dll.module->codeSize);
        const uint64_t ordinalAt = exports.AddressOfNameOrdinals + 2 * first;

        image.Write<uint16_t>(ordinalAt, static_cast<uint16_t>(exports.NumberOfFunctions + 1));
        CHECK(PEGetProcAddress(dll.module, "probe_value") == nullptr);

        // Equal to NumberOfFunctions is still accepted: the word behind the address array is used.
        image.Write<uint16_t>(ordinalAt, static_cast<uint16_t>(exports.NumberOfFunctions));
        uint32_t behind = 0;
        image.Read(exports.AddressOfFunctions + 4ull * exports.NumberOfFunctions, behind);
        CHECK(PEGetProcAddress(dll.module, "probe_value") == dll.module->codeBase + behind);
    }

    // A forwarder is not followed: its address points at its own text in the export directory.
    TEST(GetProcAddress_ForwardedExport_IsTheAddressOfItsText)
    {
        LoadedFixture dll("GsReader.dll");
        if (!dll.module)
            return;
        const char* text = static_cast<const char*>(PEGetProcAddress(dll.module, "gs_forwarded"));
        CHECK(text != nullptr);
        if (!text)
            return;
        CHECK_EQUAL("Elsewhere.Forwarded_Function", text);
        const PE_IMAGE_DATA_DIRECTORY dir = dll.module->headers->OptionalHeader.DataDirectory[kPEDirectoryExports];
        CHECK(text >= reinterpret_cast<const char*>(dll.module->codeBase) + dir.va);
        CHECK(text < reinterpret_cast<const char*>(dll.module->codeBase) + dir.va + dir.size);
    }

    // Sections are taken in table order: a section without raw data placed over an earlier one
    // clears what that one copied.
    TEST(SectionWithoutRawData_OverAnEarlierSection_ClearsIt)
    {
        RawImage raw = ReadFixture("Args.dll");
        PE_IMAGE_SECTION_HEADER rdata{};
        raw.View().Read(raw.SectionOffset(1), rdata);
        raw.Patch<uint32_t>(raw.SectionOffset(2) + 12, rdata.VirtualAddress);  // .data over .rdata
        LoadResult dll = LoadQuietly(raw.bytes);
        CHECK_EQUAL("(null)", dll.message);
        if (!dll.module)
            return;
        size_t nonZero = 0;
        for (uint32_t i = 0; i < rdata.SizeOfRawData; ++i)
            nonZero += dll.module->codeBase[rdata.VirtualAddress + i] != 0;
        CHECK_EQUAL(0u, nonZero);
        PEFreeLibrary(dll.module);
    }

    TEST(GetProcAddress_ReadsNothingOutsideTheImage)
    {
        LoadedFixture dll("EntryRecord.dll");
        if (!dll.module)
            return;
        PE_IMAGE_EXPORT_DIRECTORY exports{};
        const int64_t index = ExportNameIndex(dll.module, "EntryRecord_Calls", exports);
        MutableByteView image(dll.module->codeBase, dll.module->codeSize);
        const uint64_t dirAt = dll.module->headers->OptionalHeader.DataDirectory[kPEDirectoryExports].va;

        image.Write<uint32_t>(exports.AddressOfNames + 4 * index, 0x7FFFFFF0);  // a name far outside
        CHECK(PEGetProcAddress(dll.module, "EntryRecord_Calls") == nullptr);
        image.Write<uint32_t>(dirAt + offsetof(PE_IMAGE_EXPORT_DIRECTORY, NumberOfNames), 0x40000000);
        CHECK(PEGetProcAddress(dll.module, "Nothing") == nullptr);
        dll.module->headers->OptionalHeader.DataDirectory[kPEDirectoryExports].va = 0xFFFFFFF0;
        CHECK(PEGetProcAddress(dll.module, "EntryRecord_Calls") == nullptr);
    }

    TEST(TenMixedArguments_ReachTheExport_SixOnTheStack)
    {
        typedef int32_t(__attribute__((ms_abi)) * CheckFn)(int32_t, double, int64_t, float, double, int32_t, float, int64_t, double, uint16_t);
        typedef double(__attribute__((ms_abi)) * SumFn)(int32_t, double, int64_t, float, double, int32_t, float, int64_t, double, uint16_t);
        LoadedFixture dll("Args.dll");
        CheckFn check = Export<CheckFn>(dll.module, "Args_Check");
        SumFn sum = Export<SumFn>(dll.module, "Args_Sum");
        CHECK(check && sum);
        if (!check || !sum)
            return;
        PESetupFS();
        CHECK_EQUAL(0x3FF, check(-7, 2.5, 0x123456789ALL, -0.75f, 1e100, 2147483647, 3.125f, -0x7000000000000000LL, -4.0625, 0xBEEF));
        CHECK_EQUAL(0x3FE, check(-6, 2.5, 0x123456789ALL, -0.75f, 1e100, 2147483647, 3.125f, -0x7000000000000000LL, -4.0625, 0xBEEF));
        CHECK_EQUAL(0x1FF, check(-7, 2.5, 0x123456789ALL, -0.75f, 1e100, 2147483647, 3.125f, -0x7000000000000000LL, -4.0625, 0xBEEE));
        const double expected = 1 * 1 + 2 * 2.5 + 3 * 3.0 + 4 * 0.25 + 5 * 5.5 + 6 * 6 + 7 * 7.75 + 8 * 8.0 + 9 * 9.125 + 10 * 10;
        CHECK_EQUAL(expected, sum(1, 2.5, 3, 0.25f, 5.5, 6, 7.75f, 8, 9.125, 10));
    }

    TEST(CreateCallThunk_ReturnsFunc_NullsDestination)
    {
        int marker = 0;
        void* dest = &marker;
        CHECK(PECreateCallThunk(nullptr, &marker, 12, &dest) == &marker);
        CHECK(dest == nullptr);
        CHECK(PECreateCallThunk(nullptr, &marker, 0, nullptr) == &marker);
    }

    TEST(MapExecMemory_IsZeroedReadWriteExecute_FailureIsAllOnes)
    {
        void* block = MapExecMemory(3 * 4096);
        CHECK(block != MAP_FAILED);
        if (block == MAP_FAILED)
            return;
        CHECK(HasExecMapping(block, 3 * 4096));
        const uint8_t* bytes = static_cast<const uint8_t*>(block);
        size_t nonZero = 0;
        for (size_t i = 0; i < 3 * 4096; ++i)
            nonZero += bytes[i] != 0;
        CHECK_EQUAL(0u, nonZero);
        UnmapExecMemory(block, 3 * 4096);
        CHECK(!HasExecMapping(block, 3 * 4096));
        CHECK(MapExecMemory(0) == MAP_FAILED);
    }
}
