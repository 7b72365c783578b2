// Packing, orchestration (the contract is in AtlasPacking.h).
//
// 1. Group the triangles by chart; measure each chart's area and its starting orientation
//    (PackOrientation); find the outline of the charts of many triangles (PackOutline); order
//    the charts largest first.
// 2. For a trial scale, pack every chart (PackRaster, PackPlacement) into a strip as wide as the
//    atlas and twice as high, in each of 8 orientations (the minimum-area box one and its turns by
//    45 degrees; 2 for charts under two texels), keeping the orientation with the lowest top.
//    A trial within 5 % of the scale of the last such search keeps each chart's orientation and
//    draws it once. The trial succeeds when the charts end within the atlas's height.
// 3. Search the largest scale that succeeds: each trial's used height predicts the next scale,
//    bounded by the best success and the smallest failure, until they are within 1 %.
// 4. Packing is not monotonic in the scale (least so with few charts), so up to kExtraCharts
//    charts there is more, within a work budget (Packer::work: as much again as the first search,
//    at most 2 kExtraWork): a second search with the charts ordered by their
//    longest side, then scales in 0.5 % steps above the best, each tried in turn with the two
//    orders and the skyline's two choices (lowest, least waste) until one fits. The largest
//    scale that fitted wins.
// 5. Few large charts (up to kCoarseMaxCharts, or a mesh under kSmallMesh triangles): steps 2 to
//    4 run first on a coarse atlas (CoarseTexels), then the fine atlas climbs from the coarse
//    scale with the coarse winner's orientations and order (ScaleSearch::Climb); steps 2 to 4 on
//    the fine atlas follow except on a small mesh, their optional trials reduced by the work
//    already spent. The largest scale of all wins, with the atlas it was found on.
// 6. Move every corner to its chart's place.
//
// The margin: charts are drawn conservatively and dilated by whole texels covering half the
// margin plus a slack for float rounding, and the atlas bitmap is inset by at least as much from
// the square's border, so charts whose bitmaps share no texel are at least the margin apart and
// from the border (on either atlas). The finished UVs are checked against the border once more.
// Each trial costs the rows of every triangle (or outline edge) in every orientation tried, plus
// the placement searches (bounded, see PackPlacement.h); at most kMaxTrials trials in the first
// search, then the budget of step 4.
#include "AtlasPacking.h"

#include "PackOrientation.h"
#include "PackOutline.h"
#include "PackPlacement.h"
#include "PackRaster.h"
#include "Scratch.h"
#include "UnwrapMath.h"
#include "WinImports.h"

namespace
{
    const char* const kOutOfMemory = "out of memory";
    const char* const kDoesNotFit =
        "the charts do not fit into the unit square with packMargin between them: use a smaller packMargin, or a mesh that "
        "makes fewer charts";
    const int kMaxTrials = 24;
    const uint32_t kExtraCharts = 2000;     // more charts than this: no optional trials
    const uint64_t kExtraWork = 1u << 22;   // the optional trials spend at most twice this (see Packer::work)
    const double kScaleTolerance = 1.01;   // the search stops when success and failure are this close
    // The fine atlas's first step above the coarse atlas's scale: about what its fatter
    // drawing of a chart some kCoarseChartTexels across costs.
    const double kClimbStep = 1.04;
    const int kOrientations = 8;
    // The coarse atlas draws a typical chart about this many texels across, is at least
    // kCoarseMinTexels wide, and is used only when the fine one is kCoarseRatio times as wide.
    const double kCoarseChartTexels = 32;
    const double kCoarseMinTexels = 64;
    const double kCoarseRatio = 3;
    // Below this many triangles the full search on the fine atlas is left out when there is a
    // coarse one (its cost would dwarf the rest of the unwrap), and the coarse search's optional
    // trials get kExtraWorkPerTriangle work units a triangle. Above it, the coarse search is
    // made for at most kCoarseMaxCharts charts.
    const uint32_t kSmallMesh = 1000;
    const uint32_t kExtraWorkPerTriangle = 256;
    const uint32_t kCoarseMaxCharts = 32;
    // Charts of at least this many triangles are drawn from their outline when it is short.
    const uint32_t kOutlineMinTriangles = 16;
    // Added to half the margin: covers the rounding of the final UVs to float (below 1e-7).
    const double kSlack = 1e-6;
    // cos and sin of k * 45 degrees.
    const double kTurnCos[8] = {1, 0.70710678118654752, 0, -0.70710678118654752, -1, -0.70710678118654752, 0, 0.70710678118654752};
    const double kTurnSin[8] = {0, 0.70710678118654752, 1, 0.70710678118654752, 0, -0.70710678118654752, -1, -0.70710678118654752};

