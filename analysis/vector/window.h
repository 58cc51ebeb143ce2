#pragma once
// Symmetric Hann windows for the spectra of frequency table creation and resynthesis.

// W[i] = 0.5 * (1 - cos(2*pi*i/(n-1))) for the first half, mirrored onto the second half:
// W[0] = W[n-1] = 0 and the peak lies at the middle. A window of length 1 is {1}.
void VF_Hann(float* W, unsigned n);
void VD_Hann(double* W, unsigned n);
