// Note building over the decided pitch track. In monophonic recognition every block holds at
// most one pitch, so the candidates of all semitones never overlap; they are gathered per
// semitone, then appended in time order. The instrument match decides the note's voice (and so
// its duration limits), MIDI program and slot; the track has already decided that a note
// sounds, so a candidate no definition fits still becomes a note of the song's instrument.
#include "analysis/noteBuilding.h"

#include <algorithm>
#include <cmath>
#include <vector>

#include "analysis/analysisGeometry.h"
#include "analysis/bandEnergy.h"
#include "analysis/instrumentDefinitions.h"
#include "analysis/recognitionBlocks.h"
#include "analysis/pitchFlattening.h"
#include "analysis/pitchScale.h"
#include "analysis/recognitionOptions.h"
#include "notes/noteList.h"
#include "store/song.h"

SongInstruments songInstruments;

void resetSongInstruments() {
    songInstruments.count = 0;
    songInstruments.settledVoice = -1;
    for (int i = 0; i < MAX_SONG_INSTRUMENTS; i++) {
        songInstruments.definitions[i] = -1;
        songInstruments.noteCounts[i] = 0;
        songInstruments.strengths[i] = 0.0;
    }
}

double shortestNoteSeconds(int voice, double pitch) {
    if (voice == 52 || voice == 53 || voice == 78) return 0.05;
    if (pitch <= 24.0) return 0.25;
    if (pitch >= 60.0) return 1.0 / 12.0;
    return 0.25 - (0.25 - 1.0 / 12.0) * (pitch - 24.0) / 36.0;
}

double longestSustainSeconds(int voice, double pitch) {
    double longest, shortest;
    if (voice >= 0 && voice <= 5) longest = 10.0, shortest = 5.0;
    else if (voice >= 24 && voice <= 39) longest = 5.0, shortest = 3.0;
    else return 1000.0;
    if (pitch <= 24.0) return longest;
    if (pitch >= 68.0) return shortest;
    return longest - (longest - shortest) * (pitch - 24.0) / 44.0;
}

// ---- note pitch ----

double notePitch(uint32_t first, uint32_t end, double mean) {
    const FTBlockWindow& w = ftBlockWindow;
    end = std::min(end, w.endBlock);
    if (first < w.firstBlock) first = w.firstBlock;
    if (end <= first) return mean > 0.0 ? mean : DEFAULT_MIDDLE_A;
    std::vector<FTDataBuffer> kept(w.dataBuffers.begin() + (first - w.firstBlock), w.dataBuffers.begin() + (end - w.firstBlock));
    for (uint32_t b = first; b < end; b++) {
        FTDataBuffer& data = blockData(b);
        const FTDetectedBuffer& detected = blockDetected(b);
        data.nEntries = detected.nEntries;
        data.blockFlags = 0;
        for (uint32_t i = 0; i < detected.nEntries; i++) {
            const FrequencyEntry& d = detected.entries[i];
            double p = frequencyToPitch(d.frequency), spread = d.frequencyWidth;
            double width = 13.75 * std::exp2((p + spread / 2 - 9) / 12) - 13.75 * std::exp2((p - spread / 2 - 9) / 12);
            data.entries[i] = FrequencyEntry{d.frequency, float(width), d.amplitude, d.amplitude, d.cutOffLevel, 0};
        }
    }
    if (recognitionOptions.flattenVibrato) flattenVibrato(first, end);
    if (recognitionOptions.flattenGlissando) flattenGlissando(first, end);

    double m = mean;
    if (!(m > 0.0)) {
        double sum = 0.0, sumLog = 0.0;
        for (uint32_t b = first; b < end; b++) {
            const FTDataBuffer& data = blockData(b);
            if (data.blockFlags & BLOCK_GLISSANDO) continue;
            for (uint32_t i = 0; i < data.nEntries; i++)
                if (data.entries[i].amplitude && data.entries[i].frequency > 0.0f) {
                    sum += data.entries[i].amplitude;
                    sumLog += data.entries[i].amplitude * std::log(double(data.entries[i].frequency));
                }
        }
        m = sum > 0.0 ? std::exp(sumLog / sum) : DEFAULT_MIDDLE_A;
    }
    double p0 = frequencyToPitch(m);
    uint32_t skip = std::min(uint32_t(std::max(0.0, 0.1 / song.sampleBlockDuration)), (end - first) / 4);
    double sum = 0.0, weighted = 0.0;
    for (uint32_t b = first + skip; b < end; b++) {
        const FTDataBuffer& data = blockData(b);
        if (data.blockFlags & BLOCK_GLISSANDO) continue;
        for (uint32_t i = 0; i < data.nEntries; i++) {
            const FrequencyEntry& e = data.entries[i];
            double p = frequencyToPitch(e.frequency);
            if (!e.amplitude || std::fabs(p - p0) > 1.0) continue;
            sum += e.amplitude;
            weighted += e.amplitude * p;
        }
    }
    std::copy(kept.begin(), kept.end(), ftBlockWindow.dataBuffers.begin() + (first - w.firstBlock));
    return sum > 0.0 ? pitchToFrequency(weighted / sum) : m;
}

