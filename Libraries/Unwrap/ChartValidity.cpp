#include "ChartValidity.h"

#include "MeshAdjacency.h"
#include "WinImports.h"

namespace
{
    const double kPi = 3.14159265358979323846;

    struct Point
    {
        double x, y;
    };

    Point UV(const FlatChart& flat, uint32_t i) { return {flat.uv[2 * i], flat.uv[2 * i + 1]}; }
    double Orient(Point o, Point p, Point q) { return (p.x - o.x) * (q.y - o.y) - (p.y - o.y) * (q.x - o.x); }

    double UVAngle(Point o, Point p, Point q)
    {
        double ax = p.x - o.x, ay = p.y - o.y, bx = q.x - o.x, by = q.y - o.y;
        return AngleOf(Abs(ax * by - ay * bx), ax * bx + ay * by);
    }

    bool AllFinite(const FlatChart& flat)
    {
        for (uint64_t i = 0; i < 2ull * flat.vertexCount; ++i)
            if (!(flat.uv[i] - flat.uv[i] == 0))
                return false;
        return true;
    }

    bool WithinDistortion(const ChartMesh& mesh, const uint32_t* triangles, uint32_t count, const FlatChart& flat,
                          const DistortionLimits& limits, ChartMeasure* measure)
    {
        double area2 = 0, area3 = 0;
        for (uint32_t i = 0; i < count; ++i)
        {
            const uint32_t* k = &flat.corner[3 * i];
            double a2 = 0.5 * Orient(UV(flat, k[0]), UV(flat, k[1]), UV(flat, k[2]));
            if (!(a2 >= 1e-3 * mesh.area[triangles[i]]))
                return false;
            area2 += a2;
            area3 += mesh.area[triangles[i]];
        }
        double angleSum = 0, areaSum = 0;
        for (uint32_t i = 0; i < count; ++i)
        {
            uint32_t t = triangles[i];
            const uint32_t* k = &flat.corner[3 * i];
            double a2 = 0.5 * Orient(UV(flat, k[0]), UV(flat, k[1]), UV(flat, k[2]));
            double r = (a2 / area2) / (mesh.area[t] / area3);
            areaSum += mesh.area[t] * ((r > 1 ? r : 1 / r) - 1);
            double angles = 0;
            for (uint32_t c = 0; c < 3; ++c)
                angles += Abs(UVAngle(UV(flat, k[c]), UV(flat, k[(c + 1) % 3]), UV(flat, k[(c + 2) % 3])) -
                              CornerAngle3(mesh, t, c));
            angleSum += mesh.area[t] * angles / kPi;
        }
        measure->angleDistortion = angleSum / area3;
        measure->areaDistortion = areaSum / area3;
        return measure->angleDistortion <= limits.angle && measure->areaDistortion <= limits.area;
    }

    bool IsBoundary(const ChartMesh& mesh, const uint32_t* chartOf, uint32_t chart, uint32_t h)
    {
        return mesh.twin[h] == kNoTwin || chartOf[mesh.twin[h] / 3] != chart;
    }

