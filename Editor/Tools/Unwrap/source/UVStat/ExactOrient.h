#pragma once
// The orientation of three points, exact for every finite double input (float UVs included):
// a floating-point evaluation with a proven error bound, and exact rational arithmetic (GMP)
// for the few cases the bound cannot decide.

namespace UVStat
{
    // +1 when c lies to the left of the directed line a->b, -1 to the right, 0 on it.
    int Orient(double ax, double ay, double bx, double by, double cx, double cy);
}