    struct ChartInfo
    {
        double area;           // UV area in the input's units
        double extent;         // the larger side of its bounding box
        double cosine, sine;   // the minimum-area box turn
    };

    struct ChartPlace
    {
        double originX, originY;   // q of the chart raster's texel (0, 0)
        uint32_t x, y;             // atlas texel of it
        uint32_t orientation;
    };

    struct Layout
    {
        uint32_t atlasTexels;     // the atlas is atlasTexels wide and high
        double inset;             // from the square's border to the atlas bitmap
        double texel;
        uint32_t dilationTexels;  // dilationTexels * texel >= margin / 2 + kSlack
    };

    // The trial result: all charts placed within `usedRows`, or the share of chart demand placed.
    struct Trial
    {
        bool placedAll;
        uint32_t usedRows;
        double placedShare;
    };

    bool Finite(double v) { return v - v == 0; }

    // The orders tried: largest area first, and longest box side first (long strips then lie
    // side by side before the compact charts fill the gaps).
    enum class Order
    {
        ByArea,
        ByExtent
    };

    // The choices a trial is packed with besides the scale and the orientations.
    struct Variant
    {
        Order order;
        bool minimizeWaste;   // the skyline's choice (see AtlasOccupancy::minimizeWaste)
    };

    // Charts by decreasing key, ties by number: stable LSD radix sort on the float bits, a byte a
    // pass (the count array stays small, so a few charts sort in a few hundred steps).
    bool OrderLargestFirst(const ChartInfo* info, uint32_t n, Order by, uint32_t* order)
    {
        Scratch<uint32_t> keys, other;
        if (!keys.Allocate(n) || !other.Allocate(n))
            return false;
        for (uint32_t c = 0; c < n; ++c)
        {
            float area = (float)(by == Order::ByArea ? info[c].area : info[c].extent);
            uint32_t bits;
            memcpy(&bits, &area, 4);
            keys[c] = 0x7FFFFFFFu - (bits & 0x7FFFFFFFu);
            order[c] = c;
        }
        uint32_t* from = order;
        uint32_t* to = other.Data();
        uint32_t count[257];
        for (int shift = 0; shift < 32; shift += 8)
        {
            memset(count, 0, sizeof(count));
            for (uint32_t i = 0; i < n; ++i)
                ++count[((keys[from[i]] >> shift) & 0xFF) + 1];
            for (uint32_t d = 0; d < 256; ++d)
                count[d + 1] += count[d];
            for (uint32_t i = 0; i < n; ++i)
                to[count[(keys[from[i]] >> shift) & 0xFF]++] = from[i];
            uint32_t* swap = from;
            from = to;
            to = swap;
        }
        return true;   // an even number of passes: the result is back in `order`
    }

    // Outlines of charts (PackOutline.h): chart c's edges are segments[4 start[c] .. 4 start[c + 1]),
    // none for a chart drawn from its triangles.
    struct Outlines
    {
        const float* segments;
        const uint64_t* start;
    };

    class Packer
    {
    public:
        uint64_t work = 0;   // rasterization and search steps so far: bounds the optional trials

        // Whether a trial stops as soon as a chart ends above the atlas (a failure then reports
        // only the share placed, not the height used).
        void SetStopAboveAtlas(bool on) { m_StopAboveAtlas = on; }

        Variant variant = {Order::ByArea, false};   // the charts' order and the skyline's choice

        // Orders the charts (into `order`, which the packer reads) and sets the skyline's choice
        // (see AtlasOccupancy::minimizeWaste; Reset keeps it). False when memory runs out.
        bool SetVariant(Variant to, const ChartInfo* info, uint32_t* order)
        {
            variant = to;
            m_Atlas.minimizeWaste = to.minimizeWaste;
            return OrderLargestFirst(info, m_ChartCount, to.order, order);
        }

        Packer(const float* uv, const uint32_t* start, const uint32_t* members, const Outlines& outlines, const ChartInfo* info,
               const uint32_t* order, uint8_t* turn, uint32_t chartCount, const Layout& layout)
            : m_UV(uv), m_Start(start), m_Members(members), m_Outlines(outlines), m_Info(info), m_Order(order), m_Turn(turn),
              m_ChartCount(chartCount), m_Layout(layout)
        {
        }

