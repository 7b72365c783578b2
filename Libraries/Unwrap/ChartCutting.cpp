#include "ChartCutting.h"

#include "MeshAdjacency.h"
#include "MinHeap.h"
#include "PackOrientation.h"
#include "Scratch.h"
#include "WinImports.h"

namespace
{
    const uint32_t kMaxCuts = 12;
    const uint32_t kMinTriangles = 16;   // smaller charts are never cut
    const uint32_t kMaxPieces = 2;       // pieces a cut leaves (a level whose far side branches is not used)
    const uint32_t kLevels = 6;          // cut levels tried: 1/6 .. 5/6 of the chart's length
    // The share of the charts' boxes' area that the packing covers, for the estimate; charts that
    // fill their box pack about this densely.
    const double kPackDensity = 0.8;
    // A cut must raise the estimated utilization by this factor (n cuts together by its
    // sqrt(n)-th power, see Move): the estimate is rough, and smaller gains often vanish in the
    // packing.
    const double kMinGain = 1.08;
    // Seams cost vertices: a cut must raise the estimate by at least kSeamPrice times the share
    // of the mesh's vertices it splits (a cut that adds 1 % to the vertex split must bring 4 %
    // more utilization), and all cuts together split at most kSeamShare of the vertices.
    const double kSeamPrice = 6;
    const double kSeamShare = 0.06;
    const double kSqrtHalf = 0.70710678118654752;
    const uint32_t kSmoothing = 4;    // passes smoothing a cut (see Sides)
    const uint32_t kMaxGroup = 6;     // charts cut together at most (see BestGroup)

    struct Shape
    {
        double area;   // UV area
        double box;    // area of the minimum-area box
        double need;   // side of the smallest square the box fits, straight or turned by 45 degrees
    };

    struct Plan
    {
        bool done;       // the chart has been planned (whether or not a cut was found)
        uint32_t kind;   // the coordinate cut across (Coordinate)
        double level;    // cut where the coordinate reaches this; plan.pieces == 0: no cut
        uint32_t pieces, seam;
        Shape piece[kMaxPieces];
    };

    struct Range
    {
        uint32_t begin, end;
    };

    // What the packing estimate depends on: the charts' total area and box area, and the two
    // largest square sides needed (so that one chart's need can be left out).
    struct Totals
    {
        double area, box, need1, need2;
        uint32_t needChart;
    };

    // The estimated utilization. A square barely larger than the longest chart's need holds
    // few other charts beside it, so the two bounds on its area add up softly (the root of
    // their squares) rather than the larger one alone deciding.
    double Estimate(double area, double box, double need)
    {
        double byNeed = need * need, byBox = box / kPackDensity;
        double side2 = Sqrt(byNeed * byNeed + byBox * byBox);
        return side2 > 0 ? area / side2 : 0;
    }

    // The natural logarithm of x > 0: x = m 2^k with m in [0.75, 1.5), then the series of
    // 2 artanh((m - 1) / (m + 1)) (no log in the library).
    double Ln(double x)
    {
        const double ln2 = 0.69314718055994531;
        double k = 0;
        for (; x >= 1.5; x *= 0.5)
            k += 1;
        for (; x < 0.75; x *= 2)
            k -= 1;
        double y = (x - 1) / (x + 1), y2 = y * y, term = y, sum = 0;
        for (int i = 1; i < 40; i += 2, term *= y2)
            sum += term / i;
        return k * ln2 + 2 * sum;
    }

    uint32_t Bits(uint8_t mask) { return (mask & 1) + ((mask >> 1) & 1) + ((mask >> 2) & 1) + ((mask >> 3) & 1); }

    uint32_t LowestBit(uint8_t mask) { return mask & 1 ? 0 : (mask & 2 ? 1 : (mask & 4 ? 2 : 3)); }

    class Cutter
    {
    public:
        Cutter(const ChartMesh& mesh, uint32_t* chartOf, const float* uv) : m_Mesh(mesh), m_ChartOf(chartOf), m_UV(uv) {}

