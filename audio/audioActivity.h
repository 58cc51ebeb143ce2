#pragma once
// Whether a recording or the opening of a wave file is under way. Commands that change the
// song, and the writers of CS.fw outside those workers, are refused while either runs.

struct AudioActivity {
    bool recording = false;         // set by the recorder while capture runs
    bool opening = false;           // set by the opening path until the worker has finished
    double openingSeconds = 0.0;    // while opening: the song's length once the whole file is read (0: unknown)
};
extern AudioActivity audioActivity;

inline bool recordingOrOpeningActive() { return audioActivity.recording || audioActivity.opening; }

// The refusals of work that would meet a running recording or opening.
constexpr const char* WHILST_RECORDING_TEXT = "Sorry - this cannot be done whilst recording audio.";
constexpr const char* WHILST_OPENING_TEXT = "Sorry - this cannot be done whilst opening audio.";
// 1 after showing WHILST_RECORDING_TEXT (a recording runs) or WHILST_OPENING_TEXT (an
// opening runs), else 0.
int refuseWhileBusy();
