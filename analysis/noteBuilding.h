#pragma once
// Note building: the decided pitch track cut into Note records. Runs of blocks on one semitone
// are note candidates; each is matched against the instrument definitions, kept when its
// duration suits the instrument's voice, given its pitch (notePitch) and appended to the note
// list, and split at syllable starts. The song's instrument list (at most 16) records the
// instruments the notes use.

#include <cstdint>

constexpr int MAX_SONG_INSTRUMENTS = 16;
// A note's duration limits come from its instrument's General MIDI voice (counted from 0).
constexpr int VOICE_OOHS_VOICE = 53;   // the voice when no instrument definition is loaded
// A block keeps the semitone the block before held while its pitch stays within half a
// semitone and this much of it.
constexpr double SEMITONE_HYSTERESIS = 0.3;
// A glide between two notes is split where it passes the middle when the notes lie at most
// this much of silence apart, and the split may take back this much of the old note's end
// that already leans towards the new one, seconds.
constexpr double GLIDE_GAP_SECONDS = 0.06;
constexpr double GLIDE_REACH_SECONDS = 0.06;
// A run shorter than GLIDE_RUN_SECONDS whose pitches spread over GLIDE_RUN_DRIFT semitones or
// more is part of a glide, not a note.
constexpr double GLIDE_RUN_SECONDS = 0.15;
constexpr double GLIDE_RUN_DRIFT = 0.75;
// A run shorter than this an octave (12 +- 1 semitones) away from a longer note right after or
// before it is that note's octave slip, seconds.
constexpr double OCTAVE_SLIP_SECONDS = 0.15;
// Note building decides the semitones from this long before its first block, seconds.
constexpr double GLIDE_CONTEXT_SECONDS = 0.3;
// A boundary between two notes moves forward to a syllable start at most this far after it,
// seconds, while the new note keeps at least SNAP_KEEP_SECONDS.
constexpr double SYLLABLE_SNAP_SECONDS = 0.08;
constexpr double SNAP_KEEP_SECONDS = 0.05;
// A note out of silence starts where the track's amplitude first reaches 1/FAINT_START_RATIO
// of its largest over the note's first FAINT_START_SECONDS.
constexpr double FAINT_START_SECONDS = 0.1;
constexpr int FAINT_START_RATIO = 8;
// A note out of silence starts where the loudness leapt out of silence (from at most
// 1/LOUDNESS_SILENCE_RATIO of its loudest over its first FAINT_START_SECONDS), at most
// LOUDNESS_RISE_SECONDS earlier, when it stayed above 1/LOUDNESS_RISE_RATIO of it since.
constexpr double LOUDNESS_RISE_SECONDS = 0.1;
constexpr int LOUDNESS_RISE_RATIO = 4;
constexpr int LOUDNESS_SILENCE_RATIO = 16;
// A note starts where its partial began to rise, at most this much before the pitch track
// takes it, seconds.
constexpr double ONSET_ADVANCE_SECONDS = 0.08;
// The rise counts from the partial's largest amplitude over the note's first
// ONSET_LEVEL_SECONDS divided by ONSET_RISE_FLOOR upwards: anything fainter is breath or noise.
constexpr double ONSET_LEVEL_SECONDS = 0.05;
constexpr int ONSET_RISE_FLOOR = 8;

struct SongInstruments {
    int definitions[MAX_SONG_INSTRUMENTS];   // InstrumentDefinition index of each slot (-1: the built-in voice)
    int noteCounts[MAX_SONG_INSTRUMENTS];    // notes built with each slot
    double strengths[MAX_SONG_INSTRUMENTS];  // their summed strength
    int count;                               // slots in use
    int settledVoice;                        // the song's MIDI voice once two instruments were in use; -1 before
};
extern SongInstruments songInstruments;

// Empties the list (song close, a new whole-song analysis).
void resetSongInstruments();

// Removes the last notesToDrop notes, then appends the notes found from the block of
// fromSample to the song's end. Returns the sample position the next chunk's caller keeps.
uint32_t buildNotes(uint32_t fromSample, int notesToDrop);

// entryFlags bits 4 and 5: marks the instrument matching leaves on the entries a note has used.
// Note building clears them, and restores the amplitudes, before it builds from a block again.
constexpr uint8_t ENTRY_NOTE_MARKS = 0x30;

// recognitionCode bits of a recognised note.
constexpr uint32_t NOTE_MATCHED_IN_RANGE = 1;      // an instrument definition's range and sample fit it
constexpr uint32_t NOTE_OUTSIDE_DEFINITIONS = 2;   // none fitted; it took the song's instrument
constexpr uint32_t NOTE_SPLIT_AT_SYLLABLE = 4;     // it starts or ends at a syllable start

// The shortest note of voice at pitch (MIDI number): 0.05 s for the choir, voice and whistle
// programs (52, 53, 78); otherwise 0.25 s at 24 and below to 1/12 s at 60 and above, linear.
double shortestNoteSeconds(int voice, double pitch);
// The longest sustain: pianos (0..5) 10 s at 24 and below to 5 s at 68 and above; guitars and
// basses (24..39) 5 s to 3 s over the same pitches; every other voice 1000 s.
double longestSustainSeconds(int voice, double pitch);

// The pitch (Hz) of the note on blocks [first, end): the blocks' detected frequencies,
// flattened, averaged in semitones within a semitone of their mean, leaving out the first
// min(0.1 s, a quarter of the note); the blocks' dataBuffers are put back afterwards. mean, when
// above 0, replaces the mean found (A = 440 Hz throughout). 440.0 for a note without a pitch.
double notePitch(uint32_t first, uint32_t end, double mean = 0.0);
