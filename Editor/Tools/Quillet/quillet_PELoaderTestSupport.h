#pragma once
// Helpers for the loader tests: fixture DLL files, patching their raw bytes, building a tiny
// image by hand, and looking at this process's mappings.

#include <stdint.h>
#include <stdio.h>
#include <string.h>

#include <stdlib.h>
#include <sys/resource.h>
#include <unistd.h>

#include <fstream>
#include <iterator>
#include <sstream>
#include <string>
#include <vector>

#include "Editor/Tools/Quillet/quillet_ByteView.h"
#include "Editor/Tools/Quillet/quillet_PEFormat.h"
#include "Editor/Tools/Quillet/quillet_PELoader.h"
#include "Runtime/Testing/ChildProcess.h"

namespace PELoaderTest
{
    inline std::string FixturePath(const char* name)
    {
        return std::string(CHARTBAKE_FIXTURE_DIR) + "/" + name;
    }

    // A DLL file's bytes, with the offsets that patching needs.
    struct RawImage
    {
        std::vector<uint8_t> bytes;

        MutableByteView View() { return MutableByteView(bytes.data(), bytes.size()); }

        uint64_t NtOffset()
        {
            PE_IMAGE_DOS_HEADER dos{};
            View().Read(0, dos);
            return static_cast<uint64_t>(dos.ntHeader);
        }
        uint64_t OptionalField(size_t fieldOffset) { return NtOffset() + kPEOptionalHeaderOffset + fieldOffset; }
        uint64_t DirectoryOffset(uint32_t index) { return NtOffset() + PEDataDirectoryOffset(index); }
        PE_IMAGE_NT_HEADERS Headers()
        {
            PE_IMAGE_NT_HEADERS nt{};
            View().Read(NtOffset(), nt);
            return nt;
        }
        uint64_t SectionOffset(uint32_t index)
        {
            return NtOffset() + kPEOptionalHeaderOffset + Headers().FileHeader.sizeOfOptionalHeader +
                   uint64_t(index) * sizeof(PE_IMAGE_SECTION_HEADER);
        }
        PE_IMAGE_DATA_DIRECTORY Directory(uint32_t index)
        {
            PE_IMAGE_DATA_DIRECTORY dir{};
            View().Read(DirectoryOffset(index), dir);
            return dir;
        }
        // The file offset of an image offset, through the section that holds it; ~0 when none.
        uint64_t FileOffset(uint32_t rva)
        {
            for (uint32_t i = 0; i < Headers().FileHeader.numberOfSections; ++i)
            {
                PE_IMAGE_SECTION_HEADER s{};
                View().Read(SectionOffset(i), s);
                if (rva >= s.VirtualAddress && rva < s.VirtualAddress + s.SizeOfRawData)
                    return s.PointerToRawData + (rva - s.VirtualAddress);
            }
            return ~0ull;
        }
        template <typename T>
        void Patch(uint64_t offset, T value)
        {
            if (!View().Write(offset, value))
                fprintf(stderr, "patch at %llu is outside the fixture\n", (unsigned long long)offset);
        }
    };

    inline RawImage ReadFixture(const char* name)
    {
        std::ifstream in(FixturePath(name), std::ios::binary);
        return RawImage{std::vector<uint8_t>(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>())};
    }

    struct LoadResult
    {
        PEModule* module;
        std::string message;  // "(null)" when the loader stored null
    };

    inline LoadResult Load(const std::vector<uint8_t>& bytes, const PEKnownImport* imports = nullptr, uint32_t count = 0)
    {
        const char* message = "not written";
        PEModule* module = PELoadLibrary(bytes.data(), bytes.size(), imports, count, &message);
        return {module, message ? message : "(null)"};
    }

    struct LoadCost
    {
        long pageFaults = -1;  // minor and major page faults taken by the load
        std::string message;   // as LoadResult::message
    };

