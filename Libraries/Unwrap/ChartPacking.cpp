#include "ChartPacking.h"

#include "Scratch.h"
#include "WinImports.h"

namespace
{
    const int kBisectionSteps = 32;   // the scale to about 1e-9 of its upper bound
    // Added to every gap so that rounding the UVs to float never brings charts closer than margin.
    const double kGapSlack = 1.0 / (1 << 22);

    // Stable least-significant-digit radix sort of chart numbers by descending height (the bits of
    // a non-negative float order like the float).
    bool SortTallestFirst(const ChartBox* boxes, uint32_t n, uint32_t* order)
    {
        Scratch<uint32_t> keys, other, count;
        if (!keys.Allocate(n) || !other.Allocate(n) || !count.Allocate(65537))
            return false;
        for (uint32_t c = 0; c < n; ++c)
        {
            float height = (float)boxes[c].height;
            uint32_t bits;
            memcpy(&bits, &height, 4);
            keys[c] = 0x7FFFFFFFu - (bits & 0x7FFFFFFFu);
            order[c] = c;
        }
        uint32_t* from = order;
        uint32_t* to = other.Data();
        for (int shift = 0; shift < 32; shift += 16)
        {
            memset(count.Data(), 0, 65537 * sizeof(uint32_t));
            for (uint32_t i = 0; i < n; ++i)
                ++count[((keys[from[i]] >> shift) & 0xFFFF) + 1];
            for (uint32_t d = 0; d < 65536; ++d)
                count[d + 1] += count[d];
            for (uint32_t i = 0; i < n; ++i)
                to[count[(keys[from[i]] >> shift) & 0xFFFF]++] = from[i];
            uint32_t* swap = from;
            from = to;
            to = swap;
        }
        return true;   // two passes: the result is back in `order`
    }

    // Lays the charts out in rows at `scale`, taking them in the order of `sorted` (the boxes
    // tallest first); false as soon as one does not fit. With `placements` it also records where
    // each chart goes.
    bool Shelve(const ChartBox* sorted, const uint32_t* order, uint32_t n, double margin, double scale,
                ChartPlacement* placements)
    {
        double gap = margin + kGapSlack;
        double x = gap, y = gap, rowHeight = 0;
        for (uint32_t i = 0; i < n; ++i)
        {
            const ChartBox& box = sorted[i];
            double width = box.width * scale, height = box.height * scale;
            if (x + width + gap > 1 && x > gap)
            {
                y += rowHeight + gap;
                x = gap;
                rowHeight = 0;
            }
            if (x + width + gap > 1 || y + height + gap > 1)
                return false;
            if (placements)
                placements[order[i]] = {x, y};
            x += width + gap;
            rowHeight = height > rowHeight ? height : rowHeight;
        }
        return true;
    }

    // No scale above this can fit: the widest chart must fit the square, and so must their area.
    double UpperScale(const ChartBox* boxes, uint32_t n, double margin)
    {
        double widest = 0, area = 0;
        for (uint32_t c = 0; c < n; ++c)
        {
            widest = boxes[c].width > widest ? boxes[c].width : widest;
            area += boxes[c].width * boxes[c].height;
        }
        double inner = 1 - 2 * (margin + kGapSlack);
        double bound = widest > 0 ? inner / widest : 1;
        if (area > 0 && inner / Sqrt(area) < bound)
            bound = inner / Sqrt(area);
        return bound;
    }
}

bool PackCharts(const ChartBox* boxes, uint32_t chartCount, double margin, double* scale, ChartPlacement* placements)
{
    Scratch<uint32_t> order;
    Scratch<ChartBox> sorted;   // in packing order, so that the many trial packings read memory in sequence
    if (!order.Allocate(chartCount) || !sorted.Allocate(chartCount) || !SortTallestFirst(boxes, chartCount, order.Data()))
        return false;
    for (uint32_t i = 0; i < chartCount; ++i)
        sorted[i] = boxes[order[i]];
    double low = 0, high = UpperScale(boxes, chartCount, margin);
    if (Shelve(sorted.Data(), order.Data(), chartCount, margin, high, nullptr))
        low = high;
    for (int step = 0; step < kBisectionSteps && low < high; ++step)
    {
        double middle = 0.5 * (low + high);
        if (Shelve(sorted.Data(), order.Data(), chartCount, margin, middle, nullptr))
            low = middle;
        else
            high = middle;
    }
    *scale = low;
    return Shelve(sorted.Data(), order.Data(), chartCount, margin, low, placements);
}
