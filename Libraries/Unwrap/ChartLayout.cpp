#include "ChartLayout.h"

#include "UnwrapMath.h"
#include "WinImports.h"

namespace
{
    float Clamp01(float x) { return x < 0 ? 0 : (x > 1 ? 1 : x); }
}

float FlattenTriangle(const float* p0, const float* p1, const float* p2, float* out)
{
    const Vec3 p[3] = {Position(p0, 0), Position(p1, 0), Position(p2, 0)};
    Vec3 edge[3];
    int base = 0;
    for (int i = 0; i < 3; ++i)
    {
        edge[i] = p[(i + 1) % 3] - p[i];
        if (Length(edge[i]) > Length(edge[base]))
            base = i;
    }
    // The longest edge lies on the x axis from corner i to corner j; corner k sits above it.
    int i = base, j = (base + 1) % 3, k = (base + 2) % 3;
    double length = Length(edge[i]);
    double x[3] = {0, 0, 0}, y[3] = {0, 0, 0};
    if (length > 0)
    {
        const Vec3 toK = edge[k] * -1.0;   // from corner i to corner k
        x[j] = length;
        x[k] = Dot(edge[i], toK) / length;
        y[k] = Length(Cross(edge[i], toK)) / length;
    }
    double minX = x[k] < 0 ? x[k] : 0;
    double width = (x[k] > length ? x[k] : length) - minX;
    for (int c = 0; c < 3; ++c)
    {
        out[2 * c] = (float)(x[c] - minX);
        out[2 * c + 1] = (float)y[c];
    }
    return (float)(width > y[k] ? width : y[k]);
}

GridLayout MakeGridLayout(uint32_t chartCount, float packMargin)
{
    GridLayout grid;
    grid.columns = (uint32_t)ceil(sqrt((double)chartCount));
    if (grid.columns == 0)
        grid.columns = 1;
    float limit = 0.5f / (float)(grid.columns + 1);
    grid.margin = packMargin < limit ? packMargin : limit;
    grid.cell = (1.0f - grid.margin * (float)(grid.columns + 1)) / (float)grid.columns;
    return grid;
}

void PlaceChart(const GridLayout& grid, uint32_t index, const float* flat, float scale, float* outUV)
{
    float left = grid.margin + (float)(index % grid.columns) * (grid.cell + grid.margin);
    float bottom = grid.margin + (float)(index / grid.columns) * (grid.cell + grid.margin);
    for (int c = 0; c < 3; ++c)
    {
        outUV[2 * c] = Clamp01(left + flat[2 * c] * scale);
        outUV[2 * c + 1] = Clamp01(bottom + flat[2 * c + 1] * scale);
    }
}