// ---- instrument matching ----

// The frequency through which a sample is compared: its lowest harmonic among those whose mean
// amplitude is above 9% of its strongest; 0 for a sample without harmonics.
static double sampleFrequency(const NoteSample& sample) {
    uint32_t strongest = 0;
    for (int h = 0; h < sample.harmonicCount; h++) strongest = std::max(strongest, sample.harmonics[h].meanAmplitude);
    double lowest = 0.0;
    for (int h = 0; h < sample.harmonicCount; h++) {
        const Harmonic& k = sample.harmonics[h];
        if (double(k.meanAmplitude) > 0.09 * strongest && (lowest == 0.0 || k.frequency < lowest)) lowest = k.frequency;
    }
    return lowest;
}

static bool definitionFits(const InstrumentDefinition& d, int semitone, double frequency) {
    if (semitone < d.lowSemitone || semitone > d.highSemitone) return false;
    size_t index = size_t(semitone - d.lowSemitone);
    if (index >= d.semitones.size()) return false;
    const NoteSampleSet& set = d.semitones[index];
    double divisor = recognitionOptions.monophonicRecognition ? HALF_SEMITONE_TOLERANCE : POLYPHONIC_TOLERANCE;
    for (int k = 0; k < std::min<int>(set.sampleCount, MAX_CS_NOTESAMPLES); k++) {
        double f = sampleFrequency(set.samples[k]);
        if (f > 0.0 && nearFrequency(frequency, f, divisor)) return true;
    }
    return false;
}

// The song's instrument: the definition named like it, else the first of its voice's, else
// the first definition; -1 when no definition is loaded.
static int songDefinition(int voice) {
    const std::vector<InstrumentDefinition>& table = instrumentDefinitions.definitions;
    std::string name = fitInstrumentName(songInstrumentName());
    for (size_t i = 0; i < table.size(); i++)
        if ((voice < 0 || table[i].midiVoice == voice) && table[i].name == name) return int(i);
    for (size_t i = 0; i < table.size(); i++)
        if (voice >= 0 && table[i].midiVoice == voice) return int(i);
    return table.empty() ? -1 : 0;
}

// The definition for a candidate: the song's instrument when it fits, else the first that
// fits (only those of voice when it is 0 or more); *fitted says whether any did.
static int matchDefinition(int semitone, double frequency, int voice, bool* fitted) {
    const std::vector<InstrumentDefinition>& table = instrumentDefinitions.definitions;
    int preferred = songDefinition(voice);
    *fitted = true;
    if (preferred >= 0 && definitionFits(table[size_t(preferred)], semitone, frequency)) return preferred;
    for (size_t i = 0; i < table.size(); i++)
        if ((voice < 0 || table[i].midiVoice == voice) && definitionFits(table[i], semitone, frequency)) return int(i);
    *fitted = false;
    return preferred;
}

static int voiceOf(int definition) {
    if (definition < 0 || size_t(definition) >= instrumentDefinitions.definitions.size()) return VOICE_OOHS_VOICE;
    return instrumentDefinitions.definitions[size_t(definition)].midiVoice;
}

// The slot of definition in the song's instrument list, appended while there is room; -1 when full.
static int instrumentSlot(int definition) {
    SongInstruments& s = songInstruments;
    for (int i = 0; i < s.count; i++)
        if (s.definitions[i] == definition) return i;
    if (s.count >= MAX_SONG_INSTRUMENTS) return -1;
    s.definitions[s.count] = definition;
    s.noteCounts[s.count] = 0;
    s.strengths[s.count] = 0.0;
    return s.count++;
}

// ---- candidates ----

struct NoteCandidate {
    uint32_t first, end;   // blocks
    int semitone;          // MIDI number
    double pitch;          // Hz
    double strength;       // mean band energy at the pitch
    int largest;           // largest amplitude
    uint32_t volumeSum;    // summed block amplitudes
    int definition;        // matched instrument definition, -1 for none loaded
    bool fitted;           // a definition fitted it
};

// The nearest semitone (halves up). Taking frequencyToHalfSemitone, rounding an odd value up and
// halving rounds twice: it moves every boundary 3/8 semitone down, so a note sung 13 cents
// sharp lands on the semitone above and a steady note near that boundary falls apart.
static int blockSemitone(uint32_t b) {
    double p = blockPitch(b);
    return p > 0.0 ? frequencyToSemitone(p) : -1;
}

