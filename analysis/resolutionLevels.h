#pragma once
// The multi-resolution estimate of frequency table creation: up to nine transform lengths,
// each twice the previous, over the same stretch of sound, combined into one grid of fine
// bins with the time resolution of the shortest transform (one sampleBlock) and the
// frequency resolution of the longest (the bin spacing / G). createFrequencyTable runs it
// once per group of G blocks; the result lands in frequencyAnalysis.hiresSpectrum.

#include <cstdint>

// Analyses every level for the group of G blocks that starts at block groupBlock of the
// chunk and combines them into hiresSpectrum rows groupBlock .. groupBlock + G - 1.
void analyseBlockGroup(uint32_t groupBlock);
