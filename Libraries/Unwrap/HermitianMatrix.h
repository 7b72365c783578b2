// A sparse complex Hermitian matrix L + iB (L real symmetric, B real skew-symmetric) acting on
// complex vectors stored as interleaved pairs (u, v) = u + iv: the form of the conformal energy,
// whose matrix [[L, -B], [B, L]] on (u, v) is exactly this complex matrix. Rows are compressed:
// row i holds its off-diagonal entries sorted by column; the diagonal (real) is apart.
#pragma once

#include "Scratch.h"

#include <stdint.h>

struct MatrixEntry
{
    uint32_t column;
    double laplace, area;   // real and imaginary part
};

struct HermitianMatrix
{
    uint32_t n = 0;
    Scratch<uint32_t> rowStart;
    Scratch<MatrixEntry> entries;
    Scratch<double> diag;

    // Assembly without a list of triplets (a third of the memory at a chart's peak), in passes
    // over the same off-diagonal entries:
    //   Start(size): no entries, a zero diagonal (callers add to diag directly);
    //   Count(row) for every entry, then Place() to make room;
    //   Put(row, entry) for the same entries, then Finish(): every row sorted by column, entries
    //   of one column summed in the order they were put, and the room of the duplicates given
    //   back. False when scratch memory runs out.
    bool Start(uint32_t size);
    void Count(uint32_t row) { ++rowStart[row + 1]; }
    bool Place();
    void Put(uint32_t row, const MatrixEntry& entry) { entries[rowStart[row]++] = entry; }
    bool Finish();

    // y = A x (x, y interleaved pairs; they must not alias).
    void Multiply(const double* x, double* y) const;
};
