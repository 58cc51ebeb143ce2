// Learning definitions from recordings. A note is learnt by taking its strongest unexplained
// frequency again and again: a frequency present for at least three blocks in a row becomes a
// harmonic; anything else goes to an ignore list, so that every round explains at least the
// frequency it took and the loop ends.
#include "analysis/instrumentLearning.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <new>

#include "analysis/analysisGeometry.h"
#include "analysis/chunkedAnalysis.h"
#include "analysis/frequencyAnalysis.h"
#include "analysis/instrumentModels.h"
#include "analysis/recognitionOptions.h"
#include "audio/waveFile.h"
#include "audio/waveWorkingFile.h"
#include "platform/allocation.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "resources/generalMidi.h"
#include "resources/strings.h"
#include "store/song.h"
#include "store/workingFiles.h"

static const double SEMITONE_DIVISOR = 17.31715;       // f / this: about one semitone
static const double ATTACK_SECONDS = 0.04;             // attack length measured into onsetMeasures
static const uint8_t ONSET_LAG_BLOCKS = 5;             // low half of onsetMeasures
static const uint32_t HIGHEST_SAMPLE_RATE = 44100;     // the analysis takes nothing faster

static const char* const RATE_TOO_HIGH_TEXT =
    "Sorry - this wave file cannot be opened.\n\n44100Hz is the highest sample rate supported by this product.";

static std::string format1(const char* pattern, const std::string& text) {
    std::string out = pattern;
    size_t at = out.find("%s");
    if (at != std::string::npos) out.replace(at, 2, text);
    return out;
}

// ---- pitch names and file names ----

int parsePitchName(const std::string& text, int report) {
    static const int letterSemitones[7] = {9, 11, 0, 2, 4, 5, 7};   // A B C D E F G
    int letter = -1, accidental = 0, octave = -1;
    for (char c : text) {
        if (letter < 0 && ((c >= 'A' && c <= 'G') || (c >= 'a' && c <= 'g'))) letter = (c | 0x20) - 'a';
        if (accidental == 0 && (c == '#' || c == 'b')) accidental = c == '#' ? 1 : -1;
        if (octave < 0 && c >= '0' && c <= '8') octave = c - '0';
    }
    if (letter < 0 || octave < 0) {
        if (report) showMessage(MESSAGE_ERROR, "Cannot interpret pitch in '" + text + "'");
        return 0;
    }
    int semitone = letterSemitones[letter];
    // A sharp or flat that would reach another letter's semitone is not applied.
    if ((semitone == 11 || semitone == 4) && accidental > 0) accidental = 0;
    if ((semitone == 0 || semitone == 5) && accidental < 0) accidental = 0;
    return 12 * (octave + 1) + semitone + accidental;
}

static std::string fileNameOf(const std::string& path) {
    size_t slash = path.find_last_of('/');
    return slash == std::string::npos ? path : path.substr(slash + 1);
}

std::string instrumentFileStem(const std::string& path) {
    std::string name = fileNameOf(path);
    size_t dot = name.find_last_of('.');
    if (dot != std::string::npos && name.find('_', dot) == std::string::npos) name.erase(dot);
    return name;
}

static bool readWhole(const std::string& text, double* value) {
    const char* end = text.data() + text.size();
    std::from_chars_result r = std::from_chars(text.data(), end, *value);
    return !text.empty() && r.ec == std::errc() && r.ptr == end;
}

static bool readWhole(const std::string& text, int* value) {
    const char* end = text.data() + text.size();
    std::from_chars_result r = std::from_chars(text.data(), end, *value);
    return !text.empty() && r.ec == std::errc() && r.ptr == end;
}