    // Fans and boundary vertices; lists the boundary edges in `edges` (3 entries each: its two
    // chart vertices and its triangle). On a failure at a vertex, *seeds gets two of the
    // vertex's chart triangles on either side of the trouble, when the vertex has them.
    bool FansClosed(const ChartMesh& mesh, const uint32_t* chartOf, uint32_t chart, const uint32_t* triangles, uint32_t count,
                    const FlatChart& flat, uint32_t* edges, uint32_t* edgeCount, SplitSeeds* seeds)
    {
        uint32_t n = flat.vertexCount;
        Scratch<double> angleSum;
        Scratch<uint32_t> in, out, firstOut, lastOut, lastIn;
        if (!angleSum.Allocate(n) || !in.Allocate(n) || !out.Allocate(n) || !firstOut.Allocate(n) || !lastOut.Allocate(n) ||
            !lastIn.Allocate(n))
            return false;
        memset(angleSum.Data(), 0, n * sizeof(double));
        memset(in.Data(), 0, n * sizeof(uint32_t));
        memset(out.Data(), 0, n * sizeof(uint32_t));
        memset(firstOut.Data(), 0xFF, n * sizeof(uint32_t));   // kNoChart: no seed
        memset(lastOut.Data(), 0xFF, n * sizeof(uint32_t));
        memset(lastIn.Data(), 0xFF, n * sizeof(uint32_t));
        *edgeCount = 0;
        for (uint32_t i = 0; i < count; ++i)
            for (uint32_t c = 0; c < 3; ++c)
            {
                const uint32_t* k = &flat.corner[3 * i];
                uint32_t a = k[c], b = k[(c + 1) % 3];
                angleSum[a] += UVAngle(UV(flat, a), UV(flat, b), UV(flat, k[(c + 2) % 3]));
                if (IsBoundary(mesh, chartOf, chart, 3 * triangles[i] + c))
                {
                    firstOut[a] = out[a] == 0 ? triangles[i] : firstOut[a];
                    lastOut[a] = triangles[i];
                    lastIn[b] = triangles[i];
                    ++out[a];
                    ++in[b];
                    uint32_t* e = edges + 3 * *edgeCount;
                    e[0] = a;
                    e[1] = b;
                    e[2] = triangles[i];
                    ++*edgeCount;
                }
            }
        for (uint32_t v = 0; v < n; ++v)
        {
            bool inside = in[v] == 0 && out[v] == 0;
            if (inside ? Abs(angleSum[v] - 2 * kPi) < 1 : (in[v] == 1 && out[v] == 1 && angleSum[v] < 2 * kPi - 1e-6))
                continue;
            // Pinched: two of its fans; wrapped: the two triangles on either side of the opening.
            if (!inside)
                *seeds = {firstOut[v], out[v] > 1 ? lastOut[v] : lastIn[v]};
            return false;
        }
        return true;
    }

    double PointSegment(Point p, Point a, Point b)
    {
        double abx = b.x - a.x, aby = b.y - a.y, apx = p.x - a.x, apy = p.y - a.y;
        double length2 = abx * abx + aby * aby;
        double s = length2 > 0 ? (apx * abx + apy * aby) / length2 : 0;
        s = s < 0 ? 0 : (s > 1 ? 1 : s);
        double dx = apx - s * abx, dy = apy - s * aby;
        return Sqrt(dx * dx + dy * dy);
    }

    bool TooClose(Point p, Point q, Point r, Point s, double tolerance)
    {
        double d1 = Orient(p, q, r), d2 = Orient(p, q, s), d3 = Orient(r, s, p), d4 = Orient(r, s, q);
        if (((d1 > 0 && d2 < 0) || (d1 < 0 && d2 > 0)) && ((d3 > 0 && d4 < 0) || (d3 < 0 && d4 > 0)))
            return true;
        return PointSegment(p, r, s) < tolerance || PointSegment(q, r, s) < tolerance || PointSegment(r, p, q) < tolerance ||
               PointSegment(s, p, q) < tolerance;
    }

    struct Grid
    {
        double minX, minY, cell, tolerance;
        uint32_t side;

        uint32_t Cell(double value, double low) const
        {
            double k = (value - low) / cell;
            return k <= 0 ? 0 : (k >= side - 1 ? side - 1 : (uint32_t)k);
        }
        void Range(Point a, Point b, uint32_t* x0, uint32_t* y0, uint32_t* x1, uint32_t* y1) const
        {
            *x0 = Cell((a.x < b.x ? a.x : b.x) - tolerance, minX);
            *x1 = Cell((a.x < b.x ? b.x : a.x) + tolerance, minX);
            *y0 = Cell((a.y < b.y ? a.y : b.y) - tolerance, minY);
            *y1 = Cell((a.y < b.y ? b.y : a.y) + tolerance, minY);
        }
    };

    // The grid over the chart's box, about one cell per boundary edge (at most 1024 x 1024).
    bool MakeGrid(const FlatChart& flat, uint32_t count, Grid* grid)
    {
        double minX = 1e300, minY = 1e300, maxX = -1e300, maxY = -1e300;
        for (uint32_t v = 0; v < flat.vertexCount; ++v)
        {
            Point p = UV(flat, v);
            minX = p.x < minX ? p.x : minX;
            maxX = p.x > maxX ? p.x : maxX;
            minY = p.y < minY ? p.y : minY;
            maxY = p.y > maxY ? p.y : maxY;
        }
        double size = maxX - minX > maxY - minY ? maxX - minX : maxY - minY;
        uint32_t side = (uint32_t)Sqrt((double)count) + 1;
        side = side > 1024 ? 1024 : side;
        *grid = {minX, minY, size / side, 1e-6 * size, side};
        return size > 0;
    }

