#include "OutputCheck.h"

#include "MeshAdjacency.h"

namespace
{
    double SignedArea(const float* uv)
    {
        return ((double)uv[2] - uv[0]) * ((double)uv[5] - uv[1]) - ((double)uv[4] - uv[0]) * ((double)uv[3] - uv[1]);
    }

    bool SameUV(const float* a, const float* b) { return a[0] == b[0] && a[1] == b[1]; }
}

bool CheckOutput(const ChartMesh& mesh, const uint32_t* chartOf, const float* outUV, const char** error)
{
    for (uint64_t i = 0; i < 6ull * mesh.triCount; ++i)
        if (!(outUV[i] >= 0 && outUV[i] <= 1))
            return (*error = "internal error: a UV is not a finite number inside the unit square"), false;
    // Twice the UV area a triangle should get at the layout's one scale; below kResolution the
    // float UVs cannot hold its shape (a sliver's height under their spacing), so its sign is moot.
    const double kResolution = 1e-10;
    double area2 = 0, area3 = 0;
    for (uint32_t t = 0; t < mesh.triCount; ++t)
    {
        area2 += mesh.degenerate[t] ? 0 : Abs(SignedArea(outUV + 6ull * t));
        area3 += 2 * mesh.area[t];
    }
    double scale = area3 > 0 ? area2 / area3 : 0;
    for (uint32_t t = 0; t < mesh.triCount; ++t)
        if (!mesh.degenerate[t] && !(SignedArea(outUV + 6ull * t) > 0) && 2 * mesh.area[t] * scale >= kResolution)
            return (*error = "internal error: a triangle is flipped or has no area in UV"), false;
    for (uint32_t h = 0; h < 3 * mesh.triCount; ++h)
    {
        uint32_t twin = mesh.twin[h];
        if (twin == kNoTwin || chartOf[h / 3] != chartOf[twin / 3])
            continue;
        // h runs a -> b, its twin b -> a: corner h meets the twin's next corner, and the reverse.
        const float* a = outUV + 2ull * h;
        const float* b = outUV + 2ull * NextCorner(h);
        if (!SameUV(a, outUV + 2ull * NextCorner(twin)) || !SameUV(b, outUV + 2ull * twin))
            return (*error = "internal error: a vertex has two UVs inside one chart"), false;
    }
    return true;
}
