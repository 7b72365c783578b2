#include "HermitianSolver.h"

#include "UnwrapMath.h"
#include "WinImports.h"

namespace
{
    // The preconditioner M = (D + L) D^-1 (D + L^H), L the strict lower part of H (pins' rows and
    // columns left out), D real and diagonal. Both triangular factors are H's own rows (sorted by
    // column: the lower entries come first), so only D is stored.
    struct SplitSystem
    {
        const HermitianMatrix& h;
        uint32_t pin0, pin1;
        Scratch<double> d, root;   // D and D^1/2

        bool Pinned(uint32_t i) const { return i == pin0 || i == pin1; }

        // D keeps M's diagonal equal to H's (diagonal ILU): d_i = h_ii - sum_k<i |h_ik|^2 / d_k.
        // A pivot that would not stay clearly positive (obtuse triangles make H no M-matrix) falls
        // back to h_ii, which keeps M positive definite.
        bool Factor()
        {
            uint32_t n = h.n;
            if (!d.Allocate(n + 1ull) || !root.Allocate(n + 1ull))
                return false;
            for (uint32_t i = 0; i < n; ++i)
            {
                double sum = 0;
                for (uint32_t a = h.rowStart[i]; a < h.rowStart[i + 1] && h.entries[a].column < i; ++a)
                {
                    const MatrixEntry& e = h.entries[a];
                    if (!Pinned(e.column))
                        sum += (e.laplace * e.laplace + e.area * e.area) / d[e.column];
                }
                double pivot = h.diag[i] - sum;
                d[i] = Pinned(i) ? 1 : (pivot > 1e-3 * h.diag[i] ? pivot : (h.diag[i] > 0 ? h.diag[i] : 1));
                root[i] = Sqrt(d[i]);
            }
            return true;
        }

        // (u, v) -= the lower (below the diagonal) or upper part of row i times w.
        void SubtractLower(uint32_t i, const double* w, double* u, double* v) const
        {
            for (uint32_t a = h.rowStart[i]; a < h.rowStart[i + 1] && h.entries[a].column < i; ++a)
            {
                const MatrixEntry& e = h.entries[a];
                double wu = w[2 * e.column], wv = w[2 * e.column + 1];
                *u -= e.laplace * wu - e.area * wv;
                *v -= e.area * wu + e.laplace * wv;
            }
        }
        void SubtractUpper(uint32_t i, const double* w, double* u, double* v) const
        {
            for (uint32_t a = h.rowStart[i + 1]; a-- > h.rowStart[i] && h.entries[a].column > i;)
            {
                const MatrixEntry& e = h.entries[a];
                double wu = w[2 * e.column], wv = w[2 * e.column + 1];
                *u -= e.laplace * wu - e.area * wv;
                *v -= e.area * wu + e.laplace * wv;
            }
        }

        // w = (D + L)^-1 s, rows in ascending order; zero at the pins.
        void Forward(const double* s, double* w) const
        {
            for (uint32_t i = 0; i < h.n; ++i)
            {
                double u = s[2 * i], v = s[2 * i + 1];
                SubtractLower(i, w, &u, &v);   // w is zero at the pins
                w[2 * i] = Pinned(i) ? 0 : u / d[i];
                w[2 * i + 1] = Pinned(i) ? 0 : v / d[i];
            }
        }

        // p = r + beta p, then t = (D + L^H)^-1 D^1/2 p, rows in descending order (each p_i is read
        // by its own row only); t is zero at the pins.
        void Backward(const double* r, double beta, double* p, double* t) const
        {
            for (uint32_t i = h.n; i-- > 0;)
            {
                p[2 * i] = r[2 * i] + beta * p[2 * i];
                p[2 * i + 1] = r[2 * i + 1] + beta * p[2 * i + 1];
                double u = root[i] * p[2 * i], v = root[i] * p[2 * i + 1];
                SubtractUpper(i, t, &u, &v);   // row i of L^H is the upper part of H's row i
                t[2 * i] = Pinned(i) ? 0 : u / d[i];
                t[2 * i + 1] = Pinned(i) ? 0 : v / d[i];
            }
        }

