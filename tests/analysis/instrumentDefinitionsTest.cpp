// The instrument definitions file: its exact bytes, round trips that keep every Harmonic byte,
// names beyond ASCII and beyond the field, every damaged file refused with its message (the
// fuzz target's replay checks mutated files), save failures that keep the old file; the
// table's deletion rules, the chord limits, the nearest note and the instrument window's line.
#include <gtest/gtest.h>

#include <filesystem>

#include <cstdint>
#include <cstring>
#include <string>
#include <tuple>
#include <vector>

#include "analysis/instrumentDefinitions.h"
#include "analysis/instrumentFixtures.h"
#include "resources/strings.h"

static const char* const VERSION_TEXT =
    "The instrument definitions file cannot be used (it could be out of date) and will not be loaded.";

static Bytes hexBytes(const char* text) {
    Bytes b;
    for (const char* p = text; *p;) {
        if (*p == ' ') {
            p++;
            continue;
        }
        b.push_back(uint8_t(std::stoul(std::string(p, 2), nullptr, 16)));
        p += 2;
    }
    return b;
}

static Bytes operator+(Bytes a, const Bytes& b) {
    a.insert(a.end(), b.begin(), b.end());
    return a;
}

static Bytes zeros(size_t n) { return Bytes(n, 0); }

// A 440 Hz sine harmonic as the generated models make it.
static Harmonic sine440(uint32_t level) {
    Harmonic h{};
    h.frequency = 440.0f;
    h.noteFrequency = 440.0f;
    h.meanAmplitude = level;
    h.endPosition = 255;
    h.toleranceMeasures[0] = 14;
    h.onsetMeasures = 0x25;
    h.onsetShape = h.sustainShape = h.decayShape = 256;
    return h;
}

class InstrumentFile : public InstrumentTest {
protected:
    std::string damagedText(const std::string& reason) const {
        return "The instrument definitions file '" + definitionsPath() + "' cannot be used (" + reason +
               ") and will not be loaded.";
    }
    // Loads bytes as the definitions file; the result of the load.
    int loadBytes(const Bytes& bytes) {
        writeFileBytes(definitionsPath(), bytes);
        clearUiCalls();
        return loadInstrumentDefinitions();
    }
    // A file of one definition over 60..62 with one, two and no samples.
    static Bytes threeSemitoneFile() {
        Bytes b = fileHead(1);
        putDefinitionHead(b, "Flute", 60, 62);
        b.push_back(1);
        putSample(b, 0.5f, 100, 2, 1);
        b.push_back(2);
        putSample(b, 0.5f, 100, 0, 2);
        putSample(b, 1.0f, 200, 32, 3);
        b.push_back(0);
        return b;
    }
};

// ---- exact bytes and round trips ----