int readInstrumentFileParameters(const std::string& path, int replace, InstrumentFileParameters* p) {
    std::string fileName = fileNameOf(path);
    std::string stem = instrumentFileStem(path);
    std::vector<std::string> parts;
    for (size_t from = 0;;) {
        size_t at = stem.find('_', from);
        parts.push_back(stem.substr(from, at == std::string::npos ? std::string::npos : at - from));
        if (at == std::string::npos) break;
        from = at + 1;
    }
    size_t wanted = size_t(replace ? REPLACE_PARAMETER_COUNT : LEARN_PARAMETER_COUNT);
    if (parts.size() < wanted) {
        showMessage(MESSAGE_ERROR,
                    format1("There are too few instrument definition parameters in filename data in '%s'", fileName));
        return 0;
    }
    if (parts.size() > wanted) {
        showMessage(MESSAGE_ERROR,
                    format1("There are too many instrument definition parameters in filename data in '%s'", fileName));
        return 0;
    }
    p->name = fitInstrumentName(parts[0]);
    p->kind = fitInstrumentName(parts[1]);
    p->source = fitInstrumentName(parts[2]);
    // The middle A tunes every learnt harmonic: a value that is not a positive number would
    // give a definition no note can match.
    double middleA = 0;
    if (!readWhole(parts[3], &middleA) || !(middleA > 0) || !std::isfinite(float(middleA))) {
        showMessage(MESSAGE_ERROR, "Cannot interpret middle A in '" + parts[3] + "'");
        return 0;
    }
    p->middleA = float(middleA);
    p->lowSemitone = parsePitchName(parts[4], 1);
    if (!p->lowSemitone) return 0;
    p->highSemitone = p->lowSemitone;
    if (!replace) {
        p->highSemitone = parsePitchName(parts[5], 1);
        if (!p->highSemitone) return 0;
        // A range upside down would expect a count of notes below one.
        if (p->lowSemitone > p->highSemitone) {
            showMessage(MESSAGE_ERROR,
                        format1("The low pitch is above the high pitch in filename data in '%s'", fileName));
            return 0;
        }
    }
    if (!readWhole(parts.back(), &p->sampleNumber) || p->sampleNumber < 0) p->sampleNumber = -1;
    return 1;
}

// ---- notes ----

static uint32_t blockAmplitude(const FTDataBuffer& block) {
    uint32_t sum = 0;
    uint32_t n = std::min<uint32_t>(block.nEntries, FT_DATA_ENTRIES);
    for (uint32_t i = 0; i < n; i++) sum += block.entries[i].amplitude;
    return sum;
}

std::vector<LearningNote> findLearningNotes(const LearningRecording& recording) {
    std::vector<LearningNote> notes;
    uint32_t count = uint32_t(recording.blocks.size());
    uint32_t b = 0;
    while (b < count && int(notes.size()) < MAX_LEARNING_NOTES) {
        if (blockAmplitude(recording.blocks[b]) == 0) {
            b++;
            continue;
        }
        uint32_t start = b, loudest = 0;
        for (; b < count; b++) {
            uint32_t sum = blockAmplitude(recording.blocks[b]);
            if (sum == 0) break;
            loudest = std::max(loudest, sum);
        }
        if (loudest > LEARNING_NOTE_LEVEL && (b - start) * recording.blockDuration >= LEARNING_NOTE_SECONDS)
            notes.push_back({start, b});
    }
    return notes;
}

// ---- learning one note ----

// A harmonic being learnt, with what its shape values are later derived from.
struct HarmonicInProgress {
    Harmonic harmonic;   // the record as it will be stored
    double thirds[3];    // mean amplitude over the first, middle and last third of its presence
};

// Entries of the note's blocks, with a mark for those already explained.
struct NoteEntries {
    const LearningRecording* recording;   // the blocks
    uint32_t start, end;                  // the note's blocks
    std::vector<uint32_t> first;          // per block of the note: index of its first mark
    std::vector<uint8_t> explained;       // per entry: a harmonic or the ignore list accounts for it

    const FTDataBuffer& block(uint32_t b) const { return recording->blocks[b]; }
    uint32_t entries(uint32_t b) const { return std::min<uint32_t>(block(b).nEntries, FT_DATA_ENTRIES); }
    uint8_t& mark(uint32_t b, uint32_t i) { return explained[first[b - start] + i]; }
};