    // Loads `bytes` in a child process (the module, if any, dies with it) and counts the page
    // faults the load takes: a count of pages touched that does not depend on timing.
    inline LoadCost MeasureLoad(const std::vector<uint8_t>& bytes)
    {
        Testing::ChildResult child = Testing::RunInChildProcess([&bytes] {
            rusage before{}, after{};
            getrusage(RUSAGE_SELF, &before);
            const char* message = "not written";
            PELoadLibrary(bytes.data(), bytes.size(), nullptr, 0, &message);
            getrusage(RUSAGE_SELF, &after);
            printf("\nfaults=%ld message=%s\n", (after.ru_minflt - before.ru_minflt) + (after.ru_majflt - before.ru_majflt),
                   message ? message : "(null)");
        });
        LoadCost cost;
        const size_t at = child.out.rfind("\nfaults=");
        if (!child.exited || at == std::string::npos)
            return cost;
        const size_t text = child.out.find(" message=", at);
        cost.pageFaults = atol(child.out.c_str() + at + 8);
        cost.message = child.out.substr(text + 9, child.out.size() - text - 10);
        return cost;
    }

    // Load with standard output (the loader's console lines) captured and dropped.
    inline LoadResult LoadQuietly(const std::vector<uint8_t>& bytes);

    // The lines of /proc/self/maps.
    inline std::vector<std::string> Mappings()
    {
        std::ifstream maps("/proc/self/maps");
        std::vector<std::string> lines;
        for (std::string line; std::getline(maps, line);)
            lines.push_back(line);
        return lines;
    }

    // True when a mapping starts exactly at `start` and ends at `start + size` rounded to pages,
    // with read, write and execute access.
    inline bool HasExecMapping(const void* start, size_t size)
    {
        const uint64_t from = reinterpret_cast<uint64_t>(start);
        const uint64_t to = from + ((size + 4095) & ~uint64_t(4095));
        for (const std::string& line : Mappings())
        {
            unsigned long long a = 0, b = 0;
            char perms[5] = {};
            if (sscanf(line.c_str(), "%llx-%llx %4s", &a, &b, perms) == 3 && a <= from && to <= b)
                return strcmp(perms, "rwxp") == 0;
        }
        return false;
    }

    // Kilobytes of the mapping that starts at `start` that belong to this process alone (its
    // "Anonymous" figure in /proc/self/smaps: pages written or copied on write); -1 when no
    // mapping starts there.
    inline long PrivateKilobytes(const void* start)
    {
        std::ifstream smaps("/proc/self/smaps");
        bool inside = false;
        for (std::string line; std::getline(smaps, line);)
        {
            unsigned long long a = 0, b = 0;
            long kb = 0;
            if (sscanf(line.c_str(), "%llx-%llx ", &a, &b) == 2 && line.find(':') > line.find(' '))
                inside = a == reinterpret_cast<uint64_t>(start);
            else if (inside && sscanf(line.c_str(), "Anonymous: %ld kB", &kb) == 1)
                return kb;
        }
        return -1;
    }

    inline size_t CountExecMappings()
    {
        size_t n = 0;
        for (const std::string& line : Mappings())
            n += line.find(" rwxp ") != std::string::npos;
        return n;
    }

