#pragma once
// A growable array in one malloc block that can be handed over as the block itself: the mesh
// readers collect straight into the arrays they return, with no copy at the end. Growth goes
// through realloc, which for large blocks remaps pages instead of copying them, and capacity
// that was never written costs address space only, not memory.

#include <cstddef>
#include <cstdlib>
#include <type_traits>

template <typename T>
class MallocArray
{
    static_assert(std::is_trivially_copyable_v<T>, "the block is moved by realloc");

public:
    MallocArray() = default;
    ~MallocArray() { std::free(m_Data); }
    MallocArray(const MallocArray&) = delete;
    MallocArray& operator=(const MallocArray&) = delete;

    size_t Size() const { return m_Size; }
    T* Data() { return m_Data; }
    const T* Data() const { return m_Data; }
    T& operator[](size_t i) { return m_Data[i]; }
    const T& operator[](size_t i) const { return m_Data[i]; }

    // Room for `count` more elements at the end, which then count as used; nullptr when out of memory.
    T* Append(size_t count)
    {
        if (count > m_Capacity - m_Size && !Grow(m_Size + count))
            return nullptr;
        T* at = m_Data + m_Size;
        m_Size += count;
        return at;
    }

    bool Reserve(size_t capacity) { return capacity <= m_Capacity || Grow(capacity); }

    // Hands the block over, cut to its used size (one byte at least, so that an empty array is
    // still a valid allocation); the array is then empty. nullptr when out of memory.
    T* Release()
    {
        T* block = (T*)std::realloc(m_Data, m_Size ? m_Size * sizeof(T) : 1);
        if (!block)
            return nullptr;
        m_Data = nullptr;
        m_Size = m_Capacity = 0;
        return block;
    }

private:
    bool Grow(size_t needed)
    {
        size_t capacity = m_Capacity ? m_Capacity : 1024;
        while (capacity < needed)
            capacity = capacity > ~size_t(0) / 2 ? needed : capacity * 2;
        if (capacity > ~size_t(0) / sizeof(T))
            return false;
        T* block = (T*)std::realloc(m_Data, capacity * sizeof(T));
        if (!block)
            return false;
        m_Data = block;
        m_Capacity = capacity;
        return true;
    }

    T* m_Data = nullptr;
    size_t m_Size = 0;
    size_t m_Capacity = 0;
};
