// Packs chart boxes into the unit square at one common scale (uniform texel density).
//
// Shelf packing: charts sorted by height, tallest first, fill rows from left to right; a chart
// that does not fit the row's remaining width opens a new row above. The scale is the largest one
// (found by bisection) at which every row fits; `margin` separates charts from each other and
// from the square's border.
#pragma once

#include "ChartProjection.h"

struct ChartPlacement
{
    double x, y;   // lower-left corner of the chart's box in the unit square
};

// Fills placements[chartCount] and *scale. False when scratch memory runs out, or when the charts
// do not fit even at scale 0 (too many charts for the margin).
bool PackCharts(const ChartBox* boxes, uint32_t chartCount, double margin, double* scale, ChartPlacement* placements);