// The semitone each block holds: its nearest one, unless it stays within half a semitone and
// SEMITONE_HYSTERESIS of the semitone the block before held. A note sung between two
// semitones, or wavering across the boundary, stays on one.
static void heldSemitones(uint32_t first, uint32_t end, int* semitones) {
    int previous = -1;
    for (uint32_t b = first; b < end; b++) {
        double p = blockPitch(b);
        if (p <= 0.0) {
            semitones[b - first] = previous = -1;
            continue;
        }
        double pitch = frequencyToPitch(p);
        if (previous < 0 || std::fabs(pitch - previous) > 0.5 + SEMITONE_HYSTERESIS) previous = blockSemitone(b);
        semitones[b - first] = previous;
    }
}

// A run of blocks on one semitone, or (semitone -1) without a pitch.
struct SemitoneRun {
    uint32_t from, to;   // blocks
    int semitone;
};

static std::vector<SemitoneRun> semitoneRuns(uint32_t first, uint32_t end, const int* semitones) {
    std::vector<SemitoneRun> runs;
    for (uint32_t b = first; b < end;) {
        int s = semitones[b - first];
        uint32_t to = b + 1;
        while (to < end && semitones[to - first] == s) to++;
        runs.push_back(SemitoneRun{b, to, s});
        b = to;
    }
    return runs;
}

// Whether block b's pitch lies nearer (in semitones) to semitone `to` than to semitone `from`.
static bool nearerTo(uint32_t b, int from, int to) {
    double p = blockPitch(b);
    if (p <= 0.0) return false;
    double pitch = frequencyToPitch(p);
    return std::fabs(pitch - to) < std::fabs(pitch - from);
}

// A move from one note to the next passes through the pitches between them: a singer glides, a
// slurred instrument bends. The held semitones give such a glide to whichever note the
// hysteresis or the slivers on the way happen to favour, often its first block, so the next
// note would start where the voice leaves the note before. Between two notes (runs at least
// the voice's shortest note long, at most GLIDE_GAP_SECONDS of silence on the way), every block
// of the way goes to the note whose semitone its pitch lies nearer: the boundary falls where
// the glide passes the middle, which is where a listener hears the change whether the glide
// leads into the new note or leaves the old one. Silent blocks in the way join the note on
// both their sides when both are the same; between the two notes they stay silent.
static void splitGlides(uint32_t first, uint32_t end, int* semitones, int voice) {
    std::vector<SemitoneRun> runs = semitoneRuns(first, end, semitones);
    uint32_t gapLimit = uint32_t(std::max(1, blocksForSeconds(GLIDE_GAP_SECONDS)));
    // A run is a note when it lasts the voice's shortest note, unless it is short and its pitch
    // wanders over most of a semitone (a slow glide dwelling on a semitone on its way).
    auto isNote = [voice](const SemitoneRun& r) {
        if (r.semitone < 0) return false;
        double duration = songTimeOfBlock(r.to, r.from);
        if (duration < shortestNoteSeconds(voice, r.semitone)) return false;
        if (duration >= GLIDE_RUN_SECONDS) return true;
        double low = 1e9, high = -1e9;
        for (uint32_t b = r.from; b < r.to; b++) {
            double p = frequencyToPitch(blockPitch(b));
            low = std::min(low, p), high = std::max(high, p);
        }
        return high - low < GLIDE_RUN_DRIFT;
    };
    for (size_t i = 0; i < runs.size(); i++) {
        if (!isNote(runs[i])) continue;
        // The next note after runs[i], through slivers and short silences only.
        size_t j = i + 1;
        bool broken = false;
        while (j < runs.size() && !isNote(runs[j])) {
            const SemitoneRun& r = runs[j];
            if (r.semitone < 0 && r.to - r.from > gapLimit) broken = true;
            j++;
        }
        if (broken || j >= runs.size()) continue;
        const SemitoneRun& before = runs[i];
        const SemitoneRun& after = runs[j];
        int a = before.semitone, c = after.semitone;
        if (a == c) {
            // A wobble inside one note, or a re-attack the syllable splits will find.
            if (j == i + 1) continue;
            bool pitched = true;
            for (size_t k = i + 1; k < j; k++) pitched = pitched && runs[k].semitone >= 0;
            if (!pitched) continue;   // a silence between two notes on one semitone parts them
            for (uint32_t b = before.to; b < after.from; b++) semitones[b - first] = a;
            continue;
        }
        // The way from the old note's last blocks that already lean towards the new one (the
        // hysteresis kept them) to the new note's first block.
        uint32_t reach = uint32_t(std::max(1, blocksForSeconds(GLIDE_REACH_SECONDS)));
        uint32_t wayFrom = before.to;
        while (wayFrom > before.from + 1 && before.to - wayFrom < reach && nearerTo(wayFrom - 1, a, c)) wayFrom--;
        uint32_t wayTo = after.from;
        if (wayFrom == wayTo) continue;
        // The boundary: the first block of the way from which no pitched block is nearer the old note.
        uint32_t boundary = wayTo;
        while (boundary > wayFrom) {
            uint32_t b = boundary - 1;
            if (blockPitch(b) > 0.0 && !nearerTo(b, a, c)) break;
            boundary--;
        }
        // Silent blocks right at the boundary stay silent: the old note ended there.
        while (boundary < wayTo && blockPitch(boundary) <= 0.0) boundary++;
        uint32_t oldEnd = boundary;
        while (oldEnd > wayFrom && blockPitch(oldEnd - 1) <= 0.0) oldEnd--;
        for (uint32_t b = wayFrom; b < wayTo; b++) {
            int s = b < oldEnd ? a : b >= boundary ? c : -1;
            semitones[b - first] = s;
        }
        runs[j].from = boundary;
    }
}

