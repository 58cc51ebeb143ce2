// Generated instrument definitions: the Sine and Synthesised recipes field by field, the model
// chosen by the name's General MIDI program, creation into the table and the file, the full
// table, arguments refused; and the delivered Resources/CSInst.dat, which must be exactly what
// the program generates.
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <string>
#include <tuple>

#include "analysis/instrumentFixtures.h"
#include "analysis/instrumentModels.h"

class InstrumentModels : public InstrumentTest {
protected:
    InstrumentDefinition generated(const std::string& name, int low, int high, double duration, uint32_t level) {
        InstrumentDefinition d{};
        EXPECT_EQ(generateInstrumentDefinition(name, low, high, duration, level, &d), 1) << name;
        return d;
    }
};

TEST_F(InstrumentModels, ABassGuitarGetsFiveShapedHarmonicsPerSample) {
    InstrumentDefinition d = generated("Bass Guitar", 40, 41, 2.0, 200);
    EXPECT_EQ(std::tuple(d.kind, d.source, d.midiVoice, d.maxNotesInChord, d.middleA),
              std::tuple("Synthesised", "Generated", 33, 4, 440.0f));
    ASSERT_EQ(d.semitones.size(), 2u);
    const NoteSampleSet& e2 = d.semitones[0];
    ASSERT_EQ(e2.sampleCount, 2);
    EXPECT_EQ(std::tuple(e2.samples[0].duration, e2.samples[1].duration, e2.samples[0].level, e2.samples[1].level),
              std::tuple(1.0f, 2.0f, 100u, 200u));
    for (int k = 0; k < 2; k++) EXPECT_EQ(e2.samples[k].harmonicCount, 5) << k;
    EXPECT_EQ(d.semitones[1].samples[1].harmonicCount, 5);

    // E2 is 82.40689 Hz; its 3rd and 6th harmonics lie nearest to B3 and B4.
    const Harmonic* h = e2.samples[1].harmonics;
    const float frequencies[5] = {82.40689f, 164.81378f, 247.22067f, 329.62756f, 494.44134f};
    const float notes[5] = {82.40689f, 164.81378f, 246.94165f, 329.62756f, 493.8833f};
    const uint32_t means[5] = {200, 74, 74, 37, 37};
    const uint16_t shapes[5][3] = {{299, 234, 133}, {110, 86, 49}, {110, 86, 49}, {55, 43, 24}, {55, 43, 24}};
    for (int k = 0; k < 5; k++) {
        EXPECT_NEAR(h[k].frequency, frequencies[k], 1e-3) << k;
        EXPECT_NEAR(h[k].noteFrequency, notes[k], 1e-3) << k;
        EXPECT_EQ(std::tuple(h[k].meanAmplitude, h[k].startPosition, h[k].endPosition, h[k].toleranceMeasures[0],
                             h[k].toleranceMeasures[1]),
                  std::tuple(means[k], 0, 255, 31, 5)) << k;
        EXPECT_EQ(std::tuple(h[k].onsetShape, h[k].sustainShape, h[k].decayShape),
                  std::tuple(shapes[k][0], shapes[k][1], shapes[k][2])) << k;
    }
    const uint32_t halfMeans[5] = {100, 37, 37, 18, 18};
    for (int k = 0; k < 5; k++) EXPECT_EQ(e2.samples[0].harmonics[k].meanAmplitude, halfMeans[k]) << k;
}

TEST_F(InstrumentModels, APianoGetsOneSineHarmonicPerSample) {
    InstrumentDefinition d = generated("Piano", 69, 70, 1.0, 101);
    EXPECT_EQ(std::tuple(d.kind, d.midiVoice, d.maxNotesInChord, d.scoreThresholds[0], d.scoreThresholds[1], d.scoreThresholds[2]),
              std::tuple("Sine", 0, 12, 70.0f, 30.0f, 10.0f));
    const NoteSampleSet& a4 = d.semitones[0];
    ASSERT_EQ(a4.sampleCount, 2);
    // The shorter sample's level is (1 x 101) / 2.
    EXPECT_EQ(std::tuple(a4.samples[0].duration, a4.samples[0].level, a4.samples[1].level), std::tuple(0.5f, 50u, 101u));
    for (int k = 0; k < 2; k++) {
        ASSERT_EQ(a4.samples[k].harmonicCount, 1) << k;
        const Harmonic& h = a4.samples[k].harmonics[0];
        EXPECT_EQ(std::tuple(h.frequency, h.noteFrequency, h.meanAmplitude, h.startPosition, h.endPosition,
                             h.toleranceMeasures[0], h.toleranceMeasures[1]),
                  std::tuple(440.0f, 440.0f, a4.samples[k].level, 0, 255, 14, 0)) << k;
    }
    EXPECT_NEAR(d.semitones[1].samples[0].harmonics[0].frequency, 466.16376f, 1e-3);
}

