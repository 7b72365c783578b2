#include "PackPlacement.h"

#include "WinImports.h"

namespace
{
    // 64 atlas texels from bit `first` on (the row has a clear padding word at its end).
    inline uint64_t Window(const uint64_t* row, uint32_t first)
    {
        uint32_t w = first >> 6, shift = first & 63;
        return shift ? (row[w] >> shift) | (row[w + 1] << (64 - shift)) : row[w];
    }

    // Calls visit(first, end) for every run of clear bits of at least `need` in row[0 .. words)
    // (the padding word is not part of the row); stops early when visit returns true.
    template <typename Visit>
    bool ForEachClearRun(const uint64_t* row, uint32_t words, uint32_t need, Visit visit)
    {
        uint32_t start = 0, run = 0;
        for (uint32_t w = 0; w < words; ++w)
        {
            uint64_t bits = row[w];
            uint32_t pos = 0;
            while (pos < 64)
            {
                uint64_t rest = bits >> pos;
                uint32_t clear = rest == 0 ? 64 - pos : (uint32_t)__builtin_ctzll(rest);
                if (clear > 0)
                {
                    if (run == 0)
                        start = 64 * w + pos;
                    run += clear;
                    pos += clear;
                    if (pos >= 64)
                        break;
                }
                if (run >= need && visit(start, start + run))
                    return true;
                run = 0;
                uint64_t taken = bits >> pos;
                pos += ~taken == 0 ? 64 - pos : (uint32_t)__builtin_ctzll(~taken);
            }
        }
        return run >= need && visit(start, start + run);
    }

    // Word by word: a clear word extends the run, a full word ends it, only mixed words are
    // taken apart bit by bit (most words of a packed atlas are clear or full).
    uint32_t LongestClearRun(const uint64_t* row, uint32_t words)
    {
        uint32_t best = 0, run = 0;
        for (uint32_t w = 0; w < words; ++w)
        {
            uint64_t bits = row[w];
            if (bits == 0)
            {
                run += 64;
                continue;
            }
            uint32_t low = (uint32_t)__builtin_ctzll(bits);   // clear bits below the first taken one
            run += low;
            best = run > best ? run : best;
            if (~bits != 0)
            {
                // Clear runs strictly inside the word: clear bits between taken ones.
                uint64_t clear = ~bits & ~((bits & (0 - bits)) - 1);   // clear bits above the lowest taken
                clear &= ~0ull >> __builtin_clzll(bits);               // ... and below the highest taken
                for (uint32_t inner = 0; clear; clear &= clear << 1)
                    best = ++inner > best ? inner : best;
            }
            run = (uint32_t)__builtin_clzll(bits);   // clear bits above the last taken one
        }
        return run > best ? run : best;
    }

    // The first set bit at or below `bit` in the chart row whose run of set bits holds `bit`.
    uint32_t RunStart(const uint64_t* chartRow, uint32_t bit)
    {
        for (uint32_t k = bit >> 6;; --k)
        {
            // Clear bits at or below `bit` in word k (all of the word below the first word).
            uint64_t below = bit >> 6 == k ? ~0ull >> (63 - (bit & 63)) : ~0ull;
            uint64_t clear = ~chartRow[k] & below;
            if (clear)
                return 64 * k + 64 - (uint32_t)__builtin_clzll(clear);
            if (k == 0)
                return 0;
        }
    }

