#include "HermitianMatrix.h"

#include "WinImports.h"

bool HermitianMatrix::Start(uint32_t size)
{
    n = size;
    if (!rowStart.Allocate(n + 2ull) || !diag.Allocate(n + 1ull))
        return false;
    memset(rowStart.Data(), 0, (n + 2ull) * sizeof(uint32_t));
    memset(diag.Data(), 0, (n + 1ull) * sizeof(double));
    return true;
}

bool HermitianMatrix::Place()
{
    for (uint32_t i = 0; i < n; ++i)
        rowStart[i + 1] += rowStart[i];
    return entries.Allocate(rowStart[n] + 1ull);
}

bool HermitianMatrix::Finish()
{
    // Put left rowStart[i] at the end of row i: shift back to the starts.
    for (uint32_t i = n; i > 0; --i)
        rowStart[i] = rowStart[i - 1];
    rowStart[0] = 0;
    // Sort every row by column (insertion: rows are short) and sum entries of one column.
    uint32_t out = 0;
    for (uint32_t i = 0; i < n; ++i)
    {
        uint32_t begin = rowStart[i], end = rowStart[i + 1];
        for (uint32_t a = begin + 1; a < end; ++a)
        {
            MatrixEntry e = entries[a];
            uint32_t b = a;
            for (; b > begin && entries[b - 1].column > e.column; --b)
                entries[b] = entries[b - 1];
            entries[b] = e;
        }
        rowStart[i] = out;
        for (uint32_t a = begin; a < end; ++a)
        {
            if (out > rowStart[i] && entries[out - 1].column == entries[a].column)
            {
                entries[out - 1].laplace += entries[a].laplace;
                entries[out - 1].area += entries[a].area;
            }
            else
                entries[out++] = entries[a];
        }
    }
    rowStart[n] = out;
    // Interior edges came twice: about half the room goes back before the solver's arrays come.
    return entries.Grow(out, out + 1ull);
}

void HermitianMatrix::Multiply(const double* x, double* y) const
{
    for (uint32_t i = 0; i < n; ++i)
    {
        double yu = diag[i] * x[2 * i], yv = diag[i] * x[2 * i + 1];
        for (uint32_t a = rowStart[i]; a < rowStart[i + 1]; ++a)
        {
            const MatrixEntry& e = entries[a];
            double u = x[2 * e.column], v = x[2 * e.column + 1];
            yu += e.laplace * u - e.area * v;
            yv += e.area * u + e.laplace * v;
        }
        y[2 * i] = yu;
        y[2 * i + 1] = yv;
    }
}
