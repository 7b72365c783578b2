#include "BehaviourReports.h"

#include "WinImports.h"

namespace
{
    uint32_t Bits(float value)
    {
        uint32_t bits;
        memcpy(&bits, &value, 4);
        return bits;
    }

    uint32_t ReadControlRegister()
    {
        uint32_t mxcsr;
        __asm__ volatile("stmxcsr %0" : "=m"(mxcsr));
        return mxcsr;
    }

    // Appends to the zero-terminated text in `buffer`.
    void Append(char* buffer, uint32_t size, const char* format, uint32_t value)
    {
        size_t used = _mbstrlen(buffer);
        if (used + 1 < size)
            sprintf_s(buffer + used, size - used, format, value);
    }

    // At most the first 12 items of an optional array, or "none".
    void AppendArray(char* buffer, uint32_t size, const char* name, const uint32_t* items, uint32_t count)
    {
        Append(buffer, size, name, 0);
        if (!items)
            Append(buffer, size, " none", 0);
        for (uint32_t i = 0; items && i < count && i < 12; ++i)
            Append(buffer, size, " %X", items[i]);
    }
}

void ReportFloatingPointState(char* buffer, uint32_t size)
{
    volatile float one = 1.0f, three = 3.0f, smallest = 1.17549435e-38f, minusOne = -1.0f;
    uint32_t bits = Bits(one / three), minusBits = Bits(minusOne / three);
    // Exact 1/3 lies between 0x3EAAAAAA and 0x3EAAAAAB (nearer the latter).
    const char* rounding = bits == 0x3EAAAAABu ? (minusBits == 0xBEAAAAABu ? "to nearest" : "up")
                                               : (minusBits == 0xBEAAAAAAu ? "toward zero" : "down");
    float half = smallest * 0.5f;
    sprintf_s(buffer, size, "rounding %s, denormals %s, control %X\n", rounding, half != 0 ? "kept" : "flushed",
              ReadControlRegister() & ~0x3Fu);
}

void ReportInputs(const UnwrapParam& param, int32_t vertexCount, int32_t triCount, const float* triUV,
                  const uint32_t* srcPoly, char* buffer, uint32_t size)
{
    sprintf_s(buffer, size, "param %X %X %X %X %d; %d vertices, %d triangles; ", Bits(param.angleDistortionThreshold),
              Bits(param.areaDistortionThreshold), Bits(param.hardAngle), Bits(param.packMargin),
              param.recollectVertices, vertexCount, triCount);
    uint32_t triangles = triCount > 0 ? (uint32_t)triCount : 0;
    AppendArray(buffer, size, "triUV", reinterpret_cast<const uint32_t*>(triUV), 6 * triangles);
    AppendArray(buffer, size, "; srcPoly", srcPoly, triangles);
    Append(buffer, size, "\n", 0);
}
