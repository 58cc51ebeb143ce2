#pragma once
// Instrument definitions generated from a formula instead of a recording: a "Sine" model (one
// harmonic per note) and a "Synthesised" model (five harmonics shaped like a plucked string)
// chosen by the General MIDI program of the name. The instrument window's New command and
// tools/instruments (the definitions delivered in Resources/CSInst.dat) use them.

#include <string>
#include <vector>

#include "analysis/instrumentDefinitions.h"

constexpr const char* SINE_MODEL = "Sine";
constexpr const char* SYNTHESISED_MODEL = "Synthesised";
constexpr const char* GENERATED_SOURCE = "Generated";
constexpr float DEFAULT_SCORE_THRESHOLDS[3] = {70.0f, 30.0f, 10.0f};   // percent, every definition the program makes

// Fills definition for name over [lowSemitone, highSemitone] with two samples per semitone:
// sample k lasts (k + 1) x noteDuration / 2 seconds at level ((k + 1) x level) / 2. General
// MIDI programs 25 to 40 (guitars and basses) get the Synthesised model, all others Sine.
// 1; 0 for a range outside 0..127 or upside down, a duration that is not a positive number, or
// after the memory message (string 10401).
int generateInstrumentDefinition(const std::string& name, int lowSemitone, int highSemitone, double noteDuration,
                                 uint32_t level, InstrumentDefinition* definition);

// Generates a definition (as above), appends it to the table, saves the file and makes it the
// current definition; the caller then shows the instrument window. 1 when added and saved; 0
// after "There is no more memory available to store new instruments." when 256 exist (nothing
// changes), for arguments generateInstrumentDefinition refuses, or when the save failed (the
// definition stays in the table).
int createInstrumentDefinition(const std::string& name, int lowSemitone, int highSemitone, double noteDuration,
                               uint32_t level);

// The instruments delivered in Resources/CSInst.dat, in the file's order: "Voice" (a new song's
// default instrument) and the usual melody instruments, each with its sounding range.
struct DeliveredInstrument {
    const char* name;       // General MIDI name
    int lowSemitone;        // MIDI notes
    int highSemitone;
    double noteDuration;    // seconds
    uint32_t level;         // level of the longer sample
};
const std::vector<DeliveredInstrument>& deliveredInstruments();

// Empties the table and creates every delivered instrument into the file in use, which is
// rewritten after each. 1 when all were created and saved; 0 after the first failure's message.
int createDeliveredInstruments();
