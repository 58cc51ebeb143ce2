// The block helpers every recognition pass shares.
#include "analysis/recognitionBlocks.h"

#include "store/song.h"

FTDataBuffer& blockData(uint32_t block) { return ftBlockWindow.dataBuffers[block - ftBlockWindow.firstBlock]; }
FTDataBuffer& blockOrigData(uint32_t block) { return ftBlockWindow.origDataBuffers[block - ftBlockWindow.firstBlock]; }
FTDetectedBuffer& blockDetected(uint32_t block) {
    return ftBlockWindow.detectedFrequenciesBuffers[block - ftBlockWindow.firstBlock];
}

double blockPitch(uint32_t block) {
    const FTDataBuffer& data = blockData(block);
    if (data.nEntries == 0 || data.entries[0].amplitude == 0) return 0.0;
    return data.entries[0].frequency;
}

int blocksForSeconds(double seconds) {
    double d = song.sampleBlockDuration;
    if (!(d > 0.0) || !(seconds > 0.0)) return 0;
    return int(seconds / d + 0.5);
}

int wholeBlocksIn(double seconds) {
    double d = song.sampleBlockDuration;
    if (!(d > 0.0) || !(seconds > 0.0)) return 1;
    int n = int(seconds / d);
    return n < 1 ? 1 : n;
}

uint32_t blockOfSample(uint32_t sample) {
    uint32_t rate = song.waveFormat.samplesPerSec;
    if (rate == 0) return 0;
    return blockAtTime(double(sample) / rate);
}
