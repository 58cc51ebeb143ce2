// The General MIDI instrument list: the shipped file, the lookup rules from a name to a program
// and back, lists that are missing, damaged or too large, and garbage lines for the parser.
#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <set>
#include <string>
#include <vector>

#include "platform/files.h"
#include "platform/ui.h"
#include "resources/generalMidi.h"
#include "shell/paths.h"
#include "support/testSupport.h"

namespace fs = std::filesystem;

// Each test reads its list from a resource folder of its own (or from the source tree's).
class GeneralMidiTest : public ::testing::Test {
protected:
    void SetUp() override {
        savedPaths = paths;
        paths.resourcePath = folder.path();
        fs::create_directories(folder.file("Resources"));
        resetGeneralMidiTable();
        clearUiCalls();
        clearFileFailures();
    }
    void TearDown() override {
        clearFileFailures();
        resetGeneralMidiTable();
        paths = savedPaths;
    }
    void writeList(const std::string& text) { writeFileText(listPath(), text); }
    std::string listPath() const { return folder.file("Resources/General MIDI.txt"); }
    // The source tree this file belongs to holds the shipped Resources/.
    void useShippedList() {
        paths.resourcePath = fs::path(__FILE__).parent_path().parent_path().parent_path().string() + "/";
    }
    TempFolder folder;
    Paths savedPaths;
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
    int transpose = 99;
    EXPECT_EQ(generalMidiProgram("Voice", &transpose), 54);   // the default instrument: voice 53
    EXPECT_EQ(transpose, 0);
    EXPECT_EQ(generalMidiProgram("Piano"), 1);
    EXPECT_EQ(generalMidiProgram("Grand piano"), 1);
    EXPECT_EQ(generalMidiProgram("Choir"), 53);
    EXPECT_EQ(generalMidiProgram("Whistling"), 79);
    EXPECT_EQ(generalMidiProgram("Celesta"), 9);
    EXPECT_EQ(generalMidiProgram("Vibraphone"), 12);
    EXPECT_EQ(generalMidiProgram("Violin"), 41);
    EXPECT_EQ(generalMidiProgram("Flute"), 74);
    EXPECT_EQ(generalMidiProgram("Alto flute"), 74);
    EXPECT_EQ(generalMidiProgram("Bassoon"), 71);
    EXPECT_EQ(generalMidiProgram("Tenor saxophone"), 67);
    EXPECT_EQ(generalMidiProgram("Tenor"), 54);
    EXPECT_EQ(generalMidiProgram("Soprano recorder"), 75);
    // Guitars and basses are the programs 25 to 40 that definitions synthesise.
    int program = generalMidiProgram("Bass guitar", &transpose);
    EXPECT_GE(program, 25);
    EXPECT_LE(program, 40);
    EXPECT_EQ(transpose, -12);
    EXPECT_EQ(generalMidiProgram("Guitar", &transpose), 25);
    EXPECT_EQ(transpose, -12);
    EXPECT_EQ(generalMidiProgram("Kazoo"), 1);
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

TEST_F(GeneralMidiProgram, AnEqualNameEndsTheSearchWhateverItsCase) {
    writeList(RULES_LIST);
    int transpose = 0;
    EXPECT_EQ(generalMidiProgram("bass GUITAR", &transpose), 34);
    EXPECT_EQ(transpose, -7);
    EXPECT_EQ(generalMidiProgram("VOICE OOHS", &transpose), 54);
    EXPECT_EQ(transpose, 0);
    // "Tenor" equals a name, so the longer "Tenor Sax" starting at the same word never counts.
    EXPECT_EQ(generalMidiProgram("tenor", &transpose), 99);
}

TEST_F(GeneralMidiProgram, OtherwiseTheLongestNameAtTheStartOfAWordWins) {
    writeList(RULES_LIST);
    int transpose = 0;
    EXPECT_EQ(generalMidiProgram("tenor sax solo", &transpose), 67);
    EXPECT_EQ(transpose, 2);
    EXPECT_EQ(generalMidiProgram("Bassoon in F"), 71);       // "Bassoon" beats "Bass"
    EXPECT_EQ(generalMidiProgram("Pan Flutes"), 76);         // a name may run on into the next word
    EXPECT_EQ(generalMidiProgram("Old (electric) bass", &transpose), 33);
    EXPECT_EQ(transpose, -12);
    EXPECT_EQ(generalMidiProgram("my-bass"), 33);            // the word starts after the hyphen
    EXPECT_EQ(generalMidiProgram("Guitar2"), 25);            // digits belong to the word
}

TEST_F(GeneralMidiProgram, ANameInsideAWordDoesNotMatch) {
    writeList(RULES_LIST);
    EXPECT_EQ(generalMidiProgram("Subbass"), 1);
    EXPECT_EQ(generalMidiProgram("2Guitar"), 1);
    EXPECT_EQ(generalMidiProgram("Saxophone"), 66);          // but a word may go on after the name
}

TEST_F(GeneralMidiProgram, OnATieTheNameEarlierInTheListWins) {
    writeList(RULES_LIST);
    // "Flute" and "Piano" are both five letters; "Piano" comes first in the list.
    EXPECT_EQ(generalMidiProgram("Flute and piano"), 1);
    EXPECT_EQ(generalMidiProgram("Piano and flute"), 1);
}

TEST_F(GeneralMidiProgram, NoMatchOrAnEmptyNameGivesTheFirstProgramWithoutTransposition) {
    writeList(RULES_LIST);
    int transpose = 5;
    EXPECT_EQ(generalMidiProgram("Kazoo", &transpose), 1);
    EXPECT_EQ(transpose, 0);
    transpose = 5;
    EXPECT_EQ(generalMidiProgram("", &transpose), 1);
    EXPECT_EQ(transpose, 0);
    EXPECT_EQ(generalMidiProgram("Guitar", nullptr, 3), 25);   // the track changes nothing
    EXPECT_EQ(messageCount(), 0);
}

using GeneralMidiNames = GeneralMidiTest;

TEST_F(GeneralMidiNames, TheFirstNameOfTheFirstLineForTheProgramIsGiven) {
    writeList(RULES_LIST);
    EXPECT_EQ(generalMidiName(54), "Voice");
    EXPECT_EQ(generalMidiName(25), "Guitar");
    EXPECT_EQ(generalMidiName(1), "Piano");
}

TEST_F(GeneralMidiNames, NumbersOutsideTheListAreUnknown) {
    writeList(RULES_LIST);
    EXPECT_EQ(generalMidiName(0), "Unknown");
    EXPECT_EQ(generalMidiName(-3), "Unknown");
    EXPECT_EQ(generalMidiName(129), "Unknown");
    EXPECT_EQ(generalMidiName(2), "Unknown");   // not listed
}

// ---- lists that cannot be used as they are ----

using GeneralMidiFile = GeneralMidiTest;

TEST_F(GeneralMidiFile, AMissingListIsReportedOnceAndEveryNameGetsTheFirstProgram) {
    EXPECT_EQ(generalMidiProgram("Flute"), 1);
    EXPECT_EQ(generalMidiName(74), "Unknown");
    EXPECT_EQ(generalMidiProgram("Voice"), 1);
    EXPECT_EQ(messageCount(), 1);
    EXPECT_EQ(lastMessageText(), "The General MIDI instrument list '" + listPath() +
                                     "' could not be read, so instrument names cannot be matched to General MIDI "
                                     "programs.");
}

TEST_F(GeneralMidiFile, UnreadableLinesAreLeftOutAndTheFirstIsNamed) {
    writeList("74 \"Flute\"\n"
              "Flute 74\n"
              "\n"
              "200 \"Tuba\"\n"
              "41 \"Violin\"\n");
    EXPECT_EQ(generalMidiProgram("Violin"), 41);
    EXPECT_EQ(generalMidiProgram("Flute"), 74);
    EXPECT_EQ(generalMidiProgram("Tuba"), 1);
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

TEST_F(GeneralMidiFile, AListLargerThanAMegabyteIsNotRead) {
    std::string text = "74 \"Flute\"\n";
    text.resize(size_t(MAX_GENERAL_MIDI_FILE_BYTES) + 1, '\n');
    writeList(text);
    EXPECT_EQ(generalMidiProgram("Flute"), 1);
    EXPECT_EQ(messageCount(), 1);
    EXPECT_NE(lastMessageText().find("could not be read"), std::string::npos);
}

TEST_F(GeneralMidiFile, AReadThatFailsIsReportedLikeAMissingList) {
    writeList(RULES_LIST);
    failFileCall(FILE_OP_READ, 1);
    EXPECT_EQ(generalMidiProgram("Flute"), 1);
    EXPECT_NE(lastMessageText().find("could not be read"), std::string::npos);
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
    EXPECT_EQ(names[0].program, 12);
    EXPECT_EQ(names[0].name, "Vibraphone");
    EXPECT_EQ(names[1].name, "Piano");
    EXPECT_EQ(names[2].transpose, -12);
    EXPECT_EQ(names[3].name, "Nylon (soft)");
    EXPECT_EQ(names[3].transpose, 5);
    EXPECT_EQ(names[4].program, 7);
    EXPECT_EQ(names[4].name, "A");
    EXPECT_EQ(names[5].name, "B");
    EXPECT_EQ(names[5].transpose, 0);
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