    // Lists the edges meeting each cell: members[start[c] .. start[c + 1]). False when the lists
    // would pass `budget` entries.
    bool FillGrid(const Grid& grid, const FlatChart& flat, const uint32_t* edges, uint32_t count, uint32_t* start,
                  uint32_t* members, uint64_t budget)
    {
        uint64_t cells = (uint64_t)grid.side * grid.side, total = 0;
        memset(start, 0, (cells + 1) * sizeof(uint32_t));
        for (int pass = 0; pass < 2; ++pass)
        {
            for (uint32_t e = 0; e < count; ++e)
            {
                uint32_t x0, y0, x1, y1;
                grid.Range(UV(flat, edges[3 * e]), UV(flat, edges[3 * e + 1]), &x0, &y0, &x1, &y1);
                for (uint32_t y = y0; y <= y1; ++y)
                    for (uint32_t x = x0; x <= x1; ++x)
                    {
                        if (pass == 0 && ++total > budget)
                            return false;
                        if (pass == 0)
                            ++start[(uint64_t)y * grid.side + x + 1];
                        else
                            members[start[(uint64_t)y * grid.side + x]++] = e;
                    }
            }
            for (uint64_t c = 0; c < cells && pass == 0; ++c)
                start[c + 1] += start[c];
        }
        for (uint64_t c = cells; c > 0; --c)   // the fill moved every start one cell on
            start[c] = start[c - 1];
        start[0] = 0;
        return true;
    }

    double Low(double a, double b, double c, double d)
    {
        double first = a < b ? a : b, second = c < d ? c : d;
        return first > second ? first : second;
    }

    // Compares the boundary edges that share a grid cell; each pair only in the cell of the lower
    // left corner of their (widened) boxes' overlap.
    bool BoundarySimple(const FlatChart& flat, const uint32_t* edges, uint32_t count, SplitSeeds* seeds)
    {
        Grid grid;
        if (count < 3)
            return true;
        if (!MakeGrid(flat, count, &grid))
            return false;
        uint64_t cells = (uint64_t)grid.side * grid.side, budget = 64ull * count + 4096;
        Scratch<uint32_t> start, members;
        if (!start.Allocate(cells + 1) || !members.Allocate(budget) ||
            !FillGrid(grid, flat, edges, count, start.Data(), members.Data(), budget))
            return false;
        uint64_t comparisons = 256ull * count + 100000;
        for (uint64_t c = 0; c < cells; ++c)
            for (uint32_t i = start[c]; i < start[c + 1]; ++i)
                for (uint32_t j = i + 1; j < start[c + 1]; ++j)
                {
                    const uint32_t* e = edges + 3 * members[i];
                    const uint32_t* f = edges + 3 * members[j];
                    if (e[0] == f[0] || e[0] == f[1] || e[1] == f[0] || e[1] == f[1])
                        continue;   // edges that follow each other: the fan check covers them
                    Point p = UV(flat, e[0]), q = UV(flat, e[1]), r = UV(flat, f[0]), s = UV(flat, f[1]);
                    double lowX = Low(p.x, q.x, r.x, s.x) - grid.tolerance, lowY = Low(p.y, q.y, r.y, s.y) - grid.tolerance;
                    if ((uint64_t)grid.Cell(lowY, grid.minY) * grid.side + grid.Cell(lowX, grid.minX) != c)
                        continue;
                    if (comparisons-- == 0)
                        return false;
                    if (TooClose(p, q, r, s, grid.tolerance))
                        return (*seeds = {e[2], f[2]}), false;
                }
        return true;
    }
}

bool ChartIsValid(const ChartMesh& mesh, const uint32_t* chartOf, uint32_t chart, const uint32_t* triangles, uint32_t count,
                  const FlatChart& flat, const DistortionLimits& limits, ChartMeasure* measure, SplitSeeds* seeds)
{
    *measure = {0, 0};
    *seeds = {kNoChart, kNoChart};
    if (!AllFinite(flat) || !WithinDistortion(mesh, triangles, count, flat, limits, measure))
        return false;
    Scratch<uint32_t> edges;
    uint32_t edgeCount = 0;
    if (!edges.Allocate(9ull * count) ||
        !FansClosed(mesh, chartOf, chart, triangles, count, flat, edges.Data(), &edgeCount, seeds))
        return false;
    return BoundarySimple(flat, edges.Data(), edgeCount, seeds);
}