        bool Allocate(uint32_t chartCount)
        {
            uint64_t T = m_Mesh.triCount, V = m_Mesh.vertexCount, C = chartCount + kMaxCuts * (kMaxPieces - 1ull);
            m_ChartCount = chartCount;
            return m_Members.Allocate(T) && m_Order.Allocate(T) && m_Queue.Allocate(T) && m_Piece.Allocate(T) &&
                   m_Dist.Allocate(T) && m_Side.Allocate(T) && m_Mask.Allocate(V) && m_Out.Allocate(4 * V) && m_Ranges.Allocate(C + 1) &&
                   m_Shapes.Allocate(C) && m_Turn.Allocate(2 * C) && m_Plans.Allocate(C) && m_Heap.Allocate(1024);
        }

        bool Run(CutStats* stats)
        {
            *stats = {0, 0};
            Group();
            for (uint32_t c = 0; c < m_ChartCount; ++c)
            {
                m_Plans[c].done = false;
                if (!MeasureChart(c))
                    return false;
            }
            uint32_t budget = (uint32_t)(kSeamShare * m_Mesh.vertexCount);
            while (stats->cuts < kMaxCuts)
            {
                Totals totals = Sum();
                uint32_t top[kMaxGroup + 1];
                uint32_t found = TopByNeed(top);
                for (uint32_t c = 0; c < m_ChartCount; ++c)
                    if (!m_Plans[c].done && MayPay(totals, top, found, c) && !MakePlan(c))
                        return false;
                Move move = BestSingle(totals, budget - stats->seamVertices);
                Move group = BestGroup(totals, top, found, budget - stats->seamVertices, kMaxCuts - stats->cuts);
                move = group.score > move.score ? group : move;
                if (move.score < Ln(kMinGain))
                    break;
                for (uint32_t i = 0; i < move.count; ++i)
                {
                    stats->cuts++;
                    stats->seamVertices += m_Plans[move.chart[i]].seam;
                    if (!Apply(move.chart[i]))
                        return false;
                }
            }
            return true;
        }

        uint32_t ChartCount() const { return m_ChartCount; }

    private:
        // Cuts to make together, scored by the logarithm of the estimate's gain over the root of
        // their count: a move is made when the score reaches ln(kMinGain), so n cuts together
        // must raise the estimate by kMinGain^sqrt(n): more than one cut alone, less than n
        // separate ones (cutting one of several equally long charts pays nothing until all of
        // them are cut).
        struct Move
        {
            double score;
            uint32_t count;
            uint32_t chart[kMaxGroup];
        };

        bool Pays(double gain, uint32_t seam) const { return gain - 1 >= kSeamPrice * seam / m_Mesh.vertexCount; }

        bool CanCut(uint32_t c, uint32_t seamLeft) const
        {
            return m_Plans[c].done && m_Plans[c].pieces > 0 && m_Plans[c].seam <= seamLeft;
        }

        // The one cut that raises the estimate most.
        Move BestSingle(const Totals& totals, uint32_t seamLeft) const
        {
            Move best = {0, 0, {}};
            for (uint32_t c = 0; c < m_ChartCount; ++c)
            {
                double gain = CanCut(c, seamLeft) ? Gain(totals, c, m_Plans[c].pieces, m_Plans[c].piece) : 0;
                if (gain > 0 && Ln(gain) > best.score && Pays(gain, m_Plans[c].seam))
                    best = {Ln(gain), 1, {c}};
            }
            return best;
        }

