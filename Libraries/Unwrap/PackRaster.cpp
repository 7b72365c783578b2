#include "PackRaster.h"

#include "WinImports.h"

namespace
{
    inline double Min3(double a, double b, double c) { return a < b ? (a < c ? a : c) : (b < c ? b : c); }
    inline double Max3(double a, double b, double c) { return a > b ? (a > c ? a : c) : (b > c ? b : c); }

    // floor() for the values met here (well inside the range of int64).
    inline int64_t Floor(double v)
    {
        int64_t i = (int64_t)v;
        return (double)i > v ? i - 1 : i;
    }

    void SetBits(uint64_t* row, uint32_t first, uint32_t last)
    {
        uint32_t w0 = first >> 6, w1 = last >> 6;
        uint64_t lowMask = ~0ull << (first & 63), highMask = ~0ull >> (63 - (last & 63));
        if (w0 == w1)
        {
            row[w0] |= lowMask & highMask;
            return;
        }
        row[w0] |= lowMask;
        for (uint32_t w = w0 + 1; w < w1; ++w)
            row[w] = ~0ull;
        row[w1] |= highMask;
    }

    bool Reserve(ChartRaster* raster, uint64_t words, uint64_t rows, uint64_t columns)
    {
        if (columns > raster->columnCapacity)
        {
            uint64_t grown = columns + columns / 2;
            if (!raster->columnLow.Allocate(grown) || !raster->columnHigh.Allocate(grown))
                return (raster->columnCapacity = 0), false;
            raster->columnCapacity = grown;
        }
        if (words > raster->bitCapacity)
        {
            uint64_t grown = words + words / 2;
            if (!raster->bits.Allocate(grown) || !raster->spare.Allocate(grown))
                return (raster->bitCapacity = 0), false;
            raster->bitCapacity = grown;
        }
        if (rows > raster->rowCapacity)
        {
            uint64_t grown = rows + rows / 2;
            if (!raster->spanLow.Allocate(grown) || !raster->spanHigh.Allocate(grown) || !raster->rowRun.Allocate(grown))
                return (raster->rowCapacity = 0), false;
            raster->rowCapacity = grown;
        }
        return true;
    }

    struct Corner
    {
        double x, y;
    };

    // Room for `rows` + 1 row starts and `count` crossings.
    bool ReserveCrossings(ChartRaster* raster, uint64_t rows, uint64_t count)
    {
        if (rows > raster->crossingRowCapacity)
        {
            if (!raster->crossingStart.Allocate(rows + rows / 2))
                return (raster->crossingRowCapacity = 0), (raster->outOfMemory = true), false;
            raster->crossingRowCapacity = rows + rows / 2;
        }
        if (count > raster->crossingCapacity)
        {
            if (!raster->crossings.Allocate(count + count / 2))
                return (raster->crossingCapacity = 0), (raster->outOfMemory = true), false;
            raster->crossingCapacity = count + count / 2;
        }
        return true;
    }

    // A triangle sorted by v, with the slopes du/dv of its long edge (bottom to top) and of
    // its two short edges, for the u extent of its part within a band of v.
    struct SortedTriangle
    {
        Corner low, middle, high;
        double longSlope, lowerSlope, upperSlope;

        explicit SortedTriangle(const Corner* p)
        {
            low = p[0], middle = p[1], high = p[2];
            if (middle.y < low.y)
                Swap(low, middle);
            if (high.y < middle.y)
                Swap(middle, high);
            if (middle.y < low.y)
                Swap(low, middle);
            longSlope = high.y > low.y ? (high.x - low.x) / (high.y - low.y) : 0;
            lowerSlope = middle.y > low.y ? (middle.x - low.x) / (middle.y - low.y) : 0;
            upperSlope = high.y > middle.y ? (high.x - middle.x) / (high.y - middle.y) : 0;
        }

        static void Swap(Corner& a, Corner& b)
        {
            Corner t = a;
            a = b, b = t;
        }

        // u of the long edge and of the short chain at v (low.y <= v <= high.y).
        double LongAt(double v) const { return low.x + (v - low.y) * longSlope; }
        double ShortAt(double v) const
        {
            return v <= middle.y ? low.x + (v - low.y) * lowerSlope : middle.x + (v - middle.y) * upperSlope;
        }

