#pragma once
// Shared by the mesh-reader fuzzers: the readers take a path, so each input is handed over as an
// anonymous memory file reached through /proc/self/fd.

#include <stdint.h>
#include <stdio.h>
#include <stdlib.h>
#include <sys/mman.h>
#include <unistd.h>

#include "Editor/Tools/Unwrap/source/CLTool/MeshFiles.h"

typedef MeshFileError (*MeshReader)(const char*, UnwrapParam*, uint32_t*, uint32_t*, float**, float**, uint32_t**, uint32_t**);

// Reads `data` as a file with `reader` and frees whatever arrays it handed out, on success or not.
inline void ReadMeshFromMemory(MeshReader reader, const uint8_t* data, size_t size)
{
    const int fd = memfd_create("mesh-input", MFD_CLOEXEC);
    if (fd < 0)
        abort();
    for (size_t done = 0; done < size;)
    {
        const ssize_t n = write(fd, data + done, size - done);
        if (n <= 0)
            abort();
        done += static_cast<size_t>(n);
    }
    char path[64];
    snprintf(path, sizeof path, "/proc/self/fd/%d", fd);
    UnwrapParam param{};
    uint32_t vertexCount = 0, triCount = 0;
    float* vertex = nullptr;
    float* uv = nullptr;
    uint32_t* tri = nullptr;
    uint32_t* srcPoly = nullptr;
    MeshFileError error = reader(path, &param, &vertexCount, &triCount, &vertex, &uv, &tri, &srcPoly);
    // A success hands out complete arrays: touch their last elements so a short one shows.
    if (error.empty() && triCount > 0)
    {
        volatile uint32_t sink = tri[3ull * triCount - 1];
        if (sink >= vertexCount)
            abort();
        volatile float last = vertex[3ull * vertexCount - 1];
        (void)last;
    }
    free(vertex);
    free(uv);
    free(tri);
    free(srcPoly);
    close(fd);
}