        // Cuts of the charts that need the largest squares, together: when several charts need
        // about the same square (the faces of a blade, the strips of a torus), cutting one of them
        // alone does not lower the largest need, cutting all of them does.
        Move BestGroup(const Totals& totals, const uint32_t* top, uint32_t found, uint32_t seamLeft, uint32_t cutsLeft) const
        {
            Move best = {0, 0, {}};
            double before = Estimate(totals.area, totals.box, totals.need1), box = totals.box, need = 0;
            uint32_t seam = 0;
            for (uint32_t j = 0; j < found && j < kMaxGroup && j < cutsLeft; ++j)
            {
                const Plan& plan = m_Plans[top[j]];
                if (!CanCut(top[j], seamLeft - seam))
                    break;
                seam += plan.seam;
                box -= m_Shapes[top[j]].box;
                for (uint32_t p = 0; p < plan.pieces; ++p)
                {
                    box += plan.piece[p].box;
                    need = plan.piece[p].need > need ? plan.piece[p].need : need;
                }
                double rest = j + 1 < found ? m_Shapes[top[j + 1]].need : 0;
                double gain = Estimate(totals.area, box, need > rest ? need : rest) / before;
                double score = gain > 0 ? Ln(gain) / Sqrt(j + 1.0) : 0;
                if (score > best.score && Pays(gain, seam))
                {
                    best = {score, j + 1, {}};
                    memcpy(best.chart, top, (j + 1) * sizeof(uint32_t));
                }
            }
            return best;
        }

        // The charts needing the largest squares, largest first (lowest number on ties): up to
        // kMaxGroup + 1 of them in top[]; returns how many.
        uint32_t TopByNeed(uint32_t* top) const
        {
            uint32_t found = 0;
            for (; found < kMaxGroup + 1; ++found)
            {
                uint32_t next = kNoChart;
                for (uint32_t c = 0; c < m_ChartCount; ++c)
                {
                    bool taken = false;
                    for (uint32_t i = 0; i < found && !taken; ++i)
                        taken = top[i] == c;
                    if (!taken && (next == kNoChart || m_Shapes[c].need > m_Shapes[next].need))
                        next = c;
                }
                if (next == kNoChart)
                    break;
                top[found] = next;
            }
            return found;
        }

        // Whether cutting chart c could pay: the gain if it filled its box and needed no square
        // of its own, and, when it is among the charts that need the largest squares, they were
        // all cut down to the need of the next one.
        bool MayPay(const Totals& totals, const uint32_t* top, uint32_t found, uint32_t c) const
        {
            double need = c == totals.needChart ? totals.need2 : totals.need1;
            for (uint32_t i = 0; i < found && i < kMaxGroup; ++i)
                if (top[i] == c)
                    need = found > kMaxGroup ? m_Shapes[top[kMaxGroup]].need : 0;
            double before = Estimate(totals.area, totals.box, totals.need1);
            double after = Estimate(totals.area, totals.box - m_Shapes[c].box + m_Shapes[c].area, need);
            return before > 0 && after >= kMinGain * before;
        }

        // Lists the triangles chart by chart (counting sort on chartOf).
        void Group()
        {
            Range* ranges = m_Ranges.Data();
            memset(ranges, 0, (m_ChartCount + 1ull) * sizeof(Range));
            for (uint32_t t = 0; t < m_Mesh.triCount; ++t)
                ++ranges[m_ChartOf[t] + 1].end;
            for (uint32_t c = 0; c < m_ChartCount; ++c)
                ranges[c + 1].end += ranges[c].end;
            for (uint32_t c = 0; c < m_ChartCount; ++c)
                ranges[c].begin = ranges[c].end;
            for (uint32_t t = 0; t < m_Mesh.triCount; ++t)
                m_Members[ranges[m_ChartOf[t]].end++] = t;
        }

