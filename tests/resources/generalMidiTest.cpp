// The General MIDI instrument list: the shipped file, the lookup rules from a name to a program
// and back, lists that are missing, damaged or too large, and garbage lines for the parser.
#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <set>
#include <tuple>
#include <string>
#include <vector>

#include "platform/files.h"
#include "platform/ui.h"
#include "resources/generalMidi.h"
#include "shell/paths.h"
#include "support/testSupport.h"

namespace fs = std::filesystem;

// Each test reads its list from a resource folder of its own (or from the source tree's).
class GeneralMidiTest : public SharedFolderTest {
protected:
    void SetUp() override {
        SharedFolderTest::SetUp();
        paths.resourcePath = folder.path();
        fs::create_directories(folder.file("Resources"));
        resetGeneralMidiTable();
    }
    void TearDown() override {
        resetGeneralMidiTable();
        SharedFolderTest::TearDown();
    }
    void writeList(const std::string& text) { writeFileText(listPath(), text); }
    std::string listPath() const { return folder.file("Resources/General MIDI.txt"); }
    void useShippedList() { paths.resourcePath = sourceRoot(); }
    // Each name gives its program and transposition.
    void expectPrograms(const std::vector<std::tuple<const char*, int, int>>& cases) {
        for (auto [name, program, transposition] : cases) {
            int transpose = 99;
            EXPECT_EQ(generalMidiProgram(name, &transpose), program) << name;
            EXPECT_EQ(transpose, transposition) << name;
        }
    }
};

// ---- the shipped list ----

using GeneralMidiShippedList = GeneralMidiTest;

TEST_F(GeneralMidiShippedList, EveryProgramHasItsOwnFirstNameAndEveryLineReads) {
    useShippedList();
    ASSERT_EQ(loadGeneralMidiTable(), 1);
    EXPECT_EQ(messageCount(), 0) << lastMessageText();
    std::set<std::string> names;
    for (int program = 1; program <= 128; program++) {
        std::string name = generalMidiName(program);
        EXPECT_NE(name, "Unknown") << program;
        names.insert(name);
    }
    EXPECT_EQ(names.size(), 128u);

    std::string text = readFileText(resourceFilePath("General MIDI.txt"));
    int line = 0;
    size_t start = 0;
    std::vector<GeneralMidiName> parsed;
    while (start < text.size()) {
        size_t end = text.find('\n', start);
        if (end == std::string::npos) end = text.size();
        line++;
        EXPECT_EQ(parseGeneralMidiLine(text.substr(start, end - start), parsed), GENERAL_MIDI_LINE_READ) << line;
        EXPECT_EQ(parsed.back().program, line) << "the programs are listed in order, one a line";
        start = end + 1;
    }
    EXPECT_EQ(line, 128);
}

TEST_F(GeneralMidiShippedList, CommonInstrumentNamesFindTheirPrograms) {
    useShippedList();
    // Voice 53 is the default instrument's; guitars and basses (25 to 40) are synthesised.
    expectPrograms({{"Voice", 54, 0},       {"Piano", 1, 0},          {"Grand piano", 1, 0},   {"Choir", 53, 0},
                    {"Whistling", 79, 0},   {"Celesta", 9, 0},        {"Vibraphone", 12, 0},   {"Violin", 41, 0},
                    {"Flute", 74, 0},       {"Alto flute", 74, 0},    {"Bassoon", 71, 0},      {"Tenor", 54, 0},
                    {"Tenor saxophone", 67, 0}, {"Soprano recorder", 75, 0}, {"Bass guitar", 34, -12},
                    {"Guitar", 25, -12},    {"Kazoo", 1, 0}});
}

// ---- the lookup rules ----

static const char* const RULES_LIST =
    "1 \"Piano\"\n"
    "25 \"Guitar\":-12 \"Nylon Guitar\":-12\n"
    "33 \"Bass\":-12\n"
    "34 \"Bass Guitar\":-7\n"
    "71 \"Bassoon\"\n"
    "54 \"Voice\" \"Voice Oohs\"\n"
    "74 \"Flute\"\n"
    "76 \"Pan Flute\"\n"
    "66 \"Sax\"\n"
    "67 \"Tenor Sax\":+2\n"
    "99 \"Tenor\"\n"
    "54 \"Second Voice\"\n";

using GeneralMidiProgram = GeneralMidiTest;

