#include "Runtime/Testing/Testing.h"

#include <sys/resource.h>
#include <sys/stat.h>

#include <functional>

#include "Editor/Tools/Quillet/quillet_PEImports.h"
#include "Editor/Tools/Quillet/quillet_PELoaderTestSupport.h"

using namespace PELoaderTest;

// AddressSanitizer keeps terabytes of shadow memory reserved: an address-space limit would break
// the sanitizer before the loader, so the tests that set one run in ordinary builds only.
#if defined(__SANITIZE_ADDRESS__)
#define PELOADER_TESTS_LIMIT_ADDRESS_SPACE 0
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define PELOADER_TESTS_LIMIT_ADDRESS_SPACE 0
#endif
#endif
#ifndef PELOADER_TESTS_LIMIT_ADDRESS_SPACE
#define PELOADER_TESTS_LIMIT_ADDRESS_SPACE 1
#endif

namespace
{
    const char* kNotRun = "not written";

    // One malformed variant of a fixture DLL and the message its load must fail with.
    struct BrokenImage
    {
        const char* fixture;
        std::function<void(RawImage&)> patch;
        const char* message;
    };

    // File offset of the first lookup entry of the first import descriptor.
    uint64_t FirstLookupEntry(RawImage& image)
    {
        PE_IMAGE_IMPORT_DESCRIPTOR desc{};
        image.View().Read(image.FileOffset(image.Directory(kPEDirectoryImports).va), desc);
        return image.FileOffset(desc.OriginalFirstThunk);
    }

    uint64_t RelocationBlockOffset(RawImage& image)
    {
        return image.FileOffset(image.Directory(kPEDirectoryBaseRelocations).va);
    }

