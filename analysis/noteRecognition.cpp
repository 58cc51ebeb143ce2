// The recognition pass over a run of blocks, in its fixed order: hum, the pitch decision,
// sibilants, octave jumps, the detected frequencies, vibrato and glissando, the cleaning
// passes, syllables and the cleaning passes again. Also the block helpers and the band
// energy every pass reads.
#include "analysis/noteRecognition.h"

#include <algorithm>
#include <cmath>

#include "analysis/analysisGeometry.h"
#include "analysis/mainsHum.h"
#include "analysis/noteBuilding.h"
#include "analysis/pitchDecision.h"
#include "analysis/pitchFlattening.h"
#include "analysis/pitchTrackCleaning.h"
#include "analysis/recognitionOptions.h"
#include "analysis/syllables.h"
#include "store/song.h"

RecognitionPass recognitionPass;

void resetNoteRecognition() {
    recognitionPass.firstBlock = recognitionPass.finalBlock = recognitionPass.endBlock = 0;
    std::vector<FrequencyEntry>().swap(recognitionPass.keptPitches);
    clearMainsHum();
    releaseSyllables();
    resetSongInstruments();
}

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

// The blocks the pass decides afresh start again from the entries the analysis made; their
// syllable starts stay until the syllable pass decides them again, because it can do so only
// where the spectrogram still holds rows.
static void restoreBlocks(const RecognitionPass& pass) {
    for (uint32_t b = pass.finalBlock; b < pass.endBlock; b++) {
        FTDataBuffer& data = blockData(b);
        const FTDataBuffer& orig = blockOrigData(b);
        std::copy(orig.entries, orig.entries + orig.nEntries, data.entries);
        data.nEntries = orig.nEntries;
        data.blockFlags = orig.blockFlags & BLOCK_SYLLABLE_START;
    }
}

static void keepPitches(RecognitionPass& pass) {
    pass.keptPitches.assign(pass.endBlock - pass.finalBlock, FrequencyEntry{});
    for (uint32_t b = pass.finalBlock; b < pass.endBlock; b++) {
        const FTDataBuffer& data = blockData(b);
        if (data.nEntries && data.entries[0].amplitude) pass.keptPitches[b - pass.finalBlock] = data.entries[0];
    }
}

static void restoreKeptPitches(const RecognitionPass& pass) {
    for (uint32_t b = pass.finalBlock; b < pass.endBlock; b++) {
        FTDataBuffer& data = blockData(b);
        const FrequencyEntry& kept = pass.keptPitches[b - pass.finalBlock];
        data.nEntries = kept.frequency > 0.0f ? 1 : 0;
        if (data.nEntries) data.entries[0] = kept;
    }
}

static void cleanPitchTrack(const RecognitionPass& pass) {
    const RecognitionOptions& o = recognitionOptions;
    if (o.removeLowAmplitudeNotes) removeLowAmplitudeNotes(pass.finalBlock, pass.endBlock);
    if (o.fitPhrasesToSemitones) fitPhrasesToSemitones(pass.finalBlock, pass.endBlock);
    if (o.refineNoteBoundaries) {
        sharpenTransitions(pass.finalBlock, pass.endBlock);
        bridgeShortDropouts(pass.finalBlock, pass.endBlock);
    }
}

void recognisePitchTrack(uint32_t fromSample, uint32_t toSample) {
    const RecognitionOptions& o = recognitionOptions;
    if (!o.monophonicRecognition) return;
    const FTBlockWindow& w = ftBlockWindow;
    uint32_t end = std::min(w.endBlock, song.blockCount);
    if (end <= w.firstBlock || w.dataBuffers.size() < end - w.firstBlock) return;
    RecognitionPass& pass = recognitionPass;
    pass.firstBlock = std::max(w.firstBlock, blockOfSample(fromSample));
    pass.finalBlock = std::max(pass.firstBlock, blockOfSample(toSample));
    pass.endBlock = end;
    if (pass.finalBlock >= end) return;

    restoreBlocks(pass);
    if (o.mainsHumRemoval) scanMainsHum(end);
    else clearMainsHum();
    decideBlockPitches(pass);
    if (o.appendSibilants) appendSibilants(pass.finalBlock, pass.endBlock);
    if (o.octaveJumpCorrection) correctOctaveJumps(pass.firstBlock, pass.finalBlock, pass.endBlock);
    writeDetectedFrequencies(pass.finalBlock, pass.endBlock);
    if (o.flattenVibrato) flattenVibrato(pass.finalBlock, pass.endBlock);
    if (o.flattenGlissando) flattenGlissando(pass.finalBlock, pass.endBlock);
    keepPitches(pass);
    cleanPitchTrack(pass);
    if (o.findSyllables) {
        findSyllables(pass.finalBlock, pass.endBlock);
        restoreKeptPitches(pass);
        cleanPitchTrack(pass);
    } else {
        releaseSyllables();
    }
}
