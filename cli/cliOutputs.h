#pragma once
// What the command-line tool writes besides the engine's own files: the notes as a CSV table
// and as a printed list, and every output file through a temporary file renamed over its
// name once complete, never over the file being read.

#include <cstdio>
#include <functional>
#include <string>

// Writes path through write(temporary): the temporary file lies beside path and is renamed
// over it once write returned 1, or deleted. Refuses (0, saying why on stderr) a path that is
// the input file itself. 1 when path holds the new output.
int writeOutputFile(const std::string& path, const std::string& input,
                    const std::function<int(const std::string& temporary)>& write);
// The notes table into an open file: the header onset_s,offset_s,midi_pitch,pitch_hz,volume_sum
// and one row per note.
void writeNotesRows(FILE* csv);
// The notes as CSV (writeNotesRows) at path. 1 written.
int writeNotesTable(const std::string& path);
// Prints every note: its index, wave span, name, pitch and volume sum.
void printNoteList();
// "C4", "A#3": the name of a semitone number.
std::string noteName(int midiNote);