        // Packs all charts at `scale` into places[]; false only when memory runs out. With
        // `searchTurns` every orientation is tried; otherwise each chart keeps the orientation
        // it had in the last such trial (the choice hardly changes with small scale steps).
        bool Pack(double scale, bool searchTurns, ChartPlace* places, Trial* trial)
        {
            m_SearchTurns = searchTurns;
            uint32_t n = m_Layout.atlasTexels;
            if (!m_Atlas.Reset(n, 2 * n))
                return false;
            double demand = 0, placed = 0;
            for (uint32_t i = 0; i < m_ChartCount; ++i)
                demand += Demand(m_Order[i], scale);
            for (uint32_t i = 0; i < m_ChartCount; ++i)
            {
                uint32_t c = m_Order[i];
                bool memoryOut = false;
                int best = PlaceBest(c, scale, &places[c], &memoryOut);
                if (memoryOut)
                    return false;
                if (best < 0)
                {
                    *trial = {false, 2 * n, placed / demand};
                    return true;
                }
                placed += Demand(c, scale);
                if (m_StopAboveAtlas && m_Atlas.top > n)
                {
                    *trial = {false, 2 * n, placed / demand};   // cannot fit any more: stop early
                    return true;
                }
            }
            *trial = {true, m_Atlas.top, 1};
            return true;
        }

    private:
        // A chart's share of atlas area, counting its dilation and a texel of rounding.
        double Demand(uint32_t c, double scale) const
        {
            double side = Sqrt(m_Info[c].area) * scale + (2 * m_Layout.dilationTexels + 1) * m_Layout.texel;
            return side * side;
        }

        // Tries the chart's orientations; places it at the best. Returns the orientation, or -1.
        int PlaceBest(uint32_t c, double scale, ChartPlace* place, bool* memoryOut)
        {
            m_HoleBudget = kHoleSearchTrialBudget / m_ChartCount;
            m_HoleBudget = m_HoleBudget < kHoleSearchChartBudget[0] ? kHoleSearchChartBudget[0] : m_HoleBudget;
            m_HoleBudget = m_HoleBudget > kHoleSearchChartBudget[1] ? kHoleSearchChartBudget[1] : m_HoleBudget;
            int64_t budget = m_HoleBudget;
            int best = PlaceInOrientations(c, scale, place, memoryOut);
            work += (uint64_t)(budget - m_HoleBudget);
            return best;
        }

        int PlaceInOrientations(uint32_t c, double scale, ChartPlace* place, bool* memoryOut)
        {
            if (!m_SearchTurns)
                return PlaceTurned(c, scale, (int)m_Turn[c], place, memoryOut);
            int orientations = m_Info[c].extent * scale < 2 * m_Layout.texel ? 2 : kOrientations;
            int step = kOrientations / orientations;
            uint32_t bestTop = kNoTopLimit;
            int best = -1;
            Placement at = {0, 0};
            for (int k = 0; k < kOrientations; k += step)
            {
                ChartRaster& raster = m_Raster[m_Current];
                if (!Draw(c, k, scale, raster))
                {
                    if (raster.outOfMemory)
                        return (*memoryOut = true), -1;
                    continue;   // too large for the atlas in this orientation
                }
                Placement candidate;
                if (!FindPlacement(m_Atlas, raster, bestTop, &candidate, &m_HoleBudget))
                    continue;
                bestTop = candidate.y + raster.height;
                best = k;
                at = candidate;
                m_Current ^= 1;   // keep this raster; draw the next orientation into the other
            }
            if (best < 0)
                return -1;
            const ChartRaster& chosen = m_Raster[m_Current ^ 1];
            PlaceChart(m_Atlas, chosen, at);
            *place = {chosen.originX, chosen.originY, at.x, at.y, (uint32_t)best};
            m_Turn[c] = (uint8_t)best;
            return best;
        }

        // Places the chart in orientation k only. Returns k, or -1 when it does not fit.
        int PlaceTurned(uint32_t c, double scale, int k, ChartPlace* place, bool* memoryOut)
        {
            ChartRaster& raster = m_Raster[0];
            if (!Draw(c, k, scale, raster))
                return (*memoryOut = raster.outOfMemory), -1;
            Placement at;
            if (!FindPlacement(m_Atlas, raster, kNoTopLimit, &at, &m_HoleBudget))
                return -1;
            PlaceChart(m_Atlas, raster, at);
            *place = {raster.originX, raster.originY, at.x, at.y, (uint32_t)k};
            return k;
        }

