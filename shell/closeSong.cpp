// Closing the song.
#include "shell/closeSong.h"

#include "analysis/noteRecognition.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "store/workingFiles.h"

int closeSong() {
    int closed = closeSongStores();
    resetNoteList();
    resetNoteRecognition();
    resetSelection();
    return closed;
}
