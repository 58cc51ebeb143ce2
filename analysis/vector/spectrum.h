#pragma once
// The averaged power spectrum of frequency table creation (power spectrum analysis on).

// Averages the power spectra of the M = xsiz/specsiz - 1 segments of 2*specsiz samples of X,
// each starting specsiz after the last and multiplied by the window W (2*specsiz values).
// Spc (specsiz values) receives bins 0 .. specsiz-1; the power at the Nyquist frequency is
// returned. The scale is 1 / (sum W^2 * M * specsiz), with bin 0 halved.
// Spc the same array as X or W reports "(3) VFp_spectrum: Vectors/matrices must not be
// identical.\n" and ends the process. With xsiz < 2*specsiz there is not one whole segment:
// Spc is zeroed, 0 is returned and X is not read.
float VFp_spectrum(float* Spc, unsigned specsiz, const float* X, unsigned xsiz, const float* W);
