#pragma once
// Element-wise arithmetic on the library's vectors: clearing, windowing, scaling, sums of
// squares, magnitudes and square roots, and the magnitude and argument of one complex
// double. Used by frequency table creation and resynthesis.

#include "analysis/vector/vectorTypes.h"

void VF_equ0(float* X, unsigned n);                                      // X[i] = 0
void VF_mulV(float* Y, const float* X, const float* W, unsigned n);       // Y[i] = X[i] * W[i]
void VF_mulC(float* Y, const float* X, unsigned n, float c);              // Y[i] = X[i] * c
// Sum of X[i]^2, accumulated in double precision.
float VF_ssq(const float* X, unsigned n);
// Complex times real, component by component: Y[i] = (X[i].Re * W[i], X[i].Im * W[i]).
void VCF_mulReV(fComplex* Y, const fComplex* X, const float* W, unsigned n);
void VCD_mulReV(dComplex* Y, const dComplex* X, const double* W, unsigned n);
// Y[i] = |X[i]|, computed in double precision so that large components do not overflow.
void VF_CtoAbs(float* Y, const fComplex* X, unsigned n);
// Y[i] = sqrt(X[i]); +0 and -0 stay as they are. Returns 0, or 1 when an element was
// negative: that element becomes NaN and "VF_sqrt: DOMAIN error\n" is reported (once until
// another float math error is reported).
int VF_sqrt(float* Y, const float* X, unsigned n);
// |z|. A result beyond the largest double reports "cd_abs: OVERFLOW error\n" (once until
// another complex-double math error is reported) and returns the largest double.
double cd_abs(dComplex z);
// The argument of z, atan2(Im, Re): from -pi to pi, pi on the positive-zero side of the
// negative real axis.
double cd_arg(dComplex z);