static bool within(double f, double centre, double divisor) {
    return f >= centre - centre / divisor && f <= centre + centre / divisor;
}

static bool inToleranceWindow(double f, const Harmonic& h) {
    double above = (h.toleranceMeasures[0] >> 4) + 2, below = (h.toleranceMeasures[1] & 15) + 2;
    return f >= h.frequency * (1 - below / TOLERANCE_STEP_DIVISOR) &&
           f <= h.frequency * (1 + above / TOLERANCE_STEP_DIVISOR);
}

// position = offset x 255 / length, to the nearest integer with halves going up, at most 255.
static uint8_t notePosition(uint64_t offset, uint64_t length) {
    return uint8_t(std::min<uint64_t>(255, (2 * offset * 255 + length) / (2 * length)));
}

// Gathers the harmonic at frequency f from the note's start; 1 when it was present in at
// least three consecutive blocks, with the harmonic's measures filled in.
static int gatherHarmonic(NoteEntries& e, double f, double blockDuration, HarmonicInProgress* out) {
    uint32_t length = e.end - e.start;
    std::vector<double> blockSums;
    double total = 0, weightedLog = 0, lowest = HUGE_VAL, highest = 0, firstFrequency = 0, lastFrequency = 0;
    uint32_t firstBlock = 0;
    for (uint32_t b = e.start; b < e.end; b++) {
        double sum = 0, logSum = 0;
        const FTDataBuffer& block = e.block(b);
        for (uint32_t i = 0; i < e.entries(b); i++) {
            const FrequencyEntry& entry = block.entries[i];
            if (entry.amplitude == 0 || e.mark(b, i) || !within(entry.frequency, f, HARMONIC_GATHER_DIVISOR)) continue;
            lowest = std::min(lowest, double(entry.frequency));
            highest = std::max(highest, double(entry.frequency));
            sum += entry.amplitude;
            logSum += entry.amplitude * std::log(double(entry.frequency));
        }
        if (sum == 0) {
            if (!blockSums.empty()) break;   // the harmonic has ended
            continue;                        // not begun yet
        }
        double blockFrequency = std::exp(logSum / sum);
        if (blockSums.empty()) {
            firstBlock = b - e.start;
            firstFrequency = blockFrequency;
        }
        lastFrequency = blockFrequency;
        blockSums.push_back(sum);
        total += sum;
        weightedLog += logSum;
    }
    uint32_t present = uint32_t(blockSums.size());
    if (present < uint32_t(HARMONIC_MIN_BLOCKS)) return 0;
    uint32_t lastBlock = firstBlock + present - 1;

    Harmonic& h = out->harmonic;
    h = Harmonic{};
    h.frequency = float(std::exp(weightedLog / total));
    h.meanAmplitude = uint32_t(total / length);
    h.startPosition = notePosition(firstBlock, length);
    h.endPosition = notePosition(uint64_t(lastBlock) + 2, length);
    double mean = total / present, deviation = 0, peak = 0;
    uint32_t peakBlock = 0;
    for (uint32_t k = 0; k < present; k++) {
        deviation += std::fabs(blockSums[k] - mean);
        if (blockSums[k] > peak) {
            peak = blockSums[k];
            peakBlock = firstBlock + k;
        }
    }
    int steadiness = 15 - int(std::min(15.0, std::trunc(16 * deviation / present / mean)));
    auto steps = [](double spread) {
        return uint8_t(std::clamp(int(std::ceil(spread * TOLERANCE_STEP_DIVISOR)) - 2, 0, 15));
    };
    uint8_t above = steps(highest / h.frequency - 1), below = steps(1 - lowest / h.frequency);
    uint8_t drift = uint8_t(std::min(15.0, std::trunc(std::fabs(std::log(lastFrequency / firstFrequency)) *
                                                      TOLERANCE_STEP_DIVISOR)));
    h.toleranceMeasures[0] = uint8_t(above << 4 | steadiness);
    h.toleranceMeasures[1] = uint8_t(drift << 4 | below);
    int attack = std::clamp(int(ATTACK_SECONDS / blockDuration), 2, 15);
    h.onsetMeasures = uint8_t(attack << 4 | ONSET_LAG_BLOCKS);
    h.peakPosition = notePosition(peakBlock, length);
    h.peakAmplitude = uint32_t(peak);
    h.presentBlocks = uint16_t(std::min<uint32_t>(present, 65535));
    h.noteBlocks = uint16_t(std::min<uint32_t>(length, 65535));
    for (int third = 0; third < 3; third++) {
        uint32_t from = present * uint32_t(third) / 3, to = present * uint32_t(third + 1) / 3;
        double sum = 0;
        for (uint32_t k = from; k < to; k++) sum += blockSums[k];
        out->thirds[third] = sum / (to - from);
    }
    return 1;
}

