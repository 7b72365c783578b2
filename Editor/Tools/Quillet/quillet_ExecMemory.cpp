// Executable memory for module images and import stubs: the loader's only use of mmap.
#include "Editor/Tools/Quillet/quillet_ExecMemory.h"
#include "Editor/Tools/Quillet/quillet_PELoader.h"

#include <fcntl.h>
#include <link.h>
#include <pthread.h>
#include <stdint.h>
#include <string.h>
#include <sys/mman.h>
#include <unistd.h>

#include <array>

void* MapExecMemory(size_t bytes)
{
    // Read + write + execute, private + anonymous; the descriptor is ignored for anonymous maps.
    return mmap(nullptr, bytes, PROT_READ | PROT_WRITE | PROT_EXEC, MAP_PRIVATE | MAP_ANONYMOUS, 0, 0);
}

void UnmapExecMemory(void* ptr, size_t bytes)
{
    munmap(ptr, bytes);
}

// --- Beyond the plain mapping: breakpoint-filled areas without a fill per load ---------------
//
// The breakpoint pages already exist in this program's own file: a page-aligned constant of
// 0xCC bytes. A private mapping of that part of the file reads 0xCC everywhere from the shared
// page cache, and a page becomes the module's own only when a stub is written into it. So a load
// neither fills nor allocates the area, and no process pays for it either (the pages are cached
// across runs). Where the file cannot be mapped, an anonymous mapping is filled instead.

namespace
{
    constexpr size_t kPageSize = 4096;
    constexpr size_t kBreakpointBytes = 256 * 1024;

    constexpr std::array<uint8_t, kBreakpointBytes> MakeBreakpoints()
    {
        std::array<uint8_t, kBreakpointBytes> bytes{};
        for (uint8_t& b : bytes)
            b = 0xCC;
        return bytes;
    }
    alignas(kPageSize) const std::array<uint8_t, kBreakpointBytes> kBreakpointPages = MakeBreakpoints();

    // Where kBreakpointPages lies in the file of the object that holds it.
    struct BreakpointSource
    {
        int fd = -1;
        off_t offset = 0;
    };
    BreakpointSource s_Source;
    pthread_once_t s_SourceOnce = PTHREAD_ONCE_INIT;

    struct FileLocation
    {
        const char* path = nullptr;
        uint64_t offset = 0;
        bool found = false;
    };

    int LocateInLoadSegment(dl_phdr_info* info, size_t, void* data)
    {
        FileLocation& where = *static_cast<FileLocation*>(data);
        const uint64_t address = reinterpret_cast<uint64_t>(kBreakpointPages.data());
        for (int i = 0; i < info->dlpi_phnum; ++i)
        {
            const ElfW(Phdr)& ph = info->dlpi_phdr[i];
            const uint64_t start = info->dlpi_addr + ph.p_vaddr;
            if (ph.p_type != PT_LOAD || address < start || address + kBreakpointBytes > start + ph.p_filesz)
                continue;
            // The main program has no name here; its file is reachable through /proc.
            where.path = info->dlpi_name && info->dlpi_name[0] ? info->dlpi_name : "/proc/self/exe";
            where.offset = ph.p_offset + (address - start);
            where.found = true;
            return 1;
        }
        return 0;
    }

    void OpenBreakpointSource()
    {
        FileLocation where;
        dl_iterate_phdr(&LocateInLoadSegment, &where);
        if (!where.found || where.offset % kPageSize != 0)
            return;
        const int fd = open(where.path, O_RDONLY | O_CLOEXEC);
        if (fd < 0)
            return;
        // The file must hold exactly the bytes the program sees, or it is not used.
        uint8_t probe[16];
        if (pread(fd, probe, sizeof probe, static_cast<off_t>(where.offset)) != static_cast<ssize_t>(sizeof probe) ||
            memcmp(probe, kBreakpointPages.data(), sizeof probe) != 0)
        {
            close(fd);
            return;
        }
        s_Source = {fd, static_cast<off_t>(where.offset)};
    }
}

void* MapBreakpointMemory(size_t bytes)
{
    pthread_once(&s_SourceOnce, &OpenBreakpointSource);
    if (s_Source.fd >= 0 && bytes <= kBreakpointBytes)
    {
        // Private: the first write to a page copies it, so modules never see each other's stubs.
        void* area = mmap(nullptr, bytes, PROT_READ | PROT_WRITE | PROT_EXEC, MAP_PRIVATE, s_Source.fd, s_Source.offset);
        if (area != MAP_FAILED)
            return area;
    }
    void* area = MapExecMemory(bytes);
    if (area != MAP_FAILED)
        memset(area, 0xCC, bytes);
    return area;
}
