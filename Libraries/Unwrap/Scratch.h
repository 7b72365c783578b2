// Scratch arrays for the unwrapper, on Tessary.dll's allocator. Elements are plain data and are
// not initialised; the memory goes back when the array goes out of scope.
#pragma once

#include "../Tessary/TessaryApi.h"
#include "WinImports.h"

#include <stdint.h>

template <typename T>
class Scratch
{
public:
    Scratch() = default;
    Scratch(const Scratch&) = delete;
    Scratch& operator=(const Scratch&) = delete;
    ~Scratch() { Tessary_Deallocate(m_Data); }

    // Room for `count` elements; false when the size does not fit the allocator or memory is out.
    bool Allocate(uint64_t count)
    {
        Tessary_Deallocate(m_Data);
        m_Data = nullptr;
        uint64_t bytes = count * sizeof(T);
        if (bytes > 0xFFFFFFF0ull)
            return false;
        m_Data = (T*)Tessary_Allocate((unsigned int)bytes);
        return m_Data != nullptr;
    }

    // Room for `count` elements, the first `keep` of them kept; false (the array unchanged) when
    // memory is out.
    bool Grow(uint64_t keep, uint64_t count)
    {
        uint64_t bytes = count * sizeof(T);
        T* grown = bytes <= 0xFFFFFFF0ull ? (T*)Tessary_Allocate((unsigned int)bytes) : nullptr;
        if (!grown)
            return false;
        if (keep)
            memcpy(grown, m_Data, keep * sizeof(T));
        Tessary_Deallocate(m_Data);
        m_Data = grown;
        return true;
    }

    // Gives the memory back before the array goes out of scope.
    void Release()
    {
        Tessary_Deallocate(m_Data);
        m_Data = nullptr;
    }

    T* Data() { return m_Data; }
    T& operator[](uint64_t i) { return m_Data[i]; }
    const T& operator[](uint64_t i) const { return m_Data[i]; }

private:
    T* m_Data = nullptr;
};