// Marks the unexplained entries of the note within f / divisor of centre (or, with a
// harmonic, within its tolerance window).
static void markExplained(NoteEntries& e, double centre, double divisor, const Harmonic* harmonic) {
    for (uint32_t b = e.start; b < e.end; b++)
        for (uint32_t i = 0; i < e.entries(b); i++) {
            double f = e.block(b).entries[i].frequency;
            if (harmonic ? inToleranceWindow(f, *harmonic) : within(f, centre, divisor)) e.mark(b, i) = 1;
        }
}

int learnNoteSample(const LearningRecording& recording, uint32_t start, uint32_t end, double middleA,
                    NoteSample* sample) {
    *sample = NoteSample{};
    end = std::min<uint32_t>(end, uint32_t(recording.blocks.size()));
    if (start >= end) return 1;
    uint32_t length = end - start;
    NoteEntries e{&recording, start, end, {}, {}};
    uint64_t total = 0;
    uint32_t marks = 0;
    for (uint32_t b = start; b < end; b++) {
        e.first.push_back(marks);
        marks += e.entries(b);
        total += blockAmplitude(recording.blocks[b]);
    }
    e.explained.assign(marks, 0);
    sample->duration = float(length * recording.blockDuration);
    sample->level = uint32_t(total / length);

    std::vector<double> ignored;
    std::vector<HarmonicInProgress> found;
    int whole = 1;
    while (true) {
        // The strongest entry nothing explains yet: earliest block, then lowest frequency, on a tie.
        uint8_t strongest = 0;
        uint32_t strongestBlock = 0, strongestEntry = 0;
        for (uint32_t b = start; b < end; b++)
            for (uint32_t i = 0; i < e.entries(b); i++)
                if (!e.mark(b, i) && e.block(b).entries[i].amplitude > strongest) {
                    strongest = e.block(b).entries[i].amplitude;
                    strongestBlock = b;
                    strongestEntry = i;
                }
        if (strongest == 0) break;
        double f = e.block(strongestBlock).entries[strongestEntry].frequency;

        bool ignore = false;
        for (double g : ignored) ignore = ignore || within(f, g, SEMITONE_DIVISOR);
        for (const HarmonicInProgress& h : found) ignore = ignore || inToleranceWindow(f, h.harmonic);
        HarmonicInProgress candidate{};
        if (!ignore && f > 0 && gatherHarmonic(e, f, recording.blockDuration, &candidate)) {
            found.push_back(candidate);
            markExplained(e, 0, 0, &candidate.harmonic);
            markExplained(e, f, HARMONIC_GATHER_DIVISOR, nullptr);
            e.mark(strongestBlock, strongestEntry) = 1;
            if (int(found.size()) == MAX_CS_HARMONICS) {
                showMessage(MESSAGE_ERROR,
                            "Cannot learn note as found too many harmonics - Increase MAX_CS_HARMONICS definition in "
                            "Instruments");
                whole = 0;
                break;
            }
            continue;
        }
        if (int(ignored.size()) + 1 >= MAX_IGNORE_FREQUENCIES) {
            showMessage(MESSAGE_ERROR, "Cannot learn note - Increase MaxIgnoreFrequencies constant in AnalyseNote");
            whole = 0;
            break;
        }
        ignored.push_back(f);
        markExplained(e, f, HARMONIC_GATHER_DIVISOR, nullptr);
        // The entry taken is explained even when its frequency lies in no window (0 Hz, not a number).
        e.mark(strongestBlock, strongestEntry) = 1;
    }
    if (found.empty()) return whole;

    // Shapes against the strongest harmonic, then its onset becomes the note's start.
    size_t strongestIndex = 0;
    for (size_t k = 1; k < found.size(); k++)
        if (found[k].harmonic.meanAmplitude > found[strongestIndex].harmonic.meanAmplitude) strongestIndex = k;
    double reference = std::max<uint32_t>(1, found[strongestIndex].harmonic.meanAmplitude);
    uint32_t s = found[strongestIndex].harmonic.startPosition;
    for (HarmonicInProgress& p : found) {
        Harmonic& h = p.harmonic;
        h.noteFrequency = nearestNoteFrequency(h.frequency, middleA);
        uint16_t* shapes[3] = {&h.onsetShape, &h.sustainShape, &h.decayShape};
        for (int third = 0; third < 3; third++)
            *shapes[third] = uint16_t(std::min(65535.0, std::trunc(256 * p.thirds[third] / reference)));
        if (s > 0 && s < 255) {
            for (uint8_t* position : {&h.startPosition, &h.endPosition, &h.peakPosition}) {
                uint32_t shifted = *position > s ? *position - s : 0;
                *position = uint8_t(std::min<uint32_t>(255, shifted * 255 / (255 - s)));
            }
        }
    }
    // Exchange sort, longest and loudest first.
    auto weight = [](const Harmonic& h) {
        return (int64_t(h.endPosition) - h.startPosition) * int64_t(h.meanAmplitude);
    };
    for (size_t i = 0; i < found.size(); i++)
        for (size_t j = i + 1; j < found.size(); j++)
            if (weight(found[j].harmonic) > weight(found[i].harmonic)) std::swap(found[i], found[j]);
    sample->harmonicCount = uint8_t(found.size());
    for (size_t k = 0; k < found.size(); k++) sample->harmonics[k] = found[k].harmonic;
    return whole;
}

