// The layout a run gets with "unwrap-grid" (LibraryBehaviour.h): every triangle a chart of its own,
// flattened at its true shape, all charts at one uniform scale, packed row by row into a square
// grid inside the unit square. The chart layout uses FlattenTriangle for degenerate triangles.
#pragma once

#include <stdint.h>

// Flattens triangle (p0, p1, p2) isometrically: its longest edge on the x axis, the third corner
// above it, moved so that its bounding box starts at (0, 0). Writes 2 floats a corner into `out`
// in the corner order given and returns the larger side of the bounding box. A triangle whose
// corners coincide lands on (0, 0).
float FlattenTriangle(const float* p0, const float* p1, const float* p2, float* out);

struct GridLayout
{
    uint32_t columns;   // the grid is columns x columns cells
    float margin;       // gap around and between cells
    float cell;         // side of one cell
};

// The grid for `chartCount` charts. `packMargin` is kept as long as the cells together still fill
// at least half of the square's side; with more charts the margin shrinks to that bound.
GridLayout MakeGridLayout(uint32_t chartCount, float packMargin);

// Moves chart `index` (6 floats, flattened) into its cell at `scale` and writes it to `outUV`,
// clamped to [0, 1].
void PlaceChart(const GridLayout& grid, uint32_t index, const float* flat, float scale, float* outUV);
