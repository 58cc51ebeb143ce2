// The song record, its time axis and its names. Block durations start at the nominal duration
// and are changed per block by timing edits, so the time of a block is always a sum of durations.
#include "store/song.h"

#include <algorithm>
#include <cmath>

#include "platform/allocation.h"
#include "shell/settings.h"

Song song;

// Growth step when the nominal duration is not known yet: 300 s of the shortest blocks.
static const uint32_t FALLBACK_GROWTH_BLOCKS = 300 * 128;

void resetSong() {
    song.blockCount = 0;
    song.sampleBlockDuration = 0.0;
    std::vector<double>().swap(song.sampleBlockDurations);
    song.waveFormat = SongWaveFormat{};
    song.workingWaveBytes = 0;
    song.instrumentName.clear();
    song.notesOnly = false;
    song.timeSignatureBeats = 4;
    song.timeSignatureUnit = 4;
    song.timeSignatureSymbol = 1;
    song.changed = false;
}

int growSampleBlockDurations(uint32_t blocks) {
    size_t length = song.sampleBlockDurations.size();
    if (blocks <= length) return 1;
    uint32_t step = FALLBACK_GROWTH_BLOCKS;
    if (song.sampleBlockDuration > 0.0) step = uint32_t(300.0 / song.sampleBlockDuration);
    if (step == 0) step = 1;
    size_t steps = (blocks - length + step - 1) / step;
    return tryResize(song.sampleBlockDurations, length + steps * step, 0.0) ? 1 : 0;
}

double songTimeOfBlock(uint32_t n, uint32_t from) {
    const std::vector<double>& durations = song.sampleBlockDurations;
    size_t end = std::min<size_t>(n, durations.size());
    double sum = 0.0;
    for (size_t k = from; k < end; k++) sum += durations[k];
    return sum;
}

double blockDuration(uint32_t n) {
    return n < song.sampleBlockDurations.size() ? song.sampleBlockDurations[n] : 0.0;
}

uint32_t blockAtTime(double t, uint32_t startBlock, double startTime, double offset) {
    double rest = t - offset - startTime;
    uint32_t count = song.blockCount;
    for (uint32_t k = startBlock; k < count; k++) {
        double duration = blockDuration(k);
        rest -= duration;
        if (rest < 0.0) {
            double toEnd = -rest;
            // Half-way between two boundaries goes to the later one.
            return toEnd > duration / 2 ? k : k + 1;
        }
    }
    return count;
}

double snapTimeToBlock(double t, uint32_t startBlock, double startTime) {
    uint32_t count = song.blockCount;
    double end = startTime + songTimeOfBlock(count, startBlock);
    if (t < end || count == 0) {
        uint32_t k = blockAtTime(t, startBlock, startTime);
        return startTime + songTimeOfBlock(k, startBlock);
    }
    // Past the last block the grid goes on at the last block's duration.
    double duration = blockDuration(count - 1);
    if (duration <= 0.0) return end;
    double extra = t - end;
    double whole = std::floor(extra / duration);
    double toEnd = duration - (extra - whole * duration);
    double blocks = toEnd > duration / 2 ? whole : whole + 1;
    return end + blocks * duration;
}

double songDuration() { return songTimeOfBlock(song.blockCount); }

BlockGrid makeBlockGrid() {
    BlockGrid grid;
    uint32_t count = song.blockCount;
    grid.starts.resize(size_t(count) + 1);
    double sum = 0.0;
    for (uint32_t k = 0; k < count; k++) {
        sum += blockDuration(k);
        grid.starts[k + 1] = sum;
    }
    return grid;
}

double BlockGrid::snap(double t) const {
    size_t count = starts.size() - 1;
    if (count == 0) return 0.0;
    double end = starts[count];
    if (t < end) {
        // Block k holds t (starts[k] <= t < starts[k + 1]; k = 0 before the song); the nearer
        // boundary wins, half-way goes to the later one, as blockAtTime decides.
        size_t k = size_t(std::upper_bound(starts.begin() + 1, starts.end(), t) - starts.begin()) - 1;
        double toEnd = starts[k + 1] - t;
        return toEnd > blockDuration(uint32_t(k)) / 2 ? starts[k] : starts[k + 1];
    }
    double duration = blockDuration(uint32_t(count - 1));
    if (duration <= 0.0) return end;
    double extra = t - end;
    double whole = std::floor(extra / duration);
    double toEnd = duration - (extra - whole * duration);
    double blocks = toEnd > duration / 2 ? whole : whole + 1;
    return end + blocks * duration;
}

uint32_t sampleOfBlock(uint32_t n) {
    double samples = songTimeOfBlock(n) * song.waveFormat.samplesPerSec + 0.5;
    if (!(samples > 0.0)) return 0;
    return samples >= 4294967295.0 ? 0xFFFFFFFFu : uint32_t(samples);
}

SongNames songNames;

void resetSongNames() { songNames = SongNames{}; }

void setSongNamesFromFile(const std::string& path) {
    std::string name = path;
    size_t dot = name.rfind('.');
    if (dot != std::string::npos && dot + 4 >= name.size()) name.erase(dot);
    for (std::string& remembered : songNames.remembered) remembered = name;
}

std::string songInstrumentName() {
    return song.instrumentName.empty() ? globalSettings.defaultInstrument : song.instrumentName;
}
