// Learning instrument definitions: pitch names, the parameters of a recording's file name,
// the notes of a recording, one note's harmonics from FT blocks built in code (positions,
// re-referencing, sorting, the limits and their messages), learning and replacing through
// the table and the file, and whole recordings made in code analysed by the program.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <string>
#include <tuple>
#include <vector>

#include "analysis/instrumentFixtures.h"
#include "analysis/instrumentLearning.h"
#include "analysis/pitchScale.h"
#include "analysis/signalGenerator.h"
#include "audio/waveFixtures.h"

static const double BLOCK = 1.0 / 64;   // seconds of a block in recordings built in code
static const double CENTS = 1.0;        // tolerances in cents

static double centsBetween(double a, double b) { return 1200.0 * std::fabs(std::log2(a / b)); }

// One frequency of a note built in code: present with amplitude in blocks [from, to) of the note.
struct Partial {
    double frequency;
    uint8_t amplitude;
    uint32_t from;
    uint32_t to;
};

static void addEntry(FTDataBuffer& b, double frequency, uint8_t amplitude) {
    FrequencyEntry& e = b.entries[b.nEntries++];
    e.frequency = float(frequency);
    e.frequencyWidth = float(frequency * 0.0250858);
    e.amplitude = amplitude;
    e.initialAmplitude = amplitude;
    e.cutOffLevel = 0;
    e.entryFlags = 0;
}

static FTDataBuffer emptyBlock() {
    FTDataBuffer b{};
    return b;
}

static LearningRecording emptyRecording(double blockDuration = BLOCK) {
    LearningRecording r{};
    r.blockDuration = blockDuration;
    r.lowAmplitudesRemoved = 1;
    return r;
}

// Appends a note of length blocks holding partials (in ascending frequency), then gap empty blocks.
static void appendNote(LearningRecording& r, uint32_t length, std::vector<Partial> partials, uint32_t gap = 10) {
    std::sort(partials.begin(), partials.end(),
              [](const Partial& a, const Partial& b) { return a.frequency < b.frequency; });
    for (uint32_t b = 0; b < length; b++) {
        FTDataBuffer block = emptyBlock();
        for (const Partial& p : partials)
            if (b >= p.from && b < p.to) addEntry(block, p.frequency, p.amplitude);
        r.blocks.push_back(block);
    }
    for (uint32_t b = 0; b < gap; b++) r.blocks.push_back(emptyBlock());
}

// A chromatic scale from low, count notes of 20 blocks, each a fundamental and its octave.
static LearningRecording scaleRecording(int low, int count, uint8_t level = 200) {
    LearningRecording r = emptyRecording();
    for (int b = 0; b < 10; b++) r.blocks.push_back(emptyBlock());
    for (int k = 0; k < count; k++) {
        double f = pitchToFrequency(low + k);
        appendNote(r, 20, {{f, level, 0, 20}, {2 * f, uint8_t(level / 2), 0, 20}});
    }
    return r;
}

// ---- pitch names ----

class PitchName : public InstrumentTest {};

// The first sharp or flat anywhere decides (so a lower-case b is flat); an accidental that
// would reach another letter's semitone is ignored; the octave is the first digit up to eight,
// nines are passed over. No letter or no digit is reported, when asked.
TEST_F(PitchName, NamesGiveTheirMidiNotes) {
    const std::pair<const char*, int> cases[] = {
        {"A4", 69},  {"C4", 60},  {"C#4", 61},  {"Db4", 61},  {"G3", 55},   {"B4", 71},   {"C0", 12},
        {"B8", 119}, {"a4", 69},  {"e2", 40},   {"Eb3", 51},  {"F#5", 78},  {"pitch C 4", 60},
        {"b4", 70},  {"C4#", 61}, {"D#b4", 63}, {"Db#4", 61}, {"B#4", 71},  {"Cb4", 60},  {"E#4", 64},
        {"Fb4", 65}, {"A94", 69}, {"C45", 60}};
    for (auto [text, note] : cases) EXPECT_EQ(parsePitchName(text, 1), note) << text;
    EXPECT_EQ(messageCount(), 0);
    for (const char* text : {"G9", "H4", "C", ""}) {
        EXPECT_EQ(parsePitchName(text, 1), 0);
        EXPECT_EQ(lastMessageText(), "Cannot interpret pitch in '" + std::string(text) + "'");
    }
    clearUiCalls();
    EXPECT_EQ(parsePitchName("H4", 0), 0);
    EXPECT_EQ(messageCount(), 0);
}

