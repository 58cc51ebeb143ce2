// The song view's coordinate system: time and pitch to screen and back, labels, zoom and
// scrolling.
#include "playback/songViewGeometry.h"

#include <algorithm>
#include <cmath>

#include "analysis/pitchScale.h"
#include "analysis/recognitionOptions.h"
#include "playback/playbackState.h"
#include "shell/settings.h"
#include "shell/zoom.h"
#include "store/song.h"

SongViewGeometry songViewGeometry;
std::mutex songViewDrawingMutex;

static const int DIATONIC_STEPS[12] = {0, 0, 1, 2, 2, 3, 3, 4, 4, 5, 6, 6};
static const int DIATONIC_ACCIDENTALS[12] = {0, 1, 0, -1, 0, 0, 1, 0, 1, 0, -1, 0};
static const char* const DIATONIC_LETTERS = "CCDEEFFGGABB";
static const char* const CHROMATIC_NAMES[12] = {"C", "C#/Db", "D", "D#/Eb", "E", "F",
                                                "F#/Gb", "G", "G#/Ab", "A", "A#/Bb", "B"};
static const int Y_CACHE_SIZE = int(Y_CACHE_FREQUENCY_LIMIT) * Y_CACHE_STEPS_PER_HZ;

void resetSongViewGeometry() {
    songViewGeometry = SongViewGeometry{};
    songViewGeometry.layoutZoom = zoomState.zoomFactor;
    songViewGeometry.yCache.assign(Y_CACHE_SIZE, -1);
}

int diatonicStep(int semitone) { return DIATONIC_STEPS[((semitone % 12) + 12) % 12]; }
int diatonicAccidental(int semitone) { return DIATONIC_ACCIDENTALS[((semitone % 12) + 12) % 12]; }

// P(k): the staff position, seven steps to the octave.
static int staffPosition(int semitone) {
    int octave = semitone >= 0 ? semitone / 12 : -((11 - semitone) / 12);
    return 7 * octave + diatonicStep(semitone);
}

void layoutSongView(int clientWidth, int clientHeight) {
    SongViewGeometry& g = songViewGeometry;
    if (g.yCache.size() != size_t(Y_CACHE_SIZE)) g.yCache.assign(Y_CACHE_SIZE, -1);
    g.clientWidth = std::max(0, clientWidth);
    g.clientHeight = std::max(0, clientHeight);
    g.plotLeft = LABEL_COLUMN_WIDTH;
    g.timeScale = songViewPitchLimits.viewScale > 0 ? songViewPitchLimits.viewScale : SONG_VIEW_TIME_SCALE;
    g.scaleMode = globalSettings.scaleMode;

    // The window's height less the margins. The vertical scroll position moves the plot, not
    // its height, so scrolling never changes the layout (and never clears the cache).
    int height = g.clientHeight - PLOT_BOTTOM_MARGIN - PLOT_TOP_MARGIN;
    height = std::clamp(height, PLOT_MINIMUM_HEIGHT, PLOT_MAXIMUM_HEIGHT);
    int low = frequencyToSemitone(songViewPitchLimits.lowestFrequency);
    int high = frequencyToSemitone(songViewPitchLimits.highestFrequency);
    // A damaged pair of limits must still leave a range to divide by.
    if (high <= low) high = low + 12;
    if (height != g.plotHeight || low != g.lowSemitone || high != g.highSemitone)
        std::fill(g.yCache.begin(), g.yCache.end(), -1);
    g.plotHeight = height;
    g.lowSemitone = low;
    g.highSemitone = high;
    g.lowFrequency = pitchToFrequency(low);
    g.highFrequency = pitchToFrequency(high);

    if (zoomState.zoomFactor != g.layoutZoom) {
        int anchor = g.plotLeft + visiblePlotWidth() / 2;
        if (playbackRunning()) {
            int cursorX = timeToX(playbackState.cursor / 100.0);
            if (cursorX >= g.plotLeft && cursorX < g.clientWidth) anchor = cursorX;
        }
        setZoom(zoomState.zoomFactor, anchor);
    }
    setSongViewScroll(g.scrollX, g.scrollY);
}