    const BrokenImage kBrokenImages[] = {
        {"EntryRecord.dll", [](RawImage& i) { i.bytes.resize(63); }, "Failed to load DLL: size smaller than PE header"},
        {"EntryRecord.dll", [](RawImage& i) { i.bytes[1] = 'X'; },
         "Failed to load DLL: not a windows DLL (DOS header field mismatch)"},
        {"EntryRecord.dll", [](RawImage& i) { i.bytes[i.NtOffset() + 1] = 'X'; },
         "Failed to load DLL: not a windows DLL (NT header field mismatch)"},
        {"Pe32.dll", [](RawImage&) {}, "Failed to load DLL: not a 64 bit DLL"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint16_t>(i.OptionalField(0), 0x010B); },
         "Failed to load DLL: not a 64 bit DLL"},
        {"EntryRecord.dll", [](RawImage& i) { i.bytes.resize(64); }, "Failed to load DLL: NT headers outside the file"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<int32_t>(60, -8); }, "Failed to load DLL: NT headers outside the file"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<int32_t>(60, 0x7FFFFFF0); },
         "Failed to load DLL: NT headers outside the file"},
        {"EntryRecord.dll", [](RawImage& i) { i.bytes.resize(i.NtOffset() + 100); },
         "Failed to load DLL: NT headers outside the file"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint32_t>(i.OptionalField(56), 0); },
         "Failed to load DLL: could not allocate memory for executable"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint32_t>(i.OptionalField(60), 0x100000); },
         "Failed to load DLL: headers outside the file"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint32_t>(i.OptionalField(56), 0x200); },
         "Failed to load DLL: headers outside the image"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint32_t>(i.SectionOffset(1) + 12, 0x5000); },
         "Failed to load DLL: section outside the image"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint32_t>(i.SectionOffset(1) + 20, 0x7FFFF000); },
         "Failed to load DLL: section data outside the file"},
        {"EntryRecord.dll", [](RawImage& i) { i.bytes.resize(0x900); }, "Failed to load DLL: section data outside the file"},
        // Args.dll's .data (section 2) has no raw data: a whole SectionAlignment is zeroed.
        {"Args.dll", [](RawImage& i) { i.Patch<uint32_t>(i.SectionOffset(2) + 12, 0x4800); },
         "Failed to load DLL: section outside the image"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint16_t>(i.NtOffset() + 20, 0xFFFF); },
         "Failed to load DLL: section table outside the image"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint32_t>(RelocationBlockOffset(i) + 4, 4); },
         "Failed to load DLL: relocation block smaller than its header"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint32_t>(RelocationBlockOffset(i) + 4, 0); },
         "Failed to load DLL: relocation block smaller than its header"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint32_t>(RelocationBlockOffset(i), 0x4FF8); },
         "Failed to load DLL: relocation target outside the image"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint32_t>(i.DirectoryOffset(kPEDirectoryBaseRelocations), 0x4FFC); },
         "Failed to load DLL: relocation block outside the image"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint32_t>(RelocationBlockOffset(i) + 4, 0x2000); },
         "Failed to load DLL: relocation block outside the image"},
        {"Bound.dll", [](RawImage& i) { i.Patch<uint32_t>(i.DirectoryOffset(kPEDirectoryImports), 0x2FF8); },
         "Failed to load DLL: import descriptor outside the image"},
        {"Bound.dll", [](RawImage& i) { i.Patch<uint64_t>(FirstLookupEntry(i), 0x7FFFFFF0); },
         "Failed to load DLL: import name outside the image"},
        // The hint fits in the image's last two bytes, the name starts right behind its end.
        {"Bound.dll", [](RawImage& i) { i.Patch<uint64_t>(FirstLookupEntry(i), 0x2FFE); },
         "Failed to load DLL: import name outside the image"},
        {"Bound.dll", [](RawImage& i) { i.Patch<uint64_t>(FirstLookupEntry(i), (1ull << 63) | 5); },
         "Failed to load DLL: import by ordinal is not supported"},
        {"Bound.dll",
         [](RawImage& i) { i.Patch<uint32_t>(i.FileOffset(i.Directory(kPEDirectoryImports).va), 0x7FFFFFF0); },
         "Failed to load DLL: import lookup table outside the image"},
        {"Bound.dll",
         [](RawImage& i) { i.Patch<uint32_t>(i.FileOffset(i.Directory(kPEDirectoryImports).va) + 16, 0x2FFC); },
         "Failed to load DLL: import address table outside the image"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint32_t>(i.DirectoryOffset(kPEDirectoryExports), 0x4FE0); },
         "Failed to load DLL: export table outside the image"},
        {"EntryRecord.dll",
         [](RawImage& i) { i.Patch<uint32_t>(i.FileOffset(i.Directory(kPEDirectoryExports).va) + 32, 0x4FF0); },
         "Failed to load DLL: export table outside the image"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint32_t>(i.OptionalField(16), 0x5000); },
         "Failed to load DLL: entry point outside the image"},
        // Beyond the format's own limits: work is refused on bytes the file never filled. The
        // relocation section holds 0x200 raw bytes at 0x4000; .data 0x200 at 0x3000.
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint32_t>(RelocationBlockOffset(i) + 4, 0x400); },
         "Failed to load DLL: relocation block outside the file's data"},
        {"EntryRecord.dll", [](RawImage& i) { i.Patch<uint32_t>(RelocationBlockOffset(i), 0x3400); },
         "Failed to load DLL: relocation target outside the file's data"},
        // A name array of a million entries: inside the image once it is large enough, but not
        // in the file.
        {"EntryRecord.dll",
         [](RawImage& i) {
             i.Patch<uint32_t>(i.OptionalField(56), 0x1000000);
             i.Patch<uint32_t>(i.FileOffset(i.Directory(kPEDirectoryExports).va) + 24, 1000000);
         },
         "Failed to load DLL: export table outside the file's data"},
        // .data takes the whole file as its raw data: more than the file holds in all.
        {"EntryRecord.dll",
         [](RawImage& i) {
             i.Patch<uint32_t>(i.SectionOffset(2) + 20, 0);
             i.Patch<uint32_t>(i.SectionOffset(2) + 16, static_cast<uint32_t>(i.bytes.size()));
         },
         "Failed to load DLL: sections hold more raw data than the file"},
    };
}