        // The u extent of the triangle within low <= v <= high (a convex part: its extremes
        // lie on the band's two lines or at the middle corner).
        void Extent(double bandLow, double bandHigh, double* uMin, double* uMax) const
        {
            if (high.y == low.y)   // flat: a segment along u
            {
                *uMin = Min3(low.x, middle.x, high.x), *uMax = Max3(low.x, middle.x, high.x);
                return;
            }
            double a = bandLow > low.y ? bandLow : low.y, b = bandHigh < high.y ? bandHigh : high.y;
            double u0 = LongAt(a), u1 = LongAt(b), u2 = ShortAt(a), u3 = ShortAt(b);
            double lo = u0 < u1 ? u0 : u1, hi = u0 > u1 ? u0 : u1;
            lo = u2 < lo ? u2 : lo, hi = u2 > hi ? u2 : hi;
            lo = u3 < lo ? u3 : lo, hi = u3 > hi ? u3 : hi;
            if (middle.y >= a && middle.y <= b)
                lo = middle.x < lo ? middle.x : lo, hi = middle.x > hi ? middle.x : hi;
            *uMin = lo, *uMax = hi;
        }
    };

    // The first set row met in every column, scanning rows upwards (`rising`: the lowest) or
    // downwards (the highest); kNoRow for an empty column. Each column is written once.
    void ColumnEnds(ChartRaster* r, bool rising, uint32_t* ends, uint64_t* seen)   // seen: a row of words
    {
        for (uint32_t x = 0; x < 64 * r->words; ++x)
            ends[x] = kNoRow;
        memset(seen, 0, r->words * 8ull);
        for (uint32_t i = 0; i < r->height; ++i)
        {
            uint32_t y = rising ? i : r->height - 1 - i;
            if (r->spanLow[y] > r->spanHigh[y])
                continue;
            const uint64_t* row = r->Row(y);
            for (uint32_t k = r->spanLow[y] >> 6; k <= r->spanHigh[y] >> 6; ++k)
            {
                uint64_t fresh = row[k] & ~seen[k];
                seen[k] |= row[k];
                for (; fresh; fresh &= fresh - 1)
                    ends[64 * k + (uint32_t)__builtin_ctzll(fresh)] = y;
            }
        }
    }

    // Spans of the rows, and the anchor: the longest run of the widest row.
    void Summarize(ChartRaster* r)
    {
        uint32_t widest = 0, widestRow = 0;
        for (uint32_t y = 0; y < r->height; ++y)
        {
            const uint64_t* row = r->Row(y);
            uint32_t low = 0xFFFFFFFFu, high = 0;
            for (uint32_t k = 0; k < r->words; ++k)
                if (row[k])
                {
                    low = low == 0xFFFFFFFFu ? 64 * k + (uint32_t)__builtin_ctzll(row[k]) : low;
                    high = 64 * k + 63 - (uint32_t)__builtin_clzll(row[k]);
                }
            r->spanLow[y] = low, r->spanHigh[y] = high;
            uint32_t first, last;
            r->rowRun[y] = low <= high ? LongestSetRun(row, r->words, &first, &last) : 0;
            if (low <= high && high - low + 1 > widest)
                widest = high - low + 1, widestRow = y;
        }
        r->anchorRow = widestRow;
        LongestSetRun(r->Row(widestRow), r->words, &r->anchorLow, &r->anchorHigh);
    }

    // row |= row shifted by `step` texels left and right (a row of `words` words).
    void SpreadRow(uint64_t* row, uint32_t words, uint32_t step, uint64_t* scratch)
    {
        memcpy(scratch, row, words * 8ull);
        uint32_t wordStep = step >> 6, bitStep = step & 63;
        for (uint32_t k = 0; k < words; ++k)
        {
            uint64_t spread = 0;
            // Towards higher texels: bit i gets bit i - step.
            if (k >= wordStep)
            {
                uint32_t j = k - wordStep;
                spread |= scratch[j] << bitStep;
                if (bitStep && j > 0)
                    spread |= scratch[j - 1] >> (64 - bitStep);
            }
            // Towards lower texels: bit i gets bit i + step.
            if (k + wordStep < words)
            {
                uint32_t j = k + wordStep;
                spread |= scratch[j] >> bitStep;
                if (bitStep && j + 1 < words)
                    spread |= scratch[j + 1] << (64 - bitStep);
            }
            row[k] |= spread;
        }
    }