int plotTop() { return PLOT_TOP_MARGIN - songViewGeometry.scrollY; }
int plotBottom() { return plotTop() + songViewGeometry.plotHeight; }
int visiblePlotWidth() { return std::max(0, songViewGeometry.clientWidth - songViewGeometry.plotLeft); }
int visiblePlotHeight() { return std::max(0, songViewGeometry.clientHeight - PLOT_BOTTOM_MARGIN); }
double pixelsPerSecond() { return songViewGeometry.timeScale * songViewGeometry.layoutZoom; }
int plotWidth() { return int(pixelsPerSecond() * songDuration()); }
int maxScrollX() { return std::max(0, plotWidth() - visiblePlotWidth()); }
int maxScrollY() {
    return std::max(0, songViewGeometry.plotHeight + PLOT_TOP_MARGIN + PLOT_BOTTOM_MARGIN - songViewGeometry.clientHeight);
}

void setSongViewScroll(int x, int y) {
    songViewGeometry.scrollX = std::clamp(x, 0, maxScrollX());
    songViewGeometry.scrollY = std::clamp(y, 0, maxScrollY());
}

int timeToX(double t) {
    return int(songViewGeometry.plotLeft + t * pixelsPerSecond()) - songViewGeometry.scrollX;
}

double xToTime(int x) {
    double pps = pixelsPerSecond();
    if (pps <= 0) return 0;
    return (x + songViewGeometry.scrollX - songViewGeometry.plotLeft) / pps;
}

int chromaticY(double frequency) {
    const SongViewGeometry& g = songViewGeometry;
    if (!(frequency > 0)) frequency = g.lowFrequency;
    double span = std::log(g.highFrequency) - std::log(g.lowFrequency);
    return plotBottom() - int((std::log(frequency) - std::log(g.lowFrequency)) * g.plotHeight / span);
}

// Height above the plot bottom of a staff position Q (possibly between lines).
static int diatonicHeight(double q) {
    const SongViewGeometry& g = songViewGeometry;
    int lowP = staffPosition(g.lowSemitone);
    int span = staffPosition(g.highSemitone) - lowP;
    return int((q - lowP) * g.plotHeight / span);
}

static double staffPlace(int semitone) { return staffPosition(semitone) + 0.5 * diatonicAccidental(semitone); }

int diatonicY(double frequency) {
    SongViewGeometry& g = songViewGeometry;
    if (!(frequency > 0)) frequency = g.lowFrequency;
    int key = -1;
    if (frequency < Y_CACHE_FREQUENCY_LIMIT && g.yCache.size() == size_t(Y_CACHE_SIZE)) {
        key = int(frequency * Y_CACHE_STEPS_PER_HZ);
        if (g.yCache[key] != -1) return plotBottom() - g.yCache[key];
    }
    double pitch = frequencyToPitch(frequency);
    int k = frequencyToSemitone(frequency);
    double deviation = pitch - k;
    int neighbour = deviation > 0 ? k + 1 : k - 1;
    double q = staffPlace(k) + std::fabs(deviation) * (staffPlace(neighbour) - staffPlace(k));
    int height = diatonicHeight(q);
    // The cache holds heights above the bottom; a height below it (a frequency under the range)
    // would collide with the "unknown" mark, so only those at or above it are kept.
    if (key >= 0 && height >= 0) g.yCache[key] = height;
    return plotBottom() - height;
}

int pitchToY(double frequency) {
    int mode = songViewGeometry.scaleMode;
    bool chromatic = mode & SCALE_MODE_CHROMATIC, diatonic = mode & SCALE_MODE_DIATONIC;
    if (chromatic && diatonic) return (chromaticY(frequency) + diatonicY(frequency)) / 2;
    if (chromatic) return chromaticY(frequency);
    if (diatonic) return diatonicY(frequency);
    return 0;
}

int semitoneLineY(int semitone) {
    int mode = songViewGeometry.scaleMode;
    bool chromatic = mode & SCALE_MODE_CHROMATIC, diatonic = mode & SCALE_MODE_DIATONIC;
    int yc = chromaticY(pitchToFrequency(semitone));
    int yd = plotBottom() - diatonicHeight(staffPosition(semitone));
    if (chromatic && diatonic) return (yc + yd) / 2;
    if (chromatic) return yc;
    if (diatonic) return yd;
    return 0;
}