        // The shape of triangles[0, count): its box is the smallest of four, turned from the
        // frame (cosine, sine) by 0, 22.5, 45 and 67.5 degrees (a pass over the corners, where
        // the exact minimum-area box would sort them for every trial cut). In a chart's own
        // minimum-area frame the first is that box.
        Shape Measure(const uint32_t* triangles, uint32_t count, double cosine, double sine) const
        {
            const double turnCos[4] = {1, 0.92387953251128676, kSqrtHalf, 0.38268343236508977};
            const double turnSin[4] = {0, 0.38268343236508977, kSqrtHalf, 0.92387953251128676};
            double axisX[4], axisY[4], low[8], high[8], area = 0;
            for (uint32_t k = 0; k < 4; ++k)
            {
                axisX[k] = cosine * turnCos[k] - sine * turnSin[k];
                axisY[k] = sine * turnCos[k] + cosine * turnSin[k];
                low[2 * k] = low[2 * k + 1] = 1e300, high[2 * k] = high[2 * k + 1] = -1e300;
            }
            for (uint32_t i = 0; i < count; ++i)
            {
                const float* p = m_UV + 6ull * triangles[i];
                area += 0.5 * Abs(((double)p[2] - p[0]) * ((double)p[5] - p[1]) - ((double)p[3] - p[1]) * ((double)p[4] - p[0]));
                for (uint32_t c = 0; c < 6; c += 2)
                    for (uint32_t k = 0; k < 4; ++k)
                    {
                        double x = axisX[k] * p[c] - axisY[k] * p[c + 1], y = axisY[k] * p[c] + axisX[k] * p[c + 1];
                        low[2 * k] = x < low[2 * k] ? x : low[2 * k], high[2 * k] = x > high[2 * k] ? x : high[2 * k];
                        low[2 * k + 1] = y < low[2 * k + 1] ? y : low[2 * k + 1];
                        high[2 * k + 1] = y > high[2 * k + 1] ? y : high[2 * k + 1];
                    }
            }
            Shape shape = {area, 1e300, 1e300};
            for (uint32_t k = 0; k < 4 && count; ++k)
            {
                double w = high[2 * k] - low[2 * k], h = high[2 * k + 1] - low[2 * k + 1];
                double longer = w > h ? w : h, shorter = w > h ? h : w;
                double diagonal = (longer + shorter) * kSqrtHalf;
                shape.box = w * h < shape.box ? w * h : shape.box;
                shape.need = diagonal < shape.need ? diagonal : shape.need;
                shape.need = longer < shape.need ? longer : shape.need;
            }
            return count ? shape : Shape{0, 0, 0};
        }

        // Chart c's minimum-area frame (m_Turn) and shape; false when memory runs out.
        bool MeasureChart(uint32_t c)
        {
            const uint32_t* triangles = m_Members.Data() + m_Ranges[c].begin;
            uint32_t count = m_Ranges[c].end - m_Ranges[c].begin;
            if (!MinimumBoxTurn(m_UV, triangles, count, m_Hull, &m_Turn[2 * c], &m_Turn[2 * c + 1]))
                return false;
            m_Shapes[c] = Measure(triangles, count, m_Turn[2 * c], m_Turn[2 * c + 1]);
            return true;
        }

        Totals Sum() const
        {
            Totals totals = {0, 0, 0, 0, kNoChart};
            for (uint32_t c = 0; c < m_ChartCount; ++c)
            {
                const Shape& s = m_Shapes[c];
                totals.area += s.area;
                totals.box += s.box;
                if (s.need > totals.need1)
                    totals.need2 = totals.need1, totals.need1 = s.need, totals.needChart = c;
                else if (s.need > totals.need2)
                    totals.need2 = s.need;
            }
            return totals;
        }

        // The factor by which the estimate rises when chart c is replaced by `pieces`.
        double Gain(const Totals& totals, uint32_t c, uint32_t count, const Shape* pieces) const
        {
            double box = totals.box - m_Shapes[c].box, need = c == totals.needChart ? totals.need2 : totals.need1;
            for (uint32_t i = 0; i < count; ++i)
            {
                box += pieces[i].box;
                need = pieces[i].need > need ? pieces[i].need : need;
            }
            double before = Estimate(totals.area, totals.box, totals.need1);
            return before > 0 ? Estimate(totals.area, box, need) / before : 0;
        }

