// Vibrato and glissando flattening over the pitch track. Pitches are compared in semitones
// (frequencyToPitch with A = 440 Hz); a block without a pitch ends a note.
#include "analysis/pitchFlattening.h"

#include <algorithm>
#include <cmath>
#include <vector>

#include "analysis/recognitionBlocks.h"
#include "analysis/pitchScale.h"
#include "analysis/recognitionOptions.h"
#include "store/song.h"

static double amplitudeOf(uint32_t b) { return blockData(b).entries[0].amplitude; }

struct HalfCycle {
    uint32_t from, to;   // blocks of the turning points, from < to
    double steady;       // Hz
};

// The turning points of [from, end) (pitches in semitones): the extremes the pitch then leaves
// by more than the hysteresis in the other direction.
static void turningPoints(const std::vector<double>& pitch, std::vector<size_t>& turns) {
    turns.clear();
    if (pitch.empty()) return;
    size_t high = 0, low = 0;
    int direction = 0;   // +1 rising towards a maximum, -1 falling towards a minimum
    for (size_t k = 1; k < pitch.size(); k++) {
        if (pitch[k] > pitch[high]) high = k;
        if (pitch[k] < pitch[low]) low = k;
        // The note's first block is where the pitch starts from, not where it turns.
        if (direction >= 0 && pitch[high] - pitch[k] > VIBRATO_HYSTERESIS_SEMITONES) {
            if (high > 0) turns.push_back(high);
            direction = -1;
            low = k;
        } else if (direction <= 0 && pitch[k] - pitch[low] > VIBRATO_HYSTERESIS_SEMITONES) {
            if (low > 0) turns.push_back(low);
            direction = 1;
            high = k;
        }
    }
}

static void flattenNote(uint32_t from, uint32_t end) {
    std::vector<double> pitch(end - from);
    for (uint32_t b = from; b < end; b++) pitch[b - from] = frequencyToPitch(blockPitch(b));
    std::vector<size_t> turns;
    turningPoints(pitch, turns);
    uint32_t longest = uint32_t(blocksForSeconds(VIBRATO_HALF_CYCLE_SECONDS));
    std::vector<HalfCycle> cycles;
    for (size_t i = 0; i + 1 < turns.size() && cycles.size() < size_t(MAX_VIBRATO_HALF_CYCLES); i++) {
        size_t a = turns[i], b = turns[i + 1];
        double swing = std::fabs(pitch[b] - pitch[a]);
        if (b - a >= longest || swing <= VIBRATO_MIN_SWING_SEMITONES) continue;
        cycles.push_back(HalfCycle{uint32_t(from + a), uint32_t(from + b), pitchToFrequency((pitch[a] + pitch[b]) / 2)});
    }
    if (cycles.size() <= 2) return;
    for (size_t i = 0; i < cycles.size(); i++) {
        // Neighbouring half-cycles share a turning point; it goes to the later one, and the
        // last half-cycle keeps its closing turning point.
        uint32_t to = i + 1 == cycles.size() || cycles[i + 1].from != cycles[i].to ? cycles[i].to + 1 : cycles[i].to;
        for (uint32_t b = cycles[i].from; b < to; b++) {
            FTDataBuffer& data = blockData(b);
            data.entries[0].frequency = float(cycles[i].steady);
            data.blockFlags |= BLOCK_VIBRATO;
        }
    }
}

void flattenVibrato(uint32_t from, uint32_t end) {
    uint32_t b = from;
    while (b < end) {
        if (blockPitch(b) <= 0.0) {
            b++;
            continue;
        }
        uint32_t start = b;
        double sum = 0.0, sumLog = 0.0;
        while (b < end) {
            double p = blockPitch(b);
            if (p <= 0.0) break;
            if (b > start && !nearFrequency(p, std::exp(sumLog / sum), SEMITONE_TOLERANCE)) break;
            sum += amplitudeOf(b);
            sumLog += amplitudeOf(b) * std::log(p);
            b++;
        }
        flattenNote(start, b);
    }
}

void flattenGlissando(uint32_t from, uint32_t end) {
    uint32_t steadyBlocks = uint32_t(std::max(1, blocksForSeconds(GLIDE_STEADY_SECONDS)));
    double blockSeconds = song.sampleBlockDuration;
    uint32_t b = end;
    while (b > from) {
        uint32_t last = b - 1;
        if (blockPitch(last) <= 0.0) {
            b--;
            continue;
        }
        // The steady stretch [s, last].
        uint32_t s = last;
        double sum = amplitudeOf(last), sumLog = amplitudeOf(last) * std::log(blockPitch(last));
        while (s > from) {
            double p = blockPitch(s - 1);
            if (p <= 0.0 || !nearFrequency(p, std::exp(sumLog / sum), SEMITONE_TOLERANCE)) break;
            s--;
            sum += amplitudeOf(s);
            sumLog += amplitudeOf(s) * std::log(p);
        }
        double mean = std::exp(sumLog / sum);
        // The glide [g, s): one direction, overlapping bands, amplitudes above half its last.
        uint32_t g = s;
        if (s > from && blockPitch(s - 1) > 0.0) {
            double towards = blockPitch(s) - blockPitch(s - 1);
            double lastAmplitude = amplitudeOf(s - 1);
            while (g > from && blockPitch(g - 1) > 0.0 && towards != 0.0) {
                double p = blockPitch(g - 1), q = blockPitch(g);
                double step = q - p;
                const FrequencyEntry &e = blockData(g - 1).entries[0], &f = blockData(g).entries[0];
                if ((step > 0.0) != (towards > 0.0) || step == 0.0 ||
                    std::fabs(step) > GLIDE_BAND_SHARE * (e.frequencyWidth + f.frequencyWidth) ||
                    2.0 * amplitudeOf(g - 1) <= lastAmplitude)
                    break;
                g--;
            }
        }
        uint32_t glide = s - g;
        if (glide > 0 && last + 1 - s >= steadyBlocks) {
            double span = std::fabs(frequencyToPitch(blockPitch(g)) - frequencyToPitch(mean));
            double needed = std::max(2.0, double(glide + 1) * blockSeconds * 10.0);
            if (span >= needed) {
                bool longGlide = double(glide) * blockSeconds > GLIDE_LONG_SECONDS;
                for (uint32_t k = g; k < s; k++) {
                    FTDataBuffer& data = blockData(k);
                    data.entries[0].frequency = float(mean);
                    data.blockFlags |= BLOCK_GLISSANDO | (longGlide ? BLOCK_LONG_GLISSANDO : 0);
                }
                b = g;
                continue;
            }
        }
        b = s;
    }
}