UNIT_TEST_SUITE(PELoaderFailures)
{
    TEST(BrokenImages_FailWithTheirMessage_AndLeaveNothingMapped)
    {
        for (const BrokenImage& broken : kBrokenImages)
        {
            RawImage image = ReadFixture(broken.fixture);
            CHECK(image.bytes.size() > 1024);
            broken.patch(image);
            const size_t mappingsBefore = CountExecMappings();
            StdoutCapture capture;  // failures after the import step come after "  No imports"
            LoadResult result = Load(image.bytes);
            capture.Text();
            CHECK_EQUAL(broken.message, result.message);
            CHECK(result.module == nullptr);
            CHECK_EQUAL(mappingsBefore, CountExecMappings());
            PEFreeLibrary(result.module);
        }
    }

    // Four descriptors share one lookup list: more entries than the file has words. Two still
    // fit, as any image whose lists do not overlap does.
    TEST(ImportListsThatOverlapBeyondTheFilesSize_AreRefused)
    {
        LoadResult two = LoadQuietly(BuildImportImage(100, 2));
        LoadResult four = LoadQuietly(BuildImportImage(100, 4));
        CHECK_EQUAL("(null)", two.message);
        CHECK_EQUAL("Failed to load DLL: more import entries than the file holds", four.message);
        if (two.module)
            CHECK(two.module->thunksCurr == two.module->thunks + 200 * kImportThunkSize);
        PEFreeLibrary(two.module);
        PEFreeLibrary(four.module);
    }

    // Small files declaring huge images: the load touches only what the file fills. Measured in a
    // child as page faults (every page first touched, even only read, faults once): a zeroed or
    // walked gigabyte would cost a quarter of a million.
    TEST(HugeImages_FromSmallFiles_TouchOnlyWhatTheFileFills)
    {
        RawImage zeroed = ReadFixture("Args.dll");  // its .data has no raw data: a zeroed section
        zeroed.Patch<uint32_t>(zeroed.OptionalField(56), 0x40000000);  // SizeOfImage 1 GiB
        zeroed.Patch<uint32_t>(zeroed.OptionalField(32), 0x20000000);  // SectionAlignment 512 MiB
        LoadCost cost = MeasureLoad(zeroed.bytes);
        CHECK_EQUAL("(null)", cost.message);
        CHECK(cost.pageFaults < 2000);

        RawImage walked = ReadFixture("EntryRecord.dll");
        walked.Patch<uint32_t>(walked.OptionalField(56), 0x40000000);
        walked.Patch<uint32_t>(RelocationBlockOffset(walked) + 4, 0x20000000);  // a 512 MiB block
        cost = MeasureLoad(walked.bytes);
        CHECK_EQUAL("Failed to load DLL: relocation block outside the file's data", cost.message);
        CHECK(cost.pageFaults < 2000);
    }

#if PELOADER_TESTS_LIMIT_ADDRESS_SPACE
    // An image larger than the address space left to the process: refused with the mapping's
    // message, not a crash.
    TEST(SizeOfImageThatCannotBeMapped_FailsWithAMessage)
    {
        RawImage image = ReadFixture("EntryRecord.dll");
        image.Patch<uint32_t>(image.OptionalField(56), 0xFFFFF000);
        Testing::ChildResult result = Testing::RunInChildProcess([&image] {
            rlimit limit{};
            getrlimit(RLIMIT_AS, &limit);
            limit.rlim_cur = 1ull << 31;  // 2 GiB of address space: the image needs 4
            setrlimit(RLIMIT_AS, &limit);
            printf("%s\n", Load(image.bytes).message.c_str());
        });
        CHECK_EQUAL("Failed to load DLL: could not allocate memory for executable\n", result.out);
    }
#endif

    TEST(SixtyFourBytesOfDosHeader_PassTheSizeCheck)
    {
        RawImage image = ReadFixture("EntryRecord.dll");
        image.bytes.resize(64);
        image.Patch<int32_t>(60, 0);  // the NT headers would start at the "MZ"
        CHECK_EQUAL("Failed to load DLL: not a windows DLL (NT header field mismatch)", Load(image.bytes).message);
    }

    TEST(NullData_IsTooSmall)
    {
        const char* message = kNotRun;
        CHECK(PELoadLibrary(static_cast<const void*>(nullptr), 4096, nullptr, 0, &message) == nullptr);
        CHECK_EQUAL("Failed to load DLL: size smaller than PE header", message);
    }

    TEST(NullOutErrorMsg_StillFailsWithNull)
    {
        RawImage image = ReadFixture("Pe32.dll");
        CHECK(PELoadLibrary(image.bytes.data(), image.bytes.size(), nullptr, 0, nullptr) == nullptr);
        CHECK(PELoadLibrary("/nonexistent/Missing.dll", nullptr, 0, nullptr) == nullptr);
    }

    TEST(FileForm_MissingPath_CouldNotOpen)
    {
        const char* message = kNotRun;
        CHECK(PELoadLibrary("/nonexistent/Missing.dll", nullptr, 0, &message) == nullptr);
        CHECK_EQUAL("Failed to load DLL: could not open file", message);
        message = kNotRun;
        CHECK(PELoadLibrary(static_cast<const char*>(nullptr), nullptr, 0, &message) == nullptr);
        CHECK_EQUAL("Failed to load DLL: could not open file", message);
        // A directory opens but reads as nothing a DLL could be; which step notices depends on
        // the file system.
        message = kNotRun;
        CHECK(PELoadLibrary(CHARTBAKE_FIXTURE_DIR, nullptr, 0, &message) == nullptr);
        CHECK(message != kNotRun && message != nullptr && strncmp(message, "Failed to load DLL: ", 20) == 0);
    }

    TEST(FileForm_PassesTheMemoryFormsMessageThrough)
    {
        char path[] = "/tmp/PELoaderEmptyXXXXXX";
        int fd = mkstemp(path);
        CHECK(fd >= 0);
        close(fd);
        const char* message = kNotRun;
        CHECK(PELoadLibrary(path, nullptr, 0, &message) == nullptr);
        CHECK_EQUAL("Failed to load DLL: size smaller than PE header", message);
        message = kNotRun;
        CHECK(PELoadLibrary(FixturePath("Pe32.dll").c_str(), nullptr, 0, &message) == nullptr);
        CHECK_EQUAL("Failed to load DLL: not a 64 bit DLL", message);
        unlink(path);
    }

#if PELOADER_TESTS_LIMIT_ADDRESS_SPACE
    // A sparse file of 1 GiB with a 512 MiB address-space limit: the buffer cannot be had.
    TEST(FileForm_FileLargerThanMemoryLeft_CouldNotAllocate)
    {
        char dir[] = "/tmp/PELoaderBigXXXXXX";
        CHECK(mkdtemp(dir) != nullptr);
        const std::string path = std::string(dir) + "/Big.dll";
        FILE* big = fopen(path.c_str(), "wb");
        CHECK(big != nullptr && ftruncate(fileno(big), 1ll << 30) == 0);
        if (big)
            fclose(big);
        Testing::ChildResult result = Testing::RunInChildProcess([&path] {
            rlimit limit{};
            getrlimit(RLIMIT_AS, &limit);
            limit.rlim_cur = 1ull << 29;
            setrlimit(RLIMIT_AS, &limit);
            const char* message = kNotRun;
            PEModule* module = PELoadLibrary(path.c_str(), nullptr, 0, &message);
            printf("%s %s\n", module ? "module" : "null", message ? message : "(null)");
        });
        CHECK_EQUAL("null Failed to load DLL: could not allocate memory for file\n", result.out);
        unlink(path.c_str());
        rmdir(dir);
    }
#endif

    // A sysfs file claims a page but holds a few bytes: fewer arrive than its size.
    TEST(FileForm_FewerBytesThanTheFileSize_CouldNotRead)
    {
        const char* shortFile = "/sys/devices/system/cpu/online";
        struct stat info{};
        CHECK(stat(shortFile, &info) == 0 && info.st_size == 4096);
        const char* message = kNotRun;
        CHECK(PELoadLibrary(shortFile, nullptr, 0, &message) == nullptr);
        CHECK_EQUAL("Failed to load DLL: could not read file", message);
    }

    TEST(UnresolvedImports_FillTheStubAreaExactly_OneMoreFails)
    {
        CHECK_EQUAL(11397u, kMaxImportThunks);
        LoadResult full = Load(BuildImportImage(kMaxImportThunks));
        CHECK_EQUAL("(null)", full.message);
        CHECK(full.module != nullptr);
        if (full.module)
        {
            CHECK(full.module->thunksCurr == full.module->thunks + kMaxImportThunks * kImportThunkSize);
            CHECK(full.module->thunksCurr + kImportThunkSize > full.module->thunks + full.module->thunksSize);
        }
        PEFreeLibrary(full.module);

        const size_t mappingsBefore = CountExecMappings();
        LoadResult over = Load(BuildImportImage(kMaxImportThunks + 1));
        CHECK_EQUAL("Failed to load DLL: too many unresolved imports for the import stub area", over.message);
        CHECK(over.module == nullptr);
        CHECK_EQUAL(mappingsBefore, CountExecMappings());
    }
}
