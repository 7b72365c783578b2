// Stage 2 of the chart unwrapper: segmentation into charts that flatten well.
//
// Input: the prepared mesh (seams cut, MeshPreparation.h) and the rules for growing
// (ChartGrowing.h). Output: chartOf[t] for every triangle, charts numbered 0 .. count-1 in order of
// their lowest triangle; degenerate triangles get kNoChart (stage 3 places them).
// Steps:
//   1. charts grown one after another, each from a triangle the previous ones turned down, so
//      that seeds spread out from where the charts already are;
//   2. a few Lloyd rounds: every chart's proxy normal is fixed to its current mean normal, its
//      seed moved to its innermost triangle (farthest across edges from the chart's boundary),
//      and all charts regrown at once from their seeds; what no chart takes gets charts of its own;
//   3. merging: smallest charts first, a chart joins the neighbour it shares the longest linked
//      boundary with when the union still keeps every normal within the normal limit of the
//      union's mean normal and its curvature and size within the limits, and would not wrap a
//      vertex (the two charts' angles there passing kWrapLimit while the fan stays open, which
//      growing never does either). Seams (unlinked edges) never merge. The flattening checks
//      (stage 3) have the last word on merged charts.
// Cost: O(T log T) a round; memory about 30 bytes a triangle plus the grower's candidate heap.
#pragma once

#include "ChartGrowing.h"

// Returns the number of charts, or kNoChart when scratch memory runs out.
uint32_t SegmentCharts(const ChartMesh& mesh, const GrowRules& rules, uint32_t lloydRounds, uint32_t* chartOf);

// Renumbers charts 0, 1, ... in order of their lowest triangle (entries of kNoChart stay),
// dropping unused numbers; chart numbers on entry are below `limit`. Returns the count, or kNoChart
// when scratch memory runs out.
uint32_t RenumberCharts(uint32_t* chartOf, uint32_t triCount, uint32_t limit);
