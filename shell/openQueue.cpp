// The open queue. Files are handed on one at a time because an opening runs on the worker
// thread: a second file started while it runs would be refused with "whilst opening".
#include "shell/openQueue.h"

#include "audio/audioActivity.h"
#include "platform/mainloop.h"
#include "platform/ui.h"
#include "playback/midiImport.h"
#include "shell/closeSong.h"
#include "shell/commandDispatch.h"
#include "store/song.h"

OpenQueue openQueue;

int queueFilesToOpen(const std::vector<std::string>& paths) {
    int queued = 0;
    for (const std::string& path : paths) {
        if (queued == MAX_OPEN_FILES) {
            showMessage(MESSAGE_INFORMATION, "Only the first 400 of the chosen files are opened.");
            break;
        }
        openQueue.paths.push_back(path);
        queued++;
    }
    return queued;
}

static void stopWaiting() {
    if (!openQueue.waiting) return;
    stopTimer(OPEN_QUEUE_TIMER_ID);
    openQueue.waiting = false;
}

void workOffOpenQueue() {
    while (!openQueue.paths.empty()) {
        if (audioActivity.opening) {
            if (!openQueue.waiting) {
                openQueue.waiting = true;
                startTimer(OPEN_QUEUE_TIMER_ID, OPEN_QUEUE_POLL_MS, [] { workOffOpenQueue(); });
            }
            return;
        }
        std::string path = openQueue.paths.front();
        openQueue.paths.pop_front();
        if (isMidiFileName(path)) {
            if (!commandOperations.readMidiFile) {
                // One message is enough for the whole queue.
                openQueue.paths.clear();
                showMessage(MESSAGE_INFORMATION, notAvailableText("Reading MIDI files"));
                break;
            }
            commandOperations.readMidiFile(path);
        } else {
            if (!commandOperations.openWaveFile) {
                openQueue.paths.clear();
                showMessage(MESSAGE_INFORMATION, notAvailableText("Opening wave files"));
                break;
            }
            // A song of notes read from a MIDI file has no recording to add the wave to: the
            // wave starts a song of its own.
            if (song.notesOnly) {
                closeSong();
                resetSongNames();
            }
            commandOperations.openWaveFile(path);
        }
    }
    stopWaiting();
}

void resetOpenQueue() {
    openQueue.paths.clear();
    stopWaiting();
}