        // Draws chart c in orientation k, from its outline when it has one, and counts the work
        // (the triangles or edges, the words and the skyline's columns, in the units of the hole
        // budget). False as RasterizeChart.
        bool Draw(uint32_t c, int k, double scale, ChartRaster& raster)
        {
            uint32_t count = m_Start[c + 1] - m_Start[c];
            uint32_t segments = (uint32_t)(m_Outlines.start[c + 1] - m_Outlines.start[c]);
            bool drawn = RasterizeChart(m_UV, m_Members + m_Start[c], count, m_Outlines.segments + 4 * m_Outlines.start[c],
                                        segments, Pose(c, k, scale), m_Layout.atlasTexels, &raster);
            work += (segments ? segments : count) + (uint64_t)raster.words * raster.height + raster.width;
            return drawn;
        }

        RasterPose Pose(uint32_t c, int k, double scale) const
        {
            const ChartInfo& info = m_Info[c];
            return {info.cosine * kTurnCos[k] - info.sine * kTurnSin[k], info.sine * kTurnCos[k] + info.cosine * kTurnSin[k],
                    scale, m_Layout.texel, m_Layout.dilationTexels};
        }

        const float* m_UV;
        const uint32_t* m_Start;
        const uint32_t* m_Members;
        Outlines m_Outlines;
        const ChartInfo* m_Info;
        const uint32_t* m_Order;
        uint8_t* m_Turn;   // each chart's orientation from the last trial that searched them all
        uint32_t m_ChartCount;
        Layout m_Layout;
        AtlasOccupancy m_Atlas;
        ChartRaster m_Raster[2];
        int m_Current = 0;
        bool m_SearchTurns = true;
        bool m_StopAboveAtlas = false;
        int64_t m_HoleBudget = 0;
    };

    // Triangles grouped by chart: members[start[c] .. start[c + 1]).
    bool GroupCharts(const uint32_t* chartOf, uint32_t triCount, uint32_t chartCount, Scratch<uint32_t>& start,
                     Scratch<uint32_t>& members)
    {
        if (!start.Allocate(chartCount + 1ull) || !members.Allocate(triCount ? triCount : 1))
            return false;
        memset(start.Data(), 0, (chartCount + 1ull) * 4);
        for (uint32_t t = 0; t < triCount; ++t)
            ++start[chartOf[t] + 1];
        for (uint32_t c = 0; c < chartCount; ++c)
            start[c + 1] += start[c];
        for (uint32_t t = 0; t < triCount; ++t)
            members[start[chartOf[t]]++] = t;
        for (uint32_t c = chartCount; c > 0; --c)   // the fill moved every start one chart on
            start[c] = start[c - 1];
        start[0] = 0;
        return true;
    }

    bool MeasureCharts(const float* uv, const uint32_t* start, const uint32_t* members, uint32_t chartCount, ChartInfo* info)
    {
        HullScratch hull;
        for (uint32_t c = 0; c < chartCount; ++c)
        {
            double area = 0, minU = 1e300, minV = 1e300, maxU = -1e300, maxV = -1e300;
            for (uint32_t i = start[c]; i < start[c + 1]; ++i)
            {
                const float* p = uv + 6ull * members[i];
                area += Abs((p[2] - p[0]) * (double)(p[5] - p[1]) - (p[4] - p[0]) * (double)(p[3] - p[1])) / 2;
                for (int k = 0; k < 6; k += 2)
                {
                    minU = p[k] < minU ? p[k] : minU, maxU = p[k] > maxU ? p[k] : maxU;
                    minV = p[k + 1] < minV ? p[k + 1] : minV, maxV = p[k + 1] > maxV ? p[k + 1] : maxV;
                }
            }
            info[c].area = area;
            info[c].extent = maxU - minU > maxV - minV ? maxU - minU : maxV - minV;
            if (!MinimumBoxTurn(uv, members + start[c], start[c + 1] - start[c], hull, &info[c].cosine, &info[c].sine))
                return false;
        }
        return true;
    }

    // Outlines for the charts of at least kOutlineMinTriangles whose boundary has at most half as
    // many edges as they have triangles (drawing costs an edge about what it costs a triangle).
    bool BuildOutlines(const float* uv, const uint32_t* start, const uint32_t* members, uint32_t chartCount,
                       Scratch<float>& outline, Scratch<uint64_t>& outlineStart)
    {
        if (!outlineStart.Allocate(chartCount + 1ull))
            return false;
        OutlineScratch scratch;
        uint64_t count = 0, room = 0;
        outlineStart[0] = 0;
        for (uint32_t c = 0; c < chartCount; ++c)
        {
            uint32_t triangles = start[c + 1] - start[c];
            if (triangles >= kOutlineMinTriangles)
            {
                uint64_t before = count;
                bool outOfMemory;
                uint32_t edges = AppendOutline(uv, members + start[c], triangles, scratch, outline, &count, &room, &outOfMemory);
                if (outOfMemory)
                    return false;
                count = 2ull * edges <= triangles ? count : before;
            }
            outlineStart[c + 1] = count;
        }
        return true;
    }

