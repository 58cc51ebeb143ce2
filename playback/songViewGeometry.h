#pragma once
// The song view's coordinate system: time to x through the zoom, pitch to y in the Chromatic
// and Diatonic layouts and back, the pitch labels, the plot's margins and scrolling, zooming
// about an anchor and the auto-scroll during playback. The desktop program's song view lays
// itself out and draws by these; the pointer info and the mouse handling read them too.

#include <cstdint>
#include <mutex>
#include <string>
#include <vector>

#include "shell/zoom.h"

constexpr int SONG_VIEW_TOOLBAR_HEIGHT = 26;   // the song window's toolbar above the drawing window
constexpr int PLOT_TOP_MARGIN = 2;             // pixels above the highest pitch
constexpr int PLOT_BOTTOM_MARGIN = 28;         // pixels below the lowest pitch: the info strip
constexpr int PLOT_MINIMUM_HEIGHT = 380;       // a shorter window scrolls vertically instead
constexpr int PLOT_MAXIMUM_HEIGHT = 65536;
constexpr int LABEL_COLUMN_WIDTH = 64;         // L: the pitch labels left of time 0, pixels
constexpr double SONG_VIEW_TIME_SCALE = 32.0;  // s: pixels per second at zoom factor 1
constexpr double Y_CACHE_FREQUENCY_LIMIT = 2500.0;   // Hz; higher frequencies are computed each time
constexpr int Y_CACHE_STEPS_PER_HZ = 16;             // the cache key is frequency x 16
constexpr int AUTO_SCROLL_MARGIN = 6;          // the cursor stands this far right of the plot's left edge
constexpr int SCROLL_STEP = 32;                // one scroll step of the keys and the scroll bars, pixels

// "CS Scale Mode" bits: both set average the two layouts.
constexpr int SCALE_MODE_DIATONIC = 16;
constexpr int SCALE_MODE_CHROMATIC = 32;

// How pitchName spells a semitone.
enum PitchSpelling {
    PITCH_NAMES_CHROMATIC = 0,   // "C#/Db"
    PITCH_NAMES_DIATONIC = 1     // "C#", "Eb", "Bb"
};

struct SongViewGeometry {
    int clientWidth = 0;                     // drawing window's client width, pixels (song view, on resize)
    int clientHeight = 0;                    // drawing window's client height, pixels (song view, on resize)
    int scrollX = 0;                         // horizontal scroll position, pixels (scroll bars, zoom, auto-scroll)
    int scrollY = 0;                         // vertical scroll position, pixels; the plot moves up by it (scroll bar)
    int plotLeft = LABEL_COLUMN_WIDTH;       // L: screen x of time 0 before scrolling
    int plotHeight = PLOT_MINIMUM_HEIGHT;    // H: pixels from the highest to the lowest pitch
    double timeScale = SONG_VIEW_TIME_SCALE; // s: pixels per second at zoom 1
    double layoutZoom = ZOOM_DEFAULT;        // the zoom factor scrollX belongs to; a new factor is applied about an anchor
    int scaleMode = SCALE_MODE_CHROMATIC;    // the "CS Scale Mode" bits the layout was made for
    int lowSemitone = 23;                    // kLow: the semitone of the plot's bottom
    int highSemitone = 97;                   // kHigh: the semitone of the plot's top
    double lowFrequency = 30.867706328507758;   // fLow: exact frequency of kLow, Hz
    double highFrequency = 2217.4610478149766;  // fHigh: exact frequency of kHigh, Hz
    std::vector<int32_t> yCache;             // Diatonic height above the plot bottom per frequency x 16; -1 unknown
};
extern SongViewGeometry songViewGeometry;

// The drawing lock: the renderer, the pointer info and the level meter take it, so a picture
// never shows texts or notes half written by another thread. Wait without time-out.
extern std::mutex songViewDrawingMutex;

// Back to a view of nothing: no size, no scrolling, zoom taken as it stands, cache empty.
void resetSongViewGeometry();

// Lays the view out for a drawing window of clientWidth x clientHeight: plot height, pitch
// range (the song's view limits snapped to semitones), scale mode and time scale. A zoom
// factor changed since the last layout is applied with setZoom about the play cursor while
// it is on screen, else about the middle of the visible plot. Clears the y cache when H,
// kLow or kHigh change, and keeps both scroll positions within their ranges.
void layoutSongView(int clientWidth, int clientHeight);

int plotTop();              // screen y of the highest pitch
int plotBottom();           // screen y of the lowest pitch
int visiblePlotWidth();     // pixels of the window right of L
int visiblePlotHeight();    // pixels of the window above the info strip
int plotWidth();            // the whole song at the present zoom, pixels
int maxScrollX();           // largest horizontal scroll position, 0 or more
int maxScrollY();           // largest vertical scroll position, 0 or more
double pixelsPerSecond();   // s x z

// Sets both scroll positions, each limited to its range.
void setSongViewScroll(int x, int y);

// Screen x of time t (seconds): L + t s z - scroll position, truncated.
int timeToX(double t);
// The time at screen x, seconds (negative left of L).
double xToTime(int x);

// Screen y of frequency f (Hz) in the layout of the scale mode: Chromatic, Diatonic, the
// integer mean of both when both bits are set, 0 when neither is.
int pitchToY(double frequency);
int chromaticY(double frequency);
int diatonicY(double frequency);
// Screen y of semitone k's grid line: in the Diatonic layout a sharp or flat shares its
// letter's line.
int semitoneLineY(int semitone);
// The frequency at screen y, Hz: the inverse of pitchToY (0 when no layout bit is set).
double yToPitch(int y);
// Pixels between neighbouring semitones: Chromatic, and per staff step in the Diatonic layout.
double chromaticPixelsPerSemitone();
double diatonicPixelsPerStep();

// The label of a semitone: the chromatic names ("C#/Db") or the diatonic spelling ("C#",
// "Bb"); withOctave appends (semitone div 12) - 1, so 69 is "A4" and 60 "C4".
std::string pitchName(int semitone, bool withOctave, int spelling);
// Staff step of a semitone within its octave (C 0 .. B 6) and its accidental (+1 sharp, -1 flat, 0).
int diatonicStep(int semitone);
int diatonicAccidental(int semitone);

// Sets the zoom factor z keeping the time under screen x anchorX at the same x: the scroll
// position moves accordingly, limited to 0 .. plot width - visible width.
void setZoom(double z, int anchorX);
// The zoom that fits the whole song into the visible plot width, limited to the zoom
// limits, applied about the plot's left edge. 1 when the factor changed, 0 otherwise (also
// for a song without blocks).
int fitZoomToWindow();
// Playback's timer: keeps the cursor at cursorTime (seconds) in view. Nothing happens while
// its x lies from 6 pixels right of L to seven eighths of the visible plot; otherwise the
// cursor is put 6 pixels right of L, but never beyond the position that shows endTime at
// seven eighths of the visible plot, past the largest scroll position or below 0.
// 1 when the view scrolled.
int autoScrollSongView(double cursorTime, double endTime);
// Scrolls so that the song's end is in view (the newest notes while opening). 1 when it moved.
int scrollToSongEnd();
// Scrolls so that [start, end] seconds is in view when it is not: its start then stands at the
// auto-scroll margin right of the plot's left edge. 1 when the view scrolled.
int scrollToShowTimes(double start, double end);