        double CentreDistance(uint32_t a, uint32_t b) const
        {
            const float* p = m_UV + 6ull * a;
            const float* q = m_UV + 6ull * b;
            double dx = ((double)q[0] + q[2] + q[4] - p[0] - p[2] - p[4]) / 3;
            double dy = ((double)q[1] + q[3] + q[5] - p[1] - p[3] - p[5]) / 3;
            return Sqrt(dx * dx + dy * dy);
        }

        // The chart's triangle linked to half-edge h, else kNoChart.
        uint32_t Neighbour(uint32_t chart, uint32_t h) const
        {
            uint32_t twin = m_Mesh.twin[h];
            return twin != kNoTwin && m_ChartOf[twin / 3] == chart ? twin / 3 : kNoChart;
        }

        bool SamePolygon(uint32_t a, uint32_t b) const { return m_Mesh.srcPoly && m_Mesh.srcPoly[a] == m_Mesh.srcPoly[b]; }

        // Shortest paths from triangle `from` over the chart's linked edges, between triangle
        // centres in UV; triangles of one source polygon are at distance 0 from each other, so
        // no level of the distance separates them. Fills m_Dist for the chart's triangles and
        // returns the farthest (lowest on ties), kNoChart when memory runs out.
        uint32_t Sweep(uint32_t chart, const Range& r, uint32_t from)
        {
            for (uint32_t i = r.begin; i < r.end; ++i)
                m_Dist[m_Members[i]] = 1e300;
            m_Heap.Clear();
            m_Dist[from] = 0;
            uint32_t farthest = from;
            if (!m_Heap.Push({0, from, 0}))
                return kNoChart;
            while (!m_Heap.Empty())
            {
                HeapEntry e = m_Heap.Pop();
                uint32_t t = e.triangle;
                if (e.cost > m_Dist[t])
                    continue;
                if (e.cost > m_Dist[farthest] || (e.cost == m_Dist[farthest] && t < farthest))
                    farthest = t;
                for (uint32_t h = 3 * t; h < 3 * t + 3; ++h)
                {
                    uint32_t u = Neighbour(chart, h);
                    if (u == kNoChart)
                        continue;
                    double d = e.cost + (SamePolygon(t, u) ? 0 : CentreDistance(t, u));
                    if (d < m_Dist[u] && !((m_Dist[u] = d), m_Heap.Push({d, u, 0})))
                        return kNoChart;
                }
            }
            return farthest;
        }

        // m_Side: which side of the level each non-degenerate triangle of the chart lies on, the
        // cut then smoothed: a triangle with two or three linked neighbours on the other side
        // changes sides (kSmoothing passes). On meshes of long thin triangles the level alone
        // zigzags through them and splits several times the vertices a straight cut would.
        void Sides(uint32_t chart, const Range& r, double level)
        {
            for (uint32_t i = r.begin; i < r.end; ++i)
                m_Side[m_Members[i]] = m_Dist[m_Members[i]] < level;
            for (uint32_t pass = 0; pass < kSmoothing; ++pass)
                for (uint32_t i = r.begin; i < r.end; ++i)
                {
                    uint32_t t = m_Members[i], other = 0;
                    for (uint32_t h = 3 * t; h < 3 * t + 3 && !m_Mesh.degenerate[t]; ++h)
                    {
                        uint32_t u = Neighbour(chart, h);
                        other += u != kNoChart && m_Side[u] != m_Side[t];
                    }
                    m_Side[t] = other >= 2 ? !m_Side[t] : m_Side[t];
                }
        }

