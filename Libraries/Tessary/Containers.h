// Small containers for plain-data elements, on the library's own allocator. No constructors or
// destructors run for elements: only trivially copyable types belong in them.
#pragma once

#include "TessaryApi.h"
#include "WinImports.h"

template <typename T>
struct Array
{
    T* data = nullptr;
    uint32_t size = 0;
    uint32_t capacity = 0;

    void Release() { Tessary_Deallocate(data); data = nullptr; size = capacity = 0; }
    bool Reserve(uint32_t wanted)
    {
        if (wanted <= capacity)
            return true;
        T* grown = (T*)Tessary_Allocate(wanted * (unsigned)sizeof(T));
        if (!grown)
            return false;
        if (size)
            memcpy(grown, data, size * sizeof(T));
        Tessary_Deallocate(data);
        data = grown;
        capacity = wanted;
        return true;
    }
    bool Push(const T& value)
    {
        if (size == capacity && !Reserve(capacity ? capacity * 2 : 8))
            return false;
        data[size++] = value;
        return true;
    }
    T& operator[](uint32_t i) { return data[i]; }
};

// Variable-sized records packed one after another; each starts with its byte length.
struct BlobArray
{
    Array<uint8_t> bytes;
    Array<uint32_t> offsets;

    bool Add(const void* blob, uint32_t length);
    uint32_t Count() const { return offsets.size; }
    const uint8_t* Get(uint32_t i, uint32_t* length) const;
    void Release() { bytes.Release(); offsets.Release(); }
};

// Open-addressing hash map from 32-bit keys (not 0xFFFFFFFF) to 32-bit values.
struct HashTab
{
    static const uint32_t kEmpty = 0xFFFFFFFFu;
    uint32_t* keys = nullptr;
    uint32_t* values = nullptr;
    uint32_t capacity = 0;   // a power of two
    uint32_t count = 0;

    bool Set(uint32_t key, uint32_t value);
    bool Get(uint32_t key, uint32_t* value) const;
    void Release();
};

// Binary min-heap of (priority, item) pairs.
struct PriorityQueue
{
    struct Entry { float priority; uint32_t item; };
    Array<Entry> heap;

    bool Push(float priority, uint32_t item);
    bool Pop(Entry* top);
    void Release() { heap.Release(); }
};
