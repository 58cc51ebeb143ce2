// The instrument window's geometry. The frequency axis is logarithmic so that every octave of
// harmonics takes the same height, whether the definition is a bass or a whistle.
#include "playback/instrumentView.h"

#include <algorithm>
#include <cmath>

#include "analysis/pitchScale.h"

// The axis snaps to octaves of A from this frequency (A0).
static const double AXIS_BASE_FREQUENCY = 27.5;

InstrumentViewLayout layoutInstrumentView(const InstrumentDefinition& definition, int width, int height) {
    InstrumentViewLayout layout{};
    layout.left = INSTRUMENT_PLOT_LEFT;
    layout.top = INSTRUMENT_PLOT_TOP;
    layout.width = std::max(1, width - INSTRUMENT_PLOT_LEFT - INSTRUMENT_PLOT_RIGHT);
    layout.height = std::max(1, height - INSTRUMENT_PLOT_TOP - INSTRUMENT_PLOT_BOTTOM);
    layout.columns = int(definition.semitones.size());
    layout.columnWidth = layout.columns > 0 ? layout.width / layout.columns : layout.width;

    double low = pitchToFrequency(definition.lowSemitone);
    double high = pitchToFrequency(definition.highSemitone);
    for (const NoteSampleSet& set : definition.semitones)
        for (int s = 0; s < set.sampleCount; s++)
            for (int h = 0; h < set.samples[s].harmonicCount; h++) {
                double f = set.samples[s].harmonics[h].frequency;
                if (!(f > 0.0) || !std::isfinite(f)) continue;
                low = std::min(low, f);
                high = std::max(high, f);
            }
    // Whole octaves around what is drawn, so the grid's lines fall on the axis's ends.
    double lowOctave = std::floor(std::log2(std::max(low, 1.0) / AXIS_BASE_FREQUENCY));
    double highOctave = std::ceil(std::log2(std::max(high, 1.0) / AXIS_BASE_FREQUENCY));
    if (highOctave <= lowOctave) highOctave = lowOctave + 1;
    layout.lowFrequency = AXIS_BASE_FREQUENCY * std::pow(2.0, lowOctave);
    layout.highFrequency = AXIS_BASE_FREQUENCY * std::pow(2.0, highOctave);
    return layout;
}

double instrumentFrequencyY(const InstrumentViewLayout& layout, double frequency) {
    double span = std::log2(layout.highFrequency / layout.lowFrequency);
    double above = std::log2(std::max(frequency, 1e-6) / layout.lowFrequency);
    return layout.top + layout.height * (1.0 - above / span);
}

std::vector<HarmonicMark> harmonicMarks(const InstrumentDefinition& definition, const InstrumentViewLayout& layout) {
    std::vector<HarmonicMark> marks;
    for (int column = 0; column < layout.columns; column++) {
        const NoteSampleSet& set = definition.semitones[size_t(column)];
        int samples = std::max(1, int(set.sampleCount));
        double sampleWidth = layout.columnWidth / samples;
        for (int s = 0; s < set.sampleCount; s++) {
            const NoteSample& sample = set.samples[s];
            uint32_t strongest = 0;
            for (int h = 0; h < sample.harmonicCount; h++)
                strongest = std::max(strongest, sample.harmonics[h].meanAmplitude);
            double left = layout.left + column * layout.columnWidth + s * sampleWidth;
            for (int h = 0; h < sample.harmonicCount; h++) {
                const Harmonic& harmonic = sample.harmonics[h];
                if (!(harmonic.frequency > 0.0f) || !std::isfinite(harmonic.frequency)) continue;
                HarmonicMark mark;
                mark.semitone = definition.lowSemitone + column;
                mark.sample = s;
                mark.x0 = left + sampleWidth * harmonic.startPosition / 255.0;
                mark.x1 = left + sampleWidth * std::max(harmonic.startPosition, harmonic.endPosition) / 255.0;
                mark.y = instrumentFrequencyY(layout, harmonic.frequency);
                mark.strength = strongest > 0 ? double(harmonic.meanAmplitude) / strongest : 0.0;
                marks.push_back(mark);
            }
        }
    }
    return marks;
}
