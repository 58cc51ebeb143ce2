// The pointer info texts, the info strip's layout and the tuning indicator.
#include "playback/pointerInfo.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <mutex>

#include "analysis/pitchScale.h"
#include "audio/audioActivity.h"
#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "playback/playbackState.h"
#include "playback/songViewGeometry.h"
#include "store/song.h"

PointerInfo pointerInfo = {"", "", "", "", "", 0, 0, false, -1, -1};

void resetPointerInfo() { pointerInfo = PointerInfo{"", "", "", "", "", 0, 0, false, -1, -1}; }

std::string formatSongTime(double seconds) {
    if (!(seconds > 0)) seconds = 0;
    int minutes = int(seconds / 60);
    char text[32];
    std::snprintf(text, sizeof text, "%d:%05.2f", minutes, seconds - minutes * 60.0);
    return text;
}

std::string formatFrequencyText(double hz) {
    char text[32];
    std::snprintf(text, sizeof text, "%.0fHz", hz);
    return text;
}

static void setTexts(const char* kind, const std::string& first, const std::string& second, const std::string& name,
                     const std::string& frequency) {
    pointerInfo.kind = kind;
    pointerInfo.firstTime = first;
    pointerInfo.secondTime = second;
    pointerInfo.pitchName = name;
    pointerInfo.frequencyText = frequency;
    pointerInfo.tuningFrequency = 0;
    pointerInfo.tuningKey = 0;
}

// The note sounding at time t, or -1.
static int noteAt(double t) {
    for (int i = 0; i < noteList.count; i++) {
        const Note& n = noteList.notes[i];
        if (t >= n.waveStart && t < n.waveEnd) return i;
        if (n.waveStart > t) break;
    }
    return -1;
}

void updatePointerInfo(int x, int y) {
    std::lock_guard<std::mutex> guard(songViewDrawingMutex);
    pointerInfo.lastX = x;
    pointerInfo.lastY = y;
    double t = xToTime(x);

    // A recording being finished is still a recording: the finishing goes first.
    if (pointerInfo.finishing) {
        setTexts(POINTER_KIND_FINISHING, formatSongTime(songDuration()), "", "", "");
        return;
    }
    if (audioActivity.recording) {
        setTexts(POINTER_KIND_RECORDING, formatSongTime(songDuration()), "", "", "");
        return;
    }
    if (audioActivity.opening) {
        double total = audioActivity.openingSeconds;
        setTexts(POINTER_KIND_OPENING, formatSongTime(songDuration()), total > 0 ? formatSongTime(total) : "", "", "");
        return;
    }
    if (playbackRunning()) {
        double cursor = playbackState.cursor / 100.0;
        setTexts(POINTER_KIND_PLAYBACK, formatSongTime(cursor), formatSongTime(playbackState.end / 100.0), "", "");
        int i = noteAt(cursor);
        if (i >= 0) {
            const Note& n = noteList.notes[i];
            pointerInfo.pitchName = pitchName(n.midiNote, true, PITCH_NAMES_DIATONIC);
            pointerInfo.frequencyText = formatFrequencyText(n.pitch);
            pointerInfo.tuningFrequency = n.pitch;
            pointerInfo.tuningKey = pitchToFrequency(n.midiNote);
        }
        return;
    }
    const Selection& s = selection;
    if (s.timeSelectionStart >= 0 && s.timeSelectionEnd > s.timeSelectionStart && t >= s.timeSelectionStart &&
        t <= s.timeSelectionEnd) {
        setTexts(POINTER_KIND_SELECTION, formatSongTime(s.timeSelectionStart), formatSongTime(s.timeSelectionEnd), "",
                 "");
        return;
    }
    if (s.pointerNote >= 0 && s.pointerNote < noteList.count) {
        const Note& n = noteList.notes[s.pointerNote];
        setTexts(POINTER_KIND_NOTE, formatSongTime(n.waveStart), formatSongTime(n.waveEnd), "", "");
        if (displayModes.noteMode == NOTE_MODE_NOTE) {
            pointerInfo.pitchName = pitchName(n.midiNote, true, PITCH_NAMES_DIATONIC);
            pointerInfo.frequencyText = formatFrequencyText(n.pitch);
        }
        pointerInfo.tuningFrequency = n.pitch;
        pointerInfo.tuningKey = pitchToFrequency(n.midiNote);
        return;
    }
    if (s.pointerBarline >= 0 && s.pointerBarline < barlineList.count) {
        setTexts(POINTER_KIND_BARLINE, formatSongTime(barlineList.times[s.pointerBarline]), "", "", "");
        return;
    }
    double frequency = yToPitch(y);
    setTexts(POINTER_KIND_POINTER, formatSongTime(t), "",
             frequency > 0 ? pitchName(frequencyToSemitone(frequency), true, PITCH_NAMES_DIATONIC) : "",
             frequency > 0 ? formatFrequencyText(frequency) : "");
}

void refreshPointerInfo() { updatePointerInfo(pointerInfo.lastX, pointerInfo.lastY); }

const char* infoTimeSeparator() { return audioActivity.recording || audioActivity.opening ? "/" : "-"; }

std::string recordingLoadText(double latencySeconds, double loadPercent) {
    char text[96];
    std::snprintf(text, sizeof text, "%s %.1fs  %s %.0f%%", "Latency", latencySeconds, "Processor", loadPercent);
    return text;
}

int tuningSegmentLeft(int segment) { return 450 + 12 * segment + (segment >= 5 ? 4 : 0); }

int tuningDeviationSegments(double frequency, double key) {
    if (!(frequency > 0) || !(key > 0)) return 0;
    double cents = 1200.0 * std::log2(frequency / key);
    double size = std::fabs(cents);
    if (size <= TUNING_TOLERANCE_CENTS) return 0;
    int segments = std::min(5, 1 + int((size - TUNING_TOLERANCE_CENTS) / TUNING_CENTS_PER_SEGMENT));
    return cents < 0 ? -segments : segments;
}

int tuningSegmentLit(int segment, int segments) {
    if (segments < 0) return segment <= 4 && segment >= 5 + segments;
    if (segments > 0) return segment >= 5 && segment <= 4 + segments;
    return 0;
}
