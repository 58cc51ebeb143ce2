#pragma once
// The instrument window's picture of a definition, as geometry: one column per semitone of its
// range (split between the semitone's samples), frequency upwards on a logarithmic axis, and
// each learnt harmonic a bar at its frequency across the part of the note it sounds in, its
// strength against the sample's strongest harmonic. The desktop program paints what this gives.

#include <vector>

#include "analysis/instrumentDefinitions.h"

// Margins of the plot inside the drawing, pixels: the labels of the frequency axis on the left
// and of the semitones below.
constexpr int INSTRUMENT_PLOT_LEFT = 64;
constexpr int INSTRUMENT_PLOT_TOP = 12;
constexpr int INSTRUMENT_PLOT_RIGHT = 12;
constexpr int INSTRUMENT_PLOT_BOTTOM = 28;

struct InstrumentViewLayout {
    double left, top, width, height;   // the plot, pixels
    double lowFrequency;               // Hz at the plot's bottom
    double highFrequency;              // Hz at its top
    int columns;                       // semitones of the range
    double columnWidth;                // pixels
};

// The plot for definition in a drawing of width x height pixels. The frequency axis spans the
// definition's harmonics (or, with none, its notes) with a margin, whole octaves of A from 27.5 Hz.
InstrumentViewLayout layoutInstrumentView(const InstrumentDefinition& definition, int width, int height);

// The y of a frequency; frequencies outside the axis land outside the plot.
double instrumentFrequencyY(const InstrumentViewLayout& layout, double frequency);

// One harmonic as drawn.
struct HarmonicMark {
    int semitone;      // MIDI note of its column
    int sample;        // 0 or 1
    double x0, x1;     // where in the column it sounds: its start and end positions
    double y;          // its frequency
    double strength;   // its mean amplitude against the sample's strongest harmonic, 0 .. 1
};
std::vector<HarmonicMark> harmonicMarks(const InstrumentDefinition& definition, const InstrumentViewLayout& layout);
