#pragma once
// Hardening beyond the specified load steps: which bytes of a mapped image hold data copied from
// the file. The mapping starts out zero, so everything else reads as zero until the loader writes
// there; that lets the loader refuse work on bytes no file could have described (relocation blocks
// and targets in never-filled space) and skip zeroing memory that is zero already. A load touches
// only what the file fills, so its memory and time grow with the file, not with SizeOfImage.

#include <stdint.h>

#include <algorithm>
#include <utility>
#include <vector>

class PEFilledRanges
{
public:
    // Records that [offset, offset + length) now holds file data. Ranges may overlap.
    void Add(uint64_t offset, uint64_t length)
    {
        if (length != 0)
            m_Ranges.emplace_back(offset, offset + length);
        m_Merged = false;
    }

    // Calls `part(offset, length)` for every recorded piece inside [offset, offset + length).
    template <typename Fn>
    void ForEachInside(uint64_t offset, uint64_t length, Fn part)
    {
        Merge();
        const uint64_t end = offset + length;
        // Merged ranges are sorted by both ends: skip those that end at or before `offset`.
        auto it = std::partition_point(m_Ranges.begin(), m_Ranges.end(), [offset](const Range& r) { return r.second <= offset; });
        for (; it != m_Ranges.end() && it->first < end; ++it)
            part(std::max(it->first, offset), std::min(it->second, end) - std::max(it->first, offset));
    }

    // True when every byte of [offset, offset + length) has been filled.
    bool Covers(uint64_t offset, uint64_t length)
    {
        Merge();
        // The last merged range starting at or before `offset` is the only one that can hold it.
        auto it = std::upper_bound(m_Ranges.begin(), m_Ranges.end(), offset,
                                   [](uint64_t value, const Range& r) { return value < r.first; });
        if (it == m_Ranges.begin())
            return false;
        --it;
        return offset <= it->second && length <= it->second - offset;
    }

private:
    using Range = std::pair<uint64_t, uint64_t>;

    // Sorted, disjoint, and with touching ranges joined.
    void Merge()
    {
        if (m_Merged)
            return;
        std::sort(m_Ranges.begin(), m_Ranges.end());
        std::vector<Range> merged;
        for (const Range& r : m_Ranges)
        {
            if (!merged.empty() && r.first <= merged.back().second)
                merged.back().second = std::max(merged.back().second, r.second);
            else
                merged.push_back(r);
        }
        m_Ranges.swap(merged);
        m_Merged = true;
    }

    std::vector<Range> m_Ranges;
    bool m_Merged = true;
};
