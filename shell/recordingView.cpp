// The song's window following the recorder.
#include "shell/recordingView.h"

#include "audio/recording.h"
#include "playback/pointerInfo.h"
#include "playback/songViewGeometry.h"
#include "shell/mainFrame.h"

void recordingStateChanged() {
    pointerInfo.finishing = recordingState.labelState == RECORD_LABEL_FINISHING;
    // A recording that has just ended: its end, where the user stopped singing, is in sight.
    if (recordingState.labelState == RECORD_LABEL_IDLE) scrollToSongEnd();
    refreshPointerInfo();
    updateFrameDisplay();
    redrawSongView();
}
