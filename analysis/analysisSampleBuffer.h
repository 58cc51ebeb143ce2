#pragma once
// The song's analysis sample buffer: the samples the opening worker or the recorder hands to
// frequency table creation, one channel, placed on the song's sample positions. The
// spectrogram and the frequency tables read song positions through it; positions it does
// not hold, positions before the song and positions past its known end are silence.

#include <cstdint>

struct AnalysisSampleBuffer {
    const uint8_t* samples;   // 16-bit signed little-endian or 8-bit unsigned samples (the song's size); not owned
    uint32_t sampleCount;     // samples held
    int64_t firstSample;      // song sample position of samples[0]; negative while a lead-in of silence comes first
    int64_t endOfSong;        // song position after the last sample once the source has ended, else -1
};
extern AnalysisSampleBuffer analysisSampleBuffer;

// Points the analysis at sampleCount samples of the song's size that stand for the song
// positions firstSample onwards; endOfSong is -1 until the source is known to end.
void setAnalysisSampleBuffer(const uint8_t* samples, uint32_t sampleCount, int64_t firstSample,
                             int64_t endOfSong = -1);
// Forgets the buffer (the pass has ended).
void clearAnalysisSampleBuffer();

// The song position after the last sample the buffer holds.
int64_t analysisBufferEnd();

// count sample values from song position position on, as signed values (8-bit samples less
// 128), silence where the buffer holds nothing. bitsPerSample is the song's.
void readAnalysisSamples(int64_t position, uint32_t count, int bitsPerSample, double* out);
void readAnalysisSamples(int64_t position, uint32_t count, int bitsPerSample, float* out);
