#pragma once
// The pointer info: the texts the song view's info strip shows about what lies under the
// pointer (a selection, a note, a barline, empty space) or about what the program is doing
// (playback, recording, opening), the strip's layout and the tuning indicator. The song view
// updates it on pointer moves and edits; its renderer draws it under the drawing lock.

#include <string>

// The kind words.
constexpr const char* POINTER_KIND_SELECTION = "SELECTION";
constexpr const char* POINTER_KIND_NOTE = "NOTE";
constexpr const char* POINTER_KIND_POINTER = "POINTER";
constexpr const char* POINTER_KIND_BARLINE = "BARLINE";
constexpr const char* POINTER_KIND_PLAYBACK = "PLAYBACK";
constexpr const char* POINTER_KIND_RECORDING = "RECORDING";
constexpr const char* POINTER_KIND_OPENING = "OPENING";
constexpr const char* POINTER_KIND_FINISHING = "FINISHING...";

struct PointerInfo {
    std::string kind;            // the kind word, or "" before the pointer was anywhere
    std::string firstTime;       // "%d:%05.2f", or ""
    std::string secondTime;      // "%d:%05.2f", or "" when the strip shows one time
    std::string pitchName;       // with octave, diatonic spelling, or ""
    std::string frequencyText;   // "%.0fHz", or ""
    double tuningFrequency;      // Hz the tuning indicator compares; 0 when it shows nothing
    double tuningKey;            // Hz of the note's key it is compared with
    bool finishing;              // a recording is being finished (recording sets it)
    int lastX, lastY;            // where the pointer was last seen in the drawing window; -1 never
};
extern PointerInfo pointerInfo;

// No texts, no tuning, not finishing, pointer never seen.
void resetPointerInfo();

// "%d:%05.2f": whole minutes, then the seconds remainder with two decimals; a negative time
// shows as 0:00.00.
std::string formatSongTime(double seconds);
// "%.0fHz".
std::string formatFrequencyText(double hz);

// Recomputes the texts for the pointer at (x, y) of the drawing window, under the drawing
// lock. While recording, opening or finishing a recording the kind is the status word;
// during playback "PLAYBACK" with the cursor and end times; else, the first that applies:
// "SELECTION" inside the time selection, "NOTE" on pointerNote, "BARLINE" on
// pointerBarline, "POINTER" over empty space.
void updatePointerInfo(int x, int y);
// The same at the last position seen (after edits, when playback stops).
void refreshPointerInfo();

// The info strip: the bottom PLOT_BOTTOM_MARGIN pixels of the drawing window.
constexpr int INFO_BASELINE_RISE = 6;    // the texts' base line above the strip's bottom
constexpr int INFO_KIND_X = 6;           // small font
constexpr int INFO_TIME_X = 140;         // large font, green; separator 2 pixels after the first time
constexpr int INFO_SEPARATOR_GAP = 2;
constexpr int INFO_PITCH_X = 344;        // large font
constexpr int INFO_FREQUENCY_X = 392;    // small font
constexpr int INFO_LOAD_X = 581;         // small font, while recording
constexpr int INFO_FONT_SMALL = 120;     // font size arguments; the large is 1.5 times the small
constexpr int INFO_FONT_LARGE = 180;
// The separator between the two times: "/" while recording or opening, else "-".
const char* infoTimeSeparator();
// "%s %.1fs  %s %.0f%%" with "Latency" and "Processor".
std::string recordingLoadText(double latencySeconds, double loadPercent);

// The tuning indicator: ten segments of 8 x 16 pixels from x = 450, 12 pixels apart with 4
// more after the fifth, and a 2 x 20 centre mark at x = 509.
constexpr int TUNING_SEGMENTS = 10;
constexpr int TUNING_SEGMENT_WIDTH = 8;
constexpr int TUNING_SEGMENT_HEIGHT = 16;
constexpr int TUNING_CENTRE_X = 509;
constexpr int TUNING_CENTRE_WIDTH = 2;
constexpr int TUNING_CENTRE_HEIGHT = 20;
constexpr double TUNING_TOLERANCE_CENTS = 10.0;   // in tune: no segment lit
constexpr double TUNING_CENTS_PER_SEGMENT = 10.0;
int tuningSegmentLeft(int segment);
// Segments lit: negative when frequency lies below key (lit leftward from the centre),
// positive above (rightward), 0 within the tolerance or without a frequency; at most 5 each way.
int tuningDeviationSegments(double frequency, double key);
// 1 when segment (0 .. 9) is lit for a deviation of segments as tuningDeviationSegments gives.
int tuningSegmentLit(int segment, int segments);
