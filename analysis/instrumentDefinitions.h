#pragma once
// The instrument definitions: how each instrument sounds to the recogniser (its MIDI voice,
// chord limit, tuning, semitone range, score thresholds and learnt note samples), the table
// of at most 256 of them that start-up loads from Resources/CSInst.dat, and that file's
// format. Note recognition matches its candidates against the table; generating, learning,
// replacing and deleting a definition change it and rewrite the file; the instrument window
// shows the current one.

#include <cstdint>
#include <string>
#include <vector>

constexpr int MAX_CS_INSTRUMENTS = 256;         // definitions the table holds
constexpr int MAX_CS_HARMONICS = 32;            // harmonics of one note sample
constexpr int MAX_CS_NOTESINCHORD = 12;         // the program's chord limit
constexpr int MAX_CS_NOTESAMPLES = 2;           // samples learnt per semitone
constexpr int MAX_CS_SEMITONE = 127;            // highest MIDI note of a range
constexpr int INSTRUMENT_NAME_UNITS = 32;       // UTF-16 units of each of the three names in the file
constexpr uint8_t INSTRUMENT_FILE_VERSION = 10; // the only version the loader takes
constexpr const char* INSTRUMENT_FILE = "CSInst.dat";   // in the resource folder's Resources/

// Shown when a definition cannot be added because the table is full.
constexpr const char* NO_MORE_INSTRUMENTS_TEXT = "There is no more memory available to store new instruments.";

// The window of a harmonic's tolerance: a step is 1 / TOLERANCE_STEP_DIVISOR of its frequency
// (about half a semitone), and two steps are always allowed on each side.
constexpr double TOLERANCE_STEP_DIVISOR = 34.63431;

// One harmonic of a note sample, stored in the file exactly as it lies here. Positions count
// 0 at the note's start to 255 at its end. Learning measures every field; the generated
// models give the fixed values noted below. The polyphonic matcher of note recognition is the
// only reader of the fields after toleranceMeasures.
struct Harmonic {
    float frequency;                // Hz
    float noteFrequency;            // Hz: the nearest equal-tempered note for the definition's middleA
    uint32_t meanAmplitude;         // the harmonic's summed amplitudes over the note / the note's blocks
    uint8_t startPosition;          // where within the note the harmonic begins, 0..255
    uint8_t endPosition;            // where it ends, 0..255
    uint8_t toleranceMeasures[2];   // [0]: high half steps above, low half steadiness (15 = a constant
                                    // amplitude, each step less a sixteenth more variation);
                                    // [1]: low half steps below, high half drift (tolerance steps
                                    // the frequency moved from its first to its last block)
    uint8_t onsetMeasures;          // low half: blocks a match may lag behind the learnt onset (5);
                                    // high half: attack length, max(2, blocks in 0.04 s)
    uint8_t peakPosition;           // where within the note the harmonic is loudest (generated: 0)
    uint16_t onsetShape;            // mean amplitude over the first, middle and last third of the
    uint16_t sustainShape;          //   harmonic's presence, relative to the sample's strongest
    uint16_t decayShape;            //   harmonic's meanAmplitude (256 = equal)
    uint32_t peakAmplitude;         // the loudest block's amplitude (generated: 0, not measured)
    uint16_t presentBlocks;         // blocks the harmonic was present in (generated: 0)
    uint16_t noteBlocks;            // the note's length in blocks (generated: 0)
    uint8_t reserved[24];           // 0 when made; kept as read
};
static_assert(sizeof(Harmonic) == 56, "a Harmonic is stored as 56 bytes");

struct NoteSample {
    float duration;                        // seconds
    uint32_t level;                        // the note's summed amplitude per block (generated: as asked)
    uint8_t harmonicCount;                 // 0..MAX_CS_HARMONICS
    Harmonic harmonics[MAX_CS_HARMONICS];  // 0 .. harmonicCount-1, strongest first
};

struct NoteSampleSet {
    uint8_t sampleCount;                         // 0..MAX_CS_NOTESAMPLES; an empty sample has no harmonics
    NoteSample samples[MAX_CS_NOTESAMPLES];      // sample 0 and sample 1
};