// ---- file name parameters ----

class InstrumentFileName : public InstrumentTest {};

TEST_F(InstrumentFileName, TheExtensionGoesButADecimalPointStays) {
    EXPECT_EQ(instrumentFileStem("/a/b.c/Flute_Real_Studio_440.0_C4_B4_0.wav"), "Flute_Real_Studio_440.0_C4_B4_0");
    EXPECT_EQ(instrumentFileStem("Flute_Real_Studio_440.0_C4_B4_0"), "Flute_Real_Studio_440.0_C4_B4_0");
    EXPECT_EQ(instrumentFileStem("x/Flute_Real_Studio_440_C4_B4_0.WAV"), "Flute_Real_Studio_440_C4_B4_0");
}

TEST_F(InstrumentFileName, SevenParametersDescribeADefinitionToLearn) {
    InstrumentFileParameters p{};
    ASSERT_EQ(readInstrumentFileParameters("rec/Alto Sax_Real_Studio_442.5_Db3_Ab5_1.wav", 0, &p), 1);
    EXPECT_EQ(std::tuple(p.name, p.kind, p.source, p.middleA, p.lowSemitone, p.highSemitone, p.sampleNumber),
              std::tuple("Alto Sax", "Real", "Studio", 442.5f, 49, 80, 1));
    ASSERT_EQ(readInstrumentFileParameters("Flute_Real_Studio_440_E4_0.wav", 1, &p), 1);
    EXPECT_EQ(std::tuple(p.lowSemitone, p.highSemitone, p.sampleNumber), std::tuple(64, 64, 0));
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(InstrumentFileName, ParametersThatCannotBeReadAreReportedWithTheFileName) {
    const std::string tooFew = "There are too few instrument definition parameters in filename data in '";
    const std::string tooMany = "There are too many instrument definition parameters in filename data in '";
    const std::tuple<const char*, int, std::string> cases[] = {
        {"rec/Flute_Real_Studio_440.0_C4_B4.wav", 0, tooFew + "Flute_Real_Studio_440.0_C4_B4.wav'"},
        {"Flute_Real_Studio_440.0_C4_B4_0_x.wav", 0, tooMany + "Flute_Real_Studio_440.0_C4_B4_0_x.wav'"},
        {"Flute_Real_Studio_440.0_C4_B4_0.wav", 1, tooMany + "Flute_Real_Studio_440.0_C4_B4_0.wav'"},
        {"Flute_Real_Studio_440.0_H4_B4_0.wav", 0, "Cannot interpret pitch in 'H4'"},
        {"Flute_Real_Studio_440.0_C4_H4_0.wav", 0, "Cannot interpret pitch in 'H4'"},
        {"Flute_Real_Studio_A440_C4_B4_0.wav", 0, "Cannot interpret middle A in 'A440'"},
        {"Flute_Real_Studio_0_C4_B4_0.wav", 0, "Cannot interpret middle A in '0'"},
        {"Flute_Real_Studio_440_B4_C4_0.wav", 0,
         "The low pitch is above the high pitch in filename data in 'Flute_Real_Studio_440_B4_C4_0.wav'"}};
    for (const auto& [name, replace, text] : cases) {
        InstrumentFileParameters p{};
        EXPECT_EQ(readInstrumentFileParameters(name, replace, &p), 0) << name;
        EXPECT_EQ(lastMessageText(), text);
        // Learning stops at the same message.
        EXPECT_EQ(learnFromRecording(name, replace, scaleRecording(60, 12)), 0);
        EXPECT_EQ(lastMessageText(), text);
    }
    EXPECT_TRUE(instrumentDefinitions.definitions.empty());
}

// ---- finding notes ----

class InstrumentNotesFound : public InstrumentTest {};

TEST_F(InstrumentNotesFound, ANoteMustBeLouderThan64AndLastAtLeast80Milliseconds) {
    LearningRecording r = emptyRecording();
    appendNote(r, 6, {{440, 65, 0, 6}});   // 6 blocks of 1/64 s: 0.094 s
    appendNote(r, 5, {{440, 200, 0, 5}});  // 0.078 s: too short
    appendNote(r, 9, {{440, 64, 0, 9}});   // not louder than 64
    appendNote(r, 9, {{440, 40, 0, 9}, {880, 25, 0, 9}}, 0);   // the block sums count: 65
    std::vector<LearningNote> notes = findLearningNotes(r);
    ASSERT_EQ(notes.size(), 2u);
    EXPECT_EQ(std::tuple(notes[0].start, notes[0].end, notes[1].start, notes[1].end), std::tuple(0u, 6u, 16u + 15u + 19u, 59u));
}

TEST_F(InstrumentNotesFound, AtMost128NotesAreFound) {
    LearningRecording r = emptyRecording();
    for (int k = 0; k < 130; k++) appendNote(r, 8, {{440, 100, 0, 8}}, 2);
    EXPECT_EQ(findLearningNotes(r).size(), 128u);
}

// ---- learning one note ----

class InstrumentNoteLearning : public InstrumentTest {
protected:
    NoteSample learn(const LearningRecording& r, double middleA = 440.0, int expected = 1) {
        NoteSample sample;
        EXPECT_EQ(learnNoteSample(r, 0, 20, middleA, &sample), expected);
        return sample;
    }
};

TEST_F(InstrumentNoteLearning, EachSteadyFrequencyBecomesAHarmonicWithItsPositionsAndMeanAmplitude) {
    LearningRecording r = emptyRecording();
    appendNote(r, 20, {{220, 200, 0, 20}, {440, 100, 5, 20}, {1000, 250, 3, 5}});
    NoteSample s = learn(r);
    EXPECT_EQ(s.duration, float(20 * BLOCK));
    EXPECT_EQ(s.level, (200u * 20 + 100 * 15 + 250 * 2) / 20);
    ASSERT_EQ(s.harmonicCount, 2);   // 1000 Hz lasts two blocks only
    const Harmonic& a = s.harmonics[0];
    EXPECT_NEAR(a.frequency, 220.0, 1e-3);
    EXPECT_NEAR(a.noteFrequency, 220.0, 1e-3);
    // It ends at (19 + 2) x 255 / 20, capped; its tolerance has no spread above and a steady
    // amplitude; its onset is two blocks of attack at 1/64 s.
    EXPECT_EQ(std::tuple(a.meanAmplitude, a.startPosition, a.endPosition, a.toleranceMeasures[0], a.toleranceMeasures[1]),
              std::tuple(200u, 0, 255, 0x0F, 0x00));
    EXPECT_EQ(std::tuple(a.onsetMeasures, a.peakAmplitude, a.presentBlocks, a.noteBlocks, a.onsetShape, a.decayShape),
              std::tuple(0x25, 200u, 20, 20, 256, 256));
    const Harmonic& b = s.harmonics[1];
    EXPECT_NEAR(b.frequency, 440.0, 1e-3);
    // Mean 100 x 15 blocks / 20; start 5 x 255 / 20 = 63.75; onset half the strongest harmonic's mean.
    EXPECT_EQ(std::tuple(b.meanAmplitude, b.startPosition, b.endPosition, b.onsetShape, b.presentBlocks),
              std::tuple(75u, 64, 255, 128, 15));
}

TEST_F(InstrumentNoteLearning, TheStrongestHarmonicsOnsetBecomesTheNotesStart) {
    LearningRecording r = emptyRecording();
    appendNote(r, 20, {{220, 200, 4, 20}, {440, 60, 8, 14}, {660, 50, 0, 20}});
    NoteSample s = learn(r);
    ASSERT_EQ(s.harmonicCount, 3);
    // Strongest: 220 Hz from block 4, position 51; the others are moved by it and stretched.
    // 660 Hz starts before the strongest one's onset; 440 Hz spans 102 .. 191, which become
    // (102 - 51) x 255 / 204 and (191 - 51) x 255 / 204.
    const int expected[3][3] = {{220, 0, 255}, {660, 0, 255}, {440, 63, 175}};
    for (int k = 0; k < 3; k++) {
        const Harmonic& h = s.harmonics[k];
        EXPECT_NEAR(h.frequency, expected[k][0], 1e-3) << k;
        EXPECT_EQ(std::tuple(h.startPosition, h.endPosition), std::tuple(expected[k][1], expected[k][2])) << k;
    }
}

TEST_F(InstrumentNoteLearning, HarmonicsAreSortedByLengthTimesMeanAmplitude) {
    LearningRecording r = emptyRecording();
    // 300 Hz is the loudest entry but lasts 4 blocks; 200 Hz is quieter and lasts the note.
    appendNote(r, 20, {{200, 100, 0, 20}, {300, 250, 0, 4}, {500, 90, 0, 20}});
    NoteSample s = learn(r);
    ASSERT_EQ(s.harmonicCount, 3);
    EXPECT_NEAR(s.harmonics[0].frequency, 200.0, 1e-3);
    EXPECT_NEAR(s.harmonics[1].frequency, 500.0, 1e-3);
    EXPECT_NEAR(s.harmonics[2].frequency, 300.0, 1e-3);
}

TEST_F(InstrumentNoteLearning, AHarmonicNeedsThreeBlocksInARowAndEndsAtItsFirstGap) {
    LearningRecording r = emptyRecording();
    appendNote(r, 20, {{220, 200, 0, 10}, {220, 200, 11, 20}, {500, 150, 2, 4}, {500, 150, 6, 8}});
    NoteSample s = learn(r);
    ASSERT_EQ(s.harmonicCount, 1);
    EXPECT_EQ(s.harmonics[0].meanAmplitude, 100u);   // ten blocks of 200 over twenty
    EXPECT_EQ(s.harmonics[0].endPosition, 140);      // (9 + 2) x 255 / 20 = 140.25
}

TEST_F(InstrumentNoteLearning, TheNearestNoteFollowsTheMiddleAAndTheAttackTheBlockDuration) {
    LearningRecording r = emptyRecording();
    appendNote(r, 20, {{442.0, 200, 0, 20}});
    EXPECT_NEAR(learn(r, 442.0).harmonics[0].noteFrequency, 442.0, 1e-3);
    EXPECT_NEAR(learn(r, 440.0).harmonics[0].noteFrequency, 440.0, 1e-3);
    LearningRecording shortBlocks = emptyRecording(1.0 / 128);
    appendNote(shortBlocks, 20, {{440.0, 200, 0, 20}});
    EXPECT_EQ(learn(shortBlocks).harmonics[0].onsetMeasures, 0x55);   // 0.04 s is five blocks of 1/128 s
}

TEST_F(InstrumentNoteLearning, ThirtyTwoHarmonicsEndTheNoteWithTheMessage) {
    LearningRecording r = emptyRecording();
    std::vector<Partial> partials;
    for (int k = 0; k < 40; k++) partials.push_back({100.0 * std::pow(1.1, k), uint8_t(250 - k), 0, 20});
    appendNote(r, 20, partials);
    NoteSample s = learn(r, 440.0, 0);
    EXPECT_EQ(s.harmonicCount, 32);
    EXPECT_EQ(lastMessageText(),
              "Cannot learn note as found too many harmonics - Increase MAX_CS_HARMONICS definition in Instruments");
}

TEST_F(InstrumentNoteLearning, AFullIgnoreListEndsTheNoteWithTheMessage) {
    LearningRecording r = emptyRecording();
    // Three hundred frequencies, a semitone and more apart, each present in one block only.
    for (int b = 0; b < 20; b++) {
        FTDataBuffer block = emptyBlock();
        for (int k = 0; k < 15; k++) addEntry(block, 30.0 * std::pow(1.07, b * 15 + k), 200);
        r.blocks.push_back(block);
    }
    NoteSample s = learn(r, 440.0, 0);
    EXPECT_EQ(s.harmonicCount, 0);
    EXPECT_EQ(messageCount(), 1);
    EXPECT_EQ(lastMessageText(), "Cannot learn note - Increase MaxIgnoreFrequencies constant in AnalyseNote");
}

TEST_F(InstrumentNoteLearning, EntriesThatAreNotFrequenciesAreIgnoredWithoutLooping) {
    LearningRecording r = emptyRecording();
    appendNote(r, 20, {{220, 200, 0, 20}});
    for (int b = 0; b < 20; b++) {
        addEntry(r.blocks[size_t(b)], std::nan(""), 255);
        addEntry(r.blocks[size_t(b)], -5.0, 255);
        addEntry(r.blocks[size_t(b)], 0.0, 255);
    }
    NoteSample s = learn(r);
    ASSERT_EQ(s.harmonicCount, 1);
    EXPECT_NEAR(s.harmonics[0].frequency, 220.0, 1e-3);
}

// ---- learning and replacing through the table ----

class InstrumentLearning : public InstrumentTest {
protected:
    std::string recordingPath(const std::string& name) const { return folder.file(name); }
    // A wave file of count notes from low (0.3 s each after 0.2 s of silence), 22050 Hz.
    void writeScale(const std::string& name, int low, int count, std::vector<double> harmonics = {1.0, 0.5, 0.3}) {
        std::vector<double> x = silenceSignal(0.3, 22050);
        for (int k = 0; k < count; k++) {
            std::vector<double> note = toneSignal(pitchToFrequency(low + k), 8000, 0.3, 22050, harmonics);
            x.insert(x.end(), note.begin(), note.end());
            std::vector<double> gap = silenceSignal(0.2, 22050);
            x.insert(x.end(), gap.begin(), gap.end());
        }
        writeFileBytes(recordingPath(name), pcmWave(1, 22050, 16, toSampleBytes(x, 16)));
    }
};

TEST_F(InstrumentLearning, TwelveNotesAreLearntIntoSixtyToSeventyOne) {
    writeScale("Flute_Real_Studio_440.0_C4_B4_0.wav", 60, 12);
    ASSERT_EQ(learnFromFile(recordingPath("Flute_Real_Studio_440.0_C4_B4_0.wav"), 0), 1) << lastMessageText();
    EXPECT_EQ(messageCount(), 0) << lastMessageText();
    ASSERT_EQ(loadInstrumentDefinitions(), 1);
    ASSERT_EQ(instrumentDefinitions.definitions.size(), 1u);
    const InstrumentDefinition& d = instrumentDefinitions.definitions[0];
    EXPECT_EQ(instrumentDefinitionText(d),
              "Flute (Real) - Studio. MIDI voice is 73. Max notes in chord is 1. Middle A is 440.00Hz. Semitone range "
              "is 60 to 71. Score thresholds: 70.0%, 30.0%, 10.0%.");
    ASSERT_EQ(d.semitones.size(), 12u);
    for (int k = 0; k < 12; k++) {
        const NoteSampleSet& set = d.semitones[size_t(k)];
        ASSERT_EQ(set.sampleCount, 1) << k;
        const NoteSample& s = set.samples[0];
        EXPECT_NEAR(s.duration, 0.3, 0.05) << k;
        ASSERT_GE(s.harmonicCount, 2) << k;
        double f = pitchToFrequency(60 + k);
        EXPECT_LT(centsBetween(s.harmonics[0].frequency, f), 20 * CENTS) << k;
        EXPECT_NEAR(s.harmonics[0].noteFrequency, f, f * 1e-6) << k;
        EXPECT_LT(centsBetween(s.harmonics[1].frequency, 2 * f), 20 * CENTS) << k;
        EXPECT_EQ(s.harmonics[0].startPosition, 0) << k;
    }
    // The song's stores were only borrowed.
    EXPECT_EQ(song.blockCount, 0u);
    EXPECT_FALSE(recognitionOptions.learningInstruments);
}

TEST_F(InstrumentLearning, ElevenNotesAreRejectedWithTheCountMessage) {
    writeScale("Flute_Real_Studio_440.0_C4_B4_0.wav", 60, 11);
    EXPECT_EQ(learnFromFile(recordingPath("Flute_Real_Studio_440.0_C4_B4_0.wav"), 0), 0);
    EXPECT_EQ(lastMessageText(), "The number of notes (11) found in the waveform 'Flute_Real_Studio_440.0_C4_B4_0.wav' "
                                 "does not match the number of notes specified in the filename (12).");
    EXPECT_TRUE(instrumentDefinitions.definitions.empty());
    EXPECT_FALSE(fileExists(definitionsPath()));
}

TEST_F(InstrumentLearning, ASingleNoteReplacesTheLearntSampleOfItsPitch) {
    writeScale("Flute_Real_Studio_440.0_C4_B4_0.wav", 60, 12);
    ASSERT_EQ(learnFromFile(recordingPath("Flute_Real_Studio_440.0_C4_B4_0.wav"), 0), 1) << lastMessageText();
    InstrumentDefinition before = instrumentDefinitions.definitions.at(0);
    writeScale("Flute_Real_Studio_440.0_E4_0.wav", 64, 1, {1.0});
    ASSERT_EQ(learnFromFile(recordingPath("Flute_Real_Studio_440.0_E4_0.wav"), 1), 1) << lastMessageText();
    ASSERT_EQ(loadInstrumentDefinitions(), 1);
    const InstrumentDefinition& after = instrumentDefinitions.definitions.at(0);
    // The new recording of E4 is a pure tone: its sample has lost the octave the scale's had.
    auto octaves = [](const NoteSample& s) {
        int n = 0;
        for (int k = 0; k < s.harmonicCount; k++)
            n += centsBetween(s.harmonics[k].frequency, 2 * pitchToFrequency(64)) < 20 * CENTS;
        return n;
    };
    EXPECT_EQ(after.semitones[4].sampleCount, 1);
    EXPECT_EQ(octaves(before.semitones[4].samples[0]), 1);
    EXPECT_EQ(octaves(after.semitones[4].samples[0]), 0);
    EXPECT_LT(centsBetween(after.semitones[4].samples[0].harmonics[0].frequency, pitchToFrequency(64)), 20 * CENTS);
    for (size_t k : {3, 5}) EXPECT_EQ(after.semitones[k].samples[0].level, before.semitones[k].samples[0].level);
}

TEST_F(InstrumentLearning, AnOpenSongOrAFrequencyTableFileIsNotAnalysed) {
    LearningRecording r{};
    song.blockCount = 5;
    EXPECT_EQ(analyseLearningFile(recordingPath("Flute_Real_Studio_440.0_C4_B4_0.wav"), &r), 0);
    EXPECT_EQ(lastMessageText(), "Please close the song before learning instruments.");
    song.blockCount = 0;
    EXPECT_EQ(analyseLearningFile(recordingPath("Flute_Real_Studio_440.0_C4_B4_0.ftb"), &r), 0);
    EXPECT_EQ(lastMessageText(), "Frequency table files cannot be learnt from: 'Flute_Real_Studio_440.0_C4_B4_0.ftb'.");
    EXPECT_EQ(analyseLearningFile(recordingPath("Flute_Real_Studio_440.0_C4_B4_0.wav"), &r), 0);
    EXPECT_EQ(lastMessageText(), "This file cannot be opened. Please check it is not open in another application.");
}

TEST_F(InstrumentLearning, ScalesBuiltInCodeAreLearntWithTheVoiceOfTheName) {
    ASSERT_EQ(learnFromRecording("Alto Sax_Real_Studio_440_C4_E4_0.wav", 0, scaleRecording(60, 5)), 1);
    ASSERT_EQ(learnFromRecording("Guitar_Real_Studio_440_E2_G2_0.wav", 0, scaleRecording(40, 4)), 1);
    const std::vector<InstrumentDefinition>& t = instrumentDefinitions.definitions;
    ASSERT_EQ(t.size(), 2u);
    EXPECT_EQ(std::tuple(t[0].midiVoice, t[0].maxNotesInChord, t[1].midiVoice, t[1].maxNotesInChord), std::tuple(65, 1, 24, 6));
    EXPECT_EQ(instrumentDefinitions.current, 1);
    EXPECT_NEAR(t[1].semitones[3].samples[0].harmonics[0].frequency, pitchToFrequency(43), 1e-3);
}

TEST_F(InstrumentLearning, ASecondSampleIsAddedToTheDefinitionWithTheSameNamesTuningAndRange) {
    ASSERT_EQ(learnFromRecording("Flute_Real_Studio_440_C4_D4_0.wav", 0, scaleRecording(60, 3, 200)), 1);
    ASSERT_EQ(learnFromRecording("Flute_Real_Studio_440_C4_D4_1.wav", 0, scaleRecording(60, 3, 100)), 1);
    ASSERT_EQ(learnFromRecording("Flute_Real_Studio_442_C4_D4_1.wav", 0, scaleRecording(60, 3, 100)), 1);
    ASSERT_EQ(loadInstrumentDefinitions(), 1);
    const std::vector<InstrumentDefinition>& t = instrumentDefinitions.definitions;
    ASSERT_EQ(t.size(), 2u);   // another middle A is another definition
    for (const NoteSampleSet& set : t[0].semitones) {
        ASSERT_EQ(set.sampleCount, 2);
        EXPECT_EQ(set.samples[0].harmonics[0].meanAmplitude, 200u);
        EXPECT_EQ(set.samples[1].harmonics[0].meanAmplitude, 100u);
    }
    // Sample 1 of a new definition comes with an empty sample 0.
    for (const NoteSampleSet& set : t[1].semitones) {
        ASSERT_EQ(set.sampleCount, 2);
        EXPECT_EQ(set.samples[0].harmonicCount, 0);
        EXPECT_EQ(set.samples[0].duration, 0.0f);
        EXPECT_EQ(set.samples[1].harmonicCount, 2);
    }
    EXPECT_NEAR(t[1].semitones[0].samples[1].harmonics[0].noteFrequency, pitchToFrequency(60, 442.0), 1e-3);
}

TEST_F(InstrumentLearning, ANameLongerThanTheFileHoldsFindsItsDefinitionAfterAReload) {
    std::string name(40, 'L');
    ASSERT_EQ(learnFromRecording(name + "_Real_Studio_440_C4_D4_0.wav", 0, scaleRecording(60, 3)), 1);
    ASSERT_EQ(loadInstrumentDefinitions(), 1);
    ASSERT_EQ(learnFromRecording(name + "_Real_Studio_440_C4_D4_1.wav", 0, scaleRecording(60, 3)), 1);
    ASSERT_EQ(instrumentDefinitions.definitions.size(), 1u);
    EXPECT_EQ(instrumentDefinitions.definitions[0].name, std::string(32, 'L'));
    EXPECT_EQ(instrumentDefinitions.definitions[0].semitones[2].sampleCount, 2);
}

TEST_F(InstrumentLearning, ASampleNumberOfTwoIsOutOfRangeOnceTheCountMatches) {
    EXPECT_EQ(learnFromRecording("Flute_Real_Studio_440_C4_D4_2.wav", 0, scaleRecording(60, 2)), 0);
    EXPECT_EQ(lastMessageText(), "The number of notes (2) found in the waveform 'Flute_Real_Studio_440_C4_D4_2.wav' "
                                 "does not match the number of notes specified in the filename (3).");
    EXPECT_EQ(learnFromRecording("Flute_Real_Studio_440_C4_D4_2.wav", 0, scaleRecording(60, 3)), 0);
    EXPECT_EQ(lastMessageText(), "Pitch sample number out of range in waveform 'Flute_Real_Studio_440_C4_D4_2.wav'.");
    EXPECT_EQ(learnFromRecording("Flute_Real_Studio_440_C4_D4_x.wav", 0, scaleRecording(60, 3)), 0);
    EXPECT_EQ(lastMessageText(), "Pitch sample number out of range in waveform 'Flute_Real_Studio_440_C4_D4_x.wav'.");
    EXPECT_TRUE(instrumentDefinitions.definitions.empty());
}

TEST_F(InstrumentLearning, The257thDefinitionIsRefused) {
    fillTable(255);
    ASSERT_EQ(learnFromRecording("Flute_Real_Studio_440_C4_D4_0.wav", 0, scaleRecording(60, 3)), 1);
    EXPECT_EQ(instrumentDefinitions.definitions.size(), 256u);
    EXPECT_EQ(learnFromRecording("Oboe_Real_Studio_440_C4_D4_0.wav", 0, scaleRecording(60, 3)), 0);
    EXPECT_EQ(lastMessageText(), "There is no more memory available to store new instruments.");
    EXPECT_EQ(instrumentDefinitions.definitions.size(), 256u);
}

TEST_F(InstrumentLearning, TablesMadeWithoutRemovingLowAmplitudesAreNotLearnt) {
    LearningRecording r = scaleRecording(60, 3);
    r.lowAmplitudesRemoved = 0;
    EXPECT_EQ(learnFromRecording("Flute_Real_Studio_440_C4_D4_0.wav", 0, r), 0);
    EXPECT_EQ(lastMessageText(),
              "Filters have not been applied to 'Flute_Real_Studio_440_C4_D4_0.wav', so it will not be analysed.");
    EXPECT_TRUE(instrumentDefinitions.definitions.empty());
}

TEST_F(InstrumentLearning, AReplacementNeedsAMatchingLearntSampleAndExactlyOneNote) {
    ASSERT_EQ(learnFromRecording("Flute_Real_Studio_440_C4_D4_0.wav", 0, scaleRecording(60, 3)), 1);
    for (const char* name : {"Flute_Real_Studio_440_C4_1.wav", "Flute_Real_Studio_442_C4_0.wav",
                             "Flute_Real_Studio_440_E4_0.wav", "Oboe_Real_Studio_440_C4_0.wav"}) {
        EXPECT_EQ(learnFromRecording(name, 1, scaleRecording(60, 1)), 0) << name;
        EXPECT_EQ(lastMessageText(),
                  "A matching pitch could not be found for replacement by '" + std::string(name) + "'.");
    }
    EXPECT_EQ(learnFromRecording("Flute_Real_Studio_440_C#4_0.wav", 1, scaleRecording(61, 2)), 0);
    EXPECT_EQ(lastMessageText(),
              "Cantoscope did not find exactly one note in the waveform 'Flute_Real_Studio_440_C#4_0.wav'. "
              "It found 2.");
    ASSERT_EQ(learnFromRecording("Flute_Real_Studio_440_C#4_0.wav", 1, scaleRecording(61, 1, 90)), 1);
    EXPECT_EQ(instrumentDefinitions.definitions[0].semitones[1].samples[0].harmonics[0].meanAmplitude, 90u);
    EXPECT_EQ(instrumentDefinitions.definitions[0].semitones[0].samples[0].harmonics[0].meanAmplitude, 200u);
}

TEST_F(InstrumentLearning, ANoteStoppedPartWayKeepsItsHarmonicsInTheDefinition) {
    LearningRecording r = emptyRecording();
    appendNote(r, 20, {{pitchToFrequency(60), 200, 0, 20}});
    std::vector<Partial> many;
    for (int k = 0; k < 40; k++) many.push_back({pitchToFrequency(61) * std::pow(1.1, k), uint8_t(250 - k), 0, 20});
    appendNote(r, 20, many);
    ASSERT_EQ(learnFromRecording("Flute_Real_Studio_440_C4_C#4_0.wav", 0, r), 1);
    EXPECT_EQ(lastMessageText(),
              "Cannot learn note as found too many harmonics - Increase MAX_CS_HARMONICS definition in Instruments");
    ASSERT_EQ(loadInstrumentDefinitions(), 1);
    EXPECT_EQ(instrumentDefinitions.definitions.at(0).semitones[1].samples[0].harmonicCount, 32);
}