// ---- analysing a recording ----

struct BlockCollector {
    LearningRecording* recording;   // receives each chunk's dataBuffers
    int outOfMemory;                // a copy could not be made
};

static int collectBlocks(void* context, uint32_t firstBlock, uint32_t endBlock) {
    BlockCollector& c = *static_cast<BlockCollector*>(context);
    const FTBlockWindow& w = ftBlockWindow;
    if (!tryAllocate([&] {
            for (uint32_t b = firstBlock; b < endBlock; b++) c.recording->blocks.push_back(w.dataBuffers[b - w.firstBlock]);
        })) {
        c.outOfMemory = 1;
        return 0;
    }
    return 1;
}

int analyseLearningFile(const std::string& path, LearningRecording* recording) {
    recording->blocks.clear();
    recording->blockDuration = 0;
    recording->lowAmplitudesRemoved = 0;
    // The analysis writes into the song's stores; an open song's blocks would be mixed in.
    if (song.blockCount > 0) {
        showMessage(MESSAGE_ERROR, "Please close the song before learning instruments.");
        return 0;
    }
    std::string fileName = fileNameOf(path);
    size_t dot = fileName.find_last_of('.');
    if (dot != std::string::npos) {
        std::string extension = fileName.substr(dot);
        for (char& c : extension) c = char(c >= 'A' && c <= 'Z' ? c + 32 : c);
        if (extension == ".ftb") {
            showMessage(MESSAGE_ERROR, "Frequency table files cannot be learnt from: '" + fileName + "'.");
            return 0;
        }
    }
    WaveReadInfo info{};
    if (openCheckedWaveFile(&info, path) != WIO_OPENED) return 0;
    struct CloseWave {
        WaveReadInfo* info;
        ~CloseWave() { wioFileClose(info); }
    } closeWave{&info};
    if (info.format->samplesPerSec > HIGHEST_SAMPLE_RATE) {
        showMessage(MESSAGE_ERROR, RATE_TOO_HIGH_TEXT);
        return 0;
    }
    // The song's stores are emptied and the learning mark taken off on every return (the pass
    // makes no notes).
    struct EndLearningPass {
        bool marked;
        ~EndLearningPass() {
            releaseFrequencyAnalysis();
            recognitionOptions.learningInstruments = marked;
            closeSongStores();
        }
    } endPass{recognitionOptions.learningInstruments};
    recognitionOptions.learningInstruments = true;
    if (!acceptWaveFormat(*info.format) || !setupFrequencyAnalysis()) return 0;
    recording->blockDuration = analysisGeometry.sampleBlockDuration;
    recording->lowAmplitudesRemoved = recognitionOptions.removeLowAmplitudes;
    if (fileSeek(info.file, info.dataOffset, SEEK_SET) != 0) {
        showMessage(MESSAGE_ERROR, "File could not be seeked");
        return 0;
    }
    WaveFrameSource source{&info, info.dataSamples == WAVE_UNKNOWN ? 0 : info.dataSamples};
    BlockCollector collector{recording, 0};
    int analysed = analyseSource(readWaveFrameSource, &source, collectBlocks, &collector);
    if (collector.outOfMemory) showMessage(MESSAGE_ERROR, resourceString(10401));
    if (!analysed) recording->blocks.clear();
    return analysed;
}

