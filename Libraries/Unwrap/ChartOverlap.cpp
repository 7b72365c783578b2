#include "ChartOverlap.h"

#include "MeshAdjacency.h"
#include "Scratch.h"
#include "UnwrapMath.h"
#include "WinImports.h"

namespace
{
    const uint64_t kComparisonsPerEdge = 64;
    const uint64_t kStackPerEdge = 16;

    struct Point
    {
        double x, y;
    };

    struct Segment
    {
        Point a, b;
        uint32_t from, to;   // vertex indices
    };

    Segment SegmentOf(const uint32_t* tri, const float* uv, uint32_t h)
    {
        uint32_t next = NextCorner(h);
        return {{uv[2 * h], uv[2 * h + 1]}, {uv[2 * next], uv[2 * next + 1]}, tri[h], tri[next]};
    }

    double Cross(Point o, Point p, Point q) { return (p.x - o.x) * (q.y - o.y) - (p.y - o.y) * (q.x - o.x); }
    double Distance(Point p, Point q) { return Sqrt((p.x - q.x) * (p.x - q.x) + (p.y - q.y) * (p.y - q.y)); }

    // p and q lie strictly on opposite sides of the line through s, by more than `slack`.
    bool Straddles(const Segment& s, Point p, Point q, double slack)
    {
        double length = Distance(s.a, s.b);
        if (length == 0)
            return false;
        double dp = Cross(s.a, s.b, p) / length, dq = Cross(s.a, s.b, q) / length;
        return (dp > slack && dq < -slack) || (dp < -slack && dq > slack);
    }

    // Two edges from the common vertex `p` to q and r run along each other.
    bool RunAlong(Point p, Point q, Point r, double slack)
    {
        double dot = (q.x - p.x) * (r.x - p.x) + (q.y - p.y) * (r.y - p.y);
        double lq = Distance(p, q), lr = Distance(p, r);
        return lq > 0 && lr > 0 && dot > 0 && Abs(Cross(p, q, r)) <= slack * (lq > lr ? lq : lr);
    }

    bool Conflict(const Segment& s, const Segment& t, double slack)
    {
        if (s.from == t.from && s.to == t.to)
            return true;   // both triangles on the same side of one edge
        if (s.from == t.to && s.to == t.from)
            return false;   // on either side of it
        if (s.from == t.from)
            return RunAlong(s.a, s.b, t.b, slack);
        if (s.to == t.to)
            return RunAlong(s.b, s.a, t.a, slack);
        if (s.from == t.to)
            return RunAlong(s.a, s.b, t.a, slack);
        if (s.to == t.from)
            return RunAlong(s.b, s.a, t.b, slack);
        return Straddles(s, t.a, t.b, slack) && Straddles(t, s.a, s.b, slack);
    }

    struct Box
    {
        double minX, minY, maxX, maxY;
    };

    Box BoxOf(const Segment& s)
    {
        return {s.a.x < s.b.x ? s.a.x : s.b.x, s.a.y < s.b.y ? s.a.y : s.b.y, s.a.x < s.b.x ? s.b.x : s.a.x,
                s.a.y < s.b.y ? s.b.y : s.a.y};
    }

    // A square of the quadtree. A point belongs to it when minX <= x < maxX (x <= maxX on the
    // root's right side) and likewise for y, so that every point belongs to exactly one leaf.
    struct Cell
    {
        Box box;
        bool closedRight, closedTop;

        bool HoldsX(double x) const { return x >= box.minX && (x < box.maxX || (closedRight && x <= box.maxX)); }
        bool HoldsY(double y) const { return y >= box.minY && (y < box.maxY || (closedTop && y <= box.maxY)); }
        bool Meets(const Box& b) const
        {
            return b.maxX >= box.minX && (b.minX < box.maxX || (closedRight && b.minX <= box.maxX)) && b.maxY >= box.minY &&
                   (b.minY < box.maxY || (closedTop && b.minY <= box.maxY));
        }
        Cell Quarter(int q) const
        {
            double midX = 0.5 * (box.minX + box.maxX), midY = 0.5 * (box.minY + box.maxY);
            bool right = q & 1, top = q & 2;
            return {{right ? midX : box.minX, top ? midY : box.minY, right ? box.maxX : midX, top ? box.maxY : midY},
                    right && closedRight, top && closedTop};
        }
    };

    const uint32_t kLeafSize = 16;
    const int kMaxDepth = 24;

    struct Search
    {
        const uint32_t* tri;
        const float* uv;
        double slack;
        uint64_t budget;        // comparisons left
        Scratch<uint32_t> stack;   // member lists of the cells on the current path
        uint64_t capacity;

        // Compares the edges of a leaf, each pair only in the leaf holding the lower left corner
        // of their boxes' intersection. False on a conflict or when the budget is spent.
        bool LeafIsClean(const Cell& cell, const uint32_t* members, uint32_t n)
        {
            for (uint32_t i = 0; i < n; ++i)
                for (uint32_t j = i + 1; j < n; ++j)
                {
                    Segment s = SegmentOf(tri, uv, members[i]), t = SegmentOf(tri, uv, members[j]);
                    Box bs = BoxOf(s), bt = BoxOf(t);
                    if (!cell.HoldsX(bs.minX > bt.minX ? bs.minX : bt.minX) || !cell.HoldsY(bs.minY > bt.minY ? bs.minY : bt.minY))
                        continue;
                    if (budget == 0 || Conflict(s, t, slack))
                        return false;
                    --budget;
                }
            return true;
        }

        // The edges stack[begin, begin + n) all meet `cell`. False on a conflict, a spent budget
        // or a full stack.
        bool CellIsClean(const Cell& cell, uint64_t begin, uint32_t n, int depth)
        {
            if (n <= kLeafSize || depth == kMaxDepth)
                return LeafIsClean(cell, stack.Data() + begin, n);
            for (int q = 0; q < 4; ++q)
            {
                Cell quarter = cell.Quarter(q);
                uint64_t childBegin = begin + n;
                uint32_t childCount = 0;
                for (uint32_t i = 0; i < n; ++i)
                    if (quarter.Meets(BoxOf(SegmentOf(tri, uv, stack[begin + i]))))
                    {
                        if (childBegin + childCount == capacity)
                            return false;
                        stack[childBegin + childCount++] = stack[begin + i];
                    }
                if (!CellIsClean(quarter, childBegin, childCount, depth + 1))
                    return false;
            }
            return true;
        }
    };
}

bool BoundaryCrossesItself(const uint32_t* tri, const uint32_t* boundary, uint32_t count, const float* outUV, double width,
                           double height)
{
    if (count < 2)
        return false;
    Search search = {tri, outUV, 1e-6 * (width > height ? width : height), kComparisonsPerEdge * count + 4096, {}, 0};
    search.capacity = kStackPerEdge * count + 64;
    if (!search.stack.Allocate(search.capacity))
        return true;
    memcpy(search.stack.Data(), boundary, count * sizeof(uint32_t));
    double side = width > height ? width : height;
    Cell root = {{0, 0, side, side}, true, true};
    return !search.CellIsClean(root, 0, count, 0);
}
