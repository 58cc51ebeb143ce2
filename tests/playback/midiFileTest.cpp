// The Standard MIDI File primitives: variable-length quantities, the exact bytes of chunks and
// events, lengths filled in at the end, Latin-1 text, and the failures of the file routines.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <tuple>
#include <vector>

#include "platform/files.h"
#include "platform/ui.h"
#include "playback/midiFile.h"
#include "playback/midiTestReader.h"
#include "support/testSupport.h"

using Bytes = std::vector<uint8_t>;

static Bytes encoded(uint32_t value) {
    uint8_t out[4];
    int count = encodeVariableLength(value, out);
    return Bytes(out, out + count);
}

// Values beyond four bytes are written as the largest that fits.
TEST(MidiFileVariableLength, KnownValuesEncodeAsTheFileFormatGivesThem) {
    const std::pair<uint32_t, Bytes> cases[] = {
        {0, {0x00}},           {0x40, {0x40}},                   {0x7F, {0x7F}},
        {0x80, {0x81, 0x00}},  {512, {0x84, 0x00}},              {0x2000, {0xC0, 0x00}},
        {0x3FFF, {0xFF, 0x7F}}, {0x4000, {0x81, 0x80, 0x00}},    {0x1FFFFF, {0xFF, 0xFF, 0x7F}},
        {0x200000, {0x81, 0x80, 0x80, 0x00}},                    {0x08000000, {0xC0, 0x80, 0x80, 0x00}},
        {0x0FFFFFFF, {0xFF, 0xFF, 0xFF, 0x7F}},                  {0x10000000, {0xFF, 0xFF, 0xFF, 0x7F}},
        {0xFFFFFFFF, {0xFF, 0xFF, 0xFF, 0x7F}}};
    for (const auto& [value, bytes] : cases) EXPECT_EQ(encoded(value), bytes) << value;
}

class MidiFileTest : public ::testing::Test {
protected:
    void SetUp() override {
        clearUiCalls();
        clearFileFailures();
    }
    void TearDown() override { clearFileFailures(); }
    // Header of a format-1 file with tracks tracks at 256 ticks per quarter.
    static Bytes header(uint8_t tracks) {
        return Bytes{'M', 'T', 'h', 'd', 0, 0, 0, 6, 0, 1, 0, tracks, 0x01, 0x00};
    }
    static void append(Bytes& to, const Bytes& more) { to.insert(to.end(), more.begin(), more.end()); }
    static Bytes track(const Bytes& body) {
        uint32_t n = uint32_t(body.size());
        Bytes b{'M', 'T', 'r', 'k', uint8_t(n >> 24), uint8_t(n >> 16), uint8_t(n >> 8), uint8_t(n)};
        append(b, body);
        return b;
    }
    TempFolder folder;
    std::string path = folder.file("out.mid");
};

using MidiFileChunks = MidiFileTest;