    // Dilates the bitmap by `texels` in every direction (a square), in steps that at most
    // double the reach each time.
    void Dilate(ChartRaster* r, uint32_t texels)
    {
        uint32_t words = r->words;
        uint64_t* spare = r->spare.Data();
        for (uint32_t reach = 0; reach < texels;)
        {
            uint32_t step = reach + 1 < texels - reach ? reach + 1 : texels - reach;
            for (uint32_t y = 0; y < r->height; ++y)
                SpreadRow(r->Row(y), words, step, spare);
            memcpy(spare, r->bits.Data(), (uint64_t)words * r->height * 8);
            for (uint32_t y = 0; y < r->height; ++y)
            {
                uint64_t* row = r->Row(y);
                const uint64_t* below = y >= step ? spare + (uint64_t)(y - step) * words : nullptr;
                const uint64_t* above = y + step < r->height ? spare + (uint64_t)(y + step) * words : nullptr;
                for (uint32_t k = 0; k < words; ++k)
                    row[k] |= (below ? below[k] : 0) | (above ? above[k] : 0);
            }
            reach += step;
        }
    }
    // The chart's triangles, each texel they touch, dilated by `pad`.
    void DrawTriangles(const float* uv, const uint32_t* triangles, uint32_t count, double c, double s, double h, uint32_t pad,
                       ChartRaster* raster)
    {
        // Dilating the bitmap afterwards costs a few passes over it; drawing each triangle already
        // dilated (its band of rows widened by `pad` either way, its span by `pad` texels) costs
        // 2 pad more rows a triangle. Both set the same texels; the cheaper one is taken.
        uint32_t dilateSteps = 0;
        for (uint32_t reach = 0; reach < pad; reach += reach + 1)
            ++dilateSteps;
        const int64_t grow = (uint64_t)count * 2 * pad <= 3ull * raster->words * raster->height * dilateSteps ? pad : 0;
        const int64_t lastColumn = raster->width - 1, lastRow = raster->height - 1;
        auto clampColumn = [lastColumn](int64_t x) { return x < 0 ? 0 : (x > lastColumn ? lastColumn : x); };
        auto clampRow = [lastRow](int64_t y) { return y < 0 ? 0 : (y > lastRow ? lastRow : y); };
        for (uint32_t i = 0; i < count; ++i)
        {
            const float* t = uv + 6ull * triangles[i];
            Corner p[3];
            for (int k = 0; k < 3; ++k)
                p[k] = {(c * t[2 * k] - s * t[2 * k + 1] - raster->originX) / h, (s * t[2 * k] + c * t[2 * k + 1] - raster->originY) / h};
            // In texel units from here on: texel (x, y) is [x, x + 1] x [y, y + 1].
            int64_t low = Floor(Min3(p[0].y, p[1].y, p[2].y)), high = Floor(Max3(p[0].y, p[1].y, p[2].y));
            int64_t left = Floor(Min3(p[0].x, p[1].x, p[2].x)), right = Floor(Max3(p[0].x, p[1].x, p[2].x));
            int64_t row0 = clampRow(low - grow), row1 = clampRow(high + grow);
            if (high - low <= 1 && right - left <= 1)
            {
                for (int64_t row = row0; row <= row1; ++row)
                    SetBits(raster->Row((uint32_t)row), (uint32_t)clampColumn(left - grow), (uint32_t)clampColumn(right + grow));
                continue;
            }
            SortedTriangle sorted(p);
            for (int64_t row = row0; row <= row1; ++row)
            {
                double xMin, xMax;
                sorted.Extent((double)(row - grow), (double)(row + 1 + grow), &xMin, &xMax);
                SetBits(raster->Row((uint32_t)row), (uint32_t)clampColumn(Floor(xMin) - grow), (uint32_t)clampColumn(Floor(xMax) + grow));
            }
        }
        if (grow == 0)
            Dilate(raster, pad);
    }