    // The atlas bitmap's side: about 1024 texels, more for many charts (whose dilated outlines
    // then waste less of the margin).
    uint32_t FineTexels(uint32_t chartCount) { return chartCount <= 1000 ? 1024 : (chartCount <= 8000 ? 2048 : 4096); }

    // The atlas bitmap for about `target` texels a side, with the texel chosen so that a whole
    // number of texels covers half the margin; what is left of the square's side goes into the inset.
    Layout ChooseLayout(double margin, uint32_t target)
    {
        double half = margin / 2 + kSlack;
        double plain = (1 - 2 * half) / target;
        Layout layout;
        layout.dilationTexels = half <= plain ? 1 : (uint32_t)(half / plain + 0.5);
        layout.texel = half <= plain ? plain : half / layout.dilationTexels;
        layout.atlasTexels = (uint32_t)((1 - 2 * half) / layout.texel);
        while (layout.atlasTexels * layout.texel > 1 - 2 * half)
            --layout.atlasTexels;
        layout.inset = (1 - layout.atlasTexels * layout.texel) / 2;
        return layout;
    }

    // The coarse atlas's side: about kCoarseChartTexels texels across the charts that hold most
    // of the area (the area-weighted mean side) at `scale`; 0 when that is not below the fine
    // atlas by kCoarseRatio (many or small charts: they go straight to the fine atlas).
    uint32_t CoarseTexels(const ChartInfo* info, uint32_t n, double scale, uint32_t fineTexels)
    {
        double area = 0, weighted = 0;
        for (uint32_t c = 0; c < n; ++c)
            area += info[c].area, weighted += info[c].area * Sqrt(info[c].area);
        if (!(area > 0 && scale > 0))
            return 0;
        double texels = kCoarseChartTexels * area / (scale * weighted);
        texels = texels > kCoarseMinTexels ? texels : kCoarseMinTexels;
        return texels * kCoarseRatio <= fineTexels ? (uint32_t)texels : 0;
    }

    // The first scale to try: the charts' dilated squares fill 65 % of the atlas.
    double FirstScale(const ChartInfo* info, uint32_t n, const Layout& layout)
    {
        double area = 0, roots = 0;
        for (uint32_t c = 0; c < n; ++c)
            area += info[c].area, roots += Sqrt(info[c].area);
        double side = layout.atlasTexels * layout.texel, pad = (2 * layout.dilationTexels + 1) * layout.texel;
        double target = 0.65 * side * side;
        double a = area, b = 2 * pad * roots, c = n * pad * pad - target;
        if (a <= 0)
            return 1;
        double disc = b * b - 4 * a * c;
        double scale = c < 0 ? (-b + Sqrt(disc)) / (2 * a) : 0.01 * Sqrt(target / a);
        return scale > 0 ? scale : 0.01 * Sqrt(target / a);
    }

    // The next scale to try, between the best success `low` (0: none yet) and the smallest
    // failure `high` (0: none yet): the used height predicts the scale that just fits (area
    // goes with the square of the scale); a failure undershoots a little, so that the search
    // approaches from both sides.
    double NextScale(double scale, const Trial& trial, uint32_t atlasTexels, double low, double high)
    {
        double guess;
        if (trial.placedAll && trial.usedRows <= atlasTexels)
        {
            guess = scale * Sqrt((double)atlasTexels / (trial.usedRows ? trial.usedRows : 1));
            guess = guess > scale * kScaleTolerance ? guess : scale * kScaleTolerance;
        }
        else if (trial.placedAll)
            guess = scale * Sqrt((double)atlasTexels / trial.usedRows) * 0.985;
        else
            guess = scale * (trial.placedShare > 0 ? Sqrt(trial.placedShare / 2) : 0.5) * 0.985;
        if (high > 0 && guess >= high)
            guess = low > 0 ? Sqrt(low * high) : high * 0.97;
        if (low > 0 && guess <= low)
            guess = high > 0 ? Sqrt(low * high) : low * kScaleTolerance;
        return guess;
    }

    // The search for the largest scale at which every chart fits; the best layout found by any
    // run is kept in `best` with its scale.
    struct ScaleSearch
    {
        ChartPlace* trialPlaces;
        ChartPlace* best;
        uint32_t chartCount;
        double largest;   // the largest chart extent
        Layout layout;

        Variant bestVariant = {Order::ByArea, false};   // how the best layout was packed

        bool Fits(const Trial& trial) const { return trial.placedAll && trial.usedRows <= layout.atlasTexels; }

