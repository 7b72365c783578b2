// Solves H x = 0 for a HermitianMatrix H that is positive semi-definite and becomes definite once
// two unknowns (the pins) are held at their start values: the conformal energy's system.
//
// Method: conjugate gradients preconditioned by an incomplete Cholesky factor of H (no fill,
// complex: H ~ F F^H with F lower triangular on H's pattern), from the given x.
// Stop: the squared residual norm |H x|^2 (pins left out) at most `relative` times that of the
// given x, or at most `absolute` (a start already there takes no step), or after `maxIterations`
// steps, or when a step would not lower the energy. Every sum runs in a fixed order: the result
// depends only on the inputs.
// Cost: O(k * nnz) for k steps; memory about 100 bytes an unknown plus the factor (about the
// size of H), released on return.
#pragma once

#include "HermitianMatrix.h"

struct SolveControl
{
    double relative, absolute;   // thresholds on the squared residual norm
    uint32_t maxIterations;
};

const uint32_t kSolveOutOfMemory = 0xFFFFFFFFu;

// x (interleaved pairs) holds the start on entry, pins included, and the solution on return.
// Returns the number of steps taken, or kSolveOutOfMemory.
uint32_t SolvePinned(const HermitianMatrix& h, double* x, uint32_t pin0, uint32_t pin1, const SolveControl& control);