    // The row's texels [first, last] (texel units, clamped to the bitmap), set.
    struct RowWriter
    {
        ChartRaster* raster;
        int64_t lastColumn;
        void Set(int64_t row, int64_t first, int64_t last) const
        {
            first = first < 0 ? 0 : first, last = last > lastColumn ? lastColumn : last;
            if (row >= 0 && row < (int64_t)raster->height && first <= last)
                SetBits(raster->Row((uint32_t)row), (uint32_t)first, (uint32_t)last);
        }
    };

    // The outline's texels: every texel a boundary edge touches, dilated by `pad`, and every
    // texel whose centre lies inside (even-odd along the row's centre line; an endpoint counts
    // for the edge it is the lower end of). The inside needs no dilation: a texel within `pad`
    // of an inside texel but outside itself has the boundary between their centres, in a
    // boundary texel within `pad` of it. False when a row meets an odd number of crossings.
    bool DrawOutline(const float* outline, uint32_t segments, double c, double s, double h, uint32_t pad, ChartRaster* r)
    {
        const int64_t grow = pad;
        RowWriter row = {r, (int64_t)r->width - 1};
        if (!ReserveCrossings(r, r->height + 1ull, 0))
            return false;
        uint32_t* start = r->crossingStart.Data();
        memset(start, 0, (r->height + 1ull) * 4);
        auto corner = [&](const float* p) {
            return Corner{(c * p[0] - s * p[1] - r->originX) / h, (s * p[0] + c * p[1] - r->originY) / h};
        };
        // The rows whose centre line an edge crosses: low.y <= row + 0.5 < high.y.
        auto crossedRows = [](const Corner& a, const Corner& b, int64_t* first, int64_t* last) {
            double low = a.y < b.y ? a.y : b.y, high = a.y < b.y ? b.y : a.y;
            *first = -Floor(0.5 - low), *last = -Floor(0.5 - high) - 1;
        };
        for (uint32_t i = 0; i < segments; ++i)
        {
            Corner a = corner(outline + 4ull * i), b = corner(outline + 4ull * i + 2);
            double low = a.y < b.y ? a.y : b.y, high = a.y < b.y ? b.y : a.y;
            double slope = high > low ? (b.x - a.x) / (b.y - a.y) : 0;
            for (int64_t y = Floor(low) - grow; y <= Floor(high) + grow; ++y)
            {
                double bandLow = (double)(y - grow) > low ? (double)(y - grow) : low;
                double bandHigh = (double)(y + 1 + grow) < high ? (double)(y + 1 + grow) : high;
                double x0 = high > low ? a.x + (bandLow - a.y) * slope : a.x, x1 = high > low ? a.x + (bandHigh - a.y) * slope : b.x;
                double xMin = x0 < x1 ? x0 : x1, xMax = x0 < x1 ? x1 : x0;
                row.Set(y, Floor(xMin) - grow, Floor(xMax) + grow);
            }
            int64_t first, last;
            crossedRows(a, b, &first, &last);
            for (int64_t y = first; y <= last; ++y)
                if (y >= 0 && y < (int64_t)r->height)
                    ++start[y + 1];
        }
        for (uint32_t y = 0; y < r->height; ++y)
            start[y + 1] += start[y];
        if (!ReserveCrossings(r, r->height + 1ull, start[r->height]))
            return false;
        start = r->crossingStart.Data();
        double* crossings = r->crossings.Data();
        for (uint32_t i = 0; i < segments; ++i)   // start[y] ends up at row y + 1's first crossing
        {
            Corner a = corner(outline + 4ull * i), b = corner(outline + 4ull * i + 2);
            int64_t first, last;
            crossedRows(a, b, &first, &last);
            for (int64_t y = first; y <= last; ++y)
                if (y >= 0 && y < (int64_t)r->height)
                    crossings[start[y]++] = a.x + (y + 0.5 - a.y) * (b.x - a.x) / (b.y - a.y);
        }
        for (uint32_t y = 0, from = 0; y < r->height; from = start[y++])
        {
            uint32_t to = start[y];
            if ((to - from) & 1)
                return false;
            for (uint32_t i = from + 1; i < to; ++i)   // insertion sort: a few crossings a row
                for (uint32_t j = i; j > from && crossings[j] < crossings[j - 1]; --j)
                {
                    double t = crossings[j];
                    crossings[j] = crossings[j - 1], crossings[j - 1] = t;
                }
            for (uint32_t i = from; i < to; i += 2)   // centres x + 0.5 in [crossings[i], crossings[i + 1]]
                row.Set(y, -Floor(0.5 - crossings[i]), Floor(crossings[i + 1] - 0.5));
        }
        return true;
    }
}

