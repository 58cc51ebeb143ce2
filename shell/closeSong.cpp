// Closing the song.
#include "shell/closeSong.h"

#include "analysis/noteRecognition.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "playback/midiImport.h"
#include "playback/midiOutput.h"
#include "notes/songViewInput.h"
#include "store/timeEditing.h"
#include "store/workingFiles.h"

int closeSong(bool keepFiles) {
    int closed = closeSongStores(keepFiles);
    resetNoteList();
    resetNoteRecognition();
    resetSelection();
    resetMidiImport();
    resetMidiOutput();
    resetSongViewInput();
    resetTimeClipboard();
    return closed;
}
