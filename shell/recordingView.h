#pragma once
// What the song's window shows of a recording as it goes: the status word of the pointer info
// ("RECORDING", then "FINISHING..."), the Record command's label, and the end of the recording
// brought into view when it has been finished. Start-up installs it as the recorder's hook.

// The recorder's state changed (recordingState.labelState): the window follows.
void recordingStateChanged();