double yToPitch(int y) {
    const SongViewGeometry& g = songViewGeometry;
    int mode = g.scaleMode;
    if (!(mode & (SCALE_MODE_CHROMATIC | SCALE_MODE_DIATONIC))) return 0;
    if (mode == SCALE_MODE_CHROMATIC || !(mode & SCALE_MODE_DIATONIC)) {
        double pixelsPerLogUnit = g.plotHeight / (std::log(g.highFrequency) - std::log(g.lowFrequency));
        return std::exp(std::log(g.lowFrequency) + (plotBottom() - y) / pixelsPerLogUnit);
    }
    // y falls as the frequency rises; halve the interval until its ends meet on screen.
    double low = g.lowFrequency, high = g.highFrequency;
    for (int i = 0; i < 64; i++) {
        int yLow = pitchToY(low), yHigh = pitchToY(high);
        if (yLow - yHigh < 2) break;
        double middle = std::sqrt(low * high);
        if (pitchToY(middle) > y) low = middle;
        else high = middle;
    }
    return std::sqrt(low * high);
}

double chromaticPixelsPerSemitone() {
    const SongViewGeometry& g = songViewGeometry;
    return g.plotHeight / (12.0 * std::log2(g.highFrequency / g.lowFrequency));
}

double diatonicPixelsPerStep() {
    const SongViewGeometry& g = songViewGeometry;
    return double(g.plotHeight) / (staffPosition(g.highSemitone) - staffPosition(g.lowSemitone));
}

std::string pitchName(int semitone, bool withOctave, int spelling) {
    if (semitone < 0) return "";
    int within = semitone % 12;
    std::string name;
    if (spelling == PITCH_NAMES_DIATONIC) {
        name = DIATONIC_LETTERS[within];
        if (DIATONIC_ACCIDENTALS[within] > 0) name += '#';
        if (DIATONIC_ACCIDENTALS[within] < 0) name += 'b';
    } else {
        name = CHROMATIC_NAMES[within];
    }
    if (withOctave) name += std::to_string(semitone / 12 - 1);
    return name;
}

void setZoom(double z, int anchorX) {
    SongViewGeometry& g = songViewGeometry;
    if (!(z > 0)) return;
    double oldPps = pixelsPerSecond();
    double anchorTime = oldPps > 0 ? (anchorX - g.plotLeft + g.scrollX) / oldPps : 0;
    zoomState.zoomFactor = z;
    g.layoutZoom = z;
    int scroll = int(g.plotLeft + anchorTime * pixelsPerSecond()) - anchorX;
    g.scrollX = std::clamp(scroll, 0, maxScrollX());
}

int fitZoomToWindow() {
    double duration = songDuration();
    if (song.blockCount == 0 || !(duration > 0) || visiblePlotWidth() <= 0) return 0;
    double z = visiblePlotWidth() / (duration * songViewGeometry.timeScale);
    z = std::clamp(z, ZOOM_MINIMUM, ZOOM_MAXIMUM);
    if (z == zoomState.zoomFactor && z == songViewGeometry.layoutZoom) return 0;
    setZoom(z, songViewGeometry.plotLeft);
    return 1;
}

int autoScrollSongView(double cursorTime, double endTime) {
    SongViewGeometry& g = songViewGeometry;
    int x = timeToX(cursorTime);
    int left = g.plotLeft + AUTO_SCROLL_MARGIN;
    int right = g.plotLeft + visiblePlotWidth() * 7 / 8;
    if (x >= left && x <= right) return 0;
    double pps = pixelsPerSecond();
    int scroll = int(cursorTime * pps) - AUTO_SCROLL_MARGIN;
    scroll = std::min(scroll, int(endTime * pps) - visiblePlotWidth() * 7 / 8);
    scroll = std::min(scroll, maxScrollX());
    scroll = std::max(scroll, 0);
    if (scroll == g.scrollX) return 0;
    g.scrollX = scroll;
    return 1;
}

int scrollToSongEnd() {
    int target = maxScrollX();
    if (songViewGeometry.scrollX == target) return 0;
    songViewGeometry.scrollX = target;
    return 1;
}

int scrollToShowTimes(double start, double end) {
    SongViewGeometry& g = songViewGeometry;
    if (visiblePlotWidth() <= 0) return 0;
    int left = g.plotLeft, right = g.plotLeft + visiblePlotWidth();
    if (timeToX(start) >= left && timeToX(end) <= right) return 0;
    int scroll = std::clamp(int(start * pixelsPerSecond()) - AUTO_SCROLL_MARGIN, 0, maxScrollX());
    if (scroll == g.scrollX) return 0;
    g.scrollX = scroll;
    return 1;
}
