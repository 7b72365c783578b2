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

    // The matrix of `count` entries (rows[k], entries[k]) summed; diag starts as `diagonal` (n
    // values; zeros when null) and entries on the diagonal add their real part to it. False when
    // scratch memory runs out.
    bool FromTriplets(uint32_t size, const uint32_t* rows, const MatrixEntry* triplets, uint64_t count,
                      const double* diagonal = nullptr);

    // y = A x (x, y interleaved pairs; they must not alias).
    void Multiply(const double* x, double* y) const;
};
