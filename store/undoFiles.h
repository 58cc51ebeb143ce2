#pragma once
// The files of one undo level in the undo folder "CSUndo": "Undo"n (the song's notes,
// barlines, instrument name and time signature) and "FrDr"n (the block durations), written
// and read back here, with their names. Reading checks every count and length against the
// file first, so a damaged or hostile level restores nothing. Used by the undo ring
// (store/undo.h); the reader is fuzzed (tools/fuzz/undoFileFuzz).

#include <cstdint>
#include <string>
#include <vector>

#include "notes/noteList.h"

constexpr const char* UNDO_FOLDER_NAME = "CSUndo";
// An instrument name longer than this many UTF-16 units is cut when a level is written and
// refused when one is read: no instrument has a name of that length.
constexpr size_t UNDO_INSTRUMENT_NAME_UNITS = 1024;

// The path of a level's file: the shared folder + "CSUndo/" + prefix + level in decimal
// ("Undo3", "FrDr17", "Freq0", "FrIn0", "FrSd0", "HrFq0", "HrIn0").
std::string undoFilePath(const char* prefix, int level);

// What an "Undo" file holds.
struct UndoSongFile {
    std::string instrumentName;      // UTF-8 in memory, UTF-16 units ending in a 16-bit 0 on disk
    uint32_t timeSignatureBeats;     // upper number of the time signature
    uint32_t timeSignatureUnit;      // lower number
    uint32_t timeSignatureSymbol;    // 1 when it may be drawn as a symbol
    std::vector<Note> notes;         // at most MAX_CS_NOTES
    std::vector<float> barlines;     // at most MAX_CS_BARLINES, seconds
};

// Writes the song's instrument name, time signature, notes and barlines to path. 1 written;
// 0 after a file routine's message.
int writeUndoSongFile(const std::string& path);

// Results of the two readers.
enum UndoFileResult {
    UNDO_FILE_MISSING = 0,   // there is no such file (nothing to restore, nothing said)
    UNDO_FILE_READ = 1,      // read whole and sound
    UNDO_FILE_DAMAGED = 2    // too short, too long, a count or a name its bytes do not hold, a
                             // time or duration that is not a number, or no memory for it
};
// Reads an "Undo" file. A stored note count above MAX_CS_NOTES keeps the first MAX_CS_NOTES
// notes, a barline count above MAX_CS_BARLINES the first MAX_CS_BARLINES barlines; the file
// must still hold every note and barline it counts. Says nothing: the caller words the damage.
int readUndoSongFile(const std::string& path, UndoSongFile* contents);

// Writes "FrDr": the length of song.sampleBlockDurations (its allocated length), then the
// durations as f64. 1 written; 0 after a file routine's message.
int writeUndoDurationsFile(const std::string& path);
// Reads a "FrDr" file into durations. Says nothing.
int readUndoDurationsFile(const std::string& path, std::vector<double>* durations);
