// Stage 3b of the chart unwrapper: the checks a flattened chart must pass, else it is split.
//
// A chart passes when all of these hold (UVs as FlatChart gives them, the chart's UV area equal
// to its 3D area):
//   - every UV is finite;
//   - no triangle flips or collapses: each triangle's signed UV area is at least 1e-3 times its
//     3D area;
//   - angle distortion: the 3D-area-weighted mean over the chart's triangles of
//     sum over corners |UV angle - 3D angle| / pi is at most angleDistortionThreshold;
//   - area distortion: with r = (UV area / chart UV area) / (3D area / chart 3D area) per
//     triangle, the 3D-area-weighted mean of max(r, 1/r) - 1 is at most areaDistortionThreshold;
//   - no fan wraps: the UV angles around a vertex inside the chart sum to 2 pi (within 1 radian),
//     around a boundary vertex to less than 2 pi - 1e-6;
//   - the boundary is simple: every boundary vertex has exactly one boundary edge in and one out
//     (the chart does not touch itself at a vertex), and no two boundary edges that do not
//     follow each other cross, touch or come closer than 1e-6 times the chart's size.
// Without flips these make the map one-to-one. Boundary edges are compared through a uniform grid;
// a chart whose boundary would need more than 256 comparisons an edge fails as well (splitting
// it is cheaper than proving it clean).
// Cost: O(n) for n chart triangles plus the grid; memory about 60 bytes a chart vertex.
#pragma once

#include "ConformalMap.h"

struct DistortionLimits
{
    double angle, area;
};

struct ChartMeasure
{
    double angleDistortion, areaDistortion;
};

// Where to split a chart that failed at one place: two of its triangles on either side of the
// trouble (a wrapped or pinched vertex, two boundary edges too close), kNoChart when the failure
// has no place (distortion).
struct SplitSeeds
{
    uint32_t a, b;
};

// chartOf[t] == chart for the chart's triangles (boundary edges are those whose twin is elsewhere).
// False when the chart fails a check or scratch memory runs out. *measure is filled when the
// chart gets as far as the distortion checks, *seeds on a failure with a place.
bool ChartIsValid(const ChartMesh& mesh, const uint32_t* chartOf, uint32_t chart, const uint32_t* triangles, uint32_t count,
                  const FlatChart& flat, const DistortionLimits& limits, ChartMeasure* measure, SplitSeeds* seeds);