struct InstrumentDefinition {
    std::string name;                 // UTF-8; also finds the MIDI voice
    std::string kind;                 // "Sine", "Synthesised", or the learnt file's second parameter
    std::string source;               // "Generated", or the learnt file's third parameter
    uint8_t midiVoice;                // General MIDI program counted from 0
    uint8_t maxNotesInChord;          // 1..MAX_CS_NOTESINCHORD
    float scoreThresholds[3];         // percent: 70, 30, 10 for every definition the program makes
    float middleA;                    // Hz the samples were tuned to
    uint8_t lowSemitone;              // MIDI note of the range's bottom
    uint8_t highSemitone;             // and top, inclusive, at most MAX_CS_SEMITONE
    std::vector<NoteSampleSet> semitones;   // one per semitone of the range, low to high
};

struct InstrumentDefinitions {
    std::vector<InstrumentDefinition> definitions;   // at most MAX_CS_INSTRUMENTS; size() is the count
    int current;                                     // the definition the instrument window shows
    std::string filePath;                            // the file in use; "" = resourceFilePath(INSTRUMENT_FILE)
    int refusedFile;                                 // the last load refused an existing file: it is kept
                                                     // aside as "<file>.damaged" before the next save
};
extern InstrumentDefinitions instrumentDefinitions;

// The definitions file in use: filePath, or the resource folder's Resources/CSInst.dat.
std::string instrumentDefinitionsPath();
// Uses path ("" for the resource folder's file) from now on; the table is not touched.
void setInstrumentDefinitionsFile(const std::string& path);

// name as the file keeps it: cut at a character to 32 UTF-16 units, invalid UTF-8 as U+FFFD.
// Names are fitted before they are compared, so a definition is found again after a reload.
std::string fitInstrumentName(const std::string& name);

// Frees every definition (exit, and before each load); the current index goes back to 0.
void freeInstrumentDefinitions();

// Frees the table, then reads the file in use. 1 when it was read whole. 0 with the table
// empty when the file cannot be opened (no message), after "The instrument definitions file
// cannot be used (it could be out of date) and will not be loaded." for a version other than
// 10, after "The instrument definitions file '<path>' cannot be used (<reason>) and will not
// be loaded." for a damaged file (cut short, more than 256 definitions, a range with its low
// note above its high one or beyond note 127, more than two samples for a semitone, more than
// 32 harmonics, bytes after the last definition), or after the memory message (string 10401).
int loadInstrumentDefinitions();

// Writes the whole table to the file in use, replacing it only once the new file is complete
// (a new file beside it, renamed over it). 1; 0 after "Cannot <path>", "Bytes were not stored
// properly" or "File could not be closed", with the old file untouched.
int saveInstrumentDefinitions();

// Deletes definition index: later ones move down one place; the current index moves down one
// when it pointed at or past the new end. Then saves the file. 1 when deleted and saved; 0 for
// an index outside the table (nothing changes) or when the save failed (the table has changed).
int deleteInstrumentDefinition(int index);

// The chord limit of a MIDI voice (0-based General MIDI program): 12 for the pianos (0 to 5)
// and 8, 4 for 11, 6 for the guitars (24 to 31), 4 for the basses (32 to 39), 2 for 40 and 1
// for every other voice.
int maxNotesInChords(int midiVoice);
// A chord limit from the table above MAX_CS_NOTESINCHORD shows "An instrument in
// 'maxNotesInChords()' has been defined with a higher value than 'MAX_CS_NOTESINCHORD'" and
// gives MAX_CS_NOTESINCHORD; any other value is returned as it is.
int limitNotesInChord(int notes);

// Of the 128 equal-tempered notes 2^((i - 9) / 12) x middleA / 32, the frequency nearest to
// frequency; the lower note on a tie.
float nearestNoteFrequency(double frequency, double middleA);

// The instrument window's line for a definition: "%s (%s) - %s. MIDI voice is %d. Max notes in
// chord is %d. Middle A is %.2fHz. Semitone range is %d to %d. Score thresholds: %.1f%%,
// %.1f%%, %.1f%%." with a "." as decimal point whatever the locale.
std::string instrumentDefinitionText(const InstrumentDefinition& definition);