// A short run an octave away from the note right after it (or, failing that, right before it)
// is that note's octave slip: at a consonant or a soft attack the track may hold the second
// harmonic for a few blocks, too long for the octave-jump pass to fold when a glide lies on
// its other side. It joins that note, with the silence of at most GLIDE_GAP_SECONDS between,
// when the note's own partial is there under it.
static void foldOctaveSlips(uint32_t first, uint32_t end, int* semitones) {
    std::vector<SemitoneRun> runs = semitoneRuns(first, end, semitones);
    uint32_t gapLimit = uint32_t(std::max(1, blocksForSeconds(GLIDE_GAP_SECONDS)));
    auto octaveApart = [](int a, int b) { return std::abs(std::abs(a - b) - 12) <= 1; };
    auto neighbour = [&](size_t i, int step) -> const SemitoneRun* {
        size_t j = i;
        while (true) {
            if ((step < 0 && j == 0) || (step > 0 && j + 1 >= runs.size())) return nullptr;
            j = step < 0 ? j - 1 : j + 1;
            if (runs[j].semitone >= 0) return &runs[j];
            if (runs[j].to - runs[j].from > gapLimit) return nullptr;
        }
    };
    for (size_t i = 0; i < runs.size(); i++) {
        SemitoneRun& r = runs[i];
        if (r.semitone < 0 || songTimeOfBlock(r.to, r.from) >= OCTAVE_SLIP_SECONDS) continue;
        const SemitoneRun* into = nullptr;
        const SemitoneRun* after = neighbour(i, 1);
        const SemitoneRun* before = neighbour(i, -1);
        if (after && songTimeOfBlock(after->to, after->from) >= OCTAVE_SLIP_SECONDS && octaveApart(r.semitone, after->semitone)) into = after;
        else if (before && songTimeOfBlock(before->to, before->from) >= OCTAVE_SLIP_SECONDS && octaveApart(r.semitone, before->semitone)) into = before;
        if (!into) continue;
        // The note itself must sound under the slip, however faintly: a short note an octave
        // from the next is a leap.
        bool heard = false;
        double target = pitchToFrequency(into->semitone);
        for (uint32_t b = r.from; b < r.to && !heard; b++) {
            const FTDataBuffer& data = blockOrigData(b);
            for (uint32_t k = 0; k < data.nEntries && !heard; k++)
                heard = data.entries[k].amplitude && nearFrequency(data.entries[k].frequency, target, HALF_SEMITONE_TOLERANCE);
        }
        if (!heard) continue;
        uint32_t from = std::min(r.from, into->to), to = std::max(r.to, into->from);
        for (uint32_t b = from; b < to; b++) semitones[b - first] = into->semitone;
        r.semitone = into->semitone;
    }
}

