// The instrument window's geometry: columns per semitone and sample, the octave-snapped
// logarithmic frequency axis, and where each harmonic's bar lies and how strong it is drawn.
#include <gtest/gtest.h>

#include "analysis/instrumentModels.h"
#include "analysis/pitchScale.h"
#include "playback/instrumentView.h"

static const double PIXEL = 1e-9;

TEST(InstrumentView, ASineDefinitionHasAColumnPerSemitoneAndOneBarPerSample) {
    InstrumentDefinition flute;
    ASSERT_EQ(generateInstrumentDefinition("Flute", 60, 71, 1.0, 200, &flute), 1);
    InstrumentViewLayout layout = layoutInstrumentView(flute, 1018, 700);
    EXPECT_EQ(layout.columns, 12);
    EXPECT_DOUBLE_EQ(layout.width, 1018 - INSTRUMENT_PLOT_LEFT - INSTRUMENT_PLOT_RIGHT);
    // C4 to B4 lie between the octaves of A at 220 and 880 Hz; A4 is the axis's middle.
    EXPECT_DOUBLE_EQ(layout.lowFrequency, 220.0);
    EXPECT_DOUBLE_EQ(layout.highFrequency, 880.0);
    EXPECT_NEAR(instrumentFrequencyY(layout, 440.0), layout.top + layout.height / 2, PIXEL);
    EXPECT_NEAR(instrumentFrequencyY(layout, 880.0), layout.top, PIXEL);

    std::vector<HarmonicMark> marks = harmonicMarks(flute, layout);
    ASSERT_EQ(marks.size(), 24u);
    const HarmonicMark& a4second = marks[2 * 9 + 1];
    EXPECT_EQ(a4second.semitone, 69);
    EXPECT_EQ(a4second.sample, 1);
    double column = layout.left + 9 * layout.columnWidth;
    EXPECT_NEAR(a4second.x0, column + layout.columnWidth / 2, PIXEL);
    EXPECT_NEAR(a4second.x1, column + layout.columnWidth, PIXEL);
    EXPECT_NEAR(a4second.y, layout.top + layout.height / 2, 1e-3);
    EXPECT_DOUBLE_EQ(a4second.strength, 1.0);
}

TEST(InstrumentView, ASynthesisedDefinitionDrawsItsOvertonesAboveAndWeaker) {
    InstrumentDefinition bass;
    ASSERT_EQ(generateInstrumentDefinition("Bass Guitar", 40, 40, 2.0, 200, &bass), 1);
    InstrumentViewLayout layout = layoutInstrumentView(bass, 600, 400);
    // E2 (82.4 Hz) and its sixth harmonic (494 Hz) between A1 and A4.
    EXPECT_DOUBLE_EQ(layout.lowFrequency, 55.0);
    EXPECT_DOUBLE_EQ(layout.highFrequency, 880.0);
    std::vector<HarmonicMark> marks = harmonicMarks(bass, layout);
    ASSERT_EQ(marks.size(), 10u);
    // The longer sample: level 200, harmonics 1, 2, 3, 4 and 6 at 200, 74, 74, 37 and 37.
    const double strengths[] = {1.0, 74 / 200.0, 74 / 200.0, 37 / 200.0, 37 / 200.0};
    for (int h = 0; h < 5; h++) {
        const HarmonicMark& mark = marks[size_t(5 + h)];
        EXPECT_EQ(mark.sample, 1);
        EXPECT_NEAR(mark.strength, strengths[h], 1e-12) << h;
        if (h > 0) { EXPECT_LT(mark.y, marks[size_t(5 + h - 1)].y) << h; }
    }
}

TEST(InstrumentView, AHarmonicSpansThePartOfTheNoteItSoundsIn) {
    InstrumentDefinition d{};
    d.lowSemitone = d.highSemitone = 69;
    d.semitones.resize(1);
    d.semitones[0].sampleCount = 1;
    NoteSample& sample = d.semitones[0].samples[0];
    sample.harmonicCount = 2;
    sample.harmonics[0] = Harmonic{};
    sample.harmonics[0].frequency = 440.0f;
    sample.harmonics[0].meanAmplitude = 80;
    sample.harmonics[0].endPosition = 255;
    sample.harmonics[1] = Harmonic{};
    sample.harmonics[1].frequency = 1320.0f;
    sample.harmonics[1].meanAmplitude = 20;
    sample.harmonics[1].startPosition = 51;    // a fifth of the way in ...
    sample.harmonics[1].endPosition = 204;     // ... to four fifths
    InstrumentViewLayout layout = layoutInstrumentView(d, 576, 440);
    std::vector<HarmonicMark> marks = harmonicMarks(d, layout);
    ASSERT_EQ(marks.size(), 2u);
    EXPECT_NEAR(marks[1].x0, layout.left + layout.width / 5, PIXEL);
    EXPECT_NEAR(marks[1].x1, layout.left + layout.width * 4 / 5, PIXEL);
    EXPECT_DOUBLE_EQ(marks[1].strength, 0.25);
    EXPECT_GT(marks[1].y, layout.top);
}
