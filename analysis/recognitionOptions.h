#pragma once
// The "Recognition options": the frequency-table part, the recognition part with its
// frequency tolerances, and the song view's pitch limits that the same step sets. Program
// globals: the values below are those the program starts with; a new song's analysis
// replaces some of them from the preferences. Read by the frequency tables, the clean-up
// filters, note recognition and the song view.

#include <cstdint>

struct RecognitionOptions {
    float blockDuration = 1.0f / 128;         // seconds; "Block duration", set per pitch range
    float lowestFrequency = 82.5f;            // Hz; first "Hz" field, set per pitch range
    float highestFrequency = 4300.0f;         // Hz; "to" field, set per pitch range
    float semitoneDivisions = 1.0f;           // "Number of semitone divisions": 2 with enhanced accuracy
    float amplitudeBoost = 1.0f;              // "Amplitude boost": divides the spectrogram's silence level
    float spikeThreshold = 0.6666667f;        // "Ignore amplitude spike threshold (1 = none ignored)"
    unsigned changeLimiter = 25;              // percent; "Horz. amplitude change limiter"
    uint8_t secondaryCutOffLevel = 45;        // percent; "Secondary auto cut off level" (clean-up filters)
    uint8_t learningSecondaryCutOffLevel = 45;   // percent; the copy used while learning instrument definitions
    bool powerSpectrumAnalysis = false;       // "Power Spectrum Analysis": averaged spectra in the spectrogram
    bool monophonicRecognition = true;        // "Monophonic recognition (Voice, trumpet etc.)"
    bool removeLowAmplitudes = true;          // "Remove Low Amplitudes"
    bool removeBassNoise = true;              // "Remove Bass Noise"
    bool removeBassHum = false;               // "Remove Bass Hum (Alg 1.5)"
    bool removeAttackInterference = false;    // "Remove Attack Interference"
    bool stripSurroundingAmplitudes = true;   // "Strip Surrounding Amplitudes"
    bool removeAmplitudeBlips = true;         // "Remove Amplitude Blips"
    bool removeWeakNoteTrails = true;         // "Remove Weak Note Trails"
    bool removeNoteJoins = true;              // "Remove Note Joins"
    bool removeExcessiveAttackNoise = true;   // "Remove Excessive Attack Noise"
    unsigned lookaheadFrames = 2;             // frames of the longest transform per analysis step
    float fullBandLimit = 5000.0f;            // Hz; the Hires store and resynthesis keep nothing above it
    bool groupLimiter = true;                 // the normalisers may change between segments
    bool disableWaveEditing = false;          // "CS Disable wave editing" as taken by the last new song's setup
    bool learningInstruments = false;         // set while instrument definitions are learnt; cleared by opening
    // recognition part
    bool analyseScore = true;                 // "Analyse score": whole-song analysis recognises notes
    bool compand = true;                      // "Compand": whole-song analysis compands the samples first
    bool mainsHumRemoval = true;              // entries near a steady 50 or 60 Hz family are ignored
    bool octaveCheck = true;                  // candidates stay within 12 semitones of the recent pitch range
    bool appendSibilants = true;              // "Append 'SSS' Sounds to Notes"
    bool octaveJumpCorrection = true;         // short excursions by about an octave are folded back
    bool flattenVibrato = true;               // "Flatten Vibrato (Alg 2+3)"
    bool flattenGlissando = true;             // "Flatten Glissando"
    bool removeLowAmplitudeNotes = true;      // "Remove Low Amplitude Notes"
    bool fitPhrasesToSemitones = true;        // first further cleaning pass: phrases moved onto the semitone grid
    bool refineNoteBoundaries = true;         // second further cleaning pass: boundaries where the partials
                                              // cross, short dropouts bridged
    bool findSyllables = true;                // "Find Syllables"
    float lowPitchLimit = 150.0f;             // Hz; below it octave tests allow wider steps
    bool checkPitchDrop = true;               // "Check &pitch drop and intial noise" (polyphonic note building)
    bool searchAhead = false;                 // "Search ahead for better matches before coming to a decision"
    bool allowOverlappingHarmonics = true;    // "Allow overlapping harmonics (repeated notes)"
    bool allowHarmonicsContainingGaps = false;   // "Allow harmonics containing gaps"
    bool useLongestHarmonicDuration = true;   // "Use longest harmonic duration to calculate note length ..."
    bool adjustHarmonicFitDuration = true;    // "Adjust Harmonic Fit Duration ..."
    float lateHarmonicsPeriod = 0.075f;       // seconds; "Maximum period for late harmonics to begin"
};
extern RecognitionOptions recognitionOptions;

// Frequency tolerances of recognition: f and g agree when |f - g| <= g / d.
constexpr double SEMITONE_TOLERANCE = 17.31715;          // about one semitone
constexpr double HALF_SEMITONE_TOLERANCE = 34.63431;     // about half a semitone
constexpr double QUARTER_SEMITONE_TOLERANCE = 69.26862;  // about a quarter semitone
constexpr double TWO_SEMITONE_TOLERANCE = 8.658577;      // about two semitones
constexpr double POLYPHONIC_TOLERANCE = 51.95146;        // about a third of a semitone

// The song view's pitch axis limits for the pitch range in force (the view's own unit draws them).
struct SongViewPitchLimits {
    float lowestFrequency = 30.0f;       // Hz at the bottom of the view
    float highestFrequency = 2217.0f;    // Hz at the top of the view
    float lowestNoteFrequency = 32.0f;   // Hz of the lowest note line
    float highestNoteFrequency = 2093.0f;   // Hz of the highest note line
    float viewScale = 32.0f;             // the view's scale constant
};
extern SongViewPitchLimits songViewPitchLimits;

// "CS Pitch range" values.
enum PitchRange {
    PITCH_RANGE_MID_TO_HIGH = 0,   // E3 to C8
    PITCH_RANGE_LOW_TO_MID = 1,    // E2 to E6, the default
    PITCH_RANGE_VERY_LOW = 2       // A0 to E5
};

// Sets the lowest and highest frequency and the block duration from "CS Pitch range" and
// "CS Boost speed", the semitone divisions from "CS Enhanced pitch accuracy", remembers
// "CS Disable wave editing", and sets the song view's pitch limits. A pitch range outside
// 0..2 (a damaged setting) is taken as the default range 1.
void applyAnalysisPreferences();

// Puts every option back to the value the program starts with (tests, and a fresh start).
void resetRecognitionOptions();