        void Keep(const Packer& packer, double scale, double* bestScale)
        {
            *bestScale = scale;
            bestVariant = packer.variant;
            memcpy(best, trialPlaces, (uint64_t)chartCount * sizeof(ChartPlace));
        }

        // Packs at `scale`; a fit above the best scale so far becomes the best. False when
        // memory runs out.
        bool TryScale(Packer& packer, double scale, bool searchTurns, Trial* trial, double* bestScale)
        {
            if (!packer.Pack(scale, searchTurns, trialPlaces, trial))
                return false;
            if (Fits(*trial) && scale > *bestScale)
                Keep(packer, scale, bestScale);
            return true;
        }

        // From `scale`, at most `trials` packs, each used height predicting the next scale;
        // stops when success and failure are within kScaleTolerance or the packer's work reaches
        // workLimit. False when memory runs out.
        bool Run(Packer& packer, double scale, int trials, uint64_t workLimit, double* bestScale)
        {
            double low = 0, high = 0, turnsScale = 0;
            for (int trialNumber = 0; trialNumber < trials && packer.work < workLimit; ++trialNumber)
            {
                Trial trial;
                bool searchTurns = turnsScale == 0 || scale > turnsScale * 1.05 || scale < turnsScale / 1.05;
                turnsScale = searchTurns ? scale : turnsScale;
                if (!TryScale(packer, scale, searchTurns, &trial, bestScale))
                    return false;
                if (Fits(trial))
                    low = scale;
                else
                {
                    high = scale;
                    if (low == 0 && largest * scale < layout.texel / 8)
                        break;   // every chart is already a dot: no smaller scale makes room
                }
                if (low > 0 && high > 0 && high < low * kScaleTolerance)
                    break;
                scale = NextScale(scale, trial, layout.atlasTexels, low, high);
            }
            return true;
        }

        // From `from`, a scale at which the charts fit on a coarser atlas (which draws them
        // fatter): steps of kClimbStep up while they fit, then halves the bracket until success
        // and failure are within kScaleTolerance; at most `trials` packs, every chart in the
        // orientation the packer holds. False when memory runs out.
        bool Climb(Packer& packer, double from, int trials, double* bestScale)
        {
            double low = from, high = 0;
            for (int trialNumber = 0; trialNumber < trials && !(high > 0 && high < low * kScaleTolerance); ++trialNumber)
            {
                double scale = high > 0 ? Sqrt(low * high) : low * kClimbStep;
                Trial trial;
                if (!TryScale(packer, scale, false, &trial, bestScale))
                    return false;
                *(Fits(trial) ? &low : &high) = scale;
            }
            return true;
        }

        // Tries kRefineSteps scales in even steps above `from`, up to kRefineReach times it,
        // every orientation searched, while the work stays below workLimit; keeps the largest
        // that fits. Each scale is tried with the variants in turn (charts' order and the
        // skyline's choice) until one fits: more different layouts for the same work.
        bool Refine(Packer& packer, const ChartInfo* info, uint32_t* order, double from, uint64_t workLimit,
                    double* bestScale)
        {
            const double kRefineReach = 1.12;
            const int kRefineSteps = 24;
            if (from <= 0)
                return true;
            for (int k = 1; k <= kRefineSteps && packer.work < workLimit; ++k)
            {
                double scale = from * (1 + (kRefineReach - 1) * k / kRefineSteps);
                if (scale <= *bestScale)
                    continue;
                for (int variant = 0; variant < 4 && packer.work < workLimit; ++variant)
                {
                    if (!packer.SetVariant({variant & 1 ? Order::ByExtent : Order::ByArea, variant >= 2}, info, order))
                        return false;
                    Trial trial;
                    if (!TryScale(packer, scale, true, &trial, bestScale))
                        return false;
                    if (Fits(trial))
                        break;
                }
            }
            return true;
        }
    };

    // The charts and the working arrays that the searches of every atlas share.
    struct Charts
    {
        const float* uv;
        const uint32_t* start;
        const uint32_t* members;
        const ChartInfo* info;
        uint32_t* order;   // the packing order, rewritten by each variant
        uint8_t* turn;     // each chart's orientation when the turns are not searched
        uint32_t count;
        double largest;    // the largest chart extent
        Outlines outlines;
    };

    // A search's result: the largest scale that fitted (0: none) and the variant it was packed with.
    struct Outcome
    {
        double scale;
        Variant variant;
        uint64_t work;   // what the search cost (Packer::work)
    };