    // 0 when the chart fits at (x, y); otherwise how far x can move right and still be sure to
    // collide. With b the highest chart texel of a colliding word, and s the first texel of the
    // chart row's run of set texels that holds b, the atlas texel x + b is taken: every offset
    // up to x + b - s puts a texel of [s, b] on it, so the next candidate is x + b - s + 1.
    uint32_t Collision(const AtlasOccupancy& atlas, const ChartRaster& chart, uint32_t x, uint32_t y)
    {
        // The anchor row first: the likeliest to collide.
        for (uint32_t i = 0; i <= chart.height; ++i)
        {
            uint32_t r = i == 0 ? chart.anchorRow : i - 1;
            if ((i > 0 && r == chart.anchorRow) || chart.spanLow[r] > chart.spanHigh[r])
                continue;
            const uint64_t* atlasRow = &atlas.bits[(uint64_t)(y + r) * atlas.words];
            const uint64_t* chartRow = chart.Row(r);
            for (uint32_t k = chart.spanLow[r] >> 6; k <= chart.spanHigh[r] >> 6; ++k)
                if (uint64_t hit = chartRow[k] & Window(atlasRow, x + 64 * k))
                {
                    uint32_t b = 64 * k + 63 - (uint32_t)__builtin_clzll(hit);
                    return b - RunStart(chartRow, b) + 1;
                }
        }
        return 0;
    }
    // Bottom-left search of the bitmap for a position whose top lies below topLimit.
    bool HoleSearch(AtlasOccupancy& atlas, const ChartRaster& chart, uint32_t topLimit, Placement* at, int64_t& budget)
    {
        if (chart.width > atlas.width || chart.height > atlas.rows)
            return false;
        uint32_t need = chart.anchorHigh - chart.anchorLow + 1;
        uint32_t hinted = need < 64 ? need : 64;
        uint32_t& lowest = atlas.lowestRowWithRun[hinted];
        while (lowest < atlas.rows && atlas.longestFree[lowest] < hinted)
            ++lowest;
        uint32_t firstY = lowest > chart.anchorRow ? lowest - chart.anchorRow : 0;
        uint32_t lastY = atlas.rows - chart.height;   // the chart stays inside the atlas
        if (topLimit != kNoTopLimit)
        {
            if (topLimit <= chart.height)
                return false;
            uint32_t lowerTop = topLimit - chart.height - 1;   // strictly below the best top so far
            lastY = lowerTop < lastY ? lowerTop : lastY;
        }
        // The rows with the longest runs, longest first: they rule out most offsets soonest.
        // An atlas row whose longest free run is below `shortest`, the shortest run of any chart
        // row, takes no chart row at all: every offset that puts one on it is skipped.
        const uint32_t kDemanding = 8, kRowsPerUnit = 16;
        uint32_t demanding[kDemanding], demandingCount = 0, shortest = 0xFFFFFFFFu;
        for (uint32_t r = 0; r < chart.height; ++r)
        {
            shortest = chart.rowRun[r] && chart.rowRun[r] < shortest ? chart.rowRun[r] : shortest;
            uint32_t i = demandingCount < kDemanding ? demandingCount++ : kDemanding;
            for (; i > 0 && chart.rowRun[demanding[i - 1]] < chart.rowRun[r]; --i)
                if (i < kDemanding)
                    demanding[i] = demanding[i - 1];
            if (i < kDemanding)
                demanding[i] = r;
        }
        for (uint32_t y = firstY; y <= lastY && budget > 0; ++y, --budget)
        {
            // Every chart row's longest run must find a free run at least as long. The budget
            // pays for the rows read, a unit for every kRowsPerUnit (about what a test of a
            // position costs).
            uint32_t blocked = kNoRow, rowsRead = 0;
            for (uint32_t i = 0; i < demandingCount && blocked == kNoRow; ++i, ++rowsRead)
                if (atlas.longestFree[y + demanding[i]] < chart.rowRun[demanding[i]])
                    blocked = y + demanding[i];
            for (uint32_t r = 0; r < chart.height && blocked == kNoRow; ++r, ++rowsRead)
                if (atlas.longestFree[y + r] < chart.rowRun[r])
                    blocked = y + r;
            budget -= rowsRead / kRowsPerUnit;
            if (blocked != kNoRow)
            {
                if (atlas.longestFree[blocked] < shortest)
                    y = blocked;   // the loop goes on above it
                continue;
            }
            budget -= atlas.words / kRowsPerUnit;   // the anchor row's free runs
            const uint64_t* anchorRow = atlas.bits.Data() + (uint64_t)(y + chart.anchorRow) * atlas.words;
            uint32_t lastX = atlas.width - chart.width;
            bool found = ForEachClearRun(anchorRow, atlas.words - 1, need, [&](uint32_t first, uint32_t end) {
                // The anchor run [anchorLow, anchorHigh] must lie inside [first, end).
                uint32_t lowX = first > chart.anchorLow ? first - chart.anchorLow : 0;
                if (end < chart.anchorHigh + 1)
                    return false;
                uint32_t highX = end - 1 - chart.anchorHigh;
                highX = highX < lastX ? highX : lastX;
                for (uint32_t x = lowX; x <= highX && budget > 0; --budget)
                {
                    uint32_t skip = Collision(atlas, chart, x, y);
                    if (skip == 0)
                    {
                        *at = {x, y};
                        return true;
                    }
                    x += skip;
                }
                return false;
            });
            if (found)
                return true;
        }
        return false;
    }

