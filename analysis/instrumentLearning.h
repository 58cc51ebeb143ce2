#pragma once
// Learning instrument definitions from reference recordings: pitch names, the definition's
// parameters carried in a recording's file name, finding the notes of an analysed recording
// and measuring each note's harmonics into a NoteSample, then adding the samples to a
// definition (learning) or putting one in place of a learnt sample (replacing). The
// instrument window's Learn and Replace commands and `melodrift-cli learn-instrument` use it.
//
// A learning recording is named name_kind_source_middleA_lowPitch_highPitch_sample.wav and
// holds one note per semitone from the low to the high pitch (writeScaleMidiFile makes the
// scale to record); a replacement is named name_kind_source_middleA_pitch_sample.wav and
// holds one note.

#include <cstdint>
#include <string>
#include <vector>

#include "analysis/instrumentDefinitions.h"
#include "store/ftBlockStore.h"

constexpr int LEARN_PARAMETER_COUNT = 7;      // name, kind, source, middle A, low pitch, high pitch, sample
constexpr int REPLACE_PARAMETER_COUNT = 6;    // name, kind, source, middle A, pitch, sample
constexpr int MAX_LEARNING_NOTES = 128;       // notes looked for in one recording
constexpr int MAX_IGNORE_FREQUENCIES = 256;   // frequencies one note may pass over
constexpr uint32_t LEARNING_NOTE_LEVEL = 64;  // a note's loudest block must sum above this
constexpr double LEARNING_NOTE_SECONDS = 0.08;   // and it must last at least this long
// Learning analyses in the song's stores, so no song may be open.
constexpr const char* CLOSE_SONG_BEFORE_LEARNING_TEXT = "Please close the song before learning instruments.";
constexpr double HARMONIC_GATHER_DIVISOR = 51.95146;  // entries within f / this (a third of a semitone) form a harmonic
constexpr int HARMONIC_MIN_BLOCKS = 3;        // consecutive blocks a harmonic must be present in

// The MIDI note number of a pitch name such as "C#4", "Eb3" or "a4": the first letter A-G
// (either case), the first "#" (+1) or "b" (-1) anywhere in the text (so a lower-case note
// letter b also reads as a flat), and the first digit 0-8 as the octave (9s are passed
// over): 12 x (octave + 1) + the letter's semitone + the accidental, except that B#, Cb, E#
// and Fb keep the letter's own semitone. 0 when there is no letter or no digit, after "Cannot
// interpret pitch in '<text>'" when report is set.
int parsePitchName(const std::string& text, int report);

// A definition's parameters read from a recording's file name.
struct InstrumentFileParameters {
    std::string name;     // first parameter, fitted to the file's 32 UTF-16 units
    std::string kind;     // second, the same
    std::string source;   // third, the same
    float middleA;        // fourth, Hz
    int lowSemitone;      // learning: the low pitch; replacing: the pitch
    int highSemitone;     // learning: the high pitch; replacing: the pitch
    int sampleNumber;     // last parameter; -1 when it is not a whole number
};

// The file name of path without its folder, and without its extension when the text after
// the last "." holds no "_" (so "..._440.0_C4_B4_0" keeps its middle A).
std::string instrumentFileStem(const std::string& path);

// Splits the file name at each "_" into seven parameters (learning) or six (replacing). 1;
// 0 after "There are too few instrument definition parameters in filename data in '%s'",
// "There are too many instrument definition parameters in filename data in '%s'" (the file
// name), "Cannot interpret pitch in '%s'", "Cannot interpret middle A in '%s'" (not a
// positive number), or "The low pitch is above the high pitch in filename data in '%s'".
// The sample number is checked by the callers.
int readInstrumentFileParameters(const std::string& path, int replace, InstrumentFileParameters* parameters);

// A recording's FT blocks as learning reads them: each block's dataBuffer.
struct LearningRecording {
    std::vector<FTDataBuffer> blocks;   // block after block from the recording's start
    double blockDuration;               // seconds of one sampleBlock
    int lowAmplitudesRemoved;           // the tables were made with "Remove Low Amplitudes" on
};

// A note of a learning recording: blocks [start, end).
struct LearningNote {
    uint32_t start;   // first block
    uint32_t end;     // one past the last
};

// The notes of a recording: runs of blocks whose entries' amplitudes sum above 0, counted
// when the run's loudest block sums above 64 and it lasts at least 0.08 s; at most 128.
std::vector<LearningNote> findLearningNotes(const LearningRecording& recording);

// Learns the note in blocks [start, end) of the recording into sample, for a definition
// tuned to middleA: its harmonics strongest first, at most 32. 1; 0 when the note's learning
// ended early after "Cannot learn note - Increase MaxIgnoreFrequencies constant in
// AnalyseNote" or "Cannot learn note as found too many harmonics - Increase MAX_CS_HARMONICS
// definition in Instruments": the sample then holds the harmonics found so far.
int learnNoteSample(const LearningRecording& recording, uint32_t start, uint32_t end, double middleA,
                    NoteSample* sample);

// Analyses a wave file for learning, with the song's stores as the working space: the song
// must be empty (no blocks) and is closed again afterwards. The analysis runs marked as
// instrument learning (the learning copy of the secondary cut-off level, no note-join
// filter); the mark is taken off again. 1; 0 after a message: a song is open, a ".ftb" file,
// the wave reader's message, a rate above 44100 Hz, or the analysis's own.
int analyseLearningFile(const std::string& path, LearningRecording* recording);

// Learns the recording path names (learning, or replacing when replace is set) from its FT
// blocks already analysed: what learnFromFile does once the file is analysed. The learnt
// definition becomes the current one and the file in use is rewritten. 1 when learnt and
// saved; 0 after a message (the table unchanged unless only the save failed).
int learnFromRecording(const std::string& path, int replace, const LearningRecording& recording);

// Learns (or, with replace, replaces a sample from) the recording at path: its parameters
// from the file name, then the analysis of the file, then learnFromRecording's steps. 1; 0
// after a message: "There is no more memory available to store new instruments." (256
// definitions), a parameter's, "A matching pitch could not be found for replacement by
// '%s'.", the analysis's, "Filters have not been applied to '%s', so it will not be
// analysed.", "The number of notes (%d) found in the waveform '%s' does not match the number
// of notes specified in the filename (%d).", "Pitch sample number out of range in waveform
// '%s'.", "Cantoscope did not find exactly one note in the waveform '%s'. It found %d.", or
// the save's. The file names in the messages are without their folder.
int learnFromFile(const std::string& path, int replace);

// Learns each file in turn (the caller has asked for them). Returns how many were learnt.
int learnInstrumentNotes(const std::vector<std::string>& paths, int replace);