        // q = S p with S = D^1/2 (D + L)^-1 H (D + L^H)^-1 D^1/2, the preconditioned matrix, without
        // a product with H (Eisenstat): with t = (D + L^H)^-1 D^1/2 p and H = (D + L) + (D + L^H) -
        // (2 D - diag H), S p = D^1/2 (t + (D + L)^-1 (D^1/2 p - (2 D - diag H) t)). The scalings
        // are done inside the two sweeps, the search direction p is first made r + beta p there,
        // and p . q is summed as q is made. s: scratch.
        double Apply(const double* r, double beta, double* p, double* q, double* t, double* s) const
        {
            Backward(r, beta, p, t);
            double pq = 0;
            for (uint32_t i = 0; i < h.n; ++i)   // s = (D + L)^-1 (D^1/2 p - (2 D - diag H) t), q
            {
                double k = 2 * d[i] - h.diag[i];
                double u = root[i] * p[2 * i] - k * t[2 * i], v = root[i] * p[2 * i + 1] - k * t[2 * i + 1];
                SubtractLower(i, s, &u, &v);
                s[2 * i] = Pinned(i) ? 0 : u / d[i];
                s[2 * i + 1] = Pinned(i) ? 0 : v / d[i];
                q[2 * i] = Pinned(i) ? 0 : root[i] * (t[2 * i] + s[2 * i]);
                q[2 * i + 1] = Pinned(i) ? 0 : root[i] * (t[2 * i + 1] + s[2 * i + 1]);
                pq += p[2 * i] * q[2 * i];
                pq += p[2 * i + 1] * q[2 * i + 1];
            }
            return pq;
        }
    };

    double DotN(const double* a, const double* b, uint64_t n)
    {
        double sum = 0;
        for (uint64_t i = 0; i < n; ++i)
            sum += a[i] * b[i];
        return sum;
    }
}

uint32_t SolvePinned(const HermitianMatrix& h, double* x, uint32_t pin0, uint32_t pin1, const SolveControl& control)
{
    uint32_t n = h.n;
    uint64_t m = 2ull * n;
    SplitSystem system = {h, pin0, pin1, {}, {}};
    Scratch<double> y, r, p, q, t, w;
    if (!system.Factor() || !y.Allocate(m) || !r.Allocate(m) || !p.Allocate(m) || !q.Allocate(m) || !t.Allocate(m) ||
        !w.Allocate(m))
        return kSolveOutOfMemory;
    // The residual of the start, -H x at the free unknowns, carried into the split system:
    // r = D^1/2 (D + L)^-1 (-H x). Its squared norm is the residual's M^-1 norm.
    h.Multiply(x, w.Data());
    for (uint64_t i = 0; i < m; ++i)
        w[i] = -w[i];
    system.Forward(w.Data(), r.Data());
    double floor = 0;
    for (uint32_t i = 0; i < n; ++i)
    {
        r[2 * i] *= system.root[i];
        r[2 * i + 1] *= system.root[i];
        double component = control.resolution * h.diag[i];
        floor += system.Pinned(i) ? 0 : 2 * component * component / system.d[i];
    }
    double rr = DotN(r.Data(), r.Data(), m);
    double stop = control.relative * rr > floor ? control.relative * rr : floor;
    if (rr <= stop)
        return 0;
    // Conjugate gradients on S y = r from y = 0, the correction of x in split form.
    memset(y.Data(), 0, m * sizeof(double));
    memset(p.Data(), 0, m * sizeof(double));   // the first direction is r itself (beta 0)
    uint32_t it = 0;
    double beta = 0;
    while (it < control.maxIterations)
    {
        ++it;
        double pq = system.Apply(r.Data(), beta, p.Data(), q.Data(), t.Data(), w.Data());
        if (!(pq > 0))
            break;
        double alpha = rr / pq, next = 0;   // one pass: the same sums in the same order
        for (uint64_t i = 0; i < m; ++i)
        {
            y[i] += alpha * p[i];
            r[i] -= alpha * q[i];
            next += r[i] * r[i];
        }
        if (next <= stop)
            break;
        beta = next / rr;
        rr = next;
    }
    // x += (D + L^H)^-1 D^1/2 y (p: scratch)
    system.Backward(y.Data(), 0, p.Data(), t.Data());
    for (uint64_t i = 0; i < m; ++i)
        x[i] += t[i];
    return it;
}
