// Packing, step 1: a chart as a bitmap. The chart is turned and scaled; every texel that one of
// its triangles touches is set (conservative: a triangle whose box spans at most 2 x 2 texels
// sets its whole box), then the bitmap is dilated by `dilationTexels` in every direction (a
// square). Since dilationTexels * texel is at least half the margin, two charts whose bitmaps
// share no texel are at least the margin apart.
#pragma once

#include "Scratch.h"

#include <stdint.h>

const uint32_t kNoRow = 0xFFFFFFFFu;

// Where and how a chart is drawn: q = scale * R(angle) * uv, on texels `texel` wide.
struct RasterPose
{
    double cosine, sine, scale;
    double texel;
    uint32_t dilationTexels;
};

struct ChartRaster
{
    uint32_t width = 0, height = 0;   // texels
    uint32_t words = 0;               // 64-bit words a row
    double originX = 0, originY = 0;  // q of the lower-left corner of texel (0, 0)
    Scratch<uint64_t> bits;           // row-major, bit x of row y = texel (x, y)
    Scratch<uint64_t> spare;          // a second bitmap for the dilation
    Scratch<uint32_t> spanLow, spanHigh;       // first and last set texel of each row (low > high: empty)
    Scratch<uint32_t> rowRun;                  // the longest run of set texels of each row
    Scratch<uint32_t> columnLow, columnHigh;   // lowest and highest set row of each column (kNoRow: empty)
    // The longest run of set texels in the widest row: a placement must find it free.
    uint32_t anchorRow = 0, anchorLow = 0, anchorHigh = 0;
    Scratch<uint32_t> crossingStart;           // drawing an outline: each row's first crossing
    Scratch<double> crossings;                 // ... and the crossings, row by row
    uint64_t bitCapacity = 0, rowCapacity = 0, columnCapacity = 0;   // what the scratch arrays hold
    uint64_t crossingRowCapacity = 0, crossingCapacity = 0;
    bool outOfMemory = false;                    // set by a RasterizeChart that ran out of memory

    uint64_t* Row(uint32_t y) { return bits.Data() + (uint64_t)y * words; }
    const uint64_t* Row(uint32_t y) const { return &bits[(uint64_t)y * words]; }
};

// Draws the `count` triangles listed in `triangles` (corner UVs in `uv`, 6 floats a triangle), or,
// when `segments` is not 0, the same texels from the chart's outline (PackOutline.h: 4 floats an
// edge; an outline that does not close falls back to the triangles).
// Returns false when the bitmap would be wider or taller than `maxTexels` (the chart cannot fit
// at this scale) or memory runs out (raster->outOfMemory).
// Cost: the rows each triangle (or edge, plus 2 dilationTexels) spans, plus the bitmap's words
// times 2 log2(dilationTexels) when the triangles are dilated afterwards.
bool RasterizeChart(const float* uv, const uint32_t* triangles, uint32_t count, const float* outline, uint32_t segments,
                    const RasterPose& pose, uint32_t maxTexels, ChartRaster* raster);

// The longest run of set bits in row[0 .. words), as its first and last bit; 0 when none is set.
uint32_t LongestSetRun(const uint64_t* row, uint32_t words, uint32_t* first, uint32_t* last);