// Runs of one semitone shorter than the voice's shortest note are slivers of a transition or
// a wobble: one between two runs of the same semitone joins them, else one right before a
// run within two semitones becomes that note's start (a scoop or the attack of the next
// note), else one right after a run within two semitones becomes its end.
static void absorbSlivers(uint32_t first, uint32_t end, int* semitones, int voice) {
    struct Run {
        uint32_t from, to;   // blocks
        int semitone;
    };
    std::vector<Run> runs;
    for (uint32_t b = first; b < end;) {
        int s = semitones[b - first];
        uint32_t to = b + 1;
        while (to < end && semitones[to - first] == s) to++;
        if (s >= 0) runs.push_back(Run{b, to, s});
        b = to;
    }
    auto length = [](const Run& r) { return songTimeOfBlock(r.to, r.from); };
    for (size_t i = 0; i < runs.size(); i++) {
        Run& r = runs[i];
        if (length(r) >= shortestNoteSeconds(voice, r.semitone)) continue;
        bool before = i > 0 && runs[i - 1].to == r.from;
        bool after = i + 1 < runs.size() && runs[i + 1].from == r.to;
        int into = -1;
        if (before && after && runs[i - 1].semitone == runs[i + 1].semitone) into = runs[i + 1].semitone;
        else if (after && std::abs(runs[i + 1].semitone - r.semitone) <= 2) into = runs[i + 1].semitone;
        else if (before && std::abs(runs[i - 1].semitone - r.semitone) <= 2) into = runs[i - 1].semitone;
        if (into < 0) continue;
        for (uint32_t b = r.from; b < r.to; b++) semitones[b - first] = into;
        r.semitone = into;
        if (after && runs[i + 1].semitone == into) {
            runs[i + 1].from = before && runs[i - 1].semitone == into ? runs[i - 1].from : r.from;
        } else if (before && runs[i - 1].semitone == into) {
            runs[i - 1].to = r.to;
        }
    }
}

// The mean pitch notePitch starts from: the amplitude-weighted geometric mean of the note's
// detected frequencies within a semitone of its semitone, so that a sliver the note took in
// (a harmonic for a block or two) does not pull the mean off the note; 0 (notePitch finds
// it) when no block is that close.
static double semitoneMean(const NoteCandidate& c) {
    double sum = 0.0, sumLog = 0.0;
    for (uint32_t b = c.first; b < c.end; b++) {
        const FTDetectedBuffer& d = blockDetected(b);
        if (!d.nEntries || !d.entries[0].amplitude) continue;
        double f = d.entries[0].frequency;
        if (std::fabs(frequencyToPitch(f) - c.semitone) > 1.0) continue;
        sum += d.entries[0].amplitude;
        sumLog += d.entries[0].amplitude * std::log(f);
    }
    return sum > 0.0 ? std::exp(sumLog / sum) : 0.0;
}

// The pitch track takes a note from the block where its partial wins; the partial has been
// rising for a while by then, under the end of the note before or out of silence. The note
// starts where its partial (within half a semitone of its pitch, as the analysis made the
// entries) began to rise without a break, at most ONSET_ADVANCE_SECONDS earlier and never into
// the first half of the note before it.
static void advanceOnset(NoteCandidate& c, NoteCandidate* before, uint32_t first) {
    uint32_t limit = first;
    if (before && before->end > limit) limit = std::max(limit, before->first + (before->end - before->first + 1) / 2);
    uint32_t reach = uint32_t(blocksForSeconds(ONSET_ADVANCE_SECONDS));
    if (c.first > limit + reach) limit = c.first - reach;
    auto partial = [&c](uint32_t b) {
        const FTDataBuffer& data = blockOrigData(b);
        int largest = 0;
        for (uint32_t i = 0; i < data.nEntries; i++)
            if (nearFrequency(data.entries[i].frequency, c.pitch, HALF_SEMITONE_TOLERANCE))
                largest = std::max<int>(largest, data.entries[i].amplitude);
        return largest;
    };
    // The partial's level early in the note: what it rises from below a fraction of that is
    // breath or noise before the note, not its start.
    int early = 0;
    uint32_t earlyEnd = std::min(c.end, c.first + uint32_t(std::max(1, blocksForSeconds(ONSET_LEVEL_SECONDS))));
    for (uint32_t b = c.first; b < earlyEnd; b++) early = std::max(early, partial(b));
    uint32_t start = c.first;
    int next = partial(start);
    while (start > limit) {
        int a = partial(start - 1);
        if (a == 0 || a > next || a * ONSET_RISE_FLOOR < early || (before && start - 1 < before->first)) break;
        next = a;
        start--;
    }
    if (start == c.first) return;
    if (before && before->end > start) before->end = start;
    c.first = start;
}

// A sung note follows the one before through a consonant: the voice glides to the new pitch
// into it, so the pitch track changes a little before the syllable starts. A boundary between
// two notes on different semitones moves forward to a syllable start at most
// SYLLABLE_SNAP_SECONDS after it, as long as the new note keeps SNAP_KEEP_SECONDS.
static void snapToSyllables(std::vector<NoteCandidate>& candidates) {
    uint32_t reach = uint32_t(std::max(1, blocksForSeconds(SYLLABLE_SNAP_SECONDS)));
    uint32_t keep = uint32_t(std::max(1, blocksForSeconds(SNAP_KEEP_SECONDS)));
    for (size_t i = 1; i < candidates.size(); i++) {
        NoteCandidate& before = candidates[i - 1];
        NoteCandidate& c = candidates[i];
        if (c.first != before.end || c.semitone == before.semitone) continue;
        uint32_t hi = std::min(c.first + reach, c.end > keep ? c.end - keep : 0);
        for (uint32_t b = c.first + 1; b <= hi; b++) {
            if (!(blockData(b).blockFlags & BLOCK_SYLLABLE_START)) continue;
            before.end = c.first = b;
            break;
        }
    }
}

