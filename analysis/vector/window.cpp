// Hann windows: the first half from the cosine, the second half mirrored from the first so
// that the window is exactly symmetric.
#include "analysis/vector/window.h"

#include <cmath>
#include <numbers>

template <class T>
static void hannWindow(T* W, unsigned n) {
    // The formula divides by n - 1; a single sample passes unchanged instead of becoming NaN.
    if (n == 1) {
        W[0] = 1;
        return;
    }
    for (unsigned i = 0; i <= (n - 1) / 2; i++)
        W[i] = T(0.5 * (1.0 - std::cos(2.0 * std::numbers::pi * i / (n - 1))));
    for (unsigned i = 0; i < n / 2; i++) W[n - 1 - i] = W[i];
}

void VF_Hann(float* W, unsigned n) {
    hannWindow(W, n);
}

void VD_Hann(double* W, unsigned n) {
    hannWindow(W, n);
}