TEST_F(InstrumentFile, ASmallTableIsWrittenFieldByFieldWithoutPadding) {
    InstrumentDefinition d = emptyDefinition("Flute", 60, 61);
    d.semitones[0].sampleCount = 1;
    d.semitones[0].samples[0].duration = 0.5f;
    d.semitones[0].samples[0].level = 200;
    d.semitones[0].samples[0].harmonicCount = 1;
    d.semitones[0].samples[0].harmonics[0] = sine440(200);
    instrumentDefinitions.definitions.push_back(d);
    ASSERT_EQ(saveInstrumentDefinitions(), 1);

    Bytes expected = hexBytes("0A 01000000") +
                     hexBytes("46006C00750074006500") + zeros(54) +     // "Flute"
                     hexBytes("5200650061006C00") + zeros(56) +         // "Real"
                     hexBytes("530074007500640069006F00") + zeros(52) + // "Studio"
                     hexBytes("49 01 00008C42 0000F041 00002041 0000DC43 3C 3D") +
                     hexBytes("01 0000003F C8000000 01") +              // semitone 60: one sample, one harmonic
                     hexBytes("0000DC43 0000DC43 C8000000 00 FF 0E 00 25 00 0001 0001 0001 00000000 0000 0000") +
                     zeros(24) +
                     hexBytes("00");                                    // semitone 61: no samples
    EXPECT_EQ(readFileBytes(definitionsPath()), expected);
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(InstrumentFile, AnEmptyTableIsTheVersionAndACountOfZero) {
    ASSERT_EQ(saveInstrumentDefinitions(), 1);
    EXPECT_EQ(readFileBytes(definitionsPath()), hexBytes("0A 00000000"));
    EXPECT_EQ(loadInstrumentDefinitions(), 1);
    EXPECT_TRUE(instrumentDefinitions.definitions.empty());
}

TEST_F(InstrumentFile, LoadingAndSavingKeepsEveryByteOfEveryHarmonic) {
    Bytes file = threeSemitoneFile();
    // Harmonic fields that are not numbers still go through unchanged.
    size_t firstHarmonic = 5 + 212 + 1 + 9;
    for (int i = 0; i < 8; i++) file[firstHarmonic + size_t(i)] = 0xFF;
    ASSERT_EQ(loadBytes(file), 1);
    ASSERT_EQ(instrumentDefinitions.definitions.size(), 1u);
    std::filesystem::remove(definitionsPath());
    ASSERT_EQ(saveInstrumentDefinitions(), 1);
    EXPECT_EQ(readFileBytes(definitionsPath()), file);
}

TEST_F(InstrumentFile, ALoadedDefinitionHoldsTheFieldsOfTheFile) {
    Bytes b = fileHead(2);
    putDefinitionHead(b, "Voice", 69, 69, 53, 1, 442.0f);
    b.push_back(1);
    putSample(b, 0.25f, 7, 1, 9);
    putDefinitionHead(b, "Piano", 21, 22, 0, 12);
    b.push_back(0);
    b.push_back(2);
    putSample(b, 1.0f, 100, 0, 0);
    putSample(b, 2.0f, 200, 1, 5);
    ASSERT_EQ(loadBytes(b), 1);
    const std::vector<InstrumentDefinition>& t = instrumentDefinitions.definitions;
    ASSERT_EQ(t.size(), 2u);
    EXPECT_EQ(std::tuple(t[0].name, t[0].kind, t[0].source, t[0].midiVoice, t[0].middleA, t[0].scoreThresholds[1]),
              std::tuple("Voice", "Real", "Studio", 53, 442.0f, 30.0f));
    ASSERT_EQ(std::tuple(t[0].semitones.size(), t[1].semitones.size()), std::tuple(1u, 2u));
    const NoteSampleSet &voice = t[0].semitones[0], &piano0 = t[1].semitones[0], &piano1 = t[1].semitones[1];
    EXPECT_EQ(std::tuple(voice.sampleCount, voice.samples[0].duration, voice.samples[0].level), std::tuple(1, 0.25f, 7u));
    EXPECT_EQ(std::tuple(t[1].maxNotesInChord, piano0.sampleCount, piano1.sampleCount), std::tuple(12, 0, 2));
    EXPECT_EQ(std::tuple(piano1.samples[0].harmonicCount, piano1.samples[1].level), std::tuple(0, 200u));
    ASSERT_EQ(piano1.samples[1].harmonicCount, 1);
    const uint8_t* h = reinterpret_cast<const uint8_t*>(&t[1].semitones[1].samples[1].harmonics[0]);
    for (int i = 0; i < 56; i++) EXPECT_EQ(h[i], uint8_t(5 + i * 13)) << i;
}

TEST_F(InstrumentFile, NamesBeyondAsciiGoAsUtf16AndLongNamesAreCutAtACharacter) {
    InstrumentDefinition d = emptyDefinition("Fl\xC3\xBBte", 60, 60);   // "Flûte"
    d.kind = std::string(31, 'k') + "\xF0\x9D\x84\x9E";                 // 31 units, then a pair that does not fit
    d.source = "\xF0\x9D\x84\x9E" + std::string(40, 's');               // a pair, then more than fits
    instrumentDefinitions.definitions.push_back(d);
    ASSERT_EQ(saveInstrumentDefinitions(), 1);
    Bytes file = readFileBytes(definitionsPath());
    EXPECT_EQ(Bytes(file.begin() + 5, file.begin() + 15), hexBytes("46006C00FB0074006500"));
    EXPECT_EQ(getU16(file, 5 + 64 + 60), uint16_t('k'));
    EXPECT_EQ(getU16(file, 5 + 64 + 62), 0);
    EXPECT_EQ(getU16(file, 5 + 128), 0xD834);
    EXPECT_EQ(getU16(file, 5 + 130), 0xDD1E);
    EXPECT_EQ(getU16(file, 5 + 128 + 62), uint16_t('s'));

    ASSERT_EQ(loadInstrumentDefinitions(), 1);
    const InstrumentDefinition& loaded = instrumentDefinitions.definitions.at(0);
    EXPECT_EQ(loaded.name, "Fl\xC3\xBBte");
    EXPECT_EQ(loaded.kind, std::string(31, 'k'));
    EXPECT_EQ(loaded.source, "\xF0\x9D\x84\x9E" + std::string(30, 's'));
}

TEST_F(InstrumentFile, ALoneSurrogateInAStoredNameReadsAsAReplacementCharacter) {
    Bytes b = fileHead(1);
    putDefinitionHead(b, "Ab", 60, 60);
    b[5 + 2] = 0x00;
    b[5 + 3] = 0xDC;   // the second unit: a low surrogate alone
    b.push_back(0);
    ASSERT_EQ(loadBytes(b), 1);
    EXPECT_EQ(instrumentDefinitions.definitions.at(0).name, "A\xEF\xBF\xBD");
}

// ---- refused files ----

TEST_F(InstrumentFile, AMissingFileLeavesTheTableEmptyWithoutAMessage) {
    fillTable(3);
    EXPECT_EQ(loadInstrumentDefinitions(), 0);
    EXPECT_TRUE(instrumentDefinitions.definitions.empty());
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(InstrumentFile, AnotherVersionIsRefusedWithTheVersionMessageAndEmptiesTheTable) {
    Bytes file = threeSemitoneFile();
    ASSERT_EQ(loadBytes(file), 1);
    for (uint8_t version : {0, 9, 11, 255}) {
        file[0] = version;
        EXPECT_EQ(loadBytes(file), 0) << int(version);
        EXPECT_EQ(lastMessageText(), VERSION_TEXT);
        EXPECT_EQ(messageCount(), 1);
        EXPECT_TRUE(instrumentDefinitions.definitions.empty());
    }
}

// A damaged file is refused with its reason and leaves the table empty: cut short anywhere,
// more than 256 definitions, a sample of more than 32 harmonics, a range upside down or beyond
// note 127, a semitone of three samples, bytes after the last definition.
TEST_F(InstrumentFile, ADamagedFileIsRefusedWithItsReason) {
    const Bytes file = threeSemitoneFile();
    std::vector<std::pair<Bytes, std::string>> cases;
    for (size_t length : {size_t(0), size_t(1), size_t(4), size_t(5), size_t(100), size_t(5 + 212),
                          size_t(5 + 212 + 1 + 9 + 56), file.size() - 1})
        cases.push_back({Bytes(file.begin(), file.begin() + long(length)), "it ends before its last definition"});
    cases.push_back({fileHead(257), "it holds more than 256 definitions"});
    cases.push_back({fileHead(0xFFFFFFFF), "it holds more than 256 definitions"});
    Bytes harmonics = fileHead(1);
    putDefinitionHead(harmonics, "Flute", 60, 60);
    harmonics.push_back(1);
    putSample(harmonics, 0.5f, 100, 32, 0);
    ASSERT_EQ(loadBytes(harmonics), 1) << "32 harmonics are the most a sample holds";
    harmonics[5 + 212 + 1 + 8] = 33;
    cases.push_back({harmonics, "a note sample has more than 32 harmonics"});
    Bytes upsideDown = fileHead(1), beyond = fileHead(1), three = fileHead(1);
    putDefinitionHead(upsideDown, "Flute", 61, 60);
    putDefinitionHead(beyond, "Flute", 127, 128);
    for (Bytes* b : {&upsideDown, &beyond}) b->insert(b->end(), {0, 0});
    cases.push_back({upsideDown, "a semitone range has its low note above its high note"});
    cases.push_back({beyond, "a semitone range goes beyond note 127"});
    putDefinitionHead(three, "Flute", 60, 60);
    three.push_back(3);
    for (int i = 0; i < 3; i++) putSample(three, 0.5f, 100, 0, 0);
    cases.push_back({three, "a semitone has more than two note samples"});
    cases.push_back({file + Bytes{0}, "it has bytes after its last definition"});
    for (const auto& [bytes, reason] : cases) {
        EXPECT_EQ(loadBytes(bytes), 0) << reason << ", " << bytes.size() << " bytes";
        EXPECT_EQ(lastMessageText(), damagedText(reason));
        EXPECT_EQ(messageCount(), 1);
        EXPECT_TRUE(instrumentDefinitions.definitions.empty());
    }
}

TEST_F(InstrumentFile, AFailedAllocationGivesTheMemoryMessageAndAnEmptyTable) {
    for (int n : {1, 2}) {
        failAllocation(n);
        EXPECT_EQ(loadBytes(threeSemitoneFile()), 0) << n;
        EXPECT_EQ(lastMessageText(), resourceString(10401));
        EXPECT_TRUE(instrumentDefinitions.definitions.empty());
    }
}

TEST_F(InstrumentFile, ARefusedFileIsKeptAsideWhenTheTableIsNextSaved) {
    Bytes old = threeSemitoneFile();
    old[0] = 9;
    EXPECT_EQ(loadBytes(old), 0);
    instrumentDefinitions.definitions.push_back(emptyDefinition("Flute", 60, 60));
    ASSERT_EQ(saveInstrumentDefinitions(), 1);
    EXPECT_EQ(readFileBytes(definitionsPath() + ".damaged"), old);
    EXPECT_EQ(loadInstrumentDefinitions(), 1);
    EXPECT_EQ(instrumentDefinitions.definitions.size(), 1u);
}

// ---- saving ----

// A failed write or close, or a file that cannot be created, is reported and keeps the old
// file, with no new one left behind.
TEST_F(InstrumentFile, AFailedSaveIsReportedAndKeepsTheOldFile) {
    instrumentDefinitions.definitions.push_back(emptyDefinition("Flute", 60, 60));
    ASSERT_EQ(saveInstrumentDefinitions(), 1);
    const Bytes old = readFileBytes(definitionsPath());
    instrumentDefinitions.definitions.push_back(emptyDefinition("Oboe", 60, 70));
    for (auto [op, text] : {std::pair{FILE_OP_WRITE, "Bytes were not stored properly"},
                            std::pair{FILE_OP_CLOSE, "File could not be closed"}}) {
        failFileCall(op, op == FILE_OP_WRITE ? 2 : 1);
        EXPECT_EQ(saveInstrumentDefinitions(), 0);
        EXPECT_EQ(lastMessageText(), text);
        EXPECT_EQ(readFileBytes(definitionsPath()), old);
        EXPECT_FALSE(fileExists(definitionsPath() + ".new"));
    }
    setInstrumentDefinitionsFile(folder.file("missing/CSInst.dat"));
    EXPECT_EQ(saveInstrumentDefinitions(), 0);
    EXPECT_EQ(lastMessageText(), "Cannot " + folder.file("missing/CSInst.dat"));
}

// ---- the table ----

class InstrumentTable : public InstrumentTest {};

TEST_F(InstrumentTable, DeletingMovesTheLaterDefinitionsDownAndSavesTheFile) {
    fillTable(4);
    instrumentDefinitions.current = 1;
    EXPECT_EQ(deleteInstrumentDefinition(1), 1);
    ASSERT_EQ(instrumentDefinitions.definitions.size(), 3u);
    EXPECT_EQ(instrumentDefinitions.definitions[1].name, "Filler2");
    EXPECT_EQ(instrumentDefinitions.current, 1);   // not at or past the new end: it stays
    ASSERT_EQ(loadInstrumentDefinitions(), 1);
    EXPECT_EQ(instrumentDefinitions.definitions.size(), 3u);
    EXPECT_EQ(instrumentDefinitions.definitions[2].name, "Filler3");
}

TEST_F(InstrumentTable, TheCurrentIndexMovesDownWhenItPointedAtOrPastTheNewEnd) {
    fillTable(3);
    instrumentDefinitions.current = 2;
    for (auto [index, current] : {std::pair(0, 1), std::pair(1, 0), std::pair(0, 0)}) {
        EXPECT_EQ(deleteInstrumentDefinition(index), 1);
        EXPECT_EQ(instrumentDefinitions.current, current) << index;
    }
    EXPECT_TRUE(instrumentDefinitions.definitions.empty());
}

TEST_F(InstrumentTable, AnIndexOutsideTheTableChangesNothing) {
    fillTable(2);
    EXPECT_EQ(deleteInstrumentDefinition(2), 0);
    EXPECT_EQ(deleteInstrumentDefinition(-1), 0);
    EXPECT_EQ(instrumentDefinitions.definitions.size(), 2u);
    EXPECT_FALSE(fileExists(definitionsPath()));
}

// ---- chord limits, notes and the window's line ----

class InstrumentChordLimit : public InstrumentTest {};

TEST_F(InstrumentChordLimit, EachVoiceGetsItsTableValueAndOthersOne) {
    struct Case {
        int voice, notes;
    };
    for (Case c : {Case{0, 12}, Case{5, 12}, Case{6, 1}, Case{7, 1}, Case{8, 12}, Case{9, 1}, Case{10, 1},
                   Case{11, 4}, Case{12, 1}, Case{23, 1}, Case{24, 6}, Case{31, 6}, Case{32, 4}, Case{39, 4},
                   Case{40, 2}, Case{41, 1}, Case{53, 1}, Case{127, 1}})
        EXPECT_EQ(maxNotesInChords(c.voice), c.notes) << c.voice;
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(InstrumentChordLimit, AValueAboveTheProgramsLimitIsReportedAndLimited) {
    EXPECT_EQ(limitNotesInChord(12), 12);
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(limitNotesInChord(13), 12);
    EXPECT_EQ(lastMessageText(),
              "An instrument in 'maxNotesInChords()' has been defined with a higher value than 'MAX_CS_NOTESINCHORD'");
}

class InstrumentNotes : public InstrumentTest {};

TEST_F(InstrumentNotes, TheNearestNoteIsOneOfThe128NotesOfTheDefinitionsMiddleA) {
    // (frequency, middle A, nearest note); the last two lie below the lowest note and above the highest.
    const std::tuple<double, double, float> cases[] = {{440.0, 440.0, 440.0f}, {452.0, 440.0, 440.0f}, {455.0, 440.0, 466.16376f},
                                                       {442.0, 442.0, 442.0f}, {1.0, 440.0, 8.175799f}, {20000.0, 440.0, 12543.854f}};
    for (auto [f, middleA, nearest] : cases) EXPECT_FLOAT_EQ(nearestNoteFrequency(f, middleA), nearest) << f;
}

TEST_F(InstrumentNotes, TheWindowLineShowsEveryFieldInItsFormat) {
    InstrumentDefinition d = emptyDefinition("Flute", 60, 71);
    d.middleA = 442.125f;
    d.scoreThresholds[2] = 12.25f;
    EXPECT_EQ(instrumentDefinitionText(d),
              "Flute (Real) - Studio. MIDI voice is 73. Max notes in chord is 1. Middle A is 442.12Hz. Semitone "
              "range is 60 to 71. Score thresholds: 70.0%, 30.0%, 12.2%.");
}
