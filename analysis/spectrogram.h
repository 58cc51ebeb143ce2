#pragma once
// The magnitude spectrogram: one row of Nb magnitudes per hop of the song's samples, grown
// chunk by chunk by the analysis and read by note recognition (sibilants, syllable cues).
// Live recording and opening drop the rows recognition no longer needs, so the spectrogram
// stays a few seconds long.

#include <cstdint>
#include <vector>

struct MagnitudeSpectrogram {
    std::vector<uint32_t> magnitudes;   // rowCount rows of binsPerRow magnitudes, oldest first
    uint32_t rowCount;                  // rows held
    uint32_t hop;                       // samples from one row to the next
    uint32_t binsPerRow;                // Nb
    float binWidth;                     // sample rate / 2 / Nb, Hz; magnitude i of a row is bin i + 1
    uint32_t firstRowPosition;          // song sample position of row 0's hop
    uint32_t sampleRate;                // Hz the geometry was set for
    int bitsPerSample;                  // of the song's samples
    std::vector<float> window;          // Hann window of 2 Nb values
};
extern MagnitudeSpectrogram magnitudeSpectrogram;

// Nb and the hop for a sample rate: Nb 512 below 16538 Hz, 1024 below 33075 Hz, 2048 below
// 66150 Hz, else 4096; the hop is the largest power of two not above trunc(rate / 100) + 1,
// at least 4.
uint32_t spectrogramBinsForRate(uint32_t sampleRate);
uint32_t spectrogramHopForRate(uint32_t sampleRate);

// Empties the spectrogram and sets its geometry for the song's rate and sample size
// (setupFrequencyAnalysis calls it). 1; 0 after the memory message (string 10401).
int resetMagnitudeSpectrogram(uint32_t sampleRate, int bitsPerSample);
// Releases the rows and the window (the pass has ended).
void freeMagnitudeSpectrogram();

// Appends rows from the spectrogram's end (firstSample when it is empty) for every whole hop
// that ends a lookahead (the analysis geometry's) before the end of the analysis sample
// buffer, or at the song's end once that is known. Rows whose chunk is silent (below
// 1024 x 2^(bits - 8) after the amplitude boost) are stored as zeros. Returns the index of
// the first row written (the row count when none was), or -1 after the memory message
// (string 10401) when the rows cannot be grown.
int createMagnitudeSpectrogram(uint32_t firstSample);

// Removes the rows whose hop begins before samplePosition: k = min(rows, (position - first
// row position) / hop) rows go, the rest move to the front, and the first row position
// advances by k hops. A position at or before the first row changes nothing.
void dropSpectrogramRowsBefore(uint32_t samplePosition);

// Row r's magnitudes (binsPerRow of them); r must be below rowCount.
const uint32_t* spectrogramRow(uint32_t r);
