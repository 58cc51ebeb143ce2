// Band energies around a block, over the dataBuffers or the analysis' own entries.
#include "analysis/bandEnergy.h"

#include <algorithm>

#include "analysis/analysisGeometry.h"
#include "analysis/mainsHum.h"
#include "analysis/recognitionBlocks.h"
#include "analysis/recognitionOptions.h"
#include "store/song.h"

double blockBandEnergy(uint32_t block, double frequency, bool original) {
    const FTDataBuffer& data = original ? blockOrigData(block) : blockData(block);
    double sum = 0.0;
    for (uint32_t i = 0; i < data.nEntries; i++) {
        const FrequencyEntry& e = data.entries[i];
        if (e.amplitude && nearFrequency(e.frequency, frequency, SEMITONE_TOLERANCE) && !isHumFrequency(e.frequency))
            sum += e.amplitude;
    }
    double divisions = analysisGeometry.semitoneDivisions > 1.0 ? analysisGeometry.semitoneDivisions : 1.0;
    return sum / (2.0 * divisions);
}

static double strengthAt(uint32_t block, uint32_t endBlock, double frequency, double halfWidthSeconds,
                         int* largestAmplitude, bool original) {
    const FTBlockWindow& w = ftBlockWindow;
    if (largestAmplitude) *largestAmplitude = 0;
    uint32_t end = std::min({endBlock, w.endBlock, song.blockCount});
    if (block < w.firstBlock || block >= end) return 0.0;
    uint32_t half = uint32_t(blocksForSeconds(halfWidthSeconds));
    uint32_t from = block - w.firstBlock > half ? block - half : w.firstBlock;
    uint32_t to = std::min(end, block + half + 1);
    double divisions = analysisGeometry.semitoneDivisions > 1.0 ? analysisGeometry.semitoneDivisions : 1.0;
    double total = 0.0;
    int largest = 0;
    for (uint32_t b = from; b < to; b++) {
        const FTDataBuffer& data = original ? blockOrigData(b) : blockData(b);
        double sum = 0.0;
        for (uint32_t i = 0; i < data.nEntries; i++) {
            const FrequencyEntry& e = data.entries[i];
            if (!e.amplitude || !nearFrequency(e.frequency, frequency, SEMITONE_TOLERANCE) ||
                isHumFrequency(e.frequency))
                continue;
            sum += e.amplitude;
            if (e.amplitude > largest) largest = e.amplitude;
        }
        total += sum / (2.0 * divisions);
    }
    if (largestAmplitude) *largestAmplitude = largest;
    return total / double(to - from);
}

double noteStrengthAt(uint32_t block, uint32_t endBlock, double frequency, double halfWidthSeconds,
                      int* largestAmplitude) {
    return strengthAt(block, endBlock, frequency, halfWidthSeconds, largestAmplitude, false);
}

double originalStrengthAt(uint32_t block, uint32_t endBlock, double frequency, double halfWidthSeconds,
                          int* largestAmplitude) {
    return strengthAt(block, endBlock, frequency, halfWidthSeconds, largestAmplitude, true);
}
