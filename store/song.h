#pragma once
// The song: the one document the program holds. Its bulk data lives in working files in
// the shared folder; its block count, block durations (the time axis) and wave format
// live here. Every conversion between seconds and blocks goes through the time axis
// below, because timing edits make block durations unequal.

#include <cstdint>
#include <string>
#include <vector>

// The song's copy of the first 16 bytes of a wave format record.
struct SongWaveFormat {
    uint16_t formatTag;        // 1 = PCM
    uint16_t channels;         // of the source; the song's audio itself is one channel
    uint32_t samplesPerSec;    // Hz
    uint32_t avgBytesPerSec;   // samplesPerSec x blockAlign
    uint16_t blockAlign;       // bytes per frame of the source
    uint16_t bitsPerSample;    // 8 (unsigned) or 16 (signed)
};
static_assert(sizeof(SongWaveFormat) == 16, "SongWaveFormat is the 16-byte head of a format record");

struct Song {
    uint32_t blockCount;                        // sampleBlocks analysed; FT and Hires FT blocks alike
    double sampleBlockDuration;                 // nominal block length, seconds (set by the analysis)
    std::vector<double> sampleBlockDurations;   // per-block seconds; size() is the allocated length,
                                                // entries past blockCount are 0; timing edits change them
    SongWaveFormat waveFormat;                  // format of CS.fw's source (set by acceptWaveFormat)
    uint32_t workingWaveBytes;                  // data bytes stored in CS.fw so far
    std::string instrumentName;                 // the song's instrument; "" until the song sets it
    bool notesOnly;                             // the notes came from a MIDI file and there is no
                                                // recording: the blocks are only the notes' time axis,
                                                // with no CS.fw, FT or Hires data (set by MIDI import)
    uint32_t timeSignatureBeats = 4;            // upper number of the time signature (4; undo restores it)
    uint32_t timeSignatureUnit = 4;             // lower number (4; undo restores it)
    uint32_t timeSignatureSymbol = 1;           // 1 when the signature may be drawn as a symbol (undo restores it)
    bool changed = false;                       // edited since it was opened (editing commands); the
                                                // song window's title then ends in " *"
};
extern Song song;

// Empties the song's memory: no blocks, no durations, format and instrument cleared, the time
// signature of a new song (4/4, drawn as a symbol).
void resetSong();

// Makes room in sampleBlockDurations for at least blocks entries, growing in steps of
// 300 seconds' worth of blocks at the nominal duration; new entries are 0.
// 1 on success, 0 when the memory cannot be had (the array is left as it was).
int growSampleBlockDurations(uint32_t blocks);

// ---- time axis (t in seconds, n a block index) ----
// Sum of the durations of blocks from .. n-1 (bounded by the allocated length); 0 with no array.
double songTimeOfBlock(uint32_t n, uint32_t from = 0);
// Duration of block n; 0 beyond the allocated length.
double blockDuration(uint32_t n);
// The block boundary nearest to t (half-way rounds up), never above blockCount. The walk
// may begin at a known block startBlock whose start time is startTime; offset is
// subtracted from t first.
uint32_t blockAtTime(double t, uint32_t startBlock = 0, double startTime = 0.0, double offset = 0.0);
// The time of that same nearest boundary; past the last block the walk goes on with the
// last block's duration.
double snapTimeToBlock(double t, uint32_t startBlock = 0, double startTime = 0.0);
// The song's duration in seconds: songTimeOfBlock(blockCount).
double songDuration();
// The block boundaries summed once, for an operation that snaps many times (every note of a
// long song) while the durations stay as they are: snap(t) gives snapTimeToBlock(t) by
// bisection instead of a walk over the song.
struct BlockGrid {
    std::vector<double> starts;   // starts[k] = songTimeOfBlock(k), k = 0..blockCount
    double snap(double t) const;
};
BlockGrid makeBlockGrid();
// The first sample of block n in CS.fw: the samples of the blocks before it, the time
// songTimeOfBlock(n) at the song's rate, rounded.
uint32_t sampleOfBlock(uint32_t n);

// ---- the song's names ----
// For each output Save can write (a wave, a MIDI or a detail MIDI file, OutputType of the
// Save command) the name to propose and the name it was last written under.
struct SongNames {
    std::string remembered[3];   // per output: the name proposed (opening, saving)
    std::string lastSaved[3];    // per output: the name last written under (saving)
};
extern SongNames songNames;

// Clears the six names (start-up, song close).
void resetSongNames();
// A new song takes the file's name without its extension as each remembered name: the last
// "." within the last four characters and what follows are cut.
void setSongNamesFromFile(const std::string& path);

// The song's instrument: the name the MIDI tracks carry and take their General MIDI program
// from, which recognition fits to the instrument definitions. "CS Default Instrument" until
// the song sets instrumentName.
std::string songInstrumentName();
