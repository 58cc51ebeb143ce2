#pragma once
// Save and Save As without their dialog: the output type the modes choose, the dialog's
// filter and proposed name (from the song's names, store/song.h), and the writing itself.
// The desktop program shows the dialog.

#include <string>

// What Save writes: Wave mode a wave file; MIDI mode a MIDI file, plain in Note mode and
// following the sung pitch in Detail mode.
enum OutputType { OUTPUT_WAVE = 0, OUTPUT_MIDI = 1, OUTPUT_DETAIL_MIDI = 2 };


// The output type of the current modes.
int currentOutputType();

// Whether a save may start: 0 after "Sorry - this cannot be done whilst recording audio." or
// "... whilst opening audio.", or after saying that MIDI files cannot be written by this
// build; else 1. Asked before the Save dialog, so no name is chosen in vain.
int saveAllowed();

// Results of saveSong.
enum SaveResult {
    SAVE_WRITTEN = 0,        // written again under the last name
    SAVE_NEEDS_DIALOG = 1,   // no name to write again: run Save As
    SAVE_FAILED = 2          // refused or not written (the user has been told)
};
// Save: when the current output's remembered name is not empty and equals its last saved
// name, writes that output again without a dialog.
int saveSong();

// The Save dialog's one filter and its proposed name, for the current output type.
struct SaveDialogSetup {
    std::string filterName;     // "Wave audio files" or "MIDI files"
    std::string pattern;        // "*.wav" or "*.mid"
    std::string proposedName;   // the remembered name of the output; may be ""
    std::string directory;      // "Save Directory"
};
SaveDialogSetup saveDialogSetup();

// Writes the current output to path. A wave file holds only the selected time range when
// onlySelectedRange is set and that range starts at 0 or later and is at least half a
// sampleBlock long; otherwise the whole song. 1 when written, and path becomes the output's
// remembered and last saved name; 0 when refused or failed (the user has been told).
int writeSongOutput(const std::string& path, bool onlySelectedRange);

// The folder and 1-based filter index the Open or Save dialog was left with, kept in
// "Open Directory"/"Open Filter" or "Save Directory"/"Save Filter".
void storeOpenDialogChoice(const std::string& folder, int filterIndex);
void storeSaveDialogChoice(const std::string& folder, int filterIndex);
