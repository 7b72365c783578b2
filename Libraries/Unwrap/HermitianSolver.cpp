#include "HermitianSolver.h"

#include "UnwrapMath.h"
#include "WinImports.h"

namespace
{
    // Incomplete Cholesky factor (no fill) of H seen as the complex Hermitian matrix L + iB acting
    // on z = u + iv: H ~ F F^H with F lower triangular on the pattern of H. Rows and columns of the
    // pins are left out (identity). A pivot that would not be positive falls back to the diagonal
    // of H (obtuse triangles make H no M-matrix, so this can happen).
    struct Preconditioner
    {
        const HermitianMatrix* h = nullptr;
        Scratch<double> re, im, pivot;   // re/im aligned with h->entries (lower part used)
        uint32_t pin0 = 0, pin1 = 0;
        // The factor's strictly lower part packed row by row for the solves: (re, im) pairs.
        Scratch<uint32_t> lowerStart, lowerColumn;
        Scratch<double> lower, inversePivot;

        bool Pack()
        {
            uint32_t n = h->n, count = 0;
            for (uint32_t i = 0; i < n; ++i)
                for (uint32_t a = h->rowStart[i]; a < h->rowStart[i + 1] && h->entries[a].column < i; ++a)
                    ++count;
            if (!lowerStart.Allocate(n + 1ull) || !lowerColumn.Allocate(count + 1ull) || !lower.Allocate(2ull * count + 2) ||
                !inversePivot.Allocate(n + 1ull))
                return false;
            uint32_t k = 0;
            for (uint32_t i = 0; i < n; ++i)
            {
                lowerStart[i] = k;
                inversePivot[i] = 1 / pivot[i];
                for (uint32_t a = h->rowStart[i]; a < h->rowStart[i + 1] && h->entries[a].column < i; ++a, ++k)
                {
                    lowerColumn[k] = h->entries[a].column;
                    lower[2ull * k] = re[a];
                    lower[2ull * k + 1] = im[a];
                }
            }
            lowerStart[n] = k;
            re.Release();   // the solves read only the packed factor
            im.Release();
            pivot.Release();
            return true;
        }

        bool Pinned(uint32_t i) const { return i == pin0 || i == pin1; }

        bool Factor(const HermitianMatrix& matrix, uint32_t p0, uint32_t p1)
        {
            h = &matrix;
            pin0 = p0;
            pin1 = p1;
            uint32_t n = matrix.n;
            if (!re.Allocate(matrix.rowStart[n] + 1ull) || !im.Allocate(matrix.rowStart[n] + 1ull) || !pivot.Allocate(n))
                return false;
            for (uint32_t i = 0; i < n; ++i)
            {
                uint32_t begin = matrix.rowStart[i], end = matrix.rowStart[i + 1];
                double sum = 0;
                for (uint32_t a = begin; a < end && matrix.entries[a].column < i; ++a)
                {
                    uint32_t k = matrix.entries[a].column;
                    re[a] = im[a] = 0;
                    if (Pinned(i) || Pinned(k))
                        continue;
                    double sr = matrix.entries[a].laplace, si = matrix.entries[a].area;
                    // minus sum over j < k of F_ij conj(F_kj): merge the two rows' lower parts
                    uint32_t x = begin, y = matrix.rowStart[k];
                    while (x < a && y < matrix.rowStart[k + 1] && matrix.entries[y].column < k)
                    {
                        uint32_t cx = matrix.entries[x].column, cy = matrix.entries[y].column;
                        if (cx < cy)
                            ++x;
                        else if (cy < cx)
                            ++y;
                        else
                        {
                            sr -= re[x] * re[y] + im[x] * im[y];
                            si -= im[x] * re[y] - re[x] * im[y];
                            ++x;
                            ++y;
                        }
                    }
                    re[a] = sr / pivot[k];
                    im[a] = si / pivot[k];
                    sum += re[a] * re[a] + im[a] * im[a];
                }
                double d = matrix.diag[i] - sum;
                pivot[i] = Pinned(i) ? 1 : Sqrt(d > 1e-8 * matrix.diag[i] ? d : (matrix.diag[i] > 0 ? matrix.diag[i] : 1));
            }
            return Pack();
        }

