#include "AtlasPacking.h"

#include "ChartPacking.h"
#include "Scratch.h"
#include "WinImports.h"

namespace
{
    // Each chart's bounding box; the chart's corners are moved so that its box starts at (0, 0).
    void SettleCharts(float* uv, const uint32_t* chartOf, uint32_t triCount, uint32_t chartCount, ChartBox* boxes,
                      double* lowU, double* lowV)
    {
        for (uint32_t c = 0; c < chartCount; ++c)
        {
            lowU[c] = lowV[c] = 1e300;
            boxes[c] = {-1e300, -1e300};
        }
        for (uint32_t t = 0; t < triCount; ++t)
            for (uint32_t k = 6 * t; k < 6 * t + 6; k += 2)
            {
                uint32_t c = chartOf[t];
                lowU[c] = uv[k] < lowU[c] ? uv[k] : lowU[c];
                lowV[c] = uv[k + 1] < lowV[c] ? uv[k + 1] : lowV[c];
                boxes[c].width = uv[k] > boxes[c].width ? uv[k] : boxes[c].width;
                boxes[c].height = uv[k + 1] > boxes[c].height ? uv[k + 1] : boxes[c].height;
            }
        for (uint32_t c = 0; c < chartCount; ++c)
            boxes[c] = {boxes[c].width - lowU[c], boxes[c].height - lowV[c]};
    }
}

bool PackAtlas(float* uv, const uint32_t* chartOf, uint32_t triCount, uint32_t chartCount, double margin,
               const char** error)
{
    Scratch<ChartBox> boxes;
    Scratch<double> lowU, lowV;
    Scratch<ChartPlacement> at;
    if (!boxes.Allocate(chartCount) || !lowU.Allocate(chartCount) || !lowV.Allocate(chartCount) ||
        !at.Allocate(chartCount))
        return (*error = "out of memory"), false;
    SettleCharts(uv, chartOf, triCount, chartCount, boxes.Data(), lowU.Data(), lowV.Data());
    double scale = 0;
    if (!PackCharts(boxes.Data(), chartCount, margin, &scale, at.Data()))
        return (*error = "the charts do not fit into the unit square with packMargin between them"), false;
    for (uint32_t t = 0; t < triCount; ++t)
        for (uint32_t k = 6 * t; k < 6 * t + 6; k += 2)
        {
            uint32_t c = chartOf[t];
            double u = at[c].x + scale * (uv[k] - lowU[c]), v = at[c].y + scale * (uv[k + 1] - lowV[c]);
            uv[k] = (float)(u < 0 ? 0 : (u > 1 ? 1 : u));
            uv[k + 1] = (float)(v < 0 ? 0 : (v > 1 ? 1 : v));
        }
    return true;
}