    // A skyline position's cost: the texels it leaves empty under the chart plus the area up
    // to its top across the chart's width (low and snug both count).
    inline int64_t Score(bool minimizeWaste, int64_t y, uint32_t height, uint32_t w, int64_t waste)
    {
        return minimizeWaste ? (y + height) * (int64_t)w + waste : y;
    }

    // The texels left empty under a chart resting at y, on groups of g columns (an estimate).
    inline int64_t GroupWaste(const int64_t* sky, const int64_t* bottom, uint32_t groups, uint32_t g, int64_t y)
    {
        int64_t waste = 0;
        for (uint32_t j = 0; j < groups; ++j)
            if (bottom[j] >= 0)
                waste += (y + bottom[j] - sky[j]) * g;
        return waste;
    }

    // Skyline placement (see the header): false when the chart is wider than the atlas.
    bool SkylineSearch(const AtlasOccupancy& atlas, const ChartRaster& chart, Placement* at)
    {
        uint32_t width = atlas.width, w = chart.width;
        if (w > width)
            return false;
        // Group widths are multiples of the atlas's base group, whose highest skies it keeps.
        // The two phases cost (width / g) (w / g) and 4 g w: least near g = cube root of width / 2
        // (8 on a 1024-texel atlas), more when the chart needs it.
        uint32_t base = atlas.skyGroupWidth, perGroup = ((w + 63) / 64 + base - 1) / base, balanced = 1;
        while ((balanced + 1) * (balanced + 1) * (balanced + 1) <= width / 2)
            ++balanced;
        perGroup = perGroup * base >= balanced ? perGroup : (balanced + base - 1) / base;
        uint32_t g = base * perGroup;
        uint32_t groups = (w + g - 1) / g, atlasGroups = (width + g - 1) / g, baseGroups = (width + base - 1) / base;
        int64_t bottom[65], sky[257];
        for (uint32_t j = 0; j < groups; ++j)
        {
            bottom[j] = -1;
            for (uint32_t x = j * g; x < (j + 1) * g && x < w; ++x)
                if (chart.columnLow[x] != kNoRow && (bottom[j] < 0 || chart.columnLow[x] < bottom[j]))
                    bottom[j] = chart.columnLow[x];
        }
        for (uint32_t j = 0; j < atlasGroups; ++j)
        {
            sky[j] = 0;
            for (uint32_t b = j * perGroup; b < (j + 1) * perGroup && b < baseGroups; ++b)
                sky[j] = atlas.skyGroup[b] > sky[j] ? atlas.skyGroup[b] : sky[j];
        }
        int64_t bestScore = -1;
        uint32_t bestGroup = 0;
        for (uint32_t start = 0; start * g + w <= width; ++start)
        {
            int64_t y = 0;
            for (uint32_t j = 0; j < groups; ++j)
                if (bottom[j] >= 0 && sky[start + j] - bottom[j] > y)
                    y = sky[start + j] - bottom[j];
            int64_t score = Score(atlas.minimizeWaste, y, chart.height, w,
                                  atlas.minimizeWaste ? GroupWaste(sky + start, bottom, groups, g, y) : 0);
            if (bestScore < 0 || score < bestScore)
                bestScore = score, bestGroup = start;
        }
        // Exact resting heights around the best group's position.
        uint32_t from = bestGroup * g >= g - 1 ? bestGroup * g - (g - 1) : 0, to = bestGroup * g + (g - 1);
        to = to < width - w ? to : width - w;
        int64_t bestY = -1;
        bestScore = -1;
        for (uint32_t x = from; x <= to; ++x)
        {
            int64_t y = 0, waste = 0;
            for (uint32_t j = 0; j < w; ++j)
                if (chart.columnLow[j] != kNoRow && (int64_t)atlas.sky[x + j] - chart.columnLow[j] > y)
                    y = (int64_t)atlas.sky[x + j] - chart.columnLow[j];
            for (uint32_t j = 0; j < w && atlas.minimizeWaste; ++j)
                if (chart.columnLow[j] != kNoRow)
                    waste += y + chart.columnLow[j] - (int64_t)atlas.sky[x + j];
            int64_t score = Score(atlas.minimizeWaste, y, chart.height, w, waste);
            if (bestScore < 0 || score < bestScore)
                bestScore = score, bestY = y, *at = {x, (uint32_t)y};
        }
        return bestY >= 0 && (uint64_t)bestY + chart.height <= atlas.rows;
    }
}

