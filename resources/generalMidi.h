#pragma once
// The General MIDI instrument list "Resources/General MIDI.txt": program numbers 1 .. 128 with
// the names an instrument may be called by. The MIDI writer takes a track's program from the
// song's instrument name, instrument definitions take their MIDI voice from a definition's
// name, and MIDI import names its parts. The list is read once per resource folder.

#include <string>
#include <vector>

constexpr const char* GENERAL_MIDI_FILE = "General MIDI.txt";   // in the resource folder's Resources/
constexpr int GENERAL_MIDI_PROGRAMS = 128;                      // programs are numbered 1 .. 128
constexpr long long MAX_GENERAL_MIDI_FILE_BYTES = 1 << 20;      // a larger file is not a name list

// One quoted name of the list.
struct GeneralMidiName {
    int program;          // 1 .. GENERAL_MIDI_PROGRAMS
    std::string name;     // as written between the quotes, never empty
    int transpose;        // semitones, -99 .. 99; 0 when the name gives none
};

struct GeneralMidiTable {
    std::vector<GeneralMidiName> names;   // every name of the list, in the order of the file
    std::string loadedPath;               // the file names was read from (or failed to be); "" before any
    int loaded = 0;                       // 1 once loadedPath has been tried, readable or not
};
extern GeneralMidiTable generalMidiTable;

// Forgets the list; the next lookup reads the file again.
void resetGeneralMidiTable();

// Results of parseGeneralMidiLine.
constexpr int GENERAL_MIDI_LINE_BAD = 0;     // not in the line format; nothing appended
constexpr int GENERAL_MIDI_LINE_READ = 1;    // its names were appended
constexpr int GENERAL_MIDI_LINE_BLANK = 2;   // empty or only spaces; nothing appended

// Reads one line (without its line end; a trailing carriage return is allowed) and appends its
// names to names. A line is taken whole or not at all. Its format: the program number (up to
// the first space or control character), then one or more names in double quotes, each
// optionally followed by ":+" or ":-" and one or two digits, the transposition in semitones
// from written to sounding pitch (a guitar sounds an octave below its part: "Guitar":-12).
int parseGeneralMidiLine(const std::string& line, std::vector<GeneralMidiName>& names);

// Reads the list from resourceFilePath(GENERAL_MIDI_FILE) into generalMidiTable. 1 when read:
// unreadable lines are left out after "Line %d of the General MIDI instrument list '%s' cannot
// be read; it and any other unreadable lines have been ignored." 0 when the file cannot be
// read (missing, unreadable, larger than MAX_GENERAL_MIDI_FILE_BYTES), after "The General MIDI
// instrument list '%s' could not be read, so instrument names cannot be matched to General MIDI
// programs." and with the list empty. Either message comes once per file, not at every lookup.
int loadGeneralMidiTable();

// The General MIDI program (1 .. 128) for an instrument name: a name of the list equal to it,
// ignoring case, ends the search; otherwise the longest name of the list that equals, ignoring
// case, the text at the start of one of its words (runs of letters and digits) wins, the first
// in the list on a tie. With no match, an empty name or no list: 1. *transpose (when given)
// receives the matched name's transposition, else 0. track does not change the result.
// Reads the list when the resource folder's copy has not been read yet. User interface thread.
int generalMidiProgram(const std::string& name, int* transpose = nullptr, int track = 0);

// The first name the list gives for program (1 .. 128); "Unknown" for 0, a number above 128,
// a number the list does not give, or no list.
std::string generalMidiName(int program);