uint32_t LongestSetRun(const uint64_t* row, uint32_t words, uint32_t* first, uint32_t* last)
{
    uint32_t best = 0, run = 0, start = 0;
    *first = *last = 0;
    for (uint32_t w = 0; w < words; ++w)
    {
        uint64_t bits = row[w];
        uint32_t pos = 0;
        while (pos < 64)
        {
            // Set bits from pos on (the shifted-in high bits are clear, so ~rest stops there).
            uint64_t rest = bits >> pos;
            uint32_t ones = ~rest == 0 ? 64 : (uint32_t)__builtin_ctzll(~rest);
            if (ones > 0)
            {
                if (run == 0)
                    start = 64 * w + pos;
                run += ones;
                pos += ones;
                if (pos >= 64)
                    break;   // the run may go on in the next word
            }
            if (run > best)
                best = run, *first = start, *last = start + run - 1;
            run = 0;
            rest = bits >> pos;
            if (rest == 0)
                break;
            pos += (uint32_t)__builtin_ctzll(rest);
        }
    }
    if (run > best)
        best = run, *first = start, *last = start + run - 1;
    return best;
}

bool RasterizeChart(const float* uv, const uint32_t* triangles, uint32_t count, const float* outline, uint32_t segments,
                    const RasterPose& pose, uint32_t maxTexels, ChartRaster* raster)
{
    raster->width = raster->height = 0;
    raster->outOfMemory = false;
    const double c = pose.cosine * pose.scale, s = pose.sine * pose.scale, h = pose.texel;
    double minX = 1e300, minY = 1e300, maxX = -1e300, maxY = -1e300;
    auto extend = [&](const float* p) {
        double x = c * p[0] - s * p[1], y = s * p[0] + c * p[1];
        minX = x < minX ? x : minX, maxX = x > maxX ? x : maxX;
        minY = y < minY ? y : minY, maxY = y > maxY ? y : maxY;
    };
    // The outline holds every extreme point of the chart.
    for (uint32_t i = 0; i < segments; ++i)
        extend(outline + 4ull * i), extend(outline + 4ull * i + 2);
    for (uint32_t i = 0; i < count && segments == 0; ++i)
        for (uint32_t k = 6 * triangles[i]; k < 6 * triangles[i] + 6; k += 2)
            extend(uv + k);
    // The chart's own texels start `dilationTexels` in from the bitmap's lower-left corner.
    const uint32_t pad = pose.dilationTexels;
    raster->originX = minX - pad * h, raster->originY = minY - pad * h;
    double width = (maxX - minX) / h + 1 + 2 * pad, height = (maxY - minY) / h + 1 + 2 * pad;
    if (width > maxTexels || height > maxTexels)
        return false;
    raster->width = (uint32_t)width, raster->height = (uint32_t)height;
    raster->words = (raster->width + 63) / 64;
    if (!Reserve(raster, (uint64_t)raster->words * raster->height, raster->height, 64ull * raster->words))
        return (raster->outOfMemory = true), (raster->width = 0), false;
    memset(raster->bits.Data(), 0, (uint64_t)raster->words * raster->height * 8);
    bool drawn = segments > 0 && DrawOutline(outline, segments, c, s, h, pad, raster);
    if (raster->outOfMemory)
        return (raster->width = 0), false;
    if (!drawn)
    {
        if (segments > 0)   // an outline that does not close: the triangles decide
            memset(raster->bits.Data(), 0, (uint64_t)raster->words * raster->height * 8);
        DrawTriangles(uv, triangles, count, c, s, h, pad, raster);
    }
    Summarize(raster);
    ColumnEnds(raster, true, raster->columnLow.Data(), raster->spare.Data());
    ColumnEnds(raster, false, raster->columnHigh.Data(), raster->spare.Data());
    return true;
}