// ---- learning and replacing ----

// Where learnt samples go: a definition of the table (or a new one), and for a replacement
// the semitone and sample.
struct LearningTarget {
    InstrumentFileParameters parameters;   // from the file name
    int definition;                        // index in the table; -1 for a new definition
    int semitone;                          // replacing: MIDI note of the sample
};

static bool sameNames(const InstrumentDefinition& d, const InstrumentFileParameters& p) {
    return d.name == p.name && d.kind == p.kind && d.source == p.source && d.middleA == p.middleA;
}

static int findLearningTarget(const std::string& path, int replace, LearningTarget* target) {
    const std::vector<InstrumentDefinition>& table = instrumentDefinitions.definitions;
    if (int(table.size()) >= MAX_CS_INSTRUMENTS) {
        showMessage(MESSAGE_ERROR, NO_MORE_INSTRUMENTS_TEXT);
        return 0;
    }
    InstrumentFileParameters& p = target->parameters;
    if (!readInstrumentFileParameters(path, replace, &p)) return 0;
    target->definition = -1;
    target->semitone = p.lowSemitone;
    for (size_t i = 0; i < table.size(); i++) {
        const InstrumentDefinition& d = table[i];
        if (!sameNames(d, p)) continue;
        if (!replace && d.lowSemitone == p.lowSemitone && d.highSemitone == p.highSemitone) {
            target->definition = int(i);
            break;
        }
        if (replace && p.lowSemitone >= d.lowSemitone && p.lowSemitone <= d.highSemitone && p.sampleNumber >= 0 &&
            p.sampleNumber < d.semitones[size_t(p.lowSemitone - d.lowSemitone)].sampleCount) {
            target->definition = int(i);
            break;
        }
    }
    if (replace && target->definition < 0) {
        showMessage(MESSAGE_ERROR,
                    format1("A matching pitch could not be found for replacement by '%s'.", fileNameOf(path)));
        return 0;
    }
    return 1;
}

static InstrumentDefinition newDefinition(const InstrumentFileParameters& p) {
    InstrumentDefinition d{};
    d.name = p.name;
    d.kind = p.kind;
    d.source = p.source;
    int program = generalMidiProgram(p.name);
    d.midiVoice = uint8_t(program - 1);
    d.maxNotesInChord = uint8_t(maxNotesInChords(program - 1));
    std::memcpy(d.scoreThresholds, DEFAULT_SCORE_THRESHOLDS, sizeof d.scoreThresholds);
    d.middleA = p.middleA;
    d.lowSemitone = uint8_t(p.lowSemitone);
    d.highSemitone = uint8_t(p.highSemitone);
    d.semitones.assign(size_t(p.highSemitone - p.lowSemitone + 1), NoteSampleSet{});
    return d;
}

