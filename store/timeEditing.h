#pragma once
// Time editing: removing, copying and pasting a stretch of the song's time. The song keeps
// four sequences in step, block by block: the audio in CS.fw, the FT blocks, the Hires FT
// blocks and the block durations; cuts and pastes are made on whole blocks of all four, and
// the notes and barlines, which lie over them in seconds, follow. A copied stretch lives in
// the clipboard files "_CS.fw", "_CS.ft", "_CS.fi", "_CS.ft+", "_CS.fi+" and in
// timeClipboard; a stretch of time also goes to the system clipboard as a RIFF WAVE file.
// Delete, Cut, Copy and Paste in the song view and Strip Ends of Song call these after
// taking their undo snapshot.

#include <cstdint>
#include <vector>

#include "notes/noteList.h"

// Status texts (string numbers) while an operation runs.
constexpr int PASTING_TEXT = 10355;
constexpr int COPYING_TEXT = 10356;
constexpr int DELETING_TEXT = 10357;
// Below this many free bytes on the shared drive Paste refuses (string 10352); below
// PASTE_SPACE_LOW it warns (string 10351) and pastes.
constexpr int64_t PASTE_SPACE_MINIMUM = 20971520;
constexpr int64_t PASTE_SPACE_LOW = 104857600;

// What Copy left for Paste besides the clipboard files.
struct TimeClipboard {
    int kind = 0;                    // EDIT_RANGE_TIME (3): time copied in Wave mode, pasting inserts it;
                                     // EDIT_RANGE_NOTES (4): notes copied in MIDI mode, pasting places them;
                                     // 0: nothing copied (set by the song view's Copy and Cut)
    std::vector<double> durations;   // the copied blocks' durations, seconds; size() is the room
    uint32_t durationCount = 0;      // durations in use
    std::vector<Note> notes;         // copied notes, times relative to the copied range's start
    std::vector<float> barlines;     // copied barlines, seconds from the copied range's start
};
extern TimeClipboard timeClipboard;

// Forgets the clipboard (start-up, song close); its files go with the working files.
void resetTimeClipboard();

// The whole blocks of [start, start + length) seconds: first = blockAtTime(start), count up to
// blockAtTime(start + length), cut so that the range ends within the song. 1 with *first and
// *count; 0 when the range ends before it starts.
int timeRangeToBlocks(double start, double length, uint32_t* first, uint32_t* count);

// Removes [start, start + length) seconds, block-aligned, from the audio, the FT and Hires FT
// blocks and the durations; the first block always stays. Notes in the cut are deleted, later
// ones move earlier; barlines likewise. 1; 0 after a message, when refused (a recording or an
// opening runs, an empty range), leaving what was already changed.
int removeTimeFromSong(double start, double length);
// Copies [start, start + length) to the clipboard: for timeClipboard.kind 3 the audio (also
// onto the system clipboard), the Hires FT blocks and the durations, always the FT blocks and
// the selected notes and barlines that lie in it. 1; 0 after a message or when refused.
int copyTimeToClipboard(double start, double length);
// Pastes the clipboard at at, replacing length seconds there (0 for a plain insertion): kind 3
// inserts the copied time and moves what follows, kind 4 places the copied notes and detected
// pitches over the song's own time. The pasted notes and barlines become the selection and the
// pasted time the time selection. 1; 0 after a message or when refused (nothing copied, too
// little disk space, a recording or an opening runs).
int pasteTimeFromClipboard(double at, double length);

// ---- the workers, one per sequence (1 on success, 0 on failure; the caller words it) ----
int removeWavesFromSong(uint32_t first, uint32_t count);
int copyWavesToClipboard(uint32_t first, uint32_t count);
int copyFTBlocksToClipboard(uint32_t first, uint32_t count);
int copyHiresFTBlocksToClipboard(uint32_t first, uint32_t count);
int copyNotesAndBarlinesToClipboard(double start, double length);
// replaced: the song's blocks at first that the pasted ones take the place of.
int pasteWaves(uint32_t first, uint32_t replaced);
int pasteFTBlocks(uint32_t first, uint32_t replaced);
int pasteHiresFTBlocks(uint32_t first, uint32_t replaced);
int pasteNotesAndBarlines(double at);
// The samples the clipboard's durations cover at the song's rate.
uint32_t clipboardSamples();
