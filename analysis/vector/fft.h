#pragma once
// Fast Fourier transforms of complex float, complex double and real float arrays, used by
// frequency table creation and resynthesis. The forward transform is
// Y[k] = sum_j X[j] * exp(+2*pi*i*j*k/n); the inverse uses exp(-2*pi*i*j*k/n) and scales by
// 1/n, so applying both returns the input. dir = 1 is forward, dir = -1 inverse (any
// negative odd dir is the inverse). Y and X may be the same array.
//
// Every transform is computed in double precision in a working vector allocated and freed
// around the call; float results are rounded once, on the final store.

#include "analysis/vector/vectorTypes.h"

// Complex transforms of n points. n not a power of 2 reports
// "(8) VCFb_FFT: Size must be an integer power of 2.\n" (VCDb_FFT; VCFs_FFT and VCDs_FFT
// for n < 8) and ends the process.
void VCF_FFT(fComplex* Y, const fComplex* X, unsigned n, int dir);
void VCD_FFT(dComplex* Y, const dComplex* X, unsigned n, int dir);

// Transform of n real floats. Forward (dir >= 0): X holds n reals and Y receives the packed
// spectrum as n/2 pairs (re, im): pair 0 is (DC, Nyquist), pairs 1 .. n/2-1 the complex
// bins. Inverse (dir < 0): X holds a packed spectrum and Y receives the n reals. n must be
// even with n/2 a power of 2, else "(8) VFb_FFT: Size must be an integer power of 2.\n" ends
// the process. scratch (room for n/2 complex floats, or nullptr) is not touched: the
// transform works in its own double-precision vector.
void VF_FFT(float* Y, const float* X, unsigned n, int dir, fComplex* scratch);