        // Numbers the connected parts of the chart's non-degenerate triangles on either side of
        // the level (m_Piece); returns how many, or 0 when more than kMaxPieces.
        uint32_t Components(uint32_t chart, const Range& r, double level)
        {
            Sides(chart, r, level);
            for (uint32_t i = r.begin; i < r.end; ++i)
                m_Piece[m_Members[i]] = kNoChart;
            uint32_t pieces = 0;
            for (uint32_t i = r.begin; i < r.end; ++i)
            {
                uint32_t seed = m_Members[i];
                if (m_Mesh.degenerate[seed] || m_Piece[seed] != kNoChart)
                    continue;
                if (pieces == kMaxPieces)
                    return 0;
                uint8_t near = m_Side[seed];
                uint32_t head = 0, tail = 0;
                m_Piece[seed] = pieces;
                m_Queue[tail++] = seed;
                while (head < tail)
                {
                    uint32_t t = m_Queue[head++];
                    for (uint32_t h = 3 * t; h < 3 * t + 3; ++h)
                    {
                        uint32_t u = Neighbour(chart, h);
                        if (u != kNoChart && m_Piece[u] == kNoChart && m_Side[u] == near)
                            m_Piece[u] = pieces, m_Queue[tail++] = u;
                    }
                }
                ++pieces;
            }
            return pieces;
        }

        // Each piece's vertices in m_Mask (bit p for piece p); places the degenerate triangles in
        // a piece that holds all their vertices. False when one has none.
        bool MarkVertices(const Range& r)
        {
            for (uint32_t i = r.begin; i < r.end; ++i)
                for (uint32_t k = 0; k < 3; ++k)
                {
                    uint32_t v = m_Mesh.tri[3ull * m_Members[i] + k];
                    m_Mask[v] = 0;
                    memset(&m_Out[4ull * v], 0, 4);
                }
            for (uint32_t i = r.begin; i < r.end; ++i)
            {
                uint32_t t = m_Members[i];
                for (uint32_t k = 0; k < 3 && !m_Mesh.degenerate[t]; ++k)
                    m_Mask[m_Mesh.tri[3ull * t + k]] |= (uint8_t)(1u << m_Piece[t]);
            }
            for (uint32_t i = r.begin; i < r.end; ++i)
            {
                uint32_t t = m_Members[i];
                if (!m_Mesh.degenerate[t])
                    continue;
                const uint32_t* v = m_Mesh.tri + 3ull * t;
                uint8_t shared = m_Mask[v[0]] & m_Mask[v[1]] & m_Mask[v[2]];
                if (!shared)
                    return false;
                m_Piece[t] = LowestBit(shared);
            }
            return true;
        }

        // False when a piece touches itself (a vertex with two separate fans of it: two boundary
        // edges of the piece leave it) or a cut separates linked triangles of one source polygon.
        bool PiecesSimple(uint32_t chart, const Range& r)
        {
            for (uint32_t i = r.begin; i < r.end; ++i)
            {
                uint32_t t = m_Members[i];
                for (uint32_t h = 3 * t; h < 3 * t + 3 && !m_Mesh.degenerate[t]; ++h)
                {
                    uint32_t u = Neighbour(chart, h);
                    if (u != kNoChart && m_Piece[u] == m_Piece[t])
                        continue;
                    if (u != kNoChart && SamePolygon(t, u))
                        return false;
                    if (++m_Out[4ull * m_Mesh.tri[h] + m_Piece[t]] > 1)
                        return false;
                }
            }
            return true;
        }

        // Cuts chart `chart` at `level` on trial: m_Piece for its triangles and m_Order its
        // triangles piece by piece (piece p at start[p] .. start[p + 1]). Returns the number of
        // pieces, 0 when the cut is not allowed; *seam gets the corners it splits.
        uint32_t Label(uint32_t chart, const Range& r, double level, uint32_t* seam, uint32_t* start)
        {
            uint32_t pieces = Components(chart, r, level);
            if (pieces < 2 || !MarkVertices(r) || !PiecesSimple(chart, r))
                return 0;
            *seam = 0;
            for (uint32_t i = r.begin; i < r.end; ++i)
                for (uint32_t k = 0; k < 3; ++k)
                {
                    uint32_t v = m_Mesh.tri[3ull * m_Members[i] + k];
                    *seam += m_Mask[v] ? Bits(m_Mask[v]) - 1 : 0;
                    m_Mask[v] = 0;
                }
            memset(start, 0, (kMaxPieces + 1) * sizeof(uint32_t));
            for (uint32_t i = r.begin; i < r.end; ++i)
                ++start[m_Piece[m_Members[i]] + 1];
            for (uint32_t p = 0; p < pieces; ++p)
                start[p + 1] += start[p];
            for (uint32_t i = r.begin; i < r.end; ++i)
                m_Order[start[m_Piece[m_Members[i]]]++] = m_Members[i];
            for (uint32_t p = pieces; p > 0; --p)
                start[p] = start[p - 1];
            start[0] = 0;
            return pieces;
        }

