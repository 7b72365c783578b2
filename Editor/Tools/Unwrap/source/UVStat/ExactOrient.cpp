#include "Editor/Tools/Unwrap/source/UVStat/ExactOrient.h"

#include <cmath>
#include <gmp.h>

namespace UVStat
{
    namespace
    {
        // Error bound of the double evaluation below relative to |left| + |right| (inputs exact,
        // three roundings: the differences, the products and the final subtraction).
        const double kOrientErrorBound = (3.0 + 16.0 * 0x1p-53) * 0x1p-53;

        int OrientExact(double ax, double ay, double bx, double by, double cx, double cy)
        {
            mpq_t v[6], left, right, t;
            const double in[6] = {ax, ay, bx, by, cx, cy};
            for (int i = 0; i < 6; ++i)
            {
                mpq_init(v[i]);
                mpq_set_d(v[i], in[i]);   // exact: a double is a dyadic rational
            }
            mpq_inits(left, right, t, nullptr);
            mpq_sub(left, v[2], v[0]);    // (bx - ax) * (cy - ay)
            mpq_sub(t, v[5], v[1]);
            mpq_mul(left, left, t);
            mpq_sub(right, v[3], v[1]);   // (by - ay) * (cx - ax)
            mpq_sub(t, v[4], v[0]);
            mpq_mul(right, right, t);
            int sign = mpq_cmp(left, right);
            mpq_clears(left, right, t, nullptr);
            for (int i = 0; i < 6; ++i)
                mpq_clear(v[i]);
            return sign > 0 ? 1 : (sign < 0 ? -1 : 0);
        }
    }

    int Orient(double ax, double ay, double bx, double by, double cx, double cy)
    {
        double dxb = bx - ax, dyc = cy - ay, dyb = by - ay, dxc = cx - ax;
        // A difference of two doubles is zero only when they are equal, so a zero factor makes
        // its product exactly zero (a product of non-zero factors may underflow and is not trusted).
        bool leftZero = dxb == 0 || dyc == 0, rightZero = dyb == 0 || dxc == 0;
        if (leftZero && rightZero)
            return 0;
        double left = dxb * dyc, right = dyb * dxc;
        double det = left - right;
        double bound = kOrientErrorBound * (std::fabs(left) + std::fabs(right));
        if (det > bound)
            return 1;
        if (-det > bound)
            return -1;
        return OrientExact(ax, ay, bx, by, cx, cy);
    }
}