        // z = (F F^H)^-1 r, both interleaved (u, v); z may not alias r.
        void Apply(const double* r, double* z) const
        {
            uint32_t n = h->n;
            for (uint32_t i = 0; i < n; ++i)   // F y = r
            {
                double yr = r[2 * i], yi = r[2 * i + 1];
                for (uint32_t a = lowerStart[i]; a < lowerStart[i + 1]; ++a)
                {
                    uint32_t k = lowerColumn[a];
                    double fr = lower[2ull * a], fi = lower[2ull * a + 1];
                    yr -= fr * z[2 * k] - fi * z[2 * k + 1];
                    yi -= fr * z[2 * k + 1] + fi * z[2 * k];
                }
                z[2 * i] = yr * inversePivot[i];
                z[2 * i + 1] = yi * inversePivot[i];
            }
            for (uint32_t i = n; i-- > 0;)   // F^H z = y, column by column
            {
                double zr = z[2 * i] * inversePivot[i], zi = z[2 * i + 1] * inversePivot[i];
                z[2 * i] = zr;
                z[2 * i + 1] = zi;
                for (uint32_t a = lowerStart[i]; a < lowerStart[i + 1]; ++a)
                {
                    uint32_t k = lowerColumn[a];
                    double fr = lower[2ull * a], fi = lower[2ull * a + 1];
                    z[2 * k] -= fr * zr + fi * zi;
                    z[2 * k + 1] -= fr * zi - fi * zr;
                }
            }
            if (n)
                z[2 * pin0] = z[2 * pin0 + 1] = z[2 * pin1] = z[2 * pin1 + 1] = 0;
        }
    };

    double DotN(const double* a, const double* b, uint64_t n)
    {
        double sum = 0;
        for (uint64_t i = 0; i < n; ++i)
            sum += a[i] * b[i];
        return sum;
    }

    void ClearPins(double* a, uint32_t pin0, uint32_t pin1) { a[2 * pin0] = a[2 * pin0 + 1] = a[2 * pin1] = a[2 * pin1 + 1] = 0; }

    // r = -H x, zero at the pins.
    void Residual(const HermitianMatrix& h, const double* x, double* r, uint32_t pin0, uint32_t pin1)
    {
        h.Multiply(x, r);
        for (uint64_t i = 0; i < 2ull * h.n; ++i)
            r[i] = -r[i];
        ClearPins(r, pin0, pin1);
    }

    // Preconditioned conjugate gradients from x, whose residual r already holds; `stop` is the
    // squared residual norm to reach. Returns the steps taken, or kSolveOutOfMemory.
    uint32_t ConjugateGradients(const HermitianMatrix& h, double* x, double* r, uint32_t pin0, uint32_t pin1, double stop,
                                uint32_t maxIterations)
    {
        uint64_t m = 2ull * h.n;
        Scratch<double> z, p, q;
        Preconditioner incomplete;
        if (!z.Allocate(m) || !p.Allocate(m) || !q.Allocate(m) || !incomplete.Factor(h, pin0, pin1))
            return kSolveOutOfMemory;
        if (DotN(r, r, m) <= stop)
            return 0;
        incomplete.Apply(r, z.Data());
        memcpy(p.Data(), z.Data(), m * sizeof(double));
        double rz = DotN(r, z.Data(), m);
        uint32_t it = 0;
        while (it < maxIterations && rz > 0)
        {
            ++it;
            h.Multiply(p.Data(), q.Data());
            ClearPins(q.Data(), pin0, pin1);
            double pq = DotN(p.Data(), q.Data(), m);
            if (!(pq > 0))
                break;
            double alpha = rz / pq, rr = 0;   // one pass: the same sums in the same order
            for (uint64_t i = 0; i < m; ++i)
            {
                x[i] += alpha * p[i];
                r[i] -= alpha * q[i];
                rr += r[i] * r[i];
            }
            if (rr <= stop)
                break;
            incomplete.Apply(r, z.Data());
            double next = DotN(r, z.Data(), m);
            double beta = next / rz;
            rz = next;
            for (uint64_t i = 0; i < m; ++i)
                p[i] = z[i] + beta * p[i];
        }
        return it;
    }
}

uint32_t SolvePinned(const HermitianMatrix& h, double* x, uint32_t pin0, uint32_t pin1,
                     const SolveControl& control)
{
    uint64_t m = 2ull * h.n;
    Scratch<double> r;
    if (!r.Allocate(m))
        return kSolveOutOfMemory;
    Residual(h, x, r.Data(), pin0, pin1);
    double start = DotN(r.Data(), r.Data(), m);
    double stop = control.relative * start > control.absolute ? control.relative * start : control.absolute;
    if (start <= stop)
        return 0;
    return ConjugateGradients(h, x, r.Data(), pin0, pin1, stop, control.maxIterations);
}