        // Fills m_Dist for the chart's triangles with the coordinate that cuts run across, and
        // [*low, *high] with its range: kind 0, the position of the triangle's centre along the
        // long side of the chart's minimum-area box (straight cuts, for straight strips); kind 1,
        // the path distance from one end of the chart (cuts that follow arcs round). False when
        // memory runs out.
        bool Coordinate(uint32_t chart, const Range& r, uint32_t kind, double* low, double* high)
        {
            *low = 1e300, *high = -1e300;
            uint32_t first = kNoChart;
            for (uint32_t i = r.begin; i < r.end && first == kNoChart; ++i)
                first = m_Mesh.degenerate[m_Members[i]] ? kNoChart : m_Members[i];
            if (kind == 1)
            {
                uint32_t end = Sweep(chart, r, first);
                if (end == kNoChart || Sweep(chart, r, end) == kNoChart)
                    return false;
            }
            double cosine = 1, sine = 0;
            if (kind == 0)
                LongAxis(chart, r, &cosine, &sine);
            for (uint32_t i = r.begin; i < r.end; ++i)
            {
                uint32_t t = m_Members[i];
                if (m_Mesh.degenerate[t])
                    continue;
                if (kind == 0)
                {
                    const float* p = m_UV + 6ull * t;
                    m_Dist[t] = (cosine * ((double)p[0] + p[2] + p[4]) - sine * ((double)p[1] + p[3] + p[5])) / 3;
                }
                if (m_Dist[t] < 1e300)
                {
                    *low = m_Dist[t] < *low ? m_Dist[t] : *low;
                    *high = m_Dist[t] > *high ? m_Dist[t] : *high;
                }
            }
            return true;
        }

        // The turn whose u axis runs along the long side of the chart's minimum-area box.
        void LongAxis(uint32_t chart, const Range& r, double* cosine, double* sine) const
        {
            *cosine = m_Turn[2 * chart], *sine = m_Turn[2 * chart + 1];
            double x0 = 1e300, x1 = -1e300, y0 = 1e300, y1 = -1e300;
            for (uint32_t i = r.begin; i < r.end; ++i)
                for (uint32_t k = 0; k < 6; k += 2)
                {
                    const float* p = m_UV + 6ull * m_Members[i] + k;
                    double x = *cosine * p[0] - *sine * p[1], y = *sine * p[0] + *cosine * p[1];
                    x0 = x < x0 ? x : x0, x1 = x > x1 ? x : x1, y0 = y < y0 ? y : y0, y1 = y > y1 ? y : y1;
                }
            if (y1 - y0 > x1 - x0)   // turn a quarter more: the long side along u
            {
                double c = *cosine;
                *cosine = -*sine, *sine = c;
            }
        }

