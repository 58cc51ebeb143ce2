// The recognition pass over a run of blocks, in its fixed order: hum, the pitch decision,
// sibilants, octave jumps, the detected frequencies, vibrato and glissando, the cleaning
// passes, syllables and the cleaning passes again.
#include "analysis/noteRecognition.h"

#include <algorithm>

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
