#pragma once
// The pitch scale every part of the program shares: semitone numbers with 69 = the middle A
// (440 Hz unless an instrument names its own), and the conversions between them and
// frequencies. The analysis, recognition, note editing, the song view and MIDI use them.

// The middle A of the scale, Hz, unless an instrument names its own.
constexpr double DEFAULT_MIDDLE_A = 440.0;
// The scale's semitone numbers run 0 .. MAX_SEMITONE (a midiNote byte).
constexpr int MAX_SEMITONE = 255;

// The semitone number of frequency: 12 log2(32 f / middleA) + 9, limited to 0 .. MAX_SEMITONE.
// A frequency of 0 Hz or less, or not a number, gives 0.
double frequencyToPitch(double frequency, double middleA = DEFAULT_MIDDLE_A);
// The frequency of a (possibly fractional) semitone number: middleA / 32 x 2^((pitch - 9) / 12).
double pitchToFrequency(double pitch, double middleA = DEFAULT_MIDDLE_A);
// The nearest whole semitone of frequency, halves going up, 0 .. MAX_SEMITONE (a note's midiNote).
int frequencyToSemitone(double frequency, double middleA = DEFAULT_MIDDLE_A);
// The pitch of frequency in half-semitones (twice the semitone number), not limited: four
// times the pitch is rounded to the nearest integer, ties to even, and that is halved with
// an odd value rounded up. A frequency of 0 Hz or less, or one without a finite pitch, gives 0.
int frequencyToHalfSemitone(double frequency, double middleA = DEFAULT_MIDDLE_A);

// The rounding of frequencyToSemitone for a pitch already in hand: twice the pitch is
// truncated and an odd result rounded up before halving, so halves go up; limited to
// 0 .. MAX_SEMITONE (not a number gives 0).
int roundSemitone(double pitch);
// The rounding of frequencyToHalfSemitone for a pitch already in hand (0 when not finite).
int roundHalfSemitone(double pitch);

// The equal-tempered note frequencies with A = 440 Hz whatever the instrument:
// 13.75 x 2^((i - 9) / 12) Hz for the MIDI notes i = 0 .. NOTE_FREQUENCY_COUNT - 1. Built once;
// the analysis derives its resolution levels from it and recognition snaps phrases to it.
constexpr int NOTE_FREQUENCY_COUNT = 128;
const double* noteFrequencyTable();
