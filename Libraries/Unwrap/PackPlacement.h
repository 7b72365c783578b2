// Packing, step 2: where a chart's bitmap goes. The atlas is an occupancy bitmap `width`
// texels wide and `rows` high; a chart goes at an integer texel offset where
// none of its texels is taken. The lowest top edge wins, then the leftmost position.
//
// Two searches, both exact about the texels they accept:
// - Skyline (the lowest position, or the least waste: see AtlasOccupancy::minimizeWaste): every atlas column keeps the row above its highest taken texel; the chart rests on
//   it with its own lowest texel of each column (shapes interlock, holes below the skyline stay
//   unused). Positions are first compared on columns grouped by g (at most 64 groups a chart,
//   256 an atlas; g a multiple of a base group whose highest skyline the atlas keeps up to
//   date: the group's highest skyline against its lowest chart texel, which can only
//   overestimate), then the best group's g positions either side are worked out exactly.
// - Holes: the bitmap below the skyline's best top is searched bottom-left, within a budget.
//   Each atlas row keeps its longest free run, so rows that cannot hold the chart's runs are
//   skipped unread (the rows with the longest runs are checked first, and an atlas row too
//   full for any chart row is stepped over at once); for runs up to 64 texels the lowest row
//   that has one is remembered (rows only ever fill up); candidate offsets come from the free
//   runs of the chart's widest row; a fit is tested 64 texels at a time, and a collision moves
//   the offset past every position that must collide the same way.
#pragma once

#include "PackRaster.h"

const uint32_t kNoTopLimit = 0xFFFFFFFFu;
// The work the hole searches of one trial do at most, shared out among the charts (all
// orientations of a chart together), within the per-chart bounds: a unit for every offset
// row and every position tested, and one for every 16 rows of free-run checks or words of
// the anchor row read. Holes are a refinement, and a crowded atlas could otherwise cost a
// test at every free texel per chart.
const int64_t kHoleSearchTrialBudget = 1 << 21;
const int64_t kHoleSearchChartBudget[2] = {1024, 16384};

struct AtlasOccupancy
{
    uint32_t width = 0, rows = 0, words = 0;   // words a row, with one word of padding (taken)
    Scratch<uint64_t> bits;
    Scratch<uint32_t> longestFree;             // longest run of free texels in each row
    Scratch<uint32_t> sky;                     // each column: the row above its highest taken texel
    uint32_t skyGroupWidth = 1;                // columns a base group, so that there are at most 256
    Scratch<uint32_t> skyGroup;                // the highest sky of each base group
    uint32_t lowestRowWithRun[65] = {};        // lowest row holding a free run of n texels, n <= 64
    uint32_t top = 0;                          // rows [top, rows) are empty
    // The skyline's choice: the lowest position (false), or the least area up to the chart's
    // top plus the texels left empty under it (true).
    bool minimizeWaste = false;

    // An empty atlas; false when memory runs out.
    bool Reset(uint32_t atlasWidth, uint32_t atlasRows);
};

struct Placement
{
    uint32_t x, y;   // atlas texel of the chart's texel (0, 0)
};

// The best free position for `chart` whose top (y + height) lies below `topLimit`
// (kNoTopLimit: anywhere in the atlas); false when there is none. The hole search spends
// *holeBudget (see kHoleSearchTrialBudget).
// Cost: skyline, (atlas width / g) x (chart width / g) + 2 g x chart width; holes, the rows
// examined and the free runs of the candidate rows.
bool FindPlacement(AtlasOccupancy& atlas, const ChartRaster& chart, uint32_t topLimit, Placement* at, int64_t* holeBudget);

// Marks the chart's texels as taken. Cost: the chart's words and columns.
void PlaceChart(AtlasOccupancy& atlas, const ChartRaster& chart, Placement at);