// Whether no block holds a pitch for SNAP_KEEP_SECONDS before the candidate: it starts out of
// silence, not after another note (even across a short dropout).
static bool followsSilence(const NoteCandidate& c, uint32_t windowFirst) {
    uint32_t silence = uint32_t(std::max(1, blocksForSeconds(SNAP_KEEP_SECONDS)));
    for (uint32_t b = c.first; b > windowFirst && c.first - b < silence; b--)
        if (blockPitch(b - 1) > 0.0) return false;
    return true;
}

// A note out of silence may begin with a few faint blocks on its pitch: breath, the hum of a
// nasal before the vowel, noise the analysis found the pitch in. Its start is where the track's
// amplitude first reaches 1/FAINT_START_RATIO of its largest over the note's first
// FAINT_START_SECONDS.
static void trimFaintStart(NoteCandidate& c, uint32_t windowFirst) {
    if (!followsSilence(c, windowFirst)) return;
    auto amplitude = [](uint32_t b) { return blockData(b).nEntries ? int(blockData(b).entries[0].amplitude) : 0; };
    uint32_t span = uint32_t(std::max(1, blocksForSeconds(FAINT_START_SECONDS)));
    uint32_t spanEnd = std::min(c.end, c.first + span);
    int largest = 0;
    for (uint32_t b = c.first; b < spanEnd; b++) largest = std::max(largest, amplitude(b));
    uint32_t keep = uint32_t(std::max(1, blocksForSeconds(SNAP_KEEP_SECONDS)));
    while (c.first + keep < c.end && amplitude(c.first) * FAINT_START_RATIO < largest) c.first++;
}

// A note out of silence whose tone needs a while to settle (a choir's slow "aah") is heard
// before the track finds its pitch. When the loudness leapt out of silence (at most
// 1/LOUDNESS_SILENCE_RATIO of the note's loudest over its first FAINT_START_SECONDS) at most
// LOUDNESS_RISE_SECONDS before the note and stayed above 1/LOUDNESS_RISE_RATIO of it since,
// the note starts at that leap.
static void startAtLoudnessLeap(NoteCandidate& c, uint32_t limit, uint32_t windowFirst) {
    if (!followsSilence(c, windowFirst)) return;
    uint32_t span = uint32_t(std::max(1, blocksForSeconds(FAINT_START_SECONDS)));
    int loudest = 0;
    for (uint32_t b = c.first; b < std::min(c.end, c.first + span); b++) loudest = std::max<int>(loudest, blockData(b).blockLoudness);
    uint32_t reach = uint32_t(std::max(1, blocksForSeconds(LOUDNESS_RISE_SECONDS)));
    uint32_t lowest = std::max(limit, c.first > reach ? c.first - reach : 0);
    for (uint32_t b = c.first; b > lowest; b--) {
        int before = blockData(b - 1).blockLoudness;
        if (before * LOUDNESS_SILENCE_RATIO <= loudest) {
            c.first = b;
            return;
        }
        if (before * LOUDNESS_RISE_RATIO < loudest) return;
    }
}

// A note split at a syllable sounds its own pitch in each part: the candidate took in the
// slivers beside it (a short last note after a slow attack, a scoop), so a part made mostly of
// them would otherwise show the candidate's pitch over audio a semitone away. Each part is
// measured over its own blocks around the candidate's pitch.
static void setPartPitch(Note& part, uint32_t partFirst, uint32_t partEnd, double candidatePitch) {
    part.pitch = float(notePitch(partFirst, partEnd, candidatePitch));
    part.midiNote = uint8_t(frequencyToSemitone(part.pitch));
}

static void measureCandidate(NoteCandidate& c) {
    c.volumeSum = 0;
    c.largest = 0;
    double strength = 0.0;
    for (uint32_t b = c.first; b < c.end; b++) {
        const FTDataBuffer& data = blockData(b);
        int a = data.nEntries ? data.entries[0].amplitude : 0;
        c.volumeSum += uint32_t(a);
        c.largest = std::max(c.largest, a);
        strength += blockBandEnergy(b, c.pitch, false);
    }
    c.strength = strength / double(c.end - c.first);
}

static void matchCandidates(std::vector<NoteCandidate>& candidates, int voice) {
    for (NoteCandidate& c : candidates) c.definition = matchDefinition(c.semitone, c.pitch, voice, &c.fitted);
}

