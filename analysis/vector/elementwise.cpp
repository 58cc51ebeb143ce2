// Element-wise arithmetic. The loops are plain: the compiler unrolls and vectorises them.
#include "analysis/vector/elementwise.h"

#include <bit>
#include <cfloat>
#include <cmath>
#include <cstdint>

#include "analysis/vector/vectorErrors.h"

// Substitute for the square root of a negative number: the quiet NaN with the sign set.
static const float SQRT_DOMAIN_SUBSTITUTE = std::bit_cast<float>(uint32_t(0xFFC00000));

void VF_equ0(float* X, unsigned n) {
    for (unsigned i = 0; i < n; i++) X[i] = 0;
}

void VF_mulV(float* Y, const float* X, const float* W, unsigned n) {
    for (unsigned i = 0; i < n; i++) Y[i] = X[i] * W[i];
}

void VF_mulC(float* Y, const float* X, unsigned n, float c) {
    for (unsigned i = 0; i < n; i++) Y[i] = X[i] * c;
}

float VF_ssq(const float* X, unsigned n) {
    double sum = 0;
    for (unsigned i = 0; i < n; i++) sum += double(X[i]) * X[i];
    return float(sum);
}

void VCF_mulReV(fComplex* Y, const fComplex* X, const float* W, unsigned n) {
    for (unsigned i = 0; i < n; i++) {
        Y[i].Re = X[i].Re * W[i];
        Y[i].Im = X[i].Im * W[i];
    }
}

void VCD_mulReV(dComplex* Y, const dComplex* X, const double* W, unsigned n) {
    for (unsigned i = 0; i < n; i++) {
        Y[i].Re = X[i].Re * W[i];
        Y[i].Im = X[i].Im * W[i];
    }
}

void VF_CtoAbs(float* Y, const fComplex* X, unsigned n) {
    for (unsigned i = 0; i < n; i++) {
        double re = X[i].Re, im = X[i].Im;
        Y[i] = float(std::sqrt(re * re + im * im));
    }
}

int VF_sqrt(float* Y, const float* X, unsigned n) {
    int result = 0;
    for (unsigned i = 0; i < n; i++) {
        if (X[i] < 0) {
            MathErrorRecord record{MATH_DOMAIN, "VF_sqrt", X[i], 0, SQRT_DOMAIN_SUBSTITUTE};
            reportFloatMathError(record);
            Y[i] = SQRT_DOMAIN_SUBSTITUTE;
            result = 1;
        } else {
            Y[i] = std::sqrt(X[i]);
        }
    }
    return result;
}

double cd_abs(dComplex z) {
    double squares = z.Re * z.Re + z.Im * z.Im;
    if (squares <= DBL_MAX && squares >= DBL_MIN) return std::sqrt(squares);
    // The squares left the range: hypot scales, so only a magnitude that truly exceeds the
    // largest double overflows, and tiny components keep their precision.
    double magnitude = std::hypot(z.Re, z.Im);
    if (magnitude > DBL_MAX) {
        MathErrorRecord record{MATH_OVERFLOW, "cd_abs", z.Re, z.Im, DBL_MAX};
        reportComplexDoubleMathError(record);
        return DBL_MAX;
    }
    return magnitude;
}

double cd_arg(dComplex z) {
    return std::atan2(z.Im, z.Re);
}