        // The chart's best cut among the coordinates and levels tried, by the estimate for its
        // pieces on their own less the price of their seam (whether the cut pays depends on the
        // other charts, and is decided later); false when memory runs out.
        bool MakePlan(uint32_t chart)
        {
            Plan& plan = m_Plans[chart];
            plan.done = true;
            plan.pieces = 0;
            Range r = m_Ranges[chart];
            uint32_t count = 0;
            for (uint32_t i = r.begin; i < r.end; ++i)
                count += !m_Mesh.degenerate[m_Members[i]];
            if (count < kMinTriangles)
                return true;
            double bestScore = 0;
            for (uint32_t kind = 0; kind < 2; ++kind)
            {
                double low, high;
                if (!Coordinate(chart, r, kind, &low, &high))
                    return false;
                for (uint32_t k = 1; k < kLevels && high > low; ++k)
                {
                    // A level that is not allowed (it would part a degenerate triangle or a source
                    // polygon, or pinch a piece) is moved a little either way.
                    Plan trial = {true, kind, 0, 0, 0, {}};
                    uint32_t start[kMaxPieces + 1];
                    for (uint32_t nudge = 0; nudge < 3 && !trial.pieces; ++nudge)
                    {
                        const double offset[3] = {0, 0.25, -0.25};
                        trial.level = low + (high - low) * (k + offset[nudge]) / kLevels;
                        trial.pieces = Label(chart, r, trial.level, &trial.seam, start);
                    }
                    double box = 0, need = 0;
                    for (uint32_t p = 0; p < trial.pieces; ++p)
                    {
                        trial.piece[p] = Measure(m_Order.Data() + start[p], start[p + 1] - start[p], m_Turn[2 * chart],
                                                 m_Turn[2 * chart + 1]);
                        box += trial.piece[p].box;
                        need = trial.piece[p].need > need ? trial.piece[p].need : need;
                    }
                    double score = trial.pieces ? Estimate(m_Shapes[chart].area, box, need) *
                                                      (1 - kSeamPrice * trial.seam / m_Mesh.vertexCount)
                                                : 0;
                    if (score > bestScore)
                        bestScore = score, plan = trial;
                }
            }
            return true;
        }

        // Makes the planned cut: piece 0 keeps the chart's number, the others take new ones.
        bool Apply(uint32_t chart)
        {
            Plan& plan = m_Plans[chart];
            Range r = m_Ranges[chart];
            uint32_t start[kMaxPieces + 1], seam;
            double low, high;
            if (!Coordinate(chart, r, plan.kind, &low, &high))   // what the plan was made on
                return false;
            uint32_t pieces = Label(chart, r, plan.level, &seam, start);
            memcpy(m_Members.Data() + r.begin, m_Order.Data(), (r.end - r.begin) * sizeof(uint32_t));
            for (uint32_t p = 0; p < pieces; ++p)
            {
                uint32_t id = p == 0 ? chart : m_ChartCount++;
                m_Ranges[id] = {r.begin + start[p], r.begin + start[p + 1]};
                m_Plans[id].done = false;
                for (uint32_t i = m_Ranges[id].begin; i < m_Ranges[id].end; ++i)
                    m_ChartOf[m_Members[i]] = id;
                if (!MeasureChart(id))   // in its own frame now
                    return false;
            }
            return true;
        }

        const ChartMesh& m_Mesh;
        uint32_t* m_ChartOf;
        const float* m_UV;
        uint32_t m_ChartCount = 0;
        Scratch<uint32_t> m_Members, m_Order, m_Queue, m_Piece;
        Scratch<double> m_Dist;
        Scratch<uint8_t> m_Mask, m_Out, m_Side;
        Scratch<Range> m_Ranges;
        Scratch<Shape> m_Shapes;
        Scratch<double> m_Turn;   // 2 a chart: cosine and sine of its minimum-area frame
        Scratch<Plan> m_Plans;
        MinHeap m_Heap;
        HullScratch m_Hull;
    };
}

uint32_t CutCharts(const ChartMesh& mesh, uint32_t chartCount, uint32_t* chartOf, const float* outUV, CutStats* stats)
{
    *stats = {0, 0};
    Cutter cutter(mesh, chartOf, outUV);
    if (!cutter.Allocate(chartCount) || !cutter.Run(stats))
        return kNoChart;
    return cutter.ChartCount();
}