bool AtlasOccupancy::Reset(uint32_t atlasWidth, uint32_t atlasRows)
{
    // Rows from `top` on were never written since the last reset: only the rows below are cleared.
    uint32_t dirtyRows = top;
    if (atlasWidth != width || atlasRows != rows)
    {
        width = atlasWidth, rows = atlasRows, words = (atlasWidth + 63) / 64 + 1;
        skyGroupWidth = (width + 255) / 256;
        if (!bits.Allocate((uint64_t)words * rows) || !longestFree.Allocate(rows) || !sky.Allocate(width) ||
            !skyGroup.Allocate(width / skyGroupWidth + 1))
            return (width = rows = top = 0), false;
        dirtyRows = rows;
    }
    // Texels right of the atlas (the last word's tail and the padding word) count as taken.
    memset(bits.Data(), 0, (uint64_t)words * dirtyRows * 8);
    uint32_t tailWord = width >> 6, tailBit = width & 63;
    for (uint32_t y = 0; y < dirtyRows; ++y)
    {
        uint64_t* row = bits.Data() + (uint64_t)y * words;
        row[tailWord] |= ~0ull << tailBit;
        for (uint32_t w = tailWord + 1; w < words; ++w)
            row[w] = ~0ull;
        longestFree[y] = width;
    }
    memset(sky.Data(), 0, width * 4ull);
    memset(skyGroup.Data(), 0, (width / skyGroupWidth + 1) * 4ull);
    for (uint32_t n = 0; n <= 64; ++n)
        lowestRowWithRun[n] = 0;
    top = 0;
    return true;
}

bool FindPlacement(AtlasOccupancy& atlas, const ChartRaster& chart, uint32_t topLimit, Placement* at, int64_t* holeBudget)
{
    Placement skyline;
    bool found = SkylineSearch(atlas, chart, &skyline) && skyline.y + chart.height < topLimit;
    if (found)
        *at = skyline, topLimit = skyline.y + chart.height;
    Placement hole;
    if (HoleSearch(atlas, chart, topLimit, &hole, *holeBudget))
        return (*at = hole), true;
    return found;
}

void PlaceChart(AtlasOccupancy& atlas, const ChartRaster& chart, Placement at)
{
    for (uint32_t r = 0; r < chart.height; ++r)
    {
        if (chart.spanLow[r] > chart.spanHigh[r])
            continue;
        uint64_t* atlasRow = atlas.bits.Data() + (uint64_t)(at.y + r) * atlas.words;
        const uint64_t* chartRow = chart.Row(r);
        for (uint32_t k = chart.spanLow[r] >> 6; k <= chart.spanHigh[r] >> 6; ++k)
        {
            uint32_t first = at.x + 64 * k, w = first >> 6, shift = first & 63;
            atlasRow[w] |= chartRow[k] << shift;
            if (shift)
                atlasRow[w + 1] |= chartRow[k] >> (64 - shift);
        }
        atlas.longestFree[at.y + r] = LongestClearRun(atlasRow, atlas.words - 1);
    }
    for (uint32_t j = 0; j < chart.width; ++j)
        if (chart.columnHigh[j] != kNoRow && at.y + chart.columnHigh[j] + 1 > atlas.sky[at.x + j])
        {
            uint32_t top = at.y + chart.columnHigh[j] + 1, group = (at.x + j) / atlas.skyGroupWidth;
            atlas.sky[at.x + j] = top;
            atlas.skyGroup[group] = top > atlas.skyGroup[group] ? top : atlas.skyGroup[group];
        }
    atlas.top = at.y + chart.height > atlas.top ? at.y + chart.height : atlas.top;
}
