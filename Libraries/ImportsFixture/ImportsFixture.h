// Shared by the sources of ImportsFixture.dll: the check macro and small helpers that do not go
// through the imports under test.
#pragma once

#include "WinImports.h"

// Ends the area's test function with the line of the first failing check.
#define FIXTURE_CHECK(condition)     \
    do                               \
    {                                \
        if (!(condition))            \
            return __LINE__;         \
    } while (0)

#define FIXTURE_EXPORT extern "C" __declspec(dllexport)

// The 32-bit manglings of the global operators, which x64 code never emits by itself.
extern "C" __declspec(dllimport) void* OperatorNew32(unsigned int size) __asm__("??2@YAPAXI@Z");
extern "C" __declspec(dllimport) void* OperatorNewArray32(unsigned int size) __asm__("??_U@YAPAXI@Z");
extern "C" __declspec(dllimport) void OperatorDelete32(void* ptr) __asm__("??3@YAXPAX@Z");
extern "C" __declspec(dllimport) void OperatorDeleteArray32(void* ptr) __asm__("??_V@YAXPAX@Z");

namespace Fixture
{
    inline bool SameText(const char* a, const char* b)
    {
        while (*a && *a == *b)
            ++a, ++b;
        return *a == *b;
    }

    inline bool SameBytes(const void* a, const void* b, size_t count)
    {
        const unsigned char* x = static_cast<const unsigned char*>(a);
        const unsigned char* y = static_cast<const unsigned char*>(b);
        for (size_t i = 0; i < count; ++i)
            if (x[i] != y[i])
                return false;
        return true;
    }

    inline void Fill(void* target, unsigned char value, size_t count)
    {
        unsigned char* p = static_cast<unsigned char*>(target);
        for (size_t i = 0; i < count; ++i)
            p[i] = value;
    }

    inline uint64_t BitsOf(double value)
    {
        union { double d; uint64_t u; } pun;
        pun.d = value;
        return pun.u;
    }
}