// Each block from first on starts again from the entries the analysis made: the amplitudes
// come back and the note marks go.
static void restoreEntries(uint32_t first, uint32_t end) {
    for (uint32_t b = first; b < end; b++) {
        FTDataBuffer& data = blockData(b);
        for (uint32_t i = 0; i < data.nEntries; i++) {
            data.entries[i].amplitude = data.entries[i].initialAmplitude;
            data.entries[i].entryFlags &= uint8_t(~ENTRY_NOTE_MARKS);
        }
    }
}

// The note candidates of blocks [first, end): runs on one semitone, semitone by semitone from
// the lowest present, in time order, with their pitch, start and strength decided.
static std::vector<NoteCandidate> gatherCandidates(uint32_t first, uint32_t end) {
    const FTBlockWindow& w = ftBlockWindow;
    // The semitones are decided from a little before the first block on: the note that ends
    // there (built by an earlier call) decides where a glide out of it is split.
    uint32_t reachBack = uint32_t(std::max(1, blocksForSeconds(GLIDE_CONTEXT_SECONDS)));
    uint32_t context = first - w.firstBlock > reachBack ? first - reachBack : w.firstBlock;
    std::vector<int> contextSemitones(end - context);
    int voice = voiceOf(songDefinition(songInstruments.settledVoice));
    heldSemitones(context, end, contextSemitones.data());
    foldOctaveSlips(context, end, contextSemitones.data());
    splitGlides(context, end, contextSemitones.data(), voice);
    absorbSlivers(context, end, contextSemitones.data(), voice);
    const int* semitones = contextSemitones.data() + (first - context);
    int lowest = 256, highest = -1;
    for (uint32_t b = first; b < end; b++)
        if (semitones[b - first] >= 0) lowest = std::min(lowest, semitones[b - first]), highest = std::max(highest, semitones[b - first]);
    std::vector<NoteCandidate> candidates;
    for (int s = lowest; s <= highest; s++) {
        for (uint32_t b = first; b < end;) {
            if (semitones[b - first] != s) {
                b++;
                continue;
            }
            uint32_t runEnd = b;
            while (runEnd < end && semitones[runEnd - first] == s) runEnd++;
            candidates.push_back(NoteCandidate{b, runEnd, s, 0.0, 0.0, 0, 0, -1, false});
            b = runEnd;
        }
    }
    std::sort(candidates.begin(), candidates.end(),
              [](const NoteCandidate& a, const NoteCandidate& b) { return a.first < b.first; });
    for (NoteCandidate& c : candidates) c.pitch = notePitch(c.first, c.end, semitoneMean(c));
    for (NoteCandidate& c : candidates) trimFaintStart(c, w.firstBlock);
    for (size_t i = 0; i < candidates.size(); i++)
        advanceOnset(candidates[i], i > 0 ? &candidates[i - 1] : nullptr, first);
    for (size_t i = 0; i < candidates.size(); i++)
        startAtLoudnessLeap(candidates[i], i > 0 ? std::max(first, candidates[i - 1].end) : first, w.firstBlock);
    if (recognitionOptions.monophonicRecognition && recognitionOptions.findSyllables) snapToSyllables(candidates);
    for (NoteCandidate& c : candidates) measureCandidate(c);
    return candidates;
}

// Matches the candidates to the instrument definitions. While the song's instrument is not
// settled, the candidates count for their instruments; once two instruments are in use, the
// one with the most notes (then the larger strength) is the song's, and the candidates are
// matched again against its voice only.
static void settleSongInstrument(std::vector<NoteCandidate>& candidates) {
    SongInstruments& si = songInstruments;
    matchCandidates(candidates, si.settledVoice);
    if (si.settledVoice >= 0) return;
    for (NoteCandidate& c : candidates) {
        int slot = instrumentSlot(c.definition);
        if (slot < 0) continue;
        si.noteCounts[slot]++;
        si.strengths[slot] += c.strength;
    }
    if (si.count < 2) return;
    int best = 0;
    for (int i = 1; i < si.count; i++)
        if (si.noteCounts[i] > si.noteCounts[best] ||
            (si.noteCounts[i] == si.noteCounts[best] && si.strengths[i] > si.strengths[best]))
            best = i;
    si.settledVoice = voiceOf(si.definitions[best]);
    matchCandidates(candidates, si.settledVoice);
}

// Appends note to the list, unless its times do not hold (it is taken out again). False when
// the list is full.
static bool appendCheckedNote(const Note& note) {
    if (!appendNote(note)) return false;
    if (!validateNoteTimes(noteList.count - 1, false)) removeNote(noteList.count - 1);
    return true;
}