TEST_F(InstrumentModels, GuitarAndBassProgramsAreSynthesisedAndTheirNeighboursSine) {
    EXPECT_EQ(generated("Bandoneon", 60, 60, 1.0, 100).kind, "Sine");            // program 24
    EXPECT_EQ(generated("Nylon Guitar", 60, 60, 1.0, 100).kind, "Synthesised");  // 25
    EXPECT_EQ(generated("Synth Bass 2", 60, 60, 1.0, 100).kind, "Synthesised");  // 40
    EXPECT_EQ(generated("Violin", 60, 60, 1.0, 100).kind, "Sine");               // 41
    InstrumentDefinition violin = generated("Violin", 60, 60, 1.0, 100);
    EXPECT_EQ(violin.midiVoice, 40);
    EXPECT_EQ(violin.maxNotesInChord, 2);
}

TEST_F(InstrumentModels, ArgumentsOutsideTheScaleAreRefused) {
    InstrumentDefinition d{};
    EXPECT_EQ(generateInstrumentDefinition("Flute", 61, 60, 1.0, 100, &d), 0);
    EXPECT_EQ(generateInstrumentDefinition("Flute", -1, 60, 1.0, 100, &d), 0);
    EXPECT_EQ(generateInstrumentDefinition("Flute", 60, 128, 1.0, 100, &d), 0);
    EXPECT_EQ(generateInstrumentDefinition("Flute", 60, 60, 0.0, 100, &d), 0);
    EXPECT_EQ(generateInstrumentDefinition("Flute", 60, 60, std::numeric_limits<double>::quiet_NaN(), 100, &d), 0);
    EXPECT_EQ(generateInstrumentDefinition("Flute", 0, 127, 1.0, 100, &d), 1);
    EXPECT_EQ(d.semitones.size(), 128u);
}

TEST_F(InstrumentModels, CreatingAddsTheDefinitionSavesTheFileAndMakesItCurrent) {
    fillTable(2);
    ASSERT_EQ(createInstrumentDefinition("Flute", 60, 72, 1.0, 200), 1);
    ASSERT_EQ(instrumentDefinitions.definitions.size(), 3u);
    EXPECT_EQ(instrumentDefinitions.current, 2);
    EXPECT_EQ(instrumentDefinitions.definitions[2].name, "Flute");
    ASSERT_EQ(loadInstrumentDefinitions(), 1);
    ASSERT_EQ(instrumentDefinitions.definitions.size(), 3u);
    const InstrumentDefinition& flute = instrumentDefinitions.definitions[2];
    EXPECT_EQ(flute.kind, "Sine");
    EXPECT_EQ(flute.midiVoice, 73);
    EXPECT_EQ(flute.highSemitone, 72);
    EXPECT_EQ(flute.semitones[12].samples[1].harmonics[0].meanAmplitude, 200u);
}

TEST_F(InstrumentModels, The257thDefinitionIsRefused) {
    fillTable(255);
    ASSERT_EQ(createInstrumentDefinition("Flute", 60, 60, 1.0, 200), 1);
    EXPECT_EQ(instrumentDefinitions.definitions.size(), 256u);
    Bytes saved = readFileBytes(definitionsPath());
    clearUiCalls();
    EXPECT_EQ(createInstrumentDefinition("Oboe", 60, 60, 1.0, 200), 0);
    EXPECT_EQ(lastMessageText(), "There is no more memory available to store new instruments.");
    EXPECT_EQ(instrumentDefinitions.definitions.size(), 256u);
    EXPECT_EQ(instrumentDefinitions.current, 255);
    EXPECT_EQ(readFileBytes(definitionsPath()), saved);
}

// ---- the delivered definitions ----

TEST_F(InstrumentModels, TheDeliveredFileIsExactlyWhatTheProgramGenerates) {
    ASSERT_EQ(createDeliveredInstruments(), 1);
    EXPECT_EQ(messageCount(), 0) << lastMessageText();
    Bytes delivered = readFileBytes(sourceRoot() + "Resources/CSInst.dat");
    ASSERT_FALSE(delivered.empty());
    EXPECT_TRUE(readFileBytes(definitionsPath()) == delivered)
        << "Resources/CSInst.dat is out of date: run makeInstruments Resources/CSInst.dat";
}

TEST_F(InstrumentModels, TheDeliveredFileHoldsTheDefaultInstrumentFirstAndTheMelodyInstruments) {
    setInstrumentDefinitionsFile("");
    ASSERT_EQ(loadInstrumentDefinitions(), 1) << lastMessageText();
    const std::vector<InstrumentDefinition>& t = instrumentDefinitions.definitions;
    ASSERT_EQ(t.size(), deliveredInstruments().size());
    EXPECT_EQ(t[0].name, globalSettings.defaultInstrument);
    EXPECT_EQ(t[0].midiVoice, 53);   // Voice Oohs
    for (const char* name : {"Flute", "Trumpet", "Violin", "Clarinet", "Soprano Sax", "Alto Sax", "Tenor Sax",
                             "Baritone Sax", "Whistle", "Piano", "Guitar", "Bass Guitar"}) {
        bool found = false;
        for (const InstrumentDefinition& d : t) found = found || d.name == name;
        EXPECT_TRUE(found) << name;
    }
    for (const InstrumentDefinition& d : t) {
        EXPECT_EQ(d.kind, d.name == "Guitar" || d.name == "Bass Guitar" ? "Synthesised" : "Sine") << d.name;
        for (const NoteSampleSet& set : d.semitones) EXPECT_EQ(set.sampleCount, 2) << d.name;
    }
}