// An equal name ends the search whatever its case; otherwise the longest name at the start of a
// word wins (a word may run on after it, but a name inside a word does not match), on a tie
// the name earlier in the list; no match or an empty name gives the first program untransposed.
TEST_F(GeneralMidiProgram, NamesFindTheirProgramsByTheLookupRules) {
    writeList(RULES_LIST);
    expectPrograms({{"bass GUITAR", 34, -7},
                    {"VOICE OOHS", 54, 0},
                    {"tenor", 99, 0},   // equals a name, so the longer "Tenor Sax" at the same word never counts
                    {"tenor sax solo", 67, 2},
                    {"Bassoon in F", 71, 0},   // "Bassoon" beats "Bass"
                    {"Pan Flutes", 76, 0},     // a name may run on into the next word
                    {"Old (electric) bass", 33, -12},
                    {"my-bass", 33, -12},      // the word starts after the hyphen
                    {"Guitar2", 25, -12},      // digits belong to the word
                    {"Subbass", 1, 0},
                    {"2Guitar", 1, 0},
                    {"Saxophone", 66, 0},
                    {"Flute and piano", 1, 0},   // "Flute" and "Piano" are both five letters; "Piano" comes first
                    {"Piano and flute", 1, 0},
                    {"Kazoo", 1, 0},
                    {"", 1, 0}});
    EXPECT_EQ(generalMidiProgram("Guitar", nullptr, 3), 25);   // the track changes nothing
    EXPECT_EQ(messageCount(), 0);
}

using GeneralMidiNames = GeneralMidiTest;

TEST_F(GeneralMidiNames, TheFirstNameOfTheFirstLineForTheProgramIsGivenAndUnlistedNumbersAreUnknown) {
    writeList(RULES_LIST);
    const std::pair<int, const char*> cases[] = {{54, "Voice"},     {25, "Guitar"},   {1, "Piano"},      {0, "Unknown"},
                                                 {-3, "Unknown"},   {129, "Unknown"}, {2, "Unknown"}};
    for (auto [program, name] : cases) EXPECT_EQ(generalMidiName(program), name) << program;
}

// ---- lists that cannot be used as they are ----

using GeneralMidiFile = GeneralMidiTest;

// A missing list, one larger than a megabyte, or one whose read fails is reported once, and
// every name gets the first program.
TEST_F(GeneralMidiFile, AListThatCannotBeReadIsReportedOnceAndEveryNameGetsTheFirstProgram) {
    std::string large = "74 \"Flute\"\n";
    large.resize(size_t(MAX_GENERAL_MIDI_FILE_BYTES) + 1, '\n');
    for (int variant = 0; variant < 3; variant++) {
        resetGeneralMidiTable();
        clearUiCalls();
        if (variant == 1) writeList(large);
        if (variant == 2) {
            writeList(RULES_LIST);
            failFileCall(FILE_OP_READ, 1);
        }
        EXPECT_EQ((std::vector<std::string>{std::to_string(generalMidiProgram("Flute")), generalMidiName(74),
                                            std::to_string(generalMidiProgram("Voice"))}),
                  (std::vector<std::string>{"1", "Unknown", "1"}));
        EXPECT_EQ(messageCount(), 1);
        EXPECT_EQ(lastMessageText(), "The General MIDI instrument list '" + listPath() +
                                         "' could not be read, so instrument names cannot be matched to General MIDI "
                                         "programs.");
    }
}

TEST_F(GeneralMidiFile, UnreadableLinesAreLeftOutAndTheFirstIsNamed) {
    writeList("74 \"Flute\"\n"
              "Flute 74\n"
              "\n"
              "200 \"Tuba\"\n"
              "41 \"Violin\"\n");
    EXPECT_EQ((std::vector<int>{generalMidiProgram("Violin"), generalMidiProgram("Flute"), generalMidiProgram("Tuba")}),
              (std::vector<int>{41, 74, 1}));
    EXPECT_EQ(messageCount(), 1);
    EXPECT_EQ(lastMessageText(), "Line 2 of the General MIDI instrument list '" + listPath() +
                                     "' cannot be read; it and any other unreadable lines have been ignored.");
}

TEST_F(GeneralMidiFile, WindowsLineEndsAByteOrderMarkAndBlankLinesAreFine) {
    writeList("\xEF\xBB\xBF" "1 \"Piano\"\r\n\r\n   \r\n74 \"Flute\":+12\r\n");
    int transpose = 0;
    EXPECT_EQ(generalMidiProgram("Piano"), 1);
    EXPECT_EQ(generalMidiProgram("flute", &transpose), 74);
    EXPECT_EQ(transpose, 12);
    EXPECT_EQ(messageCount(), 0) << lastMessageText();
}

TEST_F(GeneralMidiFile, AnotherResourceFolderIsReadAfresh) {
    writeList("74 \"Flute\"\n");
    EXPECT_EQ(generalMidiProgram("Flute"), 74);
    TempFolder other;
    fs::create_directories(other.file("Resources"));
    writeFileText(other.file("Resources/General MIDI.txt"), "75 \"Flute\"\n");
    paths.resourcePath = other.path();
    EXPECT_EQ(generalMidiProgram("Flute"), 75);
}

// ---- the line parser ----

using GeneralMidiLine = GeneralMidiTest;