    // A minimal well-formed PE32+ image built by hand: headers in the first 0x200 file bytes, one
    // section at image offset 0x1000 holding the entry point (xor eax, eax; ret), `descriptors`
    // import descriptors that all share one lookup list of `importCount` entries, each naming
    // "Nowhere_Function", and one address table. No relocations, no exports.
    inline std::vector<uint8_t> BuildImportImage(uint32_t importCount, uint32_t descriptors = 1)
    {
        const uint32_t kSectionRva = 0x1000, kFileAlign = 0x200;
        const uint32_t descriptorAt = 0x10;
        const uint32_t nameAt = descriptorAt + 20 * (descriptors + 1) + 4, lookupAt = nameAt + 0x40;
        const uint32_t addressAt = lookupAt + 8 * (importCount + 1);
        const uint32_t dataSize = addressAt + 8 * (importCount + 1);
        const uint32_t rawSize = (dataSize + kFileAlign - 1) & ~(kFileAlign - 1);
        std::vector<uint8_t> bytes(kFileAlign + rawSize);
        MutableByteView file(bytes.data(), bytes.size());

        PE_IMAGE_DOS_HEADER dos{};
        dos.magic = kPEDosMagic;
        dos.ntHeader = 0x40;
        file.Write(0, dos);
        PE_IMAGE_NT_HEADERS nt{};
        nt.Signature = kPENtSignature;
        nt.FileHeader.machine = 0x8664;
        nt.FileHeader.numberOfSections = 1;
        nt.FileHeader.sizeOfOptionalHeader = sizeof(PE_IMAGE_OPTIONAL_HEADER);
        nt.FileHeader.characteristics = 0x2022;
        PE_IMAGE_OPTIONAL_HEADER& opt = nt.OptionalHeader;
        opt.Magic = kPEOptionalMagic64;
        opt.AddressOfEntryPoint = kSectionRva;
        opt.ImageBase = 0x180000000ull;
        opt.SectionAlignment = 0x1000;
        opt.FileAlignment = kFileAlign;
        opt.SizeOfImage = kSectionRva + ((dataSize + 0xFFF) & ~0xFFFu);
        opt.SizeOfHeaders = kFileAlign;
        opt.NumberOfRvaAndSizes = 16;
        opt.DataDirectory[kPEDirectoryImports] = {kSectionRva + descriptorAt, (descriptors + 1) * uint32_t(sizeof(PE_IMAGE_IMPORT_DESCRIPTOR))};
        file.Write(0x40, nt);
        PE_IMAGE_SECTION_HEADER section{};
        memcpy(section.Name, ".data", 5);
        section.Misc.VirtualSize = dataSize;
        section.VirtualAddress = kSectionRva;
        section.SizeOfRawData = rawSize;
        section.PointerToRawData = kFileAlign;
        section.Characteristics = 0xE0000040;
        file.Write(0x40 + sizeof(PE_IMAGE_NT_HEADERS), section);

        const uint64_t data = kFileAlign;
        const uint8_t entry[] = {0x31, 0xC0, 0xC3};
        memcpy(bytes.data() + data, entry, sizeof(entry));
        PE_IMAGE_IMPORT_DESCRIPTOR desc{};
        desc.OriginalFirstThunk = kSectionRva + lookupAt;
        desc.Name = kSectionRva + nameAt;  // the DLL name; any string serves
        desc.FirstThunk = kSectionRva + addressAt;
        for (uint32_t d = 0; d < descriptors; ++d)
            file.Write(data + descriptorAt + d * sizeof(desc), desc);
        memcpy(bytes.data() + data + nameAt + 2, "Nowhere_Function", 17);
        for (uint32_t i = 0; i < importCount; ++i)
        {
            file.Write<uint64_t>(data + lookupAt + 8 * i, kSectionRva + nameAt);
            file.Write<uint64_t>(data + addressAt + 8 * i, kSectionRva + nameAt);
        }
        return bytes;
    }

    // Routes standard output (the stream and descriptor 1) into a temporary file until Text(),
    // which puts the old output back and returns what was written meanwhile.
    class StdoutCapture
    {
    public:
        StdoutCapture() : m_File(tmpfile())
        {
            fflush(stdout);
            m_Saved = dup(STDOUT_FILENO);
            if (m_File)
                dup2(fileno(m_File), STDOUT_FILENO);
        }
        ~StdoutCapture()
        {
            Restore();
            if (m_File)
                fclose(m_File);
        }
        StdoutCapture(const StdoutCapture&) = delete;
        StdoutCapture& operator=(const StdoutCapture&) = delete;

        std::string Text()
        {
            Restore();
            if (!m_File)
                return "<no capture file>";
            std::string text;
            char buffer[512];
            rewind(m_File);
            for (size_t n; (n = fread(buffer, 1, sizeof(buffer), m_File)) > 0;)
                text.append(buffer, n);
            return text;
        }

    private:
        void Restore()
        {
            if (m_Saved < 0)
                return;
            fflush(stdout);
            dup2(m_Saved, STDOUT_FILENO);
            close(m_Saved);
            m_Saved = -1;
        }

        FILE* m_File;
        int m_Saved = -1;
    };

    inline LoadResult LoadQuietly(const std::vector<uint8_t>& bytes)
    {
        StdoutCapture capture;
        LoadResult result = Load(bytes);
        capture.Text();
        return result;
    }
}