    // The search on one atlas; the places of the largest scale that fits go into `best`.
    // Without a guide: steps 3 and 4 (every orientation, then the other choices within as much
    // work again, less the work `spent` by other searches of the same charts, at most extraCap).
    // With one (a coarser atlas's outcome and places): every chart keeps the
    // guide's orientation and order, and only the scale is searched, from the guide's.
    // False when memory runs out.
    bool SearchAtlas(const Charts& charts, const Layout& layout, ChartPlace* trialPlaces, ChartPlace* best,
                     const Outcome* guide, const ChartPlace* guidePlaces, uint64_t spent, uint64_t extraCap,
                     Outcome* outcome)
    {
        Packer packer(charts.uv, charts.start, charts.members, charts.outlines, charts.info, charts.order, charts.turn,
                      charts.count, layout);
        ScaleSearch search = {trialPlaces, best, charts.count, charts.largest, layout};
        double low = 0;
        if (guide)
        {
            for (uint32_t c = 0; c < charts.count; ++c)
                charts.turn[c] = (uint8_t)guidePlaces[c].orientation;
            packer.SetStopAboveAtlas(true);
            if (!packer.SetVariant(guide->variant, charts.info, charts.order) ||
                !search.Climb(packer, guide->scale, kMaxTrials, &low))
                return false;
            *outcome = {low, search.bestVariant, packer.work};
            return true;
        }
        double first = FirstScale(charts.info, charts.count, layout);
        if (!packer.SetVariant({Order::ByArea, false}, charts.info, charts.order) ||
            !search.Run(packer, first, kMaxTrials, ~0ull, &low))
            return false;
        // Then, within as much work again (at most 2 kExtraWork), the other order and scales above
        // the best found: packing is not monotonic in the scale, least so with few charts.
        // Many charts pack evenly at any scale: they skip it.
        // No floor: a mesh that packed in a few milliseconds never waits for the second search.
        // What other searches of this packing have spent comes out of it.
        uint64_t extraWork =
            charts.count > kExtraCharts ? 0 : (packer.work < 2 * kExtraWork ? packer.work : 2 * kExtraWork);
        extraWork = extraWork > spent ? extraWork - spent : 0;
        extraWork = extraWork < extraCap ? extraWork : extraCap;
        uint64_t limit = packer.work + extraWork;
        packer.SetStopAboveAtlas(true);
        if (!packer.SetVariant({Order::ByExtent, false}, charts.info, charts.order) ||
            !search.Run(packer, low > 0 ? low : first, kMaxTrials, (packer.work + limit) / 2, &low) ||
            !search.Refine(packer, charts.info, charts.order, low, limit, &low))
            return false;
        *outcome = {low, search.bestVariant, packer.work};
        return true;
    }

    void MoveCorners(float* uv, const uint32_t* chartOf, uint32_t triCount, const ChartInfo* info, const ChartPlace* places,
                     double scale, const Layout& layout)
    {
        for (uint32_t t = 0; t < triCount; ++t)
        {
            const ChartInfo& chart = info[chartOf[t]];
            const ChartPlace& place = places[chartOf[t]];
            int k = (int)place.orientation;
            double c = (chart.cosine * kTurnCos[k] - chart.sine * kTurnSin[k]) * scale;
            double s = (chart.sine * kTurnCos[k] + chart.cosine * kTurnSin[k]) * scale;
            double offsetX = layout.inset + place.x * layout.texel, offsetY = layout.inset + place.y * layout.texel;
            for (uint32_t i = 6 * t; i < 6 * t + 6; i += 2)
            {
                double x = c * uv[i] - s * uv[i + 1] - place.originX, y = s * uv[i] + c * uv[i + 1] - place.originY;
                uv[i] = (float)(x + offsetX);
                uv[i + 1] = (float)(y + offsetY);
            }
        }
    }

    // The finished layout keeps the margin to the border (the gaps between charts hold by
    // construction: their bitmaps share no texel).
    bool InsideMargin(const float* uv, uint32_t triCount, double margin)
    {
        for (uint64_t i = 0; i < 6ull * triCount; ++i)
            if (!(uv[i] >= margin && uv[i] <= 1 - margin))
                return false;
        return true;
    }
}

