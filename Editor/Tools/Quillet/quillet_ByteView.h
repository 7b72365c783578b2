#pragma once
// The one way the loader reads (and patches) the bytes of a PE image: every access names an
// offset and a length, and is refused, not performed, when it does not lie wholly inside the
// view. Values are copied out and in with memcpy, so no access depends on alignment.

#include <stddef.h>
#include <stdint.h>
#include <string.h>

#include <type_traits>

template <typename Byte>
class BasicByteView
{
    static_assert(std::is_same_v<std::remove_const_t<Byte>, uint8_t>, "a view over bytes");

public:
    BasicByteView(Byte* base, size_t size) : m_Base(base), m_Size(size) {}

    Byte* Base() const { return m_Base; }
    size_t Size() const { return m_Size; }

    // True when [offset, offset + length) lies inside the view; immune to wrap-around.
    bool Contains(uint64_t offset, uint64_t length) const
    {
        return offset <= m_Size && length <= m_Size - offset;
    }

    // Pointer to `length` bytes at `offset`, or null when they do not all lie inside.
    Byte* At(uint64_t offset, uint64_t length) const
    {
        return Contains(offset, length) ? m_Base + offset : nullptr;
    }

    template <typename T>
    bool Read(uint64_t offset, T& out) const
    {
        static_assert(std::is_trivially_copyable_v<T>);
        const Byte* p = At(offset, sizeof(T));
        if (!p)
            return false;
        memcpy(&out, p, sizeof(T));
        return true;
    }

    template <typename T>
    bool Write(uint64_t offset, const T& value) const requires(!std::is_const_v<Byte>)
    {
        static_assert(std::is_trivially_copyable_v<T>);
        Byte* p = At(offset, sizeof(T));
        if (!p)
            return false;
        memcpy(p, &value, sizeof(T));
        return true;
    }

    // The zero-terminated string at `offset`, or null when its terminator is not inside.
    const char* CString(uint64_t offset) const
    {
        if (offset >= m_Size)
            return nullptr;
        const void* end = memchr(m_Base + offset, 0, m_Size - offset);
        return end ? reinterpret_cast<const char*>(m_Base + offset) : nullptr;
    }

private:
    Byte* m_Base;
    size_t m_Size;
};

using ByteView = BasicByteView<const uint8_t>;         // the caller's file image
using MutableByteView = BasicByteView<uint8_t>;        // the mapped image the loader builds
