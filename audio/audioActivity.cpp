// Whether a recording or an opening is under way, and the refusal of work that would meet it.
#include "audio/audioActivity.h"

#include "platform/ui.h"

AudioActivity audioActivity;

int refuseWhileBusy() {
    if (audioActivity.recording) {
        showMessage(MESSAGE_INFORMATION, WHILST_RECORDING_TEXT);
        return 1;
    }
    if (audioActivity.opening) {
        showMessage(MESSAGE_INFORMATION, WHILST_OPENING_TEXT);
        return 1;
    }
    return 0;
}