bool PackAtlas(float* uv, const uint32_t* chartOf, uint32_t triCount, uint32_t chartCount, double margin,
               const char** error)
{
    if (!(margin >= 0 && margin < 0.5))
        return (*error = "packMargin must be at least 0 and below 0.5"), false;
    for (uint64_t i = 0; i < 6ull * triCount; ++i)
        if (!Finite(uv[i]))
            return (*error = "a flattened chart has a UV that is not a finite number"), false;
    if (chartCount == 0)
        return true;

    Layout fine = ChooseLayout(margin, FineTexels(chartCount));

    Scratch<uint32_t> start, members, order;
    Scratch<ChartInfo> info;
    Scratch<ChartPlace> trialPlaces, bestPlaces, finePlaces;
    Scratch<uint8_t> turn;
    if (!GroupCharts(chartOf, triCount, chartCount, start, members) || !info.Allocate(chartCount) ||
        !order.Allocate(chartCount) || !trialPlaces.Allocate(chartCount) || !bestPlaces.Allocate(chartCount) ||
        !turn.Allocate(chartCount) || !MeasureCharts(uv, start.Data(), members.Data(), chartCount, info.Data()))
        return (*error = kOutOfMemory), false;

    double largest = 0;
    for (uint32_t c = 0; c < chartCount; ++c)
        largest = info[c].extent > largest ? info[c].extent : largest;
    Scratch<float> outline;
    Scratch<uint64_t> outlineStart;
    if (!BuildOutlines(uv, start.Data(), members.Data(), chartCount, outline, outlineStart))
        return (*error = kOutOfMemory), false;
    Charts charts = {uv,        start.Data(), members.Data(), info.Data(), order.Data(), turn.Data(), chartCount, largest,
                     {outline.Data(), outlineStart.Data()}};
    // Few large charts: the whole search also runs on a coarse atlas (a typical chart some 32
    // texels across, so that a trial costs a small fraction of a fine one in texels; the
    // triangles cost the same), and the fine atlas then climbs from its scale with the coarse
    // winner's orientations and order. The coarse layout is valid in itself (its texels are
    // wider than half the margin). The two searches often find different layouts (packing is
    // far from monotonic), so the larger scale of both wins; on a small mesh (below kSmallMesh
    // triangles) the full fine search, whose trials cost about the atlas's area whatever the
    // input, is left out. Beyond kCoarseMaxCharts charts the coarse search is skipped: many
    // charts pack evenly, and it would mostly add its cost.
    uint32_t coarseTexels = chartCount > kCoarseMaxCharts && triCount >= kSmallMesh
                                ? 0
                                : CoarseTexels(info.Data(), chartCount, FirstScale(info.Data(), chartCount, fine), fine.atlasTexels);
    // On a small mesh the coarse search's optional trials get work in proportion to the input.
    uint64_t smallCap = triCount < kSmallMesh ? (uint64_t)kExtraWorkPerTriangle * triCount : ~0ull;
    Outcome outcome = {0, {Order::ByArea, false}, 0};
    Layout layout = fine;
    uint64_t spent = 0;   // the work of the coarse search and the climb
    if (coarseTexels)
    {
        Layout coarse = ChooseLayout(margin, coarseTexels);
        Outcome coarseOutcome, climbed;
        if (!SearchAtlas(charts, coarse, trialPlaces.Data(), bestPlaces.Data(), nullptr, nullptr, 0, smallCap, &coarseOutcome) ||
            !finePlaces.Allocate(chartCount))
            return (*error = kOutOfMemory), false;
        outcome = coarseOutcome, layout = coarse, spent = coarseOutcome.work;
        if (coarseOutcome.scale > 0)
        {
            if (!SearchAtlas(charts, fine, trialPlaces.Data(), finePlaces.Data(), &coarseOutcome, bestPlaces.Data(), 0, 0,
                             &climbed))
                return (*error = kOutOfMemory), false;
            spent += climbed.work;
            if (climbed.scale > outcome.scale)
            {
                outcome = climbed, layout = fine;
                memcpy(bestPlaces.Data(), finePlaces.Data(), (uint64_t)chartCount * sizeof(ChartPlace));
            }
        }
    }
    if (!coarseTexels || triCount >= kSmallMesh || outcome.scale == 0)
    {
        Outcome full;
        if (!finePlaces.Allocate(chartCount) ||
            !SearchAtlas(charts, fine, trialPlaces.Data(), finePlaces.Data(), nullptr, nullptr, spent, ~0ull, &full))
            return (*error = kOutOfMemory), false;
        if (full.scale > outcome.scale)
        {
            outcome = full, layout = fine;
            memcpy(bestPlaces.Data(), finePlaces.Data(), (uint64_t)chartCount * sizeof(ChartPlace));
        }
    }
    double low = outcome.scale;
    if (low == 0)
        return (*error = kDoesNotFit), false;
    MoveCorners(uv, chartOf, triCount, info.Data(), bestPlaces.Data(), low, layout);
    if (!InsideMargin(uv, triCount, margin))
        return (*error = kDoesNotFit), false;
    return true;
}
