// Flattens one chart: every corner projected onto the chart plane (an orthonormal basis around
// the chart's area-weighted normal), then the chart turned so that it fits a small rectangle.
#pragma once

#include "ChartMesh.h"

struct ChartBox
{
    double width;    // width >= height
    double height;
};

// Projects the `count` triangles of chart `chart` into outUV (2 floats a corner, in the mesh's
// units), turned to the smallest box among the directions tried and moved so that the box starts
// at (0, 0). Corners with the same vertex index get the same UV. Lists the chart's boundary
// half-edges (no twin, or a twin in another chart) in `boundary`, which has room for 3 * count,
// and their number in *boundaryCount. Returns false when the projection would flip a triangle:
// such a chart must be split.
bool ProjectChart(const ChartMesh& mesh, const uint32_t* chartOf, uint32_t chart, const uint32_t* triangles, uint32_t count,
                  float* outUV, ChartBox* box, uint32_t* boundary, uint32_t* boundaryCount);
