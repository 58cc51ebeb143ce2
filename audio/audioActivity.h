#pragma once
// Whether a recording or the opening of a wave file is under way. Commands that change the
// song, and the writers of CS.fw outside those workers, are refused while either runs.

struct AudioActivity {
    bool recording;   // set by the recorder while capture runs
    bool opening;     // set by the opening path until the worker has finished
};
extern AudioActivity audioActivity;

inline bool recordingOrOpeningActive() { return audioActivity.recording || audioActivity.opening; }
