#pragma once
// Reading a Standard MIDI File into the song: its note-ons and note-offs become the note list,
// grouped into parts by MIDI channel, each part named from the General MIDI list by its program.
// The Open command's queue hands ".mid" files here, and melodrift-cli opens them the same way.
// A song without a recording becomes a song of notes only, whose blocks are just a time axis
// for them; a song with a recording keeps it and takes the file's notes in place of its own.

#include <cstdint>
#include <string>

constexpr const char* NOT_A_MIDI_FILE_TEXT = "This is not a MIDI file and cannot be opened.";
constexpr const char* MIDI_FILE_UNREADABLE_TEXT = "This MIDI file cannot be read.";

constexpr int MAX_MIDI_PARTS = 16;                        // one part per MIDI channel at most
constexpr const char* MIDI_PART_DEFAULT_NAME = "Piano";   // a part's name until it is named
constexpr double MIDI_IMPORT_QUARTERS_PER_MINUTE = 100.0; // the time base where a file states no tempo
constexpr double MIDI_SCORE_UNITS_PER_BEAT = 256.0 / 0.875;   // the score's length units per beat
constexpr float MIDI_IMPORTED_WEIGHT = 100.0f;           // recognitionWeight of an imported note
constexpr int64_t MAX_MIDI_FILE_BYTES = 64 << 20;         // a larger file is refused unread
// The latest time a note may end: as much as 32-bit sample positions reach at 44100 Hz.
constexpr double MAX_IMPORTED_SONG_SECONDS = 4294967295.0 / 44100.0;

// One part: the notes of one MIDI channel.
struct MidiPart {
    int program;        // General MIDI program counted from 0, as the file's program change gave it
    std::string name;   // from the General MIDI list; MIDI_PART_DEFAULT_NAME until named
    uint32_t extra;     // kept for the score code; 0
};

struct MidiImport {
    MidiPart parts[MAX_MIDI_PARTS];   // parts[0 .. partCount-1], in part-number order
    int partCount;                    // a note's sourceIndex below partCount names its part
    std::string sourcePath;           // the file the notes were read from; "" when none
};
extern MidiImport midiImport;

// No parts, no source file (closing the song; tests between cases).
void resetMidiImport();

// ".mid" or ".midi", in any case: the files Open reads as MIDI files.
bool isMidiFileName(const std::string& path);

// Reads the Standard MIDI File at path into the song: the note list is replaced by the file's
// notes, sorted by their start (the note list keeps time order), and the parts by its channels.
// Time runs at the file's tempo, or at 100 quarter notes per minute until the file states one
// (an SMPTE time base counts frames); running status is read. A song without a recording gets
// a time axis of nominal blocks up to the last note's end and switches to MIDI playback. The song
// window shows the notes. 1 when the file was read. 0 after a message, the message naming the
// file and the reason after the first line: "Cannot <path>" (it cannot be read from the disk),
// NOT_A_MIDI_FILE_TEXT (no "MThd"; the song as it was), MIDI_FILE_UNREADABLE_TEXT (a header
// that is not 6 bytes long, no tracks or a format above 2, and the song as it was; or a key of
// 128 or more, a data byte with no status to run on, a length field beyond its track, a
// variable-length number longer than four bytes, a note past MAX_IMPORTED_SONG_SECONDS, and
// the notes read up to there stay), the busy refusals, or the memory message (string 10401).
// The end of the file inside a track ends the reading as if the file ended there. A full note
// list silently drops further notes.
int importMidiFile(const std::string& path);
