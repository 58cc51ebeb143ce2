// The averaged power spectrum: windowed overlapping segments through the real transform,
// their squared magnitudes summed and scaled once at the end.
#include "analysis/vector/spectrum.h"

#include "analysis/vector/elementwise.h"
#include "analysis/vector/fft.h"
#include "analysis/vector/vectorErrors.h"
#include "analysis/vector/vectorTable.h"

float VFp_spectrum(float* Spc, unsigned specsiz, const float* X, unsigned xsiz, const float* W) {
    if (Spc == X || Spc == W)
        fatalVectorError("(3) %s: Vectors/matrices must not be identical.\n", "VFp_spectrum");
    // Every caller passes at least one whole segment; fewer samples give an empty spectrum
    // instead of a segment read from beyond the end of X.
    if (specsiz == 0 || xsiz / specsiz < 2) {
        VF_equ0(Spc, specsiz);
        return 0;
    }
    unsigned segmentLength = 2 * specsiz;
    unsigned segments = xsiz / specsiz - 1;
    fComplex* work = VCF_vector(segmentLength);   // the segment, then the transform's scratch
    float* segment = &work[0].Re;
    fComplex* scratch = work + specsiz;
    VF_equ0(Spc, specsiz);
    double nyquist = 0;
    for (unsigned m = 0; m < segments; m++) {
        VF_mulV(segment, X + size_t(m) * specsiz, W, segmentLength);
        VF_FFT(segment, segment, segmentLength, 1, scratch);
        Spc[0] += segment[0] * segment[0];
        nyquist += double(segment[1]) * segment[1];
        for (unsigned k = 1; k < specsiz; k++)
            Spc[k] += segment[2 * k] * segment[2 * k] + segment[2 * k + 1] * segment[2 * k + 1];
    }
    float f = float(1.0 / (double(VF_ssq(W, segmentLength)) * segments * specsiz));
    VF_mulC(Spc, Spc, specsiz, f);
    Spc[0] *= 0.5f;
    V_free(work);
    return float(nyquist * f);
}
