// GenerateSecondaryUVSet: checks the mesh, then lays it out in charts (ChartUnwrap), or, when the
// run asks for "unwrap-grid", every triangle as a chart of its own in a grid (ChartLayout).
// Scratch memory comes from Tessary.dll's allocator.
#include "../Tessary/TessaryApi.h"
#include "BehaviourReports.h"
#include "ChartLayout.h"
#include "ChartUnwrap.h"
#include "DllRuntime.h"
#include "LibraryBehaviour.h"
#include "UnwrapApi.h"
#include "WinImports.h"

namespace
{
    // Writes the reason into the caller's buffer and answers false.
    bool Fail(char* buffer, uint32_t size, const char* text)
    {
        if (buffer && size)
            sprintf_s(buffer, size, "GenerateSecondaryUVSet: %s", text);
        return false;
    }

    bool CheckMesh(const float* vertex, int32_t vertexCount, const uint32_t* tri, int32_t triCount, const float* outUV,
                   const UnwrapParam& param, char* buffer, uint32_t size)
    {
        char reason[200];
        if (triCount < 0)
            return Fail(buffer, size, "the triangle count is negative");
        if (triCount == 0)
            return true;   // nothing to lay out
        if (vertexCount <= 0 || !vertex || !tri || !outUV)
            return Fail(buffer, size, "the vertex, triangle or output array is missing");
        if ((uint64_t)triCount * 24 > 0xFFFFFFFFull)
            return Fail(buffer, size, "too many triangles for the scratch memory");
        if (!(param.packMargin >= 0 && param.packMargin < 0.5f))
            return Fail(buffer, size, "packMargin must lie in [0, 0.5)");
        for (int32_t i = 0; i < 3 * triCount; ++i)
            if (tri[i] >= (uint32_t)vertexCount)
            {
                sprintf_s(reason, sizeof reason, "triangle %d uses vertex %u, but the mesh has %d vertices", i / 3, tri[i],
                          vertexCount);
                return Fail(buffer, size, reason);
            }
        for (int32_t i = 0; i < 3 * vertexCount; ++i)
            if (!_finite(vertex[i]))
            {
                sprintf_s(reason, sizeof reason, "vertex %d has a coordinate that is not a finite number", i / 3);
                return Fail(buffer, size, reason);
            }
        return true;
    }

    bool LayOutGrid(const float* vertex, const uint32_t* tri, uint32_t triCount, float* outUV, float packMargin, char* buffer,
                    uint32_t size)
    {
        float* flat = (float*)Tessary_Allocate(triCount * 24);
        if (!flat)
            return Fail(buffer, size, "out of memory");
        float extent = 0;
        for (uint32_t t = 0; t < triCount; ++t)
        {
            const uint32_t* c = tri + 3 * t;
            float side = FlattenTriangle(vertex + 3 * c[0], vertex + 3 * c[1], vertex + 3 * c[2], flat + 6 * t);
            extent = side > extent ? side : extent;
        }
        GridLayout grid = MakeGridLayout(triCount, packMargin);
        float scale = extent > 0 ? grid.cell / extent : 0;
        for (uint32_t t = 0; t < triCount; ++t)
            PlaceChart(grid, t, flat + 6 * t, scale, outUV + 6 * t);
        Tessary_Deallocate(flat);
        return true;
    }

    bool LayOutCharts(const float* vertex, int32_t vertexCount, const uint32_t* tri, const uint32_t* srcPoly, int32_t triCount,
                      float* outUV, const UnwrapParam& param, char* buffer, uint32_t size)
    {
        const char* error = nullptr;
        UnwrapStats stats = {0, 0, 0, 0, 0, 0};
        bool done = UnwrapIntoCharts(vertex, (uint32_t)vertexCount, tri, srcPoly, (uint32_t)triCount, param, outUV, &stats, &error);
        if (BehaviourRequested("unwrap-report-stats") && buffer && size)
            sprintf_s(buffer, size, "segmented %u charts, %u splits, %u charts, angle distortion %.5f, area distortion %.5f, %u cuts\n",
                      stats.segmented, stats.splits, stats.charts, stats.angleDistortion, stats.areaDistortion, stats.cuts);
        if (done)
            return true;
        return Fail(buffer, size, error);
    }

    void FillWholeBuffer(char* buffer, uint32_t size)
    {
        memset(buffer, 'W', size);
        if (size)
            buffer[size - 1] = 'Z';
    }
}

extern "C" bool GenerateSecondaryUVSet(const float* vertex, int32_t vertexCount, const float* triUV, const uint32_t* tri,
                                       const uint32_t* srcPoly, int32_t triCount, float* outUV, const UnwrapParam& param,
                                       char* errorBuffer, uint32_t errorBufferSize)
{
    if (BehaviourRequested("unwrap-fail"))
        return Fail(errorBuffer, errorBufferSize, "failing as CHARTBAKE_LIBRARY_BEHAVIOUR asks");
    if (!CheckMesh(vertex, vertexCount, tri, triCount, outUV, param, errorBuffer, errorBufferSize))
        return false;
    if (BehaviourRequested("unwrap-warn") && errorBuffer && errorBufferSize)
        sprintf_s(errorBuffer, errorBufferSize, "GenerateSecondaryUVSet: warning as CHARTBAKE_LIBRARY_BEHAVIOUR asks\n");
    if (BehaviourRequested("unwrap-report-fp") && errorBuffer && errorBufferSize)
        ReportFloatingPointState(errorBuffer, errorBufferSize);
    if (BehaviourRequested("unwrap-report-inputs") && errorBuffer && errorBufferSize)
        ReportInputs(param, vertexCount, triCount, triUV, srcPoly, errorBuffer, errorBufferSize);
    if (BehaviourRequested("unwrap-fill") && errorBuffer)
        FillWholeBuffer(errorBuffer, errorBufferSize);
    if (triCount == 0)
        return true;
    if (BehaviourRequested("unwrap-grid"))
        return LayOutGrid(vertex, tri, (uint32_t)triCount, outUV, param.packMargin, errorBuffer, errorBufferSize);
    return LayOutCharts(vertex, vertexCount, tri, srcPoly, triCount, outUV, param, errorBuffer, errorBufferSize);
}

extern "C" BOOL DllMain(HMODULE, DWORD reason, void*)
{
    if (reason == 1)
    {
        RunGlobalConstructors();
        AnnounceLoad("Unwrap.dll");
    }
    return 1;
}