// Each case writes one track's events; the file must hold exactly the header and that track,
// whose deltas start at zero and end a tick (or none) after its last event.
TEST_F(MidiFileChunks, OneTrackFilesHaveExactlyTheseBytes) {
    using Events = void (*)(MidiFileWriter&);
    struct Case {
        Events events;
        uint32_t endDelta;
        Bytes body;
    } cases[] = {
        {[](MidiFileWriter& w) {
             writeMidiTempo(w, 0, 500000);
             writeMidiNoteOn(w, 0, 0, 60, 100);
             writeMidiPitchBend(w, 0, 0, 8192);
             writeMidiNoteOff(w, 512, 0, 60);
         },
         1,
         {0x00, 0xFF, 0x51, 0x03, 0x07, 0xA1, 0x20,   // tempo 500000
          0x00, 0x90, 0x3C, 0x64,                     // note on, key 60, velocity 100
          0x00, 0xE0, 0x00, 0x40,                     // no bend
          0x84, 0x00, 0x80, 0x3C, 0x00,               // 512 ticks later, note off
          0x01, 0xFF, 0x2F, 0x00}},                   // end of track a tick later
        // Data bytes never carry the status bit.
        {[](MidiFileWriter& w) {
             writeMidiNoteOn(w, 0, 0, 200, 300);
             writeMidiControlChange(w, 0, 0, MIDI_CC_REVERB, -4);
             writeMidiProgramChange(w, 0, 0, 128);
         },
         0,
         {0x00, 0x90, 0x7F, 0x7F, 0x00, 0xB0, 0x5B, 0x00, 0x00, 0xC0, 0x7F, 0x00, 0xFF, 0x2F, 0x00}},
        // Pitch bends go low seven bits first and stay within fourteen bits.
        {[](MidiFileWriter& w) {
             for (int value : {0, 8192, 16383, 9748, 192, 20000, -1}) writeMidiPitchBend(w, 0, 5, value);
         },
         0,
         {0x00, 0xE5, 0x00, 0x00, 0x00, 0xE5, 0x00, 0x40, 0x00, 0xE5, 0x7F, 0x7F, 0x00, 0xE5, 0x14, 0x4C,
          0x00, 0xE5, 0x40, 0x01, 0x00, 0xE5, 0x7F, 0x7F, 0x00, 0xE5, 0x00, 0x00, 0x00, 0xFF, 0x2F, 0x00}},
        // A track name is counted in Latin-1 bytes.
        {[](MidiFileWriter& w) { writeMidiTextEvent(w, 0, MIDI_META_TRACK_NAME, "Fl\xC3\xBBte"); },
         0,
         {0x00, 0xFF, 0x03, 0x05, 'F', 'l', 0xFB, 't', 'e', 0x00, 0xFF, 0x2F, 0x00}},
    };
    for (const Case& c : cases) {
        MidiFileWriter w;
        ASSERT_EQ(createMidiFile(w, path), 1);
        writeMidiHeader(w, 1, 1, 256);
        beginMidiTrack(w);
        c.events(w);
        endMidiTrack(w, c.endDelta);
        ASSERT_EQ(finishMidiFile(w), 1);
        Bytes expected = header(1);
        append(expected, track(c.body));
        EXPECT_EQ(readFileBytes(path), expected);
    }
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(MidiFileChunks, EveryTrackGetsItsOwnLengthAndItsDeltasStartAtZero) {
    MidiFileWriter w;
    ASSERT_EQ(createMidiFile(w, path), 1);
    writeMidiHeader(w, 1, 2, 256);
    beginMidiTrack(w);
    writeMidiTextEvent(w, 0, MIDI_META_TRACK_NAME, "Tempo");
    writeMidiControlChange(w, 300, 2, MIDI_CC_PAN, 61);
    endMidiTrack(w, 0);
    beginMidiTrack(w);
    writeMidiProgramChange(w, 5, 3, 53);
    writeMidiKeySignature(w, 5, 0, 0);
    endMidiTrack(w, 1);
    ASSERT_EQ(finishMidiFile(w), 1);

    Bytes expected = header(2);
    append(expected, track({0x00, 0xFF, 0x03, 0x05, 'T', 'e', 'm', 'p', 'o',
                            0x82, 0x2C, 0xB2, 0x0A, 0x3D,   // 300 ticks, pan on channel 2
                            0x00, 0xFF, 0x2F, 0x00}));
    append(expected, track({0x05, 0xC3, 0x35,                 // 5 ticks from this track's start
                            0x00, 0xFF, 0x59, 0x02, 0x00, 0x00,
                            0x01, 0xFF, 0x2F, 0x00}));
    EXPECT_EQ(readFileBytes(path), expected);
    // An event before the last one follows it with delta zero.
    ASSERT_EQ(createMidiFile(w, path), 1);
    writeMidiHeader(w, 1, 1, 256);
    beginMidiTrack(w);
    writeMidiNoteOn(w, 100, 0, 60, 90);
    writeMidiNoteOff(w, 99, 0, 60);
    writeMidiNoteOn(w, 101, 0, 62, 90);
    endMidiTrack(w, 0);
    ASSERT_EQ(finishMidiFile(w), 1);
    ReadMidiFile file = readMidiBytes(readFileBytes(path));
    ASSERT_EQ(file.error, "");
    std::vector<uint32_t> ticks;
    for (const ReadMidiEvent& e : file.tracks[0].events) ticks.push_back(e.tick);
    EXPECT_EQ(ticks, (std::vector<uint32_t>{100, 100, 101}));
}

TEST(MidiFileText, TextIsWrittenInLatin1WithQuestionMarksForTheRest) {
    EXPECT_EQ(latin1FromUtf8("Voice"), "Voice");
    EXPECT_EQ(latin1FromUtf8("Fl\xC3\xBBte"), "Fl\xFBte");
    EXPECT_EQ(latin1FromUtf8("R\xC3\xA9 \xE2\x99\xAA"), "R\xE9 ?");           // a note sign has no Latin-1 form
    EXPECT_EQ(latin1FromUtf8("\xF0\x9F\x8E\xB5!"), "?!");                      // four-byte character
    EXPECT_EQ(latin1FromUtf8("\xC3("), "?(");                                  // cut short
    EXPECT_EQ(latin1FromUtf8("\xC0\x80" "a"), "??a");                          // overlong NUL
    EXPECT_EQ(latin1FromUtf8("\xE2\x99"), "??");                               // sequence past the end
}

// ---- failures ----

using MidiFileFailures = MidiFileTest;

// A small complete file, with a write failure injected at the nth write from the start.
static int writeSmallFile(const std::string& path) {
    MidiFileWriter w;
    if (!createMidiFile(w, path)) return -1;
    writeMidiHeader(w, 1, 1, 256);
    beginMidiTrack(w);
    writeMidiNoteOn(w, 0, 0, 60, 100);
    writeMidiNoteOff(w, 256, 0, 60);
    endMidiTrack(w, 1);
    return finishMidiFile(w);
}

TEST_F(MidiFileFailures, AFileThatCannotBeCreatedIsRefusedWithoutAMessage) {
    failFileCall(FILE_OP_OPEN, 1);
    MidiFileWriter w;
    EXPECT_EQ(createMidiFile(w, path), 0);
    EXPECT_EQ(w.file, nullptr);
    EXPECT_EQ(finishMidiFile(w), 0);
    EXPECT_EQ(messageCount(), 0);
    EXPECT_FALSE(fileExists(path));
}

// A short write (any of the file's writes, the lengths last), a seek that fails while filling
// in lengths or a close that fails is reported once and the incomplete file removed.
TEST_F(MidiFileFailures, AFailureIsReportedOnceAndTheIncompleteFileRemoved) {
    std::vector<std::tuple<FileOp, int, const char*>> cases = {{FILE_OP_SEEK, 1, "File could not be seeked"},
                                                               {FILE_OP_CLOSE, 1, "File could not be closed"}};
    for (int n = 1; n <= 14; n++) cases.push_back({FILE_OP_WRITE, n, "Bytes were not stored properly"});
    for (auto [op, n, text] : cases) {
        clearUiCalls();
        failFileCall(op, n);
        EXPECT_EQ(writeSmallFile(path), 0) << text << " " << n;
        EXPECT_EQ(messageCount(), 1) << text << " " << n;
        EXPECT_EQ(lastMessageText(), text);
        EXPECT_FALSE(fileExists(path)) << text << " " << n;
        clearFileFailures();
    }
    // A writer that gives up leaves no file behind, and says nothing.
    clearUiCalls();
    MidiFileWriter w;
    ASSERT_EQ(createMidiFile(w, path), 1);
    writeMidiHeader(w, 1, 1, 256);
    beginMidiTrack(w);
    w.ok = 0;
    EXPECT_EQ(finishMidiFile(w), 0);
    EXPECT_EQ(messageCount(), 0);
    EXPECT_FALSE(fileExists(path));
}