TEST_F(GeneralMidiLine, LinesInTheFormatGiveTheirNamesAndTranspositions) {
    std::vector<GeneralMidiName> names;
    EXPECT_EQ(parseGeneralMidiLine("12 \"Vibraphone\"", names), GENERAL_MIDI_LINE_READ);
    EXPECT_EQ(parseGeneralMidiLine("1\t\"Piano\"  ", names), GENERAL_MIDI_LINE_READ);
    EXPECT_EQ(parseGeneralMidiLine("25 \"Guitar\":-12 \"Nylon (soft)\":+5", names), GENERAL_MIDI_LINE_READ);
    EXPECT_EQ(parseGeneralMidiLine("0007 \"A\"\"B\":-0", names), GENERAL_MIDI_LINE_READ);
    ASSERT_EQ(names.size(), 6u);
    std::vector<std::tuple<int, std::string, int>> read;   // program, name, transposition
    for (const GeneralMidiName& n : names) read.emplace_back(n.program, n.name, n.transpose);
    EXPECT_EQ(read, (std::vector<std::tuple<int, std::string, int>>{
                        {12, "Vibraphone", 0}, {1, "Piano", 0}, {25, "Guitar", -12}, {25, "Nylon (soft)", 5}, {7, "A", 0}, {7, "B", 0}}));
    EXPECT_EQ(parseGeneralMidiLine("", names), GENERAL_MIDI_LINE_BLANK);
    EXPECT_EQ(parseGeneralMidiLine(" \t\r", names), GENERAL_MIDI_LINE_BLANK);
    EXPECT_EQ(names.size(), 6u);
}

TEST_F(GeneralMidiLine, LinesOutOfTheFormatAreRefusedWhole) {
    const char* const bad[] = {
        "0 \"Zero\"", "129 \"Too high\"", "-1 \"Negative\"", "1x \"Letter\"", "12", "12 Vibraphone",
        "\"Piano\" 1", " 1 \"Leading blank\"", "1 \"Unclosed", "1 \"\"", "1 \"Con\x01trol\"", "1 \"A\":+123",
        "1 \"A\":12", "1 \"A\":+", "1 \"A\":+1x", "1 \"A\" junk", "1,\"A\"", "1 \"A\" \"B", "1234567890 \"A\"",
        "1\x02\"A\"",
    };
    std::vector<GeneralMidiName> names{{5, "kept", 0}};
    for (const char* line : bad) EXPECT_EQ(parseGeneralMidiLine(line, names), GENERAL_MIDI_LINE_BAD) << line;
    ASSERT_EQ(names.size(), 1u);
    EXPECT_EQ(names[0].name, "kept");
}

// Deterministic garbage: lines built from the characters the format cares about, and valid
// lines with bytes changed. Nothing may crash, and what is accepted must be a sound entry.
TEST_F(GeneralMidiLine, GarbageLinesNeverGiveAnEntryOutsideTheRules) {
    uint32_t seed = 12345;
    auto next = [&seed]() {
        seed = seed * 1664525u + 1013904223u;
        return seed >> 8;
    };
    const std::string alphabet = "0123456789 \"\t:+-\r abcXYZ()\x01\x7F\xC3\xFF";
    const std::string valid = "25 \"Guitar\":-12 \"Nylon Guitar\":+5 \"Bass\"";
    std::string fileText;
    int accepted = 0;
    for (int i = 0; i < 20000; i++) {
        std::string line;
        if (i % 2) {
            line = valid;
            for (int m = int(next() % 4); m >= 0; m--) line[next() % line.size()] = char(next() & 0xFF);
        } else {
            for (int n = int(next() % 40); n > 0; n--) line += alphabet[next() % alphabet.size()];
        }
        std::vector<GeneralMidiName> names;
        int result = parseGeneralMidiLine(line, names);
        ASSERT_TRUE(result == GENERAL_MIDI_LINE_BAD || result == GENERAL_MIDI_LINE_READ ||
                    result == GENERAL_MIDI_LINE_BLANK);
        ASSERT_EQ(names.empty(), result != GENERAL_MIDI_LINE_READ) << line;
        for (const GeneralMidiName& entry : names) {
            ASSERT_GE(entry.program, 1) << line;
            ASSERT_LE(entry.program, 128) << line;
            ASSERT_FALSE(entry.name.empty()) << line;
            for (unsigned char c : entry.name) ASSERT_TRUE(c >= 0x20 && c != 0x7F && c != '"') << line;
            ASSERT_GE(entry.transpose, -99) << line;
            ASSERT_LE(entry.transpose, 99) << line;
        }
        if (result == GENERAL_MIDI_LINE_READ) accepted++;
        if (line.find('\n') == std::string::npos) fileText += line + "\n";
    }
    EXPECT_GT(accepted, 100) << "the mutations should leave many lines readable";

    // The same garbage as a list: every lookup still gives a program, every name a text.
    writeList(fileText);
    for (int i = 0; i < 300; i++) {
        std::string name;
        for (int n = int(next() % 16); n > 0; n--) name += alphabet[next() % alphabet.size()];
        int program = generalMidiProgram(name);
        ASSERT_GE(program, 1);
        ASSERT_LE(program, 128);
    }
    for (int program = -1; program <= 130; program++) EXPECT_FALSE(generalMidiName(program).empty());
    EXPECT_EQ(messageCount(), 1) << "the unreadable lines are reported once";
}
