#pragma once
// Twiddle factors of the transforms, kept for the life of the process: one table per
// half-span h = 2^level, shared by every transform size and every thread. Computing them
// once in double precision replaces the per-call trigonometric recurrence, which costs
// time and accumulates rounding error over long spans.

// The table of level: cos(pi*j/h) for j = 0..h-1, followed by sin(pi*j/h) for the same j,
// 64-byte aligned. Built on first use; thread safe. level is 0..30.
const double* fftTwiddles(int level);
