// Solves H x = 0 for a HermitianMatrix H that is positive semi-definite and becomes definite once
// two unknowns (the pins) are held at their start values: the conformal energy's system.
//
// Method: conjugate gradients preconditioned by M = (D + L) D^-1 (D + L^H), L the strict lower
// part of H and D the diagonal that keeps M's diagonal equal to H's (diagonal incomplete LU; a
// pivot that would not stay clearly positive falls back to H's diagonal). M needs no factor of its
// own, and the gradients run on the split system D^1/2 (D + L)^-1 H (D + L^H)^-1 D^1/2, whose
// product with a vector costs two triangular sweeps over H and no product with H (Eisenstat's
// trick): a step reads H once where a factored preconditioner reads H and its factor twice.
// Stop: the residual's squared M^-1 norm at most `relative` times the start's, or below that of a
// residual of `resolution` times each row's diagonal (a start already there takes no step), or
// after `maxIterations` steps, or when a step would not lower the energy. Every sum runs in a
// fixed order: the result depends only on the inputs.
// Cost: O(k * nnz) for k steps; memory 8 vectors of the unknowns (16 bytes each), released on
// return.
#pragma once

#include "HermitianMatrix.h"

struct SolveControl
{
    double relative;     // of the start's squared residual norm
    double resolution;   // a residual of about this times each row's diagonal is small enough
    uint32_t maxIterations;
};

const uint32_t kSolveOutOfMemory = 0xFFFFFFFFu;

// x (interleaved pairs) holds the start on entry, pins included, and the solution on return.
// Returns the number of steps taken, or kSolveOutOfMemory.
uint32_t SolvePinned(const HermitianMatrix& h, double* x, uint32_t pin0, uint32_t pin1, const SolveControl& control);