static int learnIntoTarget(const std::string& path, int replace, const LearningTarget& target,
                           const LearningRecording& recording) {
    const InstrumentFileParameters& p = target.parameters;
    std::string fileName = fileNameOf(path);
    if (!recording.lowAmplitudesRemoved) {
        showMessage(MESSAGE_ERROR,
                    format1("Filters have not been applied to '%s', so it will not be analysed.", fileName));
        return 0;
    }
    std::vector<LearningNote> notes = findLearningNotes(recording);
    InstrumentDefinitions& t = instrumentDefinitions;
    if (replace) {
        if (notes.size() != 1) {
            showMessage(MESSAGE_ERROR, "Cantoscope did not find exactly one note in the waveform '" + fileName +
                                           "'. It found " + std::to_string(notes.size()) + ".");
            return 0;
        }
        InstrumentDefinition& d = t.definitions[size_t(target.definition)];
        NoteSample learnt;
        learnNoteSample(recording, notes[0].start, notes[0].end, d.middleA, &learnt);
        d.semitones[size_t(target.semitone - d.lowSemitone)].samples[p.sampleNumber] = learnt;
        t.current = target.definition;
        return saveInstrumentDefinitions();
    }

    int expected = p.highSemitone - p.lowSemitone + 1;
    if (int(notes.size()) != expected) {
        showMessage(MESSAGE_ERROR, "The number of notes (" + std::to_string(notes.size()) +
                                       ") found in the waveform '" + fileName +
                                       "' does not match the number of notes specified in the filename (" +
                                       std::to_string(expected) + ").");
        return 0;
    }
    if (p.sampleNumber < 0 || p.sampleNumber >= MAX_CS_NOTESAMPLES) {
        showMessage(MESSAGE_ERROR, format1("Pitch sample number out of range in waveform '%s'.", fileName));
        return 0;
    }
    // The definition is learnt aside and counted in only when all its notes are learnt.
    InstrumentDefinition d;
    if (!tryAllocate([&] { d = target.definition < 0 ? newDefinition(p) : t.definitions[size_t(target.definition)]; })) {
        showMessage(MESSAGE_ERROR, resourceString(10401));
        return 0;
    }
    for (int k = 0; k < expected; k++) {
        NoteSampleSet& set = d.semitones[size_t(k)];
        for (int s = set.sampleCount; s < p.sampleNumber; s++) set.samples[s] = NoteSample{};
        set.sampleCount = uint8_t(std::max<int>(set.sampleCount, p.sampleNumber + 1));
        const LearningNote& note = notes[size_t(k)];
        learnNoteSample(recording, note.start, note.end, d.middleA, &set.samples[p.sampleNumber]);
    }
    if (!tryAllocate([&] {
            if (target.definition < 0) {
                t.definitions.push_back(std::move(d));
                t.current = int(t.definitions.size()) - 1;
            } else {
                t.definitions[size_t(target.definition)] = std::move(d);
                t.current = target.definition;
            }
        })) {
        showMessage(MESSAGE_ERROR, resourceString(10401));
        return 0;
    }
    return saveInstrumentDefinitions();
}

int learnFromRecording(const std::string& path, int replace, const LearningRecording& recording) {
    LearningTarget target{};
    if (!findLearningTarget(path, replace, &target)) return 0;
    return learnIntoTarget(path, replace, target, recording);
}

int learnFromFile(const std::string& path, int replace) {
    LearningTarget target{};
    if (!findLearningTarget(path, replace, &target)) return 0;
    LearningRecording recording{};
    if (!analyseLearningFile(path, &recording)) return 0;
    return learnIntoTarget(path, replace, target, recording);
}

int learnInstrumentNotes(const std::vector<std::string>& paths, int replace) {
    int learnt = 0;
    for (const std::string& path : paths) learnt += learnFromFile(path, replace);
    return learnt;
}
