// The generated models. Their harmonics are as a clean recording of the model would be
// learnt: the whole note long (positions 0 to 255), two tolerance steps either side for the
// sine, and for the plucked-string recipe a wider window below (three steps above, seven
// below) because a plucked note goes flat as it dies away.
#include "analysis/instrumentModels.h"

#include <cmath>
#include <cstring>

#include "analysis/pitchScale.h"
#include "platform/allocation.h"
#include "platform/ui.h"
#include "resources/generalMidi.h"
#include "resources/strings.h"

// Attack length and lag allowance of a generated harmonic (as learnt at 1/64 s blocks).
static const uint8_t GENERATED_ONSET_MEASURES = 0x25;
static const uint16_t FLAT_SHAPE = 256;   // a generated sine keeps its level throughout

static Harmonic sineHarmonic(double frequency, uint32_t level) {
    Harmonic h{};
    h.frequency = float(frequency);
    h.noteFrequency = float(frequency);
    h.meanAmplitude = level;
    h.startPosition = 0;
    h.endPosition = 255;
    h.toleranceMeasures[0] = 14;
    h.toleranceMeasures[1] = 0;
    h.onsetMeasures = GENERATED_ONSET_MEASURES;
    h.onsetShape = h.sustainShape = h.decayShape = FLAT_SHAPE;
    return h;
}

static Harmonic synthesisedHarmonic(double frequency, double divisor, uint32_t level) {
    Harmonic h{};
    h.frequency = float(frequency);
    h.noteFrequency = nearestNoteFrequency(frequency, DEFAULT_MIDDLE_A);
    h.meanAmplitude = uint32_t(level / divisor);
    h.startPosition = 0;
    h.endPosition = 255;
    h.toleranceMeasures[0] = 31;
    h.toleranceMeasures[1] = 5;
    h.onsetMeasures = GENERATED_ONSET_MEASURES;
    h.onsetShape = uint16_t(299 / divisor);
    h.sustainShape = uint16_t(234 / divisor);
    h.decayShape = uint16_t(133 / divisor);
    return h;
}

int generateInstrumentDefinition(const std::string& name, int lowSemitone, int highSemitone, double noteDuration,
                                 uint32_t level, InstrumentDefinition* d) {
    if (lowSemitone < 0 || highSemitone > MAX_CS_SEMITONE || lowSemitone > highSemitone) return 0;
    if (!(noteDuration > 0) || !std::isfinite(noteDuration)) return 0;
    int program = generalMidiProgram(name);
    bool synthesised = program >= 25 && program <= 40;   // guitars and basses
    d->name = fitInstrumentName(name);
    d->kind = synthesised ? SYNTHESISED_MODEL : SINE_MODEL;
    d->source = GENERATED_SOURCE;
    d->midiVoice = uint8_t(program - 1);
    d->maxNotesInChord = uint8_t(maxNotesInChords(program - 1));
    std::memcpy(d->scoreThresholds, DEFAULT_SCORE_THRESHOLDS, sizeof d->scoreThresholds);
    d->middleA = float(DEFAULT_MIDDLE_A);
    d->lowSemitone = uint8_t(lowSemitone);
    d->highSemitone = uint8_t(highSemitone);
    if (!tryAllocate([&] { d->semitones.assign(size_t(highSemitone - lowSemitone + 1), NoteSampleSet{}); })) {
        showMessage(MESSAGE_ERROR, resourceString(10401));
        return 0;
    }
    static const double multiples[5] = {1, 2, 3, 4, 6};
    static const double divisors[5] = {1, 2.7, 2.7, 5.4, 5.4};
    for (int semitone = lowSemitone; semitone <= highSemitone; semitone++) {
        NoteSampleSet& set = d->semitones[size_t(semitone - lowSemitone)];
        double frequency = pitchToFrequency(semitone, DEFAULT_MIDDLE_A);
        set.sampleCount = MAX_CS_NOTESAMPLES;
        for (int k = 0; k < MAX_CS_NOTESAMPLES; k++) {
            NoteSample& sample = set.samples[k];
            sample.duration = float((k + 1) * noteDuration / 2);
            sample.level = uint32_t((uint64_t(k + 1) * level) / 2);
            if (synthesised) {
                sample.harmonicCount = 5;
                for (int h = 0; h < 5; h++)
                    sample.harmonics[h] = synthesisedHarmonic(frequency * multiples[h], divisors[h], sample.level);
            } else {
                sample.harmonicCount = 1;
                sample.harmonics[0] = sineHarmonic(frequency, sample.level);
            }
        }
    }
    return 1;
}

int createInstrumentDefinition(const std::string& name, int lowSemitone, int highSemitone, double noteDuration,
                               uint32_t level) {
    InstrumentDefinitions& t = instrumentDefinitions;
    if (int(t.definitions.size()) >= MAX_CS_INSTRUMENTS) {
        showMessage(MESSAGE_ERROR, NO_MORE_INSTRUMENTS_TEXT);
        return 0;
    }
    InstrumentDefinition d{};
    if (!generateInstrumentDefinition(name, lowSemitone, highSemitone, noteDuration, level, &d)) return 0;
    if (!tryAllocate([&] { t.definitions.push_back(std::move(d)); })) {
        showMessage(MESSAGE_ERROR, resourceString(10401));
        return 0;
    }
    t.current = int(t.definitions.size()) - 1;
    return saveInstrumentDefinitions();
}

const std::vector<DeliveredInstrument>& deliveredInstruments() {
    static const std::vector<DeliveredInstrument> instruments = {
        {"Voice", 36, 84, 1.0, 200},          // C2 to C6: bass to soprano
        {"Flute", 60, 96, 1.0, 200},          // C4 to C7
        {"Trumpet", 54, 84, 1.0, 200},        // F#3 to C6
        {"Violin", 55, 100, 1.0, 200},        // G3 to E7
        {"Clarinet", 50, 91, 1.0, 200},       // D3 to G6
        {"Soprano Sax", 56, 87, 1.0, 200},    // Ab3 to Eb6
        {"Alto Sax", 49, 80, 1.0, 200},       // Db3 to Ab5
        {"Tenor Sax", 44, 75, 1.0, 200},      // Ab2 to Eb5
        {"Baritone Sax", 36, 68, 1.0, 200},   // C2 to Ab4
        {"Whistle", 72, 96, 1.0, 200},        // C5 to C7
        {"Piano", 21, 108, 2.0, 200},         // A0 to C8
        {"Guitar", 40, 88, 2.0, 200},         // E2 to E6, as it sounds
        {"Bass Guitar", 28, 67, 2.0, 200},    // E1 to G4, as it sounds
    };
    return instruments;
}

int createDeliveredInstruments() {
    freeInstrumentDefinitions();
    for (const DeliveredInstrument& i : deliveredInstruments())
        if (!createInstrumentDefinition(i.name, i.lowSemitone, i.highSemitone, i.noteDuration, i.level)) return 0;
    instrumentDefinitions.current = 0;
    return 1;
}