// Appends the note of candidate c, split at the syllable starts well inside it when split is
// set; times holds the start times of the blocks from first on. Nothing when its duration does
// not suit its instrument's voice or the instrument list is full. False when the note list is full.
static bool appendCandidateNote(const NoteCandidate& c, const std::vector<double>& times, uint32_t first, bool split) {
    int voice = voiceOf(c.definition);
    double duration = times[c.end - first] - times[c.first - first];
    if (duration < shortestNoteSeconds(voice, c.semitone) || duration > longestSustainSeconds(voice, c.semitone))
        return true;
    int slot = instrumentSlot(c.definition);
    if (slot < 0) return true;   // the instrument list is full: no more instruments, no note of one
    Note note{};
    note.pitch = float(c.pitch);
    note.waveStart = float(times[c.first - first]);
    note.waveEnd = float(times[c.first - first] + std::min(duration, MAX_NOTE_DURATION));
    note.midiStart = note.waveStart;
    note.midiEnd = note.waveEnd;
    note.recognitionValues[0] = float(c.strength);
    note.recognitionValues[1] = float(c.largest);
    note.recognitionValues[2] = float(c.volumeSum) / float(c.end - c.first);
    note.recognitionWeight = 100.0f;
    // The semitone nearest to the note's pitch: a note held between two semitones keeps the
    // one its blocks held, which need not be the nearest to their weighted mean.
    note.midiNote = uint8_t(frequencyToSemitone(c.pitch));
    note.recognitionCode = c.fitted ? NOTE_MATCHED_IN_RANGE : NOTE_OUTSIDE_DEFINITIONS;
    note.recognitionExtra[0] = c.first;
    note.recognitionExtra[1] = c.end - c.first;
    note.instrument = c.definition < 0 ? 0 : c.definition;
    note.sourceIndex = uint32_t(slot);
    note.group = uint8_t(voice);
    note.volumeSum = c.volumeSum;
    note.recognitionTail = uint32_t(c.semitone);

    // Split at the syllable starts well inside the note; each part sums its own blocks.
    double inside = std::max(0.1, 1.5 * song.sampleBlockDuration);
    uint32_t partFirst = c.first;
    for (uint32_t b = c.first + 1; split && b < c.end; b++) {
        if (!(blockData(b).blockFlags & BLOCK_SYLLABLE_START)) continue;
        double t = times[b - first];
        if (t - times[partFirst - first] < inside || times[c.end - first] - t < inside) continue;
        Note part = note;
        setPartPitch(part, partFirst, b, c.pitch);
        part.waveStart = part.midiStart = float(times[partFirst - first]);
        part.waveEnd = part.midiEnd = float(t);
        part.recognitionCode |= NOTE_SPLIT_AT_SYLLABLE;
        part.recognitionExtra[0] = partFirst;
        part.recognitionExtra[1] = b - partFirst;
        part.volumeSum = 0;
        for (uint32_t k = partFirst; k < b; k++) part.volumeSum += blockData(k).nEntries ? blockData(k).entries[0].amplitude : 0;
        note.volumeSum -= part.volumeSum;
        note.recognitionCode |= NOTE_SPLIT_AT_SYLLABLE;
        if (!appendCheckedNote(part)) return false;
        partFirst = b;
    }
    if (partFirst != c.first) setPartPitch(note, partFirst, c.end, c.pitch);
    note.waveStart = note.midiStart = float(times[partFirst - first]);
    note.recognitionExtra[0] = partFirst;
    note.recognitionExtra[1] = c.end - partFirst;
    return appendCheckedNote(note);
}

uint32_t buildNotes(uint32_t fromSample, int notesToDrop) {
    uint32_t rate = song.waveFormat.samplesPerSec;
    uint32_t songEnd = uint32_t(std::trunc(songDuration() * rate + 0.5));
    for (int i = 0; i < notesToDrop && noteList.count > 0; i++) removeNote(noteList.count - 1);
    const FTBlockWindow& w = ftBlockWindow;
    uint32_t end = std::min(w.endBlock, song.blockCount);
    uint32_t first = std::max(w.firstBlock, blockOfSample(fromSample));
    if (first >= end || w.dataBuffers.size() < end - w.firstBlock) return songEnd;

    restoreEntries(first, end);
    std::vector<NoteCandidate> candidates = gatherCandidates(first, end);
    // Block start times of [first, end], walked once.
    std::vector<double> times(end - first + 1);
    times[0] = songTimeOfBlock(first);
    for (uint32_t b = first; b < end; b++) times[b + 1 - first] = times[b - first] + blockDuration(b);
    settleSongInstrument(candidates);
    bool split = recognitionOptions.monophonicRecognition && recognitionOptions.findSyllables;
    for (const NoteCandidate& c : candidates)
        if (!appendCandidateNote(c, times, first, split)) break;
    return songEnd;
}
